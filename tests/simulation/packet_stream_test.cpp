#include "simulation/packet_stream.h"

#include <gtest/gtest.h>

#include <numeric>
#include <utility>

namespace ZV::Simulation {
namespace {

using Bytes = std::vector<std::uint8_t>;

Bytes CountUp(std::size_t count) {
    Bytes bytes(count);
    std::iota(bytes.begin(), bytes.end(), std::uint8_t{1});
    return bytes;
}

OutgoingFrame MakeFrame(std::size_t rows, std::uint32_t rowBytes) {
    OutgoingFrame frame;
    frame.pixels = CountUp(rows * rowBytes);
    frame.rowBytes = rowBytes;
    frame.rollingFrameNumber = 0x11223;
    frame.frameNumber = 0x77;
    frame.psn = 0x42;
    frame.timestamp = 0x01020304;
    frame.plane = 5;
    frame.sampleBits = 11;
    return frame;
}

/// Payloads of the frame, each checked against the room behind it.
std::vector<Bytes> SendFrame(PacketStream* stream, OutgoingFrame frame,
                             std::uint32_t payloadBytes) {
    constexpr std::uint8_t Guard = 0xC3;
    std::vector<Bytes> payloads;
    stream->Begin(std::move(frame));
    while (!stream->IsFinished()) {
        Bytes payload(payloadBytes + 8, Guard);
        const std::uint32_t length = stream->Next(payload.data());
        EXPECT_GT(length, 0U);
        EXPECT_LE(length, payloadBytes);
        for (std::size_t i = payloadBytes; i < payload.size(); ++i) EXPECT_EQ(Guard, payload[i]);
        payload.resize(length);
        payloads.push_back(std::move(payload));
    }
    return payloads;
}

Bytes CollectPlain(const std::vector<Bytes>& payloads) {
    Bytes image;
    for (const Bytes& payload : payloads) {
        const std::size_t start = (payload[0] & 2) != 0 ? 20 : 8;
        image.insert(image.end(), payload.begin() + static_cast<std::ptrdiff_t>(start),
                     payload.end() - 4);
    }
    return image;
}

TEST(PacketStreamTest, TheFirstPlainPacketIsSpelledOutByteForByte) {
    PacketStream stream(1, 28);

    const auto payloads = SendFrame(&stream, MakeFrame(1, 4), 28);

    const Bytes expected = {
        0x02, 0x01, 0x00, 0x77, 0x00, 0x00, 0x00, 0x00,              // First packet, mark, number.
        0x12, 0x23,                                                  // Rolling frame number.
        0x42, 0x05,                                                  // Parameter set, plane.
        0x01, 0x02, 0x03, 0x04,                                      // Timestamp.
        0x0B, 0x01,                                                  // Sample bits, field.
        0x00, 0x00, 0x01, 0x02, 0x03, 0x04, 0xAA, 0xAA, 0xAA, 0xAA,  // Image, tail mark.
    };
    ASSERT_EQ(1U, payloads.size());
    EXPECT_EQ(expected, payloads[0]);
}

TEST(PacketStreamTest, AFollowingPlainPacketIsSpelledOutByteForByte) {
    PacketStream stream(2, 28);

    const auto payloads = SendFrame(&stream, MakeFrame(1, 7), 28);

    const Bytes expected = {0x00, 0x01, 0x00, 0x77, 0x00, 0x00, 0x00, 0x04,
                            0x05, 0x06, 0x07, 0xAA, 0xAA, 0xAA, 0xAA};
    ASSERT_EQ(2U, payloads.size());
    EXPECT_EQ(expected, payloads[1]);
}

TEST(PacketStreamTest, PlainPacketsCarryTheWholeImageInOrder) {
    for (const std::uint32_t payloadBytes : {28U, 31U, 100U, 4096U}) {
        PacketStream stream(1, payloadBytes);
        const OutgoingFrame frame = MakeFrame(13, 37);
        const Bytes pixels = frame.pixels;

        EXPECT_EQ(pixels, CollectPlain(SendFrame(&stream, frame, payloadBytes))) << payloadBytes;
    }
}

TEST(PacketStreamTest, OffsetsOnTheBusHave24Bits) {
    constexpr std::uint32_t PayloadBytes = 8192;
    PacketStream stream(1, PayloadBytes);
    OutgoingFrame frame;
    frame.pixels.resize((1U << 24) + 3 * PayloadBytes);
    std::uint64_t expected = 0;

    stream.Begin(std::move(frame));
    Bytes payload(PayloadBytes);
    while (!stream.IsFinished()) {
        const std::uint32_t length = stream.Next(payload.data());
        const std::uint32_t offset =
            std::uint32_t{payload[5]} << 16 | std::uint32_t{payload[6]} << 8 | payload[7];
        ASSERT_EQ(expected & 0xFFFFFF, offset);
        expected += length - ((payload[0] & 2) != 0 ? 24 : 12);
    }

    EXPECT_EQ((1U << 24) + 3 * PayloadBytes, expected);
}

TEST(PacketStreamTest, TheFirstFieldHoldsTheEvenRowsAndTheSecondTheOddOnes) {
    PacketStream stream(1, 28);
    OutgoingFrame frame = MakeFrame(4, 2);
    frame.isInterlaced = true;

    const auto payloads = SendFrame(&stream, frame, 28);

    ASSERT_EQ(2U, payloads.size());
    EXPECT_EQ((Bytes{1, 2, 5, 6}), CollectPlain({payloads[0]}));
    EXPECT_EQ((Bytes{3, 4, 7, 8}), CollectPlain({payloads[1]}));
}

TEST(PacketStreamTest, EachFieldBeginsWithAFirstPacketAtOffset0UnderTheSameNumbers) {
    PacketStream stream(1, 28);
    OutgoingFrame frame = MakeFrame(4, 8);
    frame.isInterlaced = true;

    const auto payloads = SendFrame(&stream, frame, 28);

    ASSERT_EQ(4U, payloads.size());
    for (const std::size_t first : {0U, 2U}) {
        EXPECT_EQ(2, payloads[first][0]);
        EXPECT_EQ((Bytes{0, 0, 0}),
                  Bytes(payloads[first].begin() + 5, payloads[first].begin() + 8));
        EXPECT_EQ(0x77, payloads[first][3]);
        EXPECT_EQ((Bytes{0x12, 0x23}),
                  Bytes(payloads[first].begin() + 8, payloads[first].begin() + 10));
    }
    EXPECT_EQ(1, payloads[0][17]) << "field of the first";
    EXPECT_EQ(0, payloads[2][17]) << "field of the second";
}

TEST(PacketStreamTest, TheFirstFieldOfAnOddHeightHasTheRowMore) {
    PacketStream stream(1, 64);
    OutgoingFrame frame = MakeFrame(3, 2);
    frame.isInterlaced = true;

    const auto payloads = SendFrame(&stream, frame, 64);

    ASSERT_EQ(2U, payloads.size());
    EXPECT_EQ((Bytes{1, 2, 5, 6}), CollectPlain({payloads[0]}));
    EXPECT_EQ((Bytes{3, 4}), CollectPlain({payloads[1]}));
}

TEST(PacketStreamTest, TwoFieldsWithoutARowLengthGoInOnePart) {
    PacketStream stream(1, 64);
    OutgoingFrame frame = MakeFrame(2, 2);
    frame.rowBytes = 0;
    frame.isInterlaced = true;

    const auto payloads = SendFrame(&stream, frame, 64);

    ASSERT_EQ(1U, payloads.size());
    EXPECT_EQ((Bytes{1, 2, 3, 4}), CollectPlain(payloads));
}

TEST(PacketStreamTest, TheFirstCommonPacketIsSpelledOutByteForByte) {
    PacketStream stream(0, 40);

    const auto payloads = SendFrame(&stream, MakeFrame(1, 20), 40);

    // Two blocks of 16 bytes make a source packet with room for 18 bytes of image.
    const Bytes expected = {
        0x00, 0x04, 0x40, 0x00, 0x80, 0x00, 0x00, 0x00,  // Block size 4, FN 1, count 0.
        0x80, 0x01,                                      // Frame start, mark.
        0x12, 0x23, 0x42, 0x05, 0x01, 0x02, 0x03, 0x04,  // Frame header.
        0x0B, 0x01, 0x00, 0x12,                          // Bytes per source packet: 18.
        1,    2,    3,    4,    5,    6,    7,    8,    9, 10, 11, 12, 13, 14, 15, 16, 17, 18,
    };
    ASSERT_EQ(2U, payloads.size());
    EXPECT_EQ(expected, payloads[0]);
}

TEST(PacketStreamTest, AFollowingCommonPacketHasAnEmptyHeaderAndIsPaddedWithZeros) {
    PacketStream stream(0, 40);

    const auto payloads = SendFrame(&stream, MakeFrame(1, 20), 40);

    Bytes expected(40);
    expected[1] = 4;
    expected[2] = 0x40;
    expected[3] = 2;  // Block count.
    expected[4] = 0x80;
    expected[9] = 1;
    expected[22] = 19;
    expected[23] = 20;
    ASSERT_EQ(2U, payloads.size());
    EXPECT_EQ(expected, payloads[1]);
}

TEST(PacketStreamTest, CommonPacketsCountTheirBlocksAcrossFrames) {
    PacketStream stream(0, 4096);
    std::uint32_t expected = 0;

    for (int n = 0; n < 40; ++n) {
        for (const Bytes& payload : SendFrame(&stream, MakeFrame(10, 999), 4096)) {
            EXPECT_EQ(expected & 0xFF, payload[3]);
            expected += 1U << (payload[2] >> 6);
        }
    }

    EXPECT_GT(expected, 256U);
}

TEST(PacketStreamTest, CommonPacketsCarryTheWholeImageInOrder) {
    for (const std::uint32_t payloadBytes : {28U, 44U, 100U, 1000U, 4096U, 8192U, 9032U, 16000U}) {
        PacketStream stream(0, payloadBytes);
        const OutgoingFrame frame = MakeFrame(61, 333);
        Bytes image;
        for (const Bytes& payload : SendFrame(&stream, frame, payloadBytes)) {
            image.insert(image.end(), payload.begin() + 22, payload.end());
        }
        image.resize(std::min(image.size(), frame.pixels.size()));

        EXPECT_EQ(frame.pixels, image) << payloadBytes;
    }
}

TEST(PacketStreamTest, BlocksOf1024BytesAreToldByABlockSizeOf0) {
    PacketStream stream(0, 9032);

    const auto payloads = SendFrame(&stream, MakeFrame(1, 100), 9032);

    ASSERT_EQ(1U, payloads.size());
    EXPECT_EQ(8U + 8 * 1024, payloads[0].size());
    EXPECT_EQ(0, payloads[0][1]);
    EXPECT_EQ(0xC0, payloads[0][2]) << "8 blocks for a source packet";
}

TEST(PacketStreamTest, AnIdlePlainPacketIsMarkedToBeIgnored) {
    PacketStream stream(1, 100);
    Bytes payload(16);

    ASSERT_EQ(16U, stream.Idle(payload.data()));

    EXPECT_EQ((Bytes{1, 1, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0xAA, 0xAA, 0xAA, 0xAA}), payload);
}

TEST(PacketStreamTest, AnIdleCommonPacketIsItsHeadersAloneAndCountsNoBlock) {
    PacketStream stream(0, 40);
    (void)SendFrame(&stream, MakeFrame(1, 4), 40);
    Bytes payload(8);

    ASSERT_EQ(8U, stream.Idle(payload.data()));

    EXPECT_EQ((Bytes{0, 4, 0x40, 2, 0x80, 0, 0, 0}), payload);
    EXPECT_EQ(2, SendFrame(&stream, MakeFrame(1, 4), 40)[0][3]);
}

TEST(PacketStreamTest, AFrameBegunInsideAFrameReplacesIt) {
    PacketStream stream(1, 28);
    Bytes payload(28);
    stream.Begin(MakeFrame(10, 10));
    (void)stream.Next(payload.data());

    const auto payloads = SendFrame(&stream, MakeFrame(1, 3), 28);

    ASSERT_EQ(1U, payloads.size());
    EXPECT_EQ((Bytes{1, 2, 3}), CollectPlain(payloads));
}

TEST(PacketStreamTest, AnEmptyFrameIsAFirstPacketWithoutImage) {
    PacketStream stream(1, 28);

    const auto payloads = SendFrame(&stream, OutgoingFrame{}, 28);

    ASSERT_EQ(1U, payloads.size());
    EXPECT_EQ(24U, payloads[0].size());
}

TEST(PacketStreamTest, AReservationTooSmallForAHeaderSendsNothing) {
    for (const std::uint32_t version : {0U, 1U}) {
        PacketStream stream(version, PacketStream::PayloadBytesMin - 1);
        std::uint8_t byte = 0x5A;

        stream.Begin(MakeFrame(2, 2));

        EXPECT_TRUE(stream.IsFinished());
        EXPECT_EQ(0U, stream.Next(&byte));
        EXPECT_EQ(0U, stream.Idle(&byte));
        EXPECT_EQ(0x5A, byte);
    }
}

TEST(PacketStreamTest, AFinishedStreamGivesNothing) {
    PacketStream stream(1, 28);
    std::uint8_t byte = 0x5A;

    EXPECT_TRUE(stream.IsFinished());
    EXPECT_EQ(0U, stream.Next(&byte));
}

}  // namespace
}  // namespace ZV::Simulation
