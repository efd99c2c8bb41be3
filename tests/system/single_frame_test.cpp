#include <gtest/gtest.h>

#include <cstdlib>
#include <thread>
#include <vector>

#include "system/mosaic_camera.h"

namespace ZV::Test {
namespace {

class SingleFrame : public MosaicCamera {
  protected:
    explicit SingleFrame(std::string_view scenario = SmallColour) : MosaicCamera(scenario) {}

    Zentara_Settings MakeBlock(std::uint32_t format, std::uint32_t algorithm) {
        return MakeSettings(zfmtBayer8, format, algorithm, false);
    }
    ZentaraResult Process(std::uint32_t format, std::uint32_t algorithm, OwnedFrame& from,
                          OwnedFrame& to) {
        Zentara_Settings block = MakeBlock(format, algorithm);
        return Zentara_PostProcessSingleFrame(handle, &block, from.Get(), to.Get());
    }
    static OwnedFrame MakeTarget(OwnedFrame& mosaic, std::uint32_t format) {
        return OwnedFrame(std::max<std::size_t>(
            Zentara_CalcImageSize(format, mosaic->width, mosaic->height), mosaic->size));
    }
    void ExpectFinished(OwnedFrame& mosaic, std::uint32_t format, std::uint32_t algorithm) {
        OwnedFrame target = MakeTarget(mosaic, format);
        ASSERT_ZERR(zerrNone, Process(format, algorithm, mosaic, target));
        EXPECT_EQ(Finish(mosaic, algorithm, format), target.GetImage())
            << format << " by " << algorithm;
        EXPECT_EQ(format, target->format);
        EXPECT_EQ(mosaic->width, target->width);
        EXPECT_EQ(mosaic->height, target->height);
        EXPECT_EQ(mosaic->bits, target->bits);
        EXPECT_EQ(Zentara_CalcImageSize(format, mosaic->width, mosaic->height), target->size);
    }
    static Zentara_Frame GetRecord(OwnedFrame& frame) { return *frame.Get(); }
    static void ExpectSameRecord(const Zentara_Frame& expected, OwnedFrame& frame) {
        EXPECT_EQ(0, std::memcmp(&expected, frame.Get(), sizeof(expected)));
    }
};

TEST_F(SingleFrame, FinishesBytesByEveryAlgorithmInEveryFormat) {
    OwnedFrame mosaic = GrabMosaic();
    for (const std::uint32_t format : MosaicByteFormats) {
        for (const std::uint32_t algorithm : MosaicAlgorithms) {
            ExpectFinished(mosaic, format, algorithm);
        }
    }
}

TEST_F(SingleFrame, FinishesWordsByEveryAlgorithm) {
    Send(zfmtBayer16, zfmtRGB48, zbayerAverage, false);
    OwnedFrame mosaic = GrabMosaic();
    for (const std::uint32_t algorithm : MosaicAlgorithms) {
        ExpectFinished(mosaic, zfmtRGB48, algorithm);
    }
}

TEST_F(SingleFrame, ScalesTheColoursByTheLastSend) {
    scales[0] = 1500;
    scales[1] = 700;
    scales[2] = 2250;
    Send(zfmtBayer8, zfmtRGB24, zbayerAverage, false);
    OwnedFrame mosaic = GrabMosaic();

    ExpectFinished(mosaic, zfmtRGB24, zbayerAverage);
    ExpectFinished(mosaic, zfmtXRGB32, zbayerBicubic);
}

class FreshCamera : public SingleFrame {
  protected:
    void SetUp() override { OpenedCamera::SetUp(); }
};

TEST_F(FreshCamera, KeptAFrameIsTintedBeforeScalesAreSent) {
    OwnedFrame mosaic = GrabMosaic();
    OwnedFrame target = MakeTarget(mosaic, zfmtRGB24);
    Zentara_Settings block = ReadSettings();
    SetWord(block, zprmPostProcessImageFormat, zfmtRGB24);
    SetWord(block, zprmPostProcessBayerAlgorithm, zbayerFast);

    ASSERT_ZERR(zerrNone,
                Zentara_PostProcessSingleFrame(handle, &block, mosaic.Get(), target.Get()));

    ReferenceColours colours = MakeReferenceColours(ReadMosaic(mosaic), zbayerFast);
    ScaleReferenceColours(colours, {1.16F, 1.0F, 1.88F}, 8);
    EXPECT_EQ(PackReferenceColours(colours, zfmtRGB24), target.GetImage());
}

TEST_F(SingleFrame, LeavesTheFieldsThatItDoesNotName) {
    OwnedFrame mosaic = GrabMosaic();
    mosaic->frameNumber = 5;
    mosaic->errorCode = zerrMissingData;
    mosaic->timeStamp = 8;
    OwnedFrame target = MakeTarget(mosaic, zfmtRGB24);
    target->frameNumber = 77;
    target->bayerPattern = 3;
    target->errorCode = 99;
    target->timeStamp = 55;
    target->privateFilled = 4;

    ASSERT_ZERR(zerrNone, Process(zfmtRGB24, zbayerFast, mosaic, target));

    EXPECT_EQ(77, target->frameNumber);
    EXPECT_EQ(3u, target->bayerPattern);
    EXPECT_EQ(99u, target->errorCode);
    EXPECT_EQ(55u, target->timeStamp);
    EXPECT_EQ(4u, target->privateFilled);
    EXPECT_EQ(0u, target->privateCamera[0] + target->privateCamera[1]);
}

TEST_F(SingleFrame, TestsItsArgumentsInOrder) {
    OwnedFrame mosaic = GrabMosaic();
    OwnedFrame target = MakeTarget(mosaic, zfmtRGB24);
    const Zentara_Frame before = GetRecord(target);
    Zentara_Settings block = MakeBlock(zfmtRGB24, zbayerFast);
    Zentara_Settings corrupt = block;
    WriteField<std::uint32_t>(corrupt, 252, 0);
    const auto process = [](ZentaraHandle camera, Zentara_Settings* settings,
                            const Zentara_Frame* from, Zentara_Frame* to) {
        return Zentara_PostProcessSingleFrame(camera, settings, from, to);
    };

    EXPECT_ZERR(zerrBadParameter, process(0, nullptr, mosaic.Get(), target.Get()));
    EXPECT_ZERR(zerrBadParameter, process(handle, nullptr, nullptr, target.Get()));
    EXPECT_ZERR(zerrBadParameter, process(handle, nullptr, mosaic.Get(), nullptr));
    EXPECT_ZERR(zerrBadSettings, process(0x1234, nullptr, mosaic.Get(), target.Get()));
    EXPECT_ZERR(zerrBadSettings, process(0x1234, &corrupt, mosaic.Get(), target.Get()));
    EXPECT_ZERR(zerrBadHandle, process(0x1234, &block, mosaic.Get(), target.Get()));
    ExpectSameRecord(before, target);
    EXPECT_TRUE(target.IsUntouchedFrom(0));

    ASSERT_ZERR(zerrNone, Zentara_CloseCamera(handle));
    EXPECT_ZERR(zerrBadHandle, process(handle, &block, mosaic.Get(), target.Get()));
    Zentara_ReleaseDriver();
    EXPECT_ZERR(zerrNotLoaded, process(0, nullptr, nullptr, nullptr));
    EXPECT_ZERR(zerrNone, Zentara_LoadDriver());
}

TEST_F(SingleFrame, TestsTheRoadToColoursInOrder) {
    OwnedFrame mosaic = GrabMosaic();
    OwnedFrame target = MakeTarget(mosaic, zfmtRGB24);
    const Zentara_Frame before = GetRecord(target);
    Zentara_Settings block = MakeBlock(zfmtRGB24, zbayerFast);
    SetHandleOf(block, 0x1234);
    Zentara_Frame foreign = GetRecord(mosaic);
    foreign.privateCamera[0] = foreign.privateCamera[1] = 0;
    foreign.pBuffer = nullptr;
    const auto process = [&](const Zentara_Frame& from) {
        return Zentara_PostProcessSingleFrame(handle, &block, &from, target.Get());
    };

    EXPECT_ZERR(zerrBadSettings, process(foreign)) << "the block's own camera is not open";
    SetHandleOf(block, handle);
    foreign.width = 0;
    EXPECT_ZERR(zerrBadParameter, process(foreign)) << "an empty image";
    foreign.width = 64;
    SetWord(block, zprmPostProcessImageFormat, 13);
    EXPECT_ZERR(zerrBadParameter, process(foreign)) << "a format without a size";
    SetWord(block, zprmPostProcessImageFormat, zfmtBGR24);
    EXPECT_ZERR(zerrBadHandle, process(foreign));
    Zentara_Frame empty = GetRecord(mosaic);
    empty.pBuffer = nullptr;
    EXPECT_ZERR(zerrBadParameter, process(empty));
    empty = GetRecord(mosaic);
    empty.bufferSize = empty.size - 1;
    EXPECT_ZERR(zerrBadParameter, process(empty));
    EXPECT_EQ(static_cast<std::uint32_t>(zfmtRGB24),
              GetWord(ReadSettings(), zprmPostProcessImageFormat))
        << "nothing has changed up to here";

    SetWord(block, zprmPostProcessBayerAlgorithm, 0);
    target->bufferSize = 1;
    EXPECT_ZERR(zerrBadParameter, process(GetRecord(mosaic))) << "algorithm 0";
    SetWord(block, zprmPostProcessBayerAlgorithm, zbayerBicubic);
    EXPECT_ZERR(zerrBufferTooSmall, process(GetRecord(mosaic)));
    target->pBuffer = nullptr;
    EXPECT_ZERR(zerrBadParameter, process(GetRecord(mosaic)));
    EXPECT_EQ(static_cast<std::uint32_t>(zfmtBGR24),
              GetWord(ReadSettings(), zprmPostProcessImageFormat));
    EXPECT_EQ(static_cast<std::uint32_t>(zbayerBicubicFaster),
              GetWord(ReadSettings(), zprmPostProcessBayerAlgorithm));

    *target.Get() = before;
    EXPECT_TRUE(target.IsUntouchedFrom(0));
}

TEST_F(SingleFrame, AsksForTheLargestImageOnTheWayToTheByte) {
    OwnedFrame mosaic = GrabMosaic();
    struct Case {
        std::uint32_t inFormat, outFormat, needed;
    };
    constexpr std::uint32_t Pixels = 64 * 48;
    const Case cases[] = {{zfmtBayer8, zfmtRGB24, 3 * Pixels}, {zfmtBayer8, zfmtXRGB32, 4 * Pixels},
                          {zfmtBayer8, zfmtRGB48, 6 * Pixels}, {zfmtBayer8, zfmtBayer8, Pixels},
                          {zfmtBayer8, zfmtRGBPlane8, Pixels}, {zfmtRGB24, zfmtRGB24, Pixels}};
    for (const Case& row : cases) {
        mosaic->format = row.inFormat;
        OwnedFrame exact(row.needed), oneLess(row.needed - 1);

        EXPECT_ZERR(zerrBufferTooSmall, Process(row.outFormat, zbayerFast, mosaic, oneLess));
        EXPECT_ZERR(zerrNone, Process(row.outFormat, zbayerFast, mosaic, exact));
        EXPECT_TRUE(oneLess.IsUntouchedFrom(0));
        EXPECT_EQ(0u, oneLess->size);
        exact->bufferSize = 0;
        EXPECT_ZERR(zerrNone, Process(row.outFormat, zbayerFast, mosaic, exact)) << "vouched for";
    }
}

TEST_F(SingleFrame, KeptAnAlgorithmAbove4KeepsTheOneInForceAndRuns) {
    OwnedFrame mosaic = GrabMosaic();
    OwnedFrame target = MakeTarget(mosaic, zfmtRGB24);
    Send(zfmtBayer8, zfmtRGB24, zbayerBicubic, false);

    ASSERT_ZERR(zerrNone, Process(zfmtRGB24, 5, mosaic, target));

    EXPECT_EQ(Finish(mosaic, zbayerBicubic, zfmtRGB24), target.GetImage());
}

TEST_F(SingleFrame, KeptAFormatWithoutColoursGivesTheMosaicUnderThatName) {
    OwnedFrame mosaic = GrabMosaic();
    for (const std::uint32_t format : {zfmtRaw8, zfmtMono16, zfmtBayer8, zfmtBayer16}) {
        OwnedFrame target(2u * 64 * 48);

        ASSERT_ZERR(zerrNone, Process(format, zbayerFast, mosaic, target));

        EXPECT_EQ(format, target->format);
        EXPECT_EQ(Zentara_CalcImageSize(format, 64, 48), target->size);
        target->size = mosaic->size;
        EXPECT_EQ(mosaic.GetImage(), target.GetImage());
        EXPECT_TRUE(target.IsUntouchedFrom(mosaic->size));
    }
}

TEST_F(SingleFrame, KeptAFailureOfTheFiltersIsNotTold) {
    OwnedFrame mosaic = GrabMosaic();
    OwnedFrame target = MakeTarget(mosaic, zfmtRGBPlane8);

    EXPECT_ZERR(zerrNone, Process(zfmtRGBPlane8, zbayerFast, mosaic, target));

    EXPECT_EQ(static_cast<std::uint32_t>(zfmtRGBPlane8), target->format);
    EXPECT_EQ(3u * 64 * 48, target->size);
    EXPECT_EQ(64u, target->width);
}

TEST_F(SingleFrame, KeptColoursAreBalancedInTheirOwnFormatAndNamedByTheSettings) {
    scales[0] = 2000;
    Send(zfmtBayer8, zfmtRGB24, zbayerFast, false);
    OwnedFrame mosaic = GrabMosaic();
    OwnedFrame colours(3u * 64 * 48);
    *colours.Get() = *mosaic.Get();
    colours->pBuffer = colours.pixels.data();
    colours->size = colours->bufferSize = 3 * 64 * 48;
    colours->format = zfmtRGB24;
    std::fill(colours.pixels.begin(), colours.pixels.end(), std::uint8_t{100});
    OwnedFrame target(4u * 64 * 48);

    ASSERT_ZERR(zerrNone, Process(zfmtBGRX32, zbayerFast, colours, target));

    EXPECT_EQ(static_cast<std::uint32_t>(zfmtBGRX32), target->format);
    EXPECT_EQ(4u * 64 * 48, target->size);
    for (std::size_t i = 0; i < colours.pixels.size(); ++i) {
        ASSERT_EQ(i % 3 == 0 ? 200 : 100, target.pixels[i]);
    }
}

TEST_F(SingleFrame, MayWriteOverTheFrameItReads) {
    OwnedFrame mosaic = GrabMosaic();
    const auto expected = Finish(mosaic, zbayerAverage, zfmtRGB24);
    OwnedFrame both(expected.size());
    std::copy(mosaic.pixels.begin(), mosaic.pixels.end(), both.pixels.begin());
    *both.Get() = *mosaic.Get();
    both->pBuffer = both.pixels.data();
    both->bufferSize = static_cast<std::uint32_t>(expected.size());

    ASSERT_ZERR(zerrNone, Process(zfmtRGB24, zbayerAverage, both, both));

    EXPECT_EQ(expected, both.GetImage());
}

class FolaryFrame : public SingleFrame {
  protected:
    FolaryFrame() : SingleFrame("folary") {}
    void SetUp() override { OpenedCamera::SetUp(); }

    /// A mosaic of 64 x 48 bytes that says it came from this camera.
    OwnedFrame MakeMosaic() const {
        OwnedFrame mosaic(64 * 48);
        for (std::size_t i = 0; i < mosaic.pixels.size(); ++i) {
            mosaic.pixels[i] = static_cast<std::uint8_t>(i * 7);
        }
        mosaic->format = zfmtBayer8;
        mosaic->bits = 8;
        mosaic->width = 64;
        mosaic->height = 48;
        mosaic->size = 64 * 48;
        mosaic->privateBinning = 1;
        std::memcpy(mosaic->privateCamera, &handle, sizeof(handle));
        return mosaic;
    }
};

TEST_F(FolaryFrame, AsksForTheImageThatTheCorrectedMosaicGives) {
    struct Case {
        const char* what;
        std::uint32_t binning, realTime, format, width, height, needed;
    };
    const Case cases[] = {
        {"not binned", 1, 0, zfmtRGB24, 64, 48, 3 * 64 * 48},
        {"binned by 2", 2, 0, zfmtRGB24, 32, 48, 3 * 32 * 48},
        {"binned by 3", 3, 0, zfmtXRGB32, 20, 48, 4 * 20 * 48},
        {"binned by 4, mosaic", 4, 0, zfmtBayer8, 16, 48, 16 * 48},
        {"real time", 1, 1, zfmtRGB24, 16, 96, 3 * 16 * 96},
        {"real time, binned", 2, 7, zfmtBayer8, 16, 96, 16 * 96},
        {"binned by 5", 5, 0, zfmtRGB24, 12, 48, 3 * 12 * 48},
        {"binned beyond the width", 0xFFFFFFFF, 0, zfmtRGB24, 0, 48, 0},
        {"not reported", 0, 0, zfmtRGB24, 20, 10, 3 * 20 * 10},
    };
    for (const Case& row : cases) {
        SCOPED_TRACE(row.what);
        OwnedFrame mosaic = MakeMosaic();
        mosaic->privateBinning = row.binning;
        mosaic->privateRealTime = row.realTime;
        OwnedFrame exact(std::max(row.needed, 1U)), oneLess(std::max(row.needed, 2U) - 1);
        exact->width = oneLess->width = 20;
        exact->height = oneLess->height = 10;

        EXPECT_ZERR(row.needed > 1 ? zerrBufferTooSmall : zerrNone,
                    Process(row.format, zbayerFast, mosaic, oneLess));
        EXPECT_ZERR(zerrNone, Process(row.format, zbayerFast, mosaic, exact));

        EXPECT_EQ(row.width, exact->width);
        EXPECT_EQ(row.height, exact->height);
        EXPECT_EQ(row.format, exact->format);
        EXPECT_EQ(Zentara_CalcImageSize(row.format, row.width, row.height), exact->size);
    }
}

TEST_F(FolaryFrame, SizesThatLieComeBack) {
    for (const std::uint32_t side : {65535U, 65536U, 0x80000000U, 0xFFFFFFFFU}) {
        for (const std::uint32_t realTime : {0U, 1U}) {
            OwnedFrame mosaic = MakeMosaic();
            mosaic->width = mosaic->height = side;
            mosaic->privateBinning = 2;
            mosaic->privateRealTime = realTime;
            OwnedFrame target(4096);
            const ZentaraResult result = Process(zfmtRGB24, zbayerAverage, mosaic, target);
            EXPECT_ZERR(zerrBufferTooSmall, result) << side;
            target->bufferSize = 0;
            EXPECT_ZERR(zerrNone, Process(zfmtRGB24, zbayerAverage, mosaic, target)) << side;
            EXPECT_TRUE(target.IsUntouchedFrom(0)) << side;
        }
    }
}

// ---- Raw and monochrome frames are copied ----

/// A frame whose buffer is of the C allocator, as a copy may give it back.
class GrownFrame {
  public:
    explicit GrownFrame(std::uint32_t bytes) {
        frame.pBuffer = bytes != 0 ? std::malloc(bytes) : nullptr;
        frame.bufferSize = bytes;
    }
    ~GrownFrame() { std::free(frame.pBuffer); }
    GrownFrame(const GrownFrame&) = delete;
    GrownFrame& operator=(const GrownFrame&) = delete;

    std::vector<std::uint8_t> GetImage() const {
        const auto* bytes = static_cast<const std::uint8_t*>(frame.pBuffer);
        return {bytes, bytes + frame.size};
    }

    Zentara_Frame frame{};
};

class CopiedFrame : public SingleFrame {
  protected:
    OwnedFrame GrabAs(std::uint32_t format) {
        OwnedFrame frame = GrabMosaic();
        frame->format = format;
        frame->frameNumber = 321;
        frame->bayerPattern = 2;
        frame->errorCode = zerrMissingData;
        frame->timeStamp = 11;
        return frame;
    }
    void ExpectCopied(OwnedFrame& from, const GrownFrame& to) {
        EXPECT_EQ(from.GetImage(), to.GetImage());
        EXPECT_EQ(from->format, to.frame.format);
        EXPECT_EQ(from->width, to.frame.width);
        EXPECT_EQ(from->height, to.frame.height);
        EXPECT_EQ(from->size, to.frame.size);
        EXPECT_EQ(from->bits, to.frame.bits);
        EXPECT_EQ(321, to.frame.frameNumber);
        EXPECT_EQ(2u, to.frame.bayerPattern);
        EXPECT_EQ(static_cast<std::uint32_t>(zerrMissingData), to.frame.errorCode);
        EXPECT_EQ(11u, to.frame.timeStamp);
        EXPECT_EQ(0u, to.frame.privateCamera[0] + to.frame.privateCamera[1]) << "kept: not copied";
        EXPECT_EQ(0u, to.frame.privateFilled);
    }
    ZentaraResult Copy(OwnedFrame& from, GrownFrame& to) {
        Zentara_Settings block = MakeBlock(99, 0);
        return Zentara_PostProcessSingleFrame(handle, &block, from.Get(), &to.frame);
    }
};

TEST_F(CopiedFrame, WhateverTheSettingsSayIntoABufferThatIsMadeGrownOrLargeEnough) {
    for (const std::uint32_t format : {zfmtRaw8, zfmtRaw16, zfmtMono8, zfmtMono16}) {
        OwnedFrame from = GrabAs(format);
        for (const std::uint32_t bytes : {0u, 1u, from->size - 1, from->size, 2 * from->size}) {
            GrownFrame to(bytes);

            ASSERT_ZERR(zerrNone, Copy(from, to));

            ExpectCopied(from, to);
            EXPECT_EQ(std::max(bytes, from->size), to.frame.bufferSize)
                << "a larger buffer keeps its size";
        }
    }
}

TEST_F(CopiedFrame, ANullBufferCountsAsNoneWhateverItsSizeSays) {
    OwnedFrame from = GrabAs(zfmtMono8);
    GrownFrame to(0);
    to.frame.bufferSize = 1000000;

    ASSERT_ZERR(zerrNone, Copy(from, to));

    ExpectCopied(from, to);
    EXPECT_EQ(from->size, to.frame.bufferSize);
}

TEST_F(CopiedFrame, OfNoPixelsGivesABufferOfNone) {
    OwnedFrame from = GrabAs(zfmtMono8);
    from->size = 0;
    GrownFrame to(0);

    ASSERT_ZERR(zerrNone, Copy(from, to));

    EXPECT_NE(nullptr, to.frame.pBuffer);
    EXPECT_EQ(0u, to.frame.bufferSize + to.frame.size);
}

TEST_F(CopiedFrame, MayBeTheFrameItselfOrShareItsBuffer) {
    OwnedFrame from = GrabAs(zfmtMono8);
    const auto expected = from.GetImage();
    Zentara_Settings block = MakeBlock(zfmtRGB24, 1);
    EXPECT_ZERR(zerrNone, Zentara_PostProcessSingleFrame(handle, &block, from.Get(), from.Get()));
    EXPECT_EQ(expected, from.GetImage());

    GrownFrame shared(from->size);
    std::copy(expected.begin(), expected.end(), static_cast<std::uint8_t*>(shared.frame.pBuffer));
    from->pBuffer = shared.frame.pBuffer;
    shared.frame.bufferSize = 1;
    EXPECT_ZERR(zerrNone, Copy(from, shared));
    EXPECT_EQ(expected, shared.GetImage());
}

TEST_F(CopiedFrame, IsRefusedWithoutPixelsToRead) {
    OwnedFrame from = GrabAs(zfmtMono8);
    GrownFrame to(16);
    from->bufferSize = from->size - 1;
    EXPECT_ZERR(zerrBadParameter, Copy(from, to));
    from->pBuffer = nullptr;
    from->bufferSize = 0;
    EXPECT_ZERR(zerrBadParameter, Copy(from, to));
    EXPECT_EQ(16u, to.frame.bufferSize);
    EXPECT_EQ(0u, to.frame.size);
}

// ---- Two cameras, two threads ----

inline constexpr std::string_view TwoColours =
    R"({"base": "colour", "cameras": [{"sensor": {"width": 64, "height": 48}},
        {"model": "PellanA1", "sensor": {"width": 32, "height": 32, "colour": "bayer"}}]})";

class SingleFrameOfTwoCameras : public SingleFrame {
  protected:
    SingleFrameOfTwoCameras() : SingleFrame(TwoColours) {}
};

TEST_F(SingleFrameOfTwoCameras, KeptTheFramesCameraWorksWhateverTheHandle) {
    ZentaraHandle second = 0;
    ASSERT_ZERR(zerrNone, Zentara_OpenCamera(1, &second));
    OwnedFrame mosaic = GrabMosaic();
    OwnedFrame target = MakeTarget(mosaic, zfmtBGR24);
    Zentara_Settings block = MakeBlock(zfmtBGR24, zbayerFast);

    ASSERT_ZERR(zerrNone,
                Zentara_PostProcessSingleFrame(second, &block, mosaic.Get(), target.Get()));

    EXPECT_EQ(Finish(mosaic, zbayerFast, zfmtBGR24), target.GetImage());
    EXPECT_EQ(static_cast<std::uint32_t>(zfmtBGR24),
              GetWord(ReadSettings(), zprmPostProcessImageFormat))
        << "of the frame's camera";
    Zentara_Settings other{};
    ASSERT_ZERR(zerrNone, Zentara_ReadSettingsFromCam(second, &other));
    EXPECT_EQ(static_cast<std::uint32_t>(zfmtRGB24), GetWord(other, zprmPostProcessImageFormat));
    EXPECT_ZERR(zerrNone, Zentara_CloseCamera(second));
}

TEST_F(SingleFrame, MayBeFinishedBesideADelivery) {
    OwnedFrame mosaic = GrabMosaic();
    const auto expected = Finish(mosaic, zbayerAverage, zfmtRGB24);
    Send(zfmtBayer8, zfmtRGB24, zbayerAverage, /*isPostProcessing=*/true);
    std::vector<std::vector<std::uint8_t>> grabbed;
    std::thread grabber([&] {
        for (int i = 0; i < 20; ++i) {
            OwnedFrame frame(expected.size());
            EXPECT_ZERR(zerrNone, Zentara_GrabFrame(handle, frame.Get()));
            grabbed.push_back(frame.GetImage());
        }
    });
    std::thread converter([&] {
        for (int i = 0; i < 200; ++i) {
            OwnedFrame target(expected.size());
            target->format = zfmtRGB24;
            EXPECT_ZERR(zerrNone, Zentara_BayerToRgb(zbayerAverage, mosaic.Get(), target.Get()));
            EXPECT_TRUE(expected == target.GetImage());
        }
    });
    for (int i = 0; i < 200; ++i) {
        OwnedFrame target(expected.size());
        EXPECT_ZERR(zerrNone, Process(zfmtRGB24, zbayerAverage, mosaic, target));
        EXPECT_TRUE(expected == target.GetImage());
    }
    grabber.join();
    converter.join();

    for (const auto& image : grabbed) EXPECT_TRUE(expected == image);
}

}  // namespace
}  // namespace ZV::Test
