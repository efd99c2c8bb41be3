#include <gtest/gtest.h>

#include <array>
#include <cmath>
#include <cstring>
#include <limits>
#include <numeric>
#include <string>
#include <utility>
#include <vector>

#include "imaging/kernels/kernels.h"

namespace ZV {
namespace {

using Bytes = std::vector<std::uint8_t>;
using Words = std::vector<std::uint16_t>;

constexpr std::int32_t Most = std::numeric_limits<std::int32_t>::max();
constexpr std::int32_t Least = std::numeric_limits<std::int32_t>::min();
constexpr KernelSize BadSizes[] = {{0, 4}, {4, 0}, {-1, 4}, {4, -1}, {Least, Least}};
constexpr std::uint8_t Untouched = 0xA5;

using PackKernel = KernelStatus (*)(const void* const*, std::int32_t, void*, std::int32_t,
                                    KernelSize);

struct PackCase {
    const char* name;
    PackKernel pack;
    std::size_t planes;
    std::size_t sampleBytes;
};

template <typename Case>
class KernelTable : public testing::TestWithParam<Case> {
  protected:
    void TearDown() override {
        for (const std::uint8_t byte : memory) EXPECT_EQ(byte, Untouched);
    }
    [[nodiscard]] void* GetMemory() { return memory.data(); }

  private:
    std::array<std::uint8_t, 1024> memory = [] {
        std::array<std::uint8_t, 1024> bytes;
        bytes.fill(Untouched);
        return bytes;
    }();
};

constexpr auto GetCaseName = [](const auto& row) { return std::string(row.param.name); };

class PackStatus : public KernelTable<PackCase> {};

TEST_P(PackStatus, NullPointersComeBeforeSizesAndNothingIsWritten) {
    const Bytes plane(64);
    const auto pack = GetParam().pack;
    const void* planes[4] = {plane.data(), plane.data(), plane.data(), plane.data()};

    EXPECT_EQ(pack(nullptr, 4, GetMemory(), 16, {0, 0}), KernelNullPointer);
    EXPECT_EQ(pack(planes, 4, nullptr, 16, {0, 0}), KernelNullPointer);
    for (std::size_t index = 0; index < GetParam().planes; ++index) {
        planes[index] = nullptr;
        EXPECT_EQ(pack(planes, 4, GetMemory(), 16, {4, 1}), KernelNullPointer) << index;
        planes[index] = plane.data();
    }
    for (const KernelSize size : BadSizes) {
        EXPECT_EQ(pack(planes, 4, GetMemory(), 16, size), KernelBadSize);
    }
}

TEST(PackPlanes, DoNotTestRowLengths) {
    const Bytes plane{1, 2, 3, 4, 5, 6};
    const void* const planes[3] = {plane.data(), plane.data() + 2, plane.data() + 4};
    Bytes pixels(12, Untouched);

    // The planes' one row is read twice, and the pixels' rows run upward.
    EXPECT_EQ(PackPlanes8x3(planes, 0, pixels.data() + 6, -6, {2, 2}), KernelOk);

    EXPECT_EQ(pixels, (Bytes{1, 3, 5, 2, 4, 6, 1, 3, 5, 2, 4, 6}));
}

INSTANTIATE_TEST_SUITE_P(All, PackStatus,
                         testing::Values(PackCase{"Pack8x3", PackPlanes8x3, 3, 1},
                                         PackCase{"Pack8x4", PackPlanes8x4, 4, 1},
                                         PackCase{"Pack16x3", PackPlanes16x3, 3, 2}),
                         GetCaseName);

struct AddCase {
    const char* name;
    decltype(&AddPlane8) add;
};

class AddStatus : public KernelTable<AddCase> {};

TEST_P(AddStatus, NullPointersComeBeforeSizesAndTheScale) {
    const Bytes source(64);
    const auto add = GetParam().add;

    EXPECT_EQ(add(nullptr, 8, GetMemory(), 8, {0, 0}, 1), KernelNullPointer);
    EXPECT_EQ(add(source.data(), 8, nullptr, 8, {0, 0}, 1), KernelNullPointer);
    for (const KernelSize size : BadSizes) {
        EXPECT_EQ(add(source.data(), 8, GetMemory(), 8, size, 0), KernelBadSize);
    }
    for (const std::int32_t scale : {1, -1, Most, Least}) {
        EXPECT_EQ(add(source.data(), 8, GetMemory(), 8, {4, 4}, scale), KernelBadSize) << scale;
    }
}

TEST(AddPlane8, GivesTheGreatestSampleFor200And100) {
    const Bytes source{100, 1};
    Bytes samples{200, 2};

    EXPECT_EQ(AddPlane8(source.data(), 2, samples.data(), 2, {2, 1}, 0), KernelOk);

    EXPECT_EQ(samples, (Bytes{255, 3}));
}

TEST(AddPlane8, DoesNotTestRowLengths) {
    const Bytes source{1, 2};
    Bytes samples{10, 20};

    EXPECT_EQ(AddPlane8(source.data(), 0, samples.data(), 0, {2, 3}, 0), KernelOk);
    EXPECT_EQ(samples, (Bytes{13, 26}));
    EXPECT_EQ(AddPlane8(source.data() + 1, -1, samples.data() + 1, -1, {1, 2}, 0), KernelOk);
    EXPECT_EQ(samples, (Bytes{14, 28}));
}

INSTANTIATE_TEST_SUITE_P(All, AddStatus,
                         testing::Values(AddCase{"Add8", AddPlane8}, AddCase{"Add16", AddPlane16}),
                         GetCaseName);

struct ShiftCase {
    const char* name;
    decltype(&ShiftRightPlane8) shift;
    std::int32_t sampleBits;
};

class ShiftStatus : public KernelTable<ShiftCase> {};

TEST_P(ShiftStatus, NullThenSizeThenRowLength) {
    const auto shift = GetParam().shift;

    EXPECT_EQ(shift(-1, nullptr, 0, {0, 0}), KernelNullPointer);
    for (const KernelSize size : BadSizes) {
        EXPECT_EQ(shift(1, GetMemory(), 0, size), KernelBadSize);
    }
    EXPECT_EQ(shift(-1, GetMemory(), 0, {4, 4}), KernelBadSize);
    EXPECT_EQ(shift(Least, GetMemory(), 8, {4, 4}), KernelBadSize);
    for (const std::int32_t rowBytes : {0, -1, -8, Least}) {
        EXPECT_EQ(shift(1, GetMemory(), rowBytes, {4, 4}), KernelBadStep) << rowBytes;
    }
}

TEST_P(ShiftStatus, ACountOf0KeepsThePlane) {
    EXPECT_EQ(GetParam().shift(0, GetMemory(), 32, {16, 4}), KernelOk);
}

TEST_P(ShiftStatus, ACountBeyondTheSamplesGives0AndLeavesTheGaps) {
    for (const std::int32_t count : {GetParam().sampleBits, GetParam().sampleBits + 1, 32, Most}) {
        Bytes plane(40, 0xFF);
        const auto samples = static_cast<std::size_t>(GetParam().sampleBits / 8 * 4);

        EXPECT_EQ(GetParam().shift(count, plane.data(), 10, {4, 4}), KernelOk) << count;

        for (std::size_t index = 0; index < plane.size(); ++index) {
            EXPECT_EQ(plane[index], index % 10 < samples ? 0 : 0xFF) << count << ", " << index;
        }
    }
}

TEST(ShiftRightPlane, TakesSamplesForUnsigned) {
    Bytes bytes{0xFF, 0x80};
    Words words{0xFFFF, 0x8000};

    EXPECT_EQ(ShiftRightPlane8(7, bytes.data(), 2, {2, 1}), KernelOk);
    EXPECT_EQ(ShiftRightPlane16(15, words.data(), 4, {2, 1}), KernelOk);

    EXPECT_EQ(bytes, (Bytes{1, 1}));
    EXPECT_EQ(words, (Words{1, 1}));
}

INSTANTIATE_TEST_SUITE_P(All, ShiftStatus,
                         testing::Values(ShiftCase{"Shift8", ShiftRightPlane8, 8},
                                         ShiftCase{"Shift16", ShiftRightPlane16, 16}),
                         GetCaseName);

using LookupKernel = KernelStatus (*)(void*, std::int32_t, KernelSize, const std::int32_t* const*,
                                      const std::int32_t* const*, const std::int32_t*);

template <decltype(&LookupInPlace8x1) Kernel>
KernelStatus LookUpOneChannel(void* plane, std::int32_t rowBytes, KernelSize size,
                              const std::int32_t* const* values, const std::int32_t* const* levels,
                              const std::int32_t* counts) {
    return Kernel(plane, rowBytes, size, *values, *levels, *counts);
}

struct LookupCase {
    const char* name;
    LookupKernel lookUp;
    std::size_t channels;
};

class LookupStatus : public KernelTable<LookupCase> {};

TEST_P(LookupStatus, NullThenSizeThenRowLengthThenLevels) {
    const std::int32_t table[2] = {0, 1};
    const std::int32_t* values[4] = {table, table, table, table};
    const std::int32_t* levels[4] = {table, table, table, table};
    std::int32_t counts[4] = {2, 2, 2, 2};
    const auto lookUp = GetParam().lookUp;
    for (std::size_t channel = 0; channel < GetParam().channels; ++channel) {
        values[channel] = nullptr;
        EXPECT_EQ(lookUp(GetMemory(), 0, {0, 0}, values, levels, counts), KernelNullPointer);
        values[channel] = table;
        levels[channel] = nullptr;
        EXPECT_EQ(lookUp(GetMemory(), 0, {0, 0}, values, levels, counts), KernelNullPointer);
        levels[channel] = table;
        counts[channel] = 1;
        EXPECT_EQ(lookUp(nullptr, 0, {0, 0}, values, levels, counts), KernelNullPointer);
        for (const KernelSize size : BadSizes) {
            EXPECT_EQ(lookUp(GetMemory(), 0, size, values, levels, counts), KernelBadSize);
        }
        for (const std::int32_t rowBytes : {0, -1, Least}) {
            EXPECT_EQ(lookUp(GetMemory(), rowBytes, {4, 4}, values, levels, counts), KernelBadStep);
        }
        for (const std::int32_t count : {1, 0, -1, Least}) {
            counts[channel] = count;
            EXPECT_EQ(lookUp(GetMemory(), 32, {4, 4}, values, levels, counts), KernelBadLevels);
        }
        counts[channel] = 2;
    }
}

TEST_P(LookupStatus, NullArraysOfTablesAreNullPointersToo) {
    if (GetParam().channels == 1) return;  // Its tables come without an array around them.
    const std::int32_t table[2] = {0, 1};
    const std::int32_t* const tables[4] = {table, table, table, table};
    const std::int32_t counts[4] = {2, 2, 2, 2};
    const auto lookUp = GetParam().lookUp;

    EXPECT_EQ(lookUp(GetMemory(), 32, {4, 4}, nullptr, tables, counts), KernelNullPointer);
    EXPECT_EQ(lookUp(GetMemory(), 32, {4, 4}, tables, nullptr, counts), KernelNullPointer);
    EXPECT_EQ(lookUp(GetMemory(), 32, {4, 4}, tables, tables, nullptr), KernelNullPointer);
}

INSTANTIATE_TEST_SUITE_P(
    All, LookupStatus,
    testing::Values(LookupCase{"Lookup8x4", LookupInPlace8x4, 4},
                    LookupCase{"Lookup8x3", LookupInPlace8x3, 3},
                    LookupCase{"Lookup8x1", LookUpOneChannel<LookupInPlace8x1>, 1},
                    LookupCase{"Lookup16x3", LookupInPlace16x3, 3},
                    LookupCase{"Lookup16x1", LookUpOneChannel<LookupInPlace16x1>, 1}),
    GetCaseName);

std::vector<std::int32_t> CountUp(std::int32_t count) {
    std::vector<std::int32_t> numbers(static_cast<std::size_t>(count));
    std::iota(numbers.begin(), numbers.end(), 0);
    return numbers;
}

TEST(Lookup, Maps254To0AndLeaves255WhereAllValuesAre0) {
    const std::vector<std::int32_t> values(256);
    Bytes samples{0, 1, 254, 255};

    EXPECT_EQ(LookupInPlace8x1(samples.data(), 4, {4, 1}, values.data(), CountUp(256).data(), 256),
              KernelOk);

    EXPECT_EQ(samples, (Bytes{0, 0, 0, 255}));
}

TEST(Lookup, LeavesTheGreatestDeepSampleInSmallAndLargeImagesAlike) {
    const std::vector<std::int32_t> values(65536);
    const std::vector<std::int32_t> levels = CountUp(65536);
    for (const std::int32_t height : {80, 81}) {  // 6400 pixels, and more.
        Words samples(static_cast<std::size_t>(80 * height), 65534);
        samples.back() = 65535;

        EXPECT_EQ(LookupInPlace16x1(samples.data(), 160, {80, height}, values.data(), levels.data(),
                                    65536),
                  KernelOk);

        EXPECT_EQ(samples.front(), 0);
        EXPECT_EQ(samples.back(), 65535);
    }
}

/// The samples 0 to 65535 after a lookup of a large image by a table and of small ones by search.
void ExpectSearchAgreesWithTable(const std::vector<std::int32_t>& values,
                                 const std::vector<std::int32_t>& levels) {
    Words large(65536);
    std::iota(large.begin(), large.end(), std::uint16_t{0});
    Words small = large;
    const auto count = static_cast<std::int32_t>(levels.size());

    EXPECT_EQ(LookupInPlace16x1(large.data(), 512, {256, 256}, values.data(), levels.data(), count),
              KernelOk);
    for (std::size_t first = 0; first < small.size(); first += 4096) {
        EXPECT_EQ(
            LookupInPlace16x1(&small[first], 128, {64, 64}, values.data(), levels.data(), count),
            KernelOk);
    }

    EXPECT_EQ(large, small);
}

TEST(Lookup, SearchesSmallDeepImagesWithTheResultsOfTheTable) {
    ExpectSearchAgreesWithTable({100, -5, 70000, 9}, {10, 20, 30, 40});
    ExpectSearchAgreesWithTable({1, 2, 3, 4, 5}, {10, 20, 20, 20, 65535});
    ExpectSearchAgreesWithTable({1, 2, 3}, {-100, 0, 100000});
    ExpectSearchAgreesWithTable({1, 2, 3}, {Least, 65535, Most});
    ExpectSearchAgreesWithTable({7, 8}, {-20, -10});
    ExpectSearchAgreesWithTable({7, 8}, {65536, 70000});
    ExpectSearchAgreesWithTable({7, 8}, {500, 500});
}

TEST(Lookup, TakesTheLastOfRepeatedLevels) {
    const std::int32_t values[] = {1, 2, 3, 4};
    const std::int32_t levels[] = {10, 20, 20, 30};
    Bytes samples{9, 10, 19, 20, 29, 30};

    EXPECT_EQ(LookupInPlace8x1(samples.data(), 6, {6, 1}, values, levels, 4), KernelOk);

    EXPECT_EQ(samples, (Bytes{9, 1, 1, 3, 3, 30}));
}

TEST(Lookup, CutsLevelsAndValuesBeyondTheSamples) {
    const std::int32_t values[] = {-7, 300, Most};
    const std::int32_t levels[] = {Least, 100, Most};
    Bytes samples{0, 99, 100, 255};

    EXPECT_EQ(LookupInPlace8x1(samples.data(), 4, {4, 1}, values, levels, 3), KernelOk);

    EXPECT_EQ(samples, (Bytes{0, 0, 255, 255}));
}

TEST(Lookup, ComesBackFromFallingLevels) {
    const std::int32_t values[] = {1, 2, 3, 4};
    const std::int32_t levels[] = {200, 100, 150, 20};
    for (const std::int32_t height : {1, 7000}) {
        Words samples(static_cast<std::size_t>(height), 120);

        EXPECT_EQ(LookupInPlace16x1(samples.data(), 2, {1, height}, values, levels, 4), KernelOk);
    }
}

struct EnlargeCase {
    const char* name;
    decltype(&EnlargePlane8) enlarge;
};

class EnlargeStatus : public KernelTable<EnlargeCase> {
  protected:
    /// A call without a fault, for each test to spoil.
    struct Call {
        const void* source;
        KernelSize sourceSize{4, 4};
        KernelRect rect{0, 0, 4, 4};
        void* destination;
        KernelSize destinationSize{8, 8};
        double xFactor = 2.0;
        double yFactor = 2.0;
        std::int32_t interpolation = InterpolateLinear;
    };
    Call MakeCall() { return {.source = sourceBytes.data(), .destination = GetMemory()}; }
    static KernelStatus Run(const Call& call) {
        return GetParam().enlarge(call.source, call.sourceSize, 32, call.rect, call.destination, 64,
                                  call.destinationSize, call.xFactor, call.yFactor,
                                  call.interpolation);
    }

  private:
    Bytes sourceBytes = Bytes(1024);
};

TEST_P(EnlargeStatus, NullPointersComeFirst) {
    Call call = MakeCall();
    call.sourceSize = {0, 0};
    call.source = nullptr;
    EXPECT_EQ(Run(call), KernelNullPointer);
    call = MakeCall();
    call.sourceSize = {0, 0};
    call.destination = nullptr;
    EXPECT_EQ(Run(call), KernelNullPointer);
}

TEST_P(EnlargeStatus, SourceSizeThenRectangleThenOverlap) {
    Call call = MakeCall();
    call.destinationSize = {0, 0};
    for (const KernelSize size : BadSizes) {
        call.sourceSize = size;
        EXPECT_EQ(Run(call), KernelBadSize);
    }
    call.sourceSize = {4, 4};
    constexpr KernelRect BadRects[] = {{-1, 4, 4, 4},    {4, -1, 4, 4}, {4, 0, 0, 4},
                                       {0, 4, 4, 0},     {4, 4, -1, 4}, {Least, 0, 4, 4},
                                       {0, 0, 4, Least}, {4, 4, 4, -1}};
    for (const KernelRect& rect : BadRects) {
        call.rect = rect;
        EXPECT_EQ(Run(call), KernelBadSize);
    }
    constexpr KernelRect RectsOutside[] = {{4, 0, 1, 1}, {0, 4, 1, 1}, {Most, Most, Most, Most}};
    for (const KernelRect& rect : RectsOutside) {
        call.rect = rect;
        EXPECT_EQ(Run(call), KernelNoOverlap);
    }
}

TEST_P(EnlargeStatus, DestinationSizeThenFactorsThenInterpolation) {
    Call call = MakeCall();
    call.xFactor = 0.0;
    call.interpolation = 3;
    for (const KernelSize size : BadSizes) {
        call.destinationSize = size;
        EXPECT_EQ(Run(call), KernelBadSize);
    }
    call.destinationSize = {8, 8};
    for (const double factor : {0.0, -0.0, -2.0, -HUGE_VAL, std::nan("")}) {
        call.xFactor = factor;
        call.yFactor = 2.0;
        EXPECT_EQ(Run(call), KernelBadFactor) << factor;
        std::swap(call.xFactor, call.yFactor);
        EXPECT_EQ(Run(call), KernelBadFactor) << factor;
    }
    call = MakeCall();
    for (const std::int32_t code : {0, 3, 5, 8, 15, 17, -1, -16, Most, Least}) {
        call.interpolation = code;
        EXPECT_EQ(Run(call), KernelBadInterpolation) << code;
        call.xFactor = 1e-3;
        EXPECT_EQ(Run(call), KernelBadInterpolation) << code;
    }
}

TEST_P(EnlargeStatus, Code16IsUnknownForImagesOf8AndMore) {
    Call call = MakeCall();
    call.interpolation = InterpolateLanczos;
    call.sourceSize = {8, 8};
    EXPECT_EQ(Run(call), KernelBadInterpolation);
    call.rect = {0, 0, 2, 2};
    EXPECT_EQ(Run(call), KernelBadInterpolation);
}

TEST_P(EnlargeStatus, AResultBelowHalfASampleIsEmpty) {
    Call call = MakeCall();
    call.xFactor = 0.1249;
    EXPECT_EQ(Run(call), KernelEmptyResult);
    std::swap(call.xFactor, call.yFactor);
    EXPECT_EQ(Run(call), KernelEmptyResult);
    call.yFactor = std::numeric_limits<double>::denorm_min();
    EXPECT_EQ(Run(call), KernelEmptyResult);
}

INSTANTIATE_TEST_SUITE_P(All, EnlargeStatus,
                         testing::Values(EnlargeCase{"Enlarge8", EnlargePlane8},
                                         EnlargeCase{"Enlarge16", EnlargePlane16}),
                         GetCaseName);

Bytes Enlarge(const Bytes& source, KernelSize size, KernelRect rect, KernelSize room,
              double xFactor, double yFactor, std::int32_t interpolation) {
    Bytes output(static_cast<std::size_t>(room.width) * static_cast<std::size_t>(room.height),
                 Untouched);
    EXPECT_EQ(EnlargePlane8(source.data(), size, size.width, rect, output.data(), room.width, room,
                            xFactor, yFactor, interpolation),
              KernelOk);
    return output;
}

Bytes EnlargeTwice(const Bytes& source, KernelSize size, std::int32_t interpolation) {
    return Enlarge(source, size, {0, 0, size.width, size.height}, {2 * size.width, 2 * size.height},
                   2.0, 2.0, interpolation);
}

TEST(EnlargePlane8, WeighsTwoSamplesByThirdsWithTheLastOneExact) {
    EXPECT_EQ(EnlargeTwice({10, 20, 10, 20}, {2, 2}, InterpolateLinear),
              (Bytes{10, 13, 17, 20, 10, 13, 17, 20, 10, 13, 17, 20, 10, 13, 17, 20}));
}

TEST(EnlargePlane8, TakesTheNearestWhereTheHeightIs1) {
    EXPECT_EQ(EnlargeTwice({10, 20}, {2, 1}, InterpolateLinear),
              (Bytes{10, 10, 20, 20, 10, 10, 20, 20}));
    EXPECT_EQ(EnlargeTwice({10, 20}, {1, 2}, InterpolateLinear),
              (Bytes{10, 10, 10, 10, 20, 20, 20, 20}));
}

TEST(EnlargePlane8, TakesLinearForCubicBelow4InEitherDirection) {
    const Bytes source{0, 200, 10, 90, 255, 30, 7, 60, 120, 0, 250, 3};
    for (const KernelSize size : {KernelSize{3, 4}, KernelSize{4, 3}}) {
        EXPECT_EQ(EnlargeTwice(source, size, InterpolateCubic),
                  EnlargeTwice(source, size, InterpolateLinear));
    }
}

TEST(EnlargePlane8, TakesCubicForCode16Below8InEitherDirection) {
    Bytes source(56);
    std::iota(source.begin(), source.end(), std::uint8_t{1});
    for (std::uint8_t& sample : source) sample = static_cast<std::uint8_t>(sample * 37);
    for (const KernelSize size : {KernelSize{7, 8}, KernelSize{8, 7}, KernelSize{3, 7}}) {
        EXPECT_EQ(EnlargeTwice(source, size, InterpolateLanczos),
                  EnlargeTwice(source, size, InterpolateCubic));
    }
}

TEST(EnlargePlane8, FitsTheInterpolationToASmallRectangleOfALargeImage) {
    Bytes source(100);
    std::iota(source.begin(), source.end(), std::uint8_t{0});
    const auto enlarge = [&](KernelRect rect, std::int32_t interpolation) {
        return Enlarge(source, {10, 10}, rect, {20, 20}, 2.0, 2.0, interpolation);
    };

    EXPECT_EQ(enlarge({2, 2, 3, 5}, InterpolateCubic), enlarge({2, 2, 3, 5}, InterpolateLinear));
    EXPECT_EQ(enlarge({2, 2, 5, 1}, InterpolateCubic), enlarge({2, 2, 5, 1}, InterpolateNearest));
    EXPECT_EQ(enlarge({9, 9, 8, 8}, InterpolateCubic), enlarge({9, 9, 1, 1}, InterpolateNearest));
}

TEST(EnlargePlane8, LeavesTheDestinationBeyondTheResult) {
    const Bytes output =
        Enlarge({1, 2, 3, 4}, {2, 2}, {1, 1, Most, Most}, {4, 3}, 2.0, 2.0, InterpolateNearest);

    EXPECT_EQ(output, (Bytes{4, 4, Untouched, Untouched, 4, 4, Untouched, Untouched, Untouched,
                             Untouched, Untouched, Untouched}));
}

TEST(EnlargePlane8, EndsAtTheDestinationWhereTheResultIsLarger) {
    EXPECT_EQ(Enlarge({1, 2, 3, 4}, {2, 2}, {0, 0, 2, 2}, {3, 1}, 2.0, 2.0, InterpolateNearest),
              (Bytes{1, 1, 2}));
}

TEST(EnlargePlane8, GivesOneSampleFromHalfASampleOn) {
    EXPECT_EQ(Enlarge({1, 2, 3, 4}, {2, 2}, {0, 0, 2, 2}, {2, 2}, 0.25, 0.25, InterpolateLinear),
              (Bytes{1, Untouched, Untouched, Untouched}));
}

TEST(EnlargePlane8, RoundsALengthJustBelowAWholeNumberUp) {
    const Bytes output =
        Enlarge({5}, {1, 1}, {0, 0, 1, 1}, {3, 1}, 2.0 - 5e-8, 1.0, InterpolateNearest);

    EXPECT_EQ(output, (Bytes{5, 5, Untouched}));
}

TEST(EnlargePlane8, ComesBackFromAnyFactor) {
    constexpr double Factors[] = {0.3, 1.0, 1.5, 7.25, 1e9, 1e300, HUGE_VAL};
    Bytes source(25);
    std::iota(source.begin(), source.end(), std::uint8_t{0});
    for (const std::int32_t code : {InterpolateNearest, InterpolateLinear, InterpolateCubic}) {
        for (const double x : Factors) {
            for (const double y : Factors) {
                const Bytes output = Enlarge(source, {5, 5}, {0, 0, 5, 5}, {40, 40}, x, y, code);
                // Nearest at such a factor begins half a step in, the others on the first sample.
                if (x >= 1.0 && y >= 1.0) {
                    EXPECT_EQ(output[0], 0) << x << ", " << y;
                }
            }
        }
    }
}

TEST(EnlargePlane16, KeepsTheRowsOfAnySourceAddress) {
    Bytes bytes(2 * 36 + 1);
    for (std::size_t index = 0; index < bytes.size(); ++index) {
        bytes[index] = static_cast<std::uint8_t>(index * 91);
    }
    Words aligned(36);
    std::memcpy(aligned.data(), bytes.data() + 1, 72);
    for (const std::int32_t code : {InterpolateNearest, InterpolateLinear, InterpolateCubic}) {
        Words expected(144);
        Bytes output(289);
        constexpr KernelSize Size{6, 6}, Room{12, 12};

        EXPECT_EQ(EnlargePlane16(aligned.data(), Size, 12, {0, 0, 6, 6}, expected.data(), 24, Room,
                                 2.0, 2.0, code),
                  KernelOk);
        EXPECT_EQ(EnlargePlane16(bytes.data() + 1, Size, 12, {0, 0, 6, 6}, output.data() + 1, 24,
                                 Room, 2.0, 2.0, code),
                  KernelOk);

        EXPECT_EQ(std::memcmp(expected.data(), output.data() + 1, 288), 0) << code;
    }
}

}  // namespace
}  // namespace ZV
