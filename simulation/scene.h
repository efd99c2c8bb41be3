#pragma once

#include <cstdint>
#include <memory>
#include <string>

namespace ZV::Simulation {

/// What stands before the camera, as a scenario tells it.
struct SceneDescription {
    /// "flat", "ramp", "chart", "stars" or "image".
    std::string kind = "stars";
    /// Image file of kind "image": PNG, TIFF or FITS. Scaled to the sensor by nearest neighbour.
    std::string path;
    /// Photoelectrons per second and unbinned pixel at the scene's brightest level.
    double brightness = 2.0e6;
    /// Level of kind "flat", 0 to 1.
    double level = 0.5;
    /// Colour of the light as factors of red, green and blue.
    double light[3] = {1.0, 1.0, 1.0};
    std::uint32_t starCount = 200;
};

/// Light that falls on the unbinned sensor: relative level from 0 to 1 of a colour (0 red, 1 green, 2 blue)
/// at a pixel. Immutable after it is made; thread-safe.
class Scene {
  public:
    virtual ~Scene() = default;
    virtual double GetLevel(std::uint32_t x, std::uint32_t y, std::uint32_t colour) const = 0;
};

/// Makes the scene for a sensor of this size. Null with `message` when it cannot be made (a file that
/// cannot be read).
std::unique_ptr<Scene> MakeScene(const SceneDescription& description, std::uint32_t sensorWidth,
                                 std::uint32_t sensorHeight, std::uint64_t seed, std::string* message);

}  // namespace ZV::Simulation
