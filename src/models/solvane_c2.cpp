#include "models/solvane_c2.h"

#include "camera/gain_conversion.h"
#include "camera/setting_codes.h"
#include "models/model_traits.h"

namespace ZV {

SolvaneC2::~SolvaneC2() = default;

void SolvaneC2::GetSymmetricalBinningModes(std::vector<std::uint16_t>& modes) {
    AppendModes(BinningTo8, modes);
}

const char* SolvaneC2::GetModelName() {
    return "Solvane C2";
}

std::uint32_t SolvaneC2::GetAnalogBoardType() {
    return BoardTypeLinear;
}

void SolvaneC2::GetReadoutFrequencyModes(std::vector<float>& modes) {
    AppendModes(Readout5To20, modes);
}

void SolvaneC2::GetTriggerModes(std::vector<std::uint32_t>& modes) {
    AppendTriggerModes(LastTriggerMode, GetRGBFilterCycleMode(), modes);
}

}  // namespace ZV
