#pragma once

#include <cstdint>

#include "zentara/zentara.h"

namespace ZV {

/// Layout of the 260 bytes of a Zentara_Settings block, little-endian. The 64-bit values and the
/// handle lie on 4-byte boundaries only, so everything is moved by byte copy.
inline constexpr std::uint32_t SettingsBytes = 260;
inline constexpr std::uint32_t SettingsMagic = 0xDEADBEEF;

inline constexpr std::uint32_t SettingsSizeOffset = 0;
inline constexpr std::uint32_t SettingsWordsOffset = 4;
inline constexpr std::uint32_t SettingsSignedOffset = 192;
inline constexpr std::uint32_t SettingsWideOffset = 204;
inline constexpr std::uint32_t SettingsReserved236Offset = 236;  ///< 8 bytes, never touched.
inline constexpr std::uint32_t SettingsHandleOffset = 244;
inline constexpr std::uint32_t SettingsMagicOffset = 252;
inline constexpr std::uint32_t SettingsReserved256Offset = 256;  ///< 4 bytes, never touched.

inline constexpr std::uint32_t SettingsWordCount = 47;
inline constexpr std::uint32_t SettingsSignedCount = 3;
inline constexpr std::uint32_t SettingsWideCount = 4;

/// A key beyond its group reads as 0 and is not written.
[[nodiscard]] std::uint32_t GetSettingsWord(const Zentara_Settings& block, std::uint32_t key);
void SetSettingsWord(Zentara_Settings& block, std::uint32_t key, std::uint32_t value);
[[nodiscard]] std::int32_t GetSettingsSigned(const Zentara_Settings& block, std::uint32_t key);
void SetSettingsSigned(Zentara_Settings& block, std::uint32_t key, std::int32_t value);
[[nodiscard]] std::uint64_t GetSettingsWide(const Zentara_Settings& block, std::uint32_t key);
void SetSettingsWide(Zentara_Settings& block, std::uint32_t key, std::uint64_t value);

[[nodiscard]] ZentaraHandle GetSettingsHandle(const Zentara_Settings& block);
void SetSettingsHandle(Zentara_Settings& block, ZentaraHandle handle);

/// Writes `size`, which nothing compares.
void SetSettingsSize(Zentara_Settings& block);
/// The magic number is the block's only protection and all that is tested of it.
[[nodiscard]] bool HasSettingsMagic(const Zentara_Settings& block);
void SetSettingsMagic(Zentara_Settings& block);

}  // namespace ZV
