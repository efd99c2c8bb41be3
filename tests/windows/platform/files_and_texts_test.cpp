#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <windows.h>

#include <cstdio>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <string>

#include "hal/platform/append_file.h"
#include "hal/platform/console.h"
#include "hal/platform/debug_output.h"
#include "hal/platform/environment.h"
#include "hal/platform/last_error.h"
#include "support/temporary_folder.h"
#include "windows/support/child_process.h"
#include "windows/support/debugger_texts.h"

namespace ZV::Test {
namespace {

constexpr DWORD SomeError = 1234;

std::string ReadFile(const std::filesystem::path& path) {
    std::ifstream file(path, std::ios::binary);
    return {std::istreambuf_iterator<char>(file), {}};
}

// ---- Files ----

TEST(AppendedFile, IsOpenedByAPathInTheAnsiCodePage) {
    const TemporaryFolder folder;
    const std::filesystem::path wide = folder.GetFolder() / L"Bl\u00E4tter und \u00DC.txt";
    char path[MAX_PATH] = "";
    BOOL isLossy = FALSE;
    const bool isUtf8 = GetACP() == CP_UTF8;
    ASSERT_NE(WideCharToMultiByte(CP_ACP, 0, wide.c_str(), -1, path, sizeof path, nullptr,
                                  isUtf8 ? nullptr : &isLossy),
              0);
    if (isLossy) GTEST_SKIP() << "the code page has no such letters";

    AppendFile* file = OpenAppendFile(path);
    ASSERT_NE(file, nullptr);
    AppendToFile(file, "line\n\0", 6);
    CloseAppendFile(file);

    // Line ends stay as they are.
    EXPECT_EQ(ReadFile(wide), std::string("line\n\0", 6));
}

TEST(AppendedFile, MayBeReadWrittenAndRemovedByOthersWhileItIsOpen) {
    const TemporaryFolder folder;
    const std::string path = folder.GetPath("log.txt");
    AppendFile* first = OpenAppendFile(path.c_str());
    AppendFile* second = OpenAppendFile(path.c_str());
    ASSERT_NE(first, nullptr);
    ASSERT_NE(second, nullptr);

    AppendToFile(first, "a", 1);
    AppendToFile(second, "b", 1);
    AppendToFile(first, "c", 1);

    EXPECT_EQ(ReadFile(path), "abc");
    EXPECT_TRUE(DeleteFileA(path.c_str()));
    CloseAppendFile(first);
    CloseAppendFile(second);
}

TEST(AppendedFile, IsNotMadeOfAPathThatIsTooLongOrNoName) {
    const std::string tooLong(2000, 'x');

    EXPECT_EQ(OpenAppendFile(tooLong.c_str()), nullptr);
    EXPECT_EQ(OpenAppendFile(""), nullptr);
    EXPECT_EQ(OpenAppendFile("Z:\\no\\such\\folder\\log.txt"), nullptr);
}

TEST(AppendedFile, IsNeitherADeviceNorAPipe) {
    const std::string pipe = "\\\\.\\pipe\\zentara-test-" + std::to_string(GetCurrentProcessId());
    HANDLE server = CreateNamedPipeA(pipe.c_str(), PIPE_ACCESS_DUPLEX, PIPE_TYPE_BYTE,
                                     /*nMaxInstances=*/1, 0, 0, 0, nullptr);
    ASSERT_NE(server, INVALID_HANDLE_VALUE);
    SetLastError(SomeError);

    EXPECT_EQ(OpenAppendFile(pipe.c_str()), nullptr);
    EXPECT_EQ(OpenAppendFile("NUL"), nullptr);
    EXPECT_EQ(OpenAppendFile("CONOUT$"), nullptr);

    EXPECT_EQ(GetLastError(), SomeError);
    CloseHandle(server);
}

// ---- Texts of errors ----

TEST(SystemErrorText, IsThatOfTheSystemWithItsLineEnd) {
    char text[256] = "";
    wchar_t wide[256] = L"";
    ASSERT_NE(FormatMessageW(FORMAT_MESSAGE_FROM_SYSTEM | FORMAT_MESSAGE_IGNORE_INSERTS, nullptr,
                             ERROR_ACCESS_DENIED, 0, wide, 256, nullptr),
              0u);

    ASSERT_TRUE(GetPlatformErrorText(ERROR_ACCESS_DENIED, text, sizeof text));

    const std::wstring expected(wide);
    EXPECT_EQ(std::string(text), std::string(expected.begin(), expected.end()));
    EXPECT_TRUE(std::string(text).ends_with("\r\n"));
}

TEST(SystemErrorText, ExpandsNoInserts) {
    char text[256] = "";

    // The text of this error holds a place for a name.
    ASSERT_TRUE(GetPlatformErrorText(ERROR_BAD_EXE_FORMAT, text, sizeof text));

    EXPECT_NE(std::string(text).find("%1"), std::string::npos) << text;
}

// ---- Debugger output ----

TEST(DebuggerOutputOfTheSystem, TakesOneTextPerCallAndNoneForNull) {
    const DebuggerTexts texts;

    WriteDebuggerOutput("first");
    WriteDebuggerOutput(nullptr);
    WriteDebuggerOutput("");
    WriteDebuggerOutput("%s\n");

    EXPECT_THAT(texts.Take(), testing::ElementsAre("first", "", "%s\n"));
}

TEST(DebuggerOutputOfTheSystem, LeavesTheLastErrorAlone) {
    SetLastError(SomeError);

    WriteDebuggerOutput("text");

    EXPECT_EQ(GetLastError(), SomeError);
}

// ---- Environment ----

TEST(VariableOfTheProcess, IsThatOfTheSystemAndNotOfOneRuntimesCopy) {
    SetEnvironmentVariableA("ZENTARA_TEST_VARIABLE", "of the system");
    SetLastError(SomeError);

    EXPECT_STREQ(GetLibraryVariable("ZENTARA_TEST_VARIABLE"), "of the system");

    EXPECT_EQ(GetLastError(), SomeError);
    SetEnvironmentVariableA("ZENTARA_TEST_VARIABLE", nullptr);
    EXPECT_EQ(GetLibraryVariable("ZENTARA_TEST_VARIABLE"), nullptr);
}

// ---- Console ----

TEST(ConsoleOfAChild, DISABLED_WritesBeforeAndAfterTheLogHasPreparedIt) {
    (void)std::fputs("before\n", stdout);
    PrepareLogConsole("Zentara : Debug Console");
    (void)std::fputs("after\n", stdout);
    (void)std::fflush(stdout);
}

TEST(ConsoleOfAChild, DISABLED_BearsTheTitleAndShowsWhatIsPrinted) {
    // The log opens the standard output anew: the former handle is closed then.
    HANDLE console =
        CreateFileA("CONOUT$", GENERIC_READ | GENERIC_WRITE, FILE_SHARE_READ | FILE_SHARE_WRITE,
                    nullptr, OPEN_EXISTING, 0, nullptr);
    ASSERT_TRUE(SetConsoleTextAttribute(console, FOREGROUND_RED));
    // What was printed before, the noise of the test's frame, is not looked at.
    ASSERT_TRUE(SetConsoleCursorPosition(console, COORD{0, 5}));

    PrepareLogConsole("Zentara : Debug Console");
    (void)std::fputs("shown\n", stdout);
    (void)std::fflush(stdout);

    char title[64] = "";
    EXPECT_NE(GetConsoleTitleA(title, sizeof title), 0u);
    EXPECT_STREQ(title, "Zentara : Debug Console");
    CONSOLE_SCREEN_BUFFER_INFO information{};
    EXPECT_TRUE(GetConsoleScreenBufferInfo(console, &information));
    EXPECT_EQ(information.wAttributes, 7);
    char row[6] = "";
    DWORD count = 0;
    EXPECT_TRUE(ReadConsoleOutputCharacterA(console, row, 5, COORD{0, 5}, &count));
    EXPECT_STREQ(row, "shown");
    CloseHandle(console);
}

TEST(LogConsole, IsThatOfAProcessWhichHasOneWithoutRedirection) {
    const ChildProcess child("ConsoleOfAChild.DISABLED_Bears*", {.hasConsole = true});

    EXPECT_EQ(child.WaitForExitCode(), 0u);
}

TEST(LogConsole, DoesNotTakeAwayAnOutputThatGoesToAFile) {
    const TemporaryFolder folder;
    const std::string path = folder.GetPath("output.txt");
    SECURITY_ATTRIBUTES inherited{sizeof inherited, nullptr, TRUE};
    HANDLE file = CreateFileA(path.c_str(), GENERIC_WRITE, FILE_SHARE_READ | FILE_SHARE_WRITE,
                              &inherited, CREATE_ALWAYS, FILE_ATTRIBUTE_NORMAL, nullptr);
    ASSERT_NE(file, INVALID_HANDLE_VALUE);

    const ChildProcess child("ConsoleOfAChild.DISABLED_Writes*", {.standardOutput = file});
    EXPECT_EQ(child.WaitForExitCode(), 0u);
    CloseHandle(file);

    const std::string output = ReadFile(path);
    EXPECT_NE(output.find("before"), std::string::npos) << output;
    EXPECT_NE(output.find("after"), std::string::npos) << output;
}

}  // namespace
}  // namespace ZV::Test
