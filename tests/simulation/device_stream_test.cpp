#include <gtest/gtest.h>

#include "camera/register_map.h"
#include "hal/platform/last_error.h"
#include "hal/stream_format.h"
#include "simulation/register_file.h"
#include "simulation/settings.h"
#include "simulation/stream_reader.h"
#include "support/simulation_world.h"
#include "support/wait_until.h"

namespace ZV::Test {
namespace {

using namespace Simulation;

constexpr std::uint32_t Width = 64, Height = 48;
constexpr std::uint64_t ImageBytes = Width * Height;
constexpr std::uint32_t Stride = 512;

// A camera of a scenario, its device open, set up for a small image.
class StreamWorld {
  public:
    explicit StreamWorld(std::string_view scenario) : world(scenario) {
        EXPECT_TRUE(world.Start());
        client = std::make_unique<DriverClient>();
        SetUpImage(client.get(), Width, Height);
    }

    void SetControl(std::uint32_t quadlet, std::uint32_t value) {
        EXPECT_EQ(0u, client->Write(ControlAddress + 4 * quadlet, value));
    }
    void TakeOver() { EXPECT_EQ(0u, client->Write(CommandAddress + 4 * CommandTakeOver, 1)); }
    void Trigger() { EXPECT_EQ(0u, client->Write(CommandAddress + 4 * CommandSoftwareTrigger, 1)); }

    SimulationWorld world;
    std::unique_ptr<DriverClient> client;
};

TEST(DeviceStream, SendsFramesWhosePixelsHaveTheTracesChecksum) {
    StreamWorld mono("mono");
    StreamReader reader(mono.client.get(), Stride);
    ASSERT_EQ(0u, reader.Start());

    const ReceivedFrame first = reader.ReadFrame(ImageBytes);
    const ReceivedFrame second = reader.ReadFrame(ImageBytes);

    ASSERT_EQ(ImageBytes, first.pixels.size());
    ASSERT_EQ(ImageBytes, second.pixels.size());
    EXPECT_EQ(7u, first.psn);
    EXPECT_EQ(7u, first.sampleBits);
    EXPECT_NE(0u, first.field);
    EXPECT_EQ(first.rollingFrameNumber + 1, second.rollingFrameNumber);
    const std::vector<TraceRecord> frames = mono.world.ReadFrames();
    ASSERT_GE(frames.size(), 2u);
    EXPECT_EQ(CalculateChecksum(first.pixels.data(), ImageBytes), frames[0].checksum);
    EXPECT_EQ(CalculateChecksum(second.pixels.data(), ImageBytes), frames[1].checksum);
    EXPECT_EQ(Width, frames[0].width);
    EXPECT_EQ(1u, frames[0].frame);
}

TEST(DeviceStream, SendsNothingBeforeSettingsAreTakenOver) {
    SimulationWorld world("mono");
    ASSERT_TRUE(world.Start());
    DriverClient client;
    StreamReader reader(&client, Stride);
    ASSERT_EQ(0u, reader.Start());

    for (int i = 0; i < 3; ++i) EXPECT_FALSE(reader.ReadRequest().empty());

    EXPECT_EQ(0u, world.GetState().framesExposed);
}

TEST(DeviceStream, IdleCyclesCarryPacketsWithTheIgnoreBit) {
    SimulationWorld world("mono");
    ASSERT_TRUE(world.Start());
    DriverClient client;
    StreamReader reader(&client, Stride);
    ASSERT_EQ(0u, reader.Start());

    for (const Payload& payload : reader.ReadRequest()) {
        ASSERT_GE(payload.size(), PacketLengthMin);
        EXPECT_EQ(PlainFlagIgnore, payload[PlainFlagsOffset]);
    }
}

TEST(DeviceStream, IdleCyclesAreEmptyWhenTheScenarioSaysSo) {
    StreamWorld mono(R"({"base": "mono", "cameras": [{"idlePackets": false}]})");
    mono.SetControl(11, TriggerSoftware);
    mono.TakeOver();
    StreamReader reader(mono.client.get(), Stride, 2);
    ASSERT_EQ(0u, reader.Start());

    // 7 packets a frame: the fifth frame fills the request.
    for (int i = 0; i < 4; ++i) mono.Trigger();
    ASSERT_TRUE(WaitUntil([&] { return mono.world.GetState().framesSent == 4; }));
    EXPECT_FALSE(reader.requests[0]->IsComplete());
    mono.Trigger();

    for (const Payload& payload : reader.ReadRequest()) {
        EXPECT_EQ(0, payload[PlainFlagsOffset] & PlainFlagIgnore);
    }
}

TEST(DeviceStream, ASoftwareTriggerGivesOneFrame) {
    StreamWorld mono("mono");
    mono.SetControl(11, TriggerSoftware);
    mono.TakeOver();
    StreamReader reader(mono.client.get(), Stride);
    ASSERT_EQ(0u, reader.Start());
    ASSERT_FALSE(reader.ReadRequest().empty());
    EXPECT_EQ(0u, mono.world.GetState().framesExposed);

    mono.Trigger();
    const ReceivedFrame frame = reader.ReadFrame(ImageBytes);
    ASSERT_FALSE(reader.ReadRequest().empty());

    EXPECT_EQ(ImageBytes, frame.pixels.size());
    EXPECT_EQ(1u, mono.world.GetState().framesExposed);
}

TEST(DeviceStream, EachTriggerGivesItsFrameEvenDuringAFrame) {
    StreamWorld mono("mono");
    mono.SetControl(11, TriggerSoftware);
    mono.TakeOver();
    StreamReader reader(mono.client.get(), Stride);
    ASSERT_EQ(0u, reader.Start());

    for (int i = 0; i < 3; ++i) mono.Trigger();

    for (int i = 0; i < 3; ++i) EXPECT_EQ(ImageBytes, reader.ReadFrame(ImageBytes).pixels.size());
}

TEST(DeviceStream, ASettingReachesTheNextExposureOnlyWhenItIsTakenOver) {
    StreamWorld mono("mono");
    mono.SetControl(11, TriggerSoftware);
    mono.TakeOver();
    StreamReader reader(mono.client.get(), Stride);
    ASSERT_EQ(0u, reader.Start());

    mono.SetControl(1, 9u << 24 | 4);
    mono.Trigger();
    EXPECT_EQ(7u, reader.ReadFrame(ImageBytes).psn);
    mono.TakeOver();
    mono.Trigger();
    EXPECT_EQ(9u, reader.ReadFrame(ImageBytes).psn);
}

TEST(DeviceStream, AFrameWhosePacketsBeginAfterATakeOverHasTheNewSettings) {
    StreamWorld mono("mono");
    StreamReader reader(mono.client.get(), Stride);
    ASSERT_EQ(0u, reader.Start());
    ASSERT_EQ(7u, reader.ReadFrame(ImageBytes).psn);

    mono.SetControl(1, 9u << 24 | 4);
    mono.TakeOver();

    const std::uint64_t begun = mono.world.GetState().framesExposed;
    while (mono.world.GetState().framesSent < begun + 2) ASSERT_FALSE(reader.ReadRequest().empty());

    for (const TraceRecord& frame : mono.world.ReadFrames()) {
        EXPECT_EQ(frame.frame > begun ? 9u : frame.psn, frame.psn) << frame.frame;
    }
}

TEST(DeviceStream, AnExternalTriggerComesWithItsPeriodOrNever) {
    StreamWorld never("mono");
    never.SetControl(11, 2);
    never.TakeOver();
    {
        StreamReader reader(never.client.get(), Stride);
        ASSERT_EQ(0u, reader.Start());
        ASSERT_FALSE(reader.ReadRequest().empty());
        EXPECT_EQ(0u, never.world.GetState().framesExposed);
    }
    never.client->Close();

    StreamWorld periodic(R"({"base": "mono", "cameras": [{"triggerPeriod": 1}]})");
    periodic.SetControl(11, 2);
    periodic.TakeOver();
    StreamReader reader(periodic.client.get(), Stride);
    ASSERT_EQ(0u, reader.Start());
    EXPECT_EQ(ImageBytes, reader.ReadFrame(ImageBytes).pixels.size());
}

TEST(DeviceStream, AWheelCyclesRedGreenBlueFromItsStartColour) {
    StreamWorld wheel("wheel");
    wheel.SetControl(12, 1u << 8 | 1);
    wheel.TakeOver();
    StreamReader reader(wheel.client.get(), Stride);
    ASSERT_EQ(0u, reader.Start());

    std::vector<std::uint32_t> planes;
    for (int i = 0; i < 4; ++i) planes.push_back(reader.ReadFrame(ImageBytes).plane);

    EXPECT_EQ((std::vector<std::uint32_t>{1, 3, 0, 1}), planes);
}

TEST(DeviceStream, AColourCameraTellsItsMosaic) {
    StreamWorld colour(R"({"base": "colour", "cameras": [{"sensor": {"mosaic": "BGGR"}}]})");
    StreamReader reader(colour.client.get(), Stride);
    ASSERT_EQ(0u, reader.Start());

    EXPECT_EQ(8u, reader.ReadFrame(ImageBytes).plane);
}

TEST(DeviceStream, AFieldCameraSendsTwoFieldsOfHalfTheRowsEach) {
    StreamWorld folary("folary");
    StreamReader reader(folary.client.get(), Stride);
    ASSERT_EQ(0u, reader.Start());

    const ReceivedFrame first = reader.ReadFrame(ImageBytes / 2);
    const ReceivedFrame second = reader.ReadFrame(ImageBytes / 2);

    EXPECT_EQ(1u, first.field);
    EXPECT_EQ(0u, second.field);
    EXPECT_EQ(first.rollingFrameNumber, second.rollingFrameNumber);
}

TEST(DeviceStream, AMetronaSendsSamplesOf16BitsWhateverTheDepthCodeSays) {
    StreamWorld metrona("metrona");
    StreamReader reader(metrona.client.get(), Stride);
    ASSERT_EQ(0u, reader.Start());

    const ReceivedFrame frame = reader.ReadFrame(2 * ImageBytes);

    EXPECT_EQ(15u, frame.sampleBits);
    EXPECT_EQ(2 * ImageBytes, metrona.world.ReadFrames().front().bytes);
}

TEST(DeviceStream, PacketsKeepWithinTheReservationAndTheCamerasOwnLimit) {
    StreamWorld mono("mono");
    mono.SetControl(20, 300);
    mono.TakeOver();
    StreamReader reader(mono.client.get(), Stride);
    ASSERT_EQ(0u, reader.Start());
    EXPECT_EQ(300u, reader.ReadPacket().size());
    reader.Stop();

    mono.SetControl(20, 5000);
    mono.TakeOver();
    ASSERT_EQ(0u, mono.client->Call(FW_IOCTL_FREE_RESOURCES, &reader.stream.resources));
    StreamReader wide(mono.client.get(), Stride);
    ASSERT_EQ(0u, wide.Start());
    EXPECT_EQ(Stride - PacketSlotExtraBytes, wide.ReadPacket().size());
}

TEST(DeviceStream, AListenerWithAnotherTagGetsNoPackets) {
    StreamWorld mono("mono");
    StreamReader reader(mono.client.get(), Stride, 2, SpeedFlagS800, /*tag=*/0);

    ASSERT_EQ(0u, reader.Start());
    ASSERT_EQ(0u, mono.client->Write(0xD0002000 + 4 * 30, 1));

    EXPECT_FALSE(reader.requests[0]->IsComplete());
    EXPECT_EQ(0u, mono.world.GetState().framesExposed);
}

TEST(DeviceStream, ASecondStartBeginsWithANewFrame) {
    StreamWorld mono("mono");
    StreamReader reader(mono.client.get(), Stride);
    ASSERT_EQ(0u, reader.Start());
    ASSERT_FALSE(reader.ReadPacket().empty());
    reader.Stop();
    EXPECT_EQ(0u, mono.world.GetState().attachedBuffers);
    EXPECT_EQ(0u, mono.world.GetState().isStreaming);
    ASSERT_EQ(0u, mono.client->Call(FW_IOCTL_FREE_RESOURCES, &reader.stream.resources));

    StreamReader again(mono.client.get(), Stride);
    ASSERT_EQ(0u, again.Start());

    EXPECT_EQ(ImageBytes, again.ReadFrame(ImageBytes).pixels.size());
}

TEST(DeviceStream, ACloseEndsAttachedBuffersWithError995) {
    StreamWorld mono("mono");
    StreamReader reader(mono.client.get(), Stride);
    ASSERT_EQ(0u, reader.Start());
    ASSERT_FALSE(reader.ReadRequest().empty());

    mono.client->Close();

    std::size_t aborted = 0;
    for (const auto& request : reader.requests) {
        EXPECT_TRUE(request->IsComplete());
        aborted += request->error == PlatformErrorOperationAborted;
    }
    EXPECT_GT(aborted, 0u);
}

TEST(DeviceStream, RealTimePassesAtScale1) {
    StreamWorld mono(R"({"base": "mono", "timeScale": 1})");
    StreamReader reader(mono.client.get(), Stride, 30);
    ASSERT_EQ(0u, reader.Start());
    const auto begin = std::chrono::steady_clock::now();

    for (int i = 0; i < 20; ++i) ASSERT_FALSE(reader.ReadRequest().empty());

    // 600 cycles of 125 microseconds.
    EXPECT_GE(std::chrono::steady_clock::now() - begin, std::chrono::milliseconds(70));
}

TEST(DeviceStream, TheSameSeedGivesTheSameFrames) {
    constexpr char Scenario[] =
        R"({"base": "mono", "seed": 5, "cameras": [{"sensor": {"noise": true}}]})";
    std::vector<std::uint64_t> sums[2];
    for (auto& run : sums) {
        StreamWorld mono(Scenario);
        StreamReader reader(mono.client.get(), Stride);
        ASSERT_EQ(0u, reader.Start());
        for (int i = 0; i < 3; ++i) {
            const ReceivedFrame frame = reader.ReadFrame(ImageBytes);
            run.push_back(CalculateChecksum(frame.pixels.data(), frame.pixels.size()));
        }
    }

    EXPECT_EQ(sums[0], sums[1]);
}

}  // namespace
}  // namespace ZV::Test
