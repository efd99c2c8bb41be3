#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <atomic>
#include <cstdint>
#include <memory>
#include <thread>
#include <utility>
#include <vector>

#include "imaging/auto_white_balance.h"
#include "imaging/balancing.h"

namespace ZV::Testing {
namespace {

using testing::ElementsAre;

TEST_F(WhiteBalance, ClipsAtTheTopAndKeepsTheTopSampleValueAsItIs) {
    SetScales(1.5F, 0.5F, 0.5F);
    Balancing balancing({200, 255, 254}, 1, 1, RGB24);

    ASSERT_EQ(balancing.Run(*filter), FilterDone);

    EXPECT_EQ(balancing.GetPixels(), (Bytes{255, 255, 127}));
}

TEST_F(WhiteBalance, KeepsTheTopSampleValueOf16BitsAsItIs) {
    SetScales(0.5F, 0.5F, 0.0F);
    Balancing balancing({0xFF, 0xFF, 0xFE, 0xFF, 0xFE, 0xFF}, 1, 1, RGB48);

    ASSERT_EQ(balancing.Run(*filter), FilterDone);

    EXPECT_EQ(balancing.GetPixels(), (Bytes{0xFF, 0xFF, 0xFF, 0x7F, 0, 0}));
}

TEST_F(WhiteBalance, AScaleOf1LeavesEverySampleOf16BitsAlone) {
    SetScales(1.0F, 1.0F, 1.0F);
    Bytes every(65536 * 6);
    for (std::size_t index = 0; index < every.size(); ++index) {
        const std::size_t sample = index / 6;
        every[index] = static_cast<std::uint8_t>(index % 2 == 0 ? sample : sample >> 8);
    }
    Balancing balancing(every, 256, 256, RGB48);

    ASSERT_EQ(balancing.Run(*filter), FilterDone);

    EXPECT_EQ(balancing.GetPixels(), every);
}

TEST_F(WhiteBalance, LeavesTheByteForPaddingAlone) {
    SetScales(0.0F, 0.0F, 0.0F);
    for (const auto& [format, expected] : {std::pair{XRGB32, Bytes{7, 0, 0, 0}},
                                           {BGRX32, Bytes{0, 0, 0, 7}},
                                           {RGBX32, Bytes{0, 0, 0, 7}}}) {
        Balancing balancing(Bytes(4, 7), 1, 1, format);
        ASSERT_EQ(balancing.Run(*filter), FilterDone);
        EXPECT_EQ(balancing.GetPixels(), expected) << format;
    }
}

TEST_F(WhiteBalance, DeclinesAMonochromeCameraAndLeavesTheImage) {
    const Bytes pixels = MakeRandomBytes(12, 1);
    Balancing balancing(pixels, 2, 2, RGB24);
    balancing.camera.imageFormat = CameraMono;
    EXPECT_EQ(balancing.Run(*filter), FilterDeclined);
    EXPECT_EQ(balancing.GetPixels(), pixels);

    balancing.in.camera = nullptr;
    EXPECT_EQ(balancing.Run(*filter), FilterDeclined);
    EXPECT_EQ(balancing.GetPixels(), pixels);
}

TEST_F(WhiteBalance, BalancesTheImagesOfAWheel) {
    Balancing balancing({100, 100, 100}, 1, 1, RGBPlane8);
    balancing.camera.imageFormat = CameraRGBFilter;
    SetScales(2.0F, 1.0F, 0.5F);
    EXPECT_EQ(balancing.Run(*filter), FilterDone);
    EXPECT_EQ(balancing.GetPixels(), (Bytes{200, 100, 50}));
}

TEST_F(WhiteBalance, KeptLooksAtTheFormatOfTheOutputFirstAndWorksByThatOfTheInput) {
    const Bytes pixels = MakeRandomBytes(12, 1);
    Balancing balancing(pixels, 2, 2, Bayer8);
    balancing.out.imageFormat = RGB24;
    EXPECT_EQ(balancing.Run(*filter), FilterUnusableFormat);
    balancing.in.imageFormat = RGB24;
    for (const std::uint32_t format : {0U, 4U, 5U, 14U, 0xFFFFFFFFU}) {
        balancing.out.imageFormat = format;
        EXPECT_EQ(balancing.Run(*filter), FilterDeclined) << format;
    }
    EXPECT_EQ(balancing.GetPixels(), pixels);

    SetScales(0.0F, 1.0F, 1.0F);
    balancing.out.imageFormat = BGR24;
    EXPECT_EQ(balancing.Run(*filter), FilterDone);
    EXPECT_EQ(balancing.out.imageFormat, RGB24);
    EXPECT_EQ(balancing.GetPixels()[0], pixels[0] == 255 ? 255 : 0) << "red comes first";
    EXPECT_EQ(balancing.GetPixels()[2], pixels[2]);
}

TEST_F(WhiteBalance, RefusesAFormatThatIsNoneForTheDepth) {
    const Bytes pixels = MakeRandomBytes(48, 1);
    for (const std::uint32_t format : {6U, 7U, 8U, 9U, 10U, 11U, 12U, 13U}) {
        for (const std::uint32_t depth : {0U, 7U, 8U, 9U, 12U, 16U, 0xFFFFFFFFU}) {
            if (IsOfWords(format) == (depth != 8)) continue;
            Balancing balancing(pixels, 2, 2, format);
            balancing.in.bitDepth = depth;
            EXPECT_EQ(balancing.Run(*filter), FilterUnusableFormat) << format << " " << depth;
            EXPECT_EQ(balancing.GetPixels(), pixels);
        }
    }
}

TEST_F(WhiteBalance, RefusesAnImageThatIsNotThere) {
    const Bytes pixels = MakeRandomBytes(48, 1);
    for (const std::uint32_t format : {6U, 7U, 8U, 9U, 10U, 11U, 12U, 13U}) {
        const auto refuse = [&](auto spoil) {
            Balancing balancing(pixels, 2, 2, format);
            spoil(balancing.in, balancing.out);
            EXPECT_EQ(balancing.Run(*filter), FilterFailed) << format;
            EXPECT_EQ(balancing.GetPixels(), pixels);
        };
        using In = ZInImageBufferStruct;
        using Out = ZOutImageBufferStruct;
        const std::uint32_t needed = 4 * CountPixelBytes(format);
        refuse([](In&, Out& out) { out.data = nullptr; });
        refuse([](In& in, Out&) { in.width = 0; });
        refuse([](In& in, Out&) { in.height = 0; });
        refuse([](In& in, Out&) { in.width = in.height = 0x10000; });
        refuse([](In& in, Out&) { in.width = in.height = 0xFFFFFFFF; });
        refuse([](In& in, Out&) { in.width = 0x80000000; });
        refuse([=](In& in, Out&) { in.imageSize = needed - 1; });
        refuse([=](In&, Out& out) { out.dataCapacity = needed - 1; });
    }
}

TEST_F(WhiteBalance, RefusesGreyWorldOverNothing) {
    Bytes pixels(24, 100);
    std::uint8_t* const data = pixels.data();
    const auto balance = [&](std::uint8_t* image, std::uint8_t* blue, std::uint32_t width,
                             std::uint32_t step, std::uint32_t format) {
        return filter->GreyWorld(image, data, data, blue, width, 1, width, step, format);
    };
    const auto balanceDeep = [&](std::uint8_t* image, std::uint8_t* blue, std::uint32_t width,
                                 std::uint32_t step) {
        return filter->GreyWorld_16Bit(image, data, data, blue, width, 1, width, step, RGB48);
    };
    EXPECT_EQ(balance(nullptr, data, 1, 3, RGB24), FilterFailed);
    EXPECT_EQ(balance(nullptr, data, 1, 4, RGBX32), FilterFailed);
    EXPECT_EQ(balance(data, nullptr, 1, 1, RGBPlane8), FilterFailed);
    EXPECT_EQ(balance(data, data, 0, 3, RGB24), FilterFailed);
    EXPECT_EQ(balanceDeep(nullptr, data, 1, 3), FilterFailed);
    EXPECT_EQ(balanceDeep(data, nullptr, 1, 1), FilterFailed);
    EXPECT_EQ(balanceDeep(data, data, 0, 3), FilterFailed);
    EXPECT_EQ(pixels, Bytes(24, 100));
}

TEST_F(WhiteBalance, RefusesGreyWorldByStepsThatMakeRowsOverlapOrThatNoRowLengthTells) {
    Bytes pixels(24, 100);
    std::uint8_t* const data = pixels.data();
    for (const std::uint32_t step : {0U, 2U, 0x80000000U, 0xFFFFFFFFU}) {
        EXPECT_EQ(filter->GreyWorld(data, data, data, data, 1, 2, 2, step, RGB24), FilterFailed);
        EXPECT_EQ(filter->GreyWorld_16Bit(data, data, data, data, 1, 2, 2, step, RGB48),
                  FilterFailed);
    }
    EXPECT_EQ(pixels, Bytes(24, 100));
}

TEST_F(WhiteBalance, KeptGreyWorldTakesOtherStepsForFourSamplesPerPixelAndRowsFurtherApart) {
    SetScales(2.0F, 0.5F, 0.0F);
    for (const std::uint32_t step : {4U, 5U, 7U}) {
        Bytes pixels(2 * 3 * step, 100);
        Bytes expected = pixels;
        for (std::size_t row = 0; row < 2; ++row) {
            for (std::size_t pixel = 0; pixel < 3; ++pixel) {
                const std::size_t first = row * 3 * step + 4 * pixel;
                expected[first] = 200;
                expected[first + 1] = 50;
                expected[first + 2] = 0;
            }
        }
        EXPECT_EQ(
            filter->GreyWorld(pixels.data(), nullptr, nullptr, nullptr, 3, 2, 6, step, RGBX32),
            FilterDone);
        EXPECT_EQ(pixels, expected) << "step " << step;
    }
}

TEST_F(WhiteBalance, KeptGreyWorldOf16BitsTakesAnyOtherStepForThreeSamplesPerPixel) {
    SetScales(2.0F, 0.5F, 0.0F);
    for (const std::uint32_t step : {3U, 4U, 5U, 9U}) {
        std::vector<std::uint16_t> pixels(2 * 3 * step, 1000);
        std::vector<std::uint16_t> expected = pixels;
        for (std::size_t row = 0; row < 2; ++row) {
            for (std::size_t pixel = 0; pixel < 3; ++pixel) {
                const std::size_t first = row * 3 * step + 3 * pixel;
                expected[first] = 2000;
                expected[first + 1] = 500;
                expected[first + 2] = 0;
            }
        }
        // The format has no say in the order of the colours.
        EXPECT_EQ(filter->GreyWorld_16Bit(reinterpret_cast<std::uint8_t*>(pixels.data()), nullptr,
                                          nullptr, nullptr, 3, 2, 6, step, BGR24),
                  FilterDone);
        EXPECT_EQ(pixels, expected) << "step " << step;
    }
}

TEST_F(WhiteBalance, GreyWorldLeavesPixelsAloneWhoseFormatIsNoneOfTheirLength) {
    SetScales(0.0F, 0.0F, 0.0F);
    for (const std::uint32_t step : {3U, 4U, 6U}) {
        for (const std::uint32_t format : {0U, 2U, 6U, 7U, 10U, 14U, 0xFFFFFFFFU}) {
            Bytes pixels(2 * 2 * step, 100);
            EXPECT_EQ(
                filter->GreyWorld(pixels.data(), nullptr, nullptr, nullptr, 2, 2, 4, step, format),
                FilterDone);
            EXPECT_EQ(pixels, Bytes(2 * 2 * step, 100)) << step << " " << format;
        }
    }
    Bytes pixels(12, 100);
    EXPECT_EQ(filter->GreyWorld(pixels.data(), nullptr, nullptr, nullptr, 4, 1, 4, 3, RGBX32),
              FilterDone);
    EXPECT_EQ(filter->GreyWorld(pixels.data(), nullptr, nullptr, nullptr, 3, 1, 3, 4, RGB24),
              FilterDone);
    EXPECT_EQ(pixels, Bytes(12, 100));
}

TEST_F(WhiteBalance, MultipliesInSinglePrecision) {
    // In double precision the products lie below 29 and 47.
    ASSERT_EQ(static_cast<int>(25 * static_cast<double>(1.16F)), 28);
    ASSERT_EQ(static_cast<int>(25 * static_cast<double>(1.88F)), 46);
    EXPECT_EQ(filter->GetRedTable()->levels8[25], 29);
    EXPECT_EQ(filter->GetRedTable()->levels16[25], 29);
    EXPECT_EQ(filter->GetBlueTable()->levels8[25], 47);
    EXPECT_EQ(filter->GetBlueTable()->levels16[25], 47);
}

TEST_F(WhiteBalance, TheScaleInForceCostsNoNewTables) {
    const auto table = filter->GetRedTable();
    filter->SetRedScale(filter->GetRedScale());
    EXPECT_EQ(filter->GetRedTable(), table);
    filter->SetRedScale(1.161F);
    EXPECT_NE(filter->GetRedTable(), table);
}

TEST_F(WhiteBalance, SetsAllScalesAtOnceOrOneByOneToTheSameTables) {
    filter->SetScales(0.5F, 1.25F, 3.0F);
    EXPECT_EQ(filter->GetRedScale(), 0.5F);
    EXPECT_EQ(filter->GetGreenScale(), 1.25F);
    EXPECT_EQ(filter->GetBlueScale(), 3.0F);
    const auto red = filter->GetRedTable();
    const auto green = filter->GetGreenTable();

    const auto oneByOne = std::make_unique<ZAutoWhiteBalance>(false);
    oneByOne->SetRedScale(0.5F);
    oneByOne->SetGreenScale(1.25F);
    oneByOne->SetBlueScale(3.0F);
    EXPECT_EQ(oneByOne->GetRedTable()->levels16, red->levels16);
    EXPECT_EQ(oneByOne->GetGreenTable()->levels16, green->levels16);
    EXPECT_EQ(oneByOne->GetBlueTable()->levels16, filter->GetBlueTable()->levels16);

    filter->SetScales(0.5F, 1.25F, 4.0F);
    EXPECT_EQ(filter->GetRedTable(), red) << "what stays costs no new tables";
    EXPECT_EQ(filter->GetGreenTable(), green);
}

class FrameAmongChanges : public WhiteBalance,
                          public testing::WithParamInterface<ZImageFormatEnum> {};

TEST_P(FrameAmongChanges, IsBalancedByTheScalesOfOneChangeInAllItsSamples) {
    constexpr std::uint32_t Side = 64;
    const bool isDeep = IsOfWords(GetParam());
    // Every sample stands at 100, of bytes or of words, and becomes 25 or 50.
    Bytes frame(std::size_t{Side} * Side * CountPixelBytes(GetParam()), 100);
    for (std::size_t index = 1; isDeep && index < frame.size(); index += 2) frame[index] = 0;
    const auto scale = [&](std::uint8_t sample) {
        Bytes scaled = frame;
        std::replace(scaled.begin(), scaled.end(), std::uint8_t{100}, sample);
        return scaled;
    };
    const Bytes quarter = scale(25);
    const Bytes half = scale(50);
    filter->SetScales(0.25F, 0.25F, 0.25F);
    std::atomic<bool> mayEnd{false};
    std::thread setter([&] {
        while (!mayEnd) {
            filter->SetScales(0.5F, 0.5F, 0.5F);
            filter->SetScales(0.25F, 0.25F, 0.25F);
        }
    });
    std::uint32_t mixed = 0;
    for (int round = 0; round < 100; ++round) {
        Balancing balancing(frame, Side, Side, GetParam());
        EXPECT_EQ(balancing.Run(*filter), FilterDone);
        const Bytes pixels = balancing.GetPixels();
        if (pixels != quarter && pixels != half) ++mixed;
    }
    mayEnd = true;
    setter.join();
    EXPECT_EQ(mixed, 0U);
}

INSTANTIATE_TEST_SUITE_P(EachPath, FrameAmongChanges,
                         testing::Values(RGB24, RGBPlane8, RGBPlane16, RGB48));

}  // namespace
}  // namespace ZV::Testing
