#pragma once

#include <chrono>

namespace ZentaraProgram {

/// How often who waits looks for an interrupt and for the end of its time.
inline constexpr std::chrono::milliseconds InterruptPoll{50};

/// Takes Ctrl-C over: the first one is remembered and asks for a clean end, a second one ends the
/// process.
void CatchInterrupt();
bool IsInterrupted();

}  // namespace ZentaraProgram
