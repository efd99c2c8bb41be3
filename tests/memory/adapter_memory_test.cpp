#include <gtest/gtest.h>

#include <atomic>
#include <cstdint>

#include "hal/adapter_camera.h"
#include "hal/driver_selection.h"
#include "hal/hal.h"
#include "hal/open_camera_table.h"
#include "hal/platform/shared_memory.h"
#include "hal/table_lock.h"
#include "memory/failing_allocator.h"
#include "support/stored_settings.h"
#include "support/wait_until.h"

namespace ZV::Test {
namespace {

constexpr std::int64_t AdapterAllocationsMax = 1000;  ///< Far above what any run takes.
constexpr std::size_t BlockBytes = 504;

/// Counts how often a packet is asked for; there is none.
std::uint32_t CountAsking(void* reference, std::uint8_t*, std::uint32_t) {
    ++*static_cast<std::atomic<int>*>(reference);
    return 0;
}

/// One life of a camera of the second kind, from its making to its release.
struct AdapterLife {
    HALStatus connected = HALOk, started = HALOk;
    bool hasContext = false, wasRecorded = false;
    std::atomic<int> asked{0};

    void Run() {
        SetAdapterPacketSource({CountAsking, &asked});
        HALCamera camera = MakeAdapterCamera(0, 1);
        hasContext = camera.context != nullptr;
        connected =
            HAL_CameraConnect(&camera, 100, nullptr, nullptr, nullptr, nullptr, nullptr, nullptr);
        if (connected == HALOk) {
            started = HAL_CameraStartStreaming(&camera, 0, 1, nullptr);
            wasRecorded = HasEntry();
        }
        if (connected == HALOk && started == HALOk) {
            EXPECT_TRUE(WaitUntil([this] { return asked != 0; }));
            EXPECT_EQ(HALOk, HAL_CameraStopStreaming(&camera, 0));
        }
        EXPECT_EQ(HALOk, HAL_CameraDisconnect(&camera));
        EXPECT_EQ(HALOk, HAL_CameraRelease(&camera));
        SetAdapterPacketSource({});
    }
    static bool HasEntry() {
        const UncountedAllocations uncounted;
        return OpenCameraTable().Contains(MakeOpenCameraEntry(0, 1));
    }
};

TEST(AdapterMemory, EachFailureOfASecondKindCamerasLifeGivesACodeAndTheNextLifeIsWhole) {
    const TableLock lock;
    const StoredSettings settings("MaxPacketsPerRequest = 4\n");
    bool hasRefused = true;
    std::int64_t failing = 1;
    for (; hasRefused && failing < AdapterAllocationsMax && !HasFailure(); ++failing) {
        SCOPED_TRACE(failing);
        const std::size_t mappings = CountLiveMappings();
        AdapterLife life;
        BeginAllocations(failing);
        life.Run();
        hasRefused = EndAllocations();

        EXPECT_EQ(life.hasContext ? HALOk : HALDeviceNotOpen, life.connected);
        EXPECT_TRUE(life.started == HALOk || life.started == HALThreadNotStarted);
        EXPECT_EQ(mappings, CountLiveMappings());
        EXPECT_FALSE(AdapterLife::HasEntry());
        if (!hasRefused) {
            EXPECT_EQ(HALOk, life.started);
            EXPECT_TRUE(life.wasRecorded);
        }
    }
    EXPECT_FALSE(hasRefused);
    PrintRefusals();
    EXPECT_GT(failing, 15) << "a ring of ten, a context, a table, a thread";
    SetLastCameraFlag(false);
}

TEST(AdapterMemory, ACameraWithoutItsMutexOrItsEventDoesNotStart) {
    const TableLock lock;
    // The context and its gate come before its mutex, of two parts, and its event.
    for (std::int64_t failing = 3; failing <= 5; ++failing) {
        SCOPED_TRACE(failing);
        BeginAllocations(failing);
        HALCamera camera = MakeAdapterCamera(0, 1);
        ASSERT_TRUE(EndAllocations());
        ASSERT_NE(nullptr, camera.context);
        ASSERT_EQ(HALOk, HAL_CameraConnect(&camera, 100, nullptr, nullptr, nullptr, nullptr,
                                           nullptr, nullptr));

        EXPECT_EQ(HALThreadNotStarted, HAL_CameraStartStreaming(&camera, 0, 1, nullptr));

        EXPECT_EQ(HALOk, HAL_CameraRelease(&camera));
    }
    SetLastCameraFlag(false);
    PrintRefusals();
}

TEST(AdapterMemory, SharedMemoryThatCannotBeMadeIsNoneAndLeavesNothing) {
    constexpr const char* Name = "zentara-memory-test";
    bool hasRefused = true;
    std::int64_t failing = 1;
    for (; hasRefused && failing < AdapterAllocationsMax && !HasFailure(); ++failing) {
        SCOPED_TRACE(failing);
        const std::size_t mappings = CountLiveMappings();
        BeginAllocations(failing);
        SharedMemory* const memory = OpenSharedMemory(Name, BlockBytes);
        hasRefused = EndAllocations();

        EXPECT_EQ(hasRefused, memory == nullptr);
        EXPECT_EQ(mappings + (hasRefused ? 0 : 1), CountLiveMappings());
        if (memory != nullptr) {
            EXPECT_EQ(0, *static_cast<std::uint8_t*>(GetSharedMemoryAddress(memory)));
        }
        CloseSharedMemory(memory);
        EXPECT_EQ(mappings, CountLiveMappings());
    }
    EXPECT_FALSE(hasRefused);
    PrintRefusals();
    EXPECT_GE(failing, 4) << "the record, the file, its length, the mapping";
}

}  // namespace
}  // namespace ZV::Test
