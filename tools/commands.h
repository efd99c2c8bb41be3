#pragma once

#include <cstdint>
#include <string>

#include "exit_codes.h"

namespace ZentaraProgram {

/// Options that every command knows.
struct CommonOptions {
    std::string simulation;
    bool asJson = false;
    std::uint32_t camera = 0;
};

struct GrabOptions {
    std::string output;
    double timeoutSeconds = 60;
    bool mayOverwrite = false;
};

struct StreamOptions {
    std::string output;          ///< Name of numbered files, or empty for none.
    std::uint64_t count = 0;     ///< 0: no limit of frames.
    double durationSeconds = 0;  ///< 0: no limit of time.
    double timeoutSeconds = 60;  ///< Longest wait for one frame.
    std::uint32_t buffers = 8;
    bool isQuiet = false;
};

ExitCode RunList(const CommonOptions& common);
ExitCode RunInfo(const CommonOptions& common);
ExitCode RunGrab(const CommonOptions& common, const GrabOptions& options);
ExitCode RunStream(const CommonOptions& common, const StreamOptions& options);

}  // namespace ZentaraProgram
