#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <deque>
#include <map>
#include <mutex>
#include <set>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

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
/// Long enough for an abort amid it: 20 ms in a world of this time scale.
constexpr std::uint64_t AbortedExposureNs = 1'000'000'000;
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
    bool leavesOneUnfinished = false;     ///< A stop takes the last frame out of the queue.
    bool isAborted = false;               ///< The engine refuses one frame.
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
     .damage = OutOfSync},
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

constexpr std::uint64_t Width = 160, Height = 120;

std::string MakeScenario(const std::string& faults, std::uint32_t version) {
    return R"({"timeScale": 0.02, "cameras": [{"model": "SolvaneA1", "streamingVersion": )" +
           std::to_string(version) + R"(, "sensor": {"width": )" + std::to_string(Width) +
           R"(, "height": )" + std::to_string(Height) + R"(, "colour": "mono"},
           "scene": {"kind": "flat"}, "faults": [)" +
           faults + "]}]}";
}

/// A client that queues frames and writes down the codes that come back.
class CountingClient {
  public:
    explicit CountingClient(CameraSession& countedSession) : session(countedSession) {}
    CountingClient(const CountingClient&) = delete;
    CountingClient& operator=(const CountingClient&) = delete;

    void Queue(std::size_t count) { Queue(count, session.GetCamera().GetImageSize()); }
    void Queue(std::size_t count, std::uint32_t bytes) {
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
    /// The first frame's callback returns when a frame behind it has been dropped.
    void DawdleUntilOneIsDropped() { hasDawdled = false; }
    std::map<std::uint32_t, std::uint64_t> CountCodes() const {
        const std::lock_guard hold(mutex);
        return codes;
    }
    std::uint64_t CountAll() const {
        std::uint64_t sum = 0;
        for (const auto& [code, count] : CountCodes()) sum += count;
        return sum;
    }
    /// Checksums of what came whole, by rolling number.
    std::map<std::uint32_t, std::uint64_t> GetWholeChecksums() const {
        std::map<std::uint32_t, std::uint64_t> checksums;
        for (const DeliveredFrame& delivered : frames) {
            if (delivered.frame.frameNumber == 0 || delivered.frame.errorCode != 0) continue;
            checksums[delivered.frame.frameNumber] =
                CalculateChecksum(delivered.pixels.data(), delivered.frame.size);
        }
        return checksums;
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
        const StreamCounters& counters = client.session.GetCamera().GetStreamCounters();
        EXPECT_TRUE(WaitUntil([&] { return counters.dropped.Get() > 0; }));
    }

    CameraSession& session;
    std::deque<DeliveredFrame> frames;
    mutable std::mutex mutex;
    std::map<std::uint32_t, std::uint64_t> codes;
    bool hasDawdled = true;  // The run loop's.
};

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

/// Starts that the library saw.
std::uint64_t CountSeen(const StreamCounters& counters) {
    return counters.begun.Get() + counters.refused.Get();
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
        ASSERT_TRUE(WaitUntil([&] { return counters.begun.Get() <= SumFates(counters) + 2; }));
    }
}

/// Starts that one request can hold.
std::uint64_t CountStartsInRequest(const CameraSession& session) {
    constexpr std::uint64_t PacketsInRequest = 30;
    const std::uint64_t payload = session.GetPacketBytes();
    const std::uint64_t packets = (Width * Height + payload - 1) / payload;
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
        EXPECT_LT(0U, counters.cleared.Get());
    }
    const bool isSilent = (fault.silentVersions >> version & 1) != 0;
    EXPECT_EQ(isSilent ? 1U : 0U, FindChanged(client, session.world).size());
}

TEST_P(FrameLedger, EveryExposedFrameIsDeliveredOrCounted) {
    const LedgerFault& fault = GetFault();
    CameraSession session(MakeScenario(fault.json, GetVersion()));
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
        MakeScenario(R"({"kind": "losePacket", "packet": 1, "frame": 11, "count": 8},
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
    ASSERT_TRUE(WaitUntil([&] {
        return counters.begun.Get() - SumFates(counters) <= 2 &&
               counters.delivered.GetSum() == client.CountAll() + counters.withoutTaker.GetSum();
    }));
    ExpectClientGotWhatWasDelivered(client, counters);
    ExpectWholeFramesWereSent(client, session.world);
}

INSTANTIATE_TEST_SUITE_P(Versions, FreeRunLedger, testing::Values(0U, 1U, 2U));

/// What goes wrong with every frame of a free run, or by chance, and how it shows.
struct LastingFault {
    const char* name;
    const char* json;
    bool (*hasShown)(const StreamCounters& counters, std::uint64_t framesExposed);
};

constexpr LastingFault LastingFaults[] = {
    {"lostInside", R"({"kind": "losePacket", "packet": 1})",
     [](const StreamCounters& counters, std::uint64_t) {
         return counters.delivered.Get(FrameStatusMissingData) > 0;
     }},
    {"lostStart", R"({"kind": "losePacket", "packet": 0})",
     [](const StreamCounters&, std::uint64_t framesExposed) { return framesExposed >= Queued; }},
    {"startInside", R"({"kind": "frameStart", "packet": 2})",
     [](const StreamCounters& counters, std::uint64_t) {
         return counters.delivered.Get(FrameStatusOutOfSync) +
                    counters.delivered.Get(FrameStatusMissingData) >
                0;
     }},
    // No arrival tells of such a frame: it is looked at when a good one has come.
    {"otherSettings", R"({"kind": "wrongPsn", "probability": 0.5})",
     [](const StreamCounters& counters, std::uint64_t) { return counters.bad.Get() > 0; }},
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
    CameraSession session(MakeScenario(fault.json, version));
    ASSERT_TRUE(session.IsOpen());
    CountingClient client(session);
    client.Queue(Queued);
    ASSERT_ZERR(zerrNone, Zentara_SetStreaming(session.GetHandle(), 1));
    const StreamCounters& counters = session.GetCamera().GetStreamCounters();

    ASSERT_TRUE(WaitUntil([&, &hasShown = fault.hasShown] {
        return hasShown(counters, session.world.GetState().framesExposed);
    }));
    ASSERT_ZERR(zerrNone, Zentara_SetStreaming(session.GetHandle(), 0));

    // Of two frames that wait at a stop one stays for the next stream.
    ASSERT_TRUE(WaitUntil([&] {
        return counters.begun.Get() - SumFates(counters) <= 1 &&
               counters.delivered.GetSum() == client.CountAll() + counters.withoutTaker.GetSum();
    }));
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
    ASSERT_TRUE(WaitUntil([&] {
        return counters.delivered.GetSum() == client.CountAll() + counters.withoutTaker.GetSum();
    }));
    EXPECT_LE(2 * counters.delivered.GetSum(), counters.heldBack.Get());
    ExpectClientGotWhatWasDelivered(client, counters);
}

}  // namespace
}  // namespace ZV::Test
