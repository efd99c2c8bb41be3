#include <fcntl.h>
#include <io.h>
#include <windows.h>

#include <shellapi.h>

#include <array>
#include <cstdint>
#include <cstdlib>
#include <string>

#include "platform.h"

namespace ZentaraProgram {
namespace {

constexpr wchar_t LibraryName[] = L"zentara.dll";
constexpr wchar_t ModuleName[] = L"zentara-simulation.dll";
constexpr DWORD PathLengthMax = 32768;

std::wstring Widen(const std::string& text) {
    const int size = static_cast<int>(text.size());
    std::wstring wide(text.size(), L'\0');  // UTF-16 has no more units than UTF-8 has bytes.
    const int length = MultiByteToWideChar(CP_UTF8, 0, text.data(), size, wide.data(), size);
    wide.resize(static_cast<std::size_t>(length));
    return wide;
}

std::string Narrow(const std::wstring& wide, UINT codePage) {
    const int size = static_cast<int>(wide.size());
    const int length =
        WideCharToMultiByte(codePage, 0, wide.data(), size, nullptr, 0, nullptr, nullptr);
    std::string text(static_cast<std::size_t>(length), '\0');
    WideCharToMultiByte(codePage, 0, wide.data(), size, text.data(), length, nullptr, nullptr);
    return text;
}

/// With its last backslash; empty when it is not known.
std::wstring GetLibraryFolder() {
    std::wstring path(PathLengthMax, L'\0');
    const HMODULE library = GetModuleHandleW(LibraryName);
    const DWORD length = GetModuleFileNameW(library, path.data(), PathLengthMax);
    if (library == nullptr || length == 0 || length >= PathLengthMax) return {};
    path.resize(length);
    return path.substr(0, path.rfind(L'\\') + 1);
}

UINT savedCodePage = 0;

void RestoreConsole() {
    SetConsoleOutputCP(savedCodePage);
}

/// A console belongs to others too, before and after this program.
void TakeConsole() {
    savedCodePage = GetConsoleOutputCP();
    if (savedCodePage == 0 || savedCodePage == CP_UTF8) return;
    if (SetConsoleOutputCP(CP_UTF8)) (void)std::atexit(&RestoreConsole);
}

}  // namespace

// The runtime's own arguments are not taken: they are of the system's code page, and patterns in
// them are replaced by the names of files.
std::vector<std::string> GetArguments(int, char**) {
    int count = 0;
    wchar_t** values = CommandLineToArgvW(GetCommandLineW(), &count);
    std::vector<std::string> arguments;
    for (int i = 1; values != nullptr && i < count; ++i)
        arguments.push_back(Narrow(values[i], CP_UTF8));
    LocalFree(static_cast<void*>(values));
    return arguments;
}

std::FILE* TakeStandardOutput() {
    TakeConsole();
    std::fflush(stdout);
    const int output = _fileno(stdout), errors = _fileno(stderr);
    if (errors >= 0) (void)_setmode(errors, _O_BINARY);
    if (output < 0) return stdout;  // There is none; what is printed is lost.
    (void)_setmode(output, _O_BINARY);
    const int own = _dup(output);
    if (own < 0 || errors < 0 || _dup2(errors, output) < 0) return stdout;
    std::FILE* stream = _fdopen(own, "wb");
    return stream != nullptr ? stream : stdout;
}

// The library asks the system, not the runtime.
void SetVariable(const char* name, const std::string& value) {
    // Fails only without memory; the scenario is then not found.
    (void)SetEnvironmentVariableW(Widen(name).c_str(), Widen(value).c_str());
}

// The runtime takes any device for a terminal, the null device too.
bool IsTerminal(std::FILE* stream) {
    const int descriptor = _fileno(stream);
    DWORD mode = 0;
    return descriptor >= 0 &&
           GetConsoleMode(reinterpret_cast<HANDLE>(_get_osfhandle(descriptor)), &mode);
}

std::FILE* OpenFile(const std::string& path, const char* mode) {
    return _wfopen(Widen(path).c_str(), Widen(mode).c_str());
}

// By its name a device would be taken for a file; to open one does not wait.
bool IsDevice(const std::string& path) {
    const int descriptor = _wopen(Widen(path).c_str(), _O_RDONLY | _O_BINARY);
    if (descriptor < 0) return false;
    const auto handle = reinterpret_cast<HANDLE>(_get_osfhandle(descriptor));
    const bool isDevice = GetFileType(handle) != FILE_TYPE_DISK;
    _close(descriptor);
    return isDevice;
}

// Kept out of it is who is kept out of the folder around it.
std::error_code MakePrivateFolder(const std::string& path) {
    if (CreateDirectoryW(Widen(path).c_str(), nullptr)) return {};
    return {static_cast<int>(GetLastError()), std::system_category()};
}

// The program asks for UTF-8 as its code page; a system that is too old for that has one of its
// own.
std::string GetNarrowPath(const std::string& path) {
    return Narrow(Widen(path), CP_ACP);
}

bool CheckScenario(const std::string& scenario, std::string* message) {
    const std::wstring path = GetLibraryFolder() + ModuleName;
    const DWORD flags = LOAD_LIBRARY_SEARCH_DLL_LOAD_DIR | LOAD_LIBRARY_SEARCH_SYSTEM32;
    const HMODULE module = LoadLibraryExW(path.c_str(), nullptr, flags);
    if (module == nullptr) {
        *message = "there is no simulation beside the library (" + Narrow(path, CP_UTF8) + ")";
        return false;
    }
    using Check = std::uint32_t (*)(const char*, char*, std::uint32_t);
    const FARPROC symbol = GetProcAddress(module, "ZentaraSimulation_CheckScenario");
    const auto check = reinterpret_cast<Check>(reinterpret_cast<void*>(symbol));
    std::array<char, 1024> text{"the simulation does not fit this program"};
    const bool isGood =
        check != nullptr && check(GetNarrowPath(scenario).c_str(), text.data(), text.size()) == 0;
    if (!isGood) *message = text.data();
    return isGood;
}

}  // namespace ZentaraProgram
