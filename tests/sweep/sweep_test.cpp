// Every control request and every allocation of whole stories fails once, in each way. How many
// rounds are run is chosen by variables, which scripts/sweep sets:
//
//   ZENTARA_SWEEP_SECONDS  length of the sample; 0 for all rounds
//   ZENTARA_SWEEP_SEED     of the sample; printed when it is not given
//   ZENTARA_SWEEP_SHARES, ZENTARA_SWEEP_SHARE
//                          among how many processes the cameras are dealt out, and which is this
//   ZENTARA_SWEEP_ONLY     CAMERA:STORY:FAILURE[:NUMBER], each a name or *; s before the number
//                          of an attached buffer, e of the stream's entering or leaving

#include <gtest/gtest.h>

#include <algorithm>
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <map>
#include <random>
#include <set>
#include <sstream>

#include "hal/control_records.h"
#include "support/rounds.h"
#include "sweep/sweep_round.h"

namespace ZV::Test {
namespace {

using Clock = std::chrono::steady_clock;

constexpr int SampleSeconds = IsSanitized ? 50 : 70;
/// In a sample, requests of a stream's own thread that fail in a story: more than the ring holds.
constexpr std::size_t StreamRequestsMax = 200;
/// In a sample, allocations that fail in a story.
constexpr std::size_t AllocationsMax = 400;
/// Rounds more for a request and a way to fail that the sample's first ones have not reached.
constexpr int ExtraRoundsMax = 5;
constexpr std::size_t SampleCameras = IsSanitized ? 2 : 4;  ///< Of each story in a sample.
constexpr std::size_t KindsLeast = 16;                      ///< Of request, in all stories.
constexpr std::size_t ProblemsMax = 200;                    ///< Printed before a sweep gives up.

int ReadNumber(const char* variable, int otherwise) {
    const char* const text = std::getenv(variable);
    return text != nullptr ? std::atoi(text) : otherwise;
}

/// Which rounds are asked for.
class Selection {
  public:
    Selection() {
        const char* const text = std::getenv("ZENTARA_SWEEP_ONLY");
        std::istringstream stream(text != nullptr ? text : "");
        for (std::string part; std::getline(stream, part, ':');) parts.push_back(part);
    }
    bool IsLimited() const { return !parts.empty(); }
    bool HasCamera(std::size_t camera) const {
        return camera % shares == share && Fits(0, SweepCameras[camera].name);
    }
    bool HasStory(std::size_t camera, std::size_t story) const {
        return Test::HasStory(camera, story) && Fits(1, Stories[story].name);
    }
    bool HasRound(const Round& round) const {
        const std::string_view mark = SeriesMarks[static_cast<std::size_t>(round.series)];
        return Fits(2, FailureNames[static_cast<std::size_t>(round.failure)]) &&
               Fits(3, std::string(mark) + std::to_string(round.number));
    }

  private:
    bool Fits(std::size_t part, std::string_view text) const {
        return part >= parts.size() || parts[part] == "*" || parts[part] == text;
    }

    std::vector<std::string> parts;
    std::size_t shares = static_cast<std::size_t>(ReadNumber("ZENTARA_SWEEP_SHARES", 1));
    std::size_t share = static_cast<std::size_t>(ReadNumber("ZENTARA_SWEEP_SHARE", 0));
};

/// Whether a request can fail in this way and in no other that is tried as well.
bool CanFail(Failure failure, const CountedRequest& request) {
    const bool needsPending =
        failure == Failure::AnsweredAtOnce || failure == Failure::CompletesInError;
    return request.mayPend || !needsPending;
}

using StoryKey = std::pair<std::size_t, std::size_t>;

/// All stories, as they go without a failure, and all rounds over them.
struct Plan {
    std::map<StoryKey, CountedStory> stories;
    std::vector<Round> rounds;
};

void AddRounds(std::size_t camera, std::size_t story, const CountedStory& counted,
               const Selection& selection, bool isSample, std::vector<Round>* rounds) {
    const auto add = [&](const Round& round) {
        if (selection.HasRound(round)) rounds->push_back(round);
    };
    for (const RequestSeries series : AllSeries) {
        const auto& requests = counted.requests[static_cast<std::size_t>(series)];
        const bool isCapped = isSample && series == RequestSeries::Stream;
        const std::size_t count =
            isCapped ? std::min(requests.size(), StreamRequestsMax) : requests.size();
        for (std::size_t i = 0; i < count; ++i) {
            for (std::size_t failure = 0; failure < FailureCount; ++failure) {
                const auto kind = static_cast<Failure>(failure);
                if (kind == Failure::NoMemory || !CanFail(kind, requests[i])) continue;
                add({camera, story, kind, series, i + 1, requests[i].code});
            }
        }
    }
    const auto allocations = static_cast<std::size_t>(counted.allocations);
    const std::size_t count = isSample ? std::min(allocations, AllocationsMax) : allocations;
    for (std::size_t i = 1; i <= count; ++i) {
        add({camera, story, Failure::NoMemory, RequestSeries::Calls, i});
    }
}

/// Of each story, on each camera or, for a sample, on some of them.
std::vector<StoryKey> ChooseStories(const Selection& selection, std::size_t camerasMax,
                                    std::mt19937& random) {
    std::vector<StoryKey> keys;
    for (std::size_t story = 0; story < std::size(Stories); ++story) {
        std::vector<StoryKey> all, chosen;
        for (std::size_t camera = 0; camera < std::size(SweepCameras); ++camera) {
            if (selection.HasCamera(camera) && selection.HasStory(camera, story)) {
                all.emplace_back(camera, story);
            }
        }
        std::sample(all.begin(), all.end(), std::back_inserter(chosen), camerasMax, random);
        keys.insert(keys.end(), chosen.begin(), chosen.end());
    }
    return keys;
}

Plan MakePlan(const Selection& selection, bool isSample, std::mt19937& random) {
    const std::size_t camerasMax = isSample ? SampleCameras : std::size(SweepCameras);
    Plan plan;
    for (const auto& [camera, story] : ChooseStories(selection, camerasMax, random)) {
        CountedStory counted = CountStory(camera, story);
        for (const std::string& problem : counted.problems) {
            ADD_FAILURE() << "without a failure, " << SweepCameras[camera].name << ":"
                          << Stories[story].name << ": " << problem;
        }
        const std::size_t before = plan.rounds.size();
        AddRounds(camera, story, counted, selection, isSample, &plan.rounds);
        std::printf("%s:%s: %zu, %zu and %zu requests, %lld allocations, %zu rounds\n",
                    SweepCameras[camera].name.data(), Stories[story].name.data(),
                    counted.requests[0].size(), counted.requests[1].size(),
                    counted.requests[2].size(), static_cast<long long>(counted.allocations),
                    plan.rounds.size() - before);
        plan.stories.emplace(StoryKey{camera, story}, std::move(counted));
    }
    return plan;
}

/// Brings the rounds into an order by chance in which stories and ways to fail take turns.
void ShuffleInTurns(std::vector<Round>* rounds, std::mt19937& random) {
    std::shuffle(rounds->begin(), rounds->end(), random);
    std::map<std::pair<std::size_t, Failure>, std::size_t> counts;
    std::vector<std::pair<std::size_t, Round>> turns;
    for (const Round& round : *rounds) {
        turns.emplace_back(counts[{round.story, round.failure}]++, round);
    }
    std::stable_sort(turns.begin(), turns.end(),
                     [](const auto& left, const auto& right) { return left.first < right.first; });
    std::transform(turns.begin(), turns.end(), rounds->begin(),
                   [](const auto& turn) { return turn.second; });
}

/// Shuffles the rounds so that each kind of request comes once, in each way, before the rest.
/// Returns how many these are.
std::size_t ShuffleForSample(std::vector<Round>* rounds, std::mt19937& random) {
    ShuffleInTurns(rounds, random);
    std::set<std::pair<std::uint32_t, Failure>> seen;
    const auto rest =
        std::stable_partition(rounds->begin(), rounds->end(), [&](const Round& round) {
            return seen.insert({round.code, round.failure}).second;
        });
    return static_cast<std::size_t>(rest - rounds->begin());
}

/// Rounds and failures, in a table by story and by way to fail.
class Tally {
  public:
    void Add(const Round& round, const RoundOutcome& outcome) {
        Cell& cell = cells[round.story][static_cast<std::size_t>(round.failure)];
        ++cell.rounds;
        cell.missed += outcome.hasFailed ? 0 : 1;
        cell.bad += outcome.problems.empty() ? 0 : 1;
        if (outcome.code != 0) reached.insert({outcome.code, round.failure});
    }
    std::size_t CountCodes() const {
        std::set<std::uint32_t> codes;
        for (const auto& [code, failure] : reached) codes.insert(code);
        return codes.size();
    }
    bool HasReached(const Round& round) const {
        return reached.count({round.code, round.failure}) != 0;
    }
    void Print() const {
        std::printf("\n%-10s", "story");
        for (const std::string_view name : FailureNames) std::printf("%16s", name.data());
        std::printf("\n");
        for (std::size_t story = 0; story < std::size(Stories); ++story) {
            std::printf("%-10s", Stories[story].name.data());
            for (const Cell& cell : cells[story]) {
                char text[48];
                std::snprintf(text, sizeof text, "%u/%u/%u", cell.rounds, cell.missed, cell.bad);
                std::printf("%16s", text);
            }
            std::printf("\n");
        }
        std::printf("(rounds / not reached / with a problem)\n");
    }

  private:
    struct Cell {
        unsigned rounds = 0, missed = 0, bad = 0;
    };
    Cell cells[std::size(Stories)][FailureCount];
    std::set<std::pair<std::uint32_t, Failure>> reached;
};

/// Runs rounds one by one and says what is wrong.
class Sweeper {
  public:
    explicit Sweeper(const Plan& allOfIt) : plan(allOfIt) {}

    void Run(const Round& round);
    /// Whether so much is wrong that it makes no sense to go on.
    bool HasHadEnough() const { return problems >= ProblemsMax; }
    /// Every kind of request that the stories have has failed, in every way that it can.
    void ReachEveryKind();
    void Print(std::uint32_t seed) const;
    std::size_t CountDone() const { return done; }

  private:
    RoundOutcome RunOnce(const Round& round) const {
        return RunRound(round, plan.stories.at({round.camera, round.story}));
    }
    static bool MustBeReached(const Round& round);
    static bool IsMissed(const Round& round, const RoundOutcome& outcome) {
        return !outcome.hasFailed && outcome.problems.empty() && MustBeReached(round);
    }

    const Plan& plan;  // borrowed from the test
    Tally tally;
    std::size_t done = 0, problems = 0;
};

/// A call's request comes again as it was counted, and so does an allocation where no frame passes.
/// How many frames do depends on the machine, and with them the buffers, the allocations and the
/// writes that the changes of a running stream take.
bool Sweeper::MustBeReached(const Round& round) {
    constexpr std::string_view WithoutFrames[] = {"load", "list", "send", "finish"};
    const std::string_view story = Stories[round.story].name;
    if (round.failure == Failure::NoMemory) {
        return std::find(std::begin(WithoutFrames), std::end(WithoutFrames), story) !=
               std::end(WithoutFrames);
    }
    return round.series == RequestSeries::Calls && story != "stream";
}

void Sweeper::Run(const Round& round) {
    RoundOutcome outcome = RunOnce(round);
    // The last allocations of an opening are those of its threads, which may come too late.
    for (int i = 0; i < ExtraRoundsMax && IsMissed(round, outcome); ++i) outcome = RunOnce(round);
    if (IsMissed(round, outcome)) outcome.problems.emplace_back("what is to fail does not come");
    // What is made once and stays is no leak.
    if (outcome.leaked != 0 && RunOnce(round).leaked != 0) {
        outcome.problems.push_back(std::to_string(outcome.leaked) + " allocations are left");
    }
    tally.Add(round, outcome);
    ++done;
    for (const std::string& problem : outcome.problems) {
        ++problems;
        ADD_FAILURE() << round.GetText() << ": " << problem;
    }
    if (done % 1000 == 0) std::printf("%zu of %zu rounds\n", done, plan.rounds.size());
}

void Sweeper::ReachEveryKind() {
    std::set<std::uint32_t> planned;
    for (const Round& round : plan.rounds) planned.insert(round.code);
    planned.erase(0);  // allocations
    EXPECT_GE(planned.size(), KindsLeast);
    std::map<std::pair<std::uint32_t, Failure>, int> extra;
    for (const Round& round : plan.rounds) {
        const bool isMissed = round.code != 0 && !tally.HasReached(round);
        if (isMissed && extra[{round.code, round.failure}]++ < ExtraRoundsMax) Run(round);
    }
    for (const Round& round : plan.rounds) {
        if (round.code == 0 || tally.HasReached(round)) continue;
        ADD_FAILURE() << "nothing like " << round.GetText() << " has failed";
        return;
    }
}

void Sweeper::Print(std::uint32_t seed) const {
    tally.Print();
    std::printf("%zu of %zu rounds, %zu kinds of request, seed %u\n", done, plan.rounds.size(),
                tally.CountCodes(), seed);
}

TEST(Sweep, EveryRequestAndAllocationThatFailsLeavesTheLibraryInOrder) {
    const int seconds = ReadNumber("ZENTARA_SWEEP_SECONDS", SampleSeconds);
    const auto seed = static_cast<std::uint32_t>(
        ReadNumber("ZENTARA_SWEEP_SEED", static_cast<int>(std::random_device{}() >> 1)));
    const bool isSample = seconds != 0;
    std::mt19937 random(seed);
    const auto end = Clock::now() + std::chrono::seconds(seconds);
    const Selection selection;
    Plan plan = MakePlan(selection, isSample, random);
    const std::size_t least =
        isSample ? ShuffleForSample(&plan.rounds, random) : plan.rounds.size();

    Sweeper sweeper(plan);
    for (const Round& round : plan.rounds) {
        const bool isEnough = sweeper.CountDone() >= least && Clock::now() >= end;
        if (isEnough || sweeper.HasHadEnough()) break;
        sweeper.Run(round);
    }

    if (!selection.IsLimited()) sweeper.ReachEveryKind();
    sweeper.Print(seed);
    EXPECT_NE(0U, sweeper.CountDone());
}

}  // namespace
}  // namespace ZV::Test
