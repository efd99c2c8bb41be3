#include "imaging/region_measure.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cstring>
#include <random>
#include <vector>

#include "imaging/colour_layout.h"
#include "imaging/image_formats.h"

namespace ZV::Testing {
namespace {

constexpr std::uint32_t ThreeColourFormats[] = {RGBPlane8, RGBPlane16, BGR24, XRGB32,
                                                RGB48,     BGRX32,     RGB24, RGBX32};

bool IsWords(std::uint32_t format) {
    return format == RGBPlane16 || format == RGB48 || format == Mono16 || format == Bayer16;
}

std::uint32_t CountPixelSamples(std::uint32_t format) {
    if (format == XRGB32 || format == BGRX32 || format == RGBX32) return 4;
    return format >= RGBPlane8 ? 3 : 1;
}

/// An image whose samples are known one by one, in a block of exactly its length.
struct Picture {
    Picture(std::uint32_t pictureFormat, std::uint32_t pictureWidth, std::uint32_t pictureHeight)
        : format(pictureFormat),
          width(pictureWidth),
          height(pictureHeight),
          samples(std::size_t{width} * height * CountPixelSamples(format)) {}

    void FillRandomly(std::uint32_t seed) {
        std::mt19937 random(seed);
        const std::uint32_t top = IsWords(format) ? 65535 : 255;
        for (std::uint16_t& sample : samples)
            sample = static_cast<std::uint16_t>(random() % (top + 1));
    }

    MeasuredImage Describe() {
        bytes.resize(samples.size() * (IsWords(format) ? 2 : 1));
        for (std::size_t index = 0; index < samples.size(); ++index) {
            if (IsWords(format)) {
                std::memcpy(bytes.data() + 2 * index, &samples[index], 2);
            } else {
                bytes[index] = static_cast<std::uint8_t>(samples[index]);
            }
        }
        return {bytes.data(), bytes.size(), width, height, format};
    }

    std::uint32_t format;
    std::uint32_t width;
    std::uint32_t height;
    std::vector<std::uint16_t> samples;
    std::vector<std::uint8_t> bytes;
};

struct Placing {
    std::uint64_t first[3];  // Red, green, blue.
    std::uint64_t step;
    std::uint64_t rowSamples;
};

Placing PlaceColours(const Picture& picture) {
    const std::uint64_t plane = std::uint64_t{picture.width} * picture.height;
    const std::uint64_t width = picture.width;
    switch (picture.format) {
        case RGBPlane8:
            return {{0, plane, 2 * plane}, 1, width};
        case RGBPlane16:
            return {{0, plane, 2 * plane}, 1, 2 * width};
        case BGR24:
            return {{2, 1, 0}, 3, 3 * width};
        case XRGB32:
            return {{1, 2, 3}, 4, 4 * width};
        case BGRX32:
            return {{2, 1, 0}, 4, 4 * width};
        case RGBX32:
            return {{0, 1, 2}, 4, 4 * width};
        default:
            return {{0, 1, 2}, 3, 3 * width};
    }
}

struct Statistics {
    std::uint64_t sum = 0;
    std::uint64_t maximum = 0;
};

/// Sample by sample, 0 beyond the last.
Statistics Measure(const Picture& picture, const MeasuredRegion& region, std::size_t colour) {
    const Placing placing = PlaceColours(picture);
    Statistics result;
    for (std::uint64_t y = region.y; y < std::uint64_t{region.y} + region.height; ++y) {
        for (std::uint64_t x = region.x; x < std::uint64_t{region.x} + region.width; ++x) {
            const std::uint64_t index =
                placing.first[colour] + y * placing.rowSamples + x * placing.step;
            const std::uint64_t sample =
                index < picture.samples.size() ? picture.samples[index] : 0;
            result.sum += sample;
            result.maximum = std::max(result.maximum, sample);
        }
    }
    return result;
}

class RegionOfAThreeColourImage : public testing::TestWithParam<std::uint32_t> {
  protected:
    static void ExpectMeasured(Picture& picture, const MeasuredRegion& region) {
        SCOPED_TRACE(testing::Message()
                     << "format " << picture.format << ", region " << region.x << " " << region.y
                     << " " << region.width << " " << region.height);
        const std::uint64_t pixels = std::uint64_t{region.width} * region.height;
        ColourValues means;
        ColourValues maxima;
        ASSERT_EQ(MeasureColourMeans(picture.Describe(), region, &means), FilterDone);
        ASSERT_EQ(MeasureColourMaxima(picture.Describe(), region, &maxima), FilterDone);
        const std::uint32_t toldMeans[] = {means.red, means.green, means.blue};
        const std::uint32_t toldMaxima[] = {maxima.red, maxima.green, maxima.blue};
        for (std::size_t colour = 0; colour < 3; ++colour) {
            const Statistics expected = Measure(picture, region, colour);
            EXPECT_EQ(toldMeans[colour], expected.sum / pixels) << "colour " << colour;
            EXPECT_EQ(toldMaxima[colour], expected.maximum) << "colour " << colour;
        }
    }
};

TEST_P(RegionOfAThreeColourImage, IsMeasuredColourByColourWhereverItLies) {
    Picture picture(GetParam(), 13, 9);
    picture.FillRandomly(GetParam());
    for (const MeasuredRegion& region :
         {MeasuredRegion{0, 0, 13, 9}, MeasuredRegion{0, 0, 1, 1}, MeasuredRegion{3, 2, 5, 4},
          MeasuredRegion{12, 8, 1, 1}, MeasuredRegion{0, 8, 13, 1}, MeasuredRegion{7, 0, 1, 9}}) {
        ExpectMeasured(picture, region);
    }
}

TEST_P(RegionOfAThreeColourImage, GoesOnIntoTheRowsBelowAndCountsWhatLiesBeyondTheImageAsBlack) {
    Picture picture(GetParam(), 13, 9);
    picture.FillRandomly(100 + GetParam());
    for (const MeasuredRegion& region :
         {MeasuredRegion{10, 0, 13, 9}, MeasuredRegion{0, 7, 13, 9}, MeasuredRegion{12, 8, 13, 9},
          MeasuredRegion{40, 0, 13, 9}, MeasuredRegion{0, 9, 13, 9}, MeasuredRegion{500, 500, 2, 2},
          MeasuredRegion{0, 0, 400, 300}}) {
        ExpectMeasured(picture, region);
    }
}

TEST(RegionOfWords, IsSummedBeyond32Bits) {
    for (const std::uint32_t format : {RGBPlane16, RGB48}) {
        // Twice as high as the region, of whose planes every second row is taken.
        Picture picture(format, 300, 600);
        std::fill(picture.samples.begin(), picture.samples.end(), std::uint16_t{65535});
        ColourValues means;

        EXPECT_EQ(MeasureColourMeans(picture.Describe(), {0, 0, 300, 300}, &means), FilterDone);

        EXPECT_EQ(means.red, 65535U) << format;
        EXPECT_EQ(means.green, 65535U) << format;
        EXPECT_EQ(means.blue, 65535U) << format;
    }
}

TEST_P(RegionOfAThreeColourImage, MayHaveTheLargestNumbersAsItsPlaceAndSize) {
    constexpr std::uint32_t Most = 0xFFFFFFFF;
    Picture picture(GetParam(), 5, 3);
    picture.FillRandomly(GetParam());
    const MeasuredImage image = picture.Describe();
    ColourValues values{7, 8, 9};

    for (const MeasuredRegion& region :
         {MeasuredRegion{Most, 0, 4, 4}, MeasuredRegion{0, Most, 4, 4},
          MeasuredRegion{Most, Most, Most, Most}}) {
        EXPECT_EQ(MeasureColourMeans(image, region, &values), FilterDone);
        EXPECT_EQ(values.red + values.green + values.blue, 0U);
        EXPECT_EQ(MeasureColourMaxima(image, region, &values), FilterDone);
        EXPECT_EQ(values.red + values.green + values.blue, 0U);
    }
    EXPECT_EQ(MeasureColourMeans(image, {0, 0, Most, Most}, &values), FilterDone);
    EXPECT_EQ(MeasureColourMaxima(image, {0, 0, Most, Most}, &values), FilterDone);
}

TEST_P(RegionOfAThreeColourImage, WithoutPixelsLeavesTheMeansAndHasNoMaximum) {
    Picture picture(GetParam(), 5, 3);
    picture.FillRandomly(1);
    for (const MeasuredRegion& region : {MeasuredRegion{0, 0, 0, 3}, MeasuredRegion{0, 0, 5, 0}}) {
        ColourValues means{7, 8, 9};
        ColourValues maxima{7, 8, 9};

        EXPECT_EQ(MeasureColourMeans(picture.Describe(), region, &means), FilterDone);
        EXPECT_EQ(MeasureColourMaxima(picture.Describe(), region, &maxima), FilterDone);

        EXPECT_EQ(means.red, 7U);
        EXPECT_EQ(means.green, 8U);
        EXPECT_EQ(means.blue, 9U);
        EXPECT_EQ(maxima.red + maxima.green + maxima.blue, 0U);
    }
}

TEST_P(RegionOfAThreeColourImage, IsReadNoFurtherThanTheBytesAndTheSizeOfTheImageGo) {
    Picture picture(GetParam(), 8, 6);
    picture.FillRandomly(2);
    Picture cut = picture;
    const std::size_t held = picture.samples.size() - 11;
    std::fill(cut.samples.begin() + static_cast<std::ptrdiff_t>(held), cut.samples.end(), 0);
    MeasuredImage image = picture.Describe();
    image.bytes = held * (IsWords(GetParam()) ? 2 : 1);
    // A block of just that length, so that a read beyond is seen.
    const std::vector<std::uint8_t> block(image.data, image.data + image.bytes);
    image.data = block.data();
    ColourValues maxima;

    ASSERT_EQ(MeasureColourMaxima(image, {0, 0, 8, 6}, &maxima), FilterDone);

    EXPECT_EQ(maxima.red, Measure(cut, {0, 0, 8, 6}, 0).maximum);
    EXPECT_EQ(maxima.green, Measure(cut, {0, 0, 8, 6}, 1).maximum);
    EXPECT_EQ(maxima.blue, Measure(cut, {0, 0, 8, 6}, 2).maximum);
    for (const std::uint32_t side : {0x10000U, 0xFFFFFFFFU}) {
        image.width = side;
        image.height = side;
        EXPECT_EQ(MeasureColourMaxima(image, {3, 3, side, side}, &maxima), FilterDone);
    }
    image.width = 0;
    EXPECT_EQ(MeasureColourMaxima(image, {0, 0, 8, 6}, &maxima), FilterDone);
    EXPECT_EQ(maxima.red, 0U);
    image = {nullptr, 144, 8, 6, GetParam()};
    EXPECT_EQ(MeasureColourMaxima(image, {0, 0, 8, 6}, &maxima), FilterDone);
    EXPECT_EQ(maxima.red, 0U);
}

INSTANTIATE_TEST_SUITE_P(EachFormat, RegionOfAThreeColourImage,
                         testing::ValuesIn(ThreeColourFormats));

TEST(RegionOfPlanesOf16Bits, KeptSkipsEverySecondRow) {
    Picture picture(RGBPlane16, 4, 4);
    for (std::size_t index = 0; index < 16; ++index) {
        picture.samples[index] = (index / 4) % 2 == 0 ? 1000 : 60000;
    }
    ColourValues means;

    ASSERT_EQ(MeasureColourMeans(picture.Describe(), {0, 0, 4, 2}, &means), FilterDone);

    EXPECT_EQ(means.red, 1000U);
}

TEST(RegionOfPlanesOf16Bits, KeptGoesOnIntoTheNextPlaneAndBeyondTheLastOne) {
    Picture picture(RGBPlane16, 4, 4);
    std::fill(picture.samples.begin(), picture.samples.begin() + 16, 100);
    std::fill(picture.samples.begin() + 16, picture.samples.begin() + 32, 200);
    std::fill(picture.samples.begin() + 32, picture.samples.end(), 300);
    ColourValues means;

    ASSERT_EQ(MeasureColourMeans(picture.Describe(), {0, 0, 4, 4}, &means), FilterDone);

    EXPECT_EQ(means.red, 150U) << "half of the walk lies in the green plane";
    EXPECT_EQ(means.green, 250U);
    EXPECT_EQ(means.blue, 150U) << "beyond the image nothing is read";
}

TEST(RegionOfAnyOtherImage, CannotBeMeasuredByColour) {
    const std::uint8_t data[64] = {};
    for (const std::uint32_t format : {0U, 1U, 2U, 3U, 4U, 5U, 14U, 99U, 0xFFFFFFFFU}) {
        ColourValues values{1, 2, 3};
        const MeasuredImage image{data, sizeof(data), 4, 4, format};
        EXPECT_EQ(MeasureColourMeans(image, {0, 0, 4, 4}, &values), FilterUnknownFormat);
        EXPECT_EQ(MeasureColourMaxima(image, {0, 0, 4, 4}, &values), FilterUnknownFormat);
        EXPECT_EQ(values.red, 1U);
    }
}

TEST(RegionOfAnyOtherImage, HasAMaximumOfOneChannelForMonochromeAndMosaicsAlone) {
    for (const std::uint32_t format : {0U, 1U, 6U, 7U, 10U, 12U, 13U, 14U, 0xFFFFFFFFU}) {
        const std::uint8_t data[64] = {};
        std::uint32_t maximum = 77;
        EXPECT_EQ(MeasureMonoMaximum({data, sizeof(data), 2, 2, format}, {0, 0, 2, 2}, &maximum),
                  FilterUnknownFormat);
        EXPECT_EQ(maximum, 77U);
    }
}

class RegionOfOneChannel : public testing::TestWithParam<std::uint32_t> {};

TEST_P(RegionOfOneChannel, KeptIsSoManySamplesInARowAndNoRectangle) {
    Picture picture(GetParam(), 10, 5);
    for (std::size_t index = 0; index < picture.samples.size(); ++index) {
        picture.samples[index] = static_cast<std::uint16_t>(index + 1);
    }
    struct Case {
        MeasuredRegion region;
        std::uint32_t maximum;
    };
    for (const Case& row : {Case{{0, 0, 10, 5}, 50}, Case{{0, 0, 2, 3}, 6}, Case{{4, 1, 3, 2}, 20},
                            Case{{9, 4, 1, 1}, 50}, Case{{9, 4, 4, 4}, 50}, Case{{0, 5, 4, 4}, 0},
                            Case{{49, 0, 9, 9}, 50}, Case{{50, 0, 9, 9}, 0}, Case{{0, 0, 0, 5}, 0},
                            Case{{0xFFFFFFFF, 0xFFFFFFFF, 0xFFFFFFFF, 0xFFFFFFFF}, 0}}) {
        std::uint32_t maximum = 77;
        ASSERT_EQ(MeasureMonoMaximum(picture.Describe(), row.region, &maximum), FilterDone);
        EXPECT_EQ(maximum, row.maximum) << row.region.x << " " << row.region.y;
    }
}

TEST_P(RegionOfOneChannel, IsReadNoFurtherThanTheBytesGo) {
    Picture picture(GetParam(), 10, 5);
    std::fill(picture.samples.begin(), picture.samples.end(), 9);
    MeasuredImage image = picture.Describe();
    const std::vector<std::uint8_t> block(image.data, image.data + 7);
    image.data = block.data();
    image.bytes = block.size();
    std::uint32_t maximum = 0;

    EXPECT_EQ(MeasureMonoMaximum(image, {0, 0, 10, 5}, &maximum), FilterDone);
    EXPECT_EQ(maximum, 9U);
    image.data = nullptr;
    EXPECT_EQ(MeasureMonoMaximum(image, {0, 0, 10, 5}, &maximum), FilterDone);
    EXPECT_EQ(maximum, 0U);
}

INSTANTIATE_TEST_SUITE_P(EachFormat, RegionOfOneChannel,
                         testing::Values(Mono8, Mono16, Bayer8, Bayer16));

TEST(ColourLayout, TellsWhereTheColoursOfEachFormatStand) {
    struct Row {
        std::uint32_t format;
        std::uint32_t red, green, blue, step, sampleBytes, pixelBytes;
    };
    for (const Row& row :
         {Row{6, 0, 1, 2, 1, 1, 3}, Row{7, 0, 1, 2, 1, 2, 6}, Row{8, 2, 1, 0, 3, 1, 3},
          Row{9, 1, 2, 3, 4, 1, 4}, Row{10, 0, 1, 2, 3, 2, 6}, Row{11, 2, 1, 0, 4, 1, 4},
          Row{12, 0, 1, 2, 3, 1, 3}, Row{13, 0, 1, 2, 4, 1, 4}}) {
        const ColourLayout* const layout = FindColourLayout(row.format);
        ASSERT_NE(layout, nullptr) << row.format;
        EXPECT_EQ(layout->red, row.red) << row.format;
        EXPECT_EQ(layout->green, row.green) << row.format;
        EXPECT_EQ(layout->blue, row.blue) << row.format;
        EXPECT_EQ(layout->step, row.step) << row.format;
        EXPECT_EQ(layout->sampleBytes, row.sampleBytes) << row.format;
        EXPECT_EQ(layout->GetPixelBytes(), row.pixelBytes) << row.format;
        EXPECT_EQ(layout->GetPixelBytes(), GetThreeColourPixelBytes(row.format));
    }
    for (const std::uint32_t format : {0U, 5U, 14U, 0xFFFFFFFFU}) {
        EXPECT_EQ(FindColourLayout(format), nullptr);
    }
}

}  // namespace
}  // namespace ZV::Testing
