#pragma once

#include <cstddef>
#include <cstdint>

#include "hal/control_records.h"

/// The making of the control records. Pure functions; every byte that has no value is 0.
namespace ZV {

/// Input of a read of `quadlets` quadlets at the low 32 bits `address` of the bus offset.
AsyncReadRecord MakeAsyncReadRecord(std::uint32_t address, std::uint32_t quadlets);

/// Input length of a write of `quadlets` quadlets.
constexpr std::uint64_t GetAsyncWriteBytes(std::uint32_t quadlets) {
    return std::uint64_t{quadlets} * 4 + AsyncWriteExtraBytes;
}

/// Fills the GetAsyncWriteBytes(`quadlets`) bytes of `record` with a write of the host-order
/// quadlets of `data`, which go out in bus order.
void FillAsyncWriteRecord(std::uint8_t* record, std::uint32_t address, const std::uint32_t* data,
                          std::uint32_t quadlets);

AllocateBandwidthRecord MakeAllocateBandwidthRecord(std::uint16_t packetStride);
AllocateChannelRecord MakeAllocateChannelRecord();
AllocateResourcesRecord MakeAllocateResourcesRecord(std::uint32_t speed, std::uint32_t channel,
                                                    std::uint16_t packetStride,
                                                    std::uint16_t tagCode);
StreamSwitchRecord MakeStreamSwitchRecord(std::uint64_t resourceHandle);

/// Length of a request buffer as the driver is told it.
constexpr std::uint32_t GetRequestBufferBytes(std::uint16_t packetStride) {
    return std::uint32_t{packetStride} * 30;
}

/// Reverses the bytes of each of `quadlets` quadlets in place; no alignment is needed.
void ReverseQuadlets(void* data, std::uint32_t quadlets);

}  // namespace ZV
