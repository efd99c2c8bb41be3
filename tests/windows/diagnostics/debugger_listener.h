#pragma once

#include <gtest/gtest.h>
#include <windows.h>

#include <algorithm>
#include <mutex>
#include <string>
#include <thread>
#include <vector>

#include "support/wait_until.h"

namespace ZV::Test {

/// Listens to the debugger output of all processes, as the system's viewers do. One at a time.
class DebuggerListener {
  public:
    DebuggerListener() {
        EXPECT_NE(view, nullptr);
        thread = std::thread([this] { Listen(); });
    }
    ~DebuggerListener() {
        SetEvent(end);
        thread.join();
        UnmapViewOfFile(view);
        for (HANDLE handle : {end, isDataThere, isBufferFree, mapping}) CloseHandle(handle);
    }
    DebuggerListener(const DebuggerListener&) = delete;
    DebuggerListener& operator=(const DebuggerListener&) = delete;

    /// What the process `processId`, which has ended, has sent.
    [[nodiscard]] std::vector<std::string> GetTextsOf(DWORD processId) {
        // Texts come one at a time: with one of our own all that came before it has arrived.
        const std::string mark = "mark " + std::to_string(++markCount);
        OutputDebugStringA(mark.c_str());
        EXPECT_TRUE(WaitUntil([&] {
            const std::vector<std::string> own = FindTextsOf(GetCurrentProcessId());
            return std::find(own.begin(), own.end(), mark) != own.end();
        }));
        return FindTextsOf(processId);
    }

  private:
    static constexpr DWORD BufferBytes = 4096;

    struct Buffer {
        DWORD processId;
        char text[BufferBytes - sizeof(DWORD)];
    };
    struct Text {
        DWORD processId;
        std::string text;
    };

    void Listen() {
        const HANDLE handles[] = {isDataThere, end};
        SetEvent(isBufferFree);
        while (WaitForMultipleObjects(2, handles, FALSE, INFINITE) == WAIT_OBJECT_0) {
            Keep();
            SetEvent(isBufferFree);
        }
    }
    void Keep() {
        const std::lock_guard hold(mutex);
        const std::size_t length = strnlen(view->text, sizeof view->text);
        texts.push_back({view->processId, std::string(view->text, length)});
    }
    std::vector<std::string> FindTextsOf(DWORD processId) {
        const std::lock_guard hold(mutex);
        std::vector<std::string> found;
        for (const Text& text : texts) {
            if (text.processId == processId) found.push_back(text.text);
        }
        return found;
    }

    std::mutex mutex;
    std::vector<Text> texts;  // guarded by mutex
    int markCount = 0;
    HANDLE mapping = CreateFileMappingA(INVALID_HANDLE_VALUE, nullptr, PAGE_READWRITE, 0,
                                        BufferBytes, "DBWIN_BUFFER");
    HANDLE isBufferFree = CreateEventA(nullptr, FALSE, FALSE, "DBWIN_BUFFER_READY");
    HANDLE isDataThere = CreateEventA(nullptr, FALSE, FALSE, "DBWIN_DATA_READY");
    HANDLE end = CreateEventA(nullptr, TRUE, FALSE, nullptr);
    const Buffer* view =
        static_cast<const Buffer*>(MapViewOfFile(mapping, FILE_MAP_READ, 0, 0, BufferBytes));
    std::thread thread;
};

}  // namespace ZV::Test
