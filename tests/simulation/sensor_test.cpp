#include "simulation/sensor.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <cstring>
#include <thread>

#include "support/reference_renderer.h"

namespace ZV::Simulation {
namespace {

using Test::ReferenceCamera;
using Test::ReferenceExposure;
using Test::ReferenceRenderer;

struct Rig {
    SensorDescription sensor;
    SceneDescription scene;

    Rig() {
        sensor.width = 64;
        sensor.height = 48;
        sensor.hasNoise = false;
        scene.kind = "flat";
    }

    Sensor Make() const {
        std::string message;
        return {sensor, MakeScene(scene, sensor.width, sensor.height, sensor.seed, &message)};
    }

    /// The whole sensor, in 12 bits, with a quarter of the well filled at white.
    ExposureSettings GetWhole() const {
        ExposureSettings settings;
        settings.width = sensor.width;
        settings.height = sensor.height;
        settings.bitDepth = 12;
        settings.exposureNs = 2750000;
        return settings;
    }

    std::vector<std::uint16_t> Expose(const ExposureSettings& settings) const {
        return Unpack(Make().Expose(settings), settings);
    }

    static std::vector<std::uint16_t> Unpack(const std::vector<std::uint8_t>& bytes,
                                             const ExposureSettings& settings) {
        if (settings.bitDepth <= 8) return {bytes.begin(), bytes.end()};
        std::vector<std::uint16_t> samples(bytes.size() / 2);
        for (std::size_t i = 0; i < samples.size(); ++i) {
            samples[i] = static_cast<std::uint16_t>(bytes[2 * i] | bytes[2 * i + 1] << 8);
        }
        return samples;
    }

    ReferenceCamera GetReference() const {
        ReferenceCamera camera;
        camera.width = sensor.width;
        camera.height = sensor.height;
        camera.hasMosaic = sensor.colourKind == ColourKind::Bayer;
        camera.mosaic = sensor.mosaic;
        camera.binsWithinMosaic = sensor.binsWithinMosaic;
        camera.fullWell = sensor.fullWell;
        camera.darkCurrentAt20 = sensor.darkCurrentAt20;
        camera.seed = sensor.seed;
        camera.scene = scene.kind;
        camera.brightness = scene.brightness;
        camera.level = scene.level;
        std::copy(std::begin(scene.light), std::end(scene.light), camera.light.begin());
        camera.starCount = scene.starCount;
        return camera;
    }

    void ExpectAsWritten(const ExposureSettings& settings) const {
        ReferenceExposure exposure;
        exposure.x = settings.roiX;
        exposure.y = settings.roiY;
        exposure.width = settings.width;
        exposure.height = settings.height;
        exposure.binningX = settings.binningX;
        exposure.binningY = settings.binningY;
        exposure.bitDepth = settings.bitDepth;
        exposure.seconds = static_cast<double>(settings.exposureNs) / 1e9;
        exposure.gainDb = settings.gainDb;
        exposure.offset = settings.offset;
        exposure.wheelColour =
            settings.wheelColour == 255 ? -1 : static_cast<int>(settings.wheelColour);
        exposure.temperature = settings.temperature;
        exposure.isTurned = settings.isRotated;
        EXPECT_EQ(ReferenceRenderer(GetReference()).Render(exposure), Expose(settings));
    }
};

double GetMean(const std::vector<std::uint16_t>& samples) {
    double sum = 0;
    for (const std::uint16_t sample : samples) sum += sample;
    return sum / static_cast<double>(samples.size());
}

double GetVariance(const std::vector<std::uint16_t>& samples) {
    const double mean = GetMean(samples);
    double sum = 0;
    for (const std::uint16_t sample : samples) sum += (sample - mean) * (sample - mean);
    return sum / static_cast<double>(samples.size());
}

class SensorSceneTest : public testing::TestWithParam<const char*> {};

TEST_P(SensorSceneTest, SamplesWithoutNoiseAreThoseOfTheWrittenFormulas) {
    Rig rig;
    rig.scene.kind = GetParam();
    rig.scene.light[ColourBlue] = 0.6;
    for (const ColourKind kind : {ColourKind::Mono, ColourKind::Bayer}) {
        rig.sensor.colourKind = kind;
        for (const std::uint32_t depth : {8U, 12U, 14U, 16U}) {
            for (const std::uint32_t binning : {1U, 2U, 3U, 4U, 8U}) {
                SCOPED_TRACE(testing::Message() << "depth " << depth << ", binning " << binning);
                ExposureSettings settings = rig.GetWhole();
                settings.bitDepth = depth;
                settings.binningX = settings.binningY = binning;
                settings.width /= binning;
                settings.height /= binning;
                settings.gainDb = 3.5;
                settings.offset = 37;
                rig.ExpectAsWritten(settings);
            }
        }
    }
}

INSTANTIATE_TEST_SUITE_P(Scenes, SensorSceneTest, testing::Values("flat", "ramp", "chart", "stars"),
                         [](const auto& scene) { return std::string(scene.param); });

TEST(SensorTest, AFullWellIsTheGreatestSampleAtAnyDepth) {
    Rig rig;
    rig.scene.level = 1;
    rig.sensor.darkCurrentAt20 = 0;
    for (const std::uint32_t depth : {8U, 10U, 12U, 14U, 16U}) {
        ExposureSettings settings = rig.GetWhole();
        settings.bitDepth = depth;
        settings.exposureNs = 11000000;  // 22000 electrons.

        EXPECT_EQ((1U << depth) - 1, rig.Expose(settings)[0]) << depth;
        settings.exposureNs *= 50;
        EXPECT_EQ((1U << depth) - 1, rig.Expose(settings)[0]) << depth;
    }
}

TEST(SensorTest, AFullWellStaysBelowTheGreatestSampleAtNegativeGain) {
    Rig rig;
    ExposureSettings settings = rig.GetWhole();
    settings.exposureNs = 1000000000;
    settings.gainDb = -20;

    EXPECT_EQ(410, rig.Expose(settings)[0]) << "a tenth of 4095, rounded";
}

TEST(SensorTest, SamplesGrowWithTheExposureInAStraightLine) {
    Rig rig;
    rig.sensor.darkCurrentAt20 = 0;
    ExposureSettings settings = rig.GetWhole();
    settings.bitDepth = 16;

    const double once = rig.Expose(settings)[0];
    settings.exposureNs *= 3;

    EXPECT_NEAR(3 * once, rig.Expose(settings)[0], 2);
}

TEST(SensorTest, TwentyDecibelsOfGainMakeSamplesTenTimesAsBright) {
    Rig rig;
    ExposureSettings settings = rig.GetWhole();
    settings.bitDepth = 16;
    settings.exposureNs /= 4;

    const double once = rig.Expose(settings)[0];
    settings.gainDb = 20;

    EXPECT_NEAR(10 * once, rig.Expose(settings)[0], 6);
}

TEST(SensorTest, AnOffsetIsCountedInStepsOf12Bits) {
    Rig rig;
    rig.scene.level = 0;
    rig.sensor.darkCurrentAt20 = 0;
    ExposureSettings settings = rig.GetWhole();
    settings.offset = 160;

    EXPECT_EQ(160, rig.Expose(settings)[0]);
    settings.bitDepth = 8;
    EXPECT_EQ(10, rig.Expose(settings)[0]);
    settings.offset = -160;
    EXPECT_EQ(0, rig.Expose(settings)[0]);
}

TEST(SensorTest, DarkCurrentDoublesEvery6Point3Degrees) {
    Rig rig;
    rig.scene.level = 0;
    rig.sensor.darkCurrentAt20 = 100;
    ExposureSettings settings = rig.GetWhole();
    settings.bitDepth = 16;
    settings.exposureNs = 10000000000;
    settings.temperature = 20;

    const double warm = rig.Expose(settings)[0];
    settings.temperature = 20 - 6.3;

    EXPECT_NEAR(1000.0 * 65535 / 22000, warm, 1);
    EXPECT_NEAR(warm / 2, rig.Expose(settings)[0], 1);
}

TEST(SensorTest, BinningAddsElectrons) {
    Rig rig;
    ExposureSettings settings = rig.GetWhole();
    settings.bitDepth = 16;
    settings.exposureNs /= 4;
    const double once = rig.Expose(settings)[0];
    settings.binningX = 2;
    settings.width = 32;

    EXPECT_NEAR(2 * once, rig.Expose(settings)[0], 2);
}

TEST(SensorTest, BinningInOneAxisAloneFollowsTheFormulas) {
    Rig rig;
    rig.scene.kind = "ramp";
    ExposureSettings settings = rig.GetWhole();
    settings.binningX = 5;
    settings.width = 12;
    rig.ExpectAsWritten(settings);
    settings.binningX = 1;
    settings.width = 64;
    settings.binningY = 7;
    settings.height = 6;
    rig.ExpectAsWritten(settings);
}

TEST(SensorTest, BinningWithinTheMosaicKeepsTheMosaic) {
    Rig rig;
    rig.sensor.colourKind = ColourKind::Bayer;
    rig.sensor.binsWithinMosaic = true;
    rig.scene.light[ColourRed] = 0.25;
    rig.scene.light[ColourBlue] = 0.5;
    ExposureSettings settings = rig.GetWhole();
    settings.binningY = 2;
    settings.height = 24;

    const auto samples = rig.Expose(settings);

    EXPECT_LT(samples[0], samples[1]) << "red below green";
    EXPECT_EQ(samples[1], samples[64]) << "green is green";
    EXPECT_NEAR(2 * samples[0], samples[65], 2) << "blue is twice red";
    rig.scene.kind = "ramp";
    for (settings.binningY = 1; settings.binningY <= 4; ++settings.binningY) {
        settings.height = 48 / settings.binningY & ~1U;
        rig.ExpectAsWritten(settings);
    }
}

TEST(SensorTest, ARegionOfInterestIsCountedInBinnedPixels) {
    Rig rig;
    rig.scene.kind = "ramp";
    ExposureSettings settings = rig.GetWhole();
    settings.binningX = settings.binningY = 2;
    settings.roiX = 3;
    settings.roiY = 5;
    settings.width = 11;
    settings.height = 7;

    rig.ExpectAsWritten(settings);
}

TEST(SensorTest, WhatLiesBeyondTheEdgeIsDark) {
    Rig rig;
    rig.sensor.darkCurrentAt20 = 0;
    ExposureSettings settings = rig.GetWhole();
    settings.roiX = 60;
    settings.roiY = 46;
    settings.width = 8;
    settings.height = 4;

    const auto samples = rig.Expose(settings);

    EXPECT_NE(0, samples[3]);
    EXPECT_EQ(0, samples[4]);
    EXPECT_NE(0, samples[8 + 3]);
    EXPECT_EQ(0, samples[16]);
    for (const std::uint32_t far : {64U, 65535U, 0xFFFFFFFFU}) {
        settings.roiX = settings.roiY = far;
        for (const std::uint16_t sample : rig.Expose(settings)) EXPECT_EQ(0, sample);
    }
}

TEST(SensorTest, ARotatedImageIsSentLastPixelFirst) {
    Rig rig;
    rig.scene.kind = "ramp";
    ExposureSettings settings = rig.GetWhole();
    auto expected = rig.Expose(settings);
    std::reverse(expected.begin(), expected.end());
    settings.isRotated = true;

    EXPECT_EQ(expected, rig.Expose(settings));
}

TEST(SensorTest, BigEndianSamplesHaveTheirHighByteFirst) {
    Rig rig;
    ExposureSettings settings = rig.GetWhole();
    const auto little = rig.Make().Expose(settings);
    settings.isBigEndian = true;

    const auto big = rig.Make().Expose(settings);

    EXPECT_NE(little[0], little[1]);
    EXPECT_EQ(little[0], big[1]);
    EXPECT_EQ(little[1], big[0]);
}

TEST(SensorTest, TheWheelLetsOneColourThroughAndNoneTheMeanOfAll) {
    Rig rig;
    rig.sensor.darkCurrentAt20 = 0;
    rig.scene.light[ColourRed] = 0.3;
    rig.scene.light[ColourGreen] = 0.6;
    rig.scene.light[ColourBlue] = 0.9;
    ExposureSettings settings = rig.GetWhole();
    settings.bitDepth = 16;
    const auto expose = [&](std::uint32_t colour) {
        settings.wheelColour = colour;
        return double(rig.Expose(settings)[0]);
    };

    const double red = expose(0);

    EXPECT_NEAR(2 * red, expose(1), 2);
    EXPECT_NEAR(3 * red, expose(3), 2);
    EXPECT_NEAR(2 * red, expose(255), 2);
    EXPECT_EQ(expose(255), expose(2)) << "2 is no colour of the wheel";
}

TEST(SensorTest, ASensorWithAMosaicHasNoWheel) {
    Rig rig;
    rig.scene.kind = "chart";
    rig.sensor.colourKind = ColourKind::Bayer;
    ExposureSettings settings = rig.GetWhole();
    const auto expected = rig.Expose(settings);
    settings.wheelColour = 3;

    EXPECT_EQ(expected, rig.Expose(settings));
}

TEST(SensorTest, EachMosaicBeginsWithItsOwnCell) {
    Rig rig;
    rig.scene.kind = "ramp";
    rig.scene.light[ColourRed] = 0.2;
    rig.scene.light[ColourBlue] = 0.5;
    rig.sensor.colourKind = ColourKind::Bayer;
    for (rig.sensor.mosaic = 5; rig.sensor.mosaic <= 8; ++rig.sensor.mosaic) {
        rig.ExpectAsWritten(rig.GetWhole());
    }
}

TEST(SensorTest, TheMosaicOfAnImageFollowsTheParityOfItsFirstPixel) {
    Rig rig;
    const std::uint32_t expected[4][4] = {{5, 6, 7, 8}, {6, 5, 8, 7}, {7, 8, 5, 6}, {8, 7, 6, 5}};
    for (rig.sensor.mosaic = 5; rig.sensor.mosaic <= 8; ++rig.sensor.mosaic) {
        const Sensor sensor = rig.Make();
        const auto& row = expected[rig.sensor.mosaic - 5];
        EXPECT_EQ(row[0], sensor.GetMosaicAt(0, 0));
        EXPECT_EQ(row[1], sensor.GetMosaicAt(3, 2));
        EXPECT_EQ(row[2], sensor.GetMosaicAt(2, 5));
        EXPECT_EQ(row[3], sensor.GetMosaicAt(63, 47));
    }
}

TEST(SensorTest, TheSameSeedAndFrameGiveTheSameNoise) {
    Rig rig;
    rig.sensor.hasNoise = true;
    ExposureSettings settings = rig.GetWhole();
    settings.frameIndex = 4;
    const auto expected = rig.Expose(settings);

    EXPECT_EQ(expected, rig.Expose(settings));
    settings.frameIndex = 5;
    EXPECT_NE(expected, rig.Expose(settings));
    settings.frameIndex = 4;
    rig.sensor.seed = 2;
    EXPECT_NE(expected, rig.Expose(settings));
}

TEST(SensorTest, RowsDrawNoiseOfTheirOwn) {
    Rig rig;
    rig.sensor.hasNoise = true;

    const auto samples = rig.Expose(rig.GetWhole());

    EXPECT_FALSE(std::equal(samples.begin(), samples.begin() + 64, samples.begin() + 64));
}

TEST(SensorTest, PhotonNoiseHasTheVarianceOfTheElectrons) {
    Rig rig;
    rig.sensor.width = rig.sensor.height = 256;
    rig.sensor.hasNoise = true;
    rig.sensor.readNoise = 0;
    rig.sensor.darkCurrentAt20 = 0;
    rig.sensor.fullWell = 65535;  // One electron for a step of 16 bits.
    ExposureSettings settings = rig.GetWhole();
    settings.bitDepth = 16;
    settings.exposureNs = 10000000;

    const auto samples = rig.Expose(settings);

    EXPECT_NEAR(10000, GetMean(samples), 3);
    EXPECT_NEAR(10000, GetVariance(samples), 300);
}

TEST(SensorTest, ABinnedPixelIsReadOnce) {
    Rig rig;
    rig.sensor.width = rig.sensor.height = 256;
    rig.sensor.hasNoise = true;
    rig.sensor.readNoise = 20;
    rig.sensor.darkCurrentAt20 = 0;
    rig.sensor.fullWell = 65535;
    rig.scene.level = 0;
    ExposureSettings settings = rig.GetWhole();
    settings.bitDepth = 16;
    settings.offset = 100;
    const double single = GetVariance(rig.Expose(settings));
    settings.binningX = settings.binningY = 2;
    settings.width = settings.height = 128;

    EXPECT_NEAR(400, single, 15);
    EXPECT_NEAR(400, GetVariance(rig.Expose(settings)), 25);
}

TEST(SensorTest, SaturatedPixelsAreQuiet) {
    Rig rig;
    rig.sensor.hasNoise = true;
    ExposureSettings settings = rig.GetWhole();
    settings.exposureNs = 1000000000;

    for (const std::uint16_t sample : rig.Expose(settings)) EXPECT_EQ(4095, sample);
}

TEST(SensorTest, NonsenseSettingsGiveNothingOrSamplesInRange) {
    Rig rig;
    const Sensor sensor = rig.Make();
    ExposureSettings settings = rig.GetWhole();
    settings.width = settings.height = 65535;
    EXPECT_TRUE(sensor.Expose(settings).empty());

    for (const std::uint32_t depth : {0U, 17U, 0xFFFFFFFFU}) {
        settings = rig.GetWhole();
        settings.bitDepth = depth;
        EXPECT_TRUE(sensor.Expose(settings).empty());
    }
    settings = rig.GetWhole();
    settings.binningX = settings.binningY = 0;
    settings.exposureNs = ~std::uint64_t{0};
    settings.gainDb = 1e9;
    for (const std::uint16_t sample : Rig::Unpack(sensor.Expose(settings), settings)) {
        EXPECT_LE(sample, 4095);
    }
    settings.exposureNs = 0;
    settings.temperature = 1e9;
    EXPECT_EQ(64U * 48 * 2, sensor.Expose(settings).size());
    settings.width = 0;
    EXPECT_TRUE(sensor.Expose(settings).empty());
}

TEST(SensorTest, ThreadsMayExposeAtTheSameTime) {
    Rig rig;
    rig.scene.kind = "stars";
    const Sensor sensor = rig.Make();
    const ExposureSettings settings = rig.GetWhole();
    std::vector<std::uint8_t> results[4];

    std::vector<std::thread> threads;
    for (auto& result : results) {
        threads.emplace_back([&sensor, &settings, &result] { result = sensor.Expose(settings); });
    }
    for (std::thread& thread : threads) thread.join();

    for (const auto& result : results) EXPECT_EQ(results[0], result);
}

}  // namespace
}  // namespace ZV::Simulation
