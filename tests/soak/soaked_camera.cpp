#include "soak/soaked_camera.h"

#include <algorithm>
#include <chrono>
#include <cstdio>

#include "camera/morvane_fw_camera.h"
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
constexpr auto ListLimit = 10s;
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
                           std::mutex& allMutex)
    : position(cameraPosition), uniqueId(cameraId), listMutex(allMutex), random(cameraPosition) {
    for (Slot& slot : slots) slot.camera = this;
}

SoakSums SoakedCamera::GetSums() const {
    const std::lock_guard hold(sumsMutex);
    return sums;
}

void SoakedCamera::Expect(ZentaraResult result) {
    if (result == zerrNone) return;
    std::fprintf(stderr, "camera %u: a call failed with %u\n", position, result);
    const std::lock_guard hold(sumsMutex);
    ++sums.failures;
}

void SoakedCamera::Run(const std::atomic<bool>& isOver) {
    if (!Open()) return;
    QueueAll();
    BeginStream();
    while (!isOver) {
        if (!TakeTurn()) return;
    }
    EndStream(false);
    Expect(Zentara_Abort(handle));  // no callback any more: what has come is counted
    Close();
}

/// False when the camera is lost to the soak.
bool SoakedCamera::TakeTurn() {
    Slot* slot = Take();
    if (slot == nullptr) {
        std::fprintf(stderr, "camera %u: no frame came\n", position);
        Expect(zerrUnplugged);
        return Reopen();
    }
    Serve(*slot);
    ++served;
    if (served % FramesPerChange == 0) QueueChange();
    if (served % FramesPerUnplug == 0) {
        isPlugged = false;
        (void)ZentaraSimulation_Unplug(position);
        {
            const std::lock_guard hold(sumsMutex);
            ++sums.unplugs;
        }
        return Reopen();
    }
    if (served % FramesPerReopen == 0) {
        {
            const std::lock_guard hold(sumsMutex);
            ++sums.reopens;
        }
        return Reopen();
    }
    if (served % FramesPerRestart == 0) {
        EndStream(false);
        BeginStream();
        const std::lock_guard hold(sumsMutex);
        ++sums.restarts;
    }
    return true;
}

SoakedCamera::Slot* SoakedCamera::Take() {
    std::unique_lock lock(doneMutex);
    if (!arrived.wait_for(lock, FrameLimit, [this] { return !done.empty(); })) return nullptr;
    Slot* slot = done.front();
    done.pop_front();
    return slot;
}

void SoakedCamera::Serve(Slot& slot) {
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

void SoakedCamera::Receive(std::uint64_t userPrivate, std::uint32_t, std::uint32_t, std::uint32_t) {
    auto& slot = *reinterpret_cast<Slot*>(static_cast<std::uintptr_t>(userPrivate));
    ++slot.camera->received;
    const std::lock_guard hold(slot.camera->doneMutex);
    slot.camera->done.push_back(&slot);
    slot.camera->arrived.notify_one();
}

/// The sending of a change fails when the camera is gone.
void SoakedCamera::ReceiveChange(std::uint64_t userPrivate, std::uint32_t, std::uint32_t errorCode,
                                 std::uint32_t) {
    const auto& change = *reinterpret_cast<Change*>(static_cast<std::uintptr_t>(userPrivate));
    SoakedCamera& camera = *change.camera;
    if (change.opening != camera.opening) return;
    ++camera.changesMade;
    if (camera.isPlugged) camera.Expect(errorCode);
}

void SoakedCamera::Queue(Slot& slot) {
    Expect(Zentara_QueueFrame(handle, &slot.frame, Receive, zcbFrameDone,
                              reinterpret_cast<std::uintptr_t>(&slot), 0));
}

void SoakedCamera::QueueAll() {
    for (Slot& slot : slots) Queue(slot);
}

void SoakedCamera::QueueChange() {
    Change& change = changes.emplace_back(Change{this, opening, settings});
    Test::SetWide(change.settings, zprm64Exposure, 100000 * (1 + random() % 20));
    Expect(Zentara_QueueSettings(handle, &change.settings, ReceiveChange, zcbFrameDone,
                                 reinterpret_cast<std::uintptr_t>(&change), 0));
}

bool SoakedCamera::Open() {
    const std::lock_guard listing(listMutex);
    const auto end = std::chrono::steady_clock::now() + ListLimit;
    while (std::chrono::steady_clock::now() < end) {
        std::array<Zentara_CamListItem, ListLength> items{};
        std::uint32_t length = ListLength;
        if (Zentara_ListCameras(items.data(), &length) != zerrNone) continue;
        auto* const last = items.data() + std::min(length, ListLength);
        auto* const found = std::find_if(
            items.data(), last, [this](const auto& item) { return item.uniqueId == uniqueId; });
        if (found == last) continue;
        const ZentaraResult opened = Zentara_OpenCamera(found->cameraId, &handle);
        if (opened != zerrNone) {
            handle = {};
            Expect(opened);
            return false;
        }
        Expect(Zentara_ReadSettingsFromCam(handle, &settings));
        const auto bytes = reinterpret_cast<ZCamera*>(handle)->GetImageSize();
        for (Slot& slot : slots) {
            slot.pixels.assign(bytes, 0);
            slot.frame = {};
            slot.frame.pBuffer = slot.pixels.data();
            slot.frame.bufferSize = bytes;
        }
        return true;
    }
    std::fprintf(stderr, "camera %u: it is not listed\n", position);
    Expect(zerrBadCameraId);
    return false;
}

void SoakedCamera::Close() {
    CountEngine();
    CountChanges();
    const std::lock_guard listing(listMutex);
    Expect(Zentara_CloseCamera(handle));
    handle = {};
}

/// Every frame that began is delivered or counted, or waits in the queue, and the client was called
/// for each that found a taker. A frame that is at work has a moment to come to its count.
void SoakedCamera::CountEngine() {
    ZCamera& camera = *reinterpret_cast<ZCamera*>(handle);
    const StreamCounters& counters = camera.GetStreamCounters();
    const bool isAccounted = Test::WaitUntil([&] {
        return counters.begun.Get() == SumFates(counters) + WaitingFrames::Count(camera) &&
               counters.delivered.GetSum() == counters.withoutTaker.GetSum() + received;
    });
    const std::lock_guard hold(sumsMutex);
    sums.begun += counters.begun.Get();
    sums.dropped += counters.dropped.Get();
    sums.refused += counters.refused.Get();
    sums.bad += counters.bad.Get();
    sums.cleared += counters.cleared.Get();
    sums.withoutTaker += counters.withoutTaker.GetSum();
    sums.waiting += WaitingFrames::Count(camera);
    if (!isAccounted) ++sums.unaccounted;
}

/// Behind an abort: what has not been told by now never will be.
void SoakedCamera::CountChanges() {
    const std::lock_guard hold(sumsMutex);
    sums.changes += changesMade;
    sums.changesDropped += changes.size() - changesMade;
}

void SoakedCamera::BeginStream() {
    stream = ZentaraProgram::StreamSums(1);
    Expect(Zentara_SetStreaming(handle, 1));
}

/// The stream of a camera that is gone cannot be stopped in good order.
void SoakedCamera::EndStream(bool isExpectedToFail) {
    const ZentaraResult stopped = Zentara_SetStreaming(handle, 0);
    if (!isExpectedToFail) Expect(stopped);
    stream.Settle();
    CountStream();
}

/// Also of a camera that was unplugged: it is plugged in again before it is listed.
bool SoakedCamera::Reopen() {
    EndStream(true);
    (void)Zentara_Abort(handle);  // what is queued is ours again
    Close();
    {
        const std::lock_guard hold(doneMutex);
        done.clear();
    }
    ++opening;
    formerChanges.swap(changes);
    changes.clear();
    changesMade = received = 0;
    (void)ZentaraSimulation_Plug(position);
    isPlugged = true;
    if (!Open()) return false;
    QueueAll();
    BeginStream();
    return true;
}

}  // namespace ZV::Soak
