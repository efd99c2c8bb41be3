#pragma once

#include <windows.h>

namespace ZV::Test {

/// Calls `create`, which calls CreateProcess, again when the system has lost the process in its
/// start, as Wine does now and then; three times at most. The last error is that of the last try.
template <typename Create>
[[nodiscard]] bool StartProcessDespiteLosses(Create create) {
    constexpr int Tries = 3;
    for (int i = 0; i < Tries; ++i) {
        if (create()) return true;
        if (GetLastError() != ERROR_INTERNAL_ERROR) return false;
    }
    return false;
}

}  // namespace ZV::Test
