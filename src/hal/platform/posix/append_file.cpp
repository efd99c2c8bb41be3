#include "hal/platform/append_file.h"

#include <fcntl.h>
#include <unistd.h>

#include <cerrno>
#include <new>

namespace ZV {

struct AppendFile {
    int descriptor;
};

AppendFile* OpenAppendFile(const char* path) {
    const int savedError = errno;
    const int descriptor = open(path, O_WRONLY | O_CREAT | O_APPEND | O_CLOEXEC | O_NOCTTY, 0644);
    auto* const file = descriptor >= 0 ? new (std::nothrow) AppendFile{descriptor} : nullptr;
    if (file == nullptr && descriptor >= 0) close(descriptor);
    errno = savedError;
    return file;
}

void AppendToFile(AppendFile* file, const void* bytes, std::size_t count) {
    const int savedError = errno;
    while (write(file->descriptor, bytes, count) < 0 && errno == EINTR) {
    }
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
