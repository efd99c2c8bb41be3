#include "imaging/region_measure.h"

#include <algorithm>
#include <cstring>

#include "imaging/colour_layout.h"
#include "imaging/image_formats.h"

namespace ZV {
namespace {

template <typename Sample>
std::uint64_t ReadSample(const std::uint8_t* data, std::uint64_t index) {
    Sample sample;
    std::memcpy(&sample, data + index * sizeof(Sample), sizeof(Sample));
    return sample;
}

struct Sum {
    static std::uint64_t Join(std::uint64_t sum, std::uint64_t sample) { return sum + sample; }
};

struct Maximum {
    static std::uint64_t Join(std::uint64_t greatest, std::uint64_t sample) {
        return std::max(greatest, sample);
    }
};

/// Equally long runs of samples, equally far apart, in the first `end` samples of the image.
struct Walk {
    std::uint64_t end;
    std::uint64_t rowSamples;  ///< Above 0 where `end` is.
    std::uint64_t firstRow;
    std::uint64_t rows;
    std::uint64_t offset;  ///< Of a run's first sample in its row.
    std::uint64_t count;
    std::uint64_t step;
};

template <typename Sample, typename Joining>
std::uint64_t WalkSamples(const std::uint8_t* data, const Walk& walk) {
    std::uint64_t value = 0;
    for (std::uint64_t row = walk.firstRow; row < walk.firstRow + walk.rows; ++row) {
        // Asked before the product, which then stays below the image's end.
        if (walk.end == 0 || row > (walk.end - 1) / walk.rowSamples) break;
        const std::uint64_t first = row * walk.rowSamples + walk.offset;
        if (first >= walk.end) continue;
        const std::uint64_t inside = (walk.end - 1 - first) / walk.step + 1;
        const std::uint64_t count = std::min(walk.count, inside);
        for (std::uint64_t n = 0; n < count; ++n) {
            value = Joining::Join(value, ReadSample<Sample>(data, first + n * walk.step));
        }
    }
    return value;
}

template <typename Joining>
std::uint64_t WalkImage(const std::uint8_t* data, std::uint32_t sampleBytes, const Walk& walk) {
    return sampleBytes == 1 ? WalkSamples<std::uint8_t, Joining>(data, walk)
                            : WalkSamples<std::uint16_t, Joining>(data, walk);
}

std::uint64_t CountPixels(std::uint32_t width, std::uint32_t height) {
    return std::uint64_t{width} * height;
}

/// Samples that are there, in whole pixels of `pixelSamples`; below 2^35.
std::uint64_t CountSamples(const MeasuredImage& image, std::uint32_t sampleBytes,
                           std::uint32_t pixelSamples) {
    if (image.data == nullptr) return 0;
    const std::uint64_t held = std::min<std::uint64_t>(image.bytes, UINT32_MAX) / sampleBytes;
    const std::uint64_t pixels =
        std::min<std::uint64_t>(CountPixels(image.width, image.height), UINT32_MAX);
    return std::min(held, pixels * pixelSamples);
}

/// What the colours of an image have in common; `offset` is still that of the region's column.
Walk MakeColourWalk(const MeasuredImage& image, const MeasuredRegion& region,
                    const ColourLayout& layout) {
    const std::uint32_t pixelBytes = layout.GetPixelBytes();
    Walk walk{};
    walk.end = CountSamples(image, layout.sampleBytes, pixelBytes / layout.sampleBytes);
    walk.rowSamples = std::uint64_t{image.width} * layout.step;
    // Kept: the length of a row is counted in bytes here, where the walk goes by words.
    if (image.format == RGBPlane16) walk.rowSamples *= 2;
    walk.firstRow = region.y;
    walk.rows = region.height;
    walk.offset = std::uint64_t{region.x} * layout.step;
    walk.count = region.width;
    walk.step = layout.step;
    return walk;
}

/// Position of a colour's first sample in the image; beyond the image's end where it is not held.
std::uint64_t FindFirstSample(const MeasuredImage& image, const ColourLayout& layout,
                              std::uint32_t position) {
    if (!layout.IsPlanar()) return position;
    return std::min<std::uint64_t>(CountPixels(image.width, image.height), UINT32_MAX) * position;
}

struct WideColourValues {
    std::uint64_t red;
    std::uint64_t green;
    std::uint64_t blue;
};

template <typename Joining>
WideColourValues WalkColours(const MeasuredImage& image, const MeasuredRegion& region,
                             const ColourLayout& layout) {
    const auto measure = [&](std::uint32_t position) {
        Walk walk = MakeColourWalk(image, region, layout);
        walk.offset += FindFirstSample(image, layout, position);
        return WalkImage<Joining>(image.data, layout.sampleBytes, walk);
    };
    return {measure(layout.red), measure(layout.green), measure(layout.blue)};
}

}  // namespace

FilterResult MeasureColourMeans(const MeasuredImage& image, const MeasuredRegion& region,
                                ColourValues* means) {
    const ColourLayout* const layout = FindColourLayout(image.format);
    if (layout == nullptr) return FilterUnknownFormat;
    const std::uint64_t pixels = CountPixels(region.width, region.height);
    if (pixels == 0) return FilterDone;
    const WideColourValues sums = WalkColours<Sum>(image, region, *layout);
    means->red = static_cast<std::uint32_t>(sums.red / pixels);
    means->green = static_cast<std::uint32_t>(sums.green / pixels);
    means->blue = static_cast<std::uint32_t>(sums.blue / pixels);
    return FilterDone;
}

FilterResult MeasureColourMaxima(const MeasuredImage& image, const MeasuredRegion& region,
                                 ColourValues* maxima) {
    const ColourLayout* const layout = FindColourLayout(image.format);
    if (layout == nullptr) return FilterUnknownFormat;
    const WideColourValues greatest = WalkColours<Maximum>(image, region, *layout);
    maxima->red = static_cast<std::uint32_t>(greatest.red);
    maxima->green = static_cast<std::uint32_t>(greatest.green);
    maxima->blue = static_cast<std::uint32_t>(greatest.blue);
    return FilterDone;
}

FilterResult MeasureMonoMaximum(const MeasuredImage& image, const MeasuredRegion& region,
                                std::uint32_t* maximum) {
    if (!IsMonochrome(image.format) && !IsBayer(image.format)) return FilterUnknownFormat;
    const std::uint32_t sampleBytes = Is16Bit(image.format) ? 2 : 1;
    Walk walk{};
    walk.end = CountSamples(image, sampleBytes, 1);
    walk.rowSamples = image.width;
    walk.firstRow = region.y;
    walk.rows = 1;
    walk.offset = region.x;
    walk.count = CountPixels(region.width, region.height);
    walk.step = 1;
    *maximum = static_cast<std::uint32_t>(WalkImage<Maximum>(image.data, sampleBytes, walk));
    return FilterDone;
}

}  // namespace ZV
