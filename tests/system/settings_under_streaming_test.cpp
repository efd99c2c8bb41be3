#include <gtest/gtest.h>

#include <algorithm>
#include <atomic>
#include <memory>
#include <set>
#include <string>
#include <thread>
#include <utility>
#include <vector>

#include "support/flat_camera.h"
#include "support/settings_words.h"
#include "support/system_threads.h"
#include "system/streamed_camera.h"

// Settings change while frames flow. What a frame was exposed with is known by its number: the
// camera takes settings over as a whole, and counts its exposures.
namespace ZV::Test {
namespace {

/// For each frame the exposure callback comes first, and frames come in the order of the queue.
void ExpectCallbacksInOrder(const std::vector<FlowEvent>& events) {
    std::uint32_t nextFrame = 0;
    std::vector<int> exposures;
    for (const FlowEvent& event : events) {
        if (event.kind == FlowEvent::Kind::Settings) continue;
        if (exposures.size() <= event.userData) exposures.resize(event.userData + 1);
        if (event.kind == FlowEvent::Kind::Exposure) {
            EXPECT_EQ(1, ++exposures[event.userData]) << "exposure of frame " << event.userData;
            EXPECT_GE(event.userData, nextFrame) << "an exposure callback came late";
            continue;
        }
        EXPECT_EQ(nextFrame, event.userData) << "a frame came out of turn";
        EXPECT_EQ(1, exposures[event.userData]) << "no exposure before frame " << event.userData;
        nextFrame = event.userData + 1;
    }
}

/// Whether another thread is about to tell of the exposure of the change's frame.
bool IsExposureOnItsWay(const std::vector<FlowEvent>& events, std::size_t change) {
    for (std::size_t i = change + 1; i < events.size(); ++i) {
        if (events[i].thread == events[change].thread) continue;
        return events[i].kind == FlowEvent::Kind::Exposure &&
               events[i].userData == events[change].userData;
    }
    return false;
}

/// Change n was queued behind frame n. Kept: the exposure callbacks of two frames may meet, one of
/// them made up for by its image, and the change may meet the one of its frame when the image makes
/// up for it in the very moment in which the exposure ends.
void ExpectChangesBehindTheirFrames(const std::vector<FlowEvent>& events) {
    std::set<std::uint32_t> exposed;
    std::uint32_t nextChange = 0;
    for (std::size_t i = 0; i < events.size(); ++i) {
        const FlowEvent& event = events[i];
        if (event.kind == FlowEvent::Kind::Exposure) exposed.insert(event.userData);
        if (event.kind != FlowEvent::Kind::Settings) continue;
        EXPECT_EQ(nextChange, event.userData) << "a change came out of turn";
        EXPECT_TRUE(exposed.contains(event.userData) || IsExposureOnItsWay(events, i))
            << "change " << event.userData << " came before its frame was exposed";
        EXPECT_ZERR(zerrNone, event.errorCode);
        nextChange = event.userData + 1;
    }
}

std::uint64_t GetExposureNs(std::uint32_t change) {
    return 2000000 + std::uint64_t{100000} * change;
}

/// Everything a stream holds; what is in the kernel driver's hands changes from moment to moment.
void ExpectSameReservations(const ZentaraSimulationState& expected,
                            const ZentaraSimulationState& actual) {
    EXPECT_EQ(expected.openHandles, actual.openHandles);
    EXPECT_EQ(expected.reservedChannels, actual.reservedChannels);
    EXPECT_EQ(expected.reservedBandwidths, actual.reservedBandwidths);
    EXPECT_EQ(expected.reservedResources, actual.reservedResources);
    EXPECT_EQ(expected.isStreaming, actual.isStreaming);
}

class SettingsUnderStreaming : public testing::TestWithParam<StreamedCamera> {};

TEST_P(SettingsUnderStreaming, EveryFrameIsOfOneWholeSetWhileAClientSendsChanges) {
    constexpr std::size_t Sends = 60;
    Streamed streamed(GetParam());
    ASSERT_TRUE(streamed.session.IsOpen());
    ASSERT_NO_FATAL_FAILURE(streamed.AddDifferentSets());
    ASSERT_NO_FATAL_FAILURE(streamed.BeginFlow());
    SettingsHistory& history = streamed.history;

    for (std::size_t i = 0; i < Sends; ++i) {
        history.Send(i * 5 % history.CountSets());
        // Every other change meets the frames of the one before it.
        if (i % 2 == 0) {
            ASSERT_TRUE(streamed.WaitForFrameOfLatest()) << "after send " << i;
        }
    }
    ASSERT_TRUE(streamed.WaitForFrameOfLatest());

    ASSERT_TRUE(streamed.flow->Drain());
    const std::vector<FlownFrame> frames = streamed.flow->GetFrames();
    history.ExpectWholeSets(frames);
    EXPECT_GE(frames.size(), Sends / 2);
    EXPECT_GT(history.CountOfLatest(frames), 0u);
    ExpectCallbacksInOrder(streamed.flow->GetEvents());
}

TEST_P(SettingsUnderStreaming, AQueuedChangeIsInForceFromItsCallbackOn) {
    constexpr std::size_t Changes = 40;
    Streamed streamed(GetParam());
    ASSERT_TRUE(streamed.session.IsOpen());
    ASSERT_NO_FATAL_FAILURE(streamed.AddCompatibleSets());
    ASSERT_NO_FATAL_FAILURE(streamed.BeginFlow());
    SettingsHistory& history = streamed.history;
    FrameFlow& flow = *streamed.flow;

    for (std::uint32_t i = 0; i < Changes; ++i) {
        const std::size_t set = (i + 1) % history.CountSets();
        Zentara_Settings block = history.GetSet(set).block;
        const std::uint64_t before = history.CountExposed();
        ASSERT_ZERR(zerrNone, flow.QueueSettings(&block, zcbFrameDone, i));
        ASSERT_TRUE(flow.WaitForSettings(i + 1)) << "change " << i << " is lost";
        const FlowEvent heard = flow.GetLastSettings();
        EXPECT_EQ(i, heard.userData);
        EXPECT_ZERR(zerrNone, heard.errorCode);
        EXPECT_EQ(zcbFrameDone, heard.flags);
        history.Note(set, before, heard.framesExposed);
        if (i % 2 == 0) {
            ASSERT_TRUE(streamed.WaitForFrameOfLatest()) << "after change " << i;
        }
    }
    ASSERT_TRUE(streamed.WaitForFrameOfLatest());

    ASSERT_TRUE(flow.Drain());
    const std::vector<FlownFrame> frames = flow.GetFrames();
    history.ExpectWholeSets(frames);
    EXPECT_GT(history.CountOfLatest(frames), 0u);
    ExpectCallbacksInOrder(flow.GetEvents());
}

TEST_P(SettingsUnderStreaming, QueuedChangesAreMadeInTheirOrderEachBehindItsFrame) {
    constexpr std::uint32_t Changes = 45;
    std::vector<Zentara_Settings> blocks(Changes);
    Streamed streamed(GetParam());
    ASSERT_TRUE(streamed.session.IsOpen());
    std::fill(blocks.begin(), blocks.end(), streamed.ReadSettings());
    streamed.flow = std::make_unique<FrameFlow>(streamed.GetHandle(), Changes + 1,
                                                StreamedCamera::BufferBytes, 0);
    FrameFlow& flow = *streamed.flow;
    flow.StopCirculating();
    for (std::uint32_t i = 0; i < Changes; ++i) {
        SetWide(blocks[i], zprm64Exposure, GetExposureNs(i));
        flow.QueueFrame(i);
        ASSERT_ZERR(zerrNone, flow.QueueSettings(&blocks[i], zcbFrameDone, i));
    }
    flow.QueueFrame(Changes);

    ASSERT_ZERR(zerrNone, Zentara_SetStreaming(streamed.GetHandle(), 1));

    ASSERT_TRUE(flow.WaitForFrames(Changes + 1));
    ASSERT_TRUE(flow.WaitForSettings(Changes)) << flow.CountSettings();
    ExpectCallbacksInOrder(flow.GetEvents());
    ExpectChangesBehindTheirFrames(flow.GetEvents());
    EXPECT_EQ(GetExposureNs(Changes - 1), streamed.session.GetCamera().GetExposure());
}

TEST_P(SettingsUnderStreaming, AQueuedChangeOfRegionSpeedOrDepthIsRefusedAndTheStreamGoesOn) {
    Streamed streamed(GetParam());
    ASSERT_TRUE(streamed.session.IsOpen());
    ASSERT_NO_FATAL_FAILURE(streamed.AddCompatibleSets());
    ASSERT_NO_FATAL_FAILURE(streamed.BeginFlow());
    const Zentara_Settings base = streamed.history.GetSet(0).block;
    const std::pair<std::uint32_t, std::uint32_t> changes[] = {{zprmRoiX, 8},
                                                               {zprmRoiY, 8},
                                                               {zprmRoiWidth, 96},
                                                               {zprmRoiHeight, 64},
                                                               {zprmReadoutSpeed, zspeed5MHz},
                                                               {zprmImageFormat, zfmtMono16}};

    for (const auto& [key, value] : changes) {
        Zentara_Settings changed = base;
        SetWord(changed, key, value);
        EXPECT_ZERR(zerrBadSettings, streamed.flow->QueueSettings(&changed, zcbFrameDone, key));
    }

    const std::uint64_t exposed = streamed.history.CountExposed();
    ASSERT_TRUE(streamed.flow->WaitForFrameAfter(exposed + Circulating));
    ASSERT_TRUE(streamed.flow->Drain());
    EXPECT_EQ(0u, streamed.flow->CountSettings());
    streamed.history.ExpectWholeSets(streamed.flow->GetFrames());
}

TEST_P(SettingsUnderStreaming, HundredsOfChangesLeaveNothingBehind) {
    constexpr std::size_t Sends = 200;
    Streamed streamed(GetParam());
    ASSERT_TRUE(streamed.session.IsOpen());
    ASSERT_NO_FATAL_FAILURE(streamed.AddDifferentSets());
    const std::size_t threadsBeforeStream = CountThreads();
    const ZentaraSimulationState idle = streamed.session.world.GetState();
    ASSERT_NO_FATAL_FAILURE(streamed.BeginFlow());
    const std::size_t threads = CountThreads();
    const ZentaraSimulationState before = streamed.session.world.GetState();

    for (std::size_t i = 0; i < Sends; ++i) streamed.history.Send(i * 5 % 9);

    ASSERT_TRUE(streamed.WaitForFrameOfLatest());
    EXPECT_TRUE(WaitUntil([&] { return CountThreads() <= threads; })) << CountThreads();
    ExpectSameReservations(before, streamed.session.world.GetState());
    ASSERT_TRUE(streamed.flow->Drain());
    streamed.history.ExpectWholeSets(streamed.flow->GetFrames());
    ASSERT_ZERR(zerrNone, Zentara_SetStreaming(streamed.GetHandle(), 0));
    EXPECT_TRUE(WaitUntil([&] { return CountThreads() <= threadsBeforeStream; })) << CountThreads();
    const ZentaraSimulationState after = streamed.session.world.GetState();
    ExpectSameReservations(idle, after);
    EXPECT_EQ(idle.pendedRequests, after.pendedRequests);
    EXPECT_EQ(0u, after.attachedBuffers);
    EXPECT_EQ(zerrNone, streamed.session.Grab().frame.errorCode) << "the queue is not empty";
}

/// Hears the change that was queued behind a frame whose image cannot be served yet.
struct EarlyChange {
    std::atomic<bool> isHeard{false}, isLastDelivered{false};
    std::atomic<std::uint32_t> flags{0};
    std::thread::id frameThread, changeThread;

    static EarlyChange& Restore(std::uint64_t userPrivate) {
        return *reinterpret_cast<EarlyChange*>(static_cast<std::uintptr_t>(userPrivate));
    }
    /// The first frame keeps the run loop until the change behind the second has been made.
    static void KeepRunLoop(std::uint64_t userPrivate, std::uint32_t userData, std::uint32_t,
                            std::uint32_t) {
        EarlyChange& self = Restore(userPrivate);
        self.frameThread = std::this_thread::get_id();
        if (userData == 2) self.isLastDelivered = true;
        if (userData != 0) return;
        EXPECT_TRUE(WaitUntil([&] { return self.isHeard.load(); }, std::chrono::seconds(60)));
    }
    static void Hear(std::uint64_t userPrivate, std::uint32_t, std::uint32_t errorCode,
                     std::uint32_t flags) {
        EXPECT_ZERR(zerrNone, errorCode);
        EarlyChange& self = Restore(userPrivate);
        self.changeThread = std::this_thread::get_id();
        self.flags = flags;
        self.isHeard = true;
    }
};

TEST(SettingsBehindAFrame, AreInForceAtTheEndOfItsExposureBeforeItsImageIsDelivered) {
    Streamed streamed(VersionOne);
    ASSERT_TRUE(streamed.session.IsOpen());
    const ZentaraHandle handle = streamed.GetHandle();
    Zentara_Settings settings = streamed.ReadSettings();
    SetWide(settings, zprm64Exposure, GetExposureNs(7));
    EarlyChange early;
    const auto self = static_cast<std::uint64_t>(reinterpret_cast<std::uintptr_t>(&early));
    ClientFrame frames[] = {ClientFrame(StreamedCamera::BufferBytes),
                            ClientFrame(StreamedCamera::BufferBytes),
                            ClientFrame(StreamedCamera::BufferBytes)};
    const auto queue = [&](std::uint32_t i) {
        return Zentara_QueueFrame(handle, frames[i].Get(), EarlyChange::KeepRunLoop, zcbFrameDone,
                                  self, i);
    };
    ASSERT_ZERR(zerrNone, queue(0));
    ASSERT_ZERR(zerrNone, queue(1));
    ASSERT_ZERR(zerrNone, Zentara_QueueSettings(handle, &settings, EarlyChange::Hear,
                                                zcbFrameDone | zcbExposeDone, self, 0));
    ASSERT_ZERR(zerrNone, queue(2));

    ASSERT_ZERR(zerrNone, Zentara_SetStreaming(handle, 1));

    ASSERT_TRUE(WaitUntil([&] { return early.isLastDelivered.load(); }, std::chrono::seconds(60)));
    ASSERT_ZERR(zerrNone, Zentara_SetStreaming(handle, 0));
    ASSERT_ZERR(zerrNone, Zentara_Abort(handle));
    EXPECT_NE(early.frameThread, early.changeThread);
    EXPECT_EQ(3u, early.flags) << "the flags as they were given";
    EXPECT_EQ(GetExposureNs(7), streamed.session.GetCamera().GetExposure());
}

TEST(SettingsBehindAFrame, MayChangeTheBinningWhichIsNotComparedAndRestartsTheStream) {
    constexpr std::uint32_t Rounds = 10;
    Streamed streamed(VersionOne);
    ASSERT_TRUE(streamed.session.IsOpen());
    const Zentara_Settings base = streamed.ReadSettings();
    Zentara_Settings binned = base;
    SetWord(binned, zprmBinning, 2);
    Zentara_Settings corner = base;
    SetWord(corner, zprmRoiWidth, 80);
    SetWord(corner, zprmRoiHeight, 60);
    ASSERT_NO_FATAL_FAILURE(streamed.history.AddSet(corner));
    ASSERT_NO_FATAL_FAILURE(streamed.history.AddSet(binned));
    SetWord(binned, zprmRoiWidth, 80);
    SetWord(binned, zprmRoiHeight, 60);
    ASSERT_NO_FATAL_FAILURE(streamed.BeginFlow());

    for (std::uint32_t i = 0; i < Rounds; ++i) {
        const std::size_t set = (i + 1) % 2;
        Zentara_Settings block = set == 0 ? corner : binned;
        const std::uint64_t before = streamed.history.CountExposed();
        ASSERT_ZERR(zerrNone, streamed.flow->QueueSettings(&block, zcbFrameDone, i));
        ASSERT_TRUE(streamed.flow->WaitForSettings(i + 1));
        EXPECT_ZERR(zerrNone, streamed.flow->GetLastSettings().errorCode);
        streamed.history.Note(set, before, streamed.flow->GetLastSettings().framesExposed);
        ASSERT_TRUE(streamed.WaitForFrameOfLatest()) << "after change " << i;
    }

    ASSERT_TRUE(streamed.flow->Drain());
    streamed.history.ExpectWholeSets(streamed.flow->GetFrames());
    ExpectCallbacksInOrder(streamed.flow->GetEvents());
}

/// An image that a grab called good, as the camera's own record of it would stand.
struct GrabbedImage {
    std::uint32_t number = 0, width = 0, height = 0;
    std::uint64_t checksum = 0;

    bool IsAsSent(const TraceRecord& sent) const {
        return sent.rollingFrameNumber == number && sent.width == width && sent.height == height &&
               sent.checksum == checksum;
    }
};

GrabbedImage ReadGrabbed(const Streamed& streamed, ClientFrame& frame) {
    const std::size_t sampleBytes = frame->bits > 8 ? 2 : 1;
    const std::size_t bytes = sampleBytes * frame->width * frame->height;
    std::vector<std::uint8_t> pixels(frame.GetPixels(), frame.GetPixels() + bytes);
    if (streamed.session.GetCamera().GetStreamingVersion() == 2) {
        std::reverse(pixels.begin(), pixels.end());
        for (std::size_t i = 0; sampleBytes == 2 && i + 1 < bytes; i += 2) {
            std::swap(pixels[i], pixels[i + 1]);
        }
    }
    return {frame->frameNumber, frame->width, frame->height,
            CalculateChecksum(pixels.data(), pixels.size())};
}

void ExpectImagesAsSent(const SimulationWorld& world, const std::vector<GrabbedImage>& grabbed) {
    const auto sent = world.ReadFrames();
    for (const GrabbedImage& image : grabbed) {
        EXPECT_TRUE(std::any_of(sent.begin(), sent.end(),
                                [&](const auto& record) { return image.IsAsSent(record); }))
            << "frame " << image.number << ", " << image.width << " x " << image.height;
    }
}

/// What a second client thread does to a camera whose settings the first one sends.
struct Disturbance {
    std::atomic<bool> isOver{false};
    std::atomic<std::size_t> rounds{0};
    std::vector<GrabbedImage> grabbed;  // for the first thread once the second has ended
};
void DisturbStream(Streamed& streamed, Disturbance& disturbance) {
    const ZentaraHandle handle = streamed.GetHandle();
    const auto blocks = MakeDifferentSettings(streamed.ReadSettings(), streamed.camera);
    CallbackLog calls;
    std::vector<std::unique_ptr<ClientFrame>> frames;
    for (int i = 0; i < 6; ++i) {
        frames.push_back(std::make_unique<ClientFrame>(StreamedCamera::BufferBytes));
    }
    Zentara_Settings block = blocks[0];
    for (std::size_t round = 0; !disturbance.isOver; round = ++disturbance.rounds) {
        for (const auto& frame : frames) {
            (void)Zentara_QueueFrame(handle, frame->Get(), CallbackLog::Record, 3,
                                     calls.GetPrivate(), 0);
        }
        block = blocks[round % blocks.size()];
        (void)Zentara_QueueSettings(handle, &block, CallbackLog::Record, 3, calls.GetPrivate(), 0);
        (void)Zentara_QueueFrame(handle, frames[0]->Get(), CallbackLog::Record, 3,
                                 calls.GetPrivate(), 0);
        // The abort gives the frames and the block back.
        EXPECT_ZERR(zerrNone, Zentara_Abort(handle));
        EXPECT_ZERR(zerrNone, Zentara_SetStreaming(handle, 1));
        const ZentaraResult grabbed = Zentara_GrabFrame(handle, frames[1]->Get());
        EXPECT_TRUE(grabbed == zerrNone || grabbed == zerrCameraFault) << grabbed;
        if (grabbed == zerrNone && (*frames[1])->errorCode == zerrNone) {
            disturbance.grabbed.push_back(ReadGrabbed(streamed, *frames[1]));
        }
    }
    EXPECT_ZERR(zerrNone, Zentara_Abort(handle));
    for (const auto& frame : frames) EXPECT_TRUE(frame->IsGuardIntact());
}

TEST_P(SettingsUnderStreaming, OneThreadMaySendWhileAnotherQueuesAbortsAndGrabs) {
    constexpr std::size_t Sends = 150;
    Streamed streamed(GetParam());
    ASSERT_TRUE(streamed.session.IsOpen());
    ASSERT_NO_FATAL_FAILURE(streamed.AddDifferentSets());
    ASSERT_ZERR(zerrNone, Zentara_SetStreaming(streamed.GetHandle(), 1));
    const ZentaraSimulationState before = streamed.session.world.GetState();
    Disturbance disturbance;
    std::thread other([&] { DisturbStream(streamed, disturbance); });

    for (std::size_t i = 0; i < Sends; ++i) {
        Zentara_Settings block = streamed.history.GetSet(i * 5 % 9).block;
        EXPECT_ZERR(zerrNone, Zentara_SendSettingsToCam(streamed.GetHandle(), &block));
        if (i % 3 != 0) continue;
        // A stream that is always started anew brings no image to a grab.
        const std::size_t rounds = disturbance.rounds;
        EXPECT_TRUE(
            WaitUntil([&] { return disturbance.rounds > rounds; }, std::chrono::seconds(60)));
    }

    disturbance.isOver = true;
    other.join();
    EXPECT_FALSE(disturbance.grabbed.empty());
    ExpectImagesAsSent(streamed.session.world, disturbance.grabbed);
    ASSERT_ZERR(zerrNone, Zentara_SetStreaming(streamed.GetHandle(), 1));
    ExpectSameReservations(before, streamed.session.world.GetState());
    ASSERT_ZERR(zerrNone, Zentara_SetStreaming(streamed.GetHandle(), 0));
    ASSERT_NO_FATAL_FAILURE(streamed.BeginFlow());
    streamed.history.Send(4);
    ASSERT_TRUE(streamed.WaitForFrameOfLatest());
    ASSERT_TRUE(streamed.flow->Drain());
    streamed.history.ExpectWholeSets(streamed.flow->GetFrames());
}

INSTANTIATE_TEST_SUITE_P(Cameras, SettingsUnderStreaming,
                         testing::Values(VersionZero, VersionOne, VersionTwo, TwoFields),
                         [](const auto& camera) { return std::string(camera.param.scenario); });

}  // namespace
}  // namespace ZV::Test
