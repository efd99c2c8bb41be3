#include <gtest/gtest.h>

#include <cstring>
#include <vector>

#include "camera/bare_camera.h"
#include "camera/camera_result.h"
#include "imaging/bayer_interpolation.h"
#include "imaging/image_fixture.h"
#include "imaging/image_pipeline.h"
#include "imaging/rgb_filter_wheel.h"
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

/// The wheel of a camera in a pipeline, and frames of its colours.
class WheelWithoutMemory : public PipelineWithoutMemory {
  protected:
    class Camera : public BareBase {
      public:
        std::uint32_t GetImageFormat() override { return CameraRGBFilter; }
        std::uint16_t GetRGBFilterStartColour() override { return PatternRed; }
    };

    void AddWithout(std::int64_t plane) {
        pipeline.Setup(4, 2);
        BeginAllocations(plane);
        (void)wheel.Init(4, 2);
        ASSERT_TRUE(EndAllocations());
        pipeline.AddFilter(&bystander);
    }
    FilterResult Take(ZColourPatternEnum colour) {
        image = Testing::MakeImage(Testing::Ramp(8),
                                   {.pattern = colour, .camera = static_cast<ZCamera*>(&camera)});
        return Process();
    }

    /// Lets the pipeline have the wheel without telling it the size anew.
    class Bystander : public Tripler {
      public:
        explicit Bystander(ZRGBFilterWheel& newWheel) : wheel(newWheel) {}
        FilterResult Process(ZInImageBufferStruct* in, ZOutImageBufferStruct* out) override {
            return wheel.Process(in, out);
        }
        std::uint32_t GetNeededOutputBufferSize(ZInImageBufferStruct* in) override {
            return wheel.GetNeededOutputBufferSize(in);
        }

      private:
        ZRGBFilterWheel& wheel;
    };

    Camera camera;
    ZRGBFilterWheel wheel{RGBPlane8};
    Bystander bystander{wheel};
};

TEST_F(WheelWithoutMemory, MakesItsPlanesWithTheFirstFrameThatFindsSome) {
    for (std::int64_t plane = 1; plane <= 3; ++plane) {
        SCOPED_TRACE(plane);
        AddWithout(plane);

        EXPECT_EQ(FilterNothingYet, Take(PatternRed));
        EXPECT_EQ(FilterNothingYet, Take(PatternGreen));
        EXPECT_EQ(FilterDone, Take(PatternBlue));

        EXPECT_EQ(24U, image.GetImageSize());
        EXPECT_EQ(FrameStatusGood, image.GetErrorCode());
        wheel.FreeBuffers();
        pipeline.RemoveFilter(&bystander);
    }
}

TEST_F(WheelWithoutMemory, TellsOfEachFrameUntilThereIsSome) {
    AddWithout(1);
    image = Testing::MakeImage(Testing::Ramp(8),
                               {.pattern = PatternRed, .camera = static_cast<ZCamera*>(&camera)});
    BeginAllocations(1);
    EXPECT_EQ(FilterNotInitialised, Process());
    EXPECT_TRUE(EndAllocations());
    ExpectImageAsItCame();

    EXPECT_EQ(FilterNothingYet, Take(PatternRed));
    EXPECT_EQ(1, wheel.GetRedCount());
}

TEST_F(WheelWithoutMemory, MakesPlanesOfTheSizeThatThereWasNoneFor) {
    pipeline.Setup(4, 2);
    (void)wheel.Init(1, 1);
    wheel.FreeBuffers();
    BeginAllocations(1);
    (void)wheel.AllocateBuffers(4, 2);
    ASSERT_TRUE(EndAllocations());
    pipeline.AddFilter(&bystander);

    EXPECT_EQ(FilterNothingYet, Take(PatternRed));
    EXPECT_EQ(1, wheel.GetRedCount());
    EXPECT_EQ(FrameStatusGood, image.GetErrorCode());
}

TEST_F(WheelWithoutMemory, MakesNoPlanesThatWereLetGoOnPurpose) {
    pipeline.Setup(4, 2);
    (void)wheel.Init(4, 2);
    wheel.FreeBuffers();
    pipeline.AddFilter(&bystander);

    EXPECT_EQ(FilterNotInitialised, Take(PatternRed));

    ExpectImageAsItCame();
}

TEST_F(WheelWithoutMemory, OfAFormatThatIsNoneLeavesTheImageGoodWithMemoryAtHand) {
    pipeline.Setup(4, 2);
    pipeline.AddFilter(&wheel);
    (void)wheel.SetOutputFormat(RGBX32);
    (void)Take(PatternRed);
    (void)Take(PatternGreen);

    EXPECT_EQ(FilterFailed, Take(PatternBlue));

    EXPECT_EQ(8U, image.GetImageSize());
    EXPECT_EQ(FrameStatusGood, image.GetErrorCode());
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
