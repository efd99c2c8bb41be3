#include "api/event_service.h"

#include <gtest/gtest.h>

#include <atomic>
#include <chrono>
#include <memory>
#include <optional>
#include <thread>
#include <utility>

#include "api/entry_queue.h"
#include "hal/platform/clock.h"
#include "support/wait_until.h"

namespace ZV {
namespace {

using Test::WaitUntil;

constexpr std::chrono::milliseconds NoticeableTime{50};

class Services : public testing::Test {
  protected:
    void SetUp() override {
        ASSERT_TRUE(AppendEntry(context, {}));
        entry = HoldEntry(context, 0);
    }
    void TearDown() override { LetGoOfEntry(context, entry); }

    CameraContext context;
    QueueEntry* entry = nullptr;
};

/// A thread that serves an event until the test lets it go on.
class Server {
  public:
    Server(CameraContext& served, EventService::Kind kind, QueueEntry* called = nullptr)
        : context(served) {
        thread = std::thread([=, this] { Serve(kind, called); });
        EXPECT_TRUE(WaitUntil([&] { return isServing.load(); }));
    }
    ~Server() {
        mayEnd = true;
        thread.join();
    }

    std::atomic<bool> aborts{false}, hasAborted{false}, mayEnd{false};

  private:
    void Serve(EventService::Kind kind, QueueEntry* called) {
        EventService service(context, kind);
        if (called != nullptr) {
            EXPECT_TRUE(service.ClaimExposeDone(*called));
        }
        isServing = true;
        EXPECT_TRUE(WaitUntil([&] { return mayEnd.load() || aborts.load(); }));
        if (aborts) ReleaseOwnServices(context);
        hasAborted = aborts.load();
        EXPECT_TRUE(WaitUntil([&] { return mayEnd.load(); }));
    }

    CameraContext& context;
    std::atomic<bool> isServing{false};
    std::thread thread;
};

/// Runs `wait` on a thread of its own.
template <typename Wait>
class Waiter {
  public:
    explicit Waiter(Wait newWait) : wait(newWait) {
        thread = std::thread([this] {
            wait();
            hasEnded = true;
        });
    }
    ~Waiter() { thread.join(); }
    bool Ends() {
        return WaitUntil([&] { return hasEnded.load(); });
    }
    bool EndsSoon() {
        return WaitUntil([&] { return hasEnded.load(); }, NoticeableTime);
    }

  private:
    Wait wait;
    std::atomic<bool> hasEnded{false};
    std::thread thread;
};

TEST_F(Services, OneOfTwoThreadsGetsTheExposureCallback) {
    for (int round = 0; round < 200; ++round) {
        entry->exposeDoneCalled = 0;
        bool isOther = false;
        std::thread other([&] {
            EventService service(context, EventService::Kind::Exposure);
            isOther = service.ClaimExposeDone(*entry);
        });
        EventService service(context, EventService::Kind::Image);
        const bool isOurs = service.ClaimExposeDone(*entry);
        other.join();

        EXPECT_NE(isOurs, isOther);
        EXPECT_EQ(1, entry->exposeDoneCalled);
    }
}

TEST_F(Services, NobodyGetsTheExposureCallbackOfAFrameThatHasLeftTheQueue) {
    ClearQueue(context);
    EventService service(context, EventService::Kind::Exposure);

    EXPECT_FALSE(service.ClaimExposeDone(*entry));

    EXPECT_EQ(0, entry->exposeDoneCalled);
}

TEST_F(Services, AFrameCallbackWaitsForTheExposureCallbackOfItsFrame) {
    Server exposure(context, EventService::Kind::Exposure, entry);
    Waiter image([&] {
        EventService service(context, EventService::Kind::Image);
        service.AwaitExposeDone(*entry);
    });
    EXPECT_FALSE(image.EndsSoon());

    exposure.mayEnd = true;

    EXPECT_TRUE(image.Ends());
}

TEST_F(Services, AFrameCallbackDoesNotWaitForTheExposureCallbackOfAnotherFrame) {
    ASSERT_TRUE(AppendEntry(context, {}));
    QueueEntry* const other = HoldEntry(context, 1);
    {
        const Server exposure(context, EventService::Kind::Exposure, other);
        EventService service(context, EventService::Kind::Image);

        service.AwaitExposeDone(*entry);
    }
    LetGoOfEntry(context, other);
}

TEST_F(Services, AFrameCallbackWaitsNoLongerForAnExposureCallbackThatAborts) {
    Server exposure(context, EventService::Kind::Exposure, entry);
    Waiter image([&] {
        EventService service(context, EventService::Kind::Image);
        service.AwaitExposeDone(*entry);
    });

    exposure.aborts = true;

    EXPECT_TRUE(image.Ends());
}

TEST_F(Services, AFrameCallbackWaitsFiveSecondsAtMost) {
    const Server exposure(context, EventService::Kind::Exposure, entry);
    EventService service(context, EventService::Kind::Image);
    SetWaitClockDivisor(1000);

    service.AwaitExposeDone(*entry);

    SetWaitClockDivisor(1);
}

TEST_F(Services, AnAbortWaitsForExposuresAndFiveSecondsAtMost) {
    Server exposure(context, EventService::Kind::Exposure);
    {
        Waiter abort([&] { AwaitExposures(context); });
        EXPECT_FALSE(abort.EndsSoon());
        exposure.mayEnd = true;
        EXPECT_TRUE(abort.Ends());
    }
    const Server lasting(context, EventService::Kind::Exposure);
    SetWaitClockDivisor(1000);

    AwaitExposures(context);

    SetWaitClockDivisor(1);
}

TEST_F(Services, AnAbortDoesNotWaitForExposuresThatBeginAfterIt) {
    constexpr int Rounds = 20;
    auto current = std::make_unique<Server>(context, EventService::Kind::Exposure);
    Waiter abort([&] { AwaitExposures(context); });
    bool hasEnded = abort.EndsSoon();
    EXPECT_FALSE(hasEnded);

    // At every moment some exposure is served, and each ends soon.
    for (int round = 0; round < Rounds && !hasEnded; ++round) {
        auto later = std::make_unique<Server>(context, EventService::Kind::Exposure);
        current = std::move(later);
        hasEnded = abort.EndsSoon();
    }

    EXPECT_TRUE(hasEnded);
}

TEST_F(Services, AnAbortWaitsNeitherForItselfNorForAnotherThatAborts) {
    Server aborting(context, EventService::Kind::Exposure);
    aborting.aborts = true;
    ASSERT_TRUE(WaitUntil([&] { return aborting.hasAborted.load(); }));
    const EventService own(context, EventService::Kind::Exposure);

    AwaitExposures(context);
}

TEST_F(Services, AFailedCloseWaitsForTheImageInDelivery) {
    Server image(context, EventService::Kind::Image);
    Waiter close([&] { AwaitImages(context); });
    EXPECT_FALSE(close.EndsSoon());

    image.mayEnd = true;

    EXPECT_TRUE(close.Ends());
}

TEST_F(Services, ChangesAreMadeInTheOrderInWhichTheyWereTaken) {
    QueueEntry change;
    change.kind = QueueKindSettings;
    ASSERT_TRUE(AppendEntry(context, change));
    ASSERT_TRUE(AppendEntry(context, change));
    std::optional<EventService> earlier(std::in_place, context, EventService::Kind::Image);
    LetGoOfEntry(context, earlier->TakeChange(context.queue[0]));

    Waiter later([&] {
        EventService service(context, EventService::Kind::Exposure);
        QueueEntry* const taken = service.TakeChange(context.queue[0]);
        EXPECT_NE(nullptr, taken) << "a change in hand elsewhere keeps none in the queue";
        service.AwaitEarlierChanges();
        LetGoOfEntry(context, taken);
    });

    EXPECT_TRUE(WaitUntil([&] { return GetQueueCount(context) == 1; }));
    EXPECT_FALSE(later.EndsSoon());
    earlier->AwaitEarlierChanges();
    earlier.reset();
    EXPECT_TRUE(later.Ends());
}

TEST_F(Services, AChangeIsNotKeptFromBeingMadeByALaterOne) {
    QueueEntry change;
    change.kind = QueueKindSettings;
    ASSERT_TRUE(AppendEntry(context, change));
    ASSERT_TRUE(AppendEntry(context, change));
    EventService earlier(context, EventService::Kind::Exposure);
    EventService later(context, EventService::Kind::Image);
    LetGoOfEntry(context, earlier.TakeChange(context.queue[0]));
    LetGoOfEntry(context, later.TakeChange(context.queue[0]));

    Waiter waiter([&] { earlier.AwaitEarlierChanges(); });

    EXPECT_TRUE(waiter.Ends());
}

}  // namespace
}  // namespace ZV
