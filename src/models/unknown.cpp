#include "models/unknown.h"

#include <cstdio>

#include "camera/gain_conversion.h"
#include "models/model_traits.h"

namespace ZV {

Unknown::~Unknown() = default;

void Unknown::GetSymmetricalBinningModes(std::vector<std::uint16_t>& modes) {
    std::fputs("GetSymmetricalBinningModes() - unkown camera type being used\n", stdout);
    AppendBinningModes(BinningTo8Or3, ReadConfigurationField(ConfigBinningCode2Is8) != 0, modes);
}

const char* Unknown::GetModelName() {
    return "Unknown";
}

std::uint32_t Unknown::GetAnalogBoardType() {
    std::fputs("GetAnalogBoardType() - unkown camera type being used\n", stdout);
    return BoardTypeLinear;
}

}  // namespace ZV
