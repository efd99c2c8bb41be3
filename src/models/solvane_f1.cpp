#include "models/solvane_f1.h"

#include "camera/gain_conversion.h"
#include "camera/setting_codes.h"
#include "models/model_traits.h"

namespace ZV {

SolvaneF1::~SolvaneF1() = default;

void SolvaneF1::GetSymmetricalBinningModes(std::vector<std::uint16_t>& modes) {
    AppendModes(BinningTo8, modes);
}

const char* SolvaneF1::GetModelName() {
    return "OEM Camera 3";
}

std::uint32_t SolvaneF1::GetAnalogBoardType() {
    return BoardTypeLinear;
}

void SolvaneF1::GetTriggerModes(std::vector<std::uint32_t>& modes) {
    AppendTriggerModes(LastTriggerMode, GetRGBFilterCycleMode(), modes);
}

CameraResult SolvaneF1::SetVerticalBinning(std::uint32_t /*mode*/) {
    return CameraOk;
}

bool SolvaneF1::IsShutterCloseDelayAvailable() {
    return true;
}

}  // namespace ZV
