// The camera goes away while it is used, comes back, and is listed, opened and used again; and its
// bus is reset. That it goes at each request of an opening, a close and every other story, and
// stays away until all is closed, is a part of the sweep (sweep_test.cpp).

#include <gtest/gtest.h>

#include <array>
#include <cstdio>
#include <map>
#include <memory>
#include <string>
#include <thread>

#include "hal/platform/clock.h"
#include "support/flat_camera.h"
#include "support/rounds.h"
#include "support/settings_words.h"

namespace ZV::Test {
namespace {

constexpr std::uint32_t BufferBytes = 64 * 48 * 2;
constexpr std::uint32_t SpeedIndexSlowest = 3;  ///< Its packets are the smallest.
constexpr std::uint32_t TriggerSoftware = 5;
constexpr std::uint32_t PacketsMax = 200;
constexpr std::uint32_t RequestsMax = 400;
/// What every close sends by itself.
constexpr const char* CloseCodes[] = {
    "FW_IOCTL_STOP",           "FW_IOCTL_DETACH_BUFFERS", "FW_IOCTL_ASYNC_WRITE",
    "FW_IOCTL_FREE_RESOURCES", "FW_IOCTL_FREE_CHANNEL",   "FW_IOCTL_FREE_BANDWIDTH",
    "FW_IOCTL_NOTIFY_DISABLE",
};

struct Sender {
    const char* name;
    const char* base;
    int streamingVersion;
    bool isTurned;
};
constexpr Sender Senders[] = {
    {"VersionZero", "old", 0, false},
    {"VersionOne", "mono", 1, false},
    {"VersionTwo", "rotated", 2, true},
    {"TwoFields", "folary", 1, false},
};

std::string MakeScenario(const Sender& sender, double timeScale = 0) {
    return R"({"base": ")" + std::string(sender.base) + R"(", "timeScale": )" +
           std::to_string(timeScale) +
           R"(, "cameras": [{"sensor": {"width": 64, "height": 48, "noise": false},
               "streamingVersion": )" +
           std::to_string(sender.streamingVersion) + "}]}";
}

/// A client whose camera may vanish, over a bus of its own.
class Visitor {
  public:
    explicit Visitor(const std::string& scenario) : world(scenario) {
        SetWaitClockDivisor(1000);
        EXPECT_ZERR(zerrNone, Zentara_LoadDriver());
        Open();
    }
    ~Visitor() {
        Zentara_ReleaseDriver();
        ClientMemory::LetGo();
        SetWaitClockDivisor(1);
    }
    Visitor(const Visitor&) = delete;
    Visitor& operator=(const Visitor&) = delete;

    /// Lists, opens the camera and puts 16 bits in small packets in force.
    void Open(std::uint32_t triggerMode = 0, std::uint64_t exposureNs = 2'000'000) {
        Zentara_CamListItem items[2] = {};
        std::uint32_t length = 2;
        ASSERT_ZERR(zerrNone, Zentara_ListCameras(items, &length));
        ASSERT_EQ(1U, length);
        ASSERT_ZERR(zerrNone, Zentara_OpenCamera(0, &handle));
        Zentara_Settings settings{};
        ASSERT_ZERR(zerrNone, Zentara_ReadSettingsFromCam(handle, &settings));
        SetWord(settings, zprmImageFormat, GetWord(settings, zprmImageFormat) | 1);
        SetWord(settings, zprmReadoutSpeed, SpeedIndexSlowest);
        SetWord(settings, zprmTriggerType, triggerMode);
        SetWide(settings, zprm64Exposure, exposureNs);
        ASSERT_ZERR(zerrNone, Zentara_SendSettingsToCam(handle, &settings));
    }
    void SendExposure(std::uint64_t exposureNs) {
        Zentara_Settings settings{};
        ASSERT_ZERR(zerrNone, Zentara_ReadSettingsFromCam(handle, &settings));
        SetWide(settings, zprm64Exposure, exposureNs);
        ASSERT_ZERR(zerrNone, Zentara_SendSettingsToCam(handle, &settings));
    }
    void QueueFrames(std::size_t count) {
        log = std::make_unique<CallbackLog>();
        frames.clear();
        for (std::size_t i = 0; i < count; ++i) {
            frames.push_back(std::make_unique<ClientFrame>(BufferBytes));
            ASSERT_ZERR(zerrNone, Zentara_QueueFrame(handle, frames[i]->Get(), CallbackLog::Record,
                                                     zcbFrameDone, log->GetPrivate(),
                                                     static_cast<std::uint32_t>(i)));
        }
    }
    void StartStream(std::size_t count) {
        QueueFrames(count);
        ASSERT_ZERR(zerrNone, Zentara_SetStreaming(handle, 1));
    }
    /// Streams anew; all frames come whole.
    void ExpectStream() {
        StartStream(4);
        ASSERT_TRUE(log->WaitForCalls(4));
        for (const auto& frame : frames) EXPECT_ZERR(zerrNone, (*frame)->errorCode);
        EXPECT_ZERR(zerrNone, Zentara_SetStreaming(handle, 0));
        EXPECT_ZERR(zerrNone, Zentara_Abort(handle));
    }
    /// All that a client does about a camera that has gone, and what it gets when it is back.
    void ExpectReturn(ZentaraResult stopped = zerrDriverFault) {
        EXPECT_ZERR(stopped, Zentara_SetStreaming(handle, 0));
        EXPECT_ZERR(zerrNone, Zentara_Abort(handle));
        EXPECT_ZERR(zerrNone, Zentara_CloseCamera(handle));
        ASSERT_TRUE(world.Plug());
        ASSERT_NO_FATAL_FAILURE(Open());
        ASSERT_NO_FATAL_FAILURE(ExpectStream());
        EXPECT_ZERR(zerrNone, Zentara_CloseCamera(handle));
        EXPECT_EQ(0U, world.GetState().openHandles);
    }
    bool HasGone() const { return HasEvent("unplug"); }
    bool WasReset() const { return HasEvent("busReset"); }
    /// Each frame that counts as whole is one that the camera has sent to its end, as it was sent.
    /// Frames that have not come have no size.
    void ExpectOnlySentFramesWhole(const Sender& sender) const {
        std::map<std::uint32_t, std::uint64_t> sent;
        for (const TraceRecord& record : world.ReadFrames()) {
            sent[record.rollingFrameNumber] = record.checksum;
        }
        for (const auto& frame : frames) {
            const Zentara_Frame& record = *frame->Get();
            if (record.errorCode != zerrNone || record.size == 0) continue;
            ASSERT_EQ(1U, sent.count(record.frameNumber)) << record.frameNumber;
            if (sender.isTurned) continue;  // by the library, behind the bus
            EXPECT_EQ(sent[record.frameNumber], CalculateChecksum(record.pBuffer, record.size))
                << record.frameNumber;
        }
    }

    SimulationWorld world;
    ZentaraHandle handle = 0;
    std::unique_ptr<CallbackLog> log;
    std::vector<std::unique_ptr<ClientFrame>> frames;

  private:
    bool HasEvent(const char* type) const {
        const std::vector<TraceRecord> trace = world.ReadTrace();
        return std::any_of(trace.begin(), trace.end(),
                           [type](const TraceRecord& record) { return record.type == type; });
    }
};

std::string MakePacketFault(const char* kind, std::uint32_t packet) {
    return R"({"kind": ")" + std::string(kind) + R"(", "frame": 2, "packet": )" +
           std::to_string(packet) + "}";
}

/// For the table of rounds.
void PrintRounds(std::size_t rounds) {
    const testing::TestInfo& test = *testing::UnitTest::GetInstance()->current_test_info();
    std::printf("\n%s: %zu rounds\n", test.name(), rounds);
}

class VanishingCamera : public testing::TestWithParam<Sender> {};

TEST_P(VanishingCamera, IsUsedAgainAfterItHasGoneAtAnyPacketOfAFrame) {
    bool hasGone = true;
    std::uint32_t packet = 0;
    for (; hasGone && packet < PacketsMax && !HasFailure(); ++packet) {
        SCOPED_TRACE(packet);
        Visitor visitor(MakeScenario(GetParam()));
        ASSERT_TRUE(visitor.world.AddFault(MakePacketFault("unplug", packet)));
        ASSERT_NO_FATAL_FAILURE(visitor.StartStream(6));

        hasGone = false;
        ASSERT_TRUE(WaitUntil([&] {
            hasGone = visitor.HasGone();
            return hasGone || visitor.log->CountCalls() >= 6;
        }));

        if (!hasGone) continue;
        EXPECT_ZERR(zerrDriverFault, Zentara_SetStreaming(visitor.handle, 0));
        visitor.ExpectOnlySentFramesWhole(GetParam());
        visitor.ExpectReturn(zerrNone);
    }
    EXPECT_FALSE(hasGone);
    EXPECT_GT(packet, 2U) << "a frame is of several packets";
    PrintRounds(packet - 1);
}

TEST_P(VanishingCamera, GoesOnAfterABusResetAtAnyPacketOfAFrame) {
    bool wasReset = true;
    std::uint32_t packet = 0;
    for (; wasReset && packet < PacketsMax && !HasFailure(); ++packet) {
        SCOPED_TRACE(packet);
        Visitor visitor(MakeScenario(GetParam()));
        ASSERT_TRUE(visitor.world.AddFault(MakePacketFault("busReset", packet)));

        ASSERT_NO_FATAL_FAILURE(visitor.StartStream(8));
        ASSERT_TRUE(visitor.log->WaitForCalls(8));

        EXPECT_ZERR(zerrNone, (*visitor.frames.back())->errorCode);
        EXPECT_ZERR(zerrNone, Zentara_SetStreaming(visitor.handle, 0));
        visitor.ExpectOnlySentFramesWhole(GetParam());
        EXPECT_ZERR(zerrNone, Zentara_CloseCamera(visitor.handle));
        wasReset = visitor.WasReset();
    }
    EXPECT_FALSE(wasReset);
    EXPECT_GT(packet, 2U) << "a frame is of several packets";
    PrintRounds(packet - 1);
}

TEST_P(VanishingCamera, IsUsedAgainAfterItHasGoneBetweenTwoFrames) {
    // In real time the third exposure ends long after the test.
    constexpr std::uint64_t HourNs = 3'600'000'000'000;
    Visitor visitor(MakeScenario(GetParam(), 1));
    ASSERT_ZERR(zerrNone, Zentara_CloseCamera(visitor.handle));
    ASSERT_NO_FATAL_FAILURE(visitor.Open(TriggerSoftware));
    ASSERT_NO_FATAL_FAILURE(visitor.StartStream(6));
    for (std::size_t i = 1; i <= 2; ++i) {
        ASSERT_ZERR(zerrNone, Zentara_Trigger(visitor.handle));
        ASSERT_TRUE(visitor.log->WaitForCalls(i));
    }
    ASSERT_NO_FATAL_FAILURE(visitor.SendExposure(HourNs));
    ASSERT_ZERR(zerrNone, Zentara_Trigger(visitor.handle));

    ASSERT_TRUE(visitor.world.Unplug());

    const ZentaraSimulationState state = visitor.world.GetState();
    EXPECT_EQ(2U, state.framesSent);
    for (std::size_t i = 0; i < 2; ++i) {
        EXPECT_ZERR(zerrNone, (*visitor.frames[i])->errorCode);
    }
    visitor.ExpectReturn();
    PrintRounds(1);
}

TEST_P(VanishingCamera, IsUsedAgainAfterItHasGoneWhileAStreamWaitedForATrigger) {
    Visitor visitor(MakeScenario(GetParam()));
    ASSERT_ZERR(zerrNone, Zentara_CloseCamera(visitor.handle));
    ASSERT_NO_FATAL_FAILURE(visitor.Open(TriggerSoftware));
    ASSERT_NO_FATAL_FAILURE(visitor.StartStream(2));
    ASSERT_ZERR(zerrNone, Zentara_Trigger(visitor.handle));
    ASSERT_TRUE(visitor.log->WaitForCalls(1));

    ASSERT_TRUE(visitor.world.Unplug());

    EXPECT_ZERR(zerrDriverFault, Zentara_Trigger(visitor.handle));
    visitor.ExpectReturn();
}

TEST_P(VanishingCamera, IsUsedAgainAfterItHasGoneWhileAGrabWaitedForATrigger) {
    Visitor visitor(MakeScenario(GetParam()));
    ASSERT_ZERR(zerrNone, Zentara_CloseCamera(visitor.handle));
    ASSERT_NO_FATAL_FAILURE(visitor.Open(TriggerSoftware));
    ClientFrame frame(BufferBytes);
    std::atomic<bool> hasEnded{false};
    ZentaraResult grabbed = zerrNone;
    std::thread grab([&] {
        grabbed = Zentara_GrabFrame(visitor.handle, frame.Get());
        hasEnded = true;
    });
    EXPECT_TRUE(WaitUntil([&] { return visitor.world.GetState().isStreaming != 0; }));

    EXPECT_TRUE(visitor.world.Unplug());

    // An abort before the grab waits does not count, so it is repeated.
    EXPECT_TRUE(WaitUntil([&] {
        (void)Zentara_Abort(visitor.handle);
        return hasEnded.load();
    }));
    grab.join();
    EXPECT_ZERR(zerrDriverFault, grabbed);
    visitor.ExpectReturn(zerrNone);  // the grab has stopped its stream
}

INSTANTIATE_TEST_SUITE_P(Senders, VanishingCamera, testing::ValuesIn(Senders),
                         [](const auto& test) { return std::string(test.param.name); });

TEST_P(VanishingCamera, GoesOnAfterABusResetWhileAStreamWaitedForATrigger) {
    Visitor visitor(MakeScenario(GetParam()));
    ASSERT_ZERR(zerrNone, Zentara_CloseCamera(visitor.handle));
    ASSERT_NO_FATAL_FAILURE(visitor.Open(TriggerSoftware));
    ASSERT_NO_FATAL_FAILURE(visitor.StartStream(2));
    ASSERT_ZERR(zerrNone, Zentara_Trigger(visitor.handle));
    ASSERT_TRUE(visitor.log->WaitForCalls(1));

    // The trigger's write is pended and ends in an error; the camera waits on.
    ASSERT_TRUE(visitor.world.AddFault(R"({"kind": "busReset", "code": "FW_IOCTL_ASYNC_WRITE"})"));
    EXPECT_NE(zerrNone, Zentara_Trigger(visitor.handle));
    EXPECT_TRUE(visitor.WasReset());
    ASSERT_ZERR(zerrNone, Zentara_Trigger(visitor.handle));
    ASSERT_TRUE(visitor.log->WaitForCalls(2));
    EXPECT_ZERR(zerrNone, (*visitor.frames.back())->errorCode);
    EXPECT_ZERR(zerrNone, Zentara_SetStreaming(visitor.handle, 0));
    EXPECT_ZERR(zerrNone, Zentara_CloseCamera(visitor.handle));
}

/// A bus that is reset at one request of a listing, an opening or a close.
class ResetAtRequest : public testing::TestWithParam<Sender> {
  protected:
    static void ExpectUse(Visitor& visitor) {
        ASSERT_NO_FATAL_FAILURE(visitor.Open());
        ASSERT_NO_FATAL_FAILURE(visitor.ExpectStream());
        EXPECT_ZERR(zerrNone, Zentara_CloseCamera(visitor.handle));
        EXPECT_EQ(0U, visitor.world.GetState().openHandles);
    }
};

TEST_P(ResetAtRequest, OfAListingItsFirstSetupOrAnOpeningIsOverWithTheNextListing) {
    bool wasReset = true;
    std::uint32_t request = 1;
    std::size_t rounds = 0;
    constexpr std::uint32_t Step = IsSanitized ? 5 : 1;
    for (; wasReset && request < RequestsMax && !HasFailure(); request += Step) {
        SCOPED_TRACE(request);
        Visitor visitor(MakeScenario(GetParam()));
        ASSERT_ZERR(zerrNone, Zentara_CloseCamera(visitor.handle));
        ASSERT_TRUE(visitor.world.AddFault(R"({"kind": "busReset", "request": )" +
                                           std::to_string(request) + "}"));

        Zentara_CamListItem items[2] = {};
        std::uint32_t length = 2;
        (void)Zentara_ListCameras(items, &length);  // a read or a write of it may have failed
        ZentaraHandle opened = 0;
        if (length != 0 && Zentara_OpenCamera(0, &opened) == zerrNone) {
            EXPECT_ZERR(zerrNone, Zentara_CloseCamera(opened));
        }

        wasReset = visitor.WasReset();
        if (!wasReset) break;  // it waits for a request that comes with the next use
        ++rounds;
        ASSERT_NO_FATAL_FAILURE(ExpectUse(visitor));
    }
    EXPECT_FALSE(wasReset);
    EXPECT_GT(request, 50U) << "a listing sets the camera up";
    PrintRounds(rounds);
}

TEST_P(ResetAtRequest, OfACloseIsOverWithTheNextListing) {
    // By their codes: buffers are attached beside a close.
    for (const char* code : CloseCodes) {
        SCOPED_TRACE(code);
        Visitor visitor(MakeScenario(GetParam()));
        ASSERT_NO_FATAL_FAILURE(visitor.StartStream(2));
        ASSERT_TRUE(visitor.log->WaitForCalls(2));
        ASSERT_TRUE(visitor.world.AddFault(R"({"kind": "busReset", "code": ")" + std::string(code) +
                                           R"("})"));

        EXPECT_ZERR(zerrNone, Zentara_CloseCamera(visitor.handle));

        EXPECT_TRUE(visitor.WasReset());
        ASSERT_NO_FATAL_FAILURE(ExpectUse(visitor));
    }
    PrintRounds(std::size(CloseCodes));
}

INSTANTIATE_TEST_SUITE_P(Senders, ResetAtRequest, testing::ValuesIn(Senders),
                         [](const auto& test) { return std::string(test.param.name); });

/// A camera that goes at one request and is back at one of the next.
class BriefAbsence : public testing::TestWithParam<Sender> {
  protected:
    static void Interrupt(Visitor& visitor, std::uint32_t request, std::uint32_t length) {
        const auto fault = [&](const char* kind, std::uint32_t number) {
            return R"({"kind": ")" + std::string(kind) + R"(", "request": )" +
                   std::to_string(number) + "}";
        };
        ASSERT_TRUE(visitor.world.AddFault(fault("unplug", request)));
        ASSERT_TRUE(visitor.world.AddFault(fault("plug", request + length)));
    }
    /// The camera is back at the latest now.
    static void ExpectUse(Visitor& visitor) {
        ASSERT_TRUE(visitor.world.Plug());
        ASSERT_NO_FATAL_FAILURE(visitor.Open());
        ASSERT_NO_FATAL_FAILURE(visitor.ExpectStream());
        EXPECT_ZERR(zerrNone, Zentara_CloseCamera(visitor.handle));
        EXPECT_EQ(0U, visitor.world.GetState().openHandles);
    }
};

TEST_P(BriefAbsence, OfAnyLengthDuringAnOpeningIsOverWithTheNextListing) {
    std::size_t rounds = 0;
    for (std::uint32_t request = 1; request <= 4 && !HasFailure(); ++request) {
        for (std::uint32_t length = 1; length <= 4 && !HasFailure(); ++length) {
            SCOPED_TRACE(request * 10 + length);
            Visitor visitor(MakeScenario(GetParam()));
            ASSERT_ZERR(zerrNone, Zentara_CloseCamera(visitor.handle));
            ASSERT_NO_FATAL_FAILURE(Interrupt(visitor, request, length));

            ZentaraHandle opened = 0;
            EXPECT_NE(zerrNone, Zentara_OpenCamera(0, &opened));

            ExpectUse(visitor);
            ++rounds;
        }
    }
    PrintRounds(rounds);
}

TEST_P(BriefAbsence, OfAnyLengthDuringACloseIsOverWithTheNextListing) {
    std::size_t absences = 0;
    for (std::uint32_t request = 1; request <= 8 && !HasFailure(); ++request) {
        for (std::uint32_t length = 1; length <= 3 && !HasFailure(); ++length) {
            SCOPED_TRACE(request * 10 + length);
            Visitor visitor(MakeScenario(GetParam()));
            ASSERT_NO_FATAL_FAILURE(visitor.StartStream(2));
            ASSERT_TRUE(visitor.log->WaitForCalls(2));
            ASSERT_NO_FATAL_FAILURE(Interrupt(visitor, request, length));

            EXPECT_ZERR(zerrNone, Zentara_CloseCamera(visitor.handle));

            if (!visitor.HasGone()) break;  // the close is of fewer requests
            ++absences;
            ExpectUse(visitor);
        }
    }
    EXPECT_GE(absences, 4U);
    PrintRounds(absences);
}

INSTANTIATE_TEST_SUITE_P(Senders, BriefAbsence, testing::ValuesIn(Senders),
                         [](const auto& test) { return std::string(test.param.name); });

}  // namespace
}  // namespace ZV::Test
