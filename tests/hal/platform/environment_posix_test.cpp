#include <gtest/gtest.h>
#include <sys/stat.h>
#include <sys/statvfs.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cstdio>
#include <filesystem>
#include <string>

#include "hal/platform/environment.h"
#include "support/rounds.h"
#include "support/scoped_variable.h"
#include "support/temporary_folder.h"

namespace ZV {
namespace {

using Test::IsSanitized;
using Test::ScopedVariable;
using Test::TemporaryFolder;

constexpr char TestedVariable[] = "ZENTARA_TEST_VARIABLE";
constexpr uid_t OtherUser = 65534;

/// Runs it; true when the variable is not there.
bool IsNotThereFor(const std::string& program) {
    const pid_t child = fork();
    if (child == 0) {
        (void)!freopen("/dev/null", "w", stdout);  // its words are not this suite's
        execl(program.c_str(), program.c_str(), TestedVariable, nullptr);
        _exit(127);
    }
    int status = 0;
    waitpid(child, &status, 0);
    EXPECT_TRUE(WIFEXITED(status) && WEXITSTATUS(status) <= 1) << status;
    return WIFEXITED(status) && WEXITSTATUS(status) == 0;
}

TEST(LibraryVariable, IsIgnoredByAProcessWithPrivilegesThatItWasNotStartedWith) {
    if (geteuid() != 0) GTEST_SKIP() << "only the administrator can make such a program";
    if (IsSanitized) GTEST_SKIP() << "a sanitizer needs the rights of who started it";
    const TemporaryFolder folder;
    struct statvfs system {};
    ASSERT_EQ(0, statvfs(folder.GetPath("").c_str(), &system));
    if ((system.f_flag & ST_NOSUID) != 0) GTEST_SKIP() << "the folder's file system knows none";
    const ScopedVariable variable(TestedVariable, "set");
    const std::string program = folder.GetPath("program");
    const auto suite = std::filesystem::read_symlink("/proc/self/exe");
    std::filesystem::copy_file(suite.parent_path() / "variable-reader", program);
    ASSERT_FALSE(IsNotThereFor(program));

    ASSERT_EQ(0, chown(program.c_str(), OtherUser, OtherUser));
    ASSERT_EQ(0, chmod(program.c_str(), 04755));

    EXPECT_TRUE(IsNotThereFor(program));
}

}  // namespace
}  // namespace ZV
