#include "hal/platform/last_error.h"

#include <cerrno>
#include <cstdio>
#include <cstring>

#include "hal/platform/posix/system_error.h"

namespace ZV {
namespace {

struct ErrorRow {
    std::uint32_t platformError;
    int errorNumber;
};

/// The system's own errors and the numbers that stand for them; the text of a number is that of its
/// row.
constexpr ErrorRow ErrorRows[] = {
    {PlatformErrorFileNotFound, ENOENT},
    {PlatformErrorAccessDenied, EACCES},
    {PlatformErrorInvalidHandle, EBADF},
    {PlatformErrorNotEnoughMemory, ENOMEM},
    {PlatformErrorBadLength, EMSGSIZE},
    {PlatformErrorGeneralFailure, EIO},
    {PlatformErrorInvalidParameter, EINVAL},
    {PlatformErrorInsufficientBuffer, ENOBUFS},
    {PlatformErrorBusy, EBUSY},
    {PlatformErrorNoMoreItems, ENODATA},
    {PlatformErrorNotOwner, EPERM},
    {PlatformErrorOperationAborted, ECANCELED},
    {PlatformErrorIoPending, EINPROGRESS},
    {PlatformErrorDeviceNotConnected, ENODEV},
    {PlatformErrorNoSystemResources, EAGAIN},
};

thread_local std::uint32_t lastError = PlatformErrorNone;

const ErrorRow* FindRow(std::uint32_t error) {
    for (const ErrorRow& row : ErrorRows) {
        if (row.platformError == error) return &row;
    }
    return nullptr;
}

}  // namespace

std::uint32_t GetLastPlatformError() {
    return lastError;
}

void SetLastPlatformError(std::uint32_t error) {
    lastError = error;
}

bool GetPlatformErrorText(std::uint32_t error, char* text, std::size_t capacity) {
    if (capacity == 0) return false;
    text[0] = '\0';
    const ErrorRow* row = FindRow(error);
    if (row == nullptr) return false;
    char systemText[256];
    const char* found = strerror_r(row->errorNumber, systemText, sizeof systemText);
    std::snprintf(text, capacity, "%s", found);
    return true;
}

void SetLastPlatformErrorFromErrno(int errorNumber) {
    lastError = PlatformErrorGeneralFailure;
    for (const ErrorRow& row : ErrorRows) {
        if (row.errorNumber == errorNumber) lastError = row.platformError;
    }
}

}  // namespace ZV
