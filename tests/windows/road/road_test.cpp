// The flat interface over real devices: found by the setup interface, opened by their path, served
// by a kernel-mode driver. This process knows of no simulation.
//
// Left to the simulated driver: Wine does not wait for a driver's answer to an open, so that an
// open which the driver itself refuses reads there as one that succeeded. What is refused here is
// the device's name. Its cancellation of a request may also meet one that the driver has just
// completed, and ends the driver's process then: where a process is killed here, its stream stands
// still. A running one is cut off over the simulated driver.

#include "windows/road/road.h"

#include <chrono>
#include <iostream>
#include <memory>
#include <vector>

#include "support/expect_zerr.h"
#include "support/flat_camera.h"
#include "support/wait_until.h"

namespace ZV::Test {
namespace {

constexpr std::size_t RingFrames = 8;
/// Requests that a stream keeps with the driver.
constexpr std::uint32_t RingRequests = 60;
/// The one by which it tells the driver of itself is pended for as long.
constexpr std::uint32_t EnterRequests = 1;

class RoadClient : public Road {
  protected:
    using Road::Road;

    void SetUp() override {
        Road::SetUp();
        if (HasFatalFailure()) return;
        ASSERT_ZERR(zerrNone, Zentara_LoadDriver());
    }
    void TearDown() override {
        Zentara_ReleaseDriver();
        ClientMemory::LetGo();
    }

    std::vector<Zentara_CamListItem> ListCameras(ZentaraResult expected = zerrNone) {
        std::vector<Zentara_CamListItem> items(16);
        auto count = static_cast<std::uint32_t>(items.size());
        EXPECT_ZERR(expected, Zentara_ListCameras(items.data(), &count));
        items.resize(std::min<std::size_t>(count, items.size()));
        return items;
    }
    ZentaraHandle OpenFirst() {
        ZentaraHandle handle = 0;
        EXPECT_FALSE(ListCameras().empty());
        EXPECT_ZERR(zerrNone, Zentara_OpenCamera(0, &handle));
        return handle;
    }
    static std::uint32_t GetImageBytes(ZentaraHandle handle) {
        std::uint32_t bytes = 0;
        EXPECT_ZERR(zerrNone, Zentara_GetInfo(handle, zinfImageSize, &bytes));
        return bytes;
    }
    /// Leaves a running stream with all of its requests in the driver's hands.
    void StallStream() {
        ASSERT_TRUE(
            AddFault(R"({"kind": "neverComplete", "code": "FW_IOCTL_ATTACH_BUFFER", "count": 0})"));
        // None of them is being answered any longer.
        ASSERT_TRUE(WaitUntil([&] {
            const HostState state = GetState();
            return state.attachedBuffers == 0 &&
                   state.pendedRequests == RingRequests + EnterRequests;
        }));
    }
    /// True when nothing of a camera is open, pended or reserved any longer.
    bool IsAllGiven() {
        const HostState state = GetState();
        const RoadState driver = GetDriver().GetState();
        return state.openHandles == 0 && state.reservedResources == 0 &&
               state.pendedRequests == 0 && driver.openFiles == 0 && driver.pended == 0;
    }
};

/// A stream whose frames are queued again as they come.
class RunningStream {
  public:
    RunningStream(ZentaraHandle openHandle, std::uint32_t imageBytes) : handle(openHandle) {
        for (std::size_t i = 0; i < RingFrames; ++i) {
            frames.push_back(std::make_unique<ClientFrame>(imageBytes));
        }
        EXPECT_ZERR(zerrNone, Zentara_SetStreaming(handle, 1));
        for (std::size_t i = 0; i < RingFrames; ++i) Queue();
    }

    /// Waits for the next frame; null when none comes.
    ClientFrame* Take() {
        if (!calls.WaitForCalls(taken + 1)) return nullptr;
        return frames[taken++ % RingFrames].get();
    }
    void Queue() {
        EXPECT_ZERR(zerrNone,
                    Zentara_QueueFrame(handle, frames[queued++ % RingFrames]->Get(),
                                       CallbackLog::Record, zcbFrameDone, calls.GetPrivate(), 0));
    }

  private:
    ZentaraHandle handle;
    CallbackLog calls;
    std::vector<std::unique_ptr<ClientFrame>> frames;
    std::size_t taken = 0, queued = 0;
};

double CountPerSecond(std::size_t count, std::chrono::steady_clock::time_point start) {
    const std::chrono::duration<double> past = std::chrono::steady_clock::now() - start;
    return static_cast<double>(count) / past.count();
}

TEST_F(RoadClient, AGrabTakesTheImageThatTheCameraSent) {
    const ZentaraHandle handle = OpenFirst();
    ClientFrame frame(GetImageBytes(handle));

    ASSERT_ZERR(zerrNone, Zentara_GrabFrame(handle, frame.Get()));

    EXPECT_ZERR(zerrNone, frame->errorCode);
    EXPECT_EQ(64u, frame->width);
    EXPECT_EQ(48u, frame->height);
    EXPECT_TRUE(WasSent(*frame.Get()));
    EXPECT_TRUE(frame.IsGuardIntact());
}

TEST_F(RoadClient, ASettingArrivesInTheCameraAndIsReadBackByAnotherOpen) {
    ZentaraHandle handle = OpenFirst();
    Zentara_Settings settings{};
    ASSERT_ZERR(zerrNone, Zentara_ReadSettingsFromCam(handle, &settings));
    ASSERT_ZERR(zerrNone, Zentara_SetParam(&settings, zprmExposure, 12345));
    ASSERT_ZERR(zerrNone, Zentara_SendSettingsToCam(handle, &settings));
    ASSERT_ZERR(zerrNone, Zentara_CloseCamera(handle));
    EXPECT_TRUE(WaitUntil([&] { return IsAllGiven(); }));

    ASSERT_ZERR(zerrNone, Zentara_OpenCamera(0, &handle));
    ASSERT_ZERR(zerrNone, Zentara_ReadSettingsFromCam(handle, &settings));

    std::uint32_t exposure = 0;
    EXPECT_ZERR(zerrNone, Zentara_GetParam(&settings, zprmExposure, &exposure));
    EXPECT_EQ(12345u, exposure);
}

TEST_F(RoadClient, AStreamDeliversTheFramesInTheirOrder) {
    constexpr std::size_t Frames = 60;
    const ZentaraHandle handle = OpenFirst();
    RunningStream stream(handle, GetImageBytes(handle));
    std::uint32_t last = 0;
    const auto start = std::chrono::steady_clock::now();

    for (std::size_t i = 0; i < Frames; ++i) {
        ClientFrame* const frame = stream.Take();
        ASSERT_NE(nullptr, frame) << "after " << i;
        EXPECT_ZERR(zerrNone, (*frame)->errorCode);
        if (i > 0) {
            EXPECT_GT((*frame)->frameNumber, last);
        }
        last = (*frame)->frameNumber;
        if (i % 16 == 0) {
            EXPECT_TRUE(WasSent(*frame->Get()));
        }
        stream.Queue();
    }

    std::cout << "64 x 48 pixels: " << CountPerSecond(Frames, start) << " frames per second\n";
    EXPECT_ZERR(zerrNone, Zentara_SetStreaming(handle, 0));
    EXPECT_EQ(0u, GetState().attachedBuffers);
}

TEST_F(RoadClient, AStreamCanBeStoppedAndStartedAgain) {
    const ZentaraHandle handle = OpenFirst();
    for (int round = 0; round < 3; ++round) {
        RunningStream stream(handle, GetImageBytes(handle));

        EXPECT_NE(nullptr, stream.Take());

        EXPECT_ZERR(zerrNone, Zentara_SetStreaming(handle, 0));
        EXPECT_ZERR(zerrNone, Zentara_Abort(handle));
    }
    EXPECT_ZERR(zerrNone, Zentara_CloseCamera(handle));
    EXPECT_TRUE(WaitUntil([&] { return IsAllGiven(); }));
}

class FullSizeRoad : public RoadClient {
  protected:
    FullSizeRoad() : RoadClient({R"({"model": "SolvaneA1", "sensor": {"noise": false}})"}) {}
};

TEST_F(FullSizeRoad, AWholeSensorIsStreamed) {
    constexpr std::size_t Frames = 12;
    const ZentaraHandle handle = OpenFirst();
    RunningStream stream(handle, GetImageBytes(handle));
    ASSERT_NE(nullptr, stream.Take());
    stream.Queue();
    const auto start = std::chrono::steady_clock::now();

    for (std::size_t i = 0; i < Frames; ++i) {
        ClientFrame* const frame = stream.Take();
        ASSERT_NE(nullptr, frame) << "after " << i;
        EXPECT_ZERR(zerrNone, (*frame)->errorCode);
        stream.Queue();
        if (i + 1 == Frames) {
            std::cout << (*frame)->width << " x " << (*frame)->height
                      << " pixels: " << CountPerSecond(Frames, start) << " frames per second\n";
        }
    }
}

TEST_F(RoadClient, ADeviceThatAnotherProcessHoldsIsLeftOutUntilItIsClosed) {
    ChildProcess holder("camera-holder.exe", "");
    ASSERT_EQ("ok", holder.ReadLine());

    EXPECT_EQ(0u, ListCameras().size());

    EXPECT_TRUE(holder.Finish());
    EXPECT_TRUE(WaitUntil([&] { return IsAllGiven(); }));
    EXPECT_EQ(1u, ListCameras().size());
}

TEST_F(RoadClient, ADeviceThatAnotherProcessTakesAfterTheListingDoesNotOpen) {
    ASSERT_EQ(1u, ListCameras().size());
    ChildProcess holder("camera-holder.exe", "");
    ASSERT_EQ("ok", holder.ReadLine());
    ZentaraHandle handle = 0;

    EXPECT_ZERR(zerrDriverFault, Zentara_OpenCamera(0, &handle));
    EXPECT_EQ(0u, handle);
}

TEST_F(RoadClient, ADeviceWhoseHolderIsKilledWithAStreamUnderWayIsFreeAgain) {
    {
        ChildProcess holder("camera-holder.exe", "stream");
        ASSERT_EQ("ok", holder.ReadLine());
        ASSERT_TRUE(WaitUntil([&] { return GetState().isStreaming != 0; }));
        StallStream();
        holder.Kill();
    }
    EXPECT_TRUE(WaitUntil([&] { return IsAllGiven(); }));

    EXPECT_NE(0u, OpenFirst());
}

TEST_F(RoadClient, TheLossOfTheCameraInAStreamFailsItsStopAndTheCloseSucceeds) {
    const ZentaraHandle handle = OpenFirst();
    RunningStream stream(handle, GetImageBytes(handle));
    ASSERT_NE(nullptr, stream.Take());

    ASSERT_EQ("ok", GetHost().Ask("unplug 0"));

    EXPECT_ZERR(zerrDriverFault, Zentara_SetStreaming(handle, 0));
    EXPECT_ZERR(zerrNone, Zentara_CloseCamera(handle));
}

TEST_F(RoadClient, TheRemovalOfTheDeviceInAStreamFailsItsStopAndTheNextListing) {
    const ZentaraHandle handle = OpenFirst();
    RunningStream stream(handle, GetImageBytes(handle));
    ASSERT_NE(nullptr, stream.Take());

    ASSERT_TRUE(GetDriver().Unplug(0));

    EXPECT_ZERR(zerrDriverFault, Zentara_SetStreaming(handle, 0));
    EXPECT_ZERR(zerrNone, Zentara_CloseCamera(handle));
    // The interface is still listed, its device is not there: the open fails.
    ListCameras(zerrDriverFault);
    ASSERT_TRUE(GetDriver().Plug(0, GetPath()));
    EXPECT_EQ(1u, ListCameras().size());
}

TEST_F(RoadClient, TheDeathOfTheDriversHelperHangsNoCall) {
    const ZentaraHandle handle = OpenFirst();
    RunningStream stream(handle, GetImageBytes(handle));
    ASSERT_NE(nullptr, stream.Take());
    StallStream();

    KillHost();

    EXPECT_ZERR(zerrDriverFault, Zentara_SetStreaming(handle, 0));
    EXPECT_ZERR(zerrNone, Zentara_CloseCamera(handle));
}

class TwoDevices : public RoadClient {
  protected:
    TwoDevices() : RoadClient({RoadCameraMono, RoadCameraOther}) {}
};

TEST_F(TwoDevices, AListingFindsThemInTheirOrder) {
    const auto items = ListCameras();

    ASSERT_EQ(2u, items.size());
    EXPECT_EQ(static_cast<std::uint32_t>(zmodelSolvaneA1), items[0].cameraType);
    EXPECT_EQ(static_cast<std::uint32_t>(zmodelSolvaneA2), items[1].cameraType);
    EXPECT_NE(items[0].uniqueId, items[1].uniqueId);
}

TEST_F(TwoDevices, BothStreamSideBySide) {
    ASSERT_EQ(2u, ListCameras().size());
    std::vector<std::unique_ptr<RunningStream>> streams;
    for (std::uint32_t camera = 0; camera < 2; ++camera) {
        ZentaraHandle handle = 0;
        ASSERT_ZERR(zerrNone, Zentara_OpenCamera(camera, &handle));
        streams.push_back(std::make_unique<RunningStream>(handle, GetImageBytes(handle)));
    }

    for (int i = 0; i < 10; ++i) {
        for (const auto& stream : streams) {
            ClientFrame* const frame = stream->Take();
            ASSERT_NE(nullptr, frame);
            EXPECT_ZERR(zerrNone, (*frame)->errorCode);
            stream->Queue();
        }
    }
}

TEST_F(TwoDevices, OneThatIsHeldLeavesTheOther) {
    ChildProcess holder("camera-holder.exe", "");
    ASSERT_EQ("ok", holder.ReadLine());

    const auto items = ListCameras();

    ASSERT_EQ(1u, items.size());
    EXPECT_EQ(static_cast<std::uint32_t>(zmodelSolvaneA2), items[0].cameraType);
}

class NoDevice : public RoadClient {
  protected:
    NoDevice() : RoadClient(std::vector<std::string_view>{}) {}
};

TEST_F(NoDevice, AListingSucceedsWithoutAny) {
    EXPECT_EQ(0u, ListCameras().size());
}

}  // namespace
}  // namespace ZV::Test
