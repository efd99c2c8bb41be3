#include "models/solvane_j1.h"

#include "camera/gain_conversion.h"
#include "models/model_traits.h"

namespace ZV {

SolvaneJ1::~SolvaneJ1() = default;

void SolvaneJ1::GetSymmetricalBinningModes(std::vector<std::uint16_t>& modes) {
    AppendBinningModes(FindBinningByFirmware(GetFirmwareVersion()),
                       ReadConfigurationField(ConfigBinningCode2Is8) != 0, modes);
}

const char* SolvaneJ1::GetModelName() {
    return "SJT";
}

std::uint32_t SolvaneJ1::GetAnalogBoardType() {
    return BoardTypeCurve;
}

}  // namespace ZV
