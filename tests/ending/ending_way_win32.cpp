#include <windows.h>

#include <cstdlib>

#include "ending/ending_way.h"

namespace ZV::Test {

namespace {

void ReturnFromMain() {}

void Exit() {
    std::exit(0);
}

void ExitProcessAtOnce() {
    ExitProcess(0);
}

void TerminateItself() {
    TerminateProcess(GetCurrentProcess(), 0);
}

constexpr EndingWay Ways[] = {{"return", ReturnFromMain},
                              {"exit", Exit},
                              {"exitProcess", ExitProcessAtOnce},
                              {"terminateItself", TerminateItself},
                              {"terminatedByParent", RestForEver},
                              {"frameCallback", Exit, EndPlace::FrameCallback},
                              {"exposureCallback", Exit, EndPlace::ExposureCallback},
                              {"settingsCallback", Exit, EndPlace::SettingsCallback},
                              {"triggerWait", Exit, EndPlace::TriggerWait}};

}  // namespace

std::span<const EndingWay> GetEndingWays() {
    return Ways;
}

void WriteMark() {
    DWORD written = 0;
    if (WriteFile(GetStdHandle(STD_OUTPUT_HANDLE), "E", 1, &written, nullptr) == 0) ExitProcess(3);
}

void RestForEver() {
    for (;;) WaitForSingleObject(GetCurrentProcess(), INFINITE);
}

}  // namespace ZV::Test
