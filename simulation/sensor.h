#pragma once

#include <cstdint>
#include <memory>
#include <vector>

#include "simulation/scene.h"

namespace ZV::Simulation {

enum class ColourKind { Mono = 0, Bayer = 1 };

/// The sensor of a simulated camera; fixed for the camera's life.
struct SensorDescription {
    std::uint32_t width = 1392;
    std::uint32_t height = 1040;
    std::uint32_t maxBitDepth = 12;
    ColourKind colourKind = ColourKind::Mono;
    /// Mosaic of the first unbinned pixel of the full sensor: 5 RGGB, 6 GRBG, 7 GBRG, 8 BGGR.
    std::uint32_t mosaic = 5;
    double fullWell = 22000;        ///< Electrons of an unbinned pixel at the greatest sample value.
    double readNoise = 6;           ///< Electrons.
    double darkCurrentAt20 = 0.5;   ///< Electrons per second at 20 degrees C; doubles every 6.3 degrees.
    bool hasNoise = true;           ///< Read and photon noise; dark current is a mean level all the same.
    std::uint64_t seed = 1;
};

/// Settings in force for one exposure, decoded from the control registers.
struct ExposureSettings {
    std::uint32_t roiX = 0, roiY = 0;            ///< In binned pixels.
    std::uint32_t width = 0, height = 0;         ///< Image size in binned pixels.
    std::uint32_t binningX = 1, binningY = 1;
    std::uint32_t bitDepth = 8;                  ///< Samples above 8 bits take 2 bytes.
    bool isBigEndian = false;                    ///< Byte order of samples of 2 bytes.
    std::uint64_t exposureNs = 0;
    double gainDb = 0;                           ///< Against the default gain.
    std::int32_t offset = 0;                     ///< Added to each sample, in steps of 12 bits, scaled to the depth.
    /// Filter before a monochrome sensor: 0 red, 1 green, 3 blue; any other is no filter (mean of all).
    std::uint32_t wheelColour = 255;
    double temperature = -10;                    ///< Degrees C.
    std::uint64_t frameIndex = 0;                ///< Noise depends on it and the seed alone.
    /// A camera that sends its image turned by half a turn: the last pixel first.
    bool isRotated = false;
};

/// Turns light into samples. Binning adds electrons; Bayer sensors bin pixels of one colour so that the
/// mosaic stays for binning 1 alone (above it the sum is that of all colours); saturates at the full well
/// and at the depth's greatest value. Thread-safe after it is made.
class Sensor {
  public:
    Sensor(const SensorDescription& description, std::unique_ptr<Scene> scene);

    const SensorDescription& GetDescription() const { return description; }

    /// Samples of one exposure in row order without padding: width * height * (1 or 2) bytes.
    std::vector<std::uint8_t> Expose(const ExposureSettings& settings) const;

    /// Mosaic (5 to 8) of the first pixel of an image with this origin and turn.
    std::uint32_t GetMosaicAt(std::uint32_t x, std::uint32_t y) const;

  private:
    SensorDescription description;
    std::unique_ptr<Scene> scene;
};

}  // namespace ZV::Simulation
