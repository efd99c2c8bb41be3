#include "models/solvane_k1.h"

#include <gtest/gtest.h>

#include <cmath>

#include "camera/bare_camera.h"
#include "camera/gain_conversion.h"
#include "models/listed_models.h"

namespace ZV::Test {

namespace {

constexpr double Slope = 0.015765398;
constexpr double Intercept = 33.5092631;

std::int32_t RawTodB(std::uint32_t raw) {
    return static_cast<std::int32_t>((raw * Slope + Intercept) * 1e6);
}

struct IntensifiedCamera : BareCamera<SolvaneK1> {
    IntensifiedCamera() {
        StoreConfiguration(2, 600u << 20);
        StoreConfiguration(30, 4095u << 4);
        StoreConfiguration(66, 8337793);
        StoreConfiguration(34, 100u << 20 | 3000u << 4);
        EXPECT_EQ(CameraOk, SetupNormalizedGain());
        EXPECT_EQ(CameraOk, SetupNormalizedIntensifiedGain());
    }
    void StoreRaw(std::uint32_t raw) { StoreControl(ControlIntensifierGain, raw); }
};

}  // namespace

TEST(IntensifierGainModel, HasWholeStepsOfdBWithinTheRawLimits) {
    IntensifierGainModel model;
    ASSERT_EQ(20000u, model.dBResolution);
    ASSERT_EQ(3u, model.significantFigures);

    ASSERT_EQ(CameraOk, SetupIntensifierGain(&model, 100, 3000));

    EXPECT_EQ(2000u, model.dBResolution);
    EXPECT_EQ(100u, model.rawMin);
    EXPECT_EQ(3000u, model.rawMax);
    EXPECT_EQ(35086000u, model.dBMin) << "35.0858029 rounded up";
    EXPECT_EQ(80804000u, model.dBMax) << "80.8054571 rounded down";
}

TEST(IntensifierGainModel, HasGainsOfThreeFiguresWithinTheLimitsOfdB) {
    for (std::uint32_t rawMin = 0; rawMin < 4000; rawMin += 333) {
        IntensifierGainModel model;
        ASSERT_EQ(CameraOk, SetupIntensifierGain(&model, rawMin, rawMin + 95));

        EXPECT_LE(CalculateNormdB(model.normalizedMax), static_cast<std::int32_t>(model.dBMax));
        EXPECT_GE(CalculateNormdB(model.normalizedMin), static_cast<std::int32_t>(model.dBMin));
        EXPECT_EQ(model.normalizedMax, TruncateNormGain(model.normalizedMax, 3));
        EXPECT_EQ(model.normalizedMin, TruncateNormGain(model.normalizedMin, 3));
        EXPECT_GT(CalculateNormdB(model.normalizedMax + GetNormGainStep(model.normalizedMax, 3)),
                  static_cast<std::int32_t>(model.dBMax));
        EXPECT_LT(CalculateNormdB(model.normalizedMin - GetNormGainStep(model.normalizedMin, 3)),
                  static_cast<std::int32_t>(model.dBMin));
    }
}

TEST(IntensifierGainModel, GoesBeyond32Bits) {
    IntensifierGainModel model;
    ASSERT_EQ(CameraOk, SetupIntensifierGain(&model, 0, 4095));

    EXPECT_EQ(80000000000u, model.normalizedMax / 1000000000 * 1000000000);
    EXPECT_EQ(47400000u, model.normalizedMin);
}

TEST(IntensifierGainModel, FailsUnlessTheMaximumExceedsTheMinimum) {
    IntensifierGainModel model;

    EXPECT_EQ(CameraGainSetupFailed, SetupIntensifierGain(&model, 100, 100));
    EXPECT_EQ(CameraGainSetupFailed, SetupIntensifierGain(&model, 100, 99));
    EXPECT_EQ(CameraGainSetupFailed, SetupIntensifierGain(&model, 0, 0));
    EXPECT_EQ(20000u, model.dBResolution);
}

TEST(IntensifierGainModel, HoldsAGainWithinItsLimits) {
    IntensifierGainModel model;
    ASSERT_EQ(CameraOk, SetupIntensifierGain(&model, 100, 3000));

    EXPECT_EQ(model.normalizedMin, RoundIntensifierGain(model, 0));
    EXPECT_EQ(model.normalizedMax, RoundIntensifierGain(model, UINT64_MAX));
    EXPECT_EQ(1240000000u, RoundIntensifierGain(model, 1235000000));
    EXPECT_EQ(1230000000u, RoundIntensifierGain(model, 1234999999));
}

TEST(SolvaneK1, HasAnIntensifierAndATriggerDelay) {
    IntensifiedCamera camera;

    EXPECT_TRUE(camera.IsIntensifierAvailable());
    EXPECT_TRUE(camera.IsTriggerDelayAvialable());
    EXPECT_EQ(100u, camera.GetIntensifierGainMin());
    EXPECT_EQ(3000u, camera.GetIntensifierGainMax());
    EXPECT_EQ(35086000, camera.GetNormalizedIntensifierGaindBMin());
    EXPECT_EQ(80804000, camera.GetNormalizedIntensifierGaindBMax());
    EXPECT_EQ(2000, camera.GetNormalizedIntensifierGaindBResolution());
    EXPECT_EQ(3, camera.GetNormalizedIntensifierGainSignificantFigures());
    EXPECT_EQ(56800000u, camera.GetNormalizedIntensifierGainMin());
    EXPECT_EQ(10900000000u, camera.GetNormalizedIntensifierGainMax());
}

TEST(SolvaneK1, ReadsThedBOfItsIntensifierFromItsOwnModel) {
    IntensifiedCamera camera;
    for (const std::uint32_t raw : {0u, 100u, 1234u, 4095u}) {
        camera.StoreRaw(raw);
        EXPECT_EQ(static_cast<std::uint32_t>(RawTodB(raw)),
                  camera.GetNormalizedIntensifierGaindB());
    }
}

TEST(SolvaneK1, SetsAnIntensifierGainThroughItsOwnModel) {
    IntensifiedCamera camera;
    camera.StoreControl(18, 0xABCD000F);

    EXPECT_EQ(CameraOk, camera.SetNormalizedIntensifierGain(1000000000));

    // 60 dB: (60 - intercept) / slope + 0.5 = 1680.8
    EXPECT_EQ(0xABCD000Fu | 1680u << 4, camera.ReadControl(18));
}

TEST(SolvaneK1, HoldsAnIntensifierGainWithinItsLimits) {
    IntensifiedCamera camera;
    EXPECT_EQ(CameraOk, camera.SetNormalizedIntensifierGain(0));
    const std::uint32_t least = camera.ReadControlField(ControlIntensifierGain);
    EXPECT_EQ(CameraOk, camera.SetNormalizedIntensifierGain(UINT64_MAX));
    const std::uint32_t greatest = camera.ReadControlField(ControlIntensifierGain);

    EXPECT_NEAR(100, least, 5);
    EXPECT_NEAR(3000, greatest, 5);
}

TEST(SolvaneK1, ReadsItsIntensifierGainThroughTheModelOfTheCamera) {
    IntensifiedCamera camera;
    EXPECT_EQ(CameraOk, camera.SetNormalizedIntensifierGain(1000000000));

    // 1680 on the linear board of default 600 is 9.005 dB.
    EXPECT_EQ(2820000u, camera.GetNormalizedIntensifierGain());
    EXPECT_EQ(camera.ConvertGainToNormGain(1680), camera.GetNormalizedIntensifierGain());
    EXPECT_EQ(camera.ConvertNormGainToGain(2820000), camera.GetIntensifierGain());
}

TEST(SolvaneK1, LosesItsIntensifierGainWhenItsReadingIsSetAgain) {
    IntensifiedCamera camera;
    EXPECT_EQ(CameraOk, camera.SetNormalizedIntensifierGain(1000000000));

    EXPECT_EQ(CameraOk, camera.SetNormalizedIntensifierGain(camera.GetNormalizedIntensifierGain()));

    EXPECT_NEAR(100, camera.ReadControlField(ControlIntensifierGain), 5);
}

TEST(SolvaneK1, HasNoIntensifierValuesBeforeItsSetup) {
    BareCamera<SolvaneK1> camera;

    EXPECT_EQ(0u, camera.GetNormalizedIntensifierGainMin());
    EXPECT_EQ(0u, camera.GetNormalizedIntensifierGainMax());
    EXPECT_EQ(0u, camera.GetNormalizedIntensifierGaindB());
    EXPECT_EQ(CameraBadValue, camera.SetNormalizedIntensifierGain(1000000000));
}

TEST(SolvaneK1, EndsAListingWithoutLimitsOfItsIntensifier) {
    const ListedModels models(R"({"cameras": [{"model": "SolvaneK1",
        "configuration": {"34": 0}}]})");

    EXPECT_EQ(CameraGainSetupFailed, models.result);
    EXPECT_TRUE(models.cameras.empty());
}

}  // namespace ZV::Test
