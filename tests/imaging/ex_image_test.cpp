#include "imaging/ex_image.h"

#include <gtest/gtest.h>

#include <memory>
#include <type_traits>

#include "image_fixture.h"

namespace ZV::Testing {
namespace {

TEST(ExImage, ReadersGiveWhatTheConstructorReceived) {
    std::uint8_t pixels[6] = {};
    int camera = 0;

    const ZExImage image(pixels, 6, 70000, 80000, 12, 0x123456789ABCDEF0, 2.5, Bayer16, CameraBayer,
                         PatternGBRG, 3, true, 41, 42, 4, true, 43, 44, &camera, false);

    EXPECT_EQ(image.GetImageData(), pixels);
    EXPECT_EQ(image.GetImageSize(), 6U);
    EXPECT_EQ(image.GetWidth(), 70000U);
    EXPECT_EQ(image.GetHeight(), 80000U);
    EXPECT_EQ(image.GetBitDepth(), 12);
    EXPECT_EQ(image.GetExposure(), 0x123456789ABCDEF0U);
    EXPECT_EQ(image.GetGain(), 2.5);
    EXPECT_EQ(image.GetImageFormat(), 5U);
    EXPECT_EQ(image.GetCameraImageFormat(), 2);
    EXPECT_EQ(image.GetColourPattern(), 7);
    EXPECT_EQ(image.GetRGBFilterStartColour(), 3);
    EXPECT_TRUE(image.IsBigEndian());
    EXPECT_EQ(image.GetCameraModel(), 41);
    EXPECT_EQ(image.GetCameraNumber(), 42);
    EXPECT_EQ(image.GetSymmetricalBinningMode(), 4);
    EXPECT_TRUE(image.IsRTV());
    EXPECT_EQ(image.GetRollingFrameNumber(), 43);
    EXPECT_EQ(image.GetErrorCode(), 44);
    EXPECT_EQ(image.GetCamera(), &camera);
}

TEST(ExImage, WidthAndHeightAreWrittenWith16Bits) {
    ZExImage image = MakeImage(Ramp(8), {.width = 70000, .height = 70000});

    image.SetWidth(static_cast<std::uint16_t>(0x12345));
    image.SetHeight(7);
    image.SetImageFormat(99);
    image.SetImageSize(5);
    image.SetCameraImageFormat(CameraRGBFilter);

    EXPECT_EQ(image.GetWidth(), 0x2345U);
    EXPECT_EQ(image.GetHeight(), 7U);
    EXPECT_EQ(image.GetImageFormat(), 99U);
    EXPECT_EQ(image.GetImageSize(), 5U);
    EXPECT_EQ(image.GetCameraImageFormat(), 3);
}

TEST(ExImage, KeptReplacingByAnEqualSizeLeavesTheOldPixels) {
    ZExImage image = MakeImage({1, 2, 3, 4});
    const Bytes other{9, 9, 9, 9};

    image.ReplaceImageBufferWith(other.data(), 4);

    EXPECT_EQ(GetPixels(image), (Bytes{1, 2, 3, 4}));
}

TEST(ExImage, ReplacingByAnotherSizeTakesTheNewPixels) {
    ZExImage image = MakeImage({1, 2, 3, 4});
    const Bytes longer{9, 8, 7, 6, 5};

    image.ReplaceImageBufferWith(longer.data(), 5);
    EXPECT_EQ(GetPixels(image), longer);
    image.ReplaceImageBufferWith(longer.data(), 2);

    EXPECT_EQ(GetPixels(image), (Bytes{9, 8}));
}

TEST(ExImage, ABufferMayBeReplacedByAPartOfItself) {
    ZExImage image = MakeImage({1, 2, 3, 4});

    image.ReplaceImageBufferWith(image.GetImageData() + 1, 3);

    EXPECT_EQ(GetPixels(image), (Bytes{2, 3, 4}));
}

TEST(ExImage, ASizeOf0GivesAnEmptyBufferAndNullDataChangeNothing) {
    ZExImage image = MakeImage({1, 2, 3, 4});

    image.ReplaceImageBufferWith(nullptr, 9);
    EXPECT_EQ(GetPixels(image), (Bytes{1, 2, 3, 4}));
    image.ReplaceImageBufferWith(nullptr, 0);

    EXPECT_EQ(image.GetImageSize(), 0U);
    EXPECT_EQ(image.GetBufferBytes(), 0U);
    image.ResizeBuffer(3);
    EXPECT_EQ(GetPixels(image), Bytes(3, 0));
}

TEST(ExImage, ALargerBufferKeepsTheOldPixelsAndItsTailIsZero) {
    ZExImage image = MakeImage({1, 2, 3, 4});

    image.ResizeBuffer(7);

    EXPECT_EQ(GetPixels(image), (Bytes{1, 2, 3, 4, 0, 0, 0}));
    EXPECT_EQ(image.GetBufferBytes(), 7U);
}

TEST(ExImage, ResizingToTheSameSizeKeepsTheBuffer) {
    ZExImage image = MakeImage({1, 2, 3, 4});
    const std::uint8_t* before = image.GetImageData();

    image.ResizeBuffer(4);

    EXPECT_EQ(image.GetImageData(), before);
}

TEST(ExImage, ASmallerBufferAndASizeThatWasOnlyClaimedAreSafe) {
    ZExImage image = MakeImage({1, 2, 3, 4});
    image.ResizeBuffer(2);
    EXPECT_EQ(GetPixels(image), (Bytes{1, 2}));

    image.SetImageSize(1000000);
    EXPECT_EQ(image.GetBufferBytes(), 2U);
    image.ResizeBuffer(4);

    EXPECT_EQ(GetPixels(image), (Bytes{1, 2, 0, 0}));
}

TEST(ExImage, CopiesShareOneBufferWhichIsReleasedOnce) {
    auto original = std::make_unique<ZExImage>(MakeImage({1, 2, 3, 4}));
    ZExImage copy(*original);
    ZExImage assigned = MakeImage({7});
    assigned = copy;

    EXPECT_EQ(copy.GetImageData(), original->GetImageData());
    EXPECT_EQ(assigned.GetImageData(), original->GetImageData());
    original.reset();

    EXPECT_EQ(GetPixels(copy), (Bytes{1, 2, 3, 4}));
    EXPECT_EQ(GetPixels(assigned), (Bytes{1, 2, 3, 4}));
}

TEST(ExImage, ACopyKeepsItsBufferWhenTheOtherGrows) {
    ZExImage image = MakeImage({1, 2, 3, 4});
    const ZExImage copy(image);

    image.ResizeBuffer(100);

    EXPECT_EQ(GetPixels(copy), (Bytes{1, 2, 3, 4}));
    EXPECT_EQ(image.GetImageSize(), 100U);
}

TEST(ExImage, ABufferOfTheCallerIsNeitherFreedNorMoved) {
    std::uint8_t pixels[4] = {1, 2, 3, 4};
    {
        ZExImage image = MakeImageOver(pixels, 4, {}, false);
        image.ResizeBuffer(8);
        EXPECT_EQ(GetPixels(image), (Bytes{1, 2, 3, 4, 0, 0, 0, 0}));
        image.GetImageData()[0] = 99;
    }

    EXPECT_EQ(pixels[0], 1);
}

TEST(ExImage, AnImageWithoutABufferIsHarmless) {
    ZExImage image = MakeImageOver(nullptr, 100, {}, true);

    EXPECT_EQ(image.GetBufferBytes(), 0U);
    image.ResizeBuffer(4);

    EXPECT_EQ(GetPixels(image), Bytes(4, 0));
}

TEST(ExImage, TheDestructorIsTheOneVirtualOperation) {
    EXPECT_TRUE(std::has_virtual_destructor_v<ZExImage>);
    EXPECT_FALSE(std::is_polymorphic_v<ZObject>);
}

TEST(Object, EraseVectorEmptiesAVector) {
    std::vector<std::uint16_t> words{1, 2};
    std::vector<std::uint32_t> quadlets{3};
    std::vector<float> floats{4.0F};

    ZObject::EraseVector(words);
    ZObject::EraseVector(quadlets);
    ZObject::EraseVector(floats);

    EXPECT_TRUE(words.empty() && quadlets.empty() && floats.empty());
}

}  // namespace
}  // namespace ZV::Testing
