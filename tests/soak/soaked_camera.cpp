#include "soak/soaked_camera.h"

#include <algorithm>
#include <chrono>
#include <cstdio>

#include "camera/camera.h"
#include "simulation/zentara_simulation.h"
#include "support/settings_words.h"

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
/// One frame of two that wait stays in the queue when the stream ends, for each stream.
constexpr std::uint64_t LeftInQueueMax = 2;

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
    while (!isOver) TakeTurn();
    EndStream(false);
    Close();
}

void SoakedCamera::TakeTurn() {
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
        (void)ZentaraSimulation_Unplug(position);
        Reopen();
        const std::lock_guard hold(sumsMutex);
        ++sums.unplugs;
    } else if (served % FramesPerReopen == 0) {
        Reopen();
        const std::lock_guard hold(sumsMutex);
        ++sums.reopens;
    } else if (served % FramesPerRestart == 0) {
        EndStream(false);
        BeginStream();
        const std::lock_guard hold(sumsMutex);
        ++sums.restarts;
    }
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
    stream.ForgetCounts();
}

void SoakedCamera::Receive(std::uint64_t userPrivate, std::uint32_t, std::uint32_t, std::uint32_t) {
    auto& slot = *reinterpret_cast<Slot*>(static_cast<std::uintptr_t>(userPrivate));
    const std::lock_guard hold(slot.camera->doneMutex);
    slot.camera->done.push_back(&slot);
    slot.camera->arrived.notify_one();
}

void SoakedCamera::ReceiveChange(std::uint64_t userPrivate, std::uint32_t, std::uint32_t,
                                 std::uint32_t) {
    reinterpret_cast<SoakedCamera*>(static_cast<std::uintptr_t>(userPrivate))->isChangeQueued =
        false;
}

void SoakedCamera::Queue(Slot& slot) {
    Expect(Zentara_QueueFrame(handle, &slot.frame, Receive, zcbFrameDone,
                              reinterpret_cast<std::uintptr_t>(&slot), 0));
}

void SoakedCamera::QueueAll() {
    for (Slot& slot : slots) Queue(slot);
}

/// A change is one frame's neighbour in the queue; a bus reset may make it fail.
void SoakedCamera::QueueChange() {
    if (isChangeQueued.exchange(true)) return;
    Test::SetWide(change, zprm64Exposure, 100000 * (1 + random() % 20));
    Expect(Zentara_QueueSettings(handle, &change, ReceiveChange, zcbFrameDone,
                                 reinterpret_cast<std::uintptr_t>(this), 0));
    const std::lock_guard hold(sumsMutex);
    ++sums.changes;
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
        Expect(Zentara_OpenCamera(found->cameraId, &handle));
        Expect(Zentara_ReadSettingsFromCam(handle, &change));
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
    CountStream();
    CountEngine();
    const std::lock_guard listing(listMutex);
    Expect(Zentara_CloseCamera(handle));
}

/// Every frame that began is delivered or counted, or waits in the queue.
void SoakedCamera::CountEngine() {
    const StreamCounters& counters = reinterpret_cast<ZCamera*>(handle)->GetStreamCounters();
    const std::uint64_t fates = counters.delivered.GetSum() + counters.heldBack.Get() +
                                counters.dropped.Get() + counters.bad.Get() +
                                counters.cleared.Get();
    const std::uint64_t begun = counters.begun.Get();
    const std::lock_guard hold(sumsMutex);
    sums.begun += begun;
    sums.dropped += counters.dropped.Get();
    sums.refused += counters.refused.Get();
    sums.bad += counters.bad.Get();
    sums.cleared += counters.cleared.Get();
    sums.withoutTaker += counters.withoutTaker.GetSum();
    if (fates > begun || begun - fates > LeftInQueueMax) ++sums.unaccounted;
}

void SoakedCamera::BeginStream() {
    stream = ZentaraProgram::StreamSums(1);
    Expect(Zentara_SetStreaming(handle, 1));
}

/// The stream of a camera that is gone cannot be stopped in good order.
void SoakedCamera::EndStream(bool isExpectedToFail) {
    const ZentaraResult stopped = Zentara_SetStreaming(handle, 0);
    if (!isExpectedToFail) Expect(stopped);
    CountStream();
}

/// Also of a camera that was unplugged: it is plugged in again before it is listed.
void SoakedCamera::Reopen() {
    EndStream(true);
    (void)Zentara_Abort(handle);  // what is queued is ours again
    Close();
    {
        const std::lock_guard hold(doneMutex);
        done.clear();
    }
    isChangeQueued = false;
    (void)ZentaraSimulation_Plug(position);
    if (!Open()) return;
    QueueAll();
    BeginStream();
}

}  // namespace ZV::Soak
