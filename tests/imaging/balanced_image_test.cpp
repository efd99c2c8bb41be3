#include <gtest/gtest.h>

#include <array>
#include <cstdint>
#include <memory>
#include <numeric>
#include <string>
#include <tuple>
#include <utility>

#include "imaging/auto_white_balance.h"
#include "imaging/balancing.h"
#include "imaging/kernels/kernel_selection.h"
#include "imaging/kernels/kernels.h"

namespace ZV::Testing {
namespace {

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

}  // namespace
}  // namespace ZV::Testing
