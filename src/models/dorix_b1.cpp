#include "models/dorix_b1.h"

#include "models/model_traits.h"

namespace ZV {

DorixB1::~DorixB1() = default;

void DorixB1::GetSymmetricalBinningModes(std::vector<std::uint16_t>& modes) {
    AppendBinningModes(BinningTo8Or4, ReadConfigurationField(ConfigBinningCode2Is8) != 0, modes);
}

const char* DorixB1::GetModelName() {
    return "Dorix B1";
}

std::uint32_t DorixB1::GetAnalogBoardType() {
    return FindBoardType(GetFirmwareVersion(), UsualLinearFirmware);
}

}  // namespace ZV
