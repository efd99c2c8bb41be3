#include <gtest/gtest.h>

#include "support/sending_camera.h"
#include "system/settings_sender.h"

namespace ZV::Test {
namespace {

constexpr std::string_view SmallGeneration0 =
    R"({"base": "mono", "cameras": [{"sensor": {"width": 64, "height": 48},
        "streamingVersion": 0}]})";
// ---- The tests of the arguments ----

TEST_F(SettingsSend, ArgumentsAreTestedInOrder) {
    Zentara_Settings block = ReadSettings();
    Zentara_Settings bad = MakeFilledBlock(0);

    EXPECT_ZERR(zerrBadHandle, Zentara_SendSettingsToCam(0, nullptr));
    EXPECT_ZERR(zerrBadSettings, Zentara_SendSettingsToCam(handle, nullptr));
    EXPECT_ZERR(zerrBadSettings, Zentara_SendSettingsToCam(0x1000, &bad));
    EXPECT_ZERR(zerrBadHandle, Zentara_SendSettingsToCam(0x1000, &block));
    ASSERT_ZERR(zerrNone, Zentara_CloseCamera(handle));
    EXPECT_ZERR(zerrBadSettings, Zentara_SendSettingsToCam(handle, &bad));
    EXPECT_ZERR(zerrBadHandle, Zentara_SendSettingsToCam(handle, &block));
    Zentara_ReleaseDriver();
    EXPECT_ZERR(zerrNotLoaded, Zentara_SendSettingsToCam(0, nullptr));
}

TEST_F(SettingsSend, AWrongMagicNumberIsRefusedWhateverTheSizeSaysAndTouchesNothing) {
    for (const std::uint32_t size : {0u, 260u, 0xFFFFFFFFu}) {
        Zentara_Settings block = ReadSettings();
        block.size = size;
        SetWord(block, zprmTriggerType, 1);
        block.privateWords[SettingsMagicWord] ^= 1;
        const Zentara_Settings before = block;

        EXPECT_ZERR(zerrBadSettings, Send(block));

        EXPECT_TRUE(AreSameBlocks(before, block));
        EXPECT_TRUE(GetWrites().empty());
    }
}

TEST_F(SettingsSend, ASizeOfZeroAndTheRightMagicNumberAreAcceptedAndTheSizeStays) {
    Zentara_Settings block = ReadSettings();
    block.size = 0;

    EXPECT_ZERR(zerrNone, Send(block));

    EXPECT_EQ(0u, block.size);
}

TEST_F(SettingsSend, ReservedBytesHandleAndMagicNumberStayAsTheClientHasThem) {
    Zentara_Settings block = ReadDefaults();
    WriteField<std::uint64_t>(block, 236, 0x1122334455667788);
    WriteField<std::uint32_t>(block, 256, 0x99AABBCC);

    EXPECT_ZERR(zerrNone, Send(block));

    EXPECT_EQ(0x1122334455667788u, ReadField<std::uint64_t>(block, 236));
    EXPECT_EQ(0x99AABBCCu, ReadField<std::uint32_t>(block, 256));
    EXPECT_EQ(handle, GetHandleOf(block));
}

// ---- What is committed ----

TEST_F(SettingsSend, TheFirstSendCountsAsAChange) {
    Zentara_Settings block = ReadDefaults();

    ASSERT_ZERR(zerrNone, Send(block));

    EXPECT_TRUE(WasCommitted());
}

TEST_F(SettingsSend, TheBlockJustReadChangesNothingAndCommitsNothing) {
    Zentara_Settings block = ReadDefaults();
    ASSERT_ZERR(zerrNone, Send(block));
    block = ReadSettings();
    const Zentara_Settings before = block;

    EXPECT_ZERR(zerrNone, Send(block));

    EXPECT_TRUE(GetWrites().empty());
    EXPECT_TRUE(AreSameBlocks(before, block));
}

// The filters follow the plain exposure while the wheel stands; that alone is not committed.
TEST_F(SettingsSend, TheBlockOfAFreshCameraWritesTheFiltersExposuresAndCommitsNothing) {
    Zentara_Settings block = ReadSettings();
    const Zentara_Settings before = block;

    EXPECT_ZERR(zerrNone, Send(block));

    EXPECT_EQ(4u, GetWrites().size());
    EXPECT_FALSE(WasCommitted());
    EXPECT_TRUE(AreSameBlocks(before, block));
}

TEST_F(SettingsSend, EachComparedFieldCommitsAndNoOtherDoes) {
    Zentara_Settings block = ReadSettings();
    // Words that mean nothing to this camera are compared all the same.
    for (std::uint32_t word = 0; word < 64; ++word) {
        const bool isSent = word == 3 || (word >= 6 && word <= 16) || word == 20 || word == 24 ||
                            word == 33 || (word >= 47 && word <= 51);
        const bool isReadBack = word == 4 || word == 5;
        const bool isPrivate = word == 60 || word == 61 || word == 62;  // handle and magic number
        if (isSent || isPrivate) continue;
        Zentara_Settings changed = block;
        changed.privateWords[word] ^= word >= 27 && word <= 32 ? 1 : 2;

        ASSERT_ZERR(zerrNone, Send(changed)) << word;

        const bool isCompared =
            word <= 26 || (word >= 33 && word <= 45) || (word >= 52 && word <= 57);
        EXPECT_EQ(isCompared, WasCommitted()) << "word " << word;
        ASSERT_ZERR(zerrNone, Send(block)) << word;
        EXPECT_EQ(isCompared && !isReadBack, WasCommitted()) << "word " << word << " back";
    }
}

TEST_F(SettingsSend, EachSignedWordAndTheExposureCommit) {
    Zentara_Settings block = ReadSettings();
    for (std::uint32_t word : {47u, 48u, 49u, 50u}) {
        block.privateWords[word] += 1;

        ASSERT_ZERR(zerrNone, Send(block)) << word;

        EXPECT_TRUE(WasCommitted()) << "word " << word;
    }
}

TEST_F(SettingsSend, TheScaleOfRedAloneIsNotCommitted) {
    Zentara_Settings block = ReadSettings();
    SetWord(block, zprmPostProcessGainRed, 2000);

    EXPECT_ZERR(zerrNone, Send(block));

    EXPECT_FALSE(WasCommitted());
    EXPECT_EQ(2000u, GetWord(ReadSettings(), zprmPostProcessGainRed));
}

TEST_F(SettingsSend, AFailedCommitIsIgnored) {
    Zentara_Settings block = ReadDefaults();
    ASSERT_TRUE(RefuseWrites(Simulation::CommandAddress + 4));

    EXPECT_ZERR(zerrNone, Send(block));

    EXPECT_EQ(1u, CountWrites(Simulation::CommandAddress + 4));
    ASSERT_ZERR(zerrNone, Send(block));
    EXPECT_FALSE(WasCommitted()) << "the block counts as sent";
}

// The block is the last one sent; it is the camera's region that had changed meanwhile.
TEST_F(SettingsSend, AStreamThatASetterStopsGoesOnEvenWhereTheBlockIsTheLastOne) {
    Zentara_Settings block = ReadDefaults();
    ASSERT_ZERR(zerrNone, Send(block));
    ASSERT_ZERR(zerrNone, Send(block));
    ASSERT_FALSE(WasCommitted()) << "nothing to change";
    ASSERT_EQ(CameraOk, GetCamera().SetROI(0, 0, 32, 24));
    ASSERT_ZERR(zerrNone, Zentara_SetStreaming(handle, 1));

    EXPECT_ZERR(zerrNone, Send(block));

    EXPECT_TRUE(WasCommitted());
    EXPECT_TRUE(GetCamera().IsCameraStreaming());
    EXPECT_EQ(64u, GetCamera().GetROIWidth());
}

TEST_F(SettingsSend, ReadingMakesTheNextSendOfTheSameBlockNoChange) {
    Zentara_Settings block = ReadDefaults();
    ASSERT_ZERR(zerrNone, Send(block));
    SetWord(block, zprmTriggerType, 1);
    ASSERT_EQ(CameraOk, GetCamera().SetTriggerMode(1));
    Zentara_Settings read = ReadSettings();

    EXPECT_ZERR(zerrNone, Send(read));

    EXPECT_FALSE(WasCommitted());
}

TEST_F(SettingsSend, DefaultsThatAreOnlyReadDoNotCountAsSent) {
    Zentara_Settings block = ReadSettings();
    ReadDefaults();

    EXPECT_ZERR(zerrNone, Send(block));

    EXPECT_FALSE(WasCommitted());
}

// ---- What goes back into the block ----

TEST_F(SettingsSend, AdjustedValuesComeBack) {
    Zentara_Settings block = ReadDefaults();
    SetWord(block, zprmBinning, 2);
    SetWord(block, zprmHorizontalBinning, 7);
    SetWord(block, zprmVerticalBinning, 9);
    SetWord(block, zprmRoiX, 1000);
    SetWord(block, zprmRoiY, 4);
    SetWord(block, zprmRoiWidth, 1000);
    SetWord(block, zprmRoiHeight, 1000);
    SetWord(block, zprmReadoutSpeed, 99);

    ASSERT_ZERR(zerrNone, Send(block));

    EXPECT_EQ(2u, GetWord(block, zprmBinning));
    EXPECT_EQ(2u, GetWord(block, zprmHorizontalBinning));
    EXPECT_EQ(2u, GetWord(block, zprmVerticalBinning));
    EXPECT_EQ(0u, GetWord(block, zprmRoiX));
    EXPECT_EQ(4u, GetWord(block, zprmRoiY));
    EXPECT_EQ(32u, GetWord(block, zprmRoiWidth));
    EXPECT_EQ(20u, GetWord(block, zprmRoiHeight));
    EXPECT_EQ(0u, GetWord(block, zprmReadoutSpeed));
}

TEST_F(SettingsSend, ThePlaceOfTheRegionComesBackEvenWhereALaterSettingFails) {
    Zentara_Settings block = ReadDefaults();
    ASSERT_ZERR(zerrNone, Send(block));
    SetWord(block, zprmRoiX, 10);
    SetWord(block, zprmRoiWidth, 1000);
    SetSigned(block, zprmS32RegulatedCoolingTemp, 50);

    EXPECT_ZERR(zerrDriverFault, Send(block));

    EXPECT_EQ(10u, GetWord(block, zprmRoiX));
    EXPECT_EQ(54u, GetWord(block, zprmRoiWidth));
}

// Kept: only the words of 64 bits are brought into line, never those in microseconds.
TEST_F(SettingsSend, AnExposureBelowTheMinimumIsRaisedInItsWideWordAlone) {
    Zentara_Settings block = ReadDefaults();
    SetWide(block, zprm64Exposure, 1);
    const std::uint32_t word = GetWord(block, zprmExposure);

    ASSERT_ZERR(zerrNone, Send(block));

    EXPECT_EQ(10'000u, GetWide(block, zprm64Exposure));
    EXPECT_EQ(word, GetWord(block, zprmExposure));
    EXPECT_EQ(10'000u, GetCamera().GetExposure());
}

TEST_F(SettingsSend, WordsThatStandTwiceAreSentFromTheirSignedOrWideWordOnly) {
    Zentara_Settings block = ReadDefaults();
    for (const std::uint32_t key :
         {zprmGain, zprmOffset, zprmExposure, zprmExposureRed, zprmExposureBlue, zprmNormalizedGain,
          zprmIntensifierGain, zprmNormIntensGaindB, zprmTriggerDelay}) {
        SetWord(block, key, 77);
    }

    ASSERT_ZERR(zerrNone, Send(block));

    // The filters follow the plain exposure while the wheel stands.
    Zentara_Settings expected = ReadDefaults();
    const Zentara_Settings read = ReadSettings();
    EXPECT_EQ(GetWord(expected, zprmGain), GetWord(read, zprmGain));
    EXPECT_EQ(GetWord(expected, zprmOffset), GetWord(read, zprmOffset));
    EXPECT_EQ(GetWord(expected, zprmExposure), GetWord(read, zprmExposure));
    EXPECT_EQ(GetWord(expected, zprmExposure), GetWord(read, zprmExposureRed));
    EXPECT_EQ(GetWord(expected, zprmExposure), GetWord(read, zprmExposureBlue));
}

TEST_F(SettingsSend, BothBicubicsReadBackAsTheFasterAndUnknownAlgorithmsChangeNothing) {
    Zentara_Settings block = ReadDefaults();
    constexpr std::pair<std::uint32_t, std::uint32_t> Algorithms[] = {
        {1, 1}, {3, 4}, {2, 2}, {4, 4}, {5, 4}, {0, 4}, {0x10001, 4}, {1, 1}, {0xFFFFFFFF, 1}};
    for (const auto& [sent, expected] : Algorithms) {
        SetWord(block, zprmPostProcessBayerAlgorithm, sent);

        ASSERT_ZERR(zerrNone, Send(block));

        EXPECT_EQ(sent, GetWord(block, zprmPostProcessBayerAlgorithm));
        EXPECT_EQ(expected, GetWord(ReadSettings(), zprmPostProcessBayerAlgorithm)) << sent;
    }
}

TEST_F(SettingsSend, PostProcessingIsSentAndReadBackAndSwitchedOffByAskingForDefaults) {
    Zentara_Settings block = ReadDefaults();
    SetWord(block, zprmDoPostProcessing, 7);
    SetWord(block, zprmPostProcessGainRed, 1500);
    SetWord(block, zprmPostProcessGainGreen, 1250);
    SetWord(block, zprmPostProcessGainBlue, 750);
    SetWord(block, zprmPostProcessImageFormat, 10);
    ASSERT_ZERR(zerrNone, Send(block));

    const Zentara_Settings read = ReadSettings();
    EXPECT_EQ(1u, GetWord(read, zprmDoPostProcessing));
    EXPECT_EQ(1500u, GetWord(read, zprmPostProcessGainRed));
    EXPECT_EQ(1250u, GetWord(read, zprmPostProcessGainGreen));
    EXPECT_EQ(750u, GetWord(read, zprmPostProcessGainBlue));
    EXPECT_EQ(10u, GetWord(read, zprmPostProcessImageFormat));

    // Kept: before any block is sent.
    ReadDefaults();
    EXPECT_EQ(0u, GetWord(ReadSettings(), zprmDoPostProcessing));
}

// ---- The wheel ----

TEST_F(SettingsSend, AColourFormatTurnsTheWheelAndAMonochromeOneStopsItsCycleAlone) {
    Zentara_Settings block = ReadDefaults();
    SetWord(block, zprmImageFormat, zfmtRGBPlane8);

    ASSERT_ZERR(zerrNone, Send(block));

    EXPECT_EQ(0x11u, Peek(12) & 0x11) << "active and cycling";
    EXPECT_EQ(zfmtRGBPlane8, GetWord(ReadSettings(), zprmImageFormat));

    SetWord(block, zprmImageFormat, zfmtMono8);
    ASSERT_ZERR(zerrNone, Send(block));

    EXPECT_EQ(0x10u, Peek(12) & 0x11) << "the wheel is never made inactive";
    EXPECT_EQ(zfmtMono8, GetWord(ReadSettings(), zprmImageFormat));
}

TEST_F(SettingsSend, ATurningWheelHasExposuresOfItsOwn) {
    Zentara_Settings block = ReadDefaults();
    SetWord(block, zprmImageFormat, zfmtRGB24);
    SetWide(block, zprm64ExposureRed, 41'000'000);
    SetWide(block, zprm64ExposureBlue, 1);

    ASSERT_ZERR(zerrNone, Send(block));

    EXPECT_EQ(41'000'000u, GetCamera().GetRGBFilterRedExposure());
    EXPECT_EQ(10'000u, GetCamera().GetRGBFilterBlueExposure()) << "raised to the least";
    EXPECT_EQ(10'000u, GetWide(block, zprm64ExposureBlue));
}

class ColourSettingsSend : public SettingsSend {
  protected:
    ColourSettingsSend() : SettingsSend(SmallColour) {}
};

TEST_F(ColourSettingsSend, AMosaicCameraHasNoWheelToTurn) {
    Zentara_Settings block = ReadDefaults();
    SetWord(block, zprmImageFormat, zfmtRGB24);

    ASSERT_ZERR(zerrNone, Send(block));

    EXPECT_EQ(0u, CountWrites(Control(12)));
    EXPECT_FALSE(GetCamera().GetRGBFilterCycleMode());
}

// ---- Packets of version 0 ----

class OldSettingsSend : public SettingsSend {
  protected:
    OldSettingsSend() : SettingsSend(SmallGeneration0) {}
};

TEST_F(OldSettingsSend, SixteenBitsGoOutAtTenMegahertzAndTheBlockSaysSo) {
    Zentara_Settings block = ReadDefaults();
    SetWord(block, zprmImageFormat, zfmtRaw16);

    ASSERT_ZERR(zerrNone, Send(block));

    EXPECT_EQ(1u, GetWord(block, zprmReadoutSpeed));
    EXPECT_EQ(10.0f, GetCamera().GetReadoutFrequency());
}

TEST_F(OldSettingsSend, ASlowerSpeedIsLeftAloneAndSoAreBytes) {
    Zentara_Settings block = ReadDefaults();
    SetWord(block, zprmImageFormat, zfmtRaw16);
    SetWord(block, zprmReadoutSpeed, zspeed5MHz);

    ASSERT_ZERR(zerrNone, Send(block));

    EXPECT_EQ(2u, GetWord(block, zprmReadoutSpeed));
    SetWord(block, zprmImageFormat, zfmtRaw8);
    SetWord(block, zprmReadoutSpeed, zspeed20MHz);
    ASSERT_ZERR(zerrNone, Send(block));
    EXPECT_EQ(0u, GetWord(block, zprmReadoutSpeed));
}

// ---- Features ----

class RichSettingsSend : public SettingsSend {
  protected:
    RichSettingsSend() : SettingsSend(SmallRich) {}
};

// Kept: high gain can be asked for but not had, and double shot comes with every send.
TEST_F(RichSettingsSend, HighGainReadsBackAsOffAndDoubleShotAsOn) {
    Zentara_Settings block = ReadDefaults();
    SetWord(block, zprmHighGainMode, 1);
    SetWord(block, zprmDoubleShot, 0);

    ASSERT_ZERR(zerrNone, Send(block));

    const Zentara_Settings read = ReadSettings();
    EXPECT_EQ(0u, GetWord(read, zprmHighGainMode));
    EXPECT_EQ(1u, GetWord(read, zprmDoubleShot));
    EXPECT_EQ(1u, GetWord(block, zprmHighGainMode)) << "the block keeps what was asked";
    EXPECT_EQ(0u, GetWord(block, zprmDoubleShot));
}

TEST_F(RichSettingsSend, AValueOutOfItsRangeEndsTheSendWithTheDriversFault) {
    Zentara_Settings block = ReadDefaults();
    SetWord(block, zprmEMGain, 1024);

    EXPECT_ZERR(zerrDriverFault, Send(block));

    EXPECT_FALSE(WasCommitted());
}

TEST_F(SettingsSend, FeaturesThatAModelLacksCountAsSuccess) {
    Zentara_Settings block = ReadDefaults();
    for (const std::uint32_t key :
         {zprmBlackoutMode, zprmHighSensitivityMode, zprmDither, zprmHighGainMode, zprmCloseDelay,
          zprmEMGain, zprmVClockPeriod, zprmReadoutPort, zprmMetronaShutterDelay, zprmDoubleShot,
          zprmCameraMode}) {
        SetWord(block, key, 5);
    }
    SetWide(block, zprm64NormIntensGain, 5);

    EXPECT_ZERR(zerrNone, Send(block));
}

TEST_F(SettingsSend, ABinningThatNoCameraHasEndsTheSendAndKeepsTheClientsRegion) {
    for (const std::uint32_t mode : {0u, 5u, 6u, 7u, 9u, 0xFFFFFFFFu}) {
        Zentara_Settings block = ReadDefaults();
        SetWord(block, zprmBinning, mode);
        SetWord(block, zprmRoiWidth, 40);

        EXPECT_ZERR(zerrDriverFault, Send(block)) << mode;

        EXPECT_EQ(40u, GetWord(block, zprmRoiWidth));
        EXPECT_EQ(mode, GetWord(block, zprmBinning));
    }
}

TEST_F(SettingsSend, FormatsBeyondTheTableLeaveTheDepthAsItIs) {
    Zentara_Settings block = ReadDefaults();
    SetWord(block, zprmImageFormat, zfmtMono16);
    ASSERT_ZERR(zerrNone, Send(block));
    for (const std::uint32_t format : {13u, 32u, 0xFFFFFFFFu}) {
        SetWord(block, zprmImageFormat, format);

        EXPECT_ZERR(zerrNone, Send(block));

        EXPECT_EQ(12u, GetCamera().GetBitDepth()) << format;
    }
}

TEST_F(SettingsSend, EachFormatSetsItsDepth) {
    Zentara_Settings block = ReadDefaults();
    constexpr bool IsDeep[] = {false, true,  false, true, false, true, false,
                               true,  false, false, true, false, false};
    for (std::uint32_t format = 0; format < std::size(IsDeep); ++format) {
        SetWord(block, zprmImageFormat, format);

        ASSERT_ZERR(zerrNone, Send(block));

        EXPECT_EQ(IsDeep[format] ? 12u : 8u, GetCamera().GetBitDepth()) << format;
    }
}

// Kept: reading fills what counts as last sent with a format of its own.
TEST_F(SettingsSend, FramesAreCalledRawUntilTheSettingsAreRead) {
    Zentara_Settings block = ReadDefaults();
    SetWord(block, zprmImageFormat, zfmtRaw16);
    ASSERT_ZERR(zerrNone, Send(block));
    ClientFrame frame(GetImageBytes());

    ASSERT_ZERR(zerrNone, Zentara_GrabFrame(handle, frame.Get()));
    EXPECT_EQ(zfmtRaw16, frame->format);
    EXPECT_EQ(12u, frame->bits);

    EXPECT_EQ(zfmtMono16, GetWord(ReadSettings(), zprmImageFormat));
    ASSERT_ZERR(zerrNone, Zentara_GrabFrame(handle, frame.Get()));
    EXPECT_EQ(zfmtMono16, frame->format);
}

TEST_F(SettingsSend, AskingForDefaultsLeavesFramesRaw) {
    Zentara_Settings block = ReadDefaults();
    SetWord(block, zprmImageFormat, zfmtRaw8);
    ASSERT_ZERR(zerrNone, Send(block));
    ReadDefaults();
    ClientFrame frame(GetImageBytes());

    ASSERT_ZERR(zerrNone, Zentara_GrabFrame(handle, frame.Get()));

    EXPECT_EQ(zfmtRaw8, frame->format);
}

// ---- Two cameras ----

class SettingsOfTwoCameras : public SettingsSend {
  protected:
    SettingsOfTwoCameras()
        : SettingsSend(
              R"({"base": "mono", "cameras": [{"sensor": {"width": 64, "height": 48}},
                  {"model": "SolvaneC1", "sensor": {"width": 96, "height": 80}}]})") {}

    void SetUp() override {
        SettingsSend::SetUp();
        ASSERT_ZERR(zerrNone, Zentara_OpenCamera(1, &other));
    }

    ZentaraHandle other = 0;
};

TEST_F(SettingsOfTwoCameras, ABlockGoesToTheCameraOfTheCallAndKeepsItsOwnHandle) {
    Zentara_Settings block = ReadDefaults();
    SetWord(block, zprmTriggerType, 3);

    ASSERT_ZERR(zerrNone, Zentara_SendSettingsToCam(other, &block));

    EXPECT_EQ(handle, GetHandleOf(block));
    EXPECT_EQ(0u, GetCamera().GetTriggerMode());
    EXPECT_EQ(3u, reinterpret_cast<ZCamera*>(other)->GetTriggerMode());
}

TEST_F(SettingsOfTwoCameras, ABlockOfAClosedCameraGoesOutWithItsExposureUnmended) {
    Zentara_Settings block = ReadDefaults();
    SetWide(block, zprm64Exposure, 5);
    ASSERT_ZERR(zerrNone, Zentara_CloseCamera(handle));

    EXPECT_ZERR(zerrNone, Zentara_SendSettingsToCam(other, &block));

    EXPECT_EQ(5u, GetWide(block, zprm64Exposure));
    EXPECT_EQ(5u, reinterpret_cast<ZCamera*>(other)->GetExposure());
}

}  // namespace
}  // namespace ZV::Test
