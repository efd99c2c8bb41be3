#include "hal/platform/shared_memory.h"

#include <gtest/gtest.h>
#include <windows.h>

#include <cstdint>
#include <cstring>
#include <memory>
#include <string>

#include "hal/adapter_camera.h"
#include "hal/driver_selection.h"
#include "hal/hal.h"
#include "hal/open_camera_table.h"
#include "windows/support/child_process.h"
#include "windows/support/named_turn.h"

namespace ZV::Test {
namespace {

constexpr std::size_t BlockBytes = 504;

struct CloseMemory {
    void operator()(SharedMemory* memory) const { CloseSharedMemory(memory); }
};
using OwnedMemory = std::unique_ptr<SharedMemory, CloseMemory>;

OwnedMemory Open(const std::string& name, std::size_t bytes = BlockBytes) {
    return OwnedMemory(OpenSharedMemory(name.c_str(), bytes));
}

std::uint8_t* GetBytes(const OwnedMemory& memory) {
    return static_cast<std::uint8_t*>(GetSharedMemoryAddress(memory.get()));
}

/// A name that no other process takes.
std::string MakeName() {
    static int count = 0;
    return "zentara-test-" + std::to_string(GetCurrentProcessId()) + "-" + std::to_string(++count);
}

// ---- A block of a name ----

TEST(NamedMemory, IsZeroedWhenItIsNewAndGoneWithItsLastHolder) {
    const std::string name = MakeName();
    {
        const OwnedMemory first = Open(name);
        ASSERT_NE(first, nullptr);
        for (std::size_t i = 0; i < BlockBytes; ++i) ASSERT_EQ(GetBytes(first)[i], 0) << i;
        GetBytes(first)[503] = 7;
        const OwnedMemory second = Open(name);
        EXPECT_EQ(GetBytes(second)[503], 7);
    }

    EXPECT_EQ(GetBytes(Open(name))[503], 0);
}

TEST(NamedMemory, IsRefusedWithTheSystemsErrorUnderANameThatIsNone) {
    SetLastError(ERROR_SUCCESS);

    EXPECT_EQ(Open("folder\\that\\is\\none"), nullptr);

    EXPECT_NE(GetLastError(), DWORD{ERROR_SUCCESS});
}

TEST(NamedMemory, IsRefusedWhereTheNameStandsForSomethingElse) {
    const std::string name = MakeName();
    HANDLE event = CreateEventA(nullptr, FALSE, FALSE, name.c_str());

    EXPECT_EQ(Open(name), nullptr);
    EXPECT_EQ(GetLastError(), DWORD{ERROR_INVALID_HANDLE});

    CloseHandle(event);
}

TEST(NamedMemory, IsRefusedWhereAnotherMadeItTooSmall) {
    const std::string name = MakeName();
    const OwnedMemory small = Open(name, 16);

    EXPECT_EQ(Open(name, 1 << 20), nullptr);
}

TEST(NamedMemoryOfAChild, DISABLED_ReadsAndWritesTheBlockOfItsParent) {
    const OwnedMemory memory = Open(GetChildWord());
    ASSERT_NE(memory, nullptr);
    EXPECT_EQ(GetBytes(memory)[0], 11);
    GetBytes(memory)[503] = 22;
}

TEST(NamedMemory, IsOneBlockForTwoProcesses) {
    const std::string name = MakeName();
    const OwnedMemory memory = Open(name);
    GetBytes(memory)[0] = 11;

    const ChildProcess child("NamedMemoryOfAChild.*", {.word = name});

    EXPECT_EQ(child.WaitForExitCode(), 0u);
    EXPECT_EQ(GetBytes(memory)[503], 22);
}

// ---- The table of the open cameras ----

/// A call from one process to the other.
class Call {
  public:
    explicit Call(const std::string& name)
        : event(CreateEventA(nullptr, TRUE, FALSE, name.c_str())) {}
    ~Call() { CloseHandle(event); }
    Call(const Call&) = delete;
    Call& operator=(const Call&) = delete;

    void Make() const { SetEvent(event); }
    [[nodiscard]] bool Wait() const { return WaitForSingleObject(event, 30000) == WAIT_OBJECT_0; }

  private:
    HANDLE event;
};

HALStatus Connect(HALCamera* camera) {
    return HAL_CameraConnect(camera, 100, nullptr, nullptr, nullptr, nullptr, nullptr, nullptr);
}

/// Connects a kind 1 record, and holds it until it is told to let go.
TEST(OpenCameraOfAChild, DISABLED_IsHeldUntilTheParentHasSeenIt) {
    const Call held(GetChildWord() + "-held");
    const Call seen(GetChildWord() + "-seen");
    HALCamera camera = MakeAdapterCamera(4, 0xFFC9);
    ASSERT_EQ(Connect(&camera), HALOk);

    held.Make();
    EXPECT_TRUE(seen.Wait());

    EXPECT_EQ(HAL_CameraDisconnect(&camera), HALOk);
    (void)HAL_CameraRelease(&camera);
}

TEST(OpenCameraOfAnotherProcess, IsInTheTableThatBothSeeByItsName) {
    const NamedTurn turn(OpenCameraTableTurn);
    const std::string name = MakeName();
    const Call held(name + "-held");
    const Call seen(name + "-seen");
    ASSERT_FALSE(AnyCameraOpen());

    const ChildProcess child("OpenCameraOfAChild.*", {.word = name});
    ASSERT_TRUE(held.Wait());

    EXPECT_TRUE(AnyCameraOpen());
    {
        const OwnedMemory table = Open("404B602C-4181-4d11-A184-AB30190B8DCD");
        ASSERT_NE(table, nullptr);
        constexpr std::uint8_t Entry[] = {5, 0, 0, 0, 9, 0, 0, 0, 0};
        EXPECT_EQ(std::memcmp(GetBytes(table), Entry, sizeof Entry), 0);
    }
    HALCamera camera = MakeAdapterCamera(4, 0xFFC9);
    EXPECT_EQ(Connect(&camera), HALDeviceInUse);
    SetLastCameraFlag(true);
    EXPECT_FALSE(DriverSwitchDue());
    SetLastCameraFlag(false);
    (void)HAL_CameraRelease(&camera);

    seen.Make();
    EXPECT_EQ(child.WaitForExitCode(), 0u);
    EXPECT_FALSE(AnyCameraOpen());
}

TEST(OpenCameraTableByItsName, IsEmptyAndTakesNothingWhereItCannotBeReached) {
    const NamedTurn turn(OpenCameraTableTurn);
    HANDLE event = CreateEventA(nullptr, FALSE, FALSE, OpenCameraTableName);
    ASSERT_NE(event, nullptr);
    ASSERT_NE(GetLastError(), DWORD{ERROR_INVALID_HANDLE});

    EXPECT_FALSE(AnyCameraOpen());
    OpenCameraTable table;
    EXPECT_FALSE(table.IsReachable());
    EXPECT_FALSE(table.Add(MakeOpenCameraEntry(0, 1)));

    CloseHandle(event);
}

}  // namespace
}  // namespace ZV::Test
