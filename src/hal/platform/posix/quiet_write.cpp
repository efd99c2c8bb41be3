#include "hal/platform/posix/quiet_write.h"

#include <signal.h>
#include <unistd.h>

#include <cerrno>

namespace ZV {
namespace {

constexpr int WriteSignals[] = {SIGPIPE, SIGXFSZ};

/// Keeps the signals of a refused write from the host, which they would end, for its life: the
/// thread holds them back, and those that have come meanwhile are taken away.
class HeldWriteSignals {
  public:
    HeldWriteSignals() {
        sigset_t pending;
        sigpending(&pending);
        sigemptyset(&held);
        for (const int signal : WriteSignals) {
            // One that the host holds back and has not taken yet stays the host's.
            if (sigismember(&pending, signal) != 1) sigaddset(&held, signal);
        }
        pthread_sigmask(SIG_BLOCK, &held, &formerMask);
    }
    ~HeldWriteSignals() { pthread_sigmask(SIG_SETMASK, &formerMask, nullptr); }
    HeldWriteSignals(const HeldWriteSignals&) = delete;
    HeldWriteSignals& operator=(const HeldWriteSignals&) = delete;

    void TakeAway() const {
        static constexpr timespec AtOnce{};
        while (sigtimedwait(&held, nullptr, &AtOnce) >= 0 || errno == EINTR) {
        }
    }

  private:
    sigset_t held;
    sigset_t formerMask;
};

}  // namespace

void WriteQuietly(int descriptor, const void* bytes, std::size_t count) {
    const HeldWriteSignals signals;
    ssize_t written = -1;
    do {
        written = write(descriptor, bytes, count);
    } while (written < 0 && errno == EINTR);
    if (written < 0) signals.TakeAway();
}

}  // namespace ZV
