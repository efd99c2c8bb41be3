#include "hal/hal_world.h"

#include <gtest/gtest.h>

#include "hal/platform/clock.h"

namespace ZV::Test {

HALWorld::HALWorld(std::string_view scenario) : world(scenario) {}

HALWorld::~HALWorld() {
    GiveUpList();
}

HALStatus HALWorld::List(std::uint32_t primaryIdAddress, std::uint32_t secondaryIdAddress,
                         std::uint32_t maxCameras) {
    GiveUpList();
    return HAL_CameraGetList(&list, primaryIdAddress, secondaryIdAddress, maxCameras, &count);
}

HALCamera* HALWorld::ListFirst() {
    EXPECT_EQ(HALOk, List());
    EXPECT_GE(count, 1u);
    (void)TakeRequests();
    return &list[0];
}

HALCamera* HALWorld::Connect(std::uint16_t payloadBytes) {
    HALCamera* const camera = ListFirst();
    EXPECT_EQ(HALOk, ConnectPlain(camera, payloadBytes));
    (void)TakeRequests();
    return camera;
}

void HALWorld::GiveUpList() {
    for (std::uint32_t i = 0; list != nullptr && i < count; ++i) (void)HAL_CameraRelease(&list[i]);
    (void)HAL_MemoryFree(list);
    list = nullptr;
    count = 0xDDDDDDDD;
}

std::vector<TraceRecord> HALWorld::TakeRequests() {
    std::vector<TraceRecord> records = world.ReadRequests();
    const std::size_t first = requestsTaken;
    requestsTaken = records.size();
    records.erase(records.begin(), records.begin() + static_cast<std::ptrdiff_t>(first));
    return records;
}

std::vector<std::uint32_t> HALWorld::TakeCodes() {
    std::vector<std::uint32_t> codes;
    for (const TraceRecord& record : TakeRequests()) codes.push_back(record.code);
    return codes;
}

HALStatus ConnectPlain(HALCamera* camera, std::uint16_t payloadBytes) {
    return HAL_CameraConnect(camera, payloadBytes, nullptr, nullptr, nullptr, nullptr, nullptr,
                             nullptr);
}

FastWaits::FastWaits(std::uint32_t divisor) {
    SetWaitClockDivisor(divisor);
}

FastWaits::~FastWaits() {
    SetWaitClockDivisor(1);
}

}  // namespace ZV::Test
