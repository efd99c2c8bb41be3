#include "diagnostics/log_records.h"

#include <array>
#include <atomic>
#include <filesystem>
#include <regex>
#include <sstream>
#include <string>

#include "diagnostics/open_log.h"
#include "support/test_thread.h"

namespace ZV {
namespace {

using Test::DescribeLog;
using Test::TestThread;

/// The debugger output has no zero bytes to part its records by.
std::string MaskTimes(const std::string& text) {
    return std::regex_replace(DescribeLog(text), std::regex(R"(\d\d:\d+\.\d\d\d )"), "<time> ");
}

std::string FormatPrefix(std::int64_t elapsedMicroseconds) {
    std::array<char, 64> text{};
    const std::size_t length = FormatLogPrefix(elapsedMicroseconds, text);
    return {text.data(), length};
}

TEST(LogPrefix, HasMinutesSecondsAndMilliseconds) {
    EXPECT_EQ("00:00.000 ", FormatPrefix(0));
    EXPECT_EQ("00:00.000 ", FormatPrefix(999));
    EXPECT_EQ("00:00.001 ", FormatPrefix(1000));
    EXPECT_EQ("00:59.999 ", FormatPrefix(59999999));
}

TEST(LogPrefix, CountsItsSecondsOnBeyondAMinute) {
    EXPECT_EQ("01:75.500 ", FormatPrefix(75500000));
    EXPECT_EQ("02:125.007 ", FormatPrefix(125007000));
}

TEST(LogPrefix, EndsAtThirtyFiveMinutesAndGoesOnFromAsMuchBelowZero) {
    EXPECT_EQ("35:2147.483 ", FormatPrefix(CalculateLogElapsed(0, 0x7FFFFFFF)));
    EXPECT_EQ("-35:-2147.-483 ", FormatPrefix(CalculateLogElapsed(0, 0x80000000)));
    EXPECT_EQ("00:00.000 ", FormatPrefix(CalculateLogElapsed(0, 0xFFFFFFFF)));
    EXPECT_EQ("00:01.000 ", FormatPrefix(CalculateLogElapsed(5, 0x100000005 + 1000000)));
}

// A record's time has 32 bits, so that only the routine itself gets here.
TEST(LogPrefix, WidensItsFirstFieldAboveNinetyNineMinutes) {
    EXPECT_EQ("99:5999.999 ", FormatPrefix(5999999000));
    EXPECT_EQ("100:6000.001 ", FormatPrefix(6000001000));
    EXPECT_EQ("1440:86400.000 ", FormatPrefix(86400000000));
}

TEST(LogPrefix, IsCutToItsRoom) {
    std::array<char, 4> text{'x', 'x', 'x', 'x'};

    EXPECT_EQ(3u, FormatLogPrefix(75500000, text));

    EXPECT_STREQ("01:", text.data());
}

class LogRecords : public Test::OpenLog {};

TEST_F(LogRecords, RunTogetherInAFileAndEndWithAZeroByteEach) {
    OpenToFile();

    ZLogWrite("one");
    ZLogWrite("two %d %s\n", 2, "words");
    ZLogWrite("%s", "");

    EXPECT_EQ("<time> one|\n<time> two 2 words\\n|\n<time> |\n", DescribeFile());
    EXPECT_EQ(std::string::npos, ReadFile().find("one\n"));
}

TEST_F(LogRecords, AreInTheFileAtOnce) {
    OpenToFile();
    EXPECT_EQ("", ReadFile());

    ZLogWrite("one");

    EXPECT_EQ("<time> one|\n", DescribeFile());
}

TEST_F(LogRecords, GoToTheDebuggerOutputWithoutAFile) {
    Open("outputEnabled = 1\n");

    ZLogWrite("one\n");
    ZLogWrite("two\n");

    EXPECT_EQ("<time> one\\n<time> two\\n", MaskTimes(ReadDebuggerOutput()));
}

TEST_F(LogRecords, OfMoreThanTheirBufferAreCutAtTheLastCharacterButOne) {
    OpenToFile();
    const std::string tail(3000, 'x');

    ZLogWrite("%s", tail.c_str());
    ZLogWrite("next");

    const std::string file = ReadFile();
    const std::size_t end = file.find('\0');
    EXPECT_EQ(LogRecordCapacity - 1, end);
    EXPECT_EQ(std::string(10, 'x'), file.substr(end - 10, 10));
    EXPECT_EQ("<time> next|\n", DescribeLog(file.substr(end + 1)));
}

TEST_F(LogRecords, OfManyThreadsLieInTheFileWhole) {
    constexpr int Records = 300;
    OpenToFile("outputNestedCalls = 1\n");
    const auto write = [](const char* name) {
        for (int i = 0; i < Records; ++i) {
            ZLogEnter(name);
            ZLogMessage(name, "number %d", i);
            ZLogLeave(name, zerrNone);
        }
    };

    {
        const TestThread first([&] { write("first"); });
        const TestThread second([&] { write("second"); });
        write("third");
    }

    const std::string text = DescribeFile();
    const std::regex record(
        R"(<time> (first|second|third) (start|- number \d+ |end \(error code 0\)(\\n)+)\|)");
    int lines = 0;
    std::istringstream stream(text);
    for (std::string line; std::getline(stream, line); ++lines) {
        EXPECT_TRUE(std::regex_match(line, record)) << line;
    }
    EXPECT_EQ(3 * 3 * Records, lines);
}

TEST_F(LogRecords, AreLostWithoutHarmWhileTheFileIsExchangedUnderTheirWriters) {
    OpenToFile();
    std::atomic<bool> isDone{false};

    {
        const TestThread writer([&] {
            while (!isDone) ZLogWrite("record\n");
        });
        EXPECT_TRUE(
            ZV::Test::WaitUntil([&] { return std::filesystem::file_size(GetFilePath()) > 0; }));
        const TestThread opener([] {
            for (int i = 0; i < 50; ++i) ZLogOpen();
        });
        for (int i = 0; i < 50; ++i) {
            ZLogClose();
            ZLogOpen();
        }
        isDone = true;
    }

    const std::string text = DescribeFile();
    EXPECT_NE(std::string::npos, text.find("<time> record"));
    const std::regex known(R"(<time> record\\n\|\n|\\n-{48}\\n\\n\|\n)");
    EXPECT_EQ("", std::regex_replace(text, known, ""));
}

}  // namespace
}  // namespace ZV
