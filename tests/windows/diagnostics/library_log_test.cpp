#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <windows.h>

#include <cstdint>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <string>
#include <vector>

#include "hal/driver_selection.h"
#include "support/log_text.h"
#include "support/temporary_folder.h"
#include "windows/diagnostics/debugger_listener.h"
#include "windows/diagnostics/machine_switches.h"
#include "windows/support/child_process.h"
#include "windows/support/named_turn.h"

// The log from end to end: switches in the machine's part of the registry, a client in a process of
// its own that loads the library, a listener to the debugger output or a file at the end.

namespace ZV::Test {
namespace {

// ---- The client ----

template <typename Function>
Function Find(HMODULE library, const char* name) {
    const FARPROC symbol = GetProcAddress(library, name);
    EXPECT_NE(symbol, nullptr) << name;
    return reinterpret_cast<Function>(reinterpret_cast<void*>(symbol));
}

TEST(ClientOfTheLibrary, DISABLED_LoadsAsksAndReleases) {
    const std::string own = GetOwnPath();
    const std::string path = own.substr(0, own.rfind('\\') + 1) + "zentara.dll";
    const HMODULE library = LoadLibraryA(path.c_str());
    ASSERT_NE(library, nullptr) << path << " " << GetLastError();
    const auto load = Find<std::uint32_t (*)()>(library, "Zentara_LoadDriver");
    const auto release = Find<std::uint32_t (*)()>(library, "Zentara_ReleaseDriver");
    const auto askVersion =
        Find<std::uint32_t (*)(std::uint16_t*, std::uint16_t*)>(library, "Zentara_Version");
    const auto askLibrary = Find<std::uint32_t (*)(std::uint16_t*, std::uint16_t*, std::uint16_t*)>(
        library, "Zentara_LibVersion");
    std::uint16_t major = 0, minor = 0, build = 0;

    EXPECT_EQ(load(), 0u);
    EXPECT_EQ(askLibrary(&major, &minor, &build), 0u);
    EXPECT_EQ(askVersion(&major, nullptr), 2u);
    (void)release();
}

constexpr char Records[] =
    "<time> Zentara_LoadDriver start|\n"
    "<time> Zentara_LoadDriver end (error code 0)\\n\\n|\n"
    "<time> Zentara_LibVersion start|\n"
    "<time> Zentara_LibVersion - Zentara version is 2 .0 .8 |\n"
    "<time> Zentara_LibVersion end (error code 0)\\n\\n|\n"
    "<time> Zentara_Version start|\n"
    "<time> Zentara_Version ending because one of the parameters used is not valid. (error 2)"
    "\\n\\n|\n"
    "<time> Zentara_ReleaseDriver start|\n"
    "<time> Zentara_ReleaseDriver end (error code 0)\\n\\n|\n";

const std::string ClosingBlock = "\\n" + std::string(48, '-') + "\\n\\n|\n";

class LogOfTheLibrary : public testing::Test {
  protected:
    /// Runs the client; returns what it sent to the debugger output.
    std::vector<std::string> RunClient() {
        const ChildProcess client("ClientOfTheLibrary.*", {});
        EXPECT_EQ(client.WaitForExitCode(), 0u);
        return listener.GetTextsOf(client.GetId());
    }

    static std::string ReadFile(const std::filesystem::path& path) {
        std::ifstream file(path, std::ios::binary);
        return {std::istreambuf_iterator<char>(file), {}};
    }

    TemporaryFolder folder;
    MachineSwitches switches;
    DebuggerListener listener;
};

TEST_F(LogOfTheLibrary, IsSilentWithoutSwitches) {
    EXPECT_THAT(RunClient(), testing::IsEmpty());
}

TEST_F(LogOfTheLibrary, GoesToTheDebuggerOutputRecordByRecord) {
    switches.SetNumber("outputEnabled", 1);

    std::string bytes;
    for (const std::string& text : RunClient()) bytes += text + '\0';

    EXPECT_EQ(DescribeLog(bytes), Records);
}

TEST_F(LogOfTheLibrary, GoesToTheFileOfAPathInTheAnsiCodePage) {
    const std::filesystem::path wide = folder.GetFolder() / L"B\u00FCcher und mehr.txt";
    switches.SetNumber("outputEnabled", 1);
    switches.SetNumber("outputToFile", 7);
    switches.SetWideText(L"outputFilePath", wide.native());

    EXPECT_THAT(RunClient(), testing::IsEmpty());
    EXPECT_EQ(DescribeLog(ReadFile(wide)), Records + ClosingBlock);

    EXPECT_THAT(RunClient(), testing::IsEmpty());
    EXPECT_EQ(DescribeLog(ReadFile(wide)), Records + ClosingBlock + Records + ClosingBlock);
}

TEST_F(LogOfTheLibrary, MakesNoFileWhileItIsOff) {
    switches.SetNumber("outputToFile", 1);
    switches.SetText("outputFilePath", folder.GetPath("log.txt"));

    EXPECT_THAT(RunClient(), testing::IsEmpty());

    EXPECT_THAT(folder.ListFiles(), testing::IsEmpty());
}

TEST_F(LogOfTheLibrary, TellsOfAPathThatCannotBeOpenedOnceAndLosesItsRecords) {
    switches.SetNumber("outputEnabled", 1);
    switches.SetNumber("outputToFile", 1);
    switches.SetText("outputFilePath", "C:\\no such folder\\log.txt");

    EXPECT_THAT(RunClient(),
                testing::ElementsAre("ZLog() - cannot output to file.  The file path C:\\no such "
                                     "folder\\log.txt is invalid or not accessable"));
}

TEST_F(LogOfTheLibrary, TakesAPathOfThousandAndTwentyThreeBytesAtMost) {
    const std::string path(3000, 'p');
    switches.SetNumber("outputEnabled", 1);
    switches.SetNumber("outputToFile", 1);
    switches.SetText("outputFilePath", path);

    EXPECT_THAT(RunClient(),
                testing::ElementsAre("ZLog() - cannot output to file.  The file path " +
                                     path.substr(0, 1023) + " is invalid or not accessable"));
}

// ---- The driver's mode ----

TEST(DriverMode, OfTheMachineDecidesWhetherASwitchIsDueUnlessItIsMissing) {
    const NamedTurn turn(OpenCameraTableTurn);
    const MachineSwitches switches;
    ASSERT_FALSE(AnyCameraOpen());
    SetLastCameraFlag(true);

    EXPECT_TRUE(DriverSwitchDue());
    switches.SetText("outputFilePath", "");
    EXPECT_TRUE(DriverSwitchDue());
    switches.SetNumber("FireWireDriverMode", 1);
    EXPECT_FALSE(DriverSwitchDue());
    for (const DWORD mode : {0u, 2u, 0xFFFFFFFFu}) {
        switches.SetNumber("FireWireDriverMode", mode);
        EXPECT_TRUE(DriverSwitchDue()) << mode;
    }

    SetLastCameraFlag(false);
}

}  // namespace
}  // namespace ZV::Test
