#include <cstdio>

#include "api/result_codes.h"
#include "diagnostics/key_names.h"
#include "diagnostics/log.h"
#include "diagnostics/log_records.h"
#include "diagnostics/log_state.h"

namespace ZV {

namespace {

// A load and a store, not one addition: the counter costs next to nothing, and its drift between
// threads is accepted.
void ChangeNesting(std::int32_t difference) {
    logState.nesting = logState.nesting + difference;
}

/// Counts the call in, also while the log is off. Whether its start is shown.
bool EnterCall() {
    ChangeNesting(1);
    return logState.outputEnabled != 0 && !IsNestedCallHidden() && LogState::outputStart == 1;
}

void WriteEnd(const char* function, std::uint16_t code) {
    if (LogState::outputStart != 1) return;
    if (code != zerrNone) {
        ZLogError(function, code);
        return;
    }
    const char* const lineEnd = logState.nesting <= 1 ? "\n\n" : "\n";
    ZLogWrite("%s end (error code %u)%s", function, unsigned{code}, lineEnd);
}

}  // namespace

void ZLogEnter(const char* function) {
    if (EnterCall()) ZLogWrite("%s start", function);
}

void ZLogEnterKey32(const char* function, std::uint32_t key) {
    if (EnterCall()) ZLogWrite("%s start (%s)", function, GetKeyName32(key));
}

void ZLogEnterKeyS32(const char* function, std::uint32_t key) {
    if (EnterCall()) ZLogWrite("%s start (%s)", function, GetKeyNameS32(key));
}

void ZLogEnterKey64(const char* function, std::uint32_t key) {
    if (EnterCall()) ZLogWrite("%s start (%s)", function, GetKeyName64(key));
}

void ZLogEnterInfo(const char* function, std::uint32_t key) {
    if (EnterCall()) ZLogWrite("%s start (%s)", function, GetInformationKeyName(key));
}

void ZLogLeave(const char* function, std::uint16_t code) {
    if (logState.outputEnabled != 0 && !IsNestedCallHidden()) WriteEnd(function, code);
    ChangeNesting(-1);
}

// Kept: the record of a nested call has no line end.
void ZLogError(const char* function, std::uint16_t code) {
    if (logState.outputEnabled == 0) return;
    char text[LogRecordCapacity];
    std::snprintf(text, sizeof text, "%s ending because %s", function, GetResultMessage(code));
    const char* const lineEnd = logState.nesting < 2 ? "\n\n" : "";
    ZLogWrite("%s (error %u)%s", text, unsigned{code}, lineEnd);
}

}  // namespace ZV
