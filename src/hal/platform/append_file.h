#pragma once

#include <cstddef>

namespace ZV {

/// A file that records are appended to. None of the operations takes a lock of ours, and none
/// changes the thread's last platform error.
struct AppendFile;

/// Opens for appending and makes the file when it is not there. Null when that cannot be done, and
/// for a device or a pipe, which could block. Never waits.
AppendFile* OpenAppendFile(const char* path);

/// Appends with one write, so that what several threads or processes append lies there in whole
/// pieces. The bytes have left the process on return: a crash does not lose them. What the system
/// refuses is lost without a word, and without the signal that would end the process. Thread-safe.
void AppendToFile(AppendFile* file, const void* bytes, std::size_t count);

/// Null is ignored.
void CloseAppendFile(AppendFile* file);

}  // namespace ZV
