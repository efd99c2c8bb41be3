#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <array>
#include <cstdlib>
#include <cstring>
#include <string>
#include <vector>

#include "hal/driver_selection.h"
#include "hal/platform/win32/device_interface_class.h"
#include "hal/platform/win32/maintenance_functions.h"
#include "windows/maintenance/installed_device.h"
#include "windows/support/named_turn.h"

namespace ZV::Test {
namespace {

using testing::ElementsAre;
using testing::IsSupersetOf;

constexpr std::uint32_t ListingFailed = 998;

/// The places that a listing fills, with their texts.
struct Listing {
    std::uint32_t count = 0;
    std::array<char*, 64> ids{};

    ~Listing() {
        for (char* id : ids) std::free(id);
    }
    [[nodiscard]] std::vector<std::string> GetTexts() const {
        return {ids.begin(), ids.begin() + count};
    }
};

/// A class that no other process lists: a run that was killed leaves its devices behind.
const GUID OwnClass = [] {
    GUID id = TestDeviceClass;
    LARGE_INTEGER counter;
    QueryPerformanceCounter(&counter);
    id.Data1 = GetCurrentProcessId();
    std::memcpy(id.Data4, &counter, sizeof id.Data4);
    return id;
}();

const std::uint8_t* AsBytes(const GUID& id) {
    return reinterpret_cast<const std::uint8_t*>(&id);
}

int CountDevices(const GUID& classId, DWORD flags) {
    HDEVINFO set = SetupDiGetClassDevsA(&classId, nullptr, nullptr, flags);
    SP_DEVINFO_DATA device{};
    device.cbSize = sizeof device;
    int count = 0;
    while (SetupDiEnumDeviceInfo(set, static_cast<DWORD>(count), &device)) ++count;
    SetupDiDestroyDeviceInfoList(set);
    return count;
}

/// The instances of the tests' devices by the system's own registry.
std::vector<std::string> ReadInstancesFromRegistry() {
    HKEY key = nullptr;
    std::vector<std::string> instances;
    constexpr char Path[] = "SYSTEM\\CurrentControlSet\\Enum\\ROOT\\ZENTARATEST";
    if (RegOpenKeyExA(HKEY_LOCAL_MACHINE, Path, 0, KEY_READ, &key) != ERROR_SUCCESS) return {};
    char name[256];
    for (DWORD index = 0; RegEnumKeyA(key, index, name, sizeof name) == ERROR_SUCCESS; ++index) {
        instances.push_back(std::string("ROOT\\ZENTARATEST\\") + name);
    }
    RegCloseKey(key);
    return instances;
}

/// Two devices of one class, and listings over a table that sees them.
class ListingOfDevices : public testing::Test {
  protected:
    ListingOfDevices() {
        // Wine knows no parents: each device is its own here.
        functions.getParent = [](PDEVINST parent, DEVINST node, ULONG) -> CONFIGRET {
            *parent = node;
            return CR_SUCCESS;
        };
        functions.getClassDevices = [](const GUID*, PCSTR, HWND, DWORD) -> HDEVINFO {
            return SetupDiGetClassDevsA(&OwnClass, nullptr, nullptr, 0);
        };
    }

    std::uint32_t ListAdapters() { return AppendAdapterIds(functions, &listing.count, ids); }
    std::uint32_t ListClass() {
        return AppendClassDeviceIds(functions, AsBytes(OwnClass), &listing.count, ids);
    }

    InstalledDevice first{OwnClass};
    InstalledDevice second{OwnClass};
    MaintenanceFunctions functions = GetMaintenanceFunctions();
    Listing listing;
    char** const ids = listing.ids.data();
};

TEST_F(ListingOfDevices, FindsTheDevicesOfAClassThatTheRegistryHolds) {
    EXPECT_EQ(ListClass(), 0u);

    EXPECT_THAT(listing.GetTexts(), ElementsAre(first.GetInstanceId(), second.GetInstanceId()));
    EXPECT_THAT(ReadInstancesFromRegistry(), IsSupersetOf(listing.GetTexts()));
}

TEST_F(ListingOfDevices, ByTheSystemAloneFindsWhatIsPresent) {
    const int present = CountDevices(OwnClass, DIGCF_PRESENT);
    if (present == 0) GTEST_SKIP() << "this system takes no device without a bus for present";

    EXPECT_EQ(ListClassDeviceIds(AsBytes(OwnClass), &listing.count, ids), 0u);

    EXPECT_EQ(listing.count, static_cast<std::uint32_t>(present));
}

TEST_F(ListingOfDevices, AsksForPresentDevicesOfTheClassGiven) {
    functions.getClassDevices = [](const GUID* classId, PCSTR enumerator, HWND window,
                                   DWORD flags) -> HDEVINFO {
        EXPECT_EQ(*classId, OwnClass);
        EXPECT_EQ(enumerator, nullptr);
        EXPECT_EQ(window, nullptr);
        EXPECT_EQ(flags, 2u);
        return SetupDiCreateDeviceInfoList(nullptr, nullptr);
    };

    EXPECT_EQ(ListClass(), 0u);

    EXPECT_EQ(listing.count, 0u);
}

TEST_F(ListingOfDevices, AsksForAdaptersAmongPresentInterfacesOfTheDriver) {
    functions.getClassDevices = [](const GUID* classId, PCSTR, HWND, DWORD flags) -> HDEVINFO {
        EXPECT_EQ(*classId, DeviceInterfaceClass);
        EXPECT_EQ(flags, 0x12u);
        return SetupDiCreateDeviceInfoList(nullptr, nullptr);
    };

    EXPECT_EQ(ListAdapters(), 0u);

    EXPECT_EQ(listing.count, 0u);
}

TEST_F(ListingOfDevices, OfAnInterfaceWithoutDevicesIsEmpty) {
    functions.getClassDevices = [](const GUID*, PCSTR enumerator, HWND window, DWORD flags) {
        return SetupDiGetClassDevsA(&OwnClass, enumerator, window, flags);
    };

    EXPECT_EQ(ListAdapters(), 0u);

    EXPECT_EQ(listing.count, 0u);
}

TEST_F(ListingOfDevices, WithoutADeviceOfTheDriverListsNoAdapters) {
    const NamedTurn turn(TestDriverTurn, /*limitMs=*/0);
    if (!turn.IsOurs()) GTEST_SKIP() << "another suite has the driver";
    if (CountDevices(DeviceInterfaceClass, DIGCF_PRESENT | DIGCF_DEVICEINTERFACE) != 0) {
        GTEST_SKIP() << "a driver is installed";
    }

    EXPECT_EQ(ListAdapterIds(&listing.count, ids), 0u);

    EXPECT_EQ(listing.count, 0u);
}

TEST_F(ListingOfDevices, AddsToTheCountAndFillsTheNextPlaces) {
    EXPECT_EQ(ListClass(), 0u);
    EXPECT_EQ(ListClass(), 0u);

    EXPECT_THAT(listing.GetTexts(), ElementsAre(first.GetInstanceId(), second.GetInstanceId(),
                                                first.GetInstanceId(), second.GetInstanceId()));
}

TEST_F(ListingOfDevices, TakesTheParentOfEachDeviceForAnAdapter) {
    static DEVINST parent;
    parent = second.GetNode();
    functions.getParent = [](PDEVINST node, DEVINST, ULONG) -> CONFIGRET {
        *node = parent;
        return CR_SUCCESS;
    };

    EXPECT_EQ(ListAdapters(), 0u);

    EXPECT_THAT(listing.GetTexts(), ElementsAre(second.GetInstanceId(), second.GetInstanceId()));
}

TEST_F(ListingOfDevices, FailsWhereTheListCannotBeHad) {
    functions.getClassDevices = [](const GUID*, PCSTR, HWND, DWORD) -> HDEVINFO {
        return INVALID_HANDLE_VALUE;
    };

    EXPECT_EQ(ListAdapters(), ListingFailed);
    EXPECT_EQ(ListClass(), ListingFailed);

    EXPECT_EQ(listing.count, 0u);
}

TEST_F(ListingOfDevices, FailsWhenTheWalkEndsForAnotherReasonThanItsEnd) {
    functions.enumerateDevices = [](HDEVINFO, DWORD, PSP_DEVINFO_DATA) -> BOOL {
        SetLastError(ERROR_INVALID_HANDLE);
        return FALSE;
    };

    EXPECT_EQ(ListClass(), ListingFailed);
}

int callNumber;

TEST_F(ListingOfDevices, KeepsWhatItHasWhenALaterDeviceHasNoParent) {
    callNumber = 0;
    functions.getParent = [](PDEVINST parent, DEVINST node, ULONG) -> CONFIGRET {
        *parent = node;
        return ++callNumber == 1 ? CR_SUCCESS : CR_NO_SUCH_DEVNODE;
    };

    EXPECT_EQ(ListAdapters(), ListingFailed);

    EXPECT_THAT(listing.GetTexts(), ElementsAre(first.GetInstanceId()));
}

TEST_F(ListingOfDevices, FailsWhereTheLengthOfAnIdIsUnknown) {
    functions.getDeviceIdSize = [](PULONG, DEVINST, ULONG) -> CONFIGRET { return CR_FAILURE; };

    EXPECT_EQ(ListClass(), ListingFailed);

    EXPECT_EQ(listing.count, 0u);
}

TEST_F(ListingOfDevices, FailsWhereAnIdCannotBeRead) {
    functions.getDeviceId = [](DEVINST, PSTR, ULONG, ULONG) -> CONFIGRET { return CR_FAILURE; };

    EXPECT_EQ(ListClass(), ListingFailed);

    EXPECT_EQ(listing.count, 0u);
}

TEST_F(ListingOfDevices, CutsAnIdThatIsLongerThanItsLengthAndOneWithoutAnEnd) {
    functions.getDeviceId = [](DEVINST, PSTR id, ULONG capacity, ULONG) -> CONFIGRET {
        std::memset(id, 'x', capacity);
        return CR_SUCCESS;
    };
    functions.getDeviceIdSize = [](PULONG length, DEVINST, ULONG) -> CONFIGRET {
        *length = ++callNumber == 1 ? 3 : 1000;
        return CR_SUCCESS;
    };
    callNumber = 0;

    EXPECT_EQ(ListClass(), 0u);

    EXPECT_THAT(listing.GetTexts(), ElementsAre("xxx", std::string(200, 'x')));
}

TEST_F(ListingOfDevices, ClosesTheListWhicheverStepFails) {
    static int openCount;
    openCount = 0;
    functions.getClassDevices = [](const GUID*, PCSTR, HWND, DWORD) -> HDEVINFO {
        ++openCount;
        return SetupDiGetClassDevsA(&OwnClass, nullptr, nullptr, 0);
    };
    functions.destroyDeviceInfoList = [](HDEVINFO set) -> BOOL {
        --openCount;
        return SetupDiDestroyDeviceInfoList(set);
    };

    EXPECT_EQ(ListAdapters(), 0u);
    functions.getDeviceId = [](DEVINST, PSTR, ULONG, ULONG) -> CONFIGRET { return CR_FAILURE; };
    EXPECT_EQ(ListAdapters(), ListingFailed);

    EXPECT_EQ(openCount, 0);
}

}  // namespace
}  // namespace ZV::Test
