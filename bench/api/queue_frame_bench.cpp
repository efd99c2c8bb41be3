// From Zentara_QueueFrame to the callback while the simulated camera sends as fast as its ring is
// supplied. The counter `ratio` is the time of a frame over that of memcpy of the same bytes,
// measured in turns.

#include <benchmark/benchmark.h>

#include <atomic>
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <memory>
#include <string>
#include <thread>
#include <vector>

#include "zentara/zentara.h"

namespace ZV {
namespace {

using Clock = std::chrono::steady_clock;

constexpr std::uint32_t Depth = 10;

/// A camera of the given size without noise, open and streaming, and frames that circulate: each
/// callback queues its frame again.
class Circulation {
  public:
    Circulation(std::int64_t width, std::int64_t height)
        : scenario(std::filesystem::temp_directory_path() / "zentara-queue-bench.json") {
        std::ofstream(scenario) << R"({"base": "mono", "timeScale": 0, "cameras": [{"scene":
            {"kind": "flat"}, "sensor": {"noise": false, "width": )"
                                << width << R"(, "height": )" << height << "}}]}";
        setenv("ZENTARA_SIMULATION", scenario.c_str(), 1);
        isReady = Open();
    }
    ~Circulation() {
        isStopping = true;
        Zentara_ReleaseDriver();
        unsetenv("ZENTARA_SIMULATION");
        std::error_code ignored;
        std::filesystem::remove(scenario, ignored);
    }
    Circulation(const Circulation&) = delete;
    Circulation& operator=(const Circulation&) = delete;

    bool IsReady() const { return isReady; }
    std::uint32_t GetFrameBytes() const { return frameBytes; }
    ZentaraHandle GetHandle() const { return handle; }
    Zentara_Frame* GetFrame() { return &frames[0].record; }

    bool Start() {
        for (Frame& frame : frames) {
            if (Queue(frame) != zerrNone) return false;
        }
        return Zentara_SetStreaming(handle, 1) == zerrNone;
    }
    /// Waits until one more frame has been served.
    void WaitForNext() {
        const std::uint64_t before = seen;
        served.wait(before);
        seen = before + 1;
    }
    std::uint64_t CountBad() const { return bad; }

  private:
    struct Frame {
        Circulation* owner = nullptr;
        Zentara_Frame record{};
        std::vector<std::uint8_t> pixels;
    };

    bool Open() {
        Zentara_CamListItem item{};
        std::uint32_t length = 1;
        if (Zentara_LoadDriver() != zerrNone) return false;
        if (Zentara_ListCameras(&item, &length) != zerrNone || length == 0) return false;
        if (Zentara_OpenCamera(0, &handle) != zerrNone) return false;
        if (Zentara_GetInfo(handle, zinfImageSize, &frameBytes) != zerrNone) return false;
        for (Frame& frame : frames) {
            frame.owner = this;
            frame.pixels.resize(frameBytes);
            frame.record.pBuffer = frame.pixels.data();
            frame.record.bufferSize = frameBytes;
        }
        return true;
    }
    ZentaraResult Queue(Frame& frame) {
        return Zentara_QueueFrame(handle, &frame.record, &Serve, zcbFrameDone,
                                  reinterpret_cast<std::uintptr_t>(&frame), 0);
    }
    static void Serve(std::uint64_t userPrivate, std::uint32_t, std::uint32_t errorCode,
                      std::uint32_t) {
        auto& frame = *reinterpret_cast<Frame*>(static_cast<std::uintptr_t>(userPrivate));
        Circulation& self = *frame.owner;
        if (errorCode != zerrNone) ++self.bad;
        if (!self.isStopping) (void)self.Queue(frame);
        ++self.served;
        self.served.notify_all();
    }

    std::filesystem::path scenario;
    bool isReady = false;
    ZentaraHandle handle = 0;
    std::uint32_t frameBytes = 0;
    Frame frames[Depth];
    std::uint64_t seen = 0;
    std::atomic<std::uint64_t> served{0};
    std::atomic<std::uint64_t> bad{0};
    std::atomic<bool> isStopping{false};
};

double MeasureCopySeconds(std::uint32_t bytes) {
    const std::vector<std::uint8_t> from(bytes, 0x5A);
    std::vector<std::uint8_t> to(bytes);
    constexpr int Rounds = 20;
    const Clock::time_point start = Clock::now();
    for (int round = 0; round < Rounds; ++round) {
        std::memcpy(to.data(), from.data(), bytes);
        benchmark::DoNotOptimize(to.data());
        benchmark::ClobberMemory();
    }
    return std::chrono::duration<double>(Clock::now() - start).count() / Rounds;
}

void DeliverFrames(benchmark::State& state) {
    Circulation camera(state.range(0), state.range(1));
    if (!camera.IsReady() || !camera.Start()) {
        state.SkipWithError("the camera does not stream");
        return;
    }
    camera.WaitForNext();
    const Clock::time_point start = Clock::now();
    for (auto _ : state) camera.WaitForNext();
    const double seconds = std::chrono::duration<double>(Clock::now() - start).count() /
                           static_cast<double>(state.iterations());
    state.SetItemsProcessed(state.iterations());
    state.SetBytesProcessed(state.iterations() * camera.GetFrameBytes());
    state.counters["ratio"] = seconds / MeasureCopySeconds(camera.GetFrameBytes());
    state.counters["bad"] = static_cast<double>(camera.CountBad());
}
BENCHMARK(DeliverFrames)
    ->Args({64, 48})
    ->Args({1392, 1040})
    ->Args({4008, 2672})
    ->UseRealTime()
    ->Unit(benchmark::kMicrosecond);

/// The call alone, on a camera that does not stream; the queue is emptied outside the measurement.
void QueueFrame(benchmark::State& state) {
    Circulation camera(64, 48);
    if (!camera.IsReady()) {
        state.SkipWithError("the camera does not open");
        return;
    }
    for (auto _ : state) {
        const ZentaraResult result =
            Zentara_QueueFrame(camera.GetHandle(), camera.GetFrame(), nullptr, 0, 0, 0);
        if (result == zerrNone) continue;
        state.PauseTiming();
        (void)Zentara_Abort(camera.GetHandle());
        state.ResumeTiming();
    }
}
BENCHMARK(QueueFrame);

}  // namespace
}  // namespace ZV
