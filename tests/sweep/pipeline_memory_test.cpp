#include <gtest/gtest.h>

#include <cstring>
#include <vector>

#include "camera/camera_result.h"
#include "imaging/bayer_interpolation.h"
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

/// A filter wheel or mosaic filter whose buffers could not be had.
class Unprepared : public Tripler {
  public:
    FilterResult Process(ZInImageBufferStruct*, ZOutImageBufferStruct*) override {
        return FilterNotInitialised;
    }
};

/// A filter that has nothing to do with images of this kind.
class Decliner : public Tripler {
  public:
    FilterResult Process(ZInImageBufferStruct*, ZOutImageBufferStruct*) override {
        return FilterDeclined;
    }
    std::uint32_t GetNeededOutputBufferSize(ZInImageBufferStruct* in) override {
        return in->imageSize;
    }
};

/// A filter wheel whose semaphore is not there.
class Lockless : public Tripler {
  public:
    FilterResult Process(ZInImageBufferStruct*, ZOutImageBufferStruct*) override {
        return CameraHalFault;
    }
};

/// A pipeline of one filter.
class PipelineWithoutMemory : public testing::Test {
  protected:
    void Add(ZImageFilter* filter) {
        pipeline.Setup(4, 2);
        pipeline.AddFilter(filter);
    }
    /// The size of the sensor is one that no buffer is made for ahead.
    void AddWithoutIntermediate(ZImageFilter* filter) {
        pipeline.Setup(20000, 20000);
        pipeline.AddFilter(filter);
    }
    /// Before it the image's own buffer may have to grow: its pixels, and the count of its owners.
    FilterResult ProcessWithoutIntermediate(bool doesGrow) {
        BeginAllocations(doesGrow ? 3 : 1);
        const FilterResult result = Process();
        EXPECT_TRUE(EndAllocations());
        return result;
    }
    FilterResult Process() { return pipeline.ProcessImage(&image, &isComplete); }
    /// Kept: the image that a filter has failed on is delivered as it came.
    void ExpectImageAsItCame() const {
        EXPECT_TRUE(isComplete);
        EXPECT_EQ(8U, image.GetImageSize());
        EXPECT_EQ(0, std::memcmp(Testing::Ramp(8).data(), image.GetImageData(), 8));
        EXPECT_EQ(FrameStatusBufferTooSmall, image.GetErrorCode());
    }

    ZImagePipeline pipeline;
    ZExImage image = Testing::MakeImage(Testing::Ramp(8));
    bool isComplete = false;
};

TEST_F(PipelineWithoutMemory, LetsNoImageThatItHasNotMadePassAsAGoodOne) {
    Tripler tripler;
    Add(&tripler);

    BeginAllocations(1);
    const FilterResult result = Process();
    EXPECT_TRUE(EndAllocations());

    EXPECT_EQ(FilterFailed, result);
    ExpectImageAsItCame();
}

TEST_F(PipelineWithoutMemory, LetsNothingBeThrownForTheOwnersOfTheImagesPixels) {
    Tripler tripler;
    Add(&tripler);

    BeginAllocations(2);
    const FilterResult result = Process();
    EXPECT_TRUE(EndAllocations());

    EXPECT_EQ(FilterFailed, result);
    ExpectImageAsItCame();
    EXPECT_EQ(FilterDone, Process()) << "with memory again";
}

TEST_F(PipelineWithoutMemory, WritesNoPixelOfAClientBehindAnImageThatCouldNotGrow) {
    Tripler tripler;
    Add(&tripler);
    ASSERT_EQ(FilterDone, Process());
    ZExImage later = Testing::MakeImage(Testing::Ramp(8));
    BeginAllocations(2);
    EXPECT_EQ(FilterFailed, pipeline.ProcessImage(&later, &isComplete));
    EXPECT_TRUE(EndAllocations());
    std::vector<std::uint8_t> pixels = Testing::Ramp(8), made(24);
    ZInImageBufferStruct in;
    in.data = pixels.data();
    in.imageSize = 8;
    in.width = 4;
    in.height = 2;
    ZOutImageBufferStruct out;
    out.data = made.data();
    out.dataCapacity = made.size();

    EXPECT_EQ(FilterDone, pipeline.ProcessImage(&in, &out, &isComplete));

    EXPECT_EQ(Testing::Ramp(8), pixels);
    EXPECT_NE(pixels.data(), in.data) << "the pipeline's own buffer";
}

TEST_F(PipelineWithoutMemory, LetsNoImagePassAsAGoodOneWhoseFilterHasNoBuffers) {
    Unprepared filter;
    Add(&filter);

    EXPECT_EQ(FilterNotInitialised, Process());

    ExpectImageAsItCame();
}

TEST_F(PipelineWithoutMemory, LetsNoImagePassAsAGoodOneWhoseFilterHasNoLock) {
    Lockless filter;
    Add(&filter);

    EXPECT_EQ(CameraHalFault, Process());

    ExpectImageAsItCame();
}

TEST_F(PipelineWithoutMemory, LeavesAnImageGoodThatNoFilterWouldHaveWorkedOn) {
    Decliner first, last;
    AddWithoutIntermediate(&first);
    pipeline.AddFilter(&last);

    EXPECT_EQ(FilterDeclined, ProcessWithoutIntermediate(false));

    EXPECT_TRUE(isComplete);
    EXPECT_EQ(FrameStatusGood, image.GetErrorCode());
    EXPECT_EQ(0, std::memcmp(Testing::Ramp(8).data(), image.GetImageData(), 8));
}

TEST_F(PipelineWithoutMemory, TellsOfAnImageThatAFilterWouldHaveWorkedOn) {
    Decliner first;
    Tripler last;
    AddWithoutIntermediate(&first);
    pipeline.AddFilter(&last);

    EXPECT_EQ(FilterFailed, ProcessWithoutIntermediate(true));

    ExpectImageAsItCame();
}

TEST_F(PipelineWithoutMemory, OfNoFiltersLeavesAnImageGood) {
    Decliner none;
    AddWithoutIntermediate(&none);
    ASSERT_TRUE(pipeline.RemoveFilter(&none));

    EXPECT_EQ(PipelineEmpty, ProcessWithoutIntermediate(false));

    EXPECT_EQ(FrameStatusGood, image.GetErrorCode());
}

TEST_F(PipelineWithoutMemory, KeepsTheCodeThatAnImageHas) {
    Unprepared filter;
    Add(&filter);
    image.SetErrorCode(FrameStatusMissingData);

    EXPECT_EQ(FilterNotInitialised, Process());

    EXPECT_EQ(FrameStatusMissingData, image.GetErrorCode());
}

TEST_F(PipelineWithoutMemory, TellsOfAMosaicThatCouldNotBeFinished) {
    ZBayerInterpolation filter(1, RGB24);
    Add(&filter);
    int told = 0;
    for (std::int64_t failing = 1; failing < 50; ++failing) {
        image = Testing::MakeImage(Testing::Ramp(8), {.format = Bayer8});
        BeginAllocations(failing);
        const FilterResult result = Process();
        const bool hasRefused = EndAllocations();
        EXPECT_EQ(result == FilterDone ? FrameStatusGood : FrameStatusBufferTooSmall,
                  image.GetErrorCode());
        if (result != FilterDone) ++told;
        if (!hasRefused) break;
    }
    EXPECT_LE(2, told);
    EXPECT_EQ(std::uint32_t{RGB24}, image.GetImageFormat());
}

}  // namespace
}  // namespace ZV::Test
