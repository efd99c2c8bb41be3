#pragma once

#include <gtest/gtest.h>
#include <windows.h>

#include <setupapi.h>

#include <string>

namespace ZV::Test {

/// The class of the devices that the tests install; no driver serves it.
inline constexpr GUID TestDeviceClass = {
    0x7C3A91D4, 0x52B0, 0x4E0B, {0x9A, 0x61, 0x0C, 0x5E, 0x13, 0x77, 0xD2, 0x40}};

/// A device without a driver that the system's setup interface knows while the object lives.
class InstalledDevice {
  public:
    explicit InstalledDevice(const GUID& classId = TestDeviceClass)
        : set(SetupDiCreateDeviceInfoList(&classId, nullptr)) {
        device.cbSize = sizeof device;
        EXPECT_TRUE(SetupDiCreateDeviceInfoA(set, "ZENTARATEST", &classId, nullptr, nullptr,
                                             DICD_GENERATE_ID, &device));
        EXPECT_TRUE(SetupDiSetDeviceRegistryPropertyA(set, &device, SPDRP_HARDWAREID, HardwareIds,
                                                      sizeof HardwareIds));
        EXPECT_TRUE(SetupDiRegisterDeviceInfo(set, &device, 0, nullptr, nullptr, nullptr));
        EXPECT_TRUE(
            SetupDiGetDeviceInstanceIdA(set, &device, instanceId, sizeof instanceId, nullptr));
    }
    ~InstalledDevice() {
        SetupDiRemoveDevice(set, &device);
        SetupDiDestroyDeviceInfoList(set);
    }
    InstalledDevice(const InstalledDevice&) = delete;
    InstalledDevice& operator=(const InstalledDevice&) = delete;

    [[nodiscard]] const char* GetInstanceId() const { return instanceId; }
    [[nodiscard]] DEVINST GetNode() const { return device.DevInst; }

  private:
    /// A list of texts, ended by an empty one.
    static constexpr BYTE HardwareIds[] = "root\\zentara-test\0";

    HDEVINFO set;
    SP_DEVINFO_DATA device{};
    char instanceId[260] = "";
};

/// An installation file that offers a driver for devices of `hardwareId`.
[[nodiscard]] inline std::string MakeInf(const std::string& hardwareId) {
    return "[Version]\r\n"
           "Signature=\"$Windows NT$\"\r\n"
           "Class=ZentaraTest\r\n"
           "ClassGuid={7C3A91D4-52B0-4E0B-9A61-0C5E1377D240}\r\n"
           "Provider=Test\r\n"
           "DriverVer=01/02/2020,1.2.3.4\r\n"
           "[Manufacturer]\r\n"
           "Test=models,NTamd64\r\n"
           "[models.NTamd64]\r\n"
           "Test camera=install," +
           hardwareId +
           "\r\n"
           "[install.NT]\r\n"
           "[install.NT.Services]\r\n"
           "AddService=,2\r\n";
}

}  // namespace ZV::Test
