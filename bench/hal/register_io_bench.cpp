// One register read and one write through the HAL. The counter `ratio` is their time over that of a
// bare control request to a simulated driver of the same kind, measured in turns. All threads stay
// on one processor: whether a simulated driver's thread answers beside the caller or from another
// processor would else outweigh everything that is compared.

#include <benchmark/benchmark.h>
#include <sched.h>

#include <algorithm>
#include <chrono>
#include <condition_variable>
#include <cstdint>
#include <cstdlib>
#include <mutex>
#include <string>
#include <vector>

#include "hal/fw_camera_records.h"
#include "hal/hal.h"
#include "hal/platform/kernel_driver.h"
#include "hal/platform/last_error.h"

extern "C" const ZV::KernelDriver* ZentaraSimulation_GetKernelDriver(std::uint32_t version);

namespace ZV {
namespace {

using Clock = std::chrono::steady_clock;

constexpr char Scenario[] = "mono";
constexpr std::uint32_t PrimaryIdAddress = 0xE0010038;
constexpr std::uint32_t SecondaryIdAddress = 0xE0001138;
constexpr std::uint32_t RegisterAddress = 0xD0002010;

/// Keeps this thread, and those that it makes, on one processor for the length of a block.
class OneProcessor {
  public:
    OneProcessor() {
        sched_getaffinity(0, sizeof former, &former);
        cpu_set_t here;
        CPU_ZERO(&here);
        CPU_SET(sched_getcpu(), &here);
        sched_setaffinity(0, sizeof here, &here);
    }
    ~OneProcessor() { sched_setaffinity(0, sizeof former, &former); }
    OneProcessor(const OneProcessor&) = delete;
    OneProcessor& operator=(const OneProcessor&) = delete;

  private:
    cpu_set_t former;
};

/// A camera of the library's own simulation, connected.
class ConnectedCamera {
  public:
    ConnectedCamera() {
        setenv("ZENTARA_SIMULATION", Scenario, 1);
        std::uint32_t count = 0;
        if (HAL_CameraGetList(&list, PrimaryIdAddress, SecondaryIdAddress, 1, &count) != HALOk) {
            return;
        }
        isReady = count == 1 && HAL_CameraConnect(list, 100, nullptr, nullptr, nullptr, nullptr,
                                                  nullptr, nullptr) == HALOk;
    }
    ~ConnectedCamera() {
        if (list != nullptr) {
            (void)HAL_CameraDisconnect(list);
            (void)HAL_CameraRelease(list);
        }
        (void)HAL_MemoryFree(list);
        (void)HAL_Close();
        unsetenv("ZENTARA_SIMULATION");
    }
    ConnectedCamera(const ConnectedCamera&) = delete;
    ConnectedCamera& operator=(const ConnectedCamera&) = delete;

    bool IsReady() const { return isReady; }
    bool Read() { return HAL_CameraReadData(list, RegisterAddress, &value, 1) == HALOk; }
    bool Write() { return HAL_CameraWriteData(list, RegisterAddress, &value, 1) == HALOk; }

  private:
    HALCamera* list = nullptr;
    bool isReady = false;
    std::uint32_t value = 0;
};

/// The first device of a driver, with one request that is made over and over.
class BareDevice {
  public:
    BareDevice() : driver(*ZentaraSimulation_GetKernelDriver(KernelDriverVersion)) {
        char path[512] = {};
        void* list = nullptr;
        std::uint32_t bytes = 0;
        if (driver.begin(Scenario, nullptr, 0) != 0 || driver.openList(&list) != 0) return;
        if (driver.getDetail(list, 0, path, sizeof path, &bytes) != 0 ||
            driver.open(path, &handle) != 0) {
            handle = nullptr;
        }
        driver.closeList(list);
    }
    ~BareDevice() {
        if (handle != nullptr) driver.close(handle);
        driver.end();
    }
    BareDevice(const BareDevice&) = delete;
    BareDevice& operator=(const BareDevice&) = delete;

    bool IsReady() const { return handle != nullptr; }
    bool Read() {
        const AsyncReadRecord record = MakeAsyncReadRecord(RegisterAddress, 1);
        return Send(FW_IOCTL_ASYNC_READ, &record, sizeof record, &value, sizeof value);
    }
    bool Write() {
        std::uint8_t record[AsyncWriteExtraBytes + sizeof value];
        FillAsyncWriteRecord(record, RegisterAddress, &value, 1);
        return Send(FW_IOCTL_ASYNC_WRITE, record, sizeof record, nullptr, 0);
    }

  private:
    struct Request : KernelRequest {
        std::mutex mutex;
        std::condition_variable ended;
        bool isEnded = false;
        std::uint32_t error = 0;
    };

    static void Complete(KernelRequest* request, std::uint32_t error, std::uint32_t) {
        auto& own = *static_cast<Request*>(request);
        const std::lock_guard guard(own.mutex);
        own.error = error;
        own.isEnded = true;
        own.ended.notify_all();
    }

    bool Send(std::uint32_t code, const void* input, std::uint32_t inputBytes, void* output,
              std::uint32_t outputBytes) {
        Request request;
        static_cast<KernelRequest&>(request) = {code,        inputBytes, input,   output,
                                                outputBytes, 1,          Complete};
        std::uint32_t bytes = 0;
        if (driver.control(handle, &request, &bytes) != PlatformErrorIoPending) return false;
        std::unique_lock lock(request.mutex);
        request.ended.wait(lock, [&] { return request.isEnded; });
        return request.error == PlatformErrorNone;
    }

    const KernelDriver& driver;
    void* handle = nullptr;
    std::uint32_t value = 0;
};

template <typename Device>
double MeasureSeconds(Device& device, bool (Device::*access)(), bool* isGood) {
    const auto begin = Clock::now();
    *isGood &= (device.*access)();
    return std::chrono::duration<double>(Clock::now() - begin).count();
}

double GetMedian(std::vector<double> values) {
    const auto middle = values.begin() + static_cast<std::ptrdiff_t>(values.size() / 2);
    std::nth_element(values.begin(), middle, values.end());
    return *middle;
}

void AccessRegister(benchmark::State& state, bool (ConnectedCamera::*access)(),
                    bool (BareDevice::*bareAccess)()) {
    const OneProcessor processor;
    ConnectedCamera camera;
    BareDevice bare;
    bool isGood = camera.IsReady() && bare.IsReady();
    if (!isGood) return state.SkipWithError("no simulated camera");
    std::vector<double> seconds;
    std::vector<double> bareSeconds;
    for (auto _ : state) {
        bareSeconds.push_back(MeasureSeconds(bare, bareAccess, &isGood));
        seconds.push_back(MeasureSeconds(camera, access, &isGood));
        state.SetIterationTime(seconds.back());
    }
    if (!isGood) return state.SkipWithError("an access failed");
    state.counters["hal_us"] = GetMedian(seconds) * 1e6;
    state.counters["bare_us"] = GetMedian(bareSeconds) * 1e6;
    state.counters["ratio"] = GetMedian(seconds) / GetMedian(bareSeconds);
}

BENCHMARK_CAPTURE(AccessRegister, read, &ConnectedCamera::Read, &BareDevice::Read)
    ->UseManualTime()
    ->Unit(benchmark::kMicrosecond);
BENCHMARK_CAPTURE(AccessRegister, write, &ConnectedCamera::Write, &BareDevice::Write)
    ->UseManualTime()
    ->Unit(benchmark::kMicrosecond);

}  // namespace
}  // namespace ZV
