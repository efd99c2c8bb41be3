#pragma once

#include <cstdint>
#include <filesystem>
#include <fstream>
#include <string>
#include <system_error>

namespace ZV::Test {

/// A file as long as it is now, "" when there is none: what is appended meanwhile is not followed.
inline std::string ReadTextFile(const std::filesystem::path& path) {
    std::error_code missing;
    const std::uintmax_t size = std::filesystem::file_size(path, missing);
    std::string text(missing ? 0 : size, '\0');
    std::ifstream file(path, std::ios::binary);
    file.read(text.data(), static_cast<std::streamsize>(text.size()));
    text.resize(static_cast<std::size_t>(file.gcount()));
    return text;
}

}  // namespace ZV::Test
