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
    double fullWell = 22000;       ///< Electrons of an unbinned pixel at the greatest sample value.
    double readNoise = 6;          ///< Electrons.
    double darkCurrentAt20 = 0.5;  ///< Electrons per second at 20 degrees C; doubles every 6.3.
    bool hasNoise = true;  ///< Read and photon noise; dark current is a mean level all the same.
    std::uint64_t seed = 1;
    /// Binning adds pixels of one place of the mosaic's cell, so that a binned image is a mosaic of
    /// the same pattern (the cameras of two fields). Otherwise it adds neighbours of all colours.
    bool binsWithinMosaic = false;
    /// Rows that are added to one in real-time video, by cameras that have it.
    std::uint32_t videoBinning = 1;
};

/// Settings in force for one exposure, decoded from the control registers.
struct ExposureSettings {
    std::uint32_t roiX = 0, roiY = 0;     ///< In binned pixels.
    std::uint32_t width = 0, height = 0;  ///< Image size in binned pixels.
    std::uint32_t binningX = 1, binningY = 1;
    std::uint32_t bitDepth = 8;  ///< 1 to 16. Samples above 8 bits take 2 bytes.
    bool isBigEndian = false;    ///< Byte order of samples of 2 bytes.
    std::uint64_t exposureNs = 0;
    double gainDb = 0;        ///< Against the default gain.
    std::int32_t offset = 0;  ///< Added to each sample, in steps of 12 bits, scaled to the depth.
    /// Filter before a monochrome sensor: 0 red, 1 green, 3 blue; any other is no filter (mean of
    /// all). A sensor with a mosaic has no wheel.
    std::uint32_t wheelColour = 255;
    double temperature = -10;      ///< Degrees C.
    std::uint64_t frameIndex = 0;  ///< Noise depends on it and the seed alone.
    /// A camera that sends its image turned by half a turn: the last pixel first.
    bool isRotated = false;

    bool operator==(const ExposureSettings&) const = default;
};

/// Turns light into samples. Saturates at the full well of the pixels added and at the depth's
/// greatest value; the formulas stand in docs/simulation-optics.md. What an image covers beyond the
/// sensor's edge is without light. Thread-safe after it is made.
class Sensor {
  public:
    /// Requires: `scene` is not null and was made for a sensor of this size.
    Sensor(const SensorDescription& description, std::unique_ptr<Scene> scene);
    ~Sensor();

    const SensorDescription& GetDescription() const { return description; }

    /// Samples of one exposure in row order without padding: width * height * (1 or 2) bytes.
    /// Nothing for an image of more than 2 to the power 26 pixels or a depth of 0 or above 16.
    std::vector<std::uint8_t> Expose(const ExposureSettings& settings) const;

    /// Mosaic (5 to 8) of an image whose first pixel is this unbinned pixel of the sensor. For an
    /// image turned by half a turn that is the last pixel of its area.
    std::uint32_t GetMosaicAt(std::uint32_t x, std::uint32_t y) const;

  private:
    struct RateMaps;

    /// Photoelectrons per second of each pixel of the sensor, made at the first call of a filter.
    const float* GetRates(std::uint32_t wheelColour) const;
    std::vector<float> MakeRates(std::uint32_t wheelColour) const;

    SensorDescription description;
    std::unique_ptr<Scene> scene;
    std::unique_ptr<RateMaps> rateMaps;
};

}  // namespace ZV::Simulation
