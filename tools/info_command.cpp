#include <fmt/format.h>

#include <array>
#include <nlohmann/json.hpp>
#include <string>

#include "commands.h"
#include "driver.h"
#include "output.h"

namespace ZentaraProgram {
namespace {

struct InfoRow {
    std::uint32_t key;
    const char* name;
    const char* label;
};

// In the order of the keys; those without a meaning are left out.
constexpr std::array InfoRows{
    InfoRow{zinfCameraType, "cameraType", "Camera type"},
    InfoRow{zinfHardwareVersion, "hardwareVersion", "Hardware version"},
    InfoRow{zinfFirmwareVersion, "firmwareVersion", "Firmware version"},
    InfoRow{zinfCcd, "ccd", "Sensor id"},
    InfoRow{zinfBitDepth, "bitDepth", "Maximum bit depth"},
    InfoRow{zinfCooled, "cooled", "Cooled"},
    InfoRow{zinfImageWidth, "imageWidth", "Image width, pixels"},
    InfoRow{zinfImageHeight, "imageHeight", "Image height, pixels"},
    InfoRow{zinfImageSize, "imageSize", "Image size, bytes"},
    InfoRow{zinfCcdType, "ccdType", "Sensor kind (0 mono, 1 Bayer)"},
    InfoRow{zinfCcdWidth, "ccdWidth", "Sensor width, pixels"},
    InfoRow{zinfCcdHeight, "ccdHeight", "Sensor height, pixels"},
    InfoRow{zinfFirmwareBuild, "firmwareBuild", "Firmware build"},
    InfoRow{zinfUniqueId, "uniqueId", "Unique id, low half"},
    InfoRow{zinfIsModelB, "isModelB", "Model B"},
    InfoRow{zinfIntensifierModel, "intensifierModel", "Intensifier model"},
    InfoRow{zinfExposureRes, "exposureResolution", "Exposure resolution, ns"},
    InfoRow{zinfTriggerDelayRes, "triggerDelayResolution", "Trigger delay resolution, ns"},
    InfoRow{zinfStreamVersion, "streamVersion", "Streaming version"},
    InfoRow{zinfNormGainSigFigs, "normGainSigFigs", "Gain, significant figures"},
    InfoRow{zinfNormGaindBRes, "normGaindBResolution", "Gain resolution, millionths of a dB"},
    InfoRow{zinfNormITGainSigFigs, "normIntensifierGainSigFigs",
            "Intensifier gain, significant figures"},
    InfoRow{zinfNormITGaindBRes, "normIntensifierGaindBResolution",
            "Intensifier gain resolution, millionths of a dB"},
    InfoRow{zinfRegulatedCooling, "regulatedCooling", "Regulated cooling"},
    InfoRow{zinfRegulatedCoolingLock, "regulatedCoolingLock", "Cooling has reached its target"},
    InfoRow{zinfFanControl, "fanControl", "Fan control"},
    InfoRow{zinfHighSensitivityMode, "highSensitivityMode", "High sensitivity mode"},
    InfoRow{zinfBlackoutMode, "blackoutMode", "Blackout mode"},
    InfoRow{zinfPostProcessImageSize, "postProcessImageSize",
            "Size of a post-processed image, bytes"},
    InfoRow{zinfAsymmetricalBinning, "asymmetricalBinning", "Separate binning of the axes"},
    InfoRow{zinfEMGain, "emGain", "Electron-multiplying gain"},
    InfoRow{zinfCloseDelay, "closeDelay", "Shutter close delay"},
    InfoRow{zinfColorWheelSupported, "colorWheel", "Colour wheel"},
};

void PrintInfo(const Camera& camera) {
    Print(fmt::format("{:<40} {}\n", "Model", camera.GetModelName()));
    Print(fmt::format("{:<40} {}\n", "Serial number", camera.GetSerialNumber()));
    for (const InfoRow& row : InfoRows) {
        const auto value = camera.GetInfo(row.key);
        Print(fmt::format("{:<40} {}\n", row.label, value ? std::to_string(*value) : "-"));
    }
}

nlohmann::json GetInfoAsJson(const Camera& camera) {
    nlohmann::json info{{"model", camera.GetModelName()},
                        {"serialNumber", camera.GetSerialNumber()}};
    for (const InfoRow& row : InfoRows) {
        const auto value = camera.GetInfo(row.key);
        info[row.name] = value ? nlohmann::json(*value) : nlohmann::json(nullptr);
    }
    return info;
}

}  // namespace

ExitCode RunInfo(const CommonOptions& common) {
    Driver driver;
    Camera camera;
    std::uint32_t uniqueId = 0;
    const ExitCode opened = OpenListedCamera(driver, common.camera, &camera, &uniqueId);
    if (opened != ExitDone) return opened;
    if (common.asJson) {
        PrintJson(GetInfoAsJson(camera));
    } else {
        PrintInfo(camera);
    }
    return ExitDone;
}

}  // namespace ZentaraProgram
