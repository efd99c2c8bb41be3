#include "hal/platform/append_file.h"

#include <windows.h>

#include <new>

namespace ZV {

struct AppendFile {
    HANDLE handle;
};

namespace {

/// The file, or INVALID_HANDLE_VALUE: a device or a pipe may block each write for ever.
HANDLE OpenFileOfADisk(const char* path) {
    const HANDLE handle =
        CreateFileA(path, FILE_APPEND_DATA, FILE_SHARE_READ | FILE_SHARE_WRITE | FILE_SHARE_DELETE,
                    nullptr, OPEN_ALWAYS, FILE_ATTRIBUTE_NORMAL, nullptr);
    if (handle == INVALID_HANDLE_VALUE || GetFileType(handle) == FILE_TYPE_DISK) return handle;
    CloseHandle(handle);
    return INVALID_HANDLE_VALUE;
}

}  // namespace

AppendFile* OpenAppendFile(const char* path) {
    const DWORD savedError = GetLastError();
    const HANDLE handle = OpenFileOfADisk(path);
    auto* const file =
        handle != INVALID_HANDLE_VALUE ? new (std::nothrow) AppendFile{handle} : nullptr;
    if (file == nullptr && handle != INVALID_HANDLE_VALUE) CloseHandle(handle);
    SetLastError(savedError);
    return file;
}

void AppendToFile(AppendFile* file, const void* bytes, std::size_t count) {
    const DWORD savedError = GetLastError();
    DWORD written = 0;
    WriteFile(file->handle, bytes, static_cast<DWORD>(count), &written, nullptr);
    SetLastError(savedError);
}

void CloseAppendFile(AppendFile* file) {
    if (file == nullptr) return;
    const DWORD savedError = GetLastError();
    CloseHandle(file->handle);
    delete file;
    SetLastError(savedError);
}

}  // namespace ZV
