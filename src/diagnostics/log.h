#pragma once

#include <cstdint>

#include "zentara/zentara.h"

namespace ZV {

/// Trace of the exported calls. Free functions over process-wide state without a lock: every
/// routine may be called on any thread, and none reports a failure. An exported function calls
/// ZLogEnter or a keyed form first and ZLogLeave at every return. While the output is off, which it
/// is until records are written, a traced call costs one addition, one test and one subtraction.

/// Start: reads the switches from the settings store. The nesting depth stays as it is.
void ZLogOpen();
void ZLogClose();

/// Writes one record. Conversions are those of printf.
void ZLogWrite(const char* format, ...);
/// Writes "name - text". Conversions: %c, %d (32 bits), %l (64 bits) and %s.
void ZLogMessage(const char* function, const char* format, ...);

/// Each adds a level of nesting, also while the output is off.
void ZLogEnter(const char* function);
void ZLogEnterKey32(const char* function, std::uint32_t key);
void ZLogEnterKeyS32(const char* function, std::uint32_t key);
void ZLogEnterKey64(const char* function, std::uint32_t key);
void ZLogEnterInfo(const char* function, std::uint32_t key);

/// Takes a level of nesting away.
void ZLogLeave(const char* function, std::uint16_t code);
/// Writes the worded failure.
void ZLogError(const char* function, std::uint16_t code);

void ZentaraDebugOutputSetting32(std::uint32_t key, std::uint32_t value);
void ZentaraDebugOutputSettingS32(std::uint32_t key, std::int32_t value);
void ZentaraDebugOutputSetting64(std::uint32_t key, std::uint64_t value);
void ZentaraDebugOutputGetInfo(std::uint32_t key, std::uint32_t value);
void ZLogSettingsBlock(const char* function, const Zentara_Settings& block);
void ZLogSettingsChanged(const char* function, const Zentara_Settings& former,
                         const Zentara_Settings& present);
void ZLogFrame(const char* function, const Zentara_Frame& frame);
void ZLogSparseTable(const char* function, std::uint32_t key, const std::uint32_t* table,
                     std::uint32_t count);

/// Switches of the bus traces as read by the last ZLogOpen: 0 or 1.
std::uint8_t GetOutputReads();
std::uint8_t GetOutputWrites();

/// Present depth of nesting. Two threads inside the library let it drift, which is accepted.
std::int32_t GetLogNesting();

}  // namespace ZV
