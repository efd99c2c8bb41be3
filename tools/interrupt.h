#pragma once

namespace ZentaraProgram {

/// Takes Ctrl-C over: the first one is remembered and asks for a clean end, a second one ends the
/// process.
void CatchInterrupt();
bool IsInterrupted();

}  // namespace ZentaraProgram
