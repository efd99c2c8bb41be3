#include "simulation/configuration.h"

#include <string>

#include "camera/register_map.h"

namespace ZV::Simulation {
namespace {

constexpr std::uint64_t MinExposureNs = 10000;
constexpr std::uint64_t MaxExposureNs = 3'600'000'000'000;
// dB per DAC step in billionths: 34.15 dB over 4096 steps of the linear board.
constexpr std::uint32_t GainSpanLinear = 8337793;
constexpr std::uint32_t ConfigFeatures = 169;

class Block {
  public:
    Block() : quadlets(BlockQuadlets) {}

    void Set(std::uint32_t quadlet, std::uint32_t value) { quadlets[quadlet] = value; }
    void Set(const RegisterField& field, std::uint32_t value) {
        quadlets[field.quadlet] = InsertField(field, quadlets[field.quadlet], value);
    }

    std::vector<std::uint32_t> quadlets;
};

struct FieldValue {
    RegisterField field;
    std::uint32_t value;
};

// The same for every model; each lies in blocks of its version and above.
constexpr FieldValue CommonFields[] = {
    {ConfigOffsetDefault, 16},
    {ConfigGainMin, 0},
    {ConfigGainMax, 4095},
    {ConfigOffsetMin, 0},
    {ConfigOffsetMax, 4095},
    {ConfigSubDefault, 40000},
    // -40 and 30 degrees C.
    {ConfigTemperatureMin, 585},
    {ConfigTemperatureMax, 3315},
    {ConfigEMGainDefault, 10},
    {ConfigCloseDelayDefault, 100},
    {ConfigRatioGainDefault, 64},
    {ConfigRatioGainMin, 16},
    {ConfigRatioGainMax, 255},
    {ConfigRatioOffsetDefault, 64},
    {ConfigRatioOffsetMin, 0},
    {ConfigRatioOffsetMax, 16383},
    {ConfigEMGainMin, 0},
    {ConfigEMGainMax, 1023},
    {ConfigCalibrationGainDefault, 1},
    {ConfigVClockDefault, 80},
    {ConfigVClockMin, 20},
    {ConfigVClockMax, 400},
    {ConfigTweakDefaults[0], 100},
    {ConfigTweakDefaults[1], 110},
    {ConfigTweakDefaults[2], 120},
    {ConfigTweakDefaults[3], 130},
    {ConfigTweakDefaults[4], 140},
    {ConfigTweakDefaults[5], 150},
    {ConfigTweakDefaults[6], 4},
};

void SetExposureLimits(Block* block, std::uint32_t version) {
    if (version < MakeVersion(2, 0)) {
        block->Set(ConfigMinExposure, MinExposureNs / 1000);
        block->Set(ConfigMaxExposure, static_cast<std::uint32_t>(MaxExposureNs / 1000));
        return;
    }
    block->Set(ConfigMinExposure, 0);
    block->Set(ConfigMinExposureLow, MinExposureNs);
    block->Set(ConfigMaxExposure, static_cast<std::uint32_t>(MaxExposureNs >> 32));
    block->Set(ConfigMaxExposureLow, static_cast<std::uint32_t>(MaxExposureNs));
    block->Set(ConfigExposureResolution, 1000);
}

void SetSizes(Block* block, const CameraScenario& camera, const ModelRow& model) {
    const std::uint32_t width = camera.sensor.width, height = camera.sensor.height;
    block->Set(ConfigSensorWidth, width);
    block->Set(ConfigSensorHeight, height);
    block->Set(ConfigWidthBinning2, width / 2);
    block->Set(ConfigHeightBinning2, height / 2);
    const std::uint32_t code2 = model.isBinningCode2Mode8 ? 8 : 3;
    block->Set(ConfigWidthBinning3Or8, width / code2);
    block->Set(ConfigHeightBinning3Or8, height / code2);
    block->Set(ConfigWidthBinning4, width / 4);
    block->Set(ConfigHeightBinning4, height / 4);
    block->Set(ConfigBinningCode2Is8, model.isBinningCode2Mode8);
    block->Set(ConfigMaxBitDepthMinusOne, camera.sensor.maxBitDepth - 1);
}

void SetSerial(Block* block, const std::string& serial) {
    for (std::uint32_t i = 0; i < ConfigSerialQuadlets * 4; ++i) {
        const std::uint32_t character =
            i < serial.size() ? static_cast<std::uint8_t>(serial[i]) : 0;
        const RegisterField field{static_cast<std::uint16_t>(ConfigSerialFirst + i / 4),
                                  static_cast<std::uint8_t>(24 - 8 * (i % 4)), 8};
        block->Set(field, character);
    }
}

void SetIdentity(Block* block, const CameraScenario& camera, const ModelRow& model) {
    block->Set(ConfigUniqueIdHigh, static_cast<std::uint32_t>(camera.uniqueId >> 32));
    block->Set(ConfigUniqueIdLow, static_cast<std::uint32_t>(camera.uniqueId));
    block->Set(ConfigModel, camera.modelId);
    block->Set(ConfigHardwareVersion, 3);
    block->Set(ConfigFirmwareVersion, camera.firmwareVersion);
    block->Set(ConfigFirmwareBuild, camera.firmwareBuild);
    block->Set(ConfigColourKind, static_cast<std::uint32_t>(camera.sensor.colourKind));
    block->Set(ConfigSensorModel, camera.sensorId);
    block->Set(ConfigHardwareProfile, model.boardType == 3 ? 2 : 1);
    SetSerial(block, camera.serial);
}

void SetModelParts(Block* block, const ModelRow& model) {
    // A boards' default well above its minimum leaves room for less gain as well as for more.
    block->Set(ConfigGainDefault, 600);
    block->Set(ConfigGainSpan, GainSpanLinear);
    block->Set(ConfigCooler, (model.features & (1u << ConfigRegulatedCooling.firstBit)) != 0);
    block->Set(ConfigFeatures, model.features);
    block->Set(ConfigVClockResolution, 40'000'000);
    block->Set(ConfigTriggerDelayMax, 1'000'000'000);
    block->Set(ConfigTriggerDelayMin, 0);
    block->Set(ConfigTriggerDelayResolution, 1000);
    if (model.id == ModelSolvaneK1) {
        block->Set(ConfigIntensifierModel, 1);
        block->Set(ConfigIntensifierMin, 100);
        block->Set(ConfigIntensifierMax, 3000);
    }
    if (model.id == ModelFolary) {
        block->Set(ConfigRtvMode, 1);
        block->Set(ConfigWidthBinning2, 640);
        block->Set(ConfigHeightBinning2, 480);
    }
}

}  // namespace

std::vector<std::uint32_t> MakeConfiguration(const CameraScenario& camera) {
    const ModelRow& model = GetModel(camera.modelId);
    Block block;
    block.Set(0, camera.versions.configuration);
    for (const FieldValue& row : CommonFields) block.Set(row.field, row.value);
    SetExposureLimits(&block, camera.versions.configuration);
    SetSizes(&block, camera, model);
    SetIdentity(&block, camera, model);
    SetModelParts(&block, model);
    block.Set(ConfigStreamingVersion, camera.streamingVersion);
    for (const auto& [quadlet, value] : camera.configuration) {
        if (quadlet < BlockQuadlets) block.Set(quadlet, value);
    }
    return block.quadlets;
}

}  // namespace ZV::Simulation
