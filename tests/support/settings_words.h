#pragma once

#include <cstddef>
#include <cstdint>
#include <cstring>

#include "zentara/zentara.h"

namespace ZV::Test {

/// The fields of a settings block by their offsets, told once more without the library's code.
inline constexpr std::size_t SettingsMagicWord = 62;

/// A field of `Value` at a byte offset of the block; reading leaves it and writing changes it.
template <typename Value>
Value ReadField(const Zentara_Settings& block, std::size_t offset) {
    Value value;
    std::memcpy(&value, reinterpret_cast<const std::uint8_t*>(&block) + offset, sizeof(value));
    return value;
}
template <typename Value>
void WriteField(Zentara_Settings& block, std::size_t offset, Value value) {
    std::memcpy(reinterpret_cast<std::uint8_t*>(&block) + offset, &value, sizeof(value));
}

inline std::uint32_t GetWord(const Zentara_Settings& block, std::uint32_t key) {
    return ReadField<std::uint32_t>(block, 4 + std::size_t{4} * key);
}
inline void SetWord(Zentara_Settings& block, std::uint32_t key, std::uint32_t value) {
    WriteField(block, 4 + std::size_t{4} * key, value);
}
inline std::int32_t GetSigned(const Zentara_Settings& block, std::uint32_t key) {
    return ReadField<std::int32_t>(block, 192 + std::size_t{4} * key);
}
inline void SetSigned(Zentara_Settings& block, std::uint32_t key, std::int32_t value) {
    WriteField(block, 192 + std::size_t{4} * key, value);
}
inline std::uint64_t GetWide(const Zentara_Settings& block, std::uint32_t key) {
    return ReadField<std::uint64_t>(block, 204 + std::size_t{8} * key);
}
inline void SetWide(Zentara_Settings& block, std::uint32_t key, std::uint64_t value) {
    WriteField(block, 204 + std::size_t{8} * key, value);
}
inline ZentaraHandle GetHandleOf(const Zentara_Settings& block) {
    return ReadField<ZentaraHandle>(block, 244);
}
inline void SetHandleOf(Zentara_Settings& block, ZentaraHandle handle) {
    WriteField(block, 244, handle);
}

inline Zentara_Settings MakeFilledBlock(std::uint8_t byte) {
    Zentara_Settings settings;
    std::memset(&settings, byte, sizeof(settings));
    return settings;
}

inline bool AreSameBytes(const Zentara_Settings& left, const Zentara_Settings& right) {
    return std::memcmp(&left, &right, sizeof(left)) == 0;
}

}  // namespace ZV::Test
