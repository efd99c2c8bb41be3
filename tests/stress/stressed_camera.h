#pragma once

#include <gtest/gtest.h>

#include <algorithm>
#include <atomic>
#include <cstddef>
#include <cstdint>
#include <deque>
#include <initializer_list>
#include <memory>
#include <mutex>
#include <vector>

#include "stress/split_mix.h"
#include "support/expect_zerr.h"
#include "zentara/zentara.h"

namespace ZV::Test {

inline constexpr std::uint32_t StressWidth = 64, StressHeight = 48;
/// Room for every format at the whole sensor.
inline constexpr std::uint32_t StressFrameBytes = StressWidth * StressHeight * 6;

inline void ExpectOneOf(ZentaraResult result, std::initializer_list<std::uint32_t> allowed) {
    EXPECT_NE(allowed.end(), std::find(allowed.begin(), allowed.end(), result))
        << GetZerrName(result);
}

/// Frames and blocks that were given to the library: with aborts from everywhere nobody knows when
/// one is free again, so each is used once. Thread-safe.
class Handouts {
  public:
    Zentara_Frame* MakeFrame();
    Zentara_Settings* Keep(const Zentara_Settings& block);

  private:
    struct FrameBuffer {
        Zentara_Frame frame{};
        std::vector<std::uint8_t> pixels;
    };

    std::mutex mutex;
    std::vector<std::unique_ptr<FrameBuffer>> frames;
    std::deque<Zentara_Settings> blocks;
};

/// A camera under stress, and what the test knows of it.
struct StressedCamera {
    ZentaraHandle handle{};
    Handouts* handouts = nullptr;
    Zentara_Settings start{};
    std::atomic<std::uint64_t> exposures{0}, delivered{0};
    std::atomic<std::uint64_t> changesTaken{0};  ///< By Zentara_QueueSettings.
    std::atomic<std::uint64_t> changesMade{0};   ///< Told by a callback, and good.
    std::atomic<std::uint64_t> grabs{0};         ///< That gave an image.
    std::atomic<std::uint64_t> measured{0};      ///< At most so many images were taken to measure.
    std::atomic<std::uint64_t> aborts{0}, triggers{0};
    std::atomic<std::uint64_t> callbackTurns{0};
    std::atomic<int> refills{0};     ///< Frames that callbacks may still queue.
    std::atomic<bool> isBusy{true};  ///< Callbacks call the library.
};

/// Another exposure, offset and finish: nothing that a stream has to stop for.
Zentara_Settings DrawChange(const Zentara_Settings& start, SplitMix& numbers);

/// Another of all that four clients may fight about: region, binning, format and depth, wheel,
/// readout speed, trigger and camera mode.
Zentara_Settings DrawGeometry(const Zentara_Settings& start, SplitMix& numbers);

/// Queues a frame that Serve delivers.
ZentaraResult QueueStressFrame(StressedCamera& camera, std::uint32_t flags);

/// Queues a change on top of what the camera has now.
void QueueStressChange(StressedCamera& camera, SplitMix& numbers);

/// Callbacks; `userPrivate` is the address of the StressedCamera. They call what a callback may.
void Serve(std::uint64_t userPrivate, std::uint32_t userData, std::uint32_t errorCode,
           std::uint32_t flags);
void ServeChange(std::uint64_t userPrivate, std::uint32_t userData, std::uint32_t errorCode,
                 std::uint32_t flags);

/// Asks for all that Zentara_GetInfo tells.
void AskForInformation(const StressedCamera& camera);
void ReadStressedCamera(const StressedCamera& camera);
void TriggerStressedCamera(StressedCamera& camera);

}  // namespace ZV::Test
