#pragma once

namespace ZV {

/// Hands a text to the system's debugger output; silent when nobody listens. On POSIX it goes to
/// standard error while `ZENTARA_DEBUG_OUTPUT` is 1, or is appended to the file that the variable
/// names; what a pipe or a device of that name does not take at once is lost. Thread-safe; one call
/// is one piece of output.
void WriteDebuggerOutput(const char* text);

}  // namespace ZV
