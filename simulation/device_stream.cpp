#include <algorithm>
#include <cstring>
#include <new>
#include <utility>

#include "hal/control_records.h"
#include "hal/platform/last_error.h"
#include "hal/stream_format.h"
#include "simulation/device.h"

// The camera's sender: it waits for a trigger, exposes, and cuts the frame into packets, cycle by
// cycle, into the buffers that the listener has attached. Runs on `streamThread`; the sensor alone
// is asked without the mutex, and its image is dropped if an event has changed `sender.serial` in
// the meantime.
namespace ZV::Simulation {
namespace {

using namespace std::chrono_literals;

constexpr std::chrono::nanoseconds CycleTime = 125us;
// The clock is looked at once in so many cycles.
constexpr std::uint64_t CyclesPerWait = 8;
// A sender that was kept from running makes up for so many cycles at most.
constexpr std::uint64_t CyclesLagMax = 800;
// At time scale 0 an exposure is cut to what fills one request.
constexpr std::uint64_t CyclesPerExposureUntimed = PacketsPerRequest;
constexpr std::chrono::milliseconds RoomWait = 5ms;
constexpr std::uint64_t ImageBytesMax = 256u << 20;
constexpr std::uint32_t TriggersMax = 255;
constexpr std::uint32_t NoFilter = 255;
constexpr std::uint32_t WheelColours[] = {0, 1, 3};

std::uint64_t GetImageBytes(const ExposureSettings& exposure) {
    return std::uint64_t{exposure.width} * exposure.height * (exposure.bitDepth > 8 ? 2 : 1);
}

// Mosaic of an image turned by half a turn, for images of even size.
std::uint32_t TurnMosaic(std::uint32_t mosaic) {
    return 13 - mosaic;
}

bool HasFault(const std::vector<FaultDescription>& faults, FaultKind kind) {
    return std::any_of(faults.begin(), faults.end(),
                       [=](const FaultDescription& fault) { return fault.kind == kind; });
}

}  // namespace

void Device::SwitchSender(std::uint32_t value) {
    const bool isOn = (value & 1) != 0 && !isEnding;
    sender.triggers = 0;
    StopFrame();
    sender.wasTriggered = false;
    sender.packets.reset();
    sender.repeat.clear();
    sender.isOn = isOn;
    sender.channel = value >> 24;
    wheelStep = 0;
    isPaced = false;
    if (isOn && !streamThread.joinable()) streamThread = std::thread([this] { RunStream(); });
    streamWork.notify_all();
}

// Ends the exposure or frame under way.
void Device::StopFrame() {
    ++sender.serial;
    sender.phase = Phase::Idle;
    sender.cyclesLeft = 0;
}

// An exposure under way begins anew, so that each frame whose sending begins after the command was
// made with the new settings. A frame that is being sent goes on.
void Device::TakeOverSettings() {
    const double temperature = GetTemperature();
    const bool wasCycling = settings.isCycling;
    const std::uint32_t startColour = settings.startColour;
    inForce = registers.GetBlock(BlockName::Control);
    DecodeInForce();
    cooledFrom = temperature;
    cooledSince = Clock::now();
    if (settings.isCycling != wasCycling || settings.startColour != startColour) wheelStep = 0;
    if (sender.phase != Phase::Exposing) return;
    if (sender.wasTriggered) ++sender.triggers;
    StopFrame();
    streamWork.notify_all();
}

void Device::DecodeInForce() {
    settings = DecodeSettings(camera, inForce, registers.GetBlock(BlockName::Configuration));
}

void Device::UpdateTrigger() {
    if (!sender.isOn || settings.triggerType != TriggerSoftware) return;
    sender.triggers = std::min(sender.triggers + 1, TriggersMax);
    streamWork.notify_all();
}

bool Device::CanExpose() const {
    const std::uint64_t bytes = GetImageBytes(settings.exposure);
    if (bytes == 0 || bytes > ImageBytesMax) return false;
    if (settings.triggerType == TriggerFree) return true;
    if (settings.triggerType == TriggerSoftware) return sender.triggers > 0;
    if (camera.triggerPeriodMs <= 0) return false;
    const std::chrono::duration<double, std::milli> period(camera.triggerPeriodMs *
                                                           camera.timeScale);
    return Clock::now() - lastTrigger >= period;
}

void Device::BeginExposure() {
    lastTrigger = Clock::now();
    sender.wasTriggered = settings.triggerType == TriggerSoftware;
    if (sender.wasTriggered) --sender.triggers;
    sender.phase = Phase::Exposing;
    sender.cyclesLeft = GetExposureNs() / static_cast<std::uint64_t>(CycleTime.count());
    if (camera.timeScale <= 0) {
        sender.cyclesLeft = std::min(sender.cyclesLeft, CyclesPerExposureUntimed);
    }
}

std::uint32_t Device::GetWheelColour() const {
    const std::uint32_t start = settings.startColour == 3 ? 2 : settings.startColour == 1 ? 1 : 0;
    return WheelColours[settings.isCycling ? (start + wheelStep) % 3 : start];
}

std::uint64_t Device::GetExposureNs() const {
    if (!settings.isCycling) return settings.exposure.exposureNs;
    const std::uint32_t colour = GetWheelColour();
    if (colour == 0) return settings.redExposureNs;
    return colour == 3 ? settings.blueExposureNs : settings.exposure.exposureNs;
}

std::uint32_t Device::GetPlane() const {
    if (camera.sensor.colourKind == ColourKind::Mono) return GetWheelColour();
    const ExposureSettings& exposure = settings.exposure;
    const std::uint32_t mosaic = sensor.GetMosaicAt(exposure.roiX, exposure.roiY);
    return exposure.isRotated ? TurnMosaic(mosaic) : mosaic;
}

void Device::RunStream() {
    std::unique_lock lock(mutex);
    while (!isEnding) {
        const Handle listener = sender.isOn ? FindListener() : nullptr;
        if (listener == nullptr || !PreparePackets(*listener)) {
            isPaced = false;
            streamWork.wait(lock);
            continue;
        }
        RunBatch(lock, listener);
        Deliver(lock);
    }
}

Device::Handle Device::FindListener() const {
    for (const Handle& handle : handles) {
        const Reservations& held = handle->reservations;
        if (held.isListening && held.channel == sender.channel && held.tag == camera.tag) {
            return handle;
        }
    }
    return nullptr;
}

bool Device::PreparePackets(const FileHandle& listener) {
    std::uint32_t bytes =
        listener.reservations.stride - static_cast<std::uint32_t>(PacketSlotExtraBytes);
    if (settings.maxPacketBytes != 0) bytes = std::min(bytes, settings.maxPacketBytes);
    if (bytes < PacketStream::PayloadBytesMin) return false;
    if (sender.packets != nullptr && sender.payloadBytes == bytes) return true;
    StopFrame();
    sender.packets = std::make_unique<PacketStream>(camera.streamingVersion, bytes);
    sender.payloadBytes = bytes;
    sender.repeat.clear();
    lostPayload.resize(bytes);
    return true;
}

// At time scale 0 a camera that waits for a trigger still lets its cycles pass in real time.
bool Device::IsTimed() const {
    return camera.timeScale > 0 || (sender.phase == Phase::Idle && !CanExpose());
}

Device::Clock::duration Device::GetCycleTime() const {
    const double scale = camera.timeScale > 0 ? camera.timeScale : 1;
    const auto time = std::chrono::duration_cast<Clock::duration>(CycleTime * scale);
    return std::max(time, Clock::duration(1));
}

std::uint64_t Device::CountDueCycles() {
    if (!IsTimed()) {
        isPaced = false;
        return PacketsPerRequest;
    }
    const Clock::time_point now = Clock::now();
    if (!isPaced) {
        paceStart = now;
        paceCycles = 0;
        isPaced = true;
    }
    const auto passed = static_cast<std::uint64_t>((now - paceStart) / GetCycleTime());
    if (passed > paceCycles + CyclesLagMax) paceCycles = passed - CyclesLagMax;
    return std::min<std::uint64_t>(passed - paceCycles, PacketsPerRequest);
}

void Device::RunBatch(std::unique_lock<std::mutex>& lock, const Handle& listener) {
    const std::uint64_t due = CountDueCycles();
    if (due == 0) {
        const auto cycle = static_cast<Clock::duration::rep>(paceCycles + CyclesPerWait);
        streamWork.wait_until(lock, paceStart + GetCycleTime() * cycle);
        return;
    }
    for (std::uint64_t i = 0; i < due; ++i) {
        const CycleResult result = RunCycle(listener);
        if (result == CycleResult::Stop) return;
        if (result == CycleResult::Expose) return Expose(lock);
        if (result == CycleResult::NoRoom) return WaitForRoom(lock);
        ++cycles;
        ++paceCycles;
    }
}

// The camera's clock stands still meanwhile. A host that holds back more requests than the window
// allows gets one more at a time.
void Device::WaitForRoom(std::unique_lock<std::mutex>& lock) {
    isPaced = false;
    if (!ended.empty()) return;
    if (streamWork.wait_for(lock, RoomWait) == std::cv_status::timeout) ++extraWindow;
}

bool Device::LosesPackets() const {
    return !camera.waitsForBuffers && camera.timeScale > 0;
}

bool Device::HasRoom(const FileHandle& listener) const {
    if (listener.attached.empty()) return false;
    if (camera.timeScale > 0 || listener.attached.front().filled > 0) return true;
    const std::size_t withHost = listener.ringSize - listener.attached.size();
    return withHost < camera.ringWindow + extraWindow;
}

std::uint8_t* Device::GetPayload(const FileHandle& listener) {
    if (listener.attached.empty()) return lostPayload.data();
    const AttachedBuffer& buffer = listener.attached.front();
    return static_cast<std::uint8_t*>(buffer.request->output) +
           std::size_t{buffer.filled} * listener.reservations.stride + PacketPayloadOffset;
}

void Device::FillSlot(const Handle& listener, std::uint32_t length) {
    if (listener->attached.empty()) return;
    AttachedBuffer& buffer = listener->attached.front();
    std::uint8_t* slot = GetPayload(*listener) - PacketPayloadOffset;
    std::memset(slot, 0, PacketPayloadOffset);
    slot[PacketLengthOffset] = static_cast<std::uint8_t>(length);
    slot[PacketLengthOffset + 1] = static_cast<std::uint8_t>(length >> 8);
    if (++buffer.filled < PacketsPerRequest) return;
    if (buffer.isOverwritten) {
        buffer.filled = 0;
        buffer.isOverwritten = false;
        return;
    }
    if (listener->attached.size() == listener->ringSize) extraWindow = 0;
    EndPended(listener, buffer.id, PlatformErrorNone, buffer.request->outputBytes);
}

Device::CycleResult Device::RunCycle(const Handle& listener) {
    if (!sender.repeat.empty()) return SendRepeat(listener);
    if (sender.phase == Phase::Sending) return SendPacket(listener);
    if (sender.phase == Phase::Idle) {
        if (!CanExpose()) return SendIdle(listener);
        BeginExposure();
    }
    if (sender.cyclesLeft == 0) return CycleResult::Expose;
    const CycleResult result = SendIdle(listener);
    if (result == CycleResult::Done) --sender.cyclesLeft;
    return result;
}

Device::CycleResult Device::SendIdle(const Handle& listener) {
    if (!camera.hasIdlePackets) return CycleResult::Done;
    if (!HasRoom(*listener)) return LosesPackets() ? CycleResult::Done : CycleResult::NoRoom;
    FillSlot(listener, sender.packets->Idle(GetPayload(*listener)));
    return CycleResult::Done;
}

Device::CycleResult Device::SendRepeat(const Handle& listener) {
    if (!HasRoom(*listener) && !LosesPackets()) return CycleResult::NoRoom;
    std::memcpy(GetPayload(*listener), sender.repeat.data(), sender.repeat.size());
    FillSlot(listener, static_cast<std::uint32_t>(sender.repeat.size()));
    sender.repeat.clear();
    return CycleResult::Done;
}

Device::CycleResult Device::SendPacket(const Handle& listener) {
    if (!HasRoom(*listener) && !LosesPackets()) return CycleResult::NoRoom;
    const auto matches = faults.MatchPacket(sender.record.frame, sender.packet);
    if (!CarryOutFrameEvents(listener, matches)) return CycleResult::Stop;
    std::uint8_t* payload = GetPayload(*listener);
    std::uint32_t length = sender.packets->Next(payload);
    ++sender.packet;
    if (HasFault(matches, FaultKind::CorruptPacket)) ++packetsCorrupted;
    DamagePacket(matches, payload, &length);
    if (HasFault(matches, FaultKind::RepeatPacket)) sender.repeat.assign(payload, payload + length);
    if (sender.packets->IsFinished()) FinishFrame();
    if (!HasFault(matches, FaultKind::LosePacket)) FillSlot(listener, length);
    return CycleResult::Done;
}

// False when the frame has come to an end by it.
bool Device::CarryOutFrameEvents(const Handle& listener,
                                 const std::vector<FaultDescription>& matches) {
    if (matches.empty()) return true;
    if (HasFault(matches, FaultKind::Unplug)) {
        UnplugLocked();
        return false;
    }
    if (HasFault(matches, FaultKind::BusReset)) {
        ResetBus(listener);
        return false;
    }
    if (HasFault(matches, FaultKind::FrameStart) && !sender.wasRestarted) RestartFrame();
    if (HasFault(matches, FaultKind::OverwriteRequest) && !listener->attached.empty()) {
        listener->attached.front().isOverwritten = true;
    }
    return true;
}

void Device::DamagePacket(const std::vector<FaultDescription>& matches, std::uint8_t* payload,
                          std::uint32_t* length) const {
    constexpr std::uint32_t CorruptBytes = 4;
    for (const FaultDescription& fault : matches) {
        if (fault.kind == FaultKind::TruncatePacket) {
            *length = std::min(*length, fault.hasBytes ? fault.bytes : *length / 2);
        }
        if (fault.kind == FaultKind::MissingTail && *length >= TailMarkBytes) {
            std::memset(payload + *length - TailMarkBytes, 0, TailMarkBytes);
        }
        if (fault.kind != FaultKind::CorruptPacket) continue;
        const std::uint64_t end = std::min<std::uint64_t>(
            *length, std::uint64_t{fault.offset} + (fault.hasBytes ? fault.bytes : CorruptBytes));
        for (std::uint64_t i = fault.offset; i < end; ++i) payload[i] ^= 0xFF;
    }
}

void Device::RestartFrame() {
    sender.wasRestarted = true;
    sender.packet = 0;
    const std::uint32_t number = static_cast<std::uint32_t>(++framesBegun);
    sender.restart.rollingFrameNumber = number;
    sender.restart.frameNumber = static_cast<std::uint8_t>(number);
    sender.record.rollingFrameNumber = number & 0xFFFF;
    sender.packets->Begin(std::move(sender.restart));
}

// Reservations outlive a reset; what is under way on the bus does not.
void Device::ResetBus(const Handle& listener) {
    StopFrame();
    trace->WriteEvent(position, "busReset");
    EndWaiting(listener, FW_IOCTL_NOTIFY_WAIT, PlatformErrorNone);
    for (const std::uint32_t code : {FW_IOCTL_ASYNC_READ, FW_IOCTL_ASYNC_WRITE}) {
        CountFailed(code, EndWaiting(listener, code, PlatformErrorGeneralFailure));
    }
    if (listener->attached.empty() || listener->attached.front().filled == 0) return;
    const AttachedBuffer& buffer = listener->attached.front();
    ++buffersFailed;
    EndPended(listener, buffer.id, PlatformErrorGeneralFailure, 0);
}

void Device::Expose(std::unique_lock<std::mutex>& lock) {
    Deliver(lock);
    if (sender.phase != Phase::Exposing || sender.cyclesLeft != 0) return;
    ExposureSettings exposure = settings.exposure;
    exposure.exposureNs = GetExposureNs();
    exposure.wheelColour = settings.isCycling ? GetWheelColour() : NoFilter;
    exposure.temperature = GetTemperature();
    exposure.frameIndex = framesExposed;
    const std::uint64_t serial = sender.serial;
    lock.unlock();
    std::vector<std::uint8_t> pixels = ExposeOrRepeat(exposure);
    lock.lock();
    if (serial != sender.serial) return;
    if (pixels.empty()) return StopFrame();
    ++framesExposed;
    BeginFrame(std::move(pixels));
}

// Empty when there is no memory for it.
std::vector<std::uint8_t> Device::ExposeOrRepeat(ExposureSettings exposure) try {
    if (camera.sensor.hasNoise) return sensor.Expose(exposure);
    exposure.frameIndex = 0;
    if (lastPixels.empty() || exposure != lastExposure) {
        lastPixels = sensor.Expose(exposure);
        lastExposure = exposure;
    }
    return lastPixels;
} catch (const std::bad_alloc&) {
    return {};
}

void Device::BeginFrame(std::vector<std::uint8_t> pixels) {
    const ExposureSettings& exposure = settings.exposure;
    const std::uint64_t number = ++framesBegun;
    const bool hasWrongPsn = !faults.MatchFrame(framesExposed).empty();
    OutgoingFrame frame;
    frame.rowBytes = exposure.width * (exposure.bitDepth > 8 ? 2 : 1);
    frame.isInterlaced = settings.isInterlaced;
    frame.rollingFrameNumber = static_cast<std::uint32_t>(number);
    frame.frameNumber = static_cast<std::uint8_t>(number);
    frame.psn = static_cast<std::uint8_t>(settings.psn + (hasWrongPsn ? 1 : 0));
    frame.timestamp = static_cast<std::uint32_t>(cycles);
    frame.plane = static_cast<std::uint8_t>(GetPlane());
    frame.sampleBits = static_cast<std::uint8_t>(exposure.bitDepth - 1);
    FrameRecord& record = sender.record;
    record = {framesExposed,  static_cast<std::uint32_t>(number & 0xFFFF),
              frame.psn,      frame.plane,
              exposure.width, exposure.height,
              pixels.size(),  0};
    if (trace->IsOpen()) record.checksum = CalculateChecksum(pixels.data(), pixels.size());
    frame.pixels = std::move(pixels);
    sender.wasRestarted = false;
    if (faults.HasPacketFaults()) {
        sender.restart = frame;
    } else {
        sender.wasRestarted = true;  // There is no copy to begin anew from.
    }
    sender.packets->Begin(std::move(frame));
    sender.packet = 0;
    sender.phase = Phase::Sending;
    if (settings.isCycling) ++wheelStep;
}

void Device::FinishFrame() {
    sender.phase = Phase::Idle;
    ++framesSent;
    trace->WriteFrame(position, sender.record);
}

}  // namespace ZV::Simulation
