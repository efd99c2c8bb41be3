#include "hal/platform/shared_memory.h"

#include <fcntl.h>
#include <gtest/gtest.h>
#include <sys/mman.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cstdint>
#include <string>

namespace ZV {
namespace {

constexpr std::size_t BlockBytes = 504;

class NamedMemory : public testing::Test {
  protected:
    ~NamedMemory() override { shm_unlink(SystemName().c_str()); }

    SharedMemory* Open(std::size_t bytes = BlockBytes) const {
        return OpenSharedMemory(name.c_str(), bytes);
    }
    std::string SystemName() const { return "/" + name; }
    bool IsThere() const {
        const int file = shm_open(SystemName().c_str(), O_RDONLY, 0);
        if (file >= 0) close(file);
        return file >= 0;
    }

    const std::string name = "zentara-test-" + std::to_string(getpid());
};

std::uint8_t* GetBytes(SharedMemory* memory) {
    return static_cast<std::uint8_t*>(GetSharedMemoryAddress(memory));
}

/// Runs `body` in a child process; true when it says so.
template <typename Body>
bool IsTrueInChild(Body body) {
    const pid_t child = fork();
    if (child == 0) _exit(body() ? 0 : 1);
    int status = 0;
    return waitpid(child, &status, 0) == child && WIFEXITED(status) && WEXITSTATUS(status) == 0;
}

TEST_F(NamedMemory, IsZeroedWhenItIsNew) {
    SharedMemory* memory = Open();
    ASSERT_NE(memory, nullptr);

    for (std::size_t i = 0; i < BlockBytes; ++i) ASSERT_EQ(GetBytes(memory)[i], 0) << i;

    CloseSharedMemory(memory);
}

TEST_F(NamedMemory, IsSeenByAnotherProcessUnderItsName) {
    SharedMemory* memory = Open();
    ASSERT_NE(memory, nullptr);
    GetBytes(memory)[0] = 11;

    const bool isSeen = IsTrueInChild([this] {
        SharedMemory* ofChild = Open();
        if (ofChild == nullptr || GetBytes(ofChild)[0] != 11) return false;
        GetBytes(ofChild)[503] = 22;
        CloseSharedMemory(ofChild);
        return true;
    });

    EXPECT_TRUE(isSeen);
    EXPECT_EQ(GetBytes(memory)[503], 22);
    CloseSharedMemory(memory);
}

TEST_F(NamedMemory, IsOneBlockForTwoThatOpenIt) {
    SharedMemory* first = Open();
    SharedMemory* second = Open();

    GetBytes(first)[5] = 55;

    EXPECT_EQ(GetBytes(second)[5], 55);
    CloseSharedMemory(first);
    EXPECT_EQ(GetBytes(second)[5], 55);
    CloseSharedMemory(second);
}

TEST_F(NamedMemory, IsGoneWithItsLastHolder) {
    SharedMemory* first = Open();
    SharedMemory* second = Open();
    GetBytes(first)[0] = 1;

    CloseSharedMemory(first);
    EXPECT_TRUE(IsThere());
    CloseSharedMemory(second);

    EXPECT_FALSE(IsThere());
}

TEST_F(NamedMemory, IsBegunAnewWhenACrashLeftItBehind) {
    ASSERT_TRUE(IsTrueInChild([this] {
        SharedMemory* memory = Open();
        if (memory == nullptr) return false;
        GetBytes(memory)[0] = 99;
        return true;
    }));
    ASSERT_TRUE(IsThere());

    SharedMemory* memory = Open();
    ASSERT_NE(memory, nullptr);

    EXPECT_EQ(GetBytes(memory)[0], 0);
    CloseSharedMemory(memory);
}

TEST_F(NamedMemory, GrowsForOneThatNeedsMore) {
    SharedMemory* small = Open(16);
    GetBytes(small)[15] = 7;

    SharedMemory* large = Open(8192);
    ASSERT_NE(large, nullptr);
    GetBytes(large)[8191] = 8;

    EXPECT_EQ(GetBytes(large)[15], 7);
    SharedMemory* smallAgain = Open(16);
    EXPECT_EQ(GetBytes(large)[8191], 8);
    CloseSharedMemory(smallAgain);
    CloseSharedMemory(small);
    CloseSharedMemory(large);
}

TEST_F(NamedMemory, IsOpenToOthersAsFarAsTheUmaskLetsIt) {
    const mode_t former = umask(027);
    SharedMemory* memory = Open();
    umask(former);

    struct stat status {};
    ASSERT_EQ(0, stat(("/dev/shm" + SystemName()).c_str(), &status));
    EXPECT_EQ(0640U, status.st_mode & 07777U);
    CloseSharedMemory(memory);
}

class MemoryOfAStranger : public NamedMemory {
  protected:
    static constexpr uid_t Stranger = 65534, OtherStranger = 65533;

    void SetUp() override {
        if (geteuid() != 0) GTEST_SKIP() << "only the administrator can be two users";
        memory = Open();
        ASSERT_NE(memory, nullptr);
    }
    void TearDown() override { CloseSharedMemory(memory); }

    void GiveTo(uid_t user, mode_t mode) const {
        ASSERT_EQ(0, chown(("/dev/shm" + SystemName()).c_str(), user, user));
        ASSERT_EQ(0, chmod(("/dev/shm" + SystemName()).c_str(), mode));
    }
    bool OpensAs(uid_t user) const {
        return IsTrueInChild([&] { return setuid(user) == 0 && Open() != nullptr; });
    }

    SharedMemory* memory = nullptr;
};

TEST_F(MemoryOfAStranger, IsTakenByThemAlone) {
    for (const mode_t mode : {0600U, 0644U, 0664U, 0666U}) {
        GiveTo(Stranger, mode);

        EXPECT_TRUE(OpensAs(Stranger)) << mode;
        EXPECT_FALSE(OpensAs(OtherStranger)) << mode;
        EXPECT_EQ(nullptr, Open()) << mode << ", which keeps no administrator out";
    }
}

TEST_F(MemoryOfAStranger, IsTakenByAllWhenTheStrangerIsTheAdministratorWhoLetsThem) {
    GiveTo(0, 0666);
    EXPECT_TRUE(OpensAs(Stranger));

    GiveTo(0, 0644);
    EXPECT_FALSE(OpensAs(Stranger));
}

TEST(SharedMemoryName, IsRefusedWhenItIsNone) {
    EXPECT_EQ(OpenSharedMemory("a/b", BlockBytes), nullptr);
    CloseSharedMemory(nullptr);
}

}  // namespace
}  // namespace ZV
