// Enlarging in every form, against the judge.

#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <cstring>
#include <limits>
#include <string>
#include <vector>

#include "imaging/kernels/kernel_fixture.h"
#include "imaging/kernels/kernel_judge.h"
#include "imaging/kernels/kernels.h"
#include "imaging/kernels/pixel_rows.h"

namespace ZV::Testing {
namespace {

struct EnlargeKernel {
    const char* name;
    std::size_t sampleBytes;
    decltype(&EnlargePlane8) kernel;
    decltype(&EnlargePlane8) judge;
};

constexpr std::array EnlargeKernels{
    EnlargeKernel{"EnlargePlane8", 1, EnlargePlane8, Judge::EnlargePlane8},
    EnlargeKernel{"EnlargePlane16", 2, EnlargePlane16, Judge::EnlargePlane16},
};

constexpr std::array Interpolations{InterpolateNearest, InterpolateLinear, InterpolateCubic};

/// One call.
struct Enlarging {
    KernelSize sourceSize;
    KernelRect rect;
    KernelSize destinationSize;
    double xFactor = 2.0;
    double yFactor = 2.0;
    std::int32_t interpolation = InterpolateLinear;
    SampleKind kind = SampleKind::Random;
    RowLayout layout = DownwardLayouts[3];
};

Enlarging MakeWhole(KernelSize size, double xFactor, double yFactor, std::int32_t interpolation) {
    const auto enlarge = [](std::int32_t length, double factor) {
        return std::max(static_cast<std::int32_t>(length * factor + 1e-7), 1);
    };
    return {size,
            {0, 0, size.width, size.height},
            {enlarge(size.width, xFactor), enlarge(size.height, yFactor)},
            xFactor,
            yFactor,
            interpolation};
}

std::string Tell(const Enlarging& call) {
    const auto& [x, y, width, height] = call.rect;
    return "interpolation " + std::to_string(call.interpolation) + ", factors " +
           std::to_string(call.xFactor) + " and " + std::to_string(call.yFactor) + ", rectangle " +
           std::to_string(x) + " " + std::to_string(y) + " " + std::to_string(width) + " x " +
           std::to_string(height) + ", to " + std::to_string(call.destinationSize.width) + " x " +
           std::to_string(call.destinationSize.height) + ", " + call.layout.name;
}

class KernelEnlarging : public KernelFormTest {
  protected:
    std::int32_t PickBetween(std::int32_t low, std::int32_t high) {
        return std::uniform_int_distribution<std::int32_t>(low, high)(random);
    }
    double PickFactor();
    SampleKind PickKind() { return AllSampleKinds[random() % AllSampleKinds.size()]; }
    const RowLayout& PickLayout() { return DownwardLayouts[random() % DownwardLayouts.size()]; }

    /// Status and every byte of the destination as the judge has them.
    void Compare(const EnlargeKernel& row, const Enlarging& call);
    void CompareBoth(const Enlarging& call) {
        for (const EnlargeKernel& row : EnlargeKernels)
            if (!HasFatalFailure()) Compare(row, call);
    }
};

double KernelEnlarging::PickFactor() {
    constexpr std::array Factors{2.0, 1.0,  1.5, 3.0,  0.5,  0.3, 2.7,  4.0,
                                 0.1, 0.75, 7.0, 1.01, 0.99, 1.9, 2.49, 10.0 / 3.0};
    if (random() % 4 != 0) return Factors[random() % Factors.size()];
    return std::uniform_real_distribution<double>(0.05, 6.0)(random);
}

void KernelEnlarging::Compare(const EnlargeKernel& row, const Enlarging& call) {
    const PixelRows source(call.layout,
                           static_cast<std::size_t>(call.sourceSize.width) * row.sampleBytes,
                           static_cast<std::size_t>(call.sourceSize.height), call.layout.offset);
    const auto outputContent =
        static_cast<std::size_t>(call.destinationSize.width) * row.sampleBytes;
    const auto outputHeight = static_cast<std::size_t>(call.destinationSize.height);
    const PixelRows actual(call.layout, outputContent, outputHeight);
    const PixelRows expected(call.layout, outputContent, outputHeight);
    source.Fill(call.kind, row.sampleBytes, random);
    actual.Fill(SampleKind::Random, row.sampleBytes, random);
    expected.CopyRowsFrom(actual);
    const std::string story = Describe(std::string(row.name) + ", " + Tell(call), call.sourceSize);

    const KernelStatus status = row.kernel(
        source.GetStart(), call.sourceSize, source.GetRowBytes(), call.rect, actual.GetStart(),
        actual.GetRowBytes(), call.destinationSize, call.xFactor, call.yFactor, call.interpolation);
    const KernelStatus wanted =
        row.judge(source.GetStart(), call.sourceSize, source.GetRowBytes(), call.rect,
                  expected.GetStart(), expected.GetRowBytes(), call.destinationSize, call.xFactor,
                  call.yFactor, call.interpolation);

    ASSERT_EQ(status, wanted) << story;
    ASSERT_EQ(actual.Compare(expected, row.sampleBytes), "") << story;
}

TEST_P(KernelEnlarging, DoublingGivesTheJudgesSamplesAtEverySize) {
    std::size_t turn = 0;
    for (const KernelSize size : MakeKernelSizes(random))
        for (const std::int32_t interpolation : Interpolations) {
            Enlarging call = MakeWhole(size, 2.0, 2.0, interpolation);
            call.kind = ++turn % 2 == 0 ? SampleKind::Random : PickKind();
            call.layout = DownwardLayouts[turn % DownwardLayouts.size()];
            CompareBoth(call);
            if (HasFatalFailure()) return;
        }
}

TEST_P(KernelEnlarging, DoublingGivesTheJudgesSamplesInEveryPlaceAndOfEveryKind) {
    for (const KernelSize size : {KernelSize{34, 9}, KernelSize{7, 4}, KernelSize{71, 5}})
        for (const std::int32_t interpolation : Interpolations)
            for (const SampleKind kind : AllSampleKinds) {
                Enlarging call = MakeWhole(size, 2.0, 2.0, interpolation);
                call.kind = kind;
                for (const RowLayout& layout : DownwardLayouts) {
                    call.layout = layout;
                    CompareBoth(call);
                }
                call.layout = BottomUpLayout;
                CompareBoth(call);
                if (HasFatalFailure()) return;
            }
}

TEST_P(KernelEnlarging, EveryFactorGivesTheJudgesSamples) {
    for (int round = CountKernelRounds(400); round > 0; --round) {
        const KernelSize size{PickBetween(1, 70), PickBetween(1, round % 5 == 0 ? 40 : 9)};
        Enlarging call = MakeWhole(size, PickFactor(), PickFactor(),
                                   Interpolations[random() % Interpolations.size()]);
        call.kind = PickKind();
        call.layout = PickLayout();
        CompareBoth(call);
        if (HasFatalFailure()) return;
    }
}

TEST_P(KernelEnlarging, EveryFactorGivesTheJudgesSamplesOnLongRows) {
    for (int round = CountKernelRounds(120); round > 0; --round) {
        const KernelSize size{PickBetween(71, 600), PickBetween(1, 6)};
        Enlarging call = MakeWhole(size, PickFactor(), PickFactor(),
                                   Interpolations[random() % Interpolations.size()]);
        call.kind = PickKind();
        call.layout = PickLayout();
        CompareBoth(call);
        if (HasFatalFailure()) return;
    }
}

TEST_P(KernelEnlarging, TheSourceStaysAsItWas) {
    for (const RowLayout& layout : DownwardLayouts)
        for (const std::int32_t interpolation : Interpolations)
            for (const KernelSize size : {KernelSize{1, 1}, KernelSize{37, 5}, KernelSize{150, 4}})
                for (const EnlargeKernel& row : EnlargeKernels) {
                    const std::size_t rowContent =
                        static_cast<std::size_t>(size.width) * row.sampleBytes;
                    const auto height = static_cast<std::size_t>(size.height);
                    const PixelRows source(layout, rowContent, height);
                    const PixelRows before(layout, rowContent, height);
                    const PixelRows output(layout, 2 * rowContent, 2 * height);
                    source.Fill(SampleKind::Random, row.sampleBytes, random);
                    before.CopyRowsFrom(source);

                    ASSERT_EQ(row.kernel(source.GetStart(), size, source.GetRowBytes(),
                                         {0, 0, size.width, size.height}, output.GetStart(),
                                         output.GetRowBytes(), {2 * size.width, 2 * size.height},
                                         2.0, 2.0, interpolation),
                              KernelOk);

                    ASSERT_EQ(source.Compare(before, row.sampleBytes), "")
                        << Describe(std::string(row.name) + ", " + layout.name, size);
                }
}

TEST_P(KernelEnlarging, RectanglesInsideAndPastTheEdgesGiveTheJudgesSamples) {
    for (int round = CountKernelRounds(500); round > 0; --round) {
        const KernelSize size{PickBetween(1, 60), PickBetween(1, 14)};
        const double xFactor = round % 2 == 0 ? 2.0 : PickFactor();
        const double yFactor = round % 2 == 0 ? 2.0 : PickFactor();
        Enlarging call =
            MakeWhole(size, xFactor, yFactor, Interpolations[random() % Interpolations.size()]);
        call.rect = {PickBetween(0, size.width - 1), PickBetween(0, size.height - 1),
                     PickBetween(1, size.width), PickBetween(1, size.height)};
        call.layout = PickLayout();
        CompareBoth(call);
        if (HasFatalFailure()) return;
    }
}

TEST_P(KernelEnlarging, SamplesBeyondTheResultStayAsTheyWere) {
    for (int round = CountKernelRounds(200); round > 0; --round) {
        const KernelSize size{PickBetween(1, 50), PickBetween(1, 10)};
        Enlarging call = MakeWhole(size, PickFactor(), PickFactor(),
                                   Interpolations[random() % Interpolations.size()]);
        call.destinationSize.width += PickBetween(0, 40);
        call.destinationSize.height += PickBetween(0, 4);
        call.layout = PickLayout();
        CompareBoth(call);
        if (HasFatalFailure()) return;
    }
}

TEST_P(KernelEnlarging, ASmallerDestinationTakesTheBeginningOfTheResult) {
    for (int round = CountKernelRounds(200); round > 0; --round) {
        const KernelSize size{PickBetween(1, 50), PickBetween(1, 10)};
        Enlarging call =
            MakeWhole(size, 2.0, 2.0, Interpolations[random() % Interpolations.size()]);
        call.destinationSize = {PickBetween(1, 2 * size.width), PickBetween(1, 2 * size.height)};
        call.layout = PickLayout();
        CompareBoth(call);
        if (HasFatalFailure()) return;
    }
}

TEST_P(KernelEnlarging, ARectangleTooSmallForItsCodeTakesTheOneThatFits) {
    constexpr KernelSize Size{20, 20};
    constexpr std::array Rects{KernelRect{5, 5, 3, 8}, KernelRect{5, 5, 8, 3},
                               KernelRect{18, 2, 9, 9}, KernelRect{2, 19, 9, 9},
                               KernelRect{4, 4, 1, 1}};
    for (const std::int32_t interpolation : Interpolations)
        for (const KernelRect& rect : Rects) {
            CompareBoth({Size, rect, {20, 20}, 2.0, 2.0, interpolation});
            if (HasFatalFailure()) return;
        }
}

TEST_P(KernelEnlarging, InfiniteAndHugeFactorsFillTheDestination) {
    for (const double factor : {1e6, 1e9, 1e300, std::numeric_limits<double>::max(),
                                std::numeric_limits<double>::infinity()})
        for (const std::int32_t interpolation : Interpolations) {
            CompareBoth({{9, 6}, {0, 0, 9, 6}, {45, 11}, factor, factor, interpolation});
            CompareBoth({{9, 6}, {0, 0, 9, 6}, {45, 11}, factor, 2.0, interpolation});
            if (HasFatalFailure()) return;
        }
}

TEST_P(KernelEnlarging, AFactorOfOneKeepsEverySample) {
    for (const std::int32_t interpolation : Interpolations) {
        const PixelRows source(DownwardLayouts[3], 67, 9);
        const PixelRows output(DownwardLayouts[3], 67, 9);
        source.Fill(SampleKind::Random, 1, random);

        ASSERT_EQ(EnlargePlane8(source.GetStart(), {67, 9}, source.GetRowBytes(), {0, 0, 67, 9},
                                output.GetStart(), output.GetRowBytes(), {67, 9}, 1.0, 1.0,
                                interpolation),
                  KernelOk);

        EXPECT_EQ(output.Compare(source, 1), "") << interpolation;
    }
}

TEST_P(KernelEnlarging, DoublingALargePlaneGivesTheJudgesSamples) {
    // As many positions as a frame has, so that the rounding of the repeated addition shows.
    for (const std::int32_t interpolation : Interpolations) {
        CompareBoth(MakeWhole({2004, 6}, 2.0, 2.0, interpolation));
        CompareBoth(MakeWhole({6, 1336}, 2.0, 2.0, interpolation));
        if (HasFatalFailure()) return;
    }
}

TEST_P(KernelEnlarging, RowsAndColumnsOfManySamplesGiveTheJudgesSamples) {
    for (const std::int32_t interpolation : Interpolations) {
        CompareBoth(MakeWhole({20011, 4}, 2.0, 1.0, interpolation));
        CompareBoth(MakeWhole({4, 20011}, 1.0, 2.0, interpolation));
        if (HasFatalFailure()) return;
    }
}

ZENTARA_FOR_ALL_KERNEL_FORMS(KernelEnlarging);

}  // namespace
}  // namespace ZV::Testing
