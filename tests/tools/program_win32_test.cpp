#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <windows.h>

#include "tools/paths.h"
#include "tools/program.h"

// What only Windows does with files and its own functions.
namespace ZentaraTest {
namespace {

using testing::ElementsAre;
using testing::HasSubstr;
using testing::Not;

TEST(ProgramOnWindows, AnOlderFileThatAnotherProgramHoldsStaysAndNothingIsLeftBeside) {
    const TemporaryFolder folder;
    const std::string path = folder.GetPath("image.raw");
    WriteFile(path, "older");
    const HANDLE held = CreateFileW(ZentaraProgram::MakePath(path).c_str(), GENERIC_READ,
                                    FILE_SHARE_READ, nullptr, OPEN_EXISTING, 0, nullptr);
    ASSERT_NE(INVALID_HANDLE_VALUE, held);

    const ProgramResult result = RunProgram({"grab", "0", "--simulation", "mono", "-o", path});
    CloseHandle(held);

    EXPECT_EQ(1, result.exitCode);
    EXPECT_THAT(result.errors, HasSubstr("cannot be written: "));
    EXPECT_EQ("older", ReadFile(path));
    EXPECT_THAT(folder.ListFiles(), ElementsAre("image.raw"));
}

// By their names they pass for files; a console would be waited for.
TEST(ProgramOnWindows, ADeviceIsNoImageAndNoScenario) {
    for (const char* device : {"NUL", "CON", "NUL.png", "CONIN$"}) {
        const ProgramResult image = RunProgram({"histogram", std::string(device)});
        const ProgramResult listed = RunProgram({"list", "--simulation", device});

        EXPECT_NE(0, image.exitCode) << device;
        EXPECT_EQ(2, listed.exitCode) << device;
        EXPECT_THAT(listed.errors, HasSubstr("neither a built-in scenario nor a file")) << device;
    }
}

TEST(ProgramOnWindows, AFileWithBackslashesInItsPathIsWritten) {
    const TemporaryFolder folder;
    std::string path = folder.GetPath("") + "\\image.fits";

    const ProgramResult result = RunProgram({"grab", "0", "--simulation", "mono", "-o", path});

    EXPECT_EQ(0, result.exitCode) << result.errors;
    EXPECT_THAT(folder.ListFiles(), ElementsAre("image.fits"));
}

TEST(ProgramOnWindows, LinesEndAsOnOtherSystems) {
    EXPECT_EQ("No cameras.\n", RunProgram({"list", "--simulation", "empty"}).output);
    EXPECT_THAT(RunProgram({"fly"}).errors, Not(HasSubstr("\r")));
}

}  // namespace
}  // namespace ZentaraTest
