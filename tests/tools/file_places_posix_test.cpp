#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/stat.h>

#include <filesystem>
#include <string>

#include "support/rounds.h"
#include "tools/program.h"
#include "tools/unfinished_file.h"

// Nobody who may write beside a file, or who chooses folders, leads the program or the library to
// another file than theirs.
namespace ZentaraTest {
namespace {

using testing::HasSubstr;
using testing::Not;

TEST(SettingsFile, IsWrittenThroughNoLink) {
    const TemporaryFolder folder;
    WriteFile(folder.GetPath("other"), "untouched");
    const std::string place = folder.GetPath("a.json");
    for (const char* ending : {"", ".part"}) {
        std::filesystem::create_symlink("other", place + ending);
    }

    const ProgramResult saved = RunProgram({"settings", "save", place, "--simulation", "mono"});

    ASSERT_EQ(0, saved.exitCode) << saved.errors;
    EXPECT_EQ("untouched", ReadFile(folder.GetPath("other")));
    EXPECT_FALSE(std::filesystem::is_symlink(place));
    EXPECT_THAT(ReadFile(place), HasSubstr("\"settings\""));
}

TEST(Image, IsWrittenThroughNoLink) {
    const TemporaryFolder folder;
    WriteFile(folder.GetPath("other"), "untouched");
    const std::string place = folder.GetPath("a.raw");
    std::filesystem::create_symlink("other", place);

    const ProgramResult grabbed = RunProgram({"grab", "0", "--simulation", "mono", "-o", place});

    ASSERT_EQ(0, grabbed.exitCode) << grabbed.errors;
    EXPECT_EQ("untouched", ReadFile(folder.GetPath("other")));
    EXPECT_FALSE(std::filesystem::is_symlink(place));
}

TEST(UnfinishedImage, LiesWhereNobodyElseMayEnterWhateverTheUmaskAllows) {
    const TemporaryFolder folder;
    const mode_t former = umask(0);
    {
        const ZentaraProgram::UnfinishedFile unfinished(folder.GetPath("a.raw"));
        ASSERT_FALSE(unfinished.GetFailure());
        const auto inside = std::filesystem::path(unfinished.GetPath()).parent_path();

        EXPECT_EQ(std::filesystem::perms::owner_all, std::filesystem::status(inside).permissions());
    }
    umask(former);
    EXPECT_TRUE(folder.ListFiles().empty());
}

/// A copy of the library in a folder of its own, and the module in another that is searched for
/// libraries and is the current one.
class CopiedLibrary : public testing::Test {
  protected:
    CopiedLibrary() {
        for (const char* name : {"library", "elsewhere"}) {
            std::filesystem::create_directory(folder.GetPath(name));
        }
        Copy("libzentara.so.2", "library");
        Copy(Module, "elsewhere");
    }

    void Copy(const char* name, const char* target) const {
        std::filesystem::copy_file(ZENTARA_BINARY_DIR "/lib/" + std::string(name),
                                   folder.GetFolder() / target / name);
    }
    ProgramResult List() const {
        const std::string library = folder.GetPath("library"), other = folder.GetPath("elsewhere");
        return RunTool({"sh", "-c",
                        "cd " + other + " && LD_LIBRARY_PATH=" + library + ":" + other +
                            ":. ZENTARA_SIMULATION=mono ZENTARA_DEBUG_OUTPUT=1 " ZENTARA_BINARY_DIR
                            "/bin/zentara list"});
    }

    /// Cameras that a client lists which has loaded the library by a relative path before.
    ProgramResult CountFromAnotherFolder() const {
        const std::string client = R"(
import ctypes, os, sys
os.environ['ZENTARA_SIMULATION'] = 'mono'
os.chdir(sys.argv[1])
library = ctypes.CDLL('library/libzentara.so.2')
os.chdir('elsewhere')
count = ctypes.c_uint32(4)
library.Zentara_LoadDriver()
library.Zentara_ListCameras(ctypes.create_string_buffer(4 * 56), ctypes.byref(count))
library.Zentara_ReleaseDriver()
print(count.value)
)";
        return RunTool({"python3", "-c", client, folder.GetFolder().string()});
    }

    static constexpr const char* Module = "libzentara-simulation.so";
    const TemporaryFolder folder;
};

TEST_F(CopiedLibrary, KnowsItsFolderAlsoWhenTheClientHasLeftTheOneThatItsPathBeganIn) {
    if (ZV::Test::IsSanitized) GTEST_SKIP() << "the interpreter is not built for a sanitizer";
    std::filesystem::create_directory(folder.GetPath("elsewhere/library"));
    Copy("libzentara.so.2", "elsewhere/library");
    Copy(Module, "elsewhere/library");

    EXPECT_EQ("0\n", CountFromAnotherFolder().output);
    Copy(Module, "library");

    const ProgramResult counted = CountFromAnotherFolder();
    EXPECT_EQ("1\n", counted.output) << counted.errors;
}

TEST_F(CopiedLibrary, LoadsTheSimulationFromItsOwnFolderAndFromNowhereElse) {
    const ProgramResult without = List();
    EXPECT_THAT(without.output, Not(HasSubstr("Solvane")));
    EXPECT_THAT(without.errors, HasSubstr("The simulation's module cannot be loaded"));

    Copy(Module, "library");

    const ProgramResult with = List();
    EXPECT_THAT(with.output, HasSubstr("Solvane")) << with.errors;
}

}  // namespace
}  // namespace ZentaraTest
