#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "exit_codes.h"
#include "measure.h"
#include "settings_options.h"

namespace ZentaraProgram {

/// Options that every command knows.
struct CommonOptions {
    std::string simulation;
    bool asJson = false;
    std::uint32_t camera = 0;
};

struct GrabOptions {
    std::string output;
    SettingsOptions settings;
    double timeoutSeconds = 60;
    bool isBalanced = false;  ///< The white balance is measured first.
    MeasureOptions measure;   ///< Its region.
};

struct MeasureCommandOptions {
    MeasureOptions measure;
    SettingsOptions settings;
};

struct StreamOptions {
    std::string output;  ///< Name of numbered files, or empty for none.
    SettingsOptions settings;
    std::uint64_t count = 0;     ///< 0: no limit of frames.
    double durationSeconds = 0;  ///< 0: no limit of time.
    double timeoutSeconds = 60;  ///< Longest wait for one frame.
    std::uint32_t buffers = 8;
    bool isQuiet = false;
};

struct HistogramOptions {
    std::string source;   ///< Number of a camera, or a file.
    std::string picture;  ///< File for a picture, or empty.
    SettingsOptions settings;
    double timeoutSeconds = 60;
};

struct ProcessOptions {
    std::string file;
    std::string output;
    SettingsOptions settings;
};

ExitCode RunList(const CommonOptions& common);
/// Without keys: all that there is.
ExitCode RunInfo(const CommonOptions& common, const std::vector<std::string>& keys);
ExitCode RunGet(const CommonOptions& common, const std::vector<std::string>& keys);
ExitCode RunLimits(const CommonOptions& common, const std::vector<std::string>& keys);
/// Sends the settings and shows what they changed.
ExitCode RunSet(const CommonOptions& common, const SettingsOptions& options);
/// Shows what a send would change.
ExitCode RunPreflight(const CommonOptions& common, const SettingsOptions& options);
/// Writes the settings in force to a file, after those of `options` were sent.
ExitCode RunSave(const CommonOptions& common, const std::string& file,
                 const SettingsOptions& options);
ExitCode RunGrab(const CommonOptions& common, const GrabOptions& options);
ExitCode RunStream(const CommonOptions& common, const StreamOptions& options);
/// Measures, and prints what came of it.
ExitCode RunMeasure(const CommonOptions& common, Measurement measurement,
                    const MeasureCommandOptions& options);
/// Makes a finished image of a stored frame.
ExitCode RunProcess(const CommonOptions& common, const ProcessOptions& options);
ExitCode RunHistogram(const CommonOptions& common, const HistogramOptions& options);

}  // namespace ZentaraProgram
