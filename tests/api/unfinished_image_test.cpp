// What the standard library throws on the way of an image ends its processing, not its delivery.

#include <gtest/gtest.h>

#include <new>

#include "api/delivery_fixture.h"
#include "imaging/image_filter.h"

namespace ZV {
namespace {

using Test::ClientFrame;
using Test::Delivery;

/// Has no memory, and says so in the way of the standard library.
class ThrowingFilter : public ZImageFilter {
  public:
    FilterResult Process(ZInImageBufferStruct*, ZOutImageBufferStruct*) override {
        throw std::bad_alloc();
    }
    FilterResult Init(std::uint32_t, std::uint32_t) override { return FilterDone; }
    FilterResult SetOutputFormat(std::uint32_t) override { return FilterDone; }
    std::uint32_t GetNeededOutputBufferSize(ZInImageBufferStruct* in) override {
        return 3 * in->imageSize;
    }
};

class UnfinishedImage : public Delivery {
  protected:
    void SetUp() override {
        Delivery::SetUp();
        GetContext().postPipeline->AddFilter(&filter);
        GetContext().postProcessing = 1;
    }
    void TearDown() override {
        GetContext().postPipeline->RemoveFilter(&filter);
        Delivery::TearDown();
    }

    ThrowingFilter filter;
};

TEST_F(UnfinishedImage, IsDeliveredAsItCameWithACodeAndTheChangeBehindItIsMade) {
    ClientFrame second(ImageBytes);
    QueueFrame(zcbFrameDone, 1);
    QueueSettings(zcbFrameDone, 100);
    ASSERT_ZERR(zerrNone, Queue(second, calls, zcbFrameDone, 2));

    ReceiveImage();

    const auto heard = calls.GetCalls();
    ASSERT_EQ(2u, heard.size());
    EXPECT_EQ(1u, heard[0].userData);
    EXPECT_ZERR(zerrBufferTooSmall, heard[0].errorCode);
    EXPECT_EQ(100u, heard[1].userData);
    EXPECT_ZERR(zerrNone, heard[1].errorCode);
    EXPECT_ZERR(zerrBufferTooSmall, frame->errorCode);
    EXPECT_EQ(ImageBytes, frame->size);
    EXPECT_EQ(0x42, frame.GetPixels()[0]);
    EXPECT_TRUE(frame.IsGuardIntact());
    EXPECT_EQ(0u, GetCamera().GetStreamCounters().withoutTaker.GetSum());
}

TEST_F(UnfinishedImage, KeepsTheCodeThatItCameWith) {
    QueueFrame(zcbFrameDone);

    ReceiveImage(MakeImage(FrameStatusMissingData));

    ASSERT_EQ(1u, calls.CountCalls());
    EXPECT_ZERR(zerrMissingData, calls.GetCalls()[0].errorCode);
}

TEST_F(UnfinishedImage, OfAGrabIsToldByTheFrameAlone) {
    ASSERT_ZERR(zerrNone, Zentara_GrabFrame(handle, frame.Get()));

    EXPECT_ZERR(zerrBufferTooSmall, frame->errorCode);
    EXPECT_EQ(ImageBytes, frame->size);
}

}  // namespace
}  // namespace ZV
