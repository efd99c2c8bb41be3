#include <gtest/gtest.h>

#include <cstring>

#include "camera/camera_result.h"
#include "imaging/image_fixture.h"
#include "imaging/image_pipeline.h"
#include "memory/failing_allocator.h"

namespace ZV::Test {
namespace {

/// Makes an image of three colours out of one, as the filter wheel does with its last exposure.
class Tripler : public ZImageFilter {
  public:
    FilterResult Process(ZInImageBufferStruct* in, ZOutImageBufferStruct* out) override {
        out->imageSize = 3 * in->imageSize;
        if (out->imageSize > out->dataCapacity) return FilterFailed;
        std::memset(out->data, 1, out->imageSize);
        out->width = in->width;
        out->height = in->height;
        out->imageFormat = RGBPlane8;
        return FilterDone;
    }
    FilterResult Init(std::uint32_t, std::uint32_t) override { return FilterDone; }
    FilterResult SetOutputFormat(std::uint32_t) override { return FilterDone; }
    void Reset() override {}
    std::uint32_t GetNeededOutputBufferSize(ZInImageBufferStruct* in) override {
        return 3 * in->imageSize;
    }
};

TEST(PipelineWithoutMemory, LetsNoImageThatItHasNotMadePassAsAGoodOne) {
    Tripler tripler;
    ZImagePipeline pipeline;
    pipeline.Setup(4, 2);
    pipeline.AddFilter(&tripler);
    ZExImage image = Testing::MakeImage(Testing::Ramp(8));

    BeginAllocations(1);
    bool isComplete = false;
    const FilterResult result = pipeline.ProcessImage(&image, &isComplete);
    EXPECT_TRUE(EndAllocations());

    // Kept: the image that a filter has failed on is delivered as it came.
    EXPECT_EQ(FilterFailed, result);
    EXPECT_TRUE(isComplete);
    EXPECT_EQ(8U, image.GetImageSize());
    EXPECT_EQ(FrameStatusBufferTooSmall, image.GetErrorCode());
}

/// A filter wheel or mosaic filter whose buffers could not be had.
class Unprepared : public Tripler {
  public:
    FilterResult Process(ZInImageBufferStruct*, ZOutImageBufferStruct*) override {
        return FilterNotInitialised;
    }
};

TEST(PipelineWithoutMemory, LetsNoImagePassAsAGoodOneWhoseFilterHasNoBuffers) {
    Unprepared filter;
    ZImagePipeline pipeline;
    pipeline.Setup(4, 2);
    pipeline.AddFilter(&filter);
    ZExImage image = Testing::MakeImage(Testing::Ramp(8));
    bool isComplete = false;

    EXPECT_EQ(FilterNotInitialised, pipeline.ProcessImage(&image, &isComplete));

    EXPECT_TRUE(isComplete);
    EXPECT_EQ(8U, image.GetImageSize());
    EXPECT_EQ(FrameStatusBufferTooSmall, image.GetErrorCode());
}

}  // namespace
}  // namespace ZV::Test
