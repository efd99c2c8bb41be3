#include "simulation/device.h"

#include <algorithm>
#include <atomic>
#include <cstring>
#include <utility>

#include "hal/control_records.h"
#include "hal/platform/last_error.h"

namespace ZV::Simulation {
namespace {

constexpr std::uint32_t AnyLength = 0xFFFFFFFF;
constexpr double AmbientCelsius = 20;

std::atomic<std::uint64_t> lastReservation{0};

// The handle whose completion runs on this thread: a close from inside it must not wait for itself.
thread_local const FileHandle* deliveringHandle = nullptr;

bool IsRegisterRequest(const KernelRequest& request) {
    return (request.code == FW_IOCTL_ASYNC_READ || request.code == FW_IOCTL_ASYNC_WRITE) &&
           request.input != nullptr && request.inputBytes >= AsyncWriteDataOffset;
}

std::uint32_t GetAddress(const KernelRequest& request) {
    std::uint32_t address = 0;
    std::memcpy(
        &address,
        static_cast<const std::uint8_t*>(request.input) + offsetof(AsyncReadRecord, offsetLow),
        sizeof address);
    return address;
}

bool HasBuffers(const KernelRequest& request) {
    return (request.input != nullptr || request.inputBytes == 0) &&
           (request.output != nullptr || request.outputBytes == 0);
}

const FaultDescription* FindFault(const std::vector<FaultDescription>& faults, FaultKind kind) {
    for (const FaultDescription& fault : faults) {
        if (fault.kind == kind) return &fault;
    }
    return nullptr;
}

std::uint32_t GetAnswerLimit(const std::vector<FaultDescription>& faults,
                             const KernelRequest& request) {
    const FaultDescription* fault = FindFault(faults, FaultKind::ShortAnswer);
    if (fault == nullptr) return AnyLength;
    return fault->hasBytes ? fault->bytes : request.outputBytes / 2;
}

}  // namespace

std::uint64_t MakeReservationHandle() {
    return ++lastReservation;
}

bool WasReservationHandle(std::uint64_t handle) {
    return handle != 0 && handle <= lastReservation;
}

// The driver's control codes: lengths that it insists on, and how it answers.
struct Device::Operation {
    std::uint32_t code;
    std::uint32_t inputBytes, outputBytes;
    RequestKind kind;
    std::uint32_t (Device::*run)(Call&);
};

constexpr Device::Operation Device::Operations[] = {
    {FW_IOCTL_ASYNC_READ, sizeof(AsyncReadRecord), AnyLength, RequestKind::Transaction,
     &Device::AsyncRead},
    {FW_IOCTL_ASYNC_WRITE, AnyLength, 0, RequestKind::Transaction, &Device::AsyncWrite},
    {FW_IOCTL_NOTIFY_ENABLE, PlainRecordBytes, PlainRecordBytes, RequestKind::Answered,
     &Device::NotifyEnable},
    {FW_IOCTL_STREAM_ENTER, PlainRecordBytes, PlainRecordBytes, RequestKind::Waiting,
     &Device::StreamEnter},
    {FW_IOCTL_NOTIFY_WAIT, NotifyRecordBytes, NotifyRecordBytes, RequestKind::Waiting,
     &Device::NotifyWait},
    {FW_IOCTL_NOTIFY_DISABLE, PlainRecordBytes, PlainRecordBytes, RequestKind::Answered,
     &Device::NotifyDisable},
    {FW_IOCTL_STREAM_LEAVE, PlainRecordBytes, PlainRecordBytes, RequestKind::Answered,
     &Device::StreamLeave},
    {FW_IOCTL_QUERY_BUSY, PlainRecordBytes, PlainRecordBytes, RequestKind::Answered,
     &Device::QueryBusy},
    {FW_IOCTL_ALLOC_BANDWIDTH, sizeof(AllocateBandwidthRecord), sizeof(AllocateBandwidthRecord),
     RequestKind::Answered, &Device::AllocateBandwidth},
    {FW_IOCTL_FREE_BANDWIDTH, HandleRecordBytes, HandleRecordBytes, RequestKind::Answered,
     &Device::FreeBandwidth},
    {FW_IOCTL_ALLOC_CHANNEL, sizeof(AllocateChannelRecord), sizeof(AllocateChannelRecord),
     RequestKind::Answered, &Device::AllocateChannel},
    {FW_IOCTL_FREE_CHANNEL, ChannelRecordBytes, ChannelRecordBytes, RequestKind::Answered,
     &Device::FreeChannel},
    {FW_IOCTL_ALLOC_RESOURCES, sizeof(AllocateResourcesRecord), sizeof(AllocateResourcesRecord),
     RequestKind::Answered, &Device::AllocateResources},
    {FW_IOCTL_FREE_RESOURCES, HandleRecordBytes, HandleRecordBytes, RequestKind::Answered,
     &Device::FreeResources},
    {FW_IOCTL_ATTACH_BUFFER, AnyLength, AnyLength, RequestKind::Waiting, &Device::AttachBuffer},
    {FW_IOCTL_DETACH_BUFFERS, HandleRecordBytes, HandleRecordBytes, RequestKind::Answered,
     &Device::DetachBuffers},
    {FW_IOCTL_LISTEN, sizeof(StreamSwitchRecord), sizeof(StreamSwitchRecord),
     RequestKind::Transaction, &Device::Listen},
    {FW_IOCTL_STOP, sizeof(StreamSwitchRecord), sizeof(StreamSwitchRecord), RequestKind::Answered,
     &Device::Stop},
};

const Device::Operation* Device::FindOperation(std::uint32_t code) {
    for (const Operation& operation : Operations) {
        if (operation.code == code) return &operation;
    }
    return nullptr;
}

Device::Device(const CameraScenario& scenario, std::uint32_t cameraPosition,
               std::shared_ptr<Bus> cameraBus, std::shared_ptr<Trace> cameraTrace,
               std::unique_ptr<Scene> scene)
    : camera(scenario),
      position(cameraPosition),
      bus(std::move(cameraBus)),
      trace(std::move(cameraTrace)),
      sensor(scenario.sensor, std::move(scene)),
      registers(scenario),
      inForce(BlockQuadlets),
      faults(scenario.seed),
      isPlugged(scenario.isPlugged),
      cooledFrom(AmbientCelsius) {
    for (const FaultDescription& fault : camera.faults) faults.Add(fault);
    DecodeInForce();
}

Device::~Device() {
    End();
}

bool Device::IsPlugged() const {
    const std::lock_guard lock(mutex);
    return isPlugged && !isEnding;
}

std::shared_ptr<FileHandle> Device::Open(const std::shared_ptr<Device>& device) {
    const std::lock_guard lock(device->mutex);
    if (!device->isPlugged || device->isEnding) return nullptr;
    auto handle = std::make_shared<FileHandle>();
    handle->device = device;
    handle->opening = ++device->openings;
    device->handles.push_back(handle);
    device->trace->WriteEvent(device->position, "open");
    return handle;
}

void Device::Close(const Handle& handle) {
    std::unique_lock lock(mutex);
    if (!handle->isClosed) trace->WriteEvent(position, "close");
    handle->isClosed = true;
    EndAllPended(handle, PlatformErrorOperationAborted);
    ReleaseReservations(handle);
    handles.erase(std::remove(handles.begin(), handles.end(), handle), handles.end());
    streamWork.notify_all();
    released.notify_all();
    Deliver(lock);
    const std::uint32_t own = deliveringHandle == handle.get() ? 1 : 0;
    released.wait(lock, [&] { return handle->inFlight <= own; });
}

std::uint32_t Device::Control(const Handle& handle, KernelRequest* request, std::uint32_t* bytes) {
    const std::string input =
        trace->IsOpen() && request->code != FW_IOCTL_ATTACH_BUFFER && request->input != nullptr
            ? ConvertToHex(request->input, request->inputBytes)
            : "";
    std::unique_lock lock(mutex);
    Call call{handle, request, ++lastId};
    const std::uint32_t error = ControlLocked(lock, call);
    *bytes = call.bytes;
    if (error == PlatformErrorIoPending) {
        // The trace line of a pended request is written when it ends.
        for (PendedRequest& pended : handle->pended) {
            if (pended.id == call.id) pended.input = input;
        }
    } else {
        WriteTrace(*request, input, false, error, call.bytes);
    }
    Deliver(lock);
    return error;
}

std::uint32_t Device::ControlLocked(std::unique_lock<std::mutex>& lock, Call& call) {
    const KernelRequest& request = *call.request;
    if (call.handle->isClosed) return PlatformErrorInvalidHandle;
    ++requestsServed;
    const bool hasAddress = IsRegisterRequest(request);
    const std::vector<FaultDescription> matches =
        faults.MatchRequest(request.code, hasAddress, hasAddress ? GetAddress(request) : 0);
    CarryOutEvents(call.handle, matches);
    if (call.handle->isDead) return PlatformErrorDeviceNotConnected;
    return CarryOut(lock, call, matches);
}

void Device::CarryOutEvents(const Handle& handle, const std::vector<FaultDescription>& matches) {
    if (FindFault(matches, FaultKind::BusReset) != nullptr) ResetBus(handle);
    if (FindFault(matches, FaultKind::Unplug) != nullptr) UnplugLocked();
    if (FindFault(matches, FaultKind::Plug) != nullptr) PlugLocked();
}

std::uint32_t Device::CarryOut(std::unique_lock<std::mutex>& lock, Call& call,
                               const std::vector<FaultDescription>& matches) {
    KernelRequest& request = *call.request;
    const Operation* operation = FindOperation(request.code);
    if (operation == nullptr || !HasBuffers(request)) return PlatformErrorInvalidParameter;
    if ((operation->inputBytes != AnyLength && operation->inputBytes != request.inputBytes) ||
        (operation->outputBytes != AnyLength && operation->outputBytes != request.outputBytes)) {
        return PlatformErrorBadLength;
    }
    const bool mayPend = request.isOverlapped != 0 && operation->kind != RequestKind::Answered;
    PendedRequest pended{call.id, &request, 0, GetAnswerLimit(matches, request), ""};
    if (FindFault(matches, FaultKind::NeverComplete) != nullptr) {
        return request.isOverlapped != 0 ? Pend(call.handle, pended, false)
                                         : Block(lock, call.handle);
    }
    if (const FaultDescription* fault = FindFault(matches, FaultKind::FailRequest)) {
        CountFailed(request.code, 1);
        const bool isRefused = !fault->isPended || !mayPend;
        if (request.code == FW_IOCTL_ATTACH_BUFFER) ++(isRefused ? buffersRefused : buffersFailed);
        if (isRefused) return fault->error;
        pended.forcedError = fault->error;
        return Pend(call.handle, pended, true);
    }
    const bool isAtOnce = FindFault(matches, FaultKind::AnswerAtOnce) != nullptr ||
                          (request.code == FW_IOCTL_ASYNC_WRITE && !camera.areWritesPended);
    // A reset finds what is on its way to the camera pended, and ends it.
    if (FindFault(matches, FaultKind::BusReset) != nullptr && IsRegisterRequest(request)) {
        CountFailed(request.code, 1);
        if (!mayPend || isAtOnce) return PlatformErrorGeneralFailure;
        pended.forcedError = PlatformErrorGeneralFailure;
    }
    if (operation->kind == RequestKind::Transaction && mayPend && !isAtOnce) {
        return Pend(call.handle, pended, true);
    }
    if (operation->kind == RequestKind::Waiting) {
        if (isAtOnce) return PlatformErrorNone;
        if (!mayPend) return PlatformErrorInvalidParameter;
        const std::uint32_t error = (this->*operation->run)(call);
        return error != PlatformErrorNone ? error : Pend(call.handle, pended, false);
    }
    const std::uint32_t error = (this->*operation->run)(call);
    call.bytes = std::min(call.bytes, pended.answerLimit);
    return error;
}

std::uint32_t Device::Pend(const Handle& handle, const PendedRequest& pended, bool isTransaction) {
    handle->pended.push_back(pended);
    if (!isTransaction) return PlatformErrorIoPending;
    jobs.push_back({handle, pended.id});
    if (!requestThread.joinable()) requestThread = std::thread([this] { RunRequests(); });
    requestWork.notify_one();
    return PlatformErrorIoPending;
}

// A request without an overlapped record that never completes holds its caller until the device
// goes away or another thread closes the handle.
std::uint32_t Device::Block(std::unique_lock<std::mutex>& lock, const Handle& handle) {
    ++handle->inFlight;
    released.wait(lock, [&] { return handle->isDead || handle->isClosed; });
    --handle->inFlight;
    released.notify_all();
    return handle->isDead ? PlatformErrorDeviceNotConnected : PlatformErrorOperationAborted;
}

void Device::EndPended(const Handle& handle, std::uint64_t id, std::uint32_t error,
                       std::uint32_t bytes) {
    const auto found = std::find_if(handle->pended.begin(), handle->pended.end(),
                                    [&](const PendedRequest& pended) { return pended.id == id; });
    if (found == handle->pended.end()) return;
    std::erase_if(handle->attached, [&](const AttachedBuffer& buffer) { return buffer.id == id; });
    ended.push_back({handle, *found, error, std::min(bytes, found->answerLimit)});
    handle->pended.erase(found);
    ++handle->inFlight;
}

void Device::EndAllPended(const Handle& handle, std::uint32_t error) {
    while (!handle->pended.empty()) EndPended(handle, handle->pended.front().id, error, 0);
}

void Device::Deliver(std::unique_lock<std::mutex>& lock) {
    while (!ended.empty()) {
        Ended batch;
        batch.swap(ended);
        lock.unlock();
        for (const EndedRequest& one : batch) {
            KernelRequest* request = one.pended.request;
            WriteTrace(*request, one.pended.input, true, one.error, one.bytes);
            const FileHandle* const outer = deliveringHandle;
            deliveringHandle = one.handle.get();
            request->complete(request, one.error, one.bytes);
            deliveringHandle = outer;
            lock.lock();
            --one.handle->inFlight;
            released.notify_all();
            lock.unlock();
        }
        lock.lock();
    }
}

void Device::WriteTrace(const KernelRequest& request, const std::string& input, bool wasPended,
                        std::uint32_t error, std::uint32_t bytes) {
    if (!trace->IsOpen()) return;
    RequestRecord record;
    record.code = request.code;
    record.input = input;
    record.inputBytes = request.inputBytes;
    record.outputBytes = bytes;
    record.wasPended = wasPended;
    record.error = error;
    if (request.code != FW_IOCTL_ATTACH_BUFFER && request.output != nullptr) {
        record.output = ConvertToHex(request.output, std::min(bytes, request.outputBytes));
    }
    trace->WriteRequest(position, record);
}

void Device::RunRequests() {
    std::unique_lock lock(mutex);
    while (true) {
        requestWork.wait(lock, [&] { return isEnding || !jobs.empty(); });
        if (isEnding) return;
        const Job job = std::move(jobs.front());
        jobs.pop_front();
        RunTransaction(job.handle, job.id);
        Deliver(lock);
    }
}

void Device::RunTransaction(const Handle& handle, std::uint64_t id) {
    for (const PendedRequest& pended : handle->pended) {
        if (pended.id != id) continue;
        Call call{handle, pended.request, id};
        std::uint32_t error = pended.forcedError;
        if (error == PlatformErrorNone) {
            error = (this->*FindOperation(pended.request->code)->run)(call);
        }
        EndPended(handle, id, error, call.bytes);
        return;
    }
}

void Device::Cancel(const Handle& handle, KernelRequest* request) {
    std::unique_lock lock(mutex);
    for (const PendedRequest& pended : handle->pended) {
        if (pended.request != request) continue;
        EndPended(handle, pended.id, PlatformErrorOperationAborted, 0);
        break;
    }
    Deliver(lock);
}

void Device::KillHandles(std::uint32_t error) {
    for (const Handle& handle : handles) {
        handle->isDead = true;
        EndAllPended(handle, error);
        ReleaseReservations(handle);
    }
    released.notify_all();
}

void Device::UnplugLocked() {
    if (!isPlugged) return;
    isPlugged = false;
    trace->WriteEvent(position, "unplug");
    SwitchSender(0);
    KillHandles(PlatformErrorDeviceNotConnected);
}

void Device::PlugLocked() {
    if (isPlugged) return;
    trace->WriteEvent(position, "plug");
    registers.Reset();
    inForce.assign(BlockQuadlets, 0);
    DecodeInForce();
    cooledFrom = AmbientCelsius;
    isPlugged = true;
}

void Device::Unplug() {
    std::unique_lock lock(mutex);
    UnplugLocked();
    Deliver(lock);
}

void Device::Plug() {
    const std::lock_guard lock(mutex);
    PlugLocked();
}

void Device::End() {
    std::unique_lock lock(mutex);
    isEnding = true;
    SwitchSender(0);
    KillHandles(PlatformErrorOperationAborted);
    requestWork.notify_all();
    streamWork.notify_all();
    Deliver(lock);
    std::thread first = std::move(requestThread), second = std::move(streamThread);
    lock.unlock();
    if (first.joinable()) first.join();
    if (second.joinable()) second.join();
}

void Device::ReleaseReservations(const Handle& handle) {
    StopListening(handle);
    Reservations& held = handle->reservations;
    for (const Reservations::Bandwidth& bandwidth : held.bandwidths) {
        bus->FreeBandwidth(bandwidth.bytes);
    }
    for (std::uint32_t channel = 0; channel < 64; ++channel) {
        if (held.channels >> channel & 1) bus->FreeChannel(channel);
    }
    held = Reservations{};
}

void Device::AddFault(const FaultDescription& fault) {
    const std::lock_guard lock(mutex);
    faults.Add(fault);
}

void Device::AddState(ZentaraSimulationState* state) const {
    const std::lock_guard lock(mutex);
    for (const Handle& handle : handles) {
        const Reservations& held = handle->reservations;
        ++state->openHandles;
        for (std::uint64_t channels = held.channels; channels != 0; channels &= channels - 1) {
            ++state->reservedChannels;
        }
        state->reservedBandwidths += static_cast<std::uint32_t>(held.bandwidths.size());
        state->reservedResources += held.resources != 0;
        state->pendedRequests += static_cast<std::uint32_t>(handle->pended.size());
        state->attachedBuffers += static_cast<std::uint32_t>(handle->attached.size());
    }
    state->requestsServed += requestsServed;
    state->requestsFailed += requestsFailed;
    state->registerRequestsFailed += registerRequestsFailed;
    state->buffersRefused += buffersRefused;
    state->buffersFailed += buffersFailed;
    state->packetsCorrupted += packetsCorrupted;
    state->framesBegun += framesBegun;
    state->psn = settings.psn;
    state->framesExposed += framesExposed;
    state->framesSent += framesSent;
    state->isStreaming |= sender.isOn;
}

bool Device::Peek(std::uint32_t address, std::uint32_t* value) const {
    const std::lock_guard lock(mutex);
    return registers.Peek(address, value);
}

bool Device::Poke(std::uint32_t address, std::uint32_t value) {
    const std::lock_guard lock(mutex);
    return registers.Poke(address, value);
}

}  // namespace ZV::Simulation
