#include <gtest/gtest.h>

#include <algorithm>
#include <string>
#include <string_view>
#include <vector>

#include "support/expect_zerr.h"
#include "support/wait_until.h"
#include "system/frame_ledger.h"

// No frame of a stream that runs freely is lost without a count.
namespace ZV::Test {
namespace {

constexpr std::size_t FramesWanted = 25;

/// Whether the thread that parses has come to the requests that the unplugging ended.
bool HasLeftStream(const SimulationWorld& world) {
    const auto requests = world.ReadRequests();
    return std::any_of(requests.begin(), requests.end(), [](const TraceRecord& record) {
        return record.name == "FW_IOCTL_STREAM_LEAVE";
    });
}

class FreeRunLedger : public testing::TestWithParam<std::uint32_t> {};

// What lies in the ring when a camera goes is never parsed: it is the tail that no number follows.
TEST_P(FreeRunLedger, EveryFrameUntilTheCameraGoesIsDeliveredOrCounted) {
    constexpr std::uint64_t LastFrame = 60;
    CameraSession session(
        MakeLedgerScenario(R"({"kind": "losePacket", "packet": 1, "frame": 11, "count": 8},
        {"kind": "losePacket", "packet": 0, "frame": 21},
        {"kind": "wrongPsn", "frame": 31, "count": 8},
        {"kind": "frameStart", "packet": 2, "frame": 41},
        {"kind": "unplug", "packet": 2, "frame": 60})",
                           GetParam()));
    ASSERT_TRUE(session.IsOpen());
    CountingClient client(session);
    client.DawdleUntilOneIsDropped();
    client.Queue(LastFrame);
    ASSERT_ZERR(zerrNone, Zentara_SetStreaming(session.GetHandle(), 1));

    ASSERT_TRUE(WaitUntil([&] { return HasLeftStream(session.world); }));
    EXPECT_ZERR(zerrDriverFault, Zentara_SetStreaming(session.GetHandle(), 0));

    // The stop has failed before it emptied the queue; frames that the run loop has not served wait
    // there: the last one, which has no end, and what came since the latest wake.
    const StreamCounters& counters = session.GetCamera().GetStreamCounters();
    EXPECT_EQ(LastFrame - 1, session.world.ReadFrames().size()) << "in the trace";
    // One start is lost, and one frame has two, of which each has a number.
    const std::uint64_t seen = CountSeen(counters);
    ASSERT_FALSE(client.GetWholeNumbers().empty());
    EXPECT_LE(*client.GetWholeNumbers().rbegin(), seen + 1);
    EXPECT_GE(LastFrame, seen);
    ASSERT_TRUE(WaitUntilServed(client, counters, 2));
    ExpectClientGotWhatWasDelivered(client, counters);
    ExpectWholeFramesWereSent(client, session.world);
}

INSTANTIATE_TEST_SUITE_P(Versions, FreeRunLedger, testing::Values(0U, 1U, 2U));

/// What goes wrong with every frame of a free run, or by chance, and how it shows.
struct LastingFault {
    const char* name;
    const char* json;
    bool (*hasShown)(const StreamCounters& counters, const ZentaraSimulationState& state);
};

constexpr LastingFault LastingFaults[] = {
    {"lostInside", R"({"kind": "losePacket", "packet": 1})",
     [](const StreamCounters& counters, const ZentaraSimulationState&) {
         return counters.delivered.Get(FrameStatusMissingData) > 0;
     }},
    {"lostStart", R"({"kind": "losePacket", "packet": 0})",
     [](const StreamCounters&, const ZentaraSimulationState& state) {
         return state.framesExposed >= FramesWanted;
     }},
    {"startInside", R"({"kind": "frameStart", "packet": 2})",
     [](const StreamCounters& counters, const ZentaraSimulationState&) {
         return counters.delivered.Get(FrameStatusOutOfSync) +
                    counters.delivered.Get(FrameStatusMissingData) >
                0;
     }},
    // No arrival tells of such a frame: it is looked at when a good one has come.
    {"otherSettings", R"({"kind": "wrongPsn", "probability": 0.5})",
     [](const StreamCounters& counters, const ZentaraSimulationState&) {
         return counters.bad.Get() > 0;
     }},
    {"requestFails",
     R"({"kind": "failRequest", "code": "FW_IOCTL_ATTACH_BUFFER", "pended": true, "probability": 0.05})",
     [](const StreamCounters& counters, const ZentaraSimulationState& state) {
         return state.requestsFailed >= 3 && counters.delivered.GetSum() > 0;
     }},
};

struct LastingCase {
    std::uint32_t version;
    LastingFault fault;
};

std::ostream& operator<<(std::ostream& stream, const LastingCase& testCase) {
    return stream << testCase.fault.name << " of version " << testCase.version;
}

std::vector<LastingCase> ListLastingCases() {
    std::vector<LastingCase> cases;
    for (const LastingFault& fault : LastingFaults) {
        for (std::uint32_t version = 0; version < 3; ++version) cases.push_back({version, fault});
    }
    return cases;
}

class LastingFaultLedger : public testing::TestWithParam<LastingCase> {};

// However many frames the queue of two drops, some come by.
TEST_P(LastingFaultLedger, ShowsInAFreeRun) {
    const auto& [version, fault] = GetParam();
    CameraSession session(MakeLedgerScenario(fault.json, version));
    ASSERT_TRUE(session.IsOpen());
    CountingClient client(session);
    client.Queue(FramesWanted);
    ASSERT_ZERR(zerrNone, Zentara_SetStreaming(session.GetHandle(), 1));
    const StreamCounters& counters = session.GetCamera().GetStreamCounters();

    ASSERT_TRUE(WaitUntil(
        [&, &hasShown = fault.hasShown] { return hasShown(counters, session.world.GetState()); }));
    ASSERT_ZERR(zerrNone, Zentara_SetStreaming(session.GetHandle(), 0));

    // Of two frames that wait at a stop one stays for the next stream.
    ASSERT_TRUE(WaitUntilServed(client, counters, 1));
    if (std::string_view(fault.name) == "lostStart") {
        EXPECT_EQ(0U, CountSeen(counters));
    }
    ExpectClientGotWhatWasDelivered(client, counters);
    ExpectWholeFramesWereSent(client, session.world);
}

INSTANTIATE_TEST_SUITE_P(Versions, LastingFaultLedger, testing::ValuesIn(ListLastingCases()),
                         [](const auto& caseInfo) {
                             return std::string(caseInfo.param.fault.name) + "OfVersion" +
                                    std::to_string(caseInfo.param.version);
                         });

TEST(FrameLedgerTest, AnAbortRefusesExactlyOneFrame) {
    CameraSession session(MakeLedgerScenario("", 1));
    ASSERT_TRUE(session.IsOpen());
    CountingClient client(session);
    client.Queue(3);
    ASSERT_ZERR(zerrNone, Zentara_SetStreaming(session.GetHandle(), 1));
    ASSERT_TRUE(WaitUntil([&] { return client.CountAll() == 3; }));
    const StreamCounters& counters = session.GetCamera().GetStreamCounters();

    ASSERT_ZERR(zerrNone, Zentara_Abort(session.GetHandle()));
    const std::uint64_t begun = counters.begun.Get();
    ASSERT_TRUE(WaitUntil([&] { return counters.begun.Get() > begun + 3; }));

    EXPECT_EQ(1U, counters.refused.Get());
    ASSERT_ZERR(zerrNone, Zentara_SetStreaming(session.GetHandle(), 0));
}

TEST(FrameLedgerTest, AStreamThatEndsForWantOfARequestHasCountedEachFrame) {
    CameraSession session(MakeLedgerScenario(
        R"({"kind": "failRequest", "code": "FW_IOCTL_ATTACH_BUFFER", "request": 100})", 1));
    ASSERT_TRUE(session.IsOpen());
    CountingClient client(session);
    client.Queue(FramesWanted);
    ASSERT_ZERR(zerrNone, Zentara_SetStreaming(session.GetHandle(), 1));

    ASSERT_TRUE(WaitUntil([&] { return HasLeftStream(session.world); }));
    ASSERT_ZERR(zerrNone, Zentara_SetStreaming(session.GetHandle(), 0));

    const StreamCounters& counters = session.GetCamera().GetStreamCounters();
    EXPECT_LT(0U, counters.delivered.GetSum());
    EXPECT_GT(session.world.GetState().framesExposed, CountSeen(counters));
    ASSERT_TRUE(WaitUntilServed(client, counters, 1));
    ExpectClientGotWhatWasDelivered(client, counters);
    ExpectWholeFramesWereSent(client, session.world);
}

TEST(FrameLedgerTest, ImagesThatNobodyWaitsForAreCountedAsSuch) {
    CameraSession session(MakeLedgerScenario("", 1));
    ASSERT_TRUE(session.IsOpen());
    ASSERT_ZERR(zerrNone, Zentara_SetStreaming(session.GetHandle(), 1));
    const StreamCounters& counters = session.GetCamera().GetStreamCounters();

    ASSERT_TRUE(WaitUntil([&] { return counters.withoutTaker.GetSum() >= 5; }));
    ASSERT_ZERR(zerrNone, Zentara_SetStreaming(session.GetHandle(), 0));

    EXPECT_TRUE(
        WaitUntil([&] { return counters.delivered.GetSum() == counters.withoutTaker.GetSum(); }));
}

TEST(FrameLedgerTest, TheExposuresOfAWheelAreHeldBackUntilTheyAreAnImage) {
    CameraSession session(
        R"({"base": "wheel", "timeScale": 0.02, "cameras": [{"sensor": {"width": 60, "height": 40}}]})");
    ASSERT_TRUE(session.IsOpen());
    Zentara_Settings settings{};
    ASSERT_ZERR(zerrNone, Zentara_ReadSettingsFromCam(session.GetHandle(), &settings));
    ASSERT_ZERR(zerrNone, Zentara_SetParam(&settings, zprmImageFormat, zfmtRGBPlane8));
    ASSERT_ZERR(zerrNone, Zentara_SendSettingsToCam(session.GetHandle(), &settings));
    ASSERT_EQ(CameraOk, session.GetCamera().SetTriggerMode(TriggerModeSoftware));
    ASSERT_EQ(CameraOk, session.GetCamera().UpdateSettingsOnCamera());
    CountingClient client(session);
    client.Queue(4, 3 * session.GetCamera().GetImageSize());
    ASSERT_ZERR(zerrNone, Zentara_SetStreaming(session.GetHandle(), 1));

    const StreamCounters& counters = session.GetCamera().GetStreamCounters();
    constexpr std::uint64_t Exposures = 12;
    for (std::uint64_t i = 1; i <= Exposures; ++i) {
        ASSERT_ZERR(zerrNone, Zentara_Trigger(session.GetHandle()));
        ASSERT_TRUE(WaitUntil([&] { return session.world.GetState().framesSent == i; }));
        ASSERT_TRUE(WaitUntil([&] { return SumFates(counters) == i; }));
    }
    ASSERT_ZERR(zerrNone, Zentara_SetStreaming(session.GetHandle(), 0));

    EXPECT_EQ(Exposures, session.world.GetState().framesExposed);
    EXPECT_EQ(Exposures, counters.begun.Get());
    EXPECT_EQ(0U, counters.refused.Get());
    EXPECT_EQ(Exposures, counters.heldBack.Get() + counters.delivered.GetSum());
    EXPECT_LT(0U, counters.delivered.GetSum());
    ASSERT_TRUE(WaitUntilServed(client, counters));
    EXPECT_LE(2 * counters.delivered.GetSum(), counters.heldBack.Get());
    ExpectClientGotWhatWasDelivered(client, counters);
}

}  // namespace
}  // namespace ZV::Test