#include <unistd.h>

#include <array>
#include <atomic>
#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <iterator>
#include <thread>
#include <vector>

#include "simulation/zentara_simulation.h"
#include "zentara/zentara.h"

// A client that ends at a moment that it is told, in a way that it is told, and gives nothing back:
// `ending-client REQUESTS WAY`. One thread uses the library over and over; the process ends when
// the simulated driver has served so many requests. A byte on standard output tells the moment.
namespace {

constexpr std::uint32_t BufferBytes = 160 * 120;
constexpr std::size_t FramesQueued = 4;

std::atomic<bool> endsInCallback{false};
std::atomic<std::uint32_t> delivered{0};

std::uint32_t CountRequests() {
    ZentaraSimulationState state{};
    (void)ZentaraSimulation_GetState(0xFFFFFFFF, &state);  // zeros before the bus begins
    return state.requestsServed;
}

void TellEnd() {
    static std::atomic<bool> isTold{false};
    if (isTold.exchange(true)) return;
    if (write(STDOUT_FILENO, "E", 1) != 1) _exit(3);
}

void ReturnFromMain() {}

void Exit() {
    std::exit(0);
}

void QuickExit() {
    std::quick_exit(0);
}

void ExitAtOnce() {
    _exit(0);
}

void Terminate() {
    (void)std::raise(SIGTERM);
}

/// The callback's thread ends the process, and this one waits for it.
void ExitInCallback() {
    endsInCallback = true;
    for (;;) (void)pause();
}

struct Way {
    const char* name;
    void (*end)();
};
constexpr Way Ways[] = {{"return", ReturnFromMain}, {"exit", Exit},
                        {"quickExit", QuickExit},   {"exitAtOnce", ExitAtOnce},
                        {"terminate", Terminate},   {"callback", ExitInCallback}};

void Serve(std::uint64_t, std::uint32_t, std::uint32_t, std::uint32_t) {
    ++delivered;
    if (!endsInCallback) return;
    TellEnd();
    std::exit(0);
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

void StreamOnce(ZentaraHandle handle, Frames& frames) {
    const std::uint32_t before = delivered;
    for (std::size_t i = 0; i < FramesQueued; ++i) {
        (void)Zentara_QueueFrame(handle, &frames.records[i], Serve, zcbFrameDone, 0, 0);
    }
    (void)Zentara_SetStreaming(handle, 1);
    while (delivered < before + FramesQueued) std::this_thread::yield();
    Zentara_Settings settings{};
    (void)Zentara_ReadSettingsFromCam(handle, &settings);
    (void)Zentara_SendSettingsToCam(handle, &settings);
    (void)Zentara_SetStreaming(handle, 0);
    (void)Zentara_GrabFrame(handle, &frames.records[FramesQueued]);
}

void UseLibrary() {
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
        (void)Zentara_CloseCamera(handle);
    }
}

}  // namespace

int main(int count, char** arguments) {
    if (count != 3) return 2;
    const auto moment = static_cast<std::uint32_t>(std::strtoul(arguments[1], nullptr, 10));
    for (const Way& way : Ways) {
        if (std::strcmp(way.name, arguments[2]) != 0) continue;
        std::thread(UseLibrary).detach();
        while (CountRequests() < moment) std::this_thread::yield();
        if (way.end != ExitInCallback) TellEnd();
        way.end();
        return 0;
    }
    return 2;
}
