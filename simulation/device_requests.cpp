#include <algorithm>
#include <cmath>
#include <cstring>

#include "hal/control_records.h"
#include "hal/platform/last_error.h"
#include "hal/stream_format.h"
#include "simulation/device.h"

// What the driver answers to each control code. Input and output of a request may be the same
// memory, so each record is copied out before an answer is written. All members want the device's
// mutex held.
namespace ZV::Simulation {
namespace {

constexpr std::uint32_t ChannelCount = 64;
constexpr double CoolingSecondsPerE = 4;
constexpr double AmbientCelsius = 20;
constexpr double LockedWithinCelsius = 0.5;

template <typename Record>
Record ReadInput(const Call& call) {
    Record record{};
    std::memcpy(&record, call.request->input, sizeof record);
    return record;
}

template <typename Record>
std::uint32_t Answer(Call& call, const Record& record) {
    std::memcpy(call.request->output, &record, sizeof record);
    call.bytes = sizeof record;
    return PlatformErrorNone;
}

bool IsAsyncHeadValid(const AsyncReadRecord& record) {
    return record.rawMode == 0 && record.getGeneration == 1 &&
           record.destinationNode == AsyncDestinationNode && record.offsetHigh == AsyncOffsetHigh &&
           record.bytes % 4 == 0 && record.blockSize == 0 && record.flags == 0;
}

constexpr std::uint32_t SwapBytes(std::uint32_t value) {
    return value << 24 | (value & 0xFF00) << 8 | (value >> 8 & 0xFF00) | value >> 24;
}

}  // namespace

std::uint32_t Device::GetSpeed() const {
    return std::min(camera.speed, bus->GetSpeed());
}

std::uint32_t Device::AsyncRead(Call& call) {
    const auto record = ReadInput<AsyncReadRecord>(call);
    if (!IsAsyncHeadValid(record)) return PlatformErrorInvalidParameter;
    if (record.bytes != call.request->outputBytes) return PlatformErrorBadLength;
    const std::uint32_t quadlets = record.bytes / 4;
    if (!registers.IsReadable(record.offsetLow, quadlets)) return PlatformErrorGeneralFailure;
    RefreshStatus();
    for (std::uint32_t i = 0; i < quadlets; ++i) {
        std::uint32_t value = 0;
        registers.Read(record.offsetLow + 4 * i, 1, &value);
        value = SwapBytes(value);
        std::memcpy(static_cast<std::uint8_t*>(call.request->output) + 4 * i, &value, sizeof value);
    }
    call.bytes = record.bytes;
    return PlatformErrorNone;
}

std::uint32_t Device::AsyncWrite(Call& call) {
    if (call.request->inputBytes < AsyncWriteExtraBytes) return PlatformErrorBadLength;
    AsyncReadRecord record{};
    std::memcpy(&record, call.request->input, AsyncWriteDataOffset);
    if (!IsAsyncHeadValid(record)) return PlatformErrorInvalidParameter;
    if (std::uint64_t{record.bytes} + AsyncWriteExtraBytes != call.request->inputBytes) {
        return PlatformErrorBadLength;
    }
    const std::uint32_t quadlets = record.bytes / 4;
    if (!registers.IsWritable(record.offsetLow, quadlets)) return PlatformErrorGeneralFailure;
    const auto* data = static_cast<const std::uint8_t*>(call.request->input) + AsyncWriteDataOffset;
    for (std::uint32_t i = 0; i < quadlets; ++i) {
        std::uint32_t value = 0;
        std::memcpy(&value, data + 4 * i, sizeof value);
        ObeyWrite(record.offsetLow + 4 * i, SwapBytes(value));
    }
    return PlatformErrorNone;
}

// A version quadlet keeps its value: it says what the block is.
void Device::ObeyWrite(std::uint32_t address, std::uint32_t value) {
    BlockName block{};
    std::uint32_t quadlet = 0;
    if (!registers.Locate(address, &block, &quadlet)) return;
    if (quadlet == 0 && block != BlockName::Configuration) return;
    registers.Set(block, quadlet, value);
    if (block == BlockName::Command && quadlet == CommandTakeOver && value == 1) TakeOverSettings();
    if (block == BlockName::Command && quadlet == CommandSoftwareTrigger && value == 1) {
        UpdateTrigger();
    }
    if (block == BlockName::Stream && quadlet == StreamSwitch) SwitchSender(value);
}

double Device::GetTemperature() const {
    const bool isOn = ExtractField(ControlCooler, inForce[ControlCooler.quadlet]) != 0;
    const std::uint32_t code =
        ExtractField(ControlTemperature, inForce[ControlTemperature.quadlet]);
    const double target = isOn ? ConvertTemperatureCode(code) : AmbientCelsius;
    if (camera.timeScale <= 0) return target;
    const double seconds =
        std::chrono::duration<double>(Clock::now() - cooledSince).count() / camera.timeScale;
    return target + (cooledFrom - target) * std::exp(-seconds / CoolingSecondsPerE);
}

void Device::RefreshStatus() {
    const bool isOn = ExtractField(ControlCooler, inForce[ControlCooler.quadlet]) != 0;
    const std::uint32_t code =
        ExtractField(ControlTemperature, inForce[ControlTemperature.quadlet]);
    const double distance = std::abs(GetTemperature() - ConvertTemperatureCode(code));
    const bool isLocked = isOn && distance < LockedWithinCelsius;
    registers.Set(BlockName::Status, StatusTemperature, isLocked ? StatusTemperatureLocked : 0);
}

std::uint32_t Device::NotifyEnable(Call& call) {
    call.handle->isNotifying = true;
    return Answer(call, std::uint32_t{0});
}

std::uint32_t Device::NotifyDisable(Call& call) {
    call.handle->isNotifying = false;
    EndWaiting(call.handle, FW_IOCTL_NOTIFY_WAIT, PlatformErrorOperationAborted);
    return Answer(call, std::uint32_t{0});
}

std::uint32_t Device::NotifyWait(Call& call) {
    return call.handle->isNotifying ? PlatformErrorNone : PlatformErrorInvalidParameter;
}

std::uint32_t Device::StreamEnter(Call&) {
    return PlatformErrorNone;
}

std::uint32_t Device::StreamLeave(Call& call) {
    EndWaiting(call.handle, FW_IOCTL_STREAM_ENTER, PlatformErrorNone);
    return Answer(call, std::uint32_t{0});
}

std::uint32_t Device::EndWaiting(const Handle& handle, std::uint32_t code, std::uint32_t error) {
    std::vector<std::uint64_t> ids;
    std::uint32_t newlyFailed = 0;
    for (const PendedRequest& pended : handle->pended) {
        if (pended.request->code != code) continue;
        ids.push_back(pended.id);
        if (pended.forcedError == PlatformErrorNone) ++newlyFailed;
    }
    for (const std::uint64_t id : ids) EndPended(handle, id, error, 0);
    return newlyFailed;
}

void Device::CountFailed(std::uint32_t code, std::uint32_t count) {
    requestsFailed += count;
    if (code == FW_IOCTL_ASYNC_READ || code == FW_IOCTL_ASYNC_WRITE) {
        registerRequestsFailed += count;
    }
}

std::uint32_t Device::QueryBusy(Call& call) {
    const std::uint64_t opening = call.handle->opening;
    bool isBusy = camera.heldFrom != 0 && opening >= camera.heldFrom &&
                  (camera.heldTo == 0 || opening <= camera.heldTo);
    // Of two handles the older one holds the device.
    for (const Handle& other : handles) isBusy |= other->opening < opening;
    return Answer(call, isBusy ? DeviceIsBusy : 0u);
}

std::uint32_t Device::AllocateBandwidth(Call& call) {
    auto record = ReadInput<AllocateBandwidthRecord>(call);
    if (record.speed != SpeedFlagS400 && record.speed != SpeedFlagS800) {
        return PlatformErrorInvalidParameter;
    }
    if (!bus->ReserveBandwidth(record.maximumBytesPerFrame)) return PlatformErrorNoSystemResources;
    record.bandwidthHandle = MakeReservationHandle();
    record.bytesPerFrameAvailable = bus->GetBandwidthLeft();
    record.speedSelected = GetSpeed() >= 800 ? record.speed : SpeedFlagS400;
    call.handle->reservations.bandwidths.push_back(
        {record.bandwidthHandle, record.maximumBytesPerFrame});
    return Answer(call, record);
}

std::uint32_t Device::FreeBandwidth(Call& call) {
    const auto reservation = ReadInput<std::uint64_t>(call);
    auto& bandwidths = call.handle->reservations.bandwidths;
    for (auto held = bandwidths.begin(); held != bandwidths.end(); ++held) {
        if (held->handle != reservation) continue;
        bus->FreeBandwidth(held->bytes);
        bandwidths.erase(held);
        return Answer(call, reservation);
    }
    // None and one that is gone already are as good as freed.
    if (reservation != 0 && !WasReservationHandle(reservation))
        return PlatformErrorInvalidParameter;
    return Answer(call, reservation);
}

std::uint32_t Device::AllocateChannel(Call& call) {
    auto record = ReadInput<AllocateChannelRecord>(call);
    record.channel = bus->ReserveChannel(record.requestedChannel);
    if (record.channel == AnyChannel) return PlatformErrorNoSystemResources;
    record.channelsAvailable = bus->GetChannelsLeft();
    call.handle->reservations.channels |= 1ull << record.channel;
    call.handle->reservations.pastChannels |= 1ull << record.channel;
    return Answer(call, record);
}

std::uint32_t Device::FreeChannel(Call& call) {
    const auto channel = ReadInput<std::uint32_t>(call);
    if (channel == AnyChannel) return Answer(call, channel);
    if (channel >= ChannelCount) return PlatformErrorInvalidParameter;
    Reservations& held = call.handle->reservations;
    const std::uint64_t bit = 1ull << channel;
    if (held.channels & bit) {
        bus->FreeChannel(channel);
        held.channels &= ~bit;
        return Answer(call, channel);
    }
    // Channel 0 also stands for none in a record that was never filled.
    const bool isForeign = (held.pastChannels & bit) == 0 && bus->IsChannelReserved(channel);
    if (isForeign && channel != 0) return PlatformErrorAccessDenied;
    return Answer(call, channel);
}

std::uint32_t Device::AllocateResources(Call& call) {
    auto record = ReadInput<AllocateResourcesRecord>(call);
    Reservations& held = call.handle->reservations;
    const bool hasChannel = record.channel < ChannelCount && (held.channels >> record.channel & 1);
    const std::uint64_t bufferSize = std::uint64_t{record.maximumBytesPerFrame} * PacketsPerRequest;
    if (record.flags != ResourceFlagsListen || !hasChannel || record.bufferCount == 0 ||
        record.maximumBytesPerFrame < PacketSlotExtraBytes || record.quadletsToStrip != 0 ||
        record.maximumBufferSize != bufferSize) {
        return PlatformErrorInvalidParameter;
    }
    if (held.resources != 0) return PlatformErrorBusy;
    const bool isTooFast = record.speed == SpeedFlagS800 && GetSpeed() < 800;
    const bool isTooLong =
        record.speed == SpeedFlagS400 && record.maximumBytesPerFrame > PacketStrideMaxS400;
    if (isTooFast || isTooLong) return PlatformErrorNoSystemResources;
    if (record.speed != SpeedFlagS800 && record.speed != SpeedFlagS400) {
        return PlatformErrorInvalidParameter;
    }
    held.resources = record.resourceHandle = MakeReservationHandle();
    held.channel = record.channel;
    held.stride = record.maximumBytesPerFrame;
    held.tag = record.tagCode;
    held.bufferCount = record.bufferCount;
    return Answer(call, record);
}

std::uint32_t Device::FreeResources(Call& call) {
    const auto resource = ReadInput<std::uint64_t>(call);
    Reservations& held = call.handle->reservations;
    if (resource != 0 && resource == held.resources) {
        StopListening(call.handle);
        held.resources = 0;
        return Answer(call, resource);
    }
    if (resource != 0 && !WasReservationHandle(resource)) return PlatformErrorInvalidParameter;
    return Answer(call, resource);
}

std::uint32_t Device::AttachBuffer(Call& call) {
    const KernelRequest& request = *call.request;
    FileHandle& handle = *call.handle;
    const Reservations& held = handle.reservations;
    if (held.resources == 0) return PlatformErrorInvalidParameter;
    const std::uint64_t size = std::uint64_t{held.stride} * PacketsPerRequest;
    if (request.outputBytes != size || request.inputBytes != size) return PlatformErrorBadLength;
    if (handle.attached.size() >= held.bufferCount) return PlatformErrorNoSystemResources;
    handle.attached.push_back({call.id, call.request});
    handle.ringSize = std::max(handle.ringSize, static_cast<std::uint32_t>(handle.attached.size()));
    streamWork.notify_all();
    return PlatformErrorNone;
}

void Device::StopListening(const Handle& handle) {
    handle->reservations.isListening = false;
    EndWaiting(handle, FW_IOCTL_ATTACH_BUFFER, PlatformErrorOperationAborted);
    handle->ringSize = 0;
    ++sender.serial;
}

std::uint32_t Device::DetachBuffers(Call& call) {
    const auto resource = ReadInput<std::uint64_t>(call);
    if (resource != 0 && !WasReservationHandle(resource)) return PlatformErrorInvalidParameter;
    if (resource == call.handle->reservations.resources) StopListening(call.handle);
    return Answer(call, resource);
}

std::uint32_t Device::Listen(Call& call) {
    const auto record = ReadInput<StreamSwitchRecord>(call);
    Reservations& held = call.handle->reservations;
    if (record.resourceHandle == 0 || record.resourceHandle != held.resources) {
        return PlatformErrorInvalidParameter;
    }
    held.isListening = true;
    streamWork.notify_all();
    return Answer(call, record);
}

std::uint32_t Device::Stop(Call& call) {
    const auto record = ReadInput<StreamSwitchRecord>(call);
    const std::uint64_t resource = record.resourceHandle;
    if (resource != 0 && !WasReservationHandle(resource)) return PlatformErrorInvalidParameter;
    if (resource == call.handle->reservations.resources) {
        call.handle->reservations.isListening = false;
    }
    return Answer(call, record);
}

}  // namespace ZV::Simulation
