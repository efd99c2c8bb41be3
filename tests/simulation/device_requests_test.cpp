#include <gtest/gtest.h>

#include <cstring>
#include <thread>

#include "camera/register_map.h"
#include "hal/platform/last_error.h"
#include "hal/stream_format.h"
#include "simulation/driver_client.h"
#include "simulation/register_file.h"
#include "support/simulation_world.h"
#include "support/wait_until.h"

namespace ZV::Test {
namespace {

using namespace Simulation;

class World : public SimulationWorld {
  public:
    explicit World(std::string_view scenario) : SimulationWorld(scenario) { EXPECT_TRUE(Start()); }
};

TEST(DeviceRequests, ARegisterReadIsPendedAndAnswersInBusOrder) {
    const World world("mono");
    DriverClient client;
    TestRequest read(FW_IOCTL_ASYNC_READ, MakeReadRecord(PrimaryIdentityAddress, 1), 4);

    const std::uint32_t sent = read.Send(client.handle);

    EXPECT_EQ(PlatformErrorIoPending, sent);
    ASSERT_TRUE(read.Wait());
    EXPECT_EQ(0u, read.error);
    EXPECT_EQ(4u, read.bytes);
    EXPECT_EQ((std::vector<std::uint8_t>{0, 5, 0, 0}), read.output);
}

TEST(DeviceRequests, ARegisterKeepsWhatIsWritten) {
    const World world("mono");
    DriverClient client;
    std::uint32_t value = 0;

    ASSERT_EQ(0u, client.Write(ControlAddress + 4 * 5, 0x12345678));
    ASSERT_EQ(0u, client.Read(ControlAddress + 4 * 5, &value));

    EXPECT_EQ(0x12345678u, value);
    EXPECT_EQ(0x12345678u, world.Peek(ControlAddress + 4 * 5));
}

TEST(DeviceRequests, AWriteIsPendedUnlessTheScenarioAnswersItAtOnce) {
    const std::vector<std::uint8_t> record = MakeWriteRecord(ControlAddress + 20, {1});
    {
        const World world("mono");
        DriverClient client;
        TestRequest write(FW_IOCTL_ASYNC_WRITE, record, 0);
        EXPECT_EQ(PlatformErrorIoPending, write.Send(client.handle));
        EXPECT_TRUE(write.Wait());
    }
    const World world(R"({"base": "mono", "cameras": [{"writes": "atOnce"}]})");
    DriverClient client;
    TestRequest write(FW_IOCTL_ASYNC_WRITE, record, 0);
    EXPECT_EQ(0u, write.Send(client.handle));
    EXPECT_FALSE(write.IsComplete());
    EXPECT_EQ(1u, world.Peek(ControlAddress + 20));
}

TEST(DeviceRequests, PendedRequestsEndInTheirOrder) {
    const World world("mono");
    DriverClient client;
    std::vector<std::unique_ptr<TestRequest>> writes;
    for (std::uint32_t i = 0; i < 50; ++i) {
        writes.push_back(std::make_unique<TestRequest>(
            FW_IOCTL_ASYNC_WRITE, MakeWriteRecord(ControlAddress + 20, {i}), 0));
        ASSERT_EQ(PlatformErrorIoPending, writes.back()->Send(client.handle));
    }
    for (const auto& write : writes) ASSERT_TRUE(write->Wait());

    const std::vector<RegisterWrite> traced = world.ReadRegisterWrites();
    ASSERT_EQ(writes.size(), traced.size());
    for (std::uint32_t i = 0; i < traced.size(); ++i) {
        EXPECT_EQ((RegisterWrite{ControlAddress + 20, {i}, 0}), traced[i]);
    }
}

TEST(DeviceRequests, ABlockReadGivesTheWholeBlock) {
    const World world("mono");
    DriverClient client;
    std::uint32_t configuration[202] = {};

    ASSERT_EQ(0u, client.Read(ConfigurationAddress, configuration, 202));

    EXPECT_EQ(MakeVersion(2, 9), configuration[0]);
    EXPECT_EQ(1392u << 16 | 1040, configuration[4]);
    EXPECT_EQ(5u, configuration[14] >> 16);
}

TEST(DeviceRequests, AReadOfNoQuadletsIsAnswered) {
    const World world("mono");
    DriverClient client;
    std::uint32_t nothing = 0;

    EXPECT_EQ(0u, client.Read(ControlAddress, &nothing, 0));
}

TEST(DeviceRequests, AnAddressWithoutMemoryIsRefused) {
    const World world("mono");
    DriverClient client;
    std::uint32_t values[2] = {};

    EXPECT_EQ(PlatformErrorGeneralFailure, client.Read(0xFA000000, values));
    EXPECT_EQ(PlatformErrorGeneralFailure, client.Read(SecondaryIdentityAddress, values));
    EXPECT_EQ(PlatformErrorGeneralFailure, client.Read(ControlAddress + 2, values));
    EXPECT_EQ(PlatformErrorGeneralFailure, client.Read(ControlAddress + 4 * 255, values, 2));
    EXPECT_EQ(PlatformErrorGeneralFailure, client.Read(0xFFFFFFFC, values, 2));
    EXPECT_EQ(PlatformErrorGeneralFailure, client.Write(DirectoryAddress + 8, 0));
    EXPECT_EQ(PlatformErrorGeneralFailure, client.Write(PrimaryIdentityAddress, 0));
}

TEST(DeviceRequests, RegistersBeyondABlocksLengthAnswerUnlessBlocksAreStrict) {
    std::uint32_t value = 1;
    {
        const World world("mono");
        DriverClient client;
        EXPECT_EQ(0u, client.Read(ControlAddress + 4 * 43, &value));
        EXPECT_EQ(0u, value);
    }
    const World world(R"({"base": "mono", "cameras": [{"strictBlocks": true}]})");
    DriverClient client;
    EXPECT_EQ(0u, client.Read(ControlAddress + 4 * 42, &value));
    EXPECT_EQ(PlatformErrorGeneralFailure, client.Read(ControlAddress + 4 * 43, &value));
}

TEST(DeviceRequests, TheIdentityStandsWhereTheScenarioPutsIt) {
    const World world(
        R"({"base": "mono", "cameras": [{"identityAddress": "secondary", "identity": "0x000D0001"}]})");
    DriverClient client;
    std::uint32_t value = 0;

    EXPECT_NE(0u, client.Read(PrimaryIdentityAddress, &value));
    EXPECT_EQ(0u, client.Read(SecondaryIdentityAddress, &value));

    EXPECT_EQ(0x000D0001u, value);
}

TEST(DeviceRequests, WrongLengthsAndRecordsAreRefused) {
    const World world("mono");
    DriverClient client;
    std::uint64_t word = 0;
    std::uint8_t read[64] = {};

    EXPECT_EQ(PlatformErrorBadLength, client.Call(FW_IOCTL_QUERY_BUSY, &word, 8, &word, 8));
    EXPECT_EQ(PlatformErrorBadLength, client.Call(FW_IOCTL_FREE_BANDWIDTH, &word, 4, &word, 4));
    EXPECT_EQ(PlatformErrorInvalidParameter,
              client.Call(FW_IOCTL_QUERY_BUSY, nullptr, 4, &word, 4));
    EXPECT_EQ(PlatformErrorInvalidParameter, client.Call(0x222000, &word, 4, &word, 4));
    EXPECT_EQ(PlatformErrorBadLength, client.Call(FW_IOCTL_ASYNC_READ, read, 44, read, 4));
    EXPECT_EQ(PlatformErrorInvalidParameter, client.Call(FW_IOCTL_ASYNC_READ, read, 48, read, 4));
    EXPECT_EQ(PlatformErrorBadLength, client.Call(FW_IOCTL_ASYNC_WRITE, read, 36, nullptr, 0));

    std::vector<std::uint8_t> record = MakeReadRecord(ControlAddress, 2);
    EXPECT_EQ(PlatformErrorBadLength, client.Call(FW_IOCTL_ASYNC_READ, record.data(), 48, read, 4));
    record = MakeWriteRecord(ControlAddress + 4, {1, 2});
    record.pop_back();
    EXPECT_EQ(PlatformErrorBadLength,
              client.Call(FW_IOCTL_ASYNC_WRITE, record.data(),
                          static_cast<std::uint32_t>(record.size()), nullptr, 0));
}

TEST(DeviceRequests, AnUnknownHandleIsRefused) {
    const World world("mono");
    DriverClient client;
    void* const handle = client.handle;
    client.Close();
    std::uint32_t word = 0;
    KernelRequest request{FW_IOCTL_QUERY_BUSY, 4, &word, &word, 4, 0, nullptr};

    EXPECT_EQ(PlatformErrorInvalidHandle, GetDriver().control(handle, &request, nullptr));
    EXPECT_EQ(PlatformErrorInvalidHandle, GetDriver().control(nullptr, &request, nullptr));
    GetDriver().close(handle);
    GetDriver().cancel(handle, &request);
}

TEST(DeviceRequests, ASecondOpenSucceedsAndHearsThatTheDeviceIsBusy) {
    const World world("mono");
    DriverClient first, second;
    std::uint32_t firstBusy = 7, secondBusy = 7;

    ASSERT_TRUE(second.IsOpen());
    EXPECT_EQ(0u, first.Call(FW_IOCTL_QUERY_BUSY, &firstBusy));
    EXPECT_EQ(0u, second.Call(FW_IOCTL_QUERY_BUSY, &secondBusy));

    EXPECT_EQ(0u, firstBusy);
    EXPECT_EQ(DeviceIsBusy, secondBusy);
    EXPECT_EQ(2u, world.GetState().openHandles);
}

TEST(DeviceRequests, AnotherProcessHoldsTheDeviceFromOneOpenToAnother) {
    const World world(R"({"base": "mono", "cameras": [{"held": {"from": 2, "to": 3}}]})");
    std::vector<std::uint32_t> answers;

    for (int i = 0; i < 4; ++i) {
        DriverClient client;
        std::uint32_t busy = 7;
        EXPECT_EQ(0u, client.Call(FW_IOCTL_QUERY_BUSY, &busy));
        answers.push_back(busy);
    }

    EXPECT_EQ((std::vector<std::uint32_t>{0, 1, 1, 0}), answers);
}

TEST(DeviceRequests, ReservationsAreCountedAndGoneAfterTheClose) {
    const World world("mono");
    DriverClient client;
    Stream stream;

    ASSERT_EQ(0u, client.Reserve(112, SpeedFlagS800, 1, &stream));
    EXPECT_EQ(1u, world.GetState().reservedBandwidths);
    EXPECT_EQ(1u, world.GetState().reservedChannels);
    EXPECT_EQ(1u, world.GetState().reservedResources);
    client.Close();

    EXPECT_EQ(0u, world.GetState().reservedBandwidths);
    EXPECT_EQ(0u, world.GetState().reservedChannels);
    EXPECT_EQ(0u, world.GetState().reservedResources);
}

TEST(DeviceRequests, FreeingWhatIsNoneOrGoneIsAccepted) {
    const World world("mono");
    DriverClient client;
    Stream stream;
    ASSERT_EQ(0u, client.Reserve(112, SpeedFlagS800, 1, &stream));
    std::uint64_t none = 0, unknown = ~0ull;
    std::uint32_t noChannel = AnyChannel, wrongChannel = 64;

    for (int i = 0; i < 2; ++i) {
        EXPECT_EQ(0u, client.Call(FW_IOCTL_FREE_RESOURCES, &stream.resources));
        EXPECT_EQ(0u, client.Call(FW_IOCTL_FREE_CHANNEL, &stream.channel));
        EXPECT_EQ(0u, client.Call(FW_IOCTL_FREE_BANDWIDTH, &stream.bandwidth));
    }
    EXPECT_EQ(0u, client.Call(FW_IOCTL_FREE_RESOURCES, &none));
    EXPECT_EQ(0u, client.Call(FW_IOCTL_FREE_BANDWIDTH, &none));
    EXPECT_EQ(0u, client.Call(FW_IOCTL_FREE_CHANNEL, &noChannel));
    EXPECT_EQ(PlatformErrorInvalidParameter, client.Call(FW_IOCTL_FREE_RESOURCES, &unknown));
    EXPECT_EQ(PlatformErrorInvalidParameter, client.Call(FW_IOCTL_FREE_BANDWIDTH, &unknown));
    EXPECT_EQ(PlatformErrorInvalidParameter, client.Call(FW_IOCTL_FREE_CHANNEL, &wrongChannel));
}

TEST(DeviceRequests, AChannelOfAnotherCameraCannotBeFreed) {
    const World world("ten");
    DriverClient first(0), second(1);
    Stream streams[2];
    ASSERT_EQ(0u, first.Reserve(12, SpeedFlagS800, 1, &streams[0]));
    ASSERT_EQ(0u, second.Reserve(12, SpeedFlagS800, 1, &streams[1]));

    EXPECT_EQ(PlatformErrorAccessDenied, first.Call(FW_IOCTL_FREE_CHANNEL, &streams[1].channel));

    EXPECT_EQ(1u, world.GetState(1).reservedChannels);
}

TEST(DeviceRequests, CamerasShareTheChannelsAndTheBandwidthOfTheirBus) {
    const World world("ten");
    DriverClient first(0), second(1);
    Stream streams[2];

    ASSERT_EQ(0u, first.Reserve(9056, SpeedFlagS800, 1, &streams[0]));
    EXPECT_EQ(PlatformErrorNoSystemResources, second.Reserve(9056, SpeedFlagS800, 1, &streams[1]));
    ASSERT_EQ(0u, second.Reserve(112, SpeedFlagS800, 1, &streams[1]));
    EXPECT_NE(streams[0].channel, streams[1].channel);
    ASSERT_EQ(0u, first.Call(FW_IOCTL_FREE_BANDWIDTH, &streams[0].bandwidth));
    AllocateBandwidthRecord more{9056, SpeedFlagS800, 0, 0, 0};
    EXPECT_EQ(0u, second.Call(FW_IOCTL_ALLOC_BANDWIDTH, &more));
}

TEST(DeviceRequests, ABusHas64Channels) {
    const World world("mono");
    DriverClient client;

    for (int i = 0; i < 64; ++i) {
        AllocateChannelRecord record{AnyChannel, 0, 0};
        EXPECT_EQ(0u, client.Call(FW_IOCTL_ALLOC_CHANNEL, &record));
    }
    AllocateChannelRecord record{AnyChannel, 0, 0};
    EXPECT_EQ(PlatformErrorNoSystemResources, client.Call(FW_IOCTL_ALLOC_CHANNEL, &record));
}

TEST(DeviceRequests, ASlowBusRefusesResourcesAtS800AndStridesAbove4900) {
    const World world("s400");
    Stream stream;
    {
        DriverClient client;
        EXPECT_EQ(PlatformErrorNoSystemResources, client.Reserve(112, SpeedFlagS800, 1, &stream));
    }
    {
        DriverClient client;
        EXPECT_EQ(0u, client.Reserve(4900, SpeedFlagS400, 1, &stream));
    }
    DriverClient client;
    EXPECT_EQ(PlatformErrorNoSystemResources, client.Reserve(5012, SpeedFlagS400, 1, &stream));
    EXPECT_EQ(1u, world.GetState().reservedBandwidths);
}

TEST(DeviceRequests, ABufferIsAttachedOnlyWithResourcesAndInItsSize) {
    const World world("mono");
    DriverClient client;
    TestRequest early(FW_IOCTL_ATTACH_BUFFER, std::vector<std::uint8_t>(3360), 3360);
    EXPECT_EQ(PlatformErrorInvalidParameter, early.Send(client.handle));
    Stream stream;
    ASSERT_EQ(0u, client.Reserve(112, SpeedFlagS800, 1, &stream));

    TestRequest wrong(FW_IOCTL_ATTACH_BUFFER, std::vector<std::uint8_t>(3359), 3359);
    TestRequest good(FW_IOCTL_ATTACH_BUFFER, std::vector<std::uint8_t>(3360), 3360);
    EXPECT_EQ(PlatformErrorBadLength, wrong.Send(client.handle));
    EXPECT_EQ(PlatformErrorIoPending, good.Send(client.handle));
    EXPECT_EQ(1u, world.GetState().attachedBuffers);

    ASSERT_EQ(0u, client.Call(FW_IOCTL_DETACH_BUFFERS, &stream.resources));
    ASSERT_TRUE(good.Wait());
    EXPECT_EQ(PlatformErrorOperationAborted, good.error);
    EXPECT_EQ(1u, good.completions);
}

TEST(DeviceRequests, StreamEnterIsPendedUntilStreamLeave) {
    const World world("mono");
    DriverClient client;
    TestRequest enter(FW_IOCTL_STREAM_ENTER, std::vector<std::uint8_t>(4), 4);
    std::uint32_t word = 0;

    ASSERT_EQ(PlatformErrorIoPending, enter.Send(client.handle));
    EXPECT_FALSE(enter.IsComplete());
    EXPECT_EQ(0u, client.Call(FW_IOCTL_STREAM_LEAVE, &word));

    EXPECT_TRUE(enter.IsComplete());
    EXPECT_EQ(0u, enter.error);
}

TEST(DeviceRequests, ANotificationIsWaitedForOnlyWhileItIsEnabled) {
    const World world("mono");
    DriverClient client;
    const std::vector<std::uint8_t> block(NotifyRecordBytes);
    TestRequest early(FW_IOCTL_NOTIFY_WAIT, block, block.size());
    TestRequest wait(FW_IOCTL_NOTIFY_WAIT, block, block.size());
    std::uint32_t word = 0;

    EXPECT_EQ(PlatformErrorInvalidParameter, early.Send(client.handle));
    EXPECT_EQ(0u, client.Call(FW_IOCTL_NOTIFY_ENABLE, &word));
    EXPECT_EQ(PlatformErrorIoPending, wait.Send(client.handle));
    EXPECT_EQ(0u, client.Call(FW_IOCTL_NOTIFY_DISABLE, &word));

    EXPECT_TRUE(wait.IsComplete());
    EXPECT_EQ(PlatformErrorOperationAborted, wait.error);
}

TEST(DeviceRequests, ACancelEndsOneRequestWithError995) {
    const World world("mono");
    DriverClient client;
    TestRequest enter(FW_IOCTL_STREAM_ENTER, std::vector<std::uint8_t>(4), 4);
    ASSERT_EQ(PlatformErrorIoPending, enter.Send(client.handle));

    GetDriver().cancel(client.handle, &enter.request);
    GetDriver().cancel(client.handle, &enter.request);

    EXPECT_EQ(1u, enter.completions);
    EXPECT_EQ(PlatformErrorOperationAborted, enter.error);
}

TEST(DeviceRequests, TheEndOfTheBusEndsWhatIsPendedAndHandlesAnswerErrors) {
    World world("mono");
    DriverClient client;
    TestRequest enter(FW_IOCTL_STREAM_ENTER, std::vector<std::uint8_t>(4), 4);
    ASSERT_EQ(PlatformErrorIoPending, enter.Send(client.handle));

    world.End();

    EXPECT_TRUE(enter.IsComplete());
    EXPECT_EQ(PlatformErrorOperationAborted, enter.error);
    std::uint32_t word = 0;
    EXPECT_EQ(PlatformErrorDeviceNotConnected, client.Call(FW_IOCTL_QUERY_BUSY, &word));
    EXPECT_TRUE(ListDevices().empty());
}

TEST(DeviceRequests, AnUnpluggedDeviceEndsItsRequestsAndLeavesTheList) {
    World world("ten");
    DriverClient client(3);
    Stream stream;
    ASSERT_EQ(0u, client.Reserve(112, SpeedFlagS800, 1, &stream));
    TestRequest enter(FW_IOCTL_STREAM_ENTER, std::vector<std::uint8_t>(4), 4);
    ASSERT_EQ(PlatformErrorIoPending, enter.Send(client.handle));

    ASSERT_TRUE(world.Unplug(3));

    EXPECT_EQ(PlatformErrorDeviceNotConnected, enter.error);
    std::uint32_t word = 0;
    EXPECT_EQ(PlatformErrorDeviceNotConnected, client.Call(FW_IOCTL_QUERY_BUSY, &word));
    EXPECT_EQ(9u, ListDevices().size());
    EXPECT_EQ(0u, world.GetState(3).reservedChannels);
    EXPECT_FALSE(world.Unplug(10));
}

TEST(DeviceRequests, APluggedInDeviceIsPoweredOnAndItsOldHandleStaysDead) {
    World world("mono");
    DriverClient old;
    ASSERT_EQ(0u, old.Write(ControlAddress + 20, 5));

    ASSERT_TRUE(world.Unplug());
    ASSERT_TRUE(world.Plug());

    std::uint32_t value = 7;
    EXPECT_EQ(PlatformErrorDeviceNotConnected, old.Read(ControlAddress + 20, &value));
    DriverClient fresh;
    EXPECT_EQ(0u, fresh.Read(ControlAddress + 20, &value));
    EXPECT_EQ(0u, value);
}

TEST(DeviceRequests, ASecondConfigurationIsReportedWhileAControlRegisterHasItsValue) {
    const World world(R"({"base": "mono", "cameras": [{"alternate":
        {"controlQuadlet": 41, "mask": 255, "value": 3, "configuration": {"4": "0x00100020"}}}]})");
    DriverClient client;
    std::uint32_t size = 0;

    ASSERT_EQ(0u, client.Write(ControlAddress + 4 * 41, 0x103));
    ASSERT_EQ(0u, client.Read(ConfigurationAddress + 16, &size));
    EXPECT_EQ(0x00100020u, size);
    ASSERT_EQ(0u, client.Write(ControlAddress + 4 * 41, 2));
    ASSERT_EQ(0u, client.Read(ConfigurationAddress + 16, &size));
    EXPECT_EQ(1392u << 16 | 1040, size);
}

TEST(DeviceRequests, TheTemperatureIsReachedOnceTheCoolerIsTakenOver) {
    const World world("mono");
    DriverClient client;
    std::uint32_t status = 7;

    ASSERT_EQ(0u, client.Read(StatusAddress + 4, &status));
    EXPECT_EQ(0u, status);
    ASSERT_EQ(0u, client.Write(ControlAddress + 4 * 14, 585u << 16 | 1));
    ASSERT_EQ(0u, client.Write(CommandAddress + 4, 1));
    ASSERT_EQ(0u, client.Read(StatusAddress + 4, &status));

    EXPECT_EQ(StatusTemperatureLocked, status);
}

TEST(DeviceRequests, EachRequestIsTracedWithItsBytes) {
    const World world("mono");
    {
        DriverClient client;
        std::uint32_t busy = 7;
        ASSERT_EQ(0u, client.Call(FW_IOCTL_QUERY_BUSY, &busy));
        ASSERT_EQ(0u, client.Read(PrimaryIdentityAddress, &busy));
    }

    const std::vector<TraceRecord> trace = world.ReadTrace();

    ASSERT_EQ(4u, trace.size());
    EXPECT_EQ("open", trace[0].type);
    EXPECT_EQ("FW_IOCTL_QUERY_BUSY", trace[1].name);
    EXPECT_EQ((std::vector<std::uint8_t>{7, 0, 0, 0}), trace[1].input);
    EXPECT_EQ((std::vector<std::uint8_t>{0, 0, 0, 0}), trace[1].output);
    EXPECT_FALSE(trace[1].wasPended);
    EXPECT_EQ(FW_IOCTL_ASYNC_READ, trace[2].code);
    EXPECT_EQ(MakeReadRecord(PrimaryIdentityAddress, 1), trace[2].input);
    EXPECT_EQ((std::vector<std::uint8_t>{0, 5, 0, 0}), trace[2].output);
    EXPECT_TRUE(trace[2].wasPended);
    EXPECT_EQ("close", trace[3].type);
}

TEST(DeviceRequests, ACloseFromACompletionDoesNotWaitForItself) {
    const World world("mono");
    void* handle = nullptr;
    ASSERT_EQ(0u, GetDriver().open(ListDevices().front().c_str(), &handle));
    struct Closing : KernelRequest {
        void* handle = nullptr;
        std::atomic<bool> isClosed{false};
    } request;
    std::vector<std::uint8_t> record = MakeReadRecord(PrimaryIdentityAddress, 1);
    std::uint32_t value = 0;
    static_cast<KernelRequest&>(request) = {FW_IOCTL_ASYNC_READ,
                                            48,
                                            record.data(),
                                            &value,
                                            4,
                                            1,
                                            [](KernelRequest* done, std::uint32_t, std::uint32_t) {
                                                auto& closing = *static_cast<Closing*>(done);
                                                GetDriver().close(closing.handle);
                                                closing.isClosed = true;
                                            }};
    request.handle = handle;

    ASSERT_EQ(PlatformErrorIoPending, GetDriver().control(handle, &request, nullptr));

    EXPECT_TRUE(WaitUntil([&] { return request.isClosed.load(); }));
    EXPECT_TRUE(WaitUntil([&] { return world.GetState().openHandles == 0; }));
}

TEST(DeviceRequests, ManyThreadsMayUseOneDevice) {
    const World world("mono");
    std::vector<std::thread> threads;
    std::atomic<int> failures{0};

    for (std::uint32_t t = 0; t < 4; ++t) {
        threads.emplace_back([&, t] {
            for (std::uint32_t i = 0; i < 100; ++i) {
                DriverClient client;
                std::uint32_t value = 0;
                failures += client.Write(ControlAddress + 4 * (20 + t), i) != 0;
                failures += client.Read(ControlAddress + 4 * (20 + t), &value) != 0 || value != i;
            }
        });
    }
    for (std::thread& thread : threads) thread.join();

    EXPECT_EQ(0, failures);
    EXPECT_EQ(0u, world.GetState().openHandles);
}

}  // namespace
}  // namespace ZV::Test
