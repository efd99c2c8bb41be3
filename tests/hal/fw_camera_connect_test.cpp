#include <gtest/gtest.h>

#include <algorithm>
#include <cstring>
#include <string>
#include <vector>

#include "hal/control_records.h"
#include "hal/fw_camera.h"
#include "hal/fw_device_context.h"
#include "hal/hal_world.h"
#include "hal/platform/last_error.h"
#include "support/debugger_output.h"

namespace ZV::Test {
namespace {

using Codes = std::vector<std::uint32_t>;

const Codes ConnectCodes{FW_IOCTL_QUERY_BUSY, FW_IOCTL_ALLOC_BANDWIDTH, FW_IOCTL_ALLOC_CHANNEL,
                         FW_IOCTL_ALLOC_RESOURCES};
const Codes DisconnectCodes{FW_IOCTL_FREE_RESOURCES, FW_IOCTL_FREE_CHANNEL, FW_IOCTL_FREE_BANDWIDTH,
                            FW_IOCTL_NOTIFY_DISABLE};

std::string FailRequest(const char* code, std::uint32_t count = 1) {
    return std::string(R"({"kind":"failRequest","code":")") + code + R"(","count":)" +
           std::to_string(count) + "}";
}

template <typename Word>
Word GetWord(const std::vector<std::uint8_t>& bytes, std::size_t offset) {
    Word word = 0;
    if (offset + sizeof word <= bytes.size()) std::memcpy(&word, &bytes[offset], sizeof word);
    return word;
}

struct FWCameraConnection : testing::Test {
    FWCameraConnection() : camera(mono.ListFirst()) {}

    HALWorld mono{"mono"};
    HALCamera* camera;
};

TEST_F(FWCameraConnection, AConnectAsksForUseBandwidthChannelAndResourcesInThisOrder) {
    ASSERT_EQ(HALOk, ConnectPlain(camera, 100));

    EXPECT_EQ(1, camera->connected);
    EXPECT_EQ(112u, camera->packetBytes);
    const std::vector<TraceRecord> requests = mono.TakeRequests();
    ASSERT_EQ(4u, requests.size());
    for (std::size_t i = 0; i < 4; ++i) EXPECT_EQ(ConnectCodes[i], requests[i].code);
    EXPECT_EQ(112u, GetWord<std::uint32_t>(requests[1].input, 0));
    const auto channel = GetWord<std::uint32_t>(requests[2].output, 4);
    EXPECT_EQ(channel, GetWord<std::uint32_t>(requests[3].input, 8));
    EXPECT_EQ(112u, GetWord<std::uint32_t>(requests[3].input, 12));
    EXPECT_EQ(112u * 30, GetWord<std::uint32_t>(requests[3].input, 20));
    EXPECT_EQ(1u, GetWord<std::uint32_t>(requests[3].input, 28));
}

TEST_F(FWCameraConnection, ADisconnectFreesInReverseAndClosesTheDevice) {
    ASSERT_EQ(HALOk, ConnectPlain(camera, 100));
    const std::vector<TraceRecord> reserved = mono.TakeRequests();

    ASSERT_EQ(HALOk, HAL_CameraDisconnect(camera));

    EXPECT_EQ(0, camera->connected);
    EXPECT_NE(nullptr, camera->context);
    EXPECT_EQ(0u, mono.world.GetState().openHandles);
    const std::vector<TraceRecord> freed = mono.TakeRequests();
    ASSERT_EQ(4u, freed.size());
    for (std::size_t i = 0; i < 4; ++i) EXPECT_EQ(DisconnectCodes[i], freed[i].code);
    EXPECT_EQ(GetWord<std::uint64_t>(reserved[3].output, 32),
              GetWord<std::uint64_t>(freed[0].input, 0));
    EXPECT_EQ(GetWord<std::uint32_t>(reserved[2].output, 4),
              GetWord<std::uint32_t>(freed[1].input, 0));
    EXPECT_EQ(GetWord<std::uint64_t>(reserved[1].output, 8),
              GetWord<std::uint64_t>(freed[2].input, 0));
}

TEST_F(FWCameraConnection, ADisconnectOfAnUnconnectedRecordDoesNothing) {
    void* const context = camera->context;

    EXPECT_EQ(HALOk, HAL_CameraDisconnect(camera));

    EXPECT_EQ(context, camera->context);
    EXPECT_TRUE(mono.TakeCodes().empty());
}

TEST_F(FWCameraConnection, ADisconnectedRecordCanBeConnectedAgain) {
    ASSERT_EQ(HALOk, ConnectPlain(camera, 100));
    ASSERT_EQ(HALOk, HAL_CameraDisconnect(camera));

    EXPECT_EQ(HALOk, ConnectPlain(camera, 200));
    EXPECT_EQ(212u, camera->packetBytes);
}

TEST_F(FWCameraConnection, ADeviceHeldElsewhereIs37AndItsHandleIsClosedAgain) {
    ASSERT_EQ(HALOk, ConnectPlain(camera, 100));
    HALCamera second = *camera;
    second.connected = 0;

    // The same record's device is held by the first connect.
    EXPECT_EQ(HALDeviceInUse, ConnectPlain(&second, 100));

    EXPECT_EQ(0, second.connected);
    EXPECT_EQ(1u, mono.world.GetState().openHandles);
    std::uint32_t data = 0;
    EXPECT_EQ(HALOk, HAL_CameraReadData(camera, ScratchAddress, &data, 1));
}

TEST_F(FWCameraConnection, ADeviceThatIsGoneIs17) {
    ASSERT_TRUE(mono.world.Unplug());

    EXPECT_EQ(HALDeviceNotOpen, ConnectPlain(camera, 100));
    EXPECT_EQ(0, camera->connected);
}

TEST_F(FWCameraConnection, AFailedConnectLeavesTheErrorOfItsLastStepForTheErrorText) {
    ASSERT_TRUE(mono.world.Unplug());

    EXPECT_EQ(HALDeviceNotOpen, ConnectPlain(camera, 100));

    EXPECT_EQ(PlatformErrorFileNotFound, GetLastPlatformError());
}

TEST_F(FWCameraConnection, CallbacksAreStoredWhateverTheConnectGave) {
    ASSERT_TRUE(mono.world.Unplug());
    int marker = 0;
    const HALFrameCallback getFrame = [](void*) -> tStFrameInfo* { return nullptr; };
    const HALFrameCallback peekFrame = [](void*) -> tStFrameInfo* { return nullptr; };
    const HALEventCallback done = [](void*) {};
    const HALEventCallback overrun = [](void*) {};

    EXPECT_EQ(HALDeviceNotOpen,
              HAL_CameraConnect(camera, 100, getFrame, peekFrame, done, overrun, nullptr, &marker));

    const StreamAssembler& assembler = GetFWContext(*camera)->assembler;
    EXPECT_EQ(getFrame, assembler.getNewFrame);
    EXPECT_EQ(peekFrame, assembler.peekNewFrame);
    EXPECT_EQ(done, assembler.imageDone);
    EXPECT_EQ(overrun, assembler.overrun);
    EXPECT_EQ(&marker, assembler.context);
}

TEST_F(FWCameraConnection, AFailedQueryIs27AndClosesTheDevice) {
    ASSERT_TRUE(mono.world.AddFault(FailRequest("FW_IOCTL_QUERY_BUSY")));

    EXPECT_EQ(HALChannelNotFreed, ConnectPlain(camera, 100));

    EXPECT_EQ(0, camera->connected);
    EXPECT_EQ(0u, mono.world.GetState().openHandles);
}

struct FailedRequest {
    const char* code;
    HALStatus status;
    std::uint32_t failures;
};

struct FailedReservation : FWCameraConnection, testing::WithParamInterface<FailedRequest> {};

TEST_P(FailedReservation, LeavesTheRecordConnectedUntilADisconnect) {
    ASSERT_TRUE(mono.world.AddFault(FailRequest(GetParam().code, GetParam().failures)));

    EXPECT_EQ(GetParam().status, ConnectPlain(camera, 100));

    EXPECT_EQ(1, camera->connected);
    EXPECT_EQ(1u, mono.world.GetState().openHandles);
    EXPECT_EQ(HALOk, HAL_CameraDisconnect(camera));
    EXPECT_EQ(0u, mono.world.GetState().openHandles);
    EXPECT_EQ(HALOk, ConnectPlain(camera, 100));
}

TEST_P(FailedReservation, IsTheResultOfAReallocation) {
    ASSERT_EQ(HALOk, ConnectPlain(camera, 100));
    ASSERT_TRUE(mono.world.AddFault(FailRequest(GetParam().code, GetParam().failures)));

    EXPECT_EQ(GetParam().status, HAL_CameraReallocateBandwidth(camera, 200, 1));

    EXPECT_EQ(212u, camera->packetBytes);
    EXPECT_EQ(1, camera->connected);
}

TEST_P(FailedReservation, OfAReallocationLeavesNothingThatADisconnectFreesTwice) {
    ASSERT_EQ(HALOk, ConnectPlain(camera, 100));
    ASSERT_TRUE(mono.world.AddFault(FailRequest(GetParam().code, GetParam().failures)));
    (void)mono.TakeRequests();
    ASSERT_EQ(GetParam().status, HAL_CameraReallocateBandwidth(camera, 200, 1));
    const auto reallocated = mono.TakeRequests();

    EXPECT_EQ(HALOk, HAL_CameraDisconnect(camera));

    const auto freed = mono.TakeRequests();
    ASSERT_EQ(4u, freed.size());
    // What was granted anew is freed, and where nothing was the driver is told "none".
    const auto granted = [&](std::uint32_t code, std::size_t offset, auto none) {
        for (const TraceRecord& record : reallocated) {
            if (record.code != code || record.error != 0) continue;
            return GetWord<decltype(none)>(record.output, offset);
        }
        return none;
    };
    EXPECT_EQ(granted(FW_IOCTL_ALLOC_RESOURCES, 32, std::uint64_t{0}),
              GetWord<std::uint64_t>(freed[0].input, 0));
    EXPECT_EQ(granted(FW_IOCTL_ALLOC_CHANNEL, 4, AnyChannel),
              GetWord<std::uint32_t>(freed[1].input, 0));
    EXPECT_EQ(granted(FW_IOCTL_ALLOC_BANDWIDTH, 8, std::uint64_t{0}),
              GetWord<std::uint64_t>(freed[2].input, 0));
}

INSTANTIATE_TEST_SUITE_P(
    Codes, FailedReservation,
    testing::Values(FailedRequest{"FW_IOCTL_ALLOC_BANDWIDTH", HALBandwidthNotAllocated, 1},
                    FailedRequest{"FW_IOCTL_ALLOC_CHANNEL", HALChannelNotAllocated, 1},
                    FailedRequest{"FW_IOCTL_ALLOC_RESOURCES", HALResourcesNotAllocated, 2}));

struct FailedFreeing : FWCameraConnection, testing::WithParamInterface<FailedRequest> {};

TEST_P(FailedFreeing, LeavesTheDeviceOpenAtADisconnect) {
    ASSERT_EQ(HALOk, ConnectPlain(camera, 100));
    ASSERT_TRUE(mono.world.AddFault(FailRequest(GetParam().code)));

    EXPECT_EQ(GetParam().status, HAL_CameraDisconnect(camera));

    EXPECT_EQ(1, camera->connected);
    EXPECT_EQ(1u, mono.world.GetState().openHandles);
    EXPECT_EQ(HALOk, HAL_CameraDisconnect(camera));
}

TEST_P(FailedFreeing, EndsAReallocationAtOnce) {
    ASSERT_EQ(HALOk, ConnectPlain(camera, 100));
    ASSERT_TRUE(mono.world.AddFault(FailRequest(GetParam().code)));
    (void)mono.TakeCodes();

    EXPECT_EQ(GetParam().status, HAL_CameraReallocateBandwidth(camera, 200, 1));

    EXPECT_EQ(112u, camera->packetBytes);
    const Codes codes = mono.TakeCodes();
    EXPECT_EQ(codes.end(), std::find(codes.begin(), codes.end(), FW_IOCTL_ALLOC_BANDWIDTH));
}

INSTANTIATE_TEST_SUITE_P(
    Codes, FailedFreeing,
    testing::Values(FailedRequest{"FW_IOCTL_FREE_RESOURCES", HALResourcesNotFreed, 1},
                    FailedRequest{"FW_IOCTL_FREE_CHANNEL", HALChannelNotFreed, 1},
                    FailedRequest{"FW_IOCTL_FREE_BANDWIDTH", HALBandwidthNotFreed, 1}));

TEST_F(FWCameraConnection, TheResultOfNotifyDisableAtADisconnectIsIgnored) {
    ASSERT_EQ(HALOk, ConnectPlain(camera, 100));
    ASSERT_TRUE(mono.world.AddFault(FailRequest("FW_IOCTL_NOTIFY_DISABLE")));

    EXPECT_EQ(HALOk, HAL_CameraDisconnect(camera));
}

TEST_F(FWCameraConnection, AReleaseClosesADeviceThatIsStillOpen) {
    ASSERT_EQ(HALOk, ConnectPlain(camera, 100));
    (void)mono.TakeCodes();

    EXPECT_EQ(HALOk, HAL_CameraRelease(camera));

    EXPECT_EQ(0u, mono.world.GetState().openHandles);
    EXPECT_TRUE(mono.TakeCodes().empty());
}

TEST_F(FWCameraConnection, TheDebuggerOutputTellsOfTheBandwidth) {
    DebuggerOutput output;
    ASSERT_TRUE(mono.world.AddFault(FailRequest("FW_IOCTL_ALLOC_BANDWIDTH")));

    (void)ConnectPlain(camera, 100);

    EXPECT_EQ("Allocating resources\nAllocating Resources Failed with error 24", output.Take());
}

TEST_F(FWCameraConnection, AReallocationFreesAllAndReservesForTheNewSizeAndTag) {
    ASSERT_EQ(HALOk, ConnectPlain(camera, 100));
    (void)mono.TakeCodes();

    ASSERT_EQ(HALOk, HAL_CameraReallocateBandwidth(camera, 4096, 3));

    EXPECT_EQ(4108u, camera->packetBytes);
    const std::vector<TraceRecord> requests = mono.TakeRequests();
    const Codes expected{FW_IOCTL_FREE_RESOURCES, FW_IOCTL_FREE_CHANNEL,
                         FW_IOCTL_FREE_BANDWIDTH, FW_IOCTL_ALLOC_BANDWIDTH,
                         FW_IOCTL_ALLOC_CHANNEL,  FW_IOCTL_ALLOC_RESOURCES};
    ASSERT_EQ(expected.size(), requests.size());
    for (std::size_t i = 0; i < expected.size(); ++i) EXPECT_EQ(expected[i], requests[i].code);
    EXPECT_EQ(4108u, GetWord<std::uint32_t>(requests[5].input, 12));
    EXPECT_EQ(3u, GetWord<std::uint32_t>(requests[5].input, 28));
}

TEST_F(FWCameraConnection, S800GivesTheLongPacketsAndTheHighSpeed) {
    ASSERT_EQ(HALOk, ConnectPlain(camera, 100));
    std::uint16_t bytes = 0;
    std::uint16_t megabits = 0;

    EXPECT_EQ(HALOk, HAL_CameraFastestPacketSizeSupported(camera, &bytes));
    EXPECT_EQ(HALOk, HAL_CameraConnectionSpeed(camera, &megabits));

    EXPECT_EQ(9044, bytes);
    EXPECT_EQ(800, megabits);
}

TEST(FWCameraRecord, ARecordThatWasNeverConnectedHasNoSpeed) {
    HALCamera empty{};
    std::uint16_t bytes = 0;
    std::uint16_t megabits = 7;

    EXPECT_EQ(HALSpeedUnknown, HAL_CameraConnectionSpeed(&empty, &megabits));
    EXPECT_EQ(0, megabits);
    EXPECT_EQ(HALOk, HAL_CameraFastestPacketSizeSupported(&empty, &bytes));
    EXPECT_EQ(5000, bytes);
}

struct S400Connection : testing::Test {
    S400Connection() : camera(s400.ListFirst()) {}

    HALWorld s400{"s400"};
    HALCamera* camera;
};

TEST_F(S400Connection, AStrideOf4900FallsBackToS400) {
    ASSERT_EQ(HALOk, ConnectPlain(camera, 4888));

    const std::vector<TraceRecord> requests = s400.TakeRequests();
    ASSERT_EQ(5u, requests.size());
    EXPECT_EQ(8u, GetWord<std::uint32_t>(requests[1].input, 4));
    EXPECT_EQ(8u, GetWord<std::uint32_t>(requests[3].input, 0));
    EXPECT_EQ(4u, GetWord<std::uint32_t>(requests[4].input, 0));
    std::uint16_t bytes = 0;
    std::uint16_t megabits = 0;
    EXPECT_EQ(HALOk, HAL_CameraFastestPacketSizeSupported(camera, &bytes));
    EXPECT_EQ(HALOk, HAL_CameraConnectionSpeed(camera, &megabits));
    EXPECT_EQ(5000, bytes);
    EXPECT_EQ(400, megabits);
}

TEST_F(S400Connection, AStrideOf4901DoesNotFallBack) {
    EXPECT_EQ(HALResourcesNotAllocated, ConnectPlain(camera, 4889));

    EXPECT_EQ(4u, s400.TakeCodes().size());
    std::uint16_t megabits = 0;
    EXPECT_EQ(HALOk, HAL_CameraConnectionSpeed(camera, &megabits));
    EXPECT_EQ(400, megabits);
    EXPECT_EQ(HALOk, HAL_CameraDisconnect(camera));
}

TEST(FWCameraRecord, FreeRoutinesAloneGiveTheirCodes) {
    HALWorld mono("mono");
    HALCamera* const camera = mono.Connect();

    EXPECT_EQ(HALOk, FWCameraFreeResources(*camera));
    EXPECT_EQ(HALOk, FWCameraFreeChannel(*camera));
    EXPECT_EQ(HALOk, FWCameraFreeBandwidth(*camera));

    const HALCamera empty{};
    EXPECT_EQ(HALResourcesNotFreed, FWCameraFreeResources(empty));
    EXPECT_EQ(HALChannelNotFreed, FWCameraFreeChannel(empty));
    EXPECT_EQ(HALBandwidthNotFreed, FWCameraFreeBandwidth(empty));
    EXPECT_EQ(HALBandwidthNotAllocated, FWCameraAllocateBandwidth(empty));
    EXPECT_EQ(HALChannelNotAllocated, FWCameraAllocateChannel(empty));
    EXPECT_EQ(HALResourcesNotAllocated, FWCameraAllocateResources(empty, 1));
}

}  // namespace
}  // namespace ZV::Test
