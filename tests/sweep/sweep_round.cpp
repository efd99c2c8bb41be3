#include "sweep/sweep_round.h"

#include <algorithm>
#include <chrono>
#include <cstdio>
#include <functional>
#include <iterator>
#include <thread>
#include <utility>

#include "hal/control_records.h"
#include "hal/platform/clock.h"
#include "memory/failing_allocator.h"
#include "support/rounds.h"
#include "support/wait_until.h"
#include "sweep/belongings.h"
#include "sweep/counted_waits.h"
#include "sweep/told_failures.h"

namespace ZV::Test {

bool HasStory(std::size_t camera, std::size_t story) {
    return SweepCameras[camera].hasAllStories || Stories[story].dependsOnModel;
}

namespace {

using Clock = std::chrono::steady_clock;
using std::chrono::milliseconds;

constexpr std::uint32_t WaitDivisor = 1000;
/// A call that ends is allowed so long, on a machine with other work.
constexpr milliseconds CallLimit(IsSanitized ? 20'000 : 5'000);
/// So long may it wait, on the wait clock, for what does not come: a few times five seconds.
constexpr std::uint64_t WaitedLimitMs = 30'000;
/// The client that aborts, and the driver's thread that ends late requests.
constexpr std::size_t HelperThreads = 2;
constexpr std::int64_t NoAllocation = std::int64_t{1} << 40;

constexpr ZentaraResult KnownResults[] = {
    zerrNone,           zerrNotSupported,  zerrBadParameter, zerrBadSettings,
    zerrAlreadyLoaded,  zerrNotLoaded,     zerrBadHandle,    zerrBadCameraId,
    zerrHardwareFault,  zerrFirewireFault, zerrCameraFault,  zerrDriverFault,
    zerrBufferTooSmall, zerrBusy,          zerrQueueFull,    zerrFrameIncomplete,
    zerrNotStreaming,   zerrOutOfSync,     zerrMissingData,  zerrHostOverrun,
    zerrUnplugged,      zerrCameraBusy,    zerrRoiTooSmall,
};

bool IsKnownResult(ZentaraResult result) {
    return std::find(std::begin(KnownResults), std::end(KnownResults), result) !=
           std::end(KnownResults);
}

/// Never freed: a stream may hold on to it as long as the library does.
Client& GetClient() {
    static Client* const client = new Client;
    return *client;
}

/// One round, from load to release.
class Runner {
  public:
    /// `goodImage` as CountedStory has it.
    Runner(std::size_t cameraIndex, std::size_t storyIndex, std::uint64_t goodImage = 0)
        : camera(SweepCameras[cameraIndex]),
          story(Stories[storyIndex]),
          client(GetClient()),
          image(goodImage) {
        SetWaitClockDivisor(WaitDivisor);
        SelectCamera(cameraIndex);
    }
    ~Runner() { SetWaitClockDivisor(1); }
    Runner(const Runner&) = delete;
    Runner& operator=(const Runner&) = delete;

    /// False when the camera could not be brought there.
    bool Prepare();
    /// `mayGiveUp` as Client::SetGivingUp has it.
    void Run(std::function<bool()> mayGiveUp = nullptr);
    bool MayGiveUp(const Round& round, const CountedStory& counted) const;
    void CheckResults(const CountedStory* expected);
    void CheckStream(const Round* round, const CountedStory& counted);
    void CheckIsTold(const Round& round, const CountedStory& counted);
    void CheckIsToldOrDone(const CountedStory& counted);
    void CheckWhatIsLeft(const Round* round);
    std::vector<ZentaraResult> GetResults() const;
    /// Of the story alone.
    std::uint64_t GetAnswers() const { return client.GetAnswers(); }
    Client::FinishedFrames GetFinished() const { return client.GetFinished(); }
    /// Of the grabs behind it.
    std::uint64_t GetImage() const { return image; }

    std::vector<std::string> problems;

  private:
    void Complain(const std::string& text) { problems.push_back(text); }
    template <typename Work>
    void RunBounded(const char* what, Work work);
    bool HasGoodCalls(std::size_t from, const char* where);
    bool IsToldByACall(const CountedStory& counted) const;
    bool HasStreamedWithoutMemory(const CountedStory& counted) const;
    bool IsToldOfStream(const CountedStory& counted) const;
    void Begin();
    void CheckImage(const char* where);
    void StreamShortly(const char* where);
    void CloseForGood(const Round* round);
    void TakeEveryLock();
    void LoadStill();
    void UseStill(const Round* round);
    void UseAgain(const char* where);
    void CheckRelease();
    void CheckReclaimed(std::uint32_t before, const char* where);

    const SweepCamera& camera;
    const Story& story;
    Client& client;
    std::size_t firstCall = 0;  ///< Of the story.
    std::uint64_t image;        ///< 0 before the first.
    const std::uint32_t reclaimedAtBegin = CountReclaimed();
};

/// The calls that finish a single frame want one that is not finished.
void Runner::Begin() {
    client.Begin(camera.imageFormat, story.begins == Stage::Grabbed ? 0 : camera.finishedFormat);
}

bool Runner::Prepare() {
    client.Reset();
    ForgetEnd();
    if (story.begins != Stage::Unloaded) client.Load();
    if (story.begins > Stage::Loaded) {
        client.List();
        client.Open();
        Begin();
    }
    if (story.begins == Stage::Grabbed) client.Grab();
    if (story.begins == Stage::Streaming) client.StartStream();
    firstCall = client.CountCalls();
    return HasGoodCalls(0, "before the story");
}

void Runner::Run(std::function<bool()> mayGiveUp) {
    client.SetGivingUp(std::move(mayGiveUp));
    const auto run = [this] { story.run(client); };
    // Where images are waited for the client ends the call itself.
    if (story.ends == Stage::Opened) run();
    if (story.ends != Stage::Opened) RunBounded("the story", run);
    client.SetGivingUp(nullptr);
}

bool Runner::HasGoodCalls(std::size_t from, const char* where) {
    bool areGood = true;
    for (std::size_t i = from; i < client.CountCalls(); ++i) {
        const Client::Call& call = client.GetCall(i);
        if (call.result == zerrNone) continue;
        areGood = false;
        Complain(std::string(where) + ": " + call.name + " gives " + std::to_string(call.result));
    }
    return areGood;
}

std::vector<ZentaraResult> Runner::GetResults() const {
    std::vector<ZentaraResult> results;
    for (std::size_t i = firstCall; i < client.CountCalls(); ++i) {
        results.push_back(client.GetCall(i).result);
    }
    return results;
}

void Runner::CheckResults(const CountedStory* expected) {
    for (std::size_t i = firstCall; i < client.CountCalls(); ++i) {
        const Client::Call& call = client.GetCall(i);
        if (IsKnownResult(call.result)) continue;
        Complain(std::string(call.name) + " gives " + std::to_string(call.result) +
                 ", which no table has");
    }
    if (!client.HasFramesInOrder()) Complain("a frame is not in order");
    if (client.GetStrangeFrameCode() != 0) {
        Complain("a frame has the code " + std::to_string(client.GetStrangeFrameCode()));
    }
    if (expected == nullptr) return;
    if (client.GetAnswers() != expected->answers) {
        Complain("an answer is not that without the failure");
    }
    if (GetResults() == expected->results) return;
    std::string text = "the calls do not answer as without the failure:";
    for (const ZentaraResult result : GetResults()) text += " " + std::to_string(result);
    Complain(text);
}

/// A code of a call that has none without the failure. What only an abort has ended tells nothing.
bool Runner::IsToldByACall(const CountedStory& counted) const {
    for (std::size_t i = firstCall; i < client.CountCalls(); ++i) {
        const Client::Call& call = client.GetCall(i);
        if (call.result == zerrNone || call.wasAborted) continue;
        const std::size_t number = i - firstCall;
        const bool isUsual = number < counted.results.size() && counted.results[number] != zerrNone;
        if (!isUsual) return true;
    }
    return false;
}

/// A failure that a call of the story must answer with a code.
void Runner::CheckIsTold(const Round& round, const CountedStory& counted) {
    if (!MustBeTold(round, counted) || IsToldByACall(counted)) return;
    if (!client.HasCamera()) return;  // left out of the list
    char text[80];
    std::snprintf(text, sizeof text, "no call tells of it (register 0x%X)",
                  counted.requests[0][round.number - 1].address);
    Complain(text);
}

/// What has missed its memory says so, or goes on as if it had not.
void Runner::CheckIsToldOrDone(const CountedStory& counted) {
    const std::vector<ZentaraResult> results = GetResults();
    if (counted.results.empty()) return;  // not counted: a process's first story
    if (IsToldByACall(counted) || !client.HasCamera() || client.HasFrameWithError()) return;
    if (MayMissImage(story)) return;
    if (results != counted.results) Complain("memory is missing: calls are left out");
    const Client::FinishedFrames finished = client.GetFinished();
    if (finished[0] != counted.finished[0] && finished[1] != counted.finished[1]) {
        Complain("memory is missing once, and two finished frames are others");
    }
    if (client.GetAnswers() != counted.answers) {
        Complain("memory is missing: no call tells of it, and an answer is another");
    }
    if (story.name == "grab") return;  // how many it sends depends on its frames
    for (const CountedRequest& request : ListLeftOut(counted)) {
        if (IsUntold(story, camera, request)) continue;
        char text[120];
        std::snprintf(text, sizeof text,
                      "memory is missing: no call tells of it, and request 0x%X, register 0x%X, is "
                      "left out",
                      request.code, request.address);
        Complain(text);
    }
}

/// All queued frames come, one of them damaged at the most, and the changes among them are made.
bool HasStreamedOn(const Client::StreamOutcome& stream) {
    return stream.served == Client::FrameCount && stream.damaged <= 1 && stream.unchanged == 0 &&
           stream.changed >= Client::ChangesDue;
}

/// All queued frames come, and the changes among them are made, unless the failure may keep them.
void Runner::CheckStream(const Round* round, const CountedStory& counted) {
    if (story.name != "stream") return;
    const Client::StreamOutcome stream = client.GetStream();
    const bool isWhole = stream.served == Client::FrameCount && stream.damaged == 0;
    bool isGood = isWhole && stream.unchanged == 0 && stream.changed >= Client::ChangesDue;
    if (HasRefusedAllocation()) {
        isGood = HasStreamedWithoutMemory(counted);
    } else if (GetFailedCode() != 0 && !IsHarmless(*round)) {
        if (MayEndStream(*round) || IsToldByACall(counted)) return;
        if (round->series == RequestSeries::Stream) {
            isGood = HasStreamedOn(stream);  // what the buffer still holds may damage one
        }
        if (round->series == RequestSeries::Calls) {
            isGood = stream.unchanged != 0 ? isWhole || IsStreamStopped(*round)
                                           : isWhole && IsUntoldInStream(*round);
        }
    }
    if (isGood) return;
    Complain("of " + std::to_string(stream.queued) + " frames " + std::to_string(stream.served) +
             " come, " + std::to_string(stream.damaged) + " damaged; " +
             std::to_string(stream.changed) + " changes are made, " +
             std::to_string(stream.unchanged) + " have failed");
}

/// Missing memory costs an image at most, which says so, unless the stream may end.
bool Runner::HasStreamedWithoutMemory(const CountedStory& counted) const {
    return HasStreamedOn(client.GetStream()) || client.HasGivenUp() || IsToldOfStream(counted);
}

bool Runner::IsToldOfStream(const CountedStory& counted) const {
    return IsToldByACall(counted) || client.GetStream().unchanged != 0;
}

/// Whether images may stay away, from what has happened in the round so far.
bool Runner::MayGiveUp(const Round& round, const CountedStory& counted) const {
    if (IsHarmless(round)) return false;
    const bool isMemory = round.failure == Failure::NoMemory;
    const bool isOfCalls = isMemory || round.series == RequestSeries::Calls;
    if (story.name != "stream") return isOfCalls || MayEndStream(round);
    if (isMemory) return IsToldOfStream(counted) || !IsStreamStarted();
    if (MayEndStream(round) || IsToldByACall(counted)) return true;
    return isOfCalls && client.GetStream().unchanged != 0 && IsStreamStopped(round);
}

template <typename Work>
void Runner::RunBounded(const char* what, Work work) {
    const auto start = Clock::now();
    const std::uint64_t waitedBefore = GetBegunWaitsMs();
    work();
    const auto taken = std::chrono::duration_cast<milliseconds>(Clock::now() - start);
    const std::uint64_t waitedMs = GetBegunWaitsMs() - waitedBefore;
    if (taken > CallLimit) {
        Complain(std::string(what) + " took " + std::to_string(taken.count()) + " ms");
    }
    if (waitedMs > WaitedLimitMs) {
        Complain(std::string(what) + " waited up to " + std::to_string(waitedMs) + " ms");
    }
}

/// A close that failed leaves the camera open; the next one ends it.
void Runner::CloseForGood(const Round* round) {
    for (int attempt = 0; attempt < 2 && CountOpenDevices() != 0 && client.IsOpen(); ++attempt) {
        RunBounded("the close", [&] { client.Close(); });
    }
    if (CountOpenDevices() == 0 || !client.IsOpen()) return;
    // Kept: a camera that a listing has failed to read or to close stays open at the driver.
    const bool isListing = story.begins == Stage::Loaded;
    if (round != nullptr && isListing && !IsHarmless(*round)) return;
    // Kept: a device that has gone answers the freeing of its resources with an error, which ends
    // the close. The next listing or the release gives it up.
    if (round == nullptr || round->failure != Failure::DeviceGone) {
        Complain("the camera cannot be closed");
    }
}

/// A close that failed has ended what calls need.
void Runner::TakeEveryLock() {
    const std::size_t from = client.CountCalls();
    RunBounded("taking every lock", [&] { client.TakeEveryLock(); });
    if (CountOpenDevices() == 0 || story.ends != Stage::Opened) return;
    for (std::size_t i = from; i < client.CountCalls(); ++i) {
        const Client::Call& call = client.GetCall(i);
        if (call.result != zerrBadHandle) continue;
        Complain(std::string("taking every lock: ") + call.name + " does not get there");
    }
}

/// The camera that has met a failure goes on without being listed or opened anew.
void Runner::UseStill(const Round* round) {
    if (!client.IsOpen() || story.ends != Stage::Opened) return;
    if (round != nullptr && !LeavesAWorkingCamera(*round, story)) return;
    const std::size_t from = client.CountCalls();
    Begin();
    // Kept: a stop may leave an image behind, a damaged one too; the next stream begins with it.
    client.Grab();
    client.Grab();
    if (!HasGoodCalls(from, "used further")) return;
    CheckImage("used further");
    if (HasStreamed(story) || story.begins == Stage::Loaded) StreamShortly("used further");
}

void Runner::UseAgain(const char* where) {
    const std::size_t from = client.CountCalls();
    client.List();
    if (!client.HasCamera()) return Complain(std::string(where) + ": no camera is listed");
    client.Open();
    const std::uint32_t reclaimed = CountReclaimed();
    Begin();
    client.Grab();
    if (HasGoodCalls(from, where)) {
        CheckImage(where);
        if (HasStreamed(story)) StreamShortly(where);
    }
    const std::size_t last = client.CountCalls();
    client.Close();
    if (!HasGoodCalls(last, where)) return;
    CheckReclaimed(reclaimed, where);
    if (CountOpenDevices() != 0) Complain(std::string(where) + ": a device is left open");
}

/// The scene stands still: every good image is the same.
void Runner::CheckImage(const char* where) {
    const Zentara_Frame& grabbed = client.GetGrabbed();
    if (grabbed.errorCode != zerrNone || grabbed.width == 0) {
        Complain(std::string(where) + ": the frame is bad, error " +
                 std::to_string(grabbed.errorCode));
        return;
    }
    if (image == 0) image = client.GetImage();
    if (image != client.GetImage()) Complain(std::string(where) + ": the image is another");
}

void Runner::StreamShortly(const char* where) {
    const std::size_t from = client.CountCalls();
    client.StreamShortly();
    if (!HasGoodCalls(from, where)) return;
    const Client::StreamOutcome stream = client.GetStream();
    // Kept: the stop of the grab may have left a damaged one behind.
    if (stream.served == stream.queued && stream.damaged <= 1) return;
    Complain(std::string(where) + ": of " + std::to_string(stream.queued) + " frames " +
             std::to_string(stream.served) + " come, " + std::to_string(stream.damaged) +
             " damaged");
}

/// The driver takes back what a closed handle has reserved, which hides that nobody has freed it.
void Runner::CheckReclaimed(std::uint32_t before, const char* where) {
    const std::uint32_t count = CountReclaimed() - before;
    if (count == 0) return;
    Complain(std::string(where) + ": a device is closed with " + std::to_string(count) +
             " reservations");
}

void Runner::CheckRelease() {
    RunBounded("the release", [&] { client.Release(); });
    if (CountOpenDevices() != 0) Complain("the release leaves a device open");
    ZentaraSimulationState held{};
    if (!HasEnded(&held)) return Complain("the release does not end the bus");
    const std::uint32_t all = held.openHandles + held.reservedBandwidths + held.reservedChannels +
                              held.reservedResources + held.pendedRequests + held.attachedBuffers;
    if (all != 0) {
        Complain("at the release the driver still holds " + std::to_string(held.openHandles) +
                 " handles, " + std::to_string(held.reservedChannels) + " channels, " +
                 std::to_string(held.pendedRequests) + " requests");
    }
}

/// A load that failed is none; the next one is good.
void Runner::LoadStill() {
    if (story.begins != Stage::Unloaded) return;
    const std::size_t last = client.CountCalls() - 1;
    if (client.GetCall(last).result == zerrNone) return;
    client.Load();
    (void)HasGoodCalls(last + 1, "loaded once more");
}

void Runner::CheckWhatIsLeft(const Round* round) {
    LoadStill();
    if (story.ends != Stage::Unloaded) {
        TakeEveryLock();
        if (CountOpenDevices() != 0) UseStill(round);
        CloseForGood(round);
        (void)ZentaraSimulation_Plug(0);  // unless it has gone it does not change
        client.Reset();
        UseAgain("used again on the same bus");
    }
    CheckRelease();
    client.Reset();
    ForgetEnd();
    client.Load();
    UseAgain("used again after a release");
    CheckRelease();
    if (round == nullptr || !LeavesReservations(*round, story)) {
        CheckReclaimed(reclaimedAtBegin, "in all");
    }
}

std::size_t FindStory(std::string_view name) {
    const auto* const found = std::find_if(std::begin(Stories), std::end(Stories),
                                           [&](const Story& story) { return story.name == name; });
    return static_cast<std::size_t>(found - std::begin(Stories));
}

/// A first round with a late request. Returns what it found to be wrong.
std::vector<std::string> RunFirst() {
    // The first thread of a process brings one of the thread sanitizer's own with it.
    std::thread([] {}).join();
    const Belongings before;
    Runner runner(0, FindStory("grab"));
    (void)runner.Prepare();
    BeginRequests(RequestFailure::CompletesLate, RequestSeries::Calls, 1);
    runner.Run();
    EndRequests();
    runner.CheckWhatIsLeft(nullptr);
    (void)WaitUntil([&] { return Belongings{}.threads <= before.threads + HelperThreads; });
    const Belongings& own = GetOwnBelongings();
    if (own.threads > before.threads + HelperThreads || own.files > before.files) {
        runner.problems.push_back("the first round leaves " +
                                  std::to_string(own.threads - before.threads) + " threads and " +
                                  std::to_string(own.files) + " files");
    }
    return runner.problems;
}

/// The suite's own threads begin before what the process holds is looked at.
const std::vector<std::string>& StartHelpers() {
    static const std::vector<std::string> problems = RunFirst();
    return problems;
}

constexpr RequestFailure ConvertFailure(Failure failure) {
    constexpr RequestFailure Table[] = {RequestFailure::Fails,
                                        RequestFailure::AnsweredAtOnce,
                                        RequestFailure::CompletesInError,
                                        RequestFailure::CompletesLate,
                                        RequestFailure::DeviceGone,
                                        RequestFailure::None};
    return Table[static_cast<std::size_t>(failure)];
}

RoundOutcome RunStory(const Round& round, const CountedStory& counted) {
    Runner runner(round.camera, round.story, counted.image);
    RoundOutcome outcome;
    if (runner.Prepare()) {
        const bool isRequest = round.failure != Failure::NoMemory;
        // Made before allocations are counted.
        std::function<bool()> mayGiveUp = [&] { return runner.MayGiveUp(round, counted); };
        BeginRequests(ConvertFailure(round.failure), round.series, isRequest ? round.number : 0);
        BeginAllocations(isRequest ? NoAllocation : static_cast<std::int64_t>(round.number));
        runner.Run(std::move(mayGiveUp));
        outcome.hasFailed = EndAllocations() || GetFailedCode() != 0;
        EndRequests();
        outcome.code = GetFailedCode();
        runner.CheckResults(IsHarmless(round) ? &counted : nullptr);
        runner.CheckStream(&round, counted);
        if (outcome.hasFailed) runner.CheckIsTold(round, counted);
        const bool missesMemory = outcome.hasFailed && !isRequest;
        if (missesMemory && TellsOfMissingMemory(Stories[round.story])) {
            runner.CheckIsToldOrDone(counted);
        }
    }
    runner.CheckWhatIsLeft(&round);
    outcome.problems = runner.problems;
    return outcome;
}

}  // namespace

std::string Round::GetText() const {
    char text[200];
    const bool isRequest = failure != Failure::NoMemory;
    (void)std::snprintf(text, sizeof text, "%s:%s:%s:%s%llu (code 0x%X)",
                        SweepCameras[camera].name.data(), Stories[story].name.data(),
                        FailureNames[static_cast<std::size_t>(failure)].data(),
                        SeriesMarks[isRequest ? static_cast<std::size_t>(series) : 0].data(),
                        static_cast<unsigned long long>(number), code);
    return text;
}

CountedStory CountStory(std::size_t camera, std::size_t story) {
    const std::vector<std::string>& problems = StartHelpers();
    const Watchdog watchdog("counting " + Round{camera, story}.GetText());
    Runner runner(camera, story);
    CountedStory counted;
    if (runner.Prepare()) {
        BeginRequests(RequestFailure::None, RequestSeries::Calls, 0);
        BeginAllocations(NoAllocation);
        runner.Run();
        counted.allocations = NoAllocation - CountAllocationsLeft();
        (void)EndAllocations();
        EndRequests();
        for (const RequestSeries series : AllSeries) {
            counted.requests[static_cast<std::size_t>(series)] = GetCounted(series);
        }
        counted.results = runner.GetResults();
        counted.answers = runner.GetAnswers();
        counted.finished = runner.GetFinished();
        runner.CheckStream(nullptr, counted);
    }
    runner.CheckResults(nullptr);
    runner.CheckWhatIsLeft(nullptr);
    counted.image = runner.GetImage();
    counted.problems = runner.problems;
    counted.problems.insert(counted.problems.end(), problems.begin(), problems.end());
    CheckBelongings(GetOwnBelongings(), &counted.problems);
    return counted;
}

RoundOutcome RunFirstRound(const Round& round) {
    const Watchdog watchdog("the first, " + round.GetText());
    std::thread([] {}).join();  // with it the thread sanitizer's own thread
    Belongings own;
    own.threads += HelperThreads;
    RoundOutcome outcome = RunStory(round, {});
    CheckBelongings(own, &outcome.problems);
    return outcome;
}

RoundOutcome RunRound(const Round& round, const CountedStory& counted) {
    (void)StartHelpers();
    const Watchdog watchdog(round.GetText());
    const std::size_t liveBefore = CountLiveAllocations();
    RoundOutcome outcome = RunStory(round, counted);
    CheckBelongings(GetOwnBelongings(), &outcome.problems);
    const std::size_t live = CountLiveAllocations();
    if (outcome.problems.empty() && live > liveBefore) outcome.leaked = live - liveBefore;
    return outcome;
}

}  // namespace ZV::Test
