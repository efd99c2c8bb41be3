#include <dlfcn.h>
#include <link.h>
#include <unistd.h>

#include <climits>
#include <cstdio>
#include <cstdlib>
#include <cstring>

#include "hal/platform/module_loader.h"

namespace ZV {
namespace {

constexpr char ModuleName[] = "libzentara-simulation.so";

/// The image's path as the system found it; a relative one and that of the program itself, which is
/// only what it was called by, are resolved.
bool GetOwnImagePath(char path[PATH_MAX]) {
    Dl_info info{};
    link_map* map = nullptr;
    const void* inside = reinterpret_cast<const void*>(&LoadSimulationDriver);
    if (dladdr1(inside, &info, reinterpret_cast<void**>(&map), RTLD_DL_LINKMAP) == 0) return false;
    const bool isProgram = map == nullptr || map->l_name == nullptr || map->l_name[0] == '\0';
    if (isProgram) return realpath("/proc/self/exe", path) != nullptr;
    if (map->l_name[0] != '/') return realpath(map->l_name, path) != nullptr;
    return std::snprintf(path, PATH_MAX, "%s", map->l_name) < PATH_MAX;
}

bool GetModulePath(char path[PATH_MAX]) {
    if (!GetOwnImagePath(path)) return false;
    char* slash = std::strrchr(path, '/');
    if (slash == nullptr) return false;
    const std::size_t room = PATH_MAX - static_cast<std::size_t>(slash + 1 - path);
    if (sizeof ModuleName > room) return false;
    std::memcpy(slash + 1, ModuleName, sizeof ModuleName);
    return true;
}

}  // namespace

const KernelDriver* LoadSimulationDriver() {
    char path[PATH_MAX];
    if (!GetModulePath(path)) return nullptr;
    void* module = dlopen(path, RTLD_NOW | RTLD_LOCAL);
    if (module == nullptr) return nullptr;
    void* symbol = dlsym(module, GetKernelDriverName);
    if (symbol == nullptr) return nullptr;
    return reinterpret_cast<GetKernelDriverFunction>(symbol)(KernelDriverVersion);
}

}  // namespace ZV
