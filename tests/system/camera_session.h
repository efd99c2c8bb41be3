#pragma once

#include <condition_variable>
#include <cstdint>
#include <memory>
#include <mutex>
#include <string_view>
#include <vector>

#include "camera/camera.h"
#include "support/simulation_world.h"
#include "zentara/zentara.h"

namespace ZV::Test {

/// An image as the client gets it, with the pixels that came with it.
struct DeliveredFrame {
    ZentaraResult result = zerrNone;  ///< Of the call that took it.
    Zentara_Frame frame{};
    std::vector<std::uint8_t> pixels;

    /// Samples of one or two bytes, by the frame's bits.
    std::vector<std::uint16_t> GetSamples() const;
};

/// A client of the flat interface with one camera of a simulated world open. Loads the driver,
/// lists and opens; the destructor undoes it. `world` tells what the simulation saw.
class CameraSession {
  public:
    explicit CameraSession(std::string_view scenario, std::uint32_t position = 0);
    ~CameraSession();
    CameraSession(const CameraSession&) = delete;
    CameraSession& operator=(const CameraSession&) = delete;

    /// Whether the camera could be opened; the reason fails the test.
    bool IsOpen() const { return handle != ZentaraHandle{}; }
    ZentaraHandle GetHandle() const { return handle; }
    const std::vector<Zentara_CamListItem>& GetItems() const { return items; }
    /// The camera behind the handle, for what the flat interface does not change yet.
    ZCamera& GetCamera() const;

    /// Takes one image into a buffer of the image's own size. Gives up after 30 seconds.
    DeliveredFrame Grab();
    /// Queues `count` frames, streams until all are served or 30 seconds have passed, and stops.
    /// Fewer come back in the latter case.
    std::vector<DeliveredFrame> Stream(std::size_t count);

    /// Bytes of isochronous payload that the camera was told at the last start of a stream.
    std::uint32_t GetPacketBytes() const;

    /// The trace's record of a delivered frame, by its rolling number. Fails the test if there is
    /// not exactly one.
    TraceRecord FindSent(const DeliveredFrame& delivered) const;

    SimulationWorld world;

  private:
    static void ReceiveFrame(std::uint64_t userPrivate, std::uint32_t userData,
                             std::uint32_t errorCode, std::uint32_t flags);
    DeliveredFrame MakeFrame() const;

    std::vector<Zentara_CamListItem> items;
    ZentaraHandle handle{};
    std::mutex mutex;
    std::condition_variable received;
    std::size_t receivedCount = 0;
};

}  // namespace ZV::Test
