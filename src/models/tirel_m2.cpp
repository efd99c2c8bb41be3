#include "models/tirel_m2.h"

#include "camera/gain_conversion.h"
#include "camera/packet_size.h"
#include "camera/setting_codes.h"
#include "models/model_traits.h"

namespace ZV {

TirelM2::~TirelM2() = default;

void TirelM2::GetSymmetricalBinningModes(std::vector<std::uint16_t>& modes) {
    AppendModes(BinningTo8, modes);
}

const char* TirelM2::GetModelName() {
    return "Solvane M2";
}

std::uint32_t TirelM2::GetAnalogBoardType() {
    return BoardTypeLinear;
}

float TirelM2::GetReadoutFrequencyDefault() {
    return UsualReadout;
}

void TirelM2::GetReadoutFrequencyModes(std::vector<float>& modes) {
    AppendReadoutByConnection(ReadBusConnection().megabits, modes);
}

void TirelM2::GetTriggerModes(std::vector<std::uint32_t>& modes) {
    AppendTriggerModes(LastTriggerMode, GetRGBFilterCycleMode(), modes);
}

std::uint16_t TirelM2::GetTagCode() {
    return 0;
}

}  // namespace ZV
