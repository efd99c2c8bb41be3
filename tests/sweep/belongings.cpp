#include "sweep/belongings.h"

#include <signal.h>
#include <unistd.h>

#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <iterator>

#include "support/rounds.h"
#include "support/wait_until.h"

namespace ZV::Test {
namespace {

constexpr unsigned RoundSecondsMax = IsSanitized ? 240 : 60;

char hangingText[256];

std::size_t CountEntries(const char* folder) {
    std::error_code ignored;
    const std::filesystem::directory_iterator entries(folder, ignored);
    return static_cast<std::size_t>(std::distance(begin(entries), end(entries)));
}

}  // namespace

Belongings::Belongings()
    : threads(CountEntries("/proc/self/task")), files(CountEntries("/proc/self/fd")) {}

const Belongings& GetOwnBelongings() {
    static const Belongings own;
    return own;
}

void CheckBelongings(const Belongings& own, std::vector<std::string>* problems) {
    Belongings now;
    const bool isBack = WaitUntil([&] {
        now = Belongings{};
        return now.threads <= own.threads && now.files <= own.files;
    });
    if (isBack) return;
    problems->push_back("left behind: " + std::to_string(now.threads) + " threads where " +
                        std::to_string(own.threads) + " were, " + std::to_string(now.files) +
                        " files for " + std::to_string(own.files));
}

Watchdog::Watchdog(const std::string& text) {
    (void)std::snprintf(hangingText, sizeof hangingText, "\nThe round hangs: %s\n", text.c_str());
    (void)signal(SIGALRM, [](int) {
        (void)!write(STDERR_FILENO, hangingText, std::strlen(hangingText));
        abort();
    });
    (void)alarm(RoundSecondsMax);
}

Watchdog::~Watchdog() {
    (void)alarm(0);
}

}  // namespace ZV::Test
