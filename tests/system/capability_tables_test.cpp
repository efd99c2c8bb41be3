#include <gtest/gtest.h>

#include <algorithm>
#include <set>
#include <string>
#include <vector>

#include "camera/camera.h"
#include "support/flat_camera.h"
#include "support/parameter_worlds.h"
#include "support/settings_words.h"

namespace ZV::Test {
namespace {

using List = std::vector<std::uint32_t>;
using Keys = std::set<std::uint32_t>;

constexpr std::uint32_t Untouched = 0xDDDDDDDD;

/// Keys of the whole family that answer yes.
template <typename Question>
Keys CollectKeys(std::uint32_t end, Question question) {
    Keys keys;
    for (std::uint32_t key = 0; key < end; ++key) {
        const ZentaraResult result = question(key);
        EXPECT_TRUE(result == zerrNone || result == zerrNotSupported) << key << ": " << result;
        if (result == zerrNone) keys.insert(key);
    }
    return keys;
}

class CapabilityTables : public OpenedCamera {
  protected:
    explicit CapabilityTables(std::string_view scenario = SmallMono) : OpenedCamera(scenario) {}

    void SetUp() override {
        OpenedCamera::SetUp();
        block = ReadSettings();
    }

    List GetList(std::uint32_t key, std::int32_t room = 100) {
        const Zentara_Settings before = block;
        List entries(static_cast<std::size_t>(room) + 1, Untouched);
        std::int32_t size = room;
        EXPECT_ZERR(zerrNone, Zentara_GetParamSparseTable(&block, key, entries.data(), &size))
            << "key " << key;
        EXPECT_TRUE(AreSameBytes(before, block)) << "key " << key;
        EXPECT_LE(size, room) << "key " << key;
        const auto end = entries.begin() + std::clamp(size, 0, room);
        EXPECT_TRUE(std::all_of(end, entries.end(), [](auto entry) { return entry == Untouched; }))
            << "key " << key;
        return {entries.begin(), end};
    }

    void ExpectNoList(std::uint32_t key) {
        std::uint32_t entry = Untouched;
        std::int32_t size = 1;
        EXPECT_ZERR(zerrNotSupported, Zentara_GetParamSparseTable(&block, key, &entry, &size))
            << "key " << key;
        EXPECT_EQ(1, size) << "key " << key;
        EXPECT_EQ(Untouched, entry) << "key " << key;
    }

    Keys CollectSupported() {
        return CollectKeys(
            60, [&](std::uint32_t key) { return Zentara_IsParamSupported(handle, key); });
    }
    Keys CollectRanges() {
        return CollectKeys(60,
                           [&](std::uint32_t key) { return Zentara_IsRangeTable(&block, key); });
    }
    Keys CollectLists() {
        return CollectKeys(60,
                           [&](std::uint32_t key) { return Zentara_IsSparseTable(&block, key); });
    }

    Zentara_Settings block{};
};

const Keys AlwaysSupported{0, 1, 2, 6, 7, 12, 13, 14, 15, 16, 25, 27, 28, 29, 30, 31, 32};

Keys Join(const Keys& left, const Keys& right) {
    Keys joined = left;
    joined.insert(right.begin(), right.end());
    return joined;
}

class RichCapabilities : public CapabilityTables {
  protected:
    RichCapabilities() : CapabilityTables(RichMono) {}
};

TEST_F(RichCapabilities, ACameraWithEveryFeatureHasAllKeysButThoseOfOtherModelsAndTheUnused) {
    EXPECT_EQ(Join(AlwaysSupported,
                   {3, 8, 9, 10, 11, 19, 20, 22, 23, 26, 33, 34, 35, 37, 39, 42, 43, 44, 45, 46}),
              CollectSupported());
    for (const std::uint32_t key : {0u, 1u, 2u}) {
        EXPECT_ZERR(zerrNone, Zentara_IsParamS32Supported(handle, key)) << key;
    }
    for (const std::uint32_t key : {0u, 1u, 2u, 3u}) {
        EXPECT_ZERR(zerrNone, Zentara_IsParam64Supported(handle, key)) << key;
    }
}

TEST_F(RichCapabilities, RangesAreThoseOfTheTable) {
    EXPECT_EQ(
        (Keys{0, 1, 6, 8, 9, 13, 14, 15, 16, 19, 20, 22, 23, 25, 26, 31, 33, 34, 35, 37, 39, 44}),
        CollectRanges());
    for (const std::uint32_t key : {0u, 1u, 2u, 3u, 4u}) {
        EXPECT_ZERR(key < 3 ? zerrNone : zerrNotSupported, Zentara_IsRangeTableS32(&block, key));
        EXPECT_ZERR(key < 4 ? zerrNone : zerrNotSupported, Zentara_IsRangeTable64(&block, key));
    }
}

TEST_F(RichCapabilities, ListsAreThoseOfTheTable) {
    EXPECT_EQ((Keys{3, 6, 7, 8, 9, 12, 20, 31, 32, 33, 34, 35, 42, 43}), CollectLists());
}

TEST_F(RichCapabilities, EveryListHasItsEntriesInItsOrder) {
    EXPECT_EQ((List{1, 2, 4, 8}), GetList(zprmBinning));
    EXPECT_EQ((List{0, 1, 2, 3}), GetList(zprmReadoutSpeed));
    EXPECT_EQ((List{0, 1, 2, 3, 4, 5}), GetList(zprmTriggerType));
    EXPECT_EQ((List{0, 1, 3}), GetList(zprmColorWheel));
    EXPECT_EQ((List{0, 1}), GetList(zprmCoolerActive));
    EXPECT_EQ((List{0, 1, 2, 3, 6, 7, 8, 9, 10, 11, 12}), GetList(zprmImageFormat));
    EXPECT_EQ((List{0, 1}), GetList(zprmSyncb));
    EXPECT_EQ((List{1, 2, 3, 4}), GetList(zprmPostProcessBayerAlgorithm));
    EXPECT_EQ((List{0, 1, 2, 3, 6, 7, 8, 9, 10, 11, 12}), GetList(zprmPostProcessImageFormat));
    EXPECT_EQ((List{1, 2, 3, 4}), GetList(zprmFan));
    EXPECT_EQ((List{0, 1}), GetList(zprmBlackoutMode));
    EXPECT_EQ((List{0, 1}), GetList(zprmHighSensitivityMode));
    EXPECT_EQ((List{0, 1}), GetList(zprmDither));
    EXPECT_EQ((List{0, 1}), GetList(zprmHighGainMode));
}

TEST_F(RichCapabilities, KeysWithoutAListAreRefused) {
    for (std::uint32_t key = 0; key < 60; ++key) {
        if (!CollectLists().contains(key)) ExpectNoList(key);
    }
    for (const std::uint32_t key : {0x7FFFFFFFu, 0x80000000u, 0xFFFFFFFFu}) ExpectNoList(key);
}

TEST_F(RichCapabilities, TheFamiliesOfSignedAndWideKeysHaveNoLists) {
    for (const std::uint32_t key : {0u, 1u, 2u, 3u, 4u, 0xFFFFFFFFu}) {
        std::int32_t signedEntry = -1;
        std::uint64_t wideEntry = 1;
        std::int32_t size = 5;
        EXPECT_ZERR(zerrNotSupported, Zentara_IsSparseTableS32(&block, key));
        EXPECT_ZERR(zerrNotSupported, Zentara_IsSparseTable64(&block, key));
        EXPECT_ZERR(zerrNotSupported,
                    Zentara_GetParamSparseTableS32(&block, key, &signedEntry, &size));
        EXPECT_EQ(0, size);
        size = 5;
        EXPECT_ZERR(zerrNotSupported,
                    Zentara_GetParamSparseTable64(&block, key, &wideEntry, &size));
        EXPECT_EQ(0, size);
        EXPECT_EQ(-1, signedEntry);
        EXPECT_EQ(1u, wideEntry);
    }
}

TEST_F(RichCapabilities, AListIsCutToItsRoomWithoutAnError) {
    EXPECT_EQ((List{0, 1}), GetList(zprmImageFormat, 2));
    EXPECT_EQ((List{0, 1}), GetList(zprmTriggerType, 2));
    EXPECT_EQ((List{0}), GetList(zprmImageFormat, 1));
    EXPECT_EQ(11u, GetList(zprmImageFormat, 11).size());
    EXPECT_EQ(11u, GetList(zprmImageFormat, 12).size());
}

TEST_F(RichCapabilities, NoRoomIsSuccessBeforeTheKeyIsLookedAt) {
    for (const std::uint32_t key : {12u, 0u, 18u, 47u, 0xFFFFFFFFu}) {
        std::uint32_t entry = Untouched;
        std::int32_t size = 0;
        EXPECT_ZERR(zerrNone, Zentara_GetParamSparseTable(&block, key, &entry, &size)) << key;
        EXPECT_EQ(0, size);
        EXPECT_EQ(Untouched, entry);
    }
}

TEST_F(RichCapabilities, ANegativeRoomIsRefusedAndLeftAsItWas) {
    for (const std::int32_t room : {-1, INT32_MIN}) {
        std::uint32_t entry = Untouched;
        std::int32_t size = room;
        EXPECT_ZERR(zerrNotSupported, Zentara_GetParamSparseTable(&block, 12, &entry, &size));
        EXPECT_EQ(room, size);
        EXPECT_EQ(Untouched, entry);
    }
}

TEST_F(RichCapabilities, ARoomOfTheGreatestNumberIsNotTouchedBeyondTheList) {
    List entries(20, Untouched);
    std::int32_t size = INT32_MAX;

    ASSERT_ZERR(zerrNone, Zentara_GetParamSparseTable(&block, 7, entries.data(), &size));

    EXPECT_EQ(6, size);
    EXPECT_EQ(Untouched, entries[6]);
}

TEST_F(RichCapabilities, AskingGoesNotOverTheBus) {
    const std::size_t before = world.ReadRequests().size();

    CollectSupported();
    CollectRanges();
    for (const std::uint32_t key : CollectLists()) GetList(key);

    EXPECT_EQ(before, world.ReadRequests().size());
}

class BareCapabilities : public CapabilityTables {
  protected:
    BareCapabilities()
        : CapabilityTables(R"({"base": "model:DorixR1", "cameras": [{
              "versions": {"configuration": "1.1"},
              "sensor": {"width": 64, "height": 48, "maxBitDepth": 8},
              "configuration": {"10": 0, "15": 1}}]})") {}
};

TEST_F(BareCapabilities, ACameraWithoutAnyFeatureHasBinningAndSyncBBesideWhatAllHave) {
    EXPECT_EQ(Join(AlwaysSupported, {3, 20}), CollectSupported());
    EXPECT_ZERR(zerrNotSupported, Zentara_IsParamS32Supported(handle, 2));
    for (const std::uint32_t key : {1u, 2u, 3u}) {
        EXPECT_ZERR(zerrNotSupported, Zentara_IsParam64Supported(handle, key)) << key;
    }
}

TEST_F(BareCapabilities, WhatIsNotSupportedHasNeitherRangeNorList) {
    EXPECT_EQ((Keys{0, 1, 6, 13, 14, 15, 16, 20, 25, 31}), CollectRanges());
    EXPECT_EQ((Keys{3, 6, 7, 12, 20, 31, 32}), CollectLists());
    EXPECT_ZERR(zerrNotSupported, Zentara_IsRangeTableS32(&block, 2));
    EXPECT_ZERR(zerrNotSupported, Zentara_IsRangeTable64(&block, 1));
}

TEST_F(BareCapabilities, AnEightBitBayerCameraListsNoDeepFormatButTheDeepMosaic) {
    // Kept: 5 without regard to the depth.
    EXPECT_EQ((List{0, 2, 4, 5}), GetList(zprmImageFormat));
    EXPECT_EQ((List{0, 2, 4, 8, 9, 11, 12}), GetList(zprmPostProcessImageFormat));
}

TEST_F(BareCapabilities, ARoomOfTwoForAListOfSevenGivesTwo) {
    ASSERT_EQ(7u, GetList(zprmPostProcessImageFormat).size());

    EXPECT_EQ((List{0, 2}), GetList(zprmPostProcessImageFormat, 2));
}

TEST_F(BareCapabilities, AListOfTheWheelIsRefusedWithoutAWheel) {
    ExpectNoList(zprmColorWheel);
}

TEST_F(CapabilityTables, FormatsHaveAListAndRegionsHaveNone) {
    EXPECT_ZERR(zerrNone, Zentara_IsSparseTable(&block, 12));
    EXPECT_ZERR(zerrNotSupported, Zentara_IsSparseTable(&block, 13));
}

TEST_F(CapabilityTables, AKeyWithoutUseIsNotSupportedWhileOpenAndABadHandleWhenClosed) {
    for (const std::uint32_t key : {17u, 18u, 38u, 40u, 41u}) {
        EXPECT_ZERR(zerrNotSupported, Zentara_IsParamSupported(handle, key)) << key;
    }
    ASSERT_ZERR(zerrNone, Zentara_CloseCamera(handle));

    EXPECT_ZERR(zerrBadHandle, Zentara_IsParamSupported(handle, 18));
}

TEST_F(CapabilityTables, TheReadoutPortIsSupportedByNoCamera) {
    EXPECT_ZERR(zerrNotSupported, Zentara_IsParamSupported(handle, zprmReadoutPort));
    ExpectNoList(zprmReadoutPort);
}

// Kept: "not open" is no 1, so the table alone decides.
TEST_F(CapabilityTables, ABlockOfAClosedCameraIsAnsweredFromTheTable) {
    ASSERT_ZERR(zerrNone, Zentara_CloseCamera(handle));

    EXPECT_EQ((Keys{0,  1,  6,  8,  9,  13, 14, 15, 16, 19, 20, 21,
                    22, 23, 25, 26, 31, 33, 34, 35, 37, 39, 44}),
              CollectRanges());
    EXPECT_EQ((Keys{3, 4, 5, 6, 7, 8, 9, 12, 20, 24, 31, 32, 33, 34, 35, 36, 42, 43}),
              CollectLists());
    EXPECT_ZERR(zerrNone, Zentara_IsRangeTableS32(&block, 2));
    EXPECT_ZERR(zerrNone, Zentara_IsRangeTable64(&block, 3));
    EXPECT_ZERR(zerrNotSupported, Zentara_IsRangeTableS32(&block, 3));
}

TEST_F(CapabilityTables, ABlockOfNoCameraIsAnsweredFromTheTableToo) {
    SetHandleOf(block, 0);

    EXPECT_ZERR(zerrNone, Zentara_IsRangeTable(&block, zprmIntensifierGain));
    EXPECT_ZERR(zerrNone, Zentara_IsSparseTable(&block, zprmReadoutPort));
}

struct FormatCase {
    const char* name;
    const char* camera;  ///< Of the scenario.
    List image, postProcess;
};

void PrintTo(const FormatCase& formats, std::ostream* stream) {
    *stream << formats.name;
}

class FormatLists : public CapabilityTables, public testing::WithParamInterface<FormatCase> {
  protected:
    FormatLists() : CapabilityTables(MakeScenario()) {}

  private:
    static const std::string& MakeScenario() {
        static std::string scenario;
        scenario = std::string(R"({"cameras": [)") + GetParam().camera + "]}";
        return scenario;
    }
};

TEST_P(FormatLists, GoByColourWheelAndDepth) {
    EXPECT_EQ(GetParam().image, GetList(zprmImageFormat));
    EXPECT_EQ(GetParam().postProcess, GetList(zprmPostProcessImageFormat));
}

TEST_P(FormatLists, TheLimitsOfTheImageFormatAreZeroAndTheLastOfItsList) {
    std::uint32_t least = Untouched;
    std::uint32_t greatest = Untouched;
    EXPECT_ZERR(zerrNone, Zentara_GetParamMin(&block, zprmImageFormat, &least));
    EXPECT_ZERR(zerrNone, Zentara_GetParamMax(&block, zprmImageFormat, &greatest));
    EXPECT_EQ(0u, least);
    EXPECT_EQ(GetParam().image.back(), greatest);
}

INSTANTIATE_TEST_SUITE_P(
    Cameras, FormatLists,
    testing::Values(
        FormatCase{"WheelDeep",
                   R"({"model": "SolvaneA1", "sensor": {"width": 64, "height": 48}})",
                   {0, 1, 2, 3, 6, 7, 8, 9, 10, 11, 12},
                   {0, 1, 2, 3, 6, 7, 8, 9, 10, 11, 12}},
        FormatCase{
            "WheelEightBits",
            R"({"model": "SolvaneA1", "sensor": {"width": 64, "height": 48, "maxBitDepth": 8}})",
            {0, 2, 6, 7, 8, 9, 10, 11, 12},
            {0, 2, 6, 8, 9, 11, 12}},
        FormatCase{"BayerDeep",
                   R"({"model": "PellanA1", "sensor": {"width": 64, "height": 48}})",
                   {0, 1, 2, 3, 4, 5},
                   {0, 1, 2, 3, 4, 5, 8, 9, 10, 11, 12}},
        FormatCase{
            "BayerEightBits",
            R"({"model": "PellanA1", "sensor": {"width": 64, "height": 48, "maxBitDepth": 8}})",
            {0, 2, 4, 5},
            {0, 2, 4, 8, 9, 11, 12}},
        FormatCase{
            "MonoWithoutWheelDeep",
            R"({"model": "DorixR1", "sensor": {"width": 64, "height": 48, "colour": "mono"}})",
            {0, 1, 2, 3, 4, 5},
            {0, 1, 2, 3}},
        FormatCase{"MonoWithoutWheelEightBits",
                   R"({"model": "DorixR1", "sensor": {"width": 64, "height": 48,
                       "maxBitDepth": 8, "colour": "mono"}})",
                   {0, 2, 4, 5},
                   {0, 2}},
        FormatCase{"OtherColourKind",
                   R"({"model": "SolvaneA1", "sensor": {"width": 64, "height": 48},
                       "configuration": {"17": "0x00060200"}})",
                   {0, 1, 2, 3, 4, 5},
                   {0, 1, 2, 3}}),
    [](const auto& formats) { return std::string(formats.param.name); });

class TwoSpeeds : public CapabilityTables {
  protected:
    TwoSpeeds() : CapabilityTables("model:SolvaneC1") {}
};

TEST_F(TwoSpeeds, ModesOf10And20MegahertzListFromTheLastToTheFirst) {
    EXPECT_EQ((List{0, 1}), GetList(zprmReadoutSpeed));
}

class ThreeSpeeds : public CapabilityTables {
  protected:
    ThreeSpeeds() : CapabilityTables("model:PellanB1") {}
};

TEST_F(ThreeSpeeds, ModesOf40And10And20MegahertzListFromTheLastToTheFirst) {
    EXPECT_EQ((List{0, 1, 7}), GetList(zprmReadoutSpeed));
    EXPECT_EQ((List{0, 1, 2, 3, 4, 5, 6, 7}), GetList(zprmTriggerType));
}

class FastConnection : public CapabilityTables {
  protected:
    FastConnection() : CapabilityTables("model:SolvaneE1") {}
};

TEST_F(FastConnection, At800MegabitThreeSpeedsAreOfferedOfWhichTheSecondIsTheDefault) {
    EXPECT_EQ((List{8, 0, 1}), GetList(zprmReadoutSpeed));
    EXPECT_EQ(std::uint32_t{zspeed20MHz}, GetWord(block, zprmReadoutSpeed));
}

class SlowConnection : public CapabilityTables {
  protected:
    SlowConnection()
        : CapabilityTables(R"({"base": "model:SolvaneE1", "buses": [{"speed": 400}]})") {}
};

TEST_F(SlowConnection, At400MegabitTheFastestSpeedIsNotOffered) {
    EXPECT_EQ((List{0, 1}), GetList(zprmReadoutSpeed));
    EXPECT_ZERR(zerrBadParameter, Zentara_SetParam(&block, zprmReadoutSpeed, zspeed30MHz));
}

class WheelInMotion : public CapabilityTables {};

TEST_F(WheelInMotion, WhileItCyclesTwoTriggerModesAreLeft) {
    ASSERT_EQ(CameraOk, reinterpret_cast<ZCamera*>(handle)->SetRGBFilterCycle(true));

    EXPECT_EQ((List{0, 5}), GetList(zprmTriggerType));
    EXPECT_ZERR(zerrBadParameter, Zentara_SetParam(&block, zprmTriggerType, 1));
}

class SeparateBinningLists : public CapabilityTables {
  protected:
    SeparateBinningLists() : CapabilityTables(SmallMetrona) {}
};

TEST_F(SeparateBinningLists, HaveAll64ValuesEach) {
    List expected;
    for (std::uint32_t value = 1; value <= 64; ++value) expected.push_back(value);

    EXPECT_EQ(expected, GetList(zprmHorizontalBinning));
    EXPECT_EQ(expected, GetList(zprmVerticalBinning));
    ExpectNoList(zprmBinning);
    EXPECT_ZERR(zerrNone, Zentara_IsRangeTable(&block, zprmMetronaShutterDelay));
}

class TwoFieldCapabilities : public CapabilityTables {
  protected:
    TwoFieldCapabilities() : CapabilityTables("folary") {}
};

TEST_F(TwoFieldCapabilities, HaveTwoModesAndNoSymmetricalBinningOrSyncB) {
    EXPECT_EQ((List{0, 1}), GetList(zprmCameraMode));
    EXPECT_EQ((List{1, 2, 3, 4}), GetList(zprmVerticalBinning));
    EXPECT_EQ((List{0, 5}), GetList(zprmTriggerType));
    ExpectNoList(zprmBinning);
    ExpectNoList(zprmSyncb);
    EXPECT_ZERR(zerrNotSupported, Zentara_IsRangeTable(&block, zprmSyncb));
}

}  // namespace
}  // namespace ZV::Test
