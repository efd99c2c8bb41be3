#include <fcntl.h>
#include <sys/file.h>
#include <unistd.h>

#include <filesystem>

#include "hal/table_lock.h"

namespace ZV::Test {

TableLock::TableLock() {
    const auto path = std::filesystem::temp_directory_path() / "zentara-open-camera-table.lock";
    const int descriptor = open(path.c_str(), O_RDWR | O_CREAT | O_CLOEXEC, 0666);
    if (descriptor >= 0) (void)flock(descriptor, LOCK_EX);
    file = descriptor;
}

TableLock::~TableLock() {
    if (file >= 0) close(static_cast<int>(file));
}

}  // namespace ZV::Test
