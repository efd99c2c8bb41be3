// Where bytes end up: two fields, planes, and images turned by half a turn.

#include "hal/stream_copy.h"

#include <algorithm>

#include "stream_fixture.h"

namespace ZV::Testing {
namespace {

Header MakeHeader(int field, int plane = 0, int sampleBits = 7) {
    Header header;
    header.field = static_cast<std::uint8_t>(field);
    header.plane = static_cast<std::uint8_t>(plane);
    header.sampleBits = static_cast<std::uint8_t>(sampleBits);
    return header;
}

/// Half a turn, sample by sample; an odd last byte of 16-bit samples stays.
Bytes Turned(const Bytes& image, std::size_t sampleBytes) {
    Bytes turned = image;
    const std::size_t samples = image.size() / sampleBytes;
    for (std::size_t sample = 0; sample < samples; ++sample) {
        for (std::size_t byte = 0; byte < sampleBytes; ++byte) {
            turned[(samples - 1 - sample) * sampleBytes + byte] =
                image[sample * sampleBytes + byte];
        }
    }
    return turned;
}

using StreamFieldsTest = StreamAssemblerTest;

TEST_F(StreamFieldsTest, TheFirstFieldTakesTheEvenRowsAndTheLastTheOddOnes) {
    GuardedFrame& frame = AddTwoFieldFrame(4, 6);

    Feed(FirstPacket(1, MakeHeader(1), Bytes(12, 0x11)));
    EXPECT_TRUE(doneStatus.empty()) << "the second field is still to come";
    EXPECT_EQ(assembler.current, &frame.info);
    Feed(FirstPacket(1, MakeHeader(0), Bytes(12, 0x22)));

    EXPECT_EQ(doneStatus, std::vector<std::uint32_t>{FrameComplete});
    const Bytes even(4, 0x11);
    const Bytes odd(4, 0x22);
    EXPECT_EQ(frame.Pixels(), even + odd + even + odd + even + odd);
}

TEST_F(StreamFieldsTest, PacketsMayEndAnywhereInARow) {
    for (std::size_t step = 1; step <= 23; ++step) {
        GuardedFrame& frame = AddTwoFieldFrame(5, 8);
        const Bytes image = Ramp(40);
        Bytes fields[2];
        for (std::size_t row = 0; row < 8; ++row) {
            fields[row % 2] = fields[row % 2] + Slice(image, row * 5, 5);
        }

        for (std::size_t part = 0; part < 2; ++part) {
            const int field = part == 0 ? 1 : 0;
            Feed(FirstPacket(1, MakeHeader(field),
                             Slice(fields[part], 0, std::min(step, std::size_t{20}))));
            for (std::size_t offset = step; offset < 20; offset += step) {
                const std::size_t count = std::min(step, 20 - offset);
                Feed(PlainPacket(1, static_cast<std::uint32_t>(offset),
                                 Slice(fields[part], offset, count)));
                EXPECT_EQ(assembler.rowPosition, (offset + count) % 5);
            }
        }

        EXPECT_EQ(doneStatus.back(), FrameComplete) << step;
        EXPECT_EQ(frame.Pixels(), image) << step;
    }
}

TEST_F(StreamFieldsTest, RowsThatDoNotFitEndWithStatus3AndNoneOfThemIsWritten) {
    GuardedFrame& frame = AddTwoFieldFrame(4, 4);
    frame.info.bytesExpected = 12;

    Feed(FirstPacket(1, MakeHeader(1), Ramp(4)));
    Feed(PlainPacket(1, 4, Ramp(8, 4)));

    EXPECT_EQ(doneStatus, std::vector<std::uint32_t>{FrameOverran});
    EXPECT_EQ(frame.Pixels(), Ramp(4) + Bytes(12, 0));
}

TEST_F(StreamFieldsTest, ARowLengthOf0EndsWithStatus3) {
    GuardedFrame& frame = AddTwoFieldFrame(4, 4);
    frame.info.rowBytes = 0;

    Feed(FirstPacket(1, MakeHeader(1), Ramp(8)));

    EXPECT_EQ(doneStatus, std::vector<std::uint32_t>{FrameOverran});
    EXPECT_EQ(frame.Pixels(), Bytes(16, 0));
}

TEST_F(StreamFieldsTest, KeptAFirstFieldOfAnotherNumberCompletesTheFrameAlone) {
    for (int field = 2; field < 16; ++field) {
        GuardedFrame& frame = AddTwoFieldFrame(4, 4);

        Feed(FirstPacket(1, MakeHeader(field), Ramp(8)));

        EXPECT_EQ(doneStatus.back(), FrameComplete);
        EXPECT_EQ(frame.Pixels(), Ramp(4) + Bytes(4, 0) + Ramp(4, 4) + Bytes(4, 0));
    }
}

TEST_F(StreamFieldsTest, KeptTheSecondFieldIsNotTestedAndLeavesTheFramesHeaderAlone) {
    GuardedFrame& frame = AddTwoFieldFrame(4, 4);
    frame.info.psn = 7;
    Header first = MakeHeader(1, 5);
    first.psn = 7;
    first.rollingFrameNumber = 0x1111;
    first.timestamp = 0x22222222;
    Header second = MakeHeader(0, 8);
    second.psn = 9;
    second.rollingFrameNumber = 0x3333;
    second.timestamp = 0x44444444;

    Feed(FirstPacket(1, first, Ramp(8)));
    Feed(FirstPacket(2, second, Ramp(8)));

    EXPECT_EQ(doneStatus, std::vector<std::uint32_t>{FrameComplete});
    EXPECT_EQ(frame.info.rollingFrameNumber, 0x1111);
    EXPECT_EQ(frame.info.timestamp, 0x22222222U);
    EXPECT_EQ(frame.info.colourPattern, 5U);
    EXPECT_EQ(peeks, 1);
}

TEST_F(StreamFieldsTest, ASecondFieldThatNeverCameCutsTheFrameShortWithStatus2) {
    GuardedFrame& frame = AddTwoFieldFrame(4, 4);
    AddTwoFieldFrame(4, 4);
    Feed(FirstPacket(1, MakeHeader(1), Ramp(8)));

    Feed(FirstPacket(2, MakeHeader(1), Ramp(8)));

    EXPECT_EQ(doneStatus, std::vector<std::uint32_t>{FrameCutShort});
    EXPECT_EQ(frame.Pixels(), Ramp(4) + Bytes(4, 0) + Ramp(4, 4) + Bytes(4, 0));
}

TEST_F(StreamFieldsTest, AnUnfinishedFirstFieldIsFilledAndTheFrameGoesOnDamaged) {
    GuardedFrame& frame = AddTwoFieldFrame(4, 4);
    Feed(FirstPacket(1, MakeHeader(1), Ramp(6)));

    Feed(FirstPacket(1, MakeHeader(0), Ramp(8, 8)));

    EXPECT_EQ(doneStatus, std::vector<std::uint32_t>{FrameMissingData});
    EXPECT_EQ(frame.Pixels(), Ramp(4) + Ramp(4, 8) + Ramp(2, 4) + Bytes(2, 0) + Ramp(4, 12));
}

TEST_F(StreamFieldsTest, AnEmptyFirstFieldMarksTheFrameAndItsRowsAreCleared) {
    GuardedFrame& frame = AddTwoFieldFrame(4, 4);
    Feed(FirstPacket(1, MakeHeader(1), Bytes{}));

    Feed(FirstPacket(1, MakeHeader(0), Ramp(8)));

    EXPECT_EQ(doneStatus, std::vector<std::uint32_t>{FrameMissingData});
    EXPECT_EQ(frame.Pixels(), Bytes(4, 0) + Ramp(4) + Bytes(4, 0) + Ramp(4, 4));
}

class StreamLayoutTest : public StreamAssemblerTest {
  protected:
    /// Sends the planes 0, 1 and 3 of a frame, each filled with its number plus 1.
    GuardedFrame& SendPlanes(std::int32_t layout, std::uint32_t planeBytes,
                             std::uint32_t bufferSize, int sampleBits) {
        GuardedFrame& frame = AddFrame(bufferSize);
        frame.info.fieldIndex = layout;
        frame.info.bytesExpected = planeBytes;
        for (const int plane : {0, 1, 3}) {
            Feed(FirstPacket(1, MakeHeader(1, plane, sampleBits),
                             Bytes(planeBytes, static_cast<std::uint8_t>(plane + 1))));
        }
        return frame;
    }
};

TEST_F(StreamLayoutTest, PlanesInSequenceFollowEachOther) {
    GuardedFrame& frame = SendPlanes(6, 4, 12, 7);

    EXPECT_EQ(doneStatus, std::vector<std::uint32_t>{FrameComplete});
    EXPECT_EQ(frame.Pixels(), Bytes(4, 1) + Bytes(4, 2) + Bytes(4, 4));
}

TEST_F(StreamLayoutTest, PlanesThatDoNotFitEndWithStatus3) {
    GuardedFrame& frame = SendPlanes(6, 4, 11, 7);

    EXPECT_EQ(doneStatus.front(), FrameOverran);
    EXPECT_EQ(frame.Pixels(), Bytes(4, 1) + Bytes(4, 2) + Bytes(3, 0));
}

TEST_F(StreamLayoutTest, ScatteredPlanesTakeTheirPlaces) {
    struct Row {
        std::int32_t layout;
        Bytes pixel;
    };
    const Row rows[] = {{2, {0, 1, 2, 4}}, {3, {4, 2, 1}}, {4, {4, 2, 1, 0}}, {5, {1, 2, 4}}};
    for (const Row& row : rows) {
        const auto stride = static_cast<std::uint32_t>(row.pixel.size());

        GuardedFrame& frame = SendPlanes(row.layout, 3, 3 * stride, 7);

        EXPECT_EQ(doneStatus.back(), FrameComplete) << row.layout;
        EXPECT_EQ(frame.Pixels(), row.pixel + row.pixel + row.pixel) << row.layout;
    }
}

TEST_F(StreamLayoutTest, ScatteredSamplesAbove8BitsMoveAsWords) {
    GuardedFrame& frame = SendPlanes(5, 4, 12, 8);

    EXPECT_EQ(frame.Pixels(), (Bytes{1, 1, 2, 2, 4, 4, 1, 1, 2, 2, 4, 4}));
}

TEST_F(StreamLayoutTest, AnOddByteCountOfScatteredWordsStaysInTheBuffer) {
    SendPlanes(2, 5, 20, 15);

    EXPECT_EQ(doneStatus, std::vector<std::uint32_t>{FrameComplete});
}

TEST_F(StreamLayoutTest, ScatteredPlanesThatDoNotFitEndWithStatus3) {
    GuardedFrame& frame = SendPlanes(3, 3, 8, 7);

    EXPECT_EQ(doneStatus.front(), FrameOverran);
    EXPECT_EQ(frame.Pixels(), Bytes(8, 0));
}

TEST_F(StreamLayoutTest, AScatteredPlaneOf4OrAboveEndsWithStatus2) {
    GuardedFrame& frame = AddFrame(12);
    frame.info.fieldIndex = 3;
    frame.info.bytesExpected = 4;

    Feed(FirstPacket(1, MakeHeader(1, 4), Ramp(4)));

    EXPECT_EQ(doneStatus, std::vector<std::uint32_t>{FrameCutShort});
}

TEST_F(StreamLayoutTest, AnUnknownLayoutEndsWithStatus2) {
    for (const int layout : {-1, 1, 7, 1000}) {
        GuardedFrame& frame = AddFrame(12);
        frame.info.fieldIndex = layout;

        Feed(FirstPacket(1, MakeHeader(1), Ramp(4)));

        EXPECT_EQ(doneStatus.back(), FrameCutShort) << layout;
        EXPECT_EQ(frame.Pixels(), Bytes(12, 0));
    }
}

TEST_F(StreamLayoutTest, AFrameWithPlanesStartsAtItsFirstPlaneOnly) {
    for (const int plane : {1, 3}) {
        GuardedFrame& frame = AddFrame(12);
        frame.info.fieldIndex = 1;

        Feed(FirstPacket(1, MakeHeader(1, plane), Ramp(4)));

        EXPECT_EQ(Status(frame), FrameRefused);
        EXPECT_EQ(assembler.current, nullptr);
        nextFrame = frames.size();
    }
}

TEST_F(StreamLayoutTest, AMissingPlaneCutsTheFrameShort) {
    GuardedFrame& frame = AddFrame(12);
    frame.info.fieldIndex = 6;
    frame.info.bytesExpected = 4;
    Feed(FirstPacket(1, MakeHeader(1, 0), Ramp(4)));

    Feed(FirstPacket(1, MakeHeader(1, 3), Ramp(4)));

    EXPECT_EQ(doneStatus, std::vector<std::uint32_t>{FrameCutShort});
    EXPECT_EQ(frame.Pixels(), Ramp(4) + Bytes(8, 0));
}

class StreamTurnTest : public StreamAssemblerTest {
  protected:
    StreamTurnTest() { assembler.StartStream(2); }

    void SendInPackets(const Bytes& image, std::size_t dataBytes, int sampleBits, int plane = 5) {
        Feed(FirstPacket(1, MakeHeader(1, plane, sampleBits),
                         Slice(image, 0, std::min(dataBytes, image.size()))));
        for (std::size_t offset = dataBytes; offset < image.size(); offset += dataBytes) {
            Feed(PlainPacket(1, static_cast<std::uint32_t>(offset),
                             Slice(image, offset, std::min(dataBytes, image.size() - offset))));
        }
    }
};

TEST_F(StreamTurnTest, Version2TurnsTheImageByItsSamples) {
    GuardedFrame& narrow = AddFrame(6);
    GuardedFrame& wide = AddFrame(6);

    SendInPackets({1, 2, 3, 4, 5, 6}, 4, 7);
    SendInPackets({1, 2, 3, 4, 5, 6}, 4, 8);

    EXPECT_EQ(narrow.Pixels(), (Bytes{6, 5, 4, 3, 2, 1}));
    EXPECT_EQ(wide.Pixels(), (Bytes{5, 6, 3, 4, 1, 2}));
    EXPECT_EQ(doneStatus, (std::vector<std::uint32_t>{FrameComplete, FrameComplete}));
}

TEST_F(StreamTurnTest, AnyImageSizeAndPacketSizeGivesTheSameTurnedImage) {
    for (const int sampleBits : {7, 15}) {
        for (std::uint32_t size = 1; size < 150; size += 7) {
            for (const std::size_t dataBytes : {1, 2, 3, 31, 32, 33, 65, 200}) {
                GuardedFrame& frame = AddFrame(size);
                const Bytes image = Ramp(size);

                SendInPackets(image, dataBytes, sampleBits);

                ASSERT_EQ(doneStatus.back(), FrameComplete);
                ASSERT_EQ(frame.Pixels(), Turned(image, sampleBits > 7 ? 2 : 1))
                    << "size " << size << " data " << dataBytes << " bits " << sampleBits;
            }
        }
    }
}

TEST_F(StreamTurnTest, AnOddLastByteOf16BitSamplesStays) {
    GuardedFrame& frame = AddFrame(5);

    SendInPackets({1, 2, 3, 4, 5}, 5, 15);

    EXPECT_EQ(frame.Pixels(), (Bytes{3, 4, 1, 2, 5}));
}

TEST_F(StreamTurnTest, TheMosaicChangesItsPhaseAndOtherPatternsStay) {
    const std::uint32_t turned[] = {0, 1, 2, 3, 4, 8, 7, 6, 5, 9, 10, 11, 12, 13, 14, 15};
    for (int pattern = 0; pattern < 16; ++pattern) {
        GuardedFrame& frame = AddFrame(4);

        SendInPackets(Ramp(4), 4, 7, pattern);

        EXPECT_EQ(frame.info.colourPattern, turned[pattern]);
    }
}

TEST_F(StreamTurnTest, AFrameOfTwoFieldsIsTurnedAsAWhole) {
    for (const int sampleBits : {7, 15}) {
        GuardedFrame& frame = AddTwoFieldFrame(6, 4);

        Feed(FirstPacket(1, MakeHeader(1, 0, sampleBits), Ramp(5)));
        Feed(PlainPacket(1, 5, Ramp(7, 5)));
        Feed(FirstPacket(1, MakeHeader(0, 0, sampleBits), Ramp(12, 12)));

        const Bytes image = Ramp(6) + Ramp(6, 12) + Ramp(6, 6) + Ramp(6, 18);
        EXPECT_EQ(frame.Pixels(), Turned(image, sampleBits > 7 ? 2 : 1));
    }
}

TEST_F(StreamTurnTest, TwoFieldsOfNoWholeRowsAreTurnedAsAWholeAndStayInTheBuffer) {
    GuardedFrame& frame = AddFrame(40);
    frame.info.interlaced = true;
    frame.info.rowBytes = 8;
    frame.info.bytesExpected = 12;

    Feed(FirstPacket(1, MakeHeader(1), Ramp(12)));
    Feed(FirstPacket(1, MakeHeader(0), Ramp(12, 12)));

    const Bytes image = Ramp(8) + Ramp(8, 12) + Ramp(4, 8) + Bytes(4, 0);
    EXPECT_EQ(doneStatus, std::vector<std::uint32_t>{FrameComplete});
    EXPECT_EQ(Slice(frame.Pixels(), 0, 24), Turned(image, 1));
    EXPECT_EQ(Slice(frame.Pixels(), 24, 16), Ramp(4, 20) + Bytes(12, 0));
}

TEST_F(StreamTurnTest, AFrameWithMissingDataIsTurned) {
    GuardedFrame& frame = AddFrame(12);
    Feed(FirstPacket(1, MakeHeader(1, 5), Ramp(3)));

    Feed(PlainPacket(1, 7, Ramp(5, 7)));

    EXPECT_EQ(doneStatus, std::vector<std::uint32_t>{FrameMissingData});
    EXPECT_EQ(frame.Pixels(), Turned(Ramp(3) + Bytes(4, 0) + Ramp(5, 7), 1));
    EXPECT_EQ(frame.info.colourPattern, 8U);
}

TEST_F(StreamTurnTest, KeptAFrameThatIsGivenUpIsNotTurnedAndKeepsItsPattern) {
    for (const int sampleBits : {7, 15}) {
        GuardedFrame& frame = AddTwoFieldFrame(4, 4);
        AddTwoFieldFrame(4, 4);
        Feed(FirstPacket(1, MakeHeader(1, 5, sampleBits), Ramp(8)));

        Feed(FirstPacket(2, MakeHeader(1, 5, sampleBits), Bytes{}));

        EXPECT_EQ(doneStatus.back(), FrameCutShort);
        EXPECT_EQ(frame.Pixels(), Ramp(4) + Bytes(4, 0) + Ramp(4, 4) + Bytes(4, 0));
        EXPECT_EQ(frame.info.colourPattern, 5U);
        assembler.AbandonFrame();
        nextFrame = frames.size();
    }
}

TEST_F(StreamTurnTest, KeptAFrameThatOverranIsNotTurned) {
    GuardedFrame& frame = AddFrame(8);
    frame.info.bytesExpected = 20;

    SendInPackets(Ramp(20), 6, 7);

    EXPECT_EQ(doneStatus, std::vector<std::uint32_t>{FrameOverran});
    EXPECT_EQ(frame.Pixels(), Ramp(6) + Bytes(2, 0));
    EXPECT_EQ(frame.info.colourPattern, 5U);
}

TEST_F(StreamTurnTest, BytesBehindATurnedImageAreCleared) {
    GuardedFrame& frame = AddFrame(12);
    frame.info.bytesExpected = 8;

    SendInPackets(Ramp(8), 3, 15);

    EXPECT_EQ(frame.Pixels(), Turned(Ramp(8), 2) + Bytes(4, 0));
}

TEST(TurnSamples, ReversesTheOrderOfSamplesOfAnyCount) {
    for (std::uint32_t bytes = 0; bytes < 200; ++bytes) {
        for (const bool is16Bit : {false, true}) {
            Bytes samples = Ramp(bytes + 1);
            const Bytes expected =
                Turned(Slice(samples, 0, bytes), is16Bit ? 2 : 1) + Slice(samples, bytes, 1);

            TurnSamples(samples.data(), bytes, is16Bit);

            ASSERT_EQ(samples, expected) << bytes << (is16Bit ? " bytes of words" : " bytes");
        }
    }
}

}  // namespace
}  // namespace ZV::Testing
