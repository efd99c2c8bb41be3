// Every allocation fails once. The world is real but for the allocator: number n is refused, for n
// from 1 until a run comes to its end without it. A leak check at the end of the process tells what
// a refusal has lost.

#include <gtest/gtest.h>

#include <atomic>
#include <mutex>
#include <thread>

#include "hal/platform/clock.h"
#include "memory/failing_allocator.h"
#include "support/flat_camera.h"

namespace ZV::Test {
namespace {

constexpr std::int64_t AllocationsMax = 20'000;  ///< Far above what any run takes.
constexpr ZentaraResult GreatestCode = 32;
constexpr const char* TwoCameras =
    R"({"base": "mono", "timeScale": 0, "cameras": [
        {"sensor": {"width": 64, "height": 48, "noise": false}},
        {"model": "Folary", "sensor": {"width": 64, "height": 48, "noise": false}}]})";

bool IsKnown(ZentaraResult result) {
    return result <= GreatestCode;
}

/// Ends a grab for which no image comes: where the memory for a number of its frames was refused,
/// the camera sends none that fits.
class GrabEnder {
  public:
    GrabEnder() : thread([this] { Run(); }) {}
    ~GrabEnder() {
        isDone = true;
        thread.join();
    }
    GrabEnder(const GrabEnder&) = delete;
    GrabEnder& operator=(const GrabEnder&) = delete;

    /// The camera whose grab is ended, or 0 for none; no call to the former one goes on then.
    void SetCamera(ZentaraHandle opened) {
        const std::lock_guard hold(mutex);
        handle = opened;
    }
    /// True when the grab went on for so long without reason that the test has failed.
    bool HasGivenUp() const { return hasGivenUp; }

  private:
    void Run() {
        const auto isOver = [this] { return isDone.load(); };
        if (WaitUntil(isOver, std::chrono::milliseconds(200))) return;
        if (WaitUntil([&] { return isOver() || HasRefusedAllocation(); },
                      std::chrono::seconds(30))) {
            if (WaitUntil(isOver, std::chrono::milliseconds(200))) return;
        } else {
            hasGivenUp = true;
        }
        // An abort before the grab waits does not count, so it is repeated.
        (void)WaitUntil(
            [&] {
                const std::lock_guard hold(mutex);
                if (!isOver() && handle != 0) (void)Zentara_Abort(handle);
                return isOver();
            },
            std::chrono::seconds(30));
    }

    std::mutex mutex;
    ZentaraHandle handle = 0;  // under `mutex`
    std::atomic<bool> isDone{false};
    std::atomic<bool> hasGivenUp{false};
    std::thread thread;
};

class FailingAllocation : public testing::Test {
  protected:
    FailingAllocation() { SetWaitClockDivisor(1000); }
    ~FailingAllocation() override { SetWaitClockDivisor(1); }

    void ExpectNothingHeld() const {
        EXPECT_EQ(0u, world.GetState().openHandles);
        EXPECT_EQ(0u, world.GetState().reservedBandwidths);
        EXPECT_EQ(0u, world.GetState().pendedRequests);
    }

    SimulationWorld world{SmallMono};
    Zentara_CamListItem items[4] = {};
};

TEST_F(FailingAllocation, OfOpenGrabAndCloseGivesACodeAndTheNextRunIsClean) {
    bool hasRefused = true;
    for (std::int64_t failing = 1; hasRefused && failing < AllocationsMax; ++failing) {
        SCOPED_TRACE(failing);
        ASSERT_ZERR(zerrNone, Zentara_LoadDriver());
        std::uint32_t length = 4;
        ASSERT_ZERR(zerrNone, Zentara_ListCameras(items, &length));
        ASSERT_EQ(1u, length);
        ClientFrame frame(64 * 48);
        ZentaraHandle handle = 0;
        ZentaraResult opened = zerrNone;
        ZentaraResult grabbed = zerrNone;
        ZentaraResult closed = zerrNone;
        {
            GrabEnder ender;
            BeginAllocations(failing);
            opened = Zentara_OpenCamera(items[0].cameraId, &handle);
            if (opened == zerrNone) {
                ender.SetCamera(handle);
                grabbed = Zentara_GrabFrame(handle, frame.Get());
                ender.SetCamera(0);
                closed = Zentara_CloseCamera(handle);
            }
            hasRefused = EndAllocations();
            EXPECT_FALSE(ender.HasGivenUp());
        }
        EXPECT_PRED1(IsKnown, opened);
        EXPECT_PRED1(IsKnown, grabbed);
        EXPECT_PRED1(IsKnown, closed);
        EXPECT_TRUE(frame.IsGuardIntact());
        if (!hasRefused) {
            EXPECT_ZERR(zerrNone, opened);
            EXPECT_ZERR(zerrNone, grabbed);
            EXPECT_ZERR(zerrNone, closed);
        }
        Zentara_ReleaseDriver();
        ExpectNothingHeld();
        if (HasFailure()) break;
    }
    EXPECT_FALSE(hasRefused);
    PrintRefusals();
}

TEST_F(FailingAllocation, OfLoadListAndReleaseGivesACodeAndTheNextRunIsClean) {
    bool hasRefused = true;
    for (std::int64_t failing = 1; hasRefused && failing < AllocationsMax; ++failing) {
        SCOPED_TRACE(failing);
        std::uint32_t length = 4;

        BeginAllocations(failing);
        const ZentaraResult loaded = Zentara_LoadDriver();
        ZentaraResult listed = zerrNone;
        if (loaded == zerrNone) listed = Zentara_ListCameras(items, &length);
        Zentara_ReleaseDriver();
        hasRefused = EndAllocations();

        EXPECT_PRED1(IsKnown, loaded);
        EXPECT_PRED1(IsKnown, listed);
        if (!hasRefused) {
            EXPECT_ZERR(zerrNone, loaded);
            EXPECT_ZERR(zerrNone, listed);
        }
        ExpectNothingHeld();
        if (HasFailure()) break;
    }
    EXPECT_FALSE(hasRefused);
    PrintRefusals();
}

TEST_F(FailingAllocation, OfAListingLeavesNoCameraWhoseCallsHang) {
    bool hasRefused = true;
    for (std::int64_t failing = 1; hasRefused && failing < AllocationsMax; ++failing) {
        SCOPED_TRACE(failing);
        ASSERT_ZERR(zerrNone, Zentara_LoadDriver());
        std::uint32_t length = 4;

        BeginAllocations(failing);
        const ZentaraResult listed = Zentara_ListCameras(items, &length);
        hasRefused = EndAllocations();

        EXPECT_PRED1(IsKnown, listed);
        ZentaraHandle handle = 0;
        if (length != 0) {
            EXPECT_PRED1(IsKnown, Zentara_OpenCamera(items[0].cameraId, &handle));
        }
        if (handle != 0) {
            EXPECT_ZERR(zerrNone, Zentara_SetStreaming(handle, 1));
            EXPECT_ZERR(zerrNone, Zentara_Abort(handle));
            EXPECT_ZERR(zerrNone, Zentara_Abort(handle));
            EXPECT_ZERR(zerrNone, Zentara_SetStreaming(handle, 0));
            EXPECT_ZERR(zerrNone, Zentara_CloseCamera(handle));
        }
        Zentara_ReleaseDriver();
        ExpectNothingHeld();
        if (HasFailure()) break;
    }
    EXPECT_FALSE(hasRefused);
    PrintRefusals();
}

TEST(FailingListing, OfTwoCamerasLeavesNoneThatOpensAndIsNoHandle) {
    SetWaitClockDivisor(1000);
    SimulationWorld world(TwoCameras);
    bool hasRefused = true;
    for (std::int64_t failing = 1; hasRefused && failing < AllocationsMax; ++failing) {
        SCOPED_TRACE(failing);
        ASSERT_ZERR(zerrNone, Zentara_LoadDriver());
        Zentara_CamListItem items[4] = {};
        std::uint32_t length = 4;

        BeginAllocations(failing);
        EXPECT_PRED1(IsKnown, Zentara_ListCameras(items, &length));
        hasRefused = EndAllocations();

        // A listing that ended early may have told of none, and one of them is there all the same.
        ZentaraHandle handle = 0;
        if (Zentara_OpenCamera(0, &handle) == zerrNone) {
            EXPECT_ZERR(zerrNone, Zentara_Abort(handle));
            EXPECT_ZERR(zerrNone, Zentara_CloseCamera(handle));
        }
        Zentara_ReleaseDriver();
        EXPECT_EQ(0u, world.GetState().openHandles);
        if (testing::Test::HasFailure()) break;
    }
    EXPECT_FALSE(hasRefused);
    PrintRefusals();
    SetWaitClockDivisor(1);
}

}  // namespace
}  // namespace ZV::Test
