#pragma once

#include <cstdint>
#include <memory>
#include <string>

namespace ZV::Simulation {

/// Colours of light as the scene counts them.
inline constexpr std::uint32_t ColourRed = 0;
inline constexpr std::uint32_t ColourGreen = 1;
inline constexpr std::uint32_t ColourBlue = 2;
inline constexpr std::uint32_t ColourCount = 3;

/// What stands before the camera, as a scenario tells it.
struct SceneDescription {
    /// "flat", "ramp", "chart", "stars" or "image".
    std::string kind = "stars";
    /// Image file of kind "image": PNG, TIFF or FITS. Scaled to the sensor by nearest neighbour.
    std::string path;
    /// Photoelectrons per second and unbinned pixel at level 1.
    double brightness = 2.0e6;
    /// Level of kind "flat", 0 to 1.
    double level = 0.5;
    /// Colour of the light as factors of red, green and blue.
    double light[3] = {1.0, 1.0, 1.0};
    std::uint32_t starCount = 200;
};

/// Light that falls on the unbinned sensor. A level is 0 for black and 1 for the scene's white;
/// stars that overlap may go above. Immutable after it is made; thread-safe. The formulas stand in
/// docs/simulation-optics.md.
class Scene {
  public:
    virtual ~Scene() = default;

    /// Writes the levels of a colour for a whole row of the sensor to `levels`, before the light's
    /// factor. Requires: `y` lies on the sensor.
    virtual void FillRow(std::uint32_t y, std::uint32_t colour, double* levels) const = 0;

    /// Photoelectrons per second and unbinned pixel of a colour at level 1: the brightness times
    /// the light's factor.
    double GetRate(std::uint32_t colour) const { return rates[colour]; }

    std::uint32_t GetWidth() const { return width; }
    std::uint32_t GetHeight() const { return height; }

  protected:
    Scene(const SceneDescription& description, std::uint32_t sensorWidth,
          std::uint32_t sensorHeight);

  private:
    double rates[ColourCount];
    std::uint32_t width;
    std::uint32_t height;
};

/// Makes the scene for a sensor of this size. Null with `message` when it cannot be made (an
/// unknown kind, a file that cannot be read).
std::unique_ptr<Scene> MakeScene(const SceneDescription& description, std::uint32_t sensorWidth,
                                 std::uint32_t sensorHeight, std::uint64_t seed,
                                 std::string* message);

}  // namespace ZV::Simulation
