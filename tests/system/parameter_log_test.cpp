#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <fstream>
#include <sstream>
#include <string>

#include "support/flat_camera.h"
#include "support/parameter_worlds.h"
#include "support/settings_words.h"
#include "support/stored_settings.h"

// What the functions of parameters and information print to the log. Calls inside calls are shown,
// so that the depth that earlier tests left does not matter.
namespace ZV::Test {
namespace {

using testing::HasSubstr;
using testing::Not;

class ParameterLog : public OpenedCamera {
  protected:
    explicit ParameterLog(std::string_view scenario = SmallColour)
        : OpenedCamera(scenario),
          logPath((world.GetFolder() / "log.txt").string()),
          settings(ListSwitches()) {}

    void SetUp() override {
        OpenedCamera::SetUp();
        block = ReadSettings();
        shown = ReadLog().size();
    }

    /// The records since the last look, one per line.
    std::string TakeRecords() {
        const std::string log = ReadLog();
        std::string records = log.substr(shown);
        shown = log.size();
        for (char& character : records) {
            if (character == '\0') character = '\n';
        }
        return records;
    }

    Zentara_Settings block{};

  private:
    std::string ListSwitches() const {
        return "outputEnabled = 1\noutputSettings = 1\noutputSparseTable = 1\n"
               "outputGetInfo = 1\noutputNestedCalls = 1\noutputToFile = 1\noutputFilePath = " +
               logPath + "\n";
    }
    std::string ReadLog() const {
        std::ifstream file(logPath, std::ios::binary);
        std::ostringstream text;
        text << file.rdbuf();
        return text.str();
    }

    const std::string logPath;
    const StoredSettings settings;
    std::size_t shown = 0;
};

TEST_F(ParameterLog, AValueThatIsSetIsPrintedOnceItsArgumentsHavePassed) {
    ASSERT_ZERR(zerrNone, Zentara_SetParam(&block, zprmRoiX, 123));
    EXPECT_THAT(TakeRecords(), HasSubstr(" Roi X: 123 pixels\n"));

    ASSERT_ZERR(zerrBadParameter, Zentara_SetParam(&block, zprmTriggerType, 4321));
    EXPECT_THAT(TakeRecords(), HasSubstr(" Trigger type: 4321\n"));

    ASSERT_ZERR(zerrNotSupported, Zentara_SetParam(&block, zprmShutterState, 4321));
    // The dump has no label for this key.
    EXPECT_THAT(TakeRecords(), Not(HasSubstr("Unknown parameter")));
}

TEST_F(ParameterLog, AValueThatIsReadIsPrinted) {
    std::uint32_t value = 0;
    SetWord(block, zprmRoiX, 777);

    ASSERT_ZERR(zerrNone, Zentara_GetParam(&block, zprmRoiX, &value));

    EXPECT_THAT(TakeRecords(), HasSubstr(" Roi X: 777 pixels\n"));
}

TEST_F(ParameterLog, EveryFamilyPrintsWhatIsReadBoundedAndSet) {
    std::uint32_t word = 0;
    std::int32_t signedValue = 0;
    std::uint64_t wide = 0;

    ASSERT_ZERR(zerrNone, Zentara_GetParamMin(&block, zprmPostProcessGainRed, &word));
    EXPECT_THAT(TakeRecords(), HasSubstr("Post Process Gain Red: 10 "));
    ASSERT_ZERR(zerrNone, Zentara_GetParamMax(&block, zprmPostProcessGainRed, &word));
    EXPECT_THAT(TakeRecords(), HasSubstr("Post Process Gain Red: 100000 "));
    ASSERT_ZERR(zerrNone, Zentara_SetParamS32(&block, zprmS32AbsoluteOffset, -321));
    EXPECT_THAT(TakeRecords(), HasSubstr("Absolute Offset: -321"));
    ASSERT_ZERR(zerrNone, Zentara_GetParamS32(&block, zprmS32AbsoluteOffset, &signedValue));
    EXPECT_THAT(TakeRecords(), HasSubstr("Absolute Offset: -321"));
    ASSERT_ZERR(zerrNone, Zentara_GetParamS32Max(&block, zprmS32AbsoluteOffset, &signedValue));
    EXPECT_THAT(TakeRecords(), HasSubstr("Absolute Offset: " + std::to_string(signedValue)));
    ASSERT_ZERR(zerrNone, Zentara_SetParam64(&block, zprm64Exposure, 7654321));
    EXPECT_THAT(TakeRecords(), HasSubstr("Exposure (64-bit): 7654321 ns"));
    ASSERT_ZERR(zerrNone, Zentara_GetParam64(&block, zprm64Exposure, &wide));
    EXPECT_THAT(TakeRecords(), HasSubstr("Exposure (64-bit): 7654321 ns"));
    ASSERT_ZERR(zerrNone, Zentara_GetParam64Min(&block, zprm64Exposure, &wide));
    EXPECT_THAT(TakeRecords(), HasSubstr("Exposure (64-bit): " + std::to_string(wide) + " ns"));
}

// Kept: one getter looks at the key before it asks; the others ask first.
TEST_F(ParameterLog, OfASignedKeyThatDoesNotExistTheGetterAloneAsksNotForSupport) {
    std::uint32_t word = 0;
    std::int32_t signedValue = 0;
    std::uint64_t wide = 0;

    ASSERT_ZERR(zerrNotSupported, Zentara_GetParamS32(&block, 3, &signedValue));
    EXPECT_THAT(TakeRecords(), Not(HasSubstr("Zentara_IsParamS32Supported")));
    ASSERT_ZERR(zerrNotSupported, Zentara_GetParamS32Min(&block, 3, &signedValue));
    EXPECT_THAT(TakeRecords(), HasSubstr("Zentara_IsParamS32Supported"));
    ASSERT_ZERR(zerrNotSupported, Zentara_GetParamS32(&block, 2, &signedValue));
    EXPECT_THAT(TakeRecords(), HasSubstr("Zentara_IsParamS32Supported"));
    ASSERT_ZERR(zerrNotSupported, Zentara_GetParam(&block, 47, &word));
    EXPECT_THAT(TakeRecords(), HasSubstr("Zentara_IsParamSupported"));
    ASSERT_ZERR(zerrNotSupported, Zentara_GetParam64(&block, 4, &wide));
    EXPECT_THAT(TakeRecords(), HasSubstr("Zentara_IsParam64Supported"));
}

class RichLog : public ParameterLog {
  protected:
    RichLog() : ParameterLog(RichMono) {}
};

TEST_F(RichLog, ALimitThatAKeyDoesNotHaveIsNotPrinted) {
    for (const std::uint32_t key : {27u, 34u, 35u, 45u, 46u}) {
        std::uint32_t value = 54321;

        ASSERT_ZERR(zerrNotSupported, Zentara_GetParamMin(&block, key, &value)) << key;
        ASSERT_ZERR(zerrNotSupported, Zentara_GetParamMax(&block, key, &value)) << key;

        EXPECT_THAT(TakeRecords(), Not(HasSubstr("54321"))) << key;
    }
}

class TweakLog : public ParameterLog {
  protected:
    TweakLog() : ParameterLog("model:TirelM1") {}
};

TEST_F(TweakLog, TheRegisterTweakPrintsTheValueThatItLeavesAlone) {
    std::uint32_t value = 54321;

    ASSERT_ZERR(zerrNotSupported, Zentara_GetParam(&block, zprmRegisterTweak, &value));

    EXPECT_EQ(54321u, value);
    EXPECT_THAT(TakeRecords(), HasSubstr("54321"));
}

// Kept: although it is refused.
TEST_F(ParameterLog, ALimitOfASignedKeyThatDoesNotExistPrintsTheValue) {
    constexpr const char* Record = "ZentaraDebugOutputSettingS32() - Unknown parameter";
    std::int32_t value = 5;

    ASSERT_ZERR(zerrNotSupported, Zentara_GetParamS32Min(&block, 3, &value));
    EXPECT_THAT(TakeRecords(), HasSubstr(Record));
    ASSERT_ZERR(zerrNotSupported, Zentara_GetParamS32Max(&block, 3, &value));
    EXPECT_THAT(TakeRecords(), HasSubstr(Record));
    ASSERT_ZERR(zerrNotSupported, Zentara_GetParamS32(&block, 3, &value));
    EXPECT_THAT(TakeRecords(), Not(HasSubstr(Record)));
    ASSERT_ZERR(zerrNotSupported, Zentara_GetParamS32Min(&block, 2, &value));
    EXPECT_THAT(TakeRecords(), Not(HasSubstr("Regulated Cooling Temp")));
    EXPECT_EQ(5, value);
}

TEST_F(ParameterLog, AListIsPrintedUnderTheNameOfItsKey) {
    std::uint32_t entries[20];
    std::int32_t size = 20;

    ASSERT_ZERR(zerrNone, Zentara_GetParamSparseTable(&block, 12, entries, &size));

    EXPECT_THAT(TakeRecords(), HasSubstr("Sparse Table for zprmImageFormat:"));
}

class LogOfATakenCamera : public ParameterLog {
  protected:
    LogOfATakenCamera()
        : ParameterLog(R"({"base": "colour", "cameras": [{"held": {"from": 5},
                           "sensor": {"width": 64, "height": 48}}]})") {}
};

TEST_F(LogOfATakenCamera, ACameraInAnotherProcessIsToldByTheQuestionForSupport) {
    ASSERT_ZERR(zerrNone, Zentara_CloseCamera(handle));
    ZentaraHandle again = 0;
    ASSERT_ZERR(zerrDriverFault, Zentara_OpenCamera(0, &again));
    TakeRecords();

    EXPECT_ZERR(zerrBadHandle, Zentara_IsParamSupported(handle, zprmRoiX));

    EXPECT_THAT(TakeRecords(),
                HasSubstr("Zentara_IsParamSupported - Another process has this camera open."));
}

// Kept: the serial number alone asks for the access before it asks whether the camera is open.
TEST_F(ParameterLog, OfAClosedCameraTheSerialNumberAloneIsSaidToBeInAnotherProcess) {
    constexpr const char* Message = "Another process has this camera open.";
    ASSERT_ZERR(zerrNone, Zentara_CloseCamera(handle));
    TakeRecords();
    char text[64];
    std::uint32_t value = 0;

    EXPECT_ZERR(zerrBadHandle, Zentara_GetSerialString(handle, text, sizeof text));
    EXPECT_THAT(TakeRecords(), HasSubstr(std::string("Zentara_GetSerialString - ") + Message));
    EXPECT_ZERR(zerrBadHandle, Zentara_GetCameraModelString(handle, text, sizeof text));
    EXPECT_THAT(TakeRecords(), Not(HasSubstr(Message)));
    EXPECT_ZERR(zerrBadHandle, Zentara_GetInfo(handle, zinfCcd, &value));
    EXPECT_THAT(TakeRecords(), Not(HasSubstr(Message)));
}

TEST_F(ParameterLog, ACameraThatIsClosedIsNotSaidToBeInAnotherProcess) {
    ASSERT_ZERR(zerrNone, Zentara_CloseCamera(handle));
    TakeRecords();

    EXPECT_ZERR(zerrBadHandle, Zentara_IsParamSupported(handle, zprmRoiX));

    EXPECT_THAT(TakeRecords(), Not(HasSubstr("Another process")));
}

TEST_F(ParameterLog, AnAnswerOfTheInformationIsPrinted) {
    std::uint32_t value = 0;

    ASSERT_ZERR(zerrNone, Zentara_GetInfo(handle, zinfImageWidth, &value));

    EXPECT_THAT(TakeRecords(), HasSubstr("Image Width: 64"));
}

TEST_F(ParameterLog, AnInformationKeyWithoutAnAnswerIsNotPrinted) {
    testing::internal::CaptureStdout();
    for (const std::uint32_t key : {27u, 28u, 35u, 41u, 100u}) {
        std::uint32_t value = 0;
        EXPECT_ZERR(zerrNotSupported, Zentara_GetInfo(handle, key, &value)) << key;
    }
    (void)testing::internal::GetCapturedStdout();

    const std::string records = TakeRecords();
    EXPECT_THAT(records, Not(HasSubstr("ZentaraDebugOutputGetInfo()")));
    EXPECT_THAT(records, Not(HasSubstr(": 0")));
}

TEST_F(ParameterLog, AResolutionOfATriggerDelayThatTheCameraDoesNotHaveIsNotPrinted) {
    std::uint32_t value = 0xDDDDDDDD;

    ASSERT_ZERR(zerrNotSupported, Zentara_GetInfo(handle, zinfTriggerDelayRes, &value));

    EXPECT_NE(0xDDDDDDDDu, value);
    EXPECT_THAT(TakeRecords(), Not(HasSubstr("Trigger Delay Resolution")));
}

}  // namespace
}  // namespace ZV::Test
