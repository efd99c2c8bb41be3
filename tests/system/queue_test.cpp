#include <gtest/gtest.h>

#include <atomic>
#include <cstring>
#include <memory>
#include <thread>
#include <vector>

#include "support/flat_camera.h"

namespace ZV::Test {
namespace {

class Queueing : public OpenedCamera {};

TEST_F(Queueing, TheHundredAndFirstFrameIsRefusedAndTheQueueStaysFull) {
    CallbackLog calls;
    ClientFrame frame(GetImageBytes());
    for (int i = 0; i < 100; ++i) ASSERT_ZERR(zerrNone, Queue(frame, calls, zcbFrameDone)) << i;

    EXPECT_ZERR(zerrQueueFull, Queue(frame, calls, zcbFrameDone));

    ASSERT_ZERR(zerrNone, Zentara_SetStreaming(handle, 1));
    EXPECT_TRUE(calls.WaitForCalls(100));
    ASSERT_ZERR(zerrNone, Zentara_SetStreaming(handle, 0));
    EXPECT_EQ(100u, calls.CountCalls());
}

TEST_F(Queueing, ABufferOneByteShortIsRefusedAndTheFrameUntouched) {
    CallbackLog calls;
    ClientFrame frame(GetImageBytes() - 1);

    EXPECT_ZERR(zerrBufferTooSmall, Queue(frame, calls, zcbFrameDone));

    EXPECT_TRUE(frame.IsUntouched());
    EXPECT_EQ(0u, frame->privateFilled);
    ClientFrame grabbed(GetImageBytes());
    EXPECT_ZERR(zerrNone, Zentara_GrabFrame(handle, grabbed.Get())) << "something was queued";
}

TEST_F(Queueing, AFrameWithoutABufferIsRefused) {
    CallbackLog calls;
    ClientFrame frame(GetImageBytes());
    frame->pBuffer = nullptr;

    EXPECT_ZERR(zerrBufferTooSmall, Queue(frame, calls, zcbFrameDone));
}

TEST_F(Queueing, AFrameIsTestedInOrder) {
    CallbackLog calls;
    ClientFrame frame(GetImageBytes());
    ClientFrame small(1);

    EXPECT_ZERR(zerrBadHandle, Zentara_QueueFrame(0, nullptr, nullptr, 0, 0, 0));
    EXPECT_ZERR(zerrBadHandle, Zentara_QueueFrame(0x1000, nullptr, nullptr, 0, 0, 0));
    EXPECT_ZERR(zerrBadParameter, Zentara_QueueFrame(handle, nullptr, nullptr, 0, 0, 0));
    for (int i = 0; i < 100; ++i) ASSERT_ZERR(zerrNone, Queue(frame, calls, 0));
    EXPECT_ZERR(zerrBadParameter, Zentara_QueueFrame(handle, nullptr, nullptr, 0, 0, 0));
    EXPECT_ZERR(zerrQueueFull, Queue(small, calls, 0));
}

TEST_F(Queueing, FramesAreServedInTheOrderOfTheCalls) {
    CallbackLog calls;
    std::vector<std::unique_ptr<ClientFrame>> frames;
    for (std::uint32_t i = 0; i < 20; ++i) {
        frames.push_back(std::make_unique<ClientFrame>(GetImageBytes()));
        ASSERT_ZERR(zerrNone, Queue(*frames[i], calls, zcbFrameDone, i));
    }
    ASSERT_ZERR(zerrNone, Zentara_SetStreaming(handle, 1));

    ASSERT_TRUE(calls.WaitForCalls(20));

    const auto heard = calls.GetCalls();
    for (std::uint32_t i = 0; i < 20; ++i) {
        EXPECT_EQ(i, heard[i].userData);
        EXPECT_ZERR(zerrNone, heard[i].errorCode);
        EXPECT_EQ(1u, heard[i].flags);
        EXPECT_EQ(0u, (*frames[i])->timeStamp);
        EXPECT_TRUE(frames[i]->IsGuardIntact());
    }
}

TEST_F(Queueing, FramesOutliveAStopOfTheStream) {
    CallbackLog calls;
    ClientFrame frame(GetImageBytes());
    ASSERT_ZERR(zerrNone, Zentara_SetStreaming(handle, 1));
    ASSERT_ZERR(zerrNone, Zentara_SetStreaming(handle, 0));
    ASSERT_ZERR(zerrNone, Queue(frame, calls, zcbFrameDone));
    EXPECT_ZERR(zerrBusy, Zentara_GrabFrame(handle, frame.Get()));

    ASSERT_ZERR(zerrNone, Zentara_SetStreaming(handle, 1));

    EXPECT_TRUE(calls.WaitForCalls(1));
}

TEST_F(Queueing, TheExposureCallbackOfAFrameComesBeforeItsFrameCallbackAndOnce) {
    constexpr std::uint32_t Count = 30;
    CallbackLog calls;
    std::vector<std::unique_ptr<ClientFrame>> frames;
    for (std::uint32_t i = 0; i < Count; ++i) {
        frames.push_back(std::make_unique<ClientFrame>(GetImageBytes()));
        ASSERT_ZERR(zerrNone, Queue(*frames[i], calls, 3, i));
    }
    ASSERT_ZERR(zerrNone, Zentara_SetStreaming(handle, 1));

    ASSERT_TRUE(calls.WaitForCalls(2 * Count));
    ASSERT_ZERR(zerrNone, Zentara_SetStreaming(handle, 0));

    std::vector<std::uint32_t> exposures(Count);
    std::vector<std::uint32_t> deliveries(Count);
    for (const CallbackLog::Call& call : calls.GetCalls()) {
        ASSERT_LT(call.userData, Count);
        if (call.flags == zcbExposeDone) {
            EXPECT_EQ(0u, call.errorCode);
            ++exposures[call.userData];
        } else {
            EXPECT_EQ(1u, call.flags);
            ++deliveries[call.userData];
        }
    }
    EXPECT_EQ(std::vector<std::uint32_t>(Count, 1), exposures);
    EXPECT_EQ(std::vector<std::uint32_t>(Count, 1), deliveries);
}

TEST_F(Queueing, CallbacksComeFromTheLibrarysThreads) {
    CallbackLog calls;
    ClientFrame frame(GetImageBytes());
    ASSERT_ZERR(zerrNone, Queue(frame, calls, 3));
    ASSERT_ZERR(zerrNone, Zentara_SetStreaming(handle, 1));

    ASSERT_TRUE(calls.WaitForCalls(2));

    for (const CallbackLog::Call& call : calls.GetCalls()) {
        EXPECT_NE(std::this_thread::get_id(), call.thread);
    }
}

/// A frame that its own callback queues again until it has been served often enough.
struct Circulation {
    ZentaraHandle handle = 0;
    Zentara_Frame* frame = nullptr;
    std::uint32_t rounds = 0;
    std::atomic<std::uint32_t> served{0};

    static void Serve(std::uint64_t userPrivate, std::uint32_t, std::uint32_t errorCode,
                      std::uint32_t) {
        auto& self = *reinterpret_cast<Circulation*>(static_cast<std::uintptr_t>(userPrivate));
        EXPECT_ZERR(zerrNone, errorCode);
        if (self.served + 1 < self.rounds) {
            EXPECT_ZERR(zerrNone, self.Queue());
        }
        ++self.served;
    }
    ZentaraResult Queue() {
        return Zentara_QueueFrame(handle, frame, Serve, zcbFrameDone,
                                  reinterpret_cast<std::uintptr_t>(this), 0);
    }
};

TEST_F(Queueing, AFrameIsQueuedAgainFromItsCallback) {
    ClientFrame frame(GetImageBytes());
    Circulation circulation{handle, frame.Get(), 50};
    ASSERT_ZERR(zerrNone, circulation.Queue());
    ASSERT_ZERR(zerrNone, Zentara_SetStreaming(handle, 1));

    EXPECT_TRUE(WaitUntil([&] { return circulation.served == 50; }, std::chrono::seconds(20)));
}

TEST_F(Queueing, ClientsMayQueueAndAbortFromSeveralThreadsWhileTheCameraStreams) {
    CallbackLog calls;
    std::vector<std::unique_ptr<ClientFrame>> frames;
    for (int i = 0; i < 3; ++i) frames.push_back(std::make_unique<ClientFrame>(GetImageBytes()));
    ASSERT_ZERR(zerrNone, Zentara_SetStreaming(handle, 1));
    std::vector<std::thread> clients;
    for (std::size_t i = 0; i < 3; ++i) {
        clients.emplace_back([&, i] {
            for (int round = 0; round < 200; ++round) {
                const ZentaraResult result = Queue(*frames[i], calls, 3);
                EXPECT_TRUE(result == zerrNone || result == zerrQueueFull);
                if (i == 0 && round % 20 == 19) {
                    EXPECT_ZERR(zerrNone, Zentara_Abort(handle));
                }
            }
        });
    }
    for (std::thread& client : clients) client.join();
    ASSERT_ZERR(zerrNone, Zentara_Abort(handle));
    const std::size_t before = calls.CountCalls();
    ASSERT_ZERR(zerrNone, Queue(*frames[0], calls, zcbFrameDone));

    EXPECT_TRUE(calls.WaitForCalls(before + 1));
}

TEST_F(Queueing, SettingsWithAnEmptyQueueAreAppliedAtOnceAndTheCallbackRunsBeforeTheReturn) {
    CallbackLog calls;
    Zentara_Settings settings = ReadSettings();

    const ZentaraResult result = Zentara_QueueSettings(handle, &settings, CallbackLog::Record,
                                                       zcbFrameDone, calls.GetPrivate(), 12);

    EXPECT_ZERR(zerrNone, result);
    const auto heard = calls.GetCalls();
    ASSERT_EQ(1u, heard.size());
    EXPECT_EQ(std::this_thread::get_id(), heard[0].thread);
    EXPECT_EQ(12u, heard[0].userData);
    EXPECT_ZERR(result, heard[0].errorCode);
    EXPECT_EQ(1u, heard[0].flags);
    ClientFrame frame(GetImageBytes());
    EXPECT_ZERR(zerrNone, Zentara_GrabFrame(handle, frame.Get())) << "something was queued";
}

TEST_F(Queueing, SettingsAppliedAtOnceCallBackOnlyForFrameDone) {
    CallbackLog calls;
    Zentara_Settings settings = ReadSettings();

    EXPECT_ZERR(zerrNone, Zentara_QueueSettings(handle, &settings, CallbackLog::Record,
                                                zcbExposeDone, calls.GetPrivate(), 0));
    EXPECT_ZERR(zerrNone, Zentara_QueueSettings(handle, &settings, nullptr, zcbFrameDone, 0, 0));

    EXPECT_EQ(0u, calls.CountCalls());
}

TEST_F(Queueing, SettingsBehindAFrameWait) {
    CallbackLog calls;
    Zentara_Settings settings = ReadSettings();
    ClientFrame frame(GetImageBytes());
    ASSERT_ZERR(zerrNone, Queue(frame, calls, zcbFrameDone, 1));

    EXPECT_ZERR(zerrNone, Zentara_QueueSettings(handle, &settings, CallbackLog::Record,
                                                zcbFrameDone, calls.GetPrivate(), 2));
    EXPECT_EQ(0u, calls.CountCalls());
    ASSERT_ZERR(zerrNone, Zentara_SetStreaming(handle, 1));

    EXPECT_TRUE(calls.WaitForCalls(1));
    // Sent, dropped or waiting: the block must not be the queue's any more when it goes.
    EXPECT_ZERR(zerrNone, Zentara_SetStreaming(handle, 0));
    EXPECT_ZERR(zerrNone, Zentara_Abort(handle));
}

TEST_F(Queueing, SettingsAreTestedInOrder) {
    CallbackLog calls;
    Zentara_Settings settings = ReadSettings();
    Zentara_Settings wrongMagic = settings;
    wrongMagic.privateWords[62] ^= 1;
    Zentara_Settings moved = settings;
    moved.privateWords[zprmRoiX] += 2;
    ClientFrame frame(GetImageBytes());
    auto queue = [&](Zentara_Settings* block) {
        return Zentara_QueueSettings(handle, block, nullptr, 0, 0, 0);
    };

    EXPECT_ZERR(zerrBadHandle, Zentara_QueueSettings(0, nullptr, nullptr, 0, 0, 0));
    EXPECT_ZERR(zerrBadSettings, queue(nullptr));
    EXPECT_ZERR(zerrBadSettings, queue(&wrongMagic));
    for (int i = 0; i < 100; ++i) ASSERT_ZERR(zerrNone, Queue(frame, calls, 0));
    EXPECT_ZERR(zerrBadSettings, queue(&wrongMagic));
    EXPECT_ZERR(zerrQueueFull, queue(&moved));
    EXPECT_ZERR(zerrQueueFull, queue(&settings));
}

TEST_F(Queueing, ASizeOfZeroAndTheRightMagicNumberAreAccepted) {
    CallbackLog calls;
    Zentara_Settings settings = ReadSettings();
    settings.size = 0;
    ClientFrame frame(GetImageBytes());
    ASSERT_ZERR(zerrNone, Queue(frame, calls, 0));

    EXPECT_ZERR(zerrNone, Zentara_QueueSettings(handle, &settings, nullptr, 0, 0, 0));
}

TEST_F(Queueing, AChangedRegionOrSpeedIsRefusedAndNothingIsQueued) {
    constexpr int Capacity = 100;
    CallbackLog calls;
    ClientFrame frame(GetImageBytes());
    ASSERT_ZERR(zerrNone, Queue(frame, calls, 0));
    const Zentara_Settings settings = ReadSettings();
    for (const std::uint32_t key :
         {zprmRoiX, zprmRoiY, zprmRoiWidth, zprmRoiHeight, zprmReadoutSpeed}) {
        Zentara_Settings changed = settings;
        changed.privateWords[key] += 1;

        EXPECT_ZERR(zerrBadSettings, Zentara_QueueSettings(handle, &changed, CallbackLog::Record,
                                                           zcbFrameDone, calls.GetPrivate(), 0))
            << key;
    }

    for (int i = 1; i < Capacity; ++i) ASSERT_ZERR(zerrNone, Queue(frame, calls, 0)) << i;
    EXPECT_ZERR(zerrQueueFull, Queue(frame, calls, 0)) << "one frame and nothing else was queued";
    EXPECT_ZERR(zerrNone, Zentara_Abort(handle));
    EXPECT_EQ(0u, calls.CountCalls());
}

TEST_F(Queueing, ChangedBinningIsNotCompared) {
    CallbackLog calls;
    Zentara_Settings settings = ReadSettings();
    for (const std::uint32_t key : {zprmBinning, zprmHorizontalBinning, zprmVerticalBinning}) {
        settings.privateWords[key] = 2;
    }
    ClientFrame frame(GetImageBytes());
    ASSERT_ZERR(zerrNone, Queue(frame, calls, 0));

    EXPECT_ZERR(zerrNone, Zentara_QueueSettings(handle, &settings, nullptr, 0, 0, 0));
}

}  // namespace
}  // namespace ZV::Test
