// White balance of frames of cameras, without the checks around it: time per frame and, as time
// over time in the same run, against memcpy of the bytes that it reads and writes, against the
// plain form of the kernels, and against cv::LUT on one thread, which knows 8 bits alone, where
// OpenCV is installed. Each round measures all of them one after the other; medians count. Last,
// what it costs to set a scale.

#include <benchmark/benchmark.h>

#include <algorithm>
#include <chrono>
#include <cstring>
#include <memory>
#include <random>
#include <string>
#include <vector>

#include "imaging/auto_white_balance.h"
#include "imaging/image_formats.h"
#include "imaging/kernels/kernel_selection.h"

#ifdef ZENTARA_HAS_OPENCV
#include <opencv2/core.hpp>
#endif

namespace ZV {
namespace {

using Clock = std::chrono::steady_clock;

constexpr int RoundCount = 7;

struct Side {
    const char* name;
    std::uint32_t width, height;
};
constexpr Side Sides[] = {{"1392x1040", 1392, 1040}, {"4008x2672", 4008, 2672}};

struct Format {
    const char* name;
    ZImageFormatEnum format;
    std::uint32_t step;
    std::uint32_t sampleBytes;
};
constexpr Format Formats[] = {
    {"RGB24", RGB24, 3, 1}, {"BGRX32", BGRX32, 4, 1}, {"RGB48", RGB48, 3, 2}};

template <typename Call>
double MeasureMs(Call&& call) {
    const Clock::time_point start = Clock::now();
    call();
    benchmark::ClobberMemory();
    return std::chrono::duration<double, std::milli>(Clock::now() - start).count();
}

double GetMedian(std::vector<double>& times) {
    if (times.empty()) return 0;
    std::sort(times.begin(), times.end());
    return times[times.size() / 2];
}

/// A frame, and the same work done by each of those that are compared.
class Contest {
  public:
    Contest(const Side& contestSide, const Format& contestFormat)
        : side(contestSide),
          format(contestFormat),
          fresh(std::size_t{side.width} * side.height * format.step * format.sampleBytes),
          pixels(fresh.size()),
          copy(fresh.size()),
          filter(std::make_unique<ZAutoWhiteBalance>(false)) {
        std::mt19937 random(1);
        for (std::uint8_t& byte : fresh) byte = static_cast<std::uint8_t>(random());
        // Scales near those of a warm light, none of them the identity.
        filter->SetRedScale(0.77F);
        filter->SetGreenScale(1.02F);
        filter->SetBlueScale(1.25F);
    }

    void TakeRound() {
        ours.push_back(MeasureFrame([this] { Balance(); }));
        copies.push_back(
            MeasureFrame([this] { std::memcpy(copy.data(), pixels.data(), pixels.size()); }));
        if (!ForceKernels("plain")) return;
        plain.push_back(MeasureFrame([this] { Balance(); }));
        (void)ForceKernels("");
        MeasureOpenCV();
    }

    void Report(benchmark::State& state) {
        const double own = GetMedian(ours);
        state.counters["ms"] = own;
        state.counters["over memcpy"] = own / GetMedian(copies);
        state.counters["over plain"] = own / GetMedian(plain);
        if (!theirs.empty()) state.counters["over cv::LUT"] = own / GetMedian(theirs);
    }

  private:
    // Lookups repeated in place would wear the samples off to a few values.
    template <typename Call>
    double MeasureFrame(Call&& call) {
        std::memcpy(pixels.data(), fresh.data(), fresh.size());
        return MeasureMs(call);
    }

    void Balance() {
        const auto run = format.sampleBytes == 1 ? &ZAutoWhiteBalance::GreyWorld
                                                 : &ZAutoWhiteBalance::GreyWorld_16Bit;
        benchmark::DoNotOptimize((filter.get()->*run)(pixels.data(), nullptr, nullptr, nullptr,
                                                      side.width, side.height, 0, format.step,
                                                      format.format));
    }

    void MeasureOpenCV() {
#ifdef ZENTARA_HAS_OPENCV
        if (format.sampleBytes != 1) return;
        cv::setNumThreads(1);
        const auto channels = static_cast<int>(format.step);
        const auto rows = static_cast<int>(side.height);
        const auto columns = static_cast<int>(side.width);
        cv::Mat table(1, 256, CV_8UC(channels));
        for (int level = 0; level < 256 * channels; ++level) {
            table.data[level] = static_cast<std::uint8_t>(level / channels);
        }
        cv::Mat image(rows, columns, CV_8UC(channels), pixels.data());
        theirs.push_back(MeasureFrame([&] { cv::LUT(image, table, image); }));
#endif
    }

    Side side;
    Format format;
    std::vector<std::uint8_t> fresh, pixels, copy;
    std::unique_ptr<ZAutoWhiteBalance> filter;
    std::vector<double> ours, copies, plain, theirs;
};

void BalanceFrame(benchmark::State& state, const Side& side, const Format& format) {
    Contest contest(side, format);
    for (auto _ : state) {
        for (int round = 0; round < RoundCount; ++round) contest.TakeRound();
    }
    contest.Report(state);
}

void SetScale(benchmark::State& state) {
    const auto filter = std::make_unique<ZAutoWhiteBalance>(false);
    float scale = 0.5F;
    for (auto _ : state) {
        scale = 1.5F - scale;  // The scale in force would cost nothing.
        filter->SetRedScale(scale);
    }
}
BENCHMARK(SetScale)->Name("WhiteBalance/SetRedScale")->Unit(benchmark::kMicrosecond);

[[maybe_unused]] const bool IsRegistered = [] {
    for (const Side& side : Sides) {
        for (const Format& format : Formats) {
            const std::string name =
                std::string("WhiteBalance/Process/") + format.name + "/" + side.name;
            benchmark::RegisterBenchmark(
                name.c_str(),
                [&side, &format](benchmark::State& state) { BalanceFrame(state, side, format); })
                ->Iterations(1)
                ->Unit(benchmark::kMillisecond);
        }
    }
    return true;
}();

}  // namespace
}  // namespace ZV
