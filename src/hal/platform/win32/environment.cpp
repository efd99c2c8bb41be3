#include "hal/platform/environment.h"

#include <windows.h>

#include <cstddef>
#include <iterator>
#include <memory>
#include <new>

namespace ZV {
namespace {

constexpr DWORD CharactersMax = 32767;

/// Characters of the variable without the zero; -1 if it is not set.
int ReadVariable(const char* name, wchar_t* value) {
    wchar_t wideName[64] = {};  // ours are ASCII and shorter
    for (std::size_t i = 0; name[i] != '\0' && i + 1 < std::size(wideName); ++i) {
        wideName[i] = static_cast<unsigned char>(name[i]);
    }
    SetLastError(ERROR_SUCCESS);
    const DWORD length = GetEnvironmentVariableW(wideName, value, CharactersMax + 1);
    const bool isSet = length <= CharactersMax && (length > 0 || GetLastError() == ERROR_SUCCESS);
    return isSet ? static_cast<int>(length) : -1;
}

}  // namespace

// The system is asked, not the runtime: a client with another runtime sets its own copy of the
// variables. Programs here have no privileges beyond those of who starts them. The text is turned
// to the code page here, since not every system counts its bytes when it has several a letter.
const char* GetLibraryVariable(const char* name) {
    static thread_local char text[CharactersMax + 1];
    const DWORD savedError = GetLastError();
    const std::unique_ptr<wchar_t[]> value(new (std::nothrow) wchar_t[CharactersMax + 1]);
    const int length = value != nullptr ? ReadVariable(name, value.get()) : -1;
    const bool isSet = length >= 0 && WideCharToMultiByte(CP_ACP, 0, value.get(), length + 1, text,
                                                          sizeof text, nullptr, nullptr) > 0;
    SetLastError(savedError);
    return isSet ? text : nullptr;
}

}  // namespace ZV
