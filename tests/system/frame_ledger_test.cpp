#include <gtest/gtest.h>

#include <array>
#include <string>
#include <vector>

#include "support/expect_zerr.h"
#include "support/wait_until.h"
#include "system/frame_ledger.h"

// No frame of a paced stream is lost without a count.
namespace ZV::Test {
namespace {

constexpr std::uint64_t Triggers = 40;
constexpr std::size_t Queued = 25;
/// Long enough for an abort amid it: 20 ms in a world of this time scale.
constexpr std::uint64_t AbortedExposureNs = 1'000'000'000;
/// More than the ring holds: whatever the camera had sent before has been parsed by then.
constexpr std::uint32_t RequestsUntilSettled = 70;

using StatusByVersion = std::array<std::uint16_t, 3>;
constexpr StatusByVersion Undamaged{},
    MissingData{FrameStatusMissingData, FrameStatusMissingData, FrameStatusMissingData},
    OutOfSync{FrameStatusOutOfSync, FrameStatusOutOfSync, FrameStatusOutOfSync};

/// A fault and what has to become of the frames that it meets.
struct LedgerFault {
    const char* name;
    const char* json;
    StatusByVersion damage = Undamaged;  ///< A frame comes with this status.
    std::uint32_t versions = 0b111;      ///< Bit n: fits streaming version n.
    std::uint64_t unseen = 0;            ///< Exposed frames whose start never arrives.
    std::uint64_t restarts = 0;          ///< Starts beside the first of a frame.
    std::uint64_t brokenOff = 0;         ///< Frames that are not sent to their end.
    /// Requests of the ring of which nothing, or only a part, is parsed.
    std::uint64_t requestsLost = 0;
    std::uint64_t failedTriggersMax = 0;  ///< Requests for an exposure that may fail.
    std::uint32_t silentVersions = 0;     ///< Pixels change, and nothing can tell.
    /// Frames that wait at an idle engine, since no arrival tells of them: the one in hand, or
    /// refused ones.
    std::uint64_t waitingMax = 1;
    /// The last frame is in hand at the stop, which takes it out of the queue, unless the run loop
    /// is still awake: that one throws it away.
    bool leavesOneUnfinished = false;
    bool isAborted = false;  ///< The engine refuses one frame.
};

/// The client dawdles over the first frames; each frame of these comes to an idle engine.
constexpr std::uint64_t FirstPaced = 15, LastPaced = 22;

constexpr LedgerFault Faults[] = {
    {.name = "none", .json = ""},
    {.name = "aborted", .json = "", .isAborted = true},
    {.name = "lostInside",
     .json = R"({"kind": "losePacket", "packet": 2, "frame": 16, "count": 2})",
     .damage = MissingData},
    {.name = "lostByChance",
     .json = R"({"kind": "losePacket", "packet": 1, "count": 3},
                {"kind": "losePacket", "packet": 2, "probability": 0.3})",
     .damage = MissingData},
    {.name = "lostStart",
     .json = R"({"kind": "losePacket", "packet": 0, "frame": 16},
                {"kind": "losePacket", "packet": 0, "frame": 19})",
     .unseen = 2},
    {.name = "lostEnd",
     .json = R"({"kind": "losePacket", "packet": 2, "frame": 40, "count": 100})",
     .leavesOneUnfinished = true},
    {.name = "repeated",
     .json = R"({"kind": "repeatPacket", "packet": 1, "frame": 16})",
     .damage = MissingData},
    // A second start with the frame's own number begins a record of its own.
    {.name = "repeatedStart",
     .json = R"({"kind": "repeatPacket", "packet": 0, "frame": 16})",
     .damage = MissingData,
     .versions = 0b110,
     .restarts = 1},
    {.name = "truncated",
     .json = R"({"kind": "truncatePacket", "packet": 1, "frame": 16})",
     .damage = MissingData},
    {.name = "truncatedStart",
     .json = R"({"kind": "truncatePacket", "packet": 0, "frame": 16})",
     .versions = 0b110,
     .unseen = 1},
    {.name = "corrupted",
     .json = R"({"kind": "corruptPacket", "packet": 1, "offset": 30, "frame": 16})",
     .silentVersions = 0b111},
    {.name = "otherLayout",
     .json = R"({"kind": "corruptPacket", "packet": 0, "offset": 1, "bytes": 1, "frame": 16})",
     .versions = 0b110,
     .unseen = 1},
    // Version 0 has no tail: these are pixels.
    {.name = "withoutTail",
     .json = R"({"kind": "missingTail", "packet": 1, "frame": 16})",
     .damage = {0, FrameStatusMissingData, FrameStatusMissingData},
     .silentVersions = 0b001},
    {.name = "startWithoutTail",
     .json = R"({"kind": "missingTail", "packet": 0, "frame": 16})",
     .versions = 0b110,
     .unseen = 1},
    {.name = "overwritten",
     .json = R"({"kind": "overwriteRequest", "frame": 16, "packet": 1})",
     .requestsLost = 1},
    {.name = "startInside",
     .json = R"({"kind": "frameStart", "frame": 16, "packet": 2})",
     .damage = {FrameStatusOutOfSync, FrameStatusMissingData, FrameStatusMissingData},
     .restarts = 1},
    {.name = "busReset",
     .json = R"({"kind": "busReset", "frame": 16, "packet": 2})",
     .brokenOff = 1,
     .requestsLost = 1,
     .failedTriggersMax = 1},
    // A camera that waits for triggers tells of a frame that does not fit.
    {.name = "otherSettings",
     .json = R"({"kind": "wrongPsn", "frame": 16, "count": 3})",
     .damage = OutOfSync,
     .waitingMax = 2},
};

struct LedgerCase {
    std::uint32_t version = 0;
    LedgerFault fault;
};

std::ostream& operator<<(std::ostream& stream, const LedgerCase& testCase) {
    return stream << testCase.fault.name << " of version " << testCase.version;
}

std::vector<LedgerCase> ListCases() {
    std::vector<LedgerCase> cases;
    for (const LedgerFault& fault : Faults) {
        for (std::uint32_t version = 0; version < 3; ++version) {
            if ((fault.versions >> version & 1) != 0) cases.push_back({version, fault});
        }
    }
    return cases;
}

class FrameLedger : public testing::TestWithParam<LedgerCase> {
  protected:
    static std::uint32_t GetVersion() { return GetParam().version; }
    static const LedgerFault& GetFault() { return GetParam().fault; }
};

/// Whether all that the camera has sent went through the ring.
bool WaitUntilSettled(const SimulationWorld& world) {
    const std::uint32_t served = world.GetState().requestsServed;
    return WaitUntil(
        [&] { return world.GetState().requestsServed - served >= RequestsUntilSettled; });
}

/// Asks until the camera has exposed. What falls into a reset of the bus fails and is not done.
void Trigger(const CameraSession& session, std::uint64_t* failuresLeft) {
    std::uint32_t result = Zentara_Trigger(session.GetHandle());
    for (; result == zerrDriverFault && *failuresLeft > 0; --*failuresLeft) {
        result = Zentara_Trigger(session.GetHandle());
    }
    ASSERT_ZERR(zerrNone, result);
}

/// Each of the paced triggers finds an engine with nothing to do but, perhaps, frames that lack
/// their end, of which no arrival tells.
void TriggerAll(const CameraSession& session, const LedgerFault& fault) {
    const StreamCounters& counters = session.GetCamera().GetStreamCounters();
    std::uint64_t failuresLeft = fault.failedTriggersMax;
    for (std::uint64_t i = 1; i <= Triggers; ++i) {
        ASSERT_NO_FATAL_FAILURE(Trigger(session, &failuresLeft));
        // In the midst of its exposure; a trigger would take an earlier abort back.
        if (fault.isAborted && i > FirstPaced && i <= LastPaced && counters.refused.Get() == 0) {
            ASSERT_EQ(CameraOk, session.GetCamera().Abort());
        }
        if (i + 1 < FirstPaced || i > LastPaced) continue;
        ASSERT_TRUE(WaitUntil([&] { return session.world.GetState().framesExposed == i; }));
        ASSERT_TRUE(WaitUntilSettled(session.world));
        ASSERT_TRUE(WaitUntil(
            [&] { return counters.begun.Get() <= SumFates(counters) + fault.waitingMax; }));
    }
}

/// Starts that one request can hold.
std::uint64_t CountStartsInRequest(const CameraSession& session) {
    constexpr std::uint64_t PacketsInRequest = 30;
    const std::uint64_t payload = session.GetPacketBytes();
    const std::uint64_t packets = (LedgerWidth * LedgerHeight + payload - 1) / payload;
    return PacketsInRequest / packets + 1;
}

/// Rolling numbers of frames that came as whole, with other pixels than were sent.
std::vector<std::uint32_t> FindChanged(const CountingClient& client, const SimulationWorld& world) {
    const auto received = client.GetWholeChecksums();
    std::vector<std::uint32_t> changed;
    for (const TraceRecord& record : world.ReadFrames()) {
        const auto found = received.find(record.rollingFrameNumber);
        if (found == received.end() || found->second == record.checksum) continue;
        changed.push_back(record.rollingFrameNumber);
    }
    return changed;
}

/// That the fault has done what it is there for.
void ExpectFaultShows(const LedgerCase& testCase, const CountingClient& client,
                      const CameraSession& session) {
    const auto& [version, fault] = testCase;
    const StreamCounters& counters = session.GetCamera().GetStreamCounters();
    if (const std::uint16_t status = fault.damage[version]; status != 0) {
        EXPECT_LT(0U, counters.delivered.Get(status)) << "with status " << status;
    }
    if (fault.requestsLost > 0) {
        const std::uint64_t seen = CountSeen(counters);
        EXPECT_TRUE(seen < Triggers ||
                    counters.delivered.Get(FrameStatusGood) < counters.delivered.GetSum());
    }
    EXPECT_EQ(fault.isAborted ? 1U : 0U, counters.refused.Get());
    if (fault.leavesOneUnfinished) {
        EXPECT_EQ(1U, counters.cleared.Get() + counters.bad.Get());
    }
    const bool isSilent = (fault.silentVersions >> version & 1) != 0;
    EXPECT_EQ(isSilent ? 1U : 0U, FindChanged(client, session.world).size());
}

TEST_P(FrameLedger, EveryExposedFrameIsDeliveredOrCounted) {
    const LedgerFault& fault = GetFault();
    CameraSession session(MakeLedgerScenario(fault.json, GetVersion()));
    ASSERT_TRUE(session.IsOpen());
    ASSERT_EQ(CameraOk, session.GetCamera().SetTriggerMode(TriggerModeSoftware));
    if (fault.isAborted) {
        ASSERT_EQ(CameraOk, session.GetCamera().SetExposure(AbortedExposureNs));
    }
    ASSERT_EQ(CameraOk, session.GetCamera().UpdateSettingsOnCamera());
    CountingClient client(session);
    client.DawdleUntilOneIsDropped();
    client.Queue(Queued);
    ASSERT_ZERR(zerrNone, Zentara_SetStreaming(session.GetHandle(), 1));

    ASSERT_NO_FATAL_FAILURE(TriggerAll(session, fault));
    ASSERT_TRUE(WaitUntil([&] {
        const ZentaraSimulationState state = session.world.GetState();
        return state.framesExposed == Triggers && state.framesSent + fault.brokenOff == Triggers;
    }));
    ASSERT_TRUE(WaitUntilSettled(session.world));
    // Of two that wait at a stop one would stay for the next stream.
    const StreamCounters& counters = session.GetCamera().GetStreamCounters();
    ASSERT_TRUE(WaitUntil([&] { return counters.begun.Get() <= SumFates(counters) + 1; }));
    ASSERT_ZERR(zerrNone, Zentara_SetStreaming(session.GetHandle(), 0));

    EXPECT_TRUE(WaitUntilServed(client, counters));
    EXPECT_EQ(counters.begun.Get(), SumFates(counters));
    EXPECT_EQ(Triggers - fault.brokenOff, session.world.ReadFrames().size()) << "in the trace";
    const std::uint64_t seen = CountSeen(counters);
    const std::uint64_t seenMax = Triggers + fault.restarts - fault.unseen;
    EXPECT_GE(seenMax, seen);
    EXPECT_LE(seenMax, seen + fault.requestsLost * CountStartsInRequest(session));
    EXPECT_LT(0U, counters.dropped.Get());
    ExpectClientGotWhatWasDelivered(client, counters);
    ExpectWholeFramesWereSent(client, session.world);
    ExpectFaultShows(GetParam(), client, session);
    EXPECT_LE(client.CountAll(), Queued);
    ASSERT_ZERR(zerrNone, Zentara_Abort(session.GetHandle()));
}

INSTANTIATE_TEST_SUITE_P(Versions, FrameLedger, testing::ValuesIn(ListCases()),
                         [](const auto& caseInfo) {
                             return std::string(caseInfo.param.fault.name) + "OfVersion" +
                                    std::to_string(caseInfo.param.version);
                         });

}  // namespace
}  // namespace ZV::Test
