#include "hal/platform/module_loader.h"

#include <gtest/gtest.h>
#include <windows.h>

#include <string>

#include "support/temporary_folder.h"
#include "windows/support/child_process.h"

namespace ZV::Test {
namespace {

constexpr char ModuleName[] = "zentara-simulation.dll";

void Copy(const std::string& from, const std::string& to) {
    EXPECT_TRUE(CopyFileA(from.c_str(), to.c_str(), FALSE)) << GetLastError();
}

std::string GetOwnModulePath() {
    const std::string own = GetOwnPath();
    return own.substr(0, own.rfind('\\') + 1) + ModuleName;
}

/// Its word is a folder that holds the module.
TEST(LoaderOfAChild, DISABLED_FindsNoModuleInTheCurrentFolderOrOnThePath) {
    const std::string folder = GetChildWord();
    ASSERT_TRUE(SetCurrentDirectoryA(folder.c_str()));
    ASSERT_TRUE(SetEnvironmentVariableA("PATH", folder.c_str()));

    EXPECT_EQ(LoadSimulationDriver(), nullptr);

    EXPECT_NE(LoadLibraryA(ModuleName), nullptr) << "the system itself finds it by its name";
}

TEST(LoaderOfAChild, DISABLED_FindsTheModuleBesideItsImage) {
    EXPECT_NE(LoadSimulationDriver(), nullptr);
}

/// A copy of this program alone in a folder, and the module in another one.
class LoaderOfTheModule : public testing::Test {
  protected:
    LoaderOfTheModule() {
        Copy(GetOwnPath(), program);
        Copy(GetOwnModulePath(), other.GetPath(ModuleName));
    }
    [[nodiscard]] DWORD Run(const char* test) const {
        const ChildProcess child(std::string("LoaderOfAChild.DISABLED_") + test,
                                 {.program = program, .word = other.GetFolder().string()});
        return child.WaitForExitCode();
    }

    const TemporaryFolder own;
    const TemporaryFolder other;
    const std::string program = own.GetPath("program.exe");
};

TEST_F(LoaderOfTheModule, LooksNeitherInTheCurrentFolderNorOnThePath) {
    EXPECT_EQ(Run("FindsNoModuleInTheCurrentFolderOrOnThePath"), 0u);
}

TEST_F(LoaderOfTheModule, TakesTheOneBesideItsImage) {
    Copy(GetOwnModulePath(), own.GetPath(ModuleName));

    EXPECT_EQ(Run("FindsTheModuleBesideItsImage"), 0u);
}

}  // namespace
}  // namespace ZV::Test
