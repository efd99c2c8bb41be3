#include <gtest/gtest.h>

#include <string>

#include "system/settings_sender.h"

// A camera that refuses one write of a send: what stands, what does not come, what is remembered.
namespace ZV::Test {
namespace {

constexpr std::string_view SmallIntensified =
    R"({"base": "intensified", "cameras": [{"sensor": {"width": 64, "height": 48}}]})";

struct RefusedWrite {
    const char* name;
    std::string_view scenario;
    std::uint32_t quadlet;
    void (*change)(Zentara_Settings& block);
    bool isChecked;
};

void PrintTo(const RefusedWrite& refused, std::ostream* stream) {
    *stream << refused.name;
}

template <std::uint32_t Key, std::uint32_t Value>
void ChangeWordTo(Zentara_Settings& block) {
    SetWord(block, Key, Value);
}

template <std::uint32_t Key, std::int32_t Value>
void ChangeSignedTo(Zentara_Settings& block) {
    SetSigned(block, Key, Value);
}

template <std::uint32_t Key, std::uint64_t Value>
void ChangeWideTo(Zentara_Settings& block) {
    SetWide(block, Key, Value);
}

constexpr std::string_view SmallMetrona =
    R"({"base": "metrona", "cameras": [{"sensor": {"width": 64, "height": 48}}]})";
constexpr std::string_view SmallFolary =
    R"({"base": "folary", "cameras": [{"sensor": {"width": 64, "height": 48},
        "configuration": {"5": "0x00200018"}}]})";

class RefusedSettingsWrite : public testing::WithParamInterface<RefusedWrite>, public SettingsSend {
  protected:
    RefusedSettingsWrite() : SettingsSend(GetParam().scenario) {}

    bool IsTaken() { return CountWrites(Control(GetParam().quadlet)) != 0; }
};

TEST_P(RefusedSettingsWrite, EndsTheSendOrIsIgnoredAsItsRowSays) {
    Zentara_Settings former = ReadDefaults();
    ASSERT_ZERR(zerrNone, Send(former));
    Zentara_Settings block = former;
    SetWord(block, zprmReserved17, 1);  // a change that writes nothing
    GetParam().change(block);
    ASSERT_TRUE(RefuseWrites(Control(GetParam().quadlet)));

    EXPECT_ZERR(GetParam().isChecked ? zerrDriverFault : zerrNone, Send(block));

    EXPECT_TRUE(IsTaken());
    EXPECT_NE(GetParam().isChecked, WasCommitted());
    if (!GetParam().isChecked) return;
    EXPECT_EQ(Control(GetParam().quadlet), GetWrites().back().address) << "nothing comes after";
    // The former block still counts as the last one sent, and the lock is free.
    ASSERT_ZERR(zerrNone, Send(former));
    EXPECT_FALSE(WasCommitted());
}

INSTANTIATE_TEST_SUITE_P(
    Of, RefusedSettingsWrite,
    testing::Values(
        RefusedWrite{"Depth", SmallMono, 1, ChangeWordTo<zprmImageFormat, 3>, false},
        RefusedWrite{"RealTimeVideo", SmallFolary, 2, ChangeWordTo<zprmCameraMode, 1>, false},
        RefusedWrite{"StartColour", SmallMono, 12, ChangeWordTo<zprmColorWheel, 1>, false},
        RefusedWrite{"Wheel", SmallMono, 12, ChangeWordTo<zprmImageFormat, 6>, false},
        RefusedWrite{"VerticalBinning", SmallMetrona, 2, ChangeWordTo<zprmVerticalBinning, 2>,
                     true},
        RefusedWrite{"HorizontalBinning", SmallMetrona, 2, ChangeWordTo<zprmHorizontalBinning, 2>,
                     true},
        RefusedWrite{"RegionX", SmallMono, 4, ChangeWordTo<zprmRoiX, 2>, true},
        RefusedWrite{"RegionY", SmallMono, 4, ChangeWordTo<zprmRoiY, 2>, true},
        RefusedWrite{"RegionWidth", SmallMono, 3, ChangeWordTo<zprmRoiWidth, 20>, true},
        RefusedWrite{"RegionHeight", SmallMono, 3, ChangeWordTo<zprmRoiHeight, 20>, true},
        RefusedWrite{"ReadoutSpeed", SmallMono, 1, ChangeWordTo<zprmReadoutSpeed, 2>, true},
        RefusedWrite{"Trigger", SmallMono, 11, ChangeWordTo<zprmTriggerType, 1>, true},
        RefusedWrite{"Cooler", SmallMono, 14, ChangeWordTo<zprmCoolerActive, 0>, true},
        RefusedWrite{"DoubleShot", SmallRich, 13, ChangeWordTo<zprmDoubleShot, 1>, true},
        RefusedWrite{"ShutterDelay", SmallMetrona, 15, ChangeWordTo<zprmMetronaShutterDelay, 60>,
                     true},
        RefusedWrite{"Gain", SmallMono, 5, ChangeSignedTo<zprmS32NormalizedGaindB, 3000000>, true},
        RefusedWrite{"IntensifierGain", SmallIntensified, 18,
                     ChangeWideTo<zprm64NormIntensGain, 100000000>, true},
        RefusedWrite{"Offset", SmallMono, 5, ChangeSignedTo<zprmS32AbsoluteOffset, 5>, true},
        RefusedWrite{"Exposure", SmallMono, 6, ChangeWideTo<zprm64Exposure, 5000000000>, true},
        RefusedWrite{"ExposureLow", SmallMono, 15, ChangeWideTo<zprm64Exposure, 50000000>, true},
        RefusedWrite{"RedExposure", SmallMono, 7, ChangeWideTo<zprm64Exposure, 5000000000>, true},
        RefusedWrite{"BlueExposure", SmallMono, 8, ChangeWideTo<zprm64Exposure, 5000000000>, true},
        RefusedWrite{"SyncB", SmallMono, 11, ChangeWordTo<zprmSyncb, 0>, true},
        RefusedWrite{"Fan", SmallMono, 22, ChangeWordTo<zprmFan, 1>, true},
        RefusedWrite{"Blackout", SmallRich, 21, ChangeWordTo<zprmBlackoutMode, 1>, true},
        RefusedWrite{"HighSensitivity", SmallRich, 21, ChangeWordTo<zprmHighSensitivityMode, 1>,
                     true},
        RefusedWrite{"CoolingTarget", SmallRich, 14,
                     ChangeSignedTo<zprmS32RegulatedCoolingTemp, -5>, true},
        RefusedWrite{"CloseDelay", SmallRich, 25, ChangeWordTo<zprmCloseDelay, 5>, true},
        RefusedWrite{"EMGain", SmallRich, 24, ChangeWordTo<zprmEMGain, 5>, true},
        RefusedWrite{"Dither", SmallRich, 30, ChangeWordTo<zprmDither, 1>, true},
        RefusedWrite{"VClockPeriod", SmallRich, 31, ChangeWordTo<zprmVClockPeriod, 5000>, true}),
    [](const auto& refused) { return std::string(refused.param.name); });

class SettingsRefusal : public SettingsSend {};

TEST_F(SettingsRefusal, ARefusedBinningFitsTheRegionAllTheSameAndEndsTheSend) {
    Zentara_Settings block = ReadDefaults();
    ASSERT_ZERR(zerrNone, Send(block));
    SetWord(block, zprmBinning, 2);
    SetWord(block, zprmTriggerType, 1);
    ASSERT_TRUE(RefuseWrites(Control(2)));

    EXPECT_ZERR(zerrDriverFault, Send(block));

    EXPECT_EQ(32u << 16 | 24u, Peek(3));
    EXPECT_FALSE(WasCommitted());
    EXPECT_EQ(0u, CountWrites(Control(11)));
}

TEST_F(SettingsRefusal, AFailingTriggerLeavesTheRegionApplied) {
    Zentara_Settings block = ReadDefaults();
    ASSERT_ZERR(zerrNone, Send(block));
    SetWord(block, zprmRoiX, 8);
    SetWord(block, zprmTriggerType, 1);
    SetWide(block, zprm64Exposure, 20'000'000);
    ASSERT_TRUE(RefuseWrites(Control(11)));

    EXPECT_ZERR(zerrDriverFault, Send(block));

    EXPECT_EQ(8u << 16, Peek(4));
    EXPECT_EQ(8u, GetCamera().GetROIX());
    EXPECT_EQ(16'384'000u, GetCamera().GetExposure()) << "not reached";
}

class RichSettingsRefusal : public SettingsSend {
  protected:
    RichSettingsRefusal() : SettingsSend(SmallRich) {}
};

// Kept: the second write of this register in a send, which switches high gain off whatever is sent.
TEST_F(RichSettingsRefusal, ARefusalOfHighGainEndsTheSendBehindDither) {
    Zentara_Settings block = ReadDefaults();
    ASSERT_ZERR(zerrNone, Send(block));
    SetWord(block, zprmHighGainMode, 1);
    ASSERT_TRUE(
        world.AddFault(R"({"kind": "failRequest", "code": "FW_IOCTL_ASYNC_WRITE", "address": )" +
                       std::to_string(Control(30)) + R"(, "request": 2})"));

    EXPECT_ZERR(zerrDriverFault, Send(block));

    EXPECT_EQ(2u, CountWrites(Control(30)));
    EXPECT_EQ(0u, CountWrites(Control(31)));
}

}  // namespace
}  // namespace ZV::Test
