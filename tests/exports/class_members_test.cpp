// A client of the classes: it links to what the library exports of them by name.
#include <gtest/gtest.h>

#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <vector>

#include "camera/camera.h"
#include "camera/morvane_fw_camera.h"
#include "hal/hal.h"
#include "hal/semaphore.h"
#include "imaging/auto_exposure.h"
#include "imaging/auto_white_balance.h"
#include "imaging/bayer_interpolation.h"
#include "imaging/ex_image.h"
#include "imaging/folary_ratio_correction.h"
#include "imaging/image_pipeline.h"
#include "imaging/rgb_filter_wheel.h"

namespace ZV::Test {
namespace {

/// A client's own step of a pipeline.
class Inverter : public ZImageFilter {
  public:
    FilterResult Process(ZInImageBufferStruct* in, ZOutImageBufferStruct* out) override {
        for (std::uint32_t i = 0; i < in->imageSize; ++i) {
            out->data[i] = static_cast<std::uint8_t>(255 - in->data[i]);
        }
        out->imageSize = in->imageSize;
        out->width = in->width;
        out->height = in->height;
        out->imageFormat = in->imageFormat;
        return FilterDone;
    }
    FilterResult Init(std::uint32_t width, std::uint32_t) override {
        initialWidth = width;
        return FilterDone;
    }
    FilterResult SetOutputFormat(std::uint32_t) override { return FilterDone; }

    std::uint32_t initialWidth = 0;
};

ZExImage MakeImage(std::uint8_t* pixels, std::uint32_t bytes) {
    return ZExImage(pixels, bytes, 4, 2, 8, 20'000'000'000, 2.5, Mono8, CameraMono, PatternRGGB, 0,
                    false, 7, 1, 1, false, 3, 0, nullptr, false);
}

TEST(ExportedClasses, AnImageTellsWhatItWasMadeWith) {
    std::uint8_t pixels[8] = {};

    ZExImage image = MakeImage(pixels, sizeof pixels);
    image.SetWidth(8);
    image.SetHeight(1);
    const ZExImage copy = image;

    EXPECT_EQ(pixels, copy.GetImageData());
    EXPECT_EQ(8U, copy.GetImageSize());
    EXPECT_EQ(8U, copy.GetWidth());
    EXPECT_EQ(1U, copy.GetHeight());
    EXPECT_EQ(20'000'000'000U, copy.GetExposure());
    EXPECT_EQ(2.5, copy.GetGain());
    EXPECT_EQ(7U, copy.GetCameraModel());
    EXPECT_EQ(3U, ZExImage::ImageFormatByteSize(12));
}

TEST(ExportedClasses, APipelineRunsTheFilterOfAClient) {
    std::uint8_t pixels[8] = {0, 1, 2, 3, 4, 5, 6, 7};
    ZExImage image = MakeImage(pixels, sizeof pixels);
    ZImagePipeline pipeline;
    Inverter filter;
    bool isComplete = false;

    pipeline.Setup(4, 2);
    pipeline.AddFilter(&filter);
    const FilterResult result = pipeline.ProcessImage(&image, &isComplete);

    EXPECT_EQ(FilterDone, result);
    EXPECT_TRUE(isComplete);
    EXPECT_EQ(4U, filter.initialWidth);
    EXPECT_EQ(255, image.GetImageData()[0]);
    EXPECT_TRUE(pipeline.RemoveFilter(&filter));
}

TEST(ExportedClasses, FiltersAreMadeByAClient) {
    ZBayerInterpolation bayer(1, 12);
    ZFolaryRatioCorrection ratio(0);
    ZRGBFilterWheel wheel(8);
    ZAutoWhiteBalance balance(false);
    ZAutoExposure exposure(false);

    for (ZImageFilter* filter :
         std::initializer_list<ZImageFilter*>{&bayer, &ratio, &wheel, &balance, &exposure}) {
        EXPECT_EQ(FilterDone, filter->Init(16, 16));
        EXPECT_TRUE(filter->IsEnabled());
    }
    balance.SetRedScale(1.5F);

    EXPECT_EQ(12U, bayer.GetOutputFormat());
    EXPECT_EQ(8U, wheel.GetOutputFormat());
    EXPECT_EQ(1.5F, balance.GetRedScale());
}

TEST(ExportedClasses, ASemaphoreIsTakenAndGivenBack) {
    ZSemaphore semaphore;

    semaphore.Wait();
    semaphore.Signal();
    semaphore.Wait();
}

TEST(ExportedClasses, CamerasAreListedByTheStaticOperations) {
    std::vector<ZCamera*> cameras;

    EXPECT_FALSE(ZCamera::IsInitalized());
    EXPECT_EQ(CameraOk, ZCamera::Initialize());
    EXPECT_EQ(CameraAlreadyInitialized, ZCamera::Initialize());
    EXPECT_EQ(CameraOk, ZCamera::FreeCameraList(cameras));
    EXPECT_EQ(CameraOk, ZCamera::Shutdown());
}

TEST(ExportedClasses, EachHelperThatEmptiesAVectorIsThere) {
    std::vector<std::uint16_t> words{1};
    std::vector<std::uint32_t> quadlets{1};
    std::vector<float> numbers{1};

    ZObject::EraseVector(words);
    ZObject::EraseVector(quadlets);
    ZObject::EraseVector(numbers);

    EXPECT_TRUE(words.empty() && quadlets.empty() && numbers.empty());
}

TEST(ExportedClasses, AConstantOfTheCameraHasAnAddress) {
    const std::uint32_t* const address = &MorvaneFWCamera::m_registersAddress;

    EXPECT_EQ(0xD0000000U, *address);
}

}  // namespace
}  // namespace ZV::Test
