#include <gtest/gtest.h>

#include <atomic>
#include <cstdlib>
#include <memory>
#include <thread>
#include <vector>

#include "camera/test_camera.h"
#include "support/wait_until.h"

namespace ZV::Test {

/// A camera whose stream is said to run while no bus thread and no run loop takes part: the test
/// asks for frames as the bus thread does.
class CameraAskedForFrames : public CameraWorld, public testing::Test {
  protected:
    CameraAskedForFrames() : CameraWorld(SmallCamera) {}
    void SetUp() override {
        ASSERT_NE(nullptr, camera);
        ASSERT_EQ(CameraOk, camera->Ready());
        ASSERT_EQ(CameraOk, camera->CloseCamera());
        camera->streaming.isStreaming = true;
    }

    tStFrameInfo* Peek() { return camera->PrivatePeekNewFrame(); }
    /// A frame that the stream layer has filled and let go of.
    tStFrameInfo* PeekDone() {
        tStFrameInfo* frame = Peek();
        if (frame != nullptr) frame->isHeld = false;
        return frame;
    }
    std::size_t CountFrames() const { return camera->streaming.frameQueue.GetCount(); }
};

TEST_F(CameraAskedForFrames, DescribesAFrameByItsPresentSettings) {
    camera->StoreControl(1, 0x2A000000);  // parameter set 42, 8 bits

    const tStFrameInfo* frame = Peek();

    ASSERT_NE(nullptr, frame);
    EXPECT_NE(nullptr, frame->buffer);
    EXPECT_EQ(64u * 48u, frame->bufferSize);
    EXPECT_EQ(64u * 48u, frame->bytesExpected);
    EXPECT_EQ(42, frame->psn);
    EXPECT_EQ(0, frame->fieldIndex);
    EXPECT_FALSE(frame->interlaced);
    EXPECT_EQ(64, frame->rowBytes);
    EXPECT_EQ(0u, frame->frameStatus);
    EXPECT_EQ(1u, frame->binning);
    EXPECT_EQ(64u, frame->width);
    EXPECT_EQ(48u, frame->height);
    EXPECT_EQ(8u, frame->bitDepth);
    EXPECT_EQ(camera->GetExposure(), frame->exposure);
    EXPECT_EQ(camera->GetNormalizedGain(), frame->gain);
    EXPECT_EQ(0, frame->startColour);
    EXPECT_TRUE(frame->valid);
}

TEST_F(CameraAskedForFrames, TakesTwoBytesForEachSampleAboveEightBits) {
    ASSERT_EQ(12u, camera->GetMaxBitDepth());
    camera->StoreControl(1, 1u << 3);

    const tStFrameInfo* frame = Peek();

    ASSERT_NE(nullptr, frame);
    EXPECT_EQ(2u * 64 * 48, frame->bufferSize);
    EXPECT_EQ(128, frame->rowBytes);
}

TEST_F(CameraAskedForFrames, RefusesFramesWhileItDoesNotStream) {
    camera->streaming.isStreaming = false;

    EXPECT_EQ(nullptr, Peek());
}

TEST_F(CameraAskedForFrames, RefusesExactlyOneFrameAfterAnAbort) {
    ASSERT_EQ(CameraOk, camera->Abort());

    EXPECT_EQ(nullptr, PeekDone());
    EXPECT_NE(nullptr, PeekDone());
}

TEST_F(CameraAskedForFrames, RefusesAFrameForEachAbortAtMostWhileAnotherThreadAborts) {
    constexpr std::uint64_t Aborts = 500;
    const StreamCounters& counters = camera->GetStreamCounters();
    std::atomic<bool> hasAborted{false};
    std::thread client([&] {
        for (std::uint64_t i = 0; i < Aborts; ++i) EXPECT_EQ(CameraOk, camera->Abort());
        hasAborted = true;
    });
    std::uint64_t asked = 0;
    while (!hasAborted) {
        (void)PeekDone();
        ++asked;
    }
    client.join();
    (void)PeekDone();  // may be the one that the last abort refuses

    EXPECT_NE(nullptr, PeekDone()) << "no abort is left over";
    EXPECT_EQ(asked + 2, counters.begun.Get() + counters.refused.Get());
    EXPECT_LE(1u, counters.refused.Get());
    EXPECT_GE(Aborts, counters.refused.Get());
}

TEST_F(CameraAskedForFrames, HoldsAFrameForTheStreamLayerFromItsPushOn) {
    tStFrameInfo* frame = Peek();

    ASSERT_NE(nullptr, frame);
    EXPECT_TRUE(frame->isHeld);
    EXPECT_EQ(frame, camera->PrivateGetNewFrame());
    EXPECT_EQ(1u, CountFrames()) << "it stays in the queue";
}

TEST_F(CameraAskedForFrames, HasNoNewFrameOnceTheStreamLayerHasLetGo) {
    ASSERT_NE(nullptr, PeekDone());

    EXPECT_EQ(nullptr, camera->PrivateGetNewFrame());
}

TEST_F(CameraAskedForFrames, DiscardsTheSecondFrameAndNotTheFirstForAThird) {
    tStFrameInfo* first = PeekDone();
    first->rollingFrameNumber = 1;
    PeekDone()->rollingFrameNumber = 2;

    tStFrameInfo* third = PeekDone();
    third->rollingFrameNumber = 3;

    ASSERT_EQ(2u, CountFrames());
    EXPECT_EQ(first, camera->streaming.frameQueue.TakeOldest());
    EXPECT_EQ(third, camera->streaming.frameQueue.TakeOldest());
    FreeFrameWithBuffer(first);
    FreeFrameWithBuffer(third);
}

TEST_F(CameraAskedForFrames, NeverDiscardsAFrameThatIsBeingFilled) {
    tStFrameInfo* first = PeekDone();
    tStFrameInfo* second = Peek();

    ASSERT_NE(nullptr, Peek());

    EXPECT_EQ(2u, CountFrames());
    EXPECT_TRUE(second->isHeld);
    (void)first;  // discarded in place of the held one
}

TEST_F(CameraAskedForFrames, RefusesAFrameWhenNoExternalBufferIsLeftAndChangesNothingElse) {
    camera->supportsExternalBuffers = true;
    camera->streaming.usesExternalBuffers = true;
    void* buffer = std::malloc(64 * 48);
    ASSERT_EQ(CameraOk, camera->AddExternalImageBuffer(buffer));
    const tStFrameInfo* only = PeekDone();

    EXPECT_EQ(nullptr, Peek());

    ASSERT_NE(nullptr, only);
    EXPECT_EQ(buffer, only->buffer);
    EXPECT_EQ(1u, CountFrames());
    EXPECT_TRUE(camera->streaming.isStreaming);
    std::free(buffer);
}

TEST_F(CameraAskedForFrames, KeepsAnAbortForLaterWhenNoExternalBufferIsLeft) {
    camera->streaming.usesExternalBuffers = true;
    ASSERT_EQ(nullptr, Peek());
    ASSERT_EQ(CameraOk, camera->Abort());

    EXPECT_EQ(nullptr, Peek()) << "this is the frame that the abort refuses";

    EXPECT_FALSE(camera->streaming.abortPending);
}

TEST_F(CameraAskedForFrames, TakesEachExternalBufferOnceWhileAClientOffersMore) {
    constexpr std::size_t Offered = 2000;
    camera->supportsExternalBuffers = true;
    camera->streaming.usesExternalBuffers = true;
    std::vector<std::unique_ptr<void, decltype(&std::free)>> buffers;
    for (std::size_t i = 0; i < Offered; ++i) buffers.emplace_back(std::malloc(1), &std::free);
    std::thread client([&] {
        for (const auto& buffer : buffers) {
            EXPECT_EQ(CameraOk, camera->AddExternalImageBuffer(buffer.get()));
        }
    });
    std::vector<void*> taken;
    EXPECT_TRUE(WaitUntil([&] {
        while (PeekDone() != nullptr) {
            tStFrameInfo* const frame = camera->streaming.frameQueue.TakeOldest();
            taken.push_back(frame->buffer);
            frame->buffer = nullptr;
            FreeFrame(frame);
        }
        return taken.size() == Offered;
    }));
    client.join();

    ASSERT_EQ(Offered, taken.size());
    for (std::size_t i = 0; i < Offered; ++i) EXPECT_EQ(buffers[i].get(), taken[i]) << i;
}

TEST_F(CameraAskedForFrames, RefusesExternalBuffersOnAModelWithoutThem) {
    int buffer = 0;

    EXPECT_EQ(CameraRefused, camera->AddExternalImageBuffer(&buffer));
}

TEST_F(CameraAskedForFrames, RefusesAFrameOfANonsensicalSizeLikeAFailedAllocation) {
    camera->StoreControl(3, 0xFFFFFFFF);
    testing::internal::CaptureStdout();

    const tStFrameInfo* frame = Peek();

    EXPECT_EQ("MorvaneFWCamera::PrivatePeekNewFrame - call to malloc with size -131071 failed\n",
              testing::internal::GetCapturedStdout());
    EXPECT_EQ(nullptr, frame);
    EXPECT_EQ(0u, CountFrames());
}

TEST_F(CameraAskedForFrames, LosesAFrameWithoutAWordForEachLockThatItCannotTake) {
    for (HALSemaphore* StreamingState::*lock :
         {&StreamingState::frameLock, &StreamingState::externalLock, &StreamingState::streamLock}) {
        ASSERT_EQ(HALOk, HAL_SemaphoreDestroy(&(camera->streaming.*lock)));
        testing::internal::CaptureStdout();

        const tStFrameInfo* frame = Peek();

        EXPECT_EQ("", testing::internal::GetCapturedStdout());
        EXPECT_EQ(nullptr, frame);
        EXPECT_EQ(0u, CountFrames());
        ASSERT_EQ(HALOk, HAL_SemaphoreCreate(&(camera->streaming.*lock)));
    }
    EXPECT_EQ(3u, camera->GetStreamCounters().refused.Get());
    EXPECT_NE(nullptr, Peek());
}

TEST_F(CameraAskedForFrames, HasNoNewFrameWhileItCannotTakeTheLockOfItsFrames) {
    tStFrameInfo* const frame = Peek();
    ASSERT_NE(nullptr, frame);
    ASSERT_EQ(HALOk, HAL_SemaphoreDestroy(&camera->streaming.frameLock));
    testing::internal::CaptureStdout();

    EXPECT_EQ(nullptr, camera->PrivateGetNewFrame());

    EXPECT_EQ("", testing::internal::GetCapturedStdout());
    ASSERT_EQ(HALOk, HAL_SemaphoreCreate(&camera->streaming.frameLock));
    EXPECT_EQ(frame, camera->PrivateGetNewFrame());
}

TEST_F(CameraAskedForFrames, HasARunLoopThatPrintsALineForALockThatItCannotTakeAndGoesOn) {
    TestClient client;
    camera->streaming.callbacks.Set({TestClient::ReceiveImage, nullptr, &client});
    ASSERT_NE(nullptr, PeekDone());
    ASSERT_EQ(HALOk, HAL_SemaphoreDestroy(&camera->streaming.frameLock));
    camera->streaming.runLoopActive = true;
    testing::internal::CaptureStdout();

    std::thread loop([&] { camera->PrivateImageStreamingRunLoop(); });
    EXPECT_TRUE(WaitUntil([&] { return client.GetImageCount() == 1; }));
    camera->streaming.runLoopActive = false;
    loop.join();

    EXPECT_EQ(0u, testing::internal::GetCapturedStdout().find(
                      "MorvaneFWCamera::PrivateImageStreamingRunLoop() error 32 occurred calling "
                      "HAL_SemaphoreWait\n"));
    ASSERT_EQ(HALOk, HAL_SemaphoreCreate(&camera->streaming.frameLock));
    ASSERT_EQ(HALOk, HAL_SemaphoreWait(camera->streaming.closeLock)) << "as a close takes it";
}

TEST_F(CameraAskedForFrames, LeavesTheOlderOfTwoFramesBehindAtAStop) {
    tStFrameInfo* older = PeekDone();
    ASSERT_NE(nullptr, PeekDone());

    ASSERT_EQ(CameraOk, camera->StopStreamingImages());

    ASSERT_EQ(1u, CountFrames());
    EXPECT_EQ(older, camera->streaming.frameQueue.TakeOldest());
    EXPECT_TRUE(older->valid);
    FreeFrameWithBuffer(older);
}

TEST_F(CameraAskedForFrames, LeavesNoneOfOneFrameBehindAtAStop) {
    ASSERT_NE(nullptr, PeekDone());

    ASSERT_EQ(CameraOk, camera->StopStreamingImages());

    EXPECT_EQ(0u, CountFrames());
}

TEST_F(CameraAskedForFrames, FindsAFrameInvalidOnceItsSizeNoLongerFits) {
    tStFrameInfo* frame = PeekDone();
    EXPECT_TRUE(camera->IsFrameValid(frame));

    camera->StoreControl(3, 32u << 16 | 48u);

    EXPECT_FALSE(camera->IsFrameValid(frame));
}

TEST_F(CameraAskedForFrames, FindsARefusedFrameValidInATriggeredModeAlone) {
    tStFrameInfo* frame = PeekDone();
    frame->frameStatus = FrameRefused;
    EXPECT_FALSE(camera->IsFrameValid(frame));

    camera->StoreControl(11, 1);

    EXPECT_TRUE(camera->IsFrameValid(frame));
}

TEST_F(CameraAskedForFrames, FindsMarkedAndMissingFramesInvalid) {
    tStFrameInfo* frame = PeekDone();
    camera->IgnoreFrameInfoVector();

    EXPECT_FALSE(camera->IsFrameValid(frame));
    EXPECT_FALSE(camera->IsFrameValid(nullptr));
}

TEST_F(CameraAskedForFrames, TellsATimeOutOnTheThreadThatBringsIt) {
    TestClient client;
    camera->SetStreamingCallback(TestClient::ReceiveImage, &client);

    camera->PrivateImageHasTimedOut();

    ASSERT_EQ(1u, client.GetImageCount());
    EXPECT_FALSE(client.GetDeliveries()[0].hasImage);
    EXPECT_EQ(26, client.GetDeliveries()[0].status);
}

}  // namespace ZV::Test
