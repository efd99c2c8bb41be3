#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <atomic>
#include <chrono>
#include <cstring>
#include <map>
#include <thread>
#include <tuple>
#include <vector>

#include "camera/bare_camera.h"
#include "imaging/image_fixture.h"
#include "imaging/image_formats.h"
#include "imaging/image_pipeline.h"
#include "imaging/rgb_filter_wheel.h"
#include "support/wait_until.h"

namespace ZV::Testing {
namespace {

constexpr std::uint8_t Untouched = 0xA5;
constexpr std::uint32_t Width = 5, Height = 3, Pixels = Width * Height;

/// A camera that says of its wheel what a test likes.
class WheelCamera : public ZV::Test::BareBase {
  public:
    std::uint32_t GetImageFormat() override { return imageFormat; }
    std::uint16_t GetRGBFilterStartColour() override { return startColour; }

    std::uint32_t imageFormat = CameraRGBFilter;
    std::uint16_t startColour = PatternRed;
};

/// Samples of a colour's frame, all different within a set of 8 bits.
std::uint32_t GetSample(std::uint32_t colour, std::uint32_t pixel, std::uint32_t bitDepth) {
    const std::uint32_t sample = colour * 64 + pixel * 3 + 1;
    return bitDepth == 8 ? sample : sample * 257 + colour;
}

Bytes MakeFrame(std::uint32_t colour, std::uint32_t bitDepth, std::uint32_t pixels = Pixels) {
    Bytes bytes;
    for (std::uint32_t pixel = 0; pixel < pixels; ++pixel) {
        const auto sample = static_cast<std::uint16_t>(GetSample(colour, pixel, bitDepth));
        std::uint8_t parts[2];
        std::memcpy(parts, &sample, 2);
        if (bitDepth == 8) {
            bytes.push_back(static_cast<std::uint8_t>(sample));
        } else {
            bytes.insert(bytes.end(), parts, parts + 2);
        }
    }
    return bytes;
}

class FilterWheel : public testing::Test {
  protected:
    FilterWheel() { (void)wheel.Init(Width, Height); }

    FilterResult Process(std::uint32_t colour, std::uint32_t bitDepth = 8) {
        Prepare(colour, bitDepth);
        return Process();
    }
    void Prepare(std::uint32_t colour, std::uint32_t bitDepth) {
        frame = MakeFrame(colour, bitDepth);
        in.data = frame.data();
        in.imageSize = static_cast<std::uint32_t>(frame.size());
        in.width = Width;
        in.height = Height;
        in.bitDepth = bitDepth;
        in.colourPattern = in.filterColour = colour;
        in.imageFormat = bitDepth == 8 ? Mono8 : Mono16;
        in.camera = &camera;
    }
    FilterResult Process() {
        output.assign(Pixels * 6 + 64, Untouched);
        out = {};
        out.data = output.data();
        return wheel.Process(&in, &out);
    }
    /// Red, green, blue.
    FilterResult ProcessSet(std::uint32_t bitDepth = 8) {
        EXPECT_EQ(FilterNothingYet, Process(PatternRed, bitDepth));
        EXPECT_EQ(FilterNothingYet, Process(PatternGreen, bitDepth));
        return Process(PatternBlue, bitDepth);
    }
    bool IsOutputUntouched(std::size_t from = 0) const {
        return std::all_of(output.begin() + static_cast<std::ptrdiff_t>(from), output.end(),
                           [](std::uint8_t byte) { return byte == Untouched; });
    }
    Bytes GetImage() const {
        return {output.begin(), output.begin() + static_cast<std::ptrdiff_t>(out.imageSize)};
    }
    std::array<int, 3> GetCounts() const {
        return {wheel.GetRedCount(), wheel.GetGreenCount(), wheel.GetBlueCount()};
    }

    WheelCamera camera;
    ZRGBFilterWheel wheel{RGBPlane8};
    Bytes frame, output;
    ZInImageBufferStruct in;
    ZOutImageBufferStruct out;
};

using Counts = std::array<int, 3>;

// ---- The order of the frames ----

TEST_F(FilterWheel, DeclinesAFrameOfACameraWhoseWheelDoesNotTurn) {
    for (const std::uint32_t format : {0U, 1U, 2U, 4U}) {
        camera.imageFormat = format;
        EXPECT_EQ(FilterDeclined, Process(PatternRed));
    }
    EXPECT_FALSE(wheel.IsStarted());
    EXPECT_TRUE(IsOutputUntouched());
}

TEST_F(FilterWheel, AFirstFrameThatIsNotOfTheStartColourIsDroppedAndStartsNothing) {
    EXPECT_EQ(FilterNothingYet, Process(PatternGreen));
    EXPECT_EQ(FilterNothingYet, Process(PatternBlue));

    EXPECT_FALSE(wheel.IsStarted());
    EXPECT_EQ((Counts{0, 0, 0}), GetCounts());
}

TEST_F(FilterWheel, ASetBeginsWithAnyStartColourAndGoesOnInTheOrderOfTheWheel) {
    constexpr std::uint16_t Turn[] = {PatternRed, PatternGreen, PatternBlue};
    for (std::size_t start = 0; start < 3; ++start) {
        camera.startColour = Turn[start];
        EXPECT_EQ(FilterNothingYet, Process(Turn[start]));
        EXPECT_TRUE(wheel.IsStarted());
        EXPECT_EQ(FilterNothingYet, Process(Turn[(start + 1) % 3]));
        EXPECT_EQ(FilterDone, Process(Turn[(start + 2) % 3]));
    }
}

TEST_F(FilterWheel, AColourThatComesTwiceIsNotStoredAndTheSetWaitsForTheNext) {
    ASSERT_EQ(FilterNothingYet, Process(PatternRed));
    ASSERT_EQ(FilterNothingYet, Process(PatternGreen));
    in.data[0] = 99;

    EXPECT_EQ(FilterNothingYet, Process());

    EXPECT_EQ((Counts{1, 1, 0}), GetCounts());
    EXPECT_EQ(FilterDone, Process(PatternBlue));
    EXPECT_EQ(GetSample(PatternGreen, 0, 8), output[Pixels]) << "of the first green one";
}

TEST_F(FilterWheel, AColourThatIsMissingCostsTheRestOfTheTurn) {
    ASSERT_EQ(FilterNothingYet, Process(PatternRed));

    EXPECT_EQ(FilterNothingYet, Process(PatternBlue));
    EXPECT_EQ(FilterNothingYet, Process(PatternRed));
    EXPECT_EQ((Counts{1, 0, 0}), GetCounts());
    EXPECT_EQ(FilterNothingYet, Process(PatternGreen));
    EXPECT_EQ(FilterDone, Process(PatternBlue));
}

TEST_F(FilterWheel, AfterASetTheCountsAre0AndTheNextBeginsWithTheStartColourOfThen) {
    ASSERT_EQ(FilterDone, ProcessSet());
    EXPECT_EQ((Counts{0, 0, 0}), GetCounts());
    EXPECT_FALSE(wheel.IsStarted());
    camera.startColour = PatternGreen;

    EXPECT_EQ(FilterNothingYet, Process(PatternRed));
    EXPECT_FALSE(wheel.IsStarted());
    EXPECT_EQ(FilterNothingYet, Process(PatternGreen));
    EXPECT_TRUE(wheel.IsStarted());
}

TEST_F(FilterWheel, AResetBetweenRedAndGreenMakesTheGreenOneWaitForRed) {
    ASSERT_EQ(FilterNothingYet, Process(PatternRed));

    wheel.Reset();

    EXPECT_EQ((Counts{0, 0, 0}), GetCounts());
    EXPECT_EQ(FilterNothingYet, Process(PatternGreen));
    EXPECT_FALSE(wheel.IsStarted());
    EXPECT_EQ(FilterDone, ProcessSet());
}

TEST_F(FilterWheel, KeptAStartWithTheUnusedColourWaitsForItForEver) {
    camera.startColour = 2;
    for (int frames = 0; frames < 4; ++frames) EXPECT_EQ(FilterNothingYet, Process(2));
    EXPECT_TRUE(wheel.IsStarted());
    EXPECT_EQ((Counts{0, 0, 0}), GetCounts());

    camera.startColour = PatternRed;
    EXPECT_EQ(FilterNothingYet, Process(PatternRed));
    EXPECT_EQ((Counts{0, 0, 0}), GetCounts()) << "it still waits";
}

TEST_F(FilterWheel, KeptThePatternIsWhatIsAwaitedAndTheFilterColourSaysWhereItGoes) {
    ASSERT_EQ(FilterNothingYet, Process(PatternRed));
    in.colourPattern = PatternGreen;
    in.filterColour = PatternBlue;
    ASSERT_EQ(FilterNothingYet, Process());
    EXPECT_EQ((Counts{1, 0, 1}), GetCounts());
    EXPECT_EQ(FilterNothingYet, Process(PatternGreen)) << "behind blue comes red";
    EXPECT_EQ((Counts{1, 0, 1}), GetCounts());

    in.colourPattern = PatternRed;
    in.filterColour = PatternGreen;
    EXPECT_EQ(FilterDone, Process());
}

// ---- The finished image ----

/// A pixel's samples in the order in which a format lays them out: the wheel's colours, X for 255.
constexpr std::uint32_t X = 100;
const std::map<std::uint32_t, std::vector<std::uint32_t>> PixelOrders = {
    {BGR24, {3, 1, 0}},
    {XRGB32, {X, 0, 1, 3}},
    {BGRX32, {3, 1, 0, X}},
    {RGB24, {0, 1, 3}},
};

/// The planes as the wheel holds them, read as bytes or words.
std::uint32_t ReadPlane(const Bytes& plane, std::uint32_t pixel, std::uint32_t sampleBytes) {
    if (sampleBytes == 1) return plane[pixel];
    std::uint16_t word = 0;
    std::memcpy(&word, plane.data() + 2 * pixel, 2);
    return word;
}

Bytes ExpectImage(std::uint32_t format, std::uint32_t bitDepth) {
    std::map<std::uint32_t, Bytes> planes;
    for (const std::uint32_t colour : {0U, 1U, 3U}) {
        planes[colour] = MakeFrame(colour, bitDepth);
        if (format <= RGBPlane16) continue;
        planes[colour].resize(Pixels * 2);  // what a plane holds beyond a frame of 8 bits
    }
    Bytes image;
    if (format <= RGBPlane16) {
        for (const auto& [colour, plane] : planes)
            image.insert(image.end(), plane.begin(), plane.end());
        return image;
    }
    for (std::uint32_t pixel = 0; pixel < Pixels; ++pixel) {
        if (format == RGB48) {
            for (const auto& [colour, plane] : planes) {
                const auto word = static_cast<std::uint16_t>(ReadPlane(plane, pixel, 2));
                std::uint8_t parts[2];
                std::memcpy(parts, &word, 2);
                image.insert(image.end(), parts, parts + 2);
            }
            continue;
        }
        for (const std::uint32_t colour : PixelOrders.at(format)) {
            image.push_back(
                colour == X ? 255
                            : static_cast<std::uint8_t>(ReadPlane(planes.at(colour), pixel, 1)));
        }
    }
    return image;
}

class FilterWheelFormat : public FilterWheel,
                          public testing::WithParamInterface<std::tuple<int, int>> {};

TEST_P(FilterWheelFormat, KeptItReadsThePlanesAndTellsItsSizeByTheFormatAlone) {
    const auto format = static_cast<std::uint32_t>(std::get<0>(GetParam()));
    const auto bitDepth = static_cast<std::uint32_t>(std::get<1>(GetParam()));
    constexpr std::uint32_t PixelBytes[] = {3, 6, 3, 4, 6, 4, 3};
    (void)wheel.SetOutputFormat(format);

    ASSERT_EQ(FilterDone, ProcessSet(bitDepth));

    EXPECT_EQ(format, out.imageFormat);
    EXPECT_EQ(Width, out.width);
    EXPECT_EQ(Height, out.height);
    EXPECT_EQ(PixelBytes[format - RGBPlane8] * Pixels, out.imageSize);
    const Bytes expected = ExpectImage(format, bitDepth);
    EXPECT_EQ(expected,
              Bytes(output.begin(), output.begin() + static_cast<std::ptrdiff_t>(expected.size())));
    EXPECT_TRUE(IsOutputUntouched(expected.size()));
}

INSTANTIATE_TEST_SUITE_P(Formats, FilterWheelFormat,
                         testing::Combine(testing::Range(6, 13), testing::Values(8, 12, 16)),
                         [](const auto& format) {
                             return "Format" + std::to_string(std::get<0>(format.param)) + "Of" +
                                    std::to_string(std::get<1>(format.param)) + "Bits";
                         });

TEST_F(FilterWheel, AFullSetOfWordsInRGB48HasSixBytesPerPixel) {
    (void)wheel.SetOutputFormat(RGB48);
    ASSERT_EQ(FilterDone, ProcessSet(16));
    EXPECT_EQ(6 * Pixels, out.imageSize);
}

TEST_F(FilterWheel, KeptPlanesOfWordsInTheFormatOfBytesAreLaidOutWholeAndCountForHalf) {
    ASSERT_EQ(FilterDone, ProcessSet(16));

    EXPECT_EQ(3 * Pixels, out.imageSize);
    const Bytes blue = MakeFrame(PatternBlue, 16);
    EXPECT_EQ(0, std::memcmp(output.data() + 4 * Pixels, blue.data(), blue.size()));
}

TEST_F(FilterWheel, PacksMoreThanOneBlockOfPixels) {
    constexpr std::uint32_t Many = 2500;
    ZRGBFilterWheel large(BGRX32);
    (void)large.Init(Many, 1);
    std::vector<Bytes> planes;
    Bytes image(Many * 4);
    ZInImageBufferStruct input;
    ZOutImageBufferStruct result{.data = image.data(), .dataCapacity = image.size()};
    for (const std::uint32_t colour : {0U, 1U, 3U}) {
        planes.push_back(MakeFrame(colour, 8, Many));
        input = {.data = planes.back().data(),
                 .imageSize = Many,
                 .width = Many,
                 .height = 1,
                 .bitDepth = 8,
                 .colourPattern = colour,
                 .filterColour = colour,
                 .camera = &camera};
        (void)large.Process(&input, &result);
    }
    for (std::uint32_t pixel = 0; pixel < Many; ++pixel) {
        ASSERT_EQ(planes[2][pixel], image[4 * pixel]) << pixel;
        ASSERT_EQ(planes[1][pixel], image[4 * pixel + 1]) << pixel;
        ASSERT_EQ(planes[0][pixel], image[4 * pixel + 2]) << pixel;
        ASSERT_EQ(255, image[4 * pixel + 3]) << pixel;
    }
}

// ---- What is refused ----

TEST_F(FilterWheel, KeptAFormatThatCannotBePackedKeepsTheSetForTheNextFrameInTurn) {
    for (const std::uint32_t format : {0U, 5U, 13U, 0xFFFFFFFFU}) {
        wheel.Reset();
        (void)wheel.SetOutputFormat(format);
        EXPECT_EQ(FilterFailed, ProcessSet());
        EXPECT_EQ((Counts{1, 1, 1}), GetCounts());
        EXPECT_EQ(FilterNothingYet, Process(PatternGreen)) << "red is next";
        EXPECT_EQ(FilterFailed, Process(PatternRed));
        EXPECT_EQ((Counts{2, 1, 1}), GetCounts());
        EXPECT_TRUE(IsOutputUntouched());

        (void)wheel.SetOutputFormat(RGB24);
        EXPECT_EQ(FilterDone, Process(PatternGreen)) << "at once";
        EXPECT_EQ((Counts{0, 0, 0}), GetCounts());
    }
}

TEST_F(FilterWheel, AFrameThatIsLargerThanThePlanesIsNotStored) {
    ZRGBFilterWheel small(RGBPlane8);
    (void)small.Init(2, 2);
    frame = Bytes(9, 7);
    in = {.data = frame.data(), .imageSize = 9, .width = 3, .height = 3, .bitDepth = 8};
    in.camera = &camera;
    EXPECT_EQ(FilterNotInitialised, small.Process(&in, &out));
    EXPECT_EQ(0, small.GetRedCount());

    in.imageSize = 4;
    in.bitDepth = 16;
    EXPECT_EQ(FilterNotInitialised, small.Process(&in, &out)) << "by its sides";
    in.width = in.height = 0xFFFFFFFF;
    in.bitDepth = 0xFFFFFFFF;
    EXPECT_EQ(FilterNotInitialised, small.Process(&in, &out));
    EXPECT_EQ(0, small.GetRedCount());

    in.width = in.height = 2;
    in.bitDepth = 8;
    EXPECT_EQ(FilterNothingYet, small.Process(&in, &out)) << "the turn is still red's";
    EXPECT_EQ(1, small.GetRedCount());
}

TEST_F(FilterWheel, KeptALargerSizeGivenLaterMakesNoLargerPlanes) {
    ZRGBFilterWheel small(RGBPlane8);
    (void)small.Init(2, 2);
    (void)small.Init(Width, Height);
    (void)Process(PatternRed);

    EXPECT_EQ(FilterNotInitialised, small.Process(&in, &out));
}

TEST_F(FilterWheel, BeforeItHasPlanesAFrameIsTooLarge) {
    ZRGBFilterWheel bare(RGBPlane8);
    (void)Process(PatternRed);

    EXPECT_EQ(FilterNotInitialised, bare.Process(&in, &out));
}

TEST_F(FilterWheel, WordsThatThePlanesDoNotHoldAreNotRead) {
    ZRGBFilterWheel narrow(RGB48);
    (void)narrow.Init(Width, 2);  // room for 20 bytes a plane, 10 words
    std::array<FilterResult, 3> results{};
    for (std::size_t i = 0; i < 3; ++i) {
        (void)Process(std::array{0U, 1U, 3U}[i]);
        std::fill(output.begin(), output.end(), Untouched);
        results[i] = narrow.Process(&in, &out);
    }
    EXPECT_EQ(FilterNothingYet, results[1]);
    EXPECT_EQ(FilterNotInitialised, results[2]) << "15 bytes were stored, 15 words are not there";
    EXPECT_TRUE(IsOutputUntouched());
}

TEST_F(FilterWheel, AnOutputThatHoldsLessThanTheImageIsNotWritten) {
    ASSERT_EQ(FilterNothingYet, Process(PatternRed, 16));
    ASSERT_EQ(FilterNothingYet, Process(PatternGreen, 16));
    (void)Process(PatternGreen);
    frame = MakeFrame(PatternBlue, 16);
    in = {.data = frame.data(),
          .imageSize = 2 * Pixels,
          .width = Width,
          .height = Height,
          .bitDepth = 16,
          .colourPattern = 3,
          .filterColour = 3,
          .camera = &camera};
    out.dataCapacity = 6 * Pixels - 1;  // the reported size would fit

    EXPECT_EQ(FilterFailed, wheel.Process(&in, &out));

    EXPECT_TRUE(IsOutputUntouched());
}

TEST_F(FilterWheel, AFrameWithoutDataCountsAndLeavesItsPlaneAsItWas) {
    ASSERT_EQ(FilterDone, ProcessSet());
    ASSERT_EQ(FilterNothingYet, Process(PatternRed));
    in = {.width = Width,
          .height = Height,
          .bitDepth = 8,
          .colourPattern = 1,
          .filterColour = 1,
          .camera = &camera};

    EXPECT_EQ(FilterNothingYet, Process());

    EXPECT_EQ((Counts{1, 1, 0}), GetCounts());
    EXPECT_EQ(FilterDone, Process(PatternBlue));
    EXPECT_EQ(GetSample(PatternGreen, 0, 8), output[Pixels]);
}

// ---- Needs, and being switched ----

TEST_F(FilterWheel, AsksForTheImageWhenAFrameWouldCompleteTheSetAndElseForTheFrame) {
    (void)wheel.SetOutputFormat(RGB48);
    (void)Process(PatternRed);
    in.filterColour = PatternBlue;
    EXPECT_EQ(Pixels, wheel.GetNeededOutputBufferSize(&in));
    (void)Process(PatternGreen);
    for (const std::uint32_t colour : {0U, 1U, 2U, 4U, 5U}) {
        in.filterColour = colour;
        EXPECT_EQ(Pixels, wheel.GetNeededOutputBufferSize(&in)) << colour;
    }
    in.filterColour = PatternBlue;
    EXPECT_EQ(6 * Pixels, wheel.GetNeededOutputBufferSize(&in));
    in.imageSize = 0x80000000;
    EXPECT_EQ(0U, wheel.GetNeededOutputBufferSize(&in)) << "32 bits";
}

TEST_F(FilterWheel, BeingDisabledDropsTheSetAndThePlanesAndEnablingMakesThemAnew) {
    ASSERT_EQ(FilterNothingYet, Process(PatternRed));
    wheel.Disable();
    EXPECT_EQ((Counts{0, 0, 0}), GetCounts());
    EXPECT_FALSE(wheel.IsStarted());
    EXPECT_EQ(FilterNotInitialised, Process(PatternRed));

    wheel.Enable();

    EXPECT_EQ(FilterDone, ProcessSet());
}

TEST_F(FilterWheel, BeingEnabledAloneSufficesBehindFramesThatWereMetWhileDisabled) {
    wheel.Disable();
    ASSERT_EQ(FilterNotInitialised, Process(PatternRed));
    ASSERT_TRUE(wheel.IsStarted()) << "it waits for red";
    camera.startColour = PatternGreen;

    wheel.Enable();

    EXPECT_FALSE(wheel.IsStarted());
    EXPECT_EQ(FilterNothingYet, Process(PatternGreen));
    EXPECT_EQ(FilterNothingYet, Process(PatternBlue));
    EXPECT_EQ(FilterDone, Process(PatternRed));
    EXPECT_EQ(ExpectImage(RGBPlane8, 8), GetImage());
}

TEST_F(FilterWheel, BeingEnabledWithPlanesKeepsTheSetThatIsUnderWay) {
    ASSERT_EQ(FilterNothingYet, Process(PatternRed));

    wheel.Enable();

    EXPECT_EQ((Counts{1, 0, 0}), GetCounts());
    EXPECT_EQ(FilterNothingYet, Process(PatternGreen));
    EXPECT_EQ(FilterDone, Process(PatternBlue));
}

TEST_F(FilterWheel, BeingEnabledBeforeItKnowsASizeLeavesThePlanesToInit) {
    ZRGBFilterWheel fresh(RGBPlane8);
    fresh.Enable();
    fresh.AllocateBuffers(0, Height);
    (void)fresh.Init(Width, 0);
    (void)Process(PatternRed);
    ASSERT_EQ(FilterNotInitialised, fresh.Process(&in, &out));

    (void)fresh.Init(Width, Height);

    EXPECT_EQ(FilterNothingYet, fresh.Process(&in, &out));
    EXPECT_EQ(1, fresh.GetRedCount());
}

TEST_F(FilterWheel, PlanesThatCouldNotBeMadeAreMadeBySizesThatFit) {
    ZRGBFilterWheel claimed(RGBPlane8);
    (void)claimed.Init(65535, 65535);
    (void)Process(PatternRed);
    ASSERT_EQ(FilterNotInitialised, claimed.Process(&in, &out));

    (void)claimed.Init(Width, Height);

    EXPECT_EQ(FilterNothingYet, claimed.Process(&in, &out));
}

TEST_F(FilterWheel, MayBeResetAndSwitchedWhileFramesCome) {
    std::atomic<bool> mayEnd{false};
    std::thread client([&] {
        while (!mayEnd) {
            wheel.Reset();
            wheel.Disable();
            wheel.Enable();
            ZV::Test::Disturb(std::chrono::microseconds(20));
        }
    });

    const Bytes expected = ExpectImage(RGBPlane8, 8);
    const auto end = std::chrono::steady_clock::now() + std::chrono::seconds(20);
    int images = 0;
    for (int set = 0; set < 300 || (images == 0 && std::chrono::steady_clock::now() < end); ++set) {
        for (const std::uint32_t colour : {0U, 1U, 3U}) {
            Prepare(colour, 8);
            // As the pipeline does: it asks, and gives just so many bytes.
            output.assign(wheel.GetNeededOutputBufferSize(&in), Untouched);
            out = {};
            out.data = output.data();
            out.dataCapacity = output.size();
            const FilterResult result = wheel.Process(&in, &out);
            // Without room for its image a set would fail.
            EXPECT_TRUE(result == FilterDone || result == FilterNothingYet ||
                        result == FilterNotInitialised)
                << result;
            if (result != FilterDone) continue;
            ++images;
            EXPECT_EQ(expected, GetImage());
        }
    }
    mayEnd = true;
    client.join();
    EXPECT_NE(0, images);
    EXPECT_EQ(FilterDone, ProcessSet());
    EXPECT_EQ(expected, GetImage());
}

// ---- In its pipeline ----

class WheelPipeline : public FilterWheel {
  protected:
    WheelPipeline() {
        pipeline.Setup(Width, Height);
        pipeline.AddFilter(&wheel);
    }

    ZExImage MakeWheelImage(std::uint32_t colour, std::uint16_t bitDepth) {
        return MakeImage(MakeFrame(colour, bitDepth),
                         {.width = Width,
                          .height = Height,
                          .bitDepth = bitDepth,
                          .format = bitDepth == 8 ? Mono8 : Mono16,
                          .pattern = static_cast<ZColourPatternEnum>(colour),
                          .camera = static_cast<ZCamera*>(&camera)});
    }

    ZImagePipeline pipeline;
};

TEST_F(WheelPipeline, HoldsTwoFramesBackAndDeliversTheThirdAsTheImage) {
    for (const std::uint16_t bitDepth : {std::uint16_t{8}, std::uint16_t{12}}) {
        for (std::uint32_t format = RGBPlane8; format <= RGB24; ++format) {
            (void)wheel.SetOutputFormat(format);
            for (const std::uint32_t colour : {0U, 1U}) {
                ZExImage held = MakeWheelImage(colour, bitDepth);
                bool isComplete = true;
                EXPECT_EQ(FilterNothingYet, pipeline.ProcessImage(&held, &isComplete));
                EXPECT_FALSE(isComplete);
                EXPECT_EQ(MakeFrame(colour, bitDepth), GetPixels(held)) << "no growth";
            }
            ZExImage image = MakeWheelImage(3, bitDepth);
            bool isComplete = false;

            ASSERT_EQ(FilterDone, pipeline.ProcessImage(&image, &isComplete)) << format;

            EXPECT_TRUE(isComplete);
            EXPECT_EQ(format, image.GetImageFormat());
            const Bytes expected = ExpectImage(format, bitDepth);
            const Bytes pixels = GetPixels(image);
            const std::size_t count = std::min(pixels.size(), expected.size());
            EXPECT_EQ(GetThreeColourPixelBytes(format) * Pixels, pixels.size());
            EXPECT_EQ(
                Bytes(expected.begin(), expected.begin() + static_cast<std::ptrdiff_t>(count)),
                Bytes(pixels.begin(), pixels.begin() + static_cast<std::ptrdiff_t>(count)))
                << format;
        }
    }
}

TEST_F(WheelPipeline, AFormatThatCannotBePackedLeavesTheThirdFrameAsItCame) {
    (void)wheel.SetOutputFormat(RGBX32);
    bool isComplete = false;
    for (const std::uint32_t colour : {0U, 1U}) {
        ZExImage held = MakeWheelImage(colour, 8);
        (void)pipeline.ProcessImage(&held, &isComplete);
    }
    ZExImage image = MakeWheelImage(3, 8);

    EXPECT_EQ(FilterFailed, pipeline.ProcessImage(&image, &isComplete));

    EXPECT_TRUE(isComplete);
    EXPECT_EQ(std::uint32_t{Mono8}, image.GetImageFormat());
    EXPECT_EQ(MakeFrame(3, 8), GetPixels(image));
}

TEST_F(WheelPipeline, AStaleRestOfThePlanesIsPackedWithFramesOfOneByte) {
    (void)wheel.SetOutputFormat(RGB48);
    ASSERT_EQ(FilterDone, ProcessSet(16));
    const Bytes before = output;

    ASSERT_EQ(FilterDone, ProcessSet(8));

    EXPECT_EQ(6 * Pixels, out.imageSize);
    EXPECT_EQ(before[6 * Pixels - 1], output[6 * Pixels - 1]) << "of the set before";
}

}  // namespace
}  // namespace ZV::Testing
