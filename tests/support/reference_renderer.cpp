#include "support/reference_renderer.h"

#include <algorithm>
#include <cmath>

namespace ZV::Test {
namespace {

/// The splitmix64 stream of fractions.
struct Fractions {
    std::uint64_t state;

    double Draw() {
        state += 0x9E3779B97F4A7C15ULL;
        std::uint64_t z = state;
        z ^= z >> 30;
        z *= 0xBF58476D1CE4E5B9ULL;
        z ^= z >> 27;
        z *= 0x94D049BB133111EBULL;
        z ^= z >> 31;
        return std::ldexp(static_cast<double>(z >> 11), -53);
    }
};

constexpr int Chart[24][3] = {{170, 85, 58},   {540, 300, 225}, {120, 195, 335}, {100, 150, 55},
                              {230, 215, 430}, {140, 505, 410}, {690, 200, 30},  {70, 105, 375},
                              {530, 95, 120},  {110, 45, 140},  {340, 495, 50},  {740, 360, 25},
                              {30, 50, 280},   {60, 290, 65},   {420, 35, 40},   {800, 570, 15},
                              {490, 90, 300},  {20, 230, 360},  {900, 900, 900}, {590, 590, 590},
                              {360, 360, 360}, {190, 190, 190}, {90, 90, 90},    {30, 30, 30}};

double GetChartLevel(const ReferenceCamera& camera, std::uint32_t x, std::uint32_t y,
                     std::uint32_t colour) {
    const std::uint64_t column = 6ULL * x / camera.width;
    const std::uint64_t row = 4ULL * y / camera.height;
    return Chart[6 * row + column][colour] / 1000.0;
}

/// Letters of the cell's four pixels, row by row: the colour of a pixel of the mosaic.
std::uint32_t GetMosaicColour(std::uint32_t mosaic, std::uint64_t x, std::uint64_t y) {
    constexpr const char* Cells[] = {"RGGB", "GRBG", "GBRG", "BGGR"};
    const char letter = Cells[mosaic - 5][2 * (y % 2) + x % 2];
    return letter == 'R' ? 0 : letter == 'G' ? 1 : 2;
}

std::uint64_t PlacePixel(std::uint64_t index, std::uint64_t binning, std::uint64_t n,
                         bool isWithinMosaic) {
    if (!isWithinMosaic) return index * binning + n;
    return index / 2 * 2 * binning + index % 2 + 2 * n;
}

}  // namespace

ReferenceRenderer::ReferenceRenderer(const ReferenceCamera& referenceCamera)
    : camera(referenceCamera) {
    if (camera.scene == "stars") DrawStars();
}

void ReferenceRenderer::DrawStars() {
    const std::size_t pixels = std::size_t{camera.width} * camera.height;
    for (std::vector<double>& plane : sky) plane.assign(pixels, 0.002);
    Fractions fractions{camera.seed};
    for (std::uint32_t n = 0; n < camera.starCount; ++n) {
        const double centreX = fractions.Draw() * camera.width - 0.5;
        const double centreY = fractions.Draw() * camera.height - 0.5;
        const double sigma = 0.9 + 0.7 * fractions.Draw();
        const double peak = 0.01 + 0.99 * std::pow(fractions.Draw(), 4);
        const double warmth = fractions.Draw();
        const double peaks[] = {peak * (0.6 + 0.4 * warmth), peak * 0.9, peak * (1 - 0.4 * warmth)};
        const int top = std::max(0, static_cast<int>(centreY) - 10);
        const int left = std::max(0, static_cast<int>(centreX) - 10);
        for (int y = top; y < top + 21 && y < static_cast<int>(camera.height); ++y) {
            for (int x = left; x < left + 21 && x < static_cast<int>(camera.width); ++x) {
                const double dx = x - centreX;
                const double dy = y - centreY;
                if (std::fabs(dx) > 8 || std::fabs(dy) > 8) continue;
                const double profile = std::exp(-dx * dx / (2 * sigma * sigma)) *
                                       std::exp(-dy * dy / (2 * sigma * sigma));
                const std::size_t pixel =
                    static_cast<std::size_t>(y) * camera.width + static_cast<std::size_t>(x);
                for (std::size_t colour = 0; colour < 3; ++colour) {
                    sky[colour][pixel] += peaks[colour] * profile;
                }
            }
        }
    }
}

double ReferenceRenderer::GetLevel(std::uint32_t x, std::uint32_t y, std::uint32_t colour) const {
    if (camera.scene == "flat") return camera.level;
    if (camera.scene == "ramp") return (x + y) / (camera.width + camera.height - 2.0);
    if (camera.scene == "chart") return GetChartLevel(camera, x, y, colour);
    return sky[colour][std::size_t{y} * camera.width + x];
}

float ReferenceRenderer::GetLight(std::uint64_t x, std::uint64_t y, int wheelColour) const {
    if (x >= camera.width || y >= camera.height) return 0;
    const auto column = static_cast<std::uint32_t>(x);
    const auto row = static_cast<std::uint32_t>(y);
    double rates[3];
    for (std::uint32_t colour = 0; colour < 3; ++colour) {
        rates[colour] = GetLevel(column, row, colour) * (camera.brightness * camera.light[colour]);
    }
    if (camera.hasMosaic) return static_cast<float>(rates[GetMosaicColour(camera.mosaic, x, y)]);
    if (wheelColour == 0) return static_cast<float>(rates[0]);
    if (wheelColour == 1) return static_cast<float>(rates[1]);
    if (wheelColour == 3) return static_cast<float>(rates[2]);
    return static_cast<float>((rates[0] + rates[1] + rates[2]) / 3);
}

double ReferenceRenderer::SumLight(const ReferenceExposure& exposure, std::uint64_t x,
                                   std::uint64_t y) const {
    double sum = 0;
    for (std::uint32_t j = 0; j < exposure.binningY; ++j) {
        for (std::uint32_t i = 0; i < exposure.binningX; ++i) {
            sum += GetLight(PlacePixel(x, exposure.binningX, i, camera.binsWithinMosaic),
                            PlacePixel(y, exposure.binningY, j, camera.binsWithinMosaic),
                            exposure.wheelColour);
        }
    }
    return sum;
}

std::vector<std::uint16_t> ReferenceRenderer::Render(const ReferenceExposure& exposure) const {
    const double pixels = double(exposure.binningX) * exposure.binningY;
    const double dark =
        camera.darkCurrentAt20 * std::pow(2.0, (exposure.temperature - 20) / 6.3) * pixels;
    const double greatest = std::ldexp(1, static_cast<int>(exposure.bitDepth)) - 1;
    const double gain = std::pow(10.0, exposure.gainDb / 20);
    std::vector<std::uint16_t> samples;
    samples.reserve(std::size_t{exposure.width} * exposure.height);
    for (std::uint64_t y = 0; y < exposure.height; ++y) {
        for (std::uint64_t x = 0; x < exposure.width; ++x) {
            double electrons =
                (SumLight(exposure, exposure.x + x, exposure.y + y) + dark) * exposure.seconds;
            electrons = std::min(electrons, camera.fullWell * pixels);
            const double value =
                electrons * (greatest / camera.fullWell * gain) + exposure.offset * greatest / 4095;
            const double bounded = std::clamp(value, 0.0, greatest);
            samples.push_back(static_cast<std::uint16_t>(std::floor(bounded + 0.5)));
        }
    }
    if (exposure.isTurned) std::reverse(samples.begin(), samples.end());
    return samples;
}

}  // namespace ZV::Test
