#include "models/tirel_m1.h"

#include "camera/gain_conversion.h"
#include "camera/setting_codes.h"
#include "models/model_traits.h"

namespace ZV {

TirelM1::~TirelM1() = default;

void TirelM1::GetSymmetricalBinningModes(std::vector<std::uint16_t>& modes) {
    AppendModes(BinningTo8, modes);
}

const char* TirelM1::GetModelName() {
    return "Solvane M1";
}

std::uint32_t TirelM1::GetAnalogBoardType() {
    return BoardTypeLinear;
}

float TirelM1::GetReadoutFrequencyDefault() {
    return UsualReadout;
}

void TirelM1::GetReadoutFrequencyModes(std::vector<float>& modes) {
    AppendModes(Readout10And20, modes);
}

void TirelM1::GetTriggerModes(std::vector<std::uint32_t>& modes) {
    AppendTriggerModes(LastTriggerMode, GetRGBFilterCycleMode(), modes);
}

std::uint16_t TirelM1::GetTagCode() {
    return 0;
}

}  // namespace ZV
