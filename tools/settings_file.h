#pragma once

#include <cstddef>
#include <nlohmann/json_fwd.hpp>
#include <string>
#include <vector>

#include "settings_block.h"

namespace ZentaraProgram {

/// A setting that somebody asks for, checked as far as it can be without a camera.
struct SettingEdit {
    const Setting* setting = nullptr;
    SettingValue value = 0;
    std::string place;  ///< "night.json:4: " for one of a file, else empty.
};

/// Reads the settings of a file. Each thing that is wrong with it becomes a line of `problems`,
/// with the file's name and the line. Nothing of a file with a problem is to be used.
std::vector<SettingEdit> ReadSettingsFile(const std::string& path,
                                          std::vector<std::string>* problems);

/// Writes the settings that `block` holds for its camera. Returns the reason of a failure, or an
/// empty text; an older file of that name then stays as it was.
std::string WriteSettingsFile(const std::string& path, const Camera& camera,
                              const SettingsBlock& block);

/// A value as a file holds it: a number or true and false where these say it all, else a text with
/// its unit.
nlohmann::ordered_json GetValueAsJson(const Setting& setting, SettingValue value);

}  // namespace ZentaraProgram
