#include "models/solvane_g2.h"

#include "camera/gain_conversion.h"
#include "camera/setting_codes.h"
#include "models/model_traits.h"

namespace ZV {

SolvaneG2::~SolvaneG2() = default;

void SolvaneG2::GetSymmetricalBinningModes(std::vector<std::uint16_t>& modes) {
    AppendModes(BinningTo8, modes);
}

const char* SolvaneG2::GetModelName() {
    return "Solvane G2";
}

std::uint32_t SolvaneG2::GetAnalogBoardType() {
    return BoardTypeLinear;
}

void SolvaneG2::GetReadoutFrequencyModes(std::vector<float>& modes) {
    AppendModes(Readout5To20, modes);
}

void SolvaneG2::GetTriggerModes(std::vector<std::uint32_t>& modes) {
    AppendTriggerModes(LastTriggerMode, GetRGBFilterCycleMode(), modes);
}

}  // namespace ZV
