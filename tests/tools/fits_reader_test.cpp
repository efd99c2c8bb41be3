#include "tools/fits_reader.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <filesystem>
#include <functional>

#include "tools/colour_image.h"
#include "tools/program.h"

namespace ZentaraTest {
namespace {

using testing::HasSubstr;
using ZentaraProgram::FitsDemand;
using ZentaraProgram::Image;
using ZentaraProgram::ReadFits;

constexpr std::size_t CardBytes = 80, BlockBytes = 2880;

Image MakeMosaic(std::uint32_t bytes) {
    Image image;
    image.layout = ZentaraProgram::FindPixelFormat(bytes == 2 ? std::uint32_t{zfmtBayer16}
                                                              : std::uint32_t{zfmtBayer8});
    image.width = 6;
    image.height = 4;
    image.bytesPerSample = bytes;
    image.bits = bytes == 2 ? 12 : 8;
    image.isBayer = true;
    image.bayerPattern = 2;
    image.words = {4, 1, 7};
    image.frameNumber = 777;
    image.scales = {1.25, 1, 0.75};
    image.dateObs = "2026-01-01T00:00:00.000";
    image.model = "Pellan A1";
    for (std::size_t i = 0; i < 24 * bytes; ++i)
        image.pixels.push_back(static_cast<std::uint8_t>(i * 5 + 3));
    return image;
}

/// The card of a key as it stands in a file.
std::size_t FindCard(const std::string& file, const std::string& key) {
    std::string padded = key;
    padded.resize(8, ' ');
    for (std::size_t at = 0; at + CardBytes <= file.size(); at += CardBytes) {
        if (file.compare(at, padded.size(), padded) == 0) return at;
    }
    ADD_FAILURE() << key;
    return 0;
}

void SetCard(std::string* file, const std::string& key, const std::string& value) {
    std::string card = key;
    card.resize(8, ' ');
    card += "= " + value;
    card.resize(CardBytes, ' ');
    file->replace(FindCard(*file, key), CardBytes, card);
}

void RemoveCard(std::string* file, const std::string& key) {
    file->replace(FindCard(*file, key), CardBytes, "COMMENT" + std::string(CardBytes - 7, ' '));
}

struct BadCase {
    const char* name;
    std::function<void(std::string*)> spoil;
    const char* expected;     ///< Part of the reason.
    bool isBadImage = false;  ///< Not even the pixels can be had.
};

std::function<void(std::string*)> Set(const char* key, const char* value) {
    return [=](std::string* file) { SetCard(file, key, value); };
}
std::function<void(std::string*)> Remove(const char* key) {
    return [=](std::string* file) { RemoveCard(file, key); };
}
std::function<void(std::string*)> Cut(std::size_t bytes) {
    return [=](std::string* file) { file->resize(bytes); };
}

const BadCase BadCases[] = {
    {"AnEmptyFile", Cut(0), "no FITS file", true},
    {"AFileOfOneByte", Cut(1), "no FITS file", true},
    {"HalfACard", Cut(40), "", true},
    {"HalfAHeader", Cut(1000), "", true},
    {"AHeaderWithoutItsEnd", Cut(BlockBytes), "", true},
    {"AFileOfAnotherKind", [](std::string* file) { file->replace(0, 6, "\x89PNG\r\n"); },
     "no FITS file", true},
    {"ACompressedFile", [](std::string* file) { file->replace(0, 3, "\x1f\x8b\x08"); },
     "no FITS file", true},
    {"ALargerImageThanTheFile", Set("NAXIS1", "60000"), "shorter", true},
    {"AnImageBeyondAllCameras", Set("NAXIS1", "2000000000"), "none of a camera", true},
    {"AnImageOfNegativeWidth", Set("NAXIS1", "-6"), "", true},
    {"AnImageOfNoWidth", Set("NAXIS1", "0"), "", true},
    {"AWidthThatIsNoNumber", Set("NAXIS1", "'six'"), "", true},
    {"NoWidth", Remove("NAXIS1"), "", true},
    {"OneAxis", Set("NAXIS", "1"), "planes", true},
    {"NoAxis", Set("NAXIS", "0"), "planes", true},
    {"AThirdAxisThatIsNotTold", Set("NAXIS", "3"), "", true},
    {"SoManyAxes", Set("NAXIS", "999"), "", true},
    {"FloatingPointSamples", Set("BITPIX", "-32"), "", true},
    {"SamplesOf32Bits", Set("BITPIX", "32"), "", true},
    {"SamplesWithASign", Set("BITPIX", "16"), "", true},
    {"NoSuchBitpix", Set("BITPIX", "13"), "", true},
    {"NoFormat", Remove("PIXFORM"), "PIXFORM is missing"},
    {"AFormatThatIsNoNumber", Set("PIXFORM", "'bayer8'"), "PIXFORM holds no value"},
    {"AFormatBeyondTheLast", Set("PIXFORM", "13"), "PIXFORM holds no value"},
    {"ANegativeFormat", Set("PIXFORM", "-1"), "PIXFORM holds no value"},
    {"AFormatBeyond64Bits", Set("PIXFORM", "99999999999999999999"), "PIXFORM holds no value"},
    {"ADeepFormatOfBytes", Set("PIXFORM", "5"), "does not fit the samples"},
    {"AFormatOfThreeColoursWithOnePlane", Set("PIXFORM", "12"), "does not fit the samples"},
    {"ADepthBeyondTheSamples", Set("BITDEPTH", "12"), "does not fit the samples"},
    {"ADepthOfNothing", Set("BITDEPTH", "0"), "BITDEPTH holds no value"},
    {"NoDepth", Remove("BITDEPTH"), "BITDEPTH is missing"},
    {"NoBinning", Remove("FRMBIN"), "FRMBIN is missing"},
    {"ABinningBeyond16Bits", Set("FRMBIN", "65536"), "FRMBIN holds no value"},
    {"NoRealTimeFlag", Remove("FRMRTV"), "FRMRTV is missing"},
    {"ARealTimeFlagThatIsNone", Set("FRMRTV", "'maybe'"), "FRMRTV holds no value"},
    {"NoPattern", Remove("FRMPATT"), "FRMPATT is missing"},
    {"APatternOfNoMosaic", Set("FRMPATT", "9"), "FRMPATT holds no value"},
    {"AnotherPatternThanTheMosaic", Set("FRMPATT", "5"), "do not say the same"},
    {"AMosaicThatIsNone", Set("BAYERPAT", "'RGBG'"), "BAYERPAT holds no value"},
    {"NoMosaic", Remove("BAYERPAT"), "BAYERPAT is missing"},
    {"AFrameNumberBeyond16Bits", Set("FRAMENUM", "65536"), "FRAMENUM holds no value"},
};

class BadFits : public testing::TestWithParam<BadCase> {
  protected:
    TemporaryFolder folder;
    const std::string path = folder.GetPath("a.fits");
};

TEST_P(BadFits, IsRefusedAsAFrameAndShownOnlyIfItsPixelsAreWhole) {
    ASSERT_EQ("", ZentaraProgram::WriteImage(path, MakeMosaic(1)));
    std::string file = ReadFile(path);
    GetParam().spoil(&file);
    WriteFile(path, file);
    Image frame, pixels;

    const std::string reason = ReadFits(path, FitsDemand::FrameRecord, &frame);

    EXPECT_NE("", reason);
    EXPECT_THAT(reason, HasSubstr(GetParam().expected));
    EXPECT_EQ(GetParam().isBadImage, ReadFits(path, FitsDemand::Pixels, &pixels) != "");
}

INSTANTIATE_TEST_SUITE_P(Cases, BadFits, testing::ValuesIn(BadCases),
                         [](const testing::TestParamInfo<BadCase>& tested) {
                             return std::string(tested.param.name);
                         });

class FitsReader : public testing::TestWithParam<std::uint32_t> {
  protected:
    TemporaryFolder folder;
    const std::string path = folder.GetPath("a.fits");
};

TEST_P(FitsReader, AFrameComesBackWithItsPixelsAndItsWords) {
    const Image written = MakeMosaic(GetParam());
    ASSERT_EQ("", ZentaraProgram::WriteImage(path, written));
    Image read;

    ASSERT_EQ("", ReadFits(path, FitsDemand::FrameRecord, &read));

    EXPECT_EQ(written.pixels, read.pixels);
    EXPECT_EQ(written.layout, read.layout);
    EXPECT_EQ(written.width, read.width);
    EXPECT_EQ(written.height, read.height);
    EXPECT_EQ(written.bits, read.bits);
    EXPECT_EQ(written.bytesPerSample, read.bytesPerSample);
    EXPECT_EQ(written.bayerPattern, read.bayerPattern);
    EXPECT_EQ(written.words.binning, read.words.binning);
    EXPECT_EQ(written.words.realTime, read.words.realTime);
    EXPECT_EQ(written.words.pattern, read.words.pattern);
    EXPECT_EQ(written.frameNumber, read.frameNumber);
    EXPECT_EQ(written.scales, read.scales);
    EXPECT_EQ(written.dateObs, read.dateObs);
    EXPECT_EQ(written.model, read.model);
}

TEST_P(FitsReader, AFileThatIsCutAnywhereIsRefusedOrWhole) {
    ASSERT_EQ("", ZentaraProgram::WriteImage(path, MakeMosaic(GetParam())));
    const std::string whole = ReadFile(path);
    for (std::size_t bytes = 0; bytes < whole.size(); bytes += 197) {
        WriteFile(path, whole.substr(0, bytes));
        Image read;

        if (!ReadFits(path, FitsDemand::FrameRecord, &read).empty()) continue;
        EXPECT_EQ(MakeMosaic(GetParam()).pixels, read.pixels) << bytes;
    }
}

TEST_P(FitsReader, AnyByteOfTheHeaderMayBeWrong) {
    ASSERT_EQ("", ZentaraProgram::WriteImage(path, MakeMosaic(GetParam())));
    const std::string whole = ReadFile(path);
    const std::size_t header = FindCard(whole, "END") + 3;
    for (std::size_t at = 0; at < header; at += 41) {
        for (const char byte : {'\0', ' ', '9', '-', 'E', '\xFF'}) {
            std::string file = whole;
            file[at] = byte;
            WriteFile(path, file);
            Image read;

            if (!ReadFits(path, FitsDemand::Pixels, &read).empty()) continue;
            EXPECT_EQ(
                std::size_t{read.width} * read.height * read.GetChannels() * read.bytesPerSample,
                read.pixels.size());
        }
    }
}

INSTANTIATE_TEST_SUITE_P(BytesPerSample, FitsReader, testing::Values(1U, 2U));

TEST(FitsReaderDoor, RawFormatsTakeSamplesOfEitherWidth) {
    const TemporaryFolder folder;
    const std::string path = folder.GetPath("a.fits");
    for (const std::uint32_t format : {zfmtRaw8, zfmtRaw16}) {
        for (const std::uint32_t bytes : {1U, 2U}) {
            Image written = MakeMosaic(bytes);
            written.layout = ZentaraProgram::FindPixelFormat(format);
            written.isBayer = false;
            ASSERT_EQ("", ZentaraProgram::WriteImage(path, written));
            Image read;

            ASSERT_EQ("", ReadFits(path, FitsDemand::FrameRecord, &read)) << format << bytes;

            EXPECT_EQ(format, read.layout->format);
            EXPECT_EQ(bytes, read.bytesPerSample);
            EXPECT_EQ(written.pixels, read.pixels);
        }
    }
}

TEST(FitsReaderDoor, ATextHoldsNothingThatATerminalTakesForACommand) {
    const TemporaryFolder folder;
    const std::string path = folder.GetPath("a.fits");
    ASSERT_EQ("", ZentaraProgram::WriteImage(path, MakeMosaic(1)));
    std::string file = ReadFile(path);
    SetCard(&file, "INSTRUME", "'\x1B[2J\x7F\n'");
    WriteFile(path, file);
    Image read;

    ASSERT_EQ("", ReadFits(path, FitsDemand::FrameRecord, &read));

    EXPECT_EQ("?[2J??", read.model);
}

/// Another current folder, until the end of the scope.
class CurrentFolder {
  public:
    explicit CurrentFolder(const std::string& path) { std::filesystem::current_path(path); }
    ~CurrentFolder() { std::filesystem::current_path(before); }
    CurrentFolder(const CurrentFolder&) = delete;
    CurrentFolder& operator=(const CurrentFolder&) = delete;

  private:
    std::filesystem::path before = std::filesystem::current_path();
};

TEST(FitsReaderDoor, NamesThatBeginWithATildeOrABlankAreNamesOfFiles) {
    const TemporaryFolder folder;
    const CurrentFolder here(folder.GetPath(""));
    for (const char* name : {"~a.fits", "~/a.fits", " a.fits", "~.fits", "a[1].fits"}) {
        std::filesystem::create_directory("~");
        ASSERT_EQ("", ZentaraProgram::WriteImage(name, MakeMosaic(1))) << name;
        Image read;

        EXPECT_EQ("", ReadFits(name, FitsDemand::FrameRecord, &read)) << name;

        EXPECT_TRUE(std::filesystem::exists(folder.GetPath(name))) << name;
    }
}

TEST(FitsReaderDoor, APathThatIsTooLongIsRefused) {
    const TemporaryFolder folder;
    const CurrentFolder here(folder.GetPath(""));
    std::string path;
    for (int i = 0; i < 11; ++i) {
        path += std::string(120, 'd') + "/";
        std::filesystem::create_directory(path);
    }
    EXPECT_NE("", ZentaraProgram::WriteImage(path + "a.fits", MakeMosaic(1)));
    WriteFile(path + "a.fits", "SIMPLE  =                    T");
    Image read;

    EXPECT_NE("", ReadFits(path + "a.fits", FitsDemand::Pixels, &read));
}

TEST(FitsReaderDoor, AFolderAndAMissingFileAreNamedForWhatTheyAre) {
    const TemporaryFolder folder;
    Image read;

    EXPECT_EQ("it is no file", ReadFits(folder.GetPath(""), FitsDemand::Pixels, &read));
    EXPECT_EQ("there is no such file",
              ReadFits(folder.GetPath("a.fits"), FitsDemand::Pixels, &read));
}

}  // namespace
}  // namespace ZentaraTest
