#include "models/solvane_d2.h"

#include "camera/gain_conversion.h"
#include "camera/setting_codes.h"
#include "models/model_traits.h"

namespace ZV {

SolvaneD2::~SolvaneD2() = default;

void SolvaneD2::GetSymmetricalBinningModes(std::vector<std::uint16_t>& modes) {
    AppendModes(BinningTo8, modes);
}

const char* SolvaneD2::GetModelName() {
    return "Solvane D2";
}

std::uint32_t SolvaneD2::GetAnalogBoardType() {
    return BoardTypeLinear;
}

float SolvaneD2::GetReadoutFrequencyDefault() {
    return UsualReadout;
}

void SolvaneD2::GetReadoutFrequencyModes(std::vector<float>& modes) {
    AppendModes(Readout10To30, modes);
}

void SolvaneD2::GetTriggerModes(std::vector<std::uint32_t>& modes) {
    AppendTriggerModes(LastTriggerMode, GetRGBFilterCycleMode(), modes);
}

std::uint16_t SolvaneD2::GetTagCode() {
    return 0;
}

}  // namespace ZV
