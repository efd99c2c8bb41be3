#include "models/dorix_r1.h"

#include "camera/gain_conversion.h"
#include "models/model_traits.h"

namespace ZV {

DorixR1::~DorixR1() = default;

void DorixR1::GetSymmetricalBinningModes(std::vector<std::uint16_t>& modes) {
    AppendModes(BinningTo2, modes);
}

const char* DorixR1::GetModelName() {
    return "Dorix R1";
}

std::uint32_t DorixR1::GetAnalogBoardType() {
    return BoardTypeLinear;
}

bool DorixR1::IsRGBFilterSupported() {
    return false;
}

}  // namespace ZV
