#pragma once

#include <windows.h>

#include <mutex>
#include <string>
#include <utility>
#include <vector>

namespace ZV::Test {

/// What this process hands to the debugger output while the object lives, in its order; no other
/// listener sees it. One at a time.
class DebuggerTexts {
  public:
    DebuggerTexts() {
        (void)Take();
        handler = AddVectoredExceptionHandler(/*First=*/1, Receive);
    }
    ~DebuggerTexts() { RemoveVectoredExceptionHandler(handler); }
    DebuggerTexts(const DebuggerTexts&) = delete;
    DebuggerTexts& operator=(const DebuggerTexts&) = delete;

    /// The texts since the last call.
    [[nodiscard]] std::vector<std::string> Take() const {
        const std::lock_guard hold(m_mutex);
        return std::exchange(m_texts, {});
    }

  private:
    static constexpr DWORD PrintException = 0x40010006;

    static LONG CALLBACK Receive(EXCEPTION_POINTERS* pointers) {
        const EXCEPTION_RECORD& record = *pointers->ExceptionRecord;
        if (record.ExceptionCode != PrintException) return EXCEPTION_CONTINUE_SEARCH;
        const std::lock_guard hold(m_mutex);
        m_texts.emplace_back(reinterpret_cast<const char*>(record.ExceptionInformation[1]));
        return EXCEPTION_CONTINUE_EXECUTION;
    }

    static inline std::mutex m_mutex;
    static inline std::vector<std::string> m_texts;
    void* handler;
};

}  // namespace ZV::Test
