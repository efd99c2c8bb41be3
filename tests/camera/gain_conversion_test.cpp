#include "camera/gain_conversion.h"

#include <gtest/gtest.h>

#include <cmath>

#include "camera/bare_camera.h"

namespace ZV::Test {

namespace {

GainModel MakeModel(std::uint32_t boardType, std::uint32_t defaultDac) {
    GainModel model;
    model.boardType = boardType;
    model.dynamicRange = boardType == BoardTypeCurve ? 30.8929 : 34.1516;
    model.dBResolution = 10000;
    model.significantFigures = 3;
    model.dacMax = 4095;
    model.dacMin = 0;
    model.dacRange = 4096;
    model.dacDefault = defaultDac;
    EXPECT_EQ(CameraOk, DeriveGainLimits(&model));
    return model;
}

std::int32_t TodB(const GainModel& model, std::uint32_t dac) {
    std::int32_t gaindB = 0;
    EXPECT_TRUE(ConvertDacTodB(model, dac, &gaindB));
    return gaindB;
}

std::int64_t ToDac(const GainModel& model, std::int32_t gaindB) {
    std::int64_t dac = 0;
    EXPECT_TRUE(ConvertdBToDac(model, gaindB, &dac));
    return dac;
}

/// A camera of configuration 2.4 with its gain set up.
struct GainCamera : BareBase {
    explicit GainCamera(std::uint32_t newBoardType, std::uint32_t defaultDac = 600,
                        std::uint32_t version = MakeVersion(2, 4))
        : BareBase(version) {
        boardType = newBoardType;
        StoreConfiguration(ConfigGainDefault, defaultDac);
        StoreConfiguration(ConfigGainMin, boardType >= BoardTypeRatio ? 16 : 0);
        StoreConfiguration(ConfigGainMax, boardType >= BoardTypeRatio ? 255 : 4095);
        StoreConfiguration(ConfigGainSpan, 8337793);
        StoreConfiguration(ConfigOffsetDefault, 16);
        setupResult = SetupNormalizedGain();
    }
    CameraResult setupResult = CameraOk;
};

}  // namespace

TEST(GainCurve, HasItsPiecesMeetAtTheirEnds) {
    const GainModel model = MakeModel(BoardTypeCurve, 0);

    EXPECT_EQ(0, TodB(model, 0));
    EXPECT_EQ(3758, TodB(model, 500)) << "truncated";
    EXPECT_EQ(11276, TodB(model, 501));
    EXPECT_EQ(22557194, TodB(model, 3500)) << "truncated";
    EXPECT_EQ(22573873, TodB(model, 3501));
    EXPECT_EQ(30896667, TodB(model, 4000));
    EXPECT_EQ(30897381, TodB(model, 4095));
    EXPECT_EQ(30897381, TodB(model, 4096));
}

TEST(GainCurve, TakesADefaultBeyondTheDacForTheEndOfItsFirstPiece) {
    GainModel model = MakeModel(BoardTypeCurve, 0);
    model.dacDefault = 4096;

    EXPECT_EQ(-3759, TodB(model, 0));
    EXPECT_EQ(0, TodB(model, 500));
}

TEST(GainCurve, EndsAt4095AboveItsGreatestdB) {
    const GainModel model = MakeModel(BoardTypeCurve, 0);
    const GainModel raised = MakeModel(BoardTypeCurve, 600);

    EXPECT_EQ(4095, ToDac(model, 30897382));
    EXPECT_EQ(4095, ToDac(model, 2000000000));
    EXPECT_EQ(4095, ToDac(raised, 30897382));
}

TEST(GainLine, SpreadsItsRangeOverTheDac) {
    const GainModel model = MakeModel(BoardTypeLinear, 1000);

    EXPECT_EQ(0, TodB(model, 1000));
    EXPECT_EQ(-8337792, TodB(model, 0)) << "truncated";
    EXPECT_EQ(1000, ToDac(model, 0));
    EXPECT_EQ(0, ToDac(model, -8337793));
    EXPECT_LT(ToDac(model, -20000000), 0) << "not held within the DAC";
    EXPECT_GT(ToDac(model, 60000000), 4095);
}

TEST(GainLine, HasABaseOf0ForARangeOf0AndThenFails) {
    GainModel model = MakeModel(BoardTypeLinear, 1000);
    model.dacRange = 0;
    std::int32_t gaindB = 0;
    std::int64_t dac = 0;

    EXPECT_FALSE(ConvertDacTodB(model, 5, &gaindB));
    EXPECT_TRUE(ConvertdBToDac(model, 1000000, &dac));
    EXPECT_EQ(0, dac);
}

TEST(GainConversion, FailsOnABoardThatHasNeitherCurveNorLine) {
    GainModel model = MakeModel(BoardTypeLinear, 1000);
    std::int32_t gaindB = 77;
    std::int64_t dac = 77;
    for (const std::uint32_t boardType : {0u, 3u, 6u}) {
        model.boardType = boardType;

        EXPECT_FALSE(ConvertDacTodB(model, 5, &gaindB));
        EXPECT_FALSE(ConvertdBToDac(model, 5, &dac));
    }
    EXPECT_EQ(77, gaindB);
    EXPECT_EQ(77, dac);
}

TEST(GainConversion, FailsWhereASpanOf0LeavesNoFiniteResult) {
    GainModel model = MakeModel(BoardTypeLinear, 1000);
    model.dynamicRange = 0;
    std::int64_t dac = 0;

    EXPECT_FALSE(ConvertdBToDac(model, 1000000, &dac));
}

class EveryDacValue : public testing::TestWithParam<std::uint32_t> {};

TEST_P(EveryDacValue, ComesBackThroughdBOnEveryDefault) {
    for (std::uint32_t defaultDac = 0; defaultDac <= 4095; defaultDac += 39) {
        const GainModel model = MakeModel(GetParam(), defaultDac);
        for (std::uint32_t dac = 0; dac <= 4095; ++dac) {
            ASSERT_EQ(dac, ToDac(model, TodB(model, dac))) << "default " << defaultDac;
        }
    }
}

INSTANTIATE_TEST_SUITE_P(OfBothBoards, EveryDacValue,
                         testing::Values(BoardTypeCurve, BoardTypeLinear));

TEST(NormGainRounding, KeepsThreeFiguresAndRoundsHalvesUp) {
    EXPECT_EQ(1000000u, RoundNormGain(1000000, 3));
    EXPECT_EQ(1230000u, RoundNormGain(1234567, 3));
    EXPECT_EQ(1240000u, RoundNormGain(1235000, 3));
    EXPECT_EQ(100u, RoundNormGain(100, 3));
    EXPECT_EQ(999u, RoundNormGain(999, 3));
    EXPECT_EQ(1000u, RoundNormGain(1004, 3));
    EXPECT_EQ(1010u, RoundNormGain(1005, 3));
    EXPECT_EQ(1230000u, TruncateNormGain(1239999, 3));
}

TEST(NormGainRounding, Leaves0AsItIs) {
    EXPECT_EQ(1u, GetNormGainStep(0, 3));
    EXPECT_EQ(0u, RoundNormGain(0, 3));
}

TEST(NormGainRounding, DoesNotWrapAtTheGreatestValues) {
    EXPECT_EQ(4290000000u, RoundNormGain(0xFFFFFFFF, 3));
    EXPECT_GT(RoundNormGain(UINT64_MAX, 3), 1u << 31);
    EXPECT_GT(RoundNormGain(UINT64_MAX, 1), 1u << 31);
}

TEST(NormGain, Of1000000Is0dB) {
    GainModel model = MakeModel(BoardTypeLinear, 1000);
    std::uint32_t normGain = 1000000;

    EXPECT_EQ(0, ConvertNormTodB(model, &normGain));
    EXPECT_EQ(1000000u, normGain);
    EXPECT_EQ(1000000u, ConvertdBToNorm(model, 0));
    EXPECT_EQ(10000000u, ConvertdBToNorm(model, 20000000));
}

TEST(NormGain, IsHeldWithinTheLimitsBeforeItsdBIsTaken) {
    const GainModel model = MakeModel(BoardTypeLinear, 1000);
    std::uint32_t least = 0;
    std::uint32_t greatest = 0xFFFFFFFF;

    const std::int32_t leastdB = ConvertNormTodB(model, &least);
    const std::int32_t greatestdB = ConvertNormTodB(model, &greatest);

    EXPECT_EQ(model.normGainMin, least);
    EXPECT_EQ(model.normGainMax, greatest);
    EXPECT_EQ(CalculateNormdB(model.normGainMin), leastdB);
    EXPECT_EQ(CalculateNormdB(model.normGainMax), greatestdB);
}

TEST(NormGain, GoesDownTo60dBBelowUnityWhereTheLimitsAllowIt) {
    GainModel model = MakeModel(BoardTypeLinear, 1000);
    model.normGainMin = 1000;
    std::uint32_t at = 0;
    EXPECT_EQ(-60000000, ConvertNormTodB(model, &at));

    model.normGainMin = 0;
    std::uint32_t below = 1;
    EXPECT_EQ(-60000000, ConvertNormTodB(model, &below));
}

TEST(NormGain, OfAdBFarAboveTheMaximumIsTheMaximum) {
    const GainModel model = MakeModel(BoardTypeLinear, 1000);

    EXPECT_EQ(model.normGainMax, ConvertdBToNorm(model, 72000000));
    EXPECT_EQ(model.normGainMax, ConvertdBToNorm(model, 2147483647));
    EXPECT_EQ(model.normGainMin, ConvertdBToNorm(model, -2147483647 - 1));
}

TEST(dBRounding, GoesToTheNearestStepHalvesAwayFrom0) {
    const GainModel model = MakeModel(BoardTypeLinear, 1000);

    EXPECT_EQ(0, RoundGaindB(model, 4999));
    EXPECT_EQ(10000, RoundGaindB(model, 5000));
    EXPECT_EQ(0, RoundGaindB(model, -4999));
    EXPECT_EQ(-10000, RoundGaindB(model, -5000));
    EXPECT_EQ(model.gaindBMax, RoundGaindB(model, 2147483647));
    EXPECT_EQ(model.gaindBMin, RoundGaindB(model, -2147483647 - 1));
}

TEST(SignificantFigures, FollowFromTheStepIndB) {
    EXPECT_EQ(3u, CalculateSignificantFigures(10000));
    EXPECT_EQ(2u, CalculateSignificantFigures(100000));
    EXPECT_EQ(4u, CalculateSignificantFigures(1000));
    EXPECT_EQ(3u, CalculateSignificantFigures(2000));
}

TEST(GainLimits, AreWholeStepsWhosedBLiesWithin) {
    for (const std::uint32_t boardType : {BoardTypeCurve, BoardTypeLinear}) {
        for (std::uint32_t defaultDac = 0; defaultDac <= 4095; defaultDac += 65) {
            const GainModel model = MakeModel(boardType, defaultDac);

            EXPECT_EQ(0, model.gaindBMin % 10000);
            EXPECT_EQ(0, model.gaindBMax % 10000);
            EXPECT_LE(CalculateNormdB(model.normGainMax), model.gaindBMax);
            EXPECT_GE(CalculateNormdB(model.normGainMin), model.gaindBMin);
            EXPECT_EQ(0u, model.normGainMax % GetNormGainStep(model.normGainMax, 3));
            EXPECT_LT(CalculateNormdB(model.normGainMin - GetNormGainStep(model.normGainMin, 3)),
                      model.gaindBMin);
        }
    }
}

TEST(GainLimits, AreThoseOfTheLinearBoardOfDefault600) {
    GainModel model = MakeModel(BoardTypeLinear, 600);

    EXPECT_EQ(-5000000, model.gaindBMin);
    EXPECT_EQ(29140000, model.gaindBMax);
    EXPECT_EQ(563000u, model.normGainMin);
    EXPECT_EQ(28600000u, model.normGainMax);
}

TEST(GainLimits, OfImpossibleModelsAreFoundInTheEnd) {
    GainModel model = MakeModel(BoardTypeLinear, 1000);
    model.dynamicRange = 1e6;
    EXPECT_EQ(CameraOk, DeriveGainLimits(&model));
    EXPECT_EQ(0xFFFFFFFFu / 10000000 * 10000000, model.normGainMax);

    model.dacDefault = 0;
    model.dacMin = 4000;
    EXPECT_EQ(CameraOk, DeriveGainLimits(&model));
    EXPECT_EQ(0xFFFFFFFFu, model.normGainMin);
}

TEST(GainSetup, FillsTheModelFromTheConfiguration) {
    const GainCamera camera(BoardTypeLinear);

    EXPECT_EQ(CameraOk, camera.setupResult);
    EXPECT_EQ(2u, camera.gainModel.boardType);
    EXPECT_EQ(0u, camera.gainModel.dacMin);
    EXPECT_EQ(4095u, camera.gainModel.dacMax);
    EXPECT_EQ(4096u, camera.gainModel.dacRange);
    EXPECT_EQ(600u, camera.gainModel.dacDefault);
    EXPECT_EQ(1u, camera.gainModel.modelVersion);
    EXPECT_EQ(10000, camera.gainModel.dBResolution);
    EXPECT_EQ(3u, camera.gainModel.significantFigures);
    EXPECT_DOUBLE_EQ(4096.0 * 8337793 / 1e9, camera.gainModel.dynamicRange);
    EXPECT_FALSE(camera.gainModel.gainFlag);
}

TEST(GainSetup, TakesTheSpanOfTheBoardBelowConfiguration24) {
    GainCamera curve(BoardTypeCurve, 600, MakeVersion(2, 3));
    GainCamera line(BoardTypeLinear, 600, MakeVersion(2, 3));

    EXPECT_DOUBLE_EQ(30.8929, curve.GetNormalizedGaindBDR());
    EXPECT_DOUBLE_EQ(34.1516, line.GetNormalizedGaindBDR());
}

TEST(GainSetup, ReadsTheGainFlagFromConfiguration23) {
    BareBase early(MakeVersion(2, 2));
    BareBase late(MakeVersion(2, 3));
    for (BareBase* camera : {&early, &late}) {
        camera->StoreConfiguration(ConfigGainFlag, 1);
        EXPECT_EQ(CameraOk, camera->SetupNormalizedGain());
    }

    EXPECT_FALSE(early.gainModel.gainFlag);
    EXPECT_TRUE(late.gainModel.gainFlag);
}

TEST(GainSetup, HasTheWholeDacBelowConfigurationMajor2) {
    BareBase camera(MakeVersion(1, 2));

    EXPECT_EQ(0u, camera.GetGainMin());
    EXPECT_EQ(4095u, camera.GetGainMax());
    EXPECT_EQ(0, camera.GetOffsetMin());
    EXPECT_EQ(4095, camera.GetOffsetMax());
}

TEST(GainSetup, FailsWith2WhereALimitHasNodB) {
    GainCamera zeroLimit(BoardTypeRatio, 64);
    zeroLimit.StoreConfiguration(ConfigGainMin, 0);
    GainCamera zeroDefault(BoardTypeRatio, 0);
    GainCamera neither(0);

    EXPECT_EQ(CameraGainSetupFailed, zeroLimit.SetupNormalizedGain());
    EXPECT_EQ(CameraGainSetupFailed, zeroDefault.setupResult);
    EXPECT_EQ(CameraGainSetupFailed, neither.setupResult);
}

TEST(GainSetup, CountsTheRatioBoardIndBOfItsQuotients) {
    const GainCamera camera(BoardTypeRatio, 64);

    EXPECT_EQ(CameraOk, camera.setupResult);
    EXPECT_EQ(-12040000, camera.gainModel.gaindBMin);
    EXPECT_EQ(12000000, camera.gainModel.gaindBMax);
}

TEST(GainOperations, StateTheLimitsOfTheModel) {
    GainCamera camera(BoardTypeLinear);

    EXPECT_DOUBLE_EQ(0.563, camera.GetNormalizedGainMin());
    EXPECT_DOUBLE_EQ(28.6, camera.GetNormalizedGainMax());
    EXPECT_EQ(-5000000, camera.GetNormalizedGaindBMin());
    EXPECT_EQ(29140000, camera.GetNormalizedGaindBMax());
    EXPECT_EQ(10000, camera.GetNormalizedGaindBResolution());
    EXPECT_EQ(3, camera.GetNormalizedGainSignificantFigures());
}

TEST(GainOperations, TakeANormalizedGainOf1000000ToTheDefault) {
    for (const std::uint32_t boardType : {BoardTypeCurve, BoardTypeLinear}) {
        GainCamera camera(boardType);

        EXPECT_EQ(600u, camera.ConvertNormGainToGain(1000000));
        EXPECT_EQ(0, camera.ConvertNormGainToNormGaindB(1000000));
        EXPECT_EQ(600u, camera.ConvertNormGaindBToGain(0));
        EXPECT_EQ(1000000u, camera.ConvertNormGaindBToNormGain(0));
        EXPECT_EQ(1000000u, camera.ConvertGainToNormGain(600));
        EXPECT_EQ(0, camera.ConvertGainToNormGaindB(600));
    }
}

TEST(GainOperations, GiveThedBOfTheLeastGainForANormalizedGainOf0) {
    GainCamera camera(BoardTypeLinear);

    EXPECT_EQ(CalculateNormdB(563000), camera.ConvertNormGainToNormGaindB(0));
}

TEST(GainOperations, RoundAdBIntoTheLimits) {
    GainCamera camera(BoardTypeLinear);

    EXPECT_EQ(29140000, camera.RoundNormGaindB(1000000000));
    EXPECT_EQ(-5000000, camera.RoundNormGaindB(-1000000000));
    EXPECT_EQ(1230000, camera.RoundNormGaindB(1234999));
}

TEST(GainOperations, StateADacValueOfAnySizeWithoutWrapping) {
    GainCamera camera(BoardTypeLinear);

    EXPECT_EQ(0u, camera.ConvertNormGaindBToGain(-1000000000));
    EXPECT_EQ(120536u, camera.ConvertNormGaindBToGain(1000000000));
}

TEST(GainOperations, KeepThePlainQuotientOfARatioBoard) {
    GainCamera camera(BoardTypeRatio, 64);

    EXPECT_EQ(1u, camera.ConvertGainToNormGain(64));
    EXPECT_EQ(1u, camera.ConvertGainToNormGain(127));
    EXPECT_EQ(2u, camera.ConvertGainToNormGain(128));
    EXPECT_EQ(64000000u, camera.ConvertNormGainToGain(1000000)) << "no inverse at unity";
    EXPECT_EQ(0xFFFFFFFFu, camera.ConvertNormGainToGain(0xFFFFFFFF));
    EXPECT_EQ(0, camera.ConvertGainToNormGaindB(0));
    EXPECT_EQ(CalculateNormdB(camera.gainModel.normGainMin), camera.ConvertGainToNormGaindB(64));
    EXPECT_EQ(0, camera.ConvertNormGainToNormGaindB(0));
    EXPECT_EQ(0, camera.ConvertNormGainToNormGaindB(1000000));
    EXPECT_EQ(128u, camera.ConvertNormGaindBToGain(6100000));
    EXPECT_EQ(2020000u, camera.ConvertNormGaindBToNormGain(6100000));
}

TEST(GainOperations, DivideADefaultOf0To0) {
    GainCamera camera(BoardTypeRatio, 64);
    camera.StoreConfiguration(ConfigGainDefault, 0);

    EXPECT_EQ(0u, camera.ConvertGainToNormGain(5));
    EXPECT_EQ(0u, camera.ConvertNormGainToGain(1000000));
}

TEST(GainOperations, TakeTheOffsetFromItsDefault) {
    GainCamera camera(BoardTypeLinear);

    EXPECT_EQ(84, camera.ConvertOffsetToAbsoluteOffset(100));
    EXPECT_EQ(-16, camera.ConvertOffsetToAbsoluteOffset(0));
    EXPECT_EQ(100u, camera.ConvertAbsoluteOffsetToOffset(84));
    EXPECT_EQ(0u, camera.ConvertAbsoluteOffsetToOffset(-16));
}

TEST(GainSetters, PutTheDacValueIntoItsField) {
    GainCamera camera(BoardTypeLinear);
    camera.StoreControl(5, 0x0000ABC7);

    EXPECT_EQ(CameraOk, camera.SetGain(1234));

    EXPECT_EQ(0x4D20ABC7u, camera.ReadControl(5));
    EXPECT_EQ(1234u, camera.GetGain());
    EXPECT_EQ(camera.ConvertGainToNormGaindB(1234), camera.GetNormalizedGaindB());
    EXPECT_EQ(camera.ConvertGainToNormGain(1234), camera.GetNormalizedGain());
}

TEST(GainSetters, ReadBackFromAbove4095AsTheEndOfTheCurve) {
    GainCamera camera(BoardTypeCurve);

    EXPECT_EQ(CameraOk, camera.SetGain(5000));

    EXPECT_EQ(4095u, camera.GetGain());
}

TEST(GainSetters, HoldADacValueWithinItsField) {
    GainCamera camera(BoardTypeLinear);

    EXPECT_EQ(CameraOk, camera.SetNormalizedGaindB(1000000000));
    EXPECT_EQ(4095u, camera.ReadControlField(ControlGain));
    EXPECT_EQ(CameraOk, camera.SetNormalizedGaindB(-1000000000));
    EXPECT_EQ(0u, camera.ReadControlField(ControlGain));
    EXPECT_EQ(CameraOk, camera.SetNormalizedGain(0xFFFFFFFF));
    EXPECT_EQ(4093u, camera.ReadControlField(ControlGain));
}

TEST(GainSetters, RefuseOnABoardWithoutAConversion) {
    GainCamera camera(BoardTypeRatio, 64);

    EXPECT_EQ(CameraBadValue, camera.SetGain(100));
    EXPECT_EQ(CameraBadValue, camera.SetNormalizedGaindB(1000000));
    EXPECT_EQ(CameraBadValue, camera.SetNormalizedGain(2000000));
    EXPECT_EQ(0u, camera.GetGain());
    EXPECT_EQ(0u, camera.GetNormalizedGain());
    EXPECT_EQ(0, camera.GetNormalizedGaindB());
}

TEST(GainSetters, RefuseWhereTheSpanIs0) {
    GainCamera camera(BoardTypeLinear);
    camera.gainModel.dynamicRange = 0;

    EXPECT_EQ(CameraBadValue, camera.SetNormalizedGaindB(1000000));
    EXPECT_EQ(0u, camera.ConvertNormGaindBToGain(1000000));
}

}  // namespace ZV::Test
