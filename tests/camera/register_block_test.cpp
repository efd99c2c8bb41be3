#include "camera/register_block.h"

#include <gtest/gtest.h>

#include "camera/morvane_fw_camera.h"

namespace ZV::Test {

TEST(RegisterBlock, ReadsZeroBeforeItHasACopyAndBeyondItsLength) {
    RegisterBlock block(ControlVersions);
    EXPECT_EQ(0u, block.Read(0));

    ASSERT_NE(nullptr, block.Provide(3));
    block.Store(2, 7);
    block.Store(3, 8);

    EXPECT_EQ(7u, block.Read(2));
    EXPECT_EQ(0u, block.Read(3));
    EXPECT_EQ(0u, block.Read(0xFFFFFFFF));
    EXPECT_EQ(3u, block.GetLength());
}

TEST(RegisterBlock, KeepsItsCopyInPlaceWhileTheLengthIsTheSame) {
    RegisterBlock block(ControlVersions);
    RegisterCopy* first = block.Provide(5);
    block.Store(4, 9);

    EXPECT_EQ(first, block.Provide(5));
    EXPECT_EQ(9u, block.Read(4));
}

TEST(RegisterBlock, UsesAFormerCopyAgainWhenItsLengthComesBack) {
    RegisterBlock block(ControlVersions);
    RegisterCopy* five = block.Provide(5);
    RegisterCopy* two = block.Provide(2);

    EXPECT_EQ(0u, five->Read(4)) << "a reader may still hold the former copy";
    EXPECT_EQ(five, block.Provide(5));
    EXPECT_EQ(two, block.Provide(2));
}

TEST(RegisterBlock, HasAnEmptyCopyForAnUnknownVersion) {
    RegisterBlock block(ConfigurationVersions);

    ASSERT_NE(nullptr, block.Provide(0));

    EXPECT_EQ(0u, block.GetLength());
    EXPECT_EQ(0u, block.Read(0));
}

TEST(RegisterLength, IsFoundByThePairOfNumbersAndNotByTheirOrder) {
    const auto find = [](std::uint32_t major, std::uint32_t minor) {
        return MorvaneFWCamera::CalculateRegisterLength(ConfigurationVersions,
                                                        MakeVersion(major, minor));
    };

    EXPECT_EQ(29u, find(1, 1));
    EXPECT_EQ(209u, find(2, 10));
    EXPECT_EQ(210u, find(2, 11));
    EXPECT_EQ(0u, find(2, 12)) << "above the last row";
    EXPECT_EQ(0u, find(1, 3));
    EXPECT_EQ(0u, find(0, 0));
    EXPECT_EQ(0u, find(2, 0));
}

TEST(RegisterLength, IsThatOfTheTableForEveryKnownVersion) {
    struct Row {
        const regVersionEntry* table;
        std::uint32_t major, minor, length;
    };
    constexpr Row Rows[] = {
        {DirectoryVersions, 1, 1, 11},      {ConfigurationVersions, 1, 1, 29},
        {ConfigurationVersions, 1, 2, 30},  {ConfigurationVersions, 2, 1, 42},
        {ConfigurationVersions, 2, 2, 44},  {ConfigurationVersions, 2, 3, 62},
        {ConfigurationVersions, 2, 4, 67},  {ConfigurationVersions, 2, 5, 68},
        {ConfigurationVersions, 2, 6, 79},  {ConfigurationVersions, 2, 7, 176},
        {ConfigurationVersions, 2, 8, 178}, {ConfigurationVersions, 2, 9, 202},
        {ControlVersions, 1, 1, 15},        {ControlVersions, 1, 2, 16},
        {ControlVersions, 2, 1, 20},        {ControlVersions, 2, 2, 20},
        {ControlVersions, 2, 3, 21},        {ControlVersions, 2, 4, 21},
        {ControlVersions, 2, 5, 24},        {ControlVersions, 2, 6, 26},
        {ControlVersions, 2, 7, 34},        {ControlVersions, 2, 8, 43},
        {StreamVersions, 1, 2, 4},          {CommandVersions, 1, 1, 3},
        {CommandVersions, 1, 2, 4},         {StatusVersions, 1, 1, 2},
        {StatusVersions, 1, 2, 2},          {StatusVersions, 1, 3, 4},
    };
    for (const Row& row : Rows) {
        EXPECT_EQ(row.length, MorvaneFWCamera::CalculateRegisterLength(
                                  row.table, MakeVersion(row.major, row.minor)))
            << row.major << '.' << row.minor;
    }
}

TEST(VersionTest, ComparesTheMajorNumberFirst) {
    EXPECT_TRUE(MorvaneFWCamera::CheckVersionAtLeast(3, 0, 2, 9));
    EXPECT_FALSE(MorvaneFWCamera::CheckVersionAtLeast(1, 9, 2, 0));
    EXPECT_TRUE(MorvaneFWCamera::CheckVersionAtLeast(2, 9, 2, 9));
    EXPECT_TRUE(MorvaneFWCamera::CheckVersionAtLeast(2, 10, 2, 9));
    EXPECT_FALSE(MorvaneFWCamera::CheckVersionAtLeast(2, 8, 2, 9));
}

}  // namespace ZV::Test
