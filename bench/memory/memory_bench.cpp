// Memory that the library holds for one open colour camera of 4008 x 2672 pixels: after the open,
// while it streams, and while it streams with post-processing. `perFrame` is how often it allocates
// for a frame.

#include <benchmark/benchmark.h>

#include <algorithm>
#include <atomic>
#include <cstdlib>
#include <vector>

#include "memory/tracked_allocator.h"
#include "zentara/zentara.h"

namespace ZV::Bench {
namespace {

constexpr std::uint32_t Width = 4008;
constexpr std::uint32_t Height = 2672;
constexpr std::uint32_t Depth = 2;
constexpr double Mebibyte = 1024.0 * 1024.0;

/// The camera, and frames of its own that circulate: each callback queues its frame again.
class LargeCamera {
  public:
    LargeCamera() : before(GetAllocations()) {
        setenv("ZENTARA_SIMULATION", "large", 1);
        isReady = Open();
    }
    ~LargeCamera() {
        isStopping = true;
        Zentara_ReleaseDriver();
        unsetenv("ZENTARA_SIMULATION");
    }
    LargeCamera(const LargeCamera&) = delete;
    LargeCamera& operator=(const LargeCamera&) = delete;

    bool IsReady() const { return isReady; }
    bool Start(bool postProcesses, std::uint32_t format) {
        Zentara_Settings settings{};
        if (Zentara_ReadSettingsFromCam(handle, &settings) != zerrNone) return false;
        if (Zentara_SetParam(&settings, zprmDoPostProcessing, postProcesses) != zerrNone)
            return false;
        if (Zentara_SetParam(&settings, zprmPostProcessImageFormat, format) != zerrNone)
            return false;
        if (Zentara_SendSettingsToCam(handle, &settings) != zerrNone) return false;
        for (Frame& frame : frames) {
            if (Queue(frame) != zerrNone) return false;
        }
        return Zentara_SetStreaming(handle, 1) == zerrNone;
    }
    void WaitForNext() {
        const std::uint64_t last = seen;
        served.wait(last);
        seen = last + 1;
    }
    /// What the library holds more than before the open, without the client's own frames.
    double GetHeldMebibytes() const {
        const std::uint64_t held = GetAllocations().heldBytes - before.heldBytes;
        return static_cast<double>(held - clientBytes) / Mebibyte;
    }

  private:
    struct Frame {
        LargeCamera* owner = nullptr;
        Zentara_Frame record{};
        std::vector<std::uint8_t> pixels;
    };

    bool Open() {
        Zentara_CamListItem item{};
        std::uint32_t length = 1;
        if (Zentara_LoadDriver() != zerrNone) return false;
        if (Zentara_ListCameras(&item, &length) != zerrNone || length == 0) return false;
        if (Zentara_OpenCamera(0, &handle) != zerrNone) return false;
        for (Frame& frame : frames) {
            frame.owner = this;
            frame.pixels.resize(std::size_t{Width} * Height * 6);
            frame.record.pBuffer = frame.pixels.data();
            frame.record.bufferSize = static_cast<std::uint32_t>(frame.pixels.size());
            clientBytes += frame.pixels.size();
        }
        return true;
    }
    ZentaraResult Queue(Frame& frame) {
        return Zentara_QueueFrame(handle, &frame.record, &Serve, zcbFrameDone,
                                  reinterpret_cast<std::uintptr_t>(&frame), 0);
    }
    static void Serve(std::uint64_t userPrivate, std::uint32_t, std::uint32_t, std::uint32_t) {
        auto& frame = *reinterpret_cast<Frame*>(static_cast<std::uintptr_t>(userPrivate));
        LargeCamera& self = *frame.owner;
        if (!self.isStopping) (void)self.Queue(frame);
        ++self.served;
        self.served.notify_all();
    }

    Allocations before;
    bool isReady = false;
    ZentaraHandle handle = 0;
    Frame frames[Depth];
    std::uint64_t clientBytes = 0;
    std::uint64_t seen = 0;
    std::atomic<std::uint64_t> served{0};
    std::atomic<bool> isStopping{false};
};

void HoldOpenCamera(benchmark::State& state) {
    LargeCamera camera;
    if (!camera.IsReady()) {
        state.SkipWithError("the camera does not open");
        return;
    }
    for (auto _ : state) benchmark::ClobberMemory();
    state.counters["MiB"] = camera.GetHeldMebibytes();
}
BENCHMARK(HoldOpenCamera)->Iterations(1);

void HoldStreamingCamera(benchmark::State& state, bool postProcesses, std::uint32_t format) {
    LargeCamera camera;
    if (!camera.IsReady() || !camera.Start(postProcesses, format)) {
        state.SkipWithError("the camera does not stream");
        return;
    }
    for (std::uint32_t i = 0; i < 2 * Depth; ++i) camera.WaitForNext();
    const std::uint64_t before = GetAllocations().count;
    double most = 0.0;
    for (auto _ : state) {
        camera.WaitForNext();
        most = std::max(most, camera.GetHeldMebibytes());
    }
    const auto taken = static_cast<double>(GetAllocations().count - before);
    state.counters["MiB"] = most;
    state.counters["perFrame"] = taken / static_cast<double>(state.iterations());
}
BENCHMARK_CAPTURE(HoldStreamingCamera, raw, false, zfmtRGB24)->Iterations(20)->UseRealTime();
BENCHMARK_CAPTURE(HoldStreamingCamera, RGB24, true, zfmtRGB24)->Iterations(20)->UseRealTime();
BENCHMARK_CAPTURE(HoldStreamingCamera, BGRX32, true, zfmtBGRX32)->Iterations(20)->UseRealTime();

}  // namespace
}  // namespace ZV::Bench
