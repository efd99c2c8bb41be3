#include "hal/platform/driver_maintenance.h"

#include <gtest/gtest.h>
#include <unistd.h>

#include "hal/driver_selection.h"
#include "hal/hal.h"

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

TEST(DriverMaintenance, FindsNoDriverAndNoElevationOnThisSystem) {
    bool isElevated = true;
    std::uint32_t count = 3;
    char* ids[4] = {};
    const std::uint8_t classId[16] = {};

    EXPECT_FALSE(IsVistaExactly());
    EXPECT_FALSE(IsNotElevated(&isElevated));
    EXPECT_TRUE(isElevated);
    EXPECT_FALSE(IsNotElevated(nullptr));
    EXPECT_EQ(HALListingFailed, ListAdapterIds(&count, ids));
    EXPECT_EQ(HALListingFailed, ListClassDeviceIds(classId, &count, ids));
    EXPECT_EQ(3u, count);
    EXPECT_EQ(0u, InstallDriverOnDevice("id", "path"));
    EXPECT_EQ(0u, InstallDriverOnDeviceForOS("id", "path"));
    EXPECT_EQ(IsProcessAdministrator(), IsAdministrator());
}

}  // namespace
}  // namespace ZV
