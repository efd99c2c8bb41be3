#include <dlfcn.h>
#include <link.h>
#include <unistd.h>

#include <cinttypes>
#include <climits>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>

#include "hal/platform/module_loader.h"

namespace ZV {
namespace {

constexpr char ModuleName[] = "libzentara-simulation.so";

constexpr std::size_t MapLineBytes = PATH_MAX + 128;

/// The file that a line of /proc/self/maps names, or null when `address` does not lie in it.
const char* FindFileAt(char* line, std::uintptr_t address) {
    std::uintptr_t begin = 0, end = 0;
    int nameOffset = 0;
    const int found = std::sscanf(line, "%" SCNxPTR "-%" SCNxPTR " %*s %*s %*s %*s %n", &begin,
                                  &end, &nameOffset);
    if (found != 2 || address < begin || address >= end) return nullptr;
    line[std::strcspn(line, "\n")] = '\0';
    return line + nameOffset;
}

/// The file that is mapped at an address, whatever folder is the current one now.
bool GetMappedFile(const void* address, char path[PATH_MAX]) {
    std::FILE* maps = std::fopen("/proc/self/maps", "re");
    if (maps == nullptr) return false;
    char line[MapLineBytes];
    const char* file = nullptr;
    while (file == nullptr && std::fgets(line, sizeof line, maps) != nullptr) {
        file = FindFileAt(line, reinterpret_cast<std::uintptr_t>(address));
    }
    (void)std::fclose(maps);  // It was only read.
    return file != nullptr && file[0] == '/' &&
           std::snprintf(path, PATH_MAX, "%s", file) < PATH_MAX;
}

/// The image's path as the system found it. That of the program itself is only what it was called
/// by, and a relative one is of the folder that was current then: these are asked for.
bool GetOwnImagePath(char path[PATH_MAX]) {
    Dl_info info{};
    link_map* map = nullptr;
    const void* inside = reinterpret_cast<const void*>(&LoadSimulationDriver);
    if (dladdr1(inside, &info, reinterpret_cast<void**>(&map), RTLD_DL_LINKMAP) == 0) return false;
    const bool isProgram = map == nullptr || map->l_name == nullptr || map->l_name[0] == '\0';
    if (isProgram) return realpath("/proc/self/exe", path) != nullptr;
    if (map->l_name[0] != '/') return GetMappedFile(inside, path);
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
