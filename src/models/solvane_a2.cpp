#include "models/solvane_a2.h"

#include "models/model_traits.h"

namespace ZV {

SolvaneA2::~SolvaneA2() = default;

void SolvaneA2::GetSymmetricalBinningModes(std::vector<std::uint16_t>& modes) {
    AppendBinningModes(BinningTo8Or4, ReadConfigurationField(ConfigBinningCode2Is8) != 0, modes);
}

const char* SolvaneA2::GetModelName() {
    return "Solvane A2";
}

std::uint32_t SolvaneA2::GetAnalogBoardType() {
    constexpr std::uint32_t FirstLinearFirmware = 6;
    return FindBoardType(GetFirmwareVersion(), FirstLinearFirmware);
}

}  // namespace ZV
