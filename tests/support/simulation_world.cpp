#include "support/simulation_world.h"

#include <algorithm>
#include <cstring>
#include <fstream>
#include <iterator>
#include <nlohmann/json.hpp>

#include "hal/control_records.h"
#include "hal/platform/kernel_driver.h"
#include "support/environment_variable.h"

extern "C" const ZV::KernelDriver* ZentaraSimulation_GetKernelDriver(std::uint32_t version);

namespace ZV::Test {
namespace {

using Json = nlohmann::json;

constexpr char Variable[] = "ZENTARA_SIMULATION";
constexpr char ScenarioFile[] = "scenario.json";
constexpr char TraceFile[] = "trace.jsonl";

void SetDefault(Json* object, const char* key, const Json& value) {
    if (!object->contains(key)) (*object)[key] = value;
}

void QuietSensors(Json* cameras) {
    if (!cameras->is_array()) return;
    for (Json& camera : *cameras) {
        if (!camera.is_object()) continue;
        SetDefault(&camera, "sensor", Json::object());
        if (camera["sensor"].is_object()) SetDefault(&camera["sensor"], "noise", false);
    }
}

std::size_t CountBuiltInCameras(const std::string& base) {
    if (base == "empty") return 0;
    if (base == "ten") return 10;
    return base == "held" ? 2 : 1;
}

Json MakeDocument(std::string_view scenario) {
    Json document = Json::object();
    if (scenario.starts_with("{")) {
        document = Json::parse(scenario);
    } else {
        document["base"] = scenario;
    }
    SetDefault(&document, "trace", TraceFile);
    SetDefault(&document, "timeScale", 0);
    SetDefault(&document, "cameras", Json::array());
    if (document.contains("base") && document["base"].is_string()) {
        const std::size_t count = CountBuiltInCameras(document["base"]);
        while (document["cameras"].size() < count) document["cameras"].push_back(Json::object());
    }
    QuietSensors(&document["cameras"]);
    return document;
}

std::vector<std::uint8_t> ConvertHex(const std::string& text) {
    std::vector<std::uint8_t> bytes;
    for (std::size_t i = 0; i + 1 < text.size(); i += 2) {
        bytes.push_back(static_cast<std::uint8_t>(std::stoul(text.substr(i, 2), nullptr, 16)));
    }
    return bytes;
}

TraceRecord ParseRecord(const Json& line) {
    TraceRecord record;
    record.time = line.value("time", 0.0);
    record.type = line.value("type", "");
    record.camera = line.value("camera", 0u);
    record.code = line.value("code", 0u);
    record.name = line.value("name", "");
    record.input = ConvertHex(line.value("input", ""));
    record.output = ConvertHex(line.value("output", ""));
    record.inputBytes = line.value("inputBytes", std::uint64_t{0});
    record.outputBytes = line.value("outputBytes", std::uint64_t{0});
    record.wasPended = line.value("pended", false);
    record.error = line.value("error", 0u);
    record.frame = line.value("frame", std::uint64_t{0});
    record.rollingFrameNumber = line.value("rollingFrameNumber", 0u);
    record.psn = line.value("psn", 0u);
    record.plane = line.value("plane", 0u);
    record.width = line.value("width", 0u);
    record.height = line.value("height", 0u);
    record.bytes = line.value("bytes", std::uint64_t{0});
    record.checksum = std::stoull(line.value("checksum", "0"), nullptr, 16);
    return record;
}

RegisterWrite ParseWrite(const TraceRecord& record) {
    RegisterWrite write{0, {}, record.error};
    if (record.input.size() < AsyncWriteExtraBytes) return write;
    std::memcpy(&write.address, record.input.data() + offsetof(AsyncReadRecord, offsetLow), 4);
    const std::size_t end = record.input.size() - (AsyncWriteExtraBytes - AsyncWriteDataOffset);
    for (std::size_t i = AsyncWriteDataOffset; i + 4 <= end; i += 4) {
        const std::uint8_t* quadlet = record.input.data() + i;
        write.values.push_back(std::uint32_t{quadlet[0]} << 24 | std::uint32_t{quadlet[1]} << 16 |
                               std::uint32_t{quadlet[2]} << 8 | quadlet[3]);
    }
    return write;
}

const KernelDriver& GetKernelDriver() {
    return *ZentaraSimulation_GetKernelDriver(KernelDriverVersion);
}

/// What stands in a file at the call: a stream may go on writing, and a reader that took what comes
/// meanwhile could run after the writer for ever.
std::string ReadText(const std::string& path) {
    std::error_code failure;
    const std::uintmax_t bytes = std::filesystem::file_size(path, failure);
    std::string text(failure ? 0 : bytes, '\0');
    std::ifstream file(path, std::ios::binary);
    file.read(text.data(), static_cast<std::streamsize>(text.size()));
    text.resize(static_cast<std::size_t>(file.gcount()));
    return text;
}

}  // namespace

std::vector<TraceRecord> TraceReader::Read(
    const std::string& path, const std::function<bool(const TraceRecord&)>& isWanted) {
    const std::lock_guard hold(mutex);
    const std::string text = ReadText(path);
    if (!text.starts_with(known)) {  // another run's
        known.clear();
        records.clear();
    }
    // The last line may be half written.
    for (std::size_t end; (end = text.find('\n', known.size())) != std::string::npos;) {
        const std::string_view line(text.data() + known.size(), end - known.size());
        const Json parsed = Json::parse(line, nullptr, false);
        if (parsed.is_object()) records.push_back(ParseRecord(parsed));
        known.append(line).push_back('\n');
    }
    std::vector<TraceRecord> wanted;
    std::copy_if(records.begin(), records.end(), std::back_inserter(wanted), isWanted);
    return wanted;
}

std::uint64_t CalculateChecksum(const void* bytes, std::size_t count) {
    std::uint64_t sum = 0xCBF29CE484222325;
    const auto* source = static_cast<const std::uint8_t*>(bytes);
    for (std::size_t i = 0; i < count; ++i) sum = (sum ^ source[i]) * 0x100000001B3;
    return sum;
}

SimulationWorld::SimulationWorld(std::string_view scenario) {
    std::ofstream(GetScenarioPath()) << MakeDocument(scenario).dump(2);
    SetVariable(Variable, GetScenarioPath().c_str());
}

SimulationWorld::~SimulationWorld() {
    End();
    SetVariable(Variable, nullptr);
}

std::string SimulationWorld::GetScenarioPath() const {
    return folder.GetPath(ScenarioFile);
}

bool SimulationWorld::Start() {
    return GetKernelDriver().begin(GetScenarioPath().c_str(), nullptr, 0) == 0;
}

void SimulationWorld::End() {
    GetKernelDriver().end();
}

std::vector<TraceRecord> SimulationWorld::ReadTrace() const {
    return trace.Read(folder.GetPath(TraceFile), [](const TraceRecord&) { return true; });
}

std::vector<TraceRecord> SimulationWorld::ReadTrace(std::string_view type,
                                                    std::uint32_t camera) const {
    return trace.Read(folder.GetPath(TraceFile), [&](const TraceRecord& record) {
        return record.type == type && record.camera == camera;
    });
}

std::vector<TraceRecord> SimulationWorld::ReadRequests(std::uint32_t camera) const {
    return ReadTrace("request", camera);
}

std::vector<TraceRecord> SimulationWorld::ReadFrames(std::uint32_t camera) const {
    return ReadTrace("frame", camera);
}

std::vector<RegisterWrite> SimulationWorld::ReadRegisterWrites(std::uint32_t camera) const {
    const std::vector<TraceRecord> records =
        trace.Read(folder.GetPath(TraceFile), [&](const TraceRecord& record) {
            return record.name == "FW_IOCTL_ASYNC_WRITE" && record.type == "request" &&
                   record.camera == camera;
        });
    std::vector<RegisterWrite> writes;
    for (const TraceRecord& record : records) writes.push_back(ParseWrite(record));
    return writes;
}

bool SimulationWorld::AddFault(std::string_view fault, std::uint32_t camera) {
    return ZentaraSimulation_AddFault(camera, std::string(fault).c_str(), nullptr, 0) == 0;
}

bool SimulationWorld::Unplug(std::uint32_t camera) {
    return ZentaraSimulation_Unplug(camera) == 0;
}

bool SimulationWorld::Plug(std::uint32_t camera) {
    return ZentaraSimulation_Plug(camera) == 0;
}

ZentaraSimulationState SimulationWorld::GetState(std::uint32_t camera) const {
    ZentaraSimulationState state{};
    (void)ZentaraSimulation_GetState(camera, &state);  // Zeros say the same.
    return state;
}

std::uint32_t SimulationWorld::Peek(std::uint32_t address, std::uint32_t camera) const {
    std::uint32_t value = 0;
    (void)ZentaraSimulation_PeekRegister(camera, address, &value);  // 0 where there is nothing.
    return value;
}

bool SimulationWorld::Poke(std::uint32_t address, std::uint32_t value, std::uint32_t camera) {
    return ZentaraSimulation_PokeRegister(camera, address, value) == 0;
}

}  // namespace ZV::Test
