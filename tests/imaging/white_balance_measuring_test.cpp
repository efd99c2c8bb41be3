#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <bit>
#include <cmath>
#include <cstdint>
#include <limits>
#include <vector>

#include "imaging/auto_white_balance.h"
#include "imaging/balancing.h"
#include "imaging/scripted_camera.h"

namespace ZV::Testing {
namespace {

using testing::ElementsAre;

/// The whole measuring over a camera whose colours a test gives.
class WhiteBalanceMeasuring : public WhiteBalance {
  protected:
    WhiteBalanceMeasuring() {
        camera.imageFormat = CameraBayer;
        camera.render = [this](ScriptedCamera&) {
            return camera.MakeFlatImage(format, colours, depth);
        };
    }
    FilterResult Measure(std::uint32_t width = 100, std::uint32_t height = 100) {
        return filter->Preprocess(0, 0, width, height, static_cast<ZCamera*>(&camera));
    }
    void ExpectScales(float red, float green, float blue) {
        EXPECT_EQ(std::bit_cast<std::uint32_t>(filter->GetRedScale()),
                  std::bit_cast<std::uint32_t>(red));
        EXPECT_EQ(filter->GetGreenScale(), green);
        EXPECT_EQ(std::bit_cast<std::uint32_t>(filter->GetBlueScale()),
                  std::bit_cast<std::uint32_t>(blue));
    }

    ScriptedCamera camera;
    ZImageFormatEnum format = RGB24;
    std::vector<std::uint16_t> colours{100, 120, 160};
    std::uint16_t depth = 8;
};

/// Every step in single precision, in its order.
float CalculateScale(std::uint32_t red, std::uint32_t green, std::uint32_t blue,
                     std::uint32_t mean) {
    const float average = static_cast<float>(red + green + blue) / 3.0F;
    const float inverse = 1.0F / (average / static_cast<float>(green));
    return average / static_cast<float>(mean) * inverse;
}

TEST_F(WhiteBalanceMeasuring, TakesOneImageWhenAllMeansAreInBand) {
    EXPECT_EQ(Measure(), FilterDone);
    EXPECT_EQ(camera.imageCount, 1U);
    EXPECT_EQ(filter->GetRedMean(), 100U);
    EXPECT_EQ(filter->GetGreenMean(), 120U);
    EXPECT_EQ(filter->GetBlueMean(), 160U);
    ExpectScales(CalculateScale(100, 120, 160, 100), 1.0F, CalculateScale(100, 120, 160, 160));
    EXPECT_NEAR(filter->GetRedScale(), 1.2F, 1e-6F);
    EXPECT_NEAR(filter->GetBlueScale(), 0.75F, 1e-6F);
}

TEST_F(WhiteBalanceMeasuring, TakesSixImagesWhenTheMeansAreNeverInBand) {
    for (const std::vector<std::uint16_t>& out : {std::vector<std::uint16_t>{79, 120, 160},
                                                  {100, 79, 160},
                                                  {100, 120, 200},
                                                  {100, 200, 120},
                                                  {10, 20, 30}}) {
        colours = out;
        camera.imageCount = 0;
        EXPECT_EQ(Measure(), FilterDone);
        EXPECT_EQ(camera.imageCount, 6U);
        EXPECT_EQ(filter->GetRedScale(), CalculateScale(out[0], out[1], out[2], out[0]));
    }
}

TEST_F(WhiteBalanceMeasuring, ItsBandIs80To199With8BitsAnd20560To51400WithMore) {
    struct Row {
        std::uint16_t mean, depth;
        std::uint32_t images;
    };
    for (const Row& row : {Row{79, 8, 6}, Row{80, 8, 1}, Row{199, 8, 1}, Row{200, 8, 6},
                           Row{20559, 16, 6}, Row{20560, 16, 1}, Row{51400, 16, 1},
                           Row{51401, 16, 6}, Row{20560, 12, 1}, Row{100, 12, 6}}) {
        format = row.depth == 8 ? RGB24 : RGB48;
        depth = row.depth;
        colours = {row.mean, row.mean, row.mean};
        camera.imageCount = 0;
        EXPECT_EQ(Measure(), FilterDone);
        EXPECT_EQ(camera.imageCount, row.images) << row.mean << " of " << row.depth << " bits";
    }
}

TEST_F(WhiteBalanceMeasuring, GoesByTheDepthOfTheImageAndNotOfTheCamera) {
    camera.bitDepth = 16;
    EXPECT_EQ(Measure(), FilterDone);
    EXPECT_EQ(camera.imageCount, 1U);
}

TEST_F(WhiteBalanceMeasuring, MeasuresTheSecondPassAnew) {
    camera.render = [this](ScriptedCamera&) {
        return camera.imageCount == 1 ? camera.MakeFlatImage(RGB24, {10, 10, 10}, 8)
                                      : camera.MakeFlatImage(BGR24, {90, 120, 150}, 8);
    };
    EXPECT_EQ(Measure(), FilterDone);
    EXPECT_EQ(camera.imageCount, 2U);
    EXPECT_NEAR(filter->GetRedScale(), 0.8F, 1e-6F);
    EXPECT_NEAR(filter->GetBlueScale(), 120.0F / 90, 1e-6F);
}

TEST_F(WhiteBalanceMeasuring, AMeanOf0GivesScalesThatAreNoNumbersOrInfinite) {
    colours = {0, 120, 120};
    EXPECT_EQ(Measure(), FilterDone);
    EXPECT_EQ(filter->GetRedScale(), Infinity);
    EXPECT_EQ(filter->GetRedTable()->levels8[0], 255) << "not even black is a number";
    EXPECT_EQ(filter->GetRedTable()->levels8[1], 255);

    colours = {120, 0, 120};
    EXPECT_EQ(Measure(), FilterDone);
    EXPECT_EQ(filter->GetRedScale(), 0.0F);
    EXPECT_EQ(filter->GetGreenScale(), 1.0F);

    colours = {0, 0, 0};
    EXPECT_EQ(Measure(), FilterDone);
    EXPECT_TRUE(std::isnan(filter->GetRedScale()));
    EXPECT_TRUE(std::isnan(filter->GetBlueScale()));
    EXPECT_EQ(filter->GetBlueTable()->levels16[7], 65535);
}

TEST_F(WhiteBalanceMeasuring, KeepsItsMeansForARegionWithoutPixels) {
    EXPECT_EQ(Measure(0, 5), FilterDone);
    EXPECT_EQ(filter->GetRedMean(), 128U);
    EXPECT_EQ(camera.imageCount, 1U) << "128 is in band";
    EXPECT_EQ(filter->GetRedScale(), 1.0F);
}

TEST_F(WhiteBalanceMeasuring, CutsTheRegionToTheImageForTheLaterPassesToo) {
    camera.render = [this](ScriptedCamera&) {
        if (camera.imageCount > 1) return camera.MakeFlatImage(RGB24, {120, 120, 120}, 8);
        ImageTraits traits;
        traits.width = 1;
        traits.height = 1;
        traits.format = RGB24;
        return MakeImage({10, 10, 10}, traits);
    };
    EXPECT_EQ(Measure(), FilterDone);
    EXPECT_EQ(camera.imageCount, 2U);
    EXPECT_EQ(filter->GetRedMean(), 120U);
}

TEST_F(WhiteBalanceMeasuring, CutsTheRegionToTheImageThatThePipelineHasMade) {
    // The image shrinks to its left upper quarter, which is all that the mean is taken over.
    camera.probe.onProcessOutput = [](ZInImageBufferStruct* in, ZOutImageBufferStruct* out) {
        out->width = in->width / 2;
        out->height = in->height / 2;
        out->imageFormat = RGB24;
        out->imageSize = out->width * out->height * 3;
        std::fill_n(out->data, out->imageSize, std::uint8_t{120});
    };
    camera.probe.result = FilterDone;
    EXPECT_EQ(Measure(), FilterDone);
    EXPECT_EQ(filter->GetRedMean(), 120U) << "less, were the region of the whole image divided by";
    EXPECT_EQ(camera.imageCount, 1U);
}

TEST_F(WhiteBalanceMeasuring, OfAMosaicCameraLeavesTheExposures) {
    EXPECT_EQ(Measure(), FilterDone);
    EXPECT_THAT(camera.TakeCalls(), ElementsAre("image"));
}

TEST_F(WhiteBalanceMeasuring, OfAWheelMultipliesTheExposuresPassByPassAndCommitsThem) {
    camera.imageFormat = CameraRGBFilter;
    format = RGBPlane8;
    colours = {40, 80, 160};
    camera.render = [this](ScriptedCamera&) {
        if (camera.imageCount > 2) colours = {81, 81, 81};
        return camera.MakeFlatImage(format, colours, depth);
    };
    EXPECT_EQ(Measure(), FilterDone);
    EXPECT_THAT(camera.TakeCalls(),
                ElementsAre("image", "red 2000", "exposure 1000", "blue 500", "update", "image",
                            "red 4000", "exposure 1000", "blue 250", "update", "image", "red 4000",
                            "exposure 1000", "blue 250", "update"));
}

TEST_F(WhiteBalanceMeasuring, OfAWheelHoldsExposuresThatAreNoNumbers) {
    camera.imageFormat = CameraRGBFilter;
    format = RGBPlane8;
    camera.failingImage = 2;
    colours = {0, 120, 120};
    EXPECT_EQ(Measure(), CameraHalFault);
    EXPECT_EQ(camera.redExposure, std::numeric_limits<std::uint64_t>::max());

    camera.imageCount = 0;
    colours = {0, 0, 0};
    EXPECT_EQ(Measure(), CameraHalFault);
    EXPECT_EQ(camera.redExposure, 0U);
    EXPECT_EQ(camera.blueExposure, 0U);
    EXPECT_EQ(camera.exposure, 1000U);
}

class FailedWhiteBalance : public WhiteBalanceMeasuring,
                           public testing::WithParamInterface<std::uint32_t> {};

TEST_P(FailedWhiteBalance, LeavesTheScalesOfTheLastFinishedPass) {
    colours = {10, 20, 30};
    camera.failingImage = GetParam();
    camera.imageFailure = CameraUnknownFault;

    EXPECT_EQ(Measure(), CameraUnknownFault);

    EXPECT_EQ(camera.imageCount, GetParam());
    if (GetParam() == 1) {
        ExpectScales(1.16F, 1.0F, 1.88F);
    } else {
        ExpectScales(CalculateScale(10, 20, 30, 10), 1.0F, CalculateScale(10, 20, 30, 30));
    }
    camera.failingImage = 0;
    camera.imageCount = 0;
    EXPECT_EQ(Measure(), FilterDone) << "the next call works";
}

INSTANTIATE_TEST_SUITE_P(AtEachPass, FailedWhiteBalance, testing::Range(1U, 7U));

TEST_F(WhiteBalanceMeasuring, EndsWithTheFailureOfThePipeline) {
    camera.probe.result = FilterUnusableFormat;
    EXPECT_EQ(Measure(), FilterUnusableFormat);
    EXPECT_EQ(camera.imageCount, 1U);
    ExpectScales(1.16F, 1.0F, 1.88F);
}

TEST_F(WhiteBalanceMeasuring, CannotMeasureAMosaicThatNobodyHasResolved) {
    format = Bayer8;
    colours = {100};
    EXPECT_EQ(Measure(), FilterUnknownFormat);
    EXPECT_EQ(camera.imageCount, 1U);
    ExpectScales(1.16F, 1.0F, 1.88F);
}

TEST_F(WhiteBalanceMeasuring, RefusesToGoWithoutACamera) {
    EXPECT_EQ(filter->Preprocess(0, 0, 10, 10, nullptr), FilterFailed);
}

struct StandIn {
    std::uint32_t inForce;
    std::uint16_t depth;
    std::uint32_t whileMeasuring;
};

class MeasuringFormat : public WhiteBalanceMeasuring,
                        public testing::WithParamInterface<StandIn> {};

TEST_P(MeasuringFormat, FitsTheDepthOfTheImageAndTheOneInForceIsBackAfterwards) {
    depth = GetParam().depth;
    (void)camera.GetBayerFilter()->SetOutputFormat(GetParam().inForce);

    EXPECT_EQ(Measure(), FilterDone);

    EXPECT_EQ(camera.probe.formats.at(0), GetParam().whileMeasuring);
    EXPECT_EQ(camera.GetBayerFilter()->GetOutputFormat(), GetParam().inForce);

    camera.probe.result = FilterUnusableFormat;
    EXPECT_EQ(Measure(), FilterUnusableFormat);
    EXPECT_EQ(camera.GetBayerFilter()->GetOutputFormat(), GetParam().inForce);
}

TEST_P(MeasuringFormat, StaysTheOneThatAnotherThreadSendsMeanwhile) {
    depth = GetParam().depth;
    (void)camera.GetBayerFilter()->SetOutputFormat(GetParam().inForce);
    camera.probe.onProcess = [this](ZInImageBufferStruct*) {
        (void)camera.GetBayerFilter()->SetOutputFormat(99);
    };

    EXPECT_EQ(Measure(), FilterDone);

    EXPECT_EQ(camera.GetBayerFilter()->GetOutputFormat(), 99U);
}

INSTANTIATE_TEST_SUITE_P(EachFormatAndDepth, MeasuringFormat,
                         testing::Values(StandIn{8, 8, 8}, StandIn{9, 8, 9}, StandIn{10, 8, 12},
                                         StandIn{11, 8, 11}, StandIn{12, 8, 12}, StandIn{13, 8, 13},
                                         StandIn{8, 12, 10}, StandIn{9, 16, 10},
                                         StandIn{10, 12, 10}, StandIn{11, 14, 10},
                                         StandIn{12, 12, 10}, StandIn{13, 16, 10},
                                         StandIn{0, 12, 0}, StandIn{5, 8, 5}, StandIn{6, 12, 6},
                                         StandIn{7, 8, 7}, StandIn{14, 12, 14}));

}  // namespace
}  // namespace ZV::Testing
