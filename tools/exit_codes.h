#pragma once

namespace ZentaraProgram {

/// Exit codes of the program, part of its interface.
enum ExitCode : int {
    ExitDone = 0,
    ExitFailed = 1,      ///< Camera or capture failed, or a file could not be read or written.
    ExitWrongUse = 2,    ///< Arguments, or a scenario that is refused.
    ExitNoCamera = 3,    ///< No such camera in the list.
    ExitCameraBusy = 4,  ///< Code 30, or a listed camera that cannot be opened.
    ExitCameraGone = 5,  ///< The camera is missing from the list after a failure.
    ExitDamaged = 6,     ///< Finished, with lost or damaged frames.
    ExitInterrupted = 130,
};

}  // namespace ZentaraProgram
