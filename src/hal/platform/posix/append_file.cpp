#include "hal/platform/append_file.h"

#include <fcntl.h>
#include <unistd.h>

#include <cerrno>
#include <new>

#include "hal/platform/posix/quiet_write.h"
#include "hal/platform/posix/regular_file.h"

namespace ZV {

struct AppendFile {
    int descriptor;
};

AppendFile* OpenAppendFile(const char* path) {
    const int savedError = errno;
    const int descriptor = OpenRegularFile(path, O_WRONLY | O_CREAT | O_APPEND);
    auto* const file = descriptor >= 0 ? new (std::nothrow) AppendFile{descriptor} : nullptr;
    if (file == nullptr && descriptor >= 0) close(descriptor);
    errno = savedError;
    return file;
}

void AppendToFile(AppendFile* file, const void* bytes, std::size_t count) {
    const int savedError = errno;
    WriteQuietly(file->descriptor, bytes, count);
    errno = savedError;
}

void CloseAppendFile(AppendFile* file) {
    if (file == nullptr) return;
    const int savedError = errno;
    close(file->descriptor);
    delete file;
    errno = savedError;
}

}  // namespace ZV
