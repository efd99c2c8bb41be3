#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "hal/driver_selection.h"
#include "hal/platform/win32/maintenance_functions.h"
#include "support/temporary_folder.h"
#include "windows/maintenance/installed_device.h"
#include "windows/support/debugger_texts.h"

namespace ZV::Test {
namespace {

using testing::ElementsAre;

constexpr DWORD SomeError = 1234;

/// A device without a driver, an installation file that fits it, and what is printed.
class InstallationOfADriver : public testing::Test {
  protected:
    void Install(const char* infPath) {
        EXPECT_EQ(InstallDriverOnDevice(device.GetInstanceId(), infPath), 0u);
    }
    void InstallForOS(const char* infPath) {
        EXPECT_EQ(InstallDriverOnDeviceForOS(device.GetInstanceId(), infPath), 0u);
    }
    /// The three ways, over `functions`.
    void InstallBySelection() { Run(false, false); }
    void InstallAsOnXP() { Run(true, false); }
    void InstallAsOnVista() { Run(true, true); }

    TemporaryFolder folder;
    InstalledDevice device;
    std::string inf = folder.WriteFile("camera.inf", MakeInf("root\\zentara-test"));
    MaintenanceFunctions functions = GetMaintenanceFunctions();
    DebuggerTexts texts;

  private:
    void Run(bool bySystemVersion, bool isVistaExactly) {
        InstallDriver(functions, device.GetInstanceId(), inf.c_str(), bySystemVersion,
                      isVistaExactly);
    }
};

// ---- Over the system's own functions ----

TEST_F(InstallationOfADriver, PrintsItsEndAloneWhenAllGoesWell) {
    Install(inf.c_str());

    EXPECT_THAT(texts.Take(), ElementsAre("clean0"));
}

TEST_F(InstallationOfADriver, ByTheSystemsVersionPrintsTheOlderSystemsNameOnALaterOne) {
    ASSERT_FALSE(IsVistaExactly());

    InstallForOS(inf.c_str());

    EXPECT_THAT(texts.Take(), ElementsAre("UnInstall on XP", "clean0"));
}

TEST_F(InstallationOfADriver, EndsAtADeviceThatIsNotThereWithoutAWordOfIt) {
    EXPECT_EQ(InstallDriverOnDevice("ROOT\\ZENTARANONE\\0000", inf.c_str()), 0u);
    EXPECT_EQ(InstallDriverOnDeviceForOS("ROOT\\ZENTARANONE\\0000", inf.c_str()), 0u);

    EXPECT_THAT(texts.Take(), ElementsAre("clean0", "clean0"));
}

TEST_F(InstallationOfADriver, TakesANullTextForAStepThatFails) {
    EXPECT_EQ(InstallDriverOnDevice(nullptr, inf.c_str()), 0u);
    EXPECT_THAT(texts.Take(), ElementsAre("clean0"));

    Install(nullptr);
    EXPECT_THAT(texts.Take(), ElementsAre("StringCchCopy  was NOT succesfull 87", "clean0"));
}

TEST_F(InstallationOfADriver, StopsAtAPathOf260CharactersAndGoesOnWithOneOf259) {
    const std::string fitting(259, 'a');
    const std::string tooLong(260, 'a');
    const std::string muchTooLong(100000, 'a');

    Install(tooLong.c_str());
    EXPECT_THAT(texts.Take(), ElementsAre("StringCchCopy  was NOT succesfull 87", "clean0"));
    InstallForOS(muchTooLong.c_str());
    EXPECT_THAT(texts.Take(), ElementsAre("StringCchCopy  was NOT succesfull 87", "clean0"));
    Install(fitting.c_str());
    EXPECT_THAT(texts.Take(),
                ElementsAre(testing::Not(testing::HasSubstr("StringCchCopy")), "clean0"));
}

TEST_F(InstallationOfADriver, PrintsTheClassInstallersErrorWhenNoDriverFits) {
    const std::string other = folder.WriteFile("other.inf", MakeInf("root\\zentara-other"));
    const std::string failure = "SetupDiCallClassInstaller  was NOT succesfull " +
                                std::to_string(static_cast<int>(ERROR_NO_COMPAT_DRIVERS));

    Install(other.c_str());
    InstallForOS(other.c_str());

    EXPECT_THAT(texts.Take(), ElementsAre(failure, "clean0", failure, "clean0"));
}

TEST_F(InstallationOfADriver, SelectsTheDriverOfTheGivenFile) {
    static std::string description;
    functions.getSelectedDriver = [](HDEVINFO set, PSP_DEVINFO_DATA data,
                                     PSP_DRVINFO_DATA_A driver) {
        EXPECT_EQ(driver->cbSize, 800u);
        const BOOL isDone = SetupDiGetSelectedDriverA(set, data, driver);
        description = driver->Description;
        return isDone;
    };

    InstallBySelection();

    EXPECT_EQ(description, "Test camera");
    EXPECT_THAT(texts.Take(), ElementsAre("clean0"));
}

// ---- With a step that fails ----

BOOL Fail() {
    SetLastError(SomeError);
    return FALSE;
}

TEST_F(InstallationOfADriver, EndsWithoutAWordWhenThereIsNoDeviceSet) {
    functions.createDeviceInfoList = [](const GUID*, HWND) -> HDEVINFO {
        Fail();
        return INVALID_HANDLE_VALUE;
    };
    functions.destroyDeviceInfoList = [](HDEVINFO) -> BOOL {
        ADD_FAILURE() << "there is no set";
        return FALSE;
    };

    InstallBySelection();

    EXPECT_THAT(texts.Take(), ElementsAre("clean0"));
}

TEST_F(InstallationOfADriver, EndsWithoutAWordWhenTheDeviceCannotBeSelected) {
    functions.setSelectedDevice = [](HDEVINFO, PSP_DEVINFO_DATA) { return Fail(); };

    InstallBySelection();

    EXPECT_THAT(texts.Take(), ElementsAre("clean0"));
}

TEST_F(InstallationOfADriver, EndsWithoutAWordWhenTheParametersCannotBeRead) {
    functions.getDeviceInstallParams = [](HDEVINFO, PSP_DEVINFO_DATA,
                                          PSP_DEVINSTALL_PARAMS_A) -> BOOL { return Fail(); };

    InstallBySelection();

    EXPECT_THAT(texts.Take(), ElementsAre("clean0"));
}

TEST_F(InstallationOfADriver, PrintsTheErrorOfParametersThatCannotBeWritten) {
    functions.setDeviceInstallParams = [](HDEVINFO, PSP_DEVINFO_DATA,
                                          PSP_DEVINSTALL_PARAMS_A) -> BOOL { return Fail(); };

    InstallAsOnVista();

    EXPECT_THAT(texts.Take(),
                ElementsAre("SetupDiSetDeviceInstallParams  was NOT succesfull 1234", "clean0"));
}

TEST_F(InstallationOfADriver, PrintsTheErrorOfADriverListThatCannotBeBuilt) {
    functions.buildDriverInfoList = [](HDEVINFO, PSP_DEVINFO_DATA, DWORD) { return Fail(); };

    InstallBySelection();

    EXPECT_THAT(texts.Take(),
                ElementsAre("SetupDiBuildDriverInfoList  was NOT succesfull 1234", "clean0"));
}

TEST_F(InstallationOfADriver, PrintsTheErrorOfTheClassInstaller) {
    functions.callClassInstaller = [](DI_FUNCTION, HDEVINFO, PSP_DEVINFO_DATA) { return Fail(); };

    InstallAsOnXP();

    EXPECT_THAT(texts.Take(),
                ElementsAre("SetupDiCallClassInstaller  was NOT succesfull 1234", "clean0"));
}

TEST_F(InstallationOfADriver, PrintsTheErrorOfASelectedDriverThatCannotBeRead) {
    functions.getSelectedDriver = [](HDEVINFO, PSP_DEVINFO_DATA, PSP_DRVINFO_DATA_A) -> BOOL {
        return Fail();
    };

    InstallBySelection();

    EXPECT_THAT(texts.Take(),
                ElementsAre("SetupDiGetSelectedDriver  was NOT succesfull 1234", "clean0"));
}

// ---- What the steps are given ----

TEST_F(InstallationOfADriver, WritesItsFlagsAndPathBesideWhatTheParametersHeld) {
    static SP_DEVINSTALL_PARAMS_A written;
    functions.getDeviceInstallParams = [](HDEVINFO set, PSP_DEVINFO_DATA data,
                                          PSP_DEVINSTALL_PARAMS_A parameters) -> BOOL {
        EXPECT_EQ(parameters->cbSize, 320u);
        const BOOL isDone = SetupDiGetDeviceInstallParamsA(set, data, parameters);
        parameters->Flags |= 0x1;
        parameters->FlagsEx |= 0x2;
        return isDone;
    };
    functions.setDeviceInstallParams = [](HDEVINFO, PSP_DEVINFO_DATA,
                                          PSP_DEVINSTALL_PARAMS_A parameters) -> BOOL {
        written = *parameters;
        return Fail();
    };

    InstallBySelection();

    EXPECT_EQ(written.cbSize, 320u);
    EXPECT_EQ(written.Flags & 0x1810001u, 0x1810001u);
    EXPECT_EQ(written.FlagsEx & 0x802u, 0x802u);
    EXPECT_EQ(written.DriverPath, inf);
}

TEST_F(InstallationOfADriver, AsksForCompatibleDriversAndForTheBestOfThem) {
    functions.buildDriverInfoList = [](HDEVINFO set, PSP_DEVINFO_DATA data, DWORD type) {
        EXPECT_EQ(type, 2u);
        return SetupDiBuildDriverInfoList(set, data, type);
    };
    functions.callClassInstaller = [](DI_FUNCTION function, HDEVINFO set, PSP_DEVINFO_DATA data) {
        EXPECT_EQ(function, 23u);
        return SetupDiCallClassInstaller(function, set, data);
    };

    InstallBySelection();

    EXPECT_THAT(texts.Take(), ElementsAre("clean0"));
}

// ---- The installer's library ----

std::string loadedPath;
DWORD loadFlags;
int freeCount;

TEST_F(InstallationOfADriver, LoadsTheInstallerFromTheSystemFolderByItsFullPathAndFreesIt) {
    freeCount = 0;
    functions.loadLibrary = [](const char* path, HANDLE file, DWORD flags) {
        loadedPath = path;
        loadFlags = flags;
        return LoadLibraryExA(path, file, flags);
    };
    functions.freeLibrary = [](HMODULE library) -> BOOL {
        ++freeCount;
        return FreeLibrary(library);
    };
    char systemFolder[MAX_PATH];
    ASSERT_NE(GetSystemDirectoryA(systemFolder, sizeof systemFolder), 0u);

    InstallBySelection();

    EXPECT_EQ(loadedPath, std::string(systemFolder) + "\\NEWDEV.DLL");
    EXPECT_EQ(loadFlags, DWORD{LOAD_WITH_ALTERED_SEARCH_PATH});
    EXPECT_EQ(freeCount, 1);
}

TEST_F(InstallationOfADriver, LoadsNothingWhereTheSystemFolderIsUnknown) {
    functions.loadLibrary = [](const char* path, HANDLE, DWORD) -> HMODULE {
        ADD_FAILURE() << path;
        return nullptr;
    };

    functions.getSystemDirectory = [](char*, UINT) { return UINT{0}; };
    InstallBySelection();
    functions.getSystemDirectory = [](char*, UINT size) { return size; };
    InstallBySelection();

    EXPECT_THAT(texts.Take(), ElementsAre("clean0", "clean0"));
}

HMODULE LoadNothing(const char*, HANDLE, DWORD) {
    return nullptr;
}

FARPROC FindNothing(HMODULE, const char*) {
    return nullptr;
}

TEST_F(InstallationOfADriver, TakesALibraryThatCannotBeLoadedForMissingFunctions) {
    functions.loadLibrary = LoadNothing;

    InstallBySelection();
    EXPECT_THAT(texts.Take(), ElementsAre("clean0"));
    InstallAsOnXP();
    EXPECT_THAT(texts.Take(), ElementsAre("UnInstall on XP", "clean0"));
    InstallAsOnVista();
    EXPECT_THAT(texts.Take(),
                ElementsAre("DiInstallDevice function did not load properly", "clean0"));
}

TEST_F(InstallationOfADriver, SaysSoOfTheNewerFunctionAloneWhenItIsMissing) {
    functions.getProcAddress = FindNothing;

    InstallBySelection();
    EXPECT_THAT(texts.Take(), ElementsAre("clean0"));
    InstallAsOnXP();
    EXPECT_THAT(texts.Take(), ElementsAre("UnInstall on XP", "clean0"));
    InstallAsOnVista();
    EXPECT_THAT(texts.Take(),
                ElementsAre("DiInstallDevice function did not load properly", "clean0"));
}

template <typename Function>
FARPROC AsSymbol(Function function) {
    return reinterpret_cast<FARPROC>(reinterpret_cast<void*>(function));
}

int selectedCount;

BOOL WINAPI RecordSelected(HWND window, HDEVINFO set, LPCWSTR reserved, BOOL backup,
                           DWORD* needsReboot) {
    ++selectedCount;
    EXPECT_EQ(window, nullptr);
    EXPECT_NE(set, INVALID_HANDLE_VALUE);
    EXPECT_EQ(reserved, nullptr);
    EXPECT_EQ(backup, TRUE);
    EXPECT_NE(needsReboot, nullptr);
    return Fail();
}

TEST_F(InstallationOfADriver, CallsTheOlderFunctionAndDropsItsResult) {
    selectedCount = 0;
    functions.getProcAddress = [](HMODULE, const char* name) {
        EXPECT_STREQ(name, "InstallSelectedDriver");
        return AsSymbol(RecordSelected);
    };

    InstallBySelection();
    EXPECT_THAT(texts.Take(), ElementsAre("clean0"));
    InstallAsOnXP();
    EXPECT_THAT(texts.Take(), ElementsAre("UnInstall on XP", "clean0"));

    EXPECT_EQ(selectedCount, 2);
}

DWORD deviceInstallError;
DEVINST installedNode;

BOOL WINAPI RecordDeviceInstall(HWND window, HDEVINFO set, SP_DEVINFO_DATA* device,
                                SP_DRVINFO_DATA_A* driver, DWORD flags, BOOL* needsReboot) {
    EXPECT_EQ(window, nullptr);
    EXPECT_NE(set, INVALID_HANDLE_VALUE);
    installedNode = device->DevInst;
    EXPECT_EQ(driver, nullptr);
    EXPECT_EQ(flags, 2u);
    EXPECT_NE(needsReboot, nullptr);
    SetLastError(deviceInstallError);
    return deviceInstallError == 0;
}

TEST_F(InstallationOfADriver, CallsTheNewerFunctionAndWordsItsResult) {
    constexpr struct {
        DWORD error;
        const char* text;
    } Rows[] = {
        {0, "pInstallDevice  was succesfull"},
        {5, "ERROR_ACCESS_DENIED"},
        {1004, "ERROR_INVALID_FLAGS"},
        {1234, "pInstallDevice  was NOT succesfull 1234"},
        {0xE0000234, "pInstallDevice  was NOT succesfull -536870348"},
    };
    functions.getProcAddress = [](HMODULE, const char* name) {
        EXPECT_STREQ(name, "DiInstallDevice");
        return AsSymbol(RecordDeviceInstall);
    };

    for (const auto& row : Rows) {
        deviceInstallError = row.error;
        installedNode = 0;
        InstallAsOnVista();

        EXPECT_THAT(texts.Take(), ElementsAre("UnInstall on Vista", row.text, "clean0"));
        EXPECT_NE(installedNode, 0u);
    }
}

// ---- What is held ----

int setCount;
int libraryCount;
int failingStep;
int stepNumber;

/// Whether the step at which this stands is the one that is to fail.
bool IsStepToFail() {
    return ++stepNumber == failingStep;
}

MaintenanceFunctions CountWhatIsHeld(MaintenanceFunctions functions) {
    functions.createDeviceInfoList = [](const GUID* classId, HWND window) -> HDEVINFO {
        if (IsStepToFail()) return INVALID_HANDLE_VALUE;
        ++setCount;
        return SetupDiCreateDeviceInfoList(classId, window);
    };
    functions.openDeviceInfo = [](HDEVINFO set, PCSTR id, HWND window, DWORD flags,
                                  PSP_DEVINFO_DATA data) -> BOOL {
        return IsStepToFail() ? Fail() : SetupDiOpenDeviceInfoA(set, id, window, flags, data);
    };
    functions.setSelectedDevice = [](HDEVINFO set, PSP_DEVINFO_DATA data) {
        return IsStepToFail() ? Fail() : SetupDiSetSelectedDevice(set, data);
    };
    functions.getDeviceInstallParams = [](HDEVINFO set, PSP_DEVINFO_DATA data,
                                          PSP_DEVINSTALL_PARAMS_A parameters) -> BOOL {
        return IsStepToFail() ? Fail() : SetupDiGetDeviceInstallParamsA(set, data, parameters);
    };
    functions.setDeviceInstallParams = [](HDEVINFO set, PSP_DEVINFO_DATA data,
                                          PSP_DEVINSTALL_PARAMS_A parameters) -> BOOL {
        return IsStepToFail() ? Fail() : SetupDiSetDeviceInstallParamsA(set, data, parameters);
    };
    functions.buildDriverInfoList = [](HDEVINFO set, PSP_DEVINFO_DATA data, DWORD type) {
        return IsStepToFail() ? Fail() : SetupDiBuildDriverInfoList(set, data, type);
    };
    functions.callClassInstaller = [](DI_FUNCTION function, HDEVINFO set, PSP_DEVINFO_DATA data) {
        return IsStepToFail() ? Fail() : SetupDiCallClassInstaller(function, set, data);
    };
    functions.getSelectedDriver = [](HDEVINFO set, PSP_DEVINFO_DATA data,
                                     PSP_DRVINFO_DATA_A driver) -> BOOL {
        return IsStepToFail() ? Fail() : SetupDiGetSelectedDriverA(set, data, driver);
    };
    functions.loadLibrary = [](const char* path, HANDLE file, DWORD flags) -> HMODULE {
        if (IsStepToFail()) return nullptr;
        ++libraryCount;
        return LoadLibraryExA(path, file, flags);
    };
    functions.getProcAddress = [](HMODULE library, const char* name) -> FARPROC {
        return IsStepToFail() ? nullptr : GetProcAddress(library, name);
    };
    functions.freeLibrary = [](HMODULE library) -> BOOL {
        --libraryCount;
        return FreeLibrary(library);
    };
    functions.destroyDeviceInfoList = [](HDEVINFO set) -> BOOL {
        --setCount;
        return SetupDiDestroyDeviceInfoList(set);
    };
    return functions;
}

TEST_F(InstallationOfADriver, LetsGoOfAllItHoldsWhicheverStepFails) {
    constexpr int StepCount = 10;
    functions = CountWhatIsHeld(functions);
    setCount = libraryCount = 0;

    for (failingStep = 1; failingStep <= StepCount + 1; ++failingStep) {
        stepNumber = 0;
        InstallBySelection();

        EXPECT_EQ(setCount, 0) << "step " << failingStep;
        EXPECT_EQ(libraryCount, 0) << "step " << failingStep;
        EXPECT_EQ(texts.Take().back(), "clean0") << "step " << failingStep;
    }
    EXPECT_EQ(stepNumber, StepCount);
}

}  // namespace
}  // namespace ZV::Test
