#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <nlohmann/json.hpp>

#include "tools/program.h"

// What only a system with its shell, its limits and names of any bytes shows.
namespace ZentaraTest {
namespace {

using nlohmann::json;
using testing::HasSubstr;
using testing::IsEmpty;

TEST(Program, AFullDiskLeavesNoHalfFile) {
    const TemporaryFolder folder;
    for (const char* ending : {"fits", "tiff", "png", "raw"}) {
        const std::string path = folder.GetPath("image.") + ending;
        // A limit of 64 KiB for a file stands for a full disk.
        const ProgramResult result =
            RunTool({"sh", "-c",
                     "trap '' XFSZ; ulimit -f 64; exec \"$0\" grab 0 --simulation mono -o \"$1\"",
                     ZENTARA_BINARY_DIR "/bin/zentara", path});

        EXPECT_EQ(1, result.exitCode) << ending;
        EXPECT_THAT(result.errors, HasSubstr(path));
    }
    EXPECT_THAT(folder.ListFiles(), IsEmpty());
}

TEST(Program, AnOlderFileStaysWhenANewOneCannotBeWritten) {
    const TemporaryFolder folder;
    const std::string path = folder.GetPath("image.raw");
    WriteFile(path, "older");

    RunTool({"sh", "-c",
             "trap '' XFSZ; ulimit -f 64; exec \"$0\" grab 0 --simulation mono -o \"$1\"",
             ZENTARA_BINARY_DIR "/bin/zentara", path});

    EXPECT_EQ("older", ReadFile(path));
}

TEST(Program, AFileNameThatIsNotUtf8IsPrintedWithReplacementsInJson) {
    const TemporaryFolder folder;

    const ProgramResult result = RunProgram(
        {"grab", "0", "--simulation", "mono", "--json", "-o", folder.GetPath("a\xFF.raw")});

    ASSERT_EQ(0, result.exitCode) << result.errors;
    EXPECT_EQ(folder.GetPath("a\xEF\xBF\xBD.raw"), json::parse(result.output)["file"]);
}

TEST(HistogramCommand, AFileOfATildeIsShown) {
    const TemporaryFolder folder;
    ASSERT_EQ(0, RunProgram({"grab", "0", "--simulation", "mono", "-o", folder.GetPath("~a.fits")})
                     .exitCode);
    const std::string program = ZENTARA_BINARY_DIR "/bin/zentara";

    const ProgramResult result = RunTool(
        {"sh", "-c", "cd '" + folder.GetPath("") + "' && '" + program + "' histogram '~a.fits'"});

    EXPECT_EQ(0, result.exitCode) << result.errors;
    EXPECT_THAT(result.output, HasSubstr("grey: "));
}

}  // namespace
}  // namespace ZentaraTest
