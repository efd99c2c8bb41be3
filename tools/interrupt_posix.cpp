#include "interrupt.h"

#include <atomic>
#include <csignal>

namespace ZentaraProgram {
namespace {

// The handler runs on any thread, and other threads than that one ask.
std::atomic<bool> interrupted = false;
static_assert(std::atomic<bool>::is_always_lock_free, "a signal handler may not wait for a lock");

extern "C" void RememberInterrupt(int signal) {
    interrupted = true;
    (void)std::signal(signal, SIG_DFL);
}

}  // namespace

void CatchInterrupt() {
    (void)std::signal(SIGINT, &RememberInterrupt);
    (void)std::signal(SIGTERM, &RememberInterrupt);
}

bool IsInterrupted() {
    return interrupted;
}

}  // namespace ZentaraProgram
