#include "api/delivery.h"

#include <gtest/gtest.h>

#include <atomic>
#include <mutex>
#include <thread>
#include <vector>

#include "api/camera_context.h"
#include "api/delivery_fixture.h"
#include "api/settings_block.h"
#include "diagnostics/log.h"
#include "imaging/image_filter.h"

namespace ZV {
namespace {

using Test::CallbackLog;
using Test::ClientFrame;
using Test::Delivery;
using Test::WaitUntil;

constexpr std::uint32_t ImageBytes = Delivery::ImageBytes;

TEST_F(Delivery, AFrameWithFlagsTwoGetsAnExposureCallbackAndNoFrameCallback) {
    QueueFrame(zcbExposeDone, 9);

    EndExposure();
    ReceiveImage();

    const auto heard = calls.GetCalls();
    ASSERT_EQ(1u, heard.size());
    EXPECT_EQ(9u, heard[0].userData);
    EXPECT_EQ(0u, heard[0].errorCode);
    EXPECT_EQ(2u, heard[0].flags);
    EXPECT_EQ(1u, frame->privateFilled);
    EXPECT_EQ(0u, CountQueued());
}

TEST_F(Delivery, AFrameWithFlagsOneGetsOneFrameCallbackAndNoExposureCallback) {
    QueueFrame(zcbFrameDone, 9);

    EndExposure();
    ReceiveImage();

    const auto heard = calls.GetCalls();
    ASSERT_EQ(1u, heard.size());
    EXPECT_EQ(9u, heard[0].userData);
    EXPECT_EQ(0u, heard[0].errorCode);
    EXPECT_EQ(1u, heard[0].flags);
    EXPECT_EQ(0x42, frame.GetPixels()[0]);
    EXPECT_EQ(0u, frame->timeStamp);
    EXPECT_TRUE(frame.IsGuardIntact());
}

TEST_F(Delivery, AFrameWithoutFlagsIsFilledInSilence) {
    QueueFrame(0);

    EndExposure();
    ReceiveImage();

    EXPECT_EQ(0u, calls.CountCalls());
    EXPECT_EQ(1u, frame->privateFilled);
}

TEST_F(Delivery, FramesWithoutACallbackAreServedAllTheSame) {
    ASSERT_ZERR(zerrNone, Zentara_QueueFrame(handle, frame.Get(), nullptr, 3, 0, 0));

    EndExposure();
    ReceiveImage();

    EXPECT_EQ(1u, frame->privateFilled);
    EXPECT_EQ(0u, CountQueued());
}

TEST_F(Delivery, AnImageBeforeItsExposeDoneGetsTheExposureCallbackFirst) {
    ClientFrame second(ImageBytes);
    QueueFrame(3, 1);
    ASSERT_ZERR(zerrNone, Queue(second, calls, 3, 2));

    ReceiveImage();
    EndExposure();

    const auto heard = calls.GetCalls();
    ASSERT_EQ(3u, heard.size());
    EXPECT_EQ(1u, heard[0].userData);
    EXPECT_EQ(2u, heard[0].flags);
    EXPECT_EQ(1u, heard[1].userData);
    EXPECT_EQ(1u, heard[1].flags);
    // The late end of the exposure finds the next frame.
    EXPECT_EQ(2u, heard[2].userData);
    EXPECT_EQ(2u, heard[2].flags);
}

TEST_F(Delivery, AnExposureThatEndsTwiceIsToldOnceForALoneFrame) {
    QueueFrame(3);

    EndExposure();
    EndExposure();

    EXPECT_EQ(1u, calls.CountCalls());
}

TEST_F(Delivery, ASecondExposureBelongsToTheSecondFrame) {
    ClientFrame second(ImageBytes);
    QueueFrame(3, 1);
    ASSERT_ZERR(zerrNone, Queue(second, calls, 3, 2));

    EndExposure();
    EndExposure();
    EndExposure();

    const auto heard = calls.GetCalls();
    ASSERT_EQ(2u, heard.size());
    EXPECT_EQ(1u, heard[0].userData);
    EXPECT_EQ(2u, heard[1].userData);
}

TEST_F(Delivery, ASettingsChangeBetweenTwoFramesIsPassedOver) {
    ClientFrame second(ImageBytes);
    QueueFrame(zcbExposeDone, 1);
    GetContext().sendInProgress = 1;  // keeps the change in the queue
    EndExposure();
    QueueSettings();
    ASSERT_ZERR(zerrNone, Queue(second, calls, zcbExposeDone, 2));

    EndExposure();

    const auto heard = calls.GetCalls();
    ASSERT_EQ(2u, heard.size());
    EXPECT_EQ(2u, heard[1].userData);
    EXPECT_EQ(3u, CountQueued());
}

TEST_F(Delivery, AnExposureDoneCallbackOfALoneChangeBehindAFrameIsNotMadeUp) {
    QueueFrame(zcbExposeDone, 1);
    GetContext().sendInProgress = 1;
    EndExposure();
    QueueSettings();

    EndExposure();

    EXPECT_EQ(1u, calls.CountCalls());
    EXPECT_EQ(2u, CountQueued());
}

TEST_F(Delivery, ASettingsChangeBehindAFrameIsAppliedWhenItsExposureEnds) {
    QueueFrame(zcbFrameDone, 1);
    QueueSettings(zcbFrameDone, 100);

    EndExposure();

    const auto heard = calls.GetCalls();
    ASSERT_EQ(1u, heard.size());
    EXPECT_EQ(100u, heard[0].userData);
    EXPECT_ZERR(zerrNone, heard[0].errorCode);
    EXPECT_EQ(1u, heard[0].flags);
    EXPECT_EQ(1u, CountQueued());
}

TEST_F(Delivery, TheCallbackOfASettingsChangeHearsTheFlagsAsGiven) {
    QueueFrame(0);
    QueueSettings(0xF1, 100);

    EndExposure();

    ASSERT_EQ(1u, calls.CountCalls());
    EXPECT_EQ(0xF1u, calls.GetCalls()[0].flags);
}

TEST_F(Delivery, ASettingsChangeWithoutFrameDoneIsAppliedInSilence) {
    QueueFrame(0);
    QueueSettings(zcbExposeDone);

    EndExposure();

    EXPECT_EQ(0u, calls.CountCalls());
    EXPECT_EQ(1u, CountQueued());
}

TEST_F(Delivery, OnlyTheChangeBehindTheFirstFrameIsAppliedEarly) {
    ClientFrame second(ImageBytes);
    QueueFrame(zcbExposeDone, 1);
    ASSERT_ZERR(zerrNone, Queue(second, calls, zcbExposeDone, 2));
    QueueSettings();
    EndExposure();

    EndExposure();  // the second frame's, at index 1

    EXPECT_EQ(2u, calls.CountCalls());
    EXPECT_EQ(3u, CountQueued());
}

TEST_F(Delivery, NoChangeIsAppliedEarlyWhileSettingsAreBeingSent) {
    QueueFrame(0);
    QueueSettings();
    GetContext().sendInProgress = 1;

    EndExposure();

    EXPECT_EQ(2u, CountQueued());
    EXPECT_EQ(0u, calls.CountCalls());
}

TEST_F(Delivery, ASettingsChangeThatIsLastInTheQueueStaysAndIsThenDroppedWithItsImage) {
    QueueFrame(zcbFrameDone, 1);
    QueueSettings(zcbFrameDone, 100);

    ReceiveImage();
    EXPECT_EQ(1u, CountQueued());
    ClientFrame second(ImageBytes);
    ASSERT_ZERR(zerrNone, Queue(second, calls, zcbFrameDone, 2));
    ReceiveImage();

    EXPECT_EQ(1u, calls.CountCalls());
    EXPECT_EQ(0u, second->privateFilled);
    EXPECT_EQ(1u, CountQueued());
}

TEST_F(Delivery, ASettingsChangeAtTheHeadOfTheQueueIsPassedOverByAnExposure) {
    ClientFrame second(ImageBytes);
    ClientFrame third(ImageBytes);
    QueueFrame(0);
    QueueSettings();
    ReceiveImage();
    ASSERT_ZERR(zerrNone, Queue(second, calls, 3, 2));
    ASSERT_ZERR(zerrNone, Queue(third, calls, 3, 3));

    EndExposure();

    EXPECT_EQ(0u, calls.CountCalls());
    EXPECT_EQ(3u, CountQueued());
}

TEST_F(Delivery, ASettingsChangeFollowedByAFrameIsAppliedBehindTheDeliveredFrame) {
    ClientFrame second(ImageBytes);
    QueueFrame(zcbFrameDone, 1);
    QueueSettings(zcbFrameDone, 100);
    ASSERT_ZERR(zerrNone, Queue(second, calls, zcbFrameDone, 2));

    ReceiveImage();

    const auto heard = calls.GetCalls();
    ASSERT_EQ(2u, heard.size());
    EXPECT_EQ(1u, heard[0].userData);
    EXPECT_EQ(100u, heard[1].userData);
    EXPECT_ZERR(zerrNone, heard[1].errorCode);
    EXPECT_EQ(1u, CountQueued());
}

// Kept: the change at the head goes with the image, the one behind it is made.
TEST_F(Delivery, OfTwoChangesAtTheHeadOneIsDroppedWithTheImageAndTheOtherIsSent) {
    constexpr std::uint32_t Dropped = 100, Sent = 101;
    ClientFrame second(ImageBytes);
    Zentara_Settings latest = settings;
    SetSettingsWide(settings, zprm64Exposure, 20000000);
    SetSettingsWide(latest, zprm64Exposure, 30000000);
    QueueFrame(0);
    QueueSettings(zcbFrameDone, Dropped);
    ReceiveImage();
    ASSERT_ZERR(zerrNone, Zentara_QueueSettings(handle, &latest, CallbackLog::Record, zcbFrameDone,
                                                calls.GetPrivate(), Sent));
    ASSERT_ZERR(zerrNone, Queue(second, calls, zcbFrameDone, 2));

    ReceiveImage();

    ASSERT_EQ(1u, calls.CountCalls());
    EXPECT_EQ(Sent, calls.GetCalls()[0].userData);
    EXPECT_EQ(30000000u, GetCamera().GetExposure());
    EXPECT_EQ(0u, second->privateFilled) << "the image was for nobody";
    EXPECT_EQ(1u, CountQueued());
    ReceiveImage();
    EXPECT_EQ(1u, second->privateFilled);
}

/// A client whose frame callback lasts until the test lets it go on.
struct SlowClient {
    static void Record(std::uint64_t userPrivate, std::uint32_t userData, std::uint32_t errorCode,
                       std::uint32_t) {
        auto& client = *reinterpret_cast<SlowClient*>(userPrivate);
        EXPECT_EQ(0u, errorCode);
        {
            const std::lock_guard hold(client.mutex);
            client.heard.push_back(userData);
        }
        if (userData != 0) return;
        client.isInside = true;
        EXPECT_TRUE(WaitUntil([&] { return client.mayGoOn.load(); }));
    }
    std::vector<std::uint32_t> GetHeard() {
        const std::lock_guard hold(mutex);
        return heard;
    }
    std::uint64_t GetPrivate() { return reinterpret_cast<std::uintptr_t>(this); }

    std::atomic<bool> isInside{false}, mayGoOn{false};
    std::mutex mutex;
    std::vector<std::uint32_t> heard;
};

TEST_F(Delivery, AChangeTakenEarlyWaitsForTheOneBeforeItAndIsNotLost) {
    constexpr std::uint32_t Frame0 = 0, Change0 = 100, Frame1 = 1, Change1 = 101;
    ClientFrame second(ImageBytes);
    Zentara_Settings latest = settings;
    SlowClient client;
    SetSettingsWide(settings, zprm64Exposure, 20000000);
    SetSettingsWide(latest, zprm64Exposure, 30000000);
    const auto queueFrame = [&](Zentara_Frame* queued, std::uint32_t userData) {
        ASSERT_ZERR(zerrNone, Zentara_QueueFrame(handle, queued, SlowClient::Record, zcbFrameDone,
                                                 client.GetPrivate(), userData));
    };
    const auto queueChange = [&](Zentara_Settings* queued, std::uint32_t userData) {
        ASSERT_ZERR(zerrNone, Zentara_QueueSettings(handle, queued, SlowClient::Record,
                                                    zcbFrameDone, client.GetPrivate(), userData));
    };
    queueFrame(frame.Get(), Frame0);
    queueChange(&settings, Change0);
    queueFrame(second.Get(), Frame1);
    queueChange(&latest, Change1);

    std::thread runLoop([&] { ReceiveImage(); });
    EXPECT_TRUE(WaitUntil([&] { return client.isInside.load(); }));
    std::thread exposure([&] { EndExposure(); });
    EXPECT_TRUE(WaitUntil([&] { return CountQueued() == 1; })) << "the last change was not taken";
    client.mayGoOn = true;
    runLoop.join();
    exposure.join();

    EXPECT_EQ((std::vector<std::uint32_t>{Frame0, Change0, Change1}), client.GetHeard());
    EXPECT_EQ(30000000u, GetCamera().GetExposure());
    EXPECT_EQ(1u, CountQueued());
}

TEST_F(Delivery, AnExposureWhoseFrameHasBeenDeliveredLeavesTheNextFramesChangeAlone) {
    constexpr std::uint32_t Frame0 = 0, Frame1 = 1, Change1 = 101;
    ClientFrame second(ImageBytes);
    SlowClient client;
    const auto queueFrame = [&](Zentara_Frame* queued, std::uint32_t userData) {
        ASSERT_ZERR(zerrNone, Zentara_QueueFrame(handle, queued, SlowClient::Record,
                                                 zcbExposeDone | zcbFrameDone, client.GetPrivate(),
                                                 userData));
    };
    queueFrame(frame.Get(), Frame0);
    queueFrame(second.Get(), Frame1);
    ASSERT_ZERR(zerrNone, Zentara_QueueSettings(handle, &settings, SlowClient::Record, zcbFrameDone,
                                                client.GetPrivate(), Change1));

    std::thread exposure([&] { EndExposure(); });
    EXPECT_TRUE(WaitUntil([&] { return client.isInside.load(); }));
    {
        // Behind its callback the exposure waits for this lock.
        const SemaphoreHold hold(*GetContext().queueLock);
        client.mayGoOn = true;
        ReceiveImage();
    }
    exposure.join();

    EXPECT_EQ((std::vector<std::uint32_t>{Frame0, Frame0}), client.GetHeard());
    EXPECT_EQ(2u, CountQueued());
    EndExposure();
    EXPECT_EQ((std::vector<std::uint32_t>{Frame0, Frame0, Frame1, Change1}), client.GetHeard());
}

TEST_F(Delivery, AnExposureOfASecondFrameLeavesItsChangeAloneWhenTheFrameBecomesTheFirst) {
    constexpr std::uint32_t Frame1 = 1, Frame0 = 0, Change0 = 100;
    ClientFrame second(ImageBytes);
    SlowClient client;
    const auto queueFrame = [&](Zentara_Frame* queued, std::uint32_t userData) {
        ASSERT_ZERR(zerrNone, Zentara_QueueFrame(handle, queued, SlowClient::Record, zcbExposeDone,
                                                 client.GetPrivate(), userData));
    };
    queueFrame(frame.Get(), Frame1);
    queueFrame(second.Get(), Frame0);
    ASSERT_ZERR(zerrNone, Zentara_QueueSettings(handle, &settings, SlowClient::Record, zcbFrameDone,
                                                client.GetPrivate(), Change0));
    EndExposure();

    std::thread exposure([&] { EndExposure(); });
    EXPECT_TRUE(WaitUntil([&] { return client.isInside.load(); }));
    ReceiveImage();
    client.mayGoOn = true;
    exposure.join();

    EXPECT_EQ((std::vector<std::uint32_t>{Frame1, Frame0}), client.GetHeard());
    EXPECT_EQ(2u, CountQueued());
}

TEST_F(Delivery, AnImageWithoutAQueuedFrameIsDropped) {
    ReceiveImage();

    EXPECT_EQ(0u, calls.CountCalls());
}

TEST_F(Delivery, ATimeOutWithoutAnImageIsDeliveredAsUnplugged) {
    QueueFrame(zcbFrameDone);

    ReceiveImage(nullptr, FrameStatusTimedOut);

    ASSERT_EQ(1u, calls.CountCalls());
    EXPECT_ZERR(zerrUnplugged, calls.GetCalls()[0].errorCode);
    EXPECT_ZERR(zerrUnplugged, frame->errorCode);
    EXPECT_TRUE(frame.IsUntouched());
    EXPECT_EQ(0u, frame->privateFilled);
}

TEST_F(Delivery, ATimeOutThatComesWithAnImageIsDeliveredAsTheImage) {
    QueueFrame(zcbFrameDone);

    ReceiveImage(MakeImage(FrameStatusMissingData), FrameStatusTimedOut);

    EXPECT_ZERR(zerrMissingData, calls.GetCalls()[0].errorCode);
    EXPECT_EQ(0x42, frame.GetPixels()[0]);
}

TEST_F(Delivery, TroubleWithAnImageIsTheCallbacksErrorCode) {
    QueueFrame(zcbFrameDone);

    ReceiveImage(MakeImage(FrameStatusMissingData), FrameStatusMissingData);

    EXPECT_ZERR(zerrMissingData, calls.GetCalls()[0].errorCode);
    EXPECT_ZERR(zerrMissingData, frame->errorCode);
}

TEST_F(Delivery, AnImageThatOutgrewTheBufferIsNotCopied) {
    QueueFrame(zcbFrameDone);
    frame->bufferSize = ImageBytes - 1;

    ReceiveImage();

    EXPECT_ZERR(zerrBufferTooSmall, calls.GetCalls()[0].errorCode);
    EXPECT_TRUE(frame.IsUntouched());
    EXPECT_EQ(0u, frame->size);
}

TEST_F(Delivery, EarlyFramesCarryTheImagesOwnFormat) {
    QueueFrame(zcbFrameDone);

    ReceiveImage();

    EXPECT_EQ(2u, frame->format);
}

TEST_F(Delivery, AnAbortedQueueIsServedInSilence) {
    QueueFrame(3);
    GetContext().abortRequested = 1;

    EndExposure();
    ReceiveImage();

    EXPECT_EQ(0u, calls.CountCalls());
    EXPECT_EQ(1u, frame->privateFilled);
    EXPECT_EQ(0u, CountQueued());
}

TEST_F(Delivery, AnAbortFromAnExposureCallbackEmptiesTheQueueUnderIt) {
    static ZentaraHandle aborted;
    aborted = handle;
    const auto abort = [](std::uint64_t, std::uint32_t, std::uint32_t, std::uint32_t) {
        EXPECT_ZERR(zerrNone, Zentara_Abort(aborted));
    };
    ASSERT_ZERR(zerrNone, Zentara_QueueFrame(handle, frame.Get(), abort, zcbExposeDone, 0, 0));
    QueueSettings();

    EndExposure();

    EXPECT_EQ(0u, CountQueued());
    EXPECT_EQ(0u, calls.CountCalls());
}

TEST_F(Delivery, AnExposureCallbackMayQueueAndReadSettings) {
    static ZentaraHandle queued;
    static Zentara_Frame* again;
    queued = handle;
    ClientFrame second(ImageBytes);
    again = second.Get();
    const auto queueAgain = [](std::uint64_t, std::uint32_t, std::uint32_t, std::uint32_t) {
        Zentara_Settings read;
        EXPECT_ZERR(zerrNone, Zentara_QueueFrame(queued, again, nullptr, 0, 0, 0));
        EXPECT_ZERR(zerrNone, Zentara_ReadSettingsFromCam(queued, &read));
    };
    ASSERT_ZERR(zerrNone, Zentara_QueueFrame(handle, frame.Get(), queueAgain, zcbExposeDone, 0, 0));

    EndExposure();

    EXPECT_EQ(2u, CountQueued());
}

TEST_F(Delivery, AFrameCallbackMayQueueItsFrameAgain) {
    static ZentaraHandle queued;
    queued = handle;
    const auto queueAgain = [](std::uint64_t userPrivate, std::uint32_t, std::uint32_t,
                               std::uint32_t) {
        auto* const record = reinterpret_cast<Zentara_Frame*>(userPrivate);
        EXPECT_ZERR(zerrNone, Zentara_QueueFrame(queued, record, nullptr, 0, 0, 0));
    };
    ASSERT_ZERR(zerrNone, Zentara_QueueFrame(handle, frame.Get(), queueAgain, zcbFrameDone,
                                             reinterpret_cast<std::uintptr_t>(frame.Get()), 0));

    ReceiveImage();

    EXPECT_EQ(1u, CountQueued());
}

TEST_F(Delivery, AnExposureDuringASendDoesNotWaitForTheQueueLock) {
    QueueFrame(zcbExposeDone);
    GetContext().sendInProgress = 1;
    GetContext().queueLock->Wait();  // as the sending thread holds it

    std::thread engine([&] { EndExposure(); });
    engine.join();

    EXPECT_EQ(1u, calls.CountCalls());
    GetContext().queueLock->Signal();
}

TEST_F(Delivery, AnExposureWithoutASendWaitsForTheQueueLock) {
    QueueFrame(zcbExposeDone);
    GetContext().queueLock->Wait();
    std::atomic<bool> hasReturned{false};
    std::thread engine([&] {
        EndExposure();
        hasReturned = true;
    });
    EXPECT_FALSE(WaitUntil([&] { return hasReturned.load(); }, std::chrono::milliseconds(50)));

    GetContext().queueLock->Signal();
    engine.join();

    EXPECT_EQ(1u, calls.CountCalls());
}

TEST_F(Delivery, AnImageIsDeliveredWhileTheQueueLockIsHeld) {
    QueueFrame(zcbFrameDone);
    const SemaphoreHold queueing(*GetContext().queueLock);

    ReceiveImage();

    EXPECT_EQ(1u, calls.CountCalls());
}

TEST_F(Delivery, AnAbortWaitsForADeliveryInProgress) {
    QueueFrame(zcbFrameDone);
    GetContext().deliveryLock->Wait();
    std::atomic<bool> hasReturned{false};
    std::thread client([&] {
        EXPECT_ZERR(zerrNone, Zentara_Abort(handle));
        hasReturned = true;
    });
    EXPECT_FALSE(WaitUntil([&] { return hasReturned.load(); }, std::chrono::milliseconds(50)));
    EXPECT_EQ(1u, CountQueued());

    GetContext().deliveryLock->Signal();
    client.join();

    EXPECT_EQ(0u, CountQueued());
}

/// Callbacks of one frame: that of its exposure stays inside until the test lets it go.
struct SlowExposure {
    ZentaraHandle handle = 0;
    bool aborts = false;
    std::atomic<bool> isInside{false}, mayLeave{false}, hasLeft{false}, isDelivered{false};
    std::atomic<bool> wasLeftAtDelivery{false};

    static void Serve(std::uint64_t userPrivate, std::uint32_t, std::uint32_t,
                      std::uint32_t flags) {
        auto& self = *reinterpret_cast<SlowExposure*>(static_cast<std::uintptr_t>(userPrivate));
        if (flags == zcbExposeDone) {
            self.isInside = true;
            EXPECT_TRUE(WaitUntil([&] { return self.mayLeave.load(); }));
            if (self.aborts) {
                EXPECT_ZERR(zerrNone, Zentara_Abort(self.handle));
            }
            self.hasLeft = true;
        } else {
            self.wasLeftAtDelivery = self.hasLeft.load();
            self.isDelivered = true;
        }
    }
    ZentaraResult Queue(ClientFrame& frame) {
        return Zentara_QueueFrame(handle, frame.Get(), Serve, zcbFrameDone | zcbExposeDone,
                                  reinterpret_cast<std::uintptr_t>(this), 0);
    }
};

TEST_F(Delivery, AFrameCallbackWaitsUntilTheExposureCallbackOfItsFrameHasReturned) {
    SlowExposure slow{.handle = handle};
    ASSERT_ZERR(zerrNone, slow.Queue(frame));
    std::thread exposing([&] { EndExposure(); });
    EXPECT_TRUE(WaitUntil([&] { return slow.isInside.load(); }));
    std::thread receiving([&] { ReceiveImage(); });
    EXPECT_FALSE(WaitUntil([&] { return slow.isDelivered.load(); }, std::chrono::milliseconds(50)));

    slow.mayLeave = true;
    exposing.join();
    receiving.join();

    EXPECT_TRUE(slow.isDelivered);
    EXPECT_TRUE(slow.wasLeftAtDelivery);
}

TEST_F(Delivery, AnAbortReturnsAfterAnExposureCallbackThatWasBegun) {
    SlowExposure slow{.handle = handle};
    ASSERT_ZERR(zerrNone, slow.Queue(frame));
    std::thread exposing([&] { EndExposure(); });
    EXPECT_TRUE(WaitUntil([&] { return slow.isInside.load(); }));
    std::atomic<bool> hasReturned{false};
    std::thread client([&] {
        EXPECT_ZERR(zerrNone, Zentara_Abort(handle));
        EXPECT_TRUE(slow.hasLeft);
        hasReturned = true;
    });
    EXPECT_TRUE(WaitUntil([&] { return CountQueued() == 0; }));
    EXPECT_FALSE(WaitUntil([&] { return hasReturned.load(); }, std::chrono::milliseconds(50)));

    slow.mayLeave = true;
    exposing.join();
    client.join();

    EXPECT_FALSE(slow.isDelivered);
}

TEST_F(Delivery, AnExposureCallbackMayAbortWhileTheImageOfItsFrameWaitsForIt) {
    SlowExposure slow{.handle = handle, .aborts = true};
    ASSERT_ZERR(zerrNone, slow.Queue(frame));
    std::thread exposing([&] { EndExposure(); });
    EXPECT_TRUE(WaitUntil([&] { return slow.isInside.load(); }));
    std::thread receiving([&] { ReceiveImage(); });

    slow.mayLeave = true;
    exposing.join();
    receiving.join();

    EXPECT_TRUE(slow.hasLeft);
    EXPECT_EQ(0u, CountQueued());
}

TEST_F(Delivery, TwoThreadsMayAbortAtATimeOneOfThemFromAnExposureCallback) {
    SlowExposure slow{.handle = handle, .aborts = true};
    ASSERT_ZERR(zerrNone, slow.Queue(frame));
    std::thread exposing([&] { EndExposure(); });
    EXPECT_TRUE(WaitUntil([&] { return slow.isInside.load(); }));
    std::thread client([&] { EXPECT_ZERR(zerrNone, Zentara_Abort(handle)); });

    slow.mayLeave = true;
    exposing.join();
    client.join();

    EXPECT_EQ(0u, CountQueued());
}

TEST_F(Delivery, WithoutAContextNothingIsServedAndTheImageIsLetGo) {
    CameraContext* const context = GetCameraContext(GetCamera());
    GetCamera().SetRefCon(nullptr);

    EndExposure();
    ReceiveImage();

    GetCamera().SetRefCon(context);
}

TEST_F(Delivery, EveryEventLeavesTheNestingAsItFoundIt) {
    QueueFrame(3);
    const std::int32_t depth = GetLogNesting();

    EndExposure();
    ReceiveImage();
    ReceiveImage();
    EndExposure();

    EXPECT_EQ(depth, GetLogNesting());
}

/// Counts the images that pass.
class CountingFilter : public ZImageFilter {
  public:
    FilterResult Process(ZInImageBufferStruct*, ZOutImageBufferStruct*) override {
        ++count;
        return FilterDeclined;
    }
    FilterResult Init(std::uint32_t, std::uint32_t) override { return FilterDone; }
    FilterResult SetOutputFormat(std::uint32_t) override { return FilterDone; }

    std::uint32_t count = 0;
};

class PostProcessing : public Delivery {
  protected:
    void SetUp() override {
        Delivery::SetUp();
        GetContext().postPipeline->AddFilter(&filter);
    }
    void TearDown() override {
        GetContext().postPipeline->RemoveFilter(&filter);
        Delivery::TearDown();
    }
    void ReceiveWithFormat(std::uint32_t format) {
        Zentara_Settings last = settings;
        SetSettingsWord(last, zprmImageFormat, format);
        SetLastSettings(GetContext(), last);
        QueueFrame(zcbFrameDone);
        ReceiveImage();
    }

    CountingFilter filter;
};

TEST_F(PostProcessing, IsOffAfterOpening) {
    ReceiveWithFormat(zfmtMono8);

    EXPECT_EQ(0u, filter.count);
}

TEST_F(PostProcessing, RunsTheChainOnEveryImageThatIsNotRaw) {
    GetContext().postProcessing = 1;

    ReceiveWithFormat(zfmtMono8);
    ReceiveWithFormat(0xCDCDCDCD);

    EXPECT_EQ(2u, filter.count);
}

TEST_F(PostProcessing, RawDataAreDeliveredAsRawWithNoFilterRun) {
    GetContext().postProcessing = 1;

    for (const std::uint32_t raw : {zfmtRaw8, zfmtRaw16}) {
        ReceiveWithFormat(raw);
        EXPECT_EQ(raw, frame->format);
    }

    EXPECT_EQ(0u, filter.count);
}

TEST_F(PostProcessing, ATimeOutIsNotProcessed) {
    GetContext().postProcessing = 1;
    QueueFrame(zcbFrameDone);

    ReceiveImage(MakeImage(), FrameStatusTimedOut);

    EXPECT_EQ(0u, filter.count);
}

}  // namespace
}  // namespace ZV
