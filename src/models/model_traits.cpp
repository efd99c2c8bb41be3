#include "models/model_traits.h"

#include "camera/gain_conversion.h"

namespace ZV {

const BinningList& FindBinningByFirmware(std::uint32_t firmware) {
    static constexpr BinningList Few{{1, 2}, {1, 2}};
    constexpr std::uint32_t FirstWithMore = 102;
    return firmware >= FirstWithMore ? BinningTo8Or3 : Few;
}

void AppendBinningModes(const BinningList& list, bool isCode2Mode8,
                        std::vector<std::uint16_t>& modes) {
    for (const std::uint16_t mode : isCode2Mode8 ? list.withMode8 : list.withMode3) {
        if (mode != 0) modes.push_back(mode);
    }
}

void AppendReadoutByConnection(std::uint16_t megabits, std::vector<float>& modes) {
    constexpr std::uint16_t FastMegabits = 800;
    if (megabits == FastMegabits)
        AppendModes(Readout10To30, modes);
    else
        AppendModes(Readout10And20, modes);
}

std::uint32_t FindBoardType(std::uint32_t firmware, std::uint32_t firstLinearFirmware) {
    return firmware < firstLinearFirmware ? BoardTypeCurve : BoardTypeLinear;
}

}  // namespace ZV
