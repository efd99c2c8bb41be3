#include "hal/semaphore.h"

#include <cstdio>

namespace ZV {

namespace {

// Kept: the four messages all bear the constructor's name.
void ReportFailure(HALStatus status, const char* call) {
    if (status == HALOk) return;
    std::printf("ZSemaphore::ZSemaphore() call to %s failed\n", call);
}

}  // namespace

ZSemaphore::ZSemaphore() {
    ReportFailure(HAL_SemaphoreCreate(&semaphore), "HAL_SemaphoreCreate");
}

ZSemaphore::~ZSemaphore() {
    ReportFailure(HAL_SemaphoreDestroy(&semaphore), "HAL_SemaphoreDestroy");
}

bool ZSemaphore::IsMade() const {
    return IsHALSemaphoreMade(semaphore);
}

void ZSemaphore::Wait() {
    ReportFailure(HAL_SemaphoreWait(semaphore), "HAL_SemaphoreWait");
}

void ZSemaphore::Signal() {
    ReportFailure(HAL_SemaphoreSignal(semaphore), "HAL_SemaphoreSignal");
}

}  // namespace ZV
