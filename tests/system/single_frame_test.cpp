#include <gtest/gtest.h>

#include <atomic>
#include <cstdlib>
#include <thread>
#include <vector>

#include "support/wait_until.h"
#include "system/single_frame.h"

namespace ZV::Test {
namespace {

void CountDelivery(std::uint64_t userPrivate, std::uint32_t, std::uint32_t errorCode,
                   std::uint32_t) {
    EXPECT_ZERR(zerrNone, errorCode);
    ++*reinterpret_cast<std::atomic<std::size_t>*>(static_cast<std::uintptr_t>(userPrivate));
}

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

TEST_F(SingleFrame, WorksForAnOpenCameraAlone) {
    OwnedFrame mosaic = GrabMosaic();
    OwnedFrame target = MakeTarget(mosaic, zfmtRGB24);
    const Zentara_Frame before = GetRecord(target);
    for (const ZentaraHandle camera : {ZentaraHandle{0}, ZentaraHandle{0x1234}, handle + 8}) {
        std::memcpy(mosaic->privateCamera, &camera, sizeof(camera));
        EXPECT_ZERR(zerrBadHandle, Process(zfmtRGB24, zbayerFast, mosaic, target));
    }
    ExpectSameRecord(before, target);
    EXPECT_TRUE(target.IsUntouchedFrom(0));
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
    const Case cases[] = {
        {zfmtBayer8, zfmtRGB24, 3 * Pixels},    {zfmtBayer8, zfmtXRGB32, 4 * Pixels},
        {zfmtBayer8, zfmtRGB48, 6 * Pixels},    {zfmtBayer8, zfmtBayer8, Pixels},
        {zfmtBayer8, zfmtRGBPlane8, Pixels},    {zfmtRGB24, zfmtRGB24, Pixels},
        {zfmtBayer16, zfmtRGB48, 6 * Pixels},   {zfmtBayer16, zfmtRGB24, 3 * Pixels},
        {zfmtBayer16, zfmtBayer16, 2 * Pixels}, {zfmtBayer16, zfmtRGBPlane16, 2 * Pixels},
    };
    for (const Case& row : cases) {
        for (const std::uint32_t algorithm : {zbayerFast, zbayerAverage, zbayerBicubic}) {
            const bool isOfWords = row.inFormat == zfmtBayer16;
            OwnedFrame from(isOfWords ? 2 * Pixels : Pixels);
            CopyRecord(mosaic, from);
            from->format = row.inFormat;
            from->bits = isOfWords ? 16 : 8;
            OwnedFrame exact(row.needed), oneLess(row.needed - 1);

            EXPECT_ZERR(zerrBufferTooSmall, Process(row.outFormat, algorithm, from, oneLess));
            EXPECT_ZERR(zerrNone, Process(row.outFormat, algorithm, from, exact));
            EXPECT_TRUE(oneLess.IsUntouchedFrom(0));
            EXPECT_EQ(0u, oneLess->size);
            exact->bufferSize = 0;
            EXPECT_ZERR(zerrNone, Process(row.outFormat, algorithm, from, exact)) << "vouched for";
        }
    }
}

TEST_F(SingleFrame, KeptAFrameLargerThanTheSensorIsCopiedAndNamedAsFinished) {
    OwnedFrame mosaic = GrabMosaic();
    const std::uint32_t bytes = mosaic->size;
    struct Case {
        std::uint32_t width, height;
    };
    for (const Case& row : {Case{65, 48}, Case{65535, 65535}, Case{65536, 65536},
                            Case{0x80000000, 1}, Case{0xFFFFFFFF, 0xFFFFFFFF}}) {
        SCOPED_TRACE(row.width);
        mosaic->width = row.width;
        mosaic->height = row.height;
        for (const std::uint32_t room : {bytes, 0U}) {
            OwnedFrame target(2 * bytes), small(2 * bytes);
            target->bufferSize = room;
            small->bufferSize = bytes - 1;

            EXPECT_ZERR(zerrNone, Process(zfmtRGB24, zbayerBicubic, mosaic, target));
            EXPECT_ZERR(zerrBufferTooSmall, Process(zfmtRGB24, zbayerBicubic, mosaic, small));

            EXPECT_EQ(row.width, target->width);
            EXPECT_EQ(row.height, target->height);
            EXPECT_EQ(static_cast<std::uint32_t>(zfmtRGB24), target->format);
            EXPECT_EQ(
                static_cast<std::uint32_t>(Zentara_CalcImageSize(zfmtRGB24, row.width, row.height)),
                target->size);
            EXPECT_TRUE(
                std::equal(mosaic.pixels.begin(), mosaic.pixels.end(), target.pixels.begin()));
            EXPECT_TRUE(target.IsUntouchedFrom(bytes));
            EXPECT_TRUE(small.IsUntouchedFrom(0));
        }
    }
}

TEST_F(SingleFrame, AFrameOfNoBytesInsideItsTargetGivesTheColoursOfNoLight) {
    OwnedFrame mosaic = GrabMosaic();
    OwnedFrame target = MakeTarget(mosaic, zfmtRGB24);
    mosaic->pBuffer = target.pixels.data() + 5;
    mosaic->size = mosaic->bufferSize = 0;

    EXPECT_ZERR(zerrNone, Process(zfmtRGB24, zbayerAverage, mosaic, target));

    EXPECT_EQ(std::vector<std::uint8_t>(target.pixels.size()), target.GetImage());
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

TEST_F(SingleFrame, KeptColoursOfFewerBytesThanTheirSizeAsksForAreCopiedAndNotBalanced) {
    scales[0] = 2000;
    Send(zfmtBayer8, zfmtRGB24, zbayerFast, false);
    OwnedFrame mosaic = GrabMosaic();
    OwnedFrame colours(3u * 64 * 48 - 1);
    CopyRecord(mosaic, colours);
    colours->format = zfmtRGB24;
    std::fill(colours.pixels.begin(), colours.pixels.end(), std::uint8_t{100});
    for (const std::uint32_t height : {48U, 49U, 0xFFFFFFFFU}) {
        colours->height = height;
        OwnedFrame target(4u * 64 * 48);

        ASSERT_ZERR(zerrNone, Process(zfmtRGB24, zbayerFast, colours, target));

        EXPECT_EQ(height, target->height);
        EXPECT_EQ(static_cast<std::uint32_t>(Zentara_CalcImageSize(zfmtRGB24, 64, height)),
                  target->size);
        EXPECT_TRUE(
            std::equal(colours.pixels.begin(), colours.pixels.end(), target.pixels.begin()));
        EXPECT_TRUE(target.IsUntouchedFrom(colours.pixels.size()));
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

TEST_F(CopiedFrame, IsRefusedForItsSettingsFirstThenForItsCameraAndThenForItsPixels) {
    OwnedFrame from = GrabAs(zfmtRaw8);
    from->pBuffer = nullptr;
    GrownFrame to(16);
    Zentara_Settings block = MakeBlock(99, 0);
    Zentara_Settings corrupt = block;
    WriteField<std::uint32_t>(corrupt, 252, 0);
    const auto copy = [&](ZentaraHandle camera, Zentara_Settings* settings) {
        return Zentara_PostProcessSingleFrame(camera, settings, from.Get(), &to.frame);
    };

    EXPECT_ZERR(zerrBadSettings, copy(0x1234, nullptr));
    EXPECT_ZERR(zerrBadSettings, copy(0x1234, &corrupt));
    EXPECT_ZERR(zerrBadHandle, copy(0x1234, &block));
    EXPECT_ZERR(zerrBadParameter, copy(handle, &block));
    EXPECT_EQ(16u, to.frame.bufferSize);
    EXPECT_EQ(0u, to.frame.size);

    from->pBuffer = from.pixels.data();
    SetHandleOf(block, 0x1234);
    from->privateCamera[0] = from->privateCamera[1] = 0x77777777;
    EXPECT_ZERR(zerrNone, copy(handle, &block)) << "neither block nor frame is asked for a camera";
    ExpectCopied(from, to);
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

TEST_F(SingleFrameOfTwoCameras, IsRefusedOnceTheFramesCameraIsClosed) {
    ZentaraHandle second = 0;
    ASSERT_ZERR(zerrNone, Zentara_OpenCamera(1, &second));
    OwnedFrame mosaic = GrabMosaic();
    std::memcpy(mosaic->privateCamera, &second, sizeof(second));
    mosaic->width = mosaic->height = 32;
    mosaic->size = 32 * 32;
    OwnedFrame target = MakeTarget(mosaic, zfmtRGB24);
    target->format = zfmtRGB24;
    EXPECT_ZERR(zerrNone, Process(zfmtRGB24, zbayerFast, mosaic, target));
    EXPECT_ZERR(zerrNone, Zentara_BayerToRgb(zbayerFast, mosaic.Get(), target.Get()));
    ASSERT_ZERR(zerrNone, Zentara_CloseCamera(second));
    const Zentara_Frame before = GetRecord(target);

    EXPECT_ZERR(zerrBadHandle, Process(zfmtRGB24, zbayerFast, mosaic, target));
    EXPECT_ZERR(zerrBadHandle, Zentara_BayerToRgb(zbayerFast, mosaic.Get(), target.Get()));

    ExpectSameRecord(before, target);
}

TEST_F(SingleFrame, MayBeFinishedBesideADelivery) {
    constexpr std::size_t Rounds = 200;
    OwnedFrame mosaic = GrabMosaic();
    const auto expected = Finish(mosaic, zbayerAverage, zfmtRGB24);
    Send(zfmtBayer8, zfmtRGB24, zbayerAverage, /*isPostProcessing=*/true);
    std::vector<OwnedFrame> queued;
    for (std::size_t i = 0; i < Rounds; ++i) queued.emplace_back(expected.size());
    std::atomic<std::size_t> delivered{0};
    ASSERT_ZERR(zerrNone, Zentara_SetStreaming(handle, 1));
    std::thread converter([&] {
        for (std::size_t i = 0; i < Rounds; ++i) {
            OwnedFrame target(expected.size());
            target->format = zfmtRGB24;
            EXPECT_ZERR(zerrNone, Zentara_BayerToRgb(zbayerAverage, mosaic.Get(), target.Get()));
            EXPECT_TRUE(expected == target.GetImage());
        }
    });
    for (std::size_t i = 0; i < Rounds; ++i) {
        // One behind the other, so that deliveries go on until the last frame is finished.
        EXPECT_TRUE(WaitUntil([&] { return i < delivered + 4; }));
        EXPECT_ZERR(zerrNone,
                    Zentara_QueueFrame(handle, queued[i].Get(), CountDelivery, zcbFrameDone,
                                       reinterpret_cast<std::uintptr_t>(&delivered), 0));
        OwnedFrame target(expected.size());
        EXPECT_ZERR(zerrNone, Process(zfmtRGB24, zbayerAverage, mosaic, target));
        EXPECT_TRUE(expected == target.GetImage());
    }
    EXPECT_TRUE(WaitUntil([&] { return delivered == Rounds; }));
    converter.join();
    EXPECT_ZERR(zerrNone, Zentara_SetStreaming(handle, 0));

    for (const OwnedFrame& frame : queued) EXPECT_TRUE(expected == frame.GetImage());
}

}  // namespace
}  // namespace ZV::Test
