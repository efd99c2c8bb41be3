#include "simulation/scene.h"

#include <fitsio.h>
#include <gtest/gtest.h>
#include <png.h>
#include <tiffio.h>

#include <cmath>
#include <cstdio>
#include <filesystem>
#include <numeric>
#include <vector>

#include "support/reference_renderer.h"
#include "support/temporary_folder.h"

namespace ZV::Simulation {
namespace {

using Test::ReferenceCamera;
using Test::ReferenceRenderer;
using Test::TemporaryFolder;

std::unique_ptr<Scene> Make(const SceneDescription& description, std::uint32_t width,
                            std::uint32_t height, std::uint64_t seed = 1) {
    std::string message;
    std::unique_ptr<Scene> scene = MakeScene(description, width, height, seed, &message);
    EXPECT_NE(nullptr, scene) << message;
    return scene;
}

std::vector<double> ReadLevels(const Scene& scene, std::uint32_t colour) {
    std::vector<double> levels(std::size_t{scene.GetWidth()} * scene.GetHeight());
    for (std::uint32_t y = 0; y < scene.GetHeight(); ++y) {
        scene.FillRow(y, colour, levels.data() + std::size_t{y} * scene.GetWidth());
    }
    return levels;
}

SceneDescription Describe(const char* kind) {
    SceneDescription description;
    description.kind = kind;
    return description;
}

TEST(SceneTest, AFlatSceneHasItsLevelEverywhere) {
    SceneDescription description = Describe("flat");
    description.level = 0.25;

    const auto scene = Make(description, 5, 3);

    for (const double level : ReadLevels(*scene, ColourGreen)) EXPECT_EQ(0.25, level);
}

TEST(SceneTest, ARampRisesAlongBothAxesFromBlackToWhite) {
    const auto levels = ReadLevels(*Make(Describe("ramp"), 4, 3), ColourRed);

    EXPECT_EQ(0.0, levels.front());
    EXPECT_EQ(1.0, levels.back());
    EXPECT_LT(levels[0], levels[1]);
    EXPECT_LT(levels[0], levels[4]);
}

TEST(SceneTest, ARampOfOnePixelIsBlack) {
    EXPECT_EQ(std::vector<double>{0}, ReadLevels(*Make(Describe("ramp"), 1, 1), ColourRed));
}

TEST(SceneTest, TheChartsLastRowIsGreyAndFallsFromWhiteToBlack) {
    const auto scene = Make(Describe("chart"), 60, 40);
    const auto red = ReadLevels(*scene, ColourRed);
    const auto blue = ReadLevels(*scene, ColourBlue);

    double before = 1;
    for (std::size_t column = 0; column < 6; ++column) {
        const std::size_t pixel = 35 * 60 + column * 10 + 5;
        EXPECT_EQ(red[pixel], blue[pixel]);
        EXPECT_LT(red[pixel], before);
        before = red[pixel];
    }
}

TEST(SceneTest, TheChartHasSixTimesFourPatchesThatFillTheSensor) {
    const auto scene = Make(Describe("chart"), 61, 43);
    const auto red = ReadLevels(*scene, ColourRed);
    const auto green = ReadLevels(*scene, ColourGreen);
    ReferenceCamera camera;
    camera.width = 61;
    camera.height = 43;
    camera.scene = "chart";
    const ReferenceRenderer reference(camera);

    for (std::uint32_t y = 0; y < 43; ++y) {
        for (std::uint32_t x = 0; x < 61; ++x) {
            ASSERT_EQ(reference.GetLevel(x, y, 0), red[y * 61 + x]) << x << ", " << y;
            ASSERT_EQ(reference.GetLevel(x, y, 1), green[y * 61 + x]) << x << ", " << y;
        }
    }
}

TEST(SceneTest, StarsLieWhereTheWrittenFormulaPutsThem) {
    SceneDescription description = Describe("stars");
    description.starCount = 40;
    const auto scene = Make(description, 150, 90, 77);
    ReferenceCamera camera;
    camera.width = 150;
    camera.height = 90;
    camera.starCount = 40;
    camera.seed = 77;
    const ReferenceRenderer reference(camera);

    for (std::uint32_t colour = 0; colour < ColourCount; ++colour) {
        const auto levels = ReadLevels(*scene, colour);
        for (std::uint32_t y = 0; y < 90; ++y) {
            for (std::uint32_t x = 0; x < 150; ++x) {
                ASSERT_NEAR(reference.GetLevel(x, y, colour), levels[y * 150 + x], 1e-12);
            }
        }
    }
}

TEST(SceneTest, ASkyWithoutStarsIsDarkButNotBlack) {
    SceneDescription description = Describe("stars");
    description.starCount = 0;

    for (const double level : ReadLevels(*Make(description, 8, 8), ColourRed)) {
        EXPECT_EQ(0.002, level);
    }
}

TEST(SceneTest, StarsDependOnTheSeedAlone) {
    const auto first = ReadLevels(*Make(Describe("stars"), 64, 64, 5), ColourRed);

    EXPECT_EQ(first, ReadLevels(*Make(Describe("stars"), 64, 64, 5), ColourRed));
    EXPECT_NE(first, ReadLevels(*Make(Describe("stars"), 64, 64, 6), ColourRed));
}

TEST(SceneTest, TheRateOfAColourIsTheBrightnessTimesTheLight) {
    SceneDescription description = Describe("flat");
    description.brightness = 1000;
    description.light[ColourBlue] = 0.25;

    const auto scene = Make(description, 2, 2);

    EXPECT_EQ(1000, scene->GetRate(ColourRed));
    EXPECT_EQ(250, scene->GetRate(ColourBlue));
}

TEST(SceneTest, AnUnknownKindIsRefusedByName) {
    std::string message;

    EXPECT_EQ(nullptr, MakeScene(Describe("night"), 4, 4, 1, &message));

    EXPECT_EQ("there is no scene of kind \"night\"", message);
}

/// A folder for image files, which goes with the test.
class SceneImageTest : public testing::Test {
  protected:
    SceneDescription Describe(const char* name) const {
        SceneDescription description;
        description.kind = "image";
        description.path = folder.GetPath(name);
        return description;
    }

    void ExpectRefused(const char* name, const std::string& reason) const {
        std::string message;
        EXPECT_EQ(nullptr, MakeScene(Describe(name), 4, 4, 1, &message));
        EXPECT_EQ("image file \"" + folder.GetPath(name) + "\": " + reason, message);
    }

    void WriteTiff16(const char* name, const std::vector<std::uint16_t>& samples,
                     std::uint32_t width, std::uint16_t channels) const {
        TIFF* file = TIFFOpen(folder.GetPath(name).c_str(), "w");
        ASSERT_NE(nullptr, file);
        const std::size_t line = std::size_t{width} * channels;
        TIFFSetField(file, TIFFTAG_IMAGEWIDTH, width);
        TIFFSetField(file, TIFFTAG_IMAGELENGTH, static_cast<std::uint32_t>(samples.size() / line));
        TIFFSetField(file, TIFFTAG_BITSPERSAMPLE, 16);
        TIFFSetField(file, TIFFTAG_SAMPLESPERPIXEL, channels);
        TIFFSetField(file, TIFFTAG_PLANARCONFIG, PLANARCONFIG_CONTIG);
        TIFFSetField(file, TIFFTAG_PHOTOMETRIC,
                     channels == 3 ? PHOTOMETRIC_RGB : PHOTOMETRIC_MINISBLACK);
        for (std::uint32_t y = 0; y < samples.size() / line; ++y) {
            std::vector<std::uint16_t> row(
                samples.begin() + static_cast<std::ptrdiff_t>(y * line),
                samples.begin() + static_cast<std::ptrdiff_t>((y + 1) * line));
            TIFFWriteScanline(file, row.data(), y, 0);
        }
        TIFFClose(file);
    }

    const TemporaryFolder folder;
};

TEST_F(SceneImageTest, AnImageIsScaledToTheSensorByItsNearestPixel) {
    WriteTiff16("step.tif", {0, 65535, 13107, 26214}, 2, 1);

    const auto levels = ReadLevels(*Make(Describe("step.tif"), 4, 4), ColourGreen);

    const std::vector<double> row0 = {0, 0, 1, 1};
    EXPECT_EQ(row0, std::vector<double>(levels.begin(), levels.begin() + 4));
    EXPECT_EQ(row0, std::vector<double>(levels.begin() + 4, levels.begin() + 8));
    EXPECT_FLOAT_EQ(0.2F, static_cast<float>(levels[8]));
    EXPECT_FLOAT_EQ(0.4F, static_cast<float>(levels[15]));
}

TEST_F(SceneImageTest, AColourTiffGivesEachColourItsChannel) {
    WriteTiff16("colour.tif", {65535, 13107, 0}, 1, 3);

    const auto scene = Make(Describe("colour.tif"), 1, 1);

    EXPECT_FLOAT_EQ(1.0F, static_cast<float>(ReadLevels(*scene, ColourRed)[0]));
    EXPECT_FLOAT_EQ(0.2F, static_cast<float>(ReadLevels(*scene, ColourGreen)[0]));
    EXPECT_FLOAT_EQ(0.0F, static_cast<float>(ReadLevels(*scene, ColourBlue)[0]));
}

TEST_F(SceneImageTest, APngOf8BitsBecomesLinearLight) {
    png_image image = {};
    image.version = PNG_IMAGE_VERSION;
    image.width = 2;
    image.height = 1;
    image.format = PNG_FORMAT_RGB;
    const png_byte pixels[] = {255, 0, 188, 0, 255, 0};
    ASSERT_NE(0, png_image_write_to_file(&image, folder.GetPath("two.png").c_str(), 0, pixels, 0,
                                         nullptr));

    const auto scene = Make(Describe("two.png"), 2, 1);

    EXPECT_FLOAT_EQ(1.0F, static_cast<float>(ReadLevels(*scene, ColourRed)[0]));
    EXPECT_NEAR(0.503, ReadLevels(*scene, ColourBlue)[0], 0.01);
    EXPECT_FLOAT_EQ(1.0F, static_cast<float>(ReadLevels(*scene, ColourGreen)[1]));
}

TEST_F(SceneImageTest, AFitsImageIsScaledToItsGreatestValueAndItsFirstRowIsOnTop) {
    fitsfile* file = nullptr;
    int status = 0;
    LONGLONG sizes[] = {2, 2};
    float values[] = {50, 100, -5, 25};
    fits_create_diskfile(&file, folder.GetPath("sky.fits").c_str(), &status);
    fits_create_imgll(file, FLOAT_IMG, 2, sizes, &status);
    fits_write_img(file, TFLOAT, 1, 4, values, &status);
    fits_close_file(file, &status);
    ASSERT_EQ(0, status);

    const auto levels = ReadLevels(*Make(Describe("sky.fits"), 2, 2), ColourRed);

    EXPECT_EQ((std::vector<double>{0.5, 1, 0, 0.25}), levels);
}

TEST_F(SceneImageTest, AFileThatIsNotThereIsRefusedWithItsPath) {
    ExpectRefused("none.png", "it cannot be opened");
}

TEST_F(SceneImageTest, AFileOfAnotherKindIsRefused) {
    std::FILE* file = std::fopen(folder.GetPath("text.png").c_str(), "w");
    std::fputs("not an image", file);
    std::fclose(file);

    ExpectRefused("text.png", "it is neither a PNG nor a TIFF nor a FITS file");
}

TEST_F(SceneImageTest, AFolderOrDeviceInPlaceOfAFileIsRefused) {
    ExpectRefused(".", "it cannot be opened");
    std::string message;
    EXPECT_EQ(nullptr, MakeScene(Describe("/dev/zero"), 4, 4, 1, &message));
    EXPECT_NE("", message);
}

TEST_F(SceneImageTest, AFileThatIsShorterThanItsHeaderSaysIsRefusedBeforeThereIsRoomForIt) {
    // Small files with a row of a tebibyte, and with images of gibibytes.
    for (const char* name : {"wide.tiff", "samples.tiff", "wide.png", "short.fits"}) {
        std::filesystem::copy_file(
            std::filesystem::path(ZENTARA_SOURCE_DIR) / "fuzz/corpus/image_file" / name,
            folder.GetPath(name));
        ExpectRefused(name, "it is shorter than its header says");
    }
}

TEST_F(SceneImageTest, AnImageFileCutAtAnyLengthIsRefusedOrReadButNeverCrashes) {
    WriteTiff16("whole.tif", std::vector<std::uint16_t>(64, 4000), 8, 1);
    std::vector<char> bytes(std::filesystem::file_size(folder.GetPath("whole.tif")));
    std::FILE* whole = std::fopen(folder.GetPath("whole.tif").c_str(), "rb");
    ASSERT_EQ(bytes.size(), std::fread(bytes.data(), 1, bytes.size(), whole));
    std::fclose(whole);

    for (std::size_t length = 0; length < bytes.size(); length += 7) {
        std::FILE* cut = std::fopen(folder.GetPath("cut.tif").c_str(), "wb");
        std::fwrite(bytes.data(), 1, length, cut);
        std::fclose(cut);
        std::string message;
        const auto scene = MakeScene(Describe("cut.tif"), 4, 4, 1, &message);
        EXPECT_EQ(scene == nullptr, !message.empty()) << length;
    }
}

}  // namespace
}  // namespace ZV::Simulation
