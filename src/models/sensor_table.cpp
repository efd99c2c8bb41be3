#include "models/sensor_table.h"

#include <array>

namespace ZV {

namespace {

struct SensorRow {
    std::uint32_t id;
    const char* name;
    std::uint16_t pixelNanometres;
    std::uint32_t fullWellElectrons;
};
/// In the order of the ids, without a gap. The last has a pixel size and nothing else.
constexpr std::array Sensors{
    SensorRow{0, "KAF1400", 0, 0},
    SensorRow{1, "KAF1600", 0, 0},
    SensorRow{2, "KAF1600L", 0, 0},
    SensorRow{3, "KAF4200", 0, 0},
    SensorRow{4, "ICX085AL", 6700, 36000},
    SensorRow{5, "ICX085AK", 6700, 36000},
    SensorRow{6, "ICX285AL", 6450, 22000},
    SensorRow{7, "ICX285AK", 6450, 22000},
    SensorRow{8, "ICX205AL", 4650, 10000},
    SensorRow{9, "ICX205AK", 4650, 10000},
    SensorRow{10, "ICX252AQ", 3450, 0},
    SensorRow{11, "S70311006", 0, 0},
    SensorRow{12, "ICX282AQ", 3400, 0},
    SensorRow{13, "ICX407AL", 0, 0},
    SensorRow{14, "S70310908", 0, 0},
    SensorRow{15, "VQE3618L", 13700, 22000},
    SensorRow{16, "KAI-2001 Quartz Glass", 0, 0},
    SensorRow{17, "KAI-2001 No Glass", 0, 0},
    SensorRow{18, "KAI-2001M AR Glass", 0, 0},
    SensorRow{19, "KAI-2001CM AR Glass", 0, 0},
    SensorRow{20, "KAI-4020 No Glass", 7400, 80000},
    SensorRow{21, "KAI-4020M AR Glass", 7400, 80000},
    SensorRow{22, "KAI-4020M No Glass", 7400, 80000},
    SensorRow{23, "KAI-4020CM AR Glass", 7400, 80000},
    SensorRow{24, "KAI-1020 No Glass", 0, 0},
    SensorRow{25, "KAI-1020M AR Glass", 0, 0},
    SensorRow{26, "KAI-1020M Clear Glass", 0, 0},
    SensorRow{27, "KAI-1020CM AR Glass", 0, 0},
    SensorRow{28, "KAI-2001M Clear Glass", 0, 0},
    SensorRow{29, "KAI-2001 AR Glass", 0, 0},
    SensorRow{30, "KAI-2001 Clear Glass", 0, 0},
    SensorRow{31, "KAI-2001M No Glass", 0, 0},
    SensorRow{32, "KAI-2001CM Clear Glass", 0, 0},
    SensorRow{33, "KAI-2001CM No Glass", 0, 0},
    SensorRow{34, "KAI-4020M Clear Glass", 7400, 80000},
    SensorRow{35, "KAI-4020 AR Glass", 7400, 80000},
    SensorRow{36, "KAI-4020 Quartz Glass", 7400, 80000},
    SensorRow{37, "KAI-4020 Clear Glass", 7400, 80000},
    SensorRow{38, "KAI-4020CM Clear Glass", 7400, 80000},
    SensorRow{39, "KAI-4020CM No Glass", 7400, 80000},
    SensorRow{40, "KAI-1020 AR Glass", 0, 0},
    SensorRow{41, "KAI-1020 Quartz Glass", 0, 0},
    SensorRow{42, "KAI-1020 Clear Glass", 0, 0},
    SensorRow{43, "KAI-1020M No Glass", 0, 0},
    SensorRow{44, "KAI-1020CM Clear Glass", 0, 0},
    SensorRow{45, "KAI-1020CM No Glass", 0, 0},
    SensorRow{46, "KAI-2020M AR Glass", 7400, 80000},
    SensorRow{47, "KAI-2020M Clear Glass", 7400, 80000},
    SensorRow{48, "KAI-2020 AR Glass", 7400, 80000},
    SensorRow{49, "KAI-2020 Quartz Glass", 7400, 80000},
    SensorRow{50, "KAI-2020 Clear Glass", 7400, 80000},
    SensorRow{51, "KAI-2020M No Glass", 7400, 80000},
    SensorRow{52, "KAI-2020 No Glass", 7400, 80000},
    SensorRow{53, "KAI-2020CM AR Glass", 7400, 80000},
    SensorRow{54, "KAI-2020CM Clear Glass", 7400, 80000},
    SensorRow{55, "KAI-2020CM No Glass", 7400, 80000},
    SensorRow{56, "KAI-2021M Clear Glass", 7400, 80000},
    SensorRow{57, "KAI-2021CM Clear Glass", 7400, 80000},
    SensorRow{58, "KAI-2021M AR Glass", 7400, 80000},
    SensorRow{59, "KAI-2021CM AR Glass", 7400, 80000},
    SensorRow{60, "KAI-2021 AR Glass", 7400, 80000},
    SensorRow{61, "KAI-2021 Quartz Glass", 7400, 80000},
    SensorRow{62, "KAI-2021 Clear Glass", 7400, 80000},
    SensorRow{63, "KAI-2021 No Glass", 7400, 80000},
    SensorRow{64, "KAI-2021M No Glass", 7400, 80000},
    SensorRow{65, "KAI-2021CM No Glass", 7400, 80000},
    SensorRow{66, "KAI-4021M Clear Glass", 7400, 80000},
    SensorRow{67, "KAI-4021CM Clear Glass", 7400, 80000},
    SensorRow{68, "KAI-4021CM AR Glass", 7400, 80000},
    SensorRow{69, "KAI-4021M AR Glass", 7400, 80000},
    SensorRow{70, "KAI-4021 AR Glass", 7400, 80000},
    SensorRow{71, "KAI-4021 Quartz Glass", 7400, 80000},
    SensorRow{72, "KAI-4021 Clear Glass", 7400, 80000},
    SensorRow{73, "KAI-4021 No Glass", 7400, 80000},
    SensorRow{74, "KAI-4021M No Glass", 7400, 80000},
    SensorRow{75, "KAI-4021CM No Glass", 7400, 80000},
    SensorRow{76, "KAF-3200", 6800, 55000},
    SensorRow{77, "KAF-3200", 6800, 55000},
    SensorRow{78, "", 16000, 0},
};

constexpr bool AreIdsIndexes() {
    for (std::uint32_t index = 0; index < Sensors.size(); ++index) {
        if (Sensors[index].id != index) return false;
    }
    return true;
}
static_assert(AreIdsIndexes());

constexpr SensorRow UnknownSensor{0, "", 0, 0};

const SensorRow& FindSensor(std::uint32_t sensorId) {
    return sensorId < Sensors.size() ? Sensors[sensorId] : UnknownSensor;
}

}  // namespace

const char* GetSensorName(std::uint32_t sensorId) {
    return FindSensor(sensorId).name;
}

std::uint16_t GetSensorPixelSize(std::uint32_t sensorId) {
    return FindSensor(sensorId).pixelNanometres;
}

std::uint32_t GetSensorFullWell(std::uint32_t sensorId) {
    return FindSensor(sensorId).fullWellElectrons;
}

}  // namespace ZV
