#pragma once

#include <filesystem>
#include <string>

namespace ZentaraProgram {

/// Names of files are UTF-8 throughout the program, on each system; where the system takes any
/// bytes, they pass unchanged.
std::filesystem::path MakePath(const std::string& text);
std::string GetPathText(const std::filesystem::path& path);

}  // namespace ZentaraProgram
