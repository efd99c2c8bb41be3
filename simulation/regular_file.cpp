#include "simulation/regular_file.h"

#include <sys/stat.h>

#ifdef _WIN32
#include <fcntl.h>
#include <io.h>
#endif

namespace ZV::Simulation {

// The paths of the standard library take letters of no code page but their own, so both systems are
// asked through their C libraries.
#ifdef _WIN32
// By its name a device would be taken for a file; to open one does not wait.
std::optional<std::uint64_t> MeasureRegularFile(const std::string& path) {
    const int descriptor = _open(path.c_str(), _O_RDONLY | _O_BINARY);
    if (descriptor < 0) return std::nullopt;
    struct _stat64 facts = {};
    const bool isKnown = _fstat64(descriptor, &facts) == 0;
    _close(descriptor);
    if (!isKnown || !S_ISREG(facts.st_mode)) return std::nullopt;
    return static_cast<std::uint64_t>(facts.st_size);
}
#else
std::optional<std::uint64_t> MeasureRegularFile(const std::string& path) {
    struct stat facts = {};
    if (stat(path.c_str(), &facts) != 0 || !S_ISREG(facts.st_mode)) return std::nullopt;
    return static_cast<std::uint64_t>(facts.st_size);
}
#endif

}  // namespace ZV::Simulation
