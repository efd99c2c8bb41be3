#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <string>
#include <vector>

#include "support/log_file.h"
#include "system/single_frame.h"

namespace ZV::Test {
namespace {

using testing::ElementsAre;
using testing::HasSubstr;
using Texts = std::vector<std::string>;

constexpr const char* Function = "Zentara_PostProcessSingleFrame";
constexpr const char* Taken = "Another process has this camera open.";

class LoggedSingleFrame : public LogFile, public SingleFrame {
  protected:
    explicit LoggedSingleFrame(std::string_view scenario = SmallColour)
        : LogFile("outputFrame = 1\n"), SingleFrame(scenario) {}

    static Texts::const_iterator FindFrame(const Texts& texts) {
        return std::find_if(texts.begin(), texts.end(), [](const std::string& text) {
            return text.find("Zentara_Frame structure:") != std::string::npos;
        });
    }
};

TEST_F(LoggedSingleFrame, AFinishedFrameIsShownBetweenStartAndEnd) {
    OwnedFrame mosaic = GrabMosaic();
    OwnedFrame target = MakeTarget(mosaic, zfmtXRGB32);
    target->frameNumber = 77;
    Zentara_Settings block = MakeBlock(zfmtXRGB32, zbayerFast);
    (void)TakeTexts();

    ASSERT_ZERR(zerrNone,
                Zentara_PostProcessSingleFrame(handle, &block, mosaic.Get(), target.Get()));

    const Texts texts = TakeTexts();
    ASSERT_GE(texts.size(), 14u);
    EXPECT_THAT(texts.front(), HasSubstr("Zentara_PostProcessSingleFrame start"));
    EXPECT_THAT(texts.back(), HasSubstr("Zentara_PostProcessSingleFrame end (error code 0)"));
    const auto shown = FindFrame(texts);
    ASSERT_GE(texts.end() - shown, 13) << "twelve lines and the end";
    EXPECT_THAT(shown[2], HasSubstr("Buffer size: 12288"));
    EXPECT_THAT(shown[3], HasSubstr("Format: 9"));
    EXPECT_THAT(shown[4], HasSubstr("Width: 64"));
    EXPECT_THAT(shown[5], HasSubstr("Height: 48"));
    EXPECT_THAT(shown[6], HasSubstr("Size: 12288"));
    EXPECT_THAT(shown[7], HasSubstr("Bit Depth: 8"));
    EXPECT_THAT(shown[8], HasSubstr("Frame Number: 77")) << "the frame as it leaves";
}

TEST_F(LoggedSingleFrame, ACopiedFrameIsNotShown) {
    OwnedFrame mosaic = GrabMosaic();
    mosaic->format = zfmtMono8;
    OwnedFrame target = MakeTarget(mosaic, zfmtMono8);
    Zentara_Settings block = MakeBlock(zfmtXRGB32, zbayerFast);
    (void)TakeTexts();

    ASSERT_ZERR(zerrNone,
                Zentara_PostProcessSingleFrame(handle, &block, mosaic.Get(), target.Get()));

    const Texts texts = TakeTexts();
    EXPECT_THAT(texts, ElementsAre(HasSubstr("Zentara_PostProcessSingleFrame start"),
                                   HasSubstr("Zentara_PostProcessSingleFrame end (error code 0)")));
}

TEST_F(LoggedSingleFrame, AClosedCameraIsSaidToBelongToAnotherProcess) {
    OwnedFrame mosaic = GrabMosaic();
    OwnedFrame target = MakeTarget(mosaic, zfmtRGB24);
    Zentara_Settings block = MakeBlock(zfmtRGB24, zbayerFast);
    ASSERT_ZERR(zerrNone, Zentara_CloseCamera(handle));
    (void)TakeTexts();

    EXPECT_ZERR(zerrBadHandle,
                Zentara_PostProcessSingleFrame(handle, &block, mosaic.Get(), target.Get()));

    EXPECT_THAT(TakeMessages(Function), ElementsAre(Taken));
}

class LoggedFrameOfATakenCamera : public LoggedSingleFrame {
  protected:
    LoggedFrameOfATakenCamera()
        : LoggedSingleFrame(R"({"base": "colour", "cameras": [{"held": {"from": 5},
                                "sensor": {"width": 64, "height": 48}}]})") {}
};

TEST_F(LoggedFrameOfATakenCamera, ACameraInAnotherProcessIsToldToTheLog) {
    OwnedFrame mosaic = GrabMosaic();
    OwnedFrame target = MakeTarget(mosaic, zfmtRGB24);
    Zentara_Settings block = MakeBlock(zfmtRGB24, zbayerFast);
    ASSERT_ZERR(zerrNone, Zentara_CloseCamera(handle));
    ZentaraHandle again = 0;
    ASSERT_ZERR(zerrDriverFault, Zentara_OpenCamera(0, &again));
    (void)TakeTexts();

    EXPECT_ZERR(zerrBadHandle,
                Zentara_PostProcessSingleFrame(handle, &block, mosaic.Get(), target.Get()));
    EXPECT_THAT(TakeMessages(Function), ElementsAre(Taken));

    EXPECT_ZERR(zerrBadHandle,
                Zentara_PostProcessSingleFrame(0x1234, &block, mosaic.Get(), target.Get()));
    EXPECT_THAT(TakeMessages(Function), ElementsAre()) << "no camera at all";
    EXPECT_TRUE(target.IsUntouchedFrom(0));
}

}  // namespace
}  // namespace ZV::Test
