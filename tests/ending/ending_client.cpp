#include <array>
#include <atomic>
#include <cstdlib>
#include <cstring>
#include <thread>
#include <vector>

#include "ending/ending_way.h"
#include "simulation/zentara_simulation.h"
#include "zentara/zentara.h"

// A client that ends at a moment that it is told, in a way that it is told, and gives nothing back:
// `ending-client REQUESTS WAY`. One thread uses the library over and over; the process ends when
// the simulated driver has served so many requests. A byte on standard output tells the moment.
namespace ZV::Test {
namespace {

constexpr std::uint32_t BufferBytes = 160 * 120;
constexpr std::size_t FramesQueued = 4;

const EndingWay* way = nullptr;
std::atomic<EndPlace> endsIn{EndPlace::Elsewhere};
std::atomic<std::uint32_t> delivered{0};

std::uint32_t CountRequests() {
    ZentaraSimulationState state{};
    (void)ZentaraSimulation_GetState(0xFFFFFFFF, &state);  // zeros before the bus begins
    return state.requestsServed;
}

const EndingWay* FindEndingWay(const char* name) {
    for (const EndingWay& each : GetEndingWays()) {
        if (std::strcmp(each.name, name) == 0) return &each;
    }
    return nullptr;
}

/// Tells, once, that the end comes now.
void TellEnd() {
    static std::atomic<bool> isTold{false};
    if (!isTold.exchange(true)) WriteMark();
}

void EndHere(EndPlace place) {
    if (endsIn != place) return;
    TellEnd();
    way->end();
}

void Serve(std::uint64_t, std::uint32_t, std::uint32_t, std::uint32_t flags) {
    if (flags == zcbExposeDone) return EndHere(EndPlace::ExposureCallback);
    ++delivered;
    EndHere(EndPlace::FrameCallback);
}

void ServeSettings(std::uint64_t, std::uint32_t, std::uint32_t, std::uint32_t) {
    EndHere(EndPlace::SettingsCallback);
}

struct Frames {
    std::array<Zentara_Frame, FramesQueued + 1> records{};
    std::vector<std::uint8_t> pixels = std::vector<std::uint8_t>(records.size() * BufferBytes);

    Frames() {
        for (std::size_t i = 0; i < records.size(); ++i) {
            records[i].pBuffer = pixels.data() + i * BufferBytes;
            records[i].bufferSize = BufferBytes;
        }
    }
};

void SendTriggerMode(ZentaraHandle handle, std::uint32_t mode) {
    Zentara_Settings settings{};
    (void)Zentara_ReadSettingsFromCam(handle, &settings);
    (void)Zentara_SetParam(&settings, zprmTriggerType, mode);
    (void)Zentara_SendSettingsToCam(handle, &settings);
}

void StreamOnce(ZentaraHandle handle, Frames& frames) {
    const std::uint32_t before = delivered;
    for (std::size_t i = 0; i < FramesQueued; ++i) {
        (void)Zentara_QueueFrame(handle, &frames.records[i], Serve, zcbFrameDone | zcbExposeDone, 0,
                                 0);
    }
    (void)Zentara_SetStreaming(handle, 1);
    while (delivered < before + FramesQueued) std::this_thread::yield();
    Zentara_Settings settings{};
    (void)Zentara_ReadSettingsFromCam(handle, &settings);
    (void)Zentara_QueueSettings(handle, &settings, ServeSettings, zcbFrameDone, 0, 0);
    (void)Zentara_SendSettingsToCam(handle, &settings);
    (void)Zentara_SetStreaming(handle, 0);
    (void)Zentara_GrabFrame(handle, &frames.records[FramesQueued]);
}

void TriggerOnce(ZentaraHandle handle, Frames& frames) {
    SendTriggerMode(handle, ztrigSoftware);
    (void)Zentara_SetStreaming(handle, 1);
    if (endsIn == EndPlace::TriggerWait) {
        std::thread([] { EndHere(EndPlace::TriggerWait); }).detach();
        (void)Zentara_GrabFrame(handle, &frames.records[FramesQueued]);
    }
    const std::uint32_t before = delivered;
    (void)Zentara_QueueFrame(handle, &frames.records[0], Serve, zcbFrameDone, 0, 0);
    (void)Zentara_Trigger(handle);
    while (delivered == before) std::this_thread::yield();
    (void)Zentara_SetStreaming(handle, 0);
    SendTriggerMode(handle, ztrigFreeRun);
}

[[noreturn]] void UseLibrary() {
    // Never freed: the library fills it for as long as the process lives.
    static Frames& frames = *new Frames;
    (void)Zentara_LoadDriver();
    for (;;) {
        Zentara_CamListItem item{};
        std::uint32_t length = 1;
        ZentaraHandle handle{};
        (void)Zentara_ListCameras(&item, &length);
        if (Zentara_OpenCamera(item.cameraId, &handle) != zerrNone) std::_Exit(4);
        for (int round = 0; round < 3; ++round) StreamOnce(handle, frames);
        TriggerOnce(handle, frames);
        (void)Zentara_CloseCamera(handle);
    }
}

int EndAfter(std::uint32_t requests) {
    std::thread(UseLibrary).detach();
    while (CountRequests() < requests) std::this_thread::yield();
    if (way->place != EndPlace::Elsewhere) {
        endsIn = way->place;
        RestForEver();
    }
    TellEnd();
    way->end();
    return 0;
}

}  // namespace
}  // namespace ZV::Test

#ifdef __SANITIZE_THREAD__
/// Settings of the thread sanitizer's runtime. A process that ends without a release leaves threads
/// behind.
extern "C" [[gnu::visibility("default")]] const char*
__tsan_default_options() {  // NOLINT(bugprone-reserved-identifier)
    return "report_thread_leaks=0";
}
#endif

int main(int count, char** arguments) {
    using namespace ZV::Test;
    if (count != 3) return 2;
    way = FindEndingWay(arguments[2]);
    if (way == nullptr) return 2;
    return EndAfter(static_cast<std::uint32_t>(std::strtoul(arguments[1], nullptr, 10)));
}
