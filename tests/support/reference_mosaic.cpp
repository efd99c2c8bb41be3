#include "support/reference_mosaic.h"

#include <algorithm>
#include <cstddef>
#include <string_view>

#include "zentara/zentara.h"

namespace ZV::Test {
namespace {

/// One colour of the mosaic, half as wide and half as high.
struct Plane {
    std::int32_t width, height;
    std::uint32_t top;
    std::vector<std::uint16_t> samples;

    std::uint16_t At(std::int32_t x, std::int32_t y) const {
        return samples[static_cast<std::size_t>(y * width + x)];
    }
};

std::vector<double> ListPositions(std::int32_t length) {
    const double step = length > 0 && length * 2.0 > 1.0 ? (length - 1) / (length * 2.0 - 1.0) : 0;
    std::vector<double> positions;
    double position = 0;
    for (std::int32_t i = 0; i < 2 * length; ++i, position += step) positions.push_back(position);
    return positions;
}

struct LinearPlace {
    std::int32_t index, weight;
};

LinearPlace PlaceLinear(double position, std::int32_t length) {
    const auto index = static_cast<std::int32_t>(position + 1e-7);
    if (index == length - 1) return {index - 1, 16384};
    return {index, static_cast<std::int32_t>((position - index) * 16384.0 + 1e-7)};
}

std::uint16_t InterpolateLinear(const Plane& plane, double x, double y) {
    const LinearPlace column = PlaceLinear(x, plane.width), row = PlaceLinear(y, plane.height);
    const auto passRow = [&](std::int32_t at) {
        const std::int32_t sum = (16384 - column.weight) * plane.At(column.index, at) +
                                 column.weight * plane.At(column.index + 1, at);
        return plane.top == 255 ? (sum + 128) >> 8 : (sum + 8192) >> 14;
    };
    const std::int64_t sum = std::int64_t{passRow(row.index + 1)} * row.weight +
                             std::int64_t{passRow(row.index)} * (16384 - row.weight);
    return static_cast<std::uint16_t>(plane.top == 255 ? (sum + 0x80000) >> 20
                                                       : (sum + 8192) >> 14);
}

struct CubicPlace {
    std::int32_t base;
    float t;
};

CubicPlace PlaceCubic(double position, std::int32_t length) {
    const auto index = static_cast<std::int32_t>(position + 1e-7);
    if (index == length - 1) return {index - 2, 2.0F};
    std::int32_t base = index;
    if (index == 0) base = 1;
    if (index == length - 2 && index != 0) base = index - 1;
    return {base, static_cast<float>(position - base)};
}

float Newton(float a, float c, float d, float e, float t) {
    const float first = c - a;
    const float second = d - c - first;
    const float third = c - 2.0F * d + e - second;
    const float half = t * (1.0F + t) * 0.5F;
    return a + (1.0F + t) * first + half * second + ((t - 1.0F) * half / 3.0F) * third;
}

std::uint16_t InterpolateCubic(const Plane& plane, double x, double y) {
    const CubicPlace column = PlaceCubic(x, plane.width), row = PlaceCubic(y, plane.height);
    float rows[4];
    for (std::int32_t i = 0; i < 4; ++i) {
        const auto at = [&](std::int32_t dx) {
            return static_cast<float>(plane.At(column.base + dx, row.base - 1 + i));
        };
        rows[i] = Newton(at(-1), at(0), at(1), at(2), column.t);
    }
    const double value =
        static_cast<double>(Newton(rows[0], rows[1], rows[2], rows[3], row.t)) + 0.5000001;
    return static_cast<std::uint16_t>(
        std::clamp(static_cast<std::int64_t>(value), std::int64_t{0}, std::int64_t{plane.top}));
}

std::vector<std::uint16_t> EnlargePlane(const Plane& plane, std::uint32_t algorithm) {
    const std::vector<double> xs = ListPositions(plane.width), ys = ListPositions(plane.height);
    const std::int32_t least = std::min(plane.width, plane.height);
    std::vector<std::uint16_t> full;
    for (std::int32_t y = 0; y < 2 * plane.height; ++y) {
        for (std::int32_t x = 0; x < 2 * plane.width; ++x) {
            const double px = xs[static_cast<std::size_t>(x)], py = ys[static_cast<std::size_t>(y)];
            if (algorithm == zbayerFast || least < 2) {
                full.push_back(plane.At(x / 2, y / 2));
            } else if (algorithm == zbayerAverage || least < 4) {
                full.push_back(InterpolateLinear(plane, px, py));
            } else {
                full.push_back(InterpolateCubic(plane, px, py));
            }
        }
    }
    return full;
}

}  // namespace

ReferenceColours MakeReferenceColours(const ReferenceMosaic& mosaic, std::uint32_t algorithm) {
    // Cells row by row; the first green of a cell is told from the second, which is of no account.
    static constexpr std::string_view Cells[] = {"RGgB", "GRBg", "GBRg", "BGgR"};
    const std::string_view cell = Cells[mosaic.pattern];
    const auto pick = [&](char colour) {
        const std::size_t place = cell.find(colour);
        Plane plane{static_cast<std::int32_t>(mosaic.width / 2),
                    static_cast<std::int32_t>(mosaic.height / 2),
                    mosaic.bits == 8 ? 255U : 65535U,
                    {}};
        for (std::size_t y = place / 2; y < mosaic.height; y += 2) {
            for (std::size_t x = place % 2; x < mosaic.width; x += 2) {
                plane.samples.push_back(mosaic.samples[y * mosaic.width + x]);
            }
        }
        return plane;
    };
    Plane green = pick('G');
    const Plane second = pick('g');
    for (std::size_t i = 0; i < green.samples.size(); ++i) {
        green.samples[i] = static_cast<std::uint16_t>(green.samples[i] / 2 + second.samples[i] / 2);
    }
    return {mosaic.width,
            mosaic.height,
            {EnlargePlane(pick('R'), algorithm), EnlargePlane(green, algorithm),
             EnlargePlane(pick('B'), algorithm)}};
}

void ScaleReferenceColours(ReferenceColours& colours, const float (&scales)[3],
                           std::uint32_t bits) {
    const std::uint16_t top = bits == 8 ? 255 : 65535;
    for (std::size_t colour = 0; colour < 3; ++colour) {
        for (std::uint16_t& sample : colours.planes[colour]) {
            if (sample == top) continue;
            const float scaled = static_cast<float>(sample) * scales[colour];
            sample = static_cast<std::uint16_t>(std::min(scaled, static_cast<float>(top)));
        }
    }
}

std::vector<std::uint8_t> PackReferenceColours(const ReferenceColours& colours,
                                               std::uint32_t format) {
    struct Layout {
        std::uint32_t format;
        std::string_view order;
    };
    static constexpr Layout Layouts[] = {
        {zfmtBGR24, "210"}, {zfmtXRGB32, "X012"}, {zfmtBGRX32, "210X"}, {zfmtRGB24, "012"}};
    std::vector<std::uint8_t> image;
    const auto addWord = [&](std::uint16_t sample) {
        image.push_back(static_cast<std::uint8_t>(sample));
        image.push_back(static_cast<std::uint8_t>(sample >> 8));
    };
    for (std::size_t i = 0; i < colours.planes[0].size(); ++i) {
        if (format == zfmtRGB48) {
            for (const auto& plane : colours.planes) addWord(plane[i]);
        }
        for (const Layout& layout : Layouts) {
            if (layout.format != format) continue;
            for (const char place : layout.order) {
                image.push_back(place == 'X'
                                    ? std::uint8_t{255}
                                    : static_cast<std::uint8_t>(colours.planes[place - '0'][i]));
            }
        }
    }
    for (const auto& plane : colours.planes) {
        for (const std::uint16_t sample : plane) {
            if (format == zfmtRGBPlane8) image.push_back(static_cast<std::uint8_t>(sample));
            if (format == zfmtRGBPlane16) addWord(sample);
        }
    }
    return image;
}

}  // namespace ZV::Test
