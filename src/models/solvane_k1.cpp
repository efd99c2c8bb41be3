#include "models/solvane_k1.h"

#include <new>

#include "camera/gain_conversion.h"
#include "models/model_traits.h"

namespace ZV {

namespace {

constexpr IntensifierGainModel NoIntensifier{0, 0, 0, 0, 0, 0, 0, 0, 0, 0};

}  // namespace

SolvaneK1::~SolvaneK1() = default;

void SolvaneK1::GetSymmetricalBinningModes(std::vector<std::uint16_t>& modes) {
    AppendBinningModes(BinningTo8Or2, ReadConfigurationField(ConfigBinningCode2Is8) != 0, modes);
}

const char* SolvaneK1::GetModelName() {
    return "Solvane K1";
}

std::uint32_t SolvaneK1::GetAnalogBoardType() {
    return BoardTypeLinear;
}

bool SolvaneK1::IsIntensifierAvailable() {
    return true;
}

bool SolvaneK1::IsTriggerDelayAvialable() {
    return true;
}

CameraResult SolvaneK1::SetupNormalizedIntensifiedGain() {
    if (intensifierGainModel == nullptr)
        intensifierGainModel.reset(new (std::nothrow) IntensifierGainModel);
    if (intensifierGainModel == nullptr) return CameraGainSetupFailed;
    return SetupIntensifierGain(intensifierGainModel.get(), GetIntensifierGainMin(),
                                GetIntensifierGainMax());
}

const IntensifierGainModel& SolvaneK1::GetIntensifierModelOrNone() const {
    return intensifierGainModel != nullptr ? *intensifierGainModel : NoIntensifier;
}

std::uint32_t SolvaneK1::GetIntensifierGainMin() {
    return ReadConfigurationField(ConfigIntensifierMin);
}

std::uint32_t SolvaneK1::GetIntensifierGainMax() {
    return ReadConfigurationField(ConfigIntensifierMax);
}

std::uint64_t SolvaneK1::GetNormalizedIntensifierGainMin() {
    return GetIntensifierModelOrNone().normalizedMin;
}

std::uint64_t SolvaneK1::GetNormalizedIntensifierGainMax() {
    return GetIntensifierModelOrNone().normalizedMax;
}

std::int32_t SolvaneK1::GetNormalizedIntensifierGaindBMin() {
    return static_cast<std::int32_t>(GetIntensifierModelOrNone().dBMin);
}

std::int32_t SolvaneK1::GetNormalizedIntensifierGaindBMax() {
    return static_cast<std::int32_t>(GetIntensifierModelOrNone().dBMax);
}

std::uint16_t SolvaneK1::GetNormalizedIntensifierGaindBResolution() {
    return static_cast<std::uint16_t>(GetIntensifierModelOrNone().dBResolution);
}

std::uint16_t SolvaneK1::GetNormalizedIntensifierGainSignificantFigures() {
    return static_cast<std::uint16_t>(GetIntensifierModelOrNone().significantFigures);
}

std::uint32_t SolvaneK1::GetNormalizedIntensifierGaindB() {
    const std::uint32_t raw = ReadControlField(ControlIntensifierGain);
    return static_cast<std::uint32_t>(ConvertRawTodB(GetIntensifierModelOrNone(), raw));
}

// Kept: this and GetIntensifierGain go through the gain model of the camera, not through that of
// the intensifier, so a gain that was set reads back as another.
std::uint64_t SolvaneK1::GetNormalizedIntensifierGain() {
    std::int32_t gaindB = 0;
    const std::uint32_t raw = ReadControlField(ControlIntensifierGain);
    return ConvertDacTodB(gainModel, raw, &gaindB) ? ConvertdBToNorm(gainModel, gaindB) : 0;
}

std::uint32_t SolvaneK1::GetIntensifierGain() {
    auto normGain = static_cast<std::uint32_t>(GetNormalizedIntensifierGain());
    std::int64_t dac = 0;
    return ConvertdBToDac(gainModel, ConvertNormTodB(gainModel, &normGain), &dac) ? SaturateDac(dac)
                                                                                  : 0;
}

CameraResult SolvaneK1::SetNormalizedIntensifierGain(std::uint64_t normGain) {
    if (intensifierGainModel == nullptr) return CameraBadValue;
    std::uint32_t raw = 0;
    const std::uint64_t rounded = RoundIntensifierGain(*intensifierGainModel, normGain);
    if (!ConvertNormToRaw(*intensifierGainModel, rounded, &raw)) return CameraBadValue;
    return WriteControlField(ControlIntensifierGain, raw);
}

}  // namespace ZV
