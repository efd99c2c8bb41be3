#include <array>
#include <cstdlib>
#include <vector>

#include "fuzz/camera_feed.h"
#include "fuzz/client_calls.h"
#include "fuzz/fuzz_input.h"
#include "fuzz/good_packets.h"
#include "fuzz/hostile_cameras.h"
#include "fuzz/hostile_driver.h"

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

/// The client of one execution, with one buffer for all queued frames. All of it outlives the
/// stream.
struct Client {
    ZentaraHandle handle = 0;
    Zentara_Settings block{}, queuedBlock{};
    std::array<Zentara_Frame, FramesMax> frames{};
    std::size_t queued = 0;
    Zentara_Frame grabbed{};
    std::vector<std::uint8_t> grabbedPixels;
    GoodPackets packets{0};
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

struct Delivery {
    std::uint8_t form, frameNumber;
    std::span<const std::uint8_t> bytes;
};

Delivery TakeDelivery(FuzzInput& input) {
    const std::uint8_t form = input.TakeByte();
    const std::uint8_t frameNumber = input.TakeByte();
    return {form, frameNumber, input.TakeBytes(input.TakeByte())};
}

void Deliver(FuzzInput& input, Client& client) {
    const Delivery delivery = TakeDelivery(input);
    if (client.packets.Deliver(delivery.form, delivery.frameNumber, delivery.bytes)) {
        (void)WaitForRing(0);
    }
}

/// What the camera sends while the client waits for images.
FeedPlan TakeFeed(FuzzInput& input, const Client& client) {
    constexpr std::uint8_t RequestsMax = 32;
    const auto requests = static_cast<std::uint8_t>(input.TakeByte() % (RequestsMax + 1));
    const Delivery delivery = TakeDelivery(input);
    return {client.handle, delivery.form, delivery.frameNumber, requests, delivery.bytes};
}

void GiveBuffer(std::vector<std::uint8_t>& pixels, Zentara_Frame& frame) {
    frame.pBuffer = pixels.empty() ? nullptr : pixels.data();
    frame.bufferSize = static_cast<std::uint32_t>(pixels.size());
}

void Grab(FuzzInput& input, Client& client) {
    client.grabbedPixels = std::vector<std::uint8_t>(input.TakeShort());
    GiveBuffer(client.grabbedPixels, client.grabbed);
    const CameraFeed feed(0, client.packets, TakeFeed(input, client));
    RequireKnownResult(Zentara_GrabFrame(client.handle, &client.grabbed));
}

using MeasuringCall = ZentaraResult (*)(Zentara_Settings*, std::uint32_t, std::uint32_t,
                                        std::uint32_t, std::uint32_t);

void Measure(MeasuringCall measure, FuzzInput& input, Client& client) {
    const std::uint32_t x = input.TakeShort();
    const std::uint32_t y = input.TakeShort();
    const std::uint32_t width = input.TakeShort();
    const std::uint32_t height = input.TakeShort();
    const CameraFeed feed(0, client.packets, TakeFeed(input, client));
    RequireKnownResult(measure(&client.block, x, y, width, height));
}
void Balance(FuzzInput& input, Client& client) {
    Measure(Zentara_WhiteBalance, input, client);
}
void Expose(FuzzInput& input, Client& client) {
    Measure(Zentara_AutoExpose, input, client);
}

/// The frame that was grabbed last. A copy may replace the buffer, which is therefore malloc's.
void Finish(FuzzInput& input, Client& client) {
    Zentara_Frame finished{};
    finished.bufferSize = input.TakeShort();
    if (finished.bufferSize != 0) finished.pBuffer = std::malloc(finished.bufferSize);
    RequireKnownResult(
        Zentara_PostProcessSingleFrame(client.handle, &client.block, &client.grabbed, &finished));
    std::free(finished.pBuffer);
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
constexpr std::array<Step, 25> Steps{
    StoreQuadlet,  ChangeQuadlet, StoreQuadlets, MakeMischief, ReadInfo,
    ReadTexts,     ReadSettings,  ReadDefaults,  Access,       ReadBlock,
    Preflight,     Send,          StartStream,   StopStream,   QueueFrame,
    QueueSettings, Trigger,       Abort,         ReadReserved, Deliver,
    OpenAnew,      Grab,          Balance,       Expose,       Finish};
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
