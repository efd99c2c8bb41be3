#include "api/entry_queue.h"

#include <gtest/gtest.h>

#include <memory>
#include <thread>
#include <vector>

namespace ZV {
namespace {

class EntryQueue : public testing::Test {
  protected:
    bool Append(std::uint32_t userData, std::uint16_t kind = QueueKindFrame) {
        return AppendEntry(context, {.userData = userData, .kind = kind});
    }
    std::vector<std::uint32_t> GetOrder() {
        std::vector<std::uint32_t> order;
        for (std::uint32_t index = 0; index < GetQueueCount(context); ++index) {
            QueueEntry* const entry = HoldEntry(context, index);
            order.push_back(entry->userData);
            LetGoOfEntry(context, entry);
        }
        return order;
    }

    CameraContext context;
};

TEST_F(EntryQueue, OneHundredEntriesFitAndNoMore) {
    for (std::uint32_t i = 0; i < 100; ++i) EXPECT_TRUE(Append(i)) << i;

    EXPECT_FALSE(Append(100));

    EXPECT_EQ(100u, GetQueueCount(context));
}

TEST_F(EntryQueue, TheOldestEntryIsTakenFirstAndTheOthersMoveDown) {
    for (std::uint32_t i = 0; i < 4; ++i) ASSERT_TRUE(Append(i));

    QueueEntry* const first = TakeFirstEntry(context);

    EXPECT_EQ(0u, first->userData);
    EXPECT_EQ((std::vector<std::uint32_t>{1, 2, 3}), GetOrder());
    LetGoOfEntry(context, first);
}

TEST_F(EntryQueue, AFullQueueIsTakenWholeInOrder) {
    for (std::uint32_t i = 0; i < 100; ++i) ASSERT_TRUE(Append(i));

    for (std::uint32_t i = 0; i < 100; ++i) {
        QueueEntry* const entry = TakeFirstEntry(context);
        ASSERT_NE(nullptr, entry);
        EXPECT_EQ(i, entry->userData);
        LetGoOfEntry(context, entry);
    }

    EXPECT_EQ(nullptr, TakeFirstEntry(context));
}

TEST_F(EntryQueue, OnlyASettingsEntryIsTakenFromTheMiddle) {
    std::uint64_t ticket = 0;
    ASSERT_TRUE(Append(0));
    ASSERT_TRUE(Append(1, QueueKindSettings));
    ASSERT_TRUE(Append(2));

    EXPECT_EQ(nullptr, TakeSettingsEntry(context, 0, 2, &ticket));
    EXPECT_EQ(nullptr, TakeSettingsEntry(context, 1, 4, &ticket));
    EXPECT_EQ(nullptr, TakeSettingsEntry(context, 3, 2, &ticket));
    QueueEntry* const taken = TakeSettingsEntry(context, 1, 2, &ticket);

    ASSERT_NE(nullptr, taken);
    EXPECT_EQ(1u, taken->userData);
    EXPECT_EQ((std::vector<std::uint32_t>{0, 2}), GetOrder());
    EXPECT_EQ(1u, ticket) << "one that is not taken gets no place";
    LetGoOfEntry(context, taken);
}

TEST_F(EntryQueue, AnEntryAtWorkOutlivesTheQueue) {
    ASSERT_TRUE(Append(7));
    QueueEntry* const held = HoldEntry(context, 0);

    ClearQueue(context);

    EXPECT_EQ(0u, GetQueueCount(context));
    EXPECT_EQ(7u, held->userData);
    LetGoOfEntry(context, held);
}

TEST_F(EntryQueue, AnIndexBeyondTheQueueHoldsNothing) {
    EXPECT_EQ(nullptr, HoldEntry(context, 0));
    ASSERT_TRUE(Append(0));
    EXPECT_EQ(nullptr, HoldEntry(context, 1));
    EXPECT_EQ(nullptr, HoldEntry(context, 100));
    EXPECT_EQ(nullptr, HoldEntry(context, 0xFFFFFFFF));
    LetGoOfEntry(context, nullptr);
}

TEST_F(EntryQueue, AnExposureBelongsToTheFirstEntryThatHasNotHadItsCallback) {
    const auto find = [&] {
        std::uint32_t index = 99;
        LetGoOfEntry(context, HoldExposedEntry(context, &index));
        return index;
    };
    std::uint32_t index = 99;
    EXPECT_EQ(nullptr, HoldExposedEntry(context, &index));
    EXPECT_EQ(99u, index);

    ASSERT_TRUE(Append(0));
    EXPECT_EQ(0u, find());
    context.queue[0]->exposeDoneCalled = 1;
    EXPECT_EQ(0u, find()) << "a lone frame is passed over by nothing";
    ASSERT_TRUE(Append(1, QueueKindSettings));
    EXPECT_EQ(1u, find());
    ASSERT_TRUE(Append(2));
    EXPECT_EQ(2u, find());
    context.abortRequested = 1;
    EXPECT_EQ(0u, find());
}

TEST_F(EntryQueue, StaysWholeWhileThreadsAppendTakeAndClear) {
    constexpr std::uint32_t Rounds = 2000;
    std::thread appender([&] {
        for (std::uint32_t i = 0; i < Rounds; ++i) (void)Append(i, i % 3 == 0 ? 1 : 0);
    });
    std::thread taker([&] {
        std::uint64_t ticket = 0;
        for (std::uint32_t i = 0; i < Rounds; ++i) {
            LetGoOfEntry(context, TakeSettingsEntry(context, 1, 2, &ticket));
            LetGoOfEntry(context, TakeFirstEntry(context));
        }
    });
    for (std::uint32_t i = 0; i < Rounds; ++i) {
        QueueEntry* const held = HoldEntry(context, i % 100);
        if (i % 64 == 0) ClearQueue(context);
        LetGoOfEntry(context, held);
    }
    appender.join();
    taker.join();

    EXPECT_LE(GetQueueCount(context), 100u);
}

}  // namespace
}  // namespace ZV
