#pragma once

#include <string_view>

namespace ZV::Test {

/// A monochrome camera of 64 x 48 pixels that has every parameter but those of two models: separate
/// binning and the shutter delay (`SmallMetrona`), and real-time video (`folary`). Its default gain
/// is 600 and its default offset 16, camera units; its gain runs over 34.1516 dB in 4096 steps.
inline constexpr std::string_view RichMono = R"({"base": "model:SolvaneK1", "cameras": [{
    "versions": {"configuration": "2.11"},
    "sensor": {"width": 64, "height": 48},
    "configuration": {"29": 1, "169": "0x1F5E", "201": 2}}]})";

inline constexpr std::string_view SmallMetrona =
    R"({"base": "metrona", "cameras": [{"sensor": {"width": 128, "height": 64}}]})";

}  // namespace ZV::Test
