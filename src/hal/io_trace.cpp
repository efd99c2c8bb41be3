#include "hal/io_trace.h"

#include <atomic>
#include <cstdio>
#include <cstring>

#include "hal/hal.h"
#include "hal/platform/clock.h"
#include "hal/platform/debug_output.h"

namespace ZV {
namespace {

std::atomic<std::uint8_t> halOutputReads{0};
std::atomic<std::uint8_t> halOutputWrites{0};

constexpr std::uint8_t SwitchOn = 1;

void PrintTime() {
    const LocalTime now = GetLocalTime24();
    char time[32];
    char text[48];
    std::snprintf(time, sizeof time, "%02u:%02u:%02u", unsigned{now.hour}, unsigned{now.minute},
                  unsigned{now.second});
    std::snprintf(text, sizeof text, "%s.%hu\n", time, now.millisecond);
    WriteDebuggerOutput(text);
}

void PrintQuadlets(const std::uint32_t* data, std::uint32_t quadlets) {
    if (data == nullptr) return;
    const auto* bytes = reinterpret_cast<const std::uint8_t*>(data);
    for (std::uint32_t i = 0; i < quadlets; ++i, bytes += sizeof(std::uint32_t)) {
        std::uint32_t quadlet = 0;
        std::memcpy(&quadlet, bytes, sizeof quadlet);
        char text[16];
        std::snprintf(text, sizeof text, "%08x ", quadlet);
        WriteDebuggerOutput(text);
    }
}

void PrintLength(std::uint32_t quadlets) {
    if (quadlets == 0) {
        WriteDebuggerOutput("Packet data is not available because the length is 0 bytes.\n");
        return;
    }
    char text[48];
    std::snprintf(text, sizeof text, "Length in bytes: %d\n",
                  static_cast<std::int32_t>(quadlets * 4));
    WriteDebuggerOutput(text);
    WriteDebuggerOutput("Hex data: ");
}

void PrintAccess(const char* access, std::uint32_t address, const std::uint32_t* data,
                 std::uint32_t quadlets) {
    WriteDebuggerOutput("\n---\n");
    PrintTime();
    char text[64];
    std::snprintf(text, sizeof text, "Async %s address 0x%x\n", access, address);
    WriteDebuggerOutput(text);
    PrintLength(quadlets);
    PrintQuadlets(data, quadlets);
    WriteDebuggerOutput("\n");
}

}  // namespace

void SetHalOutputReads(std::uint8_t on) {
    halOutputReads.store(on, std::memory_order_relaxed);
}

void SetHalOutputWrites(std::uint8_t on) {
    halOutputWrites.store(on, std::memory_order_relaxed);
}

std::uint8_t GetHalOutputReads() {
    return halOutputReads.load(std::memory_order_relaxed);
}

std::uint8_t GetHalOutputWrites() {
    return halOutputWrites.load(std::memory_order_relaxed);
}

void TraceRead(std::uint32_t address, const std::uint32_t* data, std::uint32_t quadlets) {
    if (GetHalOutputReads() == SwitchOn) PrintAccess("read from", address, data, quadlets);
}

void TraceWrite(std::uint32_t address, const std::uint32_t* data, std::uint32_t quadlets) {
    if (GetHalOutputWrites() == SwitchOn) PrintAccess("write to", address, data, quadlets);
}

}  // namespace ZV
