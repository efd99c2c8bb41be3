#include "diagnostics/log_state.h"

#include <cstdio>

#include "diagnostics/log.h"
#include "hal/platform/clock.h"
#include "hal/platform/console.h"
#include "hal/platform/debug_output.h"
#include "hal/platform/settings_store.h"

namespace ZV {

constinit LogState logState;

namespace {

constexpr char ConsoleTitle[] = "Zentara : Debug Console";
constexpr std::size_t PathCapacity = 1024;
/// Ticks of 100 ns are lessened by this and divided by 10.
constexpr std::uint64_t EpochOffset = 0x295E9648864000;

struct LogSwitch {
    const char* name;
    Relaxed<std::uint8_t> LogState::*flag;
};

constexpr LogSwitch Switches[] = {
    {"outputEnabled", &LogState::outputEnabled},
    {"outputSettings", &LogState::outputSettings},
    {"outputGetInfo", &LogState::outputGetInfo},
    {"outputFrame", &LogState::outputFrame},
    {"outputSparseTable", &LogState::outputSparseTable},
    {"outputNestedCalls", &LogState::outputNestedCalls},
    {"outputToFile", &LogState::outputToFile},
    {"outputReads", &LogState::outputReads},
    {"outputWrites", &LogState::outputWrites},
};

std::uint8_t ReadSwitch(SettingsStore* store, const char* name) {
    std::uint32_t value = 0;
    if (store == nullptr || !ReadStoredNumber(store, name, &value)) return 0;
    return value != 0 ? 1 : 0;
}

/// Fills `path` with the file's path, which is empty when the store has none.
void ReadSwitches(char (&path)[PathCapacity]) {
    SettingsStore* const store = OpenSettingsStore();
    for (const LogSwitch& row : Switches) logState.*row.flag = ReadSwitch(store, row.name);
    path[0] = '\0';
    if (store != nullptr) (void)ReadStoredText(store, "outputFilePath", path, sizeof path);
    CloseSettingsStore(store);
}

void ReportBadPath(const char* path) {
    char text[PathCapacity + 100];
    std::snprintf(text, sizeof text,
                  "ZLog() - cannot output to file.  The file path %s is invalid or not accessable",
                  path);
    WriteDebuggerOutput(text);
}

}  // namespace

std::uint64_t GetLogMicroseconds() {
    return (GetSystemTimeTicks() - EpochOffset) / 10;
}

// Kept: the depth of nesting is not reset, so what a second load left too high stays too high.
void ZLogOpen() {
    logState.startMicroseconds = GetLogMicroseconds();
    PrepareLogConsole(ConsoleTitle);
    CloseLogFile();
    char path[PathCapacity];
    ReadSwitches(path);
    if (logState.outputToFile == 0 || logState.outputEnabled == 0) return;
    // Kept: records meant for a file that cannot be opened go nowhere.
    if (!OpenLogFile(path)) ReportBadPath(path);
}

void ZLogClose() {
    if (logState.outputToFile == 0 || !IsLogFileOpen()) return;
    static constexpr char ClosingBlock[] = "\n------------------------------------------------\n\n";
    WriteToLogFile(ClosingBlock, sizeof ClosingBlock);
    CloseLogFile();
}

std::uint8_t GetOutputReads() {
    return logState.outputReads;
}

std::uint8_t GetOutputWrites() {
    return logState.outputWrites;
}

std::int32_t GetLogNesting() {
    return logState.nesting;
}

}  // namespace ZV
