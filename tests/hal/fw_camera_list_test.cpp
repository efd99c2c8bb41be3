#include <gtest/gtest.h>

#include <algorithm>
#include <string>
#include <vector>

#include "hal/control_records.h"
#include "hal/hal_world.h"
#include "hal/platform/last_error.h"
#include "support/debugger_output.h"

namespace ZV::Test {
namespace {

constexpr std::uint32_t ErrorMax = 40;

bool Contains(const std::vector<std::uint32_t>& codes, std::uint32_t code) {
    return std::find(codes.begin(), codes.end(), code) != codes.end();
}

TEST(FWCameraList, NoDeviceIsAnEmptyListAndNoFailure) {
    HALWorld empty("empty");

    EXPECT_EQ(HALOk, empty.List());

    EXPECT_EQ(0u, empty.count);
    EXPECT_NE(nullptr, empty.list);
}

TEST(FWCameraList, ADeviceIsProbedWithAStreamOfTwelveBytesAndReleased) {
    HALWorld mono("mono");

    ASSERT_EQ(HALOk, mono.List());

    ASSERT_EQ(1u, mono.count);
    EXPECT_EQ(0u, mono.list[0].index);
    EXPECT_EQ(HALKindFWCamera, mono.list[0].kind);
    EXPECT_EQ(0, mono.list[0].connected);
    EXPECT_EQ(mono.world.Peek(PrimaryIdAddress), mono.list[0].cameraWord);
    EXPECT_EQ(12u, mono.list[0].packetBytes);
    EXPECT_EQ(0u, mono.world.GetState().openHandles);
    const std::vector<std::uint32_t> expected{
        FW_IOCTL_QUERY_BUSY,      FW_IOCTL_ALLOC_BANDWIDTH, FW_IOCTL_ALLOC_CHANNEL,
        FW_IOCTL_ALLOC_RESOURCES, FW_IOCTL_ASYNC_READ,      FW_IOCTL_FREE_RESOURCES,
        FW_IOCTL_FREE_CHANNEL,    FW_IOCTL_FREE_BANDWIDTH,  FW_IOCTL_NOTIFY_DISABLE};
    EXPECT_EQ(expected, mono.TakeCodes());
}

TEST(FWCameraList, DevicesStandInTheOrderInWhichTheyAreFound) {
    HALWorld ten("ten");

    ASSERT_EQ(HALOk, ten.List());

    ASSERT_EQ(10u, ten.count);
    for (std::uint32_t i = 0; i < 10; ++i) EXPECT_EQ(i, ten.list[i].index);
}

TEST(FWCameraList, TheWalkStopsAtTheMaximum) {
    HALWorld ten("ten");

    ASSERT_EQ(HALOk, ten.List(PrimaryIdAddress, SecondaryIdAddress, 3));

    EXPECT_EQ(3u, ten.count);
    EXPECT_EQ(0u, ten.world.GetState(3).requestsServed);
}

TEST(FWCameraList, AMaximumOfZeroFindsNothing) {
    HALWorld mono("mono");

    EXPECT_EQ(HALOk, mono.List(PrimaryIdAddress, SecondaryIdAddress, 0));
    EXPECT_EQ(0u, mono.count);
}

TEST(FWCameraList, ADeviceHeldElsewhereIsOnTheListAsConnectedWithoutAnIdentity) {
    HALWorld held("held");

    ASSERT_EQ(HALOk, held.List());

    ASSERT_EQ(2u, held.count);
    EXPECT_EQ(0, held.list[0].connected);
    EXPECT_EQ(1, held.list[1].connected);
    EXPECT_EQ(0u, held.list[1].cameraWord);
    EXPECT_EQ(0u, held.world.GetState(1).openHandles);
}

TEST(FWCameraList, WithoutAPrimaryAddressNothingIsRead) {
    HALWorld mono("mono");

    ASSERT_EQ(HALOk, mono.List(0, SecondaryIdAddress));

    EXPECT_EQ(0u, mono.list[0].cameraWord);
    EXPECT_FALSE(Contains(mono.TakeCodes(), FW_IOCTL_ASYNC_READ));
}

TEST(FWCameraList, AnIdentityAtTheSecondaryAddressGivesANormalEntry) {
    HALWorld second(R"({"base":"mono","cameras":[{"identityAddress":"secondary"}]})");

    ASSERT_EQ(HALOk, second.List());

    ASSERT_EQ(1u, second.count);
    EXPECT_EQ(second.world.Peek(SecondaryIdAddress), second.list[0].cameraWord);
    EXPECT_NE(0u, second.list[0].cameraWord);
}

TEST(FWCameraList, NoIdentityAtAllEndsTheListingWith17AndClosesTheDevice) {
    HALWorld none(R"({"base":"mono","cameras":[{"identityAddress":"none"}]})");

    EXPECT_EQ(HALDeviceNotOpen, none.List());

    EXPECT_EQ(nullptr, none.list);
    EXPECT_EQ(0xDDDDDDDDu, none.count);
    EXPECT_EQ(0u, none.world.GetState().openHandles);
    EXPECT_TRUE(Contains(none.TakeCodes(), FW_IOCTL_FREE_BANDWIDTH));
}

TEST(FWCameraList, AnIdentityThatIsAnsweredAtOnceStaysInBusOrder) {
    HALWorld mono(
        R"({"base":"mono","cameras":[{"identity":16909060,
            "faults":[{"kind":"answerAtOnce","code":"FW_IOCTL_ASYNC_READ"}]}]})");

    ASSERT_EQ(HALOk, mono.List());

    EXPECT_EQ(0x04030201u, mono.list[0].cameraWord);
}

TEST(FWCameraList, TheDebuggerOutputTellsTheCount) {
    HALWorld held("held");
    DebuggerOutput output;

    ASSERT_EQ(HALOk, held.List());

    EXPECT_EQ(0u, output.Take().find("FWCameraGetList - got 2 devices using setup API\n"));
}

TEST(FWCameraList, ARequestThatFailsEndsTheListingWith17AndLeavesNothingOpen) {
    std::uint32_t request = 1;
    for (;; ++request) {
        ASSERT_LT(request, ErrorMax);
        HALWorld mono(R"({"base":"mono","cameras":[{"faults":[{"kind":"failRequest","request":)" +
                      std::to_string(request) + "}]}]}");
        const HALStatus status = mono.List();
        EXPECT_TRUE(status == HALOk || status == HALDeviceNotOpen);
        EXPECT_EQ(status == HALOk, mono.list != nullptr);
        EXPECT_EQ(0u, mono.world.GetState().openHandles) << request;
        EXPECT_EQ(0u, mono.world.GetState().reservedBandwidths);

        if (mono.world.GetState().requestsServed < request) break;
        EXPECT_EQ(HALOk, mono.List());
        EXPECT_EQ(1u, mono.count);
    }
    EXPECT_EQ(10u, request);
}

TEST(FWCameraList, AFailedListingLeavesTheErrorThatEndedItForTheErrorText) {
    HALWorld mono(R"({"base":"mono","cameras":[{"faults":[
        {"kind":"failRequest","code":"FW_IOCTL_ALLOC_CHANNEL","error":1450},
        {"kind":"failRequest","code":"FW_IOCTL_FREE_RESOURCES","error":87}]}]})");

    EXPECT_EQ(HALDeviceNotOpen, mono.List());

    EXPECT_EQ(PlatformErrorNoSystemResources, GetLastPlatformError());
}

TEST(FWCameraList, AFailureAtTheSecondDeviceGivesUpTheFirstOneToo) {
    HALWorld ten("ten");
    ASSERT_TRUE(ten.world.Start());
    ASSERT_TRUE(ten.world.AddFault(R"({"kind":"failRequest","code":"FW_IOCTL_ALLOC_CHANNEL"})", 1));

    EXPECT_EQ(HALDeviceNotOpen, ten.List());

    EXPECT_EQ(0u, ten.world.GetState(0xFFFFFFFF).openHandles);
    EXPECT_EQ(0u, ten.world.GetState(2).requestsServed);
    EXPECT_EQ(HALOk, ten.List());
}

struct DiscoveryCase {
    std::uint32_t step;
    HALStatus status;
    std::uint32_t count;
};

/// Steps of a listing of one device: open, select, size, detail, select.
struct FailedDiscovery : testing::TestWithParam<DiscoveryCase> {};

TEST_P(FailedDiscovery, EndsTheWalk) {
    HALWorld mono(R"({"base":"mono","discoveryFaults":[{"listing":1,"step":)" +
                  std::to_string(GetParam().step) + "}]}");

    EXPECT_EQ(GetParam().status, mono.List());
    EXPECT_EQ(GetParam().count, mono.count);
    EXPECT_EQ(0u, mono.world.GetState().openHandles);

    EXPECT_EQ(HALOk, mono.List());
    EXPECT_EQ(1u, mono.count);
}

INSTANTIATE_TEST_SUITE_P(
    Steps, FailedDiscovery,
    testing::Values(DiscoveryCase{1, HALDeviceNotOpen, 0xDDDDDDDD},
                    DiscoveryCase{2, HALDeviceNotOpen, 0xDDDDDDDD},
                    // Kept: a size that cannot be asked for ends the walk without a failure.
                    DiscoveryCase{3, HALOk, 0}, DiscoveryCase{4, HALDeviceNotOpen, 0xDDDDDDDD},
                    DiscoveryCase{5, HALDeviceNotOpen, 0xDDDDDDDD}));

std::string MakePathScenario(std::uint32_t length) {
    return R"({"base":"mono","cameras":[{},{"model":"SolvaneA1","pathLength":)" +
           std::to_string(length) + "}]}";
}

TEST(FWCameraList, APathOf255CharactersIsTakenWhole) {
    HALWorld two(MakePathScenario(255));

    EXPECT_EQ(HALOk, two.List());
    EXPECT_EQ(2u, two.count);
}

TEST(FWCameraList, ALongerPathIsCutAndDoesNotOpen) {
    for (const std::uint32_t length : {256u, 258u}) {
        HALWorld two(MakePathScenario(length));

        EXPECT_EQ(HALDeviceNotOpen, two.List());
        EXPECT_NE(0u, two.world.GetState(0).requestsServed);
    }
}

TEST(FWCameraList, APathAboveTheRecordEndsTheWalkAndFailsAfterTheDevicesBeforeItAreProbed) {
    for (const std::uint32_t length : {259u, 4096u}) {
        HALWorld two(MakePathScenario(length));
        DebuggerOutput output;

        EXPECT_EQ(HALDeviceNotOpen, two.List());

        EXPECT_EQ(0u, output.Take().find("FWCameraGetList - got 1 devices using setup API\n"));
        EXPECT_NE(0u, two.world.GetState(0).requestsServed);
        EXPECT_EQ(0u, two.world.GetState(0).openHandles);
    }
}

TEST(FWCameraList, NullOutputsAre17) {
    HALCamera* list = nullptr;
    std::uint32_t count = 0;

    EXPECT_EQ(HALDeviceNotOpen, HAL_CameraGetList(nullptr, 0, 0, 10, &count));
    EXPECT_EQ(HALDeviceNotOpen, HAL_CameraGetList(&list, 0, 0, 10, nullptr));
}

}  // namespace
}  // namespace ZV::Test
