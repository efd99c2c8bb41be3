#include <gtest/gtest.h>

#include <map>
#include <vector>

#include "support/flat_camera.h"
#include "support/parameter_worlds.h"
#include "support/settings_words.h"

namespace ZV::Test {
namespace {

constexpr std::uint32_t Untouched = 0xDDDDDDDD;
constexpr std::int32_t UntouchedSigned = -0x22222222;
constexpr std::uint64_t UntouchedWide = 0xDDDDDDDDDDDDDDDD;
constexpr std::uint32_t WordMax = 0xFFFFFFFF;

/// What a setter left in a block.
struct Change {
    enum { Word, Signed, Wide } family;
    std::uint32_t key;
    std::uint64_t value;
};

void Apply(const Change& change, Zentara_Settings& block) {
    if (change.family == Change::Word) {
        SetWord(block, change.key, static_cast<std::uint32_t>(change.value));
    } else if (change.family == Change::Signed) {
        SetSigned(block, change.key, static_cast<std::int32_t>(change.value));
    } else {
        SetWide(block, change.key, change.value);
    }
}

struct LimitCase {
    std::uint32_t key;
    std::uint32_t least, greatest;
};

struct SetCase {
    std::uint32_t key;
    std::uint32_t value;
    ZentaraResult result;
    std::vector<Change> changes;  ///< Of the whole block; none for a refusal.
};

/// Keys are read, bounded and set on one camera; every call is asked to leave the 260 bytes of the
/// block as they were but for what the case says.
class Parameters : public OpenedCamera {
  protected:
    explicit Parameters(std::string_view scenario = RichMono) : OpenedCamera(scenario) {}

    void SetUp() override {
        OpenedCamera::SetUp();
        block = ReadSettings();
    }

    void ExpectValue(ZentaraResult result, std::uint32_t expected, std::uint32_t key) {
        const Zentara_Settings before = block;
        std::uint32_t value = Untouched;

        EXPECT_ZERR(result, Zentara_GetParam(&block, key, &value)) << "key " << key;

        EXPECT_EQ(result == zerrNone ? expected : Untouched, value) << "key " << key;
        EXPECT_TRUE(AreSameBytes(before, block)) << "key " << key;
    }

    void ExpectLimits(const LimitCase& limits) {
        const Zentara_Settings before = block;
        std::uint32_t least = Untouched;
        std::uint32_t greatest = Untouched;

        EXPECT_ZERR(zerrNone, Zentara_GetParamMin(&block, limits.key, &least)) << limits.key;
        EXPECT_ZERR(zerrNone, Zentara_GetParamMax(&block, limits.key, &greatest)) << limits.key;

        EXPECT_EQ(limits.least, least) << "key " << limits.key;
        EXPECT_EQ(limits.greatest, greatest) << "key " << limits.key;
        EXPECT_TRUE(AreSameBytes(before, block)) << "key " << limits.key;
    }

    void ExpectNoLimits(std::uint32_t key) {
        std::uint32_t value = Untouched;

        EXPECT_ZERR(zerrNotSupported, Zentara_GetParamMin(&block, key, &value)) << "key " << key;
        EXPECT_ZERR(zerrNotSupported, Zentara_GetParamMax(&block, key, &value)) << "key " << key;

        EXPECT_EQ(Untouched, value) << "key " << key;
    }

    void ExpectSet(const SetCase& set) {
        Zentara_Settings edited = block;
        Zentara_Settings expected = block;
        for (const Change& change : set.changes) Apply(change, expected);

        EXPECT_ZERR(set.result, Zentara_SetParam(&edited, set.key, set.value))
            << "key " << set.key << " to " << set.value;

        EXPECT_TRUE(AreSameBytes(expected, edited)) << "key " << set.key << " to " << set.value;
    }

    std::uint32_t Get(std::uint32_t key) {
        std::uint32_t value = Untouched;
        EXPECT_ZERR(zerrNone, Zentara_GetParam(&block, key, &value)) << "key " << key;
        return value;
    }
    std::int32_t GetS32(std::uint32_t key) {
        std::int32_t value = UntouchedSigned;
        EXPECT_ZERR(zerrNone, Zentara_GetParamS32(&block, key, &value)) << "key " << key;
        return value;
    }

    Zentara_Settings block{};
};

/// Words that differ from each other, and values to send that differ from them.
void FillWithMarks(Zentara_Settings& block) {
    for (std::uint32_t key = 0; key < 47; ++key) SetWord(block, key, 0x5000 + key);
    SetSigned(block, zprmS32NormalizedGaindB, 3335117);
    SetSigned(block, zprmS32AbsoluteOffset, 100);
    SetSigned(block, zprmS32RegulatedCoolingTemp, -7);
    SetWide(block, zprm64Exposure, 5'000'999);
    SetWide(block, zprm64ExposureRed, 500);
    SetWide(block, zprm64ExposureBlue, 0xFFFFFFFFFFFFFFFF);
    SetWide(block, zprm64NormIntensGain, 0x123456789ABCDEF0);
}

TEST_F(Parameters, GainOffsetAndExposuresReadFromTheWordsThatAreSentAndOthersAsStored) {
    FillWithMarks(block);
    const std::map<std::uint32_t, std::uint32_t> fromOtherWords{
        {0, 1000}, {1, 116}, {2, 5000}, {10, 1}, {11, WordMax}, {25, 1470000}};

    for (const auto& [key, value] : fromOtherWords) ExpectValue(zerrNone, value, key);
    for (const std::uint32_t key :
         {3u,  6u,  7u,  8u,  9u,  12u, 13u, 14u, 15u, 16u, 19u, 20u, 22u, 23u, 26u,
          27u, 28u, 29u, 30u, 31u, 32u, 33u, 34u, 35u, 37u, 39u, 42u, 43u, 44u, 45u}) {
        ExpectValue(zerrNone, 0x5000 + key, key);
    }
}

TEST_F(Parameters, AKeyThatTheCameraDoesNotHaveCannotBeReadBoundedOrSet) {
    for (const std::uint32_t key : {4u, 5u, 17u, 18u, 21u, 24u, 36u, 38u, 40u, 41u, 47u, 48u, 100u,
                                    0x7FFFFFFFu, 0x80000000u, WordMax}) {
        ExpectValue(zerrNotSupported, 0, key);
        ExpectNoLimits(key);
        ExpectSet({key, 1, zerrNotSupported, {}});
    }
}

TEST_F(Parameters, TheRegisterTweakCanBeSetAndNeverRead) {
    ExpectSet({zprmRegisterTweak, WordMax, zerrNone, {{Change::Word, 46, WordMax}}});
    ExpectValue(zerrNotSupported, 0, zprmRegisterTweak);
    ExpectNoLimits(zprmRegisterTweak);
}

TEST_F(Parameters, AnExposureBelowAMicrosecondReadsAsOne) {
    for (const std::uint64_t nanoseconds : {0u, 1u, 500u, 999u, 1999u}) {
        SetWide(block, zprm64Exposure, nanoseconds);
        ExpectValue(zerrNone, 1, zprmExposure);
    }
    SetWide(block, zprm64Exposure, 2000);
    ExpectValue(zerrNone, 2, zprmExposure);
}

TEST_F(Parameters, AnExposureBeyondTheWordReadsAsItsGreatestValue) {
    SetWide(block, zprm64Exposure, 4'294'967'294'999);
    ExpectValue(zerrNone, WordMax - 1, zprmExposure);
    SetWide(block, zprm64Exposure, 4'294'967'295'000);
    ExpectValue(zerrNone, WordMax, zprmExposure);
}

TEST_F(Parameters, AGainFarBeyondTheCameraReadsAsTheEndsOfTheUnits) {
    SetSigned(block, zprmS32NormalizedGaindB, 2'000'000'000);
    ExpectValue(zerrNone, 240472, zprmGain);  // 600 and 2000 dB in steps of 8337793 billionths
    ExpectValue(zerrNone, 28600000, zprmNormalizedGain);
    SetSigned(block, zprmS32NormalizedGaindB, -2'000'000'000);
    ExpectValue(zerrNone, 0, zprmGain);
    ExpectValue(zerrNone, 563000, zprmNormalizedGain);
}

TEST_F(Parameters, AnOffsetBelowZeroReadsBitByBit) {
    SetSigned(block, zprmS32AbsoluteOffset, -17);
    ExpectValue(zerrNone, WordMax, zprmOffset);
}

TEST_F(Parameters, LimitsAreTheCameras) {
    const LimitCase cases[] = {
        {0, 0, 4095},
        {1, 0, 4095},
        {2, 10, 3'600'000'000},
        {3, 1, 8},
        {6, 0, 3},
        {7, 0, 5},
        {8, 0, 3},
        {9, 0, 1},
        {10, 10, 3'600'000'000},
        {11, 10, 3'600'000'000},
        {12, 0, 12},
        {13, 0, 63},
        {14, 0, 47},
        {15, 1, 64},
        {16, 1, 48},
        {19, 0, 1},
        {20, 0, 1},
        {22, 100, 3000},
        {23, 0, 1'000'000'000},
        {25, 563'000, 28'600'000},
        {26, 100, 3000},  // Kept: those of the gain in camera units.
        {28, 10, 100'000},
        {29, 10, 100'000},
        {30, 10, 100'000},
        {31, 1, 4},
        {32, 0, 12},
        {33, 1, 4},
        {37, 0, 1023},
        {39, 0, 26208},
        {42, 0, 1},
        {43, 0, 1},
        {44, 500, 10'000},
    };
    for (const LimitCase& limits : cases) ExpectLimits(limits);
}

// Kept: two of them are told to be ranges.
TEST_F(Parameters, PostProcessingBlackoutSensitivityAndTheReservedKeysHaveNoLimits) {
    for (const std::uint32_t key : {27u, 34u, 35u, 45u, 46u}) ExpectNoLimits(key);
    EXPECT_ZERR(zerrNone, Zentara_IsRangeTable(&block, 34));
    EXPECT_ZERR(zerrNone, Zentara_IsRangeTable(&block, 35));
}

TEST_F(Parameters, GainAndOffsetAreStoredAsTheSignedValuesThatAreSent) {
    // (1000 - 600) steps of 8337793 billionths of a dB.
    ExpectSet({zprmGain, 1000, zerrNone, {{Change::Signed, 0, 3335117}}});
    ExpectSet({zprmGain, 600, zerrNone, {{Change::Signed, 0, 0}}});
    ExpectSet({zprmOffset, 116, zerrNone, {{Change::Signed, 1, 100}}});
    ExpectSet({zprmOffset, 0, zerrNone, {{Change::Signed, 1, static_cast<std::uint64_t>(-16)}}});
    ExpectSet({zprmNormalizedGain, 2'000'000, zerrNone, {{Change::Signed, 0, 6020599}}});
}

TEST_F(Parameters, AGainThatIsSetReadsBackInAllItsUnits) {
    ASSERT_ZERR(zerrNone, Zentara_SetParam(&block, zprmGain, 1000));

    EXPECT_EQ(1000u, Get(zprmGain));
    EXPECT_EQ(1470000u, Get(zprmNormalizedGain));
    EXPECT_EQ(3340000, GetS32(zprmS32NormalizedGaindB));
    EXPECT_EQ(600u, GetWord(block, zprmGain));
}

TEST_F(Parameters, AnExposureIsStoredInItsNanosecondsToo) {
    ExpectSet({2, 5000, zerrNone, {{Change::Word, 2, 5000}, {Change::Wide, 0, 5'000'000}}});
    ExpectSet({10, 5001, zerrNone, {{Change::Word, 10, 5001}, {Change::Wide, 1, 5'001'000}}});
    ExpectSet({11, 5002, zerrNone, {{Change::Word, 11, 5002}, {Change::Wide, 2, 5'002'000}}});
    ExpectSet({2, 10, zerrNone, {{Change::Word, 2, 10}, {Change::Wide, 0, 10'000}}});
    ExpectSet({2,
               3'600'000'000,
               zerrNone,
               {{Change::Word, 2, 3'600'000'000}, {Change::Wide, 0, 3'600'000'000'000}}});
}

// Kept: unlike any other value that is refused.
TEST_F(Parameters, AnExposureOutOfRangeIsRefusedAndStoredAllTheSame) {
    struct {
        std::uint32_t key, wide;
    } constexpr Exposures[] = {{2, 0}, {10, 1}, {11, 2}};
    for (const auto& [key, wide] : Exposures) {
        for (const std::uint32_t value : {0u, 9u, 3'600'000'001u, WordMax}) {
            ExpectSet(
                {key,
                 value,
                 zerrBadParameter,
                 {{Change::Word, key, value}, {Change::Wide, wide, std::uint64_t{value} * 1000}}});
        }
    }
}

TEST_F(Parameters, AnExposureBelowTheLeastIsRefusedAndReadsBackAsItWasSet) {
    EXPECT_ZERR(zerrBadParameter, Zentara_SetParam(&block, zprmExposure, 9));

    EXPECT_EQ(9u, Get(zprmExposure));
}

TEST_F(Parameters, AnExposureOfZeroIsRefusedAndReadsBackAsOne) {
    EXPECT_ZERR(zerrBadParameter, Zentara_SetParam(&block, zprmExposure, 0));

    EXPECT_EQ(1u, Get(zprmExposure));
    EXPECT_EQ(0u, GetWord(block, zprmExposure));
}

TEST_F(Parameters, AValueOfAListIsStored) {
    struct {
        std::uint32_t key;
        std::vector<std::uint32_t> listed, other;
        ZentaraResult refusal;
    } const cases[] = {
        {3, {1, 2, 4, 8}, {0, 3, 5, 16, WordMax}, zerrNotSupported},
        {6, {0, 1, 2, 3}, {4, 5, 6, 7, 8, 9, WordMax}, zerrBadParameter},
        {7, {0, 1, 2, 3, 4, 5}, {6, 7, 8, WordMax}, zerrBadParameter},
        {9, {0, 1}, {2, WordMax}, zerrBadParameter},
        {12, {0, 1, 2, 3, 6, 7, 8, 9, 10, 11, 12}, {4, 5, 13, WordMax}, zerrBadParameter},
        {20, {0, 1}, {2, WordMax}, zerrBadParameter},
        {32, {0, 1, 2, 3, 6, 7, 8, 9, 10, 11, 12}, {4, 5, 13, WordMax}, zerrBadParameter},
        {33, {1, 2, 3, 4}, {0, 5, WordMax}, zerrBadParameter},
        {34, {0, 1}, {2, WordMax}, zerrBadParameter},
        {35, {0, 1}, {2, WordMax}, zerrBadParameter},
        {42, {0, 1}, {2, WordMax}, zerrBadParameter},
        {43, {0, 1}, {2, WordMax}, zerrBadParameter},
    };
    for (const auto& [key, listed, other, refusal] : cases) {
        for (const std::uint32_t value : listed) {
            ExpectSet({key, value, zerrNone, {{Change::Word, key, value}}});
        }
        for (const std::uint32_t value : other) ExpectSet({key, value, refusal, {}});
    }
}

TEST_F(Parameters, ColourIntensifierAndPostProcessingAreStoredUnchecked) {
    for (const std::uint32_t key : {8u, 22u, 26u, 27u, 28u, 29u, 30u, 31u, 46u}) {
        for (const std::uint32_t value : {0u, 1u, 2u, 77u, 100'001u, WordMax}) {
            ExpectSet({key, value, zerrNone, {{Change::Word, key, value}}});
        }
    }
}

TEST_F(Parameters, AScaleAboveItsGreatestIsStored) {
    std::uint32_t greatest = 0;
    ASSERT_ZERR(zerrNone, Zentara_GetParamMax(&block, zprmPostProcessGainRed, &greatest));

    ExpectSet({28, greatest + 1, zerrNone, {{Change::Word, 28, greatest + 1}}});
}

// Kept: the check of a range asks for one bound alone.
TEST_F(Parameters, AKeyWithARangeAndNoListTakesEveryValue) {
    for (const std::uint32_t key : {13u, 14u, 15u, 16u, 19u, 23u, 37u, 39u, 44u}) {
        for (const std::uint32_t value : {0u, 1u, 100'000u, WordMax}) {
            ExpectSet({key, value, zerrNone, {{Change::Word, key, value}}});
        }
    }
}

TEST_F(Parameters, TheReservedKeyOfTheSecondHardwareCanBeReadAndNotBeSet) {
    ASSERT_LE(2u, GetInfo(zinfHardwareVersion));

    ExpectSet({zprmRevisionTwoReserved, 0, zerrNotSupported, {}});
    EXPECT_EQ(GetWord(block, 45), Get(zprmRevisionTwoReserved));
}

TEST_F(Parameters, SettingTestsBlockMagicAndKeyInThisOrder) {
    Zentara_Settings spoiled = block;
    spoiled.privateWords[SettingsMagicWord] = 0;

    EXPECT_ZERR(zerrBadParameter, Zentara_SetParam(nullptr, 47, 0));
    EXPECT_ZERR(zerrBadSettings, Zentara_SetParam(&spoiled, 47, 0));
    EXPECT_ZERR(zerrNotSupported, Zentara_SetParam(&block, 47, 0));
}

TEST_F(Parameters, SignedKeysReadTheirWordsAndTheGainIsRounded) {
    FillWithMarks(block);

    EXPECT_EQ(3340000, GetS32(zprmS32NormalizedGaindB));
    EXPECT_EQ(100, GetS32(zprmS32AbsoluteOffset));
    EXPECT_EQ(-7, GetS32(zprmS32RegulatedCoolingTemp));
}

TEST_F(Parameters, AGainInDecibelsRoundsToItsStepAndIntoTheLimits) {
    struct {
        std::int32_t stored, read;
    } constexpr Gains[] = {{0, 0},
                           {4999, 0},
                           {5000, 10000},
                           {-4999, 0},
                           {-5000, -10000},
                           {29'145'000, 29'140'000},
                           {100'000'000, 29'140'000},
                           {-100'000'000, -5'000'000}};
    for (const auto& [stored, read] : Gains) {
        SetSigned(block, zprmS32NormalizedGaindB, stored);
        EXPECT_EQ(read, GetS32(zprmS32NormalizedGaindB)) << stored;
    }
}

TEST_F(Parameters, LimitsOfSignedKeysAreTheCameras) {
    struct {
        std::uint32_t key;
        std::int32_t least, greatest;
    } constexpr Limits[] = {{0, -5'000'000, 29'140'000}, {1, -16, 4079}, {2, -40, 29}};
    for (const auto& [key, least, greatest] : Limits) {
        std::int32_t value = UntouchedSigned;
        EXPECT_ZERR(zerrNone, Zentara_GetParamS32Min(&block, key, &value)) << key;
        EXPECT_EQ(least, value) << key;
        EXPECT_ZERR(zerrNone, Zentara_GetParamS32Max(&block, key, &value)) << key;
        EXPECT_EQ(greatest, value) << key;
    }
}

TEST_F(Parameters, SignedGainAndOffsetAreStoredUncheckedAndInNoOtherWord) {
    for (const std::uint32_t key : {zprmS32NormalizedGaindB, zprmS32AbsoluteOffset}) {
        for (const std::int32_t value : {0, 1, -1, INT32_MAX, INT32_MIN}) {
            Zentara_Settings edited = block;
            Zentara_Settings expected = block;
            SetSigned(expected, key, value);

            EXPECT_ZERR(zerrNone, Zentara_SetParamS32(&edited, key, value)) << key;

            EXPECT_TRUE(AreSameBytes(expected, edited)) << key << " to " << value;
        }
    }
}

TEST_F(Parameters, ACoolingTargetOutsideItsLimitsIsRefusedAndNotStored) {
    for (const std::int32_t value : {-40, -39, 0, 28, 29}) {
        EXPECT_ZERR(zerrNone, Zentara_SetParamS32(&block, 2, value)) << value;
        EXPECT_EQ(value, GetSigned(block, 2));
    }
    const Zentara_Settings before = block;
    for (const std::int32_t value : {-41, 30, INT32_MIN, INT32_MAX}) {
        EXPECT_ZERR(zerrBadParameter, Zentara_SetParamS32(&block, 2, value)) << value;
        EXPECT_TRUE(AreSameBytes(before, block)) << value;
    }
}

TEST_F(Parameters, WideKeysReadTheirWords) {
    FillWithMarks(block);
    constexpr std::uint64_t Expected[] = {5'000'999, 500, 0xFFFFFFFFFFFFFFFF, 0x123456789ABCDEF0};
    for (std::uint32_t key = 0; key < 4; ++key) {
        std::uint64_t value = UntouchedWide;
        EXPECT_ZERR(zerrNone, Zentara_GetParam64(&block, key, &value)) << key;
        EXPECT_EQ(Expected[key], value) << key;
    }
}

TEST_F(Parameters, LimitsOfWideKeysAreTheCameras) {
    for (std::uint32_t key = 0; key < 4; ++key) {
        std::uint64_t least = UntouchedWide;
        std::uint64_t greatest = UntouchedWide;
        EXPECT_ZERR(zerrNone, Zentara_GetParam64Min(&block, key, &least)) << key;
        EXPECT_ZERR(zerrNone, Zentara_GetParam64Max(&block, key, &greatest)) << key;
        EXPECT_EQ(key == 3 ? 56'800'000u : 10'000u, least) << key;
        EXPECT_EQ(key == 3 ? 10'900'000'000u : 3'600'000'000'000u, greatest) << key;
    }
}

// Kept: as for the exposures in microseconds.
TEST_F(Parameters, AWideExposureIsStoredAlwaysAndInNoOtherWord) {
    struct {
        std::uint64_t value;
        ZentaraResult result;
    } constexpr Exposures[] = {{10'000, zerrNone},
                               {12'345, zerrNone},
                               {3'600'000'000'000, zerrNone},
                               {9'999, zerrBadParameter},
                               {0, zerrBadParameter},
                               {3'600'000'000'001, zerrBadParameter},
                               {0xFFFFFFFFFFFFFFFF, zerrBadParameter}};
    for (std::uint32_t key = 0; key < 3; ++key) {
        for (const auto& [value, result] : Exposures) {
            Zentara_Settings edited = block;
            Zentara_Settings expected = block;
            SetWide(expected, key, value);

            EXPECT_ZERR(result, Zentara_SetParam64(&edited, key, value)) << key << " " << value;

            EXPECT_TRUE(AreSameBytes(expected, edited)) << key << " to " << value;
        }
    }
}

TEST_F(Parameters, TheWideIntensifierGainIsStoredUnchecked) {
    for (const std::uint64_t value : {std::uint64_t{0}, std::uint64_t{0xFFFFFFFFFFFFFFFF}}) {
        Zentara_Settings expected = block;
        SetWide(expected, 3, value);

        EXPECT_ZERR(zerrNone, Zentara_SetParam64(&block, 3, value));

        EXPECT_TRUE(AreSameBytes(expected, block));
    }
}

TEST_F(Parameters, EditingABlockGoesNotOverTheBusAndChangesNoCamera) {
    const std::size_t before = world.ReadRequests().size();
    const Zentara_Settings camera = ReadSettings();

    for (std::uint32_t key = 0; key < 48; ++key) {
        std::uint32_t value = 0;
        (void)Zentara_GetParam(&block, key, &value);
        (void)Zentara_GetParamMin(&block, key, &value);
        (void)Zentara_GetParamMax(&block, key, &value);
        (void)Zentara_SetParam(&block, key, value);
    }
    for (std::uint32_t key = 0; key < 4; ++key) {
        std::int32_t value = 0;
        (void)Zentara_GetParamS32(&block, key, &value);
        (void)Zentara_GetParamS32Min(&block, key, &value);
        (void)Zentara_GetParamS32Max(&block, key, &value);
        (void)Zentara_SetParamS32(&block, key, value);
    }
    for (std::uint32_t key = 0; key < 5; ++key) {
        std::uint64_t value = 0;
        (void)Zentara_GetParam64(&block, key, &value);
        (void)Zentara_GetParam64Min(&block, key, &value);
        (void)Zentara_GetParam64Max(&block, key, &value);
        (void)Zentara_SetParam64(&block, key, value);
    }

    EXPECT_EQ(before, world.ReadRequests().size());
    EXPECT_TRUE(AreSameBytes(camera, ReadSettings()));
}

class MetronaParameters : public Parameters {
  protected:
    MetronaParameters() : Parameters(SmallMetrona) {}
};

TEST_F(MetronaParameters, BinsItsDirectionsSeparatelyFromOneTo64) {
    for (const std::uint32_t key : {4u, 5u}) {
        ExpectLimits({key, 1, 64});
        for (std::uint32_t value = 1; value <= 64; ++value) {
            ExpectSet({key, value, zerrNone, {{Change::Word, key, value}}});
        }
        for (const std::uint32_t value : {0u, 65u, WordMax}) {
            ExpectSet({key, value, zerrNotSupported, {}});
        }
    }
    ExpectSet({3, 1, zerrNotSupported, {}});
}

TEST_F(MetronaParameters, TheShutterDelayHasARangeThatIsNotEnforced) {
    ExpectLimits({21, 0, 1'000'000});
    ExpectSet({21, WordMax, zerrNone, {{Change::Word, 21, WordMax}}});
    ExpectValue(zerrNone, GetWord(block, 21), 21);
}

TEST_F(MetronaParameters, OneSpeedIsFirstAndLastOfItsList) {
    // Kept: the least is 0 whatever the list.
    ExpectLimits({6, 0, 2});
    ExpectSet({6, 2, zerrNone, {{Change::Word, 6, 2}}});
    ExpectSet({6, 0, zerrBadParameter, {}});
}

class FolaryParameters : public Parameters {
  protected:
    FolaryParameters() : Parameters("folary") {}
};

TEST_F(FolaryParameters, HaveTwoModesAndNoModeOfOversampling) {
    ExpectLimits({24, 0, 1});
    ExpectSet({24, 0, zerrNone, {{Change::Word, 24, 0}}});
    ExpectSet({24, 1, zerrNone, {{Change::Word, 24, 1}}});
    ExpectSet({24, 2, zerrBadParameter, {}});
    ExpectValue(zerrNone, 0, 24);
}

TEST_F(FolaryParameters, VerticalBinningIsCheckedByTheCamerasList) {
    ExpectLimits({5, 1, 4});
    ExpectSet({5, 3, zerrNone, {{Change::Word, 5, 3}}});
    ExpectSet({5, 8, zerrNotSupported, {}});
}

class PellanParameters : public Parameters {
  protected:
    PellanParameters() : Parameters("model:PellanB1") {}
};

TEST_F(PellanParameters, TheGreatestReadoutSpeedIsTheIndexOfTheFirstMode) {
    // 40, 10 and 20 MHz.
    ExpectLimits({6, 0, 7});
}

class CrossedDelayLimits : public Parameters {
  protected:
    CrossedDelayLimits()
        : Parameters(R"({"base": "model:SolvaneK1", "cameras": [{
              "sensor": {"width": 64, "height": 48},
              "configuration": {"36": 500, "37": 1000}}]})") {}
};

TEST_F(CrossedDelayLimits, AValueBelowTheLeastAndAboveTheGreatestAtOnceIsRefused) {
    ExpectLimits({23, 1000, 500});
    for (const std::uint32_t value : {501u, 999u}) ExpectSet({23, value, zerrBadParameter, {}});
    for (const std::uint32_t value : {0u, 500u, 1000u, 2000u}) {
        ExpectSet({23, value, zerrNone, {{Change::Word, 23, value}}});
    }
}

class ClosedParameters : public Parameters {};

TEST_F(ClosedParameters, ABlockKeepsItsHandleAndFailsWithBadSettings) {
    ASSERT_ZERR(zerrNone, Zentara_CloseCamera(handle));
    std::uint32_t value = Untouched;

    EXPECT_ZERR(zerrBadSettings, Zentara_GetParam(&block, zprmGain, &value));
    EXPECT_ZERR(zerrBadSettings, Zentara_SetParam(&block, zprmRoiX, 1));
    EXPECT_ZERR(zerrNotSupported, Zentara_SetParam(&block, 47, 1));

    EXPECT_EQ(Untouched, value);
    ASSERT_ZERR(zerrNone, Zentara_OpenCamera(0, &handle));
    EXPECT_ZERR(zerrNone, Zentara_GetParam(&block, zprmRoiWidth, &value));
}

}  // namespace
}  // namespace ZV::Test
