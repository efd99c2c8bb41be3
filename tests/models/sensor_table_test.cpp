#include "models/sensor_table.h"

#include <gtest/gtest.h>

#include <set>
#include <string>

#include "camera/bare_camera.h"

namespace ZV::Test {

namespace {

struct SensorRange {
    std::uint32_t first, last;
    std::uint16_t pixelSize;
    std::uint32_t fullWell;
};
constexpr SensorRange Ranges[] = {
    {4, 5, 6700, 36000},   {6, 7, 6450, 22000},    {8, 9, 4650, 10000},   {10, 10, 3450, 0},
    {12, 12, 3400, 0},     {15, 15, 13700, 22000}, {20, 23, 7400, 80000}, {34, 39, 7400, 80000},
    {46, 75, 7400, 80000}, {76, 77, 6800, 55000},  {78, 78, 16000, 0}};

SensorRange FindRange(std::uint32_t id) {
    for (const SensorRange& range : Ranges) {
        if (id >= range.first && id <= range.last) return range;
    }
    return {id, id, 0, 0};
}

struct SensorName {
    std::uint32_t id;
    const char* name;
};

}  // namespace

TEST(SensorTable, HasThePixelSizeAndFullWellOfEverySensor) {
    for (std::uint32_t id = 0; id < 200; ++id) {
        EXPECT_EQ(FindRange(id).pixelSize, GetSensorPixelSize(id)) << id;
        EXPECT_EQ(FindRange(id).fullWell, GetSensorFullWell(id)) << id;
    }
}

TEST(SensorTable, NamesTheSensorsFrom0To77) {
    const SensorName names[] = {{0, "KAF1400"},
                                {3, "KAF4200"},
                                {6, "ICX285AL"},
                                {10, "ICX252AQ"},
                                {11, "S70311006"},
                                {13, "ICX407AL"},
                                {15, "VQE3618L"},
                                {16, "KAI-2001 Quartz Glass"},
                                {23, "KAI-4020CM AR Glass"},
                                {33, "KAI-2001CM No Glass"},
                                {39, "KAI-4020CM No Glass"},
                                {45, "KAI-1020CM No Glass"},
                                {46, "KAI-2020M AR Glass"},
                                {53, "KAI-2020CM AR Glass"},
                                {65, "KAI-2021CM No Glass"},
                                {66, "KAI-4021M Clear Glass"},
                                {75, "KAI-4021CM No Glass"},
                                {76, "KAF-3200"},
                                {77, "KAF-3200"}};
    for (const SensorName& row : names) EXPECT_STREQ(row.name, GetSensorName(row.id));

    std::set<std::string> different;
    for (std::uint32_t id = 0; id <= 77; ++id) {
        EXPECT_STRNE("", GetSensorName(id)) << id;
        different.insert(GetSensorName(id));
    }
    EXPECT_EQ(77u, different.size()) << "the last two share a name";
}

TEST(SensorTable, HasNoNameFor78AndAbove) {
    EXPECT_STREQ("", GetSensorName(78));
    EXPECT_STREQ("", GetSensorName(79));
    EXPECT_STREQ("", GetSensorName(0xFFFFFFFF));
}

TEST(SensorTable, IsWhatACameraAnswersFrom) {
    BareBase camera;
    camera.StoreConfiguration(ConfigSensorModel, 78);

    EXPECT_EQ(78u, camera.GetCCDModel());
    EXPECT_STREQ("", camera.GetCCDModelString());
    EXPECT_EQ(16000, camera.GetPixelSize());
    EXPECT_EQ(16000, camera.GetDistanceBetweenPixels());
    EXPECT_EQ(0u, camera.GetFullWellCapacity());

    camera.StoreConfiguration(ConfigSensorModel, 21);
    EXPECT_STREQ("KAI-4020M AR Glass", camera.GetCCDModelString());
    EXPECT_EQ(7400, camera.GetPixelSize());
    EXPECT_EQ(80000u, camera.GetFullWellCapacity());
}

}  // namespace ZV::Test
