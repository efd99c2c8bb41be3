#include "paths.h"

namespace ZentaraProgram {

std::filesystem::path MakePath(const std::string& text) {
    return std::u8string(text.begin(), text.end());
}

std::string GetPathText(const std::filesystem::path& path) {
    const std::u8string text = path.u8string();
    return {text.begin(), text.end()};
}

}  // namespace ZentaraProgram
