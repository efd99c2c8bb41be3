#include "tools/setting_names.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <set>

#include "zentara/zentara.h"

namespace ZentaraProgram {
namespace {

using testing::ElementsAre;
using testing::IsEmpty;

TEST(SettingNames, ANameIsTheKeyWithoutItsPrefixInSmallWords) {
    EXPECT_EQ("roi-width", MakeName("zprmRoiWidth"));
    EXPECT_EQ("roi-x", MakeName("zprmRoiX"));
    EXPECT_EQ("em-gain", MakeName("zprmEMGain"));
    EXPECT_EQ("v-clock-period", MakeName("zprmVClockPeriod"));
    EXPECT_EQ("ccd-clearing-mode", MakeName("zprmCCDClearingMode"));
    EXPECT_EQ("regulated-cooling-temp", MakeName("zprmS32RegulatedCoolingTemp"));
    EXPECT_EQ("exposure-red", MakeName("zprm64ExposureRed"));
    EXPECT_EQ("normalized-gain-db", MakeName("zprmS32NormalizedGaindB"));
    EXPECT_EQ("norm-it-gain-sig-figs", MakeName("zinfNormITGainSigFigs"));
    EXPECT_EQ("norm-gain-db-res", MakeName("zinfNormGaindBRes"));
}

TEST(SettingNames, EveryKeyOfTheThreeFamiliesHasANameOfItsOwn) {
    std::set<std::string> names;
    for (const Setting& setting : GetSettings()) names.insert(Simplify(setting.name));

    EXPECT_EQ(47U + 3 + 4, GetSettings().size());
    EXPECT_EQ(GetSettings().size(), names.size());
}

TEST(SettingNames, EverySettingIsFoundByItsNameAndByItsKey) {
    for (const Setting& setting : GetSettings()) {
        EXPECT_EQ(&setting, FindSetting(setting.name)) << setting.name;
        EXPECT_EQ(&setting, FindSetting(setting.parameter->name)) << setting.name;
        EXPECT_EQ(&setting, &GetSetting(setting.parameter->family, setting.parameter->key));
    }
}

TEST(SettingNames, WhereKeysSayTheSameThePlainNameIsTheOneThatIsSent) {
    const auto isNamed = [](const char* name, ParameterFamily family, std::uint32_t key) {
        return FindSetting(name) == &GetSetting(family, key);
    };

    EXPECT_TRUE(isNamed("exposure", ParameterFamily::Wide, zprm64Exposure));
    EXPECT_TRUE(isNamed("exposure-red", ParameterFamily::Wide, zprm64ExposureRed));
    EXPECT_TRUE(isNamed("intensifier-gain", ParameterFamily::Wide, zprm64NormIntensGain));
    EXPECT_TRUE(isNamed("gain-db", ParameterFamily::Signed, zprmS32NormalizedGaindB));
    EXPECT_TRUE(isNamed("offset", ParameterFamily::Signed, zprmS32AbsoluteOffset));
    EXPECT_TRUE(isNamed("cooling", ParameterFamily::Signed, zprmS32RegulatedCoolingTemp));
    EXPECT_TRUE(isNamed("exposure-us", ParameterFamily::Word, zprmExposure));
    EXPECT_TRUE(isNamed("offset-units", ParameterFamily::Word, zprmOffset));
}

TEST(SettingNames, CaseAndDashesDoNotCount) {
    EXPECT_EQ(FindSetting("roi-width"), FindSetting("ROI_Width"));
    EXPECT_EQ(FindSetting("roi-width"), FindSetting("roiwidth"));
    EXPECT_EQ(FindSetting("do-post-processing"), FindSetting("post-processing"));
    EXPECT_EQ(nullptr, FindSetting("roi"));
    EXPECT_EQ(nullptr, FindSetting(""));
}

TEST(SettingNames, OfKeysThatSayTheSameAFileHoldsTheOneThatIsSent) {
    EXPECT_TRUE(FindSetting("exposure")->isStored);
    EXPECT_TRUE(FindSetting("gain-db")->isStored);
    EXPECT_FALSE(FindSetting("exposure-us")->isStored);
    EXPECT_FALSE(FindSetting("gain")->isStored);
    EXPECT_FALSE(FindSetting("normalized-gain")->isStored);
    EXPECT_FALSE(FindSetting("register-tweak")->isStored);
}

TEST(SettingNames, NamesThatAreNearComeInTheOrderOfTheirDistance) {
    const std::vector<std::string> known{"roi-width", "roi-height", "exposure", "exposure-red"};

    EXPECT_THAT(FindNearest("exposre", known), ElementsAre("exposure"));
    EXPECT_THAT(FindNearest("xeposure", known), ElementsAre("exposure"));
    EXPECT_THAT(FindNearest("width", known), ElementsAre("roi-width"));
    EXPECT_THAT(FindNearest("exposurered", known), ElementsAre("exposure-red", "exposure"));
    EXPECT_THAT(FindNearest("banana", known), IsEmpty());
}

TEST(SettingNames, AnUnknownNameIsAnsweredWithTheNearest) {
    EXPECT_EQ("unknown setting 'exposre'; did you mean exposure?",
              DescribeUnknownSetting("exposre"));
    EXPECT_EQ("unknown setting 'quark'", DescribeUnknownSetting("quark"));
}

}  // namespace
}  // namespace ZentaraProgram
