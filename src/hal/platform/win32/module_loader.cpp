#include "hal/platform/module_loader.h"

#include <windows.h>

#include <cwchar>
#include <memory>
#include <new>

namespace ZV {
namespace {

constexpr wchar_t ModuleName[] = L"zentara-simulation.dll";
constexpr DWORD PathLengthMax = 32768;
constexpr DWORD ModuleNameLength = sizeof ModuleName / sizeof ModuleName[0];

/// `path` has room for PathLengthMax characters.
bool GetModulePath(wchar_t* path) {
    HMODULE image = nullptr;
    const DWORD flags =
        GET_MODULE_HANDLE_EX_FLAG_FROM_ADDRESS | GET_MODULE_HANDLE_EX_FLAG_UNCHANGED_REFCOUNT;
    const auto* inside = reinterpret_cast<const wchar_t*>(&LoadSimulationDriver);
    if (!GetModuleHandleExW(flags, inside, &image)) return false;
    const DWORD length = GetModuleFileNameW(image, path, PathLengthMax);
    if (length == 0 || length >= PathLengthMax) return false;
    wchar_t* slash = std::wcsrchr(path, L'\\');
    if (slash == nullptr || slash + 1 - path > PathLengthMax - ModuleNameLength) return false;
    std::wmemcpy(slash + 1, ModuleName, ModuleNameLength);
    return true;
}

}  // namespace

const KernelDriver* LoadSimulationDriver() {
    // Too long for the stack of a client's thread.
    const std::unique_ptr<wchar_t[]> path(new (std::nothrow) wchar_t[PathLengthMax]);
    if (path == nullptr || !GetModulePath(path.get())) return nullptr;
    // What the module itself needs comes from its folder or the system's, never from the search
    // path.
    const DWORD flags = LOAD_LIBRARY_SEARCH_DLL_LOAD_DIR | LOAD_LIBRARY_SEARCH_SYSTEM32;
    const HMODULE module = LoadLibraryExW(path.get(), nullptr, flags);
    if (module == nullptr) return nullptr;
    const FARPROC symbol = GetProcAddress(module, GetKernelDriverName);
    if (symbol == nullptr) return nullptr;
    const auto getDriver =
        reinterpret_cast<GetKernelDriverFunction>(reinterpret_cast<void*>(symbol));
    return getDriver(KernelDriverVersion);
}

}  // namespace ZV
