#include "fuzz/hostile_driver.h"

#include <algorithm>
#include <bit>
#include <chrono>
#include <condition_variable>
#include <cstdio>
#include <cstring>
#include <deque>
#include <memory>
#include <mutex>
#include <string>
#include <thread>
#include <utility>
#include <vector>

#include "hal/control_records.h"
#include "hal/platform/kernel_driver.h"
#include "hal/platform/last_error.h"
#include "hal/platform/simulation_module.h"
#include "hal/stream_format.h"

// Threads: the library's, the target's, and one of its own, which ends what is answered late. One
// mutex guards all; a request is ended after it has been let go. The bus is never destroyed: the
// thread waits there for as long as the process lives.

namespace ZV::Fuzzing {
namespace {

using Simulation::BlockName;
using Simulation::RegisterFile;

struct HostileHandle;

using Clock = std::chrono::steady_clock;

/// A request that stays until a buffer is delivered, it is due to be answered late, it is cancelled
/// or its handle closed.
struct PendedRequest {
    KernelRequest* request;
    HostileHandle* handle;
    Clock::time_point due = Clock::time_point::max();
};

struct HostileCamera {
    explicit HostileCamera(const Simulation::CameraScenario& scenario) : memory(scenario) {}

    RegisterFile memory;
    std::deque<PendedRequest> pended;
    std::uint32_t stride = 0;
    std::size_t openHandles = 0;
};

struct HostileHandle {
    HostileCamera* camera;
    std::size_t ending = 0;  ///< Late requests that have been let go and are not ended yet.
};

struct HostilePlan {
    Mischief mischief = Mischief::None;
    std::uint32_t skipped = 0, count = 0, error = 0;
};

struct HostileBus {
    std::mutex mutex;
    std::condition_variable attachedMore, plannedLate, endedLate;
    std::vector<std::unique_ptr<HostileCamera>> cameras;
    HostilePlan plan;
    std::uint64_t nextHandle = 1;
    bool hasLateThread = false;
};

HostileBus& GetBus() {
    static HostileBus& bus = *new HostileBus;
    return bus;
}

std::uint32_t SwapBytes(std::uint32_t value) {
    return __builtin_bswap32(value);
}

std::uint32_t AnswerAddress(const HostileCamera& camera, std::uint32_t address) {
    std::uint32_t value = 0;
    return camera.memory.Peek(address, &value) ? value : ~std::rotl(address, 16);
}

std::uint32_t ReadRegisters(HostileCamera& camera, KernelRequest& request) {
    AsyncReadRecord record{};
    std::memcpy(&record, request.input, std::min<std::size_t>(sizeof record, request.inputBytes));
    auto* const output = static_cast<std::uint8_t*>(request.output);
    for (std::uint32_t at = 0; at + 4 <= request.outputBytes; at += 4) {
        const std::uint32_t value = SwapBytes(AnswerAddress(camera, record.offsetLow + at));
        std::memcpy(output + at, &value, sizeof value);
    }
    return request.outputBytes;
}

std::uint32_t WriteRegisters(HostileCamera& camera, KernelRequest& request) {
    AsyncReadRecord record{};
    std::memcpy(&record, request.input, std::min(AsyncWriteDataOffset, std::size_t{36}));
    const auto* const data = static_cast<const std::uint8_t*>(request.input) + AsyncWriteDataOffset;
    for (std::uint32_t at = 0; at + AsyncWriteExtraBytes < request.inputBytes; at += 4) {
        std::uint32_t value = 0;
        std::memcpy(&value, data + at, sizeof value);
        (void)camera.memory.Poke(record.offsetLow + at, SwapBytes(value));  // elsewhere it is lost
    }
    return 0;
}

template <typename Record>
Record& GetRecord(KernelRequest& request) {
    return *static_cast<Record*>(request.output);
}

std::uint32_t AllocateBandwidth(HostileCamera& camera, KernelRequest& request) {
    auto& record = GetRecord<AllocateBandwidthRecord>(request);
    camera.stride = record.maximumBytesPerFrame;
    record.bandwidthHandle = GetBus().nextHandle++;
    return sizeof record;
}
std::uint32_t AllocateChannel(HostileCamera&, KernelRequest& request) {
    auto& record = GetRecord<AllocateChannelRecord>(request);
    record.channel = static_cast<std::uint32_t>(GetBus().nextHandle++);
    return sizeof record;
}
std::uint32_t AllocateResources(HostileCamera&, KernelRequest& request) {
    auto& record = GetRecord<AllocateResourcesRecord>(request);
    record.resourceHandle = GetBus().nextHandle++;
    return sizeof record;
}
std::uint32_t QueryBusy(HostileCamera&, KernelRequest& request) {
    GetRecord<std::uint32_t>(request) = 0;
    return PlainRecordBytes;
}

/// Requests with an answer of their own; any other code is accepted.
struct AnswerRow {
    std::uint32_t code;
    std::uint32_t (*answer)(HostileCamera& camera, KernelRequest& request);
};
constexpr AnswerRow Answers[] = {
    {FW_IOCTL_ASYNC_READ, ReadRegisters},          {FW_IOCTL_ASYNC_WRITE, WriteRegisters},
    {FW_IOCTL_ALLOC_BANDWIDTH, AllocateBandwidth}, {FW_IOCTL_ALLOC_CHANNEL, AllocateChannel},
    {FW_IOCTL_ALLOC_RESOURCES, AllocateResources}, {FW_IOCTL_QUERY_BUSY, QueryBusy},
};

std::uint32_t Answer(HostileCamera& camera, KernelRequest& request) {
    for (const AnswerRow& row : Answers) {
        if (row.code == request.code) return row.answer(camera, request);
    }
    return request.outputBytes;
}

Mischief TakeMischief(HostilePlan& plan) {
    if (plan.count == 0) return Mischief::None;
    if (plan.skipped > 0) {
        --plan.skipped;
        return Mischief::None;
    }
    --plan.count;
    return plan.mischief;
}

bool StaysPended(const KernelRequest& request) {
    return request.code == FW_IOCTL_ATTACH_BUFFER || request.code == FW_IOCTL_NOTIFY_WAIT;
}

// ---- Late answers

PendedRequest* FindLate(HostileBus& bus) {
    PendedRequest* first = nullptr;
    for (const auto& camera : bus.cameras) {
        for (PendedRequest& row : camera->pended) {
            const bool isLate = row.due != Clock::time_point::max();
            if (isLate && (first == nullptr || row.due < first->due)) first = &row;
        }
    }
    return first;
}

void Forget(const PendedRequest& pended) {
    std::erase_if(pended.handle->camera->pended,
                  [&pended](const PendedRequest& row) { return row.request == pended.request; });
}

/// Lets go of the mutex while it ends the request.
void EndLate(std::unique_lock<std::mutex>& lock, HostileBus& bus, const PendedRequest pended) {
    Forget(pended);
    const std::uint32_t answered = Answer(*pended.handle->camera, *pended.request);
    ++pended.handle->ending;
    lock.unlock();
    pended.request->complete(pended.request, PlatformErrorNone, answered);
    lock.lock();
    --pended.handle->ending;
    bus.endedLate.notify_all();
}

void EndAllLate() {
    HostileBus& bus = GetBus();
    std::unique_lock lock(bus.mutex);
    for (;;) {
        const PendedRequest* const first = FindLate(bus);
        if (first == nullptr) {
            bus.plannedLate.wait(lock);
        } else if (const PendedRequest due = *first; due.due <= Clock::now()) {
            EndLate(lock, bus, due);
        } else {
            bus.plannedLate.wait_until(lock, due.due);
        }
    }
}

void PendLate(HostileBus& bus, HostileHandle& handle, KernelRequest* request,
              std::uint32_t number) {
    constexpr std::uint32_t DelayMask = 1023;
    const auto delay = std::chrono::microseconds(number & DelayMask);
    handle.camera->pended.push_back({request, &handle, Clock::now() + delay});
    if (!std::exchange(bus.hasLateThread, true)) std::thread(EndAllLate).detach();
    bus.plannedLate.notify_one();
}

// ---- The driver's table

std::uint32_t OpenList(void** list) {
    *list = nullptr;
    return PlatformErrorNone;
}

std::uint32_t SelectInterface(void*, std::uint32_t index) {
    const std::lock_guard hold(GetBus().mutex);
    return index < GetBus().cameras.size() ? PlatformErrorNone : PlatformErrorNoMoreItems;
}

std::uint32_t GetDetail(void*, std::uint32_t index, char* path, std::uint32_t capacity,
                        std::uint32_t* requiredBytes) {
    const std::string name = "hostile" + std::to_string(index);
    *requiredBytes = static_cast<std::uint32_t>(4 + name.size() + 1);
    if (capacity < *requiredBytes) return PlatformErrorInsufficientBuffer;
    std::memcpy(path, name.c_str(), name.size() + 1);
    return PlatformErrorNone;
}

std::uint32_t Open(const char* path, void** handle) {
    const std::lock_guard hold(GetBus().mutex);
    unsigned index = 0;
    const bool isNamed = std::sscanf(path, "hostile%u", &index) == 1;
    if (!isNamed || index >= GetBus().cameras.size()) return PlatformErrorFileNotFound;
    HostileCamera* const camera = GetBus().cameras[index].get();
    ++camera->openHandles;
    *handle = new HostileHandle{camera};
    return PlatformErrorNone;
}

std::deque<PendedRequest> TakePended(const HostileHandle& handle) {
    std::deque<PendedRequest>& all = handle.camera->pended;
    const auto isOther = [&handle](const PendedRequest& row) { return row.handle != &handle; };
    const auto firstOwn = std::stable_partition(all.begin(), all.end(), isOther);
    std::deque<PendedRequest> own(firstOwn, all.end());
    all.erase(firstOwn, all.end());
    return own;
}

void Close(void* opened) {
    const std::unique_ptr<HostileHandle> handle(static_cast<HostileHandle*>(opened));
    std::deque<PendedRequest> own;
    {
        std::unique_lock lock(GetBus().mutex);
        own = TakePended(*handle);
        --handle->camera->openHandles;
        GetBus().endedLate.wait(lock, [&handle] { return handle->ending == 0; });
    }
    for (const PendedRequest& row : own) {
        row.request->complete(row.request, PlatformErrorOperationAborted, 0);
    }
}

std::uint32_t Control(void* opened, KernelRequest* request, std::uint32_t* bytes) {
    auto& handle = *static_cast<HostileHandle*>(opened);
    HostileBus& bus = GetBus();
    std::unique_lock lock(bus.mutex);
    const Mischief mischief = TakeMischief(bus.plan);
    const std::uint32_t error = bus.plan.error;
    const bool canPend = request->isOverlapped != 0;
    if (mischief == Mischief::Fail) return error;
    const bool isOrdered = mischief == Mischief::None || mischief == Mischief::Late;
    if (isOrdered && StaysPended(*request) && canPend) {
        handle.camera->pended.push_back({request, &handle});
        bus.attachedMore.notify_all();
        return PlatformErrorIoPending;
    }
    if (mischief == Mischief::Late && canPend) {
        PendLate(bus, handle, request, error);
        return PlatformErrorIoPending;
    }
    std::uint32_t answered = 0;
    if (mischief != Mischief::EndWithError) answered = Answer(*handle.camera, *request);
    if (mischief == Mischief::ShortAnswer) answered /= 2;
    const std::uint32_t outcome =
        mischief == Mischief::EndWithError ? error : std::uint32_t{PlatformErrorNone};
    if (!canPend || mischief == Mischief::AnswerAtOnce) {
        *bytes = answered;
        return outcome;
    }
    lock.unlock();
    request->complete(request, outcome, answered);
    return PlatformErrorIoPending;
}

void Cancel(void* opened, KernelRequest* request) {
    auto& handle = *static_cast<HostileHandle*>(opened);
    {
        const std::lock_guard hold(GetBus().mutex);
        const auto isIt = [request](const PendedRequest& row) { return row.request == request; };
        if (std::erase_if(handle.camera->pended, isIt) == 0) return;
    }
    request->complete(request, PlatformErrorOperationAborted, 0);
}

constexpr KernelDriver HostileTable{
    KernelDriverVersion,
    [](const char*, char*, std::uint32_t) { return PlatformErrorNone; },
    [] {},
    OpenList,
    SelectInterface,
    GetDetail,
    [](void*) {},
    Open,
    Close,
    Control,
    Cancel,
};

bool IsAttached(const PendedRequest& row) {
    return row.request->code == FW_IOCTL_ATTACH_BUFFER;
}

}  // namespace

void PlugHostileCameras(std::span<const Simulation::CameraScenario> cameras) {
    const std::lock_guard hold(GetBus().mutex);
    GetBus().cameras.clear();
    GetBus().plan = HostilePlan{};
    for (const Simulation::CameraScenario& camera : cameras) {
        GetBus().cameras.push_back(std::make_unique<HostileCamera>(camera));
    }
}

void SetRegister(std::size_t camera, BlockName block, std::uint32_t quadlet, std::uint32_t value) {
    const std::lock_guard hold(GetBus().mutex);
    GetBus().cameras[camera]->memory.Set(block, quadlet, value);
}

std::uint32_t GetRegister(std::size_t camera, BlockName block, std::uint32_t quadlet) {
    const std::lock_guard hold(GetBus().mutex);
    return GetBus().cameras[camera]->memory.Get(block, quadlet);
}

void PlanMischief(Mischief mischief, std::uint32_t skipped, std::uint32_t count,
                  std::uint32_t error) {
    const std::lock_guard hold(GetBus().mutex);
    const bool isError = error != PlatformErrorNone && error != PlatformErrorIoPending;
    GetBus().plan = {mischief, skipped, count,
                     isError ? error : std::uint32_t{PlatformErrorGeneralFailure}};
}

bool DeliverRequest(std::size_t camera, const std::function<void(std::span<std::uint8_t>)>& fill) {
    KernelRequest* request = nullptr;
    {
        const std::lock_guard hold(GetBus().mutex);
        std::deque<PendedRequest>& pended = GetBus().cameras[camera]->pended;
        const auto first = std::find_if(pended.begin(), pended.end(), IsAttached);
        if (first == pended.end()) return false;
        request = first->request;
        pended.erase(first);
    }
    fill({static_cast<std::uint8_t*>(request->output), request->outputBytes});
    request->complete(request, PlatformErrorNone, request->outputBytes);
    return true;
}

bool WaitForRing(std::size_t camera) {
    constexpr std::chrono::milliseconds Limit{20};
    std::unique_lock lock(GetBus().mutex);
    const std::deque<PendedRequest>& pended = GetBus().cameras[camera]->pended;
    return GetBus().attachedMore.wait_for(lock, Limit, [&pended] {
        return std::count_if(pended.begin(), pended.end(), IsAttached) >=
               static_cast<std::ptrdiff_t>(StreamRequestCount);
    });
}

std::uint32_t GetPacketStride(std::size_t camera) {
    const std::lock_guard hold(GetBus().mutex);
    return GetBus().cameras[camera]->stride;
}

std::size_t CountOpenHandles() {
    const std::lock_guard hold(GetBus().mutex);
    std::size_t count = 0;
    for (const auto& camera : GetBus().cameras) count += camera->openHandles;
    return count;
}

}  // namespace ZV::Fuzzing

namespace ZV {

// In place of the seam's own: the devices are always those of this driver.
const KernelDriver* SelectSimulation(bool* isSelected) {
    return GetSelectedSimulation(isSelected);
}

const KernelDriver* GetSelectedSimulation(bool* isSelected) {
    *isSelected = true;
    return &Fuzzing::HostileTable;
}

void EndSimulation() {}

}  // namespace ZV
