#pragma once

#include <gtest/gtest.h>

#include <cstdint>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

#include "support/temporary_folder.h"
#include "windows/road/child_process.h"
#include "windows/road/test_driver.h"
#include "zentara/zentara.h"

namespace ZV::Test {

/// One monochrome camera of 64 x 48 pixels.
inline constexpr std::string_view RoadCameraMono =
    R"({"model": "SolvaneA1", "sensor": {"width": 64, "height": 48, "noise": false}})";
/// Another model.
inline constexpr std::string_view RoadCameraOther =
    R"({"model": "SolvaneA2", "sensor": {"width": 64, "height": 48, "noise": false}})";

/// What the simulation holds for a camera.
struct HostState {
    std::uint32_t openHandles = 0, reservedResources = 0, pendedRequests = 0, attachedBuffers = 0;
    std::uint64_t framesSent = 0;
    std::uint32_t isStreaming = 0;
};

/// The whole road: devices that the setup interface lists, the driver behind them, and a process
/// that serves them from the simulation. The client is the test's own process, which knows of no
/// simulation.
class Road : public testing::Test {
  protected:
    explicit Road(std::vector<std::string_view> cameras = {RoadCameraMono});
    ~Road() override;

    void SetUp() override;

    TestDriver& GetDriver();
    const std::string& GetPath(std::uint32_t camera = 0) const {
        return interfaces[camera]->GetPath();
    }
    ChildProcess& GetHost() { return *host; }
    /// The host's process goes without a word.
    void KillHost() { host->Kill(); }

    bool AddFault(std::string fault, std::uint32_t camera = 0);
    HostState GetState(std::uint32_t camera = 0);
    std::uint32_t Peek(std::uint32_t address, std::uint32_t camera = 0);
    /// True when the simulation has sent a frame of this number with these pixels.
    bool WasSent(const Zentara_Frame& frame) const;

  private:
    void WriteScenario(const std::vector<std::string_view>& cameras);

    TemporaryFolder folder;
    std::vector<std::unique_ptr<DeviceInterface>> interfaces;
    std::unique_ptr<ChildProcess> host;
};

}  // namespace ZV::Test
