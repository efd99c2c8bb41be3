// Streaming version 0: packets of data blocks.

#include "hal/stream_assembler.h"
#include "stream_fixture.h"

namespace ZV::Testing {
namespace {

class StreamBlocksTest : public StreamAssemblerTest {
  protected:
    static constexpr std::uint8_t Quadlets = 8;
    static constexpr std::size_t BlockBytes = 32;
    static constexpr std::size_t StartData = BlockBytes - 14;  ///< Image bytes of a first block.

    StreamBlocksTest() { assembler.StartStream(0); }

    /// One source packet of one block.
    static Bytes OneBlock(std::uint8_t count, bool isFrameStart, const Bytes& data,
                          Header header = {}) {
        header.blockPayload = StartData;
        Bytes packet = BlocksStart(count, Quadlets, 0) + SourceStart(isFrameStart, header) + data;
        packet.resize(8 + BlockBytes);
        return packet;
    }
};

TEST_F(StreamBlocksTest, PacketsOfVersion0AreReadByTheseBytes) {
    GuardedFrame& frame = AddFrame(6);
    frame.info.psn = 0x21;
    const Bytes packet{0x3F, 0x05, 0x00, 0x00, 0x9F, 0x00, 0x00, 0x00,              //
                       0x80, 0x01, 0x43, 0x21, 0x21, 0x05, 0x01, 0x02, 0x03, 0x04,  //
                       0x07, 0x31, 0x00, 0x06, 0xA0, 0xA1, 0xA2, 0xA3, 0xA4, 0xA5};

    const Bytes parsed = Feed(packet);

    EXPECT_EQ(doneStatus, std::vector<std::uint32_t>{FrameComplete});
    EXPECT_EQ(frame.Pixels(), (Bytes{0xA0, 0xA1, 0xA2, 0xA3, 0xA4, 0xA5}));
    EXPECT_EQ(frame.info.rollingFrameNumber, 0x4321);
    EXPECT_EQ(frame.info.timestamp, 0x01020304U);
    EXPECT_EQ(frame.info.colourPattern, 5U);
    EXPECT_EQ(assembler.reservedNibble, 3);
    EXPECT_EQ(assembler.blockPayload, 6);
    EXPECT_EQ(assembler.blockCounter, 1);
    EXPECT_EQ(Slice(parsed, 0, 8), (Bytes{0x00, 0x00, 0x05, 0x3F, 0x00, 0x00, 0x00, 0x9F}));
    EXPECT_EQ(Slice(parsed, 8, 4), (Bytes{0x01, 0x80, 0x21, 0x43}));
}

TEST_F(StreamBlocksTest, ASizeOf0MeansBlocksOf1024Bytes) {
    GuardedFrame& frame = AddFrame(1010);
    Header header;
    header.blockPayload = 1010;

    Feed(BlocksStart(0, 0, 0) + SourceStart(true, header) + Ramp(1010));

    EXPECT_EQ(doneStatus, std::vector<std::uint32_t>{FrameComplete});
    EXPECT_EQ(frame.Pixels(), Ramp(1010));
}

TEST_F(StreamBlocksTest, ASourcePacketSpansTwoToThePowerOfItsFractionBlocks) {
    for (const int shift : {0, 1, 2, 3}) {
        const std::size_t blocks = std::size_t{1} << shift;
        const std::size_t payload = blocks * BlockBytes - 14;
        GuardedFrame& frame = AddFrame(static_cast<std::uint32_t>(2 * payload));
        Header header;
        header.blockPayload = static_cast<std::uint16_t>(payload);
        const Bytes image = Ramp(2 * payload);
        assembler.StartStream(0);

        Feed(BlocksStart(0, Quadlets, static_cast<std::uint8_t>(shift)) +
             SourceStart(true, header) + Slice(image, 0, payload));
        Feed(BlocksStart(static_cast<std::uint8_t>(blocks), Quadlets,
                         static_cast<std::uint8_t>(shift)) +
             SourceStart(false, Header{}) + Slice(image, payload, payload));

        EXPECT_EQ(doneStatus.back(), FrameComplete) << shift;
        EXPECT_EQ(frame.Pixels(), image) << shift;
    }
}

TEST_F(StreamBlocksTest, SeveralSourcePacketsTravelInOnePayload) {
    GuardedFrame& frame = AddFrame(3 * StartData);
    Header header;
    header.blockPayload = StartData;
    const Bytes image = Ramp(3 * StartData);

    Feed(BlocksStart(0, Quadlets, 0) + SourceStart(true, header) + Slice(image, 0, StartData) +
         SourceStart(false, header) + Slice(image, StartData, StartData) +
         SourceStart(false, header) + Slice(image, 2 * StartData, StartData));

    EXPECT_EQ(doneStatus, std::vector<std::uint32_t>{FrameComplete});
    EXPECT_EQ(frame.Pixels(), image);
}

TEST_F(StreamBlocksTest, APayloadOfHeadersAloneHasNoEffect) {
    AddFrame(40);
    Feed(OneBlock(0, true, Ramp(StartData)));

    const Bytes parsed = Feed(BlocksStart(7, Quadlets, 0));

    EXPECT_EQ(assembler.remaining, 40 - StartData);
    EXPECT_EQ(assembler.blockCounter, 1);
    EXPECT_EQ(parsed[0], 7) << "its two quadlets are reversed all the same";
    EXPECT_EQ(overruns, 0);
}

TEST_F(StreamBlocksTest, BytesBehindTheLastWholeBlockAreLeftOut) {
    AddFrame(40);
    Bytes packet = OneBlock(0, true, Ramp(StartData));
    packet.resize(packet.size() + BlockBytes - 1, 0x55);

    Feed(packet);

    EXPECT_EQ(assembler.blockCounter, 1);
    EXPECT_EQ(assembler.remaining, 40 - StartData);
}

TEST_F(StreamBlocksTest, ALostSourcePacketLeavesOneHoleOfItsSize) {
    GuardedFrame& frame = AddFrame(4 * StartData);
    const Bytes image = Ramp(4 * StartData);

    Feed(OneBlock(0, true, Slice(image, 0, StartData)));
    Feed(OneBlock(2, false, Slice(image, 2 * StartData, StartData)));
    Feed(OneBlock(3, false, Slice(image, 3 * StartData, StartData)));

    EXPECT_EQ(doneStatus, std::vector<std::uint32_t>{FrameMissingData});
    EXPECT_EQ(frame.Pixels(), Slice(image, 0, StartData) + Bytes(StartData, 0) +
                                  Slice(image, 2 * StartData, 2 * StartData));
}

TEST_F(StreamBlocksTest, TheCountWrapsAt256WithoutAGap) {
    GuardedFrame& frame = AddFrame(4 * StartData);
    const Bytes image = Ramp(4 * StartData);
    assembler.blockCounter = 254;

    for (const int index : {0, 1, 2, 3}) {
        Feed(OneBlock(static_cast<std::uint8_t>(254 + index), index == 0,
                      Slice(image, static_cast<std::size_t>(index) * StartData, StartData)));
    }

    EXPECT_EQ(doneStatus, std::vector<std::uint32_t>{FrameComplete});
    EXPECT_EQ(frame.Pixels(), image);
}

TEST_F(StreamBlocksTest, AfterALossTheParserWaitsForTheNextSourcePacket) {
    constexpr std::size_t Payload = 2 * BlockBytes - 14;
    GuardedFrame& frame = AddFrame(3 * Payload);
    Header header;
    header.blockPayload = Payload;
    const Bytes image = Ramp(3 * Payload);
    Feed(BlocksStart(0, Quadlets, 1) + SourceStart(true, header) + Slice(image, 0, Payload));

    Feed(BlocksStart(3, Quadlets, 1) + Bytes(BlockBytes, 0x77));
    EXPECT_EQ(assembler.blockCounter, 2) << "a block that starts nothing is ignored";
    Feed(BlocksStart(4, Quadlets, 1) + SourceStart(false, header) +
         Slice(image, 2 * Payload, Payload));

    EXPECT_EQ(doneStatus, std::vector<std::uint32_t>{FrameMissingData});
    EXPECT_EQ(frame.Pixels(),
              Slice(image, 0, Payload) + Bytes(Payload, 0) + Slice(image, 2 * Payload, Payload));
}

TEST_F(StreamBlocksTest, ALossInsideASourcePacketFillsWhatItStillHeld) {
    constexpr std::size_t Payload = 2 * BlockBytes - 14;
    GuardedFrame& frame = AddFrame(2 * Payload);
    Header header;
    header.blockPayload = Payload;
    const Bytes image = Ramp(2 * Payload);
    Bytes half =
        BlocksStart(0, Quadlets, 1) + SourceStart(true, header) + Slice(image, 0, StartData);

    Feed(half);
    EXPECT_EQ(assembler.blockLeft, Payload - StartData);
    Feed(BlocksStart(2, Quadlets, 1) + SourceStart(false, header) + Slice(image, Payload, Payload));

    EXPECT_EQ(doneStatus, std::vector<std::uint32_t>{FrameMissingData});
    EXPECT_EQ(frame.Pixels(), Slice(image, 0, StartData) + Bytes(Payload - StartData, 0) +
                                  Slice(image, Payload, Payload));
}

TEST_F(StreamBlocksTest, TheLastSourcePacketTakesNoMoreThanTheFrameIsDue) {
    GuardedFrame& frame = AddFrame(StartData + 5);

    Feed(OneBlock(0, true, Ramp(StartData)));
    Feed(OneBlock(1, false, Ramp(StartData, StartData)));

    EXPECT_EQ(doneStatus, std::vector<std::uint32_t>{FrameComplete});
    EXPECT_EQ(frame.Pixels(), Ramp(StartData + 5));
    EXPECT_EQ(assembler.blockLeft, StartData - 5);
}

TEST_F(StreamBlocksTest, ABlockThatCannotHoldTheStartIsIgnored) {
    AddFrame(40);
    for (std::uint8_t quadlets = 1; quadlets <= 3; ++quadlets) {
        assembler.StartStream(0);
        Bytes packet = BlocksStart(0, quadlets, 0) + SourceStart(true, Header{});
        packet.resize(8 + 4U * quadlets);
        Feed(packet);
        EXPECT_EQ(assembler.blockCounter, 1);
    }

    EXPECT_EQ(peeks, 0);
}

TEST_F(StreamBlocksTest, AnUnfinishedFrameIsCutShortWithStatus2ByTheNext) {
    GuardedFrame& frame = AddFrame(100);
    AddFrame(100);
    Feed(OneBlock(0, true, Ramp(StartData)));

    Feed(OneBlock(1, true, Ramp(StartData)));

    EXPECT_EQ(doneStatus, std::vector<std::uint32_t>{FrameCutShort});
    EXPECT_EQ(frame.Pixels(), Ramp(StartData) + Bytes(100 - StartData, 0));
    EXPECT_EQ(assembler.current, &frames[1]->info);
}

TEST_F(StreamBlocksTest, APayloadOfMoreThan255BlocksIsReadToItsEnd) {
    constexpr std::size_t Blocks = 300;
    constexpr std::size_t Data = 2;
    GuardedFrame& frame = AddFrame(Blocks * Data);
    const Bytes image = Ramp(Blocks * Data);
    Header header;
    header.blockPayload = Data;
    Bytes packet = BlocksStart(0, 4, 0);
    for (std::size_t index = 0; index < Blocks; ++index) {
        packet = packet + SourceStart(index == 0, header) + Slice(image, index * Data, Data);
    }

    Feed(packet);

    EXPECT_EQ(doneStatus, std::vector<std::uint32_t>{FrameComplete});
    EXPECT_EQ(frame.Pixels(), image);
    EXPECT_EQ(assembler.blockCounter, Blocks % 256);
}

TEST_F(StreamBlocksTest, AnOverwrittenRequestIsReportedAndItsFrameCountsAsDamaged) {
    GuardedFrame& first = AddFrame(StartData);
    GuardedFrame& second = AddFrame(100);
    Header header;
    header.blockPayload = StartData;
    overwriteAtDone = 0x3F;

    Feed(BlocksStart(0, Quadlets, 0) + SourceStart(true, header) + Ramp(StartData) +
         SourceStart(true, header) + Ramp(StartData));

    EXPECT_EQ(overruns, 1);
    EXPECT_EQ(doneStatus, std::vector<std::uint32_t>{FrameComplete});
    EXPECT_EQ(Status(first), FrameComplete);
    EXPECT_EQ(Status(second), FrameMissingData);
    EXPECT_FALSE(second.info.isHeld);
    EXPECT_EQ(second.Pixels(), Ramp(StartData) + Bytes(100 - StartData, 0));
    EXPECT_EQ(assembler.current, nullptr);
}

TEST_F(StreamBlocksTest, AnOverwriteOutsideAFrameIsReportedAsWell) {
    AddFrame(StartData);
    overwriteAtDone = 0x3F;

    Feed(OneBlock(0, true, Ramp(StartData)));

    EXPECT_EQ(overruns, 1);
    EXPECT_EQ(assembler.current, nullptr);
}

TEST_F(StreamBlocksTest, KeptBlocksBehindABadStartMayStillBeTaken) {
    constexpr std::size_t Payload = 2 * BlockBytes - 14;
    AddFrame(10 * Payload);
    Header header;
    header.blockPayload = Payload;
    Feed(BlocksStart(0, Quadlets, 1) + SourceStart(true, header) + Ramp(StartData));
    const std::uint32_t remaining = assembler.remaining;
    assembler.blockCounter = 2;
    Bytes bad(2 * BlockBytes, 0x66);

    Feed(BlocksStart(2, Quadlets, 1) + bad);

    EXPECT_EQ(assembler.blockCounter, 4);
    EXPECT_EQ(assembler.remaining, remaining - BlockBytes)
        << "the start is ignored, the block behind it goes to what was still left";
}

TEST_F(StreamBlocksTest, BlocksBehindABadStartAfterAGapAreLeftOut) {
    constexpr std::size_t Payload = 2 * BlockBytes - 14;
    AddFrame(10 * Payload);
    Header header;
    header.blockPayload = Payload;
    Feed(BlocksStart(0, Quadlets, 1) + SourceStart(true, header) + Ramp(StartData));

    Feed(BlocksStart(2, Quadlets, 1) + Bytes(2 * BlockBytes, 0x66));

    EXPECT_EQ(assembler.blockLeft, 0) << "the gap took what was left";
    EXPECT_EQ(assembler.remaining, 9 * Payload);
}

TEST_F(StreamBlocksTest, KeptAFrameThatWaitsForItsSecondFieldIsDamagedByAnyGap) {
    GuardedFrame& frame = AddTwoFieldFrame(static_cast<std::uint16_t>(StartData), 2);
    Header second;
    second.field = 0;
    Feed(OneBlock(0, true, Ramp(StartData)));
    EXPECT_EQ(assembler.remaining, 0U);

    Feed(OneBlock(3, true, Ramp(StartData, StartData), second));

    EXPECT_EQ(doneStatus, std::vector<std::uint32_t>{FrameMissingData});
    EXPECT_EQ(frame.Pixels(), Ramp(2 * StartData)) << "though nothing is missing";
}

TEST_F(StreamBlocksTest, TheBlockPayloadIsTakenFromFrameStartsAlone) {
    AddFrame(100);
    Feed(OneBlock(0, true, Ramp(StartData)));
    Header other;
    other.blockPayload = 3;

    Feed(BlocksStart(1, Quadlets, 0) + SourceStart(false, other) + Ramp(StartData));

    EXPECT_EQ(assembler.blockPayload, StartData);
    EXPECT_EQ(assembler.remaining, 100 - 2 * StartData);
}

}  // namespace
}  // namespace ZV::Testing
