#include <gtest/gtest.h>
#include <tiffio.h>

#include "tools/colour_image.h"
#include "tools/fits_file.h"
#include "tools/fits_reader.h"
#include "tools/fits_verdict.h"
#include "tools/image_samples.h"
#include "tools/program.h"

namespace ZentaraTest {
namespace {

using ZentaraProgram::FitsDemand;
using ZentaraProgram::Image;

std::vector<std::uint16_t> GetExpected(const ColourCase& row, bool isPlanar) {
    std::vector<std::uint16_t> values;
    for (std::size_t i = 0; i < 45; ++i) {
        const std::size_t pixel = isPlanar ? i % 15 : i / 3, colour = isPlanar ? i / 15 : i % 3;
        values.push_back(GetTestSample(row.bytes, pixel, colour));
    }
    return values;
}

class ColourFiles : public testing::TestWithParam<ColourCase> {
  protected:
    std::string Write(const char* name) {
        const std::string path = folder.GetPath(name);
        EXPECT_EQ("", ZentaraProgram::WriteImage(path, image));
        return path;
    }

    const ColourCase& row = GetParam();
    const Image image = MakeColourImage(row);
    TemporaryFolder folder;
};

TEST_P(ColourFiles, APngHoldsPixelsOfRedGreenAndBlueThatAreToldToBeLinear) {
    const std::string path = Write("a.png");

    const ReadSamples samples = ReadPng(path);

    EXPECT_EQ(3U, samples.channels);
    EXPECT_EQ(8 * row.bytes, samples.bits);
    EXPECT_EQ(GetExpected(row, false), samples.values);
    EXPECT_NE(std::string::npos, ReadFile(path).find("gAMA"));
}

TEST_P(ColourFiles, ATiffHoldsPixelsOfRedGreenAndBlue) {
    TIFF* tiff = TIFFOpen(Write("a.tiff").c_str(), "r");
    ASSERT_NE(nullptr, tiff);
    std::uint16_t channels = 0, bits = 0, photometric = 0;
    TIFFGetField(tiff, TIFFTAG_SAMPLESPERPIXEL, &channels);
    TIFFGetField(tiff, TIFFTAG_BITSPERSAMPLE, &bits);
    TIFFGetField(tiff, TIFFTAG_PHOTOMETRIC, &photometric);
    std::vector<std::uint8_t> bytes(45 * row.bytes);
    EXPECT_EQ(static_cast<tmsize_t>(bytes.size()), TIFFReadEncodedStrip(tiff, 0, bytes.data(), -1));
    TIFFClose(tiff);

    EXPECT_EQ(3, channels);
    EXPECT_EQ(8 * row.bytes, bits);
    EXPECT_EQ(PHOTOMETRIC_RGB, photometric);
    const auto expected = GetExpected(row, false);
    for (std::size_t i = 0; i < expected.size(); ++i) {
        std::uint16_t value = bytes[i];
        if (row.bytes == 2) std::memcpy(&value, bytes.data() + 2 * i, 2);
        ASSERT_EQ(expected[i], value) << i;
    }
}

TEST_P(ColourFiles, AFitsFileHoldsPlanesOfRedGreenAndBlue) {
    const FitsFile file(Write("a.fits"));
    int status = 0, axes = 0;
    std::array<LONGLONG, 3> size{};
    fits_get_img_dim(file.Get(), &axes, &status);
    fits_get_img_sizell(file.Get(), 3, size.data(), &status);
    std::vector<std::uint16_t> samples(45);
    fits_read_img(file.Get(), TUSHORT, 1, 45, nullptr, samples.data(), nullptr, &status);

    EXPECT_EQ(0, status);
    EXPECT_EQ(3, axes);
    EXPECT_EQ((std::array<LONGLONG, 3>{5, 3, 3}), size);
    EXPECT_EQ(GetExpected(row, true), samples);
    EXPECT_EQ(row.format, ReadFitsNumber(file.Get(), "PIXFORM"));
}

TEST_P(ColourFiles, AFitsFileOfThreePlanesKeepsTheStandard) {
    EXPECT_TRUE(IsFitsGood(Write("a.fits")));
}

TEST_P(ColourFiles, ARawFileHoldsTheBytesAsTheyWereDelivered) {
    const std::string bytes = ReadFile(Write("a.raw"));

    EXPECT_EQ(std::string(image.pixels.begin(), image.pixels.end()), bytes);
}

TEST_P(ColourFiles, AFitsFileIsReadBackAsPlanes) {
    Image read;

    ASSERT_EQ("", ZentaraProgram::ReadFits(Write("a.fits"), FitsDemand::Pixels, &read));

    EXPECT_TRUE(read.layout->isPlanar);
    EXPECT_EQ(row.bytes, read.bytesPerSample);
    std::vector<std::uint8_t> one, other;
    const auto expected = ZentaraProgram::GetPixelSamples(image, &one);
    const auto found = ZentaraProgram::GetPixelSamples(read, &other);
    EXPECT_TRUE(std::equal(expected.begin(), expected.end(), found.begin(), found.end()));
}

INSTANTIATE_TEST_SUITE_P(Formats, ColourFiles, testing::ValuesIn(ColourCases),
                         [](const testing::TestParamInfo<ColourCase>& tested) {
                             return std::string(tested.param.name);
                         });

TEST(PixelFormats, EveryFormatIsFoundByItsNumberAndByItsNameInAnySpelling) {
    for (const auto& format : ZentaraProgram::GetPixelFormats()) {
        EXPECT_EQ(&format, ZentaraProgram::FindPixelFormat(format.format));
        EXPECT_EQ(&format, ZentaraProgram::FindPixelFormat(std::string_view(format.name)));
        EXPECT_EQ(Zentara_CalcImageSize(format.format, 1, 1), format.GetBytesPerPixel());
        EXPECT_EQ(Zentara_is3Color(format.format) != 0, format.IsThreeColour());
        EXPECT_EQ(Zentara_is16bit(format.format) != 0, format.IsDeep());
    }
    EXPECT_STREQ("rgb-planes16", ZentaraProgram::FindPixelFormat("RGB Planes 16")->name);
    EXPECT_EQ(nullptr, ZentaraProgram::FindPixelFormat(13U));
    EXPECT_EQ(nullptr, ZentaraProgram::FindPixelFormat(std::string_view("rgb25")));
}

}  // namespace
}  // namespace ZentaraTest
