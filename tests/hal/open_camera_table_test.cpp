#include "hal/open_camera_table.h"

#include <gtest/gtest.h>

#include <cstring>
#include <memory>

#include "hal/table_lock.h"

namespace ZV::Test {
namespace {

struct OpenTable : testing::Test {
    TableLock lock;
    OpenCameraTable table;
};

TEST_F(OpenTable, IsEmptyAtFirst) {
    ASSERT_TRUE(table.IsReachable());

    EXPECT_EQ(0u, table.CountUsed());
}

TEST_F(OpenTable, IsSharedByAllWhoOpenIt) {
    OpenCameraTable other;

    ASSERT_TRUE(table.Add(MakeOpenCameraEntry(0, 5)));

    EXPECT_EQ(1u, other.CountUsed());
    EXPECT_TRUE(other.Contains(MakeOpenCameraEntry(0, 5)));
    EXPECT_FALSE(other.Contains(MakeOpenCameraEntry(1, 5)));
    other.Remove(MakeOpenCameraEntry(0, 5));
    EXPECT_EQ(0u, table.CountUsed());
}

TEST_F(OpenTable, AnEntryIsTheAdapterPlusOneAndTheLowSixBitsOfTheNode) {
    SharedMemory* const memory = OpenSharedMemory("404B602C-4181-4d11-A184-AB30190B8DCD", 504);
    ASSERT_NE(nullptr, memory);
    const std::uint8_t expected[] = {3, 0, 0, 0, 0x3F, 0, 0, 0};

    ASSERT_TRUE(table.Add(MakeOpenCameraEntry(2, 0xFFFF)));

    EXPECT_EQ(0, std::memcmp(GetSharedMemoryAddress(memory), expected, sizeof expected));
    CloseSharedMemory(memory);
}

TEST_F(OpenTable, TakesTheFirstFreeEntryAndIsFullWith63) {
    for (std::uint32_t i = 0; i < 63; ++i) ASSERT_TRUE(table.Add(MakeOpenCameraEntry(i, 1)));

    EXPECT_FALSE(table.Add(MakeOpenCameraEntry(63, 1)));
    EXPECT_EQ(63u, table.CountUsed());

    table.Remove(MakeOpenCameraEntry(40, 1));
    EXPECT_TRUE(table.Add(MakeOpenCameraEntry(63, 1)));
    EXPECT_TRUE(table.Contains(MakeOpenCameraEntry(63, 1)));
}

TEST_F(OpenTable, AFreeEntryIsFreeWhateverItsNode) {
    SharedMemory* const memory = OpenSharedMemory(OpenCameraTableName, OpenCameraTableBytes);
    ASSERT_NE(nullptr, memory);
    const OpenCameraEntry leftover{0, 17};
    std::memcpy(GetSharedMemoryAddress(memory), &leftover, sizeof leftover);

    EXPECT_EQ(0u, table.CountUsed());
    EXPECT_TRUE(table.Add(MakeOpenCameraEntry(0, 1)));
    OpenCameraEntry first{};
    std::memcpy(&first, GetSharedMemoryAddress(memory), sizeof first);
    EXPECT_EQ(1u, first.adapterPlusOne);
    CloseSharedMemory(memory);
}

}  // namespace
}  // namespace ZV::Test
