// The platform seam's devices over a real driver: what the library itself does not ask of them.

#include "hal/platform/device.h"

#include <windows.h>

#include <cstdint>
#include <cstring>
#include <vector>

#include "hal/control_records.h"
#include "hal/platform/device_discovery.h"
#include "hal/platform/last_error.h"
#include "hal/platform/thread.h"
#include "hal/platform/wait_outcome.h"
#include "hal/platform/win32/handle_wait.h"
#include "support/test_thread.h"
#include "support/wait_until.h"
#include "windows/road/road.h"

namespace ZV::Test {
namespace {

constexpr std::uint32_t IdentityAddress = 0xE0010038;
constexpr std::uint32_t DirectoryAddress = 0xD0000000;
constexpr std::uint64_t ShortMs = 20;
constexpr std::uint64_t LongMs = 60000;

class SeamDevice : public Road {
  protected:
    void SetUp() override {
        Road::SetUp();
        if (HasFatalFailure()) return;
        device = OpenDevice(GetPath().c_str());
        ASSERT_NE(nullptr, device);
        overlapped = MakeOverlapped();
        record.getGeneration = 1;
        record.destinationNode = AsyncDestinationNode;
        record.offsetHigh = AsyncOffsetHigh;
        record.offsetLow = IdentityAddress;
        record.bytes = sizeof data;
    }
    void TearDown() override {
        CloseDevice(device);
        DestroyOverlapped(overlapped);
    }

    ControlOutcome SendRead() {
        const ControlRequest request{FW_IOCTL_ASYNC_READ, &record, sizeof record, &data,
                                     sizeof data};
        return ControlDeviceOverlapped(device, request, overlapped);
    }
    void MakeReadsHang() {
        ASSERT_TRUE(
            AddFault(R"({"kind": "neverComplete", "code": "FW_IOCTL_ASYNC_READ", "count": 0})"));
    }

    PlatformDevice* device = nullptr;
    PlatformOverlapped* overlapped = nullptr;
    AsyncReadRecord record{};
    std::uint32_t data = 0;
};

TEST_F(SeamDevice, IsARealOne) {
    EXPECT_TRUE(IsRealDevice(device));
}

TEST_F(SeamDevice, APendedRequestIsWaitedFor) {
    ASSERT_EQ(ControlOutcome::Pending, SendRead());

    EXPECT_EQ(CompletionOutcome::Completed, WaitForCompletion(device, overlapped, LongMs));
    EXPECT_EQ(Peek(IdentityAddress), __builtin_bswap32(data));
    EXPECT_FALSE(IsOverlappedPending(overlapped));
    EXPECT_EQ(CompletionOutcome::Completed, WaitForCompletion(device, overlapped, LongMs))
        << "a wait without a new request";
}

TEST_F(SeamDevice, ManyRequestsOfOneRecordEachEndWithTheirOwnAnswer) {
    constexpr int Rounds = 500;
    const std::uint32_t addresses[] = {IdentityAddress, DirectoryAddress};
    const std::uint32_t values[] = {Peek(IdentityAddress), Peek(DirectoryAddress)};
    ASSERT_NE(values[0], values[1]);

    for (int i = 0; i < Rounds; ++i) {
        record.offsetLow = addresses[i % 2];
        data = 0xA5A5A5A5;
        ASSERT_EQ(ControlOutcome::Pending, SendRead()) << i;
        ASSERT_EQ(CompletionOutcome::Completed, WaitForCompletion(device, overlapped, LongMs)) << i;
        ASSERT_EQ(values[i % 2], __builtin_bswap32(data)) << i;
    }
}

TEST_F(SeamDevice, ARecordIsInUseUntilTheEndOfItsRequestHasBeenWaitedFor) {
    ASSERT_EQ(ControlOutcome::Pending, SendRead());
    ASSERT_TRUE(WaitUntil([&] { return !IsOverlappedPending(overlapped); }));

    EXPECT_EQ(ControlOutcome::Failed, SendRead());
    EXPECT_EQ(PlatformErrorBusy, GetLastPlatformError());
    ClearOverlapped(overlapped);

    EXPECT_EQ(CompletionOutcome::Completed, WaitForCompletion(device, overlapped, LongMs));
    EXPECT_EQ(ControlOutcome::Pending, SendRead());
    EXPECT_EQ(CompletionOutcome::Completed, WaitForCompletion(device, overlapped, LongMs));
}

TEST_F(SeamDevice, AThreadThatIsToEndGetsItsWaitBackAndTheRequestStaysUnderWay) {
    MakeReadsHang();
    ASSERT_EQ(ControlOutcome::Pending, SendRead());
    CompletionOutcome outcome = CompletionOutcome::Failed;
    const TestThread waiter([&] { outcome = WaitForCompletion(device, overlapped, WaitForEver); });

    EXPECT_TRUE(EndThread(waiter.Get()));

    EXPECT_EQ(CompletionOutcome::Ended, outcome);
    EXPECT_TRUE(IsOverlappedPending(overlapped));
    CancelOverlapped(device, overlapped);
    EXPECT_EQ(CompletionOutcome::Failed, WaitForCompletion(device, overlapped, LongMs));
}

TEST_F(SeamDevice, TheEndOfAThreadWinsOverARequestThatIsDone) {
    ASSERT_EQ(ControlOutcome::Pending, SendRead());
    ASSERT_TRUE(WaitUntil([&] { return !IsOverlappedPending(overlapped); }));
    CompletionOutcome outcome = CompletionOutcome::Failed;
    const TestThread waiter([&] {
        WaitForSingleObject(GetOwnEndEvent(), INFINITE);
        outcome = WaitForCompletion(device, overlapped, WaitForEver);
    });

    EXPECT_TRUE(EndThread(waiter.Get()));

    EXPECT_EQ(CompletionOutcome::Ended, outcome);
    EXPECT_EQ(CompletionOutcome::Completed, WaitForCompletion(device, overlapped, LongMs))
        << "by another thread";
}

TEST_F(SeamDevice, ASynchronousRequestThatTheDriverKeepsIsTakenBackFromIt) {
    ASSERT_TRUE(AddFault(R"({"kind": "neverComplete", "code": "FW_IOCTL_STREAM_LEAVE"})"));
    std::uint32_t word = 0;
    std::uint32_t error = 0;
    bool hasReturned = false;
    const TestThread caller([&] {
        const ControlRequest request{FW_IOCTL_STREAM_LEAVE, &word, sizeof word, &word, sizeof word};
        EXPECT_FALSE(ControlDevice(device, request, nullptr));
        error = GetLastPlatformError();
        hasReturned = true;
    });
    EXPECT_TRUE(WaitUntil([&] { return GetDriver().GetState().pended == 1; }));

    EXPECT_TRUE(EndThread(caller.Get()));

    EXPECT_TRUE(hasReturned);
    EXPECT_EQ(PlatformErrorOperationAborted, error);
    EXPECT_TRUE(WaitUntil([&] { return GetState().pendedRequests == 0; }));
}

TEST_F(SeamDevice, ASynchronousRequestThatFailsCarriesTheDriversNumber) {
    RoadPrepared prepared{0, FW_IOCTL_QUERY_BUSY, PlatformErrorBusy, 0, {}};
    ASSERT_TRUE(GetDriver().PrepareAnswer(prepared));
    std::uint32_t answer = 0;
    const ControlRequest request{FW_IOCTL_QUERY_BUSY, &answer, sizeof answer, &answer,
                                 sizeof answer};

    EXPECT_FALSE(ControlDevice(device, request, nullptr));
    EXPECT_EQ(PlatformErrorBusy, GetLastPlatformError());

    EXPECT_TRUE(ControlDevice(device, request, nullptr));
}

TEST_F(SeamDevice, ARequestThatIsAnsweredAtOnceIsDone) {
    RoadPrepared prepared{0, FW_IOCTL_ASYNC_READ, 0, sizeof data, {1, 2, 3, 4}};
    ASSERT_TRUE(GetDriver().PrepareAnswer(prepared));

    EXPECT_EQ(ControlOutcome::Done, SendRead());

    EXPECT_EQ(0x04030201u, data);
    EXPECT_EQ(CompletionOutcome::Completed, WaitForCompletion(device, overlapped, LongMs));
}

TEST_F(SeamDevice, AFailureAtOnceAndALaterOneCarryTheDriversNumber) {
    RoadPrepared prepared{0, FW_IOCTL_ASYNC_READ, PlatformErrorBusy, 0, {}};
    ASSERT_TRUE(GetDriver().PrepareAnswer(prepared));
    EXPECT_EQ(ControlOutcome::Failed, SendRead());
    EXPECT_EQ(PlatformErrorBusy, GetLastPlatformError());

    ASSERT_TRUE(
        AddFault(R"({"kind": "failRequest", "code": "FW_IOCTL_ASYNC_READ", "error": 121})"));
    ASSERT_EQ(ControlOutcome::Pending, SendRead());
    EXPECT_EQ(CompletionOutcome::Failed, WaitForCompletion(device, overlapped, LongMs));
    EXPECT_EQ(121u, GetLastPlatformError());
}

TEST_F(SeamDevice, AWaitRunsOutAndTheRequestStaysUnderWayUntilItIsCancelled) {
    MakeReadsHang();
    ASSERT_EQ(ControlOutcome::Pending, SendRead());

    EXPECT_EQ(CompletionOutcome::TimedOut, WaitForCompletion(device, overlapped, ShortMs));
    EXPECT_TRUE(IsOverlappedPending(overlapped));
    EXPECT_EQ(ControlOutcome::Failed, SendRead()) << "its record is in use";
    EXPECT_EQ(PlatformErrorBusy, GetLastPlatformError());

    CancelOverlapped(device, overlapped);
    EXPECT_EQ(CompletionOutcome::Failed, WaitForCompletion(device, overlapped, LongMs));
    EXPECT_EQ(PlatformErrorOperationAborted, GetLastPlatformError());
    EXPECT_FALSE(IsOverlappedPending(overlapped));
}

TEST_F(SeamDevice, TheRecordOfARequestUnderWayIsNotTakenFromUnderTheDriver) {
    MakeReadsHang();
    ASSERT_EQ(ControlOutcome::Pending, SendRead());

    DestroyOverlapped(overlapped);

    EXPECT_TRUE(IsOverlappedPending(overlapped));
    CancelOverlapped(device, overlapped);
    EXPECT_EQ(CompletionOutcome::Failed, WaitForCompletion(device, overlapped, LongMs));
}

TEST_F(SeamDevice, ASynchronousRequestIsWaitedForAndTellsItsLength) {
    std::uint32_t answer = 0xFFFFFFFF;
    std::uint32_t bytes = 0;
    const ControlRequest request{FW_IOCTL_QUERY_BUSY, &answer, sizeof answer, &answer,
                                 sizeof answer};

    EXPECT_TRUE(ControlDevice(device, request, &bytes));

    EXPECT_NE(DeviceIsBusy, answer);
    EXPECT_EQ(sizeof answer, bytes);
}

TEST_F(SeamDevice, ASecondOpenFindsTheDeviceBusy) {
    PlatformDevice* const second = OpenDevice(GetPath().c_str());
    ASSERT_NE(nullptr, second);
    std::uint32_t answer = 0;
    const ControlRequest request{FW_IOCTL_QUERY_BUSY, &answer, sizeof answer, &answer,
                                 sizeof answer};

    EXPECT_TRUE(ControlDevice(second, request, nullptr));

    EXPECT_EQ(DeviceIsBusy, answer);
    CloseDevice(second);
}

TEST_F(SeamDevice, APathWithoutADeviceDoesNotOpen) {
    EXPECT_EQ(nullptr, OpenDevice((GetPath() + "x").c_str()));
    EXPECT_EQ(PlatformErrorFileNotFound, GetLastPlatformError());
}

TEST_F(SeamDevice, AListingTellsTheSizeOfAPathAndThenThePath) {
    DeviceInterfaceList* const list = OpenDeviceInterfaceList();
    ASSERT_NE(nullptr, list);
    const auto expected = static_cast<std::uint32_t>(DeviceDetailPathOffset + GetPath().size() + 1);
    std::uint32_t required = 0;

    ASSERT_TRUE(SelectDeviceInterface(list, 0));
    EXPECT_FALSE(GetDeviceInterfaceDetail(list, nullptr, 0, &required));
    EXPECT_EQ(PlatformErrorInsufficientBuffer, GetLastPlatformError());
    ASSERT_GE(required, expected);
    std::vector<char> detail(required);
    const std::uint32_t recordBytes = 8;
    std::memcpy(detail.data(), &recordBytes, sizeof recordBytes);
    EXPECT_TRUE(GetDeviceInterfaceDetail(list, detail.data(), required, nullptr));
    EXPECT_EQ(GetPath(), detail.data() + DeviceDetailPathOffset);

    EXPECT_FALSE(SelectDeviceInterface(list, 1));
    EXPECT_EQ(PlatformErrorNoMoreItems, GetLastPlatformError());
    CloseDeviceInterfaceList(list);
}

}  // namespace
}  // namespace ZV::Test
