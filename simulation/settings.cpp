#include "simulation/settings.h"

#include <algorithm>
#include <cmath>

#include "camera/register_map.h"

namespace ZV::Simulation {
namespace {

using Quadlets = std::vector<std::uint32_t>;

constexpr double GainDacRange = 4096;
constexpr double OldLinearSpanDb = 34.1516;
constexpr double IntensifierDbPerStep = 0.015765398;

struct Request {
    const CameraScenario& camera;
    const Quadlets& control;
    const Quadlets& configuration;

    std::uint32_t Control(const RegisterField& field) const {
        return ExtractField(field, control[field.quadlet]);
    }
    std::uint32_t Config(const RegisterField& field) const {
        return ExtractField(field, configuration[field.quadlet]);
    }
};

bool IsFirstGeneration(std::uint32_t version) {
    return version < MakeVersion(2, 0);
}

std::uint64_t ReadExposure(const Request& request, std::uint32_t high, std::uint32_t low) {
    if (IsFirstGeneration(request.camera.versions.control)) {
        return std::uint64_t{request.control[high]} * 1000;
    }
    return std::uint64_t{request.control[high]} << 32 | request.control[low];
}

// The boards of some models changed with a firmware.
std::uint32_t GetBoardType(const CameraScenario& camera) {
    constexpr std::uint16_t ChangedAt100[] = {5, 7, 12, 13, 14};
    constexpr std::uint16_t ChangedAt6 = 6;
    const auto* end = std::end(ChangedAt100);
    const bool isOld =
        (camera.modelId == ChangedAt6 && camera.firmwareVersion < 6) ||
        (std::find(ChangedAt100, end, camera.modelId) != end && camera.firmwareVersion < 100);
    return isOld ? 1 : GetModel(camera.modelId).boardType;
}

// Response in dB of the board whose curve has four straight pieces.
double GetCurveDb(double dac) {
    if (dac <= 500) return dac * 7.518e-6;
    if (dac <= 3500) return (dac - 500) * 0.007517812 + 0.003759;
    if (dac <= 4000) return (dac - 3500) * 0.016678944 + 22.557195;
    return (dac - 4000) * 7.518e-6 + 30.896667;
}

double GetLinearDb(const Request& request, double dac) {
    const bool hasSpan = request.camera.versions.configuration >= MakeVersion(2, 4);
    const double step =
        hasSpan ? request.configuration[ConfigGainSpan] / 1e9 : OldLinearSpanDb / GainDacRange;
    return dac * step;
}

double GetRatioDb(const Request& request) {
    const std::uint32_t gain = request.Control(ControlRatioGain);
    const std::uint32_t unity = request.Config(ConfigRatioGainDefault);
    return gain == 0 || unity == 0 ? 0 : 20 * std::log10(double(gain) / unity);
}

double GetBoardDb(const Request& request) {
    const double dac = request.Control(ControlGain);
    const double unity = request.Config(ConfigGainDefault);
    const std::uint32_t board = GetBoardType(request.camera);
    if (board == 1) return GetCurveDb(dac) - GetCurveDb(unity);
    if (board == 2) return GetLinearDb(request, dac) - GetLinearDb(request, unity);
    return GetRatioDb(request);
}

double GetGainDb(const Request& request) {
    double gain = GetBoardDb(request);
    if (request.camera.modelId == ModelSolvaneK1) {
        const double minimum = request.Config(ConfigIntensifierMin);
        gain += (request.Control(ControlIntensifierGain) - minimum) * IntensifierDbPerStep;
    }
    return std::isfinite(gain) ? std::clamp(gain, -200.0, 200.0) : 0;
}

std::int32_t GetOffset(const Request& request) {
    if (GetBoardType(request.camera) == 3) {
        return static_cast<std::int32_t>(request.Control(ControlRatioOffset) / 4);
    }
    return static_cast<std::int32_t>(request.Control(ControlOffset));
}

std::uint32_t GetBitDepth(const Request& request) {
    constexpr std::uint32_t FixedDepths[] = {8, 0, 12, 14};
    if (request.camera.modelId == ModelMetrona) return 16;
    const std::uint32_t depth = FixedDepths[request.Control(ControlBitDepth)];
    return depth != 0 ? depth : request.Config(ConfigMaxBitDepthMinusOne) + 1;
}

struct BinningState {
    std::uint32_t x = 1, y = 1;
    std::uint32_t maxWidth, maxHeight;  // Of an image at this binning.
};

BinningState GetSymmetricalBinning(const Request& request) {
    constexpr RegisterField Widths[] = {ConfigSensorWidth, ConfigWidthBinning2,
                                        ConfigWidthBinning3Or8, ConfigWidthBinning4};
    constexpr RegisterField Heights[] = {ConfigSensorHeight, ConfigHeightBinning2,
                                         ConfigHeightBinning3Or8, ConfigHeightBinning4};
    const bool isMode8 = request.camera.versions.configuration >= MakeVersion(2, 2) &&
                         request.Config(ConfigBinningCode2Is8) != 0;
    const std::uint32_t modes[] = {1, 2, isMode8 ? 8u : 3u, 4};
    const std::uint32_t code = request.Control(ControlBinning);
    return {modes[code], modes[code], request.Config(Widths[code]), request.Config(Heights[code])};
}

BinningState GetSeparateBinning(const Request& request) {
    const std::uint32_t x = request.Control(ControlHorizontalBinningMinusOne) + 1;
    const std::uint32_t y = request.Control(ControlVerticalBinningMinusOne) + 1;
    return {x, y, request.Config(ConfigSensorWidth) / x,
            std::max(1u, request.Config(ConfigSensorHeight) / y)};
}

// Rows are added, columns never: the image keeps its width.
BinningState GetVerticalBinning(const Request& request) {
    const bool isVideo = request.Control(ControlRtvMode) != 0;
    const std::uint32_t mode = (request.Control(ControlVerticalBinningMinusOne) + 1) *
                               (isVideo ? request.camera.sensor.videoBinning : 1);
    return {1, mode, request.Config(ConfigSensorWidth) / (2 * mode) * mode * 2,
            request.Config(ConfigSensorHeight) / mode & ~1u};
}

BinningState GetBinning(const Request& request) {
    if (request.camera.modelId == ModelMetrona) return GetSeparateBinning(request);
    if (request.camera.modelId == ModelFolary) return GetVerticalBinning(request);
    return GetSymmetricalBinning(request);
}

// A turned image counts its origin from the far corner, in pixels of the sensor or of the image,
// whichever puts it on the sensor.
std::uint32_t TurnOrigin(std::uint32_t origin, std::uint32_t size, std::uint32_t sensorSize,
                         std::uint32_t binning) {
    const std::uint32_t binnedSize = sensorSize / binning;
    if (origin + size <= binnedSize) return binnedSize - origin - size;
    return origin + size <= sensorSize ? sensorSize - origin - size : 0;
}

void SetGeometry(const Request& request, ExposureSettings* exposure) {
    const BinningState binning = GetBinning(request);
    exposure->binningX = binning.x;
    exposure->binningY = binning.y;
    exposure->width = request.Control(ControlRoiWidth);
    exposure->height = request.Control(ControlRoiHeight);
    if (binning.x > 1) exposure->width = std::min(exposure->width, binning.maxWidth);
    if (binning.y > 1) exposure->height = std::min(exposure->height, binning.maxHeight);
    exposure->roiX = request.Control(ControlRoiX);
    exposure->roiY = request.Control(ControlRoiY);
    exposure->isRotated = request.camera.streamingVersion == 2;
    if (!exposure->isRotated) return;
    const SensorDescription& sensor = request.camera.sensor;
    exposure->roiX = TurnOrigin(exposure->roiX, exposure->width, sensor.width, binning.x);
    exposure->roiY = TurnOrigin(exposure->roiY, exposure->height, sensor.height, binning.y);
}

}  // namespace

CameraSettings DecodeSettings(const CameraScenario& camera, const Quadlets& control,
                              const Quadlets& configuration) {
    const Request request{camera, control, configuration};
    CameraSettings settings;
    SetGeometry(request, &settings.exposure);
    settings.exposure.bitDepth = GetBitDepth(request);
    settings.exposure.isBigEndian = request.Control(ControlLittleEndian) == 0;
    settings.exposure.exposureNs = ReadExposure(request, ControlExposure, ControlExposureLow);
    settings.exposure.gainDb = GetGainDb(request);
    settings.exposure.offset = GetOffset(request);
    settings.redExposureNs = ReadExposure(request, ControlRedExposure, ControlRedExposureLow);
    settings.blueExposureNs = ReadExposure(request, ControlBlueExposure, ControlBlueExposureLow);
    settings.triggerType = request.Control(ControlTriggerType);
    settings.psn = request.Control(ControlPsn);
    settings.isCycling =
        camera.sensor.colourKind == ColourKind::Mono && request.Control(ControlFilterCycle) != 0;
    settings.startColour = request.Control(ControlFilterStartColour);
    settings.isInterlaced = camera.modelId == ModelFolary && request.Control(ControlRtvMode) == 0;
    if (camera.versions.control >= VersionPacketSizeControl) {
        settings.maxPacketBytes = request.Control(ControlMaxPacketSize);
    }
    return settings;
}

double ConvertTemperatureCode(std::uint32_t code) {
    return code * (105.0 / 4096.0) - 55.0;
}

}  // namespace ZV::Simulation
