// Three exposures behind a filter wheel are one colour image: what the client gets is held against
// frames that are computed on their own, from the scene of the simulation.

#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <cstring>
#include <iterator>
#include <memory>
#include <string>
#include <vector>

#include "camera/morvane_fw_camera.h"
#include "imaging/image_filter.h"
#include "imaging/image_pipeline.h"
#include "support/flat_camera.h"
#include "support/reference_renderer.h"

namespace ZV::Test {
namespace {

using Bytes = std::vector<std::uint8_t>;

constexpr std::uint32_t Width = 60, Height = 40, Pixels = Width * Height;
constexpr std::uint32_t ImageBytesMax = 6 * Pixels;
constexpr double FullWell = 22000;
constexpr double Brightness = 1.5e6;

/// In the order of the wheel's turn.
constexpr std::array<std::uint32_t, 3> Turn{zwheelRed, zwheelGreen, zwheelBlue};

std::string MakeScenario(const std::string& faults = "") {
    return R"({"base": "wheel", "cameras": [{"sensor": {"width": 60, "height": 40, "noise": false,
              "darkCurrent": 0, "fullWell": 22000}, "scene": {"kind": "chart",
              "brightness": 1.5e6, "light": [0.8, 1, 0.6]}, "faults": [)" +
           faults + "]}]}";
}

/// An image of three planes as a format lays it out, by words of its definition.
Bytes LayOut(const std::array<Bytes, 3>& planes, std::uint32_t format) {
    constexpr std::uint32_t Filler = 3;
    Bytes image;
    if (format == zfmtRGBPlane8 || format == zfmtRGBPlane16) {
        for (const Bytes& plane : planes) image.insert(image.end(), plane.begin(), plane.end());
        return image;
    }
    const std::size_t sampleBytes = format == zfmtRGB48 ? 2 : 1;
    std::vector<std::uint32_t> order{0, 1, 2};
    if (format == zfmtBGR24) order = {2, 1, 0};
    if (format == zfmtXRGB32) order = {Filler, 0, 1, 2};
    if (format == zfmtBGRX32) order = {2, 1, 0, Filler};
    for (std::size_t pixel = 0; pixel < Pixels; ++pixel) {
        for (const std::uint32_t channel : order) {
            for (std::size_t byte = 0; byte < sampleBytes; ++byte) {
                const std::size_t place = pixel * sampleBytes + byte;
                // What a plane of one byte has behind its samples was never written.
                const bool isThere = channel != Filler && place < planes[channel].size();
                image.push_back(channel == Filler ? 255 : isThere ? planes[channel][place] : 0);
            }
        }
    }
    return image;
}

/// More than the ring holds.
constexpr std::uint32_t RequestsUntilSettled = 70;

class WheelCapture : public OpenedCamera {
  protected:
    explicit WheelCapture(const std::string& faults = "") : OpenedCamera(MakeScenario(faults)) {}

    ZCamera& GetCamera() { return *reinterpret_cast<ZCamera*>(handle); }

    /// A format of three colours makes the wheel turn.
    void Send(std::uint32_t format, std::uint32_t startColour = zwheelRed,
              std::uint32_t trigger = ztrigFreeRun) {
        Zentara_Settings settings = ReadSettings();
        ASSERT_ZERR(zerrNone, Zentara_SetParam(&settings, zprmImageFormat, format));
        ASSERT_ZERR(zerrNone, Zentara_SetParam(&settings, zprmColorWheel, startColour));
        ASSERT_ZERR(zerrNone, Zentara_SetParam(&settings, zprmTriggerType, trigger));
        SetExposures(settings, {9'000'000, 6'000'000, 12'000'000});
        ASSERT_ZERR(zerrNone, Zentara_SendSettingsToCam(handle, &settings));
    }
    void SetExposures(Zentara_Settings& settings, const std::array<std::uint64_t, 3>& nanoseconds) {
        constexpr std::array Keys{zprm64ExposureRed, zprm64Exposure, zprm64ExposureBlue};
        for (std::size_t i = 0; i < 3; ++i) {
            ASSERT_ZERR(zerrNone, Zentara_SetParam64(&settings, static_cast<std::uint32_t>(Keys[i]),
                                                     nanoseconds[i]));
            seconds[i] = static_cast<double>(nanoseconds[i]) / 1e9;
        }
    }

    /// The scene in red, green and blue, each with its exposure.
    std::array<Bytes, 3> RenderPlanes() {
        ReferenceCamera reference;
        reference.width = Width;
        reference.height = Height;
        reference.fullWell = FullWell;
        reference.darkCurrentAt20 = 0;
        reference.scene = "chart";
        reference.brightness = Brightness;
        reference.light = {0.8, 1, 0.6};
        const ReferenceRenderer renderer(reference);
        std::array<Bytes, 3> planes;
        for (std::size_t i = 0; i < 3; ++i) {
            ReferenceExposure exposure;
            exposure.width = Width;
            exposure.height = Height;
            exposure.bitDepth = GetCamera().GetBitDepth();
            exposure.seconds = seconds[i];
            exposure.offset = GetCamera().GetOffset();
            exposure.wheelColour = static_cast<int>(Turn[i]);
            for (const std::uint16_t sample : renderer.Render(exposure)) {
                std::uint8_t parts[2];
                std::memcpy(parts, &sample, 2);
                const std::size_t sampleBytes = exposure.bitDepth > 8 ? 2 : 1;
                planes[i].insert(planes[i].end(), parts, parts + sampleBytes);
            }
        }
        return planes;
    }

    void ExpectImage(ClientFrame& frame, std::uint32_t format) {
        constexpr std::uint32_t PixelBytes[] = {3, 6, 3, 4, 6, 4, 3};
        EXPECT_ZERR(zerrNone, frame->errorCode);
        EXPECT_EQ(format, frame->format);
        EXPECT_EQ(Width, frame->width);
        EXPECT_EQ(Height, frame->height);
        ASSERT_EQ(PixelBytes[format - zfmtRGBPlane8] * Pixels, frame->size);
        EXPECT_EQ(GetCamera().GetBitDepth(), frame->bits);
        const Bytes expected = LayOut(RenderPlanes(), format);
        const std::size_t count = std::min<std::size_t>(expected.size(), frame->size);
        const auto* const end = frame.GetPixels() + count;
        const auto difference = std::mismatch(frame.GetPixels(), end, expected.begin());
        EXPECT_EQ(end, difference.first)
            << "byte " << difference.first - frame.GetPixels() << " of format " << format;
        EXPECT_TRUE(frame.IsGuardIntact());
    }

    /// The sent frame that a delivered image bears the number of, from 1.
    std::uint64_t FindSent(std::uint32_t rollingFrameNumber) const {
        for (const TraceRecord& sent : world.ReadFrames()) {
            if (sent.rollingFrameNumber == rollingFrameNumber) return sent.frame;
        }
        return 0;
    }
    std::uint32_t FindSentColour(std::uint32_t rollingFrameNumber) const {
        for (const TraceRecord& sent : world.ReadFrames()) {
            if (sent.rollingFrameNumber == rollingFrameNumber) return sent.plane;
        }
        return 99;
    }

    /// Streams `count` images and leaves the stream off.
    void StreamImages(std::size_t count) {
        frames.clear();
        for (std::size_t i = 0; i < count; ++i) {
            frames.push_back(std::make_unique<ClientFrame>(ImageBytesMax));
            ASSERT_ZERR(zerrNone, Queue(*frames.back(), log, zcbFrameDone));
        }
        const std::size_t before = log.CountCalls();
        ASSERT_ZERR(zerrNone, Zentara_SetStreaming(handle, 1));
        EXPECT_TRUE(log.WaitForCalls(before + count));
        ASSERT_ZERR(zerrNone, Zentara_SetStreaming(handle, 0));
    }

    /// Queues frames for a stream that goes on trigger by trigger, so that no exposure is lost for
    /// want of time.
    void BeginSteps(std::size_t count) {
        frames.clear();
        for (std::size_t i = 0; i < count; ++i) {
            frames.push_back(std::make_unique<ClientFrame>(ImageBytesMax));
            ASSERT_ZERR(zerrNone, Queue(*frames.back(), log, zcbFrameDone));
        }
        ASSERT_ZERR(zerrNone, Zentara_SetStreaming(handle, 1));
    }
    void Step(std::size_t exposures) {
        for (std::size_t i = 0; i < exposures; ++i) {
            const std::size_t sent = world.ReadFrames().size();
            const std::uint64_t begun = GetCounters().begun.Get();
            ASSERT_ZERR(zerrNone, Zentara_Trigger(handle));
            ASSERT_TRUE(WaitUntil([&] { return world.ReadFrames().size() > sent; }));
            ASSERT_TRUE(WaitUntilServed(begun));
        }
    }
    StreamCounters& GetCounters() {
        return static_cast<MorvaneFWCamera&>(GetCamera()).GetStreamCounters();
    }
    /// Whether the frame sent last, if its start is seen at all, is past the queue of two, which
    /// would drop one else. One that has lost its end waits for the next.
    bool WaitUntilServed(std::uint64_t begunBefore) {
        const std::uint32_t served = world.GetState().requestsServed;
        const StreamCounters& counters = GetCounters();
        return WaitUntil([&] {
            const bool isParsed = counters.begun.Get() > begunBefore ||
                                  world.GetState().requestsServed - served >= RequestsUntilSettled;
            return isParsed &&
                   counters.begun.Get() <= counters.delivered.GetSum() + counters.heldBack.Get() +
                                               counters.dropped.Get() + counters.bad.Get() + 1;
        });
    }

    std::array<double, 3> seconds{};
    CallbackLog log;
    std::vector<std::unique_ptr<ClientFrame>> frames;
};

class WheelFormat : public WheelCapture, public testing::WithParamInterface<std::uint32_t> {};

TEST_P(WheelFormat, AGrabGivesOneColourImageOfTheScene) {
    Send(GetParam());
    ClientFrame frame(ImageBytesMax);

    ASSERT_ZERR(zerrNone, Zentara_GrabFrame(handle, frame.Get()));

    ExpectImage(frame, GetParam());
}

TEST_P(WheelFormat, AStreamGivesOneColourImageForThreeExposures) {
    Send(GetParam());

    StreamImages(3);

    ASSERT_EQ(3U, frames.size());
    for (std::size_t i = 0; i < frames.size(); ++i) {
        ClientFrame& frame = *frames[i];
        ExpectImage(frame, GetParam());
        EXPECT_EQ(zwheelBlue, static_cast<int>(FindSentColour(frame->frameNumber)));
        EXPECT_EQ(0U, FindSent(frame->frameNumber) % 3);
        if (i == 0) continue;
        EXPECT_LT((*frames[i - 1])->frameNumber, frame->frameNumber);
    }
}

TEST_P(WheelFormat, KeptTheOtherDepthIsPackedAsTheFormatHasIt) {
    Send(GetParam());
    const bool isByte = GetCamera().GetBitDepth() == 8;
    ASSERT_EQ(CameraOk, GetCamera().SetBitDepth(isByte ? 12 : 8));
    ASSERT_EQ(CameraOk, GetCamera().UpdateSettingsOnCamera());

    StreamImages(1);

    ExpectImage(*frames.at(0), GetParam());
}

INSTANTIATE_TEST_SUITE_P(Formats, WheelFormat, testing::Range(6U, 13U), [](const auto& format) {
    return "Format" + std::to_string(format.param);
});

TEST_F(WheelCapture, ASetBeginsWithTheStartColourThatWasAskedFor) {
    for (std::size_t start = 0; start < 3; ++start) {
        Send(zfmtRGB24, Turn[start]);

        StreamImages(2);

        for (const auto& frame : frames) {
            ExpectImage(*frame, zfmtRGB24);
            EXPECT_EQ(Turn[(start + 2) % 3], FindSentColour((*frame)->frameNumber));
        }
    }
}

TEST_F(WheelCapture, NoExposureIsLostBetweenTwoImages) {
    Send(zfmtRGB24, zwheelRed, ztrigSoftware);
    BeginSteps(3);
    for (std::size_t image = 1; image <= 3; ++image) {
        Step(3);
        ASSERT_TRUE(log.WaitForCalls(image));
        EXPECT_EQ(image, log.CountCalls());
    }
    ASSERT_ZERR(zerrNone, Zentara_SetStreaming(handle, 0));

    for (std::size_t i = 0; i < 3; ++i) {
        ExpectImage(*frames[i], zfmtRGB24);
        EXPECT_EQ(3 * (i + 1), FindSent((*frames[i])->frameNumber));
    }
}

TEST_F(WheelCapture, AMonochromeFormatStopsTheWheelAndEveryExposureIsAnImage) {
    Send(zfmtRGB24);
    StreamImages(1);
    Send(zfmtMono8, zwheelRed, ztrigSoftware);
    const std::size_t before = log.CountCalls();

    BeginSteps(3);
    for (std::size_t image = 1; image <= 3; ++image) {
        Step(1);
        ASSERT_TRUE(log.WaitForCalls(before + image));
    }
    ASSERT_ZERR(zerrNone, Zentara_SetStreaming(handle, 0));

    for (const auto& frame : frames) {
        EXPECT_EQ(std::uint32_t{zfmtMono8}, (*frame)->format);
        EXPECT_EQ(Pixels, (*frame)->size);
    }
}

TEST_F(WheelCapture, KeptABufferForOneColourIsTakenAndTheImageThenDoesNotFit) {
    Send(zfmtRGB24);
    ClientFrame frame(Pixels);

    ASSERT_ZERR(zerrNone, Zentara_GrabFrame(handle, frame.Get()));

    EXPECT_ZERR(zerrBufferTooSmall, frame->errorCode);
    EXPECT_EQ(0U, frame->size);
    EXPECT_TRUE(frame.IsUntouched());
}

// ---- A lost frame ----

/// One of the three exposures of the second image never arrives.
class WheelLosing : public WheelCapture, public testing::WithParamInterface<std::uint32_t> {
  protected:
    WheelLosing()
        : WheelCapture(R"({"kind": "losePacket", "packet": 0, "count": 0, "frame": )" +
                       std::to_string(GetParam()) + "}") {}
};

TEST_P(WheelLosing, AFrameCostsOneTurnOfTheWheelAndNoMore) {
    Send(zfmtRGB24, zwheelRed, ztrigSoftware);
    BeginSteps(3);

    Step(3);
    ASSERT_TRUE(log.WaitForCalls(1));
    Step(6);
    ASSERT_TRUE(log.WaitForCalls(2));
    Step(3);
    ASSERT_TRUE(log.WaitForCalls(3));
    ASSERT_ZERR(zerrNone, Zentara_SetStreaming(handle, 0));

    for (const auto& frame : frames) ExpectImage(*frame, zfmtRGB24);
    EXPECT_EQ(3U, FindSent((*frames[0])->frameNumber));
    EXPECT_EQ(9U, FindSent((*frames[1])->frameNumber)) << "instead of 6";
    EXPECT_EQ(12U, FindSent((*frames[2])->frameNumber));
}

INSTANTIATE_TEST_SUITE_P(Frames, WheelLosing, testing::Values(4U, 5U, 6U));

// ---- Settings in the middle of a set ----

class WheelStepByStep : public WheelCapture {
  protected:
    /// Whether the wheel holds two colours and waits for this one.
    bool IsWaitingFor(std::uint32_t colour) {
        ZInImageBufferStruct in;
        in.imageSize = 1;
        in.filterColour = colour;
        return GetCamera().GetImagePipeline()->GetNeededOutputBufferSize(&in) > 1;
    }
};

TEST_F(WheelStepByStep, SettingsInTheMiddleOfASetDropIt) {
    Send(zfmtRGB24, zwheelRed, ztrigSoftware);
    BeginSteps(1);
    Step(2);
    ASSERT_TRUE(WaitUntil([&] { return IsWaitingFor(zwheelBlue); }));

    Zentara_Settings settings = ReadSettings();
    SetExposures(settings, {5'000'000, 8'000'000, 7'000'000});
    ASSERT_ZERR(zerrNone, Zentara_SendSettingsToCam(handle, &settings));

    EXPECT_FALSE(IsWaitingFor(zwheelBlue));
    while (log.CountCalls() == 0 && world.ReadFrames().size() < 8) Step(1);
    ASSERT_TRUE(log.WaitForCalls(1));
    ASSERT_ZERR(zerrNone, Zentara_SetStreaming(handle, 0));
    ExpectImage(*frames.at(0), zfmtRGB24);
    EXPECT_GE(FindSent((*frames.at(0))->frameNumber), 5U)
        << "three exposures after the two that were dropped";
}

TEST_F(WheelStepByStep, SettingsThatChangeNothingLeaveTheSetAlone) {
    Send(zfmtRGB24, zwheelRed, ztrigSoftware);
    BeginSteps(1);
    Step(2);
    ASSERT_TRUE(WaitUntil([&] { return IsWaitingFor(zwheelBlue); }));

    Zentara_Settings settings = ReadSettings();
    ASSERT_ZERR(zerrNone, Zentara_SendSettingsToCam(handle, &settings));

    EXPECT_TRUE(IsWaitingFor(zwheelBlue));
    Step(1);
    ASSERT_TRUE(log.WaitForCalls(1));
    ASSERT_ZERR(zerrNone, Zentara_SetStreaming(handle, 0));
    ExpectImage(*frames.at(0), zfmtRGB24);
    EXPECT_EQ(3U, FindSent((*frames.at(0))->frameNumber));
}

}  // namespace
}  // namespace ZV::Test
