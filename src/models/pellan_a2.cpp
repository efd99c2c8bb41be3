#include "models/pellan_a2.h"

#include "camera/gain_conversion.h"
#include "camera/setting_codes.h"
#include "models/model_traits.h"

namespace ZV {

PellanA2::~PellanA2() = default;

void PellanA2::GetSymmetricalBinningModes(std::vector<std::uint16_t>& modes) {
    AppendModes(BinningTo4, modes);
}

const char* PellanA2::GetModelName() {
    return "Pellan A2";
}

std::uint32_t PellanA2::GetAnalogBoardType() {
    return BoardTypeLinear;
}

float PellanA2::GetReadoutFrequencyDefault() {
    return UsualReadout;
}

void PellanA2::GetReadoutFrequencyModes(std::vector<float>& modes) {
    AppendModes(Readout10To30, modes);
}

void PellanA2::GetTriggerModes(std::vector<std::uint32_t>& modes) {
    AppendTriggerModes(LastTriggerMode, GetRGBFilterCycleMode(), modes);
}

std::uint16_t PellanA2::GetTagCode() {
    return 0;
}

}  // namespace ZV
