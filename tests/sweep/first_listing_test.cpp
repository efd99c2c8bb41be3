// The first listing of a process loads the simulation's module. Everything that it opens or
// allocates on the way there fails once, in a process of its own.

#include <gtest/gtest.h>

#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <iterator>

#include "sweep/sweep_round.h"

namespace ZV::Test {
namespace {

constexpr std::uint64_t FirstRoundsMax = 100;  ///< Far above what a load takes.

/// What the process of a round tells of it.
enum ChildCode : int { AllWell, LoadFailed, FailedBehindTheLoad, HasProblem };

std::size_t FindListing() {
    return static_cast<std::size_t>(
        std::find_if(std::begin(Stories), std::end(Stories),
                     [](const Story& story) { return story.name == "list"; }) -
        std::begin(Stories));
}

int RunInThisProcess(std::uint64_t number) {
    const RoundOutcome outcome =
        RunFirstRound({.story = FindListing(), .failure = Failure::NoMemory, .number = number});
    for (const std::string& problem : outcome.problems) {
        (void)std::fprintf(stderr, "%s\n", problem.c_str());
    }
    if (!outcome.problems.empty() || !outcome.hasFailed) return HasProblem;
    if (GetModuleLoads().failed != 0) return LoadFailed;
    return GetModuleLoads().allocationsLeft > 0 ? FailedBehindTheLoad : AllWell;
}

/// How many of the failures kept the module from being loaded.
int CountFailedLoads(void (*prepare)()) {
    testing::FLAGS_gtest_death_test_style = "threadsafe";
    int failedLoads = 0;
    bool isBehind = false;
    const auto isGood = [&](int status) {
        if (!WIFEXITED(status) || WEXITSTATUS(status) >= HasProblem) return false;
        failedLoads += WEXITSTATUS(status) == LoadFailed ? 1 : 0;
        isBehind = WEXITSTATUS(status) == FailedBehindTheLoad;
        return true;
    };
    for (std::uint64_t number = 1; number < FirstRoundsMax && !isBehind; ++number) {
        const auto run = [&] {
            prepare();
            std::exit(RunInThisProcess(number));
        };
        EXPECT_EXIT(run(), isGood, "") << number;
        if (testing::Test::HasFailure()) break;
    }
    EXPECT_TRUE(isBehind);
    return failedLoads;
}

TEST(FirstListing, WithoutItsModuleLeavesTheLibraryInOrderAndTheNextOneLoadsIt) {
    EXPECT_EQ(1, CountFailedLoads([] {})) << "the module";
}

TEST(FirstListing, WithoutTheListOfMappedFilesLeavesTheLibraryInOrder) {
    EXPECT_EQ(2, CountFailedLoads(NameImageRelatively)) << "the list and the module";
}

}  // namespace
}  // namespace ZV::Test
