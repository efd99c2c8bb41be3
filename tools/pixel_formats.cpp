#include "pixel_formats.h"

#include <algorithm>
#include <vector>

#include "setting_names.h"
#include "zentara/zentara.h"

namespace ZentaraProgram {
namespace {

constexpr std::array Formats{
    PixelFormat{zfmtRaw8, "raw8", 1, 1, false, {}},
    PixelFormat{zfmtRaw16, "raw16", 2, 1, false, {}},
    PixelFormat{zfmtMono8, "mono8", 1, 1, false, {}},
    PixelFormat{zfmtMono16, "mono16", 2, 1, false, {}},
    PixelFormat{zfmtBayer8, "bayer8", 1, 1, false, {}},
    PixelFormat{zfmtBayer16, "bayer16", 2, 1, false, {}},
    PixelFormat{zfmtRGBPlane8, "rgb-planes", 1, 3, true, {0, 1, 2}},
    PixelFormat{zfmtRGBPlane16, "rgb-planes16", 2, 3, true, {0, 1, 2}},
    PixelFormat{zfmtBGR24, "bgr24", 1, 3, false, {2, 1, 0}},
    PixelFormat{zfmtXRGB32, "xrgb32", 1, 4, false, {1, 2, 3}},
    PixelFormat{zfmtRGB48, "rgb48", 2, 3, false, {0, 1, 2}},
    PixelFormat{zfmtBGRX32, "bgrx32", 1, 4, false, {2, 1, 0}},
    PixelFormat{zfmtRGB24, "rgb24", 1, 3, false, {0, 1, 2}},
};

}  // namespace

std::span<const PixelFormat> GetPixelFormats() {
    return Formats;
}

const PixelFormat* FindPixelFormat(std::uint32_t format) {
    return format < Formats.size() ? &Formats[format] : nullptr;
}

const PixelFormat* FindPixelFormat(std::string_view name) {
    const std::string simple = Simplify(name);
    const auto* found = std::find_if(Formats.begin(), Formats.end(), [&](const PixelFormat& row) {
        return Simplify(row.name) == simple;
    });
    return found == Formats.end() ? nullptr : found;
}

std::string DescribeUnknownFormat(std::string_view name) {
    std::vector<std::string> names;
    names.reserve(Formats.size());
    for (const PixelFormat& row : Formats) names.emplace_back(row.name);
    return DescribeUnknown("format", name, names);
}

}  // namespace ZentaraProgram
