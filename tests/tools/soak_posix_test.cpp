#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "soak/process_usage.h"
#include "soak/soak_sums.h"
#include "tools/program.h"

// What the soak concludes from what it measures, and what it takes over into its next run.
namespace ZentaraTest {
namespace {

using ZV::Soak::GrowthJudge;
using ZV::Soak::ProcessUsage;
using ZV::Soak::SoakSums;

ProcessUsage MakeUsage(std::uint64_t megabytes, std::uint64_t handles) {
    return {megabytes << 20, megabytes << 20, 20, handles};
}

void AddMinute(GrowthJudge& judge, std::initializer_list<ProcessUsage> usages) {
    for (const ProcessUsage& usage : usages) judge.Add(usage);
    judge.EndMinute();
}

TEST(GrowthJudgeTest, FindsASteadyProcessSteady) {
    GrowthJudge judge;
    AddMinute(judge, {MakeUsage(50, 10), MakeUsage(70, 12)});
    EXPECT_TRUE(judge.IsSteady());

    AddMinute(judge, {MakeUsage(90, 14), MakeUsage(65, 11)});

    EXPECT_TRUE(judge.IsSteady()) << "what comes and goes is no growth";
}

TEST(GrowthJudgeTest, FindsMemoryThatStaysAboveTheFirstMinute) {
    GrowthJudge judge;
    AddMinute(judge, {MakeUsage(50, 10), MakeUsage(70, 12)});
    AddMinute(judge, {MakeUsage(85, 10), MakeUsage(90, 10)});

    EXPECT_FALSE(judge.IsSteady());
}

TEST(GrowthJudgeTest, FindsOneHandleTooMany) {
    GrowthJudge judge;
    AddMinute(judge, {MakeUsage(50, 10)});
    AddMinute(judge, {MakeUsage(50, 11)});

    EXPECT_FALSE(judge.IsSteady());
}

TEST(SoakState, GoesOnWhereTheFormerRunEnded) {
    const TemporaryFolder folder;
    SoakSums sums;
    sums.frames = 7;
    sums.unaccounted = 1;
    ASSERT_TRUE(ZV::Soak::WriteState(folder.GetPath("state"), sums));

    SoakSums read;
    ASSERT_TRUE(ZV::Soak::ReadState(folder.GetPath("state"), &read));
    read += sums;

    EXPECT_EQ(14U, read.frames);
    EXPECT_EQ(2U, read.unaccounted);
    EXPECT_THAT(folder.ListFiles(), testing::ElementsAre("state"));
}

TEST(SoakState, BeginsAtZeroWithoutAFileAndRefusesAnother) {
    const TemporaryFolder folder;
    SoakSums sums;

    EXPECT_TRUE(ZV::Soak::ReadState(folder.GetPath("none"), &sums));
    EXPECT_EQ(0U, sums.frames);
    EXPECT_FALSE(ZV::Soak::ReadState(folder.WriteFile("other", "frames many\n"), &sums));
    EXPECT_FALSE(ZV::Soak::ReadState(folder.WriteFile("third", "apples 3\n"), &sums));
}

TEST(Soak, RunsForItsTimeAndLosesNothingQuietly) {
    const TemporaryFolder folder;

    const ProgramResult result =
        RunTool({ZENTARA_BINARY_DIR "/tests/zentara-soak", "--seconds", "3", "--cameras", "3",
                 "--faults", "0.01", "--state", folder.GetPath("state")});

    EXPECT_EQ(0, result.exitCode) << result.output << result.errors;
    EXPECT_THAT(result.output, testing::HasSubstr("unaccounted 0"));
    SoakSums sums;
    EXPECT_TRUE(ZV::Soak::ReadState(folder.GetPath("state"), &sums));
    EXPECT_GT(sums.frames, 0U);
    EXPECT_GT(sums.damaged, 0U);
}

TEST(Soak, RefusesMoreCamerasThanAListingGives) {
    const ProgramResult result =
        RunTool({ZENTARA_BINARY_DIR "/tests/zentara-soak", "--cameras", "11"});

    EXPECT_EQ(2, result.exitCode);
    EXPECT_THAT(result.errors, testing::HasSubstr("--cameras 1-10"));
}

}  // namespace
}  // namespace ZentaraTest
