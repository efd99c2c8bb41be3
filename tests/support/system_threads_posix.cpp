#include <filesystem>
#include <fstream>
#include <iterator>
#include <string>

#include "support/system_threads.h"

namespace ZV::Test {

bool IsAsleep(std::uint32_t id) {
    std::ifstream file("/proc/self/task/" + std::to_string(id) + "/stat");
    std::string line;
    std::getline(file, line);
    const std::size_t name = line.rfind(')');
    return name != std::string::npos && line.compare(name, 3, ") S") == 0;
}

std::size_t CountThreads() {
    const std::filesystem::directory_iterator tasks("/proc/self/task");
    return static_cast<std::size_t>(std::distance(begin(tasks), end(tasks)));
}

}  // namespace ZV::Test
