#include "hal/platform/driver_maintenance.h"

#include <gtest/gtest.h>
#include <unistd.h>

namespace ZV {
namespace {

TEST(DriverMaintenance, ListsNoDevicesWhereThereIsNoSetupInterface) {
    constexpr std::uint8_t ClassId[16] = {};
    std::uint32_t count = 3;
    char* ids[4] = {};

    EXPECT_EQ(AppendAdapterIds(&count, ids), 998u);
    EXPECT_EQ(AppendClassDeviceIds(ClassId, &count, ids), 998u);

    EXPECT_EQ(count, 3u);
    EXPECT_EQ(ids[0], nullptr);
}

TEST(DriverMaintenance, AnswersPrivilegesByTheEffectiveUser) {
    EXPECT_EQ(IsProcessAdministrator(), geteuid() == 0);
}

TEST(DriverMaintenance, KnowsNeitherElevationNorAVersionNorAProgramFolder) {
    bool isElevated = true;
    SystemVersion version{7, 7, 7};
    char path[260] = "before";

    EXPECT_FALSE(QueryProcessElevation(&isElevated));
    EXPECT_FALSE(QuerySystemVersion(&version));
    GetCommonProgramFilesFolder(path);

    EXPECT_TRUE(isElevated);
    EXPECT_EQ(version.major, 7u);
    EXPECT_STREQ(path, "");
}

TEST(DriverMaintenance, InstallsNothing) {
    InstallDriver("device", "path.inf", true, false);
}

}  // namespace
}  // namespace ZV
