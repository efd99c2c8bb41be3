#include <cstring>
#include <vector>

#include "fuzz/client_calls.h"
#include "fuzz/fuzz_input.h"
#include "fuzz/hostile_cameras.h"

// Any 260 bytes as a settings block of an open camera: through the accessors, the limits and the
// tables, a preflight and the send. Input: camera, switches, the block, then accessor calls.
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

/// What the execution did to the camera is undone as far as a client can.
void RestoreCamera(ZentaraHandle handle) {
    Zentara_Settings block{};
    RequireKnownResult(Zentara_ReadDefaultSettings(handle, &block));
    RequireKnownResult(Zentara_SendSettingsToCam(handle, &block));
}

void RunOnce(FuzzInput input) {
    static const std::vector<ZentaraHandle> handles = OpenHostileCameras(CameraCount);
    const ZentaraHandle handle = handles[input.TakeByte() % handles.size()];
    const std::uint8_t switches = input.TakeByte();
    Zentara_Settings block{};
    TakeBlock(input, switches, handle, &block);
    ReadWholeBlock(handle, &block);
    while (!input.IsEmpty()) CallAccessor(input, handle, &block);
    Zentara_Settings copy = block;
    RequireKnownResult(Zentara_TranslateSettings(handle, &copy));
    SendBlock(switches, handle, &block);
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
