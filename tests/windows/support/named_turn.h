#pragma once

#include <windows.h>

namespace ZV::Test {

/// The turn at something that all suites of the machine share, by the name of a mutex. Ends with
/// the object.
class NamedTurn {
  public:
    /// Waits for it at most `limitMs`.
    explicit NamedTurn(const char* name, DWORD limitMs = INFINITE)
        : mutex(CreateMutexA(nullptr, FALSE, name)) {
        const DWORD outcome = WaitForSingleObject(mutex, limitMs);
        isOurs = outcome == WAIT_OBJECT_0 || outcome == WAIT_ABANDONED;
    }
    ~NamedTurn() {
        if (isOurs) ReleaseMutex(mutex);
        CloseHandle(mutex);
    }
    NamedTurn(const NamedTurn&) = delete;
    NamedTurn& operator=(const NamedTurn&) = delete;

    [[nodiscard]] bool IsOurs() const { return isOurs; }

  private:
    HANDLE mutex;
    bool isOurs = false;
};

/// The turn at the table of the open cameras.
inline constexpr char OpenCameraTableTurn[] = "zentara-open-camera-table-of-the-tests";
/// The turn at the driver that the tests install, and its devices.
inline constexpr char TestDriverTurn[] = "ZentaraTestDriverTurn";

}  // namespace ZV::Test
