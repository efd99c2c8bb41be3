#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "camera/test_camera.h"

namespace ZV::Test {

namespace {

using testing::ElementsAre;
using testing::IsEmpty;

RegisterWrite MakeWrite(std::uint32_t address, std::vector<std::uint32_t> values) {
    return {address, std::move(values), 0};
}

std::uint32_t SumComplements(const std::vector<std::uint32_t>& quadlets) {
    std::uint32_t sum = 0;
    for (const std::uint32_t quadlet : quadlets) sum += ~quadlet;
    return sum;
}

std::vector<std::uint32_t> CountUp(std::uint32_t count) {
    std::vector<std::uint32_t> quadlets(count);
    for (std::uint32_t quadlet = 0; quadlet < count; ++quadlet) quadlets[quadlet] = 100 + quadlet;
    return quadlets;
}

}  // namespace

class OneReadCamera : public CameraWorld, public testing::Test {
  protected:
    OneReadCamera() : CameraWorld(SmallCamera) {}
    void SetUp() override {
        ASSERT_NE(nullptr, camera);
        ASSERT_EQ(CameraOk, camera->OpenCamera());
        ASSERT_EQ(CameraOk, camera->ReadCameraInfo());
    }
};

TEST_F(OneReadCamera, KnowsWhereItsBlocksLieAndTheirVersions) {
    const CameraRegisters& registers = camera->registers;

    EXPECT_EQ(ConfigurationAddress, registers.configuration.address);
    EXPECT_EQ(ControlAddress, registers.control.address);
    EXPECT_EQ(CommandAddress, registers.command.address);
    EXPECT_EQ(StatusAddress, registers.status.address);
    EXPECT_EQ(StreamAddress, registers.stream.address);
    EXPECT_EQ(MakeVersion(2, 9), registers.configuration.version);
    EXPECT_EQ(202u, registers.configuration.GetLength());
    EXPECT_EQ(MakeVersion(2, 8), registers.control.version);
    EXPECT_EQ(0u, registers.control.GetLength()) << "the shadow is made by the setup";
    EXPECT_EQ(MakeVersion(1, 3), registers.status.version);
    EXPECT_EQ(4u, registers.status.GetLength());
    EXPECT_TRUE(camera->CheckConfigRegVersion(2, 9));
    EXPECT_FALSE(camera->CheckConfigRegVersion(2, 10));
}

TEST_F(OneReadCamera, ReadsTheStatusVersionByItselfAndOnceMoreWithTheBlock) {
    std::vector<std::size_t> answerBytes;
    for (const TraceRecord& request : world.ReadRequests()) {
        if (request.name == "FW_IOCTL_ASYNC_READ") answerBytes.push_back(request.outputBytes);
    }

    // Enumeration reads one quadlet; then directory, configuration, stream, command, control and
    // status: version and block, or the version alone.
    const std::size_t quadlets[] = {1, 1, 11, 1, 202, 1, 1, 1, 1, 1, 4};
    ASSERT_EQ(std::size(quadlets), answerBytes.size());
    for (std::size_t read = 1; read < std::size(quadlets); ++read) {
        EXPECT_EQ(4 * (quadlets[read] - quadlets[0]), answerBytes[read] - answerBytes[0]) << read;
    }
}

TEST_F(OneReadCamera, KeepsTheVersionNumbersOfItsFirstReadingWhenABlockIsReadAgain) {
    ASSERT_TRUE(world.Poke(ConfigurationAddress, MakeVersion(2, 7)));

    ASSERT_EQ(CameraOk, camera->ReadRegisterSet(camera->registers.configuration));

    EXPECT_EQ(176u, camera->registers.configuration.GetLength());
    EXPECT_EQ(0u, camera->ReadConfiguration(200));
    EXPECT_TRUE(camera->CheckConfigRegVersion(2, 9));
    EXPECT_EQ(MakeVersion(2, 7), camera->registers.configuration.version);
}

TEST_F(OneReadCamera, FailsARegisterReadWithTheTranslatedStatusAndNoMessage) {
    ASSERT_TRUE(world.AddFault(R"({"kind": "failRequest", "code": "FW_IOCTL_ASYNC_READ"})"));
    testing::internal::CaptureStdout();

    const CameraResult result = camera->ReadRegisterSet(camera->registers.configuration);

    EXPECT_EQ("", testing::internal::GetCapturedStdout());
    EXPECT_EQ(CameraHalFault, result);
}

TEST_F(OneReadCamera, SaysWhyItCannotReadTheVersionsBehindTheConfiguration) {
    for (const char* address : {"0xD0005000", "0xD0003000", "0xD0002000", "0xD0004000"}) {
        ASSERT_TRUE(world.AddFault(std::string(R"({"kind": "failRequest", "address": ")") +
                                   address + R"("})"));
        testing::internal::CaptureStdout();

        const CameraResult result = camera->ReadCameraInfo();

        EXPECT_NE("", testing::internal::GetCapturedStdout()) << address;
        EXPECT_EQ(CameraHalFault, result) << address;
    }
    EXPECT_EQ(CameraOk, camera->ReadCameraInfo());
}

TEST_F(OneReadCamera, SaysNothingWhenItCannotReadTheDirectoryOrTheConfiguration) {
    for (const char* address : {"0xD0000000", "0xD0001000"}) {
        ASSERT_TRUE(world.AddFault(std::string(R"({"kind": "failRequest", "address": ")") +
                                   address + R"("})"));
        testing::internal::CaptureStdout();

        const CameraResult result = camera->ReadCameraInfo();

        EXPECT_EQ("", testing::internal::GetCapturedStdout()) << address;
        EXPECT_EQ(CameraHalFault, result) << address;
    }
}

TEST_F(OneReadCamera, ReadsReservedQuadletsWithoutAChecksum) {
    std::uint32_t data[3] = {};

    EXPECT_EQ(CameraOk, camera->SetReserved0(2, data, 3, 0xDEAD));

    EXPECT_EQ(MakeVersion(2, 9), data[0]);
    EXPECT_EQ(camera->ReadConfiguration(2), data[2]);
}

TEST_F(OneReadCamera, RefusesAReservedWriteWithAWrongChecksumAndSendsNothing) {
    std::vector<std::uint32_t> data = CountUp(10);

    EXPECT_EQ(CameraRefused, camera->SetReserved0(3, data.data(), 10, SumComplements(data) + 1));

    EXPECT_THAT(TakeWrites(), IsEmpty());
}

TEST_F(OneReadCamera, WritesUpTo151ReservedQuadletsAtOnce) {
    std::vector<std::uint32_t> data = CountUp(151);

    EXPECT_EQ(CameraOk, camera->SetReserved0(3, data.data(), 151, SumComplements(data)));

    EXPECT_THAT(TakeWrites(), ElementsAre(MakeWrite(ConfigurationAddress, data)));
}

TEST_F(OneReadCamera, LeavesReservedQuadlets80To150OutOfALongWrite) {
    std::vector<std::uint32_t> data = CountUp(200);

    EXPECT_EQ(CameraOk, camera->SetReserved0(3, data.data(), 200, SumComplements(data)));

    EXPECT_THAT(
        TakeWrites(),
        ElementsAre(MakeWrite(ConfigurationAddress, {data.begin(), data.begin() + 80}),
                    MakeWrite(ConfigurationAddress + 0x25C, {data.begin() + 151, data.end()})));
}

TEST_F(OneReadCamera, EndsALongReservedWriteAtItsFirstFailure) {
    std::vector<std::uint32_t> data = CountUp(152);
    ASSERT_TRUE(world.AddFault(R"({"kind": "failRequest", "code": "FW_IOCTL_ASYNC_WRITE"})"));

    EXPECT_EQ(CameraHalFault, camera->SetReserved0(3, data.data(), 152, SumComplements(data)));

    EXPECT_EQ(1u, TakeWrites().size());
}

TEST_F(OneReadCamera, RefusesOtherReservedSelectorsAndNullData) {
    std::uint32_t data = 0;

    EXPECT_EQ(CameraRefused, camera->SetReserved0(0, &data, 1, 0));
    EXPECT_EQ(CameraRefused, camera->SetReserved0(4, &data, 1, 0));
    EXPECT_EQ(CameraHalFault, camera->SetReserved0(2, nullptr, 1, 0));
    EXPECT_EQ(CameraHalFault, camera->SetReserved0(3, nullptr, 200, 0));
    EXPECT_THAT(TakeWrites(), IsEmpty());
}

TEST_F(OneReadCamera, ChangesTheShadowAndWritesThatQuadletOnly) {
    ASSERT_NE(nullptr, camera->registers.control.Provide(43));
    camera->StoreControl(5, 0x12345678);

    EXPECT_EQ(CameraOk, camera->WriteControlField(ControlOffset, 0xABC));

    EXPECT_EQ(0x1234ABC8u, camera->ReadControl(5));
    EXPECT_THAT(TakeWrites(), ElementsAre(MakeWrite(ControlAddress + 20, {0x1234ABC8})));
}

TEST_F(OneReadCamera, KeepsAChangedShadowWhenTheWriteFails) {
    ASSERT_NE(nullptr, camera->registers.control.Provide(43));
    ASSERT_TRUE(world.AddFault(R"({"kind": "failRequest", "code": "FW_IOCTL_ASYNC_WRITE"})"));

    EXPECT_EQ(CameraHalFault, camera->WriteControl(6, 77));

    EXPECT_EQ(77u, camera->ReadControl(6));
    EXPECT_EQ(0u, world.Peek(ControlAddress + 24));
}

TEST_F(OneReadCamera, WritesAQuadletBeyondTheShadowEachTimeFromZero) {
    ASSERT_NE(nullptr, camera->registers.control.Provide(21));

    EXPECT_EQ(CameraOk, camera->WriteControlField(ControlFanSpeed, 2));
    EXPECT_EQ(CameraOk, camera->WriteControlField(ControlFanSpeed, 4));

    EXPECT_EQ(0u, camera->ReadControl(22));
    EXPECT_THAT(TakeWrites(), ElementsAre(MakeWrite(ControlAddress + 88, {0x00020000}),
                                          MakeWrite(ControlAddress + 88, {0x00040000})));
}

TEST_F(OneReadCamera, PrintsItsControlRegisters) {
    ASSERT_NE(nullptr, camera->registers.control.Provide(43));
    camera->registers.control.version = MakeVersion(1, 1);
    camera->StoreControl(1, 0xAB);
    testing::internal::CaptureStdout();

    EXPECT_EQ(CameraOk, camera->PrintOutControlRegisters());

    std::string expected =
        "---\nLength in control registers: 15\nControl registers: 00000000 000000ab ";
    for (int quadlet = 2; quadlet < 15; ++quadlet) expected += "00000000 ";
    EXPECT_EQ(expected + "\n", testing::internal::GetCapturedStdout());
}

TEST_F(OneReadCamera, BeginsItsSetupWithAShadowOfZerosWhateverTheCameraHolds) {
    ASSERT_TRUE(world.Poke(ControlAddress + 4 * 33, 0x55));

    ASSERT_EQ(CameraOk, camera->SetupNormalizedGain());
    ASSERT_EQ(CameraOk, camera->SetupControlRegisters(camera->registers.control));

    EXPECT_EQ(43u, camera->registers.control.GetLength());
    EXPECT_EQ(0u, camera->ReadControl(33));
    EXPECT_EQ(64u, camera->GetROIWidth());
    EXPECT_EQ(48u, camera->GetROIHeight());
    EXPECT_FALSE(camera->GetBigEndian());
    EXPECT_EQ(1u, camera->GetSymmetricalBinningMode());
    EXPECT_EQ(RegisterWrite(MakeWrite(CommandAddress + 4, {1})), TakeWrites().back());
}

TEST_F(OneReadCamera, StopsItsSetupAtTheFirstStepThatFails) {
    ASSERT_EQ(CameraOk, camera->SetupNormalizedGain());
    ASSERT_TRUE(world.AddFault(
        R"({"kind": "failRequest", "code": "FW_IOCTL_ASYNC_WRITE", "request": 3, "count": 0})"));

    EXPECT_EQ(CameraHalFault, camera->SetupControlRegisters(camera->registers.control));

    EXPECT_EQ(3u, TakeWrites().size());
}

TEST(CameraOfAnUnknownConfigurationVersion, ReadsAsZerosThroughout) {
    CameraWorld one(
        R"({"base": "mono", "timeScale": 0, "cameras": [{"versions": {"configuration": "2.12"}}]})");
    ASSERT_NE(nullptr, one.camera);

    EXPECT_EQ(CameraOk, one.camera->Ready());

    EXPECT_EQ(0u, one.camera->GetModel());
    EXPECT_EQ(0u, one.camera->GetCCDWidth());
    EXPECT_EQ(0u, one.camera->registers.configuration.GetLength());
    EXPECT_TRUE(one.camera->CheckConfigRegVersion(2, 11)) << "the number itself is kept";
}

TEST(CameraOfAnUnknownDirectoryVersion, ReadsItsBlocksAtAddressZeroAndFails) {
    CameraWorld one(
        R"({"base": "mono", "timeScale": 0, "cameras": [{"versions": {"directory": "9.9"}}]})");
    ASSERT_NE(nullptr, one.camera);
    ASSERT_EQ(CameraOk, one.camera->OpenCamera());

    EXPECT_EQ(CameraHalFault, one.camera->ReadCameraInfo());
}

}  // namespace ZV::Test
