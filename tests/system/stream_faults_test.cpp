#include <gtest/gtest.h>

#include <algorithm>
#include <set>
#include <string>

#include "support/reference_renderer.h"
#include "support/wait_until.h"
#include "system/camera_session.h"

// Each test breaks one thing on the wire and tells what the client sees of it. The camera is small,
// its scene a ramp that is black nowhere but in its first corner, so that a hole of zeros shows.
namespace ZV::Test {
namespace {

constexpr std::uint32_t Width = 160;
constexpr std::uint32_t Height = 120;
constexpr std::uint32_t FirstPacketExtra = 24;
constexpr std::uint32_t PacketExtra = 12;
constexpr std::uint32_t CipHeader = 8;
constexpr std::uint32_t SourcePacketHeader = 14;
constexpr std::uint32_t CipBlockMax = 1024;

std::string MakeScenario(const std::string& faults, std::uint32_t version = 1,
                         const std::string& model = "SolvaneA1", int timeScale = 0) {
    return R"({"timeScale": )" + std::to_string(timeScale) + R"(, "cameras": [{"model": ")" +
           model + R"(", "streamingVersion": )" + std::to_string(version) +
           R"(, "sensor": {"width": 160, "height": 120, "colour": "mono",
           "darkCurrent": 0, "fullWell": 22000}, "scene": {"kind": "ramp", "brightness": 1e6},
           "faults": [)" +
           faults + "]}]}";
}

/// Bytes of the image in the order of the wire that one packet carries.
struct Span {
    std::uint64_t begin, end;
};

/// Where packet `index` of a frame (or of each of its fields) of `bytes` lies.
Span FindPacket(const CameraSession& session, std::uint64_t index, std::uint64_t bytes) {
    const std::uint64_t payload = session.GetPacketBytes();
    if (session.GetCamera().GetStreamingVersion() == 0) {
        const std::uint64_t block =
            std::min<std::uint64_t>((payload - CipHeader) / 32 * 4, CipBlockMax);
        const std::uint64_t image = 8 * block - SourcePacketHeader;
        return {std::min(index * image, bytes), std::min((index + 1) * image, bytes)};
    }
    const std::uint64_t first = payload - FirstPacketExtra;
    const std::uint64_t other = payload - PacketExtra;
    const auto end = [&](std::uint64_t n) { return std::min(first + n * other, bytes); };
    return {index == 0 ? 0 : end(index - 1), end(index)};
}

/// The image without faults, 8 bits, in the order of the wire.
std::vector<std::uint8_t> RenderSent(ZCamera& camera) {
    ReferenceCamera reference;
    reference.width = Width;
    reference.height = Height;
    reference.darkCurrentAt20 = 0;
    reference.scene = "ramp";
    reference.brightness = 1e6;
    ReferenceExposure exposure;
    exposure.width = Width;
    exposure.height = Height;
    exposure.seconds = static_cast<double>(camera.GetExposure()) / 1e9;
    exposure.offset = camera.GetOffset();
    exposure.isTurned = camera.GetStreamingVersion() == 2;
    const auto samples = ReferenceRenderer(reference).Render(exposure);
    return {samples.begin(), samples.end()};
}

std::vector<std::uint8_t> GetAsSent(const CameraSession& session, const DeliveredFrame& delivered) {
    std::vector<std::uint8_t> pixels = delivered.pixels;
    if (session.GetCamera().GetStreamingVersion() == 2) std::reverse(pixels.begin(), pixels.end());
    return pixels;
}

void ExpectHole(const CameraSession& session, const DeliveredFrame& delivered, Span hole) {
    std::vector<std::uint8_t> expected = RenderSent(session.GetCamera());
    ASSERT_LT(hole.begin, hole.end);
    ASSERT_LE(hole.end, expected.size());
    std::fill(expected.begin() + static_cast<std::ptrdiff_t>(hole.begin),
              expected.begin() + static_cast<std::ptrdiff_t>(hole.end), std::uint8_t{0});
    EXPECT_EQ(zerrMissingData, delivered.frame.errorCode);
    EXPECT_EQ(expected, GetAsSent(session, delivered)) << "hole " << hole.begin << " " << hole.end;
}

void ExpectWhole(const CameraSession& session, const DeliveredFrame& delivered) {
    EXPECT_EQ(zerrNone, delivered.frame.errorCode);
    EXPECT_EQ(RenderSent(session.GetCamera()), GetAsSent(session, delivered));
}

/// Rolling numbers of the frames delivered.
std::set<std::uint32_t> GetNumbers(const std::vector<DeliveredFrame>& frames) {
    std::set<std::uint32_t> numbers;
    for (const DeliveredFrame& delivered : frames) numbers.insert(delivered.frame.frameNumber);
    return numbers;
}

/// Each frame begins anew before its third packet, under the next number, so that odd numbers are
/// cut short. In real time, so that the client keeps up with both.
std::string MakeRestarts(std::uint32_t version) {
    return MakeScenario(R"({"kind": "frameStart", "packet": 2})", version, "SolvaneA1", 1);
}

bool IsCutShort(const DeliveredFrame& delivered) {
    return delivered.frame.frameNumber % 2 == 1;
}

void ExpectBothKinds(const std::vector<DeliveredFrame>& frames) {
    const auto cut = std::count_if(frames.begin(), frames.end(), IsCutShort);
    EXPECT_GT(cut, 0);
    EXPECT_LT(cut, static_cast<std::ptrdiff_t>(frames.size()));
}

class PacketFault : public testing::TestWithParam<std::uint32_t> {};

TEST_P(PacketFault, ALostPacketLeavesAHoleOfZerosAndIsReportedAsMissingData) {
    CameraSession session(MakeScenario(R"({"kind": "losePacket", "packet": 1})", GetParam()));
    ASSERT_TRUE(session.IsOpen());

    const auto frames = session.Stream(3);

    ASSERT_EQ(3U, frames.size());
    for (const DeliveredFrame& delivered : frames) {
        ExpectHole(session, delivered, FindPacket(session, 1, Width * Height));
    }
}

TEST_P(PacketFault, SeveralLostPacketsInARowLeaveOneHole) {
    CameraSession session(
        MakeScenario(R"({"kind": "losePacket", "packet": 1, "count": 2})", GetParam()));
    ASSERT_TRUE(session.IsOpen());
    // Packets small enough that the frame has more than the lost ones.
    ASSERT_EQ(CameraOk, session.GetCamera().SetReadoutFrequency(5.0F));
    ASSERT_EQ(CameraOk, session.GetCamera().UpdateSettingsOnCamera());

    const auto frames = session.Stream(2);

    ASSERT_EQ(2U, frames.size());
    const Span first = FindPacket(session, 1, Width * Height);
    const Span last = FindPacket(session, 2, Width * Height);
    for (const DeliveredFrame& delivered : frames) {
        ExpectHole(session, delivered, {first.begin, last.end});
    }
}

TEST_P(PacketFault, AFrameWithoutItsFirstPacketIsNotDelivered) {
    CameraSession session(
        MakeScenario(R"({"kind": "losePacket", "frame": 2, "packet": 0})", GetParam()));
    ASSERT_TRUE(session.IsOpen());

    const auto frames = session.Stream(4);

    ASSERT_EQ(4U, frames.size());
    for (const DeliveredFrame& delivered : frames) ExpectWhole(session, delivered);
    EXPECT_EQ(0U, GetNumbers(frames).count(2));
}

TEST_P(PacketFault, ACorruptedSampleIsNotNoticed) {
    CameraSession session(MakeScenario(
        R"({"kind": "corruptPacket", "packet": 1, "offset": 30, "bytes": 3})", GetParam()));
    ASSERT_TRUE(session.IsOpen());

    const auto frames = session.Stream(2);

    ASSERT_EQ(2U, frames.size());
    auto expected = RenderSent(session.GetCamera());
    const std::uint64_t header = GetParam() == 0 ? CipHeader + SourcePacketHeader : 8;
    const std::uint64_t place = FindPacket(session, 1, Width * Height).begin + 30 - header;
    for (std::uint64_t i = place; i < place + 3; ++i) {
        expected[i] = static_cast<std::uint8_t>(~expected[i]);
    }
    for (const DeliveredFrame& delivered : frames) {
        EXPECT_EQ(zerrNone, delivered.frame.errorCode);
        EXPECT_EQ(expected, GetAsSent(session, delivered));
    }
}

TEST_P(PacketFault, FramesOfAnotherParameterSetAreNotDelivered) {
    CameraSession session(
        MakeScenario(R"({"kind": "wrongPsn", "frame": 2, "count": 1})", GetParam()));
    ASSERT_TRUE(session.IsOpen());

    const auto frames = session.Stream(4);

    ASSERT_EQ(4U, frames.size());
    for (const DeliveredFrame& delivered : frames) ExpectWhole(session, delivered);
    EXPECT_EQ(0U, GetNumbers(frames).count(2));
}

TEST_P(PacketFault, ARequestThatIsFilledTwiceCostsItsPacketsAndNoDamageIsHidden) {
    CameraSession session(
        MakeScenario(R"({"kind": "overwriteRequest", "frame": 3, "packet": 1})", GetParam()));
    ASSERT_TRUE(session.IsOpen());

    const auto frames = session.Stream(6);

    ASSERT_EQ(6U, frames.size());
    for (const DeliveredFrame& delivered : frames) {
        if (delivered.frame.errorCode == zerrMissingData) continue;
        ExpectWhole(session, delivered);
        EXPECT_NE(3U, delivered.frame.frameNumber) << "its packets were overwritten";
    }
    ExpectWhole(session, frames.back());
}

TEST_P(PacketFault, ABusResetEndsAFrameAndTheStreamGoesOn) {
    CameraSession session(
        MakeScenario(R"({"kind": "busReset", "frame": 2, "packet": 2})", GetParam()));
    ASSERT_TRUE(session.IsOpen());

    const auto frames = session.Stream(6);

    ASSERT_EQ(6U, frames.size());
    ExpectWhole(session, frames.back());
    for (const DeliveredFrame& delivered : frames) {
        if (delivered.frame.errorCode == zerrNone) {
            ExpectWhole(session, delivered);
        } else {
            EXPECT_EQ(2U, delivered.frame.frameNumber);
        }
    }
}

TEST_P(PacketFault, LossesByChanceNeverShiftTheRestOfTheImage) {
    CameraSession session(
        MakeScenario(R"({"kind": "losePacket", "probability": 0.1})", GetParam()));
    ASSERT_TRUE(session.IsOpen());

    const auto frames = session.Stream(40);

    ASSERT_EQ(40U, frames.size());
    const auto whole = RenderSent(session.GetCamera());
    for (const DeliveredFrame& delivered : frames) {
        const auto pixels = GetAsSent(session, delivered);
        ASSERT_EQ(whole.size(), pixels.size());
        for (std::size_t i = 0; i < pixels.size(); ++i) {
            ASSERT_TRUE(pixels[i] == 0 || pixels[i] == whole[i]) << "byte " << i;
        }
        const bool isWhole = delivered.frame.errorCode == zerrNone;
        EXPECT_TRUE(!isWhole || pixels == whole);
    }
}

INSTANTIATE_TEST_SUITE_P(Versions, PacketFault, testing::Values(0U, 1U, 2U));

class PlainPacketFault : public testing::TestWithParam<std::uint32_t> {
  protected:
    /// Streams with a fault in packet 1 of each frame and expects it to be missing.
    void ExpectPacketMissing(const std::string& fault) {
        CameraSession session(MakeScenario(fault, GetParam()));
        ASSERT_TRUE(session.IsOpen());

        const auto frames = session.Stream(3);

        ASSERT_EQ(3U, frames.size());
        for (const DeliveredFrame& delivered : frames) {
            ExpectHole(session, delivered, FindPacket(session, 1, Width * Height));
        }
    }
};

TEST_P(PlainPacketFault, APacketWithoutItsTailMarkIsMissing) {
    ExpectPacketMissing(R"({"kind": "missingTail", "packet": 1})");
}

TEST_P(PlainPacketFault, ACutPacketIsMissing) {
    ExpectPacketMissing(R"({"kind": "truncatePacket", "packet": 1})");
}

TEST_P(PlainPacketFault, APacketOf12BytesIsMissing) {
    ExpectPacketMissing(R"({"kind": "truncatePacket", "packet": 1, "bytes": 12})");
}

TEST_P(PlainPacketFault, APacketOfAnotherLayoutIsMissing) {
    ExpectPacketMissing(R"({"kind": "corruptPacket", "packet": 1, "offset": 1, "bytes": 1})");
}

// Kept: a packet that comes again fills all the rest of its frame with zeros.
TEST_P(PlainPacketFault, ARepeatedPacketBlackensTheRestOfItsFrame) {
    CameraSession session(MakeScenario(R"({"kind": "repeatPacket", "packet": 1})", GetParam()));
    ASSERT_TRUE(session.IsOpen());

    const auto frames = session.Stream(3);

    ASSERT_EQ(3U, frames.size());
    const Span repeated = FindPacket(session, 1, Width * Height);
    for (const DeliveredFrame& delivered : frames) {
        ExpectHole(session, delivered, {repeated.end, Width * Height});
    }
}

// Kept: the frame that is cut short counts as one with missing data, not as one out of step.
TEST_P(PlainPacketFault, AFrameStartInsideAFrameEndsItWithMissingData) {
    CameraSession session(MakeRestarts(GetParam()));
    ASSERT_TRUE(session.IsOpen());

    const auto frames = session.Stream(6);

    ASSERT_EQ(6U, frames.size());
    const Span reached = FindPacket(session, 2, Width * Height);
    for (const DeliveredFrame& delivered : frames) {
        if (IsCutShort(delivered)) {
            ExpectHole(session, delivered, {reached.begin, Width * Height});
        } else {
            ExpectWhole(session, delivered);
        }
    }
    ExpectBothKinds(frames);
}

TEST_P(PlainPacketFault, AFrameWithoutItsLastPacketIsFilledWhenTheNextOneBegins) {
    CameraSession session(MakeScenario(
        R"({"kind": "losePacket", "frame": 1, "packet": 2, "count": 100})", GetParam()));
    ASSERT_TRUE(session.IsOpen());

    const auto frames = session.Stream(3);

    ASSERT_EQ(3U, frames.size());
    const Span lost = FindPacket(session, 2, Width * Height);
    EXPECT_EQ(1U, frames[0].frame.frameNumber);
    ExpectHole(session, frames[0], {lost.begin, Width * Height});
    ExpectWhole(session, frames[1]);
}

INSTANTIATE_TEST_SUITE_P(Versions, PlainPacketFault, testing::Values(1U, 2U));

TEST(StreamFaultsTest, AFrameStartInsideAFrameOfVersion0PutsItOutOfStep) {
    CameraSession session(MakeRestarts(0));
    ASSERT_TRUE(session.IsOpen());

    const auto frames = session.Stream(6);

    ASSERT_EQ(6U, frames.size());
    for (const DeliveredFrame& delivered : frames) {
        if (IsCutShort(delivered)) {
            EXPECT_EQ(zerrOutOfSync, delivered.frame.errorCode);
        } else {
            ExpectWhole(session, delivered);
        }
    }
    ExpectBothKinds(frames);
}

TEST(StreamFaultsTest, AFrameOfVersion0WithoutItsLastPacketIsOutOfStep) {
    CameraSession session(
        MakeScenario(R"({"kind": "losePacket", "frame": 1, "packet": 2, "count": 100})", 0));
    ASSERT_TRUE(session.IsOpen());

    const auto frames = session.Stream(3);

    ASSERT_EQ(3U, frames.size());
    EXPECT_NE(zerrNone, frames[0].frame.errorCode);
    ExpectWhole(session, frames[1]);
    ExpectWhole(session, frames[2]);
}

/// The camera of two fields over a small sensor.
class FieldFault : public testing::Test {
  protected:
    /// Rows of the first field lie at the even rows of the image.
    static std::vector<std::uint8_t> TakeField(const std::vector<std::uint8_t>& image,
                                               std::uint32_t firstRow) {
        std::vector<std::uint8_t> field;
        for (std::uint32_t y = firstRow; y < Height; y += 2) {
            const auto row = image.begin() + y * Width;
            field.insert(field.end(), row, row + Width);
        }
        return field;
    }
};

TEST_F(FieldFault, APacketLostInTheFirstFieldLeavesItsHoleInTheEvenRows) {
    CameraSession session(MakeScenario(R"({"kind": "losePacket", "packet": 1})", 1, "Folary"));
    ASSERT_TRUE(session.IsOpen());

    const DeliveredFrame delivered = session.Grab();

    const auto whole = RenderSent(session.GetCamera());
    auto even = TakeField(whole, 0);
    const Span hole = FindPacket(session, 1, even.size());
    ASSERT_LT(hole.begin, hole.end);
    std::fill(even.begin() + static_cast<std::ptrdiff_t>(hole.begin),
              even.begin() + static_cast<std::ptrdiff_t>(hole.end), std::uint8_t{0});
    EXPECT_EQ(zerrMissingData, delivered.frame.errorCode);
    EXPECT_EQ(even, TakeField(delivered.pixels, 0));
    EXPECT_EQ(TakeField(whole, 1), TakeField(delivered.pixels, 1));
}

TEST_F(FieldFault, AFirstFieldThatBreaksOffKeepsTheSecondField) {
    CameraSession session(MakeScenario(R"({"kind": "losePacket", "packet": 4})", 1, "Folary"));
    ASSERT_TRUE(session.IsOpen());
    const std::uint64_t fieldBytes = Width * Height / 2;

    const DeliveredFrame delivered = session.Grab();

    const Span lost = FindPacket(session, 4, fieldBytes);
    ASSERT_LT(lost.begin, lost.end);
    ASSERT_EQ(fieldBytes, lost.end) << "the fifth packet is the field's last";
    auto even = TakeField(RenderSent(session.GetCamera()), 0);
    std::fill(even.begin() + static_cast<std::ptrdiff_t>(lost.begin), even.end(), std::uint8_t{0});
    EXPECT_EQ(zerrMissingData, delivered.frame.errorCode);
    EXPECT_EQ(even, TakeField(delivered.pixels, 0));
    EXPECT_EQ(TakeField(RenderSent(session.GetCamera()), 1), TakeField(delivered.pixels, 1));
}

// The stop waits its whole five seconds when the loop has left by itself.
TEST(StreamFaultsTest, AStreamWhoseCameraIsUnpluggedCanBeStoppedAndClosed) {
    CameraSession session(MakeScenario(""));
    ASSERT_TRUE(session.IsOpen());
    ASSERT_EQ(zerrNone, Zentara_SetStreaming(session.GetHandle(), 1));
    ASSERT_TRUE(WaitUntil([&] { return session.world.GetState().framesSent > 2; }));

    ASSERT_TRUE(session.world.Unplug());

    EXPECT_EQ(zerrDriverFault, Zentara_SetStreaming(session.GetHandle(), 0));
}

}  // namespace
}  // namespace ZV::Test
