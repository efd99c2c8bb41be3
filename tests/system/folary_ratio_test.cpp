// A camera whose frames are binned down their columns alone: the ratio filter gives them the
// scene's proportions. Each frame shows the whole chart, whose patches stand at known fractions of
// width and height.

#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <cmath>
#include <cstring>
#include <string>
#include <vector>

#include "camera/camera.h"
#include "camera/register_map.h"
#include "imaging/folary_ratio_correction.h"
#include "imaging/image_pipeline.h"
#include "support/flat_camera.h"
#include "support/ratio_judge.h"
#include "support/reference_renderer.h"

namespace ZV::Test {
namespace {

using Samples = std::vector<std::uint32_t>;

constexpr std::uint32_t PatchColumns = 6, PatchRows = 4;
constexpr double FullWell = 22000;
constexpr double Brightness = 3e5;

/// A sensor, and the real-time video that shows all of it.
struct FolarySensor {
    std::uint32_t width, height;
    std::uint32_t videoRows;  ///< Rows of a frame of real-time video, each of `videoBinning`.
    std::uint32_t videoBinning;
    std::uint32_t videoFactor;  ///< By which the filter reduces its columns.
};
constexpr FolarySensor Sensors[] = {{2560, 1920, 240, 8, 4}, {2048, 1536, 256, 6, 3}};

constexpr std::uint32_t RealTime = 0;  ///< In place of a binning mode.

struct RatioCase {
    FolarySensor sensor;
    std::uint32_t binning;
    std::uint32_t depthFormat;  ///< zfmtBayer8 or zfmtBayer16.
};

std::vector<RatioCase> MakeCases() {
    std::vector<RatioCase> cases;
    for (const FolarySensor& sensor : Sensors) {
        for (const std::uint32_t binning : {RealTime, 2U, 3U, 4U}) {
            for (const std::uint32_t format : {zfmtBayer8, zfmtBayer16}) {
                cases.push_back({sensor, binning, format});
            }
        }
    }
    return cases;
}

/// `isMode3`: whether the camera's code 2 of binning reads back as mode 3, or as mode 8.
std::string MakeScenario(const FolarySensor& sensor, bool isMode3) {
    const std::uint32_t window = InsertField(
        ConfigWidthBinning2, InsertField(ConfigHeightBinning2, 0, sensor.videoRows), sensor.width);
    return R"({"base": "folary", "cameras": [{"sensor": {"width": )" +
           std::to_string(sensor.width) + R"(, "height": )" + std::to_string(sensor.height) +
           R"(, "noise": false, "darkCurrent": 0, "fullWell": 22000, "videoBinning": )" +
           std::to_string(sensor.videoBinning) + R"(}, "configuration": {")" +
           std::to_string(ConfigWidthBinning2.quadlet) + R"(": )" + std::to_string(window) +
           R"(, ")" + std::to_string(ConfigBinningCode2Is8.quadlet) + R"(": )" +
           (isMode3 ? "0" : "1") +
           R"(}, "scene": {"kind": "chart", "brightness": 3e5, "light": [0.8, 1, 0.6]}}]})";
}

/// A mosaic (one sample a pixel) or a finished image (red, green, blue).
struct Picture {
    std::uint32_t width = 0, height = 0;
    bool isMosaic = true;
    std::uint32_t mosaic = 0;  ///< Of the first pixel, 0 to 3.
    Samples samples;

    /// Colour 0 to 2 at a place, or right beside it where the mosaic has it.
    std::uint32_t Get(std::uint32_t x, std::uint32_t y, std::uint32_t colour) const {
        if (!isMosaic) return samples.at((std::size_t{y} * width + x) * 3 + colour);
        static constexpr std::uint32_t Cells[4][4] = {
            {0, 1, 1, 2}, {1, 0, 2, 1}, {1, 2, 0, 1}, {2, 1, 1, 0}};
        const std::uint32_t left = x & ~1U, top = y & ~1U;
        for (std::uint32_t place = 0; place < 4; ++place) {
            if (Cells[mosaic][place] != colour) continue;
            return samples.at(std::size_t{top + place / 2} * width + left + place % 2);
        }
        return 0;
    }
};

Samples ReadSamples(const std::uint8_t* pixels, std::size_t count, std::size_t sampleBytes) {
    Samples samples(count);
    for (std::size_t i = 0; i < count; ++i) {
        std::uint16_t word = pixels[i * sampleBytes];
        if (sampleBytes == 2) std::memcpy(&word, pixels + 2 * i, 2);
        samples[i] = word;
    }
    return samples;
}

class FolaryProportions : public OpenedCamera, public testing::WithParamInterface<RatioCase> {
  protected:
    FolaryProportions() : OpenedCamera(MakeScenario(GetParam().sensor, true)) {}

    ZCamera& GetCamera() { return *reinterpret_cast<ZCamera*>(handle); }
    bool IsVideo() const { return GetParam().binning == RealTime; }
    std::size_t GetSampleBytes() const { return GetParam().depthFormat == zfmtBayer8 ? 1 : 2; }
    std::uint32_t GetFactor() const {
        return IsVideo() ? GetParam().sensor.videoFactor : GetParam().binning;
    }
    std::uint32_t GetRowsAdded() const {
        return IsVideo() ? GetParam().sensor.videoBinning : GetParam().binning;
    }

    /// The same light in a sample in every mode.
    std::uint64_t GetExposureNs() const { return 48'000'000 / GetRowsAdded(); }

    void Send(bool isFinished) {
        Zentara_Settings settings = ReadSettings();
        const auto set = [&](std::uint32_t key, std::uint32_t value) {
            ASSERT_ZERR(zerrNone, Zentara_SetParam(&settings, key, value));
        };
        set(zprmImageFormat, GetParam().depthFormat);
        set(zprmCameraMode, IsVideo() ? zmodeRealTimeVideo : zmodeStandard);
        if (!IsVideo()) set(zprmVerticalBinning, GetParam().binning);
        set(zprmDoPostProcessing, isFinished ? 1 : 0);
        set(zprmPostProcessImageFormat, GetSampleBytes() == 1 ? zfmtRGB24 : zfmtRGB48);
        set(zprmPostProcessBayerAlgorithm, zbayerFast);
        for (const auto key :
             {zprmPostProcessGainRed, zprmPostProcessGainGreen, zprmPostProcessGainBlue}) {
            set(static_cast<std::uint32_t>(key), 1000);
        }
        ASSERT_ZERR(zerrNone, Zentara_SetParam64(&settings, zprm64Exposure, GetExposureNs()));
        ASSERT_ZERR(zerrNone, Zentara_SendSettingsToCam(handle, &settings));
        if (!IsVideo()) {
            // The region of the mode, as the camera has it now.
            settings = ReadSettings();
            set(zprmRoiWidth, GetParam().sensor.width);
            set(zprmRoiHeight, GetParam().sensor.height / GetParam().binning);
            ASSERT_ZERR(zerrNone, Zentara_SendSettingsToCam(handle, &settings));
        }
        ASSERT_EQ(IsVideo(), GetCamera().GetRTVMode());
    }

    void Grab() {
        const std::size_t bytes =
            std::size_t{GetParam().sensor.width} * GetParam().sensor.height * 6;
        frame = std::make_unique<ClientFrame>(static_cast<std::uint32_t>(bytes));
        ASSERT_ZERR(zerrNone, Zentara_GrabFrame(handle, frame->Get()));
        ASSERT_ZERR(zerrNone, (*frame)->errorCode);
    }

    /// Runs the camera's ratio filter alone over the frame, as a pair of buffers.
    Picture Correct() {
        Zentara_Frame& record = *frame->Get();
        std::vector<std::uint8_t> data(frame->GetPixels(), frame->GetPixels() + record.size);
        std::vector<std::uint8_t> corrected(record.size);
        ZInImageBufferStruct in{.data = data.data(),
                                .imageSize = record.size,
                                .width = record.width,
                                .height = record.height,
                                .bitDepth = record.bits,
                                .colourPattern = record.privatePattern,
                                .imageFormat = record.format,
                                .filterColour = record.privatePattern,
                                .symmetricalBinningMode = record.privateBinning,
                                .isRTV = record.privateRealTime != 0,
                                .camera = &GetCamera()};
        ZOutImageBufferStruct out{.data = corrected.data(), .dataCapacity = corrected.size()};
        ZImagePipeline pipeline;
        pipeline.Setup(record.width, record.height);
        pipeline.AddFilter(GetCamera().GetFYRatioCorrectionFilter());
        bool isComplete = false;
        EXPECT_EQ(FilterDone, pipeline.ProcessImage(&in, &out, &isComplete));
        EXPECT_EQ(record.format, out.imageFormat);
        EXPECT_EQ(std::uint64_t{out.width} * out.height * GetSampleBytes(), out.imageSize);
        return {out.width, out.height, true, record.bayerPattern,
                ReadSamples(corrected.data(), out.imageSize / GetSampleBytes(), GetSampleBytes())};
    }

    Picture ReadFinished() {
        Zentara_Frame& record = *frame->Get();
        return {record.width, record.height, false, 0,
                ReadSamples(frame->GetPixels(), record.size / GetSampleBytes(), GetSampleBytes())};
    }

    /// What the chart's patch is in samples.
    double GetExpected(std::uint32_t column, std::uint32_t row, std::uint32_t colour) {
        ReferenceCamera reference;
        reference.width = GetParam().sensor.width;
        reference.height = GetParam().sensor.height;
        reference.scene = "chart";
        constexpr double Light[] = {0.8, 1, 0.6};
        const ReferenceRenderer renderer(reference);
        const double level = renderer.GetLevel((2 * column + 1) * reference.width / 12,
                                               (2 * row + 1) * reference.height / 8, colour);
        const double top = std::pow(2.0, GetCamera().GetBitDepth()) - 1;
        const double electrons = level * Brightness * Light[colour] * GetRowsAdded() *
                                 static_cast<double>(GetExposureNs()) / 1e9;
        return electrons * top / FullWell + GetCamera().GetOffset() * top / 4095;
    }

    /// Red is red, green green and blue blue in the middle of every patch.
    void ExpectColours(const Picture& picture) {
        for (std::uint32_t row = 0; row < PatchRows; ++row) {
            for (std::uint32_t column = 0; column < PatchColumns; ++column) {
                const std::uint32_t x = (2 * column + 1) * picture.width / (2 * PatchColumns);
                const std::uint32_t y = (2 * row + 1) * picture.height / (2 * PatchRows);
                for (std::uint32_t colour = 0; colour < 3; ++colour) {
                    ASSERT_NEAR(GetExpected(column, row, colour), picture.Get(x, y, colour), 2)
                        << "patch " << column << ", " << row << ", colour " << colour;
                }
            }
        }
    }

    /// Place along a line, 0 to `length` - 1, at which it comes nearer to the second level than to
    /// the first.
    template <typename Sample>
    static std::uint32_t FindEdge(std::uint32_t from, std::uint32_t to, double first, double second,
                                  Sample sample) {
        for (std::uint32_t place = from; place < to; ++place) {
            const double value = sample(place);
            if (std::abs(value - second) < std::abs(value - first)) return place;
        }
        return to;
    }

    /// The patches meet at the sixths of the width and the quarters of the height.
    void ExpectEdges(const Picture& picture) {
        constexpr std::uint32_t Green = 1;
        for (std::uint32_t column = 1; column < PatchColumns; ++column) {
            const std::uint32_t middle = column * picture.width / PatchColumns;
            const std::uint32_t edge = FindEdge(
                middle - picture.width / 13, middle + picture.width / 13,
                GetExpected(column - 1, 0, Green), GetExpected(column, 0, Green),
                [&](std::uint32_t x) { return picture.Get(x, picture.height / 8, Green); });
            EXPECT_NEAR(middle, edge, 5) << "behind column " << column - 1;
        }
        for (std::uint32_t row = 1; row < PatchRows; ++row) {
            const std::uint32_t middle = row * picture.height / PatchRows;
            const std::uint32_t edge = FindEdge(
                middle - picture.height / 9, middle + picture.height / 9,
                GetExpected(0, row - 1, Green), GetExpected(0, row, Green),
                [&](std::uint32_t y) { return picture.Get(picture.width / 12, y, Green); });
            EXPECT_NEAR(middle, edge, 5) << "below row " << row - 1;
        }
    }

    void ExpectScene(const Picture& picture) {
        const double proportion =
            static_cast<double>(GetParam().sensor.width) / GetParam().sensor.height;
        EXPECT_NEAR(proportion, static_cast<double>(picture.width) / picture.height, 0.01);
        ExpectColours(picture);
        ExpectEdges(picture);
    }

    std::unique_ptr<ClientFrame> frame;
};

TEST_P(FolaryProportions, AreTheScenesAndTheMosaicsPhaseIsKept) {
    Send(/*isFinished=*/false);
    Grab();
    const Zentara_Frame& record = *frame->Get();
    EXPECT_EQ(GetParam().depthFormat, record.format);

    const Picture picture = Correct();

    const Samples taken =
        ReadSamples(frame->GetPixels(), record.size / GetSampleBytes(), GetSampleBytes());
    Samples expected = JudgeReduction(taken, record.width, GetFactor());
    if (IsVideo()) {
        expected = JudgeZoomFill(JudgeZoomSpread(expected, picture.width, 0), picture.width,
                                 picture.height, record.privatePattern);
    }
    EXPECT_TRUE(expected == picture.samples);
    ExpectScene(picture);
}

TEST_P(FolaryProportions, AreTheScenesInTheFinishedImage) {
    Send(/*isFinished=*/true);
    Grab();

    EXPECT_EQ(GetSampleBytes() == 1 ? zfmtRGB24 : zfmtRGB48, static_cast<int>((*frame)->format));
    ASSERT_EQ(std::uint64_t{(*frame)->width} * (*frame)->height * 3 * GetSampleBytes(),
              (*frame)->size);
    ExpectScene(ReadFinished());
}

INSTANTIATE_TEST_SUITE_P(Modes, FolaryProportions, testing::ValuesIn(MakeCases()),
                         [](const auto& test) {
                             const RatioCase& ratio = test.param;
                             return (ratio.binning == RealTime
                                         ? "RealTime"
                                         : "Binning" + std::to_string(ratio.binning)) +
                                    std::string("Of") + std::to_string(ratio.sensor.width) +
                                    (ratio.depthFormat == zfmtBayer8 ? "In8Bits" : "In12Bits");
                         });

class FolaryMode8 : public OpenedCamera {
  protected:
    FolaryMode8() : OpenedCamera(MakeScenario(Sensors[0], false)) {}
};

TEST_F(FolaryMode8, KeptAMode3ThatReadsBackAs8ShrinksTheRecordAndReducesNothing) {
    Zentara_Settings settings = ReadSettings();
    ASSERT_ZERR(zerrNone, Zentara_SetParam(&settings, zprmVerticalBinning, 3));
    ASSERT_ZERR(zerrNone, Zentara_SendSettingsToCam(handle, &settings));
    ClientFrame frame(2560 * 640);
    ASSERT_ZERR(zerrNone, Zentara_GrabFrame(handle, frame.Get()));
    ASSERT_EQ(8U, frame->privateBinning);
    std::vector<std::uint8_t> corrected(frame->size, 0xA5);
    ZInImageBufferStruct in{.data = const_cast<std::uint8_t*>(frame.GetPixels()),
                            .imageSize = frame->size,
                            .width = frame->width,
                            .height = frame->height,
                            .bitDepth = frame->bits,
                            .symmetricalBinningMode = frame->privateBinning,
                            .camera = reinterpret_cast<ZCamera*>(handle)};
    ZOutImageBufferStruct out{.data = corrected.data(), .dataCapacity = corrected.size()};

    EXPECT_EQ(FilterDone, in.camera->GetFYRatioCorrectionFilter()->Process(&in, &out));

    EXPECT_EQ(frame->width / 16 * 2, out.width);
    EXPECT_EQ(frame->height, out.height);
    EXPECT_EQ(out.width * out.height, out.imageSize);
    EXPECT_TRUE(std::all_of(corrected.begin(), corrected.end(),
                            [](std::uint8_t byte) { return byte == 0xA5; }));
}

}  // namespace
}  // namespace ZV::Test
