#include <gtest/gtest.h>

#include <algorithm>
#include <iterator>
#include <map>
#include <string>
#include <tuple>
#include <utility>

#include "support/reference_renderer.h"
#include "support/wait_until.h"
#include "system/camera_session.h"

// What a client gets is what the camera saw: the trace tells what was sent, an independent renderer
// what had to be sent.
namespace ZV::Test {
namespace {

struct ModelCase {
    const char* className;
    std::uint32_t type;
    const char* text;
};

constexpr ModelCase Models[] = {
    {"SolvaneA1", 5, "Solvane A1"},    {"SolvaneA2", 6, "Solvane A2"},
    {"DorixB1", 7, "Dorix B1"},        {"Folary", 8, "Folary"},
    {"SolvaneK1", 9, "Solvane K1"},    {"DorixR1", 10, "Dorix R1"},
    {"SolvaneC1", 12, "Solvane C1"},   {"SolvaneB1", 13, "Solvane B1"},
    {"PellanA1", 14, "PellanA1"},      {"SolvaneD1", 15, "Solvane D1"},
    {"SolvaneF1", 16, "OEM Camera 3"}, {"SolvaneC2", 18, "Solvane C2"},
    {"SolvaneB2", 19, "Solvane B2"},   {"PellanB1", 25, "Pellan D1"},
    {"SolvaneE1", 26, "Solvane E1"},   {"PellanA2", 27, "Pellan A2"},
    {"SolvaneD2", 28, "Solvane D2"},   {"SolvaneG2", 29, "Solvane G2"},
    {"SolvaneG1", 30, "Solvane G1"},   {"TirelM2", 31, "Solvane M2"},
    {"TirelM1", 32, "Solvane M1"},     {"SolvaneH1", 33, "Solvane H1"},
    {"SolvaneJ1", 1001, "SJT"},        {"Metrona", 1002, "MT1"},
    {"Unknown", 99, "Unknown"},
};

/// The pixels in the order in which the camera sent them.
std::vector<std::uint8_t> TurnBack(const CameraSession& session, const DeliveredFrame& delivered) {
    std::vector<std::uint8_t> pixels = delivered.pixels;
    if (session.GetCamera().GetStreamingVersion() != 2) return pixels;
    std::reverse(pixels.begin(), pixels.end());
    if (delivered.frame.bits <= 8) return pixels;
    for (std::size_t i = 0; i + 1 < pixels.size(); i += 2) std::swap(pixels[i], pixels[i + 1]);
    return pixels;
}

void ExpectAsSent(const CameraSession& session, const DeliveredFrame& delivered) {
    EXPECT_EQ(zerrNone, delivered.result);
    EXPECT_EQ(zerrNone, delivered.frame.errorCode);
    const TraceRecord sent = session.FindSent(delivered);
    EXPECT_EQ(sent.width, delivered.frame.width);
    EXPECT_EQ(sent.height, delivered.frame.height);
    ASSERT_EQ(sent.bytes, delivered.frame.size);
    ASSERT_EQ(delivered.pixels.size(), delivered.frame.size);
    const std::vector<std::uint8_t> pixels = TurnBack(session, delivered);
    EXPECT_EQ(sent.checksum, CalculateChecksum(pixels.data(), pixels.size()));
}

class EveryModel : public testing::TestWithParam<ModelCase> {};

TEST_P(EveryModel, IsListedUnderItsTypeAndTellsItsName) {
    CameraSession session(std::string("model:") + GetParam().className);
    ASSERT_TRUE(session.IsOpen());

    ASSERT_EQ(1U, session.GetItems().size());
    EXPECT_EQ(GetParam().type, session.GetItems()[0].cameraType);
    char text[64] = {};
    EXPECT_EQ(zerrNone, Zentara_GetCameraModelString(session.GetHandle(), text, sizeof text));
    EXPECT_STREQ(GetParam().text, text);
}

TEST_P(EveryModel, GrabsTheFrameThatWasSent) {
    CameraSession session(std::string("model:") + GetParam().className);
    ASSERT_TRUE(session.IsOpen());

    const DeliveredFrame delivered = session.Grab();

    ExpectAsSent(session, delivered);
}

TEST_P(EveryModel, StreamsTheFramesThatWereSent) {
    CameraSession session(std::string("model:") + GetParam().className);
    ASSERT_TRUE(session.IsOpen());

    const auto frames = session.Stream(3);

    ASSERT_EQ(3U, frames.size());
    for (const DeliveredFrame& delivered : frames) ExpectAsSent(session, delivered);
    EXPECT_LT(frames[0].frame.frameNumber, frames[1].frame.frameNumber);
    EXPECT_LT(frames[1].frame.frameNumber, frames[2].frame.frameNumber);
}

INSTANTIATE_TEST_SUITE_P(Models, EveryModel, testing::ValuesIn(Models),
                         [](const auto& model) { return std::string(model.param.className); });

/// A camera with a small sensor, so that every sample can be computed anew.
struct SmallCamera {
    std::string model = "SolvaneA1";
    std::uint32_t width = 160, height = 120;
    std::string scene = "ramp";
    std::uint32_t streamingVersion = 1;
    bool hasMosaic = false;
    bool binsWithinMosaic = false;
    double fullWell = 22000;

    std::string GetScenario() const {
        return R"({"cameras": [{"model": ")" + model + R"(", "seed": 4711, "streamingVersion": )" +
               std::to_string(streamingVersion) + R"(, "sensor": {"width": )" +
               std::to_string(width) + R"(, "height": )" + std::to_string(height) +
               R"(, "darkCurrent": 0, "noise": false, "fullWell": )" + std::to_string(fullWell) +
               R"(, "colour": ")" + (hasMosaic ? "bayer" : "mono") + R"("}, "scene": {"kind": ")" +
               scene + R"(", "brightness": 1.5e6,
               "light": [0.8, 1, 0.6], "starCount": 60}}]})";
    }

    ReferenceCamera GetReference() const {
        ReferenceCamera camera;
        camera.width = width;
        camera.height = height;
        camera.hasMosaic = hasMosaic;
        camera.binsWithinMosaic = binsWithinMosaic;
        camera.fullWell = fullWell;
        camera.darkCurrentAt20 = 0;
        camera.seed = 4711;
        camera.scene = scene;
        camera.brightness = 1.5e6;
        camera.light = {0.8, 1, 0.6};
        camera.starCount = 60;
        return camera;
    }
};

/// The exposure that the camera's settings ask for, binning apart.
ReferenceExposure GetExposure(ZCamera& camera) {
    ReferenceExposure exposure;
    exposure.x = camera.GetROIX();
    exposure.y = camera.GetROIY();
    exposure.width = camera.GetImageWidth();
    exposure.height = camera.GetImageHeight();
    exposure.bitDepth = camera.GetBitDepth();
    exposure.seconds = static_cast<double>(camera.GetExposure()) / 1e9;
    exposure.offset = camera.GetOffset();
    return exposure;
}

void ExpectAsComputed(const CameraSession& session, const SmallCamera& small,
                      const ReferenceExposure& exposure, const DeliveredFrame& delivered) {
    ExpectAsSent(session, delivered);
    EXPECT_EQ(exposure.bitDepth, delivered.frame.bits);
    const auto expected = ReferenceRenderer(small.GetReference()).Render(exposure);
    const auto samples = delivered.GetSamples();
    ASSERT_EQ(expected.size(), samples.size());
    const auto difference = std::mismatch(expected.begin(), expected.end(), samples.begin());
    const auto position = static_cast<std::size_t>(difference.first - expected.begin());
    ASSERT_EQ(expected.size(), position)
        << "sample " << position % exposure.width << ", " << position / exposure.width << ": "
        << *difference.second << " for " << *difference.first;
}

void ExpectAsComputed(CameraSession& session, const SmallCamera& small,
                      const ReferenceExposure& exposure) {
    ExpectAsComputed(session, small, exposure, session.Grab());
}

void ExpectAsComputed(CameraSession& session, const SmallCamera& small) {
    ExpectAsComputed(session, small, GetExposure(session.GetCamera()));
}

class ScenesOnTheWire
    : public testing::TestWithParam<std::tuple<const char*, std::uint32_t, std::uint32_t>> {};

TEST_P(ScenesOnTheWire, ArriveSampleForSample) {
    SmallCamera small;
    small.scene = std::get<0>(GetParam());
    small.streamingVersion = std::get<1>(GetParam());
    CameraSession session(small.GetScenario());
    ASSERT_TRUE(session.IsOpen());
    ASSERT_EQ(CameraOk, session.GetCamera().SetBitDepth(std::get<2>(GetParam())));
    ASSERT_EQ(CameraOk, session.GetCamera().UpdateSettingsOnCamera());

    ExpectAsComputed(session, small);
}

INSTANTIATE_TEST_SUITE_P(Scenes, ScenesOnTheWire,
                         testing::Combine(testing::Values("flat", "ramp", "chart", "stars"),
                                          testing::Values(0U, 1U, 2U), testing::Values(8U, 12U)),
                         [](const auto& parameter) {
                             return std::string(std::get<0>(parameter.param)) + "Version" +
                                    std::to_string(std::get<1>(parameter.param)) + "In" +
                                    std::to_string(std::get<2>(parameter.param)) + "Bits";
                         });

TEST(ImageContentTest, AMosaicArrivesSampleForSampleWithItsPattern) {
    SmallCamera small{.model = "PellanA1", .scene = "chart", .hasMosaic = true};
    CameraSession session(small.GetScenario());
    ASSERT_TRUE(session.IsOpen());

    ExpectAsComputed(session, small);

    EXPECT_EQ(0U, session.Grab().frame.bayerPattern) << "RGGB";
}

TEST(ImageContentTest, AMosaicFollowsTheOriginOfTheRegion) {
    SmallCamera small{.model = "PellanA1", .scene = "chart", .hasMosaic = true};
    CameraSession session(small.GetScenario());
    ASSERT_TRUE(session.IsOpen());
    const std::pair<std::uint32_t, std::uint32_t> origins[] = {{0, 0}, {3, 2}, {2, 3}, {3, 3}};
    for (std::uint32_t pattern = 0; pattern < 4; ++pattern) {
        const auto [x, y] = origins[pattern];
        ASSERT_EQ(CameraOk, session.GetCamera().SetROI(x, y, 96, 64));
        ASSERT_EQ(CameraOk, session.GetCamera().UpdateSettingsOnCamera());

        EXPECT_EQ(pattern, session.Grab().frame.bayerPattern);
        ExpectAsComputed(session, small);
    }
}

TEST(ImageContentTest, TheSumOfABinnedMosaicIsMonochrome) {
    SmallCamera small{.model = "PellanA1", .scene = "chart", .hasMosaic = true};
    CameraSession session(small.GetScenario());
    ASSERT_TRUE(session.IsOpen());
    ASSERT_EQ(CameraOk, session.GetCamera().SetSymmetricalBinning(2));
    ASSERT_EQ(CameraOk, session.GetCamera().UpdateSettingsOnCamera());
    ReferenceExposure exposure = GetExposure(session.GetCamera());
    exposure.binningX = exposure.binningY = 2;

    ExpectAsComputed(session, small, exposure);

    EXPECT_EQ(zfmtMono8, session.Grab().frame.format);
}

class RegionOnTheWire : public testing::TestWithParam<std::uint32_t> {};

TEST_P(RegionOnTheWire, HoldsThePixelsOfItsPlace) {
    SmallCamera small{.streamingVersion = GetParam()};
    CameraSession session(small.GetScenario());
    ASSERT_TRUE(session.IsOpen());
    ASSERT_EQ(CameraOk, session.GetCamera().SetROI(21, 13, 75, 41));
    ASSERT_EQ(CameraOk, session.GetCamera().UpdateSettingsOnCamera());
    ReferenceExposure exposure = GetExposure(session.GetCamera());
    // A turned image counts its origin from the far corner; only one model mirrors it back.
    if (GetParam() == 2) {
        exposure.x = small.width - 21 - 75;
        exposure.y = small.height - 13 - 41;
    }

    ExpectAsComputed(session, small, exposure);
}

INSTANTIATE_TEST_SUITE_P(Versions, RegionOnTheWire, testing::Values(0U, 1U, 2U));

TEST(ImageContentTest, ATurnedCameraMirrorsItsRegionSoThatTheClientSeesItsOwn) {
    SmallCamera small{.model = "SolvaneD1", .streamingVersion = 2, .fullWell = 40000};
    CameraSession session(small.GetScenario());
    ASSERT_TRUE(session.IsOpen());
    ExpectAsComputed(session, small);
    ASSERT_EQ(CameraOk, session.GetCamera().SetROI(20, 10, 64, 48));
    ASSERT_EQ(CameraOk, session.GetCamera().UpdateSettingsOnCamera());

    const ReferenceExposure exposure = GetExposure(session.GetCamera());

    EXPECT_EQ(20U, exposure.x);
    EXPECT_EQ(10U, exposure.y);
    ExpectAsComputed(session, small, exposure);
}

class BinningOnTheWire : public testing::TestWithParam<std::uint32_t> {};

TEST_P(BinningOnTheWire, AddsThePixelsUnderIt) {
    for (const std::uint32_t version : {0U, 1U, 2U}) {
        SmallCamera small{.streamingVersion = version};
        CameraSession session(small.GetScenario());
        ASSERT_TRUE(session.IsOpen());
        ASSERT_EQ(CameraOk, session.GetCamera().SetSymmetricalBinning(GetParam()));
        ASSERT_EQ(CameraOk, session.GetCamera().UpdateSettingsOnCamera());
        ReferenceExposure exposure = GetExposure(session.GetCamera());
        exposure.binningX = exposure.binningY = GetParam();
        EXPECT_EQ(small.width / GetParam(), exposure.width);

        ExpectAsComputed(session, small, exposure);
    }
}

INSTANTIATE_TEST_SUITE_P(Modes, BinningOnTheWire, testing::Values(2U, 4U, 8U));

TEST(ImageContentTest, TwoFieldsAreWovenIntoOneImage) {
    for (const std::uint32_t version : {0U, 1U, 2U}) {
        SmallCamera small{.model = "Folary",
                          .streamingVersion = version,
                          .hasMosaic = true,
                          .binsWithinMosaic = true};
        CameraSession session(small.GetScenario());
        ASSERT_TRUE(session.IsOpen());
        ExpectAsComputed(session, small);
        ASSERT_EQ(CameraOk, session.GetCamera().SetBitDepth(12));
        ASSERT_EQ(CameraOk, session.GetCamera().UpdateSettingsOnCamera());

        ExpectAsComputed(session, small);
    }
}

TEST(ImageContentTest, EveryImageOfAStreamOfTwoFieldsIsWovenAnew) {
    for (const std::uint32_t version : {0U, 1U, 2U}) {
        SmallCamera small{.model = "Folary",
                          .streamingVersion = version,
                          .hasMosaic = true,
                          .binsWithinMosaic = true};
        CameraSession session(small.GetScenario());
        ASSERT_TRUE(session.IsOpen());

        const auto frames = session.Stream(5);

        ASSERT_EQ(5U, frames.size());
        const ReferenceExposure exposure = GetExposure(session.GetCamera());
        for (const DeliveredFrame& delivered : frames) {
            ExpectAsComputed(session, small, exposure, delivered);
        }
    }
}

/// A camera of two fields whose real-time video takes 640 by 480 pixels of its sensor.
const SmallCamera VideoCamera{
    .model = "Folary", .width = 2560, .height = 1920, .hasMosaic = true, .binsWithinMosaic = true};

void ExpectVideo(CameraSession& session) {
    ReferenceExposure exposure = GetExposure(session.GetCamera());
    EXPECT_EQ(640U, exposure.width);
    EXPECT_EQ(480U, exposure.height);

    const auto frames = session.Stream(3);

    ASSERT_EQ(3U, frames.size());
    for (const DeliveredFrame& delivered : frames) {
        ExpectAsComputed(session, VideoCamera, exposure, delivered);
    }
}

TEST(ImageContentTest, RealTimeVideoSendsItsWindowInOneField) {
    CameraSession session(VideoCamera.GetScenario());
    ASSERT_TRUE(session.IsOpen());
    ASSERT_EQ(CameraOk, session.GetCamera().SetRTVMode(true));
    ASSERT_EQ(CameraOk, session.GetCamera().UpdateSettingsOnCamera());

    ExpectVideo(session);

    ASSERT_EQ(CameraOk, session.GetCamera().SetRTVMode(false));
    ASSERT_EQ(CameraOk, session.GetCamera().UpdateSettingsOnCamera());
    EXPECT_EQ(2560U, session.GetCamera().GetImageWidth());
    ExpectAsSent(session, session.Grab());
}

TEST(ImageContentTest, ASettingsBlockTurnsRealTimeVideoOn) {
    CameraSession session(VideoCamera.GetScenario());
    ASSERT_TRUE(session.IsOpen());
    Zentara_Settings settings{};
    ASSERT_EQ(zerrNone, Zentara_ReadSettingsFromCam(session.GetHandle(), &settings));
    ASSERT_EQ(zerrNone, Zentara_SetParam(&settings, zprmCameraMode, zmodeRealTimeVideo));

    ASSERT_EQ(zerrNone, Zentara_SendSettingsToCam(session.GetHandle(), &settings));

    EXPECT_TRUE(session.GetCamera().GetRTVMode());
    ExpectVideo(session);
}

/// Where the wheel's colours stand in its turn.
std::size_t GetTurnPlace(std::uint32_t colour) {
    constexpr std::uint32_t Turn[] = {0, 1, 3};
    return static_cast<std::size_t>(std::find(std::begin(Turn), std::end(Turn), colour) - Turn);
}

class WheelOnTheWire : public testing::TestWithParam<std::uint32_t> {};

TEST_P(WheelOnTheWire, SendsTheColoursInTurnFromItsStartEachWithItsLightAndExposure) {
    SmallCamera small{.scene = "chart"};
    std::string scenario = small.GetScenario();
    scenario.insert(1, R"("base": "wheel", )");
    CameraSession session(scenario);
    ASSERT_TRUE(session.IsOpen());
    ZCamera& camera = session.GetCamera();
    ASSERT_EQ(CameraOk, camera.SetRGBFilterRedExposure(9'000'000));
    ASSERT_EQ(CameraOk, camera.SetExposure(6'000'000));
    ASSERT_EQ(CameraOk, camera.SetRGBFilterBlueExposure(12'000'000));
    ASSERT_EQ(CameraOk, camera.SetRGBFilterStartColour(GetParam()));
    ASSERT_EQ(CameraOk, camera.SetRGBFilterCycle(true));
    ASSERT_EQ(CameraOk, camera.UpdateSettingsOnCamera());

    ASSERT_EQ(zerrNone, Zentara_SetStreaming(session.GetHandle(), 1));
    EXPECT_TRUE(WaitUntil([&] { return session.world.ReadFrames().size() >= 7; }));
    ASSERT_EQ(zerrNone, Zentara_SetStreaming(session.GetHandle(), 0));

    std::size_t place = GetTurnPlace(GetParam());
    constexpr std::uint32_t Turn[] = {0, 1, 3};
    const std::vector<TraceRecord> sent = session.world.ReadFrames();
    ASSERT_GE(sent.size(), 7U);
    for (std::size_t i = 0; i < 7; ++i, place = (place + 1) % 3) {
        ASSERT_EQ(Turn[place], sent[i].plane) << "frame " << i;
        ReferenceExposure exposure = GetExposure(camera);
        exposure.wheelColour = static_cast<int>(Turn[place]);
        constexpr double Seconds[] = {0.009, 0.006, 0.012};
        exposure.seconds = Seconds[place];
        const auto samples = ReferenceRenderer(small.GetReference()).Render(exposure);
        const std::vector<std::uint8_t> pixels(samples.begin(), samples.end());
        EXPECT_EQ(CalculateChecksum(pixels.data(), pixels.size()), sent[i].checksum)
            << "frame " << i;
    }
}

INSTANTIATE_TEST_SUITE_P(StartColours, WheelOnTheWire, testing::Values(0U, 1U, 3U));

TEST(ImageContentTest, TwoBinnedFieldsKeepTheirMosaic) {
    SmallCamera small{
        .model = "Folary", .scene = "chart", .hasMosaic = true, .binsWithinMosaic = true};
    CameraSession session(small.GetScenario());
    ASSERT_TRUE(session.IsOpen());
    for (const std::uint32_t mode : {2U, 3U, 4U}) {
        ASSERT_EQ(CameraOk, session.GetCamera().SetVerticalBinning(mode));
        ASSERT_EQ(CameraOk, session.GetCamera().UpdateSettingsOnCamera());
        ReferenceExposure exposure = GetExposure(session.GetCamera());
        exposure.binningY = mode;

        ExpectAsComputed(session, small, exposure);

        EXPECT_EQ(zfmtBayer8, session.Grab().frame.format);
    }
}

TEST(ImageContentTest, SeparateBinningAddsAlongEachAxis) {
    SmallCamera small{.model = "Metrona", .width = 256, .height = 58, .scene = "stars"};
    CameraSession session(small.GetScenario());
    ASSERT_TRUE(session.IsOpen());
    ExpectAsComputed(session, small);
    for (const auto& [x, y] : {std::pair{1U, 58U}, {4U, 1U}, {3U, 7U}}) {
        ASSERT_EQ(CameraOk, session.GetCamera().SetHorizontalBinning(x));
        ASSERT_EQ(CameraOk, session.GetCamera().SetVerticalBinning(y));
        ASSERT_EQ(CameraOk, session.GetCamera().UpdateSettingsOnCamera());
        ReferenceExposure exposure = GetExposure(session.GetCamera());
        exposure.binningX = x;
        exposure.binningY = y;
        EXPECT_EQ(16U, exposure.bitDepth);

        ExpectAsComputed(session, small, exposure);
    }
}

TEST(ImageContentTest, ACameraOfTheFirstGenerationSendsItsSceneToo) {
    SmallCamera small{.streamingVersion = 0};
    std::string scenario = small.GetScenario();
    scenario.insert(scenario.find("\"seed\""),
                    R"("versions": {"configuration": "1.2", "control": "1.2", "command": "1.1",)"
                    R"( "status": "1.1"}, "firmwareVersion": 90, )");
    CameraSession session(scenario);
    ASSERT_TRUE(session.IsOpen());

    ExpectAsComputed(session, small);
}

TEST(ImageContentTest, AChangedExposureAndOffsetShowInTheNextImage) {
    SmallCamera small;
    CameraSession session(small.GetScenario());
    ASSERT_TRUE(session.IsOpen());
    for (const std::uint64_t exposureNs : {2000000U, 5000000U, 40000000U}) {
        ASSERT_EQ(CameraOk, session.GetCamera().SetExposure(exposureNs));
        ASSERT_EQ(CameraOk, session.GetCamera().SetOffset(
                                static_cast<std::int32_t>(100 + exposureNs / 100000)));
        ASSERT_EQ(CameraOk, session.GetCamera().UpdateSettingsOnCamera());

        ExpectAsComputed(session, small);
    }
}

TEST(ImageContentTest, AnImageAbove16MebibytesArrivesWhole) {
    SmallCamera small{.model = "SolvaneC2", .width = 4008, .height = 2672, .fullWell = 40000};
    CameraSession session(small.GetScenario());
    ASSERT_TRUE(session.IsOpen());
    ASSERT_EQ(CameraOk, session.GetCamera().SetBitDepth(14));
    ASSERT_EQ(CameraOk, session.GetCamera().UpdateSettingsOnCamera());
    ASSERT_GT(session.GetCamera().GetImageSize(), 1U << 24);

    ExpectAsComputed(session, small);
}

/// Checksums of the first frames that a camera of this seed sent, and the first image delivered.
/// Which frame that is depends on the client's speed: the noise goes by the frame's number.
std::map<std::uint32_t, std::uint64_t> GrabNoise(const char* seed) {
    CameraSession session(std::string(R"({"cameras": [{"model": "SolvaneA1", "seed": )") + seed +
                          R"(, "sensor": {"noise": true, "darkCurrent": 0}}]})");
    if (!session.IsOpen()) return {};
    ExpectAsSent(session, session.Grab());
    std::map<std::uint32_t, std::uint64_t> checksums;
    for (const TraceRecord& sent : session.world.ReadFrames()) {
        checksums[sent.rollingFrameNumber] = sent.checksum;
    }
    return checksums;
}

TEST(ImageContentTest, TheSameSeedGivesTheSameNoisyBytesInEachFrame) {
    const auto first = GrabNoise("5");
    const auto second = GrabNoise("5");
    const auto other = GrabNoise("6");

    ASSERT_TRUE(first.contains(1) && second.contains(1) && other.contains(1));
    for (const auto& [number, checksum] : first) {
        if (!second.contains(number)) continue;
        EXPECT_EQ(checksum, second.at(number)) << "frame " << number;
    }
    EXPECT_NE(first.at(1), other.at(1));
}

}  // namespace
}  // namespace ZV::Test
