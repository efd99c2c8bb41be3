// What the trace costs an exported call while the log is off: the call as it is exported, and the
// same body without its log calls, measured in turns. `difference_ns` is what one call pays.

#include <benchmark/benchmark.h>

#include <algorithm>
#include <chrono>
#include <cstdlib>
#include <vector>

#include "api/exported_call.h"
#include "camera/camera.h"
#include "diagnostics/log.h"
#include "imaging/image_formats.h"
#include "zentara/zentara.h"

namespace ZV {
namespace {

using Clock = std::chrono::steady_clock;

constexpr int CallsPerRound = 10000;

template <typename Call>
double MeasureCallNs(Call call) {
    const Clock::time_point start = Clock::now();
    for (int i = 0; i < CallsPerRound; ++i) {
        auto result = call();
        benchmark::DoNotOptimize(result);
    }
    const std::chrono::duration<double, std::nano> taken = Clock::now() - start;
    return taken.count() / CallsPerRound;
}

double TakeMedian(std::vector<double>& values) {
    std::sort(values.begin(), values.end());
    return values.empty() ? 0.0 : values[values.size() / 2];
}

template <typename Traced, typename Untraced>
void CompareCalls(benchmark::State& state, Traced traced, Untraced untraced) {
    setenv("ZENTARA_CONFIG", "/nonexistent/zentara.conf", 1);
    ZLogOpen();
    std::vector<double> tracedNs, untracedNs;
    for (auto _ : state) {
        tracedNs.push_back(MeasureCallNs(traced));
        untracedNs.push_back(MeasureCallNs(untraced));
    }
    unsetenv("ZENTARA_CONFIG");
    const double with = TakeMedian(tracedNs), without = TakeMedian(untracedNs);
    state.counters["traced_ns"] = with;
    state.counters["untraced_ns"] = without;
    state.counters["difference_ns"] = with - without;
}

/// The body of Zentara_RegisterUnpluggedCallback.
[[gnu::noinline]] ZentaraResult RegisterUntraced(ZentaraHandle, ZentaraUnpluggedCallback,
                                                 std::uint64_t) {
    return Guarded([] {
        return ZCamera::IsInitalized() ? ZentaraResult{zerrNone} : ZentaraResult{zerrNotLoaded};
    });
}

void CallWithStartAndEnd(benchmark::State& state) {
    CompareCalls(
        state, [] { return Zentara_RegisterUnpluggedCallback(0, nullptr, 0); },
        [] { return RegisterUntraced(0, nullptr, 0); });
}

/// The body of Zentara_is16bit.
[[gnu::noinline]] std::uint32_t Is16BitUntraced(std::uint32_t format) {
    return Is16Bit(format) ? 1 : 0;
}

void CallWithStartMessageAndEnd(benchmark::State& state) {
    CompareCalls(
        state, [] { return Zentara_is16bit(zfmtMono16); },
        [] { return Is16BitUntraced(zfmtMono16); });
}

BENCHMARK(CallWithStartAndEnd);
BENCHMARK(CallWithStartMessageAndEnd);

}  // namespace
}  // namespace ZV
