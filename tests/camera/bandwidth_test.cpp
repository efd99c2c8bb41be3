#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cstring>

#include "camera/bare_camera.h"
#include "camera/test_camera.h"
#include "hal/control_records.h"

namespace ZV::Test {

namespace {

using testing::ElementsAre;
using testing::IsEmpty;

std::string MakeScenario(const char* camera) {
    return std::string(R"({"base": "mono", "timeScale": 0, "cameras": [{
        "sensor": {"width": 64, "height": 48}, )") +
           camera + "}]}";
}

/// Tag and packet stride of each reservation of resources that was asked for.
std::vector<std::pair<std::uint32_t, std::uint32_t>> ReadReservations(
    const SimulationWorld& world) {
    std::vector<std::pair<std::uint32_t, std::uint32_t>> reservations;
    for (const TraceRecord& request : world.ReadRequests()) {
        if (request.code != FW_IOCTL_ALLOC_RESOURCES) continue;
        AllocateResourcesRecord record{};
        std::memcpy(&record, request.input.data(), std::min(sizeof record, request.input.size()));
        reservations.emplace_back(record.tagCode, record.maximumBytesPerFrame);
    }
    return reservations;
}

class ReallocatingCamera : public CameraWorld, public testing::Test {
  protected:
    explicit ReallocatingCamera(const std::string& scenario = std::string(SmallCamera))
        : CameraWorld(scenario) {}
    void SetUp() override {
        ASSERT_EQ(CameraOk, camera->Ready());
        (void)TakeWrites();
        reservationsBefore = ReadReservations(world).size();
    }
    std::vector<std::pair<std::uint32_t, std::uint32_t>> TakeReservations() {
        auto all = ReadReservations(world);
        all.erase(all.begin(), all.begin() + static_cast<std::ptrdiff_t>(reservationsBefore));
        return all;
    }
    std::size_t reservationsBefore = 0;
};

class ReallocatingOldCamera : public ReallocatingCamera {
  protected:
    ReallocatingOldCamera()
        : ReallocatingCamera(MakeScenario(R"("versions": {"control": "2.2"})")) {}
};

}  // namespace

TEST_F(ReallocatingCamera, TellsTheCameraItsSizeAndThenReserves) {
    EXPECT_EQ(CameraOk, camera->ReallocateBandwidth(1000));

    EXPECT_THAT(TakeWrites(), ElementsAre(RegisterWrite{ControlAddress + 4 * 20, {1000}, 0},
                                          RegisterWrite{CommandAddress + 4, {1}, 0}));
    EXPECT_THAT(TakeReservations(), ElementsAre(testing::Pair(1, 1012)));
}

TEST_F(ReallocatingCamera, KeepsTheNewSizeInTheShadowWhenTheBusRefuses) {
    ASSERT_TRUE(world.AddFault(
        R"({"kind": "failRequest", "code": "FW_IOCTL_ALLOC_RESOURCES", "count": 2})"));

    EXPECT_EQ(CameraBandwidthFault, camera->ReallocateBandwidth(2000));

    EXPECT_EQ(2000u, camera->ReadControl(20));
}

TEST_F(ReallocatingCamera, AnswersAnyFailureOfTheReservationWith7) {
    ASSERT_TRUE(world.AddFault(R"({"kind": "failRequest", "code": "FW_IOCTL_FREE_RESOURCES"})"));

    EXPECT_EQ(CameraBandwidthFault, camera->ReallocateBandwidth(2000));
}

TEST_F(ReallocatingCamera, EndsAtASizeThatCannotBeWritten) {
    ASSERT_TRUE(world.AddFault(R"({"kind": "failRequest", "code": "FW_IOCTL_ASYNC_WRITE"})"));

    EXPECT_EQ(CameraHalFault, camera->ReallocateBandwidth(2000));

    EXPECT_EQ(1u, TakeWrites().size());
    EXPECT_THAT(TakeReservations(), IsEmpty());
}

TEST_F(ReallocatingCamera, EndsAtATakeOverThatFailsWithoutAMessage) {
    ASSERT_TRUE(world.AddFault(
        R"({"kind": "failRequest", "code": "FW_IOCTL_ASYNC_WRITE", "address": 3489673220})"));
    testing::internal::CaptureStdout();

    const CameraResult result = camera->ReallocateBandwidth(2000);

    EXPECT_EQ("", testing::internal::GetCapturedStdout());
    EXPECT_EQ(CameraHalFault, result);
    EXPECT_THAT(TakeReservations(), IsEmpty());
}

TEST_F(ReallocatingOldCamera, IsNotToldItsSizeAndReservesAllTheSame) {
    EXPECT_EQ(CameraNotSupported, camera->SetMaxPacketSize(1000));
    EXPECT_EQ(CameraOk, camera->ReallocateBandwidth(1000));

    EXPECT_THAT(TakeWrites(), IsEmpty());
    EXPECT_THAT(TakeReservations(), ElementsAre(testing::Pair(1, 1012)));
}

TEST_F(ReallocatingOldCamera, HasFixedPacketSizes) {
    EXPECT_EQ(4980, camera->CalculateRequiredPacketSize(1, 16, 20.0F));
    EXPECT_EQ(4080, camera->CalculateRequiredPacketSize(2, 16, 20.0F));
    EXPECT_EQ(4080, camera->CalculateRequiredPacketSize(true)) << "8 bits";
}

TEST(MaxPacketSize, IsAFieldOfItsQuadlet) {
    BareBase camera;
    camera.StoreControl(20, 0xABCD0000);

    EXPECT_EQ(CameraOk, camera.SetMaxPacketSize(0x12345));

    EXPECT_EQ(0xABCD2345u, camera.ReadControl(20));
}

struct ConnectionCase {
    const char* camera;
    std::uint16_t plain, clamped;
};
class RequiredPacketSize : public testing::TestWithParam<ConnectionCase> {};

TEST_P(RequiredPacketSize, FollowsTheConnectionAndThePresentSettings) {
    CameraWorld world(MakeScenario(GetParam().camera));
    ASSERT_EQ(CameraOk, world.camera->Ready());

    EXPECT_EQ(GetParam().plain, world.camera->CalculateRequiredPacketSize(false));
    EXPECT_EQ(GetParam().clamped, world.camera->CalculateRequiredPacketSize(true));
}

// 8 bits at 20 MHz; the limit is 9044 at 800 megabits and 5000 at 400.
INSTANTIATE_TEST_SUITE_P(
    AtBothSpeeds, RequiredPacketSize,
    testing::Values(ConnectionCase{R"("speed": 800, "firmwareVersion": 113)", 2348, 2348},
                    ConnectionCase{R"("speed": 800, "firmwareVersion": 114)", 2368, 2368},
                    ConnectionCase{R"("speed": 400, "firmwareVersion": 114)", 2580, 2580},
                    ConnectionCase{R"("speed": 400, "firmwareVersion": 101)", 2528, 2528}));

TEST(RequiredPacketSizeWithoutAConnection, Is0) {
    BareBase camera;
    camera.StoreConfiguration(8, 15);

    EXPECT_EQ(0, camera.CalculateRequiredPacketSize(true));
    EXPECT_EQ(0, camera.CalculateRequiredPacketSize(1, 16, 20.0F));
}

TEST(SixteenBitsAt20MHz, CannotStreamAt400Megabits) {
    CameraWorld world(MakeScenario(R"("speed": 400, "firmwareVersion": 102)"));
    ASSERT_EQ(CameraOk, world.camera->Ready());
    ASSERT_EQ(CameraOk, world.camera->SetBitDepth(16));

    EXPECT_EQ(5000, world.camera->CalculateRequiredPacketSize(true));
    EXPECT_EQ(CameraBandwidthFault, world.camera->StartStreamingImages(TestClient::ReceiveImage,
                                                                       nullptr, false, nullptr));
}

}  // namespace ZV::Test
