#include "models/solvane_h1.h"

#include "camera/gain_conversion.h"
#include "camera/packet_size.h"
#include "camera/setting_codes.h"
#include "models/model_traits.h"

namespace ZV {

SolvaneH1::~SolvaneH1() = default;

void SolvaneH1::GetSymmetricalBinningModes(std::vector<std::uint16_t>& modes) {
    AppendModes(BinningTo8, modes);
}

const char* SolvaneH1::GetModelName() {
    return "Solvane H1";
}

std::uint32_t SolvaneH1::GetAnalogBoardType() {
    return BoardTypeLinear;
}

float SolvaneH1::GetReadoutFrequencyDefault() {
    return UsualReadout;
}

void SolvaneH1::GetReadoutFrequencyModes(std::vector<float>& modes) {
    AppendReadoutByConnection(ReadBusConnection().megabits, modes);
}

void SolvaneH1::GetTriggerModes(std::vector<std::uint32_t>& modes) {
    AppendTriggerModes(LastTriggerMode, GetRGBFilterCycleMode(), modes);
}

std::uint16_t SolvaneH1::GetTagCode() {
    return 0;
}

}  // namespace ZV
