#pragma once

#include <filesystem>
#include <fstream>
#include <sstream>
#include <string>

namespace ZV::Test {

/// All of a file, "" when there is none. In one piece: a file that grows meanwhile is not followed.
inline std::string ReadTextFile(const std::filesystem::path& path) {
    const std::ifstream file(path, std::ios::binary);
    std::ostringstream text;
    text << file.rdbuf();
    return text.str();
}

}  // namespace ZV::Test
