#pragma once

#include <cstdint>
#include <nlohmann/json_fwd.hpp>
#include <string>
#include <vector>

#include "image_file.h"

namespace ZentaraProgram {

/// How often each value stands in one channel of an image.
struct Histogram {
    std::string name;                   ///< "grey", "red", "green", "blue"
    std::vector<std::uint64_t> counts;  ///< One for each value of the depth.
    std::uint64_t samples = 0;

    [[nodiscard]] std::uint32_t GetMinimum() const;
    [[nodiscard]] std::uint32_t GetMaximum() const;
    [[nodiscard]] double GetMean() const;
    /// The lowest value that at least half of the samples do not exceed.
    [[nodiscard]] std::uint32_t GetMedian() const;
    /// Samples at the greatest value of the depth.
    [[nodiscard]] std::uint64_t GetSaturated() const { return counts.back(); }
    /// The counts in `count` bins of the same width.
    [[nodiscard]] std::vector<std::uint64_t> GetBins(std::size_t count) const;
};

/// One for each channel: red, green and blue of an image of three colours or of a mosaic, else
/// grey. Values above the depth count as its greatest.
std::vector<Histogram> MakeHistograms(const Image& image);

/// Lines for a terminal: what is known of the channel, and its bins as bars of the logarithm.
std::string DrawInText(const Histogram& histogram);

nlohmann::ordered_json GetAsJson(const Histogram& histogram);

/// A picture of all channels over each other, each in its colour.
Image DrawPicture(const std::vector<Histogram>& histograms);

}  // namespace ZentaraProgram
