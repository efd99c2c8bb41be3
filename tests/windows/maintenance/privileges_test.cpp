#include <gtest/gtest.h>
#include <windows.h>

#include <shlobj.h>

#include <algorithm>
#include <cstdlib>
#include <string>
#include <vector>

#include "hal/driver_selection.h"
#include "hal/hal.h"
#include "hal/platform/win32/maintenance_functions.h"
#include "support/temporary_folder.h"
#include "windows/maintenance/installed_device.h"
#include "windows/support/child_process.h"
#include "windows/support/debugger_texts.h"

namespace ZV::Test {
namespace {

std::string ReadMachineText(const char* key, const char* name) {
    char text[MAX_PATH] = "";
    DWORD bytes = sizeof text;
    (void)RegGetValueA(HKEY_LOCAL_MACHINE, key, name, RRF_RT_ANY, nullptr, text, &bytes);
    return text;
}

// ---- Folders ----

TEST(CommonProgramFiles, AreWhereTheRegistryAndTheEnvironmentHaveThem) {
    char path[260] = "";

    GetCommonProgramFilesFolder(path);

    EXPECT_EQ(path,
              ReadMachineText("SOFTWARE\\Microsoft\\Windows\\CurrentVersion", "CommonFilesDir"));
    EXPECT_STREQ(path, std::getenv("CommonProgramFiles"));
}

TEST(CommonProgramFiles, HoldTheInstallationFiles) {
    const std::string folder = std::getenv("CommonProgramFiles");
    const struct {
        char* path;
        const char* tail;
    } rows[] = {
        {GetInfPath(), "\\Morvane\\inf\\1394.inf"},
        {GetUBInfPath(), "\\Morvane\\inf\\ub1394.inf"},
        {GetUBHelperPath(), "\\Morvane\\UBHelper.exe"},
    };

    for (const auto& row : rows) {
        ASSERT_NE(row.path, nullptr);
        EXPECT_EQ(row.path, folder + row.tail);
        EXPECT_EQ(HAL_MemoryFree(row.path), HALOk);
    }
}

// ---- Privileges ----

/// Whether the token of this process says so of its kind, which is another value than the one that
/// the library asks for.
bool IsElevatedByKind() {
    HANDLE token = nullptr;
    EXPECT_TRUE(OpenProcessToken(GetCurrentProcess(), TOKEN_QUERY, &token));
    TOKEN_ELEVATION_TYPE kind{};
    DWORD bytes = 0;
    EXPECT_TRUE(GetTokenInformation(token, TokenElevationType, &kind, sizeof kind, &bytes));
    CloseHandle(token);
    return kind == TokenElevationTypeFull || (kind == TokenElevationTypeDefault && IsUserAnAdmin());
}

class PrivilegesOfTheProcess : public testing::Test {
  protected:
    MaintenanceFunctions functions = GetMaintenanceFunctions();
};

TEST_F(PrivilegesOfTheProcess, AreThoseOfAnAdministratorWhereTheShellSaysSo) {
    EXPECT_EQ(IsAdministrator(), IsUserAnAdmin() != FALSE);
}

TEST_F(PrivilegesOfTheProcess, AreElevatedAsTheTokensKindSays) {
    bool isElevated = !IsElevatedByKind();

    EXPECT_EQ(IsNotElevated(&isElevated), !IsElevatedByKind());
    EXPECT_EQ(isElevated, IsElevatedByKind());
    EXPECT_EQ(IsNotElevated(nullptr), !IsElevatedByKind());
}

TEST_F(PrivilegesOfTheProcess, AreNotAnAdministratorsWhenTheGroupCannotBeNamed) {
    functions.makeSid = [](PSID_IDENTIFIER_AUTHORITY, BYTE, DWORD, DWORD, DWORD, DWORD, DWORD,
                           DWORD, DWORD, DWORD, PSID*) -> BOOL { return FALSE; };

    EXPECT_FALSE(IsProcessAdministrator(functions));
}

TEST_F(PrivilegesOfTheProcess, AreAnAdministratorsByTheMembershipInTheBuiltInGroup) {
    functions.checkMembership = [](HANDLE token, PSID group, PBOOL isMember) -> BOOL {
        EXPECT_EQ(token, nullptr);
        EXPECT_TRUE(IsWellKnownSid(group, WinBuiltinAdministratorsSid));
        *isMember = TRUE;
        return TRUE;
    };
    EXPECT_TRUE(IsProcessAdministrator(functions));

    functions.checkMembership = [](HANDLE, PSID, PBOOL isMember) -> BOOL {
        *isMember = FALSE;
        return TRUE;
    };
    EXPECT_FALSE(IsProcessAdministrator(functions));

    functions.checkMembership = [](HANDLE, PSID, PBOOL isMember) -> BOOL {
        *isMember = TRUE;
        return FALSE;
    };
    EXPECT_FALSE(IsProcessAdministrator(functions));
}

TEST_F(PrivilegesOfTheProcess, AreUnknownWithoutItsToken) {
    bool isElevated = true;
    functions.openProcessToken = [](HANDLE, DWORD access, PHANDLE) -> BOOL {
        EXPECT_EQ(access, DWORD{TOKEN_QUERY});
        return FALSE;
    };

    EXPECT_FALSE(QueryProcessElevation(functions, &isElevated));

    EXPECT_TRUE(isElevated);
}

TEST_F(PrivilegesOfTheProcess, AreUnknownWhereTheTokenDoesNotTellAndTheTokenIsClosed) {
    static HANDLE asked;
    bool isElevated = true;
    functions.getTokenInformation = [](HANDLE token, TOKEN_INFORMATION_CLASS kind, void*, DWORD,
                                       PDWORD) -> BOOL {
        EXPECT_EQ(kind, TokenElevation);
        asked = token;
        return FALSE;
    };

    EXPECT_FALSE(QueryProcessElevation(functions, &isElevated));

    EXPECT_TRUE(isElevated);
    DWORD flags = 0;
    EXPECT_FALSE(GetHandleInformation(asked, &flags));
}

// ---- Version ----

class VersionOfTheSystem : public testing::Test {
  protected:
    MaintenanceFunctions functions = GetMaintenanceFunctions();
    SystemVersion version{7, 7, 7};
};

TEST_F(VersionOfTheSystem, IsThatOfTheNTFamilyWhichTheSystemGivesInOneWordToo) {
    const DWORD word = GetVersion();

    ASSERT_TRUE(QuerySystemVersion(&version));

    EXPECT_EQ(version.platform, 2u);
    EXPECT_EQ(version.major, word & 0xFFu);
    EXPECT_EQ(version.minor, (word >> 8) & 0xFFu);
}

TEST_F(VersionOfTheSystem, IsReadFromTheBasicRecordWhereTheExtendedOneIsUnknown) {
    functions.getVersion = [](OSVERSIONINFOA* record) -> BOOL {
        if (record->dwOSVersionInfoSize == 156) return FALSE;
        EXPECT_EQ(record->dwOSVersionInfoSize, 148u);
        record->dwPlatformId = 2;
        record->dwMajorVersion = 6;
        record->dwMinorVersion = 0;
        return TRUE;
    };

    ASSERT_TRUE(QuerySystemVersion(functions, &version));

    EXPECT_TRUE(IsVistaExactly(version));
}

TEST_F(VersionOfTheSystem, IsUnknownWhereBothRecordsAre) {
    functions.getVersion = [](OSVERSIONINFOA*) -> BOOL { return FALSE; };

    EXPECT_FALSE(QuerySystemVersion(functions, &version));

    EXPECT_EQ(version.major, 7u);
}

int ordinaryCount;
int nativeCount;

void WINAPI CountNative(SYSTEM_INFO*) {
    ++nativeCount;
}

TEST_F(VersionOfTheSystem, KeptReadsTheNativeSystemInformationWhereThereIsSuchAFunction) {
    ordinaryCount = nativeCount = 0;
    functions.getSystemInfo = [](SYSTEM_INFO*) { ++ordinaryCount; };
    functions.getProcAddress = [](HMODULE library, const char* name) {
        EXPECT_EQ(library, GetModuleHandleA("kernel32.dll"));
        EXPECT_STREQ(name, "GetNativeSystemInfo");
        return reinterpret_cast<FARPROC>(reinterpret_cast<void*>(CountNative));
    };

    EXPECT_TRUE(QuerySystemVersion(functions, &version));
    EXPECT_EQ(nativeCount, 1);
    EXPECT_EQ(ordinaryCount, 0);

    functions.getProcAddress = [](HMODULE, const char*) -> FARPROC { return nullptr; };
    EXPECT_TRUE(QuerySystemVersion(functions, &version));
    EXPECT_EQ(nativeCount, 1);
    EXPECT_EQ(ordinaryCount, 1);
}

// ---- Version of another system ----

constexpr UINT VistaExitCode = 60;
constexpr UINT OtherExitCode = 61;
constexpr UINT NeitherExitCode = 62;

TEST(VersionOfAChild, DISABLED_TellsByItsExitCode) {
    ExitProcess(IsVistaExactly() ? VistaExitCode : OtherExitCode);
}

/// Which way an installation went, by what it has printed.
UINT GetExitCodeOf(const std::vector<std::string>& texts) {
    const auto isPrinted = [&](const char* text) {
        return std::find(texts.begin(), texts.end(), text) != texts.end();
    };
    if (isPrinted("UnInstall on XP")) return OtherExitCode;
    const bool isNewer = isPrinted("UnInstall on Vista") ||
                         isPrinted("DiInstallDevice function did not load properly");
    return isNewer ? VistaExitCode : NeitherExitCode;
}

const DebuggerTexts* textsOfTheChild;

/// Of the newer function Wine has the name alone: the call of it would end the process.
LONG CALLBACK EndAtAMissingFunction(EXCEPTION_POINTERS* pointers) {
    constexpr DWORD CallOfAMissingFunction = 0x80000100;
    if (pointers->ExceptionRecord->ExceptionCode != CallOfAMissingFunction) {
        return EXCEPTION_CONTINUE_SEARCH;
    }
    ExitProcess(GetExitCodeOf(textsOfTheChild->Take()));
}

/// Its word is the device and the installation file, with a bar between.
TEST(InstallationOfAChild, DISABLED_TellsItsWayByItsExitCode) {
    const std::string word = GetChildWord();
    const std::size_t bar = word.find('|');
    ASSERT_NE(bar, std::string::npos);
    const DebuggerTexts texts;
    textsOfTheChild = &texts;
    ASSERT_NE(AddVectoredExceptionHandler(/*First=*/1, EndAtAMissingFunction), nullptr);

    EXPECT_EQ(InstallDriverOnDeviceForOS(word.substr(0, bar).c_str(), word.substr(bar + 1).c_str()),
              0u);

    ExitProcess(GetExitCodeOf(texts.Take()));
}

/// A copy of this program under a name of its own, for which Wine plays another system.
class ProgramOnAnotherSystem {
  public:
    explicit ProgramOnAnotherSystem(const char* system) {
        EXPECT_TRUE(CopyFileA(GetOwnPath().c_str(), GetPath().c_str(), FALSE));
        EXPECT_EQ(RegSetKeyValueA(HKEY_CURRENT_USER, Key, "Version", REG_SZ, system,
                                  static_cast<DWORD>(std::string(system).size() + 1)),
                  ERROR_SUCCESS);
    }
    ~ProgramOnAnotherSystem() {
        RegDeleteTreeA(HKEY_CURRENT_USER, Key);
        DeleteFileA(GetPath().c_str());
    }
    ProgramOnAnotherSystem(const ProgramOnAnotherSystem&) = delete;
    ProgramOnAnotherSystem& operator=(const ProgramOnAnotherSystem&) = delete;

    [[nodiscard]] static UINT Run(const std::string& test, const std::string& word = {}) {
        const ChildProcess child(test, {.program = GetPath(), .word = word});
        return child.WaitForExitCode();
    }

  private:
    static constexpr char Key[] = "Software\\Wine\\AppDefaults\\zentara-other-system.exe";

    /// Beside this program, where its libraries are.
    static std::string GetPath() {
        const std::string own = GetOwnPath();
        return own.substr(0, own.rfind('\\') + 1) + "zentara-other-system.exe";
    }
};

constexpr struct {
    const char* name;
    UINT exitCode;
} Systems[] = {
    {"winxp64", OtherExitCode}, {"vista", VistaExitCode}, {"win2008", VistaExitCode},
    {"win7", OtherExitCode},    {"win10", OtherExitCode},
};

class VersionOfAnotherSystem : public testing::Test {
  protected:
    void SetUp() override {
        if (GetProcAddress(GetModuleHandleA("ntdll.dll"), "wine_get_version") == nullptr) {
            GTEST_SKIP() << "this system plays no other one";
        }
    }
};

TEST_F(VersionOfAnotherSystem, IsVistaForSixPointZeroAloneAndNotForALaterOne) {
    for (const auto& system : Systems) {
        const ProgramOnAnotherSystem program(system.name);

        EXPECT_EQ(ProgramOnAnotherSystem::Run("VersionOfAChild.*"), system.exitCode) << system.name;
    }
}

TEST_F(VersionOfAnotherSystem, KeptInstallsAsOnXPOnALaterSystemThanVista) {
    const TemporaryFolder folder;
    const InstalledDevice device;
    const std::string inf = folder.WriteFile("camera.inf", MakeInf("root\\zentara-test"));
    const std::string word = device.GetInstanceId() + ("|" + inf);

    for (const auto& system : Systems) {
        const ProgramOnAnotherSystem program(system.name);

        EXPECT_EQ(ProgramOnAnotherSystem::Run("InstallationOfAChild.*", word), system.exitCode)
            << system.name;
    }
}

}  // namespace
}  // namespace ZV::Test
