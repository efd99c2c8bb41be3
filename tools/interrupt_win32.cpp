#include <windows.h>

#include <atomic>

#include "interrupt.h"

namespace ZentaraProgram {
namespace {

// The handler runs on a thread of its own.
std::atomic<bool> interrupted = false;

BOOL WINAPI RememberInterrupt(DWORD event) {
    if (interrupted.exchange(true)) return FALSE;  // The system's own handler ends the process.
    // A closed window, the end of a session: the process is ended when this returns, in a few
    // seconds at the latest. Its own end comes before that.
    if (event != CTRL_C_EVENT && event != CTRL_BREAK_EVENT) Sleep(INFINITE);
    return TRUE;
}

}  // namespace

void CatchInterrupt() {
    SetConsoleCtrlHandler(nullptr, FALSE);  // Whoever started this may have switched Ctrl-C off.
    SetConsoleCtrlHandler(&RememberInterrupt, TRUE);
}

bool IsInterrupted() {
    return interrupted;
}

}  // namespace ZentaraProgram
