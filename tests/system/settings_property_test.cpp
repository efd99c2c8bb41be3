#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <memory>

#include "camera/camera.h"
#include "support/flat_camera.h"
#include "support/random_blocks.h"
#include "support/rounds.h"
#include "support/sending_camera.h"
#include "support/settings_words.h"

// What holds for every settings block, tried with many random ones.
namespace ZV::Test {
namespace {

constexpr int Rounds = CountRounds(200);
constexpr std::uint16_t CcdMosaic = 2;

struct PropertyCase {
    const char* name;
    std::string_view scenario;
    bool countsMicroseconds = false;  ///< Its exposure registers do: control registers of 1.x.
};

void PrintTo(const PropertyCase& property, std::ostream* stream) {
    *stream << property.name;
}

constexpr PropertyCase Cases[] = {
    {"Mono", SmallMono},
    {"Colour", SmallColour},
    {"PacketsOfVersion0", R"({"base": "mono", "cameras": [{"streamingVersion": 0}]})"},
    {"FirstGeneration", "old", /*countsMicroseconds=*/true},
    {"Metrona", "metrona"},
    {"Intensified", "intensified"},
    {"Mirrored", "rotated"},
    {"Tweaked", "model:TirelM1"},
    {"RatioBoard", "model:PellanB1"},
    {"Rich", R"({"base": "model:SolvaneG1",
                 "cameras": [{"configuration": {"169": "0x1F5E", "29": 1}}]})"},
    {"Folary", "folary"},
};

class SettingsProperty : public testing::WithParamInterface<PropertyCase>, public OpenedCamera {
  protected:
    SettingsProperty() : OpenedCamera(GetParam().scenario) {}

    Zentara_Settings ReadDefaults() {
        Zentara_Settings block{};
        EXPECT_ZERR(zerrNone, Zentara_ReadDefaultSettings(handle, &block));
        return block;
    }
    /// Keeps a block away from what has tests of its own, further below.
    void AvoidExceptions(Zentara_Settings& block) {
        if (GetCamera().GetStreamingVersion() == 0) AvoidFastDeepFormats(block);
        if (GetParam().countsMicroseconds) AvoidRoundedExposures(block);
        if (GetWord(block, zprmCameraMode) == zmodeRealTimeVideo) AvoidVideosLimits(block);
    }
    bool Send(Zentara_Settings& block) {
        const bool isSent = Zentara_SendSettingsToCam(handle, &block) == zerrNone;
        sent += isSent ? 1 : 0;
        return isSent;
    }
    /// What a camera refuses is a share of the blocks; a test of none would prove nothing.
    void ExpectMostWereSent(int rounds) const { EXPECT_GE(sent, rounds / 4); }

    RandomBlocks blocks;

  private:
    ZCamera& GetCamera() const { return *reinterpret_cast<ZCamera*>(handle); }
    static void AvoidFastDeepFormats(Zentara_Settings& block) {
        constexpr std::uint32_t DeepFormats[] = {1, 3, 5, 7, 10};
        constexpr std::uint32_t PlainSpeeds[] = {0, 1, 2, 3};
        const std::uint32_t format = GetWord(block, zprmImageFormat);
        if (format > 12) SetWord(block, zprmImageFormat, zfmtMono8);
        const bool isDeep = std::ranges::find(DeepFormats, format) != std::end(DeepFormats);
        const bool isPlain = std::ranges::find(PlainSpeeds, GetWord(block, zprmReadoutSpeed)) !=
                             std::end(PlainSpeeds);
        if (isDeep && !isPlain) SetWord(block, zprmReadoutSpeed, zspeed10MHz);
    }
    void AvoidVideosLimits(Zentara_Settings& block) const {
        if (GetCamera().IsRTVModeSupported()) {
            SetWord(block, zprmRoiX, 0);
            SetWord(block, zprmRoiY, 0);
        } else if (GetCamera().GetCCDImageFormat() == CcdMosaic) {
            SetWord(block, zprmCameraMode, zmodeStandard);
        }
    }
    static void AvoidRoundedExposures(Zentara_Settings& block) {
        for (std::uint32_t key = 0; key < 3; ++key) {
            const std::uint64_t exposure = GetWide(block, key) % 4'000'000'000;
            SetWide(block, key, std::max<std::uint64_t>(exposure, 1'000'000));
        }
    }

    int sent = 0;
};

INSTANTIATE_TEST_SUITE_P(Of, SettingsProperty, testing::ValuesIn(Cases),
                         [](const auto& property) { return std::string(property.param.name); });

TEST_P(SettingsProperty, ASecondPreflightChangesNothing) {
    SCOPED_TRACE(blocks.DescribeSeed());
    for (int round = 0; round < Rounds; ++round) {
        Zentara_Settings block = ReadDefaults();
        blocks.Change(block);
        ASSERT_ZERR(zerrNone, Zentara_PreflightSettings(handle, &block));
        Zentara_Settings again = block;

        ASSERT_ZERR(zerrNone, Zentara_PreflightSettings(handle, &again));

        ASSERT_TRUE(AreSameBlocks(block, again)) << "round " << round;
    }
}

TEST_P(SettingsProperty, ABlockThatWasSentAndReadBackFitsTheCamera) {
    SCOPED_TRACE(blocks.DescribeSeed());
    for (int round = 0; round < Rounds; ++round) {
        Zentara_Settings block = ReadDefaults();
        blocks.Change(block);
        AvoidExceptions(block);
        if (!Send(block)) continue;
        const Zentara_Settings read = ReadSettings();
        Zentara_Settings again = read;

        ASSERT_ZERR(zerrNone, Zentara_PreflightSettings(handle, &again));

        ASSERT_TRUE(AreSameBlocks(read, again)) << "round " << round;
    }
    ExpectMostWereSent(Rounds);
}

TEST_P(SettingsProperty, ABlockThatWasSentTwiceComesBackTheSame) {
    SCOPED_TRACE(blocks.DescribeSeed());
    for (int round = 0; round < Rounds / 4; ++round) {
        Zentara_Settings block = ReadDefaults();
        blocks.Change(block);
        AvoidExceptions(block);
        if (!Send(block)) continue;
        Zentara_Settings again = block;

        ASSERT_ZERR(zerrNone, Zentara_SendSettingsToCam(handle, &again));

        ASSERT_TRUE(AreSameBlocks(block, again)) << "round " << round;
    }
    ExpectMostWereSent(Rounds / 4);
}

// ---- Blocks of anything ----

/// A client's block between bytes that nobody may touch.
struct GuardedBlock {
    GuardedBlock() {
        before.fill(0xA5);
        behind.fill(0xA5);
    }
    bool IsGuardIntact() const {
        const auto isUntouched = [](std::uint8_t byte) { return byte == 0xA5; };
        return std::ranges::all_of(before, isUntouched) && std::ranges::all_of(behind, isUntouched);
    }

    std::array<std::uint8_t, 64> before;
    Zentara_Settings block{};
    std::array<std::uint8_t, 64> behind;
};

void AskAll(Zentara_Settings& block, std::uint32_t key) {
    std::uint32_t word = 0;
    std::int32_t signedWord = 0;
    std::uint64_t wide = 0;
    (void)Zentara_GetParam(&block, key, &word);
    (void)Zentara_GetParamMin(&block, key, &word);
    (void)Zentara_GetParamMax(&block, key, &word);
    (void)Zentara_GetParamS32(&block, key, &signedWord);
    (void)Zentara_GetParamS32Min(&block, key, &signedWord);
    (void)Zentara_GetParamS32Max(&block, key, &signedWord);
    (void)Zentara_GetParam64(&block, key, &wide);
    (void)Zentara_GetParam64Min(&block, key, &wide);
    (void)Zentara_GetParam64Max(&block, key, &wide);
    (void)Zentara_IsRangeTable(&block, key);
    (void)Zentara_IsSparseTable(&block, key);
}

void SetAll(Zentara_Settings& block, std::uint32_t key, RandomBlocks& blocks) {
    const std::uint32_t value = blocks.Pick(0xFFFFFFFF);
    (void)Zentara_SetParam(&block, key, value);
    (void)Zentara_SetParamS32(&block, key, static_cast<std::int32_t>(value));
    (void)Zentara_SetParam64(&block, key, std::uint64_t{value} << blocks.Pick(32));
}

TEST_P(SettingsProperty, NoiseWithTheRightMagicNumberIsSentWithoutHarm) {
    SCOPED_TRACE(blocks.DescribeSeed());
    for (int round = 0; round < Rounds; ++round) {
        GuardedBlock client;
        client.block = blocks.MakeNoise(handle);
        const ZentaraHandle owner = GetHandleOf(client.block);

        (void)Zentara_SendSettingsToCam(handle, &client.block);
        (void)Zentara_QueueSettings(handle, &client.block, nullptr, 0, 0, 0);
        (void)Zentara_PreflightSettings(handle, &client.block);

        ASSERT_TRUE(client.IsGuardIntact()) << "round " << round;
        ASSERT_EQ(owner, GetHandleOf(client.block));
    }
    Zentara_Settings block = ReadDefaults();
    EXPECT_ZERR(zerrNone, Zentara_SendSettingsToCam(handle, &block));
}

TEST_P(SettingsProperty, NoiseWithTheRightMagicNumberIsAskedAndChangedWithoutHarm) {
    SCOPED_TRACE(blocks.DescribeSeed());
    for (int round = 0; round < Rounds / 4; ++round) {
        GuardedBlock client;
        client.block = blocks.MakeNoise(handle);
        for (std::uint32_t key = 0; key < 50; ++key) {
            AskAll(client.block, key);
            SetAll(client.block, key, blocks);
        }

        ASSERT_TRUE(client.IsGuardIntact()) << "round " << round;
    }
}

// ---- What a second preflight, or one after a send, does change ----

class SettingsException : public LoadedLibrary {
  protected:
    void Open(std::string_view scenario) {
        changedWorld.reset();
        changedWorld = std::make_unique<SimulationWorld>(scenario);
        ASSERT_FALSE(ListCameras().empty());
        ASSERT_ZERR(zerrNone, Zentara_OpenCamera(0, &handle));
        ASSERT_ZERR(zerrNone, Zentara_ReadDefaultSettings(handle, &block));
    }
    /// Sends the block, reads the camera, and preflights what was read.
    void SendAndReadBack() {
        ASSERT_ZERR(zerrNone, Zentara_SendSettingsToCam(handle, &block));
        ASSERT_ZERR(zerrNone, Zentara_ReadSettingsFromCam(handle, &read));
        mended = read;
        ASSERT_ZERR(zerrNone, Zentara_PreflightSettings(handle, &mended));
    }

    std::unique_ptr<SimulationWorld> changedWorld;
    ZentaraHandle handle = 0;
    Zentara_Settings block{}, read{}, mended{};
};

TEST_F(SettingsException, AnOddMaximumOfAMosaicIsOnlyMadeEvenTheNextTime) {
    Open(R"({"base": "colour", "cameras": [{"sensor": {"width": 65, "height": 49}}]})");

    SendAndReadBack();
    EXPECT_EQ(64u, GetWord(read, zprmRoiWidth));
    SetWord(block, zprmRoiWidth, 66);
    SetWord(block, zprmRoiHeight, 50);
    SendAndReadBack();

    EXPECT_EQ(65u, GetWord(read, zprmRoiWidth));
    EXPECT_EQ(49u, GetWord(read, zprmRoiHeight));
    EXPECT_EQ(64u, GetWord(mended, zprmRoiWidth));
    EXPECT_EQ(48u, GetWord(mended, zprmRoiHeight));
}

// Kept: without the mode its largest region is one pixel, which no mosaic has.
TEST_F(SettingsException, RealTimeVideoThatAMosaicLacksLeavesOnePixelAndTwoTheNextTime) {
    Open(SmallColour);
    SetWord(block, zprmCameraMode, zmodeRealTimeVideo);

    SendAndReadBack();

    EXPECT_EQ(zmodeStandard, GetWord(read, zprmCameraMode));
    EXPECT_EQ(1u, GetWord(read, zprmRoiWidth));
    EXPECT_EQ(2u, GetWord(mended, zprmRoiWidth));
    EXPECT_EQ(2u, GetWord(mended, zprmRoiHeight));
}

constexpr std::string_view MicrosecondControl =
    R"({"base": "mono", "cameras": [{"versions": {"control": "1.2"},
        "configuration": {"39": 10500}}]})";

// Kept: registers in microseconds round down, below a minimum that is told in nanoseconds.
TEST_F(SettingsException, AnExposureThatIsRoundedBelowTheMinimumIsRaisedTheNextTime) {
    Open(MicrosecondControl);
    SetWide(block, zprm64Exposure, 1);

    SendAndReadBack();

    EXPECT_EQ(10'500u, GetWide(block, zprm64Exposure));
    EXPECT_EQ(10'000u, GetWide(read, zprm64Exposure));
    EXPECT_EQ(10'500u, GetWide(mended, zprm64Exposure));
}

// Kept: a filter's exposure is cut to 32 bits of nanoseconds before it is rounded.
TEST_F(SettingsException, AFiltersExposureIsCutTo32BitsInMicroseconds) {
    Open(MicrosecondControl);
    SetWord(block, zprmImageFormat, zfmtRGB24);
    SetWide(block, zprm64ExposureRed, 5'000'000'000);
    SetWide(block, zprm64ExposureBlue, 4'294'967'296 + 5'000);

    SendAndReadBack();

    EXPECT_EQ(705'032'000u, GetWide(read, zprm64ExposureRed));
    EXPECT_EQ(705'032'000u, GetWide(mended, zprm64ExposureRed));
    EXPECT_EQ(5'000u, GetWide(read, zprm64ExposureBlue));
    EXPECT_EQ(10'500u, GetWide(mended, zprm64ExposureBlue));
}

// Kept: the camera lowers such a speed itself, to one that its packets do not carry at 16 bits.
TEST_F(SettingsException, ASpeedThatTheCameraLowersIsLoweredOnceMoreTheNextTime) {
    for (const std::uint32_t speed : {zspeed30MHz, zspeed40MHz}) {
        Open(R"({"base": "model:PellanB1", "cameras": [{"versions": {"control": "2.2"},
                 "streamingVersion": 0}]})");
        SetWord(block, zprmImageFormat, zfmtMono16);
        SetWord(block, zprmReadoutSpeed, speed);

        SendAndReadBack();

        EXPECT_EQ(zspeed20MHz, GetWord(block, zprmReadoutSpeed));
        EXPECT_EQ(zspeed20MHz, GetWord(read, zprmReadoutSpeed));
        EXPECT_EQ(zspeed10MHz, GetWord(mended, zprmReadoutSpeed));
        ASSERT_ZERR(zerrNone, Zentara_CloseCamera(handle));
    }
}

constexpr std::string_view PacketsOfVersion0 =
    R"({"base": "mono", "cameras": [{"streamingVersion": 0}]})";

// Kept: a speed that has no frequency leaves the camera at its former one.
TEST_F(SettingsException, AnUnknownSpeedLeavesSixteenBitsAtTwentyMegahertzUntilTheNextTime) {
    Open(PacketsOfVersion0);
    SetWord(block, zprmImageFormat, zfmtMono16);
    SetWord(block, zprmReadoutSpeed, 99);

    SendAndReadBack();

    EXPECT_EQ(zspeed20MHz, GetWord(read, zprmReadoutSpeed));
    EXPECT_EQ(zspeed10MHz, GetWord(mended, zprmReadoutSpeed));
}

// Kept: a format beyond the table keeps the depth, and the speed is not held back for it.
TEST_F(SettingsException, AnUnknownFormatLetsSixteenBitsRunAtTwentyMegahertzUntilTheNextTime) {
    Open(PacketsOfVersion0);
    SetWord(block, zprmImageFormat, zfmtMono16);
    ASSERT_ZERR(zerrNone, Zentara_SendSettingsToCam(handle, &block));
    SetWord(block, zprmImageFormat, 13);
    SetWord(block, zprmReadoutSpeed, zspeed20MHz);

    SendAndReadBack();

    EXPECT_EQ(zfmtMono16, GetWord(read, zprmImageFormat));
    EXPECT_EQ(zspeed20MHz, GetWord(read, zprmReadoutSpeed));
    EXPECT_EQ(zspeed10MHz, GetWord(mended, zprmReadoutSpeed));
}

// Kept: on the way into the mode only the size is replaced; the edge meets its limit later.
TEST_F(SettingsException, AnEdgeThatCameAlongIntoRealTimeVideoCutsTheRegionTheNextTime) {
    Open("folary");
    SetWord(block, zprmCameraMode, 1);
    SetWord(block, zprmRoiX, 100);

    SendAndReadBack();

    EXPECT_EQ(100u, GetWord(read, zprmRoiX));
    EXPECT_EQ(640u, GetWord(read, zprmRoiWidth));
    EXPECT_EQ(540u, GetWord(mended, zprmRoiWidth));
}

}  // namespace
}  // namespace ZV::Test
