#include <gtest/gtest.h>

#include <cstdint>
#include <string>
#include <vector>

#include "camera/register_map.h"
#include "simulation/register_file.h"
#include "support/flat_camera.h"
#include "support/settings_words.h"
#include "support/wait_until.h"
#include "system/streamed_camera.h"

// What a send does to a running stream: when it is stopped, who starts it again, and what becomes
// of it when a send fails half way.
namespace ZV::Test {
namespace {

class StreamUnderSends : public testing::TestWithParam<StreamedCamera> {};

// A change of the region stops the stream, the commit starts it again.

constexpr std::uint32_t StreamSwitchAddress = Simulation::StreamAddress + 4 * StreamSwitch;
constexpr std::uint32_t TakeOverAddress = Simulation::CommandAddress + 4 * CommandTakeOver;

constexpr std::uint32_t GetControlAddress(std::uint32_t quadlet) {
    return Simulation::ControlAddress + 4 * quadlet;
}

/// Addresses of the writes from `begin` on, those of the stream and of the take-over alone with
/// what was written.
struct SwitchWrite {
    std::uint32_t address, value;
    bool operator==(const SwitchWrite&) const = default;
};
std::vector<SwitchWrite> FilterSwitches(const std::vector<RegisterWrite>& writes,
                                        std::size_t begin) {
    std::vector<SwitchWrite> switches;
    for (std::size_t i = begin; i < writes.size(); ++i) {
        const RegisterWrite& write = writes[i];
        if (write.address != StreamSwitchAddress && write.address != TakeOverAddress &&
            write.address != GetControlAddress(ControlRoiX.quadlet))
            continue;
        const bool isRoi = write.address == GetControlAddress(ControlRoiX.quadlet);
        const SwitchWrite found{write.address, isRoi ? 0 : write.values.at(0) & 1};
        if (switches.empty() || !(switches.back() == found)) switches.push_back(found);
    }
    return switches;
}

TEST_P(StreamUnderSends, AStreamThatASetterStoppedIsStartedAgainByTheCommit) {
    Streamed streamed(GetParam());
    ASSERT_TRUE(streamed.session.IsOpen());
    ASSERT_NO_FATAL_FAILURE(streamed.AddDifferentSets());
    ASSERT_NO_FATAL_FAILURE(streamed.BeginFlow());
    const SimulationWorld& world = streamed.session.world;
    const std::uint32_t psn = world.Peek(GetControlAddress(ControlPsn.quadlet)) >> 24;
    const std::size_t begin = world.ReadRegisterWrites().size();

    streamed.history.Send(4);

    EXPECT_EQ((std::vector<SwitchWrite>{{StreamSwitchAddress, 0},
                                        {GetControlAddress(ControlRoiX.quadlet), 0},
                                        {TakeOverAddress, 1},
                                        {StreamSwitchAddress, 1}}),
              FilterSwitches(world.ReadRegisterWrites(), begin));
    EXPECT_EQ((psn + 1) & 0xFF, world.Peek(GetControlAddress(ControlPsn.quadlet)) >> 24);
    ASSERT_TRUE(streamed.WaitForFrameOfLatest());
    ASSERT_TRUE(streamed.flow->Drain());
    streamed.history.ExpectWholeSets(streamed.flow->GetFrames());
}

TEST_P(StreamUnderSends, AChangeOfExposureAloneKeepsTheStreamRunning) {
    Streamed streamed(GetParam());
    ASSERT_TRUE(streamed.session.IsOpen());
    ASSERT_NO_FATAL_FAILURE(streamed.AddCompatibleSets());
    ASSERT_NO_FATAL_FAILURE(streamed.BeginFlow());
    const std::size_t begin = streamed.session.world.ReadRegisterWrites().size();

    streamed.history.Send(1);

    EXPECT_EQ((std::vector<SwitchWrite>{{TakeOverAddress, 1}}),
              FilterSwitches(streamed.session.world.ReadRegisterWrites(), begin));
    ASSERT_TRUE(streamed.WaitForFrameOfLatest());
    ASSERT_TRUE(streamed.flow->Drain());
    streamed.history.ExpectWholeSets(streamed.flow->GetFrames());
}

// A send that fails half way.

std::string MakeFailingWrite(std::uint32_t quadlet) {
    return R"({"kind": "failRequest", "code": "FW_IOCTL_ASYNC_WRITE", "address": )" +
           std::to_string(GetControlAddress(quadlet)) + "}";
}

TEST_P(StreamUnderSends, AfterASendThatFailedBehindTheStopTheNextGoodOneStartsTheStream) {
    Streamed streamed(GetParam());
    ASSERT_TRUE(streamed.session.IsOpen());
    ASSERT_NO_FATAL_FAILURE(streamed.AddDifferentSets());
    ASSERT_NO_FATAL_FAILURE(streamed.BeginFlow());
    Zentara_Settings failing = streamed.history.GetSet(4).block;
    SetWord(failing, zprmTriggerType, ztrigSoftware);
    ASSERT_TRUE(streamed.session.world.AddFault(MakeFailingWrite(ControlTriggerType.quadlet)));

    EXPECT_NE(zerrNone, Zentara_SendSettingsToCam(streamed.GetHandle(), &failing));

    EXPECT_FALSE(streamed.IsStreaming());
    EXPECT_EQ(0u, streamed.session.world.GetState().attachedBuffers);
    ZCamera& camera = streamed.session.GetCamera();
    EXPECT_EQ(GetWord(streamed.history.GetSet(4).block, zprmRoiX), camera.GetROIX());
    // Frames that had come before the stop still go home; what comes later is of the new set.
    const std::uint64_t exposed = streamed.history.CountExposed();
    streamed.history.Send(5);
    EXPECT_TRUE(streamed.IsStreaming());
    ASSERT_TRUE(streamed.flow->WaitForFrameAfter(exposed));
    ASSERT_TRUE(streamed.flow->Drain());
    streamed.history.ExpectWholeSets(streamed.flow->GetFrames());
}

TEST_P(StreamUnderSends, AfterASendThatFailedWithoutAStopTheStreamGoesOnAsItWas) {
    Streamed streamed(GetParam());
    ASSERT_TRUE(streamed.session.IsOpen());
    ASSERT_NO_FATAL_FAILURE(streamed.AddCompatibleSets());
    ASSERT_NO_FATAL_FAILURE(streamed.BeginFlow());
    Zentara_Settings failing = streamed.history.GetSet(3).block;
    ASSERT_TRUE(streamed.session.world.AddFault(MakeFailingWrite(ControlExposure)));

    EXPECT_NE(zerrNone, Zentara_SendSettingsToCam(streamed.GetHandle(), &failing));

    EXPECT_TRUE(streamed.IsStreaming());
    const std::uint64_t exposed = streamed.history.CountExposed();
    ASSERT_TRUE(streamed.flow->WaitForFrameAfter(exposed + Circulating));
    streamed.history.Send(1);
    ASSERT_TRUE(streamed.WaitForFrameOfLatest());
    ASSERT_TRUE(streamed.flow->Drain());
    streamed.history.ExpectWholeSets(streamed.flow->GetFrames());
}

TEST_P(StreamUnderSends, AFailedSendFollowedByTheFormerSettingsLeavesTheStreamOff) {
    // Kept: the former settings are no change, so nothing is committed and nothing starts again.
    Streamed streamed(GetParam());
    ASSERT_TRUE(streamed.session.IsOpen());
    ASSERT_NO_FATAL_FAILURE(streamed.AddDifferentSets());
    ASSERT_NO_FATAL_FAILURE(streamed.BeginFlow());
    streamed.history.Send(4);
    Zentara_Settings failing = streamed.history.GetSet(5).block;
    SetWord(failing, zprmTriggerType, ztrigSoftware);
    ASSERT_TRUE(streamed.session.world.AddFault(MakeFailingWrite(ControlTriggerType.quadlet)));
    EXPECT_NE(zerrNone, Zentara_SendSettingsToCam(streamed.GetHandle(), &failing));

    streamed.history.Send(4);

    EXPECT_FALSE(streamed.IsStreaming());
    ASSERT_ZERR(zerrNone, Zentara_SetStreaming(streamed.GetHandle(), 1));
    ASSERT_TRUE(streamed.WaitForFrameOfLatest());
    ASSERT_TRUE(streamed.flow->Drain());
    streamed.history.ExpectWholeSets(streamed.flow->GetFrames());
}

TEST_P(StreamUnderSends, AStreamThatTheClientStartsAfterAFailedSendIsNotStoppedByTheNext) {
    // Kept: the failed send has stopped the stream and left the restart to a commit, so no setter
    // stops it a second time.
    Streamed streamed(GetParam());
    ASSERT_TRUE(streamed.session.IsOpen());
    ASSERT_NO_FATAL_FAILURE(streamed.AddDifferentSets());
    ASSERT_NO_FATAL_FAILURE(streamed.BeginFlow());
    Zentara_Settings failing = streamed.history.GetSet(4).block;
    SetWord(failing, zprmTriggerType, ztrigSoftware);
    ASSERT_TRUE(streamed.session.world.AddFault(MakeFailingWrite(ControlTriggerType.quadlet)));
    EXPECT_NE(zerrNone, Zentara_SendSettingsToCam(streamed.GetHandle(), &failing));
    ASSERT_ZERR(zerrNone, Zentara_SetStreaming(streamed.GetHandle(), 1));
    const std::size_t begin = streamed.session.world.ReadRegisterWrites().size();

    streamed.history.Send(5);

    for (const SwitchWrite& write :
         FilterSwitches(streamed.session.world.ReadRegisterWrites(), begin)) {
        EXPECT_NE(StreamSwitchAddress, write.address);
    }
    EXPECT_TRUE(streamed.IsStreaming());
    // The one after it stops and starts the stream again.
    streamed.history.Send(4);
    const std::size_t before = streamed.flow->CountFrames();
    ASSERT_TRUE(streamed.flow->WaitForFrames(before + Circulating));
    EXPECT_TRUE(streamed.flow->Drain());
}

TEST_P(StreamUnderSends, AGrabBehindAFailedSendKeepsTheStreamThatTheNextSendStarts) {
    // Kept: the grab starts and stops a stream of its own and leaves its callback in place, and the
    // restart to the commit.
    Streamed streamed(GetParam());
    ASSERT_TRUE(streamed.session.IsOpen());
    const ZentaraHandle handle = streamed.GetHandle();
    const SimulationWorld& world = streamed.session.world;
    Zentara_Settings settings = streamed.ReadSettings();
    ASSERT_ZERR(zerrNone, Zentara_SetStreaming(handle, 1));
    SetWord(settings, zprmRoiWidth, 96);
    Zentara_Settings failing = settings;
    SetWord(failing, zprmTriggerType, ztrigSoftware);
    ASSERT_TRUE(streamed.session.world.AddFault(MakeFailingWrite(ControlTriggerType.quadlet)));
    ASSERT_NE(zerrNone, Zentara_SendSettingsToCam(handle, &failing));
    ASSERT_FALSE(streamed.IsStreaming());
    ClientFrame frame(StreamedCamera::BufferBytes);
    ASSERT_ZERR(zerrNone, Zentara_GrabFrame(handle, frame.Get()));
    EXPECT_FALSE(streamed.IsStreaming());
    CallbackLog calls;
    ASSERT_ZERR(zerrNone, Zentara_QueueFrame(handle, frame.Get(), CallbackLog::Record, zcbFrameDone,
                                             calls.GetPrivate(), 0));

    const std::uint64_t before = world.GetState().framesSent;
    ASSERT_ZERR(zerrNone, Zentara_SendSettingsToCam(handle, &settings));

    EXPECT_TRUE(streamed.IsStreaming());
    EXPECT_TRUE(WaitUntil([&] { return world.GetState().framesSent > before + 10; }));
    EXPECT_EQ(0u, calls.CountCalls());
    ASSERT_ZERR(zerrNone, Zentara_SetStreaming(handle, 0));
    ASSERT_ZERR(zerrNone, Zentara_SetStreaming(handle, 1));
    EXPECT_TRUE(calls.WaitForCalls(1));
    ASSERT_ZERR(zerrNone, Zentara_SetStreaming(handle, 0));
    EXPECT_ZERR(zerrNone, Zentara_Abort(handle));
}

// A model that is binned under its stream.

TEST(MetronaUnderSends, AFailedSendDoesNotSilenceTheStream) {
    CameraSession session(
        R"({"base": "metrona", "cameras": [{"sensor": {"width": 160, "height": 120}}]})");
    ASSERT_TRUE(session.IsOpen());
    const ZentaraHandle handle = session.GetHandle();
    Zentara_Settings settings{};
    ASSERT_ZERR(zerrNone, Zentara_ReadSettingsFromCam(handle, &settings));
    FrameFlow flow(handle, Circulating, StreamedCamera::BufferBytes, 0);
    flow.Begin();
    ASSERT_ZERR(zerrNone, Zentara_SetStreaming(handle, 1));
    ASSERT_TRUE(flow.WaitForFrames(Circulating));
    SetWord(settings, zprmVerticalBinning, 2);
    SetWord(settings, zprmHorizontalBinning, 65);  // refused behind the vertical one

    EXPECT_ZERR(zerrDriverFault, Zentara_SendSettingsToCam(handle, &settings));

    const std::size_t before = flow.CountFrames();
    EXPECT_TRUE(flow.WaitForFrames(before + 3 * Circulating));
    ASSERT_ZERR(zerrNone, Zentara_ReadSettingsFromCam(handle, &settings));
    SetWord(settings, zprmHorizontalBinning, 2);
    EXPECT_ZERR(zerrNone, Zentara_SendSettingsToCam(handle, &settings));
    EXPECT_TRUE(WaitUntil([&] { return flow.GetFrames().back().width == 80; }));
    flow.StopCirculating();
    ASSERT_ZERR(zerrNone, Zentara_SetStreaming(handle, 0));
    EXPECT_ZERR(zerrNone, Zentara_Abort(handle));
}

// Trigger modes.

TEST_P(StreamUnderSends, InTheSoftwareModeEachTriggerGivesOneFrameAndTheFreeRunComesBack) {
    constexpr std::uint64_t Triggers = 20;
    Streamed streamed(GetParam());
    ASSERT_TRUE(streamed.session.IsOpen());
    ASSERT_NO_FATAL_FAILURE(streamed.AddCompatibleSets());
    // Frames that the stops of single images have cut off.
    const ZentaraSimulationState idle = streamed.session.world.GetState();
    const std::uint64_t cutOff = idle.framesExposed - idle.framesSent;
    ASSERT_NO_FATAL_FAILURE(streamed.BeginFlow());
    Zentara_Settings triggered = streamed.history.GetSet(0).block;
    SetWord(triggered, zprmTriggerType, ztrigSoftware);
    const auto sentCount = [&] { return streamed.session.world.GetState().framesSent; };
    const auto exposedCount = [&] { return streamed.history.CountExposed(); };
    EXPECT_ZERR(zerrNotSupported, Zentara_Trigger(streamed.GetHandle()));

    ASSERT_ZERR(zerrNone, Zentara_SendSettingsToCam(streamed.GetHandle(), &triggered));

    // The frame that was being sent at the take-over is the last one of the free run.
    ASSERT_TRUE(WaitUntil([&] { return sentCount() + cutOff == exposedCount(); }));
    const std::uint64_t last = exposedCount();
    std::size_t delivered = 0;
    for (std::uint64_t i = 1; i <= Triggers; ++i) {
        ASSERT_ZERR(zerrNone, Zentara_Trigger(streamed.GetHandle()));
        ASSERT_TRUE(streamed.flow->WaitForFrameAfter(last + i - 1)) << "trigger " << i;
        EXPECT_EQ(last + i, exposedCount());
        EXPECT_TRUE(i == 1 || streamed.flow->CountFrames() == delivered + 1);
        delivered = streamed.flow->CountFrames();
    }
    streamed.history.Send(1);
    EXPECT_ZERR(zerrNotSupported, Zentara_Trigger(streamed.GetHandle()));
    ASSERT_TRUE(streamed.flow->WaitForFrameAfter(streamed.history.GetLastMark() + Circulating));
    ASSERT_TRUE(streamed.flow->Drain());
    // The wish for this mode refuses one frame header. If that was a first field, the second comes
    // alone, and a triggered mode delivers it marked.
    std::vector<FlownFrame> frames = streamed.flow->GetFrames();
    const auto strays = std::erase_if(
        frames, [](const FlownFrame& frame) { return frame.errorCode == zerrOutOfSync; });
    EXPECT_LE(strays, GetParam().hasMosaic ? 1u : 0u);
    streamed.history.ExpectWholeSets(frames);
}

INSTANTIATE_TEST_SUITE_P(Cameras, StreamUnderSends,
                         testing::Values(VersionZero, VersionOne, VersionTwo, TwoFields),
                         [](const auto& camera) { return std::string(camera.param.scenario); });

}  // namespace
}  // namespace ZV::Test
