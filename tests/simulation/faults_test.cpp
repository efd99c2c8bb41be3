#include <gtest/gtest.h>

#include <string>
#include <thread>

#include "hal/platform/last_error.h"
#include "hal/stream_format.h"
#include "simulation/register_file.h"
#include "simulation/stream_reader.h"
#include "support/simulation_world.h"
#include "support/wait_until.h"

namespace ZV::Test {
namespace {

using namespace Simulation;

// 7 packets of at most 500 bytes.
constexpr std::uint32_t Width = 64, Height = 48, Stride = 512;
constexpr std::uint64_t ImageBytes = Width * Height;
constexpr std::uint32_t PacketsPerFrame = 7;

class World : public SimulationWorld {
  public:
    explicit World(const std::string& faults)
        : SimulationWorld(R"({"base": "mono", "cameras": [{"faults": [)" + faults + "]}]}") {
        EXPECT_TRUE(Start());
    }
};

TEST(Faults, ARequestFailsAtItsNumber) {
    const World world(R"({"kind": "failRequest", "code": "FW_IOCTL_ASYNC_READ", "request": 2,
                          "error": 170})");
    DriverClient client;
    std::uint32_t value = 0;

    EXPECT_EQ(0u, client.Read(ControlAddress, &value));
    EXPECT_EQ(0u, client.Write(ControlAddress + 4, 0));
    EXPECT_EQ(PlatformErrorBusy, client.Read(ControlAddress, &value));
    EXPECT_EQ(0u, client.Read(ControlAddress, &value));
    EXPECT_EQ(1u, world.GetState().requestsFailed);
}

TEST(Faults, ARequestFailsOnItsCompletionWhenThatIsAskedFor) {
    const World world(R"({"kind": "failRequest", "code": "FW_IOCTL_ASYNC_WRITE", "error": 170,
                          "address": "0xD0002014", "pended": true})");
    DriverClient client;
    TestRequest other(FW_IOCTL_ASYNC_WRITE, MakeWriteRecord(ControlAddress + 4, {1}), 0);
    TestRequest write(FW_IOCTL_ASYNC_WRITE, MakeWriteRecord(ControlAddress + 20, {1}), 0);

    EXPECT_EQ(PlatformErrorIoPending, other.Send(client.handle));
    EXPECT_EQ(PlatformErrorIoPending, write.Send(client.handle));
    ASSERT_TRUE(other.Wait());
    ASSERT_TRUE(write.Wait());

    EXPECT_EQ(0u, other.error);
    EXPECT_EQ(PlatformErrorBusy, write.error);
    EXPECT_EQ(0u, world.Peek(ControlAddress + 20));
}

TEST(Faults, ARunOfRequestsFails) {
    const World world(R"({"kind": "failRequest", "request": 2, "count": 2})");
    DriverClient client;
    std::vector<std::uint32_t> errors;

    for (int i = 0; i < 4; ++i) {
        std::uint32_t word = 0;
        errors.push_back(client.Call(FW_IOCTL_QUERY_BUSY, &word));
    }

    EXPECT_EQ((std::vector<std::uint32_t>{0, 31, 31, 0}), errors);
}

TEST(Faults, ARequestIsAnsweredAtOnceInsteadOfPended) {
    const World world(R"({"kind": "answerAtOnce", "code": "FW_IOCTL_ASYNC_READ"})");
    DriverClient client;
    TestRequest read(FW_IOCTL_ASYNC_READ, MakeReadRecord(PrimaryIdentityAddress, 1), 4);

    EXPECT_EQ(0u, read.Send(client.handle));

    EXPECT_EQ((std::vector<std::uint8_t>{0, 5, 0, 0}), read.output);
    EXPECT_EQ(4u, read.bytes);
    EXPECT_EQ(0u, read.completions);
}

TEST(Faults, ARequestThatNeverCompletesEndsWithTheUnplugging) {
    World world(R"({"kind": "neverComplete", "code": "FW_IOCTL_ASYNC_READ"})");
    DriverClient client;
    TestRequest read(FW_IOCTL_ASYNC_READ, MakeReadRecord(PrimaryIdentityAddress, 1), 4);
    std::uint32_t value = 0;
    ASSERT_EQ(PlatformErrorIoPending, read.Send(client.handle));
    ASSERT_EQ(0u, client.Read(PrimaryIdentityAddress, &value));
    EXPECT_FALSE(read.IsComplete());
    EXPECT_EQ(1u, world.GetState().pendedRequests);

    ASSERT_TRUE(world.Unplug());

    EXPECT_TRUE(read.IsComplete());
    EXPECT_EQ(PlatformErrorDeviceNotConnected, read.error);
}

TEST(Faults, ARequestThatNeverCompletesEndsWithTheClose) {
    const World world(R"({"kind": "neverComplete", "code": "FW_IOCTL_ASYNC_WRITE"})");
    DriverClient client;
    TestRequest write(FW_IOCTL_ASYNC_WRITE, MakeWriteRecord(ControlAddress + 20, {1}), 0);
    ASSERT_EQ(PlatformErrorIoPending, write.Send(client.handle));

    client.Close();

    EXPECT_TRUE(write.IsComplete());
    EXPECT_EQ(PlatformErrorOperationAborted, write.error);
}

TEST(Faults, ACallerWithoutOverlappedRecordIsHeldUntilTheDeviceGoesAway) {
    World world(R"({"kind": "neverComplete", "code": "FW_IOCTL_QUERY_BUSY"})");
    DriverClient client;
    std::atomic<std::uint32_t> error{0};

    std::thread caller([&] {
        std::uint32_t word = 0;
        error = client.Call(FW_IOCTL_QUERY_BUSY, &word);
    });
    EXPECT_TRUE(WaitUntil([&] { return world.GetState().requestsServed == 1; }));
    ASSERT_TRUE(world.Unplug());
    caller.join();

    EXPECT_EQ(PlatformErrorDeviceNotConnected, error);
}

TEST(Faults, AnAnswerIsShort) {
    const World world(R"({"kind": "shortAnswer", "code": "FW_IOCTL_ASYNC_READ", "bytes": 3})");
    DriverClient client;
    TestRequest read(FW_IOCTL_ASYNC_READ, MakeReadRecord(PrimaryIdentityAddress, 1), 4);

    ASSERT_EQ(PlatformErrorIoPending, read.Send(client.handle));
    ASSERT_TRUE(read.Wait());

    EXPECT_EQ(0u, read.error);
    EXPECT_EQ(3u, read.bytes);
}

TEST(Faults, ARequestUnplugsTheDeviceAndAnotherPlugsItIn) {
    const World world(R"({"kind": "unplug", "request": 2}, {"kind": "plug", "request": 4})");
    DriverClient client;
    std::uint32_t word = 0;

    EXPECT_EQ(0u, client.Call(FW_IOCTL_QUERY_BUSY, &word));
    EXPECT_EQ(PlatformErrorDeviceNotConnected, client.Call(FW_IOCTL_QUERY_BUSY, &word));
    EXPECT_TRUE(ListDevices().empty());
    EXPECT_EQ(PlatformErrorDeviceNotConnected, client.Call(FW_IOCTL_QUERY_BUSY, &word));
    EXPECT_EQ(PlatformErrorDeviceNotConnected, client.Call(FW_IOCTL_QUERY_BUSY, &word));
    EXPECT_EQ(1u, ListDevices().size());
}

TEST(Faults, AFaultIsAddedWhileTheBusRuns) {
    World world("");
    DriverClient client;
    std::uint32_t word = 0;
    ASSERT_EQ(0u, client.Call(FW_IOCTL_QUERY_BUSY, &word));

    ASSERT_TRUE(world.AddFault(R"({"kind": "failRequest", "error": 5})"));
    EXPECT_FALSE(world.AddFault(R"({"kind": "nothing"})"));
    EXPECT_FALSE(world.AddFault("nonsense"));
    EXPECT_FALSE(world.AddFault(R"({"kind": "failRequest"})", 1));

    EXPECT_EQ(PlatformErrorAccessDenied, client.Call(FW_IOCTL_QUERY_BUSY, &word));
    EXPECT_EQ(0u, client.Call(FW_IOCTL_QUERY_BUSY, &word));
}

TEST(Faults, AProbabilityOfOneMeetsEachRequestAndOfZeroNone) {
    const World world(R"({"kind": "failRequest", "code": "FW_IOCTL_QUERY_BUSY", "probability": 1},
                         {"kind": "failRequest", "probability": 0, "error": 5})");
    DriverClient client;
    std::uint32_t word = 0, value = 0;

    for (int i = 0; i < 3; ++i) EXPECT_EQ(31u, client.Call(FW_IOCTL_QUERY_BUSY, &word));
    EXPECT_EQ(0u, client.Read(ControlAddress, &value));
}

TEST(Faults, DiscoveryFailsAtItsStep) {
    SimulationWorld world(R"({"base": "ten", "discoveryFaults": [
        {"step": 1, "listing": 1, "error": 5}, {"step": 5, "listing": 2, "error": 170},
        {"step": 6, "listing": 3, "error": 31}]})");
    ASSERT_TRUE(world.Start());
    void* list = nullptr;

    EXPECT_EQ(PlatformErrorAccessDenied, GetDriver().openList(&list));
    ASSERT_EQ(0u, GetDriver().openList(&list));
    std::uint32_t required = 0;
    char path[300];
    EXPECT_EQ(0u, GetDriver().selectInterface(list, 0));
    EXPECT_EQ(PlatformErrorInsufficientBuffer,
              GetDriver().getDetail(list, 0, nullptr, 0, &required));
    EXPECT_EQ(0u, GetDriver().getDetail(list, 0, path, required, &required));
    EXPECT_EQ(PlatformErrorBusy, GetDriver().selectInterface(list, 1));
    GetDriver().closeList(list);
    EXPECT_EQ(1u, ListDevices().size());
    EXPECT_EQ(10u, ListDevices().size());
}

TEST(Faults, ADevicePathMayHaveAnyLength) {
    SimulationWorld world(
        R"({"base": "mono", "cameras": [{"path": "device", "pathLength": 1000}]})");
    ASSERT_TRUE(world.Start());

    const std::vector<std::string> paths = ListDevices();

    ASSERT_EQ(1u, paths.size());
    EXPECT_EQ(1000u, paths.front().size());
    EXPECT_EQ("devicexx", paths.front().substr(0, 8));
    EXPECT_TRUE(DriverClient().IsOpen());
}

class StreamFaults {
  public:
    explicit StreamFaults(const std::string& faults) : world(faults), reader(&client, Stride) {
        SetUpImage(&client, Width, Height);
        EXPECT_EQ(0u, reader.Start());
    }

    std::vector<Payload> ReadPackets(std::size_t count) {
        std::vector<Payload> packets;
        for (std::size_t i = 0; i < count; ++i) packets.push_back(reader.ReadPacket());
        return packets;
    }

    World world;
    DriverClient client;
    StreamReader reader;
};

std::uint32_t GetOffset(const Payload& payload) {
    return payload[PlainOffsetHighOffset] << 16 | payload[PlainOffsetLowOffset] << 8 |
           payload[PlainOffsetLowOffset + 1];
}

TEST(Faults, APacketIsLost) {
    StreamFaults stream(R"({"kind": "losePacket", "frame": 2, "packet": 3})");
    const std::vector<Payload> packets = stream.ReadPackets(2 * PacketsPerFrame);

    EXPECT_EQ(PlainFlagFirst, packets[PacketsPerFrame][PlainFlagsOffset]);
    const Payload& before = packets[PacketsPerFrame + 2];
    const Payload& after = packets[PacketsPerFrame + 3];
    EXPECT_EQ(2u * (Stride - PacketSlotExtraBytes - PlainHeaderBytes - TailMarkBytes),
              GetOffset(after) - GetOffset(before));
    EXPECT_EQ(PlainFlagFirst, packets[2 * PacketsPerFrame - 1][PlainFlagsOffset]);
}

TEST(Faults, APacketIsRepeated) {
    StreamFaults stream(R"({"kind": "repeatPacket", "frame": 1, "packet": 6})");
    const std::vector<Payload> packets = stream.ReadPackets(PacketsPerFrame + 2);

    EXPECT_NE(packets[5], packets[6]);
    EXPECT_EQ(packets[6], packets[7]);
    EXPECT_EQ(PlainFlagFirst, packets[8][PlainFlagsOffset]);
}

TEST(Faults, APacketIsCutCorruptedAndWithoutItsTailMark) {
    StreamFaults stream(R"({"kind": "truncatePacket", "packet": 1, "bytes": 20},
                           {"kind": "corruptPacket", "packet": 2, "offset": 1, "bytes": 1},
                           {"kind": "missingTail", "packet": 3})");
    const std::vector<Payload> packets = stream.ReadPackets(2 * PacketsPerFrame);

    for (std::size_t first = 0; first < 2 * PacketsPerFrame; first += PacketsPerFrame) {
        EXPECT_EQ(20u, packets[first + 1].size());
        EXPECT_EQ(0xFE, packets[first + 2][PlainMarkOffset]);
        EXPECT_EQ(TailMarkByte, packets[first + 2].back());
        EXPECT_EQ(0, packets[first + 3].back());
        EXPECT_EQ(TailMarkByte, packets[first + 4].back());
    }
    EXPECT_GE(stream.world.GetState().packetsCorrupted, 2u) << "the camera may be ahead";
}

TEST(Faults, AFrameHasAWrongParameterSetNumber) {
    StreamFaults stream(R"({"kind": "wrongPsn", "frame": 2})");

    EXPECT_EQ(7u, stream.reader.ReadFrame(ImageBytes).psn);
    EXPECT_EQ(8u, stream.reader.ReadFrame(ImageBytes).psn);
    EXPECT_EQ(7u, stream.reader.ReadFrame(ImageBytes).psn);
}

TEST(Faults, AFrameBeginsAnewInItsMiddle) {
    StreamFaults stream(R"({"kind": "frameStart", "frame": 1, "packet": 3})");
    const std::vector<Payload> packets = stream.ReadPackets(3 + PacketsPerFrame + 1);

    EXPECT_EQ(PlainFlagFirst, packets[0][PlainFlagsOffset]);
    EXPECT_EQ(0, packets[2][PlainFlagsOffset]);
    EXPECT_EQ(PlainFlagFirst, packets[3][PlainFlagsOffset]);
    EXPECT_NE(packets[0][PlainFrameNumberOffset], packets[3][PlainFrameNumberOffset]);
    const ZentaraSimulationState state = stream.world.GetState();
    EXPECT_EQ(state.framesExposed + 1, state.framesBegun);
    EXPECT_EQ(PlainFlagFirst, packets[3 + PacketsPerFrame][PlainFlagsOffset]);
}

TEST(Faults, ARequestIsOverwrittenWithLaterPackets) {
    StreamFaults stream(R"({"kind": "overwriteRequest", "frame": 1, "packet": 0})");

    const std::vector<Payload> packets = stream.reader.ReadRequest();

    ASSERT_EQ(PacketsPerRequest, packets.size());
    // The exposure takes 8 cycles, each of the frames 7.
    EXPECT_EQ(PlainFlagIgnore, packets[0][PlainFlagsOffset]);
    EXPECT_EQ(PlainFlagFirst, packets[8][PlainFlagsOffset]);
    EXPECT_EQ(3u, packets[8][PlainFrameNumberOffset]);
}

TEST(Faults, ABusResetCutsTheFrameAndFailsTheRequestUnderWay) {
    StreamFaults stream(R"({"kind": "busReset", "frame": 1, "packet": 3})");

    (void)stream.reader.ReadRequest();
    EXPECT_EQ(PlatformErrorGeneralFailure, stream.reader.lastError);
    EXPECT_EQ(1u, stream.world.GetState().buffersFailed);

    EXPECT_FALSE(stream.reader.ReadRequest().empty());
    EXPECT_EQ(0u, stream.reader.lastError);
    EXPECT_TRUE(WaitUntil([&] { return !stream.world.ReadFrames().empty(); }));
    EXPECT_EQ(2u, stream.world.ReadFrames().front().frame);
}

TEST(Faults, ABusResetEndsTheRegisterRequestThatItMeetsAndLetsOthersPass) {
    const World world(R"({"kind": "busReset", "request": 1, "count": 2})");
    DriverClient client;
    std::uint32_t word = 0;
    TestRequest cut(FW_IOCTL_ASYNC_READ, MakeReadRecord(PrimaryIdentityAddress, 1), 4);
    TestRequest whole(FW_IOCTL_ASYNC_READ, MakeReadRecord(PrimaryIdentityAddress, 1), 4);

    EXPECT_EQ(0u, client.Call(FW_IOCTL_QUERY_BUSY, &word));
    ASSERT_EQ(PlatformErrorIoPending, cut.Send(client.handle));
    ASSERT_TRUE(cut.Wait());
    ASSERT_EQ(PlatformErrorIoPending, whole.Send(client.handle));
    ASSERT_TRUE(whole.Wait());

    EXPECT_EQ(PlatformErrorGeneralFailure, cut.error);
    EXPECT_EQ(0u, whole.error);
    EXPECT_EQ(1u, world.GetState().requestsFailed);
    EXPECT_EQ(1u, world.GetState().registerRequestsFailed);
}

// Whether the reset finds the first request pended is up to the threads; the count is not.
TEST(Faults, ARequestThatFailsIsCountedOnceThoughAResetEndsIt) {
    constexpr std::uint32_t Pairs = 200;
    const World world(R"({"kind": "failRequest", "code": "FW_IOCTL_ASYNC_READ", "count": 0,
                          "pended": true},
                         {"kind": "busReset", "code": "FW_IOCTL_ASYNC_WRITE", "count": 0})");
    DriverClient client;
    for (std::uint32_t i = 0; i < Pairs; ++i) {
        TestRequest read(FW_IOCTL_ASYNC_READ, MakeReadRecord(PrimaryIdentityAddress, 1), 4);
        TestRequest write(FW_IOCTL_ASYNC_WRITE, MakeWriteRecord(ControlAddress + 4, {1}), 0);

        ASSERT_EQ(PlatformErrorIoPending, read.Send(client.handle));
        const bool isPended = write.Send(client.handle) == PlatformErrorIoPending;
        ASSERT_TRUE(read.Wait());
        ASSERT_TRUE(!isPended || write.Wait());
    }

    EXPECT_EQ(2 * Pairs, world.GetState().requestsFailed);
    EXPECT_EQ(2 * Pairs, world.GetState().registerRequestsFailed);
}

TEST(Faults, BuffersThatAreRefusedAndThatFailAreCountedApart) {
    const World world(R"({"kind": "failRequest", "code": "FW_IOCTL_ATTACH_BUFFER", "request": 1},
                         {"kind": "failRequest", "code": "FW_IOCTL_ATTACH_BUFFER", "request": 2,
                          "pended": true})");
    DriverClient client;
    std::vector<std::uint8_t> buffer(PacketsPerRequest * Stride);
    TestRequest refused(FW_IOCTL_ATTACH_BUFFER, buffer, buffer.size());
    TestRequest failed(FW_IOCTL_ATTACH_BUFFER, buffer, buffer.size());

    EXPECT_EQ(31u, refused.Send(client.handle));
    ASSERT_EQ(PlatformErrorIoPending, failed.Send(client.handle));
    ASSERT_TRUE(failed.Wait());

    EXPECT_EQ(1u, world.GetState().buffersRefused);
    EXPECT_EQ(1u, world.GetState().buffersFailed);
}

TEST(Faults, AFrameUnplugsTheDevice) {
    StreamFaults stream(R"({"kind": "unplug", "frame": 2, "packet": 1})");

    for (const auto& request : stream.reader.requests) EXPECT_TRUE(request->Wait());

    EXPECT_EQ(PlatformErrorDeviceNotConnected, stream.reader.requests.back()->error);
    EXPECT_EQ(1u, stream.world.GetState().framesSent);
    EXPECT_EQ(0u, stream.world.GetState().isStreaming);
}

}  // namespace
}  // namespace ZV::Test
