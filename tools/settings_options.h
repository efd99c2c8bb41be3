#pragma once

#include <string>
#include <vector>

#include "colour_options.h"
#include "exit_codes.h"
#include "settings_file.h"

namespace ZentaraProgram {

/// Settings that a command line asks for: those that it implies, those of a file, then those of
/// --set, then those that --colour and its like stand for.
struct SettingsOptions {
    std::string file;
    std::vector<std::string> assignments;  ///< "exposure=250ms"
    ColourOptions colour;
    /// What the command itself asks for, where the file and --set do not.
    std::vector<SettingEdit> first;
};

/// Checks all that can be checked without a camera; says on standard error what is wrong.
ExitCode ReadEdits(const SettingsOptions& options, std::vector<SettingEdit>* edits);

/// Makes the edits in a block that was read from the camera. Says on standard error what the camera
/// does not have or allow; the block is then not to be used. What is already so is no edit.
ExitCode ApplyEdits(const Camera& camera, const std::vector<SettingEdit>& edits,
                    SettingsBlock* block);

/// Edits with the blocks before and after they were sent.
struct SentSettings {
    std::vector<SettingEdit> edits;
    SettingsBlock before;
    SettingsBlock asked;
    SettingsBlock sent;
};

/// Opens a camera with the settings of a command line in force: what a command does first. What is
/// wrong with the options is told before a camera is looked for, and nothing is sent unless every
/// edit is accepted. Without edits that change something the camera is only read.
ExitCode OpenWithSettings(std::uint32_t cameraId, const SettingsOptions& options, Session* session,
                          SentSettings* settings);

/// Says on standard error which edits `block` does not hold as they were asked.
void TellMended(const SentSettings& settings, const SettingsBlock& block);

}  // namespace ZentaraProgram
