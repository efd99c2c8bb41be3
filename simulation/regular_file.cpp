#include "simulation/regular_file.h"

#include <sys/stat.h>

namespace ZV::Simulation {

// The paths of the standard library take letters of no code page but their own, so both systems are
// asked through their C libraries.
std::optional<std::uint64_t> MeasureRegularFile(const std::string& path) {
#ifdef _WIN32
    struct _stat64 facts = {};
    const bool isThere = _stat64(path.c_str(), &facts) == 0;
#else
    struct stat facts = {};
    const bool isThere = stat(path.c_str(), &facts) == 0;
#endif
    if (!isThere || !S_ISREG(facts.st_mode)) return std::nullopt;
    return static_cast<std::uint64_t>(facts.st_size);
}

}  // namespace ZV::Simulation
