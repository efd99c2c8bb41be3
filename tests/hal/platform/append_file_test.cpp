#include "hal/platform/append_file.h"

#include <gtest/gtest.h>

#include <cstring>
#include <memory>
#include <string>

#include "hal/platform/last_error.h"
#include "support/temporary_folder.h"
#include "support/test_thread.h"

namespace ZV {
namespace {

using Test::TemporaryFolder;
using Test::TestThread;

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

TEST(AppendFileSeam, MakesItsFileAndAppendsBytesAsTheyAre) {
    const TemporaryFolder folder;
    const OpenFile file = Open(folder.GetPath("log"));
    ASSERT_NE(nullptr, file);

    Append(file, "one\n");
    AppendToFile(file.get(), "two\0", 4);

    EXPECT_EQ(std::string("one\ntwo\0", 8), folder.ReadFile("log"));
}

TEST(AppendFileSeam, KeepsWhatIsThere) {
    const TemporaryFolder folder;
    const OpenFile file = Open(folder.WriteFile("log", "before"));

    Append(file, "after");

    EXPECT_EQ("beforeafter", folder.ReadFile("log"));
}

TEST(AppendFileSeam, OpensNothingWhereThereIsNoFolderOrAFolder) {
    const TemporaryFolder folder;

    EXPECT_EQ(nullptr, Open(folder.GetPath("missing/log")));
    EXPECT_EQ(nullptr, Open(folder.GetPath("")));
    EXPECT_EQ(nullptr, Open(""));
}

TEST(AppendFileSeam, LeavesTheLastErrorAlone) {
    const TemporaryFolder folder;
    SetLastPlatformError(1234);

    EXPECT_EQ(nullptr, Open(folder.GetPath("missing/log")));
    const OpenFile file = Open(folder.GetPath("log"));
    Append(file, "text");

    EXPECT_EQ(1234u, GetLastPlatformError());
}

TEST(AppendFileSeam, KeepsThePiecesOfSeveralThreadsWhole) {
    constexpr int Pieces = 500;
    const TemporaryFolder folder;
    {
        const OpenFile file = Open(folder.GetPath("log"));
        const TestThread first([&] {
            for (int i = 0; i < Pieces; ++i) Append(file, "aaaaaaaa\n");
        });
        for (int i = 0; i < Pieces; ++i) Append(file, "bbbbbbbb\n");
    }

    const std::string text = folder.ReadFile("log");
    ASSERT_EQ(std::size_t{2 * Pieces * 9}, text.size());
    for (std::size_t at = 0; at < text.size(); at += 9) {
        const std::string piece = text.substr(at, 9);
        EXPECT_TRUE(piece == "aaaaaaaa\n" || piece == "bbbbbbbb\n") << piece;
    }
}

TEST(AppendFileSeam, ClosesNothingWithoutComplaint) {
    CloseAppendFile(nullptr);
}

}  // namespace
}  // namespace ZV
