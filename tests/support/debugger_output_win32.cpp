#include <windows.h>

#include <mutex>

#include "support/debugger_output.h"

// The system tells a debugger of a text by an exception, which the process itself sees as well.

namespace ZV::Test {
namespace {

constexpr DWORD CodeOfText = 0x40010006;

std::mutex textLock;
std::string heard;  // guarded by textLock

LONG CALLBACK HearText(EXCEPTION_POINTERS* exception) {
    const EXCEPTION_RECORD& record = *exception->ExceptionRecord;
    if (record.ExceptionCode != CodeOfText || record.NumberParameters < 2) {
        return EXCEPTION_CONTINUE_SEARCH;
    }
    const std::lock_guard lock(textLock);
    heard += reinterpret_cast<const char*>(record.ExceptionInformation[1]);
    return EXCEPTION_CONTINUE_EXECUTION;
}

}  // namespace

struct DebuggerOutput::Listener {
    PVOID handler = AddVectoredExceptionHandler(1, HearText);
};

DebuggerOutput::DebuggerOutput() : listener(std::make_unique<Listener>()) {
    const std::lock_guard lock(textLock);
    heard.clear();
}

DebuggerOutput::~DebuggerOutput() {
    RemoveVectoredExceptionHandler(listener->handler);
}

std::string DebuggerOutput::Take() {
    const std::string text = Read();
    const std::size_t first = taken;
    taken = text.size();
    return text.substr(first);
}

std::string DebuggerOutput::Read() const {
    const std::lock_guard lock(textLock);
    return heard;
}

}  // namespace ZV::Test
