#include <gtest/gtest.h>

#include <algorithm>
#include <string>
#include <vector>

#include "simulation/register_file.h"
#include "support/flat_camera.h"
#include "support/log_file.h"
#include "support/settings_words.h"

// What preflighting and sending say in the log, nested calls shown.
namespace ZV::Test {
namespace {

class SettingsLog : protected LogFile, public OpenedCamera {
  protected:
    explicit SettingsLog(std::string_view scenario = SmallMono) : OpenedCamera(scenario) {}

    void SetUp() override {
        OpenedCamera::SetUp();
        ASSERT_ZERR(zerrNone, Zentara_ReadDefaultSettings(handle, &block));
    }

    std::vector<std::string> Preflight() {
        TakeTexts();
        EXPECT_ZERR(zerrNone, Zentara_PreflightSettings(handle, &block));
        return TakeMessages("Zentara_PreflightSettings");
    }
    /// What the send says behind "Settings that changed:".
    std::vector<std::string> SendAndTakeChanges() {
        TakeTexts();
        EXPECT_ZERR(zerrNone, Zentara_SendSettingsToCam(handle, &block));
        std::vector<std::string> texts = TakeTexts();
        const auto start = std::ranges::find(texts, "Settings that changed:");
        EXPECT_NE(texts.end(), start);
        if (start != texts.end()) texts.erase(texts.begin(), start + 1);
        if (!texts.empty()) texts.pop_back();  // the end of the call
        return texts;
    }
    void SetRegion(std::uint32_t x, std::uint32_t y, std::uint32_t width, std::uint32_t height) {
        SetWord(block, zprmRoiX, x);
        SetWord(block, zprmRoiY, y);
        SetWord(block, zprmRoiWidth, width);
        SetWord(block, zprmRoiHeight, height);
    }

    using Texts = std::vector<std::string>;
    Zentara_Settings block{};
};

TEST_F(SettingsLog, ABlockThatFitsIsPreflightedInSilence) {
    EXPECT_EQ(Texts{}, Preflight());
}

// A blank follows each value.
TEST_F(SettingsLog, EachMendedEdgeAndLengthIsToldRowsFirst) {
    SetRegion(65, 49, 100, 100);

    EXPECT_EQ((Texts{"Roi Y is now 0 ", "Roi Height is now 48 ", "Roi X is now 0 ",
                     "Roi Width is now 64 "}),
              Preflight());
}

TEST_F(SettingsLog, EachMendedExposureIsTold) {
    SetWide(block, zprm64Exposure, 1);
    SetWide(block, zprm64ExposureRed, 2);
    SetWide(block, zprm64ExposureBlue, 3'600'000'000'001);

    EXPECT_EQ((Texts{"Exposure is now 10000 ", "Red Exposure is now 10000 ",
                     "Blue Exposure is now 3600000000000 "}),
              Preflight());
}

TEST_F(SettingsLog, TheLossOfBinningOnTheWayIntoRealTimeVideoIsNotTold) {
    SetWord(block, zprmCameraMode, 1);
    SetWord(block, zprmBinning, 2);

    EXPECT_EQ((Texts{"Roi Width is now 1 ", "Roi Height is now 1 "}), Preflight());
}

TEST_F(SettingsLog, MendingByASendIsToldUnderTheNameOfThePreflight) {
    SetRegion(0, 0, 64, 100);
    TakeTexts();

    ASSERT_ZERR(zerrNone, Zentara_SendSettingsToCam(handle, &block));

    EXPECT_EQ(Texts{"Roi Height is now 48 "}, TakeMessages("Zentara_PreflightSettings"));
}

TEST_F(SettingsLog, ASendTellsTheWordsThatChanged) {
    ASSERT_ZERR(zerrNone, Zentara_SendSettingsToCam(handle, &block));
    SetWord(block, zprmTriggerType, 3);
    SetWord(block, zprmPostProcessGainRed, 2000);

    const Texts changes = SendAndTakeChanges();

    ASSERT_EQ(2u, changes.size());
    EXPECT_EQ(0u, changes[0].find("Trigger type")) << changes[0];
    EXPECT_NE(std::string::npos, changes[1].find("2000")) << changes[1];
}

TEST_F(SettingsLog, ASendOfTheBlockJustReadSaysNothing) {
    ASSERT_ZERR(zerrNone, Zentara_SendSettingsToCam(handle, &block));
    block = ReadSettings();

    EXPECT_EQ(Texts{"Nothing"}, SendAndTakeChanges());
}

// Kept: only the 47 words are looked at, while the camera does take the settings over.
TEST_F(SettingsLog, AChangeOfASignedOrWideWordAloneSaysNothing) {
    ASSERT_ZERR(zerrNone, Zentara_SendSettingsToCam(handle, &block));
    SetSigned(block, zprmS32AbsoluteOffset, 3);
    SetWide(block, zprm64Exposure, 50'000'000);

    EXPECT_EQ(Texts{"Nothing"}, SendAndTakeChanges());

    EXPECT_EQ(Simulation::CommandAddress + 4, world.ReadRegisterWrites().back().address);
}

class ColourSettingsLog : public SettingsLog {
  protected:
    ColourSettingsLog() : SettingsLog(SmallColour) {}
};

TEST_F(ColourSettingsLog, TheAlignmentToTheMosaicIsToldForBothEdgesBeforeBothLengths) {
    SetRegion(3, 5, 7, 1);

    EXPECT_EQ((Texts{"Roi X is now 2 ", "Roi Y is now 4 ", "Roi Width is now 6 ",
                     "Roi Height is now 2 "}),
              Preflight());
}

class OldSettingsLog : public SettingsLog {
  protected:
    OldSettingsLog()
        : SettingsLog(R"({"base": "mono", "cameras": [{"sensor": {"width": 64, "height": 48},
                          "streamingVersion": 0}]})") {}
};

TEST_F(OldSettingsLog, TheLowerSpeedOfSixteenBitsIsTold) {
    SetWord(block, zprmImageFormat, zfmtRaw16);

    EXPECT_EQ(Texts{"Readout speed is now 10MHz"}, Preflight());
}

TEST_F(SettingsLog, AClosedCameraIsSaidToBelongToAnotherProcess) {
    ASSERT_ZERR(zerrNone, Zentara_CloseCamera(handle));
    TakeTexts();

    EXPECT_ZERR(zerrBadHandle, Zentara_PreflightSettings(handle, &block));

    EXPECT_EQ(Texts{"Another process has this camera open."},
              TakeMessages("Zentara_PreflightSettings"));
}

}  // namespace
}  // namespace ZV::Test
