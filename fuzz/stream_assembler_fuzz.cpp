#include <array>
#include <cstring>
#include <memory>
#include <vector>

#include "fuzz/fuzz_input.h"
#include "hal/frame_info.h"
#include "hal/request_ring.h"
#include "hal/stream_assembler.h"
#include "hal/stream_format.h"

// Whole request buffers as a hostile camera or driver could fill them, for frames of all layouts.
// The same input runs twice, over buffers that held different bytes before: a frame that is handed
// back may not show them. Input: the stream, the frames, then requests.
namespace ZV::Fuzzing {
namespace {

constexpr std::size_t FramesMax = 8;
constexpr std::uint32_t StatusLast = FrameRefused;
/// Two blocks of the largest size, 1024 bytes, fit a payload.
constexpr std::uint16_t StrideMax = 2200;
constexpr std::uint16_t FreeLengthMax = 4096;

/// What the camera is set to, and how the driver behaves.
struct StreamPlan {
    std::uint8_t version, layout, psn, frames, refusedFrame, switches;
    std::uint16_t bytesExpected, rowBytes, stride;
    std::uint32_t bufferSize;
    std::uint8_t overwriteByte;
};

enum Switches : std::uint8_t {
    IsInterlaced = 1,
    HasNoBuffer = 2,
    RefusesOne = 4,        ///< The camera gives null for one frame that it has peeked.
    OverwritesAtDone = 8,  ///< The driver changes the packet's head while a frame is handed back.
    HasOddSize = 16,       ///< The buffer's size has nothing to do with what is expected.
    HasFreeLengths = 32,   ///< Packets of any length, one after the other, in place of slots.
};

StreamPlan TakePlan(FuzzInput& input) {
    StreamPlan plan{};
    plan.version = input.TakeByte() % 4;
    plan.layout = input.TakeByte() % 9;
    plan.switches = input.TakeByte();
    plan.psn = input.TakeByte();
    plan.frames = input.TakeByte() % (FramesMax + 1);
    plan.refusedFrame = input.TakeByte() % FramesMax;
    plan.overwriteByte = input.TakeByte();
    plan.bytesExpected = input.TakeShort();
    plan.rowBytes = input.TakeShort();
    plan.stride = input.TakeShort() % StrideMax;
    const std::uint32_t fields = (plan.switches & IsInterlaced) != 0 ? 2 : 1;
    const std::uint32_t planes = plan.layout == 0 ? 1 : 4;
    plan.bufferSize = (plan.switches & HasOddSize) != 0 ? input.TakeShort()
                                                        : plan.bytesExpected * fields * planes;
    return plan;
}

std::uint64_t MixBytes(std::uint64_t sum, const std::uint8_t* bytes, std::size_t count) {
    constexpr std::uint64_t Prime = 0x100000001B3;
    for (std::size_t at = 0; at < count; ++at) sum = (sum ^ bytes[at]) * Prime;
    return sum;
}

/// The camera of one run. Its buffers are as long as their records say and not a byte longer.
class HostileCamera {
  public:
    HostileCamera(const StreamPlan& streamPlan, std::uint8_t heldBefore) : plan(streamPlan) {
        for (std::size_t frame = 0; frame < plan.frames; ++frame) MakeFrame(frame, heldBefore);
        assembler.SetCallbacks(&GetNewFrame, &PeekNewFrame, &ImageDone, &Overrun, this);
        assembler.StartStream(plan.version);
    }

    void Parse(std::uint8_t* payload, std::uint32_t length) {
        livePayload = length > 0 ? payload : nullptr;
        assembler.ParsePacket(payload, length);
        livePayload = nullptr;
    }

    StreamAssembler& GetAssembler() { return assembler; }

    /// A stop, and what the frames then are.
    std::uint64_t Finish() {
        assembler.AbandonFrame();
        for (std::size_t frame = 0; frame < plan.frames; ++frame) Require(!infos[frame].isHeld);
        return seen;
    }

  private:
    static HostileCamera& From(void* context) { return *static_cast<HostileCamera*>(context); }

    void MakeFrame(std::size_t frame, std::uint8_t heldBefore) {
        tStFrameInfo& info = infos[frame];
        const bool hasBuffer = (plan.switches & HasNoBuffer) == 0;
        if (hasBuffer) {
            buffers[frame] = std::make_unique<std::uint8_t[]>(plan.bufferSize);
            std::memset(buffers[frame].get(), heldBefore, plan.bufferSize);
        }
        info.buffer = buffers[frame].get();
        info.bufferSize = plan.bufferSize;
        info.bytesExpected = plan.bytesExpected;
        info.psn = plan.psn;
        info.fieldIndex = plan.layout;
        info.interlaced = (plan.switches & IsInterlaced) != 0;
        info.rowBytes = plan.rowBytes;
    }

    tStFrameInfo* Front() { return next < plan.frames ? &infos[next] : nullptr; }

    static tStFrameInfo* PeekNewFrame(void* context) {
        tStFrameInfo* const front = From(context).Front();
        if (front != nullptr) front->isHeld = true;
        return front;
    }

    static tStFrameInfo* GetNewFrame(void* context) {
        HostileCamera& self = From(context);
        const bool isRefused =
            (self.plan.switches & RefusesOne) != 0 && self.next == self.plan.refusedFrame;
        if (!isRefused) return self.Front();
        ++self.next;
        return nullptr;
    }

    static void ImageDone(void* context) {
        HostileCamera& self = From(context);
        tStFrameInfo* const front = self.Front();
        Require(front != nullptr && !front->isHeld);
        Require(front->frameStatus <= StatusLast);
        self.Remember(*front);
        ++self.next;
        const bool overwrites = (self.plan.switches & OverwritesAtDone) != 0;
        if (overwrites && self.livePayload != nullptr) *self.livePayload = self.plan.overwriteByte;
    }

    static void Overrun(void* context) { ++From(context).next; }

    void Remember(const tStFrameInfo& info) {
        const std::array<std::uint32_t, 4> words{info.frameStatus, info.rollingFrameNumber,
                                                 info.timestamp, info.colourPattern};
        seen = MixBytes(seen, reinterpret_cast<const std::uint8_t*>(words.data()), sizeof words);
        if (info.buffer != nullptr) seen = MixBytes(seen, info.buffer, info.bufferSize);
    }

    const StreamPlan plan;
    StreamAssembler assembler;
    std::array<tStFrameInfo, FramesMax> infos;
    std::array<std::unique_ptr<std::uint8_t[]>, FramesMax> buffers;
    std::size_t next = 0;
    std::uint8_t* livePayload = nullptr;
    std::uint64_t seen = 0;
};

/// Packets in memory of exactly their length.
void FeedFreeLengths(FuzzInput input, HostileCamera& camera) {
    while (!input.IsEmpty()) {
        const std::span<const std::uint8_t> bytes =
            input.TakeBytes(input.TakeShort() % FreeLengthMax);
        const auto payload = std::make_unique<std::uint8_t[]>(bytes.size());
        std::copy(bytes.begin(), bytes.end(), payload.get());
        camera.Parse(payload.get(), static_cast<std::uint32_t>(bytes.size()));
    }
}

/// Requests as the callback loop takes them in.
void FeedRequests(FuzzInput input, std::uint16_t stride, HostileCamera& camera) {
    constexpr std::size_t RoomBehind = 8;  // that the ring's buffers have
    RequestRing ring;
    ring.packetStride = stride;
    IsochRequestSlot slot;
    slot.assembler = &camera.GetAssembler();
    while (!input.IsEmpty()) {
        const std::size_t count = std::max<std::size_t>(stride, 1) * PacketsPerRequest;
        const auto request = std::make_unique<std::uint8_t[]>(count + RoomBehind);
        const std::span<const std::uint8_t> bytes = input.TakeBytes(count);
        std::copy(bytes.begin(), bytes.end(), request.get());
        slot.buffer = request.get();
        ParseRequest(ring, slot);
    }
}

std::uint64_t Run(FuzzInput input, const StreamPlan& plan, std::uint8_t heldBefore) {
    HostileCamera camera(plan, heldBefore);
    const bool hasFreeLengths = (plan.switches & HasFreeLengths) != 0;
    if (hasFreeLengths) FeedFreeLengths(input, camera);
    if (!hasFreeLengths) FeedRequests(input, plan.stride, camera);
    return camera.Finish();
}

void RunOnce(FuzzInput input) {
    const StreamPlan plan = TakePlan(input);
    Require(Run(input, plan, 0x00) == Run(input, plan, 0xFF));
}

}  // namespace
}  // namespace ZV::Fuzzing

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    ZV::Fuzzing::RunOnce(ZV::Fuzzing::FuzzInput(data, size));
    return 0;
}
