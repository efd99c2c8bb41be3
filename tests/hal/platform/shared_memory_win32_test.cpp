#include <gtest/gtest.h>
#include <windows.h>

#include <cstdint>
#include <string>

#include "hal/platform/shared_memory.h"

namespace ZV {
namespace {

constexpr std::size_t BlockBytes = 504;

class NamedMemory : public testing::Test {
  protected:
    SharedMemory* Open(std::size_t bytes = BlockBytes) const {
        return OpenSharedMemory(name.c_str(), bytes);
    }
    bool IsThere() const {
        HANDLE mapping = OpenFileMappingA(FILE_MAP_READ, FALSE, name.c_str());
        if (mapping == nullptr) return false;
        CloseHandle(mapping);
        return true;
    }

    const std::string name = "zentara-test-" + std::to_string(GetCurrentProcessId());
};

std::uint8_t* GetBytes(SharedMemory* memory) {
    return static_cast<std::uint8_t*>(GetSharedMemoryAddress(memory));
}

TEST_F(NamedMemory, IsZeroedWhenItIsNew) {
    SharedMemory* memory = Open();
    ASSERT_NE(memory, nullptr);

    for (std::size_t i = 0; i < BlockBytes; ++i) ASSERT_EQ(GetBytes(memory)[i], 0) << i;

    CloseSharedMemory(memory);
}

TEST_F(NamedMemory, IsOneBlockForTwoThatOpenIt) {
    SharedMemory* first = Open();
    SharedMemory* second = Open();
    ASSERT_NE(first, nullptr);
    ASSERT_NE(second, nullptr);

    GetBytes(first)[5] = 55;

    EXPECT_EQ(GetBytes(second)[5], 55);
    CloseSharedMemory(first);
    EXPECT_EQ(GetBytes(second)[5], 55);
    CloseSharedMemory(second);
}

TEST_F(NamedMemory, IsGoneWithItsLastHolder) {
    SharedMemory* first = Open();
    SharedMemory* second = Open();

    CloseSharedMemory(first);
    EXPECT_TRUE(IsThere());
    CloseSharedMemory(second);

    EXPECT_FALSE(IsThere());
}

TEST(SharedMemoryName, IsRefusedWhenItIsNone) {
    EXPECT_EQ(OpenSharedMemory("a\\b\\c", BlockBytes), nullptr);
    CloseSharedMemory(nullptr);
}

}  // namespace
}  // namespace ZV
