#include <array>
#include <cstring>
#include <vector>

#include "fuzz/client_calls.h"
#include "fuzz/fuzz_input.h"
#include "fuzz/hostile_cameras.h"
#include "fuzz/hostile_driver.h"
#include "hal/stream_format.h"

// A camera whose registers say anything, and the whole road of a client over it. Input: the kind of
// camera to start from, steps before it is listed, a byte 0xFF, then steps while it is open. Each
// step is a byte and what it takes.
namespace ZV::Fuzzing {
namespace {

using Simulation::BlockName;

constexpr std::uint8_t LastStepBeforeListing = 0xFF;
constexpr std::size_t FrameBytes = 1 << 16;
constexpr std::size_t FramesMax = 16;
constexpr std::size_t StepsMax = 200;

/// The client of one execution, with one buffer for all frames. All of it outlives the stream.
struct Client {
    ZentaraHandle handle = 0;
    Zentara_Settings block{}, queuedBlock{};
    std::array<Zentara_Frame, FramesMax> frames{};
    std::size_t queued = 0;
};

std::vector<std::uint8_t>& GetPixels() {
    static std::vector<std::uint8_t> pixels(FrameBytes);
    return pixels;
}

void IgnoreEvent(std::uint64_t, std::uint32_t, std::uint32_t, std::uint32_t) {}

BlockName TakeBlockName(FuzzInput& input) {
    return static_cast<BlockName>(input.TakeByte() % Simulation::BlockCount);
}

void StoreQuadlet(FuzzInput& input, Client&) {
    const BlockName block = TakeBlockName(input);
    const std::uint8_t quadlet = input.TakeByte();
    SetRegister(0, block, quadlet, input.TakeWord());
}

void ChangeQuadlet(FuzzInput& input, Client&) {
    const BlockName block = TakeBlockName(input);
    const std::uint8_t quadlet = input.TakeByte();
    const std::uint32_t value = GetRegister(0, block, quadlet);
    SetRegister(0, block, quadlet, value ^ input.TakeWord());
}

/// Quadlets in a row, all bytes of which are the input's.
void StoreQuadlets(FuzzInput& input, Client&) {
    const BlockName block = TakeBlockName(input);
    std::uint32_t quadlet = input.TakeByte();
    const std::uint32_t count = input.TakeByte();
    for (const std::uint32_t end = quadlet + count; quadlet < end && !input.IsEmpty(); ++quadlet) {
        SetRegister(0, block, quadlet, input.TakeWord());
    }
}

void MakeMischief(FuzzInput& input, Client&) {
    constexpr std::uint8_t Kinds = static_cast<std::uint8_t>(Mischief::Last) + 1;
    const auto mischief = static_cast<Mischief>(input.TakeByte() % Kinds);
    const std::uint8_t skipped = input.TakeByte();
    const std::uint8_t count = input.TakeByte();
    PlanMischief(mischief, skipped, count, input.TakeShort());
}

void ReadInfo(FuzzInput&, Client& client) {
    for (std::uint32_t key = zinfCameraType; key <= zinfReserved4 + 1; ++key) {
        std::uint32_t value = 0;
        RequireKnownResult(Zentara_GetInfo(client.handle, key, &value));
    }
}

void ReadTexts(FuzzInput& input, Client& client) {
    const std::uint8_t room = input.TakeByte();
    std::vector<char> text(room);
    RequireKnownResult(Zentara_GetSerialString(client.handle, text.data(), room));
    RequireKnownResult(Zentara_GetCameraModelString(client.handle, text.data(), room));
}

void ReadSettings(FuzzInput&, Client& client) {
    RequireKnownResult(Zentara_ReadSettingsFromCam(client.handle, &client.block));
}
void ReadDefaults(FuzzInput&, Client& client) {
    RequireKnownResult(Zentara_ReadDefaultSettings(client.handle, &client.block));
}
void Access(FuzzInput& input, Client& client) {
    CallAccessor(input, client.handle, &client.block);
}
void ReadBlock(FuzzInput&, Client& client) {
    ReadWholeBlock(client.handle, &client.block);
}
void Preflight(FuzzInput&, Client& client) {
    RequireKnownResult(Zentara_PreflightSettings(client.handle, &client.block));
}
void Send(FuzzInput&, Client& client) {
    RequireKnownResult(Zentara_SendSettingsToCam(client.handle, &client.block));
}
void StartStream(FuzzInput&, Client& client) {
    RequireKnownResult(Zentara_SetStreaming(client.handle, 1));
}
void StopStream(FuzzInput&, Client& client) {
    RequireKnownResult(Zentara_SetStreaming(client.handle, 0));
}

void QueueFrame(FuzzInput& input, Client& client) {
    if (client.queued == FramesMax) return;
    Zentara_Frame& frame = client.frames[client.queued++];
    frame.pBuffer = GetPixels().data();
    frame.bufferSize = FrameBytes;
    RequireKnownResult(
        Zentara_QueueFrame(client.handle, &frame, IgnoreEvent, input.TakeByte(), 0, 0));
}

void QueueSettings(FuzzInput&, Client& client) {
    client.queuedBlock = client.block;
    RequireKnownResult(
        Zentara_QueueSettings(client.handle, &client.queuedBlock, IgnoreEvent, zcbFrameDone, 0, 0));
}

void Trigger(FuzzInput&, Client& client) {
    RequireKnownResult(Zentara_Trigger(client.handle));
}
void Abort(FuzzInput&, Client& client) {
    RequireKnownResult(Zentara_Abort(client.handle));
}

void ReadReserved(FuzzInput& input, Client& client) {
    const std::uint8_t quadlets = input.TakeByte();
    std::vector<std::uint32_t> words(quadlets);
    RequireKnownResult(_Zentara_factory_reserved0(client.handle, 2, words.data(), quadlets, 0));
}

void RepeatBytes(std::span<const std::uint8_t> bytes, std::span<std::uint8_t> buffer) {
    for (std::size_t at = 0; at < buffer.size() && !bytes.empty(); at += bytes.size()) {
        const std::size_t count = std::min(bytes.size(), buffer.size() - at);
        std::memcpy(buffer.data() + at, bytes.data(), count);
    }
}

struct PacketHead {
    std::uint8_t psn, frameNumber;
    bool isFirst;
};

/// What a camera of streaming version 1 or 2 would send, around bytes that are there already.
void MakePacketGood(std::span<std::uint8_t> slot, const PacketHead& head, std::uint32_t offset) {
    const std::size_t length = slot.size() - PacketSlotExtraBytes;
    slot[PacketLengthOffset] = static_cast<std::uint8_t>(length);
    slot[PacketLengthOffset + 1] = static_cast<std::uint8_t>(length >> 8);
    std::uint8_t* const payload = slot.data() + PacketPayloadOffset;
    payload[PlainFlagsOffset] = head.isFirst ? PlainFlagFirst : 0;
    payload[PlainMarkOffset] = PlainMark;
    payload[PlainFrameNumberOffset] = head.frameNumber;
    payload[PlainOffsetHighOffset] = static_cast<std::uint8_t>(offset >> 16);
    payload[PlainOffsetLowOffset] = static_cast<std::uint8_t>(offset >> 8);
    payload[PlainOffsetLowOffset + 1] = static_cast<std::uint8_t>(offset);
    if (head.isFirst) {
        payload[PlainHeaderBytes + HeaderPsnOffset] = head.psn;
        payload[PlainHeaderBytes + HeaderFieldOffset] = FieldFirst;
    }
    std::memset(payload + length - TailMarkBytes, TailMarkByte, TailMarkBytes);
}

void MakeFrameGood(std::span<std::uint8_t> buffer, std::uint8_t frameNumber, bool isStart) {
    constexpr std::size_t SmallestSlot =
        PacketSlotExtraBytes + PlainHeaderBytes + FrameHeaderBytes + TailMarkBytes;
    const std::size_t stride = GetPacketStride(0);
    if (stride <= SmallestSlot) return;
    const auto psn = static_cast<std::uint8_t>(GetRegister(0, BlockName::Control, 1) >> 24);
    std::uint32_t offset = 0;
    bool isFirst = isStart;
    for (std::size_t at = 0; at + stride <= buffer.size(); at += stride) {
        MakePacketGood(buffer.subspan(at, stride), {psn, frameNumber, isFirst}, offset);
        offset += static_cast<std::uint32_t>(stride - PacketSlotExtraBytes - PlainHeaderBytes -
                                             TailMarkBytes - (isFirst ? FrameHeaderBytes : 0));
        isFirst = false;
    }
}

/// A request of the input's bytes, over and over; by a bit of the first one with good packets.
void Deliver(FuzzInput& input, Client&) {
    const std::uint8_t form = input.TakeByte();
    const std::uint8_t frameNumber = input.TakeByte();
    const std::span<const std::uint8_t> bytes = input.TakeBytes(input.TakeByte());
    const bool isDelivered = DeliverRequest(0, [&](std::span<std::uint8_t> buffer) {
        RepeatBytes(bytes, buffer);
        if ((form & 1) != 0) MakeFrameGood(buffer, frameNumber, (form & 2) != 0);
    });
    if (isDelivered) WaitForRing(0);
}

void OpenFirst(Client& client) {
    std::array<Zentara_CamListItem, 4> items{};
    auto listed = static_cast<std::uint32_t>(items.size());
    RequireKnownResult(Zentara_ListCameras(items.data(), &listed));
    if (listed == 0 || listed > items.size()) return;
    RequireKnownResult(Zentara_OpenCamera(items[0].cameraId, &client.handle));
}

void OpenAnew(FuzzInput&, Client& client) {
    RequireKnownResult(Zentara_CloseCamera(client.handle));
    OpenFirst(client);
}

using Step = void (*)(FuzzInput&, Client&);
/// The first four concern the camera alone and may stand before its listing.
constexpr std::array<Step, 21> Steps{
    StoreQuadlet, ChangeQuadlet, StoreQuadlets, MakeMischief,  ReadInfo,  ReadTexts,
    ReadSettings, ReadDefaults,  Access,        ReadBlock,     Preflight, Send,
    StartStream,  StopStream,    QueueFrame,    QueueSettings, Trigger,   Abort,
    ReadReserved, Deliver,       OpenAnew};
constexpr std::size_t CameraSteps = 4;

void PrepareCamera(FuzzInput& input, Client& client) {
    for (std::size_t step = 0; step < StepsMax && !input.IsEmpty(); ++step) {
        const std::uint8_t choice = input.TakeByte();
        if (choice == LastStepBeforeListing) return;
        Steps[choice % CameraSteps](input, client);
    }
}

void UseCamera(FuzzInput& input, Client& client) {
    for (std::size_t step = 0; step < StepsMax && !input.IsEmpty(); ++step) {
        Steps[input.TakeByte() % Steps.size()](input, client);
    }
}

void RunOnce(FuzzInput input) {
    HurryWaits();
    PlugHostileCameras(MakeHostileCameras(input.TakeByte(), 1));
    Client client;
    PrepareCamera(input, client);
    Require(Zentara_LoadDriver() == zerrNone);
    OpenFirst(client);
    UseCamera(input, client);
    RequireKnownResult(Zentara_CloseCamera(client.handle));
    Zentara_ReleaseDriver();
    Require(CountOpenHandles() == 0);
}

}  // namespace
}  // namespace ZV::Fuzzing

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    ZV::Fuzzing::RunOnce(ZV::Fuzzing::FuzzInput(data, size));
    return 0;
}
