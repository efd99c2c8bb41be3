#pragma once

#include <optional>
#include <string>

#include "driver.h"
#include "settings_block.h"

namespace ZentaraProgram {

/// Part of an image, in pixels of the image.
struct Region {
    std::uint32_t x = 0, y = 0, width = 0, height = 0;
};

/// Reads "X,Y,WxH"; nothing for a text of another form or for a region without pixels.
std::optional<Region> ParseRegion(const std::string& text);

/// What the library measures over a region on images of its own, and then sends to the camera.
enum class Measurement { WhiteBalance, Exposure };

/// How a measurement is made.
struct MeasureOptions {
    std::string region;  ///< "X,Y,WxH", or empty for the whole image.
    double timeoutSeconds = 60;
};

/// Why the options cannot be followed whatever the camera is; empty when they can.
std::string FindMeasureProblem(const MeasureOptions& options);

/// Measures with the settings in force, which are in `settings`; what comes of it is there too.
/// Says on standard error why it cannot; after an interrupt nothing.
ExitCode Measure(Measurement measurement, const MeasureOptions& options, Session* session,
                 SettingsBlock* settings);

}  // namespace ZentaraProgram
