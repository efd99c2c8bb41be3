#include <algorithm>
#include <array>
#include <cstdint>
#include <cstring>
#include <mutex>
#include <vector>

#include "camera/morvane_fw_camera.h"
#include "camera/setting_codes.h"
#include "models/sensor_table.h"

/// Readings of the host copies of the registers. None but the temperature lock asks the camera.
namespace ZV {

namespace {

constexpr std::uint32_t GreatestDac = 4095;
constexpr std::uint32_t ColourKindBayer = 1;
constexpr std::uint16_t FormatMono = 1;
constexpr std::uint16_t FormatBayer = 2;
constexpr std::uint32_t FormatFilterWheel = 3;
constexpr std::uint32_t LastBaseTriggerMode = 5;
constexpr std::uint32_t GreatestCloseDelay = 26208;

constexpr std::uint64_t Join(std::uint32_t high, std::uint32_t low) {
    return static_cast<std::uint64_t>(high) << 32 | low;
}

/// A register of exposure: microseconds at major 1, else the upper half of nanoseconds.
constexpr std::uint64_t ConvertExposure(std::uint32_t major, std::uint32_t first,
                                        std::uint32_t low) {
    return major == 1 ? static_cast<std::uint64_t>(first) * 1000 : Join(first, low);
}

struct SizeFields {
    std::uint32_t mode;
    RegisterField width;
    RegisterField height;
};
constexpr SizeFields FullSize{1, ConfigSensorWidth, ConfigSensorHeight};
constexpr SizeFields BinnedSizes[] = {{2, ConfigWidthBinning2, ConfigHeightBinning2},
                                      {3, ConfigWidthBinning3Or8, ConfigHeightBinning3Or8},
                                      {4, ConfigWidthBinning4, ConfigHeightBinning4},
                                      {8, ConfigWidthBinning3Or8, ConfigHeightBinning3Or8}};

/// Those of mode 1 for a mode that no register describes.
const SizeFields& FindSizeFields(std::uint32_t mode) {
    for (const SizeFields& row : BinnedSizes) {
        if (row.mode == mode) return row;
    }
    return FullSize;
}

}  // namespace

std::uint32_t MorvaneFWCamera::GetModel() {
    return ReadConfigurationField(ConfigModel);
}

std::uint32_t MorvaneFWCamera::GetROIX() {
    return ReadControlField(ControlRoiX);
}

std::uint32_t MorvaneFWCamera::GetROIY() {
    return ReadControlField(ControlRoiY);
}

std::uint32_t MorvaneFWCamera::GetROIWidth() {
    return ReadControlField(ControlRoiWidth);
}

std::uint32_t MorvaneFWCamera::GetROIHeight() {
    return ReadControlField(ControlRoiHeight);
}

std::uint32_t MorvaneFWCamera::GetBitDepth() {
    const std::uint32_t depths[] = {8, GetMaxBitDepth(), 12, 14};
    return depths[ReadControlField(ControlBitDepth)];
}

std::uint32_t MorvaneFWCamera::GetPSN() {
    return ReadControlField(ControlPsn);
}

std::uint64_t MorvaneFWCamera::GetExposure() {
    return ConvertExposure(registers.control.major, ReadControl(ControlExposure),
                           ReadControl(ControlExposureLow));
}

std::uint32_t MorvaneFWCamera::GetImageFormat() {
    const std::uint16_t sensorFormat = GetCCDImageFormat();
    if (sensorFormat == FormatMono && GetRGBFilterCycleMode()) return FormatFilterWheel;
    if (sensorFormat == FormatBayer && GetSymmetricalBinningMode() > 1) return FormatMono;
    return sensorFormat;
}

std::uint32_t MorvaneFWCamera::GetFirmwareVersion() {
    return ReadConfigurationField(ConfigFirmwareVersion);
}

bool MorvaneFWCamera::GetCoolerStatus() {
    return ReadControlField(ControlCooler) != 0;
}

std::uint16_t MorvaneFWCamera::GetSymmetricalBinningMode() {
    return ConvertCodeToBinning(ReadControlField(ControlBinning),
                                ReadConfigurationField(ConfigBinningCode2Is8) != 0);
}

std::uint32_t MorvaneFWCamera::GetCCDWidth() {
    return ReadConfigurationField(ConfigSensorWidth);
}

std::uint32_t MorvaneFWCamera::GetCCDHeight() {
    return ReadConfigurationField(ConfigSensorHeight);
}

std::uint16_t MorvaneFWCamera::GetHardwareProfile() {
    const std::uint32_t profile = ReadConfigurationField(ConfigHardwareProfile);
    return static_cast<std::uint16_t>(profile <= 3 ? profile : 0);
}

std::uint32_t MorvaneFWCamera::GetHardwareVersion() {
    if (CheckConfigRegVersion(2, 9)) return GetHardwareProfile();
    return ReadConfigurationField(ConfigHardwareVersion);
}

std::uint32_t MorvaneFWCamera::GetFirmwareBuildNumber() {
    return ReadConfigurationField(ConfigFirmwareBuild);
}

bool MorvaneFWCamera::GetRGBFilterCycleMode() {
    return ReadControlField(ControlFilterCycle) != 0;
}

std::uint16_t MorvaneFWCamera::GetStreamingVersion() {
    return static_cast<std::uint16_t>(ReadConfigurationField(ConfigStreamingVersion));
}

float MorvaneFWCamera::GetReadoutFrequency() {
    return ConvertCodeToFrequency(ReadControlField(ControlReadoutFrequency));
}

float MorvaneFWCamera::GetReadoutFrequencyMin() {
    std::vector<float> modes;
    GetReadoutFrequencyModes(modes);
    return modes.empty() ? 0.0F : *std::min_element(modes.begin(), modes.end());
}

float MorvaneFWCamera::GetReadoutFrequencyMax() {
    std::vector<float> modes;
    GetReadoutFrequencyModes(modes);
    return modes.empty() ? 0.0F : *std::max_element(modes.begin(), modes.end());
}

void MorvaneFWCamera::GetReadoutFrequencyModes(std::vector<float>& modes) {
    modes.insert(modes.end(), {2.5F, 5.0F, 10.0F, 20.0F});
}

std::uint32_t MorvaneFWCamera::GetImageWidth() {
    const std::uint16_t mode = GetSymmetricalBinningMode();
    if (mode <= 1) return GetROIWidth();
    return std::min(GetROIWidth(), GetMaxCCDWidthForBinningMode(mode));
}

std::uint32_t MorvaneFWCamera::GetImageHeight() {
    const std::uint16_t mode = GetSymmetricalBinningMode();
    if (mode <= 1) return GetROIHeight();
    return std::min(GetROIHeight(), GetMaxCCDHeightForBinningMode(mode));
}

std::uint32_t MorvaneFWCamera::GetImageSize() {
    return GetImageWidth() * GetImageHeight() * (GetBitDepth() > 8 ? 2 : 1);
}

bool MorvaneFWCamera::GetBigEndian() {
    return ReadControlField(ControlLittleEndian) == 0;
}

std::uint32_t MorvaneFWCamera::GetCompression() {
    return ReadControlField(ControlCompression);
}

std::uint32_t MorvaneFWCamera::GetMaxBitDepth() {
    return ReadConfigurationField(ConfigMaxBitDepthMinusOne) + 1;
}

std::uint64_t MorvaneFWCamera::GetMinExposure() {
    return ConvertExposure(registers.configuration.major, ReadConfiguration(ConfigMinExposure),
                           ReadConfiguration(ConfigMinExposureLow));
}

std::uint64_t MorvaneFWCamera::GetMaxExposure() {
    return ConvertExposure(registers.configuration.major, ReadConfiguration(ConfigMaxExposure),
                           ReadConfiguration(ConfigMaxExposureLow));
}

std::int32_t MorvaneFWCamera::GetOffset() {
    return static_cast<std::int32_t>(ReadControlField(ControlOffset));
}

std::int32_t MorvaneFWCamera::GetOffsetDefault() {
    return static_cast<std::int32_t>(ReadConfigurationField(ConfigOffsetDefault));
}

std::uint32_t MorvaneFWCamera::GetGainOffsetDefault() {
    return ReadConfigurationField(ConfigOffsetDefault);
}

std::int32_t MorvaneFWCamera::GetOffsetMin() {
    return static_cast<std::int32_t>(ReadConfigurationField(ConfigOffsetMin));
}

std::int32_t MorvaneFWCamera::GetOffsetMax() {
    if (!CheckConfigRegVersion(2, 0)) return GreatestDac;
    return static_cast<std::int32_t>(ReadConfigurationField(ConfigOffsetMax));
}

std::int32_t MorvaneFWCamera::GetAbsoluteOffset() {
    return GetOffset() - GetOffsetDefault();
}

std::int32_t MorvaneFWCamera::GetAbsoluteOffsetMin() {
    return GetOffsetMin() - GetOffsetDefault();
}

std::int32_t MorvaneFWCamera::GetAbsoluteOffsetMax() {
    return GetOffsetMax() - GetOffsetDefault();
}

std::uint32_t MorvaneFWCamera::GetTriggerMode() {
    return FindTriggerMode(
        {ReadControlField(ControlTriggerType), ReadControlField(ControlTriggerPolarity)});
}

std::uint64_t MorvaneFWCamera::GetRGBFilterRedExposure() {
    return ConvertExposure(registers.control.major, ReadControl(ControlRedExposure),
                           ReadControl(ControlRedExposureLow));
}

std::uint64_t MorvaneFWCamera::GetRGBFilterBlueExposure() {
    return ConvertExposure(registers.control.major, ReadControl(ControlBlueExposure),
                           ReadControl(ControlBlueExposureLow));
}

std::uint32_t MorvaneFWCamera::GetSyncBMode() {
    return ReadControlField(ControlSyncB);
}

std::uint32_t MorvaneFWCamera::GetTriggerDelay() {
    return ReadControl(ControlTriggerDelay);
}

std::uint32_t MorvaneFWCamera::GetTriggerDelayMin() {
    return ReadConfiguration(ConfigTriggerDelayMin);
}

std::uint32_t MorvaneFWCamera::GetTriggerDelayMax() {
    return ReadConfiguration(ConfigTriggerDelayMax);
}

std::uint32_t MorvaneFWCamera::GetFanSpeed() {
    constexpr std::uint32_t FanAutomatic = 4;
    if (!IsFanControlAvailable()) return FanAutomatic;
    const std::uint32_t speed = ReadControlField(ControlFanSpeed);
    return speed >= 1 && speed <= 3 ? speed : FanAutomatic;
}

bool MorvaneFWCamera::GetBlackoutMode() {
    return IsBlackoutModeAvailable() && ReadControlField(ControlBlackout) != 0;
}

bool MorvaneFWCamera::GetHighSensitivityMode() {
    return IsHighSensitivityModeAvailable() && ReadControlField(ControlHighSensitivity) != 0;
}

void MorvaneFWCamera::GetSyncBModes(std::vector<std::uint32_t>& modes) {
    modes.insert(modes.end(), {0, 1});
}

void MorvaneFWCamera::GetTriggerModes(std::vector<std::uint32_t>& modes) {
    AppendTriggerModes(LastBaseTriggerMode, GetRGBFilterCycleMode(), modes);
}

std::int32_t MorvaneFWCamera::GetMinRegulatedCoolingTemp() {
    if (!IsRegulatedCoolingAvailable()) return 0;
    return ConvertTemperatureCode(ReadConfigurationField(ConfigTemperatureMin));
}

std::int32_t MorvaneFWCamera::GetMaxRegulatedCoolingTemp() {
    if (!IsRegulatedCoolingAvailable()) return 0;
    return ConvertTemperatureCode(ReadConfigurationField(ConfigTemperatureMax));
}

std::uint32_t MorvaneFWCamera::GetCCDModel() {
    return ReadConfigurationField(ConfigSensorModel);
}

const char* MorvaneFWCamera::GetCCDModelString() {
    return GetSensorName(GetCCDModel());
}

std::uint32_t MorvaneFWCamera::GetExposureResolution() {
    constexpr std::uint32_t Microsecond = 1000;
    return CheckConfigRegVersion(2, 0) ? ReadConfiguration(ConfigExposureResolution) : Microsecond;
}

std::uint32_t MorvaneFWCamera::GetTriggerDelayResolution() {
    return ReadConfiguration(ConfigTriggerDelayResolution);
}

const char* MorvaneFWCamera::GetSerialNumberString() {
    const bool isReversed = !GetBigEndian();
    std::array<char, ConfigSerialQuadlets * sizeof(std::uint32_t)> text{};
    for (std::uint32_t index = 0; index < ConfigSerialQuadlets; ++index) {
        const std::uint32_t quadlet = ReadConfiguration(ConfigSerialFirst + index);
        char* const bytes = &text[index * sizeof quadlet];
        std::memcpy(bytes, &quadlet, sizeof quadlet);
        if (isReversed) std::reverse(bytes, bytes + sizeof quadlet);
    }
    // Stored only when it differs: other threads may be reading what they were given.
    const std::lock_guard hold(serialMutex);
    if (std::memcmp(serialText.data(), text.data(), text.size()) != 0) {
        std::memcpy(serialText.data(), text.data(), text.size());
    }
    return serialText.data();
}

bool MorvaneFWCamera::GetRegulatedCoolingTemperatureLock() {
    if (!IsRegulatedCoolingAvailable()) return false;
    // Kept: the camera is asked anew each time, and a failure leaves the answer of the last time.
    (void)ReadRegisterSet(registers.status);
    const std::uint32_t status = registers.status.Read(StatusTemperature);
    return (status & StatusTemperatureLocked) == StatusTemperatureLocked;
}

std::int32_t MorvaneFWCamera::GetRegulatedCoolingTemperature() {
    if (!IsRegulatedCoolingAvailable()) return 0;
    return ConvertTemperatureCode(ReadControlField(ControlTemperature));
}

std::uint16_t MorvaneFWCamera::GetCCDImageFormat() {
    const std::uint32_t kind = ReadConfigurationField(ConfigColourKind);
    if (kind == 0) return FormatMono;
    return kind == ColourKindBayer ? FormatBayer : 0;
}

std::uint16_t MorvaneFWCamera::GetRGBFilterStartColour() {
    return static_cast<std::uint16_t>(ReadControlField(ControlFilterStartColour));
}

std::uint64_t MorvaneFWCamera::GetUniqueID() {
    return Join(ReadConfiguration(ConfigUniqueIdHigh), ReadConfiguration(ConfigUniqueIdLow));
}

std::uint16_t MorvaneFWCamera::GetIntensifierModel() {
    return static_cast<std::uint16_t>(ReadConfigurationField(ConfigIntensifierModel));
}

bool MorvaneFWCamera::GetDoubleShotMode() {
    return IsDoubleShotSupported() && ReadControlField(ControlDoubleShot) != 0;
}

std::uint32_t MorvaneFWCamera::GetEMGain() {
    return IsEMGainAvailable() ? GetEMGainMax() - ReadControlField(ControlEMGain) : 0;
}

std::uint32_t MorvaneFWCamera::GetEMGainDefault() {
    return IsEMGainAvailable() ? ReadConfigurationField(ConfigEMGainDefault) : 0;
}

std::uint32_t MorvaneFWCamera::GetEMGainDefaultWithFlip() {
    return GetEMGainMax() - GetEMGainDefault();
}

std::uint32_t MorvaneFWCamera::GetEMGainMin() {
    return ReadConfigurationField(ConfigEMGainMin);
}

std::uint32_t MorvaneFWCamera::GetEMGainMax() {
    return ReadConfigurationField(ConfigEMGainMax);
}

bool MorvaneFWCamera::GetDitherMode() {
    return IsDitherControlAvailable() && ReadControlField(ControlDither) != 0;
}

bool MorvaneFWCamera::GetHighGainMode() {
    return IsHighGainModeAvailable() && ReadControlField(ControlHighGain) != 0;
}

bool MorvaneFWCamera::GetDitherModeDefault() {
    return IsDitherControlAvailable() && ReadConfigurationField(ConfigDitherDefault) != 0;
}

bool MorvaneFWCamera::GetHighGainModeDefault() {
    return IsHighGainModeAvailable() && ReadConfigurationField(ConfigHighGainDefault) != 0;
}

std::uint32_t MorvaneFWCamera::GetChan1CalibrationGainDefault() {
    return GetHardwareProfile() < 2 ? 0 : ReadConfigurationField(ConfigCalibrationGainDefault);
}

std::uint32_t MorvaneFWCamera::GetChan1CalibrationGain() {
    return GetHardwareProfile() < 2 ? 0 : ReadControlField(ControlCalibrationGain);
}

std::uint32_t MorvaneFWCamera::GetVClockFrequencyResolution() {
    return IsVClockControlAvailable() ? ReadConfiguration(ConfigVClockResolution) : 0;
}

// Without vertical clock control the resolution is 0, and with it every period.
std::uint32_t MorvaneFWCamera::GetVClockPeriodDefault() {
    return ConvertVClockCount(ReadConfigurationField(ConfigVClockDefault),
                              GetVClockFrequencyResolution());
}

std::uint32_t MorvaneFWCamera::GetVClockPeriodMin() {
    return ConvertVClockCount(ReadConfigurationField(ConfigVClockMin),
                              GetVClockFrequencyResolution());
}

std::uint32_t MorvaneFWCamera::GetVClockPeriodMax() {
    return ConvertVClockCount(ReadConfigurationField(ConfigVClockMax),
                              GetVClockFrequencyResolution());
}

std::uint32_t MorvaneFWCamera::GetVClockPeriod() {
    return ConvertVClockCount(ReadControlField(ControlVClock), GetVClockFrequencyResolution());
}

std::uint32_t MorvaneFWCamera::GetShutterCloseDelay() {
    if (!IsShutterCloseDelayAvailable()) return 0;
    return ConvertCloseDelayCode(ReadControlField(ControlCloseDelay));
}

std::uint32_t MorvaneFWCamera::GetShutterCloseDelayDefault() {
    if (!IsShutterCloseDelayAvailable()) return 0;
    return ConvertCloseDelayCode(ReadConfigurationField(ConfigCloseDelayDefault));
}

std::uint32_t MorvaneFWCamera::GetShutterCloseDelayMin() {
    return 0;
}

std::uint32_t MorvaneFWCamera::GetShutterCloseDelayMax() {
    return IsShutterCloseDelayAvailable() ? GreatestCloseDelay : 0;
}

std::uint32_t MorvaneFWCamera::GetMaxCCDWidthForBinningMode(std::uint32_t mode) {
    return ReadConfigurationField(FindSizeFields(mode).width);
}

std::uint32_t MorvaneFWCamera::GetMaxCCDHeightForBinningMode(std::uint32_t mode) {
    return ReadConfigurationField(FindSizeFields(mode).height);
}

std::uint16_t MorvaneFWCamera::GetPixelSize() {
    return GetSensorPixelSize(GetCCDModel());
}

std::uint32_t MorvaneFWCamera::GetFullWellCapacity() {
    return GetSensorFullWell(GetCCDModel());
}

std::uint32_t MorvaneFWCamera::GetSubDefAd() {
    return ReadConfigurationField(ConfigSubDefault);
}

std::uint32_t MorvaneFWCamera::GetSubCpDefAd() {
    return ReadConfigurationField(ConfigTweakDefaults[0]);
}

std::uint32_t MorvaneFWCamera::GetResetVhDefAd() {
    return ReadConfigurationField(ConfigTweakDefaults[1]);
}

std::uint32_t MorvaneFWCamera::GetV1VmDefAd() {
    return ReadConfigurationField(ConfigTweakDefaults[2]);
}

std::uint32_t MorvaneFWCamera::GetV2VmDefAd() {
    return ReadConfigurationField(ConfigTweakDefaults[3]);
}

std::uint32_t MorvaneFWCamera::GetV3VmDefAd() {
    return ReadConfigurationField(ConfigTweakDefaults[4]);
}

std::uint32_t MorvaneFWCamera::GetV4VmDefAd() {
    return ReadConfigurationField(ConfigTweakDefaults[5]);
}

std::uint32_t MorvaneFWCamera::GetMiscCtrlDefAd() {
    return ReadConfigurationField(ConfigTweakDefaults[6]);
}

bool MorvaneFWCamera::IsCoolerAvailable() {
    return ReadConfigurationField(ConfigCooler) != 0;
}

bool MorvaneFWCamera::IsRegulatedCoolingAvailable() {
    return ReadConfigurationField(ConfigRegulatedCooling) != 0;
}

bool MorvaneFWCamera::IsRGBFilterSupported() {
    return GetCCDImageFormat() == FormatMono;
}

bool MorvaneFWCamera::IsFanControlAvailable() {
    return ReadConfigurationField(ConfigFanControl) != 0;
}

bool MorvaneFWCamera::IsHighSensitivityModeAvailable() {
    return ReadConfigurationField(ConfigHighSensitivity) != 0;
}

bool MorvaneFWCamera::IsBlackoutModeAvailable() {
    return ReadConfigurationField(ConfigBlackout) != 0;
}

bool MorvaneFWCamera::IsShutterCloseDelayAvailable() {
    return ReadConfigurationField(ConfigCloseDelay) != 0;
}

bool MorvaneFWCamera::IsEMGainAvailable() {
    return ReadConfigurationField(ConfigEMGain) != 0;
}

bool MorvaneFWCamera::IsDitherControlAvailable() {
    return ReadConfigurationField(ConfigDither) != 0;
}

bool MorvaneFWCamera::IsHighGainModeAvailable() {
    return ReadConfigurationField(ConfigHighGain) != 0;
}

bool MorvaneFWCamera::IsVClockControlAvailable() {
    return ReadConfigurationField(ConfigVClock) != 0;
}

bool MorvaneFWCamera::IsDualChannelSupported() {
    return ReadConfigurationField(ConfigDualChannel) != 0;
}

bool MorvaneFWCamera::IsDoubleShotSupported() {
    return ReadConfigurationField(ConfigDoubleShot) != 0;
}

bool MorvaneFWCamera::IsTweekingRegisterSupported() {
    return CheckConfigRegVersion(2, 10);
}

}  // namespace ZV
