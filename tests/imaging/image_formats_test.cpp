#include "imaging/image_formats.h"

#include <gtest/gtest.h>

#include <set>

#include "imaging/ex_image.h"

namespace ZV::Testing {
namespace {

using Formats = std::set<std::uint32_t>;

Formats FormatsFor(bool (*test)(std::uint32_t)) {
    Formats formats;
    for (const std::uint32_t beyond : {255U, 0x10004U, 0xFFFFFFFFU}) {
        if (test(beyond)) formats.insert(beyond);
    }
    for (std::uint32_t format = 0; format < 40; ++format) {
        if (test(format)) formats.insert(format);
    }
    return formats;
}

TEST(ImageFormats, SixteenBitFormatsAreOddOnesUpTo7And10) {
    EXPECT_EQ(FormatsFor(Is16Bit), (Formats{1, 3, 5, 7, 10}));
}

TEST(ImageFormats, ThreeColoursEndAt12ForAClient) {
    EXPECT_EQ(FormatsFor(Is3Colour), (Formats{6, 7, 8, 9, 10, 11, 12}));
}

TEST(ImageFormats, KeptFormat13HasThreeColoursForTheFiltersAlone) {
    EXPECT_EQ(FormatsFor(IsFilterThreeColour), (Formats{6, 7, 8, 9, 10, 11, 12, 13}));
    EXPECT_FALSE(Is3Colour(13));
    EXPECT_FALSE(IsColour(13));
}

TEST(ImageFormats, MosaicsAreColourAndRawFormatsAreNeitherColourNorMono) {
    EXPECT_EQ(FormatsFor(IsBayer), (Formats{4, 5}));
    EXPECT_EQ(FormatsFor(IsColour), (Formats{4, 5, 6, 7, 8, 9, 10, 11, 12}));
    EXPECT_EQ(FormatsFor(IsMonochrome), (Formats{2, 3}));
}

TEST(ImageFormats, AnImageTakesItsPixelsTimesTheBytesOfItsFormat) {
    const std::uint64_t pixelBytes[] = {1, 2, 1, 2, 1, 2, 3, 6, 3, 4, 6, 4, 3};
    for (std::uint32_t format = 0; format <= 12; ++format) {
        EXPECT_EQ(CalculateImageSize(format, 10, 7), 70 * pixelBytes[format]) << format;
    }
}

TEST(ImageFormats, FormatsFrom13UpwardHaveNoSizeForAClient) {
    for (const std::uint32_t format : {13U, 14U, 255U, 0xFFFFFFFFU}) {
        EXPECT_EQ(CalculateImageSize(format, 10, 7), 0U);
    }
}

TEST(ImageFormats, TheSizeIsAProductOf64Bits) {
    EXPECT_EQ(CalculateImageSize(0, 0xFFFFFFFF, 0xFFFFFFFF), 0xFFFFFFFE00000001U);
    EXPECT_EQ(CalculateImageSize(10, 65535, 65535), 6ULL * 65535 * 65535);
}

TEST(ImageFormats, TheFiltersKnowTheSizeOfThreeColourFormatsAlone) {
    const std::uint32_t pixelBytes[] = {0, 0, 0, 0, 0, 0, 3, 6, 3, 4, 6, 4, 3, 4, 0, 0};
    for (std::uint32_t format = 0; format < 16; ++format) {
        EXPECT_EQ(ZExImage::ImageFormatByteSize(format), pixelBytes[format]) << format;
    }
    EXPECT_EQ(ZExImage::ImageFormatByteSize(0xFFFFFFFF), 0U);
}

TEST(ImageFormats, LabelsEndAt12) {
    const char* labels[] = {"Raw 8-Bit",   "Raw 16-Bit",   "Mono 8-Bit",      "Mono 16-Bit",
                            "Bayer 8-Bit", "Bayer 16-Bit", "RGB Plane 8-Bit", "RGB Plane 16-Bit",
                            "BGR24",       "XRGB32",       "RGB48",           "BGRX32",
                            "RGB24"};
    for (std::uint32_t format = 0; format <= 12; ++format) {
        EXPECT_STREQ(GetImageFormatLabel(format), labels[format]);
    }
    EXPECT_STREQ(GetImageFormatLabel(13), "Unknown image format");
    EXPECT_STREQ(GetImageFormatLabel(0xFFFFFFFF), "Unknown image format");
}

TEST(ImageFormats, ASampleTakesWholeBytes) {
    EXPECT_EQ(GetBytesPerSample(0), 0U);
    EXPECT_EQ(GetBytesPerSample(1), 1U);
    EXPECT_EQ(GetBytesPerSample(8), 1U);
    EXPECT_EQ(GetBytesPerSample(9), 2U);
    EXPECT_EQ(GetBytesPerSample(16), 2U);
    EXPECT_EQ(GetBytesPerSample(17), 3U);
}

TEST(ImageFormats, TheMosaicOfAFrameRecordBecomesAPattern) {
    EXPECT_EQ(ConvertFrameMosaicToColourPattern(0), PatternRGGB);
    EXPECT_EQ(ConvertFrameMosaicToColourPattern(3), PatternBGGR);
    EXPECT_EQ(ConvertFrameMosaicToColourPattern(4), 0U);
    EXPECT_EQ(ConvertFrameMosaicToColourPattern(0xFFFFFFFF), 0U);
}

}  // namespace
}  // namespace ZV::Testing
