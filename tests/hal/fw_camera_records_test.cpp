#include "hal/fw_camera_records.h"

#include <gtest/gtest.h>

#include <cstring>
#include <vector>

namespace ZV {
namespace {

using Bytes = std::vector<std::uint8_t>;

template <typename Record>
Bytes GetBytes(const Record& record) {
    Bytes bytes(sizeof record);
    std::memcpy(bytes.data(), &record, sizeof record);
    return bytes;
}

// clang-format off
TEST(FWCameraRecords, AReadNamesNodeOffsetAndLengthAndIsZeroElsewhere) {
    const Bytes expected{
        0, 0, 0, 0,              // raw mode
        1, 0, 0, 0,              // get generation
        0xC0, 0xFF, 0, 0,        // destination node
        0xFF, 0xFF, 0, 0,        // offset high
        0x38, 0x00, 0x01, 0xE0,  // offset low
        0x0C, 0, 0, 0,           // bytes
        0, 0, 0, 0,              // block size
        0, 0, 0, 0,              // flags
        0, 0, 0, 0,              // generation
        0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0};

    EXPECT_EQ(expected, GetBytes(MakeAsyncReadRecord(0xE0010038, 3)));
}

TEST(FWCameraRecords, AWriteCarriesItsDataInBusOrderAndFourBytesBehindThem) {
    const std::uint32_t data[] = {0x01020304, 0xA0B0C0D0};
    const Bytes expected{
        0, 0, 0, 0,
        1, 0, 0, 0,
        0xC0, 0xFF, 0, 0,
        0xFF, 0xFF, 0, 0,
        0x00, 0x00, 0x00, 0xFA,
        8, 0, 0, 0,
        0, 0, 0, 0,
        0, 0, 0, 0,
        0, 0, 0, 0,
        0x01, 0x02, 0x03, 0x04,
        0xA0, 0xB0, 0xC0, 0xD0,
        0, 0, 0, 0};

    ASSERT_EQ(expected.size(), GetAsyncWriteBytes(2));
    Bytes record(GetAsyncWriteBytes(2), 0xEE);
    FillAsyncWriteRecord(record.data(), 0xFA000000, data, 2);

    EXPECT_EQ(expected, record);
    EXPECT_EQ(0x01020304u, data[0]);
}

TEST(FWCameraRecords, AWriteOfNothingIsFortyBytes) {
    Bytes record(40, 0xEE);
    FillAsyncWriteRecord(record.data(), 0, nullptr, 0);

    EXPECT_EQ(40u, GetAsyncWriteBytes(0));
    EXPECT_EQ(0, record[20]);
    EXPECT_EQ((Bytes{0, 0, 0, 0}), Bytes(record.begin() + 36, record.end()));
}

TEST(FWCameraRecords, TheLengthOfAWriteDoesNotWrapAt32Bits) {
    EXPECT_EQ(4ull * 0xFFFFFFFF + 40, GetAsyncWriteBytes(0xFFFFFFFF));
}

TEST(FWCameraRecords, BandwidthIsAskedForAtSpeedEight) {
    const Bytes expected{
        0x70, 0, 0, 0,           // maximum bytes per frame
        8, 0, 0, 0,              // speed
        0, 0, 0, 0, 0, 0, 0, 0,  // bandwidth handle
        0, 0, 0, 0, 0, 0, 0, 0};

    EXPECT_EQ(expected, GetBytes(MakeAllocateBandwidthRecord(112)));
}

TEST(FWCameraRecords, AnyFreeChannelIsAskedFor) {
    const Bytes expected{0xFF, 0xFF, 0xFF, 0xFF, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0};

    EXPECT_EQ(expected, GetBytes(MakeAllocateChannelRecord()));
}

TEST(FWCameraRecords, ResourcesAreAskedForWith61BuffersOf30Packets) {
    const Bytes expected{
        4, 0, 0, 0,              // speed
        0x41, 0, 0, 0,           // listening, packet based
        9, 0, 0, 0,              // channel
        0x70, 0, 0, 0,           // maximum bytes per frame
        61, 0, 0, 0,             // number of buffers
        0x20, 0x0D, 0, 0,        // maximum buffer size: 112 * 30
        0, 0, 0, 0,              // quadlets to strip
        0x02, 0x01, 0, 0,        // tag code
        0, 0, 0, 0, 0, 0, 0, 0}; // resource handle

    EXPECT_EQ(expected, GetBytes(MakeAllocateResourcesRecord(4, 9, 112, 0x0102)));
}

TEST(FWCameraRecords, ListenAndStopCarryTheResourceHandleAndZero) {
    const Bytes expected{8, 7, 6, 5, 4, 3, 2, 1, 0, 0, 0, 0, 0, 0, 0, 0};

    EXPECT_EQ(expected, GetBytes(MakeStreamSwitchRecord(0x0102030405060708)));
}
// clang-format on

TEST(FWCameraRecords, QuadletsAreReversedAtAnyAlignment) {
    Bytes bytes{9, 1, 2, 3, 4, 5, 6, 7, 8, 9};

    ReverseQuadlets(bytes.data() + 1, 2);

    EXPECT_EQ((Bytes{9, 4, 3, 2, 1, 8, 7, 6, 5, 9}), bytes);
}

}  // namespace
}  // namespace ZV
