#include "hal/stream_assembler.h"

#include <numeric>

#include "stream_fixture.h"

namespace ZV::Testing {
namespace {

TEST_F(StreamAssemblerTest, PacketsOfVersion1AreReadByTheseBytes) {
    GuardedFrame& frame = AddFrame(6);
    frame.info.psn = 0x5A;
    const Bytes first{0x02, 0x01, 0x00, 0x07, 0x00, 0x00, 0x00, 0x00,                          //
                      0x12, 0x34, 0x5A, 0xF6, 0xDE, 0xAD, 0xBE, 0xEF, 0xFB, 0x41, 0x00, 0x00,  //
                      0x10, 0x11, 0x12, 0x13, 0xAA, 0xAA, 0xAA, 0xAA};
    const Bytes plain{0x00, 0x01, 0x00, 0x07, 0x00, 0x00, 0x00, 0x04,  //
                      0x14, 0x15, 0xAA, 0xAA, 0xAA, 0xAA};

    Feed(first);
    EXPECT_EQ(assembler.field, 1);
    EXPECT_EQ(assembler.reservedNibble, 4);
    EXPECT_EQ(assembler.sampleBits, 0x0B);
    EXPECT_EQ(assembler.plane, 6);
    EXPECT_EQ(assembler.remaining, 2U);
    EXPECT_EQ(assembler.frameNumber, 7);
    Feed(plain);

    EXPECT_EQ(doneStatus, std::vector<std::uint32_t>{0});
    EXPECT_EQ(frame.Pixels(), (Bytes{0x10, 0x11, 0x12, 0x13, 0x14, 0x15}));
    EXPECT_EQ(frame.info.rollingFrameNumber, 0x1234);
    EXPECT_EQ(frame.info.timestamp, 0xDEADBEEFU);
    EXPECT_EQ(frame.info.colourPattern, 6U);
}

TEST_F(StreamAssemblerTest, TheOffsetOnTheBusHas24BitsInBusOrder) {
    GuardedFrame& frame = AddFrame(0x010210);
    Feed(FirstPacket(1, Header{}, Ramp(0x0100)));
    Bytes far{0x00, 0x01, 0x00, 0x01, 0x00, 0x01, 0x02, 0x03, 0x99, 0xAA, 0xAA, 0xAA, 0xAA};

    Feed(far);

    EXPECT_EQ(assembler.expectedOffset, 0x010204U);
    EXPECT_EQ(frame.info.buffer[0x010202], 0);
    EXPECT_EQ(frame.info.buffer[0x010203], 0x99);
}

TEST_F(StreamAssemblerTest, AFrameWhoseLastPacketFillsItExactlyFinishesAtOnce) {
    GuardedFrame& frame = AddFrame(100);

    Feed(FirstPacket(1, Header{}, Ramp(60)));
    EXPECT_TRUE(doneStatus.empty());
    Feed(PlainPacket(1, 60, Ramp(40, 60)));

    EXPECT_EQ(doneStatus, std::vector<std::uint32_t>{FrameComplete});
    EXPECT_EQ(frame.Pixels(), Ramp(100));
    EXPECT_EQ(assembler.current, nullptr);
}

TEST_F(StreamAssemblerTest, DataBeyondTheFrameAreLeftOut) {
    GuardedFrame& frame = AddFrame(10);

    Feed(FirstPacket(1, Header{}, Ramp(30)));

    EXPECT_EQ(doneStatus, std::vector<std::uint32_t>{FrameComplete});
    EXPECT_EQ(frame.Pixels(), Ramp(10));
    EXPECT_EQ(assembler.expectedOffset, 10U);
}

TEST_F(StreamAssemblerTest, APacketWithoutTheVersionMarkOrWithTheIgnoreBitIsIgnored) {
    GuardedFrame& frame = AddFrame(8);
    Bytes unmarked = FirstPacket(1, Header{}, Ramp(8));
    unmarked[1] = 2;
    Bytes ignored = FirstPacket(1, Header{}, Ramp(8));
    ignored[0] = 3;

    Feed(unmarked);
    Feed(ignored);

    EXPECT_EQ(peeks, 0);
    EXPECT_EQ(frame.info.buffer[0], HeldBefore);
}

TEST_F(StreamAssemblerTest, AnyOtherStreamingVersionIsIgnored) {
    AddFrame(8);
    for (const int version : {3, 4, 255}) {
        assembler.StartStream(static_cast<std::uint8_t>(version));
        const Bytes packet = FirstPacket(1, Header{}, Ramp(8));
        EXPECT_EQ(Feed(packet), packet);
    }

    EXPECT_EQ(peeks, 0);
}

TEST_F(StreamAssemblerTest, AStaleParameterSetNumberLeavesNoFrameAndItsPacketsPassUnused) {
    GuardedFrame& frame = AddFrame(16);
    frame.info.psn = 4;
    Header stale;
    stale.psn = 3;

    Feed(FirstPacket(1, stale, Ramp(8)));
    EXPECT_EQ(assembler.current, nullptr);
    EXPECT_EQ(assembler.writePointer, nullptr);
    EXPECT_EQ(Status(frame), FrameRefused);
    EXPECT_FALSE(frame.info.isHeld);
    Feed(PlainPacket(1, 8, Ramp(8)));

    EXPECT_EQ(takes, 0);
    EXPECT_TRUE(doneStatus.empty());
    EXPECT_EQ(frame.Pixels(), Bytes(16, HeldBefore)) << "who delivers it clears it";
}

TEST_F(StreamAssemblerTest, KeptARefusedStartMarksTheRecordThatWasNeverTaken) {
    GuardedFrame& frame = AddFrame(16);
    Header last;
    last.field = 0;

    Feed(FirstPacket(1, last, Ramp(16)));

    EXPECT_EQ(Status(frame), FrameRefused);
    EXPECT_EQ(takes, 0);
    EXPECT_EQ(assembler.current, nullptr);
    EXPECT_FALSE(frame.info.isHeld);
    EXPECT_EQ(frame.Pixels(), Bytes(16, HeldBefore));
}

TEST_F(StreamAssemblerTest, ARefusedRecordThatIsAcceptedLaterLosesItsStatus) {
    GuardedFrame& frame = AddFrame(4);
    Header stale;
    stale.psn = 1;
    Feed(FirstPacket(1, stale, Ramp(4)));

    Feed(FirstPacket(2, Header{}, Ramp(4)));

    EXPECT_EQ(doneStatus, std::vector<std::uint32_t>{FrameComplete});
    EXPECT_EQ(frame.Pixels(), Ramp(4));
}

TEST_F(StreamAssemblerTest, ANewNumberFillsTheWholeRestBeforeTheNextFrameIsLookedAt) {
    GuardedFrame& frame = AddFrame(100);
    AddFrame(100);
    Feed(FirstPacket(1, Header{}, Ramp(40)));

    Feed(PlainPacket(2, 40, Ramp(60)));

    EXPECT_EQ(doneStatus, std::vector<std::uint32_t>{FrameMissingData});
    EXPECT_EQ(frame.Pixels(), Ramp(40) + Bytes(60, 0));
    EXPECT_EQ(peeks, 1);
}

TEST_F(StreamAssemblerTest, AFrameStartInMidFrameFinishesTheOldFrameWithStatus1) {
    GuardedFrame& frame = AddFrame(100);
    AddFrame(100);
    Feed(FirstPacket(1, Header{}, Ramp(40)));

    Feed(FirstPacket(2, Header{}, Ramp(40)));

    EXPECT_EQ(doneStatus, std::vector<std::uint32_t>{FrameMissingData});
    EXPECT_EQ(frame.Pixels(), Ramp(40) + Bytes(60, 0));
    EXPECT_EQ(assembler.current, &frames[1]->info);
}

TEST_F(StreamAssemblerTest, OneLostPacketLeavesOneHoleAndTheRestStandsInItsPlace) {
    GuardedFrame& frame = AddFrame(100);

    Feed(FirstPacket(1, Header{}, Ramp(20)));
    Feed(PlainPacket(1, 40, Ramp(20, 40)));
    Feed(PlainPacket(1, 60, Ramp(20, 60)));
    Feed(PlainPacket(1, 80, Ramp(20, 80)));

    EXPECT_EQ(doneStatus, std::vector<std::uint32_t>{FrameMissingData});
    EXPECT_EQ(frame.Pixels(), Ramp(20) + Bytes(20, 0) + Ramp(60, 40));
}

TEST_F(StreamAssemblerTest, AFrameAbove16MebibytesPassesAndALossAcrossThatBoundIsOneHole) {
    constexpr std::uint32_t FrameBytes = 4008 * 2672 * 2;
    constexpr std::uint32_t DataBytes = 8180;
    for (const bool isLossy : {false, true}) {
        GuardedFrame& frame = AddFrame(FrameBytes);
        const Bytes image = Ramp(FrameBytes);

        Feed(FirstPacket(1, Header{}, Slice(image, 0, DataBytes)));
        for (std::uint32_t offset = DataBytes; offset < FrameBytes; offset += DataBytes) {
            const bool isAcrossBound = offset < 0x1000000 && offset + DataBytes > 0x1000000;
            if (isLossy && isAcrossBound) continue;
            const std::uint32_t count = std::min(DataBytes, FrameBytes - offset);
            Feed(PlainPacket(1, offset, Slice(image, offset, count)));
        }

        EXPECT_EQ(doneStatus.back(), isLossy ? FrameMissingData : FrameComplete);
        const Bytes pixels = frame.Pixels();
        const auto holes = std::count(pixels.begin(), pixels.end(), 0);
        EXPECT_EQ(holes, isLossy ? DataBytes : 0);
        EXPECT_EQ(pixels.back(), image.back());
    }
    EXPECT_EQ(doneStatus.size(), 2U);
}

TEST_F(StreamAssemblerTest, KeptTheGapIsFilledFromAPacketThatIsThenDroppedForItsTail) {
    GuardedFrame& frame = AddFrame(100);
    Feed(FirstPacket(1, Header{}, Ramp(20)));
    Bytes damaged = PlainPacket(1, 40, Ramp(20, 40));
    damaged.back() = 0xAB;

    Feed(damaged);
    EXPECT_EQ(Status(frame), FrameMissingData);
    EXPECT_EQ(assembler.remaining, 60U);
    EXPECT_EQ(assembler.expectedOffset, 40U);
    Feed(PlainPacket(1, 60, Ramp(40, 60)));

    EXPECT_EQ(frame.Pixels(), Ramp(20) + Bytes(40, 0) + Ramp(40, 60));
}

TEST_F(StreamAssemblerTest, AFirstPacketWithoutItsTailStartsNothing) {
    AddFrame(100);
    Bytes damaged = FirstPacket(1, Header{}, Ramp(20));
    damaged[damaged.size() - 4] = 0;

    Feed(damaged);

    EXPECT_EQ(peeks, 0);
}

TEST_F(StreamAssemblerTest, AFirstPacketTooShortForItsHeaderIsDroppedAfterTheGapIsFilled) {
    for (std::size_t length = 13; length < 24; ++length) {
        GuardedFrame& frame = AddFrame(40);
        Feed(FirstPacket(1, Header{}, Ramp(20)));
        Bytes cut = PlainStart(2, 2, 0);
        cut.resize(length, 0xAA);

        Feed(cut);

        EXPECT_EQ(Status(frame), FrameMissingData) << length;
        EXPECT_EQ(frame.Pixels(), Ramp(20) + Bytes(20, 0)) << length;
        EXPECT_EQ(assembler.current, nullptr);
    }
    EXPECT_EQ(peeks, 11);
}

TEST_F(StreamAssemblerTest, PacketsShorterThanTheirHeadersAreHarmless) {
    for (const int version : {0, 1, 2}) {
        assembler.StartStream(static_cast<std::uint8_t>(version));
        for (std::size_t length = 0; length < 13; ++length) {
            Bytes cut = PlainPacket(1, 0, Ramp(8));
            cut.resize(length);
            Feed(cut);
        }
    }

    EXPECT_EQ(peeks, 0);
}

TEST_F(StreamAssemblerTest, KeptARepeatedPacketCountsAsAHugeGapAndEndsTheFrame) {
    GuardedFrame& frame = AddFrame(100);
    Feed(FirstPacket(1, Header{}, Ramp(20)));
    Feed(PlainPacket(1, 20, Ramp(20, 20)));

    Feed(PlainPacket(1, 20, Ramp(20, 20)));

    EXPECT_EQ(doneStatus, std::vector<std::uint32_t>{FrameMissingData});
    EXPECT_EQ(frame.Pixels(), Ramp(40) + Bytes(60, 0));
}

TEST_F(StreamAssemblerTest, KeptARestartWithTheSameNumberEndsTheOldFrameAndStartsANewOne) {
    AddFrame(100);
    GuardedFrame& second = AddFrame(20);
    Feed(FirstPacket(1, Header{}, Ramp(20)));

    Feed(FirstPacket(1, Header{}, Ramp(20)));

    EXPECT_EQ(doneStatus, (std::vector<std::uint32_t>{FrameMissingData, FrameComplete}));
    EXPECT_EQ(second.Pixels(), Ramp(20));
}

TEST_F(StreamAssemblerTest, ARepeatedEmptyFirstPacketCutsTheFrameShortWithStatus2) {
    GuardedFrame& frame = AddFrame(20);
    AddFrame(20);
    Feed(FirstPacket(1, Header{}, Bytes{}));

    Feed(FirstPacket(1, Header{}, Ramp(20)));

    EXPECT_EQ(doneStatus, (std::vector<std::uint32_t>{FrameCutShort, FrameComplete}));
    EXPECT_EQ(frame.Pixels(), Bytes(20, 0)) << "nothing of what the allocator held";
}

TEST_F(StreamAssemblerTest, OnlyAFirstPacketLosesItsTailMark) {
    AddFrame(100);

    const Bytes first = Feed(FirstPacket(1, Header{}, Ramp(20)));
    const Bytes plain = Feed(PlainPacket(1, 20, Ramp(20)));

    EXPECT_EQ(Slice(first, first.size() - 4, 4), Bytes(4, 0));
    EXPECT_EQ(Slice(plain, plain.size() - 4, 4), Bytes(4, 0xAA));
}

TEST_F(StreamAssemblerTest, WordsAreReversedInPlaceSoAPacketThatComesBackUnchangedIsIgnored) {
    AddFrame(100);
    Header header;
    header.rollingFrameNumber = 0x1234;
    header.timestamp = 0x01020304;

    const Bytes once = Feed(FirstPacket(1, header, Ramp(4)));
    EXPECT_EQ(Slice(once, 0, 8), (Bytes{1, 2, 1, 0, 0, 0, 0, 0}));
    EXPECT_EQ(Slice(once, 8, 12), (Bytes{0x34, 0x12, 0, 0, 2, 1, 4, 3, 1, 7, 0, 0}));
    const Bytes plain = Feed(PlainPacket(1, 4, Ramp(4)));
    const Bytes twice = Feed(plain);

    EXPECT_EQ(assembler.remaining, 92U) << "the second pass fails the version mark";
    EXPECT_EQ(twice, PlainPacket(1, 4, Ramp(4))) << "and restores the packet for the third";
}

TEST_F(StreamAssemblerTest, AFrameThatOverrunsItsBufferEndsWithStatus3AndNothingBeyondIsWritten) {
    GuardedFrame& frame = AddFrame(50);
    frame.info.bytesExpected = 100;

    Feed(FirstPacket(1, Header{}, Ramp(40)));
    Feed(PlainPacket(1, 40, Ramp(20, 40)));

    EXPECT_EQ(doneStatus, std::vector<std::uint32_t>{FrameOverran});
    EXPECT_EQ(frame.Pixels(), Ramp(40) + Bytes(10, 0)) << "the failing packet leaves no part of it";
    EXPECT_EQ(assembler.current, nullptr);
}

TEST_F(StreamAssemblerTest, AGapThatOverrunsTheBufferEndsWithStatus3) {
    GuardedFrame& frame = AddFrame(50);
    frame.info.bytesExpected = 100;
    Feed(FirstPacket(1, Header{}, Ramp(40)));

    Feed(PlainPacket(1, 80, Ramp(20)));

    EXPECT_EQ(doneStatus, std::vector<std::uint32_t>{FrameOverran});
    EXPECT_EQ(frame.Pixels(), Ramp(40) + Bytes(10, 0));
}

TEST_F(StreamAssemblerTest, BytesOfTheBufferBehindTheImageAreCleared) {
    GuardedFrame& frame = AddFrame(30);
    frame.info.bytesExpected = 20;

    Feed(FirstPacket(1, Header{}, Ramp(20)));

    EXPECT_EQ(frame.Pixels(), Ramp(20) + Bytes(10, 0));
}

TEST_F(StreamAssemblerTest, KeptAFrameOfNoBytesStaysUntilTheNextStartGivesItStatus2) {
    GuardedFrame& frame = AddFrame(20);
    frame.info.bytesExpected = 0;
    AddFrame(20);

    Feed(FirstPacket(1, Header{}, Ramp(10)));
    EXPECT_EQ(assembler.current, &frame.info);
    EXPECT_TRUE(doneStatus.empty());
    Feed(FirstPacket(2, Header{}, Ramp(20)));

    EXPECT_EQ(doneStatus, (std::vector<std::uint32_t>{FrameCutShort, FrameComplete}));
    EXPECT_EQ(frame.Pixels(), Bytes(20, 0));
}

TEST_F(StreamAssemblerTest, AFrameWithoutABufferIsCountedAndNotWritten) {
    GuardedFrame& frame = AddFrame(20);
    frame.info.buffer = nullptr;

    Feed(FirstPacket(1, Header{}, Ramp(20)));

    EXPECT_EQ(doneStatus, std::vector<std::uint32_t>{FrameComplete});
}

TEST_F(StreamAssemblerTest, WithoutARecordAFramePassesUnused) {
    Feed(FirstPacket(1, Header{}, Ramp(20)));
    Feed(PlainPacket(1, 20, Ramp(20)));

    EXPECT_EQ(peeks, 1);
    EXPECT_EQ(takes, 0);
    EXPECT_EQ(assembler.current, nullptr);
}

TEST_F(StreamAssemblerTest, ARecordThatIsAskedForInVainIsLetGo) {
    GuardedFrame& frame = AddFrame(20);
    refusesNewFrame = true;

    Feed(FirstPacket(1, Header{}, Ramp(20)));

    EXPECT_EQ(takes, 1);
    EXPECT_EQ(assembler.current, nullptr);
    EXPECT_FALSE(frame.info.isHeld);
    EXPECT_EQ(Status(frame), FrameComplete);
}

TEST_F(StreamAssemblerTest, WithoutCallbacksAStreamPassesUnused) {
    assembler.SetCallbacks(nullptr, nullptr, nullptr, nullptr, nullptr);

    Feed(FirstPacket(1, Header{}, Ramp(20)));
    assembler.StartStream(0);
    Feed(BlocksStart(0, 8, 0) + SourceStart(true, Header{}) + Ramp(18));

    EXPECT_EQ(assembler.current, nullptr);
}

TEST_F(StreamAssemblerTest, TheRecordIsHeldWhileItIsFilledAndLetGoBeforeItIsReported) {
    GuardedFrame& frame = AddFrame(20);

    Feed(FirstPacket(1, Header{}, Ramp(10)));
    EXPECT_TRUE(frame.info.isHeld);
    Feed(PlainPacket(1, 10, Ramp(10)));

    EXPECT_EQ(doneStatus.size(), 1U);
    EXPECT_FALSE(wasHeldWhenDone);
}

TEST_F(StreamAssemblerTest, AnAbandonedFrameHasNoSizeAndIsNotReported) {
    GuardedFrame& frame = AddFrame(20);
    Feed(FirstPacket(1, Header{}, Ramp(10)));

    assembler.AbandonFrame();
    assembler.AbandonFrame();

    EXPECT_EQ(frame.info.bufferSize, 0U);
    EXPECT_FALSE(frame.info.isHeld);
    EXPECT_EQ(assembler.current, nullptr);
    EXPECT_TRUE(doneStatus.empty());
}

TEST_F(StreamAssemblerTest, KeptANewStreamClearsTheBlockCounterAlone) {
    AddFrame(100);
    Feed(FirstPacket(9, Header{}, Ramp(10)));
    assembler.blockCounter = 5;
    assembler.blockLeft = 6;
    assembler.blockPayload = 7;

    assembler.StartStream(2);

    EXPECT_EQ(assembler.streamingVersion, 2);
    EXPECT_EQ(assembler.blockCounter, 0);
    EXPECT_EQ(assembler.blockLeft, 6);
    EXPECT_EQ(assembler.blockPayload, 7);
    EXPECT_EQ(assembler.remaining, 90U);
    EXPECT_EQ(assembler.expectedOffset, 10U);
    EXPECT_EQ(assembler.frameNumber, 9);
}

TEST_F(StreamAssemblerTest, AFrameBegunBeforeAChangeOfVersionEndsAsTheNewVersionAsks) {
    assembler.StartStream(2);
    GuardedFrame& frame = AddFrame(20);
    Feed(FirstPacket(1, Header{}, Ramp(10)));

    assembler.StartStream(1);
    Feed(PlainPacket(1, 10, Ramp(10, 10)));

    EXPECT_EQ(frame.Pixels(), Ramp(20));
}

}  // namespace
}  // namespace ZV::Testing
