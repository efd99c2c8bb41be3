#include "models/solvane_b2.h"

#include "camera/gain_conversion.h"
#include "camera/setting_codes.h"
#include "models/model_traits.h"

namespace ZV {

SolvaneB2::~SolvaneB2() = default;

void SolvaneB2::GetSymmetricalBinningModes(std::vector<std::uint16_t>& modes) {
    AppendModes(BinningTo8, modes);
}

const char* SolvaneB2::GetModelName() {
    return "Solvane B2";
}

std::uint32_t SolvaneB2::GetAnalogBoardType() {
    return BoardTypeLinear;
}

void SolvaneB2::GetReadoutFrequencyModes(std::vector<float>& modes) {
    AppendModes(Readout5To20, modes);
}

void SolvaneB2::GetTriggerModes(std::vector<std::uint32_t>& modes) {
    AppendTriggerModes(LastTriggerMode, GetRGBFilterCycleMode(), modes);
}

}  // namespace ZV
