#pragma once

#include <cstdint>

/// Register map of the cameras. Quadlet q stands at byte offset 4q of its block; bit 0 is the least
/// significant of the host-order value. Library, simulation and tests read it here.
namespace ZV {

/// Version word of a block: the major number in bits 16 to 31, the minor in bits 0 to 15.
constexpr std::uint32_t MakeVersion(std::uint32_t major, std::uint32_t minor) {
    return (major << 16) | minor;
}

/// Row of a version table: a block's length in quadlets, its version quadlet included. Ends with
/// zeros.
struct regVersionEntry {
    std::uint32_t major;
    std::uint32_t minor;
    std::uint32_t length;
};

inline constexpr regVersionEntry DirectoryVersions[] = {{1, 1, 11}, {0, 0, 0}};
inline constexpr regVersionEntry ConfigurationVersions[] = {
    {1, 1, 29}, {1, 2, 30},  {2, 1, 42},  {2, 2, 44},  {2, 3, 62},   {2, 4, 67},   {2, 5, 68},
    {2, 6, 79}, {2, 7, 176}, {2, 8, 178}, {2, 9, 202}, {2, 10, 209}, {2, 11, 210}, {0, 0, 0}};
inline constexpr regVersionEntry ControlVersions[] = {
    {1, 1, 15}, {1, 2, 16}, {2, 1, 20}, {2, 2, 20}, {2, 3, 21}, {2, 4, 21},
    {2, 5, 24}, {2, 6, 26}, {2, 7, 34}, {2, 8, 43}, {0, 0, 0}};
inline constexpr regVersionEntry StreamVersions[] = {{1, 2, 4}, {0, 0, 0}};
inline constexpr regVersionEntry CommandVersions[] = {{1, 1, 3}, {1, 2, 4}, {0, 0, 0}};
inline constexpr regVersionEntry StatusVersions[] = {{1, 1, 2}, {1, 2, 2}, {1, 3, 4}, {0, 0, 0}};

/// A run of bits in a quadlet. `sinceVersion` is the version word of the block from which the field
/// is read; below it the field reads 0. 0 where no such test is made.
struct RegisterField {
    std::uint16_t quadlet;
    std::uint8_t firstBit, bitCount;
    std::uint32_t sinceVersion = 0;
};

constexpr std::uint32_t GetFieldMask(const RegisterField& field) {
    return field.bitCount >= 32 ? 0xFFFFFFFFu : (1u << field.bitCount) - 1u;
}
constexpr std::uint32_t ExtractField(const RegisterField& field, std::uint32_t quadlet) {
    return (quadlet >> field.firstBit) & GetFieldMask(field);
}
constexpr std::uint32_t InsertField(const RegisterField& field, std::uint32_t quadlet,
                                    std::uint32_t value) {
    const std::uint32_t mask = GetFieldMask(field);
    return (quadlet & ~(mask << field.firstBit)) | ((value & mask) << field.firstBit);
}

// Directory: quadlets that hold the address of a block.
inline constexpr std::uint32_t DirectoryConfiguration = 2;
inline constexpr std::uint32_t DirectoryControl = 4;
inline constexpr std::uint32_t DirectoryCommand = 6;
inline constexpr std::uint32_t DirectoryStatus = 8;
inline constexpr std::uint32_t DirectoryStream = 10;

// Configuration block: read only.
inline constexpr RegisterField ConfigGainDefault{2, 20, 12};
inline constexpr RegisterField ConfigOffsetDefault{2, 4, 12};
inline constexpr std::uint32_t ConfigMinExposure =
    3;  ///< Major 1: microseconds; else upper half, ns.
inline constexpr RegisterField ConfigSensorWidth{4, 16, 16};
inline constexpr RegisterField ConfigSensorHeight{4, 0, 16};
inline constexpr RegisterField ConfigWidthBinning2{5, 16, 16};
inline constexpr RegisterField ConfigHeightBinning2{5, 0, 16};
inline constexpr RegisterField ConfigWidthBinning3Or8{6, 16, 16};
inline constexpr RegisterField ConfigHeightBinning3Or8{6, 0, 16};
inline constexpr RegisterField ConfigWidthBinning4{7, 16, 16};
inline constexpr RegisterField ConfigHeightBinning4{7, 0, 16};
inline constexpr RegisterField ConfigMaxBitDepthMinusOne{8, 0, 4};
inline constexpr std::uint32_t ConfigFilterDelays = 9;
inline constexpr RegisterField ConfigCooler{10, 31, 1};
inline constexpr std::uint32_t ConfigUniqueIdHigh = 12;
inline constexpr std::uint32_t ConfigUniqueIdLow = 13;
inline constexpr RegisterField ConfigModel{14, 16, 16};
inline constexpr RegisterField ConfigHardwareVersion{15, 0, 16};
inline constexpr RegisterField ConfigFirmwareVersion{16, 0, 16};
inline constexpr RegisterField ConfigFirmwareBuild{16, 16, 16};
inline constexpr RegisterField ConfigColourKind{17, 8, 4};  ///< 0 monochrome, 1 Bayer.
inline constexpr RegisterField ConfigSensorModel{17, 16, 16};
inline constexpr std::uint32_t ConfigSerialFirst = 18;
inline constexpr std::uint32_t ConfigSerialQuadlets = 7;
inline constexpr std::uint32_t ConfigMaxExposure = 26;  ///< Like ConfigMinExposure.
inline constexpr RegisterField ConfigDoubleShot{29, 0, 1, MakeVersion(1, 2)};
inline constexpr RegisterField ConfigRtvMode{29, 1, 1};
inline constexpr RegisterField ConfigGainFlag{29, 2, 1, MakeVersion(2, 3)};
inline constexpr RegisterField ConfigGainMin{30, 20, 12, MakeVersion(2, 0)};
inline constexpr RegisterField ConfigGainMax{30, 4, 12, MakeVersion(2, 0)};
inline constexpr RegisterField ConfigOffsetMin{31, 20, 12, MakeVersion(2, 0)};
inline constexpr RegisterField ConfigOffsetMax{31, 4, 12, MakeVersion(2, 0)};
inline constexpr RegisterField ConfigIntensifierModel{32, 16, 16};
inline constexpr RegisterField ConfigIntensifierMin{34, 20, 12};
inline constexpr RegisterField ConfigIntensifierMax{34, 4, 12};
inline constexpr std::uint32_t ConfigExposureResolution = 35;
inline constexpr std::uint32_t ConfigTriggerDelayMax = 36;
inline constexpr std::uint32_t ConfigTriggerDelayMin = 37;
inline constexpr std::uint32_t ConfigTriggerDelayResolution = 38;
inline constexpr std::uint32_t ConfigMinExposureLow = 39;
inline constexpr std::uint32_t ConfigMaxExposureLow = 40;
inline constexpr RegisterField ConfigStreamingVersion{41, 0, 16, MakeVersion(2, 1)};
/// Binning code 2 means mode 8 instead of mode 3.
inline constexpr RegisterField ConfigBinningCode2Is8{42, 0, 1, MakeVersion(2, 2)};
inline constexpr std::uint32_t ConfigGainSpan = 66;  ///< dB per DAC step in billionths, from 2.4.
inline constexpr RegisterField ConfigSubDefault{69, 0, 32, MakeVersion(2, 10)};
inline constexpr RegisterField ConfigTemperatureMin{167, 0, 16, MakeVersion(2, 7)};
inline constexpr RegisterField ConfigTemperatureMax{167, 16, 16, MakeVersion(2, 7)};
inline constexpr RegisterField ConfigHighSensitivity{169, 1, 1, MakeVersion(2, 7)};
inline constexpr RegisterField ConfigBlackout{169, 2, 1, MakeVersion(2, 7)};
inline constexpr RegisterField ConfigFanControl{169, 3, 1, MakeVersion(2, 7)};
inline constexpr RegisterField ConfigRegulatedCooling{169, 4, 1, MakeVersion(2, 7)};
inline constexpr RegisterField ConfigEMGain{169, 6, 1, MakeVersion(2, 7)};
inline constexpr RegisterField ConfigCloseDelay{169, 8, 1, MakeVersion(2, 7)};
inline constexpr RegisterField ConfigDither{169, 9, 1, MakeVersion(2, 7)};
inline constexpr RegisterField ConfigHighGain{169, 10, 1, MakeVersion(2, 7)};
inline constexpr RegisterField ConfigVClock{169, 11, 1, MakeVersion(2, 7)};
inline constexpr RegisterField ConfigDualChannel{169, 12, 1, MakeVersion(2, 7)};
inline constexpr RegisterField ConfigEMGainDefault{176, 0, 16};
inline constexpr RegisterField ConfigCloseDelayDefault{177, 0, 16};
// Board type 3: gain and offset stand elsewhere.
inline constexpr RegisterField ConfigRatioGainDefault{178, 0, 8};
inline constexpr RegisterField ConfigRatioGainMin{179, 0, 8};
inline constexpr RegisterField ConfigRatioGainMax{180, 0, 8};
inline constexpr RegisterField ConfigRatioOffsetDefault{186, 2, 14};
inline constexpr RegisterField ConfigRatioOffsetMin{187, 2, 14};
inline constexpr RegisterField ConfigRatioOffsetMax{188, 2, 14};
inline constexpr RegisterField ConfigEMGainMin{192, 0, 16};
inline constexpr RegisterField ConfigEMGainMax{193, 0, 16};
inline constexpr RegisterField ConfigCalibrationGainDefault{194, 0, 8};
inline constexpr RegisterField ConfigDitherDefault{196, 0, 1};
inline constexpr RegisterField ConfigHighGainDefault{196, 1, 1};
inline constexpr RegisterField ConfigVClockDefault{197, 0, 16};
inline constexpr RegisterField ConfigVClockMin{198, 0, 16};
inline constexpr RegisterField ConfigVClockMax{199, 0, 16};
inline constexpr std::uint32_t ConfigVClockResolution = 200;
inline constexpr RegisterField ConfigHardwareProfile{201, 0, 16, MakeVersion(2, 9)};
/// SubCp, ResetVh, V1Vm, V2Vm, V3Vm, V4Vm, MiscCtrl: 202 to 208.
inline constexpr RegisterField ConfigTweakDefaults[7] = {
    {202, 0, 16, MakeVersion(2, 10)}, {203, 0, 16, MakeVersion(2, 10)},
    {204, 0, 16, MakeVersion(2, 10)}, {205, 0, 16, MakeVersion(2, 10)},
    {206, 0, 16, MakeVersion(2, 10)}, {207, 0, 16, MakeVersion(2, 10)},
    {208, 0, 16, MakeVersion(2, 10)}};

// Control block: host shadow and camera.
inline constexpr RegisterField ControlLittleEndian{1, 2, 1};
inline constexpr RegisterField ControlBitDepth{1, 3,
                                               2};  ///< 0: 8 bits, 1: the maximum, 2: 12, 3: 14.
inline constexpr RegisterField ControlReadoutFrequency{1, 8, 4};
inline constexpr RegisterField ControlCompression{1, 16, 8};
inline constexpr RegisterField ControlPsn{1, 24, 8};
inline constexpr RegisterField ControlBinning{2, 0, 2};
inline constexpr RegisterField ControlRtvMode{2, 2, 1};
inline constexpr RegisterField ControlVerticalBinningMinusOne{2, 8, 8};
inline constexpr RegisterField ControlHorizontalBinningMinusOne{2, 16, 8};
inline constexpr RegisterField ControlRoiWidth{3, 16, 16};
inline constexpr RegisterField ControlRoiHeight{3, 0, 16};
inline constexpr RegisterField ControlRoiX{4, 16, 16};
inline constexpr RegisterField ControlRoiY{4, 0, 16};
inline constexpr RegisterField ControlGain{5, 20, 12};
inline constexpr RegisterField ControlOffset{5, 4, 12};
inline constexpr std::uint32_t ControlExposure =
    6;  ///< Major 1: microseconds; else upper half, ns.
inline constexpr std::uint32_t ControlRedExposure = 7;
inline constexpr std::uint32_t ControlBlueExposure = 8;
inline constexpr RegisterField ControlTriggerType{11, 0, 4};
inline constexpr RegisterField ControlTriggerPolarity{11, 8, 1};
inline constexpr RegisterField ControlSyncB{11, 16, 2};
inline constexpr RegisterField ControlFilterCycle{12, 0, 1};
inline constexpr RegisterField ControlFilterActive{12, 4, 1};
inline constexpr RegisterField ControlFilterStartColour{12, 8, 2};
inline constexpr std::uint32_t ControlFilterDelays = 13;
inline constexpr RegisterField ControlDoubleShot{13, 0, 1};
inline constexpr RegisterField ControlCooler{14, 0, 1};
inline constexpr RegisterField ControlTemperature{14, 16, 16};
inline constexpr std::uint32_t ControlExposureLow = 15;
inline constexpr std::uint32_t ControlMetronaDelay = 15;
inline constexpr std::uint32_t ControlRedExposureLow = 16;
inline constexpr std::uint32_t ControlBlueExposureLow = 17;
inline constexpr RegisterField ControlIntensifierGain{18, 4, 12};
inline constexpr std::uint32_t ControlTriggerDelay = 19;
/// Used from control version 2.3.
inline constexpr RegisterField ControlMaxPacketSize{20, 0, 16};
inline constexpr RegisterField ControlHighSensitivity{21, 0, 1};
inline constexpr RegisterField ControlBlackout{21, 1, 1};
inline constexpr RegisterField ControlFanSpeed{22, 16, 16};
inline constexpr RegisterField ControlEMGain{24, 0, 16};  ///< Stored as the maximum minus the gain.
inline constexpr RegisterField ControlCloseDelay{25, 0, 16};
inline constexpr RegisterField ControlRatioGain{26, 0, 8};
inline constexpr RegisterField ControlRatioOffset{28, 2, 14};
inline constexpr RegisterField ControlDither{30, 0, 1};
inline constexpr RegisterField ControlHighGain{30, 1, 1};
inline constexpr RegisterField ControlVClock{31, 0, 16};
inline constexpr RegisterField ControlCalibrationGain{32, 0, 8};
inline constexpr std::uint32_t ControlTweakFirst =
    34;  ///< SubCp, Sub, ResetVh, V1Vm .. V4Vm: 34 to 40.
inline constexpr std::uint32_t ControlMiscCtrl = 41;

// Command block: quadlets that do something when 1 is written.
inline constexpr std::uint32_t CommandTakeOver = 1;
inline constexpr std::uint32_t CommandSoftwareTrigger = 2;

// Stream block: the switch, the channel in the top byte, bit 0 on.
inline constexpr std::uint32_t StreamSwitch = 1;

// Status block: both bits set once the sensor has its regulated temperature.
inline constexpr std::uint32_t StatusTemperature = 1;
inline constexpr std::uint32_t StatusTemperatureLocked = 3;

}  // namespace ZV
