#include <array>
#include <cstdlib>
#include <cstring>
#include <vector>

#include "fuzz/client_calls.h"
#include "fuzz/fuzz_input.h"
#include "fuzz/hostile_cameras.h"

// Frame records that say anything, through the functions that work on frames taken before. A buffer
// is as long as its record's `bufferSize`; it comes from malloc, since a copy may replace it.
// Input: camera, function, switches, algorithm, both records, the settings' words, then pixels.
namespace ZV::Fuzzing {
namespace {

constexpr std::size_t CameraCount = 10;
constexpr std::uint32_t HeldBytesMax = 1 << 17;
constexpr std::uint32_t KeyPostProcessFirst = zprmDoPostProcessing;
constexpr std::uint32_t KeyPostProcessLast = zprmPostProcessImageFormat;

enum Switches : std::uint8_t {
    IsSameRecord = 1,
    SharesBuffer = 2,
    LeavesCamera = 4,  ///< The record names whatever the input says.
    InHasNoBuffer = 8,
    OutHasNoBuffer = 16,
    HasAnySize = 32,      ///< The frames' sides are the input's words and not cut to what is small.
    HasWholeFields = 64,  ///< Every field and setting is as wide in the input as it is in memory.
};

/// A number of which most inputs give the low part alone: that is where the good values are.
template <typename Low, typename Number>
void TakeField(FuzzInput& input, std::uint8_t switches, Number* field) {
    *field = (switches & HasWholeFields) != 0 ? input.Take<Number>() : input.Take<Low>();
}

/// A record's fields in the input's order. Sides that are not cut are rarely of any use.
Zentara_Frame TakeRecord(FuzzInput& input, std::uint8_t switches, ZentaraHandle handle) {
    constexpr std::uint32_t SideMask = 0x7F;
    Zentara_Frame frame{};
    frame.bufferSize = input.TakeWord() % HeldBytesMax;
    TakeField<std::uint8_t>(input, switches, &frame.format);
    frame.width = input.TakeWord();
    frame.height = input.TakeWord();
    if ((switches & HasAnySize) == 0) {
        frame.width &= SideMask;
        frame.height &= SideMask;
    }
    frame.size = input.TakeWord();
    TakeField<std::uint8_t>(input, switches, &frame.bits);
    TakeField<std::uint8_t>(input, switches, &frame.bayerPattern);
    const ZentaraHandle named = (switches & LeavesCamera) != 0 ? input.TakeWide() : handle;
    std::memcpy(frame.privateCamera, &named, sizeof named);
    TakeField<std::uint8_t>(input, switches, &frame.privateBinning);
    TakeField<std::uint8_t>(input, switches, &frame.privateRealTime);
    TakeField<std::uint8_t>(input, switches, &frame.privatePattern);
    TakeField<std::uint8_t>(input, switches, &frame.privateFilled);
    return frame;
}

/// A buffer of what the record says, or, where it says nothing, of as much as anything needs.
void GiveBuffer(Zentara_Frame& frame, std::span<const std::uint8_t> pixels) {
    constexpr std::uint32_t Plenty = 1 << 20;
    const std::size_t held = frame.bufferSize != 0 ? frame.bufferSize : Plenty;
    auto* const buffer = static_cast<std::uint8_t*>(std::malloc(held));
    Require(buffer != nullptr);
    std::memset(buffer, 0x5A, held);
    if (!pixels.empty()) std::memcpy(buffer, pixels.data(), std::min(held, pixels.size()));
    frame.pBuffer = buffer;
}

/// Two records and the buffers that they have at the time.
class Frames {
  public:
    Frames(FuzzInput& input, std::uint8_t recordSwitches, ZentaraHandle handle)
        : switches(recordSwitches),
          in(TakeRecord(input, switches, handle)),
          out(TakeRecord(input, switches, handle)) {}

    ~Frames() {
        void* const inBuffer = in.pBuffer;
        void* const outBuffer = out.pBuffer;
        // A copy frees the buffer that it replaces.
        const bool isInFreed = isShared && outBuffer != inBuffer;
        if (!isInFreed) std::free(inBuffer);
        if (outBuffer != inBuffer) std::free(outBuffer);
    }
    Frames(const Frames&) = delete;
    Frames& operator=(const Frames&) = delete;

    void GiveBuffers(FuzzInput& input) {
        const std::span<const std::uint8_t> pixels = input.TakeRest();
        if ((switches & InHasNoBuffer) == 0) GiveBuffer(in, pixels);
        if ((switches & IsSameRecord) != 0) return;
        isShared = (switches & SharesBuffer) != 0 && in.pBuffer != nullptr;
        if (isShared) {
            out.pBuffer = in.pBuffer;
            out.bufferSize = in.bufferSize;
        } else if ((switches & OutHasNoBuffer) == 0) {
            GiveBuffer(out, {});
        }
    }

    const Zentara_Frame* GetIn() const { return &in; }
    Zentara_Frame* GetOut() { return (switches & IsSameRecord) != 0 ? &in : &out; }

  private:
    const std::uint8_t switches;
    Zentara_Frame in, out;
    bool isShared = false;
};

Zentara_Settings TakeSettings(FuzzInput& input, std::uint8_t switches, ZentaraHandle handle) {
    Zentara_Settings block{};
    (void)Zentara_ReadDefaultSettings(handle, &block);
    for (std::uint32_t key = KeyPostProcessFirst; key <= KeyPostProcessLast; ++key) {
        std::uint32_t value = 0;
        TakeField<std::uint16_t>(input, switches, &value);
        (void)Zentara_SetParam(&block, key, value);
    }
    return block;
}

/// Where nothing is said of a buffer, the client vouches for it: only for frames that it can hold.
bool CanVouch(const Zentara_Frame& frame) {
    constexpr std::uint64_t PixelsMax = 1 << 16;
    constexpr std::uint64_t BytesMax = 1 << 20;
    return frame.bufferSize != 0 ||
           (std::uint64_t{frame.width} * frame.height <= PixelsMax && frame.size <= BytesMax);
}

void AskHelpers(const Zentara_Frame& frame) {
    Require(Zentara_is16bit(frame.format) <= 1 && Zentara_is3Color(frame.format) <= 1);
    Require(Zentara_isBayer(frame.format) <= 1 && Zentara_isColor(frame.format) <= 1);
    Require(Zentara_isMonochrome(frame.format) <= 1);
    const std::uint64_t size = Zentara_CalcImageSize(frame.format, frame.width, frame.height);
    Require(frame.format <= zfmtRGB24 || size == 0);
}

void RunOnce(FuzzInput input) {
    static const std::vector<ZentaraHandle> handles = OpenHostileCameras(CameraCount);
    const ZentaraHandle handle = handles[input.TakeByte() % handles.size()];
    const std::uint8_t function = input.TakeByte() % 3;
    const std::uint8_t switches = input.TakeByte();
    const std::uint8_t algorithm = input.TakeByte();
    Frames frames(input, switches, handle);
    if (!CanVouch(*frames.GetIn()) || !CanVouch(*frames.GetOut())) return;
    Zentara_Settings block = TakeSettings(input, switches, handle);
    frames.GiveBuffers(input);
    AskHelpers(*frames.GetIn());
    ZentaraResult result = zerrNone;
    if (function == 0) {
        result = Zentara_PostProcessSingleFrame(handle, &block, frames.GetIn(), frames.GetOut());
    } else if (function == 1) {
        result = Zentara_BayerToRgb(algorithm, frames.GetIn(), frames.GetOut());
    } else {
        result = Zentara_BayerZoomVert(algorithm, frames.GetIn(), frames.GetOut());
    }
    RequireKnownResult(result);
}

}  // namespace
}  // namespace ZV::Fuzzing

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    ZV::Fuzzing::RunOnce(ZV::Fuzzing::FuzzInput(data, size));
    return 0;
}
