#include "api/settings_block.h"

#include <gtest/gtest.h>

#include <array>
#include <cstring>

namespace ZV {
namespace {

using Bytes = std::array<std::uint8_t, 260>;

Bytes GetBytes(const Zentara_Settings& block) {
    Bytes bytes;
    std::memcpy(bytes.data(), &block, bytes.size());
    return bytes;
}

TEST(SettingsBlock, EveryFieldStandsAtItsOffsetInLittleEndianOrder) {
    Zentara_Settings block{};
    Bytes expected{};
    auto expect = [&](std::size_t offset, std::uint64_t value, std::size_t width) {
        for (std::size_t i = 0; i < width; ++i) {
            expected[offset + i] = static_cast<std::uint8_t>(value >> (8 * i));
        }
    };

    SetSettingsSize(block);
    expect(0, 260, 4);
    for (std::uint32_t key = 0; key < 47; ++key) {
        SetSettingsWord(block, key, 0x01020300 + key);
        expect(4 + 4 * key, 0x01020300 + key, 4);
    }
    for (std::uint32_t key = 0; key < 3; ++key) {
        SetSettingsSigned(block, key, -5 - static_cast<std::int32_t>(key));
        expect(192 + 4 * key, static_cast<std::uint32_t>(-5 - static_cast<std::int32_t>(key)), 4);
    }
    for (std::uint32_t key = 0; key < 4; ++key) {
        SetSettingsWide(block, key, 0x1122334455667700 + key);
        expect(204 + 8 * key, 0x1122334455667700 + key, 8);
    }
    SetSettingsHandle(block, 0x8877665544332211);
    expect(244, 0x8877665544332211, 8);
    SetSettingsMagic(block);
    expect(252, 0xDEADBEEF, 4);

    EXPECT_EQ(expected, GetBytes(block));
}

TEST(SettingsBlock, WhatIsStoredIsReadBack) {
    Zentara_Settings block{};

    SetSettingsWord(block, 46, 0xFFFFFFFF);
    SetSettingsSigned(block, 2, -40);
    SetSettingsWide(block, 3, 0xFEDCBA9876543210);
    SetSettingsHandle(block, 0x123456789ABCDEF0);

    EXPECT_EQ(0xFFFFFFFF, GetSettingsWord(block, 46));
    EXPECT_EQ(-40, GetSettingsSigned(block, 2));
    EXPECT_EQ(0xFEDCBA9876543210, GetSettingsWide(block, 3));
    EXPECT_EQ(0x123456789ABCDEF0, GetSettingsHandle(block));
}

TEST(SettingsBlock, TheMagicNumberAloneMakesABlockGood) {
    Zentara_Settings block{};
    EXPECT_FALSE(HasSettingsMagic(block));

    SetSettingsMagic(block);

    EXPECT_TRUE(HasSettingsMagic(block));
    EXPECT_EQ(0u, block.size);
}

TEST(SettingsBlock, AKeyBeyondItsGroupReadsZeroAndChangesNothing) {
    Zentara_Settings block;
    std::memset(&block, 0x77, sizeof(block));
    const Bytes before = GetBytes(block);

    SetSettingsWord(block, 47, 1);
    SetSettingsSigned(block, 3, 1);
    SetSettingsWide(block, 4, 1);
    SetSettingsWord(block, 0xFFFFFFFF, 1);

    EXPECT_EQ(before, GetBytes(block));
    EXPECT_EQ(0u, GetSettingsWord(block, 47));
    EXPECT_EQ(0, GetSettingsSigned(block, 3));
    EXPECT_EQ(0u, GetSettingsWide(block, 4));
}

}  // namespace
}  // namespace ZV
