#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <cmath>
#include <future>
#include <string>
#include <tuple>

#include "support/log_file.h"
#include "system/measuring_camera.h"

// White balance as a client meets it: a chart under coloured light, measured over its greys.
namespace ZV::Test {
namespace {

using testing::Contains;
using testing::ElementsAre;
using testing::Not;

/// Six patches by four of 32 pixels; the last row is grey.
constexpr std::uint32_t ChartWidth = 192;
constexpr std::uint32_t ChartHeight = 128;
constexpr std::uint32_t PatchSide = 32;
constexpr std::uint32_t GreyRow = 3;
/// An interpolated pixel looks no further than this over the edge of its patch.
constexpr std::uint32_t Margin = 4;

std::string MakeChartWorld(std::string_view base, std::string_view light) {
    return R"({"base": ")" + std::string(base) +
           R"(", "cameras": [{"sensor": {"width": 192, "height": 128, "noise": false},
                "scene": {"kind": "chart", "brightness": 400000, "light": )" +
           std::string(light) + "}}]}";
}

constexpr std::string_view WarmLight = "[1.3, 1.0, 0.8]";

/// The darkest mean that is in band.
constexpr double BandBegin = 80;

/// Samples are rounded and means truncated: a mean lies at most 1.5 below the light and 0.5 above
/// it, which makes 2 of the darker mean for a quotient of two. A gain is truncated to thousandths.
constexpr double GetGainTolerance(double gain, double darkestMean) {
    return gain * 2 / darkestMean + 0.001;
}

using Colour = std::array<double, 3>;

class ChartCamera : public LogFile, public MeasuringCamera {
  protected:
    explicit ChartCamera(std::string_view base, std::string_view light = WarmLight)
        : MeasuringCamera(MakeChartWorld(base, light)) {}

    /// Over the second and the third grey.
    ZentaraResult BalanceOverGreys() {
        return Balance(PatchSide + Margin, GreyRow * PatchSide + Margin, 2 * PatchSide - 2 * Margin,
                       PatchSide - 2 * Margin);
    }
    /// An exposure at which the means of the greys lie in band.
    void ExposeForBand() {
        ASSERT_ZERR(zerrNone, Finish([this] {
                        return Zentara_AutoExpose(&settings, PatchSide + Margin,
                                                  GreyRow * PatchSide + Margin,
                                                  PatchSide - 2 * Margin, PatchSide - 2 * Margin);
                    }));
        ASSERT_NO_FATAL_FAILURE(Set64(zprm64Exposure, GetWide(settings, zprm64Exposure) * 3 / 4));
        ASSERT_NO_FATAL_FAILURE(Send());
    }
    void ExposeFor(std::uint64_t nanoseconds) {
        ASSERT_NO_FATAL_FAILURE(Set64(zprm64Exposure, nanoseconds));
        ASSERT_NO_FATAL_FAILURE(Send());
    }

    std::vector<std::uint8_t> GrabChart(Zentara_Frame* frame) {
        std::vector<std::uint8_t> pixels(std::size_t{ChartWidth} * ChartHeight * 8);
        frame->pBuffer = pixels.data();
        frame->bufferSize = static_cast<std::uint32_t>(pixels.size());
        EXPECT_ZERR(zerrNone, Finish([&] { return Zentara_GrabFrame(handle, frame); }));
        return pixels;
    }
    /// Mean of a grey patch in a finished image of `RGB24`.
    static Colour MeanOfGrey(const std::vector<std::uint8_t>& pixels, std::uint32_t column) {
        Colour mean{};
        constexpr std::uint32_t Side = PatchSide - 2 * Margin;
        for (std::uint32_t y = 0; y < Side; ++y) {
            for (std::uint32_t x = 0; x < Side; ++x) {
                const std::size_t pixel =
                    (std::size_t{GreyRow} * PatchSide + Margin + y) * ChartWidth +
                    column * PatchSide + Margin + x;
                for (std::size_t c = 0; c < 3; ++c) mean[c] += pixels[3 * pixel + c];
            }
        }
        for (double& value : mean) value /= Side * Side;
        return mean;
    }
};

class MosaicUnderWarmLight : public ChartCamera {
  protected:
    MosaicUnderWarmLight() : ChartCamera("colour") {}
    void SetUp() override {
        ASSERT_NO_FATAL_FAILURE(ChartCamera::SetUp());
        ASSERT_NO_FATAL_FAILURE(Set(zprmPostProcessImageFormat, zfmtRGB24));
        ASSERT_NO_FATAL_FAILURE(Set(zprmDoPostProcessing, 1));
        ASSERT_NO_FATAL_FAILURE(Send());
    }
    /// Means are truncated, at most one of 80, on both sides of a quotient; gains are truncated to
    /// thousandths twice; samples are rounded before the scale and truncated after it.
    static double GetTolerance(double sample, double scale) {
        return sample * (1.0 / 80 + 2.0 / (1000 * scale)) + 0.5 * scale + 0.5 + 1;
    }
};

TEST_F(MosaicUnderWarmLight, HasGreyGreysAfterOneImageInBand) {
    ASSERT_NO_FATAL_FAILURE(ExposeForBand());
    const std::size_t before = CountImages();

    ASSERT_ZERR(zerrNone, BalanceOverGreys());

    EXPECT_EQ(CountImages() - before, 1U);
    const double redScale = GetWord(settings, zprmPostProcessGainRed) / 1000.0;
    const double blueScale = GetWord(settings, zprmPostProcessGainBlue) / 1000.0;
    EXPECT_NEAR(redScale, 1 / 1.3, 1.0 / 80 + 0.002);
    EXPECT_NEAR(blueScale, 1 / 0.8, 1.25 / 80 + 0.002);
    EXPECT_EQ(GetWord(settings, zprmPostProcessGainGreen), 1000U);
    Zentara_Frame frame{};
    const std::vector<std::uint8_t> pixels = GrabChart(&frame);
    ASSERT_EQ(frame.format, zfmtRGB24);
    // The first patch, the white, is saturated.
    for (const std::uint32_t column : {1U, 2U, 3U, 4U, 5U}) {
        const Colour mean = MeanOfGrey(pixels, column);
        EXPECT_NEAR(mean[0], mean[1], GetTolerance(mean[1], redScale)) << "patch " << column;
        EXPECT_NEAR(mean[2], mean[1], GetTolerance(mean[1], blueScale)) << "patch " << column;
    }
}

TEST_F(MosaicUnderWarmLight, IsBalancedThroughSixImagesWhenItIsTooDarkForTheBand) {
    ASSERT_NO_FATAL_FAILURE(ExposeForBand());
    ASSERT_NO_FATAL_FAILURE(ExposeFor(GetWide(settings, zprm64Exposure) / 2));
    const std::size_t before = CountImages();

    ASSERT_ZERR(zerrNone, BalanceOverGreys());

    EXPECT_EQ(CountImages() - before, 6U);
    // At least 200 in the red of the first patch before it is taken three eighths of: 60 in the
    // mean with the second one, and 46 in green.
    EXPECT_NEAR(GetWord(settings, zprmPostProcessGainRed) / 1000.0, 1 / 1.3,
                GetGainTolerance(1 / 1.3, 46));
}

TEST_F(MosaicUnderWarmLight, IsBalancedInEveryFormatAndDepth) {
    ASSERT_NO_FATAL_FAILURE(ExposeForBand());
    for (const std::uint32_t imageFormat : {zfmtBayer8, zfmtBayer16}) {
        for (const std::uint32_t format :
             {zfmtBGR24, zfmtXRGB32, zfmtRGB48, zfmtBGRX32, zfmtRGB24}) {
            ASSERT_NO_FATAL_FAILURE(Set(zprmImageFormat, imageFormat));
            ASSERT_NO_FATAL_FAILURE(Set(zprmPostProcessImageFormat, format));
            ASSERT_NO_FATAL_FAILURE(Set(zprmPostProcessGainRed, 4000));
            ASSERT_NO_FATAL_FAILURE(Send());
            ASSERT_ZERR(zerrNone, BalanceOverGreys()) << imageFormat << " " << format;
            // Twelve bits stand in the low bits of their words: never in band, and balanced all the
            // same.
            EXPECT_NEAR(GetWord(settings, zprmPostProcessGainRed) / 1000.0, 1 / 1.3,
                        GetGainTolerance(1 / 1.3, BandBegin))
                << imageFormat << " " << format;
            EXPECT_EQ(GetWord(ReadBack(), zprmPostProcessImageFormat), format)
                << "the format in force is back";
        }
    }
}

TEST_F(MosaicUnderWarmLight, KeptReadsGainsBackThatAreTruncatedOnceMore) {
    for (const std::uint32_t key :
         {zprmPostProcessGainRed, zprmPostProcessGainGreen, zprmPostProcessGainBlue}) {
        ASSERT_NO_FATAL_FAILURE(Set(key, 251));
        ASSERT_NO_FATAL_FAILURE(Send());
        EXPECT_EQ(GetWord(ReadBack(), key), 250U);
    }
}

TEST_F(MosaicUnderWarmLight, KeptTakesOneImageAndFailsWhenTheFormatDoesNotResolveTheMosaic) {
    for (const std::uint32_t format : {zfmtBayer8, zfmtBayer16, zfmtRGBPlane8, zfmtRGBPlane16}) {
        SetWord(settings, zprmPostProcessImageFormat, format);
        ASSERT_NO_FATAL_FAILURE(Send());
        const std::size_t before = CountImages();
        EXPECT_ZERR(zerrDriverFault, BalanceOverGreys()) << format;
        EXPECT_EQ(CountImages() - before, 1U) << format;
        EXPECT_EQ(GetWord(ReadBack(), zprmPostProcessImageFormat), format) << "still in force";
    }
}

TEST_F(MosaicUnderWarmLight, DoesNothingForAFormatThatIsNotOfColour) {
    (void)TakeMessages("Zentara_WhiteBalance");
    for (const std::uint32_t format : {0U, 1U, 2U, 3U, 13U, 99U}) {
        SetWord(settings, zprmPostProcessImageFormat, format);
        const Zentara_Settings before = settings;
        const std::size_t requests = world.ReadRegisterWrites().size();

        EXPECT_ZERR(zerrNone, Balance(0, 0, 100, 100));

        EXPECT_EQ(world.ReadRegisterWrites().size(), requests);
        EXPECT_TRUE(AreSameBytes(settings, before));
        EXPECT_THAT(TakeMessages("Zentara_WhiteBalance"),
                    ElementsAre("X:0  Y:0  Width:100  Height:100 ",
                                "Output image format:" + std::to_string(format) + " ",
                                "Post processing image format is not colour so returning success "
                                "without white balancing"));
    }
}

TEST_F(MosaicUnderWarmLight, TestsItsArgumentsInOrder) {
    Zentara_Settings broken = settings;
    WriteField<std::uint32_t>(broken, 4 * SettingsMagicWord + 4, 1);
    EXPECT_ZERR(zerrBadParameter, Zentara_WhiteBalance(nullptr, 0, 0, 0, 0));
    EXPECT_ZERR(zerrBadSettings, Zentara_WhiteBalance(&broken, 0, 0, 0, 0));
    Zentara_Settings foreign = settings;
    for (const ZentaraHandle other : {ZentaraHandle{0}, handle + 8}) {
        SetHandleOf(foreign, other);
        EXPECT_ZERR(zerrBadSettings, Zentara_WhiteBalance(&foreign, 0, 0, 0, 0));
    }
    SetWord(settings, zprmPostProcessImageFormat, zfmtMono8);
    EXPECT_ZERR(zerrRoiTooSmall, Zentara_WhiteBalance(&settings, 0, 0, 0, 100));
    EXPECT_ZERR(zerrRoiTooSmall, Zentara_WhiteBalance(&settings, 0, 0, 100, 0));
    EXPECT_ZERR(zerrRoiTooSmall, Zentara_WhiteBalance(&settings, 0, 0, 8, 8));
    EXPECT_ZERR(zerrRoiTooSmall, Zentara_WhiteBalance(&settings, 0, 0, 15, 15));
    EXPECT_ZERR(zerrNone, Zentara_WhiteBalance(&settings, 0, 0, 8, 100));
    EXPECT_ZERR(zerrNone, Zentara_WhiteBalance(&settings, 0, 0, 16, 1));
    EXPECT_EQ(CountImages(), 0U);
    ASSERT_ZERR(zerrNone, Zentara_CloseCamera(handle));
    EXPECT_ZERR(zerrBadSettings, Zentara_WhiteBalance(&settings, 0, 0, 100, 100));
    Zentara_ReleaseDriver();
    EXPECT_ZERR(zerrNotLoaded, Zentara_WhiteBalance(nullptr, 0, 0, 0, 0));
    ASSERT_ZERR(zerrNone, Zentara_LoadDriver());
}

TEST_F(MosaicUnderWarmLight, TakesARegionOf8By100AndOneAnywhere) {
    EXPECT_ZERR(zerrNone, Balance(0, 0, 8, 100));
    constexpr std::uint32_t Most = 0xFFFFFFFF;
    EXPECT_ZERR(zerrNone, Balance(Most, Most, Most, Most));
    EXPECT_EQ(GetWord(settings, zprmPostProcessGainRed), 0U) << "black: no number, 0 as a gain";
    EXPECT_EQ(GetWord(settings, zprmPostProcessGainGreen), 1000U);
}

TEST_F(MosaicUnderWarmLight, TellsTheLogItsRegionAndItsGains) {
    ASSERT_NO_FATAL_FAILURE(ExposeForBand());
    (void)TakeMessages("Zentara_WhiteBalance");
    ASSERT_ZERR(zerrNone, BalanceOverGreys());
    EXPECT_THAT(
        TakeMessages("Zentara_WhiteBalance"),
        ElementsAre(
            "X:36  Y:100  Width:56  Height:24 ", "Output image format:12 ",
            "New red gain: " + std::to_string(GetWord(settings, zprmPostProcessGainRed)) + " ",
            "New green gain: 1000 ",
            "New blue gain: " + std::to_string(GetWord(settings, zprmPostProcessGainBlue)) + " "));
    EXPECT_ZERR(zerrBadParameter, Zentara_WhiteBalance(nullptr, 1, 2, 3, 4));
    EXPECT_THAT(TakeMessages("Zentara_WhiteBalance"),
                ElementsAre("X:1  Y:2  Width:3  Height:4 ", "Output image format:0 "));
}

TEST_F(MosaicUnderWarmLight, EndsWithTheFailureOfAGrabAndWorksTheNextTime) {
    ASSERT_NO_FATAL_FAILURE(ExposeForBand());
    ASSERT_NO_FATAL_FAILURE(ExposeFor(GetWide(settings, zprm64Exposure) / 4));
    for (std::uint32_t pass = 1; pass <= 6; ++pass) {
        const Zentara_Settings before = settings;
        const std::size_t images = CountImages();
        ASSERT_TRUE(world.AddFault(R"({"kind": "failRequest", "code": "FW_IOCTL_ALLOC_BANDWIDTH",
                                       "request": )" +
                                   std::to_string(pass) + "}"));

        EXPECT_ZERR(zerrCameraBusy, BalanceOverGreys());

        EXPECT_EQ(CountImages() - images, pass - 1);
        EXPECT_TRUE(AreSameBytes(settings, before));
        EXPECT_ZERR(zerrNone, BalanceOverGreys());
    }
}

TEST_F(MosaicUnderWarmLight, SurvivesACameraThatVanishesAndWorksWhenItIsBack) {
    for (std::uint32_t request = 1; request < 24; ++request) {
        ASSERT_TRUE(world.AddFault(R"({"kind": "unplug", "code": "FW_IOCTL_ASYNC_WRITE",
                                       "request": )" +
                                   std::to_string(request) + "}"));
        EXPECT_THAT(BalanceOverGreys(), Not(zerrNone)) << request;
        ASSERT_NO_FATAL_FAILURE(Reopen()) << request;
        ASSERT_NO_FATAL_FAILURE(Set(zprmPostProcessImageFormat, zfmtRGB24));
        ASSERT_NO_FATAL_FAILURE(ExposeFor(2000000));
    }
    EXPECT_ZERR(zerrNone, BalanceOverGreys());
}

TEST_F(MosaicUnderWarmLight, IsBalancedAndExposedByTwoThreadsOneAfterTheOther) {
    ASSERT_NO_FATAL_FAILURE(ExposeForBand());
    Zentara_Settings other = settings;
    auto exposing = std::async(std::launch::async, [&] {
        return Zentara_AutoExpose(&other, 0, 0, ChartWidth, ChartHeight);
    });
    EXPECT_ZERR(zerrNone, BalanceOverGreys());
    EXPECT_ZERR(zerrNone, Finish([&] { return exposing.get(); }));
    // Whichever comes first, red and green are as bright as the band asks for.
    EXPECT_NEAR(GetWord(settings, zprmPostProcessGainRed) / 1000.0, 1 / 1.3,
                GetGainTolerance(1 / 1.3, BandBegin));
}

TEST_F(MosaicUnderWarmLight, EndsByAnAbortWhenTheCameraVanishesInTheMiddleOfAnImage) {
    ASSERT_NO_FATAL_FAILURE(ExposeFor(100000));
    auto running = std::async(std::launch::async, [this] {
        return Zentara_WhiteBalance(&settings, 0, 0, ChartWidth, ChartHeight);
    });
    ASSERT_TRUE(WaitUntil([this] { return CountImages() > 0; }));
    ASSERT_TRUE(world.Unplug());
    // A pass that begins behind the end of the device fails by itself.
    const bool hasEnded = WaitUntil([&] {
        (void)Zentara_Abort(handle);
        return running.wait_for(std::chrono::seconds(0)) == std::future_status::ready;
    });
    EXPECT_TRUE(hasEnded);
    (void)running.get();  // Six images may all have come before the end.
    ASSERT_NO_FATAL_FAILURE(Reopen());
    ASSERT_NO_FATAL_FAILURE(Set(zprmPostProcessImageFormat, zfmtRGB24));
    ASSERT_NO_FATAL_FAILURE(Send());
    EXPECT_ZERR(zerrNone, BalanceOverGreys()) << "the next call works";
}

class MosaicWithoutRedLight : public ChartCamera {
  protected:
    MosaicWithoutRedLight() : ChartCamera("colour", "[0, 1.0, 1.0]") {}
};

TEST_F(MosaicWithoutRedLight, HasTheGreatestGainForRed) {
    ASSERT_NO_FATAL_FAILURE(Set(zprmPostProcessImageFormat, zfmtRGB24));
    ASSERT_NO_FATAL_FAILURE(ExposeFor(2000000));
    (void)TakeMessages("Zentara_WhiteBalance");

    // Half of the region is greys, the other is black beyond the image: without light red is 1, of
    // which the mean is then 0, and that of the others is not.
    constexpr std::uint32_t Rows = PatchSide - Margin;
    ASSERT_ZERR(zerrNone, Balance(PatchSide + Margin, ChartHeight - Rows,
                                  2 * PatchSide - 2 * Margin, 2 * Rows));

    EXPECT_EQ(GetWord(settings, zprmPostProcessGainRed), 0xFFFFFFFF);
    EXPECT_EQ(GetWord(settings, zprmPostProcessGainGreen), 1000U);
    EXPECT_THAT(TakeMessages("Zentara_WhiteBalance"), Contains("New red gain: -1 "));
}

class MosaicOfAutoExposure : public ChartCamera, public testing::WithParamInterface<std::uint64_t> {
  protected:
    MosaicOfAutoExposure() : ChartCamera("colour") {}
};

TEST_P(MosaicOfAutoExposure, HasItsBrightestSampleBelowFullScaleAtTheEnd) {
    ASSERT_NO_FATAL_FAILURE(Set(zprmPostProcessImageFormat, zfmtRGB48));
    ASSERT_NO_FATAL_FAILURE(ExposeFor(GetParam()));
    const auto expose = [this] {
        return Zentara_AutoExpose(&settings, 0, 0, ChartWidth, ChartHeight);
    };
    ASSERT_ZERR(zerrNone, Finish(expose));

    EXPECT_LE(CountImages(), 10U);
    Zentara_Frame frame{};
    const std::vector<std::uint8_t> pixels = GrabChart(&frame);
    const int maximum = *std::max_element(pixels.begin(), pixels.begin() + frame.size);
    EXPECT_GE(maximum, 200);
    EXPECT_LE(maximum, 254);
    EXPECT_EQ(GetWord(ReadBack(), zprmPostProcessImageFormat), zfmtRGB48);
}

INSTANTIATE_TEST_SUITE_P(From, MosaicOfAutoExposure,
                         testing::Values(10000U, 1000000U, 30000000U, 1000000000U, 100000000000U));

class MonochromeCamera : public ChartCamera {
  protected:
    MonochromeCamera() : ChartCamera("mono") {}
};

TEST_F(MonochromeCamera, CannotBeBalancedAndKeepsItsBlock) {
    SetWord(settings, zprmPostProcessImageFormat, zfmtRGB24);
    const Zentara_Settings before = settings;
    EXPECT_ZERR(zerrDriverFault, Balance(0, 0, 100, 100));
    EXPECT_EQ(CountImages(), 1U);
    EXPECT_TRUE(AreSameBytes(settings, before));
}

class WheelUnderWarmLight : public ChartCamera {
  protected:
    WheelUnderWarmLight() : ChartCamera("wheel") {}
    void SetUp() override {
        ASSERT_NO_FATAL_FAILURE(ChartCamera::SetUp());
        ASSERT_NO_FATAL_FAILURE(Set(zprmImageFormat, zfmtRGB24));
        ASSERT_NO_FATAL_FAILURE(Set(zprmPostProcessImageFormat, zfmtRGB24));
        ASSERT_NO_FATAL_FAILURE(ExposeColoursFor(40000000));
    }
    void ExposeColoursFor(std::uint64_t nanoseconds) {
        ASSERT_NO_FATAL_FAILURE(ExposeColoursFor(nanoseconds, nanoseconds, nanoseconds));
    }
    void ExposeColoursFor(std::uint64_t red, std::uint64_t green, std::uint64_t blue) {
        ASSERT_NO_FATAL_FAILURE(Set64(zprm64ExposureRed, red));
        ASSERT_NO_FATAL_FAILURE(Set64(zprm64ExposureBlue, blue));
        ASSERT_NO_FATAL_FAILURE(ExposeFor(green));
    }
    /// Start colours that were written to the camera, one after the other.
    std::vector<std::uint32_t> FindStartColours() const {
        constexpr std::uint32_t Address =
            Simulation::ControlAddress + 4 * ControlFilterStartColour.quadlet;
        std::vector<std::uint32_t> colours;
        for (const RegisterWrite& write : world.ReadRegisterWrites()) {
            const std::size_t offset = (Address - write.address) / 4;
            if (write.address > Address || offset >= write.values.size()) continue;
            const std::uint32_t colour =
                ExtractField(ControlFilterStartColour, write.values[offset]);
            if (colours.empty() || colours.back() != colour) colours.push_back(colour);
        }
        return colours;
    }
};

TEST_F(WheelUnderWarmLight, TakesItsColoursWithExposuresThatMakeThemGrey) {
    ASSERT_ZERR(zerrNone, BalanceOverGreys());

    const double green = static_cast<double>(GetWide(settings, zprm64Exposure));
    EXPECT_EQ(GetWide(settings, zprm64Exposure), 40000000U);
    EXPECT_LT(CountImages(), 6U) << "the last image is in band";
    EXPECT_NEAR(static_cast<double>(GetWide(settings, zprm64ExposureRed)) / green, 1 / 1.3,
                GetGainTolerance(1 / 1.3, BandBegin));
    EXPECT_NEAR(static_cast<double>(GetWide(settings, zprm64ExposureBlue)) / green, 1 / 0.8,
                GetGainTolerance(1 / 0.8, BandBegin));
    const Zentara_Settings back = ReadBack();
    for (const std::uint32_t key : {zprm64Exposure, zprm64ExposureRed, zprm64ExposureBlue}) {
        EXPECT_EQ(GetWide(back, key), GetWide(settings, key)) << key;
    }
    Zentara_Frame frame{};
    const std::vector<std::uint8_t> pixels = GrabChart(&frame);
    ASSERT_EQ(frame.format, zfmtRGB24);
    for (const std::uint32_t column : {1U, 2U, 3U}) {
        const Colour mean = MeanOfGrey(pixels, column);
        // As exact as the exposures, and rounded on both sides.
        const double tolerance = mean[1] * 2 / BandBegin + 1;
        EXPECT_NEAR(mean[0], mean[1], tolerance) << "patch " << column;
        EXPECT_NEAR(mean[2], mean[1], tolerance) << "patch " << column;
    }
}

TEST_F(WheelUnderWarmLight, KeptHasTheScalesOfItsImageInExposuresAndGainsAlike) {
    constexpr std::uint64_t StartNs = 60000000;  // In band.
    ASSERT_NO_FATAL_FAILURE(ExposeColoursFor(StartNs));

    ASSERT_ZERR(zerrNone, BalanceOverGreys());

    EXPECT_EQ(CountImages(), 1U);
    for (const auto& [gain, exposure, light] :
         {std::tuple{zprmPostProcessGainRed, zprm64ExposureRed, 1.3},
          std::tuple{zprmPostProcessGainBlue, zprm64ExposureBlue, 0.8}}) {
        const double scale = GetWord(settings, gain) / 1000.0;
        EXPECT_NEAR(scale, 1 / light, GetGainTolerance(1 / light, BandBegin));
        EXPECT_NEAR(static_cast<double>(GetWide(settings, exposure)) / StartNs, scale, 0.001)
            << "a correction is made twice where frames are balanced";
    }
}

TEST_F(WheelUnderWarmLight, TellsTheLogItsExposures) {
    (void)TakeMessages("Zentara_WhiteBalance");
    ASSERT_ZERR(zerrNone, BalanceOverGreys());
    const std::vector<std::string> messages = TakeMessages("Zentara_WhiteBalance");
    ASSERT_EQ(messages.size(), 8U);
    const auto text = [&](std::uint32_t key) { return std::to_string(GetWide(settings, key)); };
    EXPECT_EQ(messages[5], "New red exposure: " + text(zprm64ExposureRed) + "  ns");
    EXPECT_EQ(messages[6], "New green exposure: " + text(zprm64Exposure) + "  ns");
    EXPECT_EQ(messages[7], "New blue exposure: " + text(zprm64ExposureBlue) + "  ns");
}

TEST_F(WheelUnderWarmLight, IsHeldAtGreenWhileItsExposureIsFoundAndCyclesAgainAfterwards) {
    constexpr std::uint64_t StartNs = 1000000;
    constexpr std::uint64_t RedNs = 15000000;
    constexpr std::uint64_t BlueNs = 70000000;
    constexpr std::uint32_t Blue = 3;
    ASSERT_NO_FATAL_FAILURE(Set(zprmColorWheel, Blue));
    ASSERT_NO_FATAL_FAILURE(ExposeColoursFor(RedNs, StartNs, BlueNs));
    // A block that says another colour tells what the search puts back from what is sent behind it.
    ASSERT_NO_FATAL_FAILURE(Set(zprmColorWheel, 0));
    const std::size_t coloursBefore = FindStartColours().size();
    (void)TakeMessages("Zentara_AutoExpose");
    const std::size_t framesBefore = world.ReadFrames().size();

    ASSERT_ZERR(zerrNone, Finish([this] {
                    return Zentara_AutoExpose(&settings, 0, 0, ChartWidth, ChartHeight);
                }));

    const std::vector<TraceRecord> frames = world.ReadFrames();
    ASSERT_GT(frames.size(), framesBefore);
    for (std::size_t n = framesBefore; n < frames.size(); ++n) {
        EXPECT_EQ(frames[n].plane, 1U) << "frame " << n;
    }
    EXPECT_EQ(GetWord(ReadBack(), zprmImageFormat), zfmtRGB24) << "it cycles";
    EXPECT_EQ(GetWide(ReadBack(), zprm64ExposureRed), GetWide(settings, zprm64ExposureRed));
    std::vector<std::uint32_t> colours = FindStartColours();
    colours.erase(colours.begin(), colours.begin() + static_cast<std::ptrdiff_t>(coloursBefore));
    EXPECT_THAT(colours, ElementsAre(1, Blue, 0)) << "green, the one before, that of the block";
    const std::uint64_t red = GetWide(settings, zprm64ExposureRed);
    const std::uint64_t green = GetWide(settings, zprm64Exposure);
    const std::uint64_t blue = GetWide(settings, zprm64ExposureBlue);
    EXPECT_GT(green, 4 * StartNs);
    // The last step alone, which is no more than a tenth, moves both.
    const auto step = static_cast<double>(red) - static_cast<double>(RedNs);
    EXPECT_EQ(static_cast<double>(blue) - static_cast<double>(BlueNs), step);
    EXPECT_LE(std::abs(step), 0.12 * static_cast<double>(green));
    const std::vector<std::string> messages = TakeMessages("Zentara_AutoExpose");
    ASSERT_EQ(messages.size(), 4U);
    EXPECT_EQ(messages[1], "New red exposure: " + std::to_string(red) + "  ns");
    EXPECT_EQ(messages[2], "New green exposure: " + std::to_string(green) + "  ns");
    EXPECT_EQ(messages[3], "New blue exposure: " + std::to_string(blue) + "  ns");
}

TEST_F(WheelUnderWarmLight, CyclesAgainAfterAFailedGrabByTheBlockThatIsSent) {
    constexpr std::uint32_t Blue = 3;
    ASSERT_NO_FATAL_FAILURE(Set(zprmColorWheel, Blue));
    ASSERT_NO_FATAL_FAILURE(ExposeColoursFor(2000000, 1000000, 3000000));
    ASSERT_TRUE(world.AddFault(
        R"({"kind": "failRequest", "code": "FW_IOCTL_ALLOC_BANDWIDTH", "request": 2})"));

    ASSERT_ZERR(zerrNone, Finish([this] {
                    return Zentara_AutoExpose(&settings, 0, 0, ChartWidth, ChartHeight);
                }));

    EXPECT_EQ(CountImages(), 1U);
    const Zentara_Settings back = ReadBack();
    EXPECT_EQ(GetWord(back, zprmImageFormat), zfmtRGB24) << "it cycles";
    EXPECT_EQ(GetWord(back, zprmColorWheel), Blue);
    EXPECT_EQ(GetWide(back, zprm64Exposure), 4000000U) << "one step";
    EXPECT_EQ(GetWide(back, zprm64ExposureRed), GetWide(settings, zprm64ExposureRed));
    EXPECT_EQ(GetWide(back, zprm64ExposureBlue), GetWide(settings, zprm64ExposureBlue));
    EXPECT_ZERR(zerrNone, BalanceOverGreys()) << "the next call works";
}

}  // namespace
}  // namespace ZV::Test
