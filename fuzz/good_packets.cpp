#include "fuzz/good_packets.h"

#include <algorithm>
#include <cstring>
#include <utility>

#include "fuzz/hostile_cameras.h"
#include "fuzz/hostile_driver.h"
#include "hal/stream_format.h"

namespace ZV::Fuzzing {
namespace {

using Simulation::BlockName;
using Simulation::OutgoingFrame;

void RepeatBytes(std::span<const std::uint8_t> bytes, std::span<std::uint8_t> buffer) {
    for (std::size_t at = 0; at < buffer.size() && !bytes.empty(); at += bytes.size()) {
        const std::size_t count = std::min(bytes.size(), buffer.size() - at);
        std::memcpy(buffer.data() + at, bytes.data(), count);
    }
}

OutgoingFrame MakeFrame(std::size_t camera, std::uint8_t form, std::uint8_t frameNumber,
                        std::span<const std::uint8_t> bytes) {
    constexpr std::uint8_t BitsOfByte = 7, BitsOfWord = 15;
    constexpr std::uint8_t PatternBase = 4;
    const bool hasWideSamples = (form & HasWideSamples) != 0;
    OutgoingFrame frame;
    frame.rowBytes = HostileSensorWidth * (hasWideSamples ? 2 : 1);
    frame.pixels.resize(std::size_t{frame.rowBytes} * HostileSensorHeight);
    RepeatBytes(bytes, frame.pixels);
    frame.isInterlaced = (form & HasTwoFields) != 0;
    frame.frameNumber = frameNumber;
    frame.rollingFrameNumber = frameNumber;
    frame.psn = static_cast<std::uint8_t>(GetRegister(camera, BlockName::Control, 1) >> 24);
    const auto pattern = static_cast<std::uint8_t>(form / FirstPatternBit);
    frame.plane = pattern != 0 ? static_cast<std::uint8_t>(PatternBase + pattern) : pattern;
    frame.sampleBits = hasWideSamples ? BitsOfWord : BitsOfByte;
    return frame;
}

}  // namespace

bool GoodPackets::Deliver(std::uint8_t form, std::uint8_t frameNumber,
                          std::span<const std::uint8_t> bytes) {
    return DeliverRequest(camera, [&](std::span<std::uint8_t> buffer) {
        RepeatBytes(bytes, buffer);
        if ((form & HasGoodPackets) != 0) Fill(buffer, form, frameNumber, bytes);
    });
}

void GoodPackets::Fill(std::span<std::uint8_t> buffer, std::uint8_t form, std::uint8_t frameNumber,
                       std::span<const std::uint8_t> bytes) {
    PrepareStream((form & HasBlocks) != 0 ? 0 : 1, GetPacketStride(camera));
    if (!stream) return;
    if ((form & StartsFrame) != 0) stream->Begin(MakeFrame(camera, form, frameNumber, bytes));
    for (std::size_t at = 0; at + stride <= buffer.size(); at += stride) {
        std::uint8_t* const slot = buffer.data() + at;
        std::uint32_t length = stream->Next(slot + PacketPayloadOffset);
        if (length == 0) length = stream->Idle(slot + PacketPayloadOffset);
        slot[PacketLengthOffset] = static_cast<std::uint8_t>(length);
        slot[PacketLengthOffset + 1] = static_cast<std::uint8_t>(length >> 8);
    }
}

void GoodPackets::PrepareStream(std::uint32_t newVersion, std::uint32_t newStride) {
    if (stream && version == newVersion && stride == newStride) return;
    version = newVersion;
    stride = newStride;
    stream.reset();
    if (stride < PacketSlotExtraBytes + Simulation::PacketStream::PayloadBytesMin) return;
    stream.emplace(version, static_cast<std::uint32_t>(stride - PacketSlotExtraBytes));
}

}  // namespace ZV::Fuzzing
