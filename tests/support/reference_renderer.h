#pragma once

#include <array>
#include <cstdint>
#include <string>
#include <vector>

namespace ZV::Test {

/// A simulated camera without noise, as docs/simulation-optics.md tells it. The defaults are those
/// of a scenario.
struct ReferenceCamera {
    std::uint32_t width = 1392, height = 1040;
    bool hasMosaic = false;
    std::uint32_t mosaic = 5;
    bool binsWithinMosaic = false;
    double fullWell = 22000;
    double darkCurrentAt20 = 0.5;
    std::uint64_t seed = 1;

    std::string scene = "stars";  ///< "flat", "ramp", "chart" or "stars".
    double brightness = 2e6;
    double level = 0.5;
    std::array<double, 3> light = {1, 1, 1};
    std::uint32_t starCount = 200;
};

struct ReferenceExposure {
    std::uint32_t x = 0, y = 0, width = 0, height = 0;  ///< Binned pixels.
    std::uint32_t binningX = 1, binningY = 1;
    std::uint32_t bitDepth = 8;
    double seconds = 0.016384;
    double gainDb = 0;
    double offset = 0;
    int wheelColour = -1;  ///< -1 for none, 0 red, 1 green, 3 blue.
    double temperature = -10;
    bool isTurned = false;
};

/// Computes frames from the written formulas, pixel by pixel. It shares no code with the
/// simulation, so that both can be held against each other.
class ReferenceRenderer {
  public:
    explicit ReferenceRenderer(const ReferenceCamera& camera);

    /// Samples in row order.
    std::vector<std::uint16_t> Render(const ReferenceExposure& exposure) const;

    /// Level of a scene at a pixel, before the light's factor.
    double GetLevel(std::uint32_t x, std::uint32_t y, std::uint32_t colour) const;

  private:
    void DrawStars();
    float GetLight(std::uint64_t x, std::uint64_t y, int wheelColour) const;
    double SumLight(const ReferenceExposure& exposure, std::uint64_t x, std::uint64_t y) const;

    ReferenceCamera camera;
    std::array<std::vector<double>, 3> sky;  ///< Levels of the star field.
};

}  // namespace ZV::Test
