#include "hal/platform/debug_output.h"

#include <fcntl.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>

#include "hal/platform/environment.h"
#include "hal/platform/posix/quiet_write.h"

namespace ZV {
namespace {

/// A terminal and a named pipe are as good as a file, but none is waited for.
int OpenTarget(const char* path) {
    return open(path, O_WRONLY | O_CREAT | O_APPEND | O_CLOEXEC | O_NONBLOCK | O_NOCTTY, 0644);
}

}  // namespace

void WriteDebuggerOutput(const char* text) {
    const char* target = GetLibraryVariable("ZENTARA_DEBUG_OUTPUT");
    if (target == nullptr || target[0] == '\0' || text == nullptr) return;
    const int savedError = errno;
    if (std::strcmp(target, "1") == 0) {
        WriteQuietly(STDERR_FILENO, text, std::strlen(text));
    } else if (const int file = OpenTarget(target); file >= 0) {
        WriteQuietly(file, text, std::strlen(text));
        close(file);
    }
    errno = savedError;
}

}  // namespace ZV
