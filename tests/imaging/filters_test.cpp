// What the filters hold and answer apart from the images that they make.

#include <gtest/gtest.h>

#include <atomic>
#include <bit>
#include <cmath>
#include <limits>
#include <memory>
#include <thread>

#include "imaging/auto_exposure.h"
#include "imaging/auto_white_balance.h"
#include "imaging/bayer_interpolation.h"
#include "imaging/folary_ratio_correction.h"
#include "imaging/image_formats.h"
#include "imaging/rgb_filter_wheel.h"

namespace ZV::Testing {
namespace {

TEST(BayerInterpolation, HoldsAlgorithmAndFormatUnchecked) {
    ZBayerInterpolation filter(1, 12);
    EXPECT_EQ(filter.GetAlgorithm(), 1);
    EXPECT_EQ(filter.GetOutputFormat(), 12U);
    EXPECT_FALSE(filter.IsInitialised());

    EXPECT_EQ(filter.SetAlgorithm(77), FilterDone);
    EXPECT_EQ(filter.SetOutputFormat(0xABCDEF), FilterDone);

    EXPECT_EQ(filter.GetAlgorithm(), 77);
    EXPECT_EQ(filter.GetOutputFormat(), 0xABCDEFU);
}

TEST(BayerInterpolation, MayBeInitialisedAgainAndByANonsensicalSize) {
    ZBayerInterpolation filter(1, 12);
    for (const std::uint32_t side : {8U, 100U, 0U, 65535U, 0xFFFFFFFFU}) {
        EXPECT_EQ(filter.Init(side, side), FilterDone);
        EXPECT_TRUE(filter.IsInitialised());
    }
}

TEST(BayerInterpolation, KeptItAsksForTheBytesOfAPixelTimesTheBytesOfTheMosaic) {
    ZBayerInterpolation filter(1, RGB48);
    ZInImageBufferStruct in;
    in.imageSize = 1000;
    in.imageFormat = Bayer16;
    EXPECT_EQ(filter.GetNeededOutputBufferSize(&in), 6000U) << "twice the need of 16-bit samples";
    in.imageFormat = Mono16;
    EXPECT_EQ(filter.GetNeededOutputBufferSize(&in), 1000U);
    in.imageFormat = Bayer8;
    in.imageSize = 0x80000000;
    EXPECT_EQ(filter.GetNeededOutputBufferSize(&in), 0U) << "32 bits";
    in.imageSize = 10;
    (void)filter.SetOutputFormat(Mono8);
    EXPECT_EQ(filter.GetNeededOutputBufferSize(&in), 0U);
}

TEST(FolaryRatioCorrection, TakesEverySizeAndFormat) {
    ZFolaryRatioCorrection filter(0);
    ZInImageBufferStruct in;
    in.imageSize = 123;

    EXPECT_EQ(filter.Init(0xFFFFFFFF, 0xFFFFFFFF), FilterDone);
    EXPECT_EQ(filter.SetOutputFormat(99), FilterDone);
    EXPECT_EQ(filter.GetNeededOutputBufferSize(&in), 123U);
}

TEST(RGBFilterWheel, StartsWithoutASetAndTakesEverySize) {
    ZRGBFilterWheel wheel(6);

    EXPECT_EQ(wheel.GetOutputFormat(), 6U);
    EXPECT_FALSE(wheel.IsStarted());
    EXPECT_EQ(wheel.GetRedCount() + wheel.GetGreenCount() + wheel.GetBlueCount(), 0);
    EXPECT_EQ(wheel.Init(65535, 65535), FilterDone);
    EXPECT_EQ(wheel.Init(16, 16), FilterDone);
    EXPECT_EQ(wheel.SetOutputFormat(13), FilterDone);
    EXPECT_EQ(wheel.GetOutputFormat(), 13U);
}

TEST(RGBFilterWheel, AsksForNoGrowthWhileNoSetIsUnderWay) {
    ZRGBFilterWheel wheel(6);
    ZInImageBufferStruct in;
    in.imageSize = 100;
    for (std::uint32_t colour = 0; colour < 5; ++colour) {
        in.filterColour = colour;
        EXPECT_EQ(wheel.GetNeededOutputBufferSize(&in), 100U);
    }
}

TEST(RGBFilterWheel, MayBeDisabledEnabledAndResetInAnyOrder) {
    ZRGBFilterWheel wheel(6);
    wheel.Enable();
    wheel.Disable();
    wheel.Disable();
    EXPECT_FALSE(wheel.IsEnabled());
    (void)wheel.Init(16, 16);
    EXPECT_FALSE(wheel.IsEnabled());
    wheel.Enable();
    wheel.Reset();

    EXPECT_TRUE(wheel.IsEnabled());
    EXPECT_FALSE(wheel.IsStarted());
}

std::int32_t Level8(float scale, std::size_t level) {
    const auto filter = std::make_unique<ZAutoWhiteBalance>(false);
    filter->SetGreenScale(scale);
    return filter->GetGreenTable()->levels8[level];
}

TEST(AutoWhiteBalance, StartsWithTheScalesOfItsMakers) {
    const auto filter = std::make_unique<ZAutoWhiteBalance>(false);

    EXPECT_EQ(std::bit_cast<std::uint32_t>(filter->GetRedScale()), 0x3F947AE1U);
    EXPECT_EQ(std::bit_cast<std::uint32_t>(filter->GetGreenScale()), 0x3F800000U);
    EXPECT_EQ(std::bit_cast<std::uint32_t>(filter->GetBlueScale()), 0x3FF0A3D7U);
    EXPECT_EQ(filter->GetRedMean(), 128U);
    EXPECT_EQ(filter->GetGreenMean(), 128U);
    EXPECT_EQ(filter->GetBlueMean(), 128U);
}

TEST(AutoWhiteBalance, ALevelIsScaledTruncatedAndCutAtTheTop) {
    EXPECT_EQ(Level8(1.5F, 200), 255);
    EXPECT_EQ(Level8(1.5F, 101), 151);
    EXPECT_EQ(Level8(0.5F, 254), 127);
    EXPECT_EQ(Level8(0.0F, 255), 0);
    EXPECT_EQ(Level8(-2.0F, 100), -200);
}

TEST(AutoWhiteBalance, AProductThatIsNoNumberGivesTheTopLevel) {
    const float infinity = std::numeric_limits<float>::infinity();
    EXPECT_EQ(Level8(std::nanf(""), 7), 255);
    EXPECT_EQ(Level8(infinity, 0), 255);
    EXPECT_EQ(Level8(infinity, 1), 255);
    EXPECT_EQ(Level8(-infinity, 1), std::numeric_limits<std::int32_t>::min());
    EXPECT_EQ(Level8(-3e38F, 200), std::numeric_limits<std::int32_t>::min());
}

TEST(AutoWhiteBalance, AScaleOf1IsTheIdentityOf16Bits) {
    const auto filter = std::make_unique<ZAutoWhiteBalance>(false);
    const auto table = filter->GetGreenTable();
    const auto& levels = table->levels16;
    for (std::size_t level = 0; level < levels.size(); ++level) {
        ASSERT_EQ(levels[level], static_cast<std::int32_t>(level));
    }
}

TEST(AutoWhiteBalance, EachScaleBuildsTheTablesOfItsColourAlone) {
    const auto filter = std::make_unique<ZAutoWhiteBalance>(true);

    filter->SetRedScale(2.0F);
    filter->SetBlueScale(0.25F);
    filter->SetCalculateValuesOnAllFrames(false);

    EXPECT_EQ(filter->GetRedTable()->levels8[100], 200);
    EXPECT_EQ(filter->GetRedTable()->levels16[40000], 65535);
    EXPECT_EQ(filter->GetGreenTable()->levels16[40000], 40000);
    EXPECT_EQ(filter->GetBlueTable()->levels16[40000], 10000);
    EXPECT_EQ(filter->GetRedScale(), 2.0F);
    EXPECT_EQ(filter->GetBlueScale(), 0.25F);
    EXPECT_EQ(filter->Init(1, 1), FilterDone);
    EXPECT_EQ(filter->SetOutputFormat(99), FilterDone);
}

TEST(AutoWhiteBalance, TablesThatAreHeldStayWholeWhileTheScaleIsSetAnew) {
    const auto filter = std::make_unique<ZAutoWhiteBalance>(false);
    filter->SetRedScale(0.25F);
    const auto held = filter->GetRedTable();
    std::atomic<bool> mayEnd{false};
    std::thread setter([&] {
        while (!mayEnd) {
            filter->SetRedScale(0.5F);
            filter->SetRedScale(0.25F);
        }
    });

    for (int round = 0; round < 200; ++round) {
        const auto table = filter->GetRedTable();
        const std::int32_t top = table->levels8.back();
        EXPECT_EQ(table->levels16[1000], top == 127 ? 500 : 250) << "of one and the same scale";
        EXPECT_EQ(table->levels16.back(), top == 127 ? 32767 : 16383);
    }
    mayEnd = true;
    setter.join();

    EXPECT_EQ(held->levels8[100], 25);
}

TEST(AutoExposure, MeasuresTheWholeSensorFromInitOn) {
    ZAutoExposure filter(false);
    EXPECT_EQ(filter.GetWidth() + filter.GetHeight() + filter.GetX() + filter.GetY(), 0U);

    EXPECT_EQ(filter.Init(640, 480), FilterDone);

    EXPECT_EQ(filter.GetWidth(), 640U);
    EXPECT_EQ(filter.GetHeight(), 480U);
    EXPECT_EQ(filter.SetOutputFormat(99), FilterDone);
}

TEST(Filters, DeclineAnImageOfNoFormatAndNoCamera) {
    ZBayerInterpolation bayer(1, 12);
    ZFolaryRatioCorrection ratio(0);
    ZRGBFilterWheel wheel(6);
    const auto balance = std::make_unique<ZAutoWhiteBalance>(false);
    ZAutoExposure exposure(false);
    ZInImageBufferStruct in;
    ZOutImageBufferStruct out;

    ZImageFilter* filters[] = {&bayer, &ratio, &wheel, balance.get(), &exposure};
    for (ZImageFilter* filter : filters) EXPECT_EQ(filter->Process(&in, &out), FilterDeclined);
}

}  // namespace
}  // namespace ZV::Testing
