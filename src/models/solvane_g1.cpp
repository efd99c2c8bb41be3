#include "models/solvane_g1.h"

#include "camera/gain_conversion.h"
#include "camera/setting_codes.h"
#include "models/model_traits.h"

namespace ZV {

SolvaneG1::~SolvaneG1() = default;

void SolvaneG1::GetSymmetricalBinningModes(std::vector<std::uint16_t>& modes) {
    AppendModes(BinningTo8, modes);
}

const char* SolvaneG1::GetModelName() {
    return "Solvane G1";
}

std::uint32_t SolvaneG1::GetAnalogBoardType() {
    return BoardTypeLinear;
}

void SolvaneG1::GetReadoutFrequencyModes(std::vector<float>& modes) {
    AppendModes(Readout5To20, modes);
}

void SolvaneG1::GetTriggerModes(std::vector<std::uint32_t>& modes) {
    AppendTriggerModes(LastTriggerMode, GetRGBFilterCycleMode(), modes);
}

}  // namespace ZV
