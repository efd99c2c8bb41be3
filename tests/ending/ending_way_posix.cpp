#include <unistd.h>

#include <csignal>
#include <cstdlib>

#include "ending/ending_way.h"

namespace ZV::Test {

namespace {

void ReturnFromMain() {}

void Exit() {
    std::exit(0);
}

void QuickExit() {
    std::quick_exit(0);
}

void ExitAtOnce() {
    _exit(0);
}

void Terminate() {
    (void)std::raise(SIGTERM);
}

constexpr EndingWay Ways[] = {{"return", ReturnFromMain},
                              {"exit", Exit},
                              {"quickExit", QuickExit},
                              {"exitAtOnce", ExitAtOnce},
                              {"terminate", Terminate},
                              {"frameCallback", Exit, EndPlace::FrameCallback},
                              {"exposureCallback", Exit, EndPlace::ExposureCallback},
                              {"settingsCallback", Exit, EndPlace::SettingsCallback},
                              {"triggerWait", Exit, EndPlace::TriggerWait}};

}  // namespace

std::span<const EndingWay> GetEndingWays() {
    return Ways;
}

void WriteMark() {
    if (write(STDOUT_FILENO, "E", 1) != 1) _exit(3);
}

void RestForEver() {
    for (;;) (void)pause();
}

}  // namespace ZV::Test
