#include "api/settings_compare.h"

#include <gtest/gtest.h>

#include "support/settings_words.h"

namespace ZV {
namespace {

using Test::MakeFilledBlock;

/// Words 0 to 26 and 33 to 45, the signed and the wide parameters.
bool IsCompared(std::size_t offset) {
    const bool isFirstWords = offset >= 4 && offset < 4 + 4 * 27;
    const bool isLastWords = offset >= 4 + 4 * 33 && offset < 4 + 4 * 46;
    const bool isSignedOrWide = offset >= 192 && offset < 236;
    return isFirstWords || isLastWords || isSignedOrWide;
}

TEST(SettingsCompare, EachByteOfWhatTheCameraIsSetToCountsAndNoOther) {
    const Zentara_Settings former = MakeFilledBlock(0x5A);
    for (std::size_t offset = 0; offset < sizeof(former); ++offset) {
        Zentara_Settings present = former;
        reinterpret_cast<std::uint8_t*>(&present)[offset] ^= 0x80;

        EXPECT_EQ(IsCompared(offset), DoSettingsDiffer(former, present)) << "byte " << offset;
        EXPECT_EQ(IsCompared(offset), DoSettingsDiffer(present, former)) << "byte " << offset;
    }
}

TEST(SettingsCompare, ABlockDoesNotDifferFromItself) {
    const Zentara_Settings block = MakeFilledBlock(0xCD);

    EXPECT_FALSE(DoSettingsDiffer(block, block));
}

}  // namespace
}  // namespace ZV
