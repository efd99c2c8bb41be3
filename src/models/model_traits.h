#pragma once

#include <array>
#include <cstdint>
#include <vector>

/// What several models share: lists of modes, in the order in which clients see them, and the rules
/// that tell a model's analog board.
namespace ZV {

inline constexpr std::array<std::uint16_t, 4> BinningTo8{1, 2, 4, 8};
inline constexpr std::array<std::uint16_t, 3> BinningTo4{1, 2, 4};
inline constexpr std::array<std::uint16_t, 2> BinningTo2{1, 2};

/// Symmetrical binning modes that hang on the camera's binning code 2, which means mode 8 on some
/// and mode 3 on others. Ended by 0.
struct BinningList {
    std::array<std::uint16_t, 4> withMode8;
    std::array<std::uint16_t, 4> withMode3;
};
inline constexpr BinningList BinningTo8Or2{{1, 2, 4, 8}, {1, 2}};
inline constexpr BinningList BinningTo8Or4{{1, 2, 4, 8}, {1, 2, 3, 4}};
inline constexpr BinningList BinningTo8Or3{{1, 2, 4, 8}, {1, 2, 4, 3}};

/// BinningTo8Or3 from firmware 102, only 1 and 2 below it.
const BinningList& FindBinningByFirmware(std::uint32_t firmware);
void AppendBinningModes(const BinningList& list, bool isCode2Mode8,
                        std::vector<std::uint16_t>& modes);

inline constexpr std::array Readout10And20{10.0F, 20.0F};
inline constexpr std::array Readout5To20{5.0F, 10.0F, 20.0F};
inline constexpr std::array Readout10To30{10.0F, 20.0F, 30.0F};
inline constexpr float UsualReadout = 20.0F;
/// The list of a model whose 30 MHz only a fast connection carries.
void AppendReadoutByConnection(std::uint16_t megabits, std::vector<float>& modes);

/// Last mode of a model that knows all triggers.
inline constexpr std::uint32_t LastTriggerMode = 7;

/// First firmware of most models for the board whose gain is linear in dB.
inline constexpr std::uint32_t UsualLinearFirmware = 100;
/// BoardTypeCurve below `firstLinearFirmware`, else BoardTypeLinear.
std::uint32_t FindBoardType(std::uint32_t firmware, std::uint32_t firstLinearFirmware);

template <typename Mode>
void AppendModes(const auto& list, std::vector<Mode>& modes) {
    modes.insert(modes.end(), list.begin(), list.end());
}

}  // namespace ZV
