#include "camera/frame_queue.h"

#include <gtest/gtest.h>

namespace ZV::Test {

class FrameQueueOfThree : public testing::Test {
  protected:
    void SetUp() override {
        for (tStFrameInfo& frame : frames) ASSERT_TRUE(queue.PushNewest(&frame));
    }

    tStFrameInfo frames[3];  // oldest first
    FrameQueue queue;
};

TEST_F(FrameQueueOfThree, GivesItsNewestAndItsOldest) {
    EXPECT_EQ(&frames[2], queue.TakeNewest());
    EXPECT_EQ(&frames[0], queue.TakeOldest());
    EXPECT_EQ(&frames[1], queue.TakeOldest());
    EXPECT_EQ(nullptr, queue.TakeOldest());
    EXPECT_EQ(nullptr, queue.TakeNewest());
}

TEST_F(FrameQueueOfThree, NeverTakesOutAFrameThatIsHeld) {
    frames[0].isHeld = true;
    frames[2].isHeld = true;

    EXPECT_EQ(&frames[1], queue.TakeNewest());
    EXPECT_EQ(nullptr, queue.TakeNewest());
    EXPECT_EQ(nullptr, queue.TakeOldest());
    EXPECT_EQ(2u, queue.GetCount());
    EXPECT_EQ(&frames[2], queue.FindHeld());
}

TEST_F(FrameQueueOfThree, AnswersWithNoHeldFrameWhenThereIsNone) {
    EXPECT_EQ(nullptr, queue.FindHeld());
    EXPECT_EQ(3u, queue.GetCount());
}

TEST_F(FrameQueueOfThree, MarksAllFramesInvalid) {
    queue.MarkAllInvalid();

    for (const tStFrameInfo& frame : frames) EXPECT_FALSE(frame.valid);
}

TEST(FrameQueue, RefusesAFrameBeyondItsCapacity) {
    tStFrameInfo frames[FrameQueue::Capacity + 1];
    FrameQueue queue;
    for (std::size_t frame = 0; frame < FrameQueue::Capacity; ++frame) {
        ASSERT_TRUE(queue.PushNewest(&frames[frame]));
    }

    EXPECT_FALSE(queue.PushNewest(&frames[FrameQueue::Capacity]));
    EXPECT_EQ(FrameQueue::Capacity, queue.GetCount());
}

TEST(ExternalBufferQueue, GivesBuffersInTheOrderInWhichTheyCame) {
    ExternalBufferQueue queue;
    int first = 0;
    int second = 0;
    EXPECT_TRUE(queue.IsEmpty());

    queue.Append(&first);
    queue.Append(&second);

    EXPECT_FALSE(queue.IsEmpty());
    EXPECT_EQ(&first, queue.TakeFirst());
    EXPECT_EQ(&second, queue.TakeFirst());
    EXPECT_EQ(nullptr, queue.TakeFirst());
}

}  // namespace ZV::Test
