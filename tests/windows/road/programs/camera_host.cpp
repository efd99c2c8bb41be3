// Serves the test driver's camera devices from the simulation: `camera-host SCENARIO`. Device n of
// the driver is camera n of the scenario.
//
// Threads: the main one takes the driver's requests in their order and hands them to the
// simulation, whose own threads post the answers of those that it pends; a second one reads
// commands, one a line, from standard input and answers each with a line that begins with "ok" or
// "failed". The end of the input ends the process, so that it does not outlive its test.

#include <windows.h>

#include <cstdint>
#include <cstdio>
#include <cstring>
#include <iostream>
#include <map>
#include <memory>
#include <mutex>
#include <sstream>
#include <string>
#include <thread>
#include <vector>

#include "hal/platform/kernel_driver.h"
#include "hal/platform/last_error.h"
#include "simulation/zentara_simulation.h"
#include "windows/driver/road_protocol.h"

extern "C" const ZV::KernelDriver* ZentaraSimulation_GetKernelDriver(std::uint32_t version);

namespace ZV::Test {
namespace {

constexpr std::size_t MessageBytesMax = 2048;
/// The largest request is a stream's buffer of 30 packets.
constexpr std::size_t RequestBytesMax = 512 * 1024;

HANDLE OpenControl() {
    return CreateFileA(ROAD_CONTROL_PATH, GENERIC_READ | GENERIC_WRITE,
                       FILE_SHARE_READ | FILE_SHARE_WRITE, nullptr, OPEN_EXISTING, 0, nullptr);
}

class CameraHost {
  public:
    CameraHost() : simulation(*ZentaraSimulation_GetKernelDriver(KernelDriverVersion)) {}

    bool Start(const char* scenario, std::string* message);
    /// Serves until the driver ends the wait for requests.
    void Serve();

  private:
    struct Request : KernelRequest {
        CameraHost* host;
        std::uint64_t id;
        std::uint64_t file;
        std::vector<std::uint8_t> inputBuffer;
        /// The answer's record, then its data.
        std::vector<std::uint8_t> answer;
    };

    bool ReadPaths();
    void Handle(const RoadRequest& record, const std::uint8_t* input);
    void Open(const RoadRequest& record);
    void Close(const RoadRequest& record);
    void Cancel(const RoadRequest& record);
    void Control(const RoadRequest& record, const std::uint8_t* input);
    void End(std::uint64_t id, std::uint32_t error, std::uint32_t bytes);
    void Post(std::vector<std::uint8_t>& answer, std::uint64_t id, std::uint32_t error,
              std::uint32_t bytes);

    const KernelDriver& simulation;
    std::vector<std::string> paths;
    std::map<std::uint64_t, void*> files;  // of the main thread alone
    HANDLE requests = INVALID_HANDLE_VALUE;
    HANDLE answers = INVALID_HANDLE_VALUE;

    std::mutex mutex;
    std::map<std::uint64_t, std::shared_ptr<Request>> pended;  // guarded by mutex
};

bool CameraHost::ReadPaths() {
    void* list = nullptr;
    if (simulation.openList(&list) != PlatformErrorNone) return false;
    for (std::uint32_t index = 0; simulation.selectInterface(list, index) == PlatformErrorNone;
         ++index) {
        std::uint32_t required = 0;
        (void)simulation.getDetail(list, index, nullptr, 0, &required);
        std::vector<char> path(required);
        if (simulation.getDetail(list, index, path.data(), required, &required) == 0) {
            paths.emplace_back(path.data());
        }
    }
    simulation.closeList(list);
    return true;
}

bool CameraHost::Start(const char* scenario, std::string* message) {
    char text[MessageBytesMax] = "";
    if (simulation.begin(scenario, text, sizeof text) != PlatformErrorNone || !ReadPaths()) {
        *message = text;
        return false;
    }
    requests = OpenControl();
    answers = OpenControl();
    *message = "the driver's control device";
    return requests != INVALID_HANDLE_VALUE && answers != INVALID_HANDLE_VALUE;
}

void CameraHost::Serve() {
    std::vector<std::uint8_t> buffer(RequestBytesMax);
    DWORD bytes = 0;
    while (DeviceIoControl(requests, ROAD_NEXT, nullptr, 0, buffer.data(),
                           static_cast<DWORD>(buffer.size()), &bytes, nullptr)) {
        RoadRequest record;
        if (bytes < sizeof record) return;
        std::memcpy(&record, buffer.data(), sizeof record);
        if (bytes - sizeof record < record.inputBytes) return;
        Handle(record, buffer.data() + sizeof record);
    }
}

void CameraHost::Handle(const RoadRequest& record, const std::uint8_t* input) {
    switch (record.kind) {
        case RoadOpen:
            return Open(record);
        case RoadControl:
            return Control(record, input);
        case RoadClose:
            return Close(record);
        case RoadCancel:
            return Cancel(record);
        default:
            return;
    }
}

void CameraHost::Open(const RoadRequest& record) {
    void* handle = nullptr;
    std::uint32_t error = PlatformErrorFileNotFound;
    if (record.device < paths.size()) {
        error = simulation.open(paths[record.device].c_str(), &handle);
    }
    if (error == PlatformErrorNone) files[record.file] = handle;
    std::vector<std::uint8_t> answer(sizeof(RoadAnswer));
    Post(answer, record.id, error, 0);
}

void CameraHost::Close(const RoadRequest& record) {
    const auto file = files.find(record.file);
    // An open that was given up before it got here has left no file.
    if (file == files.end()) return;
    simulation.close(file->second);
    files.erase(file);
}

void CameraHost::Cancel(const RoadRequest& record) {
    std::shared_ptr<Request> request;
    {
        const std::lock_guard hold(mutex);
        const auto found = pended.find(record.id);
        if (found != pended.end()) request = found->second;
    }
    const auto file = files.find(record.file);
    if (request != nullptr && file != files.end()) simulation.cancel(file->second, request.get());
}

void CameraHost::Control(const RoadRequest& record, const std::uint8_t* input) {
    auto request = std::make_shared<Request>();
    request->host = this;
    request->id = record.id;
    request->file = record.file;
    request->inputBuffer.assign(input, input + record.inputBytes);
    request->answer.resize(sizeof(RoadAnswer) + record.outputBytes);
    request->code = record.code;
    request->inputBytes = record.inputBytes;
    request->input = record.inputBytes == 0 ? nullptr : request->inputBuffer.data();
    request->outputBytes = record.outputBytes;
    request->output =
        record.outputBytes == 0 ? nullptr : request->answer.data() + sizeof(RoadAnswer);
    // The kernel does not tell a driver whether the caller waits: each request may be pended.
    request->isOverlapped = 1;
    request->complete = [](KernelRequest* ended, std::uint32_t error, std::uint32_t bytes) {
        auto* const own = static_cast<Request*>(ended);
        own->host->End(own->id, error, bytes);
    };
    {
        const std::lock_guard hold(mutex);
        pended.emplace(record.id, request);
    }
    const auto file = files.find(record.file);
    std::uint32_t bytes = 0;
    const std::uint32_t error = file == files.end()
                                    ? PlatformErrorInvalidHandle
                                    : simulation.control(file->second, request.get(), &bytes);
    if (error != PlatformErrorIoPending) End(record.id, error, bytes);
}

void CameraHost::End(std::uint64_t id, std::uint32_t error, std::uint32_t bytes) {
    std::shared_ptr<Request> request;
    {
        const std::lock_guard hold(mutex);
        auto node = pended.extract(id);
        if (node.empty()) return;
        request = std::move(node.mapped());
    }
    Post(request->answer, id, error, error == 0 ? std::min(bytes, request->outputBytes) : 0);
}

void CameraHost::Post(std::vector<std::uint8_t>& answer, std::uint64_t id, std::uint32_t error,
                      std::uint32_t bytes) {
    const RoadAnswer record{id, error, bytes};
    std::memcpy(answer.data(), &record, sizeof record);
    DWORD unused = 0;
    // A driver that has gone has ended the request by itself.
    (void)DeviceIoControl(answers, ROAD_ANSWER, answer.data(),
                          static_cast<DWORD>(sizeof record + bytes), nullptr, 0, &unused, nullptr);
}

// ---- commands ----

void Print(const std::string& line) {
    std::cout << line << std::endl;
}

std::string AnswerState(std::uint32_t camera) {
    ZentaraSimulationState state{};
    if (ZentaraSimulation_GetState(camera, &state) != 0) return "failed";
    std::ostringstream line;
    line << "ok " << state.openHandles << ' ' << state.reservedResources << ' '
         << state.pendedRequests << ' ' << state.attachedBuffers << ' ' << state.framesSent << ' '
         << state.isStreaming;
    return line.str();
}

std::string AnswerFault(std::uint32_t camera, const std::string& fault) {
    char message[MessageBytesMax] = "";
    const bool isAdded =
        ZentaraSimulation_AddFault(camera, fault.c_str(), message, sizeof message) == 0;
    return isAdded ? "ok" : std::string("failed ") + message;
}

std::string AnswerPeek(std::uint32_t camera, std::uint32_t address) {
    std::uint32_t value = 0;
    if (ZentaraSimulation_PeekRegister(camera, address, &value) != 0) return "failed";
    return "ok " + std::to_string(value);
}

/// `VERB CAMERA [REST]`.
std::string AnswerCommand(const std::string& line) {
    std::istringstream words(line);
    std::string verb, rest;
    std::uint32_t camera = 0;
    words >> verb >> camera >> std::ws;
    std::getline(words, rest);
    if (verb == "state") return AnswerState(camera);
    if (verb == "fault") return AnswerFault(camera, rest);
    if (verb == "unplug") return ZentaraSimulation_Unplug(camera) == 0 ? "ok" : "failed";
    if (verb == "plug") return ZentaraSimulation_Plug(camera) == 0 ? "ok" : "failed";
    if (verb == "peek") {
        return AnswerPeek(camera,
                          static_cast<std::uint32_t>(std::strtoul(rest.c_str(), nullptr, 0)));
    }
    return "failed no such command";
}

[[noreturn]] void RunCommands() {
    for (std::string line; std::getline(std::cin, line);) {
        if (!line.empty() && line.back() == '\r') line.pop_back();
        Print(AnswerCommand(line));
    }
    // No orderly end: requests that the driver still holds must end by the loss of their helper.
    TerminateProcess(GetCurrentProcess(), 0);
    std::abort();
}

int Run(const char* scenario) {
    // Its threads outlive this function's return, which the end of the process overtakes.
    auto& host = *new CameraHost;
    std::string message;
    if (!host.Start(scenario, &message)) {
        Print("failed " + message);
        return 1;
    }
    std::thread(RunCommands).detach();
    Print("ok");
    host.Serve();
    return 0;
}

}  // namespace
}  // namespace ZV::Test

int main(int argc, char** argv) {
    return argc == 2 ? ZV::Test::Run(argv[1]) : 2;
}
