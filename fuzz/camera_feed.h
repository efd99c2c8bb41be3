#pragma once

#include <condition_variable>
#include <cstdint>
#include <mutex>
#include <span>
#include <thread>

#include "fuzz/good_packets.h"
#include "zentara/zentara.h"

namespace ZV::Fuzzing {

/// What a camera sends while a call waits for its images.
struct FeedPlan {
    ZentaraHandle handle;
    std::uint8_t form;         ///< A DeliveryForm; a frame starts wherever none is being sent.
    std::uint8_t frameNumber;  ///< Of the first request, and one more for each that follows.
    std::uint8_t requests;
    std::span<const std::uint8_t> bytes;
};

/// A thread that sends for as long as it lives, and aborts over and over when all has been sent: a
/// call that waits for images ends at last. `packets` are its own meanwhile.
class CameraFeed {
  public:
    CameraFeed(std::size_t sendingCamera, GoodPackets& goodPackets, const FeedPlan& feedPlan);
    ~CameraFeed();
    CameraFeed(const CameraFeed&) = delete;
    CameraFeed& operator=(const CameraFeed&) = delete;

  private:
    void Run();
    bool Send();
    bool Rest();

    const std::size_t camera;
    GoodPackets& packets;  // borrowed from the client, until the thread has ended
    const FeedPlan plan;
    std::uint8_t sent = 0;
    std::mutex mutex;
    std::condition_variable ended;
    bool hasEnded = false;  // guarded by mutex
    std::thread thread;     // the last member: it uses the others
};

}  // namespace ZV::Fuzzing
