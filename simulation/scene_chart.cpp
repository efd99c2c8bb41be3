#include <new>

#include "simulation/scene_kinds.h"

namespace ZV::Simulation {
namespace {

constexpr std::uint32_t ChartColumns = 6;
constexpr std::uint32_t ChartRows = 4;

/// Linear red, green and blue of each patch in thousandths: tints of nature, saturated colours,
/// primaries, and a row of greys from white to black.
constexpr std::uint16_t ChartPatches[ChartRows][ChartColumns][ColourCount] = {
    {{170, 85, 58},
     {540, 300, 225},
     {120, 195, 335},
     {100, 150, 55},
     {230, 215, 430},
     {140, 505, 410}},
    {{690, 200, 30},
     {70, 105, 375},
     {530, 95, 120},
     {110, 45, 140},
     {340, 495, 50},
     {740, 360, 25}},
    {{30, 50, 280}, {60, 290, 65}, {420, 35, 40}, {800, 570, 15}, {490, 90, 300}, {20, 230, 360}},
    {{900, 900, 900},
     {590, 590, 590},
     {360, 360, 360},
     {190, 190, 190},
     {90, 90, 90},
     {30, 30, 30}},
};

class ChartScene final : public Scene {
  public:
    explicit ChartScene(const SceneRequest& request)
        : Scene(request.description, request.width, request.height) {}

    void FillRow(std::uint32_t y, std::uint32_t colour, double* levels) const override {
        const std::uint64_t row = std::uint64_t{y} * ChartRows / GetHeight();
        for (std::uint32_t x = 0; x < GetWidth(); ++x) {
            const std::uint64_t column = std::uint64_t{x} * ChartColumns / GetWidth();
            levels[x] = ChartPatches[row][column][colour] / 1000.0;
        }
    }
};

}  // namespace

std::unique_ptr<Scene> MakeChartScene(const SceneRequest& request, std::string*) {
    return std::unique_ptr<Scene>(new (std::nothrow) ChartScene(request));
}

}  // namespace ZV::Simulation
