#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <fstream>
#include <sstream>
#include <string>

#include "support/flat_camera.h"
#include "support/scoped_variable.h"
#include "support/settings_words.h"

// What the parameters' functions print to the log. Calls inside calls are shown, so that the depth
// that earlier tests left does not matter.
namespace ZV::Test {
namespace {

using testing::HasSubstr;
using testing::Not;

class ParameterLog : public OpenedCamera {
  protected:
    explicit ParameterLog(std::string_view scenario = SmallColour)
        : OpenedCamera(scenario),
          logPath(world.GetFolder() / "log.txt"),
          config("ZENTARA_CONFIG", WriteSwitches().c_str()) {}

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
    std::string WriteSwitches() const {
        std::string path = world.GetFolder() / "zentara.conf";
        std::ofstream(path) << "outputEnabled = 1\noutputSettings = 1\noutputSparseTable = 1\n"
                               "outputNestedCalls = 1\noutputToFile = 1\noutputFilePath = "
                            << logPath << "\n";
        return path;
    }
    std::string ReadLog() const {
        std::ifstream file(logPath, std::ios::binary);
        std::ostringstream text;
        text << file.rdbuf();
        return text.str();
    }

    const std::string logPath;
    const ScopedVariable config;
    std::size_t shown = 0;
};

TEST_F(ParameterLog, AValueThatIsSetIsPrintedOnceItsArgumentsHavePassed) {
    ASSERT_ZERR(zerrNone, Zentara_SetParam(&block, zprmRoiX, 123));
    EXPECT_THAT(TakeRecords(), HasSubstr("123"));

    ASSERT_ZERR(zerrBadParameter, Zentara_SetParam(&block, zprmTriggerType, 4321));
    EXPECT_THAT(TakeRecords(), HasSubstr("4321"));

    ASSERT_ZERR(zerrNotSupported, Zentara_SetParam(&block, zprmShutterState, 4321));
    EXPECT_THAT(TakeRecords(), Not(HasSubstr("4321")));
}

TEST_F(ParameterLog, AValueThatIsReadIsPrinted) {
    std::uint32_t value = 0;
    SetWord(block, zprmRoiX, 777);

    ASSERT_ZERR(zerrNone, Zentara_GetParam(&block, zprmRoiX, &value));

    EXPECT_THAT(TakeRecords(), HasSubstr("777"));
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

TEST_F(ParameterLog, ACameraThatIsClosedIsNotSaidToBeInAnotherProcess) {
    ASSERT_ZERR(zerrNone, Zentara_CloseCamera(handle));
    TakeRecords();

    EXPECT_ZERR(zerrBadHandle, Zentara_IsParamSupported(handle, zprmRoiX));

    EXPECT_THAT(TakeRecords(), Not(HasSubstr("Another process")));
}

}  // namespace
}  // namespace ZV::Test
