#include "simulation/driver.h"

#include <algorithm>
#include <cstring>
#include <exception>
#include <map>
#include <mutex>
#include <new>
#include <utility>
#include <vector>

#include "hal/platform/last_error.h"
#include "simulation/scenario_reader.h"

// The table of operations over one world at a time. The world and the open handles lie behind one
// pointer that is never freed: a process may end at any moment, and nothing is torn down under the
// device threads then. `mutex` is held for the tables alone, never while a device works.
namespace ZV::Simulation {
namespace {

constexpr std::uint32_t DetailHeadBytes = 4;

struct DriverState {
    std::mutex mutex;
    std::string configuration;                                   // guarded by mutex
    std::shared_ptr<World> world;                                // guarded by mutex
    std::map<std::uintptr_t, std::shared_ptr<FileHandle>> open;  // guarded by mutex
    std::uintptr_t lastToken = 0;                                // guarded by mutex
};

DriverState& GetState() {
    static DriverState* const state = new DriverState;
    return *state;
}

struct DiscoveryList {
    std::shared_ptr<World> world;
    std::vector<std::string> paths;
    std::uint64_t listing = 0;
    std::uint64_t step = 0;

    std::uint32_t CountStep() {
        ++step;
        return world != nullptr ? world->GetDiscoveryError(listing, step) : PlatformErrorNone;
    }
};

// What the standard library throws ends here.
template <typename Work>
std::uint32_t RunShielded(Work work) {
    try {
        return work();
    } catch (const std::bad_alloc&) {
        return PlatformErrorNotEnoughMemory;
    } catch (const std::exception&) {
        return PlatformErrorGeneralFailure;
    }
}

std::shared_ptr<World> TakeWorld() {
    DriverState& state = GetState();
    const std::lock_guard lock(state.mutex);
    state.configuration.clear();
    return std::exchange(state.world, nullptr);
}

void EndWorld() {
    if (const std::shared_ptr<World> world = TakeWorld()) world->End();
}

bool IsRunning(const std::string& configuration) {
    DriverState& state = GetState();
    const std::lock_guard lock(state.mutex);
    return state.world != nullptr && state.configuration == configuration;
}

std::uint32_t StartWorld(const std::string& configuration, std::string* message) {
    Scenario scenario;
    if (!LoadScenario(configuration, &scenario, message)) return PlatformErrorInvalidParameter;
    std::shared_ptr<World> world = World::Make(scenario, message);
    if (world == nullptr) return PlatformErrorInvalidParameter;
    DriverState& state = GetState();
    const std::lock_guard lock(state.mutex);
    state.configuration = configuration;
    state.world = std::move(world);
    return PlatformErrorNone;
}

std::shared_ptr<FileHandle> FindHandle(void* token) {
    DriverState& state = GetState();
    const std::lock_guard lock(state.mutex);
    const auto found = state.open.find(reinterpret_cast<std::uintptr_t>(token));
    return found != state.open.end() ? found->second : nullptr;
}

std::shared_ptr<FileHandle> TakeHandle(void* token) {
    DriverState& state = GetState();
    const std::lock_guard lock(state.mutex);
    auto node = state.open.extract(reinterpret_cast<std::uintptr_t>(token));
    return node.empty() ? nullptr : std::move(node.mapped());
}

std::uint32_t Begin(const char* configuration, char* message, std::uint32_t messageBytes) {
    std::string reason;
    const std::uint32_t error = RunShielded([&]() -> std::uint32_t {
        const std::string text = configuration != nullptr ? configuration : "";
        if (IsRunning(text)) return PlatformErrorNone;
        EndWorld();
        return StartWorld(text, &reason);
    });
    if (error != PlatformErrorNone && reason.empty()) reason = "the simulation cannot be started";
    CopyMessage(reason, message, messageBytes);
    return error;
}

void End() {
    (void)RunShielded([]() -> std::uint32_t {  // There is nobody to tell.
        EndWorld();
        return PlatformErrorNone;
    });
}

std::uint32_t OpenList(void** list) {
    return RunShielded([&]() -> std::uint32_t {
        auto discovery = std::make_unique<DiscoveryList>();
        discovery->world = GetWorld();
        if (discovery->world != nullptr) {
            discovery->paths = discovery->world->ListPaths();
            discovery->listing = discovery->world->CountListing();
        }
        if (const std::uint32_t error = discovery->CountStep()) return error;
        *list = discovery.release();
        return PlatformErrorNone;
    });
}

std::uint32_t SelectInterface(void* list, std::uint32_t index) {
    if (list == nullptr) return PlatformErrorInvalidHandle;
    auto& discovery = *static_cast<DiscoveryList*>(list);
    if (const std::uint32_t error = discovery.CountStep()) return error;
    return index < discovery.paths.size() ? PlatformErrorNone : PlatformErrorNoMoreItems;
}

std::uint32_t GetDetail(void* list, std::uint32_t index, char* path, std::uint32_t capacity,
                        std::uint32_t* requiredBytes) {
    if (list == nullptr) return PlatformErrorInvalidHandle;
    auto& discovery = *static_cast<DiscoveryList*>(list);
    if (const std::uint32_t error = discovery.CountStep()) return error;
    if (index >= discovery.paths.size()) return PlatformErrorNoMoreItems;
    const std::string& text = discovery.paths[index];
    const auto required = static_cast<std::uint32_t>(DetailHeadBytes + text.size() + 1);
    if (requiredBytes != nullptr) *requiredBytes = required;
    if (capacity < required) return PlatformErrorInsufficientBuffer;
    if (path == nullptr) return PlatformErrorInvalidParameter;
    std::memcpy(path, text.c_str(), text.size() + 1);
    return PlatformErrorNone;
}

void CloseList(void* list) {
    delete static_cast<DiscoveryList*>(list);
}

std::uint32_t OpenDevice(const char* path, void** handle) {
    return RunShielded([&]() -> std::uint32_t {
        const std::shared_ptr<World> world = GetWorld();
        if (world == nullptr || path == nullptr) return PlatformErrorFileNotFound;
        const std::shared_ptr<Device> device = world->FindDevice(path);
        if (device == nullptr) return PlatformErrorFileNotFound;
        std::shared_ptr<FileHandle> opened = Device::Open(device);
        if (opened == nullptr) return PlatformErrorFileNotFound;
        DriverState& state = GetState();
        const std::lock_guard lock(state.mutex);
        state.open.emplace(++state.lastToken, std::move(opened));
        *handle = reinterpret_cast<void*>(state.lastToken);
        return PlatformErrorNone;
    });
}

void CloseDevice(void* token) {
    (void)RunShielded([&]() -> std::uint32_t {  // There is nobody to tell.
        if (const std::shared_ptr<FileHandle> handle = TakeHandle(token)) {
            handle->device->Close(handle);
        }
        return PlatformErrorNone;
    });
}

std::uint32_t ControlDevice(void* token, KernelRequest* request, std::uint32_t* bytes) {
    return RunShielded([&]() -> std::uint32_t {
        std::uint32_t answered = 0;
        const std::shared_ptr<FileHandle> handle = FindHandle(token);
        if (handle == nullptr) return PlatformErrorInvalidHandle;
        const std::uint32_t error = handle->device->Control(handle, request, &answered);
        if (bytes != nullptr) *bytes = answered;
        return error;
    });
}

void CancelRequest(void* token, KernelRequest* request) {
    (void)RunShielded([&]() -> std::uint32_t {  // The request ends by itself then.
        if (const std::shared_ptr<FileHandle> handle = FindHandle(token)) {
            handle->device->Cancel(handle, request);
        }
        return PlatformErrorNone;
    });
}

constexpr KernelDriver DriverTable{
    KernelDriverVersion, Begin,      End,         OpenList,      SelectInterface, GetDetail,
    CloseList,           OpenDevice, CloseDevice, ControlDevice, CancelRequest,
};

}  // namespace

const KernelDriver& GetDriverTable() {
    return DriverTable;
}

std::shared_ptr<World> GetWorld() {
    DriverState& state = GetState();
    const std::lock_guard lock(state.mutex);
    return state.world;
}

void CopyMessage(const std::string& text, char* message, std::uint32_t messageBytes) {
    if (message == nullptr || messageBytes == 0) return;
    const std::size_t count = std::min<std::size_t>(text.size(), messageBytes - 1);
    std::memcpy(message, text.data(), count);
    message[count] = '\0';
}

}  // namespace ZV::Simulation
