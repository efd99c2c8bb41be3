#include "hal/debug_output_file.h"

#include <cstdlib>
#include <fstream>
#include <iterator>

namespace ZV::Test {
namespace {

constexpr char Variable[] = "ZENTARA_DEBUG_OUTPUT";

}  // namespace

DebugOutputFile::DebugOutputFile(const std::filesystem::path& folder)
    : path(folder / "debug_output.txt") {
    setenv(Variable, path.c_str(), 1);
}

DebugOutputFile::~DebugOutputFile() {
    unsetenv(Variable);
}

std::string DebugOutputFile::Take() {
    std::ifstream file(path, std::ios::binary);
    const std::string text{std::istreambuf_iterator<char>(file), std::istreambuf_iterator<char>()};
    const std::size_t first = taken;
    taken = text.size();
    return text.substr(first);
}

}  // namespace ZV::Test
