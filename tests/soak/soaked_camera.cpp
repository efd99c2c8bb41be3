#include "soak/soaked_camera.h"

#include <algorithm>
#include <chrono>
#include <cstdio>

#include "camera/morvane_fw_camera.h"
#include "hal/stream_format.h"
#include "simulation/zentara_simulation.h"
#include "support/settings_words.h"
#include "support/wait_until.h"

namespace ZV::Soak {
namespace {

using namespace std::chrono_literals;

constexpr std::uint32_t ListLength = 64;
constexpr std::uint64_t FramesPerChange = 40;
constexpr std::uint64_t FramesPerRestart = 400;
constexpr std::uint64_t FramesPerReopen = 1500;
constexpr std::uint64_t FramesPerUnplug = 4000;
constexpr auto FrameLimit = 30s;
/// For a frame once a request of the camera has failed: its loop may have left, or its registers
/// may not be what the library takes them for.
constexpr auto FrameLimitAfterFailure = 2s;
constexpr auto LookInterval = 100ms;
constexpr auto ListLimit = 10s;
constexpr int ClosesMax = 3;
constexpr std::uint32_t AllCameras = 0xFFFFFFFF;
/// Of the frames of the soak.
constexpr std::uint64_t PacketsPerFrame = 33;
/// Twice what fits the ring of requests: frames are cut short, and requests are filled twice.
constexpr std::uint64_t FramesPerTurn =
    2 * StreamRequestCount * PacketsPerRequest / PacketsPerFrame;

ZentaraSimulationState GetState(std::uint32_t camera) {
    ZentaraSimulationState state{};
    (void)ZentaraSimulation_GetState(camera, &state);  // zeros without a bus
    return state;
}

std::uint32_t CountFailed(std::uint32_t camera) {
    return GetState(camera).requestsFailed;
}

PacketTroubles GetTroubles(const ZentaraSimulationState& state) {
    return {state.framesBegun, state.buffersFailed, state.packetsCorrupted};
}

/// Cameras that are unplugged or plugged in.
std::atomic<std::uint64_t> switchesBegun{0}, switchesDone{0};

void Switch(std::uint32_t (*unplugOrPlug)(std::uint32_t camera), std::uint32_t camera) {
    ++switchesBegun;
    (void)unplugOrPlug(camera);
    ++switchesDone;
}

/// Why a listing may fail, from its begin on: a request of any camera failed, or one came or went.
class ListingReasons {
  public:
    bool AreThere() const {
        return CountFailed(AllCameras) != failedBefore || switchesBegun != switchesBefore;
    }

  private:
    const std::uint64_t switchesBefore = switchesDone;
    const std::uint32_t failedBefore = CountFailed(AllCameras);
};

/// Frames that wait for the run loop.
struct WaitingFrames : MorvaneFWCamera {
    static std::uint64_t Count(const ZCamera& camera) {
        return (static_cast<const MorvaneFWCamera&>(camera).*&WaitingFrames::streaming)
            .frameQueue.GetCount();
    }
};

std::uint64_t SumFates(const StreamCounters& counters) {
    return counters.delivered.GetSum() + counters.heldBack.Get() + counters.dropped.Get() +
           counters.bad.Get() + counters.cleared.Get();
}

}  // namespace

SoakedCamera::SoakedCamera(std::uint32_t cameraPosition, std::uint32_t cameraId,
                           std::uint32_t streamingVersion, std::mutex& allMutex)
    : position(cameraPosition),
      uniqueId(cameraId),
      listMutex(allMutex),
      random(cameraPosition),
      staleNumbers(streamingVersion == 0, FramesPerTurn) {
    for (Slot& slot : slots) slot.camera = this;
}

SoakSums SoakedCamera::GetSums() const {
    const std::lock_guard hold(sumsMutex);
    return sums;
}

void SoakedCamera::Count(std::uint64_t SoakSums::*sum) {
    const std::lock_guard hold(sumsMutex);
    ++(sums.*sum);
}

FailedRequests SoakedCamera::CountFailedRequests() const {
    const ZentaraSimulationState state = GetState(position);
    return {state.requestsFailed, state.registerRequestsFailed, state.buffersRefused};
}

/// A call may fail, with a code of the table, when there is a reason. True for none that has
/// failed.
bool SoakedCamera::Tell(const char* call, ZentaraResult result, bool isExcused) {
    if (result == zerrNone) return true;
    if (isExcused && result < SoakSums::CodeCount) {
        const std::lock_guard hold(sumsMutex);
        ++sums.failedWith[result];
        return false;
    }
    std::fprintf(stderr, "camera %u: %s failed with %u\n", position, call, result);
    Count(&SoakSums::failures);
    return false;
}

/// The reason is a request of the camera that has failed since there were `failedBefore`.
bool SoakedCamera::Judge(const char* call, ZentaraResult result,
                         const FailedRequests& failedBefore) {
    return Tell(call, result, CountFailedRequests().all != failedBefore.all);
}

/// Of a stream that was to end. A change stops and starts it as well, tells nothing of what fails
/// in that start, and leaves it to the end that comes behind.
bool SoakedCamera::JudgeEnd(const char* call, ZentaraResult result) {
    return Judge(call, result, failedAtStream);
}

/// For a call that sends no request, or none that may fail.
void SoakedCamera::Expect(const char* call, ZentaraResult result) {
    (void)Tell(call, result, false);
}

void SoakedCamera::Run(const std::atomic<bool>& isOver) {
    if (!Start()) return;
    while (!isOver) {
        if (!TakeTurn()) return;
    }
    (void)EndStream();
    Expect("Zentara_Abort",
           Zentara_Abort(handle));  // no callback any more: what has come is counted
    Close();
}

/// False when the camera is lost to the soak.
bool SoakedCamera::TakeTurn() {
    Slot* slot = Take();
    if (slot == nullptr) return GoOnWithoutFrames();
    Serve(*slot);
    ++served;
    if (served % FramesPerChange == 0) QueueChange();
    if (served % FramesPerUnplug == 0) return ReopenUnplugged();
    if (served % FramesPerReopen == 0) {
        Count(&SoakSums::reopens);
        return Reopen();
    }
    return served % FramesPerRestart != 0 || Restart();
}

bool SoakedCamera::GoOnWithoutFrames() {
    if (HasReasonToStall()) {
        Count(&SoakSums::stalls);
        return Reopen();
    }
    std::fprintf(stderr, "camera %u: no frame came\n", position);
    Count(&SoakSums::failures);
    return Reopen();
}

bool SoakedCamera::ReopenUnplugged() {
    isPlugged = false;
    Switch(ZentaraSimulation_Unplug, position);
    Count(&SoakSums::unplugs);
    return Reopen();
}

/// A stream that could not be stopped or started goes on with a new opening.
bool SoakedCamera::Restart() {
    if (!EndStream()) return Reopen();
    SettleStream();
    if (!BeginStream()) return Reopen();
    Count(&SoakSums::restarts);
    return true;
}

/// A buffer that cannot be attached ends the loop. A change of which a register could not be
/// written may leave the camera at another parameter set number than the library: then all its
/// frames are refused.
bool SoakedCamera::HasReasonToStall() const {
    const FailedRequests failed = CountFailedRequests();
    if (failed.refused != failedAtStream.refused) return true;
    return failed.registers != failedAtOpening.registers && HasOtherPsn();
}

bool SoakedCamera::HasOtherPsn() const {
    constexpr std::uint32_t PsnMask = 0xFF;
    ZCamera& camera = *reinterpret_cast<ZCamera*>(handle);
    return ((camera.GetPSN() ^ GetState(position).psn) & PsnMask) != 0;
}

bool SoakedCamera::IsStalled(std::chrono::steady_clock::time_point begin) const {
    return std::chrono::steady_clock::now() - begin >
           (HasReasonToStall() ? FrameLimitAfterFailure : FrameLimit);
}

SoakedCamera::Slot* SoakedCamera::Take() {
    std::unique_lock lock(doneMutex);
    const auto begin = std::chrono::steady_clock::now();
    while (!arrived.wait_for(lock, LookInterval, [this] { return !done.empty(); })) {
        if (IsStalled(begin)) return nullptr;
    }
    Slot* slot = done.front();
    done.pop_front();
    return slot;
}

void SoakedCamera::Serve(Slot& slot) {
    ++taken;
    stream.Count(slot.frame);
    Queue(slot);
    if (stream.frames % FramesPerChange == 0) CountStream();
}

/// Takes what the stream has counted over into the sums; the stream goes on counting from there.
void SoakedCamera::CountStream() {
    const std::lock_guard hold(sumsMutex);
    sums.frames += stream.frames;
    sums.bytes += stream.bytes;
    sums.gaps += stream.gaps;
    sums.missing += stream.drops;
    sums.damaged += stream.damaged;
    sums.repeats += stream.repeats;
    sums.misnumbered += stream.misnumbered;
    stream.ForgetCounts();
}

void SoakedCamera::SettleStream() {
    stream.Settle();
    CountStream();
}

/// What has come and was not served by the time of a close. False when the client was called with
/// more frames than it has taken.
bool SoakedCamera::CountRest() {
    {
        const std::lock_guard hold(doneMutex);
        for (const Slot* slot : done) stream.Count(slot->frame);
        taken += done.size();
        done.clear();
    }
    SettleStream();
    return taken == received;
}

void SoakedCamera::Receive(std::uint64_t userPrivate, std::uint32_t, std::uint32_t, std::uint32_t) {
    auto& slot = *reinterpret_cast<Slot*>(static_cast<std::uintptr_t>(userPrivate));
    const std::lock_guard hold(slot.camera->doneMutex);
    slot.camera->JudgeNumber(slot.frame);
    slot.camera->done.push_back(&slot);
    ++slot.camera->received;
    slot.camera->arrived.notify_one();
}

void SoakedCamera::JudgeNumber(const Zentara_Frame& frame) {
    const ZentaraSimulationState state = GetState(position);
    const bool isDamaged = frame.errorCode != zerrNone;
    const std::uint64_t last = numbers.GetLast();
    staleNumbers.Add(GetTroubles(state), last);
    const auto verdict = numbers.Judge(frame.frameNumber, isDamaged, state.framesBegun);
    if (verdict != FrameNumbers::Verdict::Wrong) return;
    if (staleNumbers.MayBe(frame.frameNumber, isDamaged, last)) {
        return Count(&SoakSums::staleNumbers);
    }
    std::fprintf(
        stderr, "camera %u: frame %u with code %u came behind %llu, when there were %llu\n",
        position, frame.frameNumber, frame.errorCode, static_cast<unsigned long long>(last),
        static_cast<unsigned long long>(state.framesBegun));
    Count(&SoakSums::wrongNumbers);
}

/// The sending of a change fails when the camera is gone, or a read or write of its registers has
/// since it was queued.
void SoakedCamera::ReceiveChange(std::uint64_t userPrivate, std::uint32_t, std::uint32_t errorCode,
                                 std::uint32_t) {
    auto& change = *reinterpret_cast<Change*>(static_cast<std::uintptr_t>(userPrivate));
    SoakedCamera& camera = *change.camera;
    if (change.opening != camera.opening) return;
    ++camera.changesMade;
    change.isMade = true;
    if (!camera.isPlugged) return;
    (void)camera.Tell("a change", errorCode,
                      camera.CountFailedRequests().registers != change.failedBefore);
}

void SoakedCamera::Queue(Slot& slot) {
    Expect("Zentara_QueueFrame", Zentara_QueueFrame(handle, &slot.frame, Receive, zcbFrameDone,
                                                    reinterpret_cast<std::uintptr_t>(&slot), 0));
}

void SoakedCamera::QueueAll() {
    for (Slot& slot : slots) Queue(slot);
}

/// When no frame waits, the change is made at once, and its callback has judged the result.
void SoakedCamera::QueueChange() {
    Change& change = changes.emplace_back();
    change.camera = this;
    change.opening = opening;
    change.failedBefore = CountFailedRequests().registers;
    change.settings = settings;
    Test::SetWide(change.settings, zprm64Exposure, 100000 * (1 + random() % 20));
    const ZentaraResult queued =
        Zentara_QueueSettings(handle, &change.settings, ReceiveChange, zcbFrameDone,
                              reinterpret_cast<std::uintptr_t>(&change), 0);
    if (!change.isMade) Expect("Zentara_QueueSettings", queued);
}

/// False when the camera does not come back in time. What a request has failed is tried again.
bool SoakedCamera::Open() {
    const std::lock_guard listing(listMutex);
    const auto end = std::chrono::steady_clock::now() + ListLimit;
    while (std::chrono::steady_clock::now() < end) {
        const ListingReasons reasons;
        failedAtOpening = CountFailedRequests();
        std::array<Zentara_CamListItem, ListLength> items{};
        std::uint32_t length = ListLength;
        const ZentaraResult listed = Zentara_ListCameras(items.data(), &length);
        if (!Tell("Zentara_ListCameras", listed, reasons.AreThere())) continue;
        auto* const last = items.data() + std::min(length, ListLength);
        auto* const found = std::find_if(
            items.data(), last, [this](const auto& item) { return item.uniqueId == uniqueId; });
        if (found != last && OpenListed(found->cameraId, failedAtOpening)) return true;
    }
    std::fprintf(stderr, "camera %u: it is not listed\n", position);
    Count(&SoakSums::failures);
    return false;
}

bool SoakedCamera::OpenListed(std::uint32_t cameraId, const FailedRequests& failedBefore) {
    if (!Judge("Zentara_OpenCamera", Zentara_OpenCamera(cameraId, &handle), failedBefore)) {
        handle = {};
        return false;
    }
    Prepare();
    hasTrouble = false;
    const std::lock_guard hold(doneMutex);
    const ZentaraSimulationState state = GetState(position);
    numbers.Begin(state.framesBegun);
    staleNumbers.Begin(GetTroubles(state));
    return true;
}

void SoakedCamera::Prepare() {
    Expect("Zentara_ReadSettingsFromCam", Zentara_ReadSettingsFromCam(handle, &settings));
    const auto bytes = reinterpret_cast<ZCamera*>(handle)->GetImageSize();
    for (Slot& slot : slots) {
        slot.pixels.assign(bytes, 0);
        slot.frame = {};
        slot.frame.pBuffer = slot.pixels.data();
        slot.frame.bufferSize = bytes;
    }
}

/// A close that fails leaves the camera open, and is made once more.
void SoakedCamera::Close() {
    const bool isAccounted = CountEngine();
    const bool hasTakenAll = CountRest();
    if (!isAccounted || !hasTakenAll) Count(&SoakSums::unaccounted);
    CountChanges();
    const std::lock_guard listing(listMutex);
    for (int closes = 0; closes < ClosesMax; ++closes) {
        if (JudgeEnd("Zentara_CloseCamera", Zentara_CloseCamera(handle))) break;
    }
    handle = {};
}

/// Every frame that began is delivered or counted, or waits in the queue, and the client was called
/// for each that found a taker; else false. A frame that is at work has a moment to come to its
/// count.
bool SoakedCamera::CountEngine() {
    ZCamera& camera = *reinterpret_cast<ZCamera*>(handle);
    const StreamCounters& counters = camera.GetStreamCounters();
    const bool isAccounted = Test::WaitUntil([&] {
        return counters.begun.Get() == SumFates(counters) + WaitingFrames::Count(camera) &&
               counters.delivered.GetSum() == counters.withoutTaker.GetSum() + received;
    });
    const std::uint32_t failed = CountFailedRequests().all;
    const std::lock_guard hold(sumsMutex);
    sums.requestsFailed += failed - failedCounted;
    failedCounted = failed;
    sums.begun += counters.begun.Get();
    sums.delivered += counters.delivered.GetSum();
    sums.heldBack += counters.heldBack.Get();
    sums.dropped += counters.dropped.Get();
    sums.refused += counters.refused.Get();
    sums.bad += counters.bad.Get();
    sums.cleared += counters.cleared.Get();
    sums.withoutTaker += counters.withoutTaker.GetSum();
    sums.waiting += WaitingFrames::Count(camera);
    return isAccounted;
}

/// Behind an abort: what has not been told by now never will be.
void SoakedCamera::CountChanges() {
    const std::lock_guard hold(sumsMutex);
    sums.changes += changesMade;
    sums.changesDropped += changes.size() - changesMade;
}

bool SoakedCamera::BeginStream() {
    stream = ZentaraProgram::StreamSums(1);
    if (!hasTrouble) failedAtStream = CountFailedRequests();
    const ZentaraResult begun = Zentara_SetStreaming(handle, 1);
    if (begun != zerrNone) hasTrouble = true;
    return Judge("Zentara_SetStreaming", begun, failedAtStream);
}

/// The stream of a camera that is gone cannot be stopped in good order.
bool SoakedCamera::EndStream() {
    const ZentaraResult stopped = Zentara_SetStreaming(handle, 0);
    if (stopped != zerrNone) hasTrouble = true;
    return !isPlugged || JudgeEnd("the stop", stopped);
}

/// False when the camera is lost to the soak.
bool SoakedCamera::Start() {
    if (!Open()) return false;
    QueueAll();
    return BeginStream() || Reopen();
}

/// Until its stream begins, also of a camera that was unplugged: it is plugged in again before it
/// is listed.
bool SoakedCamera::Reopen() {
    do {
        (void)EndStream();
        (void)Zentara_Abort(handle);  // what is queued is ours again
        Close();
        ++opening;
        formerChanges.swap(changes);
        changes.clear();
        changesMade = received = 0;
        taken = 0;
        Switch(ZentaraSimulation_Plug, position);
        isPlugged = true;
        if (!Open()) return false;
        QueueAll();
    } while (!BeginStream());
    return true;
}

}  // namespace ZV::Soak
