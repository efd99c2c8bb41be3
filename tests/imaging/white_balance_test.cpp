#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <array>
#include <atomic>
#include <bit>
#include <cmath>
#include <cstring>
#include <limits>
#include <memory>
#include <numeric>
#include <random>
#include <string>
#include <thread>
#include <tuple>

#include "imaging/auto_white_balance.h"
#include "imaging/kernels/kernel_selection.h"
#include "imaging/kernels/kernels.h"
#include "imaging/scripted_camera.h"

namespace ZV::Testing {
namespace {

using testing::ElementsAre;

constexpr float Infinity = std::numeric_limits<float>::infinity();
const float NotANumber = std::nanf("");

bool IsOfWords(std::uint32_t format) {
    return format == RGBPlane16 || format == RGB48;
}

std::uint32_t CountPixelBytes(std::uint32_t format) {
    return ZExImage::ImageFormatByteSize(format);
}

Bytes MakeRandomBytes(std::size_t count, std::uint32_t seed) {
    std::mt19937 random(seed);
    Bytes bytes(count);
    for (std::uint8_t& byte : bytes) byte = static_cast<std::uint8_t>(random());
    // The top sample values are the special ones.
    for (std::size_t index = 0; index + 2 <= count; index += 14) {
        bytes[index] = bytes[index + 1] = 255;
    }
    return bytes;
}

/// The image of an output in a pipeline, followed by bytes that nobody may touch.
class Balancing {
  public:
    static constexpr std::size_t GuardBytes = 64;

    Balancing(const Bytes& pixels, std::uint32_t width, std::uint32_t height, std::uint32_t format)
        : bytes(pixels) {
        bytes.insert(bytes.end(), GuardBytes, 0xA5);
        in.data = nullptr;  // Not looked at: the image stands at the output.
        in.imageSize = static_cast<std::uint32_t>(pixels.size());
        in.width = width;
        in.height = height;
        in.bitDepth = IsOfWords(format) ? 12 : 8;
        in.imageFormat = format;
        in.camera = &camera;
        out.data = bytes.data();
        out.imageFormat = format;
        out.dataCapacity = pixels.size();
        camera.imageFormat = CameraBayer;
    }

    FilterResult Run(ZAutoWhiteBalance& filter) { return filter.Process(&in, &out); }
    Bytes GetPixels() const { return {bytes.begin(), bytes.end() - GuardBytes}; }
    bool IsGuardIntact() const {
        return std::all_of(bytes.end() - GuardBytes, bytes.end(),
                           [](std::uint8_t byte) { return byte == 0xA5; });
    }

    ScriptedCamera camera;
    ZInImageBufferStruct in;
    ZOutImageBufferStruct out;

  private:
    Bytes bytes;
};

/// What the lookup kernels make of an image, called with the tables of the filter's scales.
class KernelExpectation {
  public:
    explicit KernelExpectation(const ZAutoWhiteBalance& filter)
        : red(filter.GetRedTable()), green(filter.GetGreenTable()), blue(filter.GetBlueTable()) {
        std::iota(identity.begin(), identity.end(), 0);
    }

    void Balance(Bytes& pixels, std::uint32_t width, std::uint32_t height,
                 std::uint32_t format) const {
        const KernelSize size{static_cast<std::int32_t>(width), static_cast<std::int32_t>(height)};
        switch (format) {
            case RGBPlane8:
            case RGBPlane16:
                return BalancePlanes(pixels, size, format == RGBPlane16);
            case RGB48:
                return BalanceWords(pixels, size);
            case BGR24:
                return Balance3(pixels, size, Get8(blue), Get8(green), Get8(red));
            case RGB24:
                return Balance3(pixels, size, Get8(red), Get8(green), Get8(blue));
            case XRGB32:
                return Balance4(pixels, size, {I(), Get8(red), Get8(green), Get8(blue)});
            case BGRX32:
                return Balance4(pixels, size, {Get8(blue), Get8(green), Get8(red), I()});
            default:
                return Balance4(pixels, size, {Get8(red), Get8(green), Get8(blue), I()});
        }
    }

  private:
    using Table = std::shared_ptr<const ZAutoWhiteBalance::ScaleTable>;

    static const std::int32_t* Get8(const Table& table) { return table->levels8.data(); }
    const std::int32_t* I() const { return identity.data(); }

    void BalancePlanes(Bytes& pixels, KernelSize size, bool isDeep) const {
        std::uint8_t* plane = pixels.data();
        for (const Table* table : {&red, &green, &blue}) {
            const KernelStatus status =
                isDeep ? LookupInPlace16x1(plane, 2 * size.width, size, (*table)->levels16.data(),
                                           I(), 65536)
                       : LookupInPlace8x1(plane, size.width, size, Get8(*table), I(), 256);
            ASSERT_EQ(status, KernelOk);
            plane += pixels.size() / 3;
        }
    }
    void BalanceWords(Bytes& pixels, KernelSize size) const {
        const std::int32_t* const values[] = {red->levels16.data(), green->levels16.data(),
                                              blue->levels16.data()};
        const std::int32_t* const levels[] = {I(), I(), I()};
        const std::int32_t counts[] = {65536, 65536, 65536};
        ASSERT_EQ(LookupInPlace16x3(pixels.data(), 6 * size.width, size, values, levels, counts),
                  KernelOk);
    }
    void Balance3(Bytes& pixels, KernelSize size, const std::int32_t* first,
                  const std::int32_t* second, const std::int32_t* third) const {
        const std::int32_t* const values[] = {first, second, third};
        const std::int32_t* const levels[] = {I(), I(), I()};
        const std::int32_t counts[] = {256, 256, 256};
        ASSERT_EQ(LookupInPlace8x3(pixels.data(), 3 * size.width, size, values, levels, counts),
                  KernelOk);
    }
    void Balance4(Bytes& pixels, KernelSize size,
                  const std::array<const std::int32_t*, 4>& values) const {
        const std::int32_t* const levels[] = {I(), I(), I(), I()};
        const std::int32_t counts[] = {256, 256, 256, 256};
        ASSERT_EQ(
            LookupInPlace8x4(pixels.data(), 4 * size.width, size, values.data(), levels, counts),
            KernelOk);
    }

    Table red;
    Table green;
    Table blue;
    std::array<std::int32_t, 65536> identity;
};

/// A form of the kernels for the length of a test.
class ForcedKernels {
  public:
    explicit ForcedKernels(const char* name) : isForced(ForceKernels(name)) {}
    ~ForcedKernels() { (void)ForceKernels(""); }
    ForcedKernels(const ForcedKernels&) = delete;
    ForcedKernels& operator=(const ForcedKernels&) = delete;

    bool isForced;
};

class BalancedImage : public testing::TestWithParam<std::tuple<const char*, std::uint32_t>> {
  protected:
    const char* GetForm() const { return std::get<0>(GetParam()); }
    std::uint32_t GetFormat() const { return std::get<1>(GetParam()); }
};

TEST_P(BalancedImage, IsWhatTheLookupsOfItsTablesMakeOfEachSample) {
    const ForcedKernels forced(GetForm());
    if (!forced.isForced) GTEST_SKIP() << "no " << GetForm() << " here";
    struct Scales {
        float red, green, blue;
    };
    const auto filter = std::make_unique<ZAutoWhiteBalance>(false);
    for (const Scales& scales :
         {Scales{1.16F, 1.0F, 1.88F}, Scales{0.25F, 1.5F, 0.0F},
          Scales{-1.5F, Infinity, NotANumber}, Scales{-Infinity, 3e38F, 1e-40F}}) {
        filter->SetRedScale(scales.red);
        filter->SetGreenScale(scales.green);
        filter->SetBlueScale(scales.blue);
        const KernelExpectation expectation(*filter);
        for (const auto& [width, height] :
             {std::pair<std::uint32_t, std::uint32_t>{1, 1}, {7, 3}, {33, 5}, {129, 2}}) {
            const Bytes pixels =
                MakeRandomBytes(std::size_t{width} * height * CountPixelBytes(GetFormat()), width);
            Bytes expected = pixels;
            expectation.Balance(expected, width, height, GetFormat());
            Balancing balancing(pixels, width, height, GetFormat());

            ASSERT_EQ(balancing.Run(*filter), FilterDone);

            ASSERT_EQ(balancing.GetPixels(), expected)
                << GetForm() << " " << width << " x " << height << ", scales " << scales.red << " "
                << scales.green << " " << scales.blue;
            EXPECT_TRUE(balancing.IsGuardIntact());
            EXPECT_EQ(balancing.out.width, width);
            EXPECT_EQ(balancing.out.height, height);
            EXPECT_EQ(balancing.out.imageFormat, GetFormat());
            EXPECT_EQ(balancing.out.imageSize, pixels.size());
        }
    }
}

INSTANTIATE_TEST_SUITE_P(
    EachFormAndFormat, BalancedImage,
    testing::Combine(testing::Values("plain", "sse2", "ssse3", "avx2", "avx512"),
                     testing::Values(std::uint32_t{RGBPlane8}, std::uint32_t{RGBPlane16},
                                     std::uint32_t{BGR24}, std::uint32_t{XRGB32},
                                     std::uint32_t{RGB48}, std::uint32_t{BGRX32},
                                     std::uint32_t{RGB24}, std::uint32_t{RGBX32})),
    [](const testing::TestParamInfo<BalancedImage::ParamType>& test) {
        return std::string(std::get<0>(test.param)) + "_" + std::to_string(std::get<1>(test.param));
    });

class WhiteBalance : public testing::Test {
  protected:
    void SetScales(float red, float green, float blue) {
        filter->SetRedScale(red);
        filter->SetGreenScale(green);
        filter->SetBlueScale(blue);
    }

    std::unique_ptr<ZAutoWhiteBalance> filter = std::make_unique<ZAutoWhiteBalance>(false);
};

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
