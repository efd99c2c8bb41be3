#include "models/solvane_a1.h"

#include "models/model_traits.h"
#include "models/solvane_b1.h"

namespace ZV {

SolvaneA1::~SolvaneA1() = default;

void SolvaneA1::GetSymmetricalBinningModes(std::vector<std::uint16_t>& modes) {
    AppendBinningModes(BinningTo8Or4, ReadConfigurationField(ConfigBinningCode2Is8) != 0, modes);
}

const char* SolvaneA1::GetModelName() {
    return "Solvane A1";
}

std::uint32_t SolvaneA1::GetAnalogBoardType() {
    return FindBoardType(GetFirmwareVersion(), UsualLinearFirmware);
}

std::uint32_t SolvaneA1::ReturnMasqueradedModel() {
    // The chips "KAI-2020M AR Glass" and "KAI-2020CM AR Glass".
    const std::uint32_t sensor = GetCCDModel();
    return sensor == 46 || sensor == 53 ? SolvaneB1Id : GetModel();
}

}  // namespace ZV
