#include <algorithm>
#include <cstdint>

#include "camera/gain_conversion.h"
#include "camera/morvane_fw_camera.h"

namespace ZV {

namespace {

bool IsRatioBoard(const GainModel& model) {
    return model.boardType >= BoardTypeRatio;
}

/// The plain quotient that a ratio board gives, without the factor of a million; 0 for a default
/// of 0.
std::uint32_t DivideByDefault(std::uint32_t gain, std::uint32_t defaultGain) {
    return defaultGain == 0 ? 0 : gain / defaultGain;
}

std::uint32_t MultiplySaturating(std::uint32_t a, std::uint32_t b) {
    const std::uint64_t product = static_cast<std::uint64_t>(a) * b;
    return static_cast<std::uint32_t>(std::min<std::uint64_t>(product, 0xFFFFFFFFu));
}

std::uint32_t ConvertdBToStatedDac(const GainModel& model, std::int32_t gaindB) {
    std::int64_t dac = 0;
    return ConvertdBToDac(model, gaindB, &dac) ? SaturateDac(dac) : 0;
}

}  // namespace

std::uint32_t MorvaneFWCamera::ConvertGainToNormGain(std::uint32_t gain) {
    // Kept: on a ratio board this is a plain quotient, so it is not the inverse of
    // ConvertNormGainToGain.
    if (IsRatioBoard(gainModel)) return DivideByDefault(gain, GetGainDefault());
    std::int32_t gaindB = 0;
    if (!ConvertDacTodB(gainModel, gain, &gaindB)) return 0;
    return ConvertdBToNorm(gainModel, gaindB);
}

std::int32_t MorvaneFWCamera::ConvertGainToNormGaindB(std::uint32_t gain) {
    if (IsRatioBoard(gainModel)) {
        if (gain == 0) return 0;
        std::uint32_t normGain = DivideByDefault(gain, GetGainDefault());
        return ConvertNormTodB(gainModel, &normGain);
    }
    std::int32_t gaindB = 0;
    return ConvertDacTodB(gainModel, gain, &gaindB) ? gaindB : 0;
}

std::uint32_t MorvaneFWCamera::ConvertNormGainToGain(std::uint32_t normGain) {
    if (IsRatioBoard(gainModel)) return MultiplySaturating(GetGainDefault(), normGain);
    return ConvertdBToStatedDac(gainModel, ConvertNormTodB(gainModel, &normGain));
}

std::int32_t MorvaneFWCamera::ConvertNormGainToNormGaindB(std::uint32_t normGain) {
    if (IsRatioBoard(gainModel) && normGain == 0) return 0;
    return ConvertNormTodB(gainModel, &normGain);
}

std::uint32_t MorvaneFWCamera::ConvertNormGaindBToGain(std::int32_t gaindB) {
    if (IsRatioBoard(gainModel)) {
        const std::uint32_t ratio = ConvertdBToNorm(gainModel, gaindB) / NormGainUnity;
        return MultiplySaturating(ratio, GetGainDefault());
    }
    return ConvertdBToStatedDac(gainModel, gaindB);
}

std::uint32_t MorvaneFWCamera::ConvertNormGaindBToNormGain(std::int32_t gaindB) {
    return ConvertdBToNorm(gainModel, gaindB);
}

std::int32_t MorvaneFWCamera::RoundNormGaindB(std::int32_t gaindB) {
    return RoundGaindB(gainModel, gaindB);
}

std::int32_t MorvaneFWCamera::ConvertOffsetToAbsoluteOffset(std::uint32_t offset) {
    return static_cast<std::int32_t>(offset - static_cast<std::uint32_t>(GetOffsetDefault()));
}

std::uint32_t MorvaneFWCamera::ConvertAbsoluteOffsetToOffset(std::int32_t absoluteOffset) {
    return static_cast<std::uint32_t>(absoluteOffset) +
           static_cast<std::uint32_t>(GetOffsetDefault());
}

std::uint32_t MorvaneFWCamera::GetGain() {
    // Kept: the reading goes through dB and back, and so can differ from what was set.
    return ConvertdBToStatedDac(gainModel, MorvaneFWCamera::GetNormalizedGaindB());
}

std::uint32_t MorvaneFWCamera::GetGainDefault() {
    return ReadConfigurationField(ConfigGainDefault);
}

std::uint32_t MorvaneFWCamera::GetGainMin() {
    return ReadConfigurationField(ConfigGainMin);
}

std::uint32_t MorvaneFWCamera::GetGainMax() {
    if (!CheckConfigRegVersion(2, 0)) return static_cast<std::uint32_t>(GainDacFieldMax);
    return ReadConfigurationField(ConfigGainMax);
}

std::uint32_t MorvaneFWCamera::GetNormalizedGain() {
    std::int32_t gaindB = 0;
    if (!ConvertDacTodB(gainModel, ReadControlField(ControlGain), &gaindB)) return 0;
    return ConvertdBToNorm(gainModel, gaindB);
}

double MorvaneFWCamera::GetNormalizedGainMin() {
    return gainModel.normGainMin / 1000000.0;
}

double MorvaneFWCamera::GetNormalizedGainMax() {
    return gainModel.normGainMax / 1000000.0;
}

std::int32_t MorvaneFWCamera::GetNormalizedGaindB() {
    std::int32_t gaindB = 0;
    return ConvertDacTodB(gainModel, ReadControlField(ControlGain), &gaindB) ? gaindB : 0;
}

std::int32_t MorvaneFWCamera::GetNormalizedGaindBMin() {
    return gainModel.gaindBMin;
}

std::int32_t MorvaneFWCamera::GetNormalizedGaindBMax() {
    return gainModel.gaindBMax;
}

std::uint16_t MorvaneFWCamera::GetNormalizedGaindBResolution() {
    return static_cast<std::uint16_t>(gainModel.dBResolution);
}

std::uint16_t MorvaneFWCamera::GetNormalizedGainSignificantFigures() {
    return static_cast<std::uint16_t>(gainModel.significantFigures);
}

std::uint32_t MorvaneFWCamera::GetGainDACRange() {
    return 4096;
}

std::uint32_t MorvaneFWCamera::GetNormalizedGaindBRes() {
    return 10000;
}

double MorvaneFWCamera::GetNormalizedGaindBDR() {
    if (CheckConfigRegVersion(2, 4)) {
        const double span = ReadConfiguration(ConfigGainSpan);
        return GetGainDACRange() * span / 1000000000.0;
    }
    return GetAnalogBoardType() == BoardTypeCurve ? 30.8929 : 34.1516;
}

CameraResult MorvaneFWCamera::SetGain(std::uint32_t gain) {
    std::int32_t gaindB = 0;
    if (!ConvertDacTodB(gainModel, gain, &gaindB)) return CameraBadValue;
    // By name: a model that replaces the dB setter calls back into these base operations.
    return MorvaneFWCamera::SetNormalizedGaindB(gaindB);
}

CameraResult MorvaneFWCamera::SetNormalizedGain(std::uint32_t normGain) {
    return MorvaneFWCamera::SetNormalizedGaindB(ConvertNormTodB(gainModel, &normGain));
}

CameraResult MorvaneFWCamera::SetNormalizedGaindB(std::int32_t gaindB) {
    if (gaindB == MorvaneFWCamera::GetNormalizedGaindB()) return CameraOk;
    std::int64_t dac = 0;
    if (!ConvertdBToDac(gainModel, gaindB, &dac)) return CameraBadValue;
    const auto code = std::clamp<std::int64_t>(dac, 0, GainDacFieldMax);
    return WriteControlField(ControlGain, static_cast<std::uint32_t>(code));
}

CameraResult MorvaneFWCamera::SetupNormalizedGain() {
    gainModel.boardType = GetAnalogBoardType();
    gainModel.gainFlag = ReadConfigurationField(ConfigGainFlag) != 0;
    gainModel.dacMax = GetGainMax();
    gainModel.dacMin = GetGainMin();
    gainModel.dacRange = GetGainDACRange();
    gainModel.dacDefault = GetGainDefault();
    gainModel.dynamicRange = GetNormalizedGaindBDR();
    gainModel.modelVersion = 1;
    gainModel.dBResolution = static_cast<std::int32_t>(GetNormalizedGaindBRes());
    gainModel.significantFigures = CalculateSignificantFigures(gainModel.dBResolution);
    if (DeriveGainLimits(&gainModel) != CameraOk) return CameraGainSetupFailed;

    if (IsRatioBoard(gainModel)) {
        defaultGaindB = 0;
        return CameraOk;
    }
    return ConvertDacTodB(gainModel, GetGainDefault(), &defaultGaindB) ? CameraOk
                                                                       : CameraGainSetupFailed;
}

}  // namespace ZV
