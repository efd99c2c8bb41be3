#include "simulation/sensor.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <cstring>
#include <mutex>
#include <utility>

#include "simulation/noise.h"

namespace ZV::Simulation {
namespace {

constexpr std::uint64_t PixelCountMax = std::uint64_t{1} << 26;
constexpr double NanosecondsPerSecond = 1e9;
constexpr double DarkReferenceCelsius = 20;
constexpr double DarkDoublingCelsius = 6.3;
constexpr double OffsetRange = 4095;
constexpr std::uint32_t MosaicFirst = 5;

/// Rate maps: by the wheel's colour, the last without a filter (or with a mosaic).
constexpr std::size_t RateMapCount = 4;
constexpr std::size_t RateMapNoFilter = 3;
constexpr std::uint32_t WheelBlue = 3;

std::size_t GetRateMapIndex(std::uint32_t wheelColour) {
    if (wheelColour <= ColourGreen) return wheelColour;
    return wheelColour == WheelBlue ? std::size_t{ColourBlue} : RateMapNoFilter;
}

/// Colour of a pixel by the mosaic whose cell it begins: RGGB begins with red, BGGR with blue.
std::uint32_t GetColourOfMosaic(std::uint32_t mosaic) {
    constexpr std::array<std::uint32_t, 4> Colours = {ColourRed, ColourGreen, ColourGreen,
                                                      ColourBlue};
    return Colours[(mosaic - MosaicFirst) % Colours.size()];
}

/// How a binned pixel lies on one axis of the sensor: `count` pixels from `first` on, `step` apart.
struct BinnedAxis {
    std::uint64_t count;
    std::uint64_t step;

    BinnedAxis(std::uint32_t binning, bool isWithinMosaic)
        : count(std::max<std::uint32_t>(binning, 1)), step(isWithinMosaic ? 2 : 1) {}

    std::uint64_t GetFirst(std::uint64_t index) const {
        return index / step * step * count + index % step;
    }
};

/// Adds a row of the sensor to the binned pixels of a row of the image.
void AddSensorRow(const float* rates, std::uint64_t sensorWidth, const BinnedAxis& axis,
                  std::uint64_t roiX, std::vector<double>* row) {
    const std::uint64_t width = row->size();
    double* sums = row->data();
    if (axis.count == 1) {
        const std::uint64_t covered = roiX < sensorWidth ? std::min(width, sensorWidth - roiX) : 0;
        for (std::uint64_t x = 0; x < covered; ++x) sums[x] += rates[roiX + x];
        return;
    }
    for (std::uint64_t x = 0; x < width; ++x) {
        std::uint64_t pixel = axis.GetFirst(roiX + x);
        for (std::uint64_t n = 0; n < axis.count && pixel < sensorWidth; ++n, pixel += axis.step) {
            sums[x] += rates[pixel];
        }
    }
}

/// Light of one row of the image: the sum over the rows of the sensor that it covers.
void AddSensorRows(const float* rates, const SensorDescription& sensor,
                   const ExposureSettings& settings, std::uint32_t y, std::vector<double>* row) {
    const BinnedAxis horizontal(settings.binningX, sensor.binsWithinMosaic);
    const BinnedAxis vertical(settings.binningY, sensor.binsWithinMosaic);
    std::fill(row->begin(), row->end(), 0.0);
    std::uint64_t sensorRow = vertical.GetFirst(std::uint64_t{settings.roiY} + y);
    for (std::uint64_t n = 0; n < vertical.count && sensorRow < sensor.height; ++n) {
        AddSensorRow(rates + sensorRow * sensor.width, sensor.width, horizontal, settings.roiX,
                     row);
        sensorRow += vertical.step;
    }
}

/// The numbers that lead from the light of a binned pixel to its sample.
struct Response {
    double seconds;
    double darkRate;
    double wells;  ///< Electrons at which the binned pixel is full.
    double factor;
    double pedestal;
    double sampleMax;

    Response(const SensorDescription& sensor, const ExposureSettings& settings) {
        const double pixelCount = static_cast<double>(std::max(settings.binningX, 1U)) *
                                  static_cast<double>(std::max(settings.binningY, 1U));
        const double doublings =
            (settings.temperature - DarkReferenceCelsius) / DarkDoublingCelsius;
        seconds = static_cast<double>(settings.exposureNs) / NanosecondsPerSecond;
        darkRate = sensor.darkCurrentAt20 * std::exp2(doublings) * pixelCount;
        wells = sensor.fullWell * pixelCount;
        sampleMax = static_cast<double>((1U << settings.bitDepth) - 1);
        factor = sampleMax / sensor.fullWell * std::pow(10.0, settings.gainDb / 20);
        pedestal = settings.offset * sampleMax / OffsetRange;
    }

    void CollectElectrons(std::vector<double>* row) const {
        for (double& value : *row) value = (value + darkRate) * seconds;
    }

    void Quantise(const std::vector<double>& row, std::uint16_t* samples) const {
        for (std::size_t x = 0; x < row.size(); ++x) {
            const double electrons = row[x] < wells ? row[x] : wells;
            const double value = electrons * factor + pedestal;
            const double bounded = value > 0 ? std::min(value, sampleMax) : 0;
            samples[x] = static_cast<std::uint16_t>(static_cast<std::int32_t>(bounded + 0.5));
        }
    }
};

void PackRow(const std::vector<std::uint16_t>& samples, const ExposureSettings& settings,
             std::uint8_t* target) {
    if (settings.bitDepth <= 8) {
        std::transform(samples.begin(), samples.end(), target,
                       [](std::uint16_t sample) { return static_cast<std::uint8_t>(sample); });
        return;
    }
    const int firstShift = settings.isBigEndian ? 8 : 0;
    for (std::size_t x = 0; x < samples.size(); ++x) {
        target[2 * x] = static_cast<std::uint8_t>(samples[x] >> firstShift);
        target[2 * x + 1] = static_cast<std::uint8_t>(samples[x] >> (8 - firstShift));
    }
}

bool IsSupported(const ExposureSettings& settings) {
    return settings.bitDepth >= 1 && settings.bitDepth <= 16 &&
           std::uint64_t{settings.width} * settings.height <= PixelCountMax;
}

}  // namespace

struct Sensor::RateMaps {
    std::mutex mutex;  ///< Guards the making; a map that is made stays as it is.
    std::array<std::vector<float>, RateMapCount> maps;
};

Sensor::Sensor(const SensorDescription& sensorDescription, std::unique_ptr<Scene> sensorScene)
    : description(sensorDescription),
      scene(std::move(sensorScene)),
      rateMaps(std::make_unique<RateMaps>()) {}

Sensor::~Sensor() = default;

std::vector<std::uint8_t> Sensor::Expose(const ExposureSettings& settings) const {
    if (!IsSupported(settings)) return {};
    const Response response(description, settings);
    const float* rates = GetRates(settings.wheelColour);
    const std::size_t rowBytes = std::size_t{settings.width} * (settings.bitDepth > 8 ? 2 : 1);
    std::vector<std::uint8_t> image(rowBytes * settings.height);
    std::vector<double> electrons(settings.width);
    std::vector<std::uint16_t> samples(settings.width);

    for (std::uint32_t y = 0; y < settings.height; ++y) {
        AddSensorRows(rates, description, settings, y, &electrons);
        response.CollectElectrons(&electrons);
        if (description.hasNoise) {
            AddNoise(electrons.data(), electrons.size(), description.readNoise, description.seed,
                     settings.frameIndex, y);
        }
        response.Quantise(electrons, samples.data());
        if (settings.isRotated) std::reverse(samples.begin(), samples.end());
        const std::uint32_t row = settings.isRotated ? settings.height - 1 - y : y;
        PackRow(samples, settings, image.data() + row * rowBytes);
    }
    return image;
}

std::uint32_t Sensor::GetMosaicAt(std::uint32_t x, std::uint32_t y) const {
    const std::uint32_t phase = (x & 1U) | (y & 1U) << 1;
    return MosaicFirst + (((description.mosaic - MosaicFirst) ^ phase) & 3U);
}

const float* Sensor::GetRates(std::uint32_t wheelColour) const {
    const bool hasMosaic = description.colourKind == ColourKind::Bayer;
    const std::size_t index = hasMosaic ? RateMapNoFilter : GetRateMapIndex(wheelColour);
    const std::lock_guard lock(rateMaps->mutex);
    std::vector<float>& rates = rateMaps->maps[index];
    if (rates.empty()) rates = MakeRates(wheelColour);
    return rates.data();
}

std::vector<float> Sensor::MakeRates(std::uint32_t wheelColour) const {
    const std::size_t width = description.width;
    std::vector<float> rates(width * description.height);
    std::array<std::vector<double>, ColourCount> levels;
    for (std::vector<double>& row : levels) row.resize(width);
    const std::size_t filter = GetRateMapIndex(wheelColour);

    for (std::uint32_t y = 0; y < description.height; ++y) {
        for (std::uint32_t colour = 0; colour < ColourCount; ++colour) {
            scene->FillRow(y, colour, levels[colour].data());
            for (double& level : levels[colour]) level *= scene->GetRate(colour);
        }
        float* row = rates.data() + y * width;
        for (std::uint32_t x = 0; x < width; ++x) {
            if (description.colourKind == ColourKind::Bayer) {
                row[x] = static_cast<float>(levels[GetColourOfMosaic(GetMosaicAt(x, y))][x]);
            } else if (filter != RateMapNoFilter) {
                row[x] = static_cast<float>(levels[filter][x]);
            } else {
                row[x] = static_cast<float>((levels[0][x] + levels[1][x] + levels[2][x]) / 3);
            }
        }
    }
    return rates;
}

}  // namespace ZV::Simulation
