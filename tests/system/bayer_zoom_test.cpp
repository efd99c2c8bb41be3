#include <gtest/gtest.h>

#include <algorithm>
#include <cstring>
#include <random>
#include <string>
#include <vector>

#include "support/flat_camera.h"
#include "support/log_file.h"
#include "support/ratio_judge.h"

namespace ZV::Test {
namespace {

using Samples = std::vector<std::uint32_t>;

constexpr std::uint8_t Untouched = 0xA5;
constexpr std::size_t GuardBytes = 32;

/// A frame with a buffer of its own and guard bytes behind it.
struct HeldFrame {
    explicit HeldFrame(std::size_t bytes) : pixels(bytes + GuardBytes, Untouched) {
        record.pBuffer = pixels.data();
        record.bufferSize = static_cast<std::uint32_t>(bytes);
    }

    bool IsUntouched(std::size_t from = 0) const {
        return std::all_of(pixels.begin() + static_cast<std::ptrdiff_t>(from), pixels.end(),
                           [](std::uint8_t byte) { return byte == Untouched; });
    }

    Zentara_Frame record{};
    std::vector<std::uint8_t> pixels;
};

std::uint32_t GetSampleBytes(std::uint32_t format) {
    return format == zfmtBayer8 ? 1 : 2;
}

void PutSamples(const Samples& samples, std::uint32_t format, std::uint8_t* pixels) {
    for (std::size_t i = 0; i < samples.size(); ++i) {
        const auto word = static_cast<std::uint16_t>(samples[i]);
        if (format == zfmtBayer16) std::memcpy(pixels + 2 * i, &word, 2);
        if (format == zfmtBayer8) pixels[i] = static_cast<std::uint8_t>(samples[i]);
    }
}

Samples GetSamples(const std::uint8_t* pixels, std::uint32_t format, std::size_t count) {
    Samples samples(count);
    for (std::size_t i = 0; i < count; ++i) {
        std::uint16_t word = pixels[i];
        if (format == zfmtBayer16) std::memcpy(&word, pixels + 2 * i, 2);
        samples[i] = word;
    }
    return samples;
}

Samples MakeRandom(std::size_t count, std::uint32_t format) {
    std::mt19937 random(static_cast<std::uint32_t>(count));
    Samples samples(count);
    for (std::uint32_t& sample : samples) {
        sample = static_cast<std::uint32_t>(random() & (format == zfmtBayer8 ? 0xFF : 0xFFFF));
    }
    return samples;
}

/// A mosaic and the frame that its doubling goes to.
class BayerZoomVert : public LoadedLibrary {
  protected:
    void Make(std::uint32_t width, std::uint32_t height, std::uint32_t format = zfmtBayer8) {
        samples = MakeRandom(std::size_t{width} * height, format);
        const std::size_t bytes = samples.size() * GetSampleBytes(format);
        in = HeldFrame(bytes);
        PutSamples(samples, format, in.pixels.data());
        in.record.format = format;
        in.record.width = width;
        in.record.height = height;
        in.record.size = static_cast<std::uint32_t>(bytes);
        in.record.bits = format == zfmtBayer8 ? 8 : 12;
        out = HeldFrame(2 * bytes);
        out.record.height = 2 * height;
    }
    ZentaraResult Zoom(std::uint32_t algorithm = zbayerFast) {
        return Zentara_BayerZoomVert(algorithm, &in.record, &out.record);
    }
    /// Neither the record nor the pixels of the output.
    void ExpectRefused(ZentaraResult result) {
        const Zentara_Frame before = out.record;
        EXPECT_ZERR(result, Zoom());
        EXPECT_EQ(0, std::memcmp(&before, &out.record, sizeof before));
        EXPECT_TRUE(out.IsUntouched());
    }
    /// The output as its definition has it, where it held nothing but Untouched before.
    Samples Expect(std::uint32_t pattern) const {
        const std::uint32_t other = in.record.format == zfmtBayer8 ? 0xA5 : 0xA5A5;
        return JudgeZoomFill(JudgeZoomSpread(samples, in.record.width, other), in.record.width,
                             2 * in.record.height, pattern);
    }

    Samples samples;
    HeldFrame in{0}, out{0};
};

TEST_F(BayerZoomVert, DoublesEveryMosaicOfBothDepthsAsItIsDefined) {
    for (const std::uint32_t format : {zfmtBayer8, zfmtBayer16}) {
        for (std::uint32_t pattern = 0; pattern <= 9; ++pattern) {
            for (std::uint32_t width = 1; width <= 14; ++width) {
                for (std::uint32_t height = 1; height <= 9; ++height) {
                    Make(width, height, format);
                    in.record.bayerPattern = pattern;

                    ASSERT_ZERR(zerrNone, Zoom());

                    const std::size_t count = 2 * samples.size();
                    ASSERT_EQ(Expect(pattern), GetSamples(out.pixels.data(), format, count))
                        << width << " x " << height << ", pattern " << pattern;
                    ASSERT_TRUE(out.IsUntouched(count * GetSampleBytes(format)));
                }
            }
        }
    }
}

TEST_F(BayerZoomVert, KeptTheOutputTakesWidthAndBitsAlone) {
    Make(8, 6, zfmtBayer16);
    out.record.format = zfmtRGB24;
    out.record.size = 77;
    out.record.bayerPattern = 3;
    out.record.errorCode = zerrMissingData;
    out.record.frameNumber = 9;

    ASSERT_ZERR(zerrNone, Zoom());

    EXPECT_EQ(8U, out.record.width);
    EXPECT_EQ(12, out.record.bits);
    EXPECT_EQ(12U, out.record.height);
    EXPECT_EQ(std::uint32_t{zfmtRGB24}, out.record.format);
    EXPECT_EQ(77U, out.record.size);
    EXPECT_EQ(3U, out.record.bayerPattern);
    EXPECT_EQ(std::uint32_t{zerrMissingData}, out.record.errorCode);
    EXPECT_EQ(9, out.record.frameNumber);
}

TEST_F(BayerZoomVert, AnOutputOfFourRowsTakesTheRealRowsAndNothingIsComputed) {
    Make(8, 2);

    ASSERT_ZERR(zerrNone, Zoom());

    for (std::size_t column = 0; column < 8; ++column) {
        EXPECT_EQ(samples[column], out.pixels[column]);
        EXPECT_EQ(samples[8 + column], out.pixels[24 + column]);
    }
    for (std::size_t i = 8; i < 24; ++i) EXPECT_EQ(Untouched, out.pixels[i]) << i;
}

TEST_F(BayerZoomVert, KeptComputedRowsOfANarrowFrameKeepWhatTheBufferHeld) {
    Make(4, 6);

    ASSERT_ZERR(zerrNone, Zoom());

    for (const std::size_t row : {1U, 2U, 5U, 6U, 9U, 10U}) {
        for (std::size_t i = 0; i < 4; ++i) EXPECT_EQ(Untouched, out.pixels[4 * row + i]) << row;
    }
}

TEST_F(BayerZoomVert, MayDoubleAMosaicInItsOwnBuffer) {
    for (const std::uint32_t format : {zfmtBayer8, zfmtBayer16}) {
        for (const std::uint32_t height : {3U, 4U, 6U, 9U}) {
            Make(8, height, format);
            std::copy_n(in.pixels.begin(), in.record.size, out.pixels.begin());
            in.record.pBuffer = out.record.pBuffer;
            in.record.bufferSize = out.record.bufferSize;

            ASSERT_ZERR(zerrNone, Zoom());

            const std::size_t count = 2 * samples.size();
            EXPECT_EQ(Expect(0), GetSamples(out.pixels.data(), format, count)) << height;
            EXPECT_TRUE(out.IsUntouched(count * GetSampleBytes(format))) << height;
        }
    }
}

TEST_F(BayerZoomVert, EveryAlgorithmButTheFastOneIsNotSupported) {
    for (const std::uint32_t algorithm : {0U, 1U, 3U, 4U, 5U, 0x10002U}) {
        Make(8, 6);
        EXPECT_ZERR(zerrNotSupported, Zoom(algorithm));
        EXPECT_TRUE(out.IsUntouched());
        EXPECT_ZERR(zerrNotSupported, Zentara_BayerZoomVert(algorithm, nullptr, nullptr));
    }
}

TEST_F(BayerZoomVert, KeptAFrameThatIsNoMosaicIsLeftAloneAndTheCallSucceeds) {
    Make(8, 6);
    for (const std::uint32_t format : {0U, 1U, 2U, 3U, 6U, 12U, 13U, 0x10004U}) {
        in.record.format = format;
        out.record.height = 1;  // not looked at then
        ExpectRefused(zerrNone);
    }
}

TEST_F(BayerZoomVert, ANullFrameOrBufferIsABadParameterAlsoWhereTheFormatIsNoMosaic) {
    Make(8, 6);
    EXPECT_ZERR(zerrBadParameter, Zentara_BayerZoomVert(zbayerFast, nullptr, &out.record));
    EXPECT_ZERR(zerrBadParameter, Zentara_BayerZoomVert(zbayerFast, &in.record, nullptr));
    for (const std::uint32_t format : {zfmtBayer8, zfmtMono8}) {
        Make(8, 6);
        in.record.format = format;
        void* const pixels = in.record.pBuffer;
        in.record.pBuffer = nullptr;
        ExpectRefused(zerrBadParameter);
        in.record.pBuffer = pixels;
        out.record.pBuffer = nullptr;
        ExpectRefused(zerrBadParameter);
    }
}

TEST_F(BayerZoomVert, AnOutputThatIsNotTwiceAsHighIsABadParameter) {
    Make(8, 6);
    for (const std::uint32_t height : {0U, 6U, 11U, 13U, 24U, 0xFFFFFFFFU}) {
        out.record.height = height;
        ExpectRefused(zerrBadParameter);
    }
    in.record.height = 0x80000006;  // twice that is 12 in 32 bits
    out.record.height = 12;
    ExpectRefused(zerrBadParameter);
}

TEST_F(BayerZoomVert, AnOutputBufferThatIsTooSmallIsNotWritten) {
    for (const std::uint32_t format : {zfmtBayer8, zfmtBayer16}) {
        Make(8, 6, format);
        --out.record.bufferSize;
        ExpectRefused(zerrBufferTooSmall);
    }
}

TEST_F(BayerZoomVert, ForAnOutputBufferWithoutASizeTheClientVouches) {
    Make(8, 6);
    out.record.bufferSize = 0;
    EXPECT_ZERR(zerrNone, Zoom());
    EXPECT_EQ(Expect(0), GetSamples(out.pixels.data(), zfmtBayer8, 96));
}

TEST_F(BayerZoomVert, AnInputThatHoldsLessThanItsRecordSaysIsABadParameter) {
    Make(8, 6);
    in.record.bufferSize = 47;
    ExpectRefused(zerrBadParameter);
    in.record.bufferSize = 0;
    EXPECT_ZERR(zerrNone, Zoom()) << "the client vouches";

    Make(8, 6);
    in.record.size = 47;
    ExpectRefused(zerrBadParameter);
    Make(8, 6);
    in.record.format = zfmtBayer16;
    ExpectRefused(zerrBadParameter);
    Make(8, 6);
    in.record.width = 0xFFFFFFFF;
    ExpectRefused(zerrBadParameter);
    in.record.height = 0x7FFFFFFF;
    out.record.height = 0xFFFFFFFE;
    ExpectRefused(zerrBadParameter);
}

TEST_F(BayerZoomVert, AFrameWithoutPixelsIsDoubledToNothing) {
    Make(8, 6);
    in.record.height = out.record.height = 0;
    EXPECT_ZERR(zerrNone, Zoom());
    EXPECT_EQ(8U, out.record.width);
    EXPECT_TRUE(out.IsUntouched());

    Make(8, 6);
    in.record.width = 0;
    EXPECT_ZERR(zerrNone, Zoom());
    EXPECT_EQ(0U, out.record.width);
    EXPECT_TRUE(out.IsUntouched());
}

class LoggedBayerZoomVert : public LogFile, public BayerZoomVert {};

TEST_F(LoggedBayerZoomVert, WritesItsStartAndItsEndAlsoWhenItIsRefused) {
    const auto expectRecords = [&](const std::string& end) {
        const std::vector<std::string> expected = {"Zentara_BayerZoomVert start",
                                                   "Zentara_BayerZoomVert " + end};
        EXPECT_EQ(expected, TakeTexts());
    };
    Make(8, 6);
    (void)TakeTexts();

    EXPECT_ZERR(zerrNone, Zoom());
    expectRecords("end (error code 0)");
    EXPECT_ZERR(zerrNotSupported, Zoom(zbayerAverage));
    expectRecords("ending because the function is not supported for this device. (error 1)");
    in.record.pBuffer = nullptr;
    EXPECT_ZERR(zerrBadParameter, Zoom());
    expectRecords("ending because one of the parameters used is not valid. (error 2)");
}

TEST(BayerZoomVertUnloaded, IsRefusedBeforeAnythingElse) {
    EXPECT_ZERR(zerrNotLoaded, Zentara_BayerZoomVert(1, nullptr, nullptr));
}

}  // namespace
}  // namespace ZV::Test
