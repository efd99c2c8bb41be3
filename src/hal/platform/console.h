#pragma once

namespace ZV {

/// Gives the standard output of a process that has a console back to it under `title`. Has no
/// effect without a console, and never takes away a standard output that goes to a file or a pipe.
void PrepareLogConsole(const char* title);

}  // namespace ZV
