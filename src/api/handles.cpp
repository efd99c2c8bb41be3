#include "api/handles.h"

#include <algorithm>
#include <mutex>
#include <vector>

#include "diagnostics/log.h"

namespace ZV {

namespace {

struct HandleRegistry {
    std::mutex leafMutex;
    std::vector<ZCamera*> cameras;  // guarded by leafMutex
};

// Never destroyed: a process may end while threads of the library run.
HandleRegistry& GetRegistry() {
    static HandleRegistry& registry = *new HandleRegistry;
    return registry;
}

}  // namespace

void RegisterCamera(ZCamera* camera) {
    HandleRegistry& registry = GetRegistry();
    const std::lock_guard hold(registry.leafMutex);
    registry.cameras.push_back(camera);
}

void UnregisterCamera(ZCamera* camera) {
    HandleRegistry& registry = GetRegistry();
    const std::lock_guard hold(registry.leafMutex);
    std::erase(registry.cameras, camera);
}

ZentaraHandle GetHandle(ZCamera* camera) {
    return static_cast<ZentaraHandle>(reinterpret_cast<std::uintptr_t>(camera));
}

ZCamera* FindCamera(ZentaraHandle handle) {
    HandleRegistry& registry = GetRegistry();
    const std::lock_guard hold(registry.leafMutex);
    for (ZCamera* camera : registry.cameras) {
        if (GetHandle(camera) == handle) return camera;
    }
    return nullptr;
}

bool IsOpen(ZCamera* camera) {
    return camera != nullptr && camera->IsCameraOpen();
}

bool HasExclusiveAccess(const char* function, ZCamera* camera) {
    if (camera == nullptr) return false;
    if (camera->DoWeHaveExclusiveAccess()) return true;
    ZLogMessage(function, "Another process has this camera open.");
    return false;
}

}  // namespace ZV
