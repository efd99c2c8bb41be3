#include "models/solvane_e1.h"

#include "camera/gain_conversion.h"
#include "camera/packet_size.h"
#include "camera/setting_codes.h"
#include "models/model_traits.h"

namespace ZV {

SolvaneE1::~SolvaneE1() = default;

void SolvaneE1::GetSymmetricalBinningModes(std::vector<std::uint16_t>& modes) {
    AppendModes(BinningTo8, modes);
}

const char* SolvaneE1::GetModelName() {
    return "Solvane E1";
}

std::uint32_t SolvaneE1::GetAnalogBoardType() {
    return BoardTypeLinear;
}

float SolvaneE1::GetReadoutFrequencyDefault() {
    return UsualReadout;
}

void SolvaneE1::GetReadoutFrequencyModes(std::vector<float>& modes) {
    AppendReadoutByConnection(ReadBusConnection().megabits, modes);
}

void SolvaneE1::GetTriggerModes(std::vector<std::uint32_t>& modes) {
    AppendTriggerModes(LastTriggerMode, GetRGBFilterCycleMode(), modes);
}

std::uint16_t SolvaneE1::GetTagCode() {
    return 0;
}

}  // namespace ZV
