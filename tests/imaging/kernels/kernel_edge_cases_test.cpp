// Behaviours of the kernels that clients of theirs rely on, one by one, in every form.

#include <gtest/gtest.h>

#include <array>
#include <atomic>
#include <cstdint>
#include <limits>
#include <numeric>
#include <thread>
#include <utility>
#include <vector>

#include "imaging/kernels/kernel_fixture.h"
#include "imaging/kernels/kernel_judge.h"
#include "imaging/kernels/kernel_selection.h"
#include "imaging/kernels/kernels.h"

namespace ZV::Testing {
namespace {

using Bytes = std::vector<std::uint8_t>;
using Words = std::vector<std::uint16_t>;
using Numbers = std::vector<std::int32_t>;

constexpr std::int32_t Lowest = std::numeric_limits<std::int32_t>::min();
constexpr std::int32_t Highest = std::numeric_limits<std::int32_t>::max();

Numbers CountUp(std::size_t count) {
    Numbers numbers(count);
    std::iota(numbers.begin(), numbers.end(), 0);
    return numbers;
}

Bytes MakeRamp(std::size_t count) {
    Bytes bytes(count);
    for (std::size_t i = 0; i < count; ++i) bytes[i] = static_cast<std::uint8_t>(i * 29 + 3);
    return bytes;
}

/// One call of EnlargePlane8 with arguments that are right until a test changes them.
struct EnlargeCall {
    Bytes sourceBytes = MakeRamp(400);
    Bytes output = Bytes(1600, 99);
    const void* source = sourceBytes.data();
    KernelSize sourceSize{20, 20};
    KernelRect rect{0, 0, 20, 20};
    void* destination = output.data();
    KernelSize destinationSize{40, 40};
    double xFactor = 2.0;
    double yFactor = 2.0;
    std::int32_t interpolation = InterpolateLinear;

    EnlargeCall() = default;
    EnlargeCall(const EnlargeCall&) = delete;
    EnlargeCall& operator=(const EnlargeCall&) = delete;

    [[nodiscard]] KernelStatus Run() const {
        return EnlargePlane8(source, sourceSize, 20, rect, destination, 40, destinationSize,
                             xFactor, yFactor, interpolation);
    }
    [[nodiscard]] bool IsOutputUntouched() const { return output == Bytes(1600, 99); }
};

class KernelEdgeCases : public KernelFormTest {};

TEST_P(KernelEdgeCases, ShiftingByZeroKeepsThePlane) {
    const Bytes before = MakeRamp(600);
    Bytes plane = before;

    EXPECT_EQ(ShiftRightPlane8(0, plane.data(), 30, {30, 20}), KernelOk);
    EXPECT_EQ(plane, before);
    EXPECT_EQ(ShiftRightPlane16(0, plane.data(), 30, {15, 20}), KernelOk);
    EXPECT_EQ(plane, before);
}

TEST_P(KernelEdgeCases, ShiftCountsOfTheSamplesWidthAndMoreGiveZero) {
    for (const std::int32_t count : {16, 17, 32, 33, 64, 65, Highest}) {
        Bytes bytes(77, 255);
        Words words(77, 65535);

        EXPECT_EQ(ShiftRightPlane8(count, bytes.data(), 77, {77, 1}), KernelOk);
        EXPECT_EQ(ShiftRightPlane16(count, words.data(), 154, {77, 1}), KernelOk);

        EXPECT_EQ(bytes, Bytes(77, 0)) << count;
        EXPECT_EQ(words, Words(77, 0)) << count;
    }
    Bytes bytes(77, 255);
    EXPECT_EQ(ShiftRightPlane8(8, bytes.data(), 77, {77, 1}), KernelOk);
    EXPECT_EQ(bytes, Bytes(77, 0));
}

TEST_P(KernelEdgeCases, ShiftingTakesSamplesAsUnsigned) {
    Bytes bytes(77, 0x80);
    Words words(77, 0x8000);

    EXPECT_EQ(ShiftRightPlane8(1, bytes.data(), 77, {77, 1}), KernelOk);
    EXPECT_EQ(ShiftRightPlane16(1, words.data(), 154, {77, 1}), KernelOk);

    EXPECT_EQ(bytes, Bytes(77, 0x40));
    EXPECT_EQ(words, Words(77, 0x4000));
}

TEST_P(KernelEdgeCases, AddingTwoHundredAndOneHundredYieldsTheTop) {
    const Bytes source(77, 200);
    Bytes sums(77, 100);

    EXPECT_EQ(AddPlane8(source.data(), 77, sums.data(), 77, {77, 1}, 0), KernelOk);

    EXPECT_EQ(sums, Bytes(77, 255));
}

TEST_P(KernelEdgeCases, DeepSumsAreHeldAtTheTop) {
    const Words source{40000, 65535, 65535, 1, 32768, 0};
    Words sums{30000, 65535, 0, 65534, 32767, 0};

    EXPECT_EQ(AddPlane16(source.data(), 12, sums.data(), 12, {6, 1}, 0), KernelOk);

    EXPECT_EQ(sums, (Words{65535, 65535, 65535, 65535, 65535, 0}));
}

TEST_P(KernelEdgeCases, ALookupOfAllLevelsLeavesTheTopSampleAlone) {
    // Kept: the last level has no end, so the top maps to itself whatever its value is.
    const Numbers levels = CountUp(256);
    const Numbers values(256, 0);
    Bytes samples{0, 1, 128, 254, 255};

    EXPECT_EQ(LookupInPlace8x1(samples.data(), 5, {5, 1}, values.data(), levels.data(), 256),
              KernelOk);

    EXPECT_EQ(samples, (Bytes{0, 0, 0, 0, 255}));
}

TEST_P(KernelEdgeCases, ADeepLookupOfAllLevelsLeavesTheTopSampleAlone) {
    const Numbers levels = CountUp(65536);
    const Numbers values(65536, 7);
    for (const std::int32_t width : {5, 6401}) {
        Words samples(static_cast<std::size_t>(width), 65534);
        samples.back() = 65535;

        EXPECT_EQ(LookupInPlace16x1(samples.data(), 2 * width, {width, 1}, values.data(),
                                    levels.data(), 65536),
                  KernelOk);

        Words expected(static_cast<std::size_t>(width), 7);
        expected.back() = 65535;
        EXPECT_EQ(samples, expected) << width;
    }
}

TEST_P(KernelEdgeCases, ValuesAreHeldWithinTheSamplesRange) {
    const Numbers levels{0, 10, 20, 30, 40};
    const Numbers values{-1, 256, Lowest, Highest, 99};
    const Numbers deepValues{-1, 65536, Lowest, Highest, 99};
    Bytes bytes{5, 15, 25, 35, 45};
    Words words{5, 15, 25, 35, 45};

    EXPECT_EQ(LookupInPlace8x1(bytes.data(), 5, {5, 1}, values.data(), levels.data(), 5), KernelOk);
    EXPECT_EQ(LookupInPlace16x1(words.data(), 10, {5, 1}, deepValues.data(), levels.data(), 5),
              KernelOk);

    EXPECT_EQ(bytes, (Bytes{0, 255, 0, 255, 45}));
    EXPECT_EQ(words, (Words{0, 65535, 0, 65535, 45}));
}

TEST_P(KernelEdgeCases, LinearEnlargingOfTwoSamplesEndsOnThemExactly) {
    const Bytes source{10, 20, 10, 20};
    Bytes output(16);

    EXPECT_EQ(EnlargePlane8(source.data(), {2, 2}, 2, {0, 0, 2, 2}, output.data(), 4, {4, 4}, 2.0,
                            2.0, InterpolateLinear),
              KernelOk);

    EXPECT_EQ(output, (Bytes{10, 13, 17, 20, 10, 13, 17, 20, 10, 13, 17, 20, 10, 13, 17, 20}));
}

TEST_P(KernelEdgeCases, LinearEnlargingOfASingleRowTakesTheNearestSample) {
    // Kept: one direction that is too small changes the interpolation of both.
    const Bytes source{10, 20};
    Bytes output(8);

    EXPECT_EQ(EnlargePlane8(source.data(), {2, 1}, 2, {0, 0, 2, 1}, output.data(), 4, {4, 2}, 2.0,
                            2.0, InterpolateLinear),
              KernelOk);

    EXPECT_EQ(output, (Bytes{10, 10, 20, 20, 10, 10, 20, 20}));
}

TEST_P(KernelEdgeCases, NearestDoublingRepeatsEverySampleTwoByTwo) {
    const Bytes source = MakeRamp(37 * 5);
    Bytes output(74 * 10);

    EXPECT_EQ(EnlargePlane8(source.data(), {37, 5}, 37, {0, 0, 37, 5}, output.data(), 74, {74, 10},
                            2.0, 2.0, InterpolateNearest),
              KernelOk);

    for (std::size_t y = 0; y < 10; ++y)
        for (std::size_t x = 0; x < 74; ++x)
            ASSERT_EQ(output[74 * y + x], source[37 * (y / 2) + x / 2]) << x << " " << y;
}

/// The result of one code on an image, for comparison with another's.
Bytes EnlargeImage(KernelSize size, std::int32_t interpolation) {
    const Bytes source = MakeRamp(static_cast<std::size_t>(size.width * size.height));
    Bytes output(source.size() * 4);
    EXPECT_EQ(EnlargePlane8(source.data(), size, size.width, {0, 0, size.width, size.height},
                            output.data(), 2 * size.width, {2 * size.width, 2 * size.height}, 2.0,
                            2.0, interpolation),
              KernelOk);
    return output;
}

TEST_P(KernelEdgeCases, CubicBelowFourSamplesInADirectionMeansLinear) {
    for (const KernelSize size : {KernelSize{3, 30}, KernelSize{30, 3}, KernelSize{2, 2}})
        EXPECT_EQ(EnlargeImage(size, InterpolateCubic), EnlargeImage(size, InterpolateLinear));
    EXPECT_NE(EnlargeImage({4, 30}, InterpolateCubic), EnlargeImage({4, 30}, InterpolateLinear));
}

TEST_P(KernelEdgeCases, BelowTwoSamplesInADirectionEveryCodeMeansNearest) {
    for (const KernelSize size : {KernelSize{1, 30}, KernelSize{30, 1}, KernelSize{1, 1}})
        for (const std::int32_t interpolation :
             {InterpolateLinear, InterpolateCubic, InterpolateLanczos})
            EXPECT_EQ(EnlargeImage(size, interpolation), EnlargeImage(size, InterpolateNearest));
}

TEST_P(KernelEdgeCases, CodeSixteenMeansCubicBelowEightSamplesAndIsRefusedAbove) {
    for (const KernelSize size : {KernelSize{7, 30}, KernelSize{30, 7}, KernelSize{4, 4}})
        EXPECT_EQ(EnlargeImage(size, InterpolateLanczos), EnlargeImage(size, InterpolateCubic));
    EXPECT_EQ(EnlargeImage({3, 7}, InterpolateLanczos), EnlargeImage({3, 7}, InterpolateLinear));

    EnlargeCall call;
    call.interpolation = InterpolateLanczos;
    call.sourceSize = {8, 8};
    call.rect = {0, 0, 8, 8};
    EXPECT_EQ(call.Run(), KernelBadInterpolation);
    EXPECT_TRUE(call.IsOutputUntouched());
}

TEST_P(KernelEdgeCases, ARectangleIsWeighedAsIfItWereTheWholeImage) {
    const Bytes image = MakeRamp(400);
    Bytes cut;
    for (std::size_t y = 0; y < 7; ++y)
        for (std::size_t x = 0; x < 9; ++x) cut.push_back(image[20 * (y + 4) + x + 6]);
    for (const std::int32_t interpolation :
         {InterpolateNearest, InterpolateLinear, InterpolateCubic}) {
        Bytes ofRectangle(18 * 14);
        Bytes ofCut(18 * 14);

        EXPECT_EQ(EnlargePlane8(image.data(), {20, 20}, 20, {6, 4, 9, 7}, ofRectangle.data(), 18,
                                {18, 14}, 2.0, 2.0, interpolation),
                  KernelOk);
        EXPECT_EQ(EnlargePlane8(cut.data(), {9, 7}, 9, {0, 0, 9, 7}, ofCut.data(), 18, {18, 14},
                                2.0, 2.0, interpolation),
                  KernelOk);

        EXPECT_EQ(ofRectangle, ofCut) << interpolation;
    }
}

TEST_P(KernelEdgeCases, ARectanglePastTheImageIsCutToIt) {
    EnlargeCall past;
    past.rect = {15, 12, Highest, Highest};
    EnlargeCall within;
    within.rect = {15, 12, 5, 8};

    EXPECT_EQ(past.Run(), KernelOk);
    EXPECT_EQ(within.Run(), KernelOk);

    EXPECT_EQ(past.output, within.output);
}

TEST_P(KernelEdgeCases, CubicOvershootIsHeldWithinTheRange) {
    Bytes source;
    for (int y = 0; y < 8; ++y) source.insert(source.end(), {0, 0, 0, 255, 255, 255, 0, 0});
    Bytes output(256);

    EXPECT_EQ(EnlargePlane8(source.data(), {8, 8}, 8, {0, 0, 8, 8}, output.data(), 16, {16, 16},
                            2.0, 2.0, InterpolateCubic),
              KernelOk);

    // Positions 1.87, 3.73 and 6.53, between samples that are alike.
    EXPECT_EQ(output[4], 0);
    EXPECT_EQ(output[8], 255);
    EXPECT_EQ(output[14], 0);
}

TEST_P(KernelEdgeCases, AnEnlargingThatYieldsLessThanHalfASampleIsEmpty) {
    for (const auto& [xFactor, yFactor] : {std::pair{0.024, 2.0}, std::pair{2.0, 0.024}}) {
        EnlargeCall call;
        call.xFactor = xFactor;
        call.yFactor = yFactor;
        EXPECT_EQ(call.Run(), KernelEmptyResult);
        EXPECT_TRUE(call.IsOutputUntouched());
    }
}

TEST_P(KernelEdgeCases, HalfASampleAndMoreIsASample) {
    for (const std::int32_t interpolation :
         {InterpolateNearest, InterpolateLinear, InterpolateCubic}) {
        EnlargeCall call;
        call.xFactor = 0.0251;
        call.yFactor = 0.0251;
        call.interpolation = interpolation;
        EXPECT_EQ(call.Run(), KernelOk);
        Bytes expected(1600, 99);
        // Nearest starts half a step from the edge, which is here just before the last sample's
        // end.
        expected[0] =
            interpolation == InterpolateNearest ? call.sourceBytes[399] : call.sourceBytes[0];
        EXPECT_EQ(call.output, expected) << interpolation;
    }
}

TEST_P(KernelEdgeCases, ANearestPositionBehindTheRectangleTakesItsLastSample) {
    // A factor of a half starts the positions of a single sample at 1.
    EnlargeCall call;
    call.rect = {3, 3, 1, 1};
    call.xFactor = 0.5;
    call.yFactor = 0.5;
    call.interpolation = InterpolateNearest;

    EXPECT_EQ(call.Run(), KernelOk);

    EXPECT_EQ(call.output[0], call.sourceBytes[63]);
}

TEST_P(KernelEdgeCases, ANullSourceIsNamedBeforeAnythingIsWritten) {
    EnlargeCall call;
    call.source = nullptr;
    EXPECT_EQ(call.Run(), KernelNullPointer);
    EXPECT_TRUE(call.IsOutputUntouched());

    Bytes bytes(4, 99);
    const void* const planes[] = {bytes.data(), nullptr, bytes.data(), bytes.data()};
    EXPECT_EQ(AddPlane8(nullptr, 4, bytes.data(), 4, {4, 1}, 0), KernelNullPointer);
    EXPECT_EQ(AddPlane16(nullptr, 4, bytes.data(), 4, {2, 1}, 0), KernelNullPointer);
    EXPECT_EQ(PackPlanes8x3(planes, 4, bytes.data(), 4, {1, 1}), KernelNullPointer);
    EXPECT_EQ(PackPlanes8x4(planes, 4, bytes.data(), 4, {1, 1}), KernelNullPointer);
    EXPECT_EQ(PackPlanes16x3(planes, 4, bytes.data(), 4, {1, 1}), KernelNullPointer);
    EXPECT_EQ(bytes, Bytes(4, 99));
}

TEST_P(KernelEdgeCases, EnlargingNamesTheFirstOfItsFaults) {
    EnlargeCall call;
    // Everything is wrong, and is mended one by one in the order of the tests.
    call.source = nullptr;
    call.sourceSize = {0, 20};
    call.rect = {-1, 0, 20, 20};
    call.destinationSize = {0, 0};
    call.xFactor = 0.0;
    call.interpolation = 3;
    EXPECT_EQ(call.Run(), KernelNullPointer);
    call.source = call.sourceBytes.data();
    EXPECT_EQ(call.Run(), KernelBadSize);
    call.sourceSize = {20, 20};
    EXPECT_EQ(call.Run(), KernelBadSize);
    call.rect = {20, 0, 20, 20};
    EXPECT_EQ(call.Run(), KernelNoOverlap);
    call.rect = {0, 20, 1, 1};
    EXPECT_EQ(call.Run(), KernelNoOverlap);
    call.rect = {0, 0, 20, 20};
    EXPECT_EQ(call.Run(), KernelBadSize);
    call.destinationSize = {40, 40};
    EXPECT_EQ(call.Run(), KernelBadFactor);
    call.xFactor = 0.001;
    call.yFactor = -2.0;
    EXPECT_EQ(call.Run(), KernelBadFactor);
    call.yFactor = 2.0;
    EXPECT_EQ(call.Run(), KernelBadInterpolation);
    call.interpolation = InterpolateLinear;
    EXPECT_EQ(call.Run(), KernelEmptyResult);
    EXPECT_TRUE(call.IsOutputUntouched());
    call.xFactor = 2.0;
    EXPECT_EQ(call.Run(), KernelOk);
}

TEST_P(KernelEdgeCases, FactorsThatAreNoNumbersAreNotAboveZero) {
    for (const double factor : {0.0, -0.0, -1.0, std::numeric_limits<double>::quiet_NaN(),
                                -std::numeric_limits<double>::infinity()}) {
        EnlargeCall across;
        across.xFactor = factor;
        EXPECT_EQ(across.Run(), KernelBadFactor) << factor;
        EnlargeCall down;
        down.yFactor = factor;
        EXPECT_EQ(down.Run(), KernelBadFactor) << factor;
    }
}

TEST_P(KernelEdgeCases, OnlyFourInterpolationCodesAreKnown) {
    for (const std::int32_t code : {Lowest, -1, 0, 3, 5, 6, 8, 15, 17, 20, Highest}) {
        EnlargeCall call;
        call.interpolation = code;
        EXPECT_EQ(call.Run(), KernelBadInterpolation) << code;
        EXPECT_TRUE(call.IsOutputUntouched());
    }
}

TEST_P(KernelEdgeCases, ThreadsMayRunKernelsSideBySide) {
    const Bytes source = MakeRamp(60 * 40);
    const Numbers levels = CountUp(65536);
    const Numbers values(65536, 12);
    Bytes wantedPlane(120 * 80);
    ASSERT_EQ(Judge::EnlargePlane8(source.data(), {60, 40}, 60, {0, 0, 60, 40}, wantedPlane.data(),
                                   120, {120, 80}, 2.0, 2.0, InterpolateCubic),
              KernelOk);
    std::array<bool, 4> isRight{};

    std::vector<std::thread> threads;
    for (bool& isThreadRight : isRight)
        threads.emplace_back([&] {
            Bytes plane(120 * 80);
            Words words(6500, 1000);
            const KernelStatus enlarged =
                EnlargePlane8(source.data(), {60, 40}, 60, {0, 0, 60, 40}, plane.data(), 120,
                              {120, 80}, 2.0, 2.0, InterpolateCubic);
            const KernelStatus lookedUp = LookupInPlace16x1(words.data(), 13000, {6500, 1},
                                                            values.data(), levels.data(), 65536);
            isThreadRight = enlarged == KernelOk && lookedUp == KernelOk && plane == wantedPlane &&
                            words == Words(6500, 12);
        });
    for (std::thread& thread : threads) thread.join();

    EXPECT_EQ(isRight, (std::array{true, true, true, true}));
}

TEST_P(KernelEdgeCases, TheFormMayChangeWhileThreadsRunKernels) {
    const Bytes source = MakeRamp(60 * 40);
    Bytes wanted(120 * 80);
    ASSERT_EQ(Judge::EnlargePlane8(source.data(), {60, 40}, 60, {0, 0, 60, 40}, wanted.data(), 120,
                                   {120, 80}, 2.0, 2.0, InterpolateCubic),
              KernelOk);
    std::atomic<int> running{3};
    std::atomic<int> wrong{0};

    std::vector<std::thread> threads;
    for (int i = 0; i < 3; ++i) {
        threads.emplace_back([&] {
            for (int round = 0; round < CountKernelRounds(100); ++round) {
                Bytes plane(120 * 80);
                const KernelStatus status =
                    EnlargePlane8(source.data(), {60, 40}, 60, {0, 0, 60, 40}, plane.data(), 120,
                                  {120, 80}, 2.0, 2.0, InterpolateCubic);
                if (status != KernelOk || plane != wanted) ++wrong;
            }
            --running;
        });
    }
    while (running != 0) {
        EXPECT_TRUE(ForceKernels("plain"));
        EXPECT_TRUE(ForceKernels(GetParam()));
    }
    for (std::thread& thread : threads) thread.join();

    EXPECT_EQ(0, wrong);
}

ZENTARA_FOR_ALL_KERNEL_FORMS(KernelEdgeCases);

}  // namespace
}  // namespace ZV::Testing
