#include "camera/packet_size.h"

#include <gtest/gtest.h>

namespace ZV::Test {

namespace {

constexpr BusConnection S800{800, 9044};
constexpr BusConnection S400{400, 5000};

}  // namespace

TEST(FixedPacketSize, Is4980OnlyAbove8BitsUnbinnedAt20MHz) {
    EXPECT_EQ(4980, CalculateFixedPacketSize({1, 16, 20.0F}));
    EXPECT_EQ(4980, CalculateFixedPacketSize({1, 9, 20.0F}));
    EXPECT_EQ(4080, CalculateFixedPacketSize({2, 16, 20.0F}));
    EXPECT_EQ(4080, CalculateFixedPacketSize({1, 8, 20.0F}));
    EXPECT_EQ(4080, CalculateFixedPacketSize({1, 16, 10.0F}));
    EXPECT_EQ(4080, CalculateFixedPacketSize({1, 16, 40.0F}));
}

struct SizeCase {
    ReadoutLoad load;
    BusConnection bus;
    std::uint32_t firmware;
    std::uint16_t bytes;
};

class PacketSize : public testing::TestWithParam<SizeCase> {};

TEST_P(PacketSize, FollowsLoadConnectionAndFirmware) {
    const SizeCase& row = GetParam();

    EXPECT_EQ(row.bytes, CalculatePacketSize(row.load, row.bus, row.firmware));
}

// Worked out by hand: ((base - overhead) * bytes) * MHz / (binning * lineTime) + overhead.
INSTANTIATE_TEST_SUITE_P(
    Table, PacketSize,
    testing::Values(
        // 101 has an overhead of 56 and rounds up, 102 one of 40 and rounds down.
        SizeCase{{1, 8, 10.0F}, S800, 101, 1208},   // 8988 * 10 / 78 + 56 = 1208.3
        SizeCase{{1, 8, 2.5F}, S800, 101, 404},     // 8988 * 3 / 78 + 56 = 401.7
        SizeCase{{1, 8, 2.5F}, S800, 102, 384},     // 9004 * 3 / 78 + 40 = 386.3
        SizeCase{{1, 8, 10.0F}, S800, 102, 1192},   // 9004 * 10 / 78 + 40 = 1194.3
        SizeCase{{1, 8, 20.0F}, S800, 113, 2348},   // 9004 * 20 / 78 + 40 = 2348.7
        SizeCase{{1, 16, 20.0F}, S800, 113, 4656},  // 18008 * 20 / 78 + 40 = 4657.4
        SizeCase{{1, 12, 20.0F}, S800, 113, 4656}, SizeCase{{2, 16, 20.0F}, S800, 113, 2348},
        SizeCase{{1, 16, 40.0F}, S800, 113, 9044},  // 9274, cut
        // From 114 the limit is 8180 and the base 8192.
        SizeCase{{1, 8, 20.0F}, S800, 114, 2368},   // 8152 * 20 / 70 + 40 = 2369.1
        SizeCase{{1, 16, 40.0F}, S800, 114, 8180},  // 9356, cut
        SizeCase{{1, 8, 2.5F}, S800, 114, 388},     // as 3.0: 8152 * 3 / 70 + 40 = 389.4
        SizeCase{{1, 8, 3.0F}, S800, 114, 388},
        // 400 megabits.
        SizeCase{{1, 8, 20.0F}, S400, 101, 2528},   // 4944 * 20 / 40 + 56
        SizeCase{{1, 8, 20.0F}, S400, 102, 2520},   // 4960 * 20 / 40 + 40
        SizeCase{{1, 8, 20.0F}, S400, 114, 2580},   // 4960 * 20 / 39 + 40 = 2583.6
        SizeCase{{1, 16, 20.0F}, S400, 114, 5000},  // 5127, cut
        // Limits that no connection has today.
        SizeCase{{1, 8, 10.0F}, {800, 8192}, 113, 1204},    // 8152 * 10 / 70 + 40 = 1204.6
        SizeCase{{1, 8, 10.0F}, {400, 6000}, 113, 888},     // 5960 * 10 / 70 + 40 = 891.4
        SizeCase{{1, 8, 10.0F}, {800, 6000}, 113, 1204},    // base 8192
        SizeCase{{1, 8, 10.0F}, {400, 5012}, 113, 1280},    // 4972 * 10 / 40 + 40 = 1283
        SizeCase{{1, 8, 10.0F}, {400, 4096}, 114, 1196},    // 4056 * 10 / 35 + 40 = 1198.9
        SizeCase{{1, 8, 10.0F}, {400, 4097}, 114, 1080},    // 4057 * 10 / 39 + 40 = 1080.3
        SizeCase{{1, 8, 10.0F}, {800, 9056}, 113, 1192},    // 9016 * 10 / 78 + 40 = 1195.9
        SizeCase{{1, 8, 10.0F}, {800, 9057}, 113, 2292},    // 9017 * 10 / 40 + 40 = 2294.3
        SizeCase{{1, 8, 10.0F}, {800, 8181}, 114, 1204},    // 8180, base 8192
        SizeCase{{1, 8, 10.0F}, {400, 8181}, 114, 1200}));  // 8140 * 10 / 70 + 40 = 1202.9

TEST(PacketSizeLimits, AreKeptForEveryReadout) {
    constexpr std::uint16_t Binnings[] = {0, 1, 2, 64, 65535};
    for (const BusConnection& bus : {S800, S400, BusConnection{0, 0}, BusConnection{800, 100}}) {
        for (const std::uint32_t firmware : {0u, 101u, 102u, 113u, 114u, 0xFFFFu}) {
            for (std::uint16_t bits = 0; bits <= 17; ++bits) {
                for (const float megahertz : {0.0F, 2.5F, 5.0F, 10.0F, 20.0F, 30.0F, 40.0F}) {
                    for (const std::uint16_t binning : Binnings) {
                        EXPECT_LE(CalculatePacketSize({binning, bits, megahertz}, bus, firmware),
                                  bus.fastestBytes);
                    }
                }
            }
        }
    }
}

TEST(PacketSizeLimits, HoldForAbsurdLoads) {
    EXPECT_EQ(9044, CalculatePacketSize({0, 65535, 1e30F}, S800, 0));
    EXPECT_EQ(0, CalculatePacketSize({65535, 65535, 40.0F}, {0, 0}, 0));
}

TEST(UncutPacketSize, RoundsUpAndMayExceedTheConnection) {
    EXPECT_EQ(4660, CalculateUncutPacketSize({1, 8, 40.0F}, S800));       // 4657.4
    EXPECT_EQ(9276, CalculateUncutPacketSize({1, 16, 40.0F}, S800));      // 9274.9
    EXPECT_EQ(2348, CalculateUncutPacketSize({2, 8, 40.0F}, S800));       // 2348.7
    EXPECT_EQ(392, CalculateUncutPacketSize({1, 8, 2.5F}, {800, 6000}));  // 389.4
    EXPECT_EQ(5000, CalculateUncutPacketSize({1, 8, 40.0F}, S400));       // 5000 to the byte
    EXPECT_EQ(2520, CalculateUncutPacketSize({1, 8, 20.0F}, {400, 5012 - 12}));
    EXPECT_EQ(2296, CalculateUncutPacketSize({1, 8, 10.0F}, {800, 9057}));  // 2294.3
}

}  // namespace ZV::Test
