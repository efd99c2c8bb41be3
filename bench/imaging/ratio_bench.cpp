// The pixel ratio's steps over one frame, each against a read of its input by words of 8 bytes and
// against memcpy of the same bytes. The counters `toRead` and `toCopy` are times over times,
// measured in turns.

#include <benchmark/benchmark.h>

#include <chrono>
#include <cstdint>
#include <cstring>
#include <vector>

#include "imaging/horizontal_reduction.h"
#include "imaging/row_zoom.h"

namespace ZV {
namespace {

using Clock = std::chrono::steady_clock;
using Bytes = std::vector<std::uint8_t>;

std::uint64_t ReadWords(const Bytes& bytes) {
    std::uint64_t sums[4] = {};
    for (std::size_t i = 0; i + 32 <= bytes.size(); i += 32) {
        for (std::size_t lane = 0; lane < 4; ++lane) {
            std::uint64_t word = 0;
            std::memcpy(&word, bytes.data() + i + 8 * lane, 8);
            sums[lane] ^= word;
        }
    }
    return sums[0] ^ sums[1] ^ sums[2] ^ sums[3];
}

template <typename Step>
double Time(Step step) {
    const auto begin = Clock::now();
    step();
    return std::chrono::duration<double>(Clock::now() - begin).count();
}

/// Runs the step, a read and a copy of the input in turns.
template <typename Step>
void Compare(benchmark::State& state, const Bytes& input, Step step) {
    Bytes copy(input.size());
    double steps = 0, reads = 0, copies = 0;
    for (auto _ : state) {
        const double seconds = Time(step);
        steps += seconds;
        state.SetIterationTime(seconds);
        reads += Time([&] { benchmark::DoNotOptimize(ReadWords(input)); });
        copies += Time([&] {
            std::memcpy(copy.data(), input.data(), input.size());
            benchmark::ClobberMemory();
        });
    }
    state.counters["toRead"] = steps / reads;
    state.counters["toCopy"] = steps / copies;
    state.SetBytesProcessed(static_cast<std::int64_t>(input.size() * state.iterations()));
}

Bytes MakeInput(std::size_t bytes) {
    Bytes input(bytes);
    for (std::size_t i = 0; i < bytes; ++i) input[i] = static_cast<std::uint8_t>(i * 37);
    return input;
}

void Reduce(benchmark::State& state) {
    const auto factor = static_cast<std::uint32_t>(state.range(0));
    const auto sampleBytes = static_cast<std::uint32_t>(state.range(1));
    const auto width = static_cast<std::uint32_t>(state.range(2));
    const auto height = static_cast<std::uint32_t>(state.range(3));
    const Bytes input = MakeInput(std::size_t{width} * height * sampleBytes);
    Bytes output(input.size());
    Compare(state, input, [&] {
        ReduceRows(input.data(), width, height, factor, sampleBytes, output.data());
        benchmark::ClobberMemory();
    });
}
BENCHMARK(Reduce)
    ->ArgNames({"factor", "sampleBytes", "width", "height"})
    ->ArgsProduct({{2, 3, 4}, {1, 2}, {1392}, {1040}})
    ->ArgsProduct({{2, 3, 4}, {1, 2}, {4008}, {2672}})
    ->UseManualTime();

void Zoom(benchmark::State& state) {
    const auto sampleBytes = static_cast<std::uint32_t>(state.range(0));
    const auto width = static_cast<std::uint32_t>(state.range(1));
    const auto height = static_cast<std::uint32_t>(state.range(2));
    const Bytes input = MakeInput(std::size_t{width} * height * sampleBytes);
    Bytes output(2 * input.size());
    Compare(state, input, [&] {
        ZoomSpreadRows(input.data(), output.data(), width, height, sampleBytes);
        ZoomFillRows(0, output.data(), width, 2 * height, sampleBytes);
        benchmark::ClobberMemory();
    });
}
BENCHMARK(Zoom)
    ->ArgNames({"sampleBytes", "width", "height"})
    ->ArgsProduct({{1, 2}, {1392}, {1040}})
    ->ArgsProduct({{1, 2}, {4008}, {2672}})
    ->UseManualTime();

}  // namespace
}  // namespace ZV
