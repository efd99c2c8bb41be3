#include <gtest/gtest.h>

#include <array>
#include <atomic>
#include <cstdio>
#include <cstdlib>
#include <deque>
#include <filesystem>
#include <memory>
#include <mutex>
#include <random>
#include <string>
#include <thread>
#include <vector>

#include "camera/camera.h"
#include "stress/delaying_seam.h"
#include "support/expect_zerr.h"
#include "support/settings_words.h"
#include "support/simulation_world.h"
#include "support/wait_until.h"

// Four clients call all that may be called at once on two cameras that stream, while the seam's
// locks and waits are delayed. `ZENTARA_STRESS_SEED` and `ZENTARA_STRESS_STEPS` choose another run.
namespace ZV::Test {
namespace {

using namespace std::chrono_literals;

constexpr std::size_t Cameras = 2;
constexpr std::size_t Clients = 4;
constexpr std::uint32_t FrameBytesMax = 64 * 48 * 6;
/// A run in which no client takes a step for so long, aborts or not, is stuck.
constexpr auto StuckAfter = 60s;
/// A grab whose stream another client ends waits for ever; each client has an abort as its remedy.
constexpr auto RescueStep = 100ms;

constexpr const char* Scenario = R"({"timeScale": 0, "cameras": [
    {"model": "SolvaneA1", "sensor": {"width": 64, "height": 48}, "scene": {"kind": "flat"}},
    {"model": "PellanA1", "streamingVersion": 2, "sensor": {"width": 64, "height": 48},
     "faults": [{"kind": "losePacket", "probability": 0.02}]}]})";

std::uint64_t ReadNumber(const char* variable, std::uint64_t otherwise) {
    const char* text = std::getenv(variable);
    return text != nullptr ? std::strtoull(text, nullptr, 10) : otherwise;
}

/// A sanitizer starts a thread of its own with the first that is made.
std::size_t CountThreads() {
    std::thread([] {}).join();
    return static_cast<std::size_t>(
        std::distance(std::filesystem::directory_iterator("/proc/self/task"),
                      std::filesystem::directory_iterator()));
}

/// Frames and blocks that were given to the library: with aborts from everywhere nobody knows when
/// one is free again, so each is used once.
class Handouts {
  public:
    struct FrameBuffer {
        Zentara_Frame frame{};
        std::vector<std::uint8_t> pixels;
    };

    Zentara_Frame* MakeFrame() {
        auto buffer = std::make_unique<FrameBuffer>();
        buffer->pixels.resize(FrameBytesMax);
        buffer->frame.pBuffer = buffer->pixels.data();
        buffer->frame.bufferSize = FrameBytesMax;
        const std::lock_guard hold(mutex);
        return &frames.emplace_back(std::move(buffer))->frame;
    }
    Zentara_Settings* Keep(const Zentara_Settings& block) {
        const std::lock_guard hold(mutex);
        return &blocks.emplace_back(block);
    }

  private:
    std::mutex mutex;
    std::vector<std::unique_ptr<FrameBuffer>> frames;
    std::deque<Zentara_Settings> blocks;
};

struct StressedCamera {
    ZentaraHandle handle{};
    Handouts* handouts = nullptr;
    Zentara_Settings start{};
    std::atomic<std::uint64_t> exposures{0}, delivered{0}, changes{0};
    std::atomic<int> refills{0};  ///< Frames that callbacks may still queue.
};

/// A frame's callback may queue the next one.
void Serve(std::uint64_t userPrivate, std::uint32_t, std::uint32_t, std::uint32_t flags) {
    auto& camera = *reinterpret_cast<StressedCamera*>(static_cast<std::uintptr_t>(userPrivate));
    if (flags == zcbExposeDone) {
        ++camera.exposures;
        return;
    }
    ++camera.delivered;
    if (camera.refills.fetch_sub(1) <= 0) return;
    (void)Zentara_QueueFrame(camera.handle, camera.handouts->MakeFrame(), Serve,
                             zcbFrameDone | zcbExposeDone, userPrivate, 0);
}

void ServeChange(std::uint64_t userPrivate, std::uint32_t, std::uint32_t, std::uint32_t) {
    ++reinterpret_cast<StressedCamera*>(static_cast<std::uintptr_t>(userPrivate))->changes;
}

/// One of the four: it draws its steps from a generator of its own.
class Client {
  public:
    Client(std::array<StressedCamera, Cameras>& stressed, std::uint64_t seed)
        : cameras(stressed), random(static_cast<std::mt19937::result_type>(seed)) {}

    void TakeStep() {
        using Step = void (Client::*)(StressedCamera&);
        // Those that a client calls often stand more than once.
        static constexpr Step Steps[] = {
            &Client::QueueFrame,  &Client::QueueFrame,    &Client::QueueFrame,
            &Client::QueueFrame,  &Client::QueueSettings, &Client::QueueSettings,
            &Client::Send,        &Client::SendGeometry,  &Client::Switch,
            &Client::SwitchOn,    &Client::SwitchOn,      &Client::Abort,
            &Client::Grab,        &Client::Trigger,       &Client::Read,
            &Client::Ask,         &Client::Preflight,     &Client::AskForTexts,
            &Client::ProcessGrab, &Client::Expose,        &Client::Balance};
        StressedCamera& camera = cameras[random() % Cameras];
        (this->*Steps[random() % std::size(Steps)])(camera);
    }

  private:
    Zentara_Settings Change(const StressedCamera& camera) {
        Zentara_Settings block = camera.start;
        SetWide(block, zprm64Exposure, 1000000 * (1 + random() % 5));
        SetSigned(block, zprmS32AbsoluteOffset, static_cast<std::int32_t>(random() % 60));
        return block;
    }
    void QueueFrame(StressedCamera& camera) {
        camera.refills = static_cast<int>(random() % 8);
        const ZentaraResult result = Zentara_QueueFrame(
            camera.handle, camera.handouts->MakeFrame(), Serve,
            random() % 2 != 0 ? zcbFrameDone | zcbExposeDone : zcbFrameDone, GetPrivate(camera), 0);
        EXPECT_TRUE(result == zerrNone || result == zerrQueueFull) << GetZerrName(result);
    }
    void QueueSettings(StressedCamera& camera) {
        const ZentaraResult result =
            Zentara_QueueSettings(camera.handle, camera.handouts->Keep(Change(camera)), ServeChange,
                                  zcbFrameDone, GetPrivate(camera), 0);
        // A change of the geometry by another client makes the block one that does not fit.
        EXPECT_TRUE(result == zerrNone || result == zerrQueueFull || result == zerrBadSettings)
            << GetZerrName(result);
    }
    void Send(StressedCamera& camera) {
        Zentara_Settings block = Change(camera);
        EXPECT_ZERR(zerrNone, Zentara_SendSettingsToCam(camera.handle, &block));
    }
    void SendGeometry(StressedCamera& camera) {
        Zentara_Settings block = Change(camera);
        SetWord(block, zprmRoiX, 8 * (random() % 2));
        SetWord(block, zprmRoiY, 8 * (random() % 2));
        SetWord(block, zprmRoiWidth, 32);
        SetWord(block, zprmRoiHeight, 24);
        EXPECT_ZERR(zerrNone, Zentara_SendSettingsToCam(camera.handle, &block));
    }
    void Switch(StressedCamera& camera) {
        EXPECT_ZERR(zerrNone, Zentara_SetStreaming(camera.handle, random() % 2));
    }
    void SwitchOn(StressedCamera& camera) {
        EXPECT_ZERR(zerrNone, Zentara_SetStreaming(camera.handle, 1));
    }
    void Abort(StressedCamera& camera) { EXPECT_ZERR(zerrNone, Zentara_Abort(camera.handle)); }
    Zentara_Frame* GrabInto(StressedCamera& camera) {
        Zentara_Frame* frame = camera.handouts->MakeFrame();
        const ZentaraResult result = Zentara_GrabFrame(camera.handle, frame);
        // No image: the rescue, or another client, has aborted.
        EXPECT_TRUE(result == zerrNone || result == zerrBusy || result == zerrDriverFault)
            << GetZerrName(result);
        return result == zerrNone ? frame : nullptr;
    }
    void Grab(StressedCamera& camera) { (void)GrabInto(camera); }
    void Trigger(StressedCamera& camera) {
        const ZentaraResult result = Zentara_Trigger(camera.handle);
        EXPECT_TRUE(result == zerrNotStreaming || result == zerrNotSupported)
            << GetZerrName(result);
    }
    void Read(StressedCamera& camera) {
        Zentara_Settings block{};
        EXPECT_ZERR(zerrNone, Zentara_ReadSettingsFromCam(camera.handle, &block));
        EXPECT_ZERR(zerrNone, Zentara_ReadDefaultSettings(camera.handle, &block));
    }
    void Ask(StressedCamera& camera) {
        std::uint32_t value = 0;
        for (std::uint32_t key = 0; key < 24; ++key) {
            (void)Zentara_GetInfo(camera.handle, key, &value);  // not every key has an answer
            (void)Zentara_IsParamSupported(camera.handle, key);
        }
        Zentara_Settings block = camera.start;
        (void)Zentara_GetParamMax(&block, zprmRoiWidth, &value);
    }
    void Preflight(StressedCamera& camera) {
        Zentara_Settings block = Change(camera);
        EXPECT_ZERR(zerrNone, Zentara_PreflightSettings(camera.handle, &block));
    }
    void AskForTexts(StressedCamera& camera) {
        std::array<char, 64> text{};
        EXPECT_ZERR(zerrNone, Zentara_GetSerialString(camera.handle, text.data(), text.size()));
        EXPECT_ZERR(zerrNone,
                    Zentara_GetCameraModelString(camera.handle, text.data(), text.size()));
    }
    void ProcessGrab(StressedCamera& camera) {
        Zentara_Frame* frame = GrabInto(camera);
        if (frame == nullptr) return;
        Zentara_Settings block = Change(camera);
        (void)Zentara_PostProcessSingleFrame(camera.handle, &block, frame,
                                             camera.handouts->MakeFrame());
    }
    // They grab image after image; a client that ends the stream, or aborts, ends them with a code.
    void Expose(StressedCamera& camera) {
        if (random() % 4 != 0) return;
        Zentara_Settings block = Change(camera);
        (void)Zentara_AutoExpose(&block, 0, 0, 16, 16);
    }
    void Balance(StressedCamera& camera) {
        if (random() % 4 != 0) return;
        Zentara_Settings block = Change(camera);
        (void)Zentara_WhiteBalance(&block, 0, 0, 16, 16);
    }
    static std::uint64_t GetPrivate(StressedCamera& camera) {
        return reinterpret_cast<std::uintptr_t>(&camera);
    }

    std::array<StressedCamera, Cameras>& cameras;
    std::mt19937 random;
};

class Stress : public testing::TestWithParam<std::uint64_t> {
  protected:
    void Open() {
        EXPECT_ZERR(zerrNone, Zentara_LoadDriver());
        std::array<Zentara_CamListItem, Cameras> items{};
        std::uint32_t length = Cameras;
        ASSERT_ZERR(zerrNone, Zentara_ListCameras(items.data(), &length));
        ASSERT_EQ(Cameras, length);
        for (std::size_t i = 0; i < Cameras; ++i) {
            cameras[i].handouts = &handouts;
            ASSERT_ZERR(zerrNone, Zentara_OpenCamera(items[i].cameraId, &cameras[i].handle));
            ASSERT_ZERR(zerrNone,
                        Zentara_ReadSettingsFromCam(cameras[i].handle, &cameras[i].start));
            ASSERT_ZERR(zerrNone, Zentara_SetStreaming(cameras[i].handle, 1));
        }
    }
    /// Steps of all clients; aborts rescue those whose image will not come.
    void Run(std::uint64_t seed, std::uint64_t steps) {
        std::atomic<std::uint64_t> taken{0};
        std::atomic<std::size_t> working{Clients};
        std::vector<std::thread> threads;
        for (std::size_t i = 0; i < Clients; ++i) {
            threads.emplace_back([&, i] {
                Client client(cameras, seed * Clients + i);
                for (std::uint64_t step = 0; step < steps; ++step, ++taken) client.TakeStep();
                --working;
            });
        }
        auto lastStep = std::chrono::steady_clock::now();
        while (working != 0) {
            const std::uint64_t before = taken;
            if (WaitUntil([&] { return working == 0 || taken != before; }, RescueStep)) {
                lastStep = std::chrono::steady_clock::now();
                continue;
            }
            for (StressedCamera& camera : cameras) {
                EXPECT_ZERR(zerrNone, Zentara_Abort(camera.handle));
            }
            if (std::chrono::steady_clock::now() - lastStep < StuckAfter) continue;
            std::printf("seed %llu: stuck after %llu steps\n",
                        static_cast<unsigned long long>(seed),
                        static_cast<unsigned long long>(taken.load()));
            std::fflush(stdout);
            std::abort();  // Threads that hang cannot be joined.
        }
        for (std::thread& thread : threads) thread.join();
    }
    static void ExpectWorking(StressedCamera& camera) {
        EXPECT_ZERR(zerrNone, Zentara_Abort(camera.handle));
        EXPECT_ZERR(zerrNone, Zentara_SetStreaming(camera.handle, 0));
        EXPECT_ZERR(zerrNone, Zentara_SendSettingsToCam(camera.handle, &camera.start));
        EXPECT_ZERR(zerrNone, Zentara_SetStreaming(camera.handle, 1));
        const std::uint64_t before = camera.delivered;
        camera.refills = 4;
        EXPECT_ZERR(zerrNone,
                    Zentara_QueueFrame(camera.handle, camera.handouts->MakeFrame(), Serve,
                                       zcbFrameDone, reinterpret_cast<std::uintptr_t>(&camera), 0));
        EXPECT_TRUE(WaitUntil([&] { return camera.delivered >= before + 5; }, 30s));
        EXPECT_ZERR(zerrNone, Zentara_SetStreaming(camera.handle, 0));
        EXPECT_ZERR(zerrNone, Zentara_GrabFrame(camera.handle, camera.handouts->MakeFrame()));
    }
    /// Every frame is accounted for; a stop may leave one of two in the queue.
    static void ExpectLedgerClosed(const StressedCamera& camera) {
        const StreamCounters& counters =
            reinterpret_cast<ZCamera*>(camera.handle)->GetStreamCounters();
        const std::uint64_t fates = counters.delivered.GetSum() + counters.heldBack.Get() +
                                    counters.dropped.Get() + counters.bad.Get() +
                                    counters.cleared.Get();
        EXPECT_LE(fates, counters.begun.Get());
        EXPECT_GE(fates + 1, counters.begun.Get());
        EXPECT_GE(counters.delivered.GetSum() - counters.withoutTaker.GetSum(),
                  camera.delivered.load());
    }

    Handouts handouts;
    std::array<StressedCamera, Cameras> cameras;
};

TEST_P(Stress, FourClientsMayCallEverythingAtOnceOnTwoCameras) {
    const std::uint64_t seed = ReadNumber("ZENTARA_STRESS_SEED", GetParam());
    const std::uint64_t steps = ReadNumber("ZENTARA_STRESS_STEPS", 150);
    RecordProperty("seed", std::to_string(seed));
    SCOPED_TRACE("seed " + std::to_string(seed));
    SimulationWorld world(Scenario);
    const std::size_t threadsBefore = CountThreads();
    ASSERT_NO_FATAL_FAILURE(Open());

    DelaySeam(seed);
    Run(seed, steps);
    DelaySeam(0);

    EXPECT_NE(0U, CountSeamDelays());
    for (StressedCamera& camera : cameras) {
        EXPECT_NE(0U, camera.delivered);
        EXPECT_NE(0U, camera.exposures);
        ExpectWorking(camera);
        ExpectLedgerClosed(camera);
        std::printf("seed %llu: %llu exposures, %llu frames, %llu changes, %llu delays\n",
                    static_cast<unsigned long long>(seed),
                    static_cast<unsigned long long>(camera.exposures.load()),
                    static_cast<unsigned long long>(camera.delivered.load()),
                    static_cast<unsigned long long>(camera.changes.load()),
                    static_cast<unsigned long long>(CountSeamDelays()));
        EXPECT_ZERR(zerrNone, Zentara_CloseCamera(camera.handle));
    }
    const ZentaraSimulationState state = world.GetState(0xFFFFFFFF);
    EXPECT_EQ(0U, state.openHandles);
    EXPECT_EQ(0U, state.reservedChannels + state.reservedBandwidths + state.reservedResources);
    EXPECT_EQ(0U, state.attachedBuffers + state.pendedRequests);
    Zentara_ReleaseDriver();
    EXPECT_TRUE(WaitUntil([&] { return CountThreads() <= threadsBefore; })) << CountThreads();
}

INSTANTIATE_TEST_SUITE_P(Seeds, Stress, testing::Values(1U, 2U, 3U));

}  // namespace
}  // namespace ZV::Test
