#pragma once

#include <windows.h>

#include <cstdint>
#include <string>

#include "windows/driver/road_protocol.h"
#include "windows/support/named_turn.h"

namespace ZV::Test {

/// The test driver as a running service, for the life of the object. What an earlier run has left
/// is removed first. There is one on a machine: another process waits for its turn.
class TestDriver {
  public:
    TestDriver();
    ~TestDriver();
    TestDriver(const TestDriver&) = delete;
    TestDriver& operator=(const TestDriver&) = delete;

    bool IsRunning() const;
    /// Unloads the driver for good.
    void Stop();

    /// Puts camera `index` below the device path `path` ("\\\\?\\..."), and takes it away.
    bool Plug(std::uint32_t index, const std::string& path);
    bool Unplug(std::uint32_t index);
    /// The next request of `code` is answered within the driver.
    bool PrepareAnswer(const RoadPrepared& prepared);
    RoadState GetState() const;

  private:
    bool Control(DWORD code, const void* input, DWORD inputBytes, void* output,
                 DWORD outputBytes) const;

    NamedTurn turn;
    SC_HANDLE manager = nullptr;
    SC_HANDLE service = nullptr;
    HANDLE control = INVALID_HANDLE_VALUE;
};

/// A present device with the library's device interface, for the life of the object: a root device
/// of its own, registered through the setup interface, as a driver's installation and start leave
/// it.
class DeviceInterface {
  public:
    explicit DeviceInterface(std::uint32_t index);
    ~DeviceInterface();
    DeviceInterface(const DeviceInterface&) = delete;
    DeviceInterface& operator=(const DeviceInterface&) = delete;

    /// The device path under which a client opens it; empty when it could not be registered.
    const std::string& GetPath() const { return path; }

  private:
    bool SetLinked();

    void* set;
    std::string path;
};

/// Removes the devices that a run which was killed has left. Requires: the driver's turn, and no
/// DeviceInterface.
void RemoveLeftDevices();

/// Folder of the running program, without a separator at its end.
std::string GetProgramFolder();

}  // namespace ZV::Test
