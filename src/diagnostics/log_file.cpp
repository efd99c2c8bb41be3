// The file of the log. Any thread writes, opens and closes. Writers take no lock: each counts
// itself in before it looks at `logFile` and out when it is done. Who closes takes the file out of
// `logFile` first and then waits until nobody is counted in. Both sides go by sequentially
// consistent operations, so one of the two sees the other.

#include <atomic>
#include <chrono>
#include <thread>

#include "diagnostics/log_state.h"
#include "hal/platform/append_file.h"
#include "hal/platform/clock.h"

namespace ZV {

namespace {

static_assert(std::atomic<AppendFile*>::is_always_lock_free);
static_assert(std::atomic<std::uint64_t>::is_always_lock_free);

std::atomic<AppendFile*> logFile{nullptr};
std::atomic<std::uint32_t> writerCount{0};

constexpr std::uint64_t WriterMicrosecondsMax = 1000000;
/// Pause between two looks: a writer of a lower priority needs the processor.
constexpr std::chrono::microseconds LookInterval{100};

bool AreWritersDone() {
    const std::uint64_t deadline = GetMonotonicMicroseconds() + WriterMicrosecondsMax;
    while (writerCount.load() != 0) {
        if (GetMonotonicMicroseconds() > deadline) return false;
        std::this_thread::sleep_for(LookInterval);
    }
    return true;
}

void ExchangeFile(AppendFile* next) {
    AppendFile* const former = logFile.exchange(next);
    if (former == nullptr) return;
    // A write that hangs in the system keeps its file: closed, its number could become another's.
    if (AreWritersDone()) CloseAppendFile(former);
}

}  // namespace

bool OpenLogFile(const char* path) {
    CloseLogFile();
    AppendFile* const file = OpenAppendFile(path);
    ExchangeFile(file);
    return file != nullptr;
}

void CloseLogFile() {
    ExchangeFile(nullptr);
}

bool IsLogFileOpen() {
    return logFile.load(std::memory_order_relaxed) != nullptr;
}

void WriteToLogFile(const char* bytes, std::size_t count) {
    writerCount.fetch_add(1);
    AppendFile* const file = logFile.load();
    if (file != nullptr) AppendToFile(file, bytes, count);
    writerCount.fetch_sub(1);
}

}  // namespace ZV
