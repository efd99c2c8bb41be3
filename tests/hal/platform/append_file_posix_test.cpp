#include "hal/platform/append_file.h"

#include <fcntl.h>
#include <gtest/gtest.h>
#include <sys/resource.h>
#include <sys/stat.h>
#include <unistd.h>

#include <csignal>
#include <cstdlib>
#include <cstring>
#include <memory>
#include <string>

#include "support/temporary_folder.h"

namespace ZV {
namespace {

using Test::TemporaryFolder;

struct CloseFile {
    void operator()(AppendFile* file) const { CloseAppendFile(file); }
};
using OpenFile = std::unique_ptr<AppendFile, CloseFile>;

OpenFile Open(const std::string& path) {
    return OpenFile(OpenAppendFile(path.c_str()));
}

void Append(const OpenFile& file, const char* text) {
    AppendToFile(file.get(), text, std::strlen(text));
}

TEST(AppendFileSeam, OpensNoNamedPipeAndDoesNotWaitForItsReader) {
    const TemporaryFolder folder;
    const std::string path = folder.GetPath("pipe");
    ASSERT_EQ(0, mkfifo(path.c_str(), 0600));

    EXPECT_EXIT(
        {
            alarm(60);
            std::_Exit(OpenAppendFile(path.c_str()) == nullptr ? 0 : 1);
        },
        testing::ExitedWithCode(0), "");
}

TEST(AppendFileSeam, MakesAFileThatItsOwnerAloneMayWriteWhateverTheProcessAllows) {
    const TemporaryFolder folder;
    const std::string path = folder.GetPath("log");
    const mode_t former = umask(0);

    Open(path);

    umask(former);
    struct stat status {};
    ASSERT_EQ(0, stat(path.c_str(), &status));
    EXPECT_EQ(0644U, status.st_mode & 07777U);
}

TEST(AppendFileSeam, OpensNoDeviceAndNoNamedPipeThatIsRead) {
    const TemporaryFolder folder;
    const std::string path = folder.GetPath("pipe");
    ASSERT_EQ(0, mkfifo(path.c_str(), 0600));
    const int reader = open(path.c_str(), O_RDONLY | O_NONBLOCK);
    ASSERT_LE(0, reader);

    EXPECT_EQ(nullptr, Open(path));
    EXPECT_EQ(nullptr, Open("/dev/null"));

    close(reader);
}

/// Lets no file of this process grow beyond `bytes`.
void LimitFileSize(rlim_t bytes) {
    rlimit limit{};
    getrlimit(RLIMIT_FSIZE, &limit);
    limit.rlim_cur = bytes;
    setrlimit(RLIMIT_FSIZE, &limit);
}

bool IsPending(int signal) {
    sigset_t pending;
    sigpending(&pending);
    return sigismember(&pending, signal) == 1;
}

bool IsHeldBack(int signal) {
    sigset_t mask;
    pthread_sigmask(SIG_BLOCK, nullptr, &mask);
    return sigismember(&mask, signal) == 1;
}

void HoldBack(int signal) {
    sigset_t set;
    sigemptyset(&set);
    sigaddset(&set, signal);
    pthread_sigmask(SIG_BLOCK, &set, nullptr);
}

TEST(AppendFileSeam, LosesWhatAFileAtItsGreatestSizeDoesNotTakeAndLetsTheProcessLive) {
    const TemporaryFolder folder;
    const OpenFile file = Open(folder.GetPath("log"));
    ASSERT_NE(nullptr, file);

    EXPECT_EXIT(
        {
            LimitFileSize(8);
            Append(file, "12345678");
            Append(file, "lost");
            Append(file, "lost");
            std::_Exit(IsHeldBack(SIGXFSZ) ? 1 : 0);
        },
        testing::ExitedWithCode(0), "");

    EXPECT_EQ("12345678", folder.ReadFile("log"));
}

TEST(AppendFileSeam, TakesNoSignalThatTheProcessHoldsBackForItself) {
    const TemporaryFolder folder;
    const OpenFile file = Open(folder.GetPath("log"));
    ASSERT_NE(nullptr, file);

    EXPECT_EXIT(
        {
            HoldBack(SIGXFSZ);
            LimitFileSize(0);
            Append(file, "lost");
            const bool isTaken = !IsPending(SIGXFSZ);
            (void)raise(SIGXFSZ);
            Append(file, "lost");
            const bool isLeft = IsPending(SIGXFSZ) && IsHeldBack(SIGXFSZ);
            std::_Exit(isTaken && isLeft ? 0 : 1);
        },
        testing::ExitedWithCode(0), "");
}

}  // namespace
}  // namespace ZV
