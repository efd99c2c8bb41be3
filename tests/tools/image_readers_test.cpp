#include "tools/image_readers.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <tiffio.h>

#include <algorithm>
#include <array>

#include "tools/colour_image.h"
#include "tools/image_samples.h"
#include "tools/program.h"

namespace ZentaraTest {
namespace {

using ZentaraProgram::Image;
using ZentaraProgram::ReadImage;

class ImageReaders : public testing::TestWithParam<const char*> {
  private:
    TemporaryFolder folder;

  protected:
    const std::string path = folder.GetPath("image") + GetParam();
};

TEST_P(ImageReaders, AnImageComesBackWithItsSamples) {
    for (const ColourCase& row : ColourCases) {
        const Image written = MakeColourImage(row);
        ASSERT_EQ("", ZentaraProgram::WriteImage(path, written));
        Image read;

        ASSERT_EQ("", ReadImage(path, &read)) << row.name;

        EXPECT_EQ(5U, read.width);
        EXPECT_EQ(3U, read.height);
        EXPECT_EQ(row.bytes, read.bytesPerSample);
        std::vector<std::uint8_t> one, other;
        const auto expected = ZentaraProgram::GetPixelSamples(written, &one);
        const auto found = ZentaraProgram::GetPixelSamples(read, &other);
        EXPECT_TRUE(std::equal(expected.begin(), expected.end(), found.begin(), found.end()));
    }
}

TEST_P(ImageReaders, AFileThatIsCutAnywhereIsRefusedOrWhole) {
    const Image written = MakeColourImage(ColourCases.back());
    ASSERT_EQ("", ZentaraProgram::WriteImage(path, written));
    const std::string whole = ReadFile(path);
    const std::size_t step = std::max<std::size_t>(1, whole.size() / 60);
    for (std::size_t bytes = 0; bytes < whole.size(); bytes += step) {
        WriteFile(path, whole.substr(0, bytes));
        Image read;

        if (!ReadImage(path, &read).empty()) continue;
        EXPECT_EQ(written.pixels.size(), read.pixels.size()) << bytes;
    }
}

TEST_P(ImageReaders, AnyByteOfAFileMayBeWrong) {
    ASSERT_EQ("", ZentaraProgram::WriteImage(path, MakeColourImage(ColourCases.back())));
    const std::string whole = ReadFile(path);
    const std::size_t step = std::max<std::size_t>(1, whole.size() / 100);
    for (std::size_t at = 0; at < whole.size(); at += step) {
        for (const char byte : {'\0', '\1', '\x7F', '\xFF'}) {
            std::string file = whole;
            file[at] = byte;
            WriteFile(path, file);
            Image read;

            if (!ReadImage(path, &read).empty()) continue;
            EXPECT_EQ(
                std::size_t{read.width} * read.height * read.GetChannels() * read.bytesPerSample,
                read.pixels.size());
        }
    }
}

INSTANTIATE_TEST_SUITE_P(Endings, ImageReaders, testing::Values(".fits", ".png", ".tiff"),
                         [](const testing::TestParamInfo<const char*>& tested) {
                             return std::string(tested.param + 1);
                         });

TEST(ImageReadersDoor, AnEndingThatSaysNothingAndAMissingFileAreTold) {
    const TemporaryFolder folder;
    Image read;

    EXPECT_THAT(ReadImage(folder.GetPath("a.raw"), &read), testing::HasSubstr("ending"));
    EXPECT_EQ("there is no such file", ReadImage(folder.GetPath("a.png"), &read));
}

struct TiffCase {
    std::uint16_t photometric, channels;
    bool isRead;
};

TEST(TiffReader, OnlyLightOfOneOrThreeColoursIsRead) {
    const TemporaryFolder folder;
    const std::string path = folder.GetPath("a.tiff");
    const TiffCase cases[] = {
        {PHOTOMETRIC_MINISBLACK, 1, true},  {PHOTOMETRIC_RGB, 3, true},
        {PHOTOMETRIC_MINISWHITE, 1, false}, {PHOTOMETRIC_RGB, 1, false},
        {PHOTOMETRIC_MINISBLACK, 3, false}, {PHOTOMETRIC_CIELAB, 3, false},
        {PHOTOMETRIC_MASK, 1, false},       {PHOTOMETRIC_RGB, 4, false},
    };
    for (const TiffCase& row : cases) {
        std::array<std::uint8_t, 4> pixel{1, 2, 3, 4};
        TIFF* file = TIFFOpen(path.c_str(), "w");
        ASSERT_NE(nullptr, file);
        TIFFSetField(file, TIFFTAG_IMAGEWIDTH, 1);
        TIFFSetField(file, TIFFTAG_IMAGELENGTH, 1);
        TIFFSetField(file, TIFFTAG_BITSPERSAMPLE, 8);
        TIFFSetField(file, TIFFTAG_SAMPLESPERPIXEL, row.channels);
        TIFFSetField(file, TIFFTAG_PHOTOMETRIC, row.photometric);
        TIFFSetField(file, TIFFTAG_PLANARCONFIG, PLANARCONFIG_CONTIG);
        EXPECT_EQ(1, TIFFWriteScanline(file, pixel.data(), 0, 0));
        TIFFClose(file);
        Image read;

        EXPECT_EQ(row.isRead, ReadImage(path, &read).empty())
            << row.photometric << " with " << row.channels;
    }
}

TEST(ImageReadersDoor, AnImageThatTheFileCannotHoldIsRefusedBeforeThereIsRoomForIt) {
    const std::string folder = ZENTARA_SOURCE_DIR "/fuzz/corpus/image_file/";
    for (const char* name : {"huge.tiff", "wide.png", "huge.png"}) {
        Image read;

        EXPECT_EQ("the file is shorter than its header says", ReadImage(folder + name, &read))
            << name;
        EXPECT_TRUE(read.pixels.empty()) << name;
    }
}

TEST(PrepareImage, OnlyImagesOfCamerasHaveRoom) {
    Image image;

    EXPECT_TRUE(ZentaraProgram::PrepareImage(4008, 2672, 3, 2, &image));
    EXPECT_EQ(4008U * 2672 * 6, image.pixels.size());
    EXPECT_FALSE(ZentaraProgram::PrepareImage(0, 1, 1, 1, &image));
    EXPECT_FALSE(ZentaraProgram::PrepareImage(1, 65536, 1, 1, &image));
    EXPECT_FALSE(ZentaraProgram::PrepareImage(65535, 65535, 3, 2, &image));
    EXPECT_FALSE(ZentaraProgram::PrepareImage(10000, 10000, 1, 1, &image));
    EXPECT_FALSE(ZentaraProgram::PrepareImage(1, 1, 2, 1, &image));
    EXPECT_FALSE(ZentaraProgram::PrepareImage(1, 1, 1, 4, &image));
    EXPECT_EQ(4008U, image.width);
}

}  // namespace
}  // namespace ZentaraTest
