#include "api/parameter_table.h"

#include <gtest/gtest.h>

#include <fstream>
#include <map>
#include <regex>
#include <set>
#include <string>

#include "api/information_table.h"
#include "api/settings_block.h"

namespace ZV {
namespace {

/// Names and numbers of the enumerators of zentara.h that begin with `prefix`.
std::map<std::string, std::uint32_t> ReadEnumerators(const std::string& prefix) {
    std::ifstream header(ZENTARA_SOURCE_DIR "/include/zentara/zentara.h");
    const std::regex pattern("^ *(" + prefix + "[A-Z0-9a-z]*) = ([0-9]+)");
    std::map<std::string, std::uint32_t> enumerators;
    for (std::string line; std::getline(header, line);) {
        std::smatch match;
        if (std::regex_search(line, match, pattern)) {
            enumerators[match[1]] = static_cast<std::uint32_t>(std::stoul(match[2]));
        }
    }
    return enumerators;
}

template <typename Row>
std::map<std::string, std::uint32_t> CollectNames(std::span<const Row> rows) {
    std::map<std::string, std::uint32_t> names;
    for (const Row& row : rows) names[row.text.name] = row.key;
    return names;
}

template <typename Row>
void ExpectKeysInOrder(std::span<const Row> rows, std::uint32_t count) {
    ASSERT_EQ(count, rows.size());
    for (std::uint32_t key = 0; key < count; ++key) EXPECT_EQ(key, rows[key].key);
}

TEST(ParameterTable, HasARowForEachWordOfABlockInTheirOrder) {
    ExpectKeysInOrder(GetWordParameters(), 47);
    ExpectKeysInOrder(GetSignedParameters(), 3);
    ExpectKeysInOrder(GetWideParameters(), 4);
}

TEST(ParameterTable, NamesAreThoseOfTheHeader) {
    auto words = ReadEnumerators("zprm");
    std::erase_if(words, [](const auto& name) {
        return name.first.starts_with("zprmS32") || name.first.starts_with("zprm64");
    });

    EXPECT_EQ(words, CollectNames(GetWordParameters()));
    EXPECT_EQ(ReadEnumerators("zprmS32"), CollectNames(GetSignedParameters()));
    EXPECT_EQ(ReadEnumerators("zprm64"), CollectNames(GetWideParameters()));
}

TEST(ParameterTable, NamesOfInformationKeysAreThoseOfTheHeader) {
    for (const auto& [name, key] : ReadEnumerators("zinf")) {
        const InformationRow* const row = FindInformationRow(key);
        ASSERT_NE(nullptr, row) << name;
        EXPECT_EQ(name, row->name != nullptr ? row->name : "zinfReserved" + std::to_string(key));
    }
    EXPECT_EQ(ReadEnumerators("zinf").size(), GetInformationRows().size());
}

TEST(ParameterTable, AKeyBeyondItsFamilyHasNoRow) {
    for (const std::uint32_t key : {47u, 48u, 0x80000000u, 0xFFFFFFFFu}) {
        EXPECT_EQ(nullptr, FindWordParameter(key)) << key;
        EXPECT_EQ(nullptr, FindSignedParameter(key)) << key;
        EXPECT_EQ(nullptr, FindWideParameter(key)) << key;
    }
    EXPECT_NE(nullptr, FindWordParameter(46));
    EXPECT_EQ(nullptr, FindSignedParameter(3));
    EXPECT_EQ(nullptr, FindWideParameter(4));
}

TEST(ParameterTable, WordsThatReadingLeavesAloneAreThoseWithoutASource) {
    std::set<std::uint32_t> unread;
    for (const WordParameter& row : GetWordParameters()) {
        if (row.read == nullptr) unread.insert(row.key);
    }

    // The format goes by the camera's image format and is read apart.
    EXPECT_EQ((std::set<std::uint32_t>{12, 17, 18, 38, 40, 41, 45, 46}), unread);
}

TEST(ParameterTable, EveryKeySaysWhatItIs) {
    for (const WordParameter& row : GetWordParameters()) {
        EXPECT_STRNE("", row.text.meaning) << row.key;
        EXPECT_NE(nullptr, row.text.unit) << row.key;
        EXPECT_NE(nullptr, row.isSupported) << row.key;
    }
}

TEST(ParameterTable, NamesOfValuesAreFoundAndOthersAreUnknown) {
    struct {
        std::uint32_t key, value;
        const char* name;
    } constexpr Names[] = {
        {zprmReadoutSpeed, 0, "20 MHz"},
        {zprmReadoutSpeed, 3, "2.5 MHz"},
        {zprmReadoutSpeed, 7, "40 MHz"},
        {zprmReadoutSpeed, 8, "30 MHz"},
        {zprmReadoutSpeed, 4, "Unknown"},
        {zprmColorWheel, 0, "Red"},
        {zprmColorWheel, 1, "Green"},
        {zprmColorWheel, 2, "Black"},
        {zprmColorWheel, 3, "Blue"},
        {zprmColorWheel, 4, "Unknown"},
        {zprmImageFormat, 0, "Raw 8-Bit"},
        {zprmImageFormat, 1, "Raw 16-Bit"},
        {zprmImageFormat, 2, "Mono 8-Bit"},
        {zprmImageFormat, 3, "Mono 16-Bit"},
        {zprmImageFormat, 4, "Bayer 8-Bit"},
        {zprmImageFormat, 5, "Bayer 16-Bit"},
        {zprmImageFormat, 6, "RGB Plane 8-Bit"},
        {zprmImageFormat, 7, "RGB Plane 16-Bit"},
        {zprmImageFormat, 8, "BGR24"},
        {zprmImageFormat, 9, "XRGB32"},
        {zprmImageFormat, 10, "RGB48"},
        {zprmImageFormat, 11, "BGRX32"},
        {zprmImageFormat, 12, "RGB24"},
        {zprmImageFormat, 13, "Unknown"},
        {zprmSyncb, 0, "Trigger Mask"},
        {zprmSyncb, 1, "Expose"},
        {zprmSyncb, 2, "Unknown"},
        {zprmCameraMode, 0, "Standard Mode"},
        {zprmCameraMode, 1, "RTV Mode"},
        {zprmCameraMode, 2, "Oversample Mode"},
        {zprmPostProcessBayerAlgorithm, 1, "Average"},
        {zprmPostProcessBayerAlgorithm, 2, "Fast"},
        {zprmPostProcessBayerAlgorithm, 3, "Bicubic"},
        {zprmPostProcessBayerAlgorithm, 4, "Bicubic - Faster"},
        {zprmPostProcessImageFormat, 12, "RGB24"},
        {zprmFan, 1, "Low"},
        {zprmFan, 4, "Full"},
        {zprmGain, 0, "Unknown"},
    };
    for (const auto& [key, value, name] : Names) {
        EXPECT_STREQ(name, FindValueName(FindWordParameter(key)->text.values, value))
            << key << " " << value;
    }
}

}  // namespace
}  // namespace ZV
