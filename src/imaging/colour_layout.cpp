#include "imaging/colour_layout.h"

#include <array>

#include "imaging/image_formats.h"

namespace ZV {
namespace {

struct LayoutRow {
    ZImageFormatEnum format;
    ColourLayout layout;
};

constexpr std::array LayoutRows{
    LayoutRow{RGBPlane8, {.red = 0, .green = 1, .blue = 2, .step = 1, .sampleBytes = 1}},
    LayoutRow{RGBPlane16, {.red = 0, .green = 1, .blue = 2, .step = 1, .sampleBytes = 2}},
    LayoutRow{BGR24, {.red = 2, .green = 1, .blue = 0, .step = 3, .sampleBytes = 1}},
    LayoutRow{XRGB32, {.red = 1, .green = 2, .blue = 3, .step = 4, .sampleBytes = 1}},
    LayoutRow{RGB48, {.red = 0, .green = 1, .blue = 2, .step = 3, .sampleBytes = 2}},
    LayoutRow{BGRX32, {.red = 2, .green = 1, .blue = 0, .step = 4, .sampleBytes = 1}},
    LayoutRow{RGB24, {.red = 0, .green = 1, .blue = 2, .step = 3, .sampleBytes = 1}},
    LayoutRow{RGBX32, {.red = 0, .green = 1, .blue = 2, .step = 4, .sampleBytes = 1}},
};

}  // namespace

const ColourLayout* FindColourLayout(std::uint32_t format) {
    for (const LayoutRow& row : LayoutRows) {
        if (row.format == format) return &row.layout;
    }
    return nullptr;
}

}  // namespace ZV
