#include "hal/platform/driver_device.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <atomic>
#include <cstring>
#include <memory>
#include <mutex>
#include <string>
#include <vector>

#include "hal/platform/clock.h"
#include "hal/platform/device_discovery.h"
#include "hal/platform/last_error.h"
#include "support/test_thread.h"

namespace ZV {
namespace {

using Test::TestThread;
using Test::WaitUntil;

constexpr std::uint32_t CodeAnswer = 1;  ///< Answers at once with a copy of the input.
constexpr std::uint32_t CodeFail = 2;    ///< Fails at once with 31.
constexpr std::uint32_t CodePend = 3;    ///< Pends until the test ends it.
constexpr std::uint32_t CodeEndBeforePend =
    4;  ///< Ends the request, then answers that it is pended.

/// A driver of two device interfaces that keeps what it pends for the test to end.
class FakeDriver {
  public:
    FakeDriver() { current = this; }
    ~FakeDriver() { current = nullptr; }

    std::size_t CountPended() {
        const std::lock_guard guard(mutex);
        return pended.size();
    }

    void EndFirst(std::uint32_t error, std::uint32_t bytes) {
        End(TakePended(nullptr), error, bytes);
    }

    static const KernelDriver Table;

    std::atomic<int> openHandles{0};
    std::atomic<int> openLists{0};
    std::atomic<std::uint32_t> listError{0};
    std::atomic<int> overlappedRequests{0};

  private:
    static void End(KernelRequest* request, std::uint32_t error, std::uint32_t bytes) {
        if (request != nullptr) request->complete(request, error, bytes);
    }

    /// The request `wanted`, or the first for null; null when it is not there.
    KernelRequest* TakePended(KernelRequest* wanted) {
        const std::lock_guard guard(mutex);
        const auto found =
            wanted == nullptr ? pended.begin() : std::find(pended.begin(), pended.end(), wanted);
        if (found == pended.end()) return nullptr;
        KernelRequest* request = *found;
        pended.erase(found);
        return request;
    }

    std::uint32_t Control(KernelRequest* request, std::uint32_t* bytes) {
        if (request->isOverlapped != 0) ++overlappedRequests;
        if (request->code == CodeFail) return PlatformErrorGeneralFailure;
        if (request->code == CodePend) {
            const std::lock_guard guard(mutex);
            pended.push_back(request);
            return PlatformErrorIoPending;
        }
        const std::uint32_t count = std::min(request->inputBytes, request->outputBytes);
        if (count > 0) std::memcpy(request->output, request->input, count);
        if (request->code == CodeEndBeforePend) {
            request->complete(request, PlatformErrorNone, count);
            return PlatformErrorIoPending;
        }
        *bytes = count;
        return PlatformErrorNone;
    }

    static std::uint32_t OpenList(void** list) {
        if (current->listError != 0) return current->listError;
        ++current->openLists;
        *list = current;
        return PlatformErrorNone;
    }
    static std::uint32_t SelectInterface(void*, std::uint32_t index) {
        return index < Paths.size() ? PlatformErrorNone : PlatformErrorNoMoreItems;
    }
    static std::uint32_t GetDetail(void*, std::uint32_t index, char* path, std::uint32_t capacity,
                                   std::uint32_t* requiredBytes) {
        const std::string& text = Paths.at(index);
        *requiredBytes = static_cast<std::uint32_t>(DeviceDetailPathOffset + text.size() + 1);
        if (capacity < *requiredBytes) return PlatformErrorInsufficientBuffer;
        std::memcpy(path, text.c_str(), text.size() + 1);
        return PlatformErrorNone;
    }
    static void CloseList(void*) { --current->openLists; }
    static std::uint32_t Open(const char* path, void** handle) {
        if (path != Paths[0]) return PlatformErrorFileNotFound;
        ++current->openHandles;
        *handle = current;
        return PlatformErrorNone;
    }
    static void Close(void* handle) {
        auto* driver = static_cast<FakeDriver*>(handle);
        while (driver->CountPended() > 0) driver->EndFirst(PlatformErrorOperationAborted, 0);
        --driver->openHandles;
    }
    static std::uint32_t ControlHandle(void* handle, KernelRequest* request, std::uint32_t* bytes) {
        return static_cast<FakeDriver*>(handle)->Control(request, bytes);
    }
    static void Cancel(void* handle, KernelRequest* request) {
        End(static_cast<FakeDriver*>(handle)->TakePended(request), PlatformErrorOperationAborted,
            0);
    }

    static inline const std::array<std::string, 2> Paths = {"fake0", std::string(300, 'p')};
    static inline FakeDriver* current = nullptr;

    std::mutex mutex;
    std::vector<KernelRequest*> pended;  // guarded by mutex
};

const KernelDriver FakeDriver::Table = {
    KernelDriverVersion,
    [](const char*, char*, std::uint32_t) { return PlatformErrorNone; },
    [] {},
    OpenList,
    SelectInterface,
    GetDetail,
    CloseList,
    Open,
    Close,
    ControlHandle,
    Cancel,
};

class FakeDevice : public testing::Test {
  protected:
    FakeDevice() { EXPECT_TRUE(OpenDriverDevice(&FakeDriver::Table, "fake0", &device)); }
    ~FakeDevice() override {
        CloseDriverDevice(device);
        SetWaitClockDivisor(1);
    }

    ControlRequest MakeRequest(std::uint32_t code) {
        return {code, input.data(), static_cast<std::uint32_t>(input.size()), output.data(),
                static_cast<std::uint32_t>(output.size())};
    }

    FakeDriver driver;
    DriverDevice device;
    std::array<std::uint8_t, 4> input{1, 2, 3, 4};
    std::array<std::uint8_t, 4> output{};
};

/// A device with a request that is pended.
class PendedRequest : public FakeDevice {
  protected:
    PendedRequest() {
        EXPECT_EQ(ControlDriverDeviceOverlapped(device, MakeRequest(CodePend), &record),
                  ControlOutcome::Pending);
    }

    DriverRequest record;
};

TEST_F(FakeDevice, AnswersAtOnceWithTheLengthOfTheAnswer) {
    std::uint32_t bytes = 0;

    EXPECT_TRUE(ControlDriverDevice(device, MakeRequest(CodeAnswer), &bytes));

    EXPECT_EQ(bytes, 4u);
    EXPECT_EQ(output, input);
    EXPECT_EQ(driver.overlappedRequests, 0);
    EXPECT_TRUE(ControlDriverDevice(device, MakeRequest(CodeAnswer), nullptr));
}

TEST_F(FakeDevice, ReportsAFailureAsTheLastError) {
    EXPECT_FALSE(ControlDriverDevice(device, MakeRequest(CodeFail), nullptr));

    EXPECT_EQ(GetLastPlatformError(), PlatformErrorGeneralFailure);
}

TEST_F(FakeDevice, BlocksTheCallerOfAPlainRequestThatTheDriverPends) {
    std::atomic<bool> isDone{false};
    TestThread caller([&] {
        EXPECT_FALSE(ControlDriverDevice(device, MakeRequest(CodePend), nullptr));
        EXPECT_EQ(GetLastPlatformError(), PlatformErrorBusy);
        isDone.store(true);
    });

    ASSERT_TRUE(WaitUntil([this] { return driver.CountPended() == 1; }));
    EXPECT_FALSE(isDone.load());
    driver.EndFirst(PlatformErrorBusy, 0);

    EXPECT_TRUE(WaitUntil([&] { return isDone.load(); }));
}

TEST_F(FakeDevice, KeepsAThreadThatIsToEndInAPlainRequestUntilTheDriverEndsIt) {
    TestThread caller(
        [&] { EXPECT_TRUE(ControlDriverDevice(device, MakeRequest(CodePend), nullptr)); });
    ASSERT_TRUE(WaitUntil([this] { return driver.CountPended() == 1; }));

    EXPECT_FALSE(EndThread(caller.Get()));
    EXPECT_EQ(GetLastPlatformError(), PlatformErrorBusy);

    driver.EndFirst(PlatformErrorNone, 0);
    EXPECT_TRUE(EndThread(caller.Get()));
}

TEST_F(FakeDevice, LeavesARequestThatIsDoneAtOnceAsEnded) {
    DriverRequest record;

    EXPECT_EQ(ControlDriverDeviceOverlapped(device, MakeRequest(CodeAnswer), &record),
              ControlOutcome::Done);

    EXPECT_EQ(driver.overlappedRequests, 1);
    EXPECT_FALSE(IsDriverRequestPending(record));
    EXPECT_EQ(WaitForDriverRequest(&record, WaitForEver), CompletionOutcome::Completed);
}

TEST_F(FakeDevice, LeavesARequestThatFailsAtOnceAsEnded) {
    DriverRequest record;

    EXPECT_EQ(ControlDriverDeviceOverlapped(device, MakeRequest(CodeFail), &record),
              ControlOutcome::Failed);
    EXPECT_EQ(GetLastPlatformError(), PlatformErrorGeneralFailure);

    EXPECT_EQ(WaitForDriverRequest(&record, WaitForEver), CompletionOutcome::Failed);
}

TEST_F(FakeDevice, MayEndARequestBeforeItSaysThatItIsPended) {
    DriverRequest record;

    EXPECT_EQ(ControlDriverDeviceOverlapped(device, MakeRequest(CodeEndBeforePend), &record),
              ControlOutcome::Pending);
    EXPECT_EQ(GetLastPlatformError(), PlatformErrorIoPending);

    EXPECT_FALSE(IsDriverRequestPending(record));
    EXPECT_EQ(WaitForDriverRequest(&record, WaitForEver), CompletionOutcome::Completed);
    EXPECT_EQ(output, input);
}

TEST_F(FakeDevice, HasNothingToWaitForWithoutARequest) {
    DriverRequest record;

    EXPECT_EQ(WaitForDriverRequest(&record, WaitForEver), CompletionOutcome::Completed);
}

TEST_F(FakeDevice, IsNotOpenedAtAPathThatIsNotThere) {
    DriverDevice other;

    EXPECT_FALSE(OpenDriverDevice(&FakeDriver::Table, "elsewhere", &other));
    EXPECT_EQ(GetLastPlatformError(), PlatformErrorFileNotFound);
    EXPECT_FALSE(OpenDriverDevice(nullptr, "fake0", &other));
    EXPECT_EQ(GetLastPlatformError(), PlatformErrorFileNotFound);
    EXPECT_EQ(driver.openHandles, 1);
}

TEST_F(FakeDevice, LosesNoWakeWhileRequestsEndOnAnotherThread) {
    constexpr int Rounds = 2000;
    std::atomic<bool> isDone{false};
    const TestThread ender([&] {
        while (!isDone.load()) driver.EndFirst(PlatformErrorNone, 4);
    });

    for (int i = 0; i < Rounds; ++i) {
        auto record = std::make_unique<DriverRequest>();
        ASSERT_EQ(ControlDriverDeviceOverlapped(device, MakeRequest(CodePend), record.get()),
                  ControlOutcome::Pending);
        // Freed by whoever sees the end first, as its owner may.
        if (i % 2 == 0) {
            ASSERT_EQ(WaitForDriverRequest(record.get(), WaitForEver),
                      CompletionOutcome::Completed);
        } else {
            ASSERT_TRUE(WaitUntil([&] { return !IsDriverRequestPending(*record); }));
        }
    }
    isDone.store(true);
}

TEST_F(PendedRequest, TimesOutWhileTheDriverHoldsIt) {
    SetWaitClockDivisor(1000);

    EXPECT_EQ(WaitForDriverRequest(&record, 0), CompletionOutcome::TimedOut);
    EXPECT_EQ(WaitForDriverRequest(&record, 5000), CompletionOutcome::TimedOut);

    EXPECT_TRUE(IsDriverRequestPending(record));
}

TEST_F(PendedRequest, EndsWithTheOutcomeThatTheDriverGivesIt) {
    driver.EndFirst(PlatformErrorDeviceNotConnected, 0);

    EXPECT_EQ(WaitForDriverRequest(&record, WaitForEver), CompletionOutcome::Failed);
    EXPECT_EQ(GetLastPlatformError(), PlatformErrorDeviceNotConnected);
    EXPECT_EQ(WaitForDriverRequest(&record, WaitForEver), CompletionOutcome::Failed);
}

TEST_F(PendedRequest, RefusesASecondRequestOnItsRecord) {
    EXPECT_EQ(ControlDriverDeviceOverlapped(device, MakeRequest(CodeAnswer), &record),
              ControlOutcome::Failed);

    EXPECT_EQ(GetLastPlatformError(), PlatformErrorBusy);
    EXPECT_TRUE(IsDriverRequestPending(record));
}

TEST_F(PendedRequest, GivesItsRecordBackForTheNext) {
    driver.EndFirst(PlatformErrorBusy, 0);
    (void)WaitForDriverRequest(&record, WaitForEver);

    EXPECT_EQ(ControlDriverDeviceOverlapped(device, MakeRequest(CodePend), &record),
              ControlOutcome::Pending);
    EXPECT_EQ(WaitForDriverRequest(&record, 0), CompletionOutcome::TimedOut);
    driver.EndFirst(PlatformErrorNone, 4);

    EXPECT_EQ(WaitForDriverRequest(&record, WaitForEver), CompletionOutcome::Completed);
}

TEST_F(PendedRequest, EndsEarlyWhenItIsCancelled) {
    CancelDriverRequest(device, &record);

    EXPECT_EQ(WaitForDriverRequest(&record, WaitForEver), CompletionOutcome::Failed);
    EXPECT_EQ(GetLastPlatformError(), PlatformErrorOperationAborted);
    CancelDriverRequest(device, &record);
}

TEST_F(PendedRequest, EndsWhenItsDeviceIsClosed) {
    CloseDriverDevice(device);

    EXPECT_FALSE(IsDriverRequestPending(record));
    EXPECT_EQ(WaitForDriverRequest(&record, WaitForEver), CompletionOutcome::Failed);
    EXPECT_TRUE(OpenDriverDevice(&FakeDriver::Table, "fake0", &device));
}

TEST_F(PendedRequest, LetsAThreadThatIsToEndGoAndStaysPended) {
    std::atomic<int> outcome{-1};
    TestThread waiter([&] {
        waiter.AnnounceWait();
        outcome.store(static_cast<int>(WaitForDriverRequest(&record, WaitForEver)));
    });

    ASSERT_TRUE(waiter.WaitUntilAsleep());
    EXPECT_TRUE(EndThread(waiter.Get()));

    EXPECT_EQ(outcome.load(), static_cast<int>(CompletionOutcome::Ended));
    EXPECT_TRUE(IsDriverRequestPending(record));
    driver.EndFirst(PlatformErrorNone, 4);
    EXPECT_FALSE(IsDriverRequestPending(record));
}

TEST_F(PendedRequest, LetsAThreadGoThatWasToEndBeforeItWaits) {
    std::atomic<bool> isEnding{false};
    std::atomic<int> outcomes[2] = {-1, -1};
    TestThread waiter([&] {
        // The flag shows in the outcome of a poll before the unlimited wait begins.
        isEnding.store(WaitUntil(
            [&] { return WaitForDriverRequest(&record, 0) == CompletionOutcome::Ended; }));
        outcomes[0].store(static_cast<int>(WaitForDriverRequest(&record, WaitForEver)));
        outcomes[1].store(static_cast<int>(WaitForDriverRequest(&record, 5000)));
    });

    EXPECT_TRUE(EndThread(waiter.Get()));

    EXPECT_TRUE(isEnding.load());
    EXPECT_EQ(outcomes[0].load(), static_cast<int>(CompletionOutcome::Ended));
    EXPECT_EQ(outcomes[1].load(), static_cast<int>(CompletionOutcome::Ended));
}

TEST_F(PendedRequest, LetsAThreadThatIsToEndGoAlsoWhenItIsDone) {
    std::atomic<bool> isEnded{false};
    driver.EndFirst(PlatformErrorNone, 4);
    TestThread waiter([&] {
        isEnded.store(WaitUntil([&] {
            return WaitForDriverRequest(&record, WaitForEver) == CompletionOutcome::Ended;
        }));
    });

    EXPECT_TRUE(EndThread(waiter.Get()));

    EXPECT_TRUE(isEnded.load());
}

TEST_F(FakeDevice, LosesNoEndOfAThreadAmongWaitsThatEnd) {
    constexpr int Rounds = 200;
    for (int i = 0; i < Rounds; ++i) {
        auto record = std::make_unique<DriverRequest>();
        std::atomic<bool> isStarted{false};
        const TestThread loop([&] {
            CompletionOutcome outcome = CompletionOutcome::Completed;
            while (outcome != CompletionOutcome::Ended) {
                isStarted.store(true);
                (void)ControlDriverDeviceOverlapped(device, MakeRequest(CodePend), record.get());
                outcome = WaitForDriverRequest(record.get(), WaitForEver);
            }
        });

        ASSERT_TRUE(WaitUntil([&] { return isStarted.load(); }));
        for (int k = 0; k < i % 4; ++k) driver.EndFirst(PlatformErrorNone, 0);
        ASSERT_TRUE(EndThread(loop.Get()));

        CancelDriverRequest(device, record.get());
        ASSERT_FALSE(IsDriverRequestPending(*record));
    }
}

class FakeList : public testing::Test {
  protected:
    FakeList() { EXPECT_TRUE(OpenDriverInterfaceList(&FakeDriver::Table, &list)); }
    ~FakeList() override {
        CloseDriverInterfaceList(list);
        EXPECT_EQ(driver.openLists, 0);
    }

    static std::vector<char> MakeDetail(std::uint32_t bytes) {
        constexpr std::uint32_t SizeField = 8;
        std::vector<char> detail(bytes, 'x');
        std::memcpy(detail.data(), &SizeField, sizeof SizeField);
        return detail;
    }

    FakeDriver driver;
    DriverInterfaceList list;
};

TEST_F(FakeList, EndsWithNoMoreItems) {
    EXPECT_TRUE(SelectDriverInterface(&list, 0));
    EXPECT_TRUE(SelectDriverInterface(&list, 1));
    EXPECT_FALSE(SelectDriverInterface(&list, 2));

    EXPECT_EQ(GetLastPlatformError(), PlatformErrorNoMoreItems);
}

TEST_F(FakeList, TellsTheSizeOfADetailFirst) {
    std::uint32_t required = 0;
    (void)SelectDriverInterface(&list, 1);

    EXPECT_FALSE(GetDriverInterfaceDetail(list, nullptr, 0, &required));

    EXPECT_EQ(GetLastPlatformError(), PlatformErrorInsufficientBuffer);
    EXPECT_EQ(required, 4u + 300 + 1);
    std::vector<char> detail = MakeDetail(required);
    EXPECT_TRUE(GetDriverInterfaceDetail(list, detail.data(), required, nullptr));
    EXPECT_EQ(std::string(detail.data() + DeviceDetailPathOffset), std::string(300, 'p'));
}

TEST_F(FakeList, RefusesADetailThatIsTooSmall) {
    (void)SelectDriverInterface(&list, 0);
    for (const std::uint32_t capacity : {5u, 9u}) {
        std::vector<char> detail = MakeDetail(capacity);
        EXPECT_FALSE(GetDriverInterfaceDetail(list, detail.data(), capacity, nullptr));
        EXPECT_EQ(GetLastPlatformError(), PlatformErrorInsufficientBuffer);
    }
}

TEST_F(FakeList, RefusesADetailWithoutItsSizeField) {
    (void)SelectDriverInterface(&list, 0);
    std::vector<char> detail(64, 0);

    EXPECT_FALSE(GetDriverInterfaceDetail(list, detail.data(), 64, nullptr));

    EXPECT_EQ(GetLastPlatformError(), PlatformErrorInvalidParameter);
}

TEST_F(FakeList, HasNoDetailBeforeAnInterfaceIsSelected) {
    std::uint32_t required = 0;

    EXPECT_FALSE(GetDriverInterfaceDetail(list, nullptr, 0, &required));
    EXPECT_EQ(GetLastPlatformError(), PlatformErrorInvalidParameter);
    (void)SelectDriverInterface(&list, 2);

    EXPECT_FALSE(GetDriverInterfaceDetail(list, nullptr, 0, &required));
    EXPECT_EQ(GetLastPlatformError(), PlatformErrorInvalidParameter);
}

TEST_F(FakeList, IsRefusedWithTheDriversError) {
    DriverInterfaceList refused;
    driver.listError = PlatformErrorAccessDenied;

    EXPECT_FALSE(OpenDriverInterfaceList(&FakeDriver::Table, &refused));

    EXPECT_EQ(GetLastPlatformError(), PlatformErrorAccessDenied);
}

TEST(ListWithoutADriver, IsEmpty) {
    DriverInterfaceList list;

    EXPECT_TRUE(OpenDriverInterfaceList(nullptr, &list));
    EXPECT_FALSE(SelectDriverInterface(&list, 0));
    EXPECT_EQ(GetLastPlatformError(), PlatformErrorNoMoreItems);
    CloseDriverInterfaceList(list);
}

}  // namespace
}  // namespace ZV
