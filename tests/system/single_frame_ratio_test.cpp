// Frames of a camera that bins its columns alone, finished afterwards. The frames are made up:
// their private words say how they were taken.

#include <gtest/gtest.h>

#include <vector>

#include "support/ratio_judge.h"
#include "system/single_frame.h"

namespace ZV::Test {
namespace {

constexpr std::uint32_t Width = 64, Height = 48;
constexpr float FreshScales[3] = {1.16F, 1.0F, 1.88F};

class FolaryFrame : public SingleFrame {
  protected:
    explicit FolaryFrame(std::string_view scenario = "folary") : SingleFrame(scenario) {}
    void SetUp() override { OpenedCamera::SetUp(); }

    /// A mosaic that says it came from this camera.
    OwnedFrame MakeMosaic(std::uint32_t bits = 8) const {
        OwnedFrame mosaic(std::size_t{Width} * Height * (bits == 8 ? 1 : 2));
        for (std::size_t i = 0; i < mosaic.pixels.size(); ++i) {
            mosaic.pixels[i] = static_cast<std::uint8_t>(i * 7 + i / 100);
        }
        mosaic->format = bits == 8 ? zfmtBayer8 : zfmtBayer16;
        mosaic->bits = static_cast<std::uint16_t>(bits);
        mosaic->width = Width;
        mosaic->height = Height;
        mosaic->size = static_cast<std::uint32_t>(mosaic.pixels.size());
        mosaic->bayerPattern = zpatGRBG;
        mosaic->privateBinning = 1;
        std::memcpy(mosaic->privateCamera, &handle, sizeof(handle));
        return mosaic;
    }

    static ReferenceMosaic Reduce(const ReferenceMosaic& mosaic, std::uint32_t factor) {
        const std::vector<std::uint32_t> samples(mosaic.samples.begin(), mosaic.samples.end());
        const auto reduced = JudgeReduction(samples, mosaic.width, factor);
        ReferenceMosaic result = mosaic;
        result.width = mosaic.width / (2 * factor) * 2;
        result.samples.assign(reduced.begin(), reduced.end());
        return result;
    }
    static ReferenceMosaic Double(const ReferenceMosaic& mosaic) {
        const std::vector<std::uint32_t> samples(mosaic.samples.begin(), mosaic.samples.end());
        const auto doubled = JudgeZoomFill(JudgeZoomSpread(samples, mosaic.width, 0), mosaic.width,
                                           2 * mosaic.height, mosaic.pattern);
        ReferenceMosaic result = mosaic;
        result.height = 2 * mosaic.height;
        result.samples.assign(doubled.begin(), doubled.end());
        return result;
    }
    static std::vector<std::uint8_t> Colour(const ReferenceMosaic& mosaic, std::uint32_t algorithm,
                                            std::uint32_t format) {
        ReferenceColours colours = MakeReferenceColours(mosaic, algorithm);
        ScaleReferenceColours(colours, FreshScales, mosaic.bits);
        return PackReferenceColours(colours, format);
    }

    /// Also over the frame itself.
    void ExpectFinishedAs(const ReferenceMosaic& corrected, OwnedFrame& mosaic,
                          std::uint32_t algorithm, std::uint32_t format) {
        const auto expected = Colour(corrected, algorithm, format);
        OwnedFrame both(std::max<std::size_t>(expected.size(), mosaic.pixels.size()));
        *both.Get() = *mosaic.Get();
        both->pBuffer = both.pixels.data();
        both->bufferSize = static_cast<std::uint32_t>(both.pixels.size());
        std::copy(mosaic.pixels.begin(), mosaic.pixels.end(), both.pixels.begin());
        // The corrected mosaic may be longer than the colours, never here.
        OwnedFrame target(expected.size() + 64);
        target->bufferSize = static_cast<std::uint32_t>(expected.size());
        const std::vector<std::uint8_t> before = mosaic.pixels;

        ASSERT_ZERR(zerrNone, Process(format, algorithm, mosaic, target));
        ASSERT_ZERR(zerrNone, Process(format, algorithm, both, both));

        EXPECT_EQ(expected, target.GetImage());
        EXPECT_EQ(expected, both.GetImage()) << "over the frame itself";
        EXPECT_TRUE(target.IsUntouchedFrom(expected.size()));
        EXPECT_EQ(corrected.width, target->width);
        EXPECT_EQ(corrected.height, target->height);
        mosaic.pixels = before;
        mosaic->pBuffer = mosaic.pixels.data();
    }
};

constexpr std::uint32_t FormatsOfBits[][2] = {{8, zfmtRGB24}, {8, zfmtXRGB32}, {16, zfmtRGB48}};

TEST_F(FolaryFrame, IsReducedByItsBinningBeforeItGetsItsColours) {
    for (const auto& [bits, format] : FormatsOfBits) {
        for (const std::uint32_t binning : {2U, 3U, 4U}) {
            for (const std::uint32_t algorithm : MosaicAlgorithms) {
                SCOPED_TRACE(testing::Message()
                             << binning << ", format " << format << " by " << algorithm);
                OwnedFrame mosaic = MakeMosaic(bits);
                mosaic->privateBinning = binning;
                ExpectFinishedAs(Reduce(ReadMosaic(mosaic), binning), mosaic, algorithm, format);
            }
        }
    }
}

class VideoFrame : public FolaryFrame, public testing::WithParamInterface<std::uint32_t> {
  protected:
    VideoFrame()
        : FolaryFrame(GetParam() == 4 ? "folary" : R"({"base": "folary", "cameras": [
                                            {"sensor": {"width": 2048, "height": 1536}}]})") {}
};

TEST_P(VideoFrame, IsReducedAndDoubledBeforeItGetsItsColours) {
    for (const auto& [bits, format] : FormatsOfBits) {
        for (std::uint32_t pattern = 0; pattern < 4; ++pattern) {
            for (const std::uint32_t algorithm : MosaicAlgorithms) {
                SCOPED_TRACE(testing::Message()
                             << pattern << ", format " << format << " by " << algorithm);
                OwnedFrame mosaic = MakeMosaic(bits);
                mosaic->bayerPattern = pattern;
                mosaic->privateRealTime = pattern + 1;
                mosaic->privateBinning = pattern;  // not looked at
                ExpectFinishedAs(Double(Reduce(ReadMosaic(mosaic), GetParam())), mosaic, algorithm,
                                 format);
            }
        }
    }
}

INSTANTIATE_TEST_SUITE_P(Sensors, VideoFrame, testing::Values(3U, 4U), [](const auto& factor) {
    return "ReducedBy" + std::to_string(factor.param);
});

TEST_F(FolaryFrame, KeptWithoutABinningItIsANightOfTheTargetsOwnSize) {
    OwnedFrame mosaic = MakeMosaic();
    mosaic->privateBinning = 0;
    OwnedFrame target(4u * 20 * 10 + 50);
    target->width = 20;
    target->height = 10;
    target->bufferSize = 4 * 20 * 10;

    ASSERT_ZERR(zerrNone, Process(zfmtRGB24, zbayerAverage, mosaic, target));
    EXPECT_EQ(std::vector<std::uint8_t>(3 * 20 * 10), target.GetImage());
    EXPECT_EQ(20u, target->width);
    EXPECT_EQ(10u, target->height);
    EXPECT_TRUE(target.IsUntouchedFrom(3 * 20 * 10));

    ASSERT_ZERR(zerrNone, Process(zfmtBayer8, zbayerAverage, mosaic, target));
    EXPECT_EQ(200u, target->size) << "of which nothing is written";
    EXPECT_EQ(std::vector<std::uint8_t>(200), target.GetImage());
}

TEST_F(FolaryFrame, KeptABinningThatNothingIsReducedByColoursWhatTheTargetHeld) {
    OwnedFrame mosaic = MakeMosaic();
    mosaic->privateBinning = 5;
    OwnedFrame target(3u * 12 * 48);
    const ReferenceMosaic held{12, 48, 8, zpatGRBG,
                               std::vector<std::uint16_t>(12 * 48, ClientFrame::Untouched)};

    ASSERT_ZERR(zerrNone, Process(zfmtRGB24, zbayerFast, mosaic, target));

    EXPECT_EQ(Colour(held, zbayerFast, zfmtRGB24), target.GetImage());
}

TEST_F(FolaryFrame, AsksForTheImageThatTheCorrectedMosaicGives) {
    struct Case {
        const char* what;
        std::uint32_t bits, binning, realTime, format, width, height, needed;
    };
    const Case cases[] = {
        {"not binned", 8, 1, 0, zfmtRGB24, 64, 48, 3 * 64 * 48},
        {"binned by 2", 8, 2, 0, zfmtRGB24, 32, 48, 3 * 32 * 48},
        {"binned by 3", 8, 3, 0, zfmtXRGB32, 20, 48, 4 * 20 * 48},
        {"binned by 4, mosaic", 8, 4, 0, zfmtBayer8, 16, 48, 16 * 48},
        {"binned by 2, planes", 8, 2, 0, zfmtRGBPlane8, 32, 48, 32 * 48},
        {"binned by 2, words", 16, 2, 0, zfmtRGB48, 32, 48, 6 * 32 * 48},
        {"binned by 4, mosaic of words", 16, 4, 0, zfmtBayer16, 16, 48, 2 * 16 * 48},
        {"real time", 8, 1, 1, zfmtRGB24, 16, 96, 3 * 16 * 96},
        {"real time, binned", 8, 2, 7, zfmtBayer8, 16, 96, 16 * 96},
        {"real time, words", 16, 1, 1, zfmtRGB48, 16, 96, 6 * 16 * 96},
        {"binned by 5", 8, 5, 0, zfmtRGB24, 12, 48, 3 * 12 * 48},
        {"binned beyond the width", 8, 0xFFFFFFFF, 0, zfmtRGB24, 0, 48, 0},
        {"not reported", 8, 0, 0, zfmtRGB24, 20, 10, 3 * 20 * 10},
    };
    for (const Case& row : cases) {
        for (const std::uint32_t algorithm : {zbayerFast, zbayerBicubic}) {
            SCOPED_TRACE(row.what);
            OwnedFrame mosaic = MakeMosaic(row.bits);
            mosaic->privateBinning = row.binning;
            mosaic->privateRealTime = row.realTime;
            OwnedFrame exact(std::max(row.needed, 1U)), oneLess(std::max(row.needed, 2U) - 1);
            exact->width = oneLess->width = 20;
            exact->height = oneLess->height = 10;

            EXPECT_ZERR(row.needed > 1 ? zerrBufferTooSmall : zerrNone,
                        Process(row.format, algorithm, mosaic, oneLess));
            EXPECT_ZERR(zerrNone, Process(row.format, algorithm, mosaic, exact));

            EXPECT_EQ(row.width, exact->width);
            EXPECT_EQ(row.height, exact->height);
            EXPECT_EQ(row.format, exact->format);
            EXPECT_EQ(Zentara_CalcImageSize(row.format, row.width, row.height), exact->size);
        }
    }
}

TEST_F(FolaryFrame, KeptOfFewerBytesThanItsSizeAsksForItChangesTheRecordAlone) {
    struct Case {
        std::uint32_t width, height;
    };
    for (const Case& row : {Case{64, 49}, Case{65535, 65535}, Case{65536, 65536},
                            Case{0x80000000, 0x80000000}, Case{0xFFFFFFFF, 0xFFFFFFFF}}) {
        for (const std::uint32_t realTime : {0U, 1U}) {
            for (const std::uint32_t room : {0U, 1U, 4096U}) {
                SCOPED_TRACE(row.width);
                OwnedFrame mosaic = MakeMosaic();
                mosaic->width = row.width;
                mosaic->height = row.height;
                mosaic->privateBinning = 2;
                mosaic->privateRealTime = realTime;
                OwnedFrame target(4096);
                target->bufferSize = room;
                target->width = 11;
                target->height = 13;

                EXPECT_ZERR(zerrNone, Process(zfmtRGB24, zbayerAverage, mosaic, target));

                EXPECT_TRUE(target.IsUntouchedFrom(0));
                EXPECT_EQ(11u, target->width);
                EXPECT_EQ(13u, target->height);
                EXPECT_EQ(3u * 11 * 13, target->size);
                EXPECT_EQ(static_cast<std::uint32_t>(zfmtRGB24), target->format);
                EXPECT_EQ(8, target->bits);
            }
        }
    }
}

TEST_F(FolaryFrame, KeptTheBayerFilterAloneLeavesABinnedFrameItsWidth) {
    OwnedFrame mosaic = MakeMosaic();
    mosaic->privateBinning = 2;
    OwnedFrame target(3u * Width * Height);
    target->format = zfmtRGB24;

    ASSERT_ZERR(zerrNone, Zentara_BayerToRgb(zbayerAverage, mosaic.Get(), target.Get()));

    EXPECT_EQ(Width, target->width);
    EXPECT_EQ(Height, target->height);
    const ReferenceColours colours = MakeReferenceColours(ReadMosaic(mosaic), zbayerAverage);
    EXPECT_EQ(PackReferenceColours(colours, zfmtRGB24), target.GetImage());
}

}  // namespace
}  // namespace ZV::Test
