#include "windows/road/test_driver.h"

#include <gtest/gtest.h>
#include <initguid.h>
#include <setupapi.h>

#include <cstdio>
#include <cstring>
#include <utility>

#include "support/wait_until.h"

namespace ZV::Test {
namespace {

constexpr GUID InterfaceClass{
    0xE262A0C7, 0xFD57, 0x44A1, {0xA9, 0xD3, 0x88, 0x06, 0x34, 0x9A, 0x39, 0xDA}};
constexpr char InterfaceKey[] =
    "SYSTEM\\CurrentControlSet\\Control\\DeviceClasses\\{e262a0c7-fd57-44a1-a9d3-8806349a39da}";
/// Class of the systems' own devices; any will do.
constexpr GUID SystemClass{
    0x4D36E97D, 0xE325, 0x11CE, {0xBF, 0xC1, 0x08, 0x00, 0x2B, 0xE1, 0x03, 0x18}};
constexpr DWORD TurnLimitMs = 1000000;  // longer than a suite may take
constexpr auto StopLimit = std::chrono::seconds(60);
constexpr auto StartLimit = std::chrono::seconds(90);
constexpr char InstancePrefix[] = "ROOT\\ZENTARATEST\\";
constexpr std::size_t PathPrefixLength = 4;  // of "\\?\"

bool IsStopped(SC_HANDLE service) {
    SERVICE_STATUS status{};
    return !QueryServiceStatus(service, &status) || status.dwCurrentState == SERVICE_STOPPED;
}

void StopService(SC_HANDLE service) {
    SERVICE_STATUS status{};
    ControlService(service, SERVICE_CONTROL_STOP, &status);
    EXPECT_TRUE(WaitUntil([&] { return IsStopped(service); }, StopLimit))
        << "the driver does not stop";
}

void StopAndDelete(SC_HANDLE service) {
    if (service == nullptr) return;
    StopService(service);
    DeleteService(service);
    CloseServiceHandle(service);
}

HANDLE OpenControl() {
    return CreateFileA(ROAD_CONTROL_PATH, GENERIC_READ | GENERIC_WRITE,
                       FILE_SHARE_READ | FILE_SHARE_WRITE, nullptr, OPEN_EXISTING, 0, nullptr);
}

SC_HANDLE InstallService(SC_HANDLE manager) {
    const std::string image = GetProgramFolder() + "\\zentara-test.sys";
    return CreateServiceA(manager, ROAD_SERVICE_NAME, ROAD_SERVICE_NAME, SERVICE_ALL_ACCESS,
                          SERVICE_KERNEL_DRIVER, SERVICE_DEMAND_START, SERVICE_ERROR_NORMAL,
                          image.c_str(), nullptr, nullptr, nullptr, nullptr, nullptr);
}

/// On a busy machine the system gives up the start of a driver's host, which goes on all the same.
bool Start(SC_HANDLE service) {
    return WaitUntil(
        [&] {
            return StartServiceA(service, 0, nullptr) ||
                   GetLastError() == ERROR_SERVICE_ALREADY_RUNNING;
        },
        StartLimit);
}

/// A driver whose start was given up makes its control device a while later.
HANDLE WaitForControl() {
    HANDLE control = INVALID_HANDLE_VALUE;
    const bool isThere = WaitUntil(
        [&] {
            control = OpenControl();
            return control != INVALID_HANDLE_VALUE;
        },
        StartLimit);
    EXPECT_TRUE(isThere) << "the driver has no control device: " << GetLastError();
    return control;
}

/// The device's interface, with its path.
std::string CreateInterface(HDEVINFO set, SP_DEVINFO_DATA* device) {
    SP_DEVICE_INTERFACE_DATA data{};
    data.cbSize = sizeof data;
    if (!SetupDiCreateDeviceInterfaceA(set, device, &InterfaceClass, nullptr, 0, &data)) return "";
    alignas(SP_DEVICE_INTERFACE_DETAIL_DATA_A) char buffer[1024]{};
    auto* const detail = reinterpret_cast<SP_DEVICE_INTERFACE_DETAIL_DATA_A*>(buffer);
    detail->cbSize = sizeof *detail;
    if (!SetupDiGetDeviceInterfaceDetailA(set, &data, detail, sizeof buffer, nullptr, nullptr)) {
        return "";
    }
    return detail->DevicePath;
}

std::string RegisterDevice(HDEVINFO set, std::uint32_t index) {
    char instance[64];
    std::snprintf(instance, sizeof instance, "Root\\ZentaraTest\\%04u", index);
    SP_DEVINFO_DATA device{};
    device.cbSize = sizeof device;
    // One that an earlier run has left serves as well.
    if (!SetupDiCreateDeviceInfoA(set, instance, &SystemClass, nullptr, nullptr, 0, &device) &&
        !SetupDiOpenDeviceInfoA(set, instance, nullptr, 0, &device)) {
        return "";
    }
    SetupDiRegisterDeviceInfo(set, &device, 0, nullptr, nullptr, nullptr);
    return CreateInterface(set, &device);
}

bool IsOfTests(HDEVINFO set, SP_DEVINFO_DATA* device) {
    char instance[MAX_PATH] = "";
    return SetupDiGetDeviceInstanceIdA(set, device, instance, sizeof instance, nullptr) &&
           _strnicmp(instance, InstancePrefix, sizeof InstancePrefix - 1) == 0;
}

}  // namespace

void RemoveLeftDevices() {
    // With their interfaces, which go with them.
    HDEVINFO set = SetupDiGetClassDevsA(&InterfaceClass, nullptr, nullptr, DIGCF_DEVICEINTERFACE);
    SP_DEVINFO_DATA device{};
    device.cbSize = sizeof device;
    for (DWORD i = 0; SetupDiEnumDeviceInfo(set, i, &device); ++i) {
        if (IsOfTests(set, &device)) SetupDiRemoveDevice(set, &device);
    }
    SetupDiDestroyDeviceInfoList(set);
}

std::string GetProgramFolder() {
    char path[MAX_PATH] = "";
    GetModuleFileNameA(nullptr, path, MAX_PATH);
    const std::string text = path;
    return text.substr(0, text.find_last_of('\\'));
}

TestDriver::TestDriver()
    : turn(TestDriverTurn, TurnLimitMs),
      manager(OpenSCManagerA(nullptr, nullptr, SC_MANAGER_ALL_ACCESS)) {
    if (!turn.IsOurs()) {
        ADD_FAILURE() << "another suite keeps the driver";
        return;
    }
    StopAndDelete(OpenServiceA(manager, ROAD_SERVICE_NAME, SERVICE_ALL_ACCESS));
    service = InstallService(manager);
    if (service == nullptr || !Start(service)) {
        ADD_FAILURE() << "the driver does not start: " << GetLastError();
        return;
    }
    control = WaitForControl();
}

TestDriver::~TestDriver() {
    if (control != INVALID_HANDLE_VALUE) CloseHandle(control);
    StopAndDelete(service);
    CloseServiceHandle(manager);
}

void TestDriver::Stop() {
    if (control != INVALID_HANDLE_VALUE) CloseHandle(std::exchange(control, INVALID_HANDLE_VALUE));
    StopService(service);
}

bool TestDriver::IsRunning() const {
    RoadState state{};
    return Control(ROAD_STATE, nullptr, 0, &state, sizeof state);
}

bool TestDriver::Control(DWORD code, const void* input, DWORD inputBytes, void* output,
                         DWORD outputBytes) const {
    DWORD unused = 0;
    return DeviceIoControl(control, code, const_cast<void*>(input), inputBytes, output, outputBytes,
                           &unused, nullptr) != FALSE;
}

bool TestDriver::Plug(std::uint32_t index, const std::string& path) {
    RoadDevice device{};
    device.index = index;
    if (path.size() <= PathPrefixLength || path.size() - PathPrefixLength >= sizeof device.link) {
        return false;
    }
    std::memcpy(device.link, path.c_str() + PathPrefixLength, path.size() - PathPrefixLength);
    return Control(ROAD_PLUG, &device, sizeof device, nullptr, 0);
}

bool TestDriver::Unplug(std::uint32_t index) {
    RoadDevice device{};
    device.index = index;
    return Control(ROAD_UNPLUG, &device, sizeof device, nullptr, 0);
}

bool TestDriver::PrepareAnswer(const RoadPrepared& prepared) {
    return Control(ROAD_PREPARE, &prepared, sizeof prepared, nullptr, 0);
}

RoadState TestDriver::GetState() const {
    RoadState state{};
    EXPECT_TRUE(Control(ROAD_STATE, nullptr, 0, &state, sizeof state));
    return state;
}

DeviceInterface::DeviceInterface(std::uint32_t index)
    : set(SetupDiCreateDeviceInfoList(nullptr, nullptr)), path(RegisterDevice(set, index)) {
    if (!path.empty() && !SetLinked()) path.clear();
}

DeviceInterface::~DeviceInterface() {
    SP_DEVINFO_DATA device{};
    device.cbSize = sizeof device;
    if (SetupDiEnumDeviceInfo(set, 0, &device)) SetupDiRemoveDevice(set, &device);
    SetupDiDestroyDeviceInfoList(set);
}

/// A listing takes an interface for present while its driver has enabled it, which the system keeps
/// here.
bool DeviceInterface::SetLinked() {
    const std::string name =
        std::string(InterfaceKey) + "\\##?#" + path.substr(PathPrefixLength) + "\\#\\Control";
    HKEY key = nullptr;
    if (RegCreateKeyExA(HKEY_LOCAL_MACHINE, name.c_str(), 0, nullptr, REG_OPTION_VOLATILE,
                        KEY_SET_VALUE, nullptr, &key, nullptr) != ERROR_SUCCESS) {
        return false;
    }
    const DWORD linked = 1;
    const LSTATUS status = RegSetValueExA(key, "Linked", 0, REG_DWORD,
                                          reinterpret_cast<const BYTE*>(&linked), sizeof linked);
    RegCloseKey(key);
    return status == ERROR_SUCCESS;
}

}  // namespace ZV::Test
