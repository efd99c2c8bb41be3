#include "models/solvane_b1.h"

#include "models/model_traits.h"

namespace ZV {

SolvaneB1::~SolvaneB1() = default;

void SolvaneB1::GetSymmetricalBinningModes(std::vector<std::uint16_t>& modes) {
    AppendModes(BinningTo8, modes);
}

const char* SolvaneB1::GetModelName() {
    return "Solvane B1";
}

std::uint32_t SolvaneB1::GetAnalogBoardType() {
    return FindBoardType(GetFirmwareVersion(), UsualLinearFirmware);
}

// Kept: the configuration may hold the id of another model.
std::uint32_t SolvaneB1::GetModel() {
    return SolvaneB1Id;
}

void SolvaneB1::GetReadoutFrequencyModes(std::vector<float>& modes) {
    AppendModes(Readout10And20, modes);
}

}  // namespace ZV
