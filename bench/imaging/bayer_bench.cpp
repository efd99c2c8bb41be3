// The Bayer engine on frames of cameras: time per frame and, as time over time in the same run,
// against memcpy of the bytes that it reads and writes, against its own plain form, and against
// bilinear cvtColor of OpenCV on one thread where that is installed. Each round measures all of
// them one after the other; medians count.

#include <benchmark/benchmark.h>

#include <algorithm>
#include <chrono>
#include <cmath>
#include <cstring>
#include <random>
#include <string>
#include <vector>

#include "imaging/bayer_engine.h"
#include "imaging/image_formats.h"
#include "imaging/kernels/kernel_selection.h"

#ifdef ZENTARA_HAS_OPENCV
#include <opencv2/core.hpp>
#include <opencv2/imgproc.hpp>
#endif

namespace ZV {
namespace {

using Clock = std::chrono::steady_clock;

constexpr int RoundCount = 7;
constexpr double RoundMs = 20;  // Short calls are repeated up to this.

struct Side {
    const char* name;
    std::uint32_t width, height;
};
constexpr Side Sides[] = {{"1392x1040", 1392, 1040}, {"4008x2672", 4008, 2672}};

struct Format {
    const char* name;
    ZImageFormatEnum format;
    std::size_t sampleBytes;
};
constexpr Format Formats[] = {{"RGB24", RGB24, 1}, {"RGB48", RGB48, 2}, {"BGRX32", BGRX32, 1}};

struct Algorithm {
    int number;
    KernelInterpolation interpolation;
};
constexpr Algorithm Algorithms[] = {
    {1, InterpolateLinear}, {2, InterpolateNearest}, {4, InterpolateCubic}};

template <typename Call>
double MeasureOnceMs(Call&& call, int calls) {
    const Clock::time_point start = Clock::now();
    for (int i = 0; i < calls; ++i) {
        call();
        benchmark::ClobberMemory();
    }
    const std::chrono::duration<double, std::milli> taken = Clock::now() - start;
    return taken.count() / calls;
}

/// One of the things that are measured in turns.
class Measured {
  public:
    template <typename Call>
    void TakeRound(Call&& call) {
        if (calls == 0) {
            const double firstMs = MeasureOnceMs(call, 1);
            calls = std::clamp(static_cast<int>(RoundMs / std::max(firstMs, 1e-3)), 1, 1000);
        }
        times.push_back(MeasureOnceMs(call, calls));
    }
    double GetMedianMs() {
        if (times.empty()) return 0;
        std::sort(times.begin(), times.end());
        return times[times.size() / 2];
    }

  private:
    int calls = 0;
    std::vector<double> times;
};

/// A mosaic, its image, and all that makes one of the other.
class Subject {
  public:
    Subject(std::uint32_t frameWidth, std::uint32_t frameHeight, const Format& imageFormat,
            KernelInterpolation codeOfAlgorithm)
        : width(frameWidth),
          height(frameHeight),
          format(imageFormat),
          interpolation(codeOfAlgorithm),
          mosaic(std::size_t{width} * height * format.sampleBytes),
          image(std::size_t{width} * height * GetThreeColourPixelBytes(format.format)) {
        std::mt19937 random(1);
        for (std::uint8_t& sample : mosaic) sample = static_cast<std::uint8_t>(random());
        engine.Reserve(width);
    }

    void RunEngine() {
        const BayerMosaic from{mosaic.data(), mosaic.size(), width, height, PatternRGGB};
        const BayerTarget to{image.data(), image.size(), format.format};
        std::uint32_t bytes = 0;
        const FilterResult result = format.sampleBytes == 1
                                        ? engine.Run8(from, interpolation, to, &bytes)
                                        : engine.Run16(from, interpolation, to, &bytes);
        benchmark::DoNotOptimize(result);
        benchmark::DoNotOptimize(bytes);
    }

    /// As many bytes read and written as the engine reads and writes.
    void CopyMemory() {
        const std::size_t bytes = (mosaic.size() + image.size()) / 2;
        copied.resize(bytes);
        std::memcpy(copied.data(), image.data(), std::min(bytes, image.size()));
        benchmark::DoNotOptimize(copied.data());
    }

#ifdef ZENTARA_HAS_OPENCV
    void RunOpenCV() {
        const int depth = format.sampleBytes == 1 ? CV_8U : CV_16U;
        const int channels = format.format == BGRX32 ? 4 : 3;
        const auto rows = static_cast<int>(height), columns = static_cast<int>(width);
        const cv::Mat from(rows, columns, CV_MAKETYPE(depth, 1), mosaic.data());
        cv::Mat to(rows, columns, CV_MAKETYPE(depth, channels), image.data());
        // The name tells the cell from its second row and column on: this is R G over G B.
        const int code = channels == 4 ? cv::COLOR_BayerBG2BGRA : cv::COLOR_BayerBG2RGB;
        cv::cvtColor(from, to, code, channels);
        benchmark::DoNotOptimize(to.data);
    }
#endif

    double GetMegapixels() const {
        return width * 1e-6 * height;
    }

  private:
    std::uint32_t width;
    std::uint32_t height;
    Format format;
    KernelInterpolation interpolation;
    std::vector<std::uint8_t> mosaic;
    std::vector<std::uint8_t> image;
    std::vector<std::uint8_t> copied;
    BayerEngine engine;
};

void Compare(benchmark::State& state, Subject subject) {
    Measured engine, plain, copy, opencv;
    for (auto _ : state) {
        for (int round = 0; round < RoundCount; ++round) {
            engine.TakeRound([&] { subject.RunEngine(); });
            copy.TakeRound([&] { subject.CopyMemory(); });
#ifdef ZENTARA_HAS_OPENCV
            cv::setNumThreads(1);
            opencv.TakeRound([&] { subject.RunOpenCV(); });
#endif
            if (!ForceKernels("plain")) continue;
            plain.TakeRound([&] { subject.RunEngine(); });
            (void)ForceKernels("");
        }
    }
    const double engineMs = engine.GetMedianMs();
    state.counters["ms"] = engineMs;
    state.counters["megapixels/s"] = subject.GetMegapixels() / engineMs * 1e3;
    state.counters["x_memcpy"] = engineMs / copy.GetMedianMs();
    state.counters["x_plain"] = engineMs / plain.GetMedianMs();
    if (opencv.GetMedianMs() != 0) state.counters["x_opencv"] = engineMs / opencv.GetMedianMs();
}

std::string MakeName(const char* what, const char* side, const Format& format, int algorithm) {
    return std::string(what) + "/" + side + "/" + format.name +
           "/algorithm:" + std::to_string(algorithm);
}

void Register(const std::string& name, std::uint32_t width, std::uint32_t height,
              const Format& format, KernelInterpolation interpolation) {
    benchmark::RegisterBenchmark(name.c_str(),
                                 [=](benchmark::State& state) {
                                     Compare(state, Subject(width, height, format, interpolation));
                                 })
        ->Iterations(1)
        ->Unit(benchmark::kMillisecond);
}

const bool areRegistered = [] {
    for (const Side& side : Sides) {
        for (const Format& format : Formats) {
            for (const Algorithm& algorithm : Algorithms) {
                Register(MakeName("Bayer", side.name, format, algorithm.number), side.width,
                         side.height, format, algorithm.interpolation);
            }
        }
    }
    // A quarter of a megapixel to 64, four to three.
    for (const double megapixels : {0.25, 0.5, 1.0, 2.0, 4.0, 8.0, 16.0, 32.0, 64.0}) {
        const auto width = static_cast<std::uint32_t>(std::sqrt(megapixels * 1e6 * 4 / 3)) / 2 * 2;
        const std::uint32_t height = width * 3 / 4 / 2 * 2;
        std::string size = std::to_string(megapixels);
        size.resize(size.find('.') + 3);
        Register(MakeName("BayerSweep", (size + "MP").c_str(), Formats[0], 1), width, height,
                 Formats[0], InterpolateLinear);
    }
    return true;
}();

}  // namespace
}  // namespace ZV
