#include <gtest/gtest.h>

#include <algorithm>
#include <deque>
#include <map>
#include <mutex>
#include <set>
#include <string>
#include <tuple>
#include <utility>

#include "support/expect_zerr.h"
#include "support/wait_until.h"
#include "system/camera_session.h"

// No frame is lost without a count: what the simulated camera exposed, as its state and its trace
// tell, is what the camera's counters and the client's callbacks add up to.
namespace ZV::Test {
namespace {

constexpr std::uint32_t TriggerModeSoftware = 5;
constexpr std::uint64_t Triggers = 40;
constexpr std::size_t Queued = 25;
/// More than the ring holds: whatever the camera had sent before has been parsed by then.
constexpr std::uint32_t RequestsUntilSettled = 70;

/// Frame status code of an image and the code that the client gets for it.
struct CodeRow {
    std::uint16_t status;
    std::uint32_t code;
};
constexpr CodeRow Codes[] = {{FrameStatusGood, zerrNone},
                             {FrameStatusMissingData, zerrMissingData},
                             {FrameStatusOutOfSync, zerrOutOfSync},
                             {FrameStatusBufferTooSmall, zerrBufferTooSmall},
                             {FrameStatusIncomplete, zerrFrameIncomplete}};

/// A fault and what it does to the starts of frames, which are all that the library can count.
struct LedgerFault {
    const char* name;
    const char* json;
    std::uint32_t versions = 0b111;              ///< Bit n: fits streaming version n.
    std::uint64_t unseenMin = 0, unseenMax = 0;  ///< Exposed frames whose start never arrives.
    std::uint64_t restarts = 0;                  ///< Starts beside the first of a frame.
    std::uint64_t brokenOff = 0;                 ///< Frames that are not sent to their end.
    std::uint64_t failedTriggersMax = 0;         ///< Requests for an exposure that may fail.
};

std::ostream& operator<<(std::ostream& stream, const LedgerFault& fault) {
    return stream << fault.name;
}

constexpr LedgerFault Faults[] = {
    {"none", ""},
    {"lostInside", R"({"kind": "losePacket", "packet": 2, "frame": 3, "count": 2})"},
    {"lostByChance", R"({"kind": "losePacket", "packet": 1, "count": 3},
                        {"kind": "losePacket", "packet": 2, "probability": 0.3})"},
    {"lostStart", R"({"kind": "losePacket", "packet": 0, "frame": 3},
                     {"kind": "losePacket", "packet": 0, "frame": 9})",
     0b111, 2, 2},
    {"lostEnd", R"({"kind": "losePacket", "packet": 2, "frame": 40, "count": 100})"},
    {"repeated", R"({"kind": "repeatPacket", "packet": 1, "frame": 5})"},
    // A second start with the frame's own number begins a record of its own.
    {"repeatedStart", R"({"kind": "repeatPacket", "packet": 0, "frame": 5})", 0b110, 0, 0, 1},
    {"truncated", R"({"kind": "truncatePacket", "packet": 1, "frame": 5})"},
    {"truncatedStart", R"({"kind": "truncatePacket", "packet": 0, "frame": 5})", 0b110, 1, 1},
    {"corrupted", R"({"kind": "corruptPacket", "packet": 1, "offset": 30, "frame": 5})"},
    {"otherLayout", R"({"kind": "corruptPacket", "packet": 0, "offset": 1, "bytes": 1,
                        "frame": 5})",
     0b110, 1, 1},
    {"withoutTail", R"({"kind": "missingTail", "packet": 1, "frame": 5})"},
    {"startWithoutTail", R"({"kind": "missingTail", "packet": 0, "frame": 5})", 0b110, 1, 1},
    {"overwritten", R"({"kind": "overwriteRequest", "frame": 6, "packet": 1})", 0b111, 0, 30},
    {"startInside", R"({"kind": "frameStart", "frame": 7, "packet": 2})", 0b111, 0, 0, 1},
    {"busReset", R"({"kind": "busReset", "frame": 8, "packet": 2})", 0b111, 0, 30, 0, 1, 1},
    {"otherSettings", R"({"kind": "wrongPsn", "frame": 4, "count": 3})"},
};

std::string MakeScenario(const std::string& faults, std::uint32_t version) {
    return R"({"timeScale": 0.02, "cameras": [{"model": "SolvaneA1", "streamingVersion": )" +
           std::to_string(version) +
           R"(, "sensor": {"width": 160, "height": 120, "colour": "mono"},
           "scene": {"kind": "flat"}, "faults": [)" +
           faults + "]}]}";
}

/// A client that queues frames and writes down the codes that come back.
class CountingClient {
  public:
    explicit CountingClient(CameraSession& countedSession) : session(countedSession) {}
    CountingClient(const CountingClient&) = delete;
    CountingClient& operator=(const CountingClient&) = delete;

    void Queue(std::size_t count) {
        const std::uint32_t bytes = session.GetCamera().GetImageSize();
        for (std::size_t i = 0; i < count; ++i) {
            DeliveredFrame& delivered = frames.emplace_back();
            delivered.pixels.resize(bytes);
            delivered.frame.pBuffer = delivered.pixels.data();
            delivered.frame.bufferSize = bytes;
            EXPECT_ZERR(zerrNone, Zentara_QueueFrame(session.GetHandle(), &delivered.frame, Receive,
                                                     zcbFrameDone,
                                                     reinterpret_cast<std::uintptr_t>(this), 0));
        }
    }
    /// The first frame's callback returns when the camera has exposed so many: a backlog.
    void DawdleUntil(std::uint64_t framesExposed) { dawdlesUntil = framesExposed; }
    std::map<std::uint32_t, std::uint64_t> CountCodes() const {
        const std::lock_guard hold(mutex);
        return codes;
    }
    std::uint64_t CountAll() const {
        std::uint64_t sum = 0;
        for (const auto& [code, count] : CountCodes()) sum += count;
        return sum;
    }
    /// Rolling numbers of what came whole.
    std::set<std::uint32_t> GetWholeNumbers() const {
        std::set<std::uint32_t> numbers;
        for (const DeliveredFrame& delivered : frames) {
            if (delivered.frame.frameNumber == 0 || delivered.frame.errorCode != 0) continue;
            numbers.insert(delivered.frame.frameNumber);
        }
        return numbers;
    }

  private:
    static void Receive(std::uint64_t userPrivate, std::uint32_t, std::uint32_t errorCode,
                        std::uint32_t) {
        auto& client = *reinterpret_cast<CountingClient*>(userPrivate);
        {
            const std::lock_guard hold(client.mutex);
            ++client.codes[errorCode];
        }
        if (std::exchange(client.hasDawdled, true)) return;
        EXPECT_TRUE(WaitUntil(
            [&] { return client.session.world.GetState().framesExposed >= client.dawdlesUntil; }));
    }

    CameraSession& session;
    std::deque<DeliveredFrame> frames;
    mutable std::mutex mutex;
    std::map<std::uint32_t, std::uint64_t> codes;
    std::uint64_t dawdlesUntil = 0;
    bool hasDawdled = false;  // The run loop's.
};

class FrameLedger : public testing::TestWithParam<std::tuple<std::uint32_t, LedgerFault>> {
  protected:
    static std::uint32_t GetVersion() { return std::get<0>(GetParam()); }
    static const LedgerFault& GetFault() { return std::get<1>(GetParam()); }
};

/// Whether all that the camera has sent went through the ring.
bool WaitUntilSettled(const SimulationWorld& world) {
    const std::uint32_t served = world.GetState().requestsServed;
    return WaitUntil(
        [&] { return world.GetState().requestsServed - served >= RequestsUntilSettled; });
}

/// What became of the starts that the library saw, after the stop.
std::uint64_t SumFates(const StreamCounters& counters) {
    return counters.delivered.GetSum() + counters.heldBack.Get() + counters.dropped.Get() +
           counters.bad.Get() + counters.cleared.Get();
}

/// A stop does not wait for the frame that the run loop is serving. False when frames are missing.
bool WaitUntilServed(const CountingClient& client, const StreamCounters& counters) {
    return WaitUntil([&] {
        return counters.delivered.GetSum() == client.CountAll() + counters.withoutTaker.GetSum() &&
               counters.begun.Get() == SumFates(counters);
    });
}

void ExpectClientGotWhatWasDelivered(const CountingClient& client, const StreamCounters& counters) {
    auto codes = client.CountCodes();
    for (const CodeRow& row : Codes) {
        EXPECT_EQ(counters.delivered.Get(row.status),
                  codes[row.code] + counters.withoutTaker.Get(row.status))
            << GetZerrName(row.code);
    }
}

/// Every whole frame stands in the trace: it went over the bus to its end.
void ExpectWholeFramesWereSent(const CountingClient& client, const SimulationWorld& world) {
    std::set<std::uint32_t> sent;
    for (const TraceRecord& record : world.ReadFrames()) sent.insert(record.rollingFrameNumber);
    for (const std::uint32_t number : client.GetWholeNumbers()) {
        EXPECT_EQ(1U, sent.count(number)) << "frame " << number;
    }
}

/// Asks until the camera has exposed. What falls into a reset of the bus fails and is not done.
void Trigger(const CameraSession& session, std::uint64_t* failuresLeft) {
    std::uint32_t result = Zentara_Trigger(session.GetHandle());
    for (; result == zerrDriverFault && *failuresLeft > 0; --*failuresLeft) {
        result = Zentara_Trigger(session.GetHandle());
    }
    ASSERT_ZERR(zerrNone, result);
}

TEST_P(FrameLedger, EveryExposedFrameIsDeliveredOrCounted) {
    const LedgerFault& fault = GetFault();
    if ((fault.versions >> GetVersion() & 1) == 0) return;  // another fault there
    CameraSession session(MakeScenario(fault.json, GetVersion()));
    ASSERT_TRUE(session.IsOpen());
    ASSERT_EQ(CameraOk, session.GetCamera().SetTriggerMode(TriggerModeSoftware));
    ASSERT_EQ(CameraOk, session.GetCamera().UpdateSettingsOnCamera());
    CountingClient client(session);
    client.DawdleUntil(8);
    client.Queue(Queued);
    ASSERT_ZERR(zerrNone, Zentara_SetStreaming(session.GetHandle(), 1));

    std::uint64_t failuresLeft = fault.failedTriggersMax;
    for (std::uint64_t i = 0; i < Triggers; ++i) {
        ASSERT_NO_FATAL_FAILURE(Trigger(session, &failuresLeft));
    }
    ASSERT_TRUE(WaitUntil([&] {
        const ZentaraSimulationState state = session.world.GetState();
        return state.framesExposed == Triggers && state.framesSent + fault.brokenOff == Triggers;
    }));
    ASSERT_TRUE(WaitUntilSettled(session.world));
    const StreamCounters& counters = session.GetCamera().GetStreamCounters();
    // Of two that wait at a stop one would stay for the next stream.
    ASSERT_TRUE(WaitUntil([&] { return counters.begun.Get() - SumFates(counters) <= 1; }));
    ASSERT_ZERR(zerrNone, Zentara_SetStreaming(session.GetHandle(), 0));

    EXPECT_TRUE(WaitUntilServed(client, counters));
    EXPECT_EQ(counters.begun.Get(), SumFates(counters));
    EXPECT_EQ(Triggers - fault.brokenOff, session.world.ReadFrames().size()) << "in the trace";
    const std::uint64_t seen = counters.begun.Get() + counters.refused.Get();
    EXPECT_LE(Triggers + fault.restarts - fault.unseenMax, seen);
    EXPECT_GE(Triggers + fault.restarts - fault.unseenMin, seen);
    ExpectClientGotWhatWasDelivered(client, counters);
    ExpectWholeFramesWereSent(client, session.world);
    EXPECT_LE(client.CountAll(), Queued);
    ASSERT_ZERR(zerrNone, Zentara_Abort(session.GetHandle()));
}

INSTANTIATE_TEST_SUITE_P(Versions, FrameLedger,
                         testing::Combine(testing::Values(0U, 1U, 2U), testing::ValuesIn(Faults)),
                         [](const auto& caseInfo) {
                             return std::string(std::get<1>(caseInfo.param).name) + "OfVersion" +
                                    std::to_string(std::get<0>(caseInfo.param));
                         });

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
    CameraSession session(MakeScenario(R"({"kind": "losePacket", "packet": 1, "frame": 11},
        {"kind": "losePacket", "packet": 0, "frame": 21},
        {"kind": "wrongPsn", "frame": 31, "count": 3},
        {"kind": "frameStart", "packet": 2, "frame": 41},
        {"kind": "unplug", "packet": 2, "frame": 60})",
                                       GetParam()));
    ASSERT_TRUE(session.IsOpen());
    CountingClient client(session);
    client.DawdleUntil(8);
    client.Queue(LastFrame);
    ASSERT_ZERR(zerrNone, Zentara_SetStreaming(session.GetHandle(), 1));

    ASSERT_TRUE(WaitUntil([&] { return HasLeftStream(session.world); }));
    EXPECT_ZERR(zerrDriverFault, Zentara_SetStreaming(session.GetHandle(), 0));

    // The stop has failed before it emptied the queue; frames that the run loop has not served wait
    // there: the last one, which has no end, and what came since the latest wake.
    const StreamCounters& counters = session.GetCamera().GetStreamCounters();
    EXPECT_EQ(LastFrame - 1, session.world.ReadFrames().size()) << "in the trace";
    // One start is lost, and one frame has two, of which each has a number.
    const std::uint64_t seen = counters.begun.Get() + counters.refused.Get();
    ASSERT_FALSE(client.GetWholeNumbers().empty());
    EXPECT_LE(*client.GetWholeNumbers().rbegin(), seen + 1);
    EXPECT_GE(LastFrame, seen);
    ASSERT_TRUE(WaitUntil([&] {
        return counters.begun.Get() - SumFates(counters) <= 2 &&
               counters.delivered.GetSum() == client.CountAll() + counters.withoutTaker.GetSum();
    }));
    ExpectClientGotWhatWasDelivered(client, counters);
    ExpectWholeFramesWereSent(client, session.world);
}

INSTANTIATE_TEST_SUITE_P(Versions, FreeRunLedger, testing::Values(0U, 1U, 2U));

TEST(FrameLedgerTest, AnAbortRefusesExactlyOneFrame) {
    CameraSession session(MakeScenario("", 1));
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

TEST(FrameLedgerTest, ImagesThatNobodyWaitsForAreCountedAsSuch) {
    CameraSession session(MakeScenario("", 1));
    ASSERT_TRUE(session.IsOpen());
    ASSERT_ZERR(zerrNone, Zentara_SetStreaming(session.GetHandle(), 1));
    const StreamCounters& counters = session.GetCamera().GetStreamCounters();

    ASSERT_TRUE(WaitUntil([&] { return counters.withoutTaker.GetSum() >= 5; }));
    ASSERT_ZERR(zerrNone, Zentara_SetStreaming(session.GetHandle(), 0));

    EXPECT_TRUE(
        WaitUntil([&] { return counters.delivered.GetSum() == counters.withoutTaker.GetSum(); }));
}

}  // namespace
}  // namespace ZV::Test
