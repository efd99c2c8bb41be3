#include "simulation/trace.h"

#include <cerrno>
#include <cinttypes>
#include <cstring>

#include "hal/control_records.h"

namespace ZV::Simulation {
namespace {

constexpr std::uint64_t FnvOffset = 0xCBF29CE484222325;
constexpr std::uint64_t FnvPrime = 0x100000001B3;

std::string Quote(const char* name, const std::string& text) {
    return ",\"" + std::string(name) + "\":\"" + text + "\"";
}

std::string Number(const char* name, std::uint64_t value) {
    return ",\"" + std::string(name) + "\":" + std::to_string(value);
}

std::string Begin(double time, const char* type, std::uint32_t camera) {
    char text[96];
    std::snprintf(text, sizeof text, "{\"time\":%.6f,\"type\":\"%s\",\"camera\":%" PRIu32, time,
                  type, camera);
    return text;
}

}  // namespace

std::uint64_t CalculateChecksum(const std::uint8_t* bytes, std::size_t count) {
    std::uint64_t sum = FnvOffset;
    for (std::size_t i = 0; i < count; ++i) sum = (sum ^ bytes[i]) * FnvPrime;
    return sum;
}

std::string ConvertToHex(const void* bytes, std::size_t count) {
    constexpr char Digits[] = "0123456789abcdef";
    const auto* source = static_cast<const std::uint8_t*>(bytes);
    std::string text;
    text.reserve(2 * count);
    for (std::size_t i = 0; i < count; ++i) {
        text += Digits[source[i] >> 4];
        text += Digits[source[i] & 15];
    }
    return text;
}

const char* GetControlCodeName(std::uint32_t code) {
    for (const ControlCodeName& row : ControlCodeNames) {
        if (row.code == code) return row.name;
    }
    return "";
}

Trace::~Trace() {
    if (file != nullptr) std::fclose(file);
}

bool Trace::Open(const std::string& path, std::string* message) {
    file = std::fopen(path.c_str(), "wb");
    start = std::chrono::steady_clock::now();
    if (file == nullptr) *message = "trace '" + path + "': " + std::strerror(errno);
    return file != nullptr;
}

void Trace::WriteRequest(std::uint32_t camera, const RequestRecord& record) {
    if (!IsOpen()) return;
    WriteLine(Begin(GetTime(), "request", camera) + Number("code", record.code) +
              Quote("name", GetControlCodeName(record.code)) +
              Number("inputBytes", record.inputBytes) + Quote("input", record.input) +
              Number("outputBytes", record.outputBytes) + Quote("output", record.output) +
              ",\"pended\":" + (record.wasPended ? "true" : "false") +
              Number("error", record.error) + "}\n");
}

void Trace::WriteFrame(std::uint32_t camera, const FrameRecord& record) {
    if (!IsOpen()) return;
    char sum[24];
    std::snprintf(sum, sizeof sum, "%016" PRIx64, record.checksum);
    WriteLine(Begin(GetTime(), "frame", camera) + Number("frame", record.frame) +
              Number("rollingFrameNumber", record.rollingFrameNumber) + Number("psn", record.psn) +
              Number("plane", record.plane) + Number("width", record.width) +
              Number("height", record.height) + Number("bytes", record.bytes) +
              Quote("checksum", sum) + "}\n");
}

void Trace::WriteEvent(std::uint32_t camera, const char* event) {
    if (!IsOpen()) return;
    WriteLine(Begin(GetTime(), event, camera) + "}\n");
}

void Trace::WriteLine(const std::string& line) {
    const std::lock_guard lock(mutex);
    std::fwrite(line.data(), 1, line.size(), file);
    std::fflush(file);
}

double Trace::GetTime() const {
    return std::chrono::duration<double>(std::chrono::steady_clock::now() - start).count();
}

}  // namespace ZV::Simulation
