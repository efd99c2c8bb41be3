#pragma once

#include <string>
#include <vector>

#include "settings_block.h"
#include "settings_file.h"

namespace ZentaraProgram {

/// What a command line asks for in the way of colours.
struct ColourOptions {
    bool isColour = false;  ///< Post-processing on, and three colours.
    std::string format;     ///< Name of a format, or empty.
    std::string algorithm;  ///< "average", "fast", "bicubic", or empty.
    /// The colours are made of a frame in a file: only post-processing counts.
    bool isOfStoredFrame = false;

    [[nodiscard]] bool IsEmpty() const { return !isColour && format.empty() && algorithm.empty(); }
};

/// Why the options cannot be followed whatever the camera is; empty when they can.
std::string FindColourProblem(const ColourOptions& options);

/// Adds the settings that the options mean on this camera behind the edits that are there already,
/// which tell the depth where no format is named. `block` holds the settings in force. Returns why
/// the camera cannot do it, or an empty text.
std::string AddColourEdits(const Camera& camera, const SettingsBlock& block,
                           const ColourOptions& options, std::vector<SettingEdit>* edits);

}  // namespace ZentaraProgram
