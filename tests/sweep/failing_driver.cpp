#include "sweep/failing_driver.h"

#include <dlfcn.h>
#include <link.h>

#include <algorithm>
#include <array>
#include <atomic>
#include <chrono>
#include <condition_variable>
#include <cstddef>
#include <cstring>
#include <mutex>
#include <thread>

#include "hal/control_records.h"
#include "hal/platform/clock.h"
#include "hal/platform/kernel_driver.h"
#include "hal/platform/last_error.h"
#include "memory/failing_allocator.h"

// Threads: those of the library and of the simulation, and `lateThread`, which ends the one request
// of a round that is ended late or in error. `mutex` guards all state; the simulation's driver and
// completions are called without it. What is allocated here is no business of the library.

const ZV::KernelDriver* RealLoadSimulationDriver() __asm__("__real__ZN2ZV20LoadSimulationDriverEv");
const ZV::KernelDriver* WrapLoadSimulationDriver() __asm__("__wrap__ZN2ZV20LoadSimulationDriverEv");

extern "C" int __real_dladdr1(const void* address, Dl_info* info, void** extra, int flags);
extern "C" [[gnu::visibility("default")]] int __wrap_dladdr1(const void* address, Dl_info* info,
                                                             void** extra, int flags);

namespace ZV::Test {
namespace {

using Clock = std::chrono::steady_clock;

constexpr std::uint32_t AnyFailure = PlatformErrorGeneralFailure;
constexpr std::uint64_t LateMs = 2000;
constexpr std::uint32_t AllCameras = 0xFFFFFFFF;

/// The one request of a round that the driver keeps back.
struct HeldRequest : KernelRequest {
    KernelRequest* outer = nullptr;
    void* handle = nullptr;
    bool hasEnded = false;
    std::uint32_t error = 0, bytes = 0;
    Clock::time_point due;
};

/// A request that is sent on and waited for.
struct AwaitedRequest : KernelRequest {
    bool hasEnded = false;
    std::uint32_t error = 0, bytes = 0;
};

struct DriverState {
    std::mutex mutex;
    std::condition_variable changed;
    RequestFailure failure = RequestFailure::None;
    RequestSeries series = RequestSeries::Calls;
    std::uint64_t number = 0;
    bool isCounting = false;
    std::array<std::vector<CountedRequest>, std::size(AllSeries)> counted;
    std::vector<std::thread::id> streamThreads;
    std::atomic<std::uint32_t> failedCode{0};
    std::uint32_t openDevices = 0;
    std::uint32_t reclaimed = 0;
    bool hasEnded = false;
    ZentaraSimulationState stateAtEnd{};
    ModuleLoads moduleLoads;
    std::atomic<bool> isImageNameRelative{false};
    HeldRequest held;
    std::thread lateThread;
};

/// Never freed: requests may come as long as the process lives.
DriverState& GetState() {
    static DriverState* const state = new DriverState;
    return *state;
}

const KernelDriver& GetSimulation() {
    static const KernelDriver* const driver = RealLoadSimulationDriver();
    return *driver;
}

RequestSeries GetSeries(std::uint32_t code) {
    if (code == FW_IOCTL_ATTACH_BUFFER) return RequestSeries::Stream;
    const bool isSwitch = code == FW_IOCTL_STREAM_ENTER || code == FW_IOCTL_STREAM_LEAVE;
    return isSwitch ? RequestSeries::Switches : RequestSeries::Calls;
}

bool MayPend(const KernelRequest& request) {
    return request.isOverlapped != 0;
}

/// Stays pended until something happens to it: an answer at once does nothing.
bool WaitsForEvent(std::uint32_t code) {
    return GetSeries(code) != RequestSeries::Calls || code == FW_IOCTL_NOTIFY_WAIT;
}

std::uint32_t GetAddress(const KernelRequest& request) {
    constexpr std::size_t Offset = offsetof(AsyncReadRecord, offsetLow);
    std::uint32_t address = 0;
    if (request.code != FW_IOCTL_ASYNC_WRITE || request.inputBytes < Offset + 4) return 0;
    std::memcpy(&address, static_cast<const std::uint8_t*>(request.input) + Offset, 4);
    return address;
}

/// What this request meets.
RequestFailure Count(const KernelRequest& request) {
    DriverState& state = GetState();
    const std::lock_guard hold(state.mutex);
    if (!state.isCounting) return RequestFailure::None;
    if (request.code == FW_IOCTL_STREAM_ENTER) {
        state.streamThreads.push_back(std::this_thread::get_id());
    }
    const auto& threads = state.streamThreads;
    const bool isOfStream =
        std::find(threads.begin(), threads.end(), std::this_thread::get_id()) != threads.end();
    const RequestSeries series = GetSeries(request.code);
    auto& counted = state.counted[static_cast<std::size_t>(series)];
    counted.push_back({request.code, MayPend(request), GetAddress(request), isOfStream});
    if (series != state.series || counted.size() != state.number) return RequestFailure::None;
    state.failedCode = request.code;
    return state.failure;
}

void RunLateThread() {
    const UncountedAllocations uncounted;
    DriverState& state = GetState();
    std::unique_lock lock(state.mutex);
    while (true) {
        state.changed.wait(lock,
                           [&] { return state.held.outer != nullptr && state.held.hasEnded; });
        const Clock::time_point due = state.held.due;
        if (Clock::now() < due) {
            (void)state.changed.wait_until(lock, due);
            continue;
        }
        KernelRequest* const outer = state.held.outer;
        const std::uint32_t error = state.held.error, bytes = state.held.bytes;
        lock.unlock();
        outer->complete(outer, error, bytes);
        lock.lock();
        state.held.outer = nullptr;
        state.changed.notify_all();
    }
}

void EndHeld(KernelRequest*, std::uint32_t error, std::uint32_t bytes) {
    DriverState& state = GetState();
    const std::lock_guard hold(state.mutex);
    state.held.error = error;
    state.held.bytes = bytes;
    state.held.hasEnded = true;
    state.changed.notify_all();
}

void Hold(void* handle, KernelRequest* request, std::uint64_t forMs) {
    DriverState& state = GetState();
    std::unique_lock lock(state.mutex);
    state.changed.wait(lock, [&] { return state.held.outer == nullptr; });
    if (!state.lateThread.joinable()) state.lateThread = std::thread(RunLateThread);
    static_cast<KernelRequest&>(state.held) = *request;
    state.held.complete = EndHeld;
    state.held.outer = request;
    state.held.handle = handle;
    state.held.hasEnded = false;
    state.held.due = Clock::now() + std::chrono::milliseconds(forMs);
}

std::uint32_t EndInError(void* handle, KernelRequest* request) {
    Hold(handle, request, 0);
    EndHeld(nullptr, AnyFailure, 0);
    return PlatformErrorIoPending;
}

std::uint32_t EndLate(void* handle, KernelRequest* request) {
    DriverState& state = GetState();
    Hold(handle, request, GetRealWaitMs(LateMs));
    std::uint32_t bytes = 0;
    const std::uint32_t error = GetSimulation().control(handle, &state.held, &bytes);
    if (error != PlatformErrorIoPending) EndHeld(nullptr, error, bytes);
    return PlatformErrorIoPending;
}

std::uint32_t AnswerLate(void* handle, KernelRequest* request, std::uint32_t* bytes) {
    DriverState& state = GetState();
    {
        std::unique_lock lock(state.mutex);
        const auto due = Clock::now() + std::chrono::milliseconds(GetRealWaitMs(LateMs));
        state.changed.wait_until(lock, due, [due] { return Clock::now() >= due; });
    }
    return GetSimulation().control(handle, request, bytes);
}

void EndAwaited(KernelRequest* request, std::uint32_t error, std::uint32_t bytes) {
    DriverState& state = GetState();
    const std::lock_guard hold(state.mutex);
    auto* const awaited = static_cast<AwaitedRequest*>(request);
    awaited->error = error;
    awaited->bytes = bytes;
    awaited->hasEnded = true;
    state.changed.notify_all();
}

std::uint32_t AnswerAtOnce(void* handle, KernelRequest* request, std::uint32_t* bytes) {
    if (WaitsForEvent(request->code)) return PlatformErrorNone;
    AwaitedRequest awaited;
    static_cast<KernelRequest&>(awaited) = *request;
    awaited.complete = EndAwaited;
    const std::uint32_t error = GetSimulation().control(handle, &awaited, bytes);
    if (error != PlatformErrorIoPending) return error;
    DriverState& state = GetState();
    std::unique_lock lock(state.mutex);
    state.changed.wait(lock, [&] { return awaited.hasEnded; });
    *bytes = awaited.bytes;
    return awaited.error;
}

std::uint32_t Control(void* handle, KernelRequest* request, std::uint32_t* bytes) {
    const UncountedAllocations uncounted;
    const bool mayPend = MayPend(*request);
    switch (Count(*request)) {
        case RequestFailure::Fails:
            return AnyFailure;
        case RequestFailure::AnsweredAtOnce:
            if (!mayPend) break;
            return AnswerAtOnce(handle, request, bytes);
        case RequestFailure::CompletesInError:
            return mayPend ? EndInError(handle, request) : AnyFailure;
        case RequestFailure::CompletesLate:
            return mayPend ? EndLate(handle, request) : AnswerLate(handle, request, bytes);
        case RequestFailure::DeviceGone:
            (void)ZentaraSimulation_Unplug(0);  // the first camera is the world's only one
            break;
        case RequestFailure::None:
            break;
    }
    return GetSimulation().control(handle, request, bytes);
}

/// True when `request` is the one that is held back. It ends as soon as it can.
bool Hurry(void* handle, const KernelRequest* request) {
    DriverState& state = GetState();
    const std::lock_guard hold(state.mutex);
    const bool isHeld = state.held.outer != nullptr && state.held.handle == handle &&
                        (request == nullptr || state.held.outer == request);
    if (!isHeld) return false;
    state.held.due = Clock::now();
    state.changed.notify_all();
    return true;
}

void Cancel(void* handle, KernelRequest* request) {
    const bool isHeld = Hurry(handle, request);
    GetSimulation().cancel(handle, isHeld ? &GetState().held : request);
}

std::uint32_t Open(const char* path, void** handle) {
    DriverState& state = GetState();
    const std::uint32_t error = GetSimulation().open(path, handle);
    const std::lock_guard hold(state.mutex);
    if (error == PlatformErrorNone) ++state.openDevices;
    return error;
}

std::uint32_t CountReservations() {
    ZentaraSimulationState held{};
    (void)ZentaraSimulation_GetState(AllCameras, &held);  // zeros without a bus
    return held.reservedBandwidths + held.reservedChannels + held.reservedResources;
}

void Close(void* handle) {
    const UncountedAllocations uncounted;
    DriverState& state = GetState();
    const std::uint32_t before = CountReservations();
    GetSimulation().close(handle);
    const std::uint32_t after = CountReservations();
    const bool isHeld = Hurry(handle, nullptr);
    std::unique_lock lock(state.mutex);
    if (isHeld) state.changed.wait(lock, [&] { return state.held.outer == nullptr; });
    --state.openDevices;
    state.reclaimed += before - after;
}

void End() {
    DriverState& state = GetState();
    ZentaraSimulationState held{};
    (void)ZentaraSimulation_GetState(AllCameras, &held);  // zeros without a bus
    {
        const std::lock_guard hold(state.mutex);
        state.stateAtEnd = held;
        state.hasEnded = true;
    }
    GetSimulation().end();
}

const KernelDriver* GetFailingDriver() {
    static const KernelDriver table = [] {
        KernelDriver made = GetSimulation();
        made.end = End;
        made.open = Open;
        made.close = Close;
        made.control = Control;
        made.cancel = Cancel;
        return made;
    }();
    return &table;
}

void NoteModuleLoad(bool isLoaded) {
    ModuleLoads& loads = GetState().moduleLoads;
    const std::lock_guard hold(GetState().mutex);
    if (isLoaded) loads.allocationsLeft = CountAllocationsLeft();
    if (!isLoaded) ++loads.failed;
}

}  // namespace

void BeginRequests(RequestFailure failure, RequestSeries series, std::uint64_t number) {
    DriverState& state = GetState();
    const std::lock_guard hold(state.mutex);
    state.failure = failure;
    state.series = series;
    state.number = number;
    state.failedCode = 0;
    for (auto& counted : state.counted) counted.clear();
    state.streamThreads.clear();
    state.isCounting = true;
}

void EndRequests() {
    DriverState& state = GetState();
    const std::lock_guard hold(state.mutex);
    state.isCounting = false;
}

std::uint32_t GetFailedCode() {
    return GetState().failedCode;
}

std::vector<CountedRequest> GetCounted(RequestSeries series) {
    DriverState& state = GetState();
    const std::lock_guard hold(state.mutex);
    return state.counted[static_cast<std::size_t>(series)];
}

std::uint32_t CountOpenDevices() {
    DriverState& state = GetState();
    const std::lock_guard hold(state.mutex);
    return state.openDevices;
}

std::uint32_t CountReclaimed() {
    DriverState& state = GetState();
    const std::lock_guard hold(state.mutex);
    return state.reclaimed;
}

void ForgetEnd() {
    DriverState& state = GetState();
    const std::lock_guard hold(state.mutex);
    state.hasEnded = false;
}

ModuleLoads GetModuleLoads() {
    DriverState& state = GetState();
    const std::lock_guard hold(state.mutex);
    return state.moduleLoads;
}

void NameImageRelatively() {
    GetState().isImageNameRelative = true;
}

bool HasEnded(ZentaraSimulationState* held) {
    DriverState& state = GetState();
    const std::lock_guard hold(state.mutex);
    *held = state.stateAtEnd;
    return state.hasEnded;
}

}  // namespace ZV::Test

const ZV::KernelDriver* WrapLoadSimulationDriver() {
    const bool isLoaded = RealLoadSimulationDriver() != nullptr;
    const ZV::Test::UncountedAllocations uncounted;
    ZV::Test::NoteModuleLoad(isLoaded);
    return isLoaded ? ZV::Test::GetFailingDriver() : nullptr;
}

int __wrap_dladdr1(const void* address, Dl_info* info, void** extra, int flags) {
    static link_map relative{};
    static char name[] = "lib/libzentara.so";
    const int isFound = __real_dladdr1(address, info, extra, flags);
    if (isFound == 0 || !ZV::Test::GetState().isImageNameRelative) return isFound;
    relative.l_name = name;
    *extra = &relative;
    return isFound;
}
