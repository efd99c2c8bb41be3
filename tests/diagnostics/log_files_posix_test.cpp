#include <sys/stat.h>

#include <filesystem>
#include <iterator>

#include "diagnostics/open_log.h"

namespace ZV {
namespace {

class LogFilesOfThisSystem : public Test::OpenLog {};

TEST_F(LogFilesOfThisSystem, ThatAreNamedPipesAreToldLikeABadPath) {
    const std::string path = folder.GetPath("pipe");
    ASSERT_EQ(0, mkfifo(path.c_str(), 0600));

    Open("outputEnabled = 1\noutputToFile = 1\noutputFilePath = " + path + "\n");

    EXPECT_EQ(
        "ZLog() - cannot output to file.  The file path " + path + " is invalid or not accessable",
        ReadDebuggerOutput());
}

TEST_F(LogFilesOfThisSystem, LeaveNoDescriptorOpen) {
    const auto count = [] {
        const std::filesystem::directory_iterator files("/proc/self/fd");
        return std::distance(begin(files), end(files));
    };
    const auto before = count();

    for (int i = 0; i < 20; ++i) OpenToFile();
    ZLogClose();

    EXPECT_EQ(before, count());
}

}  // namespace
}  // namespace ZV
