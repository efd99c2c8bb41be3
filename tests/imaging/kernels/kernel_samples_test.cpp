// Packing, adding and shifting in every form, against the judge.

#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <memory>
#include <vector>

#include "imaging/kernels/kernel_fixture.h"
#include "imaging/kernels/kernel_judge.h"
#include "imaging/kernels/kernel_selection.h"
#include "imaging/kernels/kernels.h"
#include "imaging/kernels/pixel_rows.h"

namespace ZV::Testing {
namespace {

struct PackKernel {
    const char* name;
    std::size_t planeCount;
    std::size_t sampleBytes;
    decltype(&PackPlanes8x3) kernel;
    decltype(&PackPlanes8x3) judge;
};

constexpr std::array PackKernels{
    PackKernel{"PackPlanes8x3", 3, 1, PackPlanes8x3, Judge::PackPlanes8x3},
    PackKernel{"PackPlanes8x4", 4, 1, PackPlanes8x4, Judge::PackPlanes8x4},
    PackKernel{"PackPlanes16x3", 3, 2, PackPlanes16x3, Judge::PackPlanes16x3},
};

struct AddKernel {
    const char* name;
    std::size_t sampleBytes;
    decltype(&AddPlane8) kernel;
    decltype(&AddPlane8) judge;
};

constexpr std::array AddKernels{
    AddKernel{"AddPlane8", 1, AddPlane8, Judge::AddPlane8},
    AddKernel{"AddPlane16", 2, AddPlane16, Judge::AddPlane16},
};

struct ShiftKernel {
    const char* name;
    std::size_t sampleBytes;
    decltype(&ShiftRightPlane8) kernel;
    decltype(&ShiftRightPlane8) judge;
};

constexpr std::array ShiftKernels{
    ShiftKernel{"ShiftRightPlane8", 1, ShiftRightPlane8, Judge::ShiftRightPlane8},
    ShiftKernel{"ShiftRightPlane16", 2, ShiftRightPlane16, Judge::ShiftRightPlane16},
};

std::vector<RowLayout> ListLayoutsOfBothDirections() {
    std::vector<RowLayout> layouts(DownwardLayouts.begin(), DownwardLayouts.end());
    layouts.push_back(BottomUpLayout);
    return layouts;
}

SampleKind PickKind(std::mt19937& random) {
    // Random samples half the time.
    const std::size_t pick = random() % (2 * AllSampleKinds.size());
    return pick < AllSampleKinds.size() ? AllSampleKinds[pick] : SampleKind::Random;
}

class KernelSamples : public KernelFormTest {
  protected:
    void ComparePacking(const PackKernel& row, KernelSize size, const RowLayout& layout);
    void CompareAdding(const AddKernel& row, KernelSize size, const RowLayout& layout);
    void CompareShifting(const ShiftKernel& row, KernelSize size, const RowLayout& layout,
                         std::int32_t count);
};

void KernelSamples::ComparePacking(const PackKernel& row, KernelSize size,
                                   const RowLayout& layout) {
    const auto rowContent = static_cast<std::size_t>(size.width) * row.sampleBytes;
    const auto height = static_cast<std::size_t>(size.height);
    std::vector<std::unique_ptr<PixelRows>> planes;
    std::vector<const void*> pointers;
    for (std::size_t i = 0; i < row.planeCount; ++i) {
        planes.push_back(
            std::make_unique<PixelRows>(layout, rowContent, height, i * layout.offset));
        planes.back()->Fill(PickKind(random), row.sampleBytes, random);
        pointers.push_back(planes.back()->GetStart());
    }
    const PixelRows actual(layout, rowContent * row.planeCount, height);
    const PixelRows expected(layout, rowContent * row.planeCount, height);

    ASSERT_EQ(row.kernel(pointers.data(), planes[0]->GetRowBytes(), actual.GetStart(),
                         actual.GetRowBytes(), size),
              KernelOk);
    ASSERT_EQ(row.judge(pointers.data(), planes[0]->GetRowBytes(), expected.GetStart(),
                        expected.GetRowBytes(), size),
              KernelOk);

    ASSERT_EQ(actual.Compare(expected, row.sampleBytes), "")
        << Describe(std::string(row.name) + ", " + layout.name, size);
}

void KernelSamples::CompareAdding(const AddKernel& row, KernelSize size, const RowLayout& layout) {
    const auto rowContent = static_cast<std::size_t>(size.width) * row.sampleBytes;
    const auto height = static_cast<std::size_t>(size.height);
    const PixelRows source(layout, rowContent, height, 2 * layout.offset);
    const PixelRows actual(layout, rowContent, height);
    const PixelRows expected(layout, rowContent, height);
    source.Fill(PickKind(random), row.sampleBytes, random);
    actual.Fill(PickKind(random), row.sampleBytes, random);
    expected.CopyRowsFrom(actual);

    ASSERT_EQ(row.kernel(source.GetStart(), source.GetRowBytes(), actual.GetStart(),
                         actual.GetRowBytes(), size, 0),
              KernelOk);
    ASSERT_EQ(row.judge(source.GetStart(), source.GetRowBytes(), expected.GetStart(),
                        expected.GetRowBytes(), size, 0),
              KernelOk);

    ASSERT_EQ(actual.Compare(expected, row.sampleBytes), "")
        << Describe(std::string(row.name) + ", " + layout.name, size);
}

void KernelSamples::CompareShifting(const ShiftKernel& row, KernelSize size,
                                    const RowLayout& layout, std::int32_t count) {
    const auto rowContent = static_cast<std::size_t>(size.width) * row.sampleBytes;
    const auto height = static_cast<std::size_t>(size.height);
    const PixelRows actual(layout, rowContent, height);
    const PixelRows expected(layout, rowContent, height);
    actual.Fill(PickKind(random), row.sampleBytes, random);
    expected.CopyRowsFrom(actual);

    ASSERT_EQ(row.kernel(count, actual.GetStart(), actual.GetRowBytes(), size), KernelOk);
    ASSERT_EQ(row.judge(count, expected.GetStart(), expected.GetRowBytes(), size), KernelOk);

    ASSERT_EQ(actual.Compare(expected, row.sampleBytes), "") << Describe(
        std::string(row.name) + " by " + std::to_string(count) + ", " + layout.name, size);
}

TEST_P(KernelSamples, PackingGivesTheJudgesPixelsAtEverySizeAndPlace) {
    for (const KernelSize size : MakeKernelSizes(random))
        for (const RowLayout& layout : ListLayoutsOfBothDirections())
            for (const PackKernel& row : PackKernels) {
                ComparePacking(row, size, layout);
                if (HasFatalFailure()) return;
            }
}

TEST_P(KernelSamples, AddingGivesTheJudgesSumsAtEverySizeAndPlace) {
    for (const KernelSize size : MakeKernelSizes(random))
        for (const RowLayout& layout : ListLayoutsOfBothDirections())
            for (const AddKernel& row : AddKernels) {
                CompareAdding(row, size, layout);
                if (HasFatalFailure()) return;
            }
}

TEST_P(KernelSamples, ShiftingByOneGivesTheJudgesHalvesAtEverySizeAndPlace) {
    for (const KernelSize size : MakeKernelSizes(random))
        for (const RowLayout& layout : DownwardLayouts)
            for (const ShiftKernel& row : ShiftKernels) {
                CompareShifting(row, size, layout, 1);
                if (HasFatalFailure()) return;
            }
}

TEST_P(KernelSamples, ShiftingGivesTheJudgesSamplesByEveryCount) {
    constexpr std::array Counts{0,  1,  2,  3,  4,  5,  6,  7,  8,  9,  10,  11,
                                12, 13, 14, 15, 16, 17, 31, 32, 33, 64, 255, 0x7FFFFFFF};
    for (const std::int32_t count : Counts)
        for (const KernelSize size : {KernelSize{1, 1}, KernelSize{37, 3}, KernelSize{150, 2}})
            for (const ShiftKernel& row : ShiftKernels) {
                CompareShifting(row, size, DownwardLayouts[random() % DownwardLayouts.size()],
                                count);
                if (HasFatalFailure()) return;
            }
}

TEST_P(KernelSamples, SamplesOfEveryPairOfBytesAddUpWithinTheRange) {
    std::vector<std::uint8_t> sources(65536);
    std::vector<std::uint8_t> sums(65536);
    for (std::size_t i = 0; i < sums.size(); ++i) {
        sources[i] = static_cast<std::uint8_t>(i >> 8);
        sums[i] = static_cast<std::uint8_t>(i);
    }

    ASSERT_EQ(AddPlane8(sources.data(), 65536, sums.data(), 65536, {65536, 1}, 0), KernelOk);

    for (std::size_t i = 0; i < sums.size(); ++i)
        ASSERT_EQ(sums[i], std::min<std::size_t>((i >> 8) + (i & 255), 255)) << i;
}

TEST_P(KernelSamples, OnePlaneMayServeAsAll) {
    for (const PackKernel& row : PackKernels) {
        const PixelRows plane(DownwardLayouts[3], 53 * row.sampleBytes, 4);
        plane.Fill(SampleKind::Random, row.sampleBytes, random);
        const std::vector<const void*> pointers(row.planeCount, plane.GetStart());
        const PixelRows actual(DownwardLayouts[3], 53 * row.sampleBytes * row.planeCount, 4);
        const PixelRows expected(DownwardLayouts[3], 53 * row.sampleBytes * row.planeCount, 4);

        ASSERT_EQ(row.kernel(pointers.data(), plane.GetRowBytes(), actual.GetStart(),
                             actual.GetRowBytes(), {53, 4}),
                  KernelOk);
        ASSERT_EQ(row.judge(pointers.data(), plane.GetRowBytes(), expected.GetStart(),
                            expected.GetRowBytes(), {53, 4}),
                  KernelOk);

        EXPECT_EQ(actual.Compare(expected, row.sampleBytes), "") << row.name;
    }
}

TEST_P(KernelSamples, PackedPlanesStayAsTheyWere) {
    for (const RowLayout& layout : ListLayoutsOfBothDirections())
        for (const KernelSize size : {KernelSize{1, 1}, KernelSize{37, 3}, KernelSize{150, 2}})
            for (const PackKernel& row : PackKernels) {
                const auto rowContent = static_cast<std::size_t>(size.width) * row.sampleBytes;
                const auto height = static_cast<std::size_t>(size.height);
                const PixelRows plane(layout, rowContent, height);
                const PixelRows before(layout, rowContent, height);
                const PixelRows pixels(layout, rowContent * row.planeCount, height);
                plane.Fill(SampleKind::Random, row.sampleBytes, random);
                before.CopyRowsFrom(plane);
                const std::vector<const void*> pointers(row.planeCount, plane.GetStart());

                ASSERT_EQ(row.kernel(pointers.data(), plane.GetRowBytes(), pixels.GetStart(),
                                     pixels.GetRowBytes(), size),
                          KernelOk);

                ASSERT_EQ(plane.Compare(before, row.sampleBytes), "")
                    << Describe(std::string(row.name) + ", " + layout.name, size);
            }
}

TEST_P(KernelSamples, AnAddedPlaneStaysAsItWas) {
    for (const RowLayout& layout : ListLayoutsOfBothDirections())
        for (const KernelSize size : {KernelSize{1, 1}, KernelSize{37, 3}, KernelSize{150, 2}})
            for (const AddKernel& row : AddKernels) {
                const auto rowContent = static_cast<std::size_t>(size.width) * row.sampleBytes;
                const auto height = static_cast<std::size_t>(size.height);
                const PixelRows source(layout, rowContent, height);
                const PixelRows before(layout, rowContent, height);
                const PixelRows sums(layout, rowContent, height);
                source.Fill(SampleKind::Random, row.sampleBytes, random);
                sums.Fill(SampleKind::Random, row.sampleBytes, random);
                before.CopyRowsFrom(source);

                ASSERT_EQ(row.kernel(source.GetStart(), source.GetRowBytes(), sums.GetStart(),
                                     sums.GetRowBytes(), size, 0),
                          KernelOk);

                ASSERT_EQ(source.Compare(before, row.sampleBytes), "")
                    << Describe(std::string(row.name) + ", " + layout.name, size);
            }
}

TEST_P(KernelSamples, OverlappingRowsAreShiftedAlikeInAllForms) {
    // Rows are taken one after the other, so that samples in two of them are shifted twice.
    constexpr KernelSize Size{150, 5};
    for (const ShiftKernel& row : ShiftKernels)
        for (const std::int32_t rowBytes : {1, 2, 15, 16, 17, 33, 64, 149}) {
            std::vector<std::uint8_t> actual(150 * row.sampleBytes + 4 * 149);
            for (std::uint8_t& byte : actual) byte = static_cast<std::uint8_t>(random());
            std::vector<std::uint8_t> plain = actual;

            ASSERT_EQ(row.kernel(1, actual.data(), rowBytes, Size), KernelOk);
            ASSERT_TRUE(ForceKernels("plain"));
            ASSERT_EQ(row.kernel(1, plain.data(), rowBytes, Size), KernelOk);
            ASSERT_TRUE(ForceKernels(GetParam()));

            EXPECT_EQ(actual, plain) << Describe(row.name, Size) << ", row length " << rowBytes;
        }
}

TEST_P(KernelSamples, ARowLengthOfZeroTakesTheSameSourceRowAgain) {
    // Kept: neither packing nor adding tests row lengths.
    const std::array<std::uint8_t, 3> source{1, 2, 200};
    std::array<std::uint8_t, 6> sums{10, 10, 10, 20, 20, 100};
    const void* const planes[] = {source.data(), source.data(), source.data()};
    std::array<std::uint8_t, 18> pixels{};

    EXPECT_EQ(AddPlane8(source.data(), 0, sums.data(), 3, {3, 2}, 0), KernelOk);
    EXPECT_EQ(PackPlanes8x3(planes, 0, pixels.data(), 9, {3, 2}), KernelOk);

    EXPECT_EQ(sums, (std::array<std::uint8_t, 6>{11, 12, 210, 21, 22, 255}));
    EXPECT_EQ(pixels, (std::array<std::uint8_t, 18>{1, 1, 1, 2, 2, 2, 200, 200, 200,  //
                                                    1, 1, 1, 2, 2, 2, 200, 200, 200}));
}

ZENTARA_FOR_ALL_KERNEL_FORMS(KernelSamples);

}  // namespace
}  // namespace ZV::Testing
