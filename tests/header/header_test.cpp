// The header stands alone in C++: nothing before it.
#include <zentara/zentara.h>

#include <gtest/gtest.h>

#include <cstddef>
#include <type_traits>

extern "C" int UseHeaderFromC(void);

namespace {

TEST(Header, ServesAProgramInC) {
    EXPECT_EQ(0, UseHeaderFromC());
}

TEST(Header, RecordsHaveTheirSizesAndAreReadByByteOffset) {
    EXPECT_EQ(56u, sizeof(Zentara_CamListItem));
    EXPECT_EQ(260u, sizeof(Zentara_Settings));
    EXPECT_EQ(80u, sizeof(Zentara_Frame));
    EXPECT_EQ(44u, offsetof(Zentara_Frame, privateCamera));
    EXPECT_EQ(72u, offsetof(Zentara_Frame, privateFilled));
    EXPECT_TRUE(std::is_trivially_copyable_v<Zentara_Frame>);
    EXPECT_TRUE(std::is_standard_layout_v<Zentara_Settings>);
}

TEST(Header, KeysAreTheNumbersOfTheirWords) {
    EXPECT_EQ(0, zprmGain);
    EXPECT_EQ(12, zprmImageFormat);
    EXPECT_EQ(25, zprmNormalizedGain);
    EXPECT_EQ(32, zprmPostProcessImageFormat);
    EXPECT_EQ(46, zprmRegisterTweak);
    EXPECT_EQ(2, zprmS32RegulatedCoolingTemp);
    EXPECT_EQ(3, zprm64NormIntensGain);
    EXPECT_EQ(40, zinfReserved4);
    EXPECT_EQ(32, zinfPostProcessImageSize);
}

TEST(Header, HelpersWorkBeforeALoadAndReturnOneForTrue) {
    struct Row {
        std::uint32_t format;
        bool is16, is3, isBayer, isColour, isMono;
        std::uint64_t pixelBytes;
    };
    const Row rows[] = {{0, false, false, false, false, false, 1},
                        {1, true, false, false, false, false, 2},
                        {2, false, false, false, false, true, 1},
                        {3, true, false, false, false, true, 2},
                        {4, false, false, true, true, false, 1},
                        {5, true, false, true, true, false, 2},
                        {6, false, true, false, true, false, 3},
                        {7, true, true, false, true, false, 6},
                        {8, false, true, false, true, false, 3},
                        {9, false, true, false, true, false, 4},
                        {10, true, true, false, true, false, 6},
                        {11, false, true, false, true, false, 4},
                        {12, false, true, false, true, false, 3},
                        {13, false, false, false, false, false, 0},
                        {14, false, false, false, false, false, 0},
                        {0xFFFFFFFF, false, false, false, false, false, 0}};

    for (const Row& row : rows) {
        EXPECT_EQ(row.is16 ? 1u : 0u, Zentara_is16bit(row.format)) << row.format;
        EXPECT_EQ(row.is3 ? 1u : 0u, Zentara_is3Color(row.format)) << row.format;
        EXPECT_EQ(row.isBayer ? 1u : 0u, Zentara_isBayer(row.format)) << row.format;
        EXPECT_EQ(row.isColour ? 1u : 0u, Zentara_isColor(row.format)) << row.format;
        EXPECT_EQ(row.isMono ? 1u : 0u, Zentara_isMonochrome(row.format)) << row.format;
        EXPECT_EQ(row.pixelBytes * 64 * 48, Zentara_CalcImageSize(row.format, 64, 48));
    }
}

TEST(Header, ImageSizesAreProductsOfSixtyFourBits) {
    EXPECT_EQ(6u * 0xFFFFull * 0xFFFFull, Zentara_CalcImageSize(zfmtRGB48, 0xFFFF, 0xFFFF));
    EXPECT_EQ(0xFFFFFFFFull * 0xFFFFFFFFull,
              Zentara_CalcImageSize(zfmtMono8, 0xFFFFFFFF, 0xFFFFFFFF));
}

}  // namespace
