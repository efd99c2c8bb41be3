#include "interrupt.h"

#include <csignal>

namespace ZentaraProgram {
namespace {

volatile std::sig_atomic_t interrupted = 0;

extern "C" void RememberInterrupt(int signal) {
    interrupted = 1;
    (void)std::signal(signal, SIG_DFL);
}

}  // namespace

void CatchInterrupt() {
    (void)std::signal(SIGINT, &RememberInterrupt);
    (void)std::signal(SIGTERM, &RememberInterrupt);
}

bool IsInterrupted() {
    return interrupted != 0;
}

}  // namespace ZentaraProgram
