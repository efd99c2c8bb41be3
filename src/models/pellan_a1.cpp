#include "models/pellan_a1.h"

#include "models/model_traits.h"

namespace ZV {

PellanA1::~PellanA1() = default;

void PellanA1::GetSymmetricalBinningModes(std::vector<std::uint16_t>& modes) {
    AppendBinningModes(FindBinningByFirmware(GetFirmwareVersion()),
                       ReadConfigurationField(ConfigBinningCode2Is8) != 0, modes);
}

const char* PellanA1::GetModelName() {
    return "PellanA1";
}

std::uint32_t PellanA1::GetAnalogBoardType() {
    return FindBoardType(GetFirmwareVersion(), UsualLinearFirmware);
}

bool PellanA1::IsRGBFilterSupported() {
    return false;
}

}  // namespace ZV
