#include "imaging/bayer_interpolation.h"

#include <gtest/gtest.h>

#include <thread>
#include <vector>

#include "imaging/bayer_road.h"
#include "imaging/image_fixture.h"
#include "imaging/image_pipeline.h"
#include "imaging/kernels/kernel_judge.h"

namespace ZV::Testing {
namespace {

constexpr std::uint8_t Untouched = 0xA5;
constexpr std::uint32_t Width = 12;
constexpr std::uint32_t Height = 8;
constexpr std::size_t Pixels = Width * Height;

constexpr PlaneKernels JudgeOfBytes{Judge::ShiftRightPlane8, Judge::AddPlane8, Judge::EnlargePlane8,
                                    Judge::PackPlanes8x3, Judge::PackPlanes8x4};
constexpr PlaneKernels JudgeOfWords{Judge::ShiftRightPlane16, Judge::AddPlane16,
                                    Judge::EnlargePlane16, Judge::PackPlanes16x3, nullptr};

/// A filter before its frame, with everything in order.
class BayerFilter : public testing::Test {
  protected:
    BayerFilter() : pixels(Ramp(2 * Pixels)), image(6 * Pixels, Untouched) {
        in.data = pixels.data();
        in.imageSize = Pixels;
        in.width = Width;
        in.height = Height;
        in.bitDepth = 8;
        in.colourPattern = PatternGRBG;
        in.imageFormat = Bayer8;
        out.data = image.data();
        out.dataCapacity = image.size();
        out.width = 3;
        out.height = 4;
        out.imageSize = 5;
        out.imageFormat = 77;
        (void)filter.Init(Width, Height);
    }

    Bytes GetExpected(std::int32_t interpolation, std::uint32_t format) const {
        const BayerMosaic mosaic{in.data, in.imageSize, in.width, in.height, in.colourPattern};
        const bool isOfWords = Is16Bit(format);
        return BayerRoad(isOfWords ? JudgeOfWords : JudgeOfBytes, isOfWords ? 2 : 1)
            .Run(mosaic, interpolation, format);
    }
    Bytes GetImage(std::size_t bytes) const { return {image.data(), image.data() + bytes}; }
    void ExpectUntouched() const {
        EXPECT_EQ(image, Bytes(image.size(), Untouched));
        EXPECT_EQ(out.width, 3U);
        EXPECT_EQ(out.height, 4U);
        EXPECT_EQ(out.imageSize, 5U);
        EXPECT_EQ(out.imageFormat, 77U);
    }

    Bytes pixels;
    Bytes image;
    ZInImageBufferStruct in;
    ZOutImageBufferStruct out;
    ZBayerInterpolation filter{1, RGB24};
};

TEST_F(BayerFilter, MakesEachFormatByTheStoredAlgorithm) {
    struct Row {
        std::uint16_t algorithm;
        std::int32_t interpolation;
    };
    // Kept: 3, which a client never gets in here, is linear, and so is everything unknown.
    const Row rows[] = {{1, 2}, {2, 1}, {4, 4}, {3, 2}, {0, 2}, {77, 2}};
    for (const Row& row : rows) {
        (void)filter.SetAlgorithm(row.algorithm);
        for (const std::uint32_t format : {BGR24, XRGB32, BGRX32, RGB24, RGBX32}) {
            (void)filter.SetOutputFormat(format);
            ASSERT_EQ(filter.Process(&in, &out), FilterDone);
            EXPECT_EQ(GetImage(out.imageSize), GetExpected(row.interpolation, format));
            EXPECT_EQ(out.imageSize, Pixels * GetThreeColourPixelBytes(format));
            EXPECT_EQ(out.imageFormat, format);
            EXPECT_EQ(out.width, Width);
            EXPECT_EQ(out.height, Height);
        }
    }
}

TEST_F(BayerFilter, KeptTheOutputsFormatDecidesBetweenBytesAndWords) {
    (void)filter.SetOutputFormat(RGB48);
    for (const std::uint32_t bytes : {2 * Width * Height, Width * Height}) {
        in.imageSize = bytes;
        ASSERT_EQ(filter.Process(&in, &out), FilterDone);
        EXPECT_EQ(out.imageSize, 6 * Pixels);
        EXPECT_EQ(GetImage(6 * Pixels), GetExpected(2, RGB48)) << "nothing beyond the size is read";
    }

    (void)filter.SetOutputFormat(RGB24);
    in.imageFormat = Bayer16;
    ASSERT_EQ(filter.Process(&in, &out), FilterDone);
    EXPECT_EQ(GetImage(3 * Pixels), GetExpected(2, RGB24));
}

TEST_F(BayerFilter, DeclinesWhatIsNoMosaicOrNotToBecomeColours) {
    for (const std::uint32_t format : {0U, 1U, 2U, 3U, 6U, 12U, 13U, 99U}) {
        in.imageFormat = format;
        EXPECT_EQ(filter.Process(&in, &out), FilterDeclined) << format;
    }
    in.imageFormat = Bayer16;
    for (const std::uint32_t format : {0U, 4U, 5U, 14U, 0x1000CU}) {
        (void)filter.SetOutputFormat(format);
        EXPECT_EQ(filter.Process(&in, &out), FilterDeclined) << format;
    }
    ExpectUntouched();
}

TEST_F(BayerFilter, IsOfNoUseBeforeInit) {
    ZBayerInterpolation fresh(1, RGB24);
    EXPECT_EQ(fresh.Process(&in, &out), FilterNotInitialised);
    in.imageFormat = Mono8;
    EXPECT_EQ(fresh.Process(&in, &out), FilterDeclined) << "that comes first";
    ExpectUntouched();
}

TEST_F(BayerFilter, MakesNoWholePlanes) {
    for (const std::uint32_t format : {RGBPlane8, RGBPlane16}) {
        (void)filter.SetOutputFormat(format);
        EXPECT_EQ(filter.Process(&in, &out), FilterUnusableFormat);
        EXPECT_EQ(ZBayerInterpolation(1, static_cast<std::uint16_t>(format)).Process(&in, &out),
                  FilterNotInitialised)
            << "that comes first";
    }
    ExpectUntouched();
}

TEST_F(BayerFilter, RefusesAFrameLargerThanTheSensor) {
    in.height = Height + 1;
    EXPECT_EQ(filter.Process(&in, &out), FilterNotInitialised);
    in.width = in.height = 0xFFFFFFFF;
    EXPECT_EQ(filter.Process(&in, &out), FilterNotInitialised);
    ExpectUntouched();

    in.width = Height;
    in.height = Width;
    EXPECT_EQ(filter.Process(&in, &out), FilterDone) << "as many pixels, turned by a quarter";
    EXPECT_EQ(GetImage(3 * Pixels), GetExpected(2, RGB24));
}

TEST_F(BayerFilter, RefusesMissingDataAndAnImageThatDoesNotFit) {
    in.data = nullptr;
    EXPECT_EQ(filter.Process(&in, &out), FilterFailed);
    in.data = pixels.data();
    out.data = nullptr;
    EXPECT_EQ(filter.Process(&in, &out), FilterFailed);
    out.data = image.data();
    out.dataCapacity = 3 * Pixels - 1;
    EXPECT_EQ(filter.Process(&in, &out), FilterFailed);
    ExpectUntouched();

    out.dataCapacity = 0;
    EXPECT_EQ(filter.Process(&in, &out), FilterDone) << "vouched for";
}

TEST_F(BayerFilter, MeasuresWhatItWrites) {
    for (std::uint32_t format = 0; format < 16; ++format) {
        (void)filter.SetOutputFormat(format);
        const bool isDone = filter.Process(&in, &out) == FilterDone;
        EXPECT_EQ(filter.MeasureOutput(in, format), isDone ? out.imageSize : 0) << format;
    }
    EXPECT_EQ(filter.MeasureOutput(in, 0x1000C), 0U);
    EXPECT_EQ(ZBayerInterpolation(1, RGB24).MeasureOutput(in, RGB24), 0U) << "before Init";
    in.imageFormat = Mono8;
    EXPECT_EQ(filter.MeasureOutput(in, RGB24), 0U);
    in.imageFormat = Bayer16;
    in.height = Height + 1;
    EXPECT_EQ(filter.MeasureOutput(in, RGB24), 0U) << "larger than the sensor";
    (void)filter.Init(0x10000, 0x10000);
    in.width = in.height = 0x8000;
    EXPECT_EQ(filter.MeasureOutput(in, RGB24), 3U << 30);
    EXPECT_EQ(filter.MeasureOutput(in, XRGB32), 0U) << "above 32 bits";
    in.width = in.height = 0xFFFFFFFF;
    EXPECT_EQ(filter.MeasureOutput(in, RGB24), 0U);
}

TEST_F(BayerFilter, MakesAnEmptyImageOfAnEmptyFrame) {
    in.width = 0;
    EXPECT_EQ(filter.Process(&in, &out), FilterDone);
    EXPECT_EQ(out.imageSize, 0U);
    EXPECT_EQ(image, Bytes(image.size(), Untouched));
}

TEST_F(BayerFilter, TakesFramesOfChangingSizesOneAfterTheOther) {
    for (const std::uint32_t side : {8U, 9U, 2U, 3U, 9U, 5U, 8U}) {
        in.width = in.height = side;
        for (const std::uint16_t algorithm : std::initializer_list<std::uint16_t>{4, 1, 2}) {
            (void)filter.SetAlgorithm(algorithm);
            ASSERT_EQ(filter.Process(&in, &out), FilterDone);
            const std::int32_t interpolation = algorithm == 4 ? 4 : algorithm == 1 ? 2 : 1;
            EXPECT_EQ(GetImage(3 * side * side), GetExpected(interpolation, RGB24)) << side;
        }
    }
}

TEST_F(BayerFilter, MayBeInitialisedAnewBetweenFrames) {
    const Bytes expected = GetExpected(2, RGB24);
    for (const std::uint32_t side : {100U, 10U, 65535U, 0xFFFFFFFFU}) {
        (void)filter.Init(side, side);
        ASSERT_EQ(filter.Process(&in, &out), FilterDone) << side;
        EXPECT_EQ(GetImage(3 * Pixels), expected);
    }
    (void)filter.Init(0, 0);
    EXPECT_EQ(filter.Process(&in, &out), FilterNotInitialised);
}

TEST_F(BayerFilter, ServesTwoPipelinesAtOnce) {
    const Bytes expected = GetExpected(2, RGB24);
    const auto process = [&] {
        Bytes made(3 * Pixels);
        for (int round = 0; round < 500; ++round) {
            ZInImageBufferStruct frame = in;
            ZOutImageBufferStruct result;
            result.data = made.data();
            result.dataCapacity = made.size();
            ASSERT_EQ(filter.Process(&frame, &result), FilterDone);
            ASSERT_EQ(made, expected);
        }
    };
    std::thread other(process);
    std::thread again([&] {
        for (int round = 0; round < 100; ++round) (void)filter.Init(Width, Height);
    });
    process();
    other.join();
    again.join();
}

TEST_F(BayerFilter, AMonochromeFrameIsPassedOnByThePipeline) {
    ZImagePipeline pipeline;
    pipeline.Setup(Width, Height);
    pipeline.AddFilter(&filter);
    in.imageFormat = Mono8;
    bool isComplete = false;

    EXPECT_EQ(pipeline.ProcessImage(&in, &out, &isComplete), FilterDeclined);

    EXPECT_TRUE(isComplete);
    EXPECT_EQ(out.imageFormat, static_cast<std::uint32_t>(Mono8));
    EXPECT_EQ(GetImage(Pixels), Bytes(pixels.begin(), pixels.begin() + Pixels));
}

TEST_F(BayerFilter, AnImageOfThePipelineBecomesTheColours) {
    ZImagePipeline pipeline;
    pipeline.Setup(Width, Height);
    pipeline.AddFilter(&filter);
    const Bytes mosaic(pixels.begin(), pixels.begin() + Pixels);
    ZExImage frame = MakeImage(
        mosaic, {.width = Width, .height = Height, .format = Bayer8, .pattern = PatternGRBG});
    bool isComplete = false;

    EXPECT_EQ(pipeline.ProcessImage(&frame, &isComplete), FilterDone);

    EXPECT_EQ(GetPixels(frame), GetExpected(2, RGB24));
    EXPECT_EQ(frame.GetImageFormat(), RGB24);
    EXPECT_EQ(frame.GetColourPattern(), PatternGRBG) << "not updated";
}

// ---- The engines as public forms ----

TEST_F(BayerFilter, ThePublicFormChoosesTheEngineByTheFormatAndNeedsNoInit) {
    ZBayerInterpolation fresh(2, BGR24);
    in.imageSize = 2 * Pixels;
    for (const std::uint32_t format : {BGR24, XRGB32, RGB48, BGRX32, RGB24, RGBX32}) {
        std::uint32_t bytes = 0;
        EXPECT_EQ(fresh.BayerUsingSSE(in.data, Width, Height, 8, PatternGRBG, out.data, format,
                                      &bytes, nullptr, nullptr, 4),
                  FilterDone);
        EXPECT_EQ(bytes, Pixels * GetThreeColourPixelBytes(format));
        EXPECT_EQ(GetImage(bytes), GetExpected(4, format));
    }
}

TEST_F(BayerFilter, ThePublicFormsFailWithoutAPlaceForTheSize) {
    for (const std::uint32_t format : {RGB24, RGB48}) {
        EXPECT_EQ(filter.BayerUsingSSE(in.data, Width, Height, 8, PatternRGGB, out.data, format,
                                       nullptr, nullptr, nullptr, 1),
                  FilterFailed);
    }
    EXPECT_EQ(filter.Private_Bayer8BitUsingSSE(in.data, Width, Height, 8, PatternRGGB, out.data,
                                               RGBPlane8, nullptr, nullptr, nullptr, 1),
              FilterFailed);
    EXPECT_EQ(filter.Private_Bayer16BitUsingSSE(in.data, Width, Height, 16, PatternRGGB, out.data,
                                                RGBPlane16, nullptr, nullptr, nullptr, 1),
              FilterFailed);
    EXPECT_EQ(filter.Private_Bayer8BitUsingSSE(nullptr, 0, 0, 8, PatternRGGB, nullptr, RGB24,
                                               nullptr, nullptr, nullptr, 1),
              FilterFailed)
        << "of no pixels";
    ExpectUntouched();
}

TEST_F(BayerFilter, KeptThePublicFormGivesTheAlgorithmBackForAFormatWithoutAnEngine) {
    std::uint32_t bytes = 99;
    for (const std::uint32_t format : {0U, 5U, 6U, 7U, 14U, 0x1000CU}) {
        const auto run = [&](std::uint32_t algorithm) {
            return filter.BayerUsingSSE(in.data, Width, Height, 8, PatternRGGB, out.data, format,
                                        &bytes, nullptr, nullptr, algorithm);
        };
        EXPECT_EQ(run(4), 4);
        EXPECT_EQ(run(0x12345), 0x2345);
        EXPECT_EQ(run(0x1FFFF), -1);
    }
    EXPECT_EQ(bytes, 99U);
    ExpectUntouched();
}

TEST_F(BayerFilter, TheEnginesMakeWholePlanesAndRefuseEachOthersFormats) {
    std::uint32_t bytes = 0;
    EXPECT_EQ(filter.Private_Bayer8BitUsingSSE(in.data, Width, Height, 8, PatternGRBG, out.data,
                                               RGBPlane8, &bytes, nullptr, nullptr, 1),
              FilterDone);
    EXPECT_EQ(bytes, 3 * Pixels);
    EXPECT_EQ(GetImage(bytes), GetExpected(1, RGBPlane8));

    in.imageSize = 2 * Pixels;
    EXPECT_EQ(filter.Private_Bayer16BitUsingSSE(in.data, Width, Height, 16, PatternGRBG, out.data,
                                                RGBPlane16, &bytes, nullptr, nullptr, 4),
              FilterDone);
    EXPECT_EQ(bytes, 6 * Pixels);
    EXPECT_EQ(GetImage(bytes), GetExpected(4, RGBPlane16));

    EXPECT_EQ(filter.Private_Bayer8BitUsingSSE(in.data, Width, Height, 8, PatternGRBG, out.data,
                                               RGB48, &bytes, nullptr, nullptr, 1),
              FilterUnusableFormat);
    EXPECT_EQ(filter.Private_Bayer16BitUsingSSE(in.data, Width, Height, 8, PatternGRBG, out.data,
                                                RGB24, &bytes, nullptr, nullptr, 1),
              FilterUnusableFormat);
}

}  // namespace
}  // namespace ZV::Testing
