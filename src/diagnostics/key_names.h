#pragma once

#include <cstdint>

namespace ZV {

/// Names of keys as the log prints them. A key that the log's tables leave out gets the words of
/// its table for an unknown parameter.
[[nodiscard]] const char* GetKeyName32(std::uint32_t key);
[[nodiscard]] const char* GetKeyNameS32(std::uint32_t key);
[[nodiscard]] const char* GetKeyName64(std::uint32_t key);
[[nodiscard]] const char* GetInformationKeyName(std::uint32_t key);

}  // namespace ZV
