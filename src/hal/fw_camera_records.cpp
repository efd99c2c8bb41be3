#include "hal/fw_camera_records.h"

#include <algorithm>
#include <cstring>

#include "hal/stream_format.h"

namespace ZV {

static_assert(GetRequestBufferBytes(1) == PacketsPerRequest);

AsyncReadRecord MakeAsyncReadRecord(std::uint32_t address, std::uint32_t quadlets) {
    AsyncReadRecord record{};
    record.getGeneration = 1;
    record.destinationNode = AsyncDestinationNode;
    record.offsetHigh = AsyncOffsetHigh;
    record.offsetLow = address;
    record.bytes = quadlets * 4;
    return record;
}

void FillAsyncWriteRecord(std::uint8_t* record, std::uint32_t address, const std::uint32_t* data,
                          std::uint32_t quadlets) {
    const AsyncReadRecord head = MakeAsyncReadRecord(address, quadlets);
    const std::size_t dataBytes = std::size_t{quadlets} * 4;
    std::memcpy(record, &head, AsyncWriteDataOffset);
    if (quadlets != 0) std::memcpy(record + AsyncWriteDataOffset, data, dataBytes);
    ReverseQuadlets(record + AsyncWriteDataOffset, quadlets);
    std::memset(record + AsyncWriteDataOffset + dataBytes, 0,
                AsyncWriteExtraBytes - AsyncWriteDataOffset);
}

AllocateBandwidthRecord MakeAllocateBandwidthRecord(std::uint16_t packetStride) {
    AllocateBandwidthRecord record{};
    record.maximumBytesPerFrame = packetStride;
    record.speed = SpeedFlagS800;
    return record;
}

AllocateChannelRecord MakeAllocateChannelRecord() {
    AllocateChannelRecord record{};
    record.requestedChannel = AnyChannel;
    return record;
}

AllocateResourcesRecord MakeAllocateResourcesRecord(std::uint32_t speed, std::uint32_t channel,
                                                    std::uint16_t packetStride,
                                                    std::uint16_t tagCode) {
    AllocateResourcesRecord record{};
    record.speed = speed;
    record.flags = ResourceFlagsListen;
    record.channel = channel;
    record.maximumBytesPerFrame = packetStride;
    record.bufferCount = AnnouncedBufferCount;
    record.maximumBufferSize = GetRequestBufferBytes(packetStride);
    record.tagCode = tagCode;
    return record;
}

StreamSwitchRecord MakeStreamSwitchRecord(std::uint64_t resourceHandle) {
    return StreamSwitchRecord{resourceHandle, 0};
}

void ReverseQuadlets(void* data, std::uint32_t quadlets) {
    auto* bytes = static_cast<std::uint8_t*>(data);
    for (std::uint32_t i = 0; i < quadlets; ++i, bytes += 4) std::reverse(bytes, bytes + 4);
}

}  // namespace ZV
