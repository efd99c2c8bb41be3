#include <array>
#include <cstring>
#include <optional>
#include <vector>

#include "fuzz/client_calls.h"
#include "fuzz/fuzz_input.h"
#include "fuzz/good_packets.h"
#include "fuzz/hostile_cameras.h"
#include "fuzz/hostile_driver.h"

// Any 260 bytes as a settings block of an open camera: through the accessors, the limits and the
// tables, a preflight and the send; on demand while it streams, where a setter may start the stream
// again, and in the queue. Input: camera, switches, the form of the frames if it streams, the
// block, then accessor calls.
namespace ZV::Fuzzing {
namespace {

constexpr std::size_t CameraCount = 10;
constexpr std::size_t HandleOffset = 244, MagicOffset = 252;
constexpr std::uint32_t Magic = 0xDEADBEEF;

enum Switches : std::uint8_t {
    StartsFromDefaults = 1,  ///< The bytes change a block of defaults, by exclusive or.
    LeavesHandle = 2,
    LeavesMagic = 4,
    SendsUnmended = 8,
    SendsTwice = 16,
    IsStreaming = 32,
    QueuesBlock = 64,  ///< Before the send, behind a frame that then comes.
};

void TakeBlock(FuzzInput& input, std::uint8_t switches, ZentaraHandle handle,
               Zentara_Settings* block) {
    if ((switches & StartsFromDefaults) != 0) (void)Zentara_ReadDefaultSettings(handle, block);
    auto* const bytes = reinterpret_cast<std::uint8_t*>(block);
    const std::span<const std::uint8_t> taken = input.TakeBytes(sizeof *block);
    for (std::size_t at = 0; at < taken.size(); ++at) bytes[at] ^= taken[at];
    if ((switches & LeavesHandle) == 0) std::memcpy(bytes + HandleOffset, &handle, sizeof handle);
    if ((switches & LeavesMagic) == 0) std::memcpy(bytes + MagicOffset, &Magic, sizeof Magic);
}

void SendBlock(std::uint8_t switches, ZentaraHandle handle, Zentara_Settings* block) {
    if ((switches & SendsUnmended) == 0) {
        RequireKnownResult(Zentara_PreflightSettings(handle, block));
    }
    RequireKnownResult(Zentara_SendSettingsToCam(handle, block));
    if ((switches & SendsTwice) != 0) RequireKnownResult(Zentara_SendSettingsToCam(handle, block));
}

void IgnoreEvent(std::uint64_t, std::uint32_t, std::uint32_t, std::uint32_t) {}

GoodPackets& GetPackets(std::size_t camera) {
    static std::array<std::optional<GoodPackets>, CameraCount> packets;
    if (!packets[camera]) packets[camera].emplace(camera);
    return *packets[camera];
}

/// A frame of a camera that may have been set to any other size.
void DeliverFrame(std::size_t camera, std::uint8_t form) {
    constexpr std::array<std::uint8_t, 3> Pixels{0x50, 0x60, 0x70};
    const auto start = static_cast<std::uint8_t>(form | HasGoodPackets | StartsFrame);
    if (GetPackets(camera).Deliver(start, 1, Pixels)) (void)WaitForRing(camera);
}

/// What is queued is the client's again before it goes.
void StreamWhileSending(std::size_t camera, std::uint8_t switches, std::uint8_t form,
                        ZentaraHandle handle, Zentara_Settings* block) {
    static std::array<std::uint8_t, 1 << 16> pixels;
    Zentara_Settings queuedBlock = *block;
    Zentara_Frame frame{};
    frame.pBuffer = pixels.data();
    frame.bufferSize = pixels.size();
    RequireKnownResult(Zentara_SetStreaming(handle, 1));
    RequireKnownResult(Zentara_QueueFrame(handle, &frame, IgnoreEvent, zcbFrameDone, 0, 0));
    if ((switches & QueuesBlock) != 0) {
        RequireKnownResult(
            Zentara_QueueSettings(handle, &queuedBlock, IgnoreEvent, zcbFrameDone, 0, 0));
        DeliverFrame(camera, form);
    }
    SendBlock(switches, handle, block);
    DeliverFrame(camera, form);
    RequireKnownResult(Zentara_Abort(handle));
    RequireKnownResult(Zentara_SetStreaming(handle, 0));
}

/// What the execution did to the camera is undone as far as a client can.
void RestoreCamera(ZentaraHandle handle) {
    Zentara_Settings block{};
    RequireKnownResult(Zentara_ReadDefaultSettings(handle, &block));
    RequireKnownResult(Zentara_SendSettingsToCam(handle, &block));
}

void RunOnce(FuzzInput input) {
    static const std::vector<ZentaraHandle> handles = OpenHostileCameras(CameraCount);
    const std::size_t camera = input.TakeByte() % handles.size();
    const ZentaraHandle handle = handles[camera];
    const std::uint8_t switches = input.TakeByte();
    const bool isStreaming = (switches & IsStreaming) != 0;
    const std::uint8_t form = isStreaming ? input.TakeByte() : std::uint8_t{0};
    Zentara_Settings block{};
    TakeBlock(input, switches, handle, &block);
    ReadWholeBlock(handle, &block);
    while (!input.IsEmpty()) CallAccessor(input, handle, &block);
    Zentara_Settings copy = block;
    RequireKnownResult(Zentara_TranslateSettings(handle, &copy));
    if (isStreaming) StreamWhileSending(camera, switches, form, handle, &block);
    if (!isStreaming) SendBlock(switches, handle, &block);
    RequireKnownResult(Zentara_ReadSettingsFromCam(handle, &copy));
    ReadWholeBlock(handle, &copy);
    RestoreCamera(handle);
}

}  // namespace
}  // namespace ZV::Fuzzing

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    ZV::Fuzzing::RunOnce(ZV::Fuzzing::FuzzInput(data, size));
    return 0;
}
