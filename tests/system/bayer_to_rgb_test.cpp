#include <gtest/gtest.h>

#include <vector>

#include "support/log_file.h"
#include "system/mosaic_camera.h"

namespace ZV::Test {
namespace {

class BayerToRgb : public MosaicCamera {
  protected:
    /// A frame with room for `format` at the size of `mosaic`.
    static OwnedFrame MakeTarget(OwnedFrame& mosaic, std::uint32_t format) {
        OwnedFrame target(Zentara_CalcImageSize(format & 0xF, mosaic->width, mosaic->height));
        target->format = format;
        return target;
    }

    /// The present format and algorithm of the filter, as a client reads them.
    std::uint32_t GetFormatInForce() { return GetWord(ReadSettings(), zprmPostProcessImageFormat); }
    std::uint32_t GetAlgorithmInForce() {
        return GetWord(ReadSettings(), zprmPostProcessBayerAlgorithm);
    }
};

TEST_F(BayerToRgb, MakesTheColoursOfBytesByEveryAlgorithmInEveryFormat) {
    OwnedFrame mosaic = GrabMosaic();
    for (const std::uint32_t format : MosaicByteFormats) {
        for (const std::uint32_t algorithm : MosaicAlgorithms) {
            OwnedFrame target = MakeTarget(mosaic, format);

            ASSERT_ZERR(zerrNone, Zentara_BayerToRgb(algorithm, mosaic.Get(), target.Get()));

            EXPECT_EQ(Finish(mosaic, algorithm, format), target.GetImage()) << format;
            EXPECT_EQ(mosaic->width, target->width);
            EXPECT_EQ(mosaic->height, target->height);
            EXPECT_EQ(8, target->bits);
            EXPECT_EQ(target.pixels.size(), target->size);
            EXPECT_EQ(format, target->format);
        }
    }
}

TEST_F(BayerToRgb, MakesTheColoursOfWordsByEveryAlgorithm) {
    Send(zfmtBayer16, zfmtRGB48, zbayerAverage, false);
    OwnedFrame mosaic = GrabMosaic();
    ASSERT_EQ(static_cast<std::uint32_t>(zfmtBayer16), mosaic->format);
    for (const std::uint32_t algorithm : MosaicAlgorithms) {
        OwnedFrame target = MakeTarget(mosaic, zfmtRGB48);

        ASSERT_ZERR(zerrNone, Zentara_BayerToRgb(algorithm, mosaic.Get(), target.Get()));

        EXPECT_EQ(Finish(mosaic, algorithm, zfmtRGB48), target.GetImage()) << algorithm;
        EXPECT_EQ(mosaic->bits, target->bits);
    }
}

TEST_F(BayerToRgb, TakesTheMosaicThatTheRecordTells) {
    OwnedFrame mosaic = GrabMosaic();
    for (std::uint32_t pattern = 0; pattern < 4; ++pattern) {
        mosaic->bayerPattern = pattern;
        OwnedFrame target = MakeTarget(mosaic, zfmtRGB24);

        ASSERT_ZERR(zerrNone, Zentara_BayerToRgb(zbayerFast, mosaic.Get(), target.Get()));

        EXPECT_EQ(Finish(mosaic, zbayerFast, zfmtRGB24), target.GetImage()) << pattern;
    }
}

TEST_F(BayerToRgb, TakesAnyOtherPatternAsTheFirst) {
    OwnedFrame mosaic = GrabMosaic();
    mosaic->bayerPattern = zpatRGGB;
    const auto expected = Finish(mosaic, zbayerFast, zfmtRGB24);
    mosaic->bayerPattern = 0xFFFFFFFF;
    OwnedFrame target = MakeTarget(mosaic, zfmtRGB24);

    ASSERT_ZERR(zerrNone, Zentara_BayerToRgb(zbayerFast, mosaic.Get(), target.Get()));

    EXPECT_EQ(expected, target.GetImage());
}

TEST_F(BayerToRgb, FastRepeatsEachRedSampleInItsBlockOfFourPixels) {
    OwnedFrame mosaic = GrabMosaic();
    OwnedFrame target = MakeTarget(mosaic, zfmtRGB24);

    ASSERT_ZERR(zerrNone, Zentara_BayerToRgb(zbayerFast, mosaic.Get(), target.Get()));

    const auto image = target.GetImage();
    for (std::size_t y = 0; y < mosaic->height; y += 2) {
        for (std::size_t x = 0; x < mosaic->width; x += 2) {
            const std::uint8_t red = mosaic.pixels[y * mosaic->width + x];
            for (const std::size_t place : {0, 1, 2, 3}) {
                const std::size_t pixel = (y + place / 2) * mosaic->width + x + place % 2;
                ASSERT_EQ(red, image[3 * pixel]);
            }
        }
    }
}

TEST_F(BayerToRgb, RepeatsTheLastColumnAndRowOfAnOddSize) {
    OwnedFrame mosaic = GrabMosaic();
    mosaic->width = 7;
    mosaic->height = 5;
    mosaic->size = 35;
    OwnedFrame target = MakeTarget(mosaic, zfmtRGB24);

    ASSERT_ZERR(zerrNone, Zentara_BayerToRgb(zbayerAverage, mosaic.Get(), target.Get()));

    const auto image = target.GetImage();
    ASSERT_EQ(105u, image.size());
    for (std::size_t i = 0; i < 21; ++i) EXPECT_EQ(image[63 + i], image[84 + i]);
    for (std::size_t row = 0; row < 5; ++row) {
        for (std::size_t i = 0; i < 3; ++i) {
            EXPECT_EQ(image[21 * row + 15 + i], image[21 * row + 18 + i]);
        }
    }
}

TEST_F(BayerToRgb, KeptItLeavesFormatAndAlgorithmInTheFilterOfThePipelines) {
    OwnedFrame mosaic = GrabMosaic();
    OwnedFrame target = MakeTarget(mosaic, zfmtBGRX32);

    ASSERT_ZERR(zerrNone, Zentara_BayerToRgb(zbayerBicubic, mosaic.Get(), target.Get()));

    EXPECT_EQ(static_cast<std::uint32_t>(zfmtBGRX32), GetFormatInForce());
    EXPECT_EQ(static_cast<std::uint32_t>(zbayerBicubicFaster), GetAlgorithmInForce());
}

TEST_F(BayerToRgb, KeptAlgorithm0SetsTheFormatAndNothingElse) {
    OwnedFrame mosaic = GrabMosaic();
    OwnedFrame target = MakeTarget(mosaic, zfmtBGR24);
    target->pBuffer = nullptr;

    EXPECT_ZERR(zerrNone, Zentara_BayerToRgb(0, mosaic.Get(), target.Get()));

    EXPECT_EQ(0u, target->width + target->height + target->size + target->bits);
    EXPECT_EQ(static_cast<std::uint32_t>(zfmtBGR24), GetFormatInForce());
    EXPECT_EQ(static_cast<std::uint32_t>(zbayerAverage), GetAlgorithmInForce());
}

TEST_F(BayerToRgb, AnAlgorithmAbove4KeepsTheOneInForceAndRuns) {
    OwnedFrame mosaic = GrabMosaic();
    Send(zfmtBayer8, zfmtRGB24, zbayerFast, false);
    for (const std::uint32_t algorithm : {5u, 0x10001u, 0xFFFFFFFFu}) {
        OwnedFrame target = MakeTarget(mosaic, zfmtRGB24);

        EXPECT_ZERR(zerrNone, Zentara_BayerToRgb(algorithm, mosaic.Get(), target.Get()));

        EXPECT_EQ(Finish(mosaic, zbayerFast, zfmtRGB24), target.GetImage());
        EXPECT_EQ(static_cast<std::uint32_t>(zbayerFast), GetAlgorithmInForce());
    }
}

TEST_F(BayerToRgb, KeptTheFilterGetsTheLowHalfOfTheFormatAndTheSizeIsOfTheWhole) {
    OwnedFrame mosaic = GrabMosaic();
    OwnedFrame target(3u * 64 * 48);
    target->format = 0x1000C;

    EXPECT_ZERR(zerrNone, Zentara_BayerToRgb(zbayerFast, mosaic.Get(), target.Get()));

    EXPECT_EQ(0u, target->size);
    EXPECT_EQ(0x1000Cu, target->format);
    EXPECT_EQ(64u, target->width);
    target->size = static_cast<std::uint32_t>(target.pixels.size());
    EXPECT_EQ(Finish(mosaic, zbayerFast, zfmtRGB24), target.GetImage());
}

TEST_F(BayerToRgb, KeptWhatTheFilterDoesNotTakeIsNoFailureAndLeavesTheFrameItsSize) {
    OwnedFrame mosaic = GrabMosaic();
    struct Case {
        const char* what;
        std::uint32_t inFormat, outFormat;
        std::uint32_t width, height;
    };
    const Case cases[] = {{"mono", zfmtMono8, zfmtRGB24, 64, 48},
                          {"colours", zfmtRGB24, zfmtRGB24, 64, 48},
                          {"no such format", 77, zfmtRGB24, 64, 48},
                          {"into a mosaic", zfmtBayer8, zfmtBayer8, 64, 48},
                          {"into planes", zfmtBayer8, zfmtRGBPlane8, 64, 48},
                          {"into deep planes", zfmtBayer8, zfmtRGBPlane16, 64, 48},
                          {"larger than the sensor", zfmtBayer8, zfmtRGB24, 65, 48}};
    for (const Case& row : cases) {
        SCOPED_TRACE(row.what);
        mosaic->format = row.inFormat;
        mosaic->width = row.width;
        OwnedFrame target(6u * 65 * 48);
        target->format = row.outFormat;
        target->width = 11;
        target->height = 13;

        EXPECT_ZERR(zerrNone, Zentara_BayerToRgb(zbayerFast, mosaic.Get(), target.Get()));

        EXPECT_EQ(11u, target->width);
        EXPECT_EQ(13u, target->height);
        EXPECT_EQ(Zentara_CalcImageSize(row.outFormat, 11, 13), target->size);
        EXPECT_EQ(8, target->bits);
        EXPECT_TRUE(target.IsUntouchedFrom(0));
        mosaic->width = 64;
    }
}

TEST_F(BayerToRgb, TestsItsArgumentsInOrder) {
    OwnedFrame mosaic = GrabMosaic();
    OwnedFrame target = MakeTarget(mosaic, zfmtRGB24);
    target->pBuffer = nullptr;

    EXPECT_ZERR(zerrBadParameter, Zentara_BayerToRgb(1, nullptr, target.Get()));
    EXPECT_ZERR(zerrBadParameter, Zentara_BayerToRgb(1, mosaic.Get(), nullptr));
    for (const ZentaraHandle camera : {ZentaraHandle{0}, ZentaraHandle{0x1234}, handle + 8}) {
        OwnedFrame foreign = MakeTarget(mosaic, zfmtRGB24);
        *foreign.Get() = *mosaic.Get();
        foreign->pBuffer = nullptr;
        std::memcpy(foreign->privateCamera, &camera, sizeof(camera));
        EXPECT_ZERR(zerrBadHandle, Zentara_BayerToRgb(1, foreign.Get(), target.Get()));
    }
    EXPECT_ZERR(zerrBadParameter, Zentara_BayerToRgb(1, mosaic.Get(), target.Get()));

    target->pBuffer = target.pixels.data();
    target->bufferSize = 3 * 64 * 48 - 1;
    EXPECT_ZERR(zerrBufferTooSmall, Zentara_BayerToRgb(2, mosaic.Get(), target.Get()));
    EXPECT_EQ(0u, target->width);
    EXPECT_TRUE(target.IsUntouchedFrom(0));
    EXPECT_EQ(static_cast<std::uint32_t>(zbayerFast), GetAlgorithmInForce()) << "it has changed";

    target->bufferSize = 3 * 64 * 48;
    EXPECT_ZERR(zerrNone, Zentara_BayerToRgb(2, mosaic.Get(), target.Get()));
    ASSERT_ZERR(zerrNone, Zentara_CloseCamera(handle));
    EXPECT_ZERR(zerrBadHandle, Zentara_BayerToRgb(2, mosaic.Get(), target.Get()));
    Zentara_ReleaseDriver();
    EXPECT_ZERR(zerrNotLoaded, Zentara_BayerToRgb(2, nullptr, nullptr));
    EXPECT_ZERR(zerrNone, Zentara_LoadDriver());
}

TEST_F(BayerToRgb, RefusesAFrameThatDoesNotHoldItsPixels) {
    OwnedFrame mosaic = GrabMosaic();
    OwnedFrame target = MakeTarget(mosaic, zfmtRGB24);
    mosaic->bufferSize = mosaic->size - 1;
    EXPECT_ZERR(zerrBadParameter, Zentara_BayerToRgb(1, mosaic.Get(), target.Get()));
    mosaic->bufferSize = 0;
    EXPECT_ZERR(zerrNone, Zentara_BayerToRgb(1, mosaic.Get(), target.Get())) << "vouched for";
    mosaic->pBuffer = nullptr;
    EXPECT_ZERR(zerrBadParameter, Zentara_BayerToRgb(1, mosaic.Get(), target.Get()));
}

TEST_F(BayerToRgb, ReadsNoFurtherThanTheRecordsSize) {
    OwnedFrame mosaic = GrabMosaic();
    const ReferenceMosaic whole = ReadMosaic(mosaic);
    // The block ends where the size says so.
    OwnedFrame half(64 * 24);
    *half.Get() = *mosaic.Get();
    half->pBuffer = half.pixels.data();
    half->size = half->bufferSize = 64 * 24;
    std::copy_n(mosaic.pixels.begin(), half.pixels.size(), half.pixels.begin());
    OwnedFrame target = MakeTarget(mosaic, zfmtRGB24);

    EXPECT_ZERR(zerrNone, Zentara_BayerToRgb(zbayerFast, half.Get(), target.Get()));

    const auto image = target.GetImage();
    EXPECT_EQ(whole.samples[0], image[0]);
    for (std::size_t i = 3 * 64 * 24; i < image.size(); ++i) ASSERT_EQ(0, image[i]);
}

TEST_F(BayerToRgb, KeptAWordFormatReadsBytesAsWords) {
    OwnedFrame mosaic = GrabMosaic();
    OwnedFrame target = MakeTarget(mosaic, zfmtRGB48);

    EXPECT_ZERR(zerrNone, Zentara_BayerToRgb(zbayerFast, mosaic.Get(), target.Get()));

    const auto image = target.GetImage();
    EXPECT_EQ(mosaic.pixels[0], image[0]);
    EXPECT_EQ(mosaic.pixels[1], image[1]);
}

TEST_F(BayerToRgb, MayWriteOverTheMosaicItReads) {
    OwnedFrame mosaic = GrabMosaic();
    const auto expected = Finish(mosaic, zbayerBicubic, zfmtRGB24);
    OwnedFrame both(expected.size());
    std::copy(mosaic.pixels.begin(), mosaic.pixels.end(), both.pixels.begin());
    mosaic->pBuffer = both.pixels.data();
    both->format = zfmtRGB24;

    EXPECT_ZERR(zerrNone, Zentara_BayerToRgb(zbayerBicubic, mosaic.Get(), both.Get()));

    EXPECT_EQ(expected, both.GetImage());
}

TEST_F(BayerToRgb, OfOneRecordForBothEndsNoPixelsAreWritten) {
    OwnedFrame mosaic = GrabMosaic();
    const Zentara_Frame before = *mosaic.Get();
    const std::vector<std::uint8_t> pixels = mosaic.pixels;

    EXPECT_ZERR(zerrNone, Zentara_BayerToRgb(zbayerAverage, mosaic.Get(), mosaic.Get()));

    EXPECT_EQ(0, std::memcmp(&before, mosaic.Get(), sizeof(before)));
    EXPECT_EQ(pixels, mosaic.pixels);
}

TEST_F(BayerToRgb, AnEmptyFrameGivesAnEmptyImage) {
    OwnedFrame mosaic = GrabMosaic();
    mosaic->width = 0;
    OwnedFrame target = MakeTarget(mosaic, zfmtRGB24);
    std::uint8_t pixel = 7;
    target->pBuffer = &pixel;

    EXPECT_ZERR(zerrNone, Zentara_BayerToRgb(1, mosaic.Get(), target.Get()));

    EXPECT_EQ(0u, target->size);
    EXPECT_EQ(7, pixel);
}

TEST_F(BayerToRgb, ASizeThatIsRefusedNeedsNoRoom) {
    OwnedFrame mosaic = GrabMosaic();
    const std::vector<std::uint8_t> untouched(1 << 20, ClientFrame::Untouched);
    std::vector<std::uint8_t> room = untouched;
    for (const std::uint32_t side : {65U, 65535U, 65536U, 0x7FFFFFFFU, 0xFFFFFFFFU}) {
        for (const std::uint32_t bufferSize : {0U, 1U, 1U << 20}) {
            mosaic->width = mosaic->height = side;
            OwnedFrame target(0);
            target->format = zfmtRGB24;
            target->width = 5;
            target->height = 7;
            target->pBuffer = room.data();
            target->bufferSize = bufferSize;

            EXPECT_ZERR(zerrNone, Zentara_BayerToRgb(1, mosaic.Get(), target.Get())) << side;

            EXPECT_EQ(5u, target->width);
            EXPECT_EQ(7u, target->height);
            EXPECT_EQ(105u, target->size);
        }
    }
    EXPECT_EQ(untouched, room);
}

TEST_F(BayerToRgb, DoesNotScaleTheColours) {
    scales[0] = 2000;
    scales[1] = 500;
    scales[2] = 1500;
    Send(zfmtBayer8, zfmtRGB24, zbayerAverage, false);
    OwnedFrame mosaic = GrabMosaic();
    for (const std::uint32_t algorithm : MosaicAlgorithms) {
        OwnedFrame target = MakeTarget(mosaic, zfmtRGB24);

        ASSERT_ZERR(zerrNone, Zentara_BayerToRgb(algorithm, mosaic.Get(), target.Get()));

        const ReferenceColours colours = MakeReferenceColours(ReadMosaic(mosaic), algorithm);
        EXPECT_EQ(PackReferenceColours(colours, zfmtRGB24), target.GetImage());
        EXPECT_NE(Finish(mosaic, algorithm, zfmtRGB24), target.GetImage());
    }
}

TEST_F(BayerToRgb, AFrameOfNoBytesInsideItsTargetGivesTheColoursOfNoLight) {
    OwnedFrame mosaic = GrabMosaic();
    OwnedFrame target = MakeTarget(mosaic, zfmtRGB24);
    mosaic->pBuffer = target.pixels.data() + 5;
    mosaic->size = mosaic->bufferSize = 0;

    EXPECT_ZERR(zerrNone, Zentara_BayerToRgb(zbayerAverage, mosaic.Get(), target.Get()));

    EXPECT_EQ(std::vector<std::uint8_t>(target.pixels.size()), target.GetImage());
}

class LoggedBayerToRgb : public LogFile, public BayerToRgb {};

TEST_F(LoggedBayerToRgb, KeptWithAlgorithm0NoEndIsWritten) {
    OwnedFrame mosaic = GrabMosaic();
    OwnedFrame target = MakeTarget(mosaic, zfmtRGB24);
    const auto countRecords = [&] {
        std::size_t count = 0;
        for (const std::string& text : TakeTexts()) {
            if (text.find("Zentara_BayerToRgb") != std::string::npos) ++count;
        }
        return count;
    };
    (void)TakeTexts();

    EXPECT_ZERR(zerrNone, Zentara_BayerToRgb(1, mosaic.Get(), target.Get()));
    EXPECT_EQ(2u, countRecords());
    EXPECT_ZERR(zerrNone, Zentara_BayerToRgb(0, mosaic.Get(), target.Get()));
    EXPECT_EQ(1u, countRecords());
}

}  // namespace
}  // namespace ZV::Test
