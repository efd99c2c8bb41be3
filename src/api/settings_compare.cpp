#include "api/settings_compare.h"

#include <cstdint>
#include <cstring>

#include "api/settings_block.h"

namespace ZV {

namespace {

/// A run of bytes of the block.
struct Span {
    std::uint32_t offset;
    std::uint32_t bytes;
};

constexpr std::uint32_t WordBytes = 4;

constexpr Span WordSpan(std::uint32_t firstKey, std::uint32_t lastKey) {
    return {SettingsWordsOffset + WordBytes * firstKey, WordBytes * (lastKey - firstKey + 1)};
}

constexpr Span ComparedSpans[] = {
    WordSpan(zprmGain, zprmNormIntensGaindB),
    WordSpan(zprmFan, zprmRevisionTwoReserved),
    {SettingsSignedOffset, WordBytes* SettingsSignedCount},
    {SettingsWideOffset, 2 * WordBytes* SettingsWideCount},
};

}  // namespace

bool DoSettingsDiffer(const Zentara_Settings& former, const Zentara_Settings& present) {
    const auto* const left = reinterpret_cast<const unsigned char*>(&former);
    const auto* const right = reinterpret_cast<const unsigned char*>(&present);
    for (const Span& span : ComparedSpans) {
        if (std::memcmp(left + span.offset, right + span.offset, span.bytes) != 0) return true;
    }
    return false;
}

}  // namespace ZV
