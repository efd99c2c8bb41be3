#pragma once

#include <atomic>
#include <memory>
#include <mutex>
#include <string_view>
#include <vector>

#include "camera/morvane_fw_camera.h"
#include "support/simulation_world.h"
#include "support/wait_until.h"

namespace ZV::Test {

/// Addresses of the simulated cameras' blocks.
inline constexpr std::uint32_t DirectoryAddress = 0xD0000000;
inline constexpr std::uint32_t ConfigurationAddress = 0xD0001000;
inline constexpr std::uint32_t ControlAddress = 0xD0002000;
inline constexpr std::uint32_t CommandAddress = 0xD0003000;
inline constexpr std::uint32_t StatusAddress = 0xD0004000;
inline constexpr std::uint32_t StreamAddress = 0xD0005000;

/// A plain camera of the base class, its inside open to tests.
class TestCamera : public MorvaneFWCamera {
  public:
    explicit TestCamera(HALCamera record) : MorvaneFWCamera(record) {}
    ~TestCamera() override { EndWhatCloseLeft(); }

    void GetSymmetricalBinningModes(std::vector<std::uint16_t>& modes) override {
        modes = {1, 2, 4, 8};
    }
    const char* GetModelName() override { return "Test"; }
    std::uint32_t GetAnalogBoardType() override { return 2; }
    bool DoesSupportExternalBuffers() override { return supportsExternalBuffers; }
    std::uint32_t GetImageFormat() override {
        return imageFormat != 0 ? imageFormat : MorvaneFWCamera::GetImageFormat();
    }

    /// Opens, reads and sets up; the first result that is not 0.
    CameraResult Ready();

    using MorvaneFWCamera::GetHALCamera;
    using MorvaneFWCamera::IgnoreFrameInfoVector;
    using MorvaneFWCamera::ReadConfiguration;
    using MorvaneFWCamera::ReadControl;
    using MorvaneFWCamera::registers;
    using MorvaneFWCamera::StoreControl;
    using MorvaneFWCamera::streaming;
    using MorvaneFWCamera::WriteControl;
    using MorvaneFWCamera::WriteControlField;
    using ZCamera::m_connectedCameras;
    using ZCamera::m_numOfConnectedCameras;

    bool supportsExternalBuffers = false;
    std::uint32_t imageFormat = 0;  ///< 0: what the sensor says.
};

/// A simulated world and a TestCamera over its first device, closed and not yet read.
class CameraWorld {
  public:
    explicit CameraWorld(std::string_view scenario);

    SimulationWorld world;
    std::unique_ptr<TestCamera> camera;

    /// Register writes since the last call.
    std::vector<RegisterWrite> TakeWrites();

  private:
    std::size_t writesTaken = 0;
};

/// A client: counts what the callbacks bring and keeps the last image's particulars.
class TestClient {
  public:
    static void* ReceiveImage(ZImageReceivedCallbackStruct* record);
    static void* ExposeDone(void* refCon);

    std::uint32_t GetImageCount() const { return imageCount; }
    std::uint32_t GetExposeCount() const { return exposeCount; }
    struct Delivery {
        bool hasImage;
        std::uint16_t status;
        std::uint32_t format, width, height, size;
        const void* camera;
        bool isBlack;  ///< Every byte of the image is 0.
    };
    std::vector<Delivery> GetDeliveries() const;

    /// While true, the image callback waits.
    std::atomic<bool> isBlocked{false};
    std::atomic<bool> isInCallback{false};

  private:
    std::atomic<std::uint32_t> imageCount{0}, exposeCount{0};
    mutable std::mutex mutex;
    std::vector<Delivery> deliveries;
};

/// A scenario for fast tests: a small mono sensor with a short exposure.
inline constexpr std::string_view SmallCamera =
    R"({"base": "mono", "timeScale": 0, "cameras": [{"sensor": {"width": 64, "height": 48}}]})";

}  // namespace ZV::Test
