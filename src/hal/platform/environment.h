#pragma once

namespace ZV {

/// Value of a variable of the process's environment, or null. Always null in a process that runs
/// with privileges it was not started with, which so ignores every variable of the library. The
/// text stays good until the thread's next call, or until the process changes its environment.
const char* GetLibraryVariable(const char* name);

}  // namespace ZV
