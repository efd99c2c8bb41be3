#include "camera/morvane_fw_camera.h"

#include <algorithm>
#include <cstdio>
#include <iterator>

namespace ZV {

namespace {

constexpr char SemaphoreCreateFailed[] = "MorvaneFWCamera() - call to HAL_SemaphoreCreate failed\n";
constexpr char ConditionCreateFailed[] = "MorvaneFWCamera() - call to HAL_ConditionCreate failed\n";
constexpr char DestroyFailed[] = "MorvaneFWCamera() - call to HAL_SemaphoreDestroy failed\n";

struct SemaphoreRow {
    HALSemaphore* StreamingState::*semaphore;
};

struct ConditionRow {
    HALCondition* StreamingState::*condition;
    const char* createFailed;
};

constexpr SemaphoreRow Semaphores[] = {
    {&StreamingState::spareSemaphore}, {&StreamingState::streamLock},
    {&StreamingState::externalLock},   {&StreamingState::frameLock},
    {&StreamingState::closeLock},
};

// Kept: a failure of the first two conditions is reported as one of a semaphore.
constexpr ConditionRow Conditions[] = {
    {&StreamingState::spareCondition, SemaphoreCreateFailed},
    {&StreamingState::oneImageCondition, SemaphoreCreateFailed},
    {&StreamingState::exposeDoneCondition, ConditionCreateFailed},
    {&StreamingState::pauseCondition, ConditionCreateFailed},
};

}  // namespace

// Clients link to these by name, so that each has its place.
const std::uint32_t MorvaneFWCamera::m_cameraModelAddress;
const std::uint32_t MorvaneFWCamera::m_cameraModelAddressAlt;
const std::uint16_t MorvaneFWCamera::m_cameraModelShift;
const std::uint32_t MorvaneFWCamera::m_registersAddress;
const std::uint32_t MorvaneFWCamera::m_bulkDataControlOffset;
const std::uint32_t MorvaneFWCamera::m_asyncWriteAddressLow;
const std::uint32_t MorvaneFWCamera::m_asyncWriteAddressLength;

MorvaneFWCamera::MorvaneFWCamera(HALCamera newRecord) : halCamera(newRecord) {
    isOpen = newRecord.connected != 0;
    MakeSynchronisation();
}

MorvaneFWCamera::MorvaneFWCamera(const MorvaneFWCamera& other)
    : ZCamera(other), shouldDeleteHALCamera(false) {}

MorvaneFWCamera& MorvaneFWCamera::operator=(const MorvaneFWCamera& other) {
    ZCamera::operator=(other);
    return *this;
}

MorvaneFWCamera::~MorvaneFWCamera() {
    EndWhatCloseLeft();
    DestroySynchronisation();
    FreeFrames();
}

void MorvaneFWCamera::MakeSynchronisation() {
    for (const SemaphoreRow& row : Semaphores) {
        if (HAL_SemaphoreCreate(&(streaming.*row.semaphore)) != HALOk) {
            std::fputs(SemaphoreCreateFailed, stdout);
        }
    }
    for (const ConditionRow& row : Conditions) {
        if (HAL_ConditionCreate(&(streaming.*row.condition)) != HALOk) {
            std::fputs(row.createFailed, stdout);
        }
    }
}

bool MorvaneFWCamera::HasSynchronisation() const {
    return std::all_of(std::begin(Semaphores), std::end(Semaphores),
                       [this](const SemaphoreRow& row) {
                           return IsHALSemaphoreMade(streaming.*row.semaphore);
                       }) &&
           std::all_of(std::begin(Conditions), std::end(Conditions),
                       [this](const ConditionRow& row) {
                           return IsHALConditionMade(streaming.*row.condition);
                       });
}

void MorvaneFWCamera::DestroySynchronisation() {
    for (const ConditionRow& row : Conditions) {
        if (HAL_ConditionDestroy(&(streaming.*row.condition)) != HALOk) {
            std::fputs(DestroyFailed, stdout);
        }
    }
    for (const SemaphoreRow& row : Semaphores) {
        if (HAL_SemaphoreDestroy(&(streaming.*row.semaphore)) != HALOk) {
            std::fputs(DestroyFailed, stdout);
        }
    }
}

void MorvaneFWCamera::FreeFrames() {
    while (tStFrameInfo* frame = streaming.frameQueue.TakeAny()) DiscardFrame(frame);
    FreeImage(streaming.oneImage);
}

void MorvaneFWCamera::EndWhatCloseLeft() {
    EndThreads();
    ForgetConnectedCamera();
    if (!shouldDeleteHALCamera) return;
    // The stream's own thread ends with the device; it may call back until then.
    HALCamera record = GetHALCamera();
    (void)HAL_CameraRelease(&record);  // cannot fail
    record.context = nullptr;
    record.connected = 0;
    SetHALCamera(record);
}

bool MorvaneFWCamera::IsCameraOpen() {
    return isOpen;
}

void MorvaneFWCamera::SetShouldDeleteHALCamera(bool shouldDelete) {
    shouldDeleteHALCamera = shouldDelete;
}

HALCamera MorvaneFWCamera::GetHALCamera() const {
    const std::lock_guard hold(recordMutex);
    return halCamera;
}

void MorvaneFWCamera::SetHALCamera(const HALCamera& newRecord) {
    const std::lock_guard hold(recordMutex);
    halCamera = newRecord;
}

std::uint32_t MorvaneFWCamera::ReadConfiguration(std::uint32_t quadlet) const {
    return registers.configuration.Read(quadlet);
}

std::uint32_t MorvaneFWCamera::ReadConfigurationField(const RegisterField& field) const {
    const std::uint32_t version = MakeVersion(registers.configuration.major,  //
                                              registers.configuration.minor);
    if (version < field.sinceVersion) return 0;
    return ExtractField(field, ReadConfiguration(field.quadlet));
}

std::uint32_t MorvaneFWCamera::ReadControl(std::uint32_t quadlet) const {
    return registers.control.Read(quadlet);
}

std::uint32_t MorvaneFWCamera::ReadControlField(const RegisterField& field) const {
    return ExtractField(field, ReadControl(field.quadlet));
}

void MorvaneFWCamera::StoreControl(std::uint32_t quadlet, std::uint32_t value) {
    registers.control.Store(quadlet, value);
}

CameraResult MorvaneFWCamera::SendControl(std::uint32_t quadlet, std::uint32_t value) {
    HALCamera record = GetHALCamera();
    const HALStatus status =
        HAL_CameraWriteData(&record, registers.control.GetQuadletAddress(quadlet), &value, 1);
    return status == HALOk ? CameraOk : ReportHalStatus(status);
}

CameraResult MorvaneFWCamera::WriteControl(std::uint32_t quadlet, std::uint32_t value) {
    StoreControl(quadlet, value);
    return SendControl(quadlet, value);
}

CameraResult MorvaneFWCamera::WriteControlField(const RegisterField& field, std::uint32_t value) {
    return WriteControl(field.quadlet, InsertField(field, ReadControl(field.quadlet), value));
}

HALStatus MorvaneFWCamera::WriteCommand(std::uint32_t quadlet, std::uint32_t value) {
    HALCamera record = GetHALCamera();
    return HAL_CameraWriteData(&record, registers.command.GetQuadletAddress(quadlet), &value, 1);
}

CameraResult MorvaneFWCamera::TakeLock(HALSemaphore* lock) {
    const HALStatus status = HAL_SemaphoreWait(lock);
    return status == HALOk ? CameraOk : ReportHalStatus(status);
}

CameraResult MorvaneFWCamera::GiveLock(HALSemaphore* lock) {
    const HALStatus status = HAL_SemaphoreSignal(lock);
    return status == HALOk ? CameraOk : ReportHalStatus(status);
}

}  // namespace ZV
