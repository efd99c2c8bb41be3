#pragma once

#include <cstddef>
#include <cstdint>

/// Records and codes of the kernel driver's control requests. Library, simulation, tests and fuzz
/// targets all read them here. All fields are little-endian; unset fields are 0.
namespace ZV {

/// Control code of device type 0x22 from its function, method (0 buffered, 2 direct output) and
/// access (0 any, 2 write).
constexpr std::uint32_t MakeControlCode(std::uint32_t function, std::uint32_t method,
                                        std::uint32_t access) {
    return (0x22u << 16) | (access << 14) | (function << 2) | method;
}

inline constexpr std::uint32_t FW_IOCTL_ASYNC_READ = MakeControlCode(0x81E, 2, 0);
inline constexpr std::uint32_t FW_IOCTL_ASYNC_WRITE = MakeControlCode(0x81F, 0, 2);
inline constexpr std::uint32_t FW_IOCTL_NOTIFY_ENABLE = MakeControlCode(0x820, 0, 2);
inline constexpr std::uint32_t FW_IOCTL_STREAM_ENTER = MakeControlCode(0x821, 0, 2);
inline constexpr std::uint32_t FW_IOCTL_NOTIFY_WAIT = MakeControlCode(0x822, 2, 2);
inline constexpr std::uint32_t FW_IOCTL_NOTIFY_DISABLE = MakeControlCode(0x823, 0, 2);
inline constexpr std::uint32_t FW_IOCTL_STREAM_LEAVE = MakeControlCode(0x824, 0, 2);
inline constexpr std::uint32_t FW_IOCTL_QUERY_BUSY = MakeControlCode(0x825, 2, 0);
inline constexpr std::uint32_t FW_IOCTL_ALLOC_BANDWIDTH = MakeControlCode(0x828, 0, 2);
inline constexpr std::uint32_t FW_IOCTL_FREE_BANDWIDTH = MakeControlCode(0x829, 0, 2);
inline constexpr std::uint32_t FW_IOCTL_ALLOC_CHANNEL = MakeControlCode(0x82A, 0, 2);
inline constexpr std::uint32_t FW_IOCTL_FREE_CHANNEL = MakeControlCode(0x82B, 0, 2);
inline constexpr std::uint32_t FW_IOCTL_ALLOC_RESOURCES = MakeControlCode(0x82C, 0, 2);
inline constexpr std::uint32_t FW_IOCTL_FREE_RESOURCES = MakeControlCode(0x82D, 0, 2);
inline constexpr std::uint32_t FW_IOCTL_ATTACH_BUFFER = MakeControlCode(0x82E, 2, 2);
inline constexpr std::uint32_t FW_IOCTL_DETACH_BUFFERS = MakeControlCode(0x82F, 0, 2);
inline constexpr std::uint32_t FW_IOCTL_LISTEN = MakeControlCode(0x830, 0, 2);
inline constexpr std::uint32_t FW_IOCTL_STOP = MakeControlCode(0x831, 0, 2);

static_assert(FW_IOCTL_ASYNC_READ == 0x22207A && FW_IOCTL_ASYNC_WRITE == 0x22A07C);
static_assert(FW_IOCTL_QUERY_BUSY == 0x222096 && FW_IOCTL_ATTACH_BUFFER == 0x22A0BA);
static_assert(FW_IOCTL_STOP == 0x22A0C4);

/// Code and name of each request, in the order of the codes' functions, for traces.
struct ControlCodeName {
    std::uint32_t code;
    const char* name;
};
inline constexpr ControlCodeName ControlCodeNames[] = {
    {FW_IOCTL_ASYNC_READ, "FW_IOCTL_ASYNC_READ"},
    {FW_IOCTL_ASYNC_WRITE, "FW_IOCTL_ASYNC_WRITE"},
    {FW_IOCTL_NOTIFY_ENABLE, "FW_IOCTL_NOTIFY_ENABLE"},
    {FW_IOCTL_STREAM_ENTER, "FW_IOCTL_STREAM_ENTER"},
    {FW_IOCTL_NOTIFY_WAIT, "FW_IOCTL_NOTIFY_WAIT"},
    {FW_IOCTL_NOTIFY_DISABLE, "FW_IOCTL_NOTIFY_DISABLE"},
    {FW_IOCTL_STREAM_LEAVE, "FW_IOCTL_STREAM_LEAVE"},
    {FW_IOCTL_QUERY_BUSY, "FW_IOCTL_QUERY_BUSY"},
    {FW_IOCTL_ALLOC_BANDWIDTH, "FW_IOCTL_ALLOC_BANDWIDTH"},
    {FW_IOCTL_FREE_BANDWIDTH, "FW_IOCTL_FREE_BANDWIDTH"},
    {FW_IOCTL_ALLOC_CHANNEL, "FW_IOCTL_ALLOC_CHANNEL"},
    {FW_IOCTL_FREE_CHANNEL, "FW_IOCTL_FREE_CHANNEL"},
    {FW_IOCTL_ALLOC_RESOURCES, "FW_IOCTL_ALLOC_RESOURCES"},
    {FW_IOCTL_FREE_RESOURCES, "FW_IOCTL_FREE_RESOURCES"},
    {FW_IOCTL_ATTACH_BUFFER, "FW_IOCTL_ATTACH_BUFFER"},
    {FW_IOCTL_DETACH_BUFFERS, "FW_IOCTL_DETACH_BUFFERS"},
    {FW_IOCTL_LISTEN, "FW_IOCTL_LISTEN"},
    {FW_IOCTL_STOP, "FW_IOCTL_STOP"},
};

/// The driver addresses the device it is bound to: bus 0x3FF, node 0.
inline constexpr std::uint16_t AsyncDestinationNode = 0xFFC0;
/// Upper 16 bits of every 48-bit destination offset.
inline constexpr std::uint16_t AsyncOffsetHigh = 0xFFFF;

/// Input of FW_IOCTL_ASYNC_READ. The data arrive in the output buffer, quadlets in bus order.
struct AsyncReadRecord {
    std::uint32_t rawMode;
    std::uint32_t getGeneration;  ///< 1: the driver supplies the bus generation.
    std::uint16_t destinationNode;
    std::uint16_t unset10;
    std::uint16_t offsetHigh;
    std::uint16_t unset14;
    std::uint32_t offsetLow;  ///< Register address.
    std::uint32_t bytes;      ///< 4 times the quadlets.
    std::uint32_t blockSize;
    std::uint32_t flags;
    std::uint32_t generation;
    std::uint32_t unset36[3];
};
static_assert(sizeof(AsyncReadRecord) == 48 && offsetof(AsyncReadRecord, offsetLow) == 16);

/// Head of the input of FW_IOCTL_ASYNC_WRITE: bytes 0 to 35 of the read's record, then the data.
inline constexpr std::size_t AsyncWriteDataOffset = 36;
/// Input length of a write beyond its data: the record carries 4 bytes behind them.
inline constexpr std::size_t AsyncWriteExtraBytes = 40;
static_assert(offsetof(AsyncReadRecord, unset36) == AsyncWriteDataOffset);

/// Bus speed flags.
inline constexpr std::uint32_t SpeedFlagS400 = 4;
inline constexpr std::uint32_t SpeedFlagS800 = 8;

struct AllocateBandwidthRecord {
    std::uint32_t maximumBytesPerFrame;
    std::uint32_t speed;
    std::uint64_t bandwidthHandle;         ///< Out.
    std::uint32_t bytesPerFrameAvailable;  ///< Out.
    std::uint32_t speedSelected;           ///< Out.
};
static_assert(sizeof(AllocateBandwidthRecord) == 24);

inline constexpr std::uint32_t AnyChannel = 0xFFFFFFFF;

struct AllocateChannelRecord {
    std::uint32_t requestedChannel;
    std::uint32_t channel;            ///< Out.
    std::uint64_t channelsAvailable;  ///< Out: bit n is channel n.
};
static_assert(sizeof(AllocateChannelRecord) == 16);

/// Resource flags: listening, packet based.
inline constexpr std::uint32_t ResourceFlagsListen = 0x41;

struct AllocateResourcesRecord {
    std::uint32_t speed;
    std::uint32_t flags;
    std::uint32_t channel;
    std::uint32_t maximumBytesPerFrame;
    std::uint32_t bufferCount;
    std::uint32_t maximumBufferSize;
    std::uint32_t quadletsToStrip;
    std::uint32_t tagCode;
    std::uint64_t resourceHandle;  ///< Out.
};
static_assert(sizeof(AllocateResourcesRecord) == 40);

/// Input and output of FW_IOCTL_LISTEN and FW_IOCTL_STOP.
struct StreamSwitchRecord {
    std::uint64_t resourceHandle;
    std::uint64_t unset8;
};
static_assert(sizeof(StreamSwitchRecord) == 16);

inline constexpr std::size_t HandleRecordBytes =
    8;  ///< Free bandwidth, free resources, detach buffers.
inline constexpr std::size_t ChannelRecordBytes = 4;  ///< Free channel.
inline constexpr std::size_t PlainRecordBytes =
    4;  ///< Enter, leave, notify enable and disable, busy.
inline constexpr std::size_t NotifyRecordBytes = 2056;

/// Answer of FW_IOCTL_QUERY_BUSY for a device that is held by another open handle.
inline constexpr std::uint32_t DeviceIsBusy = 1;

}  // namespace ZV
