#pragma once

#include <cstdint>

namespace ZV {

/// Gain model of a camera, built once while it is set up.
struct GainModel {
    std::uint32_t boardType = 0;  ///< 1 piecewise curve, 2 linear, 3 and above ratio.
    double dynamicRange = 0;      ///< dB over the whole DAC range.
    std::uint32_t significantFigures = 0;
    std::int32_t dBResolution = 0;  ///< Step of a gain in millionths of a dB.
    std::uint32_t normGainMax = 0;
    std::uint32_t normGainMin = 0;
    std::int32_t gaindBMax = 0;
    std::int32_t gaindBMin = 0;
    bool gainFlag = false;
    std::uint32_t dacMax = 0;
    std::uint32_t dacMin = 0;
    std::uint32_t dacRange = 0;
    std::uint32_t dacDefault = 0;
    std::uint32_t modelVersion = 1;
};

}  // namespace ZV
