// Every row loop of every form that the processor has, row by row over one frame: against memcpy of
// the bytes that it reads and writes, and against the plain form, both in turns with it.

#include <benchmark/benchmark.h>

#include <algorithm>
#include <array>
#include <chrono>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <string>
#include <vector>

#include "imaging/kernels/enlarge_rows.h"
#include "imaging/kernels/kernel_selection.h"
#include "imaging/kernels/row_kernels.h"

namespace ZV {
namespace {

using Clock = std::chrono::steady_clock;

constexpr std::array FormNames{"plain", "sse2", "ssse3", "avx2", "avx512"};

struct FrameSize {
    std::size_t width;
    std::size_t height;
};

constexpr std::array FrameSizes{FrameSize{1392, 1040}, FrameSize{4008, 2672}};
/// Rounds over the frame are as many as this many samples allow.
constexpr std::size_t SamplesPerRun = 160'000'000;

/// What the loops read beside the rows; rows enlarge by two.
struct Aids {
    explicit Aids(std::size_t width)
        : count(width),
          lookup8(4 * 256),
          lookup16(3 * 65536 + 1),
          linear8(GetHalf(width), static_cast<std::int32_t>(width), 2.0, 1),
          linear16(GetHalf(width), static_cast<std::int32_t>(width), 2.0, 2),
          cubic(GetHalf(width), static_cast<std::int32_t>(width), 2.0) {
        // Falling tables keep apart, run by run, what they map in place; neighbours stay
        // neighbours.
        for (std::size_t i = 0; i < lookup8.size(); ++i) {
            lookup8[i] = static_cast<std::uint8_t>(255 - i % 256);
        }
        for (std::size_t i = 0; i < lookup16.size(); ++i) {
            lookup16[i] = static_cast<std::uint16_t>(65535 - i % 65536);
        }
    }

    static std::int32_t GetHalf(std::size_t width) { return static_cast<std::int32_t>(width / 2); }

    std::size_t count;  ///< Samples, or pixels, of a row of output.
    std::vector<std::uint8_t> lookup8;
    std::vector<std::uint16_t> lookup16;
    LinearPositions linear8;
    LinearPositions linear16;
    CubicPositions cubic;
};

/// One row of each area that a loop reads or writes.
struct Rows {
    const std::uint8_t* in[4];
    std::uint8_t* out[2];
};

const Word* Words(const std::uint8_t* row) {
    return reinterpret_cast<const Word*>(row);
}

Word* Words(std::uint8_t* row) {
    return reinterpret_cast<Word*>(row);
}

const std::uint16_t* Sums(const std::uint8_t* row) {
    return reinterpret_cast<const std::uint16_t*>(row);
}

std::uint16_t* Sums(std::uint8_t* row) {
    return reinterpret_cast<std::uint16_t*>(row);
}

enum Output { Fresh, InPlace };

/// A loop over one row, with the bytes per sample of output, in halves, that it reads and writes:
/// `inputs` areas of `inHalves` each and `outputs` areas of `outHalves` each, which a loop in place
/// reads too.
struct Loop {
    const char* name;
    std::size_t inputs;
    std::size_t inHalves;
    std::size_t outputs;
    std::size_t outHalves;
    Output output;
    void (*run)(const RowKernels& form, const Aids& aids, const Rows& rows);
    bool isOfSingles = false;
};

constexpr std::int32_t RowWeight = 4096;
constexpr CubicWeights ColumnWeights{1.25F, 0.15625F, -0.0390625F};

void RunCubicColumn8(const RowKernels& form, const Aids& aids, const Rows& rows) {
    const float* singles[4];
    for (std::size_t i = 0; i < 4; ++i) singles[i] = reinterpret_cast<const float*>(rows.in[i]);
    form.cubicColumn8(singles, ColumnWeights, rows.out[0], aids.count);
}

void RunCubicColumn16(const RowKernels& form, const Aids& aids, const Rows& rows) {
    const float* singles[4];
    for (std::size_t i = 0; i < 4; ++i) singles[i] = reinterpret_cast<const float*>(rows.in[i]);
    form.cubicColumn16(singles, ColumnWeights, Words(rows.out[0]), aids.count);
}

void RunPack16x3(const RowKernels& form, const Aids& aids, const Rows& rows) {
    const Word* const planes[] = {Words(rows.in[0]), Words(rows.in[1]), Words(rows.in[2])};
    form.pack16x3(planes, Words(rows.out[0]), aids.count);
}

constexpr std::array Loops{
    Loop{"pack8x3", 3, 2, 1, 6, Fresh,
         [](const RowKernels& form, const Aids& aids, const Rows& rows) {
             form.pack8x3(rows.in, rows.out[0], aids.count);
         }},
    Loop{"pack8x4", 4, 2, 1, 8, Fresh,
         [](const RowKernels& form, const Aids& aids, const Rows& rows) {
             form.pack8x4(rows.in, rows.out[0], aids.count);
         }},
    Loop{"pack16x3", 3, 4, 1, 12, Fresh, RunPack16x3},
    Loop{"add8", 1, 2, 1, 2, InPlace,
         [](const RowKernels& form, const Aids& aids, const Rows& rows) {
             form.add8(rows.in[0], rows.out[0], aids.count);
         }},
    Loop{"add16", 1, 4, 1, 4, InPlace,
         [](const RowKernels& form, const Aids& aids, const Rows& rows) {
             form.add16(Words(rows.in[0]), Words(rows.out[0]), aids.count);
         }},
    Loop{"shiftRight8", 0, 0, 1, 2, InPlace,
         [](const RowKernels& form, const Aids& aids, const Rows& rows) {
             form.shiftRight8(1, rows.out[0], aids.count);
         }},
    Loop{"shiftRight16", 0, 0, 1, 4, InPlace,
         [](const RowKernels& form, const Aids& aids, const Rows& rows) {
             form.shiftRight16(1, Words(rows.out[0]), aids.count);
         }},
    Loop{"lookup8x1", 0, 0, 1, 2, InPlace,
         [](const RowKernels& form, const Aids& aids, const Rows& rows) {
             form.lookup8x1(aids.lookup8.data(), rows.out[0], aids.count);
         }},
    Loop{"lookup8x3", 0, 0, 1, 6, InPlace,
         [](const RowKernels& form, const Aids& aids, const Rows& rows) {
             form.lookup8x3(aids.lookup8.data(), rows.out[0], aids.count);
         }},
    Loop{"lookup8x4", 0, 0, 1, 8, InPlace,
         [](const RowKernels& form, const Aids& aids, const Rows& rows) {
             form.lookup8x4(aids.lookup8.data(), rows.out[0], aids.count);
         }},
    Loop{"lookup16x1", 0, 0, 1, 4, InPlace,
         [](const RowKernels& form, const Aids& aids, const Rows& rows) {
             form.lookup16x1(aids.lookup16.data(), Words(rows.out[0]), aids.count);
         }},
    Loop{"lookup16x3", 0, 0, 1, 12, InPlace,
         [](const RowKernels& form, const Aids& aids, const Rows& rows) {
             form.lookup16x3(aids.lookup16.data(), Words(rows.out[0]), aids.count);
         }},
    Loop{"double8", 1, 1, 1, 2, Fresh,
         [](const RowKernels& form, const Aids& aids, const Rows& rows) {
             form.double8(rows.in[0], rows.out[0], aids.count);
         }},
    Loop{"double16", 1, 2, 1, 4, Fresh,
         [](const RowKernels& form, const Aids& aids, const Rows& rows) {
             form.double16(Words(rows.in[0]), Words(rows.out[0]), aids.count);
         }},
    Loop{"linearRow8", 1, 1, 1, 4, Fresh,
         [](const RowKernels& form, const Aids& aids, const Rows& rows) {
             form.linearRow8(rows.in[0], aids.linear8.GetPlan(), Sums(rows.out[0]));
         }},
    Loop{"linearColumn8", 2, 4, 1, 2, Fresh,
         [](const RowKernels& form, const Aids& aids, const Rows& rows) {
             form.linearColumn8(Sums(rows.in[0]), Sums(rows.in[1]), RowWeight, rows.out[0],
                                aids.count);
         }},
    Loop{"linearRow16", 1, 2, 1, 4, Fresh,
         [](const RowKernels& form, const Aids& aids, const Rows& rows) {
             form.linearRow16(Words(rows.in[0]), aids.linear16.GetPlan(), Sums(rows.out[0]));
         }},
    Loop{"linearColumn16", 2, 4, 1, 4, Fresh,
         [](const RowKernels& form, const Aids& aids, const Rows& rows) {
             form.linearColumn16(Sums(rows.in[0]), Sums(rows.in[1]), RowWeight, Words(rows.out[0]),
                                 aids.count);
         }},
    Loop{"cubicRow8", 1, 1, 1, 8, Fresh,
         [](const RowKernels& form, const Aids& aids, const Rows& rows) {
             form.cubicRow8(rows.in[0], aids.cubic.GetPlan(),
                            reinterpret_cast<float*>(rows.out[0]));
         }},
    Loop{"cubicRow16", 1, 2, 1, 8, Fresh,
         [](const RowKernels& form, const Aids& aids, const Rows& rows) {
             form.cubicRow16(Words(rows.in[0]), aids.cubic.GetPlan(),
                             reinterpret_cast<float*>(rows.out[0]));
         }},
    Loop{"cubicColumn8", 4, 8, 1, 2, Fresh, RunCubicColumn8, true},
    Loop{"cubicColumn16", 4, 8, 1, 4, Fresh, RunCubicColumn16, true},
    Loop{"split8", 1, 4, 2, 2, Fresh,
         [](const RowKernels& form, const Aids& aids, const Rows& rows) {
             form.split8(rows.in[0], rows.out[0], rows.out[1], aids.count);
         }},
    Loop{"split16", 1, 8, 2, 4, Fresh,
         [](const RowKernels& form, const Aids& aids, const Rows& rows) {
             form.split16(Words(rows.in[0]), Words(rows.out[0]), Words(rows.out[1]), aids.count);
         }},
    Loop{"addHalves8", 2, 2, 1, 2, Fresh,
         [](const RowKernels& form, const Aids& aids, const Rows& rows) {
             form.addHalves8(rows.in[0], rows.in[1], rows.out[0], aids.count);
         }},
    Loop{"addHalves16", 2, 4, 1, 4, Fresh,
         [](const RowKernels& form, const Aids& aids, const Rows& rows) {
             form.addHalves16(Words(rows.in[0]), Words(rows.in[1]), Words(rows.out[0]), aids.count);
         }},
};

/// The areas of one loop, as many rows of each as the frame has, and one area more for memcpy.
class Frame {
  public:
    Frame(const Loop& frameLoop, FrameSize frameSize)
        : loop(frameLoop), size(frameSize), aids(frameSize.width) {
        inRowBytes = loop.inHalves * size.width / 2;
        outRowBytes = loop.outHalves * size.width / 2;
        for (std::size_t i = 0; i < loop.inputs; ++i) in[i] = MakeArea(inRowBytes);
        for (std::size_t i = 0; i < loop.outputs; ++i) out[i] = MakeArea(outRowBytes);
        const std::size_t outPasses = loop.output == InPlace ? 2 : 1;
        copyRowBytes = (loop.inputs * inRowBytes + outPasses * loop.outputs * outRowBytes) / 2;
        from = MakeArea(copyRowBytes);
        to = MakeArea(copyRowBytes);
    }

    void Run(const RowKernels& form) {
        for (std::size_t y = 0; y < size.height; ++y) loop.run(form, aids, GetRows(y));
        benchmark::ClobberMemory();
    }

    /// As many bytes read and written as by the loop.
    void Copy() {
        for (std::size_t y = 0; y < size.height; ++y) {
            std::memcpy(to.data() + y * copyRowBytes, from.data() + y * copyRowBytes, copyRowBytes);
        }
        benchmark::ClobberMemory();
    }

    [[nodiscard]] std::size_t GetBytes() const { return 2 * copyRowBytes * size.height; }

  private:
    std::vector<std::uint8_t> MakeArea(std::size_t rowBytes) const {
        std::vector<std::uint8_t> area(rowBytes * size.height);
        if (loop.isOfSingles) {
            FillSingles(area);
        } else {
            FillWords(area);
        }
        return area;
    }

    /// A ramp with noise, below the greatest word that a linear row pass leaves.
    static void FillWords(std::vector<std::uint8_t>& area) {
        std::uint32_t state = 1;
        for (std::size_t i = 0; i + sizeof(Word) <= area.size(); i += sizeof(Word)) {
            state = state * 1664525U + 1013904223U;
            const std::size_t ramp = i / sizeof(Word) % 4096 * 3;
            const Word word{static_cast<std::uint16_t>(ramp + (state >> 22))};
            std::memcpy(area.data() + i, &word, sizeof word);
        }
    }

    static void FillSingles(std::vector<std::uint8_t>& area) {
        for (std::size_t i = 0; i + sizeof(float) <= area.size(); i += sizeof(float)) {
            const auto single = static_cast<float>(i % 1021) * 0.25F;
            std::memcpy(area.data() + i, &single, sizeof single);
        }
    }

    Rows GetRows(std::size_t y) {
        Rows rows{};
        for (std::size_t i = 0; i < loop.inputs; ++i) rows.in[i] = in[i].data() + y * inRowBytes;
        for (std::size_t i = 0; i < loop.outputs; ++i) {
            rows.out[i] = out[i].data() + y * outRowBytes;
        }
        return rows;
    }

    const Loop& loop;
    FrameSize size;
    Aids aids;
    std::size_t inRowBytes = 0;
    std::size_t outRowBytes = 0;
    std::size_t copyRowBytes = 0;
    std::vector<std::uint8_t> in[4];
    std::vector<std::uint8_t> out[2];
    std::vector<std::uint8_t> from;
    std::vector<std::uint8_t> to;
};

template <typename Step>
double MeasureSeconds(const Step& step) {
    const auto begin = Clock::now();
    step();
    return std::chrono::duration<double>(Clock::now() - begin).count();
}

double GetMedian(std::vector<double> values) {
    const auto middle = values.begin() + static_cast<std::ptrdiff_t>(values.size() / 2);
    std::nth_element(values.begin(), middle, values.end());
    return *middle;
}

void RunLoop(benchmark::State& state, const Loop& loop, const RowKernels& form, FrameSize size) {
    const RowKernels& plain = *FindRowKernels("plain");
    Frame frame(loop, size);
    std::vector<double> toCopy;
    std::vector<double> toPlain;
    for (auto _ : state) {
        const double copy = MeasureSeconds([&] { frame.Copy(); });
        const double reference = MeasureSeconds([&] { frame.Run(plain); });
        const double seconds = MeasureSeconds([&] { frame.Run(form); });
        toCopy.push_back(seconds / copy);
        toPlain.push_back(seconds / reference);
        state.SetIterationTime(seconds);
    }
    state.SetBytesProcessed(static_cast<std::int64_t>(frame.GetBytes()) * state.iterations());
    state.counters["to_memcpy"] = GetMedian(toCopy);
    state.counters["to_plain"] = GetMedian(toPlain);
}

void RegisterLoop(const Loop& loop, const char* formName) {
    const RowKernels* const form = FindRowKernels(formName);
    if (form == nullptr) return;
    for (const FrameSize& size : FrameSizes) {
        const std::string name = "KernelRows/" + std::string(loop.name) + "/" + formName + "/" +
                                 std::to_string(size.width) + "x" + std::to_string(size.height);
        benchmark::RegisterBenchmark(name.c_str(), RunLoop, loop, *form, size)
            ->UseManualTime()
            ->Iterations(static_cast<std::int64_t>(SamplesPerRun / (size.width * size.height)))
            ->Unit(benchmark::kMicrosecond);
    }
}

[[maybe_unused]] const bool isRegistered = [] {
    for (const Loop& loop : Loops) {
        for (const char* const formName : FormNames) RegisterLoop(loop, formName);
    }
    return true;
}();

}  // namespace
}  // namespace ZV
