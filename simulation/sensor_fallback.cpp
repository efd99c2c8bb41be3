#include <utility>

#include "simulation/sensor.h"

// Stands in for the sensor until there is one: black images. The real one replaces these weak
// symbols.
namespace ZV::Simulation {

__attribute__((weak)) Sensor::Sensor(const SensorDescription& sensor, std::unique_ptr<Scene> light)
    : description(sensor), scene(std::move(light)) {}

__attribute__((weak)) std::vector<std::uint8_t> Sensor::Expose(
    const ExposureSettings& settings) const {
    return std::vector<std::uint8_t>(std::size_t{settings.width} * settings.height *
                                     (settings.bitDepth > 8 ? 2 : 1));
}

__attribute__((weak)) std::uint32_t Sensor::GetMosaicAt(std::uint32_t, std::uint32_t) const {
    return description.mosaic;
}

}  // namespace ZV::Simulation
