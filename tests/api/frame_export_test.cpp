#include "api/frame_export.h"

#include <gtest/gtest.h>

#include <cstdlib>
#include <cstring>

#include "api/settings_block.h"
#include "camera/camera_result.h"
#include "imaging/ex_image.h"
#include "support/flat_camera.h"

namespace ZV {
namespace {

using Test::ClientFrame;

constexpr ZentaraHandle Handle = 0x1122334455667788;

struct ImageTraits {
    std::uint32_t width = 4;
    std::uint32_t height = 3;
    ZImageFormatEnum format = Mono8;
    std::uint16_t pattern = PatternRed;
    std::uint16_t errorCode = 0;
    bool isRTV = false;
};

/// An image whose pixels count up from 1.
ZExImage MakeImage(const ImageTraits& traits) {
    const std::uint32_t bytes = traits.width * traits.height;
    auto* const pixels = static_cast<std::uint8_t*>(std::malloc(bytes));
    for (std::uint32_t i = 0; i < bytes; ++i) pixels[i] = static_cast<std::uint8_t>(i + 1);
    return ZExImage(pixels, bytes, traits.width, traits.height, 8, 1000, 1.0, traits.format,
                    CameraMono, static_cast<ZColourPatternEnum>(traits.pattern), 0, false, 5, 0, 2,
                    traits.isRTV, 4711, traits.errorCode, nullptr, true);
}

Zentara_Settings MakeSettings(std::uint32_t format) {
    Zentara_Settings settings;
    std::memset(&settings, 0xCD, sizeof(settings));
    SetSettingsWord(settings, zprmImageFormat, format);
    return settings;
}

TEST(FrameExport, FillsEveryFieldOfTheRecord) {
    const ZExImage image = MakeImage({.pattern = PatternGRBG, .isRTV = true});
    ClientFrame frame(12);
    frame->reserved64[0] = 0x11111111;
    frame->reserved64[1] = 0x22222222;
    frame->reserved76 = 0x33333333;
    frame->timeStamp = 99;

    ExportImageToFrame(Handle, MakeSettings(zfmtMono8), image, *frame.Get(), true);

    EXPECT_EQ(0, std::memcmp(frame.GetPixels(), image.GetImageData(), 12));
    EXPECT_TRUE(frame.IsGuardIntact());
    EXPECT_EQ(2u, frame->format);
    EXPECT_EQ(4u, frame->width);
    EXPECT_EQ(3u, frame->height);
    EXPECT_EQ(12u, frame->size);
    EXPECT_EQ(8, frame->bits);
    EXPECT_EQ(4711, frame->frameNumber);
    EXPECT_EQ(1u, frame->bayerPattern);
    EXPECT_ZERR(zerrNone, frame->errorCode);
    EXPECT_EQ(0u, frame->timeStamp);
    EXPECT_EQ(0x55667788u, frame->privateCamera[0]);
    EXPECT_EQ(0x11223344u, frame->privateCamera[1]);
    EXPECT_EQ(2u, frame->privateBinning);
    EXPECT_EQ(1u, frame->privateRealTime);
    EXPECT_EQ(6u, frame->privatePattern);
    EXPECT_EQ(1u, frame->privateFilled);
    EXPECT_EQ(0x11111111u, frame->reserved64[0]);
    EXPECT_EQ(0x22222222u, frame->reserved64[1]);
    EXPECT_EQ(0x33333333u, frame->reserved76);
}

TEST(FrameExport, MosaicsBecomeZeroToThreeAndEverythingElseZero) {
    for (std::uint16_t pattern = 0; pattern < 12; ++pattern) {
        const ZExImage image = MakeImage({.pattern = pattern});
        ClientFrame frame(12);

        ExportImageToFrame(Handle, MakeSettings(zfmtMono8), image, *frame.Get(), true);

        const bool isMosaic = pattern >= 5 && pattern <= 8;
        EXPECT_EQ(isMosaic ? pattern - 5u : 0u, frame->bayerPattern) << pattern;
        EXPECT_EQ(pattern, frame->privatePattern);
    }
}

TEST(FrameExport, WhoAsksForRawDataIsToldRawWhateverTheImageSays) {
    const ZExImage image = MakeImage({.format = Bayer8});
    for (const std::uint32_t asked : {zfmtRaw8, zfmtRaw16}) {
        ClientFrame frame(12);

        ExportImageToFrame(Handle, MakeSettings(asked), image, *frame.Get(), true);

        EXPECT_EQ(asked, frame->format);
        EXPECT_EQ(12u, frame->size);
    }
}

TEST(FrameExport, AnyOtherFormatIsTheImagesOwn) {
    const ZExImage image = MakeImage({.format = Bayer8});
    for (const std::uint32_t asked : {2u, 4u, 12u, 13u, 0xCDCDCDCDu}) {
        ClientFrame frame(12);

        ExportImageToFrame(Handle, MakeSettings(asked), image, *frame.Get(), true);

        EXPECT_EQ(4u, frame->format) << asked;
    }
}

TEST(FrameExport, AnImageThatIsTooLargeIsNotCopiedAndSaysSo) {
    const ZExImage image = MakeImage({.errorCode = FrameStatusMissingData});
    ClientFrame frame(11);

    ExportImageToFrame(Handle, MakeSettings(zfmtMono8), image, *frame.Get(), true);

    EXPECT_TRUE(frame.IsUntouched());
    EXPECT_ZERR(zerrBufferTooSmall, frame->errorCode);
    EXPECT_EQ(0u, frame->size);
    EXPECT_EQ(4u, frame->width);
    EXPECT_EQ(3u, frame->height);
    EXPECT_EQ(2u, frame->format);
}

TEST(FrameExport, ANullBufferHoldsNothingWhateverItsSize) {
    const ZExImage image = MakeImage({});
    ClientFrame frame(100);
    frame->pBuffer = nullptr;

    ExportImageToFrame(Handle, MakeSettings(zfmtMono8), image, *frame.Get(), true);

    EXPECT_EQ(0u, GetFrameCapacity(*frame.Get()));
    EXPECT_ZERR(zerrBufferTooSmall, frame->errorCode);
    EXPECT_EQ(0u, frame->size);
}

TEST(FrameExport, WithoutCopyingThePixelsStayAndTheRecordIsFilled) {
    const ZExImage image = MakeImage({});
    ClientFrame frame(12);

    ExportImageToFrame(Handle, MakeSettings(zfmtMono8), image, *frame.Get(), false);

    EXPECT_TRUE(frame.IsUntouched());
    EXPECT_EQ(12u, frame->size);
    EXPECT_ZERR(zerrNone, frame->errorCode);
}

TEST(FrameExport, ImageErrorsBecomeFrameErrors) {
    const ZExImage image = MakeImage({.errorCode = FrameStatusOutOfSync});
    ClientFrame frame(12);

    ExportImageToFrame(Handle, MakeSettings(zfmtMono8), image, *frame.Get(), true);

    EXPECT_ZERR(zerrOutOfSync, frame->errorCode);
}

}  // namespace
}  // namespace ZV
