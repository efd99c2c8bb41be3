#include "hal/platform/posix/regular_file.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>

namespace ZV {

int OpenRegularFile(const char* path, int flags) {
    // A named pipe without its other end would keep an open that may block for ever.
    const int file = open(path, flags | O_CLOEXEC | O_NONBLOCK | O_NOCTTY, 0644);
    if (file < 0) return -1;
    struct stat status {};
    if (fstat(file, &status) == 0 && S_ISREG(status.st_mode)) return file;
    close(file);
    errno = EACCES;
    return -1;
}

}  // namespace ZV
