#include <gtest/gtest.h>
#include <windows.h>

#include <atomic>
#include <chrono>
#include <string>
#include <vector>

#include "support/scoped_variable.h"
#include "support/temporary_folder.h"
#include "support/wait_until.h"
#include "windows/support/child_process.h"
#include "zentara/zentara.h"

// Calls from a callback that wait for ever, each in a child process, which cannot end by itself.
namespace ZV::Test {
namespace {

using namespace std::chrono_literals;

constexpr std::uint32_t FrameBytes = 64 * 48;
constexpr const char* Scenario = R"({"base": "mono",
    "cameras": [{"sensor": {"width": 64, "height": 48}}]})";
constexpr auto LongerThanAnyCall = 1s;

ZentaraHandle handle = {};
std::atomic<bool> hasBegun{false};
std::atomic<bool> hasReturned{false};

template <typename Call>
void CallAround(Call&& call) {
    if (hasBegun.exchange(true)) return;
    call();
    hasReturned = true;
}

void AbortFromCallback(std::uint64_t, std::uint32_t, std::uint32_t, std::uint32_t) {
    CallAround([] { (void)Zentara_Abort(handle); });
}

void CloseFromCallback(std::uint64_t, std::uint32_t, std::uint32_t, std::uint32_t) {
    CallAround([] { (void)Zentara_CloseCamera(handle); });
}

void QueueFromCallback(std::uint64_t, std::uint32_t, std::uint32_t, std::uint32_t) {
    CallAround([] {
        Zentara_Frame frame{};
        (void)Zentara_QueueFrame(handle, &frame, nullptr, 0, 0, 0);
    });
}

/// Returns from its callback, so that the others are seen to be no accident.
void ReadFromCallback(std::uint64_t, std::uint32_t, std::uint32_t, std::uint32_t) {
    CallAround([] {
        Zentara_Settings settings{};
        (void)Zentara_ReadSettingsFromCam(handle, &settings);
    });
}

void Open() {
    Zentara_CamListItem item{};
    std::uint32_t length = 1;
    ASSERT_EQ(zerrNone, Zentara_LoadDriver());
    ASSERT_EQ(zerrNone, Zentara_ListCameras(&item, &length));
    ASSERT_EQ(zerrNone, Zentara_OpenCamera(item.cameraId, &handle));
}

void QueueOneFrame(ZentaraAsyncCallback callback) {
    // Never freed: the library may fill them for as long as the process lives.
    auto* const pixels = new std::vector<std::uint8_t>(FrameBytes);
    auto* const frame = new Zentara_Frame{};
    frame->pBuffer = pixels->data();
    frame->bufferSize = FrameBytes;
    ASSERT_EQ(zerrNone, Zentara_QueueFrame(handle, frame, callback, zcbFrameDone, 0, 0));
    ASSERT_EQ(zerrNone, Zentara_SetStreaming(handle, 1));
}

DWORD WINAPI QueueSettings(void* callback) {
    Zentara_Settings settings{};
    (void)Zentara_ReadSettingsFromCam(handle, &settings);
    (void)Zentara_QueueSettings(handle, &settings, reinterpret_cast<ZentaraAsyncCallback>(callback),
                                zcbFrameDone, 0, 0);
    return 0;
}

void Begin(const std::string& word) {
    if (word == "abort") return QueueOneFrame(AbortFromCallback);
    if (word == "close") return QueueOneFrame(CloseFromCallback);
    if (word == "read") return QueueOneFrame(ReadFromCallback);
    ASSERT_EQ("queue", word);
    ASSERT_NE(nullptr, CreateThread(nullptr, 0, QueueSettings,
                                    reinterpret_cast<void*>(QueueFromCallback), 0, nullptr));
}

/// The child of the tests below. Its code is 0 when the call waits, 3 when it has returned.
TEST(DISABLED_WaitingClient, CallsFromACallback) {
    Open();
    if (!HasFailure()) Begin(GetChildWord());
    EXPECT_TRUE(WaitUntil([] { return hasBegun.load(); }));
    const bool isBack = WaitUntil([] { return hasReturned.load(); }, LongerThanAnyCall);
    TerminateProcess(GetCurrentProcess(), HasFailure() ? 1 : isBack ? 3 : 0);
}

DWORD RunClient(const std::string& word) {
    const TemporaryFolder folder;
    const std::string scenario = folder.WriteFile("scenario.json", Scenario);
    const ScopedVariable simulation("ZENTARA_SIMULATION", scenario.c_str());
    ChildProcess::Options options;
    options.word = word;
    return ChildProcess("DISABLED_WaitingClient.*", options).WaitForExitCode();
}

TEST(WaitForEver, AnAbortFromAFrameCallbackWaitsForItself) {
    EXPECT_EQ(0U, RunClient("abort"));
}

TEST(WaitForEver, ACloseFromAFrameCallbackWaitsForItsOwnThread) {
    EXPECT_EQ(0U, RunClient("close"));
}

TEST(WaitForEver, AQueueCallFromTheCallbackOfSettingsAppliedAtOnceWaitsForItself) {
    EXPECT_EQ(0U, RunClient("queue"));
}

TEST(WaitForEver, AReadFromAFrameCallbackReturns) {
    EXPECT_EQ(3U, RunClient("read"));
}

}  // namespace
}  // namespace ZV::Test
