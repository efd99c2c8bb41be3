#include <gtest/gtest.h>

#include <memory>
#include <string>
#include <tuple>
#include <vector>

#include "system/mosaic_camera.h"

// What a client gets with post-processing on: by Zentara_GrabFrame and by the stream.
namespace ZV::Test {
namespace {

struct ColourCase {
    std::uint32_t imageFormat, outputFormat;
};

constexpr ColourCase Cases[] = {{zfmtBayer8, zfmtBGR24},
                                {zfmtBayer8, zfmtXRGB32},
                                {zfmtBayer8, zfmtBGRX32},
                                {zfmtBayer8, zfmtRGB24},
                                {zfmtBayer16, zfmtRGB48}};

class ColourCapture : public MosaicCamera {
  protected:
    static constexpr std::size_t Room = std::size_t{6} * 64 * 48;

    /// Frames of a stream, in order.
    std::vector<OwnedFrame> Stream(std::size_t count, std::size_t bytes) {
        CallbackLog calls;
        std::vector<OwnedFrame> frames;
        for (std::size_t i = 0; i < count; ++i) frames.emplace_back(bytes);
        for (OwnedFrame& frame : frames) {
            EXPECT_ZERR(zerrNone, Zentara_QueueFrame(handle, frame.Get(), CallbackLog::Record,
                                                     zcbFrameDone, calls.GetPrivate(), 0));
        }
        EXPECT_ZERR(zerrNone, Zentara_SetStreaming(handle, 1));
        EXPECT_TRUE(calls.WaitForCalls(count));
        EXPECT_ZERR(zerrNone, Zentara_SetStreaming(handle, 0));
        EXPECT_ZERR(zerrNone, Zentara_Abort(handle));
        return frames;
    }

    void ExpectFinished(OwnedFrame& mosaic, std::uint32_t algorithm, std::uint32_t format,
                        OwnedFrame& frame) const {
        EXPECT_ZERR(zerrNone, frame->errorCode);
        EXPECT_EQ(format, frame->format);
        EXPECT_EQ(mosaic->width, frame->width);
        EXPECT_EQ(mosaic->height, frame->height);
        EXPECT_EQ(mosaic->bits, frame->bits);
        EXPECT_EQ(Zentara_CalcImageSize(format, mosaic->width, mosaic->height), frame->size);
        EXPECT_TRUE(Finish(mosaic, algorithm, format) == frame.GetImage())
            << format << " by " << algorithm;
        EXPECT_TRUE(frame.IsUntouchedFrom(frame->size));
    }
};

class EveryColourFormat
    : public ColourCapture,
      public testing::WithParamInterface<std::tuple<ColourCase, std::uint32_t>> {};

TEST_P(EveryColourFormat, ComesOutOfAGrabAndAStreamAsComputedFromTheMosaic) {
    const auto [formats, algorithm] = GetParam();
    scales[0] = 1250;
    scales[2] = 1750;
    Send(formats.imageFormat, formats.outputFormat, algorithm, false);
    OwnedFrame mosaic = GrabMosaic();
    ASSERT_EQ(formats.imageFormat, mosaic->format);

    Send(formats.imageFormat, formats.outputFormat, algorithm, true);
    OwnedFrame grabbed = Grab(Room);
    ExpectFinished(mosaic, algorithm, formats.outputFormat, grabbed);
    for (OwnedFrame& frame : Stream(3, Room)) {
        ExpectFinished(mosaic, algorithm, formats.outputFormat, frame);
    }
}

INSTANTIATE_TEST_SUITE_P(Formats, EveryColourFormat,
                         testing::Combine(testing::ValuesIn(Cases),
                                          testing::ValuesIn(MosaicAlgorithms)),
                         [](const auto& parameter) {
                             return "Format" +
                                    std::to_string(std::get<0>(parameter.param).outputFormat) +
                                    "By" + std::to_string(std::get<1>(parameter.param));
                         });

TEST_F(ColourCapture, FollowsTheMosaicOfTheRegion) {
    for (const std::uint32_t x : {0u, 1u}) {
        for (const std::uint32_t y : {0u, 1u}) {
            const auto send = [&](bool isPostProcessing) {
                Zentara_Settings settings =
                    MakeSettings(zfmtBayer8, zfmtRGB24, zbayerAverage, isPostProcessing);
                SetWord(settings, zprmRoiX, x);
                SetWord(settings, zprmRoiY, y);
                SetWord(settings, zprmRoiWidth, 40);
                SetWord(settings, zprmRoiHeight, 32);
                EXPECT_ZERR(zerrNone, Zentara_SendSettingsToCam(handle, &settings));
            };
            send(false);
            OwnedFrame mosaic = GrabMosaic();
            send(true);

            OwnedFrame frame = Grab(Room);

            ExpectFinished(mosaic, zbayerAverage, zfmtRGB24, frame);
        }
    }
}

TEST_F(ColourCapture, KeptRawFramesRunThroughNoFilter) {
    OwnedFrame mosaic = GrabMosaic();
    for (const std::uint32_t raw : {zfmtRaw8}) {
        Send(raw, zfmtRGB24, zbayerAverage, true);

        OwnedFrame frame = Grab(Room);

        EXPECT_EQ(raw, frame->format);
        EXPECT_EQ(mosaic.GetImage(), frame.GetImage());
        EXPECT_TRUE(frame.IsUntouchedFrom(mosaic->size));
    }
}

TEST_F(ColourCapture, KeptAFormatWithoutColoursLeavesTheMosaic) {
    OwnedFrame mosaic = GrabMosaic();
    Send(zfmtBayer8, zfmtBayer8, zbayerAverage, true);

    OwnedFrame frame = Grab(Room);

    EXPECT_EQ(static_cast<std::uint32_t>(zfmtBayer8), frame->format);
    EXPECT_EQ(mosaic.GetImage(), frame.GetImage());
}

TEST_F(ColourCapture, AFrameThatHoldsTheMosaicAloneIsToldTheSizeOfTheColours) {
    Send(zfmtBayer8, zfmtRGB24, zbayerAverage, true);
    OwnedFrame frame(64 * 48);

    EXPECT_ZERR(zerrNone, Zentara_GrabFrame(handle, frame.Get()));

    EXPECT_ZERR(zerrBufferTooSmall, frame->errorCode);
    EXPECT_EQ(0u, frame->size);
    EXPECT_EQ(static_cast<std::uint32_t>(zfmtRGB24), frame->format);
    EXPECT_TRUE(frame.IsUntouchedFrom(0));
}

}  // namespace
}  // namespace ZV::Test
