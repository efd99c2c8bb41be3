#include "imaging/image_pipeline.h"

#include <gtest/gtest.h>

#include <functional>
#include <memory>
#include <string>

#include "image_fixture.h"

namespace ZV::Testing {
namespace {

/// A filter whose work a test writes down.
class ScriptedFilter : public ZImageFilter {
  public:
    using Work = std::function<FilterResult(ZInImageBufferStruct&, ZOutImageBufferStruct&)>;

    explicit ScriptedFilter(Work newWork) : work(std::move(newWork)) {}

    FilterResult Process(ZInImageBufferStruct* in, ZOutImageBufferStruct* out) override {
        ++processed;
        lastIn = *in;
        lastOut = *out;
        return work(*in, *out);
    }
    FilterResult Init(std::uint32_t width, std::uint32_t height) override {
        initWidth = width;
        initHeight = height;
        ++inits;
        return initResult;
    }
    FilterResult SetOutputFormat(std::uint32_t format) override {
        outputFormat = format;
        return formatResult;
    }
    void Reset() override { ++resets; }
    std::uint32_t GetNeededOutputBufferSize(ZInImageBufferStruct* in) override {
        return needed != 0 ? needed : ZImageFilter::GetNeededOutputBufferSize(in);
    }

    Work work;
    int processed = 0;
    int inits = 0;
    int resets = 0;
    std::uint32_t initWidth = 99;
    std::uint32_t initHeight = 99;
    std::uint32_t outputFormat = 0;
    std::uint32_t needed = 0;
    FilterResult initResult = FilterDone;
    FilterResult formatResult = FilterDone;
    ZInImageBufferStruct lastIn;
    ZOutImageBufferStruct lastOut;
};

ScriptedFilter::Work Return(FilterResult result) {
    return [result](ZInImageBufferStruct&, ZOutImageBufferStruct&) { return result; };
}

/// Writes `count` bytes, each the input's first plus `step`.
ScriptedFilter::Work Produce(std::uint32_t count, int step, std::uint32_t format = RGB24) {
    return [=](ZInImageBufferStruct& in, ZOutImageBufferStruct& out) {
        const auto value = static_cast<std::uint8_t>(in.data[0] + step);
        std::memset(out.data, value, count);
        out.imageSize = count;
        out.width = 3;
        out.height = 1;
        out.imageFormat = format;
        return FilterDone;
    };
}

/// Adds 1 to what it finds in the output, as a filter does that works in place.
FilterResult WorkInPlace(ZInImageBufferStruct& in, ZOutImageBufferStruct& out) {
    for (std::uint32_t index = 0; index < in.imageSize; ++index) ++out.data[index];
    out.imageSize = in.imageSize;
    out.width = in.width;
    out.height = in.height;
    out.imageFormat = in.imageFormat;
    return FilterDone;
}

class ImagePipelineTest : public testing::Test {
  protected:
    ScriptedFilter& Add(ScriptedFilter::Work work) {
        owned.push_back(std::make_unique<ScriptedFilter>(std::move(work)));
        pipeline.AddFilter(owned.back().get());
        return *owned.back();
    }

    FilterResult Process(ZExImage& image) { return pipeline.ProcessImage(&image, &complete); }

    FilterResult ProcessBuffers() {
        in.data = input.data();
        in.imageSize = static_cast<std::uint32_t>(input.size());
        in.width = 4;
        in.height = 2;
        in.imageFormat = Mono8;
        out.data = output.data();
        out.dataCapacity = output.size();
        return pipeline.ProcessImage(&in, &out, &complete);
    }

    std::vector<std::unique_ptr<ScriptedFilter>> owned;
    ZImagePipeline pipeline;
    bool complete = false;
    Bytes input = Ramp(8);
    Bytes output = Bytes(64, 0xEE);
    ZInImageBufferStruct in;
    ZOutImageBufferStruct out;
};

TEST_F(ImagePipelineTest, KeptBeforeSetupTheResultIs27AndTheFlagIsNotTouched) {
    Add(Return(FilterDone));
    for (const bool preset : {false, true}) {
        complete = preset;
        EXPECT_EQ(ProcessBuffers(), PipelineNotSetUp);
        EXPECT_EQ(complete, preset);
    }
}

TEST_F(ImagePipelineTest, BeforeSetupAnImageKeepsItsSizeAlthoughItsBufferMayHaveGrown) {
    Add(Return(FilterDone)).needed = 100;
    ZExImage image = MakeImage(Ramp(8));

    EXPECT_EQ(Process(image), PipelineNotSetUp);

    EXPECT_EQ(image.GetImageSize(), 8U);
    EXPECT_EQ(image.GetBufferBytes(), 100U);
    EXPECT_EQ(GetPixels(image), Ramp(8));
}

TEST_F(ImagePipelineTest, WithoutFiltersTheResultIs30InBothFormsAndNoBufferGrows) {
    pipeline.Setup(4, 2);
    ZExImage image = MakeImage(Ramp(8));

    EXPECT_EQ(ProcessBuffers(), PipelineEmpty);
    EXPECT_TRUE(complete);
    complete = false;
    EXPECT_EQ(Process(image), PipelineEmpty);

    EXPECT_TRUE(complete);
    EXPECT_EQ(image.GetBufferBytes(), 8U);
}

TEST_F(ImagePipelineTest, WithEveryFilterDisabledTheResultIs31AndTheOutputIsNotWritten) {
    pipeline.Setup(4, 2);
    ScriptedFilter& first = Add(Produce(3, 1));
    ScriptedFilter& second = Add(Produce(3, 1));
    first.Disable();
    second.Disable();

    EXPECT_EQ(ProcessBuffers(), FilterDeclined);

    EXPECT_TRUE(complete);
    EXPECT_EQ(output, Bytes(64, 0xEE));
    EXPECT_EQ(first.processed + second.processed, 0);
}

TEST_F(ImagePipelineTest, EachFilterWorksOnTheResultOfTheOneBefore) {
    pipeline.Setup(4, 2);
    Add(Produce(6, 10, RGB24));
    ScriptedFilter& second = Add(Produce(5, 20, BGR24));

    EXPECT_EQ(ProcessBuffers(), FilterDone);

    EXPECT_EQ(second.lastIn.imageFormat, RGB24);
    EXPECT_EQ(second.lastIn.imageSize, 6U);
    EXPECT_EQ(second.lastIn.width, 3U);
    EXPECT_EQ(output[0], 31);
    EXPECT_EQ(out.imageSize, 5U);
    EXPECT_EQ(out.imageFormat, BGR24);
    EXPECT_EQ(input, Ramp(8)) << "the client's input is left alone";
    EXPECT_NE(in.data, input.data()) << "the input now points at the intermediate buffer";
}

TEST_F(ImagePipelineTest, AFilterThatDeclinesPassesTheImageOnToOneThatWorksInPlace) {
    pipeline.Setup(4, 2);
    Add(Return(FilterDeclined));
    Add(WorkInPlace);

    EXPECT_EQ(ProcessBuffers(), FilterDone);

    EXPECT_EQ(Bytes(output.begin(), output.begin() + 8), (Bytes{2, 3, 4, 5, 6, 7, 8, 9}));
    EXPECT_EQ(out.imageSize, 8U);
    EXPECT_EQ(out.width, 4U);
    EXPECT_EQ(out.imageFormat, Mono8);
}

TEST_F(ImagePipelineTest, KeptADisabledFilterCopiesNothingSoTheNextFindsOldBytes) {
    pipeline.Setup(4, 2);
    Add(Return(FilterDeclined)).Disable();
    Add(WorkInPlace);

    EXPECT_EQ(ProcessBuffers(), FilterDone);

    EXPECT_EQ(output[0], 0xEF);
}

TEST_F(ImagePipelineTest, KeptAChainThatEndsWithADeclineLeavesNewPixelsUnderTheOldDescription) {
    pipeline.Setup(4, 2);
    Add(Produce(3, 10));
    Add(Return(FilterDeclined));
    ZExImage image = MakeImage(Ramp(8));

    EXPECT_EQ(Process(image), FilterDeclined);

    EXPECT_EQ(GetPixels(image), (Bytes{11, 11, 11, 4, 5, 6, 7, 8}));
    EXPECT_EQ(image.GetImageSize(), 8U);
    EXPECT_EQ(image.GetWidth(), 4U);
    EXPECT_EQ(image.GetHeight(), 2U);
    EXPECT_EQ(image.GetImageFormat(), Mono8);
}

TEST_F(ImagePipelineTest, OnSuccessTheImageTakesTheDescriptionOfTheOutput) {
    pipeline.Setup(4, 2);
    Add(Produce(20, 10)).needed = 24;
    ZExImage image = MakeImage(Ramp(8));

    EXPECT_EQ(Process(image), FilterDone);

    EXPECT_EQ(GetPixels(image), Bytes(20, 11));
    EXPECT_EQ(image.GetWidth(), 3U);
    EXPECT_EQ(image.GetHeight(), 1U);
    EXPECT_EQ(image.GetImageFormat(), RGB24);
    EXPECT_EQ(image.GetBufferBytes(), 24U);
}

TEST_F(ImagePipelineTest, OnAnyOtherResultTheSizeIsPutBackWhereTheBufferHadGrown) {
    pipeline.Setup(4, 2);
    ScriptedFilter& filter = Add(Return(FilterFailed));
    filter.needed = 24;
    for (const FilterResult result : {FilterFailed, FilterNothingYet, FilterResult{-3}}) {
        filter.work = Return(result);
        ZExImage image = MakeImage(Ramp(8));

        EXPECT_EQ(Process(image), result);

        EXPECT_EQ(GetPixels(image), Ramp(8));
        EXPECT_EQ(image.GetBufferBytes(), 24U);
    }
}

TEST_F(ImagePipelineTest, WidthAndHeightOfTheOutputAreCutTo16Bits) {
    pipeline.Setup(4, 2);
    Add([](ZInImageBufferStruct&, ZOutImageBufferStruct& result) {
        result.imageSize = 1;
        result.width = 0x12345;
        result.height = 0x54321;
        return FilterDone;
    });
    ZExImage image = MakeImage(Ramp(8));

    EXPECT_EQ(Process(image), FilterDone);

    EXPECT_EQ(image.GetWidth(), 0x2345U);
    EXPECT_EQ(image.GetHeight(), 0x4321U);
}

TEST_F(ImagePipelineTest, AFilterSeesWhatTheImageSays) {
    pipeline.Setup(4, 2);
    ScriptedFilter& filter = Add(Return(FilterFailed));
    int camera = 0;
    ZExImage image = MakeImage(Ramp(8), {.bitDepth = 12,
                                         .format = Bayer16,
                                         .pattern = PatternBlue,
                                         .binning = 3,
                                         .isRTV = true,
                                         .camera = &camera});

    (void)Process(image);

    EXPECT_EQ(filter.lastIn.data, image.GetImageData());
    EXPECT_EQ(filter.lastIn.imageSize, 8U);
    EXPECT_EQ(filter.lastIn.width, 4U);
    EXPECT_EQ(filter.lastIn.height, 2U);
    EXPECT_EQ(filter.lastIn.bitDepth, 12U);
    EXPECT_EQ(filter.lastIn.colourPattern, PatternBlue);
    EXPECT_EQ(filter.lastIn.filterColour, PatternBlue);
    EXPECT_EQ(filter.lastIn.imageFormat, Bayer16);
    EXPECT_EQ(filter.lastIn.symmetricalBinningMode, 3U);
    EXPECT_TRUE(filter.lastIn.isRTV);
    EXPECT_EQ(static_cast<void*>(filter.lastIn.camera), &camera);
    EXPECT_GE(filter.lastOut.dataCapacity, 8U);
}

TEST_F(ImagePipelineTest, AFrameThatIsHeldBackLeavesTheImageIncomplete) {
    pipeline.Setup(4, 2);
    Add(Return(FilterNothingYet));
    ZExImage image = MakeImage(Ramp(8));
    complete = true;

    EXPECT_EQ(Process(image), FilterNothingYet);

    EXPECT_FALSE(complete);
}

TEST_F(ImagePipelineTest, KeptAfterAFrameHeldBackTheChainGoesOnAndItsResultCounts) {
    pipeline.Setup(4, 2);
    Add(Return(FilterNothingYet));
    Add(Produce(3, 1));
    ZExImage image = MakeImage(Ramp(8));

    EXPECT_EQ(Process(image), FilterDone);

    EXPECT_FALSE(complete);
    EXPECT_EQ(image.GetImageSize(), 3U);
}

TEST_F(ImagePipelineTest, AnyOtherResultEndsTheChainANegativeOneToo) {
    pipeline.Setup(4, 2);
    ScriptedFilter& first = Add(Return(FilterFailed));
    ScriptedFilter& second = Add(Produce(3, 1));
    for (const int result : {-1, 3, 5, 28, 29, 100}) {
        first.work = Return(static_cast<FilterResult>(result));
        EXPECT_EQ(ProcessBuffers(), result);
    }

    EXPECT_EQ(second.processed, 0);
}

TEST_F(ImagePipelineTest, TheOutputsSizeIs0WhenAFilterIsEntered) {
    pipeline.Setup(4, 2);
    ScriptedFilter& filter = Add(Return(FilterDone));
    out.imageSize = 0xFFFFFFFF;

    EXPECT_EQ(ProcessBuffers(), FilterDone);

    EXPECT_EQ(filter.lastOut.imageSize, 0U);
    EXPECT_EQ(output, Bytes(64, 0xEE));
}

TEST_F(ImagePipelineTest, AFilterThatClaimsMoreThanTheBuffersHoldFails) {
    pipeline.Setup(4, 2);
    ScriptedFilter& filter = Add(Return(FilterDone));
    for (const std::uint32_t claimed : {9U, 49U, 0xFFFFFFFFU}) {
        filter.work = [=](ZInImageBufferStruct&, ZOutImageBufferStruct& result) {
            result.imageSize = claimed;
            return FilterDone;
        };
        ZExImage image = MakeImage(Ramp(8));

        EXPECT_EQ(Process(image), FilterFailed);
        EXPECT_EQ(GetPixels(image), Ramp(8));
    }
    EXPECT_EQ(ProcessBuffers(), FilterFailed);
}

TEST_F(ImagePipelineTest, AnOutputThatIsTooSmallForAnImagePassedOnFails) {
    pipeline.Setup(4, 2);
    Add(Return(FilterDeclined));
    output = Bytes(7, 0xEE);

    EXPECT_EQ(ProcessBuffers(), FilterFailed);

    EXPECT_EQ(output, Bytes(7, 0xEE));
}

TEST_F(ImagePipelineTest, AnOutputOfUnknownSizeIsVouchedForByItsOwner) {
    pipeline.Setup(4, 2);
    Add(Return(FilterDeclined));
    in.data = input.data();
    in.imageSize = 8;
    out.data = output.data();

    EXPECT_EQ(pipeline.ProcessImage(&in, &out, &complete), FilterDeclined);

    EXPECT_EQ(Bytes(output.begin(), output.begin() + 8), Ramp(8));
}

TEST_F(ImagePipelineTest, AnImageLargerThanTheSensorPasses) {
    pipeline.Setup(1, 1);
    Add(Return(FilterDeclined));
    Add(WorkInPlace);
    ZExImage image = MakeImage(Bytes(1000, 7), {.width = 100, .height = 10});

    EXPECT_EQ(Process(image), FilterDone);
    EXPECT_EQ(GetPixels(image), Bytes(1000, 8));
    input = Bytes(900, 3);
    output = Bytes(900, 0);
    EXPECT_EQ(ProcessBuffers(), FilterDone);

    EXPECT_EQ(output, Bytes(900, 4));
}

TEST_F(ImagePipelineTest, ANonsensicalSensorSizeTakesNoMemoryAndImagesPassAllTheSame) {
    for (const std::uint32_t side : {0U, 65535U, 0x10000U, 0xFFFFFFFFU}) {
        pipeline.Setup(side, side);
        owned.clear();
        ZImagePipeline fresh;
        fresh.Setup(side, side);
        ScriptedFilter filter(Produce(8, 1));
        fresh.AddFilter(&filter);
        ZExImage image = MakeImage(Ramp(8));

        EXPECT_EQ(fresh.ProcessImage(&image, &complete), FilterDone);
        EXPECT_EQ(GetPixels(image), Bytes(8, 2));
    }
}

TEST_F(ImagePipelineTest, AnImageWhoseClaimedSizeIsNotHeldIsReadNoFurtherThanItsBuffer) {
    pipeline.Setup(4, 2);
    Add(Return(FilterDeclined));
    Add(WorkInPlace);
    ZExImage image = MakeImage(Ramp(8));
    image.SetImageSize(100000);

    EXPECT_EQ(Process(image), FilterDone);

    EXPECT_EQ(image.GetImageSize(), 8U);
}

TEST_F(ImagePipelineTest, AnImageOfNothingIsHarmless) {
    pipeline.Setup(0, 0);
    Add(Return(FilterDeclined));
    Add(WorkInPlace);
    ZExImage image = MakeImageOver(nullptr, 0, {.width = 0, .height = 0}, true);

    EXPECT_EQ(Process(image), FilterDone);

    EXPECT_EQ(image.GetImageSize(), 0U);
}

TEST_F(ImagePipelineTest, OneBufferForBothEndsIsFine) {
    pipeline.Setup(4, 2);
    Add(Return(FilterDeclined));
    in.data = input.data();
    in.imageSize = 8;
    out.data = input.data();
    out.dataCapacity = 8;

    EXPECT_EQ(pipeline.ProcessImage(&in, &out, &complete), FilterDeclined);

    EXPECT_EQ(input, Ramp(8));
}

TEST_F(ImagePipelineTest, ASecondSetupReplacesTheBufferAndTellsNoFilter) {
    pipeline.Setup(4, 2);
    ScriptedFilter& filter = Add(Return(FilterDeclined));

    pipeline.Setup(40, 20);

    EXPECT_EQ(filter.inits, 1);
    EXPECT_EQ(filter.initWidth, 4U);
    EXPECT_EQ(ProcessBuffers(), FilterDeclined);
}

TEST_F(ImagePipelineTest, KeptAFilterAddedBeforeSetupIsToldASizeOf0AndItsFailureIsNotLookedAt) {
    ScriptedFilter filter(Return(FilterDeclined));
    filter.initResult = FilterFailed;

    pipeline.AddFilter(&filter);

    EXPECT_EQ(filter.initWidth, 0U);
    EXPECT_EQ(filter.initHeight, 0U);
    EXPECT_TRUE(pipeline.RemoveFilter(&filter));
}

TEST_F(ImagePipelineTest, RemovingTakesTheFirstEntryAndKeepsTheOrderOfTheRest) {
    pipeline.Setup(4, 2);
    std::string order;
    const auto note = [&order](char name) {
        return [&order, name](ZInImageBufferStruct&, ZOutImageBufferStruct&) {
            order += name;
            return FilterDeclined;
        };
    };
    ScriptedFilter& first = Add(note('a'));
    ScriptedFilter& second = Add(note('b'));
    Add(note('c'));
    pipeline.AddFilter(&first);

    EXPECT_TRUE(pipeline.RemoveFilter(&first));
    (void)ProcessBuffers();
    EXPECT_EQ(order, "bca");
    EXPECT_TRUE(pipeline.RemoveFilter(&first));
    EXPECT_FALSE(pipeline.RemoveFilter(&first));
    EXPECT_TRUE(pipeline.RemoveFilter(&second));
    (void)ProcessBuffers();

    EXPECT_EQ(order, "bcac");
}

TEST_F(ImagePipelineTest, ANullFilterIsNotTakenIn) {
    pipeline.Setup(4, 2);

    pipeline.AddFilter(nullptr);

    EXPECT_EQ(ProcessBuffers(), PipelineEmpty);
}

TEST_F(ImagePipelineTest, ResetReachesEveryFilter) {
    ScriptedFilter& first = Add(Return(FilterDone));
    ScriptedFilter& second = Add(Return(FilterDone));

    pipeline.ResetFilters();

    EXPECT_EQ(first.resets, 1);
    EXPECT_EQ(second.resets, 1);
}

TEST_F(ImagePipelineTest, SetOutputFormatStopsAtAFailingFirstFilter) {
    ScriptedFilter& first = Add(Return(FilterDone));
    ScriptedFilter& second = Add(Return(FilterDone));
    first.formatResult = FilterFailed;

    EXPECT_EQ(pipeline.SetOutputFormat(RGB48), FilterFailed);
    EXPECT_EQ(second.outputFormat, 0U);
    first.formatResult = FilterDone;
    EXPECT_EQ(pipeline.SetOutputFormat(RGB48), FilterDone);

    EXPECT_EQ(second.outputFormat, RGB48);
}

TEST_F(ImagePipelineTest, TheNeededSizeIsTheLargestOfAllFiltersDisabledOnesToo) {
    Add(Return(FilterDone)).needed = 50;
    Add(Return(FilterDone)).needed = 70;
    owned.back()->Disable();
    in.imageSize = 60;

    EXPECT_EQ(pipeline.GetNeededOutputBufferSize(&in), 70U);
    in.imageSize = 80;
    EXPECT_EQ(pipeline.GetNeededOutputBufferSize(&in), 80U);
}

TEST_F(ImagePipelineTest, AFilterIsEnabledUntilItIsDisabled) {
    ScriptedFilter& filter = Add(Return(FilterDone));

    EXPECT_TRUE(filter.IsEnabled());
    filter.Disable();
    EXPECT_FALSE(filter.IsEnabled());
    filter.Enable();

    EXPECT_TRUE(filter.IsEnabled());
}

}  // namespace
}  // namespace ZV::Testing
