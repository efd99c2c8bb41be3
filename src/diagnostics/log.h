#pragma once

#include <cstdint>

#include "zentara/zentara.h"

namespace ZV {

/// Trace of the exported calls, off unless a switch of the settings store turns it on. Free
/// functions over process-wide state without a lock: every routine but ZLogOpen and ZLogClose may
/// be called on any thread, and none reports a failure.
///
/// An exported function calls ZLogEnter or a keyed form first, dumps and messages in its body, and
/// ZLogLeave at every return. While the log is off such a call costs one addition, one test and one
/// subtraction.
///
/// A record is the time since ZLogOpen and a text, with no line end but those of its format. It
/// goes to the debugger output, or with one write and a zero byte behind it to the file. A record
/// of more than 1023 characters, the time among them, is cut.

/// Start: reads the switches, which stay as read until the next start, and opens the file. A file
/// that cannot be opened is told to the debugger output, and the records are lost. The depth of
/// nesting stays as it is.
void ZLogOpen();
/// End: writes the closing block to the file and closes it.
void ZLogClose();

/// Writes one record, whatever the switches. Conversions are those of printf.
[[gnu::format(printf, 1, 2)]] void ZLogWrite(const char* format, ...);
/// Writes "name - text". Conversions are %c, %d (32 bits), %l (64 bits) and %s, with a blank behind
/// each value; others are copied as they are. A backslash is copied and hides what follows it.
void ZLogMessage(const char* function, const char* format, ...);

/// Each adds a level of nesting, also while the log is off.
void ZLogEnter(const char* function);
void ZLogEnterKey32(const char* function, std::uint32_t key);
void ZLogEnterKeyS32(const char* function, std::uint32_t key);
void ZLogEnterKey64(const char* function, std::uint32_t key);
void ZLogEnterInfo(const char* function, std::uint32_t key);

/// Writes the end or the worded failure and takes a level of nesting away.
void ZLogLeave(const char* function, std::uint16_t code);
/// Writes the worded failure.
void ZLogError(const char* function, std::uint16_t code);

/// Dumps: one record for each value, by the labels of the parameter and information tables. Each
/// has a switch of its own. Single settings, the block and the sparse table are left out in nested
/// calls unless those are shown.
void ZentaraDebugOutputSetting32(std::uint32_t key, std::uint32_t value);
void ZentaraDebugOutputSettingS32(std::uint32_t key, std::int32_t value);
void ZentaraDebugOutputSetting64(std::uint32_t key, std::uint64_t value);
void ZentaraDebugOutputGetInfo(std::uint32_t key, std::uint32_t value);
void ZLogSettingsBlock(const char* function, const Zentara_Settings& block);
void ZLogSettingsChanged(const char* function, const Zentara_Settings& former,
                         const Zentara_Settings& present);
void ZLogFrame(const char* function, const Zentara_Frame& frame);
/// `table` holds `count` entries.
void ZLogSparseTable(const char* function, std::uint32_t key, const std::uint32_t* table,
                     std::uint32_t count);

/// Switches of the bus traces as read by the last ZLogOpen: 0 or 1.
std::uint8_t GetOutputReads();
std::uint8_t GetOutputWrites();

/// Present depth of nesting. Two threads inside the library let it drift, which is accepted.
std::int32_t GetLogNesting();

}  // namespace ZV
