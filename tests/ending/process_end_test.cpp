#include <gtest/gtest.h>
#include <poll.h>
#include <signal.h>
#include <sys/wait.h>
#include <unistd.h>

#include <chrono>
#include <random>
#include <string>
#include <tuple>

#include "support/temporary_folder.h"
#include "support/wait_until.h"

// A process may end at any moment, loaded or streaming, and gives nothing back: it ends at once.
namespace ZV::Test {
namespace {

using namespace std::chrono_literals;

constexpr auto EndLimit = 2s;
constexpr int StartLimitMs = 60000;
constexpr const char* Scenario = R"({"timeScale": 0, "cameras": [{"model": "SolvaneA1",
    "sensor": {"width": 160, "height": 120}, "scene": {"kind": "flat"}}]})";

/// A run of the client, killed at the latest with the object.
class EndingClient {
  public:
    EndingClient(const std::string& scenario, std::uint32_t moment, const std::string& way) {
        int ends[2] = {};
        if (pipe(ends) != 0) return;
        process = fork();
        if (process == 0) {
            dup2(ends[1], STDOUT_FILENO);
            close(ends[0]);
            close(ends[1]);
            setenv("ZENTARA_SIMULATION", scenario.c_str(), 1);
            const std::string number = std::to_string(moment);
            execl(ZENTARA_BINARY_DIR "/tests/ending-client", "ending-client", number.c_str(),
                  way.c_str(), nullptr);
            _exit(127);
        }
        close(ends[1]);
        output = ends[0];
    }
    ~EndingClient() {
        if (!hasEnded) {
            kill(process, SIGKILL);
            waitpid(process, &status, 0);
        }
        close(output);
    }
    EndingClient(const EndingClient&) = delete;
    EndingClient& operator=(const EndingClient&) = delete;

    /// Waits until it tells that it ends. What the library prints comes before.
    bool WaitForItsWord() const {
        pollfd waited{output, POLLIN, 0};
        char byte = 0;
        while (byte != 'E') {
            if (poll(&waited, 1, StartLimitMs) != 1 || read(output, &byte, 1) != 1) return false;
        }
        return true;
    }
    bool WaitForEnd() {
        hasEnded =
            WaitUntil([&] { return waitpid(process, &status, WNOHANG) == process; }, EndLimit);
        return hasEnded;
    }
    bool HasEndedAs(const std::string& way) const {
        if (way == "terminate") return WIFSIGNALED(status) && WTERMSIG(status) == SIGTERM;
        return WIFEXITED(status) && WEXITSTATUS(status) == 0;
    }
    int GetStatus() const { return status; }

  private:
    int process = -1, output = -1, status = 0;
    bool hasEnded = false;
};

class ProcessEnd : public testing::TestWithParam<const char*> {};

TEST_P(ProcessEnd, ComesWithinTwoSecondsAtAnyMoment) {
    constexpr std::uint32_t Seed = 7;
    constexpr int Moments = 12;
    SCOPED_TRACE("seed " + std::to_string(Seed));
    std::mt19937 random(Seed);
    const TemporaryFolder folder;
    const std::string scenario = folder.WriteFile("scenario.json", Scenario);
    for (int i = 0; i < Moments; ++i) {
        // The first 60 requests list and open; a stream alone has hundreds.
        const auto moment = static_cast<std::uint32_t>(random() % (i % 2 == 0 ? 60 : 3000));
        SCOPED_TRACE("after " + std::to_string(moment) + " requests");
        EndingClient client(scenario, moment, GetParam());
        ASSERT_TRUE(client.WaitForItsWord());
        EXPECT_TRUE(client.WaitForEnd());
        EXPECT_TRUE(client.HasEndedAs(GetParam())) << "status " << client.GetStatus();
    }
}

INSTANTIATE_TEST_SUITE_P(Ways, ProcessEnd,
                         testing::Values("return", "exit", "quickExit", "exitAtOnce", "terminate",
                                         "frameCallback", "exposureCallback", "settingsCallback",
                                         "triggerWait"),
                         [](const auto& way) { return std::string(way.param); });

}  // namespace
}  // namespace ZV::Test
