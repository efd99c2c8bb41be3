#include <gtest/gtest.h>
#include <sys/wait.h>
#include <unistd.h>

#include <csignal>
#include <cstdlib>
#include <fstream>
#include <string>

#include "support/flat_camera.h"

// Calls from a callback that wait for ever, each in a child process.

namespace ZV::Test {
namespace {

int reportPipe[2];
ZentaraHandle childHandle;

void Report(pid_t thread) {
    if (write(reportPipe[1], &thread, sizeof(thread)) != sizeof(thread)) _exit(2);
}

/// Tells the parent who calls, and that the call returned if ever it does.
template <typename Call>
void ReportAround(Call&& call) {
    Report(gettid());
    call();
    Report(0);
}

void AbortFromCallback(std::uint64_t, std::uint32_t, std::uint32_t, std::uint32_t) {
    ReportAround([] { (void)Zentara_Abort(childHandle); });
}

void CloseFromCallback(std::uint64_t, std::uint32_t, std::uint32_t, std::uint32_t) {
    ReportAround([] { (void)Zentara_CloseCamera(childHandle); });
}

void QueueFromCallback(std::uint64_t, std::uint32_t, std::uint32_t, std::uint32_t) {
    ReportAround([] {
        Zentara_Frame frame{};
        (void)Zentara_QueueFrame(childHandle, &frame, nullptr, 0, 0, 0);
    });
}

void Require(ZentaraResult result) {
    if (result != zerrNone) _exit(2);
}

void OpenInChild() {
    Zentara_CamListItem item{};
    std::uint32_t length = 1;
    Require(Zentara_LoadDriver());
    Require(Zentara_ListCameras(&item, &length));
    Require(Zentara_OpenCamera(0, &childHandle));
}

[[noreturn]] void RunFrameCallback(ZentaraAsyncCallback callback) {
    OpenInChild();
    ClientFrame frame(64 * 48);
    Require(Zentara_QueueFrame(childHandle, frame.Get(), callback, zcbFrameDone, 0, 0));
    Require(Zentara_SetStreaming(childHandle, 1));
    while (true) pause();
}

[[noreturn]] void RunSettingsCallback(ZentaraAsyncCallback callback) {
    OpenInChild();
    Zentara_Settings settings{};
    Require(Zentara_ReadSettingsFromCam(childHandle, &settings));
    (void)Zentara_QueueSettings(childHandle, &settings, callback, zcbFrameDone, 0, 0);
    _exit(3);
}

bool IsThreadAsleep(pid_t process, pid_t thread) {
    std::ifstream stat("/proc/" + std::to_string(process) + "/task/" + std::to_string(thread) +
                       "/stat");
    std::string text;
    std::getline(stat, text);
    const std::size_t name = text.rfind(')');
    return name != std::string::npos && text.substr(name + 2, 1) == "S";
}

/// True when the thread that `run` reports is seen to wait, and its call has not returned by then.
bool DoesWaitForEver(void (*run)(ZentaraAsyncCallback), ZentaraAsyncCallback callback) {
    const SimulationWorld world(SmallMono);
    if (pipe(reportPipe) != 0) return false;
    const pid_t child = fork();
    if (child == 0) run(callback);
    close(reportPipe[1]);
    pid_t thread = 0;
    const bool hasReported = read(reportPipe[0], &thread, sizeof(thread)) == sizeof(thread);
    std::uint32_t asleep = 0;
    const bool isWaiting = hasReported && WaitUntil([&] {
                               if (IsThreadAsleep(child, thread)) ++asleep;
                               return asleep >= 100;
                           });
    kill(child, SIGKILL);
    waitpid(child, nullptr, 0);
    const bool hasReturned = read(reportPipe[0], &thread, sizeof(thread)) != 0;
    close(reportPipe[0]);
    return isWaiting && !hasReturned;
}

TEST(WaitForEver, AnAbortFromAFrameCallbackWaitsForItself) {
    EXPECT_TRUE(DoesWaitForEver(RunFrameCallback, AbortFromCallback));
}

TEST(WaitForEver, ACloseFromAFrameCallbackWaitsForItsOwnThread) {
    EXPECT_TRUE(DoesWaitForEver(RunFrameCallback, CloseFromCallback));
}

TEST(WaitForEver, AQueueCallFromTheCallbackOfSettingsAppliedAtOnceWaitsForItself) {
    EXPECT_TRUE(DoesWaitForEver(RunSettingsCallback, QueueFromCallback));
}

}  // namespace
}  // namespace ZV::Test
