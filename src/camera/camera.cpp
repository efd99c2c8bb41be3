#include "camera/camera.h"

#include <algorithm>
#include <cstring>
#include <mutex>
#include <new>

#include "hal/hal.h"
#include "hal/static_mutex.h"
#include "imaging/bayer_interpolation.h"
#include "imaging/ex_image.h"
#include "imaging/folary_ratio_correction.h"
#include "imaging/image_pipeline.h"

namespace ZV {

namespace {

constexpr std::uint16_t RatioCorrectionFormat = 0;
constexpr std::uint16_t BayerAlgorithm = 1;
constexpr std::uint16_t BayerFormat = 12;

constinit StaticMutex connectedCamerasMutex;

}  // namespace

std::vector<ZCamera*>* ZCamera::m_connectedCameras = nullptr;
Relaxed<std::uint16_t> ZCamera::m_numOfConnectedCameras{0};
Relaxed<bool> ZCamera::m_isToolboxInitialized{false};
Relaxed<bool> ZCamera::m_shouldOutputReads{false};
Relaxed<bool> ZCamera::m_shouldOutputWrites{false};

ZCamera::ZCamera() {
    imagePipeline = new (std::nothrow) ZImagePipeline;
    ratioCorrection = new (std::nothrow) ZFolaryRatioCorrection(RatioCorrectionFormat);
    bayerFilter = new (std::nothrow) ZBayerInterpolation(BayerAlgorithm, BayerFormat);
    bayerPipeline = new (std::nothrow) ZImagePipeline;
    // Kept: any new camera turns the trace of writes off again, while that of reads stays.
    SetShouldOutputWrites(false);
}

ZCamera::ZCamera(const ZCamera& other) : ZObject(other), refCon(static_cast<void*>(other.refCon)) {}

ZCamera& ZCamera::operator=(const ZCamera& other) {
    if (this != &other) refCon = static_cast<void*>(other.refCon);
    return *this;
}

ZCamera::~ZCamera() {
    delete imagePipeline;
    delete bayerPipeline;
    delete ratioCorrection;
    delete bayerFilter;
}

ZImagePipeline* ZCamera::GetImagePipeline() {
    return imagePipeline;
}

ZImagePipeline* ZCamera::GetBayerPipeline() {
    return bayerPipeline;
}

ZBayerInterpolation* ZCamera::GetBayerFilter() {
    return bayerFilter;
}

ZFolaryRatioCorrection* ZCamera::GetFYRatioCorrectionFilter() {
    return ratioCorrection;
}

void* ZCamera::GetRefCon() {
    return refCon;
}

void ZCamera::SetRefCon(void* value) {
    refCon = value;
}

bool ZCamera::DoWeHaveExclusiveAccess() {
    return exclusiveAccess;
}

ZCamera::SerialNumberText ZCamera::CopySerialNumber() {
    (void)GetSerialNumberString();  // the text is read from the place where this puts it
    const std::lock_guard hold(serialMutex);
    SerialNumberText copy{};
    std::memcpy(copy.data(), serialText.data(), copy.size() - 1);
    return copy;
}

void ZCamera::BeginSettingsChange() {
    const std::lock_guard hold(geometryMutex);
    ++changesInProgress;
}

void ZCamera::EndSettingsChange() {
    const std::lock_guard hold(geometryMutex);
    if (--changesInProgress == 0) isGeometryPending = false;
}

CameraResult ZCamera::Initialize() {
    if (m_isToolboxInitialized) return CameraAlreadyInitialized;
    (void)HAL_Open();  // cannot fail
    m_isToolboxInitialized = true;
    return CameraOk;
}

CameraResult ZCamera::Shutdown() {
    DeleteLostCameras();
    (void)HAL_Close();  // cannot fail
    m_isToolboxInitialized = false;
    return CameraOk;
}

bool ZCamera::IsInitalized() {
    return m_isToolboxInitialized;
}

void ZCamera::FreeImage(ZExImage* image) {
    delete image;
}

bool ZCamera::GetShouldOutputReads() {
    return m_shouldOutputReads;
}

bool ZCamera::GetShouldOutputWrites() {
    return m_shouldOutputWrites;
}

void ZCamera::SetShouldOutputReads(bool isOn) {
    m_shouldOutputReads = isOn;
    (void)HAL_CameraSetShouldOutputReads(0, isOn);  // cannot fail
}

void ZCamera::SetShouldOutputWrites(bool isOn) {
    m_shouldOutputWrites = isOn;
    (void)HAL_CameraSetShouldOutputWrites(0, isOn);  // cannot fail
}

std::uint32_t ZCamera::ReturnMasqueradedModel() {
    return GetModel();
}

void ZCamera::AddToConnectedCameras() {
    const std::lock_guard hold(connectedCamerasMutex);
    if (m_connectedCameras == nullptr) m_connectedCameras = new std::vector<ZCamera*>;
    m_connectedCameras->push_back(this);
    m_numOfConnectedCameras = static_cast<std::uint16_t>(m_connectedCameras->size());
}

void ZCamera::RemoveFromConnectedCameras() {
    const std::lock_guard hold(connectedCamerasMutex);
    if (m_connectedCameras == nullptr) return;
    const std::uint64_t uniqueId = GetUniqueID();
    const auto found =
        std::find_if(m_connectedCameras->begin(), m_connectedCameras->end(),
                     [uniqueId](ZCamera* open) { return open->GetUniqueID() == uniqueId; });
    if (found != m_connectedCameras->end()) m_connectedCameras->erase(found);
    m_numOfConnectedCameras = static_cast<std::uint16_t>(m_connectedCameras->size());
}

void ZCamera::ForgetConnectedCamera() {
    const std::lock_guard hold(connectedCamerasMutex);
    if (m_connectedCameras == nullptr) return;
    std::erase(*m_connectedCameras, this);
    m_numOfConnectedCameras = static_cast<std::uint16_t>(m_connectedCameras->size());
}

}  // namespace ZV
