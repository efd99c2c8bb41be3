#include "hal/driver_selection.h"

#include <gtest/gtest.h>

#include <string>

#include "hal/hal.h"
#include "hal/open_camera_table.h"
#include "hal/table_lock.h"
#include "support/stored_settings.h"

namespace ZV::Test {
namespace {

struct DriverSelection : testing::Test {
    ~DriverSelection() override { SetLastCameraFlag(false); }

    TableLock lock;
    StoredSettings settings;
};

TEST_F(DriverSelection, NoSwitchIsDueBeforeALastCameraHasClosed) {
    settings.Write("FireWireDriverMode = 0\n");

    EXPECT_FALSE(DriverSwitchDue());
}

TEST_F(DriverSelection, NoSwitchIsDueWhileACameraIsOpenAnywhere) {
    SetLastCameraFlag(true);
    OpenCameraTable table;
    ASSERT_TRUE(table.Add(MakeOpenCameraEntry(0, 1)));

    EXPECT_TRUE(AnyCameraOpen());
    EXPECT_FALSE(DriverSwitchDue());

    table.Remove(MakeOpenCameraEntry(0, 1));
    EXPECT_FALSE(AnyCameraOpen());
    EXPECT_TRUE(DriverSwitchDue());
}

TEST_F(DriverSelection, ASwitchIsDueWithoutASettingsStore) {
    SetLastCameraFlag(true);

    EXPECT_TRUE(DriverSwitchDue());
}

TEST_F(DriverSelection, OnlyDriverModeOneForbidsTheSwitch) {
    SetLastCameraFlag(true);

    settings.Write("other = 1\n");
    EXPECT_TRUE(DriverSwitchDue());
    settings.Write("FireWireDriverMode = 0\n");
    EXPECT_TRUE(DriverSwitchDue());
    settings.Write("FireWireDriverMode = 2\n");
    EXPECT_TRUE(DriverSwitchDue());
    settings.Write("FireWireDriverMode = 1\n");
    EXPECT_FALSE(DriverSwitchDue());
}

TEST(DriverFiles, HaveFixedTailsBehindTheCommonFilesFolder) {
    char folder[260] = {};
    GetCommonProgramFilesFolder(folder);
    struct {
        char* path;
        const char* tail;
    } const rows[] = {{GetInfPath(), "\\Morvane\\inf\\1394.inf"},
                      {GetUBInfPath(), "\\Morvane\\inf\\ub1394.inf"},
                      {GetUBHelperPath(), "\\Morvane\\UBHelper.exe"}};
    for (const auto& row : rows) {
        ASSERT_NE(nullptr, row.path);
        EXPECT_EQ(std::string(folder) + row.tail, row.path);
        EXPECT_EQ(HALOk, HAL_MemoryFree(row.path));
    }
}

TEST(SystemVersions, OnlySixPointZeroOfTheNTFamilyIsVistaExactly) {
    EXPECT_TRUE(IsVistaExactly(SystemVersion{2, 6, 0}));
    EXPECT_FALSE(IsVistaExactly(SystemVersion{2, 6, 1}));
    EXPECT_FALSE(IsVistaExactly(SystemVersion{2, 5, 1}));
    EXPECT_FALSE(IsVistaExactly(SystemVersion{2, 10, 0}));
    EXPECT_FALSE(IsVistaExactly(SystemVersion{1, 6, 0}));
}

TEST(DriverMaintenance, NullArgumentsAreRefused) {
    std::uint32_t count = 0;
    char* ids[1] = {};

    EXPECT_EQ(HALListingFailed, ListAdapterIds(nullptr, ids));
    EXPECT_EQ(HALListingFailed, ListAdapterIds(&count, nullptr));
    EXPECT_EQ(HALListingFailed, ListClassDeviceIds(nullptr, &count, ids));
    EXPECT_EQ(0u, InstallDriverOnDevice(nullptr, "path"));
    EXPECT_EQ(0u, InstallDriverOnDeviceForOS("id", nullptr));
}

}  // namespace
}  // namespace ZV::Test
