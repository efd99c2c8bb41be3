#include <fmt/format.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <atomic>
#include <charconv>
#include <chrono>
#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <memory>
#include <string>
#include <string_view>
#include <system_error>
#include <thread>
#include <vector>

#include "simulation/zentara_simulation.h"
#include "soak/process_usage.h"
#include "soak/soaked_camera.h"
#include "support/wait_until.h"
#include "zentara/zentara.h"

// Streams from many simulated cameras for as long as one says; `scripts/soak` builds and runs it.
namespace ZV::Soak {
namespace {

using Clock = std::chrono::steady_clock;
using namespace std::chrono_literals;

constexpr auto MeasuringStep = 250ms;
constexpr std::uint32_t CamerasMax = 10;  // as many as a listing gives
constexpr auto BeginLimit = 60s;

std::atomic<bool> isInterrupted{false};
/// The library's own words go to standard output; they are not looked at here.
std::FILE* output = stdout;

void PartOutputs() {
    const int own = dup(STDOUT_FILENO);
    if (own < 0) return;
    output = fdopen(own, "w");
    if (output == nullptr || std::freopen("/dev/null", "w", stdout) == nullptr) std::abort();
}

struct Options {
    std::uint64_t seconds = 60, minuteSeconds = 60, cameras = 10;
    double faults = 0.001, requestFaults = 0.001;
    std::vector<std::string> givenFaults;  ///< Of every camera, besides.
    std::string state;
};

/// False for a text that is not a number to its end.
bool ReadNumber(const char* text, std::uint64_t* number) {
    const char* const end = text + std::strlen(text);
    const auto [stop, error] = std::from_chars(text, end, *number);
    return error == std::errc() && stop == end;
}

bool ReadRate(const char* text, double* rate) {
    const char* const end = text + std::strlen(text);
    const auto [stop, error] = std::from_chars(text, end, *rate);
    return error == std::errc() && stop == end && *rate >= 0 && *rate <= 1;
}

struct OptionRow {
    std::string_view name;
    bool (*read)(const char* text, Options* options);
};

constexpr OptionRow OptionRows[] = {
    {"--seconds", [](const char* text, Options* o) { return ReadNumber(text, &o->seconds); }},
    {"--minute", [](const char* text, Options* o) { return ReadNumber(text, &o->minuteSeconds); }},
    {"--cameras", [](const char* text, Options* o) { return ReadNumber(text, &o->cameras); }},
    {"--faults", [](const char* text, Options* o) { return ReadRate(text, &o->faults); }},
    {"--request-faults",
     [](const char* text, Options* o) { return ReadRate(text, &o->requestFaults); }},
    {"--fault",
     [](const char* text, Options* o) {
         o->givenFaults.emplace_back(text);
         return true;
     }},
    {"--state",
     [](const char* text, Options* o) {
         o->state = text;
         return true;
     }},
};

bool ReadOptions(int count, char** arguments, Options* options) {
    for (int i = 1; i < count; i += 2) {
        const OptionRow* found = nullptr;
        for (const OptionRow& row : OptionRows) {
            if (row.name == arguments[i]) found = &row;
        }
        if (found == nullptr || i + 1 == count) return false;
        if (!found->read(arguments[i + 1], options)) return false;
    }
    return options->cameras >= 1 && options->cameras <= CamerasMax && options->minuteSeconds > 0 &&
           options->seconds > 0;
}

/// Packets that go wrong, or meet a reset of the bus, at the rate; a frame has some tens of them.
std::string MakeFaults(double rate) {
    constexpr std::array Kinds{"losePacket",    "repeatPacket", "truncatePacket",
                               "corruptPacket", "missingTail",  "overwriteRequest",
                               "frameStart",    "busReset",     "wrongPsn"};
    std::string faults;
    for (const char* kind : Kinds) {
        if (!faults.empty()) faults += ", ";
        faults += std::string(R"({"kind": ")") + kind + R"(", "probability": )" +
                  std::to_string(rate / Kinds.size()) + "}";
    }
    return faults;
}

/// Control requests that fail at the rate, by the call itself or when they end, and reads and
/// writes of registers that a reset of the bus cuts at the same rate. A buffer that cannot be
/// attached ends a stream's loop, and there is one for each request of a stream: they fail less
/// often.
std::vector<std::string> MakeRequestFaults(double rate) {
    constexpr double AttachShare = 0.01;
    std::vector<std::string> faults;
    const auto add = [&](const char* code, double share) {
        for (const char* isPended : {"false", "true"}) {
            faults.push_back(fmt::format(
                R"({{"kind": "failRequest", "code": "FW_IOCTL_{}", "pended": {}, "probability": {}}})",
                code, isPended, rate * share / 2));
        }
    };
    if (rate <= 0) return faults;
    for (const char* code : {"ALLOC_BANDWIDTH", "ALLOC_CHANNEL", "ALLOC_RESOURCES", "ASYNC_READ",
                             "ASYNC_WRITE", "DETACH_BUFFERS", "FREE_BANDWIDTH", "FREE_CHANNEL",
                             "FREE_RESOURCES", "LISTEN", "NOTIFY_DISABLE", "NOTIFY_ENABLE",
                             "NOTIFY_WAIT", "QUERY_BUSY", "STOP", "STREAM_ENTER", "STREAM_LEAVE"}) {
        add(code, 1);
    }
    add("ATTACH_BUFFER", AttachShare);
    for (const char* code : {"ASYNC_READ", "ASYNC_WRITE"}) {
        faults.push_back(fmt::format(
            R"({{"kind": "busReset", "code": "FW_IOCTL_{}", "probability": {}}})", code, rate));
    }
    return faults;
}

std::uint32_t GetStreamingVersion(std::uint32_t position) {
    return position % 3;
}

/// Cameras of all versions of the stream, each on a bus of its own.
std::string MakeScenario(const Options& options) {
    constexpr std::array Models{"SolvaneA1", "PellanA1", "SolvaneG1", "SolvaneC2", "Folary"};
    std::string buses, cameras;
    for (std::uint32_t i = 0; i < options.cameras; ++i) {
        const char* separator = i == 0 ? "" : ", ";
        buses += std::string(separator) + "{}";
        cameras += std::string(separator) + R"({"model": ")" + Models[i % Models.size()] +
                   R"(", "bus": )" + std::to_string(i) + R"(, "streamingVersion": )" +
                   std::to_string(GetStreamingVersion(i)) +
                   R"(, "sensor": {"width": 320, "height": 240, "noise": false}, "faults": [)" +
                   MakeFaults(options.faults) + "]}";
    }
    return R"({"timeScale": 0, "buses": [)" + buses + R"(], "cameras": [)" + cameras + "]}";
}

class ScenarioFile {
  public:
    explicit ScenarioFile(const std::string& text) {
        std::string pattern = (std::filesystem::temp_directory_path() / "soak-XXXXXX").string();
        if (mkdtemp(pattern.data()) == nullptr) return;
        folder = pattern;
        const std::string path = (folder / "scenario.json").string();
        std::ofstream(path) << text;
        (void)setenv("ZENTARA_SIMULATION", path.c_str(), 1);  // an unset one lists no camera
    }
    ~ScenarioFile() {
        std::error_code ignored;
        if (!folder.empty()) std::filesystem::remove_all(folder, ignored);
    }
    ScenarioFile(const ScenarioFile&) = delete;
    ScenarioFile& operator=(const ScenarioFile&) = delete;

  private:
    std::filesystem::path folder;
};

class Soak {
  public:
    Soak(const Options& soakOptions, const SoakState& formerState)
        : options(soakOptions), former(formerState) {
        if (former.cameras == options.cameras) judge.GoOnFrom(former.firstMinute);
    }

    bool Begin() {
        if (Zentara_LoadDriver() != zerrNone) return false;
        std::array<Zentara_CamListItem, CamerasMax> items{};
        std::uint32_t length = CamerasMax;
        if (Zentara_ListCameras(items.data(), &length) != zerrNone) return false;
        if (length != options.cameras) return false;
        for (std::uint32_t i = 0; i < length; ++i) {
            cameras.push_back(std::make_unique<SoakedCamera>(i, items[i].uniqueId,
                                                             GetStreamingVersion(i), listMutex));
        }
        if (!AddFaults()) return false;
        for (const auto& camera : cameras) {
            threads.emplace_back([this, &camera] { camera->Run(isOver); });
        }
        return true;
    }

    /// False when a camera gives no frame at all.
    bool AwaitAll() {
        begin = Clock::now();
        return Test::WaitUntil([this] { return isInterrupted || DoAllStream(); }, BeginLimit);
    }

    void Watch() {
        begin = Clock::now();
        const auto end = begin + std::chrono::seconds(options.seconds);
        auto minute = begin + std::chrono::seconds(options.minuteSeconds);
        for (auto now = begin; !isInterrupted && now < end;) {
            Test::Disturb(MeasuringStep);
            judge.Add(MeasureUsage());
            now = Clock::now();  // one look: a minute that ends with the soak is whole
            if (now < minute) continue;
            judge.EndMinute();
            Tell();
            minute += std::chrono::seconds(options.minuteSeconds);
        }
    }

    /// 0 if in this run all cameras streamed, nothing grew, every frame is accounted for under its
    /// number and no call failed without a reason.
    int End(bool haveAllStreamed) {
        isOver = true;
        for (std::thread& thread : threads) thread.join();
        Zentara_ReleaseDriver();
        Tell();
        TellEarlierFaults();
        if (!judge.HasJudged()) {
            (void)std::fputs("growth was not judged: it takes a minute behind the first\n", output);
        }
        bool isGood = true;
        const auto demand = [&](bool holds, const char* otherwise) {
            if (!holds) (void)std::fputs(otherwise, output);
            isGood = isGood && holds;
        };
        const SoakSums sums = AddUp();
        demand(judge.IsSteady(), "memory, threads or handles have grown\n");
        demand(sums.unaccounted == 0, "frames are missing without a count\n");
        demand(sums.wrongNumbers == 0, "frames came under a wrong number\n");
        demand(haveAllStreamed, "a camera has not begun to stream\n");
        demand(sums.failures == 0, "calls have failed\n");
        return isGood ? 0 : 1;
    }

  private:
    /// Once all cameras are listed: they fail those that use them.
    bool AddFaults() const {
        std::vector<std::string> faults = MakeRequestFaults(options.requestFaults);
        faults.insert(faults.end(), options.givenFaults.begin(), options.givenFaults.end());
        for (std::uint32_t i = 0; i < options.cameras; ++i) {
            for (const std::string& fault : faults) {
                if (ZentaraSimulation_AddFault(i, fault.c_str(), nullptr, 0) != 0) return false;
            }
        }
        return true;
    }
    bool DoAllStream() const {
        return std::all_of(cameras.begin(), cameras.end(),
                           [](const auto& camera) { return camera->GetSums().frames > 0; });
    }
    /// Of this run.
    SoakSums AddUp() const {
        SoakSums sums;
        for (const auto& camera : cameras) sums += camera->GetSums();
        sums.seconds += static_cast<std::uint64_t>(
            std::chrono::duration_cast<std::chrono::seconds>(Clock::now() - begin).count());
        sums.grown = judge.IsSteady() ? 0 : 1;
        return sums;
    }
    SoakSums AddUpAllRuns() const {
        SoakSums sums = former.sums;
        return sums += AddUp();
    }
    /// They are in the sums, and not held against this run.
    void TellEarlierFaults() const {
        const SoakSums& sums = former.sums;
        if (sums.failures + sums.unaccounted + sums.wrongNumbers + sums.grown == 0) return;
        fmt::print(output,
                   "of earlier runs: failures {}, unaccounted {}, wrongNumbers {}, grown {}\n",
                   sums.failures, sums.unaccounted, sums.wrongNumbers, sums.grown);
    }
    SoakState MakeState(const SoakSums& sums) const {
        const ProcessUsage* const first = judge.GetFirstMinute();
        if (first == nullptr) return {sums, former.cameras, former.firstMinute};
        return {sums, options.cameras, *first};
    }
    void Tell() const {
        const SoakSums sums = AddUpAllRuns();
        const ProcessUsage usage = MeasureUsage();
        std::fprintf(output, "%s; resident %.1f MB, heap %.1f MB, threads %llu, handles %llu\n",
                     Describe(sums).c_str(), static_cast<double>(usage.residentBytes) / 1e6,
                     static_cast<double>(usage.heapBytes) / 1e6,
                     static_cast<unsigned long long>(usage.threads),
                     static_cast<unsigned long long>(usage.handles));
        (void)std::fflush(output);  // a picture of progress
        if (options.state.empty() || WriteState(options.state, MakeState(sums))) return;
        std::fprintf(output, "%s cannot be written\n", options.state.c_str());
    }

    const Options& options;
    const SoakState former;
    std::mutex listMutex;
    std::atomic<bool> isOver{false};
    std::vector<std::unique_ptr<SoakedCamera>> cameras;
    std::vector<std::thread> threads;
    Clock::time_point begin;
    GrowthJudge judge;
};

int Run(int count, char** arguments) {
    PartOutputs();
    Options options;
    if (!ReadOptions(count, arguments, &options)) {
        std::fputs(
            "zentara-soak [--seconds N] [--cameras 1-10] [--faults RATE] [--request-faults RATE] "
            "[--fault JSON]... [--state FILE] [--minute SECONDS]\n",
            stderr);
        return 2;
    }
    SoakState former;
    if (!options.state.empty() && !ReadState(options.state, &former)) {
        std::fprintf(output, "%s holds no sums of a soak\n", options.state.c_str());
        return 2;
    }
    for (const int signal : {SIGINT, SIGTERM}) {
        (void)std::signal(signal, [](int) { isInterrupted = true; });
    }
    const ScenarioFile scenario(MakeScenario(options));
    Soak soak(options, former);
    if (!soak.Begin()) {
        (void)std::fputs("the cameras cannot be listed\n", output);
        return 2;
    }
    const bool haveAllStreamed = soak.AwaitAll();
    if (haveAllStreamed) soak.Watch();
    return soak.End(haveAllStreamed);
}

}  // namespace
}  // namespace ZV::Soak

int main(int count, char** arguments) {
    return ZV::Soak::Run(count, arguments);
}
