#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <numeric>
#include <vector>

#include "soak/frame_numbers.h"
#include "soak/process_usage.h"
#include "soak/soak_sums.h"
#include "soak/stale_numbers.h"
#include "support/scoped_variable.h"
#include "tools/program.h"

// What the soak concludes from what it measures, and what it takes over into its next run.
namespace ZentaraTest {
namespace {

using ZV::Soak::FrameNumbers;
using ZV::Soak::GrowthJudge;
using ZV::Soak::PacketTroubles;
using ZV::Soak::ProcessUsage;
using ZV::Soak::SoakState;
using ZV::Soak::SoakSums;
using ZV::Soak::StaleNumbers;

/// A soak as scripts/soak runs it, with the waits of a camera that has gone short.
ProgramResult RunSoak(const std::vector<std::string>& options) {
    const ZV::Test::ScopedVariable divisor("ZENTARA_WAIT_DIVISOR", "50");
    std::vector<std::string> words{ZENTARA_BINARY_DIR "/tests/zentara-soak"};
    words.insert(words.end(), options.begin(), options.end());
    return RunTool(words);
}

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

TEST(GrowthJudgeTest, JudgesNothingBeforeTheSecondMinuteEnds) {
    GrowthJudge judge;
    EXPECT_EQ(nullptr, judge.GetFirstMinute());
    AddMinute(judge, {MakeUsage(50, 10), MakeUsage(40, 12)});

    EXPECT_FALSE(judge.HasJudged());
    ASSERT_NE(nullptr, judge.GetFirstMinute());
    EXPECT_EQ(std::uint64_t{50} << 20, judge.GetFirstMinute()->heapBytes);
    EXPECT_EQ(12U, judge.GetFirstMinute()->handles);

    AddMinute(judge, {MakeUsage(50, 10)});

    EXPECT_TRUE(judge.HasJudged());
}

TEST(GrowthJudgeTest, JudgesTheFirstMinuteOfARunThatGoesOnAgainstTheFirstOfAll) {
    GrowthJudge judge;
    judge.GoOnFrom(MakeUsage(50, 10));

    AddMinute(judge, {MakeUsage(80, 10)});

    EXPECT_TRUE(judge.HasJudged());
    EXPECT_FALSE(judge.IsSteady());
}

TEST(FrameNumbersTest, BelievesWhatTheCameraHasNumberedAcrossLossesAndWraps) {
    FrameNumbers numbers;
    numbers.Begin(65530);

    EXPECT_EQ(FrameNumbers::Verdict::Good, numbers.Judge(65535, false, 65535));
    EXPECT_EQ(FrameNumbers::Verdict::Good, numbers.Judge(4, false, 65541));
    EXPECT_EQ(FrameNumbers::Verdict::Good, numbers.Judge(30000, false, 95536));
    EXPECT_EQ(95536U, numbers.GetLast());
}

TEST(FrameNumbersTest, FindsANumberThatTheCameraHasNotReached) {
    FrameNumbers numbers;
    numbers.Begin(100);

    EXPECT_EQ(FrameNumbers::Verdict::Wrong, numbers.Judge(106, false, 105));
    EXPECT_EQ(FrameNumbers::Verdict::Good, numbers.Judge(105, false, 105));
}

TEST(FrameNumbersTest, FindsANumberOfAFrameBeforeTheLastAndOfAFormerOpening) {
    FrameNumbers numbers;
    numbers.Begin(100);

    EXPECT_EQ(FrameNumbers::Verdict::Wrong, numbers.Judge(99, true, 110));
    EXPECT_EQ(FrameNumbers::Verdict::Good, numbers.Judge(104, false, 110));
    EXPECT_EQ(FrameNumbers::Verdict::Wrong, numbers.Judge(103, true, 110));
    EXPECT_EQ(FrameNumbers::Verdict::Good, numbers.Judge(105, false, 110));
}

TEST(FrameNumbersTest, TakesANumberTwiceWhenOneOfTheFramesIsDamaged) {
    FrameNumbers numbers;
    numbers.Begin(100);

    EXPECT_EQ(FrameNumbers::Verdict::Good, numbers.Judge(101, true, 110));
    EXPECT_EQ(FrameNumbers::Verdict::Repeated, numbers.Judge(101, false, 110));
    EXPECT_EQ(FrameNumbers::Verdict::Wrong, numbers.Judge(101, false, 110));
}

/// What went wrong, by the number of the frame that the camera had begun by then.
struct TroublePlan {
    std::vector<std::uint64_t> failures, corruptions;

    PacketTroubles CountTo(std::uint64_t used) const {
        const auto count = [=](const std::vector<std::uint64_t>& numbers) {
            return static_cast<std::uint32_t>(std::count_if(
                numbers.begin(), numbers.end(), [=](auto number) { return number <= used; }));
        };
        return {used, count(failures), count(corruptions)};
    }
};

struct StaleRow {
    const char* story;
    bool isDamaged;
    std::uint64_t number;
    TroublePlan plan;
    bool mayBe;
};

constexpr bool Blocks = true, Plain = false, Damaged = true, Whole = false;
constexpr std::uint64_t FramesPerTurn = 10, Last = 65545, Used = Last + 4;
constexpr std::uint64_t OneTurn = Last - FramesPerTurn, TwoTurns = Last - 2 * FramesPerTurn;
constexpr std::uint16_t AnyNumber = 1234;

std::uint64_t Exchange(std::uint64_t number) {
    return (number & 0xFF) << 8 | (number >> 8 & 0xFF);
}

/// Each frame comes when the camera has begun the same number of frames behind it.
void ExpectVerdicts(bool hasBlocks, const std::vector<StaleRow>& rows) {
    for (const StaleRow& row : rows) {
        StaleNumbers stale(hasBlocks, FramesPerTurn);
        stale.Begin(row.plan.CountTo(Last - 100));
        for (std::uint64_t last = Last - 100; last <= Last; ++last) {
            stale.Add(row.plan.CountTo(last + Used - Last), last);
        }

        const auto number = static_cast<std::uint16_t>(row.number);
        EXPECT_EQ(row.mayBe, stale.MayBe(number, row.isDamaged, Last)) << row.story;
    }
}

TEST(StaleNumbersTest, ExcusesAnyDamagedFrameOfBlocksWhilePacketsCanBeTakenForHeaders) {
    ExpectVerdicts(Blocks,
                   {{"no trouble", Damaged, AnyNumber, {{}, {}}, false},
                    {"read twice", Damaged, AnyNumber, {{OneTurn}, {}}, true},
                    {"read twice, a turn before", Damaged, AnyNumber, {{OneTurn - 1}, {}}, false},
                    {"read twice, whole", Whole, AnyNumber, {{OneTurn, Last}, {}}, false},
                    {"corrupted", Damaged, AnyNumber, {{}, {Last}}, true},
                    {"corrupted before the last", Damaged, AnyNumber, {{}, {Last - 1}}, false},
                    {"corrupted, whole", Whole, AnyNumber, {{}, {Last, Last}}, false}});
}

TEST(StaleNumbersTest, ExcusesAWholeFrameOfBlocksByTwoFailuresAndANumberOfTwoTurns) {
    const TroublePlan twice{{TwoTurns, Last}, {}}, early{{TwoTurns - 1, Last}, {}};
    const TroublePlan once{{Last}, {}};
    ExpectVerdicts(Blocks, {{"the first", Whole, Exchange(TwoTurns), twice, true},
                            {"before the first", Whole, Exchange(TwoTurns - 1), twice, false},
                            {"the last", Whole, Exchange(Used), twice, true},
                            {"behind the last", Whole, Exchange(Used + 1), twice, false},
                            {"not exchanged", Whole, TwoTurns, twice, false},
                            {"failed too early", Whole, Exchange(TwoTurns), early, false},
                            {"failed once", Whole, Exchange(TwoTurns), once, false}});
}

TEST(StaleNumbersTest, ExcusesADamagedFrameOfOtherVersionsByAFailureAndANumberOfOneTurn) {
    const TroublePlan once{{Last}, {}}, early{{Last - 1}, {}}, twice{{TwoTurns, Last}, {}};
    ExpectVerdicts(Plain, {{"the one before", Damaged, Last - 1, once, true},
                           {"the first", Damaged, OneTurn, once, true},
                           {"before the first", Damaged, OneTurn - 1, once, false},
                           {"failed before the last", Damaged, Last - 1, early, false},
                           {"whole", Whole, Last - 1, once, false},
                           {"read thrice", Whole, Exchange(TwoTurns), twice, false},
                           {"corrupted", Damaged, Last - 1, {{}, {Last}}, false}});
}

TEST(StaleNumbersTest, BlamesNothingFromBeforeItsBegin) {
    StaleNumbers stale(Blocks, FramesPerTurn);
    stale.Begin({100, 5, 5});

    stale.Add({101, 5, 5}, 100);
    EXPECT_FALSE(stale.MayBe(AnyNumber, Damaged, 100));

    stale.Add({101, 6, 5}, 100);
    EXPECT_TRUE(stale.MayBe(AnyNumber, Damaged, 100));
}

// What went wrong between two looks may have done so at the end of that time.
TEST(StaleNumbersTest, ExcusesByAllThatWentWrongSinceTheLookBefore) {
    StaleNumbers stale(Blocks, FramesPerTurn);
    stale.Begin({100, 0, 0});
    stale.Add({989, 0, 0}, 950);
    stale.Add({1000, 1, 0}, 989);

    EXPECT_TRUE(stale.MayBe(AnyNumber, Damaged, 1000));
    EXPECT_TRUE(stale.MayBe(AnyNumber, Damaged, 1010));
    EXPECT_FALSE(stale.MayBe(AnyNumber, Damaged, 1011));
}

TEST(SoakStateTest, GoesOnWhereTheFormerRunEnded) {
    const TemporaryFolder folder;
    SoakSums sums;
    sums.frames = 7;
    sums.unaccounted = 1;
    sums.failedWith[16] = 3;
    ASSERT_TRUE(ZV::Soak::WriteState(folder.GetPath("state"), {sums, 3, MakeUsage(50, 10)}));

    SoakState state;
    ASSERT_TRUE(ZV::Soak::ReadState(folder.GetPath("state"), &state));
    SoakSums& read = state.sums;
    read += sums;

    EXPECT_EQ(3U, state.cameras);
    EXPECT_EQ(std::uint64_t{50} << 20, state.firstMinute.heapBytes);
    EXPECT_EQ(20U, state.firstMinute.threads);
    EXPECT_EQ(10U, state.firstMinute.handles);
    EXPECT_EQ(14U, read.frames);
    EXPECT_EQ(2U, read.unaccounted);
    EXPECT_EQ(6U, read.failedWith[16]);
    EXPECT_THAT(ZV::Soak::Describe(read), testing::EndsWith(", failedWith16 6"));
    EXPECT_THAT(folder.ListFiles(), testing::ElementsAre("state"));
}

TEST(SoakStateTest, BeginsAtZeroWithoutAFileAndRefusesAnother) {
    const TemporaryFolder folder;
    SoakState state;

    EXPECT_TRUE(ZV::Soak::ReadState(folder.GetPath("none"), &state));
    EXPECT_EQ(0U, state.sums.frames);
    EXPECT_EQ(0U, state.cameras);
    EXPECT_FALSE(ZV::Soak::ReadState(folder.WriteFile("other", "frames many\n"), &state));
    EXPECT_FALSE(ZV::Soak::ReadState(folder.WriteFile("third", "apples 3\n"), &state));
    EXPECT_FALSE(ZV::Soak::ReadState(folder.WriteFile("fourth", "failedWith33 3\n"), &state));
}

TEST(Soak, RunsForItsTimeAndLosesNothingQuietly) {
    const TemporaryFolder folder;

    const ProgramResult result =
        RunSoak({"--seconds", "3", "--cameras", "3", "--faults", "0.01", "--request-faults",
                 "0.005", "--fault", R"({"kind": "failRequest", "code": "FW_IOCTL_LISTEN"})",
                 "--state", folder.GetPath("state")});

    EXPECT_EQ(0, result.exitCode) << result.output << result.errors;
    EXPECT_THAT(result.output, testing::HasSubstr("unaccounted 0"));
    EXPECT_THAT(result.output, testing::HasSubstr("wrongNumbers 0"));
    EXPECT_THAT(result.output, testing::HasSubstr("growth was not judged"));
    SoakState state;
    EXPECT_TRUE(ZV::Soak::ReadState(folder.GetPath("state"), &state));
    const SoakSums& sums = state.sums;
    EXPECT_EQ(0U, state.cameras) << "three seconds have no first minute";
    EXPECT_GT(sums.frames, 0U);
    EXPECT_GT(sums.damaged, 0U);
    EXPECT_EQ(sums.delivered, sums.frames + sums.withoutTaker);
    EXPECT_EQ(sums.begun, sums.delivered + sums.heldBack + sums.dropped + sums.bad + sums.cleared +
                              sums.waiting);
    EXPECT_GE(sums.requestsFailed, 3U) << "the first start of each camera";
    EXPECT_GE(std::accumulate(sums.failedWith.begin(), sums.failedWith.end(), std::uint64_t{0}),
              3U);
}

// Each camera goes away by itself at its first start, and no fault has failed a request.
TEST(Soak, FailsWhenACallFailsWithoutARequestThatAFaultHasFailed) {
    const ProgramResult result =
        RunSoak({"--seconds", "3", "--cameras", "2", "--faults", "0", "--request-faults", "0",
                 "--fault", R"({"kind": "unplug", "code": "FW_IOCTL_LISTEN"})"});

    EXPECT_EQ(1, result.exitCode) << result.output << result.errors;
    EXPECT_THAT(result.output, testing::HasSubstr("requestsFailed 0,"));
    EXPECT_THAT(result.output, testing::HasSubstr("calls have failed"));
}

TEST(Soak, JudgesItsOwnRunAndTellsOfEarlierOnes) {
    const TemporaryFolder folder;
    SoakState state;
    state.sums.failures = 2;
    state.sums.unaccounted = state.sums.wrongNumbers = state.sums.grown = 1;
    ASSERT_TRUE(ZV::Soak::WriteState(folder.GetPath("state"), state));

    const ProgramResult result =
        RunSoak({"--seconds", "1", "--cameras", "1", "--state", folder.GetPath("state")});

    EXPECT_EQ(0, result.exitCode) << result.output << result.errors;
    EXPECT_THAT(result.output, testing::HasSubstr("of earlier runs: failures 2, unaccounted 1, "
                                                  "wrongNumbers 1, grown 1"));
    ASSERT_TRUE(ZV::Soak::ReadState(folder.GetPath("state"), &state));
    EXPECT_EQ(2U, state.sums.failures);
    EXPECT_EQ(1U, state.sums.grown);
}

TEST(Soak, RefusesWhatIsNotANumberToItsEnd) {
    for (const char* name :
         {"--seconds", "--minute", "--cameras", "--faults", "--request-faults"}) {
        for (const char* text : {"", "x", "1x", "-1", "0,1"}) {
            EXPECT_EQ(2, RunSoak({"--seconds", "1", name, text}).exitCode) << name << " " << text;
        }
    }
    EXPECT_EQ(2, RunSoak({"--seconds", "0"}).exitCode);
    EXPECT_EQ(2, RunSoak({"--seconds", "1", "--faults", "1.5"}).exitCode);
}

TEST(Soak, RefusesMinutesThatAreNone) {
    for (const char* text : {"abc", "--help", "0", "1h", ""}) {
        EXPECT_EQ(2, RunTool({ZENTARA_SOURCE_DIR "/scripts/soak", text}).exitCode) << text;
    }
}

// What has failed before the stream began is no reason for a stop that fails.
TEST(Soak, FailsWhenAStopFailsBehindARequestThatCannotBeTheReason) {
    const ProgramResult result =
        RunSoak({"--seconds", "3", "--cameras", "1", "--faults", "0", "--request-faults", "0",
                 "--fault", R"({"kind": "failRequest", "code": "FW_IOCTL_ALLOC_RESOURCES"})",
                 "--fault", R"({"kind": "unplug", "code": "FW_IOCTL_STOP", "request": 1})"});

    EXPECT_EQ(1, result.exitCode) << result.output << result.errors;
    EXPECT_THAT(result.output, testing::HasSubstr("requestsFailed 1,"));
    EXPECT_THAT(result.errors, testing::HasSubstr("the stop failed"));
}

// The upper half of the number of some frames, behind the header of their first packet. The second
// camera sends no blocks.
TEST(Soak, FailsWhenAFrameComesUnderAWrongNumber) {
    const ProgramResult result = RunSoak(
        {"--seconds", "3", "--cameras", "2", "--faults", "0", "--request-faults", "0", "--fault",
         R"({"kind": "corruptPacket", "packet": 0, "offset": 8, "bytes": 1, "probability": 0.1})"});

    EXPECT_EQ(1, result.exitCode) << result.output << result.errors;
    EXPECT_THAT(result.output, testing::HasSubstr("frames came under a wrong number"));
}

// A tenth of all buffers fails; the frames between them are whole.
TEST(Soak, FailsWhenAWholeFrameOfBlocksComesUnderANumberThatNoFailedBufferHolds) {
    const ProgramResult result = RunSoak(
        {"--seconds", "3", "--cameras", "1", "--faults", "0", "--request-faults", "0", "--fault",
         R"({"kind": "failRequest", "code": "FW_IOCTL_ATTACH_BUFFER", "pended": true,
             "probability": 0.1})",
         "--fault",
         R"({"kind": "corruptPacket", "packet": 0, "offset": 10, "bytes": 1, "probability": 0.1})"});

    EXPECT_EQ(1, result.exitCode) << result.output << result.errors;
    EXPECT_THAT(result.output, testing::HasSubstr("frames came under a wrong number"));
}

TEST(Soak, RefusesAFaultThatIsNone) {
    const ProgramResult result = RunSoak({"--cameras", "1", "--fault", "none"});

    EXPECT_EQ(2, result.exitCode);
}

TEST(Soak, RefusesMoreCamerasThanAListingGives) {
    const ProgramResult result = RunSoak({"--cameras", "11"});

    EXPECT_EQ(2, result.exitCode);
    EXPECT_THAT(result.errors, testing::HasSubstr("--cameras 1-10"));
}

}  // namespace
}  // namespace ZentaraTest
