#include "api/entry_queue.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <atomic>
#include <iterator>
#include <memory>
#include <numeric>
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

TEST_F(EntryQueue, OnlyTheSettingsEntryBehindTheFirstFrameIsTakenFromTheMiddle) {
    std::uint64_t ticket = 0;
    ASSERT_TRUE(Append(0));
    EXPECT_EQ(nullptr, TakeSettingsEntry(context, context.queue[0], &ticket)) << "a lone frame";
    ASSERT_TRUE(Append(1, QueueKindSettings));
    ASSERT_TRUE(Append(2));
    ASSERT_TRUE(Append(3, QueueKindSettings));

    EXPECT_EQ(nullptr, TakeSettingsEntry(context, nullptr, &ticket)) << "the first is a frame";
    EXPECT_EQ(nullptr, TakeSettingsEntry(context, context.queue[2], &ticket)) << "not the first";
    QueueEntry* const taken = TakeSettingsEntry(context, context.queue[0], &ticket);

    ASSERT_NE(nullptr, taken);
    EXPECT_EQ(1u, taken->userData);
    EXPECT_EQ((std::vector<std::uint32_t>{0, 2, 3}), GetOrder());
    EXPECT_EQ(1u, ticket) << "one that is not taken gets no place";
    EXPECT_EQ(nullptr, TakeSettingsEntry(context, context.queue[0], &ticket)) << "a frame follows";
    LetGoOfEntry(context, taken);
}

TEST_F(EntryQueue, NoSettingsEntryIsTakenForAFrameThatHasLeft) {
    std::uint64_t ticket = 0;
    ASSERT_TRUE(Append(0));
    ASSERT_TRUE(Append(1));
    ASSERT_TRUE(Append(2, QueueKindSettings));
    QueueEntry* const first = TakeFirstEntry(context);

    EXPECT_EQ(nullptr, TakeSettingsEntry(context, first, &ticket));

    EXPECT_EQ((std::vector<std::uint32_t>{1, 2}), GetOrder());
    LetGoOfEntry(context, first);
}

TEST_F(EntryQueue, AFirstSettingsEntryIsTakenUnlessItIsTheLast) {
    std::uint64_t ticket = 0;
    ASSERT_TRUE(Append(0, QueueKindSettings));
    EXPECT_EQ(nullptr, TakeSettingsEntry(context, nullptr, &ticket));
    ASSERT_TRUE(Append(1));

    QueueEntry* const taken = TakeSettingsEntry(context, nullptr, &ticket);

    ASSERT_NE(nullptr, taken);
    EXPECT_EQ((std::vector<std::uint32_t>{1}), GetOrder());
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
        bool isFirst = false;
        QueueEntry* const entry = HoldExposedEntry(context, &isFirst);
        const std::uint32_t number = entry->userData;
        EXPECT_EQ(number == 0, isFirst);
        LetGoOfEntry(context, entry);
        return number;
    };
    bool isFirst = true;
    EXPECT_EQ(nullptr, HoldExposedEntry(context, &isFirst));
    EXPECT_TRUE(isFirst) << "an empty queue says nothing";

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

/// A thread that appends entries numbered from 0, every third a change, and one that takes them.
class SharedEntryQueue : public EntryQueue {
  protected:
    static constexpr std::uint32_t Rounds = 2000;

    void StartBoth() {
        appender = std::thread([this] {
            for (std::uint32_t i = 0; i < Rounds; ++i) {
                while (!Append(i, i % 3 == 0 ? QueueKindSettings : QueueKindFrame)) {
                    std::this_thread::yield();
                }
            }
            isAppended = true;
        });
        taker = std::thread([this] {
            while (!isAppended || GetQueueCount(context) != 0) {
                std::uint64_t ticket = 0;
                QueueEntry* const first = HoldEntry(context, 0);
                if (first != nullptr) Keep(changes, TakeSettingsEntry(context, first, &ticket));
                LetGoOfEntry(context, first);
                Keep(firsts, TakeFirstEntry(context));
            }
        });
    }
    void Keep(std::vector<std::uint32_t>& numbers, QueueEntry* entry) {
        if (entry == nullptr) return;
        numbers.push_back(entry->userData);
        LetGoOfEntry(context, entry);
    }
    void JoinBoth() {
        appender.join();
        taker.join();
        EXPECT_EQ(0u, GetQueueCount(context));
        EXPECT_TRUE(std::ranges::is_sorted(firsts));
        EXPECT_TRUE(std::ranges::is_sorted(changes));
    }
    std::vector<std::uint32_t> GetAllTaken() const {
        std::vector<std::uint32_t> all;
        std::ranges::merge(firsts, changes, std::back_inserter(all));
        return all;
    }

    std::thread appender, taker;
    std::atomic<bool> isAppended{false};
    std::vector<std::uint32_t> firsts, changes;  // of the taker
};

TEST_F(SharedEntryQueue, StaysWholeWhileThreadsAppendTakeAndClear) {
    StartBoth();
    std::uint64_t held = 0;
    while (!isAppended) {
        QueueEntry* const entry = HoldEntry(context, static_cast<std::uint32_t>(held % 4));
        if (entry != nullptr) {
            EXPECT_GT(Rounds, entry->userData);
            EXPECT_EQ(entry->userData % 3 == 0 ? QueueKindSettings : QueueKindFrame, entry->kind);
        }
        if (held++ % 64 == 0) ClearQueue(context);
        LetGoOfEntry(context, entry);
    }
    JoinBoth();

    const std::vector<std::uint32_t> taken = GetAllTaken();
    EXPECT_EQ(taken.end(), std::ranges::adjacent_find(taken)) << "none is taken twice";
}

TEST_F(SharedEntryQueue, LosesNothingWhileOneThreadAppendsAndOneTakes) {
    StartBoth();
    JoinBoth();

    std::vector<std::uint32_t> everything(Rounds);
    std::iota(everything.begin(), everything.end(), 0u);
    EXPECT_EQ(everything, GetAllTaken());
}

}  // namespace
}  // namespace ZV
