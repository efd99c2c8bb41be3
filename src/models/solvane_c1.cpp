#include "models/solvane_c1.h"

#include "models/model_traits.h"

namespace ZV {

SolvaneC1::~SolvaneC1() = default;

void SolvaneC1::GetSymmetricalBinningModes(std::vector<std::uint16_t>& modes) {
    AppendModes(BinningTo8, modes);
}

const char* SolvaneC1::GetModelName() {
    return "Solvane C1";
}

std::uint32_t SolvaneC1::GetAnalogBoardType() {
    return FindBoardType(GetFirmwareVersion(), UsualLinearFirmware);
}

void SolvaneC1::GetReadoutFrequencyModes(std::vector<float>& modes) {
    AppendModes(Readout10And20, modes);
}

}  // namespace ZV
