#include <gtest/gtest.h>

#include <cstring>
#include <string>

#include "camera/camera.h"
#include "support/flat_camera.h"

namespace ZV::Test {
namespace {

class Information : public OpenedCamera {
  protected:
    explicit Information(std::string_view scenario = SmallMono) : OpenedCamera(scenario) {}
};

TEST_F(Information, TellsWhatTheCameraIs) {
    EXPECT_EQ(static_cast<std::uint32_t>(zmodelSolvaneA1), GetInfo(zinfCameraType));
    EXPECT_EQ(116u, GetInfo(zinfFirmwareVersion));
    EXPECT_EQ(7u, GetInfo(zinfFirmwareBuild));
    EXPECT_EQ(64u, GetInfo(zinfCcdWidth));
    EXPECT_EQ(48u, GetInfo(zinfCcdHeight));
    EXPECT_EQ(64u, GetInfo(zinfImageWidth));
    EXPECT_EQ(48u, GetInfo(zinfImageHeight));
    EXPECT_EQ(12u, GetInfo(zinfBitDepth));
    EXPECT_EQ(0u, GetInfo(zinfCcdType));
    EXPECT_EQ(1u, GetInfo(zinfStreamVersion));
}

TEST_F(Information, TheUniqueIdIsTheOneOfTheListing) {
    ASSERT_ZERR(zerrNone, Zentara_CloseCamera(handle));
    const auto items = ListCameras();
    ASSERT_ZERR(zerrNone, Zentara_OpenCamera(0, &handle));

    EXPECT_EQ(items[0].uniqueId, GetInfo(zinfUniqueId));
}

TEST_F(Information, TheSerialNumberKeyIsZeroAndModelBIsOneOnEveryCamera) {
    EXPECT_EQ(0u, GetInfo(zinfSerialNumber));
    EXPECT_EQ(0u, GetInfo(zinfReserved7));
    EXPECT_EQ(1u, GetInfo(zinfIsModelB));
}

TEST_F(Information, WithEightBitsTheImageSizeIsWidthTimesHeight) {
    EXPECT_EQ(64u * 48u, GetInfo(zinfImageSize));
}

TEST_F(Information, ThePostProcessedSizeIsThatOfTheBayerOutput) {
    EXPECT_EQ(64u * 48u * 3, GetInfo(zinfPostProcessImageSize));
}

TEST_F(Information, KeysWithoutAnAnswerReturnOneAndSetZero) {
    for (const std::uint32_t key : {27u, 28u, 35u, 41u, 100u, 0xFFFFFFFFu}) {
        std::uint32_t value = 99;

        EXPECT_ZERR(zerrNotSupported, Zentara_GetInfo(handle, key, &value)) << key;

        EXPECT_EQ(0u, value) << key;
    }
}

TEST_F(Information, AKeyWithoutAnAnswerIsNamedOnStandardOutput) {
    std::uint32_t value = 0;
    testing::internal::CaptureStdout();

    (void)Zentara_GetInfo(handle, 35, &value);
    (void)Zentara_GetInfo(handle, 100, &value);

    std::fflush(stdout);
    EXPECT_EQ(
        "Zentara_GetInfo not implemented for key 35\n"
        "Zentara_GetInfo not implemented for key 100\n",
        testing::internal::GetCapturedStdout());
}

TEST_F(Information, WithoutAnIntensifierItsKeysReturnOneAndLeaveTheValueAlone) {
    for (const std::uint32_t key :
         {zinfIntensifierModel, zinfNormITGainSigFigs, zinfNormITGaindBRes}) {
        std::uint32_t value = 99;

        EXPECT_ZERR(zerrNotSupported, Zentara_GetInfo(handle, key, &value)) << key;

        EXPECT_EQ(99u, value) << key;
    }
}

TEST_F(Information, WithoutATriggerDelayItsResolutionReturnsOneAndIsWrittenAllTheSame) {
    std::uint32_t value = 0xDDDDDDDD;

    EXPECT_ZERR(zerrNotSupported, Zentara_GetInfo(handle, zinfTriggerDelayRes, &value));

    EXPECT_NE(0xDDDDDDDDu, value);
}

TEST_F(Information, WithoutAnIntensifierKey17ReturnsOneAndTheNeighboursOfKey19StayUsable) {
    std::uint32_t value = 0;

    EXPECT_ZERR(zerrNotSupported, Zentara_GetInfo(handle, 17, &value));
    EXPECT_ZERR(zerrNotSupported, Zentara_GetInfo(handle, 19, &value));

    EXPECT_EQ(1000u, GetInfo(18));
    EXPECT_EQ(1u, GetInfo(20));
}

TEST_F(Information, EveryOtherKeyAnswersWithSuccess) {
    for (std::uint32_t key = 0; key <= zinfReserved4; ++key) {
        if (key == 17 || key == 19 || key == 23 || key == 24) continue;
        if (key == 27 || key == 28 || key == 35) continue;
        std::uint32_t value = 0xDDDDDDDD;

        EXPECT_ZERR(zerrNone, Zentara_GetInfo(handle, key, &value)) << key;

        EXPECT_NE(0xDDDDDDDDu, value) << key;
    }
}

TEST_F(Information, TheTemperatureLockReadsTheCamera) {
    const std::size_t before = world.ReadRequests().size();
    GetInfo(zinfCooled);
    EXPECT_EQ(before, world.ReadRequests().size());

    GetInfo(zinfRegulatedCoolingLock);

    EXPECT_EQ(before + 2, world.ReadRequests().size());
}

TEST_F(Information, ATemperatureLockThatCannotBeReadIsNoFailure) {
    ASSERT_TRUE(
        world.AddFault(R"({"kind": "failRequest", "code": "FW_IOCTL_ASYNC_READ", "count": 0})"));
    std::uint32_t value = 0;

    EXPECT_ZERR(zerrNone, Zentara_GetInfo(handle, zinfRegulatedCoolingLock, &value));
}

TEST_F(Information, ArgumentsAreTestedInOrder) {
    char text[64];
    std::uint32_t value = 0;

    EXPECT_ZERR(zerrBadHandle, Zentara_GetInfo(0, 100, nullptr));
    EXPECT_ZERR(zerrBadParameter, Zentara_GetInfo(0x1000, 100, nullptr));
    EXPECT_ZERR(zerrBadHandle, Zentara_GetInfo(0x1000, 100, &value));
    EXPECT_ZERR(zerrBadParameter, Zentara_GetInfo(handle, 100, nullptr));
    EXPECT_ZERR(zerrBadHandle, Zentara_GetSerialString(0, nullptr, 0));
    EXPECT_ZERR(zerrBadParameter, Zentara_GetSerialString(0x1000, nullptr, 0));
    EXPECT_ZERR(zerrBadHandle, Zentara_GetSerialString(0x1000, text, 0));
    EXPECT_ZERR(zerrBadHandle, Zentara_GetCameraModelString(0, nullptr, 0));
    EXPECT_ZERR(zerrBadParameter, Zentara_GetCameraModelString(0x1000, nullptr, 0));
    EXPECT_ZERR(zerrBadHandle, Zentara_GetCameraModelString(0x1000, text, 0));
}

class NamedCamera : public Information {
  protected:
    NamedCamera()
        : Information(R"({"base": "mono", "cameras": [{"serial": "ABC-123",
              "sensor": {"width": 64, "height": 48}}]})") {}
};

TEST_F(NamedCamera, TellsItsSerialNumberAndModel) {
    char text[64];

    ASSERT_ZERR(zerrNone, Zentara_GetSerialString(handle, text, sizeof(text)));
    EXPECT_STREQ("ABC-123", text);
    ASSERT_ZERR(zerrNone, Zentara_GetCameraModelString(handle, text, sizeof(text)));
    EXPECT_STREQ("Solvane A1", text);
}

TEST_F(NamedCamera, ABufferWithoutRoomForTheTerminatorIsRefusedAndUntouched) {
    char text[16];
    const struct {
        ZentaraResult (*get)(ZentaraHandle, char*, std::uint32_t);
        std::uint32_t length;
    } calls[] = {{Zentara_GetSerialString, 7}, {Zentara_GetCameraModelString, 10}};

    for (const auto& call : calls) {
        std::memset(text, 'x', sizeof(text));
        EXPECT_ZERR(zerrBadParameter, call.get(handle, text, call.length));
        EXPECT_ZERR(zerrBadParameter, call.get(handle, text, 0));
        for (const char character : text) EXPECT_EQ('x', character);

        EXPECT_ZERR(zerrNone, call.get(handle, text, call.length + 1));
        EXPECT_EQ(call.length, std::strlen(text));
        EXPECT_EQ('x', text[call.length + 1]);
    }
}

class ColourInformation : public Information {
  protected:
    ColourInformation() : Information(SmallColour) {}
};

TEST_F(ColourInformation, AMosaicIsOfTypeOne) {
    EXPECT_EQ(1u, GetInfo(zinfCcdType));
}

TEST_F(Information, BehindAWheelThatCyclesTheSensorIsStillOfTypeZero) {
    ASSERT_EQ(CameraOk, reinterpret_cast<ZCamera*>(handle)->SetRGBFilterCycle(true));

    EXPECT_EQ(3u, reinterpret_cast<ZCamera*>(handle)->GetImageFormat());
    EXPECT_EQ(0u, GetInfo(zinfCcdType));
}

class InformationOfAnotherColourKind : public Information {
  protected:
    InformationOfAnotherColourKind()
        : Information(R"({"cameras": [{"model": "SolvaneA1",
              "sensor": {"width": 64, "height": 48},
              "configuration": {"17": "0x00060200"}}]})") {}
};

// Kept: a client that does not preset the value reads what was there.
TEST_F(InformationOfAnotherColourKind, IsAnsweredWithSuccessAndTheValueIsLeftAlone) {
    std::uint32_t value = 99;

    EXPECT_ZERR(zerrNone, Zentara_GetInfo(handle, zinfCcdType, &value));

    EXPECT_EQ(99u, value);
}

class LongSerialNumber : public Information {
  protected:
    LongSerialNumber()
        : Information(R"({"base": "mono", "cameras": [{"serial": "ABCDEFGHIJKLMNOPQRSTUVWXYZ12",
              "sensor": {"width": 64, "height": 48}}]})") {}
};

TEST_F(LongSerialNumber, Of28CharactersIsTerminatedAllTheSame) {
    char text[29];

    EXPECT_ZERR(zerrBadParameter, Zentara_GetSerialString(handle, text, 28));
    ASSERT_ZERR(zerrNone, Zentara_GetSerialString(handle, text, 29));

    EXPECT_STREQ("ABCDEFGHIJKLMNOPQRSTUVWXYZ12", text);
}

class IntensifiedInformation : public Information {
  protected:
    IntensifiedInformation() : Information("intensified") {}
};

TEST_F(IntensifiedInformation, AnIntensifiersKeysAreAnswered) {
    for (const std::uint32_t key :
         {zinfIntensifierModel, zinfNormITGainSigFigs, zinfNormITGaindBRes, zinfTriggerDelayRes}) {
        std::uint32_t value = 0;
        EXPECT_ZERR(zerrNone, Zentara_GetInfo(handle, key, &value)) << key;
    }
    EXPECT_EQ(3u, GetInfo(zinfNormITGainSigFigs));
    EXPECT_EQ(2000u, GetInfo(zinfNormITGaindBRes));
}

class SeparateBinning : public Information {
  protected:
    SeparateBinning() : Information("metrona") {}
};

TEST_F(SeparateBinning, BothDirectionsMakeAsymmetricalBinning) {
    EXPECT_EQ(1u, GetInfo(zinfAsymmetricalBinning));
    EXPECT_EQ(16u, GetInfo(zinfBitDepth));
}

}  // namespace
}  // namespace ZV::Test
