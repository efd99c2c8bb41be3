#pragma once

#include "driver.h"
#include "image_file.h"
#include "settings_block.h"

namespace ZentaraProgram {

/// One image from an open camera with the settings in force. Says on standard error why there is
/// none, after an interrupt nothing.
ExitCode TakeImage(Session* session, const SettingsBlock& settings, double timeoutSeconds,
                   Image* image);

}  // namespace ZentaraProgram
