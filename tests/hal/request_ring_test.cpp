#include "hal/request_ring.h"

#include <gtest/gtest.h>

#include "hal/fw_camera_records.h"
#include "hal/fw_device_context.h"

namespace ZV::Test {
namespace {

constexpr std::uint16_t Stride = 64;

/// A ring without a device. A packet's header words are reversed in place as soon as the assembler
/// gets it, so that the first two bytes tell whether it did.
struct ParsedRing : testing::Test {
    ParsedRing() {
        context.packetStride = Stride;
        context.assembler.StartStream(1);
        ring = MakeRequestRing(&context);
    }

    std::uint8_t* GetPacket(std::size_t packet) {
        return ring->requests[0].buffer + packet * Stride;
    }
    void PutPacket(std::size_t packet, std::uint16_t dataLength) {
        std::uint8_t* const slot = GetPacket(packet);
        slot[PacketLengthOffset] = static_cast<std::uint8_t>(dataLength);
        slot[PacketLengthOffset + 1] = static_cast<std::uint8_t>(dataLength >> 8);
        slot[PacketPayloadOffset] = 0x00;
        slot[PacketPayloadOffset + 1] = 0x77;
    }
    bool WasParsed(std::size_t packet) {
        const std::uint8_t* const payload = GetPacket(packet) + PacketPayloadOffset;
        return payload[0] == 0x77 && payload[1] == 0x00;
    }

    FWDeviceContext context;
    std::unique_ptr<RequestRing> ring;
};

TEST_F(ParsedRing, HasSixtySlotsWithABufferOfTheirOwn) {
    ASSERT_NE(nullptr, ring);

    ASSERT_EQ(60u, ring->requests.size());
    for (std::uint32_t i = 0; i < 60; ++i) {
        EXPECT_EQ(i, ring->requests[i].index);
        EXPECT_EQ(1, ring->requests[i].active);
        EXPECT_NE(nullptr, ring->requests[i].buffer);
        EXPECT_EQ(&context.assembler, ring->requests[i].assembler);
    }
    EXPECT_EQ(30u * Stride, GetRequestBufferBytes(Stride));
}

TEST_F(ParsedRing, PacketsOf13BytesToTheWholeStrideReachTheAssembler) {
    PutPacket(0, 12);
    PutPacket(1, 13);
    PutPacket(2, Stride);
    PutPacket(3, Stride + 1);
    PutPacket(4, 0);
    PutPacket(5, 0x0D00);

    ParseRequest(*ring, ring->requests[0]);

    EXPECT_FALSE(WasParsed(0));
    EXPECT_TRUE(WasParsed(1));
    EXPECT_TRUE(WasParsed(2));
    EXPECT_FALSE(WasParsed(3));
    EXPECT_FALSE(WasParsed(4));
    EXPECT_FALSE(WasParsed(5));
}

TEST_F(ParsedRing, TheLastPacketMayReachEightBytesBeyondWhatTheDriverKnows) {
    PutPacket(PacketsPerRequest - 1, Stride);

    ParseRequest(*ring, ring->requests[0]);

    EXPECT_TRUE(WasParsed(PacketsPerRequest - 1));
}

TEST(RequestRing, AStrideThatWrappedTo16BitsIsSafe) {
    for (const std::uint16_t stride : {std::uint16_t{0}, std::uint16_t{6}}) {
        FWDeviceContext context;
        context.packetStride = stride;
        const std::unique_ptr<RequestRing> ring = MakeRequestRing(&context);
        ASSERT_NE(nullptr, ring);

        ParseRequest(*ring, ring->requests[0]);
    }
}

}  // namespace
}  // namespace ZV::Test
