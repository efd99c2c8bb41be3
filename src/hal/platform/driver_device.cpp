#include "hal/platform/driver_device.h"

#include <cstring>

#include "hal/platform/device_discovery.h"
#include "hal/platform/last_error.h"
#include "hal/platform/limited_wait.h"
#include "hal/platform/thread_end.h"

// Threads: a request's owner sends it and waits for it; a thread of the driver ends it. The
// request's mutex guards its outcome. The ender notifies under that mutex, and the owner looks at
// `isPending` under it, so that the owner can free the record as soon as it reads as ended.

namespace ZV {
namespace {

constexpr std::uint32_t DetailSizeField = 8;

bool SetErrorAndTest(std::uint32_t error) {
    if (error != PlatformErrorNone) SetLastPlatformError(error);
    return error == PlatformErrorNone;
}

void EndRequest(KernelRequest* request, std::uint32_t error, std::uint32_t bytes) {
    auto* record = static_cast<DriverRequest*>(request);
    const std::lock_guard guard(record->mutex);
    if (!record->isPending) return;
    record->isPending = false;
    record->error = error;
    record->bytes = bytes;
    record->ended.notify_all();
}

bool BeginRequest(const ControlRequest& request, bool isOverlapped, DriverRequest* record) {
    const std::lock_guard guard(record->mutex);
    if (record->isPending) return false;
    record->code = request.code;
    record->inputBytes = request.inputBytes;
    record->input = request.input;
    record->output = request.output;
    record->outputBytes = request.outputBytes;
    record->isOverlapped = isOverlapped ? 1 : 0;
    record->isPending = true;
    return true;
}

/// What the driver answered at once; 997 while the end comes through the record.
std::uint32_t SendRequest(const DriverDevice& device, DriverRequest* record) {
    std::uint32_t bytes = 0;
    const std::uint32_t error = device.driver->control(device.handle, record, &bytes);
    if (error != PlatformErrorIoPending) EndRequest(record, error, bytes);
    return error;
}

/// The registration of one wait with the thread that makes it, if that thread can be ended.
class EndableWait {
  public:
    EndableWait(ThreadEnd* ownEnd, DriverRequest* record) : end(ownEnd) {
        if (end != nullptr) end->BeginWait(&record->mutex, &record->ended);
    }
    ~EndableWait() {
        if (end != nullptr) end->EndWait();
    }
    EndableWait(const EndableWait&) = delete;
    EndableWait& operator=(const EndableWait&) = delete;

    bool IsEnding() const { return end != nullptr && end->IsRequested(); }

  private:
    ThreadEnd* end;  // borrowed from the thread's record, for the wait
};

}  // namespace

DriverRequest::DriverRequest() : KernelRequest{0, 0, nullptr, nullptr, 0, 0, EndRequest} {}

bool OpenDriverDevice(const KernelDriver* driver, const char* path, DriverDevice* device) {
    void* handle = nullptr;
    if (driver == nullptr) return SetErrorAndTest(PlatformErrorFileNotFound);
    if (!SetErrorAndTest(driver->open(path, &handle))) return false;
    *device = DriverDevice{driver, handle};
    return true;
}

void CloseDriverDevice(const DriverDevice& device) {
    device.driver->close(device.handle);
}

bool ControlDriverDevice(const DriverDevice& device, const ControlRequest& request,
                         std::uint32_t* bytes) {
    const ThreadHold hold;
    DriverRequest record;
    (void)BeginRequest(request, false, &record);  // a new record has nothing under way
    (void)SendRequest(device, &record);           // the record tells
    // Not cut short by the end of the thread: the driver may still write to the caller's buffer.
    std::unique_lock lock(record.mutex);
    record.ended.wait(lock, [&record] { return !record.isPending; });
    if (bytes != nullptr) *bytes = record.bytes;
    return SetErrorAndTest(record.error);
}

ControlOutcome ControlDriverDeviceOverlapped(const DriverDevice& device,
                                             const ControlRequest& request, DriverRequest* record) {
    if (!BeginRequest(request, true, record)) {
        SetLastPlatformError(PlatformErrorBusy);
        return ControlOutcome::Failed;
    }
    const std::uint32_t error = SendRequest(device, record);
    if (SetErrorAndTest(error)) return ControlOutcome::Done;
    return error == PlatformErrorIoPending ? ControlOutcome::Pending : ControlOutcome::Failed;
}

CompletionOutcome WaitForDriverRequest(DriverRequest* record, std::uint64_t timeoutMs) {
    const EndableWait wait(GetOwnThreadEnd(), record);
    std::unique_lock lock(record->mutex);
    const bool isOver = WaitForLimit(record->ended, lock, timeoutMs, [&wait, record] {
        return !record->isPending || wait.IsEnding();
    });
    if (wait.IsEnding()) return CompletionOutcome::Ended;
    if (!isOver) return CompletionOutcome::TimedOut;
    return SetErrorAndTest(record->error) ? CompletionOutcome::Completed
                                          : CompletionOutcome::Failed;
}

void CancelDriverRequest(const DriverDevice& device, DriverRequest* record) {
    if (IsDriverRequestPending(*record)) device.driver->cancel(device.handle, record);
}

bool IsDriverRequestPending(const DriverRequest& record) {
    const std::lock_guard guard(record.mutex);
    return record.isPending;
}

bool OpenDriverInterfaceList(const KernelDriver* driver, DriverInterfaceList* list) {
    void* driverList = nullptr;
    if (driver != nullptr && !SetErrorAndTest(driver->openList(&driverList))) return false;
    *list = DriverInterfaceList{driver, driverList, 0, false};
    return true;
}

bool SelectDriverInterface(DriverInterfaceList* list, std::uint32_t index) {
    const std::uint32_t error = list->driver != nullptr
                                    ? list->driver->selectInterface(list->list, index)
                                    : PlatformErrorNoMoreItems;
    list->isIndexValid = SetErrorAndTest(error);
    list->index = index;
    return list->isIndexValid;
}

bool GetDriverInterfaceDetail(const DriverInterfaceList& list, void* detail, std::uint32_t capacity,
                              std::uint32_t* requiredBytes) {
    if (!list.isIndexValid || (detail == nullptr) != (capacity == 0)) {
        return SetErrorAndTest(PlatformErrorInvalidParameter);
    }
    auto* bytes = static_cast<char*>(detail);
    char* path = nullptr;
    if (capacity > DeviceDetailPathOffset) {
        std::uint32_t sizeField = 0;
        std::memcpy(&sizeField, detail, sizeof sizeField);
        if (sizeField != DetailSizeField) return SetErrorAndTest(PlatformErrorInvalidParameter);
        path = bytes + DeviceDetailPathOffset;
    }
    std::uint32_t required = 0;
    const std::uint32_t usableCapacity = path != nullptr ? capacity : 0;
    const std::uint32_t error =
        list.driver->getDetail(list.list, list.index, path, usableCapacity, &required);
    if (requiredBytes != nullptr) *requiredBytes = required;
    if (path != nullptr) bytes[capacity - 1] = '\0';
    return SetErrorAndTest(error);
}

void CloseDriverInterfaceList(const DriverInterfaceList& list) {
    if (list.driver != nullptr) list.driver->closeList(list.list);
}

}  // namespace ZV
