#pragma once

#include <cstdint>
#include <string_view>

#include "camera/register_map.h"

namespace ZV::Simulation {

/// What a simulated camera of a model is made of, unless a scenario says otherwise. Contents are
/// chosen so that each model can be listed, opened and streamed in the state in which the library
/// sets it up.
struct ModelRow {
    std::uint16_t id;
    const char* name;
    std::uint16_t sensorId;
    std::uint16_t width, height;
    std::uint8_t maxBitDepth;
    std::uint8_t colourKind;  ///< 0 monochrome, 1 Bayer.
    std::uint32_t configurationVersion, controlVersion;
    std::uint16_t streamingVersion;
    std::uint8_t boardType;  ///< Analog board: 1 curve, 2 linear, 3 ratio.
    std::uint8_t tag;        ///< Tag field of its isochronous packets.
    bool isBinningCode2Mode8;
    std::uint32_t features;  ///< Configuration quadlet 169.
};

inline constexpr std::uint32_t VersionModernConfiguration = MakeVersion(2, 9);
inline constexpr std::uint32_t VersionTweakConfiguration = MakeVersion(2, 11);
inline constexpr std::uint32_t VersionModernControl = MakeVersion(2, 8);
/// From this control version a camera is told its packet size.
inline constexpr std::uint32_t VersionPacketSizeControl = MakeVersion(2, 3);

/// Ids of models that behave in a way of their own at the wire.
inline constexpr std::uint16_t ModelFolary = 8;
inline constexpr std::uint16_t ModelSolvaneK1 = 9;
inline constexpr std::uint16_t ModelSolvaneD1 = 15;
inline constexpr std::uint16_t ModelPellanB1 = 25;
inline constexpr std::uint16_t ModelMetrona = 1002;

/// Null for a name that no model has.
const ModelRow* FindModel(std::string_view name);
/// The row of an id; that of `Unknown` for an id that no model has.
const ModelRow& GetModel(std::uint32_t id);

}  // namespace ZV::Simulation
