#include "diagnostics/log.h"

#include <atomic>

#include "hal/platform/settings_store.h"

namespace ZV {

namespace {

std::atomic<std::uint8_t> outputReads{0};
std::atomic<std::uint8_t> outputWrites{0};
std::atomic<std::int32_t> nesting{0};

// A load and a store, not one addition: the counter is free of any lock, and its drift is accepted.
void ChangeNesting(std::int32_t difference) {
    nesting.store(nesting.load(std::memory_order_relaxed) + difference, std::memory_order_relaxed);
}

std::uint8_t ReadSwitch(SettingsStore* store, const char* name) {
    std::uint32_t value = 0;
    if (store == nullptr || !ReadStoredNumber(store, name, &value)) return 0;
    return value != 0 ? 1 : 0;
}

}  // namespace

// Kept: the depth is not reset, so what a second load left too high stays too high.
void ZLogOpen() {
    SettingsStore* const store = OpenSettingsStore();
    outputReads.store(ReadSwitch(store, "outputReads"), std::memory_order_relaxed);
    outputWrites.store(ReadSwitch(store, "outputWrites"), std::memory_order_relaxed);
    CloseSettingsStore(store);
}

void ZLogClose() {}

void ZLogWrite(const char*, ...) {}

void ZLogMessage(const char*, const char*, ...) {}

void ZLogEnter(const char*) {
    ChangeNesting(1);
}

void ZLogEnterKey32(const char*, std::uint32_t) {
    ChangeNesting(1);
}

void ZLogEnterKeyS32(const char*, std::uint32_t) {
    ChangeNesting(1);
}

void ZLogEnterKey64(const char*, std::uint32_t) {
    ChangeNesting(1);
}

void ZLogEnterInfo(const char*, std::uint32_t) {
    ChangeNesting(1);
}

void ZLogLeave(const char*, std::uint16_t) {
    ChangeNesting(-1);
}

void ZLogError(const char*, std::uint16_t) {}

void ZentaraDebugOutputSetting32(std::uint32_t, std::uint32_t) {}

void ZentaraDebugOutputSettingS32(std::uint32_t, std::int32_t) {}

void ZentaraDebugOutputSetting64(std::uint32_t, std::uint64_t) {}

void ZentaraDebugOutputGetInfo(std::uint32_t, std::uint32_t) {}

void ZLogSettingsBlock(const char*, const Zentara_Settings&) {}

void ZLogSettingsChanged(const char*, const Zentara_Settings&, const Zentara_Settings&) {}

void ZLogFrame(const char*, const Zentara_Frame&) {}

void ZLogSparseTable(const char*, std::uint32_t, const std::uint32_t*, std::uint32_t) {}

std::uint8_t GetOutputReads() {
    return outputReads.load(std::memory_order_relaxed);
}

std::uint8_t GetOutputWrites() {
    return outputWrites.load(std::memory_order_relaxed);
}

std::int32_t GetLogNesting() {
    return nesting.load(std::memory_order_relaxed);
}

}  // namespace ZV
