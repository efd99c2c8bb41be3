#include "histogram.h"

#include <fmt/format.h>

#include <algorithm>
#include <array>
#include <cmath>
#include <cstring>
#include <nlohmann/json.hpp>
#include <span>

#include "image_samples.h"
#include "zentara/zentara.h"

namespace ZentaraProgram {
namespace {

constexpr std::size_t TextColumns = 64, TextRows = 6, JsonBins = 256;
constexpr std::uint32_t PictureWidth = 768, PictureHeight = 320;
constexpr std::uint8_t PictureBackground = 32;
constexpr std::array<const char*, 9> Blocks{" ", "▁", "▂", "▃", "▄", "▅", "▆", "▇", "█"};
constexpr std::array<const char*, ColourCount> ColourNames{"red", "green", "blue"};

/// Colours of a mosaic's cell, row by row, by Zentara_Frame.bayerPattern.
constexpr std::uint8_t MosaicColours[4][4] = {
    {0, 1, 1, 2}, {1, 0, 2, 1}, {1, 2, 0, 1}, {2, 1, 1, 0}};

std::uint32_t ReadSample(std::span<const std::uint8_t> samples, std::size_t bytesPerSample,
                         std::size_t place) {
    if (bytesPerSample == 1) return samples[place];
    std::uint16_t word = 0;
    std::memcpy(&word, samples.data() + place * sizeof word, sizeof word);
    return word;
}

std::vector<Histogram> MakeEmpty(const Image& image) {
    const std::uint32_t bits = std::clamp<std::uint32_t>(image.bits, 8, 16);
    const std::vector<std::uint64_t> none(std::size_t{1} << bits, 0);
    if (!image.isBayer && image.GetChannels() == 1) return {{"grey", none}};
    std::vector<Histogram> histograms;
    histograms.reserve(std::size(ColourNames));
    for (const char* name : ColourNames) histograms.push_back({name, none});
    return histograms;
}

void Count(Histogram* histogram, std::uint32_t value) {
    ++histogram->counts[std::min<std::size_t>(value, histogram->counts.size() - 1)];
    ++histogram->samples;
}

std::size_t GetMosaicColour(const Image& image, std::size_t pixel) {
    const std::size_t x = pixel % image.width, y = pixel / image.width;
    return MosaicColours[image.bayerPattern & 3U][(y & 1U) * 2 + (x & 1U)];
}

std::uint64_t GetGreatest(const std::vector<std::uint64_t>& bins) {
    return *std::max_element(bins.begin(), bins.end());
}

/// A bar's height, so that a bin of a single sample still shows beside one of a million.
std::size_t GetBarHeight(std::uint64_t count, std::uint64_t greatest, std::size_t room) {
    if (count == 0) return 0;
    const double share =
        std::log1p(static_cast<double>(count)) / std::log1p(static_cast<double>(greatest));
    return std::clamp<std::size_t>(
        static_cast<std::size_t>(std::lround(share * static_cast<double>(room))), 1, room);
}

std::string DrawBars(const std::vector<std::uint64_t>& bins) {
    constexpr std::size_t Steps = Blocks.size() - 1;
    const std::uint64_t greatest = GetGreatest(bins);
    std::string lines;
    for (std::size_t row = TextRows; row-- > 0;) {
        lines += "  |";
        for (const std::uint64_t count : bins) {
            const std::size_t height = GetBarHeight(count, greatest, TextRows * Steps);
            const std::size_t above = height > row * Steps ? height - row * Steps : 0;
            lines += Blocks[std::min(above, Steps)];
        }
        lines += "|\n";
    }
    return lines;
}

void DrawChannel(const Histogram& histogram, std::span<const std::size_t> colours, Image* picture) {
    const std::vector<std::uint64_t> bins =
        histogram.GetBins(std::min<std::size_t>(JsonBins, histogram.counts.size()));
    const std::uint64_t greatest = GetGreatest(bins);
    for (std::uint32_t x = 0; x < PictureWidth; ++x) {
        const std::uint64_t count = bins[x * bins.size() / PictureWidth];
        const std::size_t height = GetBarHeight(count, greatest, PictureHeight);
        for (std::size_t y = PictureHeight - height; y < PictureHeight; ++y) {
            for (const std::size_t colour : colours)
                picture->pixels[(y * PictureWidth + x) * ColourCount + colour] = 255;
        }
    }
}

}  // namespace

std::uint32_t Histogram::GetMinimum() const {
    const auto first = std::find_if(counts.begin(), counts.end(), [](auto n) { return n != 0; });
    return first == counts.end() ? 0 : static_cast<std::uint32_t>(first - counts.begin());
}

std::uint32_t Histogram::GetMaximum() const {
    const auto last = std::find_if(counts.rbegin(), counts.rend(), [](auto n) { return n != 0; });
    return last == counts.rend() ? 0 : static_cast<std::uint32_t>(counts.rend() - last - 1);
}

double Histogram::GetMean() const {
    double sum = 0;
    for (std::size_t value = 0; value < counts.size(); ++value)
        sum += static_cast<double>(value) * static_cast<double>(counts[value]);
    return samples == 0 ? 0 : sum / static_cast<double>(samples);
}

std::uint32_t Histogram::GetMedian() const {
    std::uint64_t below = 0;
    std::uint32_t value = 0;
    for (; value + 1 < counts.size(); ++value) {
        below += counts[value];
        if (2 * below >= samples) break;
    }
    return value;
}

std::vector<std::uint64_t> Histogram::GetBins(std::size_t count) const {
    std::vector<std::uint64_t> bins(count, 0);
    for (std::size_t value = 0; value < counts.size(); ++value)
        bins[value * count / counts.size()] += counts[value];
    return bins;
}

std::vector<Histogram> MakeHistograms(const Image& image) {
    std::vector<Histogram> histograms = MakeEmpty(image);
    std::vector<std::uint8_t> scratch;
    const auto samples = GetPixelSamples(image, &scratch);
    const std::size_t channels = image.GetChannels();
    const std::size_t count = samples.size() / image.bytesPerSample;
    for (std::size_t place = 0; place < count; ++place) {
        const std::size_t channel =
            image.isBayer ? GetMosaicColour(image, place) : place % channels;
        Count(&histograms[channel], ReadSample(samples, image.bytesPerSample, place));
    }
    return histograms;
}

std::string DrawInText(const Histogram& histogram) {
    const std::string top = fmt::format("{}", histogram.counts.size() - 1);
    const double saturated = histogram.samples == 0
                                 ? 0
                                 : 100.0 * static_cast<double>(histogram.GetSaturated()) /
                                       static_cast<double>(histogram.samples);
    return fmt::format("{}: {} to {}, mean {:.1f}, median {}, {:.2f} % saturated\n{}  0{:>{}}\n",
                       histogram.name, histogram.GetMinimum(), histogram.GetMaximum(),
                       histogram.GetMean(), histogram.GetMedian(), saturated,
                       DrawBars(histogram.GetBins(TextColumns)), top, TextColumns + 1);
}

nlohmann::ordered_json GetAsJson(const Histogram& histogram) {
    return {{"name", histogram.name},
            {"samples", histogram.samples},
            {"minimum", histogram.GetMinimum()},
            {"maximum", histogram.GetMaximum()},
            {"mean", histogram.GetMean()},
            {"median", histogram.GetMedian()},
            {"saturated", histogram.GetSaturated()},
            {"bins", histogram.GetBins(JsonBins)}};
}

Image DrawPicture(const std::vector<Histogram>& histograms) {
    constexpr std::array<std::size_t, ColourCount> All{0, 1, 2};
    Image picture;
    picture.layout = FindPixelFormat(std::uint32_t{zfmtRGB24});
    picture.width = PictureWidth;
    picture.height = PictureHeight;
    picture.isDrawing = true;
    picture.pixels.assign(std::size_t{PictureWidth} * PictureHeight * ColourCount,
                          PictureBackground);
    for (std::size_t i = 0; i < histograms.size(); ++i) {
        const auto colours = std::span(All);
        DrawChannel(histograms[i], histograms.size() == 1 ? colours : colours.subspan(i, 1),
                    &picture);
    }
    return picture;
}

}  // namespace ZentaraProgram
