// Single requests on their way to a kernel-mode driver and back: pended, answered at once, failing
// and cancelled; through the bus layer's exported functions, and by the system's own where the
// library offers no such call.

#include <windows.h>

#include <chrono>
#include <cstdint>
#include <cstring>
#include <iostream>
#include <string>
#include <thread>

#include "hal/control_records.h"
#include "hal/hal.h"
#include "support/wait_until.h"
#include "windows/road/road.h"

namespace ZV::Test {
namespace {

constexpr std::uint32_t IdentityAddress = 0xE0010038;
constexpr std::uint32_t ControlAddress = 0xD0002000;
constexpr std::uint32_t StreamSwitchAddress = 0xD0005004;
constexpr std::uint16_t StreamPayloadBytes = 500;
constexpr DWORD WaitLimitMs = 20000;

/// A camera's record, listed and connected by the bus layer.
class RoadRequests : public Road {
  protected:
    void SetUp() override {
        Road::SetUp();
        if (HasFatalFailure()) return;
        ASSERT_EQ(0u, HAL_Open());
        std::uint32_t count = 0;
        ASSERT_EQ(0u, HAL_CameraGetList(&list, IdentityAddress, IdentityAddress, 8, &count));
        ASSERT_EQ(1u, count);
        ASSERT_EQ(0u, Connect(&list[0]));
    }
    void TearDown() override {
        if (list != nullptr) {
            HAL_CameraDisconnect(&list[0]);
            HAL_CameraRelease(&list[0]);
            HAL_MemoryFree(list);
        }
        HAL_Close();
    }

    static HALStatus Connect(HALCamera* camera) {
        return HAL_CameraConnect(camera, 0, nullptr, nullptr, nullptr, nullptr, nullptr, nullptr);
    }
    HALStatus Read(std::uint32_t* value) {
        return HAL_CameraReadData(&list[0], IdentityAddress, value, 1);
    }
    /// Writes the value that is there.
    HALStatus Write() {
        const std::uint32_t value = Peek(ControlAddress);
        return HAL_CameraWriteData(&list[0], ControlAddress, &value, 1);
    }
    void Prepare(std::uint32_t code, std::uint32_t error, std::uint32_t value = 0) {
        RoadPrepared prepared{};
        prepared.code = code;
        prepared.error = error;
        prepared.bytes = sizeof value;
        std::memcpy(prepared.data, &value, sizeof value);
        ASSERT_TRUE(GetDriver().PrepareAnswer(prepared));
    }

    HALCamera* list = nullptr;
};

TEST_F(RoadRequests, AListingReadsTheIdentityOfADevice) {
    EXPECT_EQ(Peek(IdentityAddress), list[0].cameraWord);
    EXPECT_NE(0u, list[0].cameraWord);
}

TEST_F(RoadRequests, APendedReadGivesHostOrder) {
    std::uint32_t value = 0;

    EXPECT_EQ(0u, Read(&value));

    EXPECT_EQ(Peek(IdentityAddress), value);
}

// Kept: the bytes are reversed on the pended path alone.
TEST_F(RoadRequests, KeptAReadThatTheDriverAnswersAtOnceStaysInBusOrder) {
    Prepare(FW_IOCTL_ASYNC_READ, 0, 0x44332211);
    std::uint32_t value = 0;

    EXPECT_EQ(0u, Read(&value));

    EXPECT_EQ(0x44332211u, value);
    EXPECT_EQ(0u, Read(&value)) << "the next one is pended again";
    EXPECT_EQ(Peek(IdentityAddress), value);
}

TEST_F(RoadRequests, AReadOfSeveralQuadletsArrivesWhole) {
    constexpr std::uint32_t Quadlets = 16;
    constexpr std::uint32_t Directory = 0xD0000000;
    std::uint32_t values[Quadlets + 1];
    values[Quadlets] = 0xA5A5A5A5;

    ASSERT_EQ(0u, HAL_CameraReadData(&list[0], Directory, values, Quadlets));

    for (std::uint32_t i = 0; i < Quadlets; ++i) EXPECT_EQ(Peek(Directory + 4 * i), values[i]) << i;
    EXPECT_EQ(0xA5A5A5A5u, values[Quadlets]);
}

TEST_F(RoadRequests, AReadOfNoQuadletsIsAnsweredAndWritesNothing) {
    std::uint32_t value = 0xA5A5A5A5;

    EXPECT_EQ(0u, HAL_CameraReadData(&list[0], IdentityAddress, &value, 0));

    EXPECT_EQ(0xA5A5A5A5u, value);
}

TEST_F(RoadRequests, AReadThatTheDriverFailsIsAFailedRead) {
    std::uint32_t value = 0;
    for (const bool isPended : {false, true}) {
        ASSERT_TRUE(AddFault(std::string(R"({"kind": "failRequest", "code": "FW_IOCTL_ASYNC_READ",
            "error": 31, "pended": )")
                                 .append(isPended ? "true}" : "false}")));
        EXPECT_EQ(HALReadFailed, Read(&value));
    }
    Prepare(FW_IOCTL_ASYNC_READ, ERROR_GEN_FAILURE);
    EXPECT_EQ(HALReadFailed, Read(&value)) << "at once";

    EXPECT_EQ(0u, Read(&value));
}

TEST_F(RoadRequests, AWriteThatFailsAtOnceIsAFailedWrite) {
    Prepare(FW_IOCTL_ASYNC_WRITE, ERROR_GEN_FAILURE);

    EXPECT_EQ(HALWriteFailed, Write());
    EXPECT_EQ(0u, Write());
}

TEST_F(RoadRequests, AWriteThatFailsAfterItWasPendedGivesTheSystemsErrorNumber) {
    ASSERT_TRUE(AddFault(R"({"kind": "failRequest", "code": "FW_IOCTL_ASYNC_WRITE", "error": 121,
        "pended": true})"));

    EXPECT_EQ(121u, Write());
}

struct RefusedRequest {
    std::uint32_t code;
    HALStatus status;
};

TEST_F(RoadRequests, AConnectOfWhichTheDriverFailsARequestTellsWhichOne) {
    constexpr RefusedRequest Refused[] = {{FW_IOCTL_QUERY_BUSY, HALChannelNotFreed},
                                          {FW_IOCTL_ALLOC_BANDWIDTH, HALBandwidthNotAllocated},
                                          {FW_IOCTL_ALLOC_CHANNEL, HALChannelNotAllocated}};
    for (const RefusedRequest& refused : Refused) {
        ASSERT_EQ(0u, HAL_CameraDisconnect(&list[0])) << refused.code;
        Prepare(refused.code, ERROR_GEN_FAILURE);

        EXPECT_EQ(refused.status, Connect(&list[0]));
    }
    EXPECT_EQ(0u, HAL_CameraDisconnect(&list[0]));
    EXPECT_EQ(0u, Connect(&list[0]));
}

TEST_F(RoadRequests, ResourcesThatTheDriverRefusesOnceAreGrantedAtTheLowerSpeedAndTwiceAre28) {
    ASSERT_EQ(0u, HAL_CameraDisconnect(&list[0]));
    Prepare(FW_IOCTL_ALLOC_RESOURCES, ERROR_GEN_FAILURE);
    EXPECT_EQ(0u, Connect(&list[0]));

    ASSERT_EQ(0u, HAL_CameraDisconnect(&list[0]));
    ASSERT_TRUE(AddFault(
        R"({"kind": "failRequest", "code": "FW_IOCTL_ALLOC_RESOURCES", "error": 31, "count": 2})"));
    EXPECT_EQ(HALResourcesNotAllocated, Connect(&list[0]));
}

TEST_F(RoadRequests, ADisconnectOfWhichTheDriverFailsARequestTellsWhichOneAndLeavesTheDeviceOpen) {
    constexpr RefusedRequest Refused[] = {{FW_IOCTL_FREE_RESOURCES, HALResourcesNotFreed},
                                          {FW_IOCTL_FREE_CHANNEL, HALChannelNotFreed},
                                          {FW_IOCTL_FREE_BANDWIDTH, HALBandwidthNotFreed}};
    for (const RefusedRequest& refused : Refused) {
        Prepare(refused.code, ERROR_GEN_FAILURE);

        EXPECT_EQ(refused.status, HAL_CameraDisconnect(&list[0]));

        EXPECT_EQ(1, list[0].connected);
    }
    EXPECT_EQ(0u, HAL_CameraDisconnect(&list[0]));
    EXPECT_EQ(0, list[0].connected);
}

TEST_F(RoadRequests, ASecondOpenIsToldThatTheDeviceIsHeldAndThenThatItIsGone) {
    HALCamera second = list[0];
    std::uint32_t count = 0;
    HALCamera* again = nullptr;

    ASSERT_EQ(0u, HAL_CameraGetList(&again, IdentityAddress, IdentityAddress, 8, &count));
    ASSERT_EQ(1u, count);
    EXPECT_EQ(1, again[0].connected);
    EXPECT_EQ(0u, again[0].cameraWord);
    EXPECT_EQ(HALDeviceInUse, Connect(&again[0]));

    ASSERT_TRUE(GetDriver().Unplug(0));
    EXPECT_EQ(HALDeviceNotOpen, Connect(&again[0]));
    EXPECT_EQ(HALReadFailed, Read(&count));
    EXPECT_EQ(HALWriteFailed, Write());
    HAL_CameraRelease(&again[0]);
    HAL_MemoryFree(again);
    EXPECT_EQ(second.context, list[0].context);
}

TEST_F(RoadRequests, AReadThatIsPendedWhenTheCameraGoesFails) {
    ASSERT_TRUE(AddFault(R"({"kind": "neverComplete", "code": "FW_IOCTL_ASYNC_READ"})"));
    std::uint32_t value = 0;
    HALStatus status = 0;
    std::thread reader([&] { status = Read(&value); });
    EXPECT_TRUE(WaitUntil([&] { return GetDriver().GetState().pended == 1; }));

    EXPECT_EQ("ok", GetHost().Ask("unplug 0"));

    reader.join();
    EXPECT_EQ(HALReadFailed, status);
}

TEST_F(RoadRequests, TheTimeOfARegisterReadIsMeasured) {
    constexpr int Reads = 500;
    const auto start = std::chrono::steady_clock::now();
    std::uint32_t value = 0;
    for (int i = 0; i < Reads; ++i) ASSERT_EQ(0u, Read(&value));
    const std::chrono::duration<double, std::micro> past = std::chrono::steady_clock::now() - start;
    std::cout << "register read: " << past.count() / Reads << " microseconds\n";
}

/// A camera that streams, of whose frames none is taken.
class RoadStream : public RoadRequests {
  protected:
    void SetUp() override {
        RoadRequests::SetUp();
        if (HasFatalFailure()) return;
        ASSERT_EQ(0u, HAL_CameraDisconnect(&list[0]));
        ASSERT_EQ(0u, HAL_CameraConnect(&list[0], StreamPayloadBytes, TakeNone, TakeNone, nullptr,
                                        nullptr, nullptr, nullptr));
    }

    static tStFrameInfo* TakeNone(void*) { return nullptr; }
    HALStatus Start() { return HAL_CameraStartStreaming(&list[0], StreamSwitchAddress, 1, nullptr); }
    HALStatus Stop() { return HAL_CameraStopStreaming(&list[0], StreamSwitchAddress); }
    bool IsNothingPended() {
        return GetState().pendedRequests == 0 && GetDriver().GetState().pended == 0;
    }
};

TEST_F(RoadStream, AListenThatFailsAfterItWasPendedFailsTheStartAndTheStopSucceeds) {
    ASSERT_TRUE(
        AddFault(R"({"kind": "failRequest", "code": "FW_IOCTL_LISTEN", "pended": true})"));

    EXPECT_EQ(HALReadFailed, Start());

    EXPECT_EQ(0u, GetState().isStreaming);
    EXPECT_EQ(0u, Stop());
    EXPECT_TRUE(WaitUntil([&] { return IsNothingPended(); }));
}

TEST_F(RoadStream, ALoopThatMayNotSubmitABufferAgainLeavesAndTheStreamGoesOnUntilItsStop) {
    ASSERT_EQ(0u, Start());
    Prepare(FW_IOCTL_ATTACH_BUFFER, ERROR_GEN_FAILURE);

    EXPECT_TRUE(WaitUntil([&] { return GetState().attachedBuffers == 0; }));

    EXPECT_EQ(1u, GetState().isStreaming);
    EXPECT_EQ(0u, Stop());
    EXPECT_EQ(0u, GetState().isStreaming);
    EXPECT_TRUE(WaitUntil([&] { return IsNothingPended(); }));
}

TEST_F(RoadStream, AStopTakesTheLeaveBackThatTheDriverKeeps) {
    ASSERT_TRUE(AddFault(R"({"kind": "neverComplete", "code": "FW_IOCTL_STREAM_LEAVE"})"));
    ASSERT_EQ(0u, Start());

    EXPECT_EQ(0u, Stop());

    EXPECT_TRUE(WaitUntil([&] { return IsNothingPended(); }));
    EXPECT_EQ(0u, HAL_CameraDisconnect(&list[0]));
    EXPECT_TRUE(WaitUntil([&] { return GetState().openHandles == 0; }));
}

/// A device that is opened by its path, with one request that the camera never answers.
class NeverAnswered : public Road {
  protected:
    void SetUp() override {
        Road::SetUp();
        if (HasFatalFailure()) return;
        ASSERT_TRUE(AddFault(R"({"kind": "neverComplete", "code": "FW_IOCTL_ASYNC_READ"})"));
        device = CreateFileA(GetPath().c_str(), GENERIC_READ | GENERIC_WRITE, 0, nullptr,
                             OPEN_EXISTING, FILE_FLAG_OVERLAPPED, nullptr);
        ASSERT_NE(INVALID_HANDLE_VALUE, device);
        overlapped.hEvent = CreateEventA(nullptr, TRUE, FALSE, nullptr);
        record.offsetLow = IdentityAddress;
        record.bytes = sizeof data;
        ASSERT_FALSE(DeviceIoControl(device, FW_IOCTL_ASYNC_READ, &record, sizeof record, &data,
                                     sizeof data, nullptr, &overlapped));
        ASSERT_EQ(static_cast<DWORD>(ERROR_IO_PENDING), GetLastError());
        ASSERT_TRUE(WaitUntil([&] { return GetState().pendedRequests == 1; }));
    }
    void TearDown() override {
        if (device != INVALID_HANDLE_VALUE) CloseHandle(device);
        if (overlapped.hEvent != nullptr) CloseHandle(overlapped.hEvent);
    }

    DWORD GetOutcome() {
        if (WaitForSingleObject(overlapped.hEvent, WaitLimitMs) != WAIT_OBJECT_0)
            return WAIT_TIMEOUT;
        DWORD bytes = 0;
        return GetOverlappedResult(device, &overlapped, &bytes, FALSE) ? ERROR_SUCCESS
                                                                       : GetLastError();
    }

    HANDLE device = INVALID_HANDLE_VALUE;
    OVERLAPPED overlapped{};
    AsyncReadRecord record{};
    std::uint32_t data = 0;
};

TEST_F(NeverAnswered, ItsCancellationEndsItThroughoutTheRoad) {
    const std::uint32_t before = GetDriver().GetState().cancelled;

    ASSERT_TRUE(CancelIoEx(device, &overlapped));

    EXPECT_EQ(static_cast<DWORD>(ERROR_OPERATION_ABORTED), GetOutcome());
    EXPECT_EQ(before + 1, GetDriver().GetState().cancelled);
    EXPECT_EQ(0u, GetDriver().GetState().pended);
    EXPECT_TRUE(WaitUntil([&] { return GetState().pendedRequests == 0; }));
}

TEST_F(NeverAnswered, TheCloseOfItsFileEndsItThroughoutTheRoad) {
    CloseHandle(device);
    device = INVALID_HANDLE_VALUE;

    EXPECT_EQ(static_cast<DWORD>(WAIT_OBJECT_0),
              WaitForSingleObject(overlapped.hEvent, WaitLimitMs));
    EXPECT_EQ(0u, GetDriver().GetState().pended);
    EXPECT_TRUE(WaitUntil([&] { return GetState().pendedRequests == 0; }));
    EXPECT_TRUE(WaitUntil([&] { return GetState().openHandles == 0; }));
}

TEST_F(NeverAnswered, TheRemovalOfTheDeviceEndsIt) {
    ASSERT_TRUE(GetDriver().Unplug(0));

    EXPECT_EQ(static_cast<DWORD>(ERROR_DEVICE_NOT_CONNECTED), GetOutcome());
}

TEST_F(NeverAnswered, TheDeathOfTheHelperEndsIt) {
    KillHost();

    EXPECT_EQ(static_cast<DWORD>(ERROR_DEVICE_NOT_CONNECTED), GetOutcome());
}

TEST_F(NeverAnswered, TheUnloadOfTheDriverEndsIt) {
    GetDriver().Stop();

    EXPECT_EQ(static_cast<DWORD>(ERROR_DEVICE_NOT_CONNECTED), GetOutcome());
    EXPECT_FALSE(GetDriver().IsRunning());
}

}  // namespace
}  // namespace ZV::Test
