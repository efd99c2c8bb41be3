#include <gtest/gtest.h>

#include <atomic>
#include <new>

#include "camera/test_camera.h"
#include "imaging/image_filter.h"
#include "imaging/image_formats.h"
#include "imaging/image_pipeline.h"

namespace ZV::Test {

/// An open camera with its run loop; the test stands in for the bus thread.
class CameraWithARunLoop : public CameraWorld, public testing::Test {
  protected:
    CameraWithARunLoop() : CameraWorld(SmallCamera) {}
    void SetUp() override {
        ASSERT_NE(nullptr, camera);
        ASSERT_EQ(CameraOk, camera->Ready());
        camera->streaming.callbacks.Set(
            {TestClient::ReceiveImage, TestClient::ExposeDone, &client});
        camera->streaming.isStreaming = true;
    }
    void TearDown() override { EXPECT_EQ(CameraOk, camera->CloseCamera()); }

    void Bring(std::uint32_t frameStatus = 0, std::uint8_t heldBefore = 0) {
        tStFrameInfo* frame = camera->PrivatePeekNewFrame();
        ASSERT_NE(nullptr, frame);
        std::fill_n(frame->buffer, frame->bufferSize, heldBefore);
        frame->frameStatus = frameStatus;
        frame->isHeld.store(false, std::memory_order_release);
        camera->PrivateImageHasArrived();
    }
    bool AwaitImages(std::uint32_t count) {
        return WaitUntil([&] { return client.GetImageCount() >= count; });
    }
    bool AwaitEmptyQueue() {
        return WaitUntil([&] { return camera->streaming.frameQueue.GetCount() == 0; });
    }

    TestClient client;
};

TEST_F(CameraWithARunLoop, DeliversAFrameAsAnImageOfTheClientsOwn) {
    Bring();

    ASSERT_TRUE(AwaitImages(1));
    const TestClient::Delivery delivery = client.GetDeliveries()[0];
    EXPECT_TRUE(delivery.hasImage);
    EXPECT_EQ(FrameStatusGood, delivery.status);
    EXPECT_EQ(Mono8, delivery.format);
    EXPECT_EQ(64u, delivery.width);
    EXPECT_EQ(48u, delivery.height);
    EXPECT_EQ(64u * 48u, delivery.size);
    EXPECT_EQ(static_cast<ZCamera*>(camera.get()), delivery.camera);
}

TEST_F(CameraWithARunLoop, TranslatesEveryFrameStatus) {
    const std::uint16_t expected[] = {0, 18, 19, 20, 21};
    for (std::uint32_t status = 0; status < std::size(expected); ++status) {
        Bring(status);
        ASSERT_TRUE(AwaitImages(status + 1));
        EXPECT_EQ(expected[status], client.GetDeliveries()[status].status);
    }
}

TEST_F(CameraWithARunLoop, DropsARefusedFrameInTheFreeMode) {
    Bring(FrameRefused);
    ASSERT_TRUE(AwaitEmptyQueue());
    Bring();

    ASSERT_TRUE(AwaitImages(1));
    EXPECT_EQ(FrameStatusGood, client.GetDeliveries()[0].status);
    EXPECT_EQ(1U, camera->GetStreamCounters().bad.Get());
}

TEST_F(CameraWithARunLoop, DeliversARefusedFrameAsOutOfSyncInATriggeredMode) {
    camera->StoreControl(11, 1);

    Bring(FrameRefused);

    ASSERT_TRUE(AwaitImages(1));
    EXPECT_EQ(FrameStatusOutOfSync, client.GetDeliveries()[0].status);
}

TEST_F(CameraWithARunLoop, DeliversARefusedFrameBlackWhateverItsBufferHeld) {
    camera->StoreControl(11, 1);

    Bring(FrameRefused, 0xEE);
    ASSERT_TRUE(AwaitImages(1));
    Bring(FrameMissingData, 0xEE);
    ASSERT_TRUE(AwaitImages(2));

    EXPECT_TRUE(client.GetDeliveries()[0].isBlack);
    EXPECT_FALSE(client.GetDeliveries()[1].isBlack) << "other frames are delivered as they are";
}

TEST_F(CameraWithARunLoop, DropsAFrameOfAFormerSizeWithoutAWord) {
    tStFrameInfo* frame = camera->PrivatePeekNewFrame();
    ASSERT_NE(nullptr, frame);
    camera->StoreControl(3, 32u << 16 | 48u);
    frame->isHeld.store(false, std::memory_order_release);
    camera->PrivateImageHasArrived();

    ASSERT_TRUE(AwaitEmptyQueue());
    Bring();
    ASSERT_TRUE(AwaitImages(1));
    EXPECT_EQ(32u, client.GetDeliveries()[0].width);
}

TEST_F(CameraWithARunLoop, DropsAFrameWhoseRecordDoesNotDescribeItsOwnBuffer) {
    using Change = void (*)(tStFrameInfo&);
    const Change changes[] = {[](tStFrameInfo& frame) { frame.width = 128; },
                              [](tStFrameInfo& frame) { frame.height = 1; },
                              [](tStFrameInfo& frame) { frame.bitDepth = 16; },
                              [](tStFrameInfo& frame) { frame.width = frame.height = 0xFFFFFFFF; }};
    for (const Change change : changes) {
        tStFrameInfo* frame = camera->PrivatePeekNewFrame();
        ASSERT_NE(nullptr, frame);
        change(*frame);
        frame->isHeld.store(false, std::memory_order_release);
        camera->PrivateImageHasArrived();
        ASSERT_TRUE(AwaitEmptyQueue());
    }

    Bring();

    ASSERT_TRUE(AwaitImages(1));
    EXPECT_EQ(64u, client.GetDeliveries()[0].width);
}

/// A filter without memory, as long as it is told so.
class StarvedFilter : public ZImageFilter {
  public:
    FilterResult Process(ZInImageBufferStruct*, ZOutImageBufferStruct*) override {
        if (isStarved) throw std::bad_alloc();
        return FilterDeclined;
    }
    FilterResult Init(std::uint32_t, std::uint32_t) override { return FilterDone; }
    FilterResult SetOutputFormat(std::uint32_t) override { return FilterDone; }

    std::atomic<bool> isStarved{true};
};

class CameraWithAStarvedFilter : public CameraWithARunLoop {
  protected:
    StarvedFilter filter;  // borrowed by the pipeline, until the camera is closed
};

TEST_F(CameraWithAStarvedFilter, CountsAFrameThatEndsInTheFilterAsBadAndGoesOn) {
    camera->GetImagePipeline()->AddFilter(&filter);
    const StreamCounters& counters = camera->GetStreamCounters();

    Bring();
    ASSERT_TRUE(WaitUntil([&] { return counters.bad.Get() == 1; }));
    EXPECT_EQ(0U, counters.delivered.GetSum());

    filter.isStarved = false;
    Bring();
    ASSERT_TRUE(AwaitImages(1));
    EXPECT_EQ(1U, counters.bad.Get());
    EXPECT_EQ(1U, counters.delivered.GetSum());
}

TEST_F(CameraWithARunLoop, NeverServesAFrameThatIsBeingFilled) {
    tStFrameInfo* held = camera->PrivatePeekNewFrame();
    ASSERT_NE(nullptr, held);
    const std::uint32_t seen = camera->streaming.arrivals;
    camera->PrivateImageHasArrived();  // a stray signal
    camera->PrivateImageHasArrived();

    Bring();  // the younger one is done first

    ASSERT_TRUE(AwaitImages(1));
    EXPECT_LT(seen, camera->streaming.arrivals);
    EXPECT_EQ(1u, camera->streaming.frameQueue.GetCount());
    EXPECT_TRUE(held->isHeld);
    held->isHeld = false;
}

TEST_F(CameraWithARunLoop, ServesEveryFrameThatIsDoneAfterOneWakeOldestFirst) {
    client.isBlocked = true;
    Bring(0);
    ASSERT_TRUE(WaitUntil([&] { return client.isInCallback.load(); }));
    Bring(1);
    // No signal for the third: the wake of the second must serve both.
    tStFrameInfo* third = camera->PrivatePeekNewFrame();
    ASSERT_NE(nullptr, third);
    third->frameStatus = 2;
    third->isHeld.store(false, std::memory_order_release);

    client.isBlocked = false;

    ASSERT_TRUE(AwaitImages(3));
    const auto deliveries = client.GetDeliveries();
    EXPECT_EQ(0, deliveries[0].status);
    EXPECT_EQ(18, deliveries[1].status);
    EXPECT_EQ(19, deliveries[2].status);
}

TEST_F(CameraWithARunLoop, NeverMissesTheLastFrameOfManyInARow) {
    for (std::uint32_t frame = 1; frame <= 300; ++frame) {
        Bring();
        ASSERT_TRUE(AwaitImages(frame)) << frame;
    }
}

TEST_F(CameraWithARunLoop, ChoosesTheImageFormatByKindAndDepth) {
    struct Row {
        std::uint32_t kind, depthCode, format;
    };
    const Row rows[] = {{1, 0, Mono8},  {1, 1, Mono16},  {3, 0, Mono8},  {3, 1, Mono16},
                        {2, 0, Bayer8}, {2, 1, Bayer16}, {9, 0, Bayer16}};
    std::uint32_t delivered = 0;
    for (const Row& row : rows) {
        camera->imageFormat = row.kind;
        camera->StoreControl(1, row.depthCode << 3);
        Bring();
        ASSERT_TRUE(AwaitImages(++delivered));
        // Kept: a kind that is none keeps the format of the last frame.
        EXPECT_EQ(row.format, client.GetDeliveries().back().format) << row.kind;
    }
}

TEST_F(CameraWithARunLoop, TakesAnUnknownKindAsMonoBeforeAnyFrame) {
    camera->imageFormat = 9;
    camera->StoreControl(1, 1u << 3);

    Bring();

    ASSERT_TRUE(AwaitImages(1));
    EXPECT_EQ(Mono16, client.GetDeliveries()[0].format);
}

TEST_F(CameraWithARunLoop, TellsTheClientOfAnExposuresEndAtTheNextFramesHeader) {
    Bring();

    EXPECT_TRUE(WaitUntil([&] { return client.GetExposeCount() >= 1; }));
    ASSERT_TRUE(AwaitImages(1));
}

TEST_F(CameraWithARunLoop, DeliversNothingWithoutACallback) {
    camera->streaming.callbacks.Set({});

    Bring();

    EXPECT_TRUE(AwaitEmptyQueue());
}

TEST_F(CameraWithARunLoop, StartsNoSecondRunLoop) {
    EXPECT_EQ(CameraOk, camera->StartImageStreamingRunLoop());

    EXPECT_EQ(1, camera->streaming.runLoopsAlive);
}

}  // namespace ZV::Test
