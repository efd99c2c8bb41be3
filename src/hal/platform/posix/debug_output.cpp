#include "hal/platform/debug_output.h"

#include <fcntl.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>

#include "hal/platform/environment.h"

namespace ZV {
namespace {

void WriteOnce(int file, const char* text) {
    const std::size_t bytes = std::strlen(text);
    while (write(file, text, bytes) < 0 && errno == EINTR) {
    }
}

}  // namespace

void WriteDebuggerOutput(const char* text) {
    const char* target = GetLibraryVariable("ZENTARA_DEBUG_OUTPUT");
    if (target == nullptr || target[0] == '\0' || text == nullptr) return;
    const int savedError = errno;
    if (std::strcmp(target, "1") == 0) {
        WriteOnce(STDERR_FILENO, text);
    } else if (const int file = open(target, O_WRONLY | O_CREAT | O_APPEND | O_CLOEXEC, 0644);
               file >= 0) {
        WriteOnce(file, text);
        close(file);
    }
    errno = savedError;
}

}  // namespace ZV
