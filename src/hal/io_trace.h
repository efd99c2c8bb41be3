#pragma once

#include <cstdint>

/// Trace of register accesses on the debugger output, each piece by a call of its own.
namespace ZV {

/// Stores the byte of `halOutputReads` or `halOutputWrites`. Thread-safe.
void SetHalOutputReads(std::uint8_t on);
void SetHalOutputWrites(std::uint8_t on);

/// Prints an access of `quadlets` host-order quadlets while its switch holds exactly 1. Null `data`
/// is a buffer without values.
void TraceRead(std::uint32_t address, const std::uint32_t* data, std::uint32_t quadlets);
void TraceWrite(std::uint32_t address, const std::uint32_t* data, std::uint32_t quadlets);

}  // namespace ZV
