#include "hal/table_lock.h"

#if !defined(_WIN32)
#include <fcntl.h>
#include <sys/file.h>
#include <unistd.h>

#include <filesystem>
#endif

namespace ZV::Test {

#if defined(_WIN32)

TableLock::TableLock() = default;

TableLock::~TableLock() = default;

#else

TableLock::TableLock() {
    const auto path = std::filesystem::temp_directory_path() / "zentara-open-camera-table.lock";
    file = open(path.c_str(), O_RDWR | O_CREAT | O_CLOEXEC, 0666);
    if (file >= 0) (void)flock(file, LOCK_EX);
}

TableLock::~TableLock() {
    if (file >= 0) close(file);
}

#endif

}  // namespace ZV::Test
