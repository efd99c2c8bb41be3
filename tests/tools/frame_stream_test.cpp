#include "tools/frame_stream.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <chrono>
#include <numeric>
#include <optional>
#include <vector>

#include "support/scoped_variable.h"
#include "support/wait_until.h"
#include "tools/traced_scenario.h"

// The program's stream without the program: what has come by the end of a stream is decided here.
namespace ZentaraTest {
namespace {

using ZentaraProgram::CaptureFacts;
using ZentaraProgram::ExitCode;
using ZentaraProgram::FrameStream;
using ZentaraProgram::Slot;
using ZentaraProgram::StreamCalls;
using ZentaraProgram::StreamOptions;
using ZentaraProgram::StreamSums;

using Clock = std::chrono::steady_clock;

constexpr std::uint32_t Buffers = 3;

class StreamedCamera : public testing::Test {
  protected:
    void SetUp() override {
        Zentara_CamListItem item{};
        std::uint32_t length = 1;
        ASSERT_EQ(zerrNone, Zentara_LoadDriver());
        ASSERT_EQ(zerrNone, Zentara_ListCameras(&item, &length));
        ASSERT_EQ(zerrNone, Zentara_OpenCamera(item.cameraId, &handle));
        facts.imageBytes = std::size_t{64} * 48 * 2;
        options.buffers = Buffers;
        options.durationSeconds = 600;
        calls.isInterrupted = [] { return false; };
        calls.show = [](const StreamSums&, bool) {};
    }
    void TearDown() override {
        if (handle != 0) Zentara_CloseCamera(handle);
        Zentara_ReleaseDriver();
    }

    /// Runs a stream whose first write lasts until all the other buffers have come, at least as
    /// long as the stream before it, and which is interrupted by then. `code` is that of each
    /// further write.
    ExitCode RunUntilInterrupted(ExitCode code = ZentaraProgram::ExitDone) {
        const Clock::time_point begin = Clock::now();
        calls.write = [this, begin, code](const Slot&, std::uint64_t number) {
            numbers.push_back(number);
            if (number > 1) return code;
            const Clock::time_point written = Clock::now();
            EXPECT_TRUE(ZV::Test::WaitUntil([&] {
                return stream->GetRing().CountWaiting() == Buffers - 1 &&
                       Clock::now() - written > written - begin;
            }));
            firstWrite = std::chrono::duration<double>(Clock::now() - written).count();
            isInterrupted = true;
            return ZentaraProgram::ExitDone;
        };
        calls.isInterrupted = [this] { return isInterrupted; };
        stream.emplace(handle, facts, options, calls);
        ZentaraResult result = zerrNone;
        const ExitCode ended = stream->Run(&result);
        EXPECT_EQ(zerrNone, result);
        return ended;
    }
    [[nodiscard]] const StreamSums& GetSums() const { return stream->GetSums(); }

    TracedScenario scenario{R"({"sensor": {"width": 64, "height": 48}})"};
    const ZV::Test::ScopedVariable simulation{"ZENTARA_SIMULATION", scenario.GetName().c_str()};
    ZentaraHandle handle = 0;
    CaptureFacts facts;
    StreamOptions options;
    StreamCalls calls;
    std::optional<FrameStream> stream;
    std::vector<std::uint64_t> numbers;
    double firstWrite = 0;
    bool isInterrupted = false;
};

TEST_F(StreamedCamera, CountsAndWritesWhatHadComeWhenItWasInterrupted) {
    EXPECT_EQ(ZentaraProgram::ExitInterrupted, RunUntilInterrupted());

    EXPECT_LE(Buffers, GetSums().frames);
    EXPECT_EQ(stream->GetRing().CountDelivered(), GetSums().frames);
    EXPECT_EQ(GetSums().frames, GetSums().files);
    EXPECT_EQ(0U, stream->GetSurplus());
    std::vector<std::uint64_t> expected(GetSums().frames);
    std::iota(expected.begin(), expected.end(), 1);
    EXPECT_EQ(expected, numbers);
}

TEST_F(StreamedCamera, TakesTheTimeOfWhatHadComeForItsOwn) {
    RunUntilInterrupted();

    EXPECT_LE(firstWrite, GetSums().seconds);
}

TEST_F(StreamedCamera, TellsOfWhatCameBehindTheLastThatWasAskedFor) {
    options.count = 1;

    RunUntilInterrupted();

    EXPECT_EQ(1U, GetSums().frames);
    EXPECT_LE(Buffers - 1, stream->GetSurplus());
    EXPECT_EQ(stream->GetRing().CountDelivered(), 1 + stream->GetSurplus());
    EXPECT_THAT(numbers, testing::ElementsAre(1));
}

TEST_F(StreamedCamera, FailsWhenWhatHadComeCannotBeWritten) {
    EXPECT_EQ(ZentaraProgram::ExitFailed, RunUntilInterrupted(ZentaraProgram::ExitFailed));

    EXPECT_EQ(stream->GetRing().CountDelivered(), GetSums().frames);
    EXPECT_EQ(1U, GetSums().files);
    EXPECT_THAT(numbers, testing::ElementsAre(1, 2)) << "one failure is enough";
}

}  // namespace
}  // namespace ZentaraTest
