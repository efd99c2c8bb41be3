#include <gtest/gtest.h>

#include "system/settings_sender.h"

// The word of a block that adjusts an analogue register.
namespace ZV::Test {
namespace {

constexpr std::string_view SmallTweaked =
    R"({"base": "model:TirelM1", "cameras": [{"sensor": {"width": 64, "height": 48}}]})";

class TweakedSettingsSend : public SettingsSend {
  protected:
    TweakedSettingsSend() : SettingsSend(SmallTweaked) {}
};

TEST_F(TweakedSettingsSend, EachSelectorWritesItsRegisterAndOnlyTheFirstTakesThousandths) {
    Zentara_Settings block = ReadDefaults();
    ASSERT_ZERR(zerrNone, Send(block));
    for (std::uint32_t selector = 1; selector <= 8; ++selector) {
        const std::uint32_t quadlet = 33 + selector;
        const std::uint32_t value = 20 + selector;
        SetWord(block, zprmRegisterTweak, selector << 28 | 0x0ABC0000 | value);

        ASSERT_ZERR(zerrNone, Send(block));

        EXPECT_EQ(1u, CountWrites(Control(quadlet))) << selector;
        EXPECT_EQ(selector == 1 ? value * 1000 : value, Peek(quadlet)) << selector;
        EXPECT_FALSE(WasCommitted()) << "the word is not compared";
    }
}

TEST_F(TweakedSettingsSend, OtherSelectorsDoNothing) {
    Zentara_Settings block = ReadDefaults();
    ASSERT_ZERR(zerrNone, Send(block));
    ASSERT_ZERR(zerrNone, Send(block));
    const std::size_t writes = GetWrites().size();
    for (const std::uint32_t selector : {0u, 9u, 10u, 15u}) {
        SetWord(block, zprmRegisterTweak, selector << 28 | 5);

        ASSERT_ZERR(zerrNone, Send(block));

        EXPECT_EQ(writes, GetWrites().size()) << selector;
    }
}

TEST_F(TweakedSettingsSend, AThousandfoldIsCutToSixteenBits) {
    Zentara_Settings block = ReadDefaults();
    SetWord(block, zprmRegisterTweak, 0x1000FFFF);

    ASSERT_ZERR(zerrNone, Send(block));

    EXPECT_EQ(65535u * 1000 & 0xFFFF, Peek(34));
}

TEST_F(TweakedSettingsSend, ARefusedTweakIsIgnored) {
    Zentara_Settings block = ReadDefaults();
    SetWord(block, zprmRegisterTweak, 0x30000001);
    ASSERT_TRUE(RefuseWrites(Control(36)));

    EXPECT_ZERR(zerrNone, Send(block));

    EXPECT_TRUE(WasCommitted());
}

// The tweak alone is no change; the configuration is read again by the commit that comes later.
TEST_F(TweakedSettingsSend, ANewMiscCtrlReadsTheConfigurationAgainWithTheNextCommit) {
    Zentara_Settings block = ReadDefaults();
    ASSERT_ZERR(zerrNone, Send(block));
    SetWord(block, zprmRegisterTweak, 0x80000003);
    const auto countReads = [&] {
        const std::vector<TraceRecord> requests = world.ReadRequests();
        return std::ranges::count(requests, "FW_IOCTL_ASYNC_READ", &TraceRecord::name);
    };
    const auto before = countReads();

    ASSERT_ZERR(zerrNone, Send(block));
    EXPECT_EQ(before, countReads());

    SetWord(block, zprmTriggerType, 1);
    SetWord(block, zprmRegisterTweak, 0);
    ASSERT_ZERR(zerrNone, Send(block));
    EXPECT_LT(before, countReads());
}

TEST_F(SettingsSend, ACameraWithoutTheRegistersIsNotTweaked) {
    Zentara_Settings block = ReadDefaults();
    ASSERT_ZERR(zerrNone, Send(block));
    SetWord(block, zprmRegisterTweak, 0x20000001);

    EXPECT_ZERR(zerrNone, Send(block));

    EXPECT_TRUE(GetWrites().empty());
}

class SensorOfTwoSizes : public SettingsSend {
  protected:
    // The default of the register, 4, gives the smaller size.
    SensorOfTwoSizes()
        : SettingsSend(
              R"({"base": "model:TirelM1", "cameras": [{"sensor": {"width": 64, "height": 48},
              "alternate": {"controlQuadlet": 41, "value": 4,
                            "configuration": {"4": "0x00200018", "5": "0x0010000C"}}}]})") {}
};

TEST_F(SensorOfTwoSizes, TheRegionBecomesTheNewSensorWithTheCommitAndComesBackInTheBlock) {
    Zentara_Settings block = ReadDefaults();
    EXPECT_EQ(32u, GetWord(block, zprmRoiWidth));
    SetWord(block, zprmRegisterTweak, 0x80000005);

    ASSERT_ZERR(zerrNone, Send(block));

    EXPECT_EQ(64u, GetWord(block, zprmRoiWidth));
    EXPECT_EQ(48u, GetWord(block, zprmRoiHeight));
    EXPECT_EQ(64u << 16 | 48u, Peek(3));
}

}  // namespace
}  // namespace ZV::Test
