#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <chrono>
#include <future>
#include <string>

#include "support/log_file.h"
#include "system/measuring_camera.h"

// Auto exposure as a client meets it: over the bus, on frames that the simulation has exposed.
namespace ZV::Test {
namespace {

using testing::ElementsAre;

constexpr std::uint64_t LeastNs = 10000;
constexpr std::uint64_t GreatestNs = 3600000000000;

std::string MakeFlatWorld(std::string_view base, double brightness, std::string_view light = "") {
    return R"({"base": ")" + std::string(base) +
           R"(", "cameras": [{"sensor": {"width": 64, "height": 48, "noise": false},
                "scene": {"kind": "flat", "brightness": )" +
           std::to_string(brightness) + std::string(light) + "}}]}";
}

/// Half of this light fills a sensor of 22000 electrons in 22 ms.
constexpr double Bright = 2e6;

struct Start {
    const char* name;
    double brightness;
    std::uint64_t exposureNs;
};

class StartOfAutoExposure : public MeasuringCamera, public testing::WithParamInterface<Start> {
  protected:
    StartOfAutoExposure() : MeasuringCamera(MakeFlatWorld("mono", GetParam().brightness)) {}
    void SetUp() override {
        ASSERT_NO_FATAL_FAILURE(MeasuringCamera::SetUp());
        ASSERT_NO_FATAL_FAILURE(Set64(zprm64Exposure, GetParam().exposureNs));
        ASSERT_NO_FATAL_FAILURE(Send());
    }
};

using StartWithinReach = StartOfAutoExposure;

TEST_P(StartWithinReach, EndsWithTheBrightestSampleBelowFullScale) {
    ASSERT_ZERR(zerrNone, Expose());

    EXPECT_LE(CountImages(), 10U);
    const int maximum = GrabMaximum();
    EXPECT_GE(maximum, 200);
    EXPECT_LE(maximum, 254);
    EXPECT_EQ(GetWide(ReadBack(), zprm64Exposure), GetWide(settings, zprm64Exposure));
}

INSTANTIATE_TEST_SUITE_P(
    Mono, StartWithinReach,
    testing::Values(Start{"Least", Bright, LeastNs}, Start{"AMillisecond", Bright, 1000000},
                    Start{"JustDark", Bright, 4300000}, Start{"JustMiddle", Bright, 8700000},
                    Start{"OnTarget", Bright, 21568627}, Start{"JustSaturated", Bright, 22100000},
                    Start{"ASecond", Bright, 1000000000}, Start{"Greatest", Bright, GreatestNs},
                    Start{"DimFromTheLeast", 1e4, LeastNs},
                    Start{"DimFromAMinute", 2e3, 60000000000},
                    Start{"GlareFromAMillisecond", 4e8, 1000000}),
    [](const testing::TestParamInfo<Start>& test) { return test.param.name; });

struct OutOfReach {
    const char* name;
    const char* base;
    double brightness;
    std::uint64_t exposureNs;
    std::uint64_t endNs;
    std::size_t images;
};

class StartOutOfReach : public MeasuringCamera, public testing::WithParamInterface<OutOfReach> {
  protected:
    StartOutOfReach() : MeasuringCamera(MakeFlatWorld(GetParam().base, GetParam().brightness)) {}
};

TEST_P(StartOutOfReach, EndsWhereTheLastPassOrALimitLeavesItWithoutAFailure) {
    ASSERT_NO_FATAL_FAILURE(Set64(zprm64Exposure, GetParam().exposureNs));
    ASSERT_NO_FATAL_FAILURE(Send());

    ASSERT_ZERR(zerrNone, Expose());

    EXPECT_EQ(CountImages(), GetParam().images);
    EXPECT_EQ(GetWide(settings, zprm64Exposure), GetParam().endNs);
    EXPECT_EQ(GetWide(ReadBack(), zprm64Exposure), GetParam().endNs);
}

INSTANTIATE_TEST_SUITE_P(
    MonoAndColour, StartOutOfReach,
    testing::Values(OutOfReach{"Glare", "mono", 2e8, GreatestNs, GreatestNs >> 20, 10},
                    OutOfReach{"Dark", "mono", 250, LeastNs, LeastNs << 20, 10},
                    OutOfReach{"GlareAtTheLeast", "mono", 2e13, 4 * LeastNs, LeastNs, 2},
                    OutOfReach{"BlackAtTheGreatest", "mono", 0, GreatestNs, GreatestNs, 1},
                    OutOfReach{"BlackBelowTheGreatest", "mono", 0, GreatestNs / 2, GreatestNs, 2},
                    OutOfReach{"GlareInColour", "colour", 2e8, GreatestNs, GreatestNs >> 20, 10},
                    OutOfReach{"DarkInColour", "colour", 250, LeastNs, LeastNs << 20, 10}),
    [](const testing::TestParamInfo<OutOfReach>& test) { return test.param.name; });

class AutoExposure : public LogFile, public MeasuringCamera {
  protected:
    AutoExposure() : MeasuringCamera(MakeFlatWorld("mono", Bright)) {}
};

TEST_F(AutoExposure, TestsItsArgumentsInOrder) {
    Zentara_Settings broken = settings;
    WriteField<std::uint32_t>(broken, 4 * SettingsMagicWord + 4, 1);
    EXPECT_ZERR(zerrBadParameter, Zentara_AutoExpose(nullptr, 0, 0, 0, 0));
    EXPECT_ZERR(zerrBadSettings, Zentara_AutoExpose(&broken, 0, 0, 0, 0));
    Zentara_Settings foreign = settings;
    for (const ZentaraHandle other : {ZentaraHandle{0}, handle + 8}) {
        SetHandleOf(foreign, other);
        EXPECT_ZERR(zerrBadSettings, Zentara_AutoExpose(&foreign, 0, 0, 0, 0));
    }
    EXPECT_ZERR(zerrRoiTooSmall, Zentara_AutoExpose(&settings, 0, 0, 0, 100));
    EXPECT_ZERR(zerrRoiTooSmall, Zentara_AutoExpose(&settings, 0, 0, 100, 0));
    EXPECT_ZERR(zerrRoiTooSmall, Zentara_AutoExpose(&settings, 0, 0, 15, 15));
    EXPECT_EQ(CountImages(), 0U);
    ASSERT_ZERR(zerrNone, Zentara_CloseCamera(handle));
    EXPECT_ZERR(zerrBadSettings, Zentara_AutoExpose(&settings, 0, 0, 100, 100));
    Zentara_ReleaseDriver();
    EXPECT_ZERR(zerrNotLoaded, Zentara_AutoExpose(nullptr, 0, 0, 0, 0));
    ASSERT_ZERR(zerrNone, Zentara_LoadDriver());
}

TEST_F(AutoExposure, TakesARegionThatIsTooSmallInOneDirectionAlone) {
    EXPECT_ZERR(zerrNone, Zentara_AutoExpose(&settings, 0, 0, 8, 100));
    EXPECT_ZERR(zerrNone, Zentara_AutoExpose(&settings, 0, 0, 16, 1));
}

TEST_F(AutoExposure, TakesARegionAnywhere) {
    constexpr std::uint32_t Most = 0xFFFFFFFF;
    EXPECT_ZERR(zerrNone, Zentara_AutoExpose(&settings, Most, Most, Most, Most));
    EXPECT_EQ(GetWide(settings, zprm64Exposure), GreatestNs) << "beyond the image all is black";
}

TEST_F(AutoExposure, PutsTheBitDepthBackAndKeepsTheFormat) {
    ASSERT_NO_FATAL_FAILURE(Set(zprmImageFormat, zfmtMono16));
    ASSERT_NO_FATAL_FAILURE(Send());
    ASSERT_ZERR(zerrNone, Expose());
    EXPECT_EQ(GetWord(ReadBack(), zprmImageFormat), zfmtMono16);
    Zentara_Frame frame{};
    (void)Grab(&frame);
    EXPECT_EQ(frame.format, zfmtMono16);
}

TEST_F(AutoExposure, TellsTheLogItsRegionAndWhatItHasFound) {
    (void)TakeMessages("Zentara_AutoExpose");
    ASSERT_ZERR(zerrNone, Zentara_AutoExpose(&settings, 1, 2, 63, 46));
    const std::string exposure = std::to_string(GetWide(settings, zprm64Exposure));
    EXPECT_THAT(
        TakeMessages("Zentara_AutoExpose"),
        ElementsAre("X:1  Y:2  Width:63  Height:46 ", "New red exposure: " + exposure + "  ns",
                    "New green exposure: " + exposure + "  ns",
                    "New blue exposure: " + exposure + "  ns"));

    EXPECT_ZERR(zerrBadParameter, Zentara_AutoExpose(nullptr, 0xFFFFFFFF, 0, 3, 4));
    EXPECT_THAT(TakeMessages("Zentara_AutoExpose").at(0), "X:-1  Y:0  Width:3  Height:4 ");
}

class FailedGrab : public MeasuringCamera, public testing::WithParamInterface<std::uint32_t> {
  protected:
    FailedGrab() : MeasuringCamera(MakeFlatWorld("mono", Bright)) {}
};

TEST_P(FailedGrab, KeptDoesNotFailAutoExposureWhichSendsTheExposureThatItHasThen) {
    constexpr std::uint64_t StartNs = 100000000000;
    ASSERT_NO_FATAL_FAILURE(Set64(zprm64Exposure, StartNs));
    ASSERT_NO_FATAL_FAILURE(Set(zprmImageFormat, zfmtMono16));
    ASSERT_NO_FATAL_FAILURE(Send());
    ASSERT_TRUE(world.AddFault(R"({"kind": "failRequest", "code": "FW_IOCTL_ALLOC_BANDWIDTH",
                                   "request": )" +
                               std::to_string(GetParam()) + "}"));

    ASSERT_ZERR(zerrNone, Expose());

    EXPECT_EQ(CountImages(), GetParam() - 1);
    EXPECT_EQ(GetWide(settings, zprm64Exposure), StartNs >> 2 * (GetParam() - 1));
    EXPECT_EQ(GetWord(ReadBack(), zprmImageFormat), zfmtMono16) << "sent with the block";
    ASSERT_ZERR(zerrNone, Expose()) << "the next call works";
    ASSERT_NO_FATAL_FAILURE(Set(zprmImageFormat, zfmtMono8));
    ASSERT_NO_FATAL_FAILURE(Send());
    const int maximum = GrabMaximum();
    EXPECT_GE(maximum, 200);
    EXPECT_LE(maximum, 254);
}

INSTANTIATE_TEST_SUITE_P(AtEachPass, FailedGrab, testing::Range(1U, 5U));

TEST_F(AutoExposure, SurvivesACameraThatVanishesAtAnyRequestAndWorksWhenItIsBack) {
    for (std::uint32_t request = 1; request < 24; ++request) {
        ASSERT_NO_FATAL_FAILURE(Set64(zprm64Exposure, 1000000000));
        ASSERT_NO_FATAL_FAILURE(Send());
        ASSERT_TRUE(world.AddFault(R"({"kind": "unplug", "code": "FW_IOCTL_ASYNC_WRITE",
                                       "request": )" +
                                   std::to_string(request) + "}"));
        EXPECT_ZERR(zerrNone, Expose()) << request;
        ASSERT_NO_FATAL_FAILURE(Reopen()) << request;
    }
    ASSERT_ZERR(zerrNone, Expose());
    EXPECT_GE(GrabMaximum(), 200);
}

TEST_F(AutoExposure, EndsByAnAbortWhenTheCameraVanishesInTheMiddleOfAnImage) {
    ASSERT_NO_FATAL_FAILURE(Set64(zprm64Exposure, 100000));
    ASSERT_NO_FATAL_FAILURE(Send());
    auto running = std::async(
        std::launch::async, [this] { return Zentara_AutoExpose(&settings, 0, 0, Width, Height); });
    ASSERT_TRUE(WaitUntil([this] { return CountImages() > 0; }));
    ASSERT_TRUE(world.Unplug());
    // A pass that begins behind the end of the device fails by itself.
    const bool hasEnded = WaitUntil([&] {
        (void)Zentara_Abort(handle);
        return running.wait_for(std::chrono::seconds(0)) == std::future_status::ready;
    });
    EXPECT_TRUE(hasEnded);
    EXPECT_ZERR(zerrNone, running.get());
    ASSERT_NO_FATAL_FAILURE(Reopen());
    EXPECT_ZERR(zerrNone, Expose()) << "the next call works";
}

}  // namespace
}  // namespace ZV::Test
