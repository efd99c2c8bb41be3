#pragma once

#include <array>
#include <cstdint>
#include <mutex>
#include <vector>

#include "camera/camera_result.h"
#include "camera/relaxed.h"
#include "camera/stream_counters.h"
#include "imaging/object.h"
#include "zentara/zentara.h"

namespace ZV {

struct HALCamera;
class ZBayerInterpolation;
class ZExImage;
class ZFolaryRatioCorrection;
class ZImagePipeline;

/// What the image callback receives. The image is the callback's; null on a time-out record.
struct ZImageReceivedCallbackStruct {
    ZExImage* image;
    void* refCon;          ///< As given to StartStreamingImages.
    std::uint16_t status;  ///< Frame status code.
};
using ImageCallback = void* (*)(ZImageReceivedCallbackStruct* record);
using ExposeDoneCallback = void* (*)(void* refCon);

/// A camera as the flat interface and the filters see it: an abstract interface with a little state
/// of its own. Operations read cached state unless they say otherwise; setters run on client
/// threads.
class ZENTARA_API ZCamera : public ZObject {
  public:
    ZCamera();
    /// A copy owns nothing: no pipelines, no filters. Only the reference is copied.
    ZCamera(const ZCamera& other);
    ZCamera& operator=(const ZCamera& other);
    virtual ~ZCamera();

    /// Opens the bus layer and sets the flag; CameraAlreadyInitialized when it is set.
    static CameraResult Initialize();
    /// Closes the bus layer and clears the flag, whatever it was. Ends what failed listings left.
    static CameraResult Shutdown();
    /// The spelling is the name that clients link to.
    static bool IsInitalized();

    /// Appends an object for each camera of the bus that nobody holds, read and set up, closed.
    /// Stops at the first failure; what was appended stays.
    static CameraResult GetCameraList(std::vector<ZCamera*>& cameras);
    /// Empties the vector, deletes nothing.
    static CameraResult EraseCameraList(std::vector<ZCamera*>& cameras);
    /// Closes and deletes cameras from the front, up to the first open one.
    static CameraResult EraseClosedCamerasFromList(std::vector<ZCamera*>& cameras);
    /// Closes and deletes all, failures ignored.
    static CameraResult FreeCameraList(std::vector<ZCamera*>& cameras);
    static void FreeImage(ZExImage* image);

    static bool GetShouldOutputReads();
    static bool GetShouldOutputWrites();
    static void SetShouldOutputReads(bool isOn);
    static void SetShouldOutputWrites(bool isOn);

    ZImagePipeline* GetImagePipeline();
    ZImagePipeline* GetBayerPipeline();
    ZBayerInterpolation* GetBayerFilter();
    ZFolaryRatioCorrection* GetFYRatioCorrectionFilter();
    void* GetRefCon();
    void SetRefCon(void* value);
    /// Set only by a successful OpenCamera.
    bool DoWeHaveExclusiveAccess();

    // Lifetime.
    virtual CameraResult OpenCamera() = 0;
    virtual CameraResult CloseCamera() = 0;
    virtual bool IsCameraOpen() = 0;
    virtual CameraResult Abort() = 0;
    virtual void SetShouldDeleteHALCamera(bool shouldDelete) = 0;

    // Gain and offset conversion: DAC values, normalized gain in millionths, dB in millionths.
    virtual std::uint32_t ConvertGainToNormGain(std::uint32_t gain) = 0;
    virtual std::int32_t ConvertGainToNormGaindB(std::uint32_t gain) = 0;
    virtual std::uint32_t ConvertNormGainToGain(std::uint32_t normGain) = 0;
    virtual std::int32_t ConvertNormGainToNormGaindB(std::uint32_t normGain) = 0;
    virtual std::uint32_t ConvertNormGaindBToGain(std::int32_t gaindB) = 0;
    virtual std::uint32_t ConvertNormGaindBToNormGain(std::int32_t gaindB) = 0;
    virtual std::int32_t RoundNormGaindB(std::int32_t gaindB) = 0;
    virtual std::int32_t ConvertOffsetToAbsoluteOffset(std::uint32_t offset) = 0;
    virtual std::uint32_t ConvertAbsoluteOffsetToOffset(std::int32_t absoluteOffset) = 0;

    // Current state, from the host copy of the registers. Exposure in nanoseconds.
    virtual std::uint32_t GetModel() = 0;
    virtual std::uint32_t GetROIX() = 0;
    virtual std::uint32_t GetROIY() = 0;
    virtual std::uint32_t GetROIWidth() = 0;
    virtual std::uint32_t GetROIHeight() = 0;
    virtual std::uint32_t GetBitDepth() = 0;
    virtual std::uint32_t GetPSN() = 0;
    virtual std::uint64_t GetExposure() = 0;

    // Gain.
    virtual std::uint32_t GetGain() = 0;
    virtual std::uint32_t GetGainDefault() = 0;
    virtual std::uint32_t GetGainMin() = 0;
    virtual std::uint32_t GetGainMax() = 0;
    virtual std::uint32_t GetNormalizedGain() = 0;
    virtual std::uint32_t GetNormalizedGainDefault() = 0;
    virtual double GetNormalizedGainMin() = 0;
    virtual double GetNormalizedGainMax() = 0;
    virtual std::int32_t GetNormalizedGaindB() = 0;
    virtual std::int32_t GetNormalizedGaindBMin() = 0;
    virtual std::int32_t GetNormalizedGaindBMax() = 0;
    virtual std::uint16_t GetNormalizedGaindBResolution() = 0;
    virtual std::uint16_t GetNormalizedGainSignificantFigures() = 0;

    // Image and identity.
    virtual std::uint32_t GetImageFormat() = 0;
    virtual std::uint32_t GetFirmwareVersion() = 0;
    virtual bool GetCoolerStatus() = 0;
    virtual void GetSymmetricalBinningModes(std::vector<std::uint16_t>& modes) = 0;
    virtual void GetHorizontalBinningModes(std::vector<std::uint16_t>& modes) = 0;
    virtual void GetVerticalBinningModes(std::vector<std::uint16_t>& modes) = 0;
    virtual const char* GetModelName() = 0;
    virtual std::uint16_t GetSymmetricalBinningMode() = 0;
    virtual std::uint16_t GetHorizontalBinningMode() = 0;
    virtual std::uint16_t GetVerticalBinningMode() = 0;
    virtual std::uint32_t GetCCDWidth() = 0;
    virtual std::uint32_t GetCCDHeight() = 0;
    virtual std::uint32_t GetHardwareVersion() = 0;
    virtual std::uint32_t GetFirmwareBuildNumber() = 0;
    virtual bool GetRGBFilterCycleMode() = 0;
    virtual std::uint16_t GetStreamingVersion() = 0;

    // Readout. Frequencies in MHz.
    virtual float GetReadoutFrequencyDefault() = 0;
    virtual float GetReadoutFrequency() = 0;
    virtual float GetReadoutFrequencyMin() = 0;
    virtual float GetReadoutFrequencyMax() = 0;
    virtual std::uint32_t GetImageWidth() = 0;
    virtual std::uint32_t GetImageHeight() = 0;
    virtual std::uint32_t GetImageSize() = 0;
    virtual bool GetBigEndian() = 0;
    virtual std::uint32_t GetCompression() = 0;
    virtual bool GetRTVMode() = 0;
    virtual std::uint32_t GetMaxBitDepth() = 0;
    virtual std::uint64_t GetMinExposure() = 0;
    virtual std::uint64_t GetMaxExposure() = 0;
    virtual void GetReadoutFrequencyModes(std::vector<float>& modes) = 0;

    // Offset.
    virtual std::int32_t GetOffset() = 0;
    virtual std::int32_t GetOffsetDefault() = 0;
    virtual std::int32_t GetOffsetMin() = 0;
    virtual std::int32_t GetOffsetMax() = 0;
    virtual std::int32_t GetAbsoluteOffset() = 0;
    virtual std::int32_t GetAbsoluteOffsetDefault() = 0;
    virtual std::int32_t GetAbsoluteOffsetMin() = 0;
    virtual std::int32_t GetAbsoluteOffsetMax() = 0;

    // Trigger, filter wheel exposures (nanoseconds), sync output.
    virtual std::uint32_t GetTriggerMode() = 0;
    virtual std::uint64_t GetRGBFilterRedExposure() = 0;
    virtual std::uint64_t GetRGBFilterBlueExposure() = 0;
    virtual std::uint32_t GetSyncBMode() = 0;

    // Intensifier.
    virtual std::uint64_t GetNormalizedIntensifierGain() = 0;
    virtual std::uint64_t GetNormalizedIntensifierGainMin() = 0;
    virtual std::uint64_t GetNormalizedIntensifierGainMax() = 0;
    virtual std::uint16_t GetNormalizedIntensifierGaindBResolution() = 0;
    virtual std::uint16_t GetNormalizedIntensifierGainSignificantFigures() = 0;
    virtual std::uint32_t GetNormalizedIntensifierGaindB() = 0;
    virtual std::int32_t GetNormalizedIntensifierGaindBMin() = 0;
    virtual std::int32_t GetNormalizedIntensifierGaindBMax() = 0;
    virtual std::uint32_t GetIntensifierGain() = 0;
    virtual std::uint32_t GetIntensifierGainMin() = 0;
    virtual std::uint32_t GetIntensifierGainMax() = 0;

    // Trigger delay, fan, modes, cooling (degrees C), sensor, serial number.
    virtual std::uint32_t GetTriggerDelay() = 0;
    virtual std::uint32_t GetTriggerDelayMin() = 0;
    virtual std::uint32_t GetTriggerDelayMax() = 0;
    virtual std::uint32_t GetFanSpeed() = 0;
    virtual bool GetBlackoutMode() = 0;
    virtual bool GetHighSensitivityMode() = 0;
    virtual void GetSyncBModes(std::vector<std::uint32_t>& modes) = 0;
    virtual void GetTriggerModes(std::vector<std::uint32_t>& modes) = 0;
    virtual std::int32_t GetMinRegulatedCoolingTemp() = 0;
    virtual std::int32_t GetMaxRegulatedCoolingTemp() = 0;
    virtual std::uint32_t GetCCDModel() = 0;
    virtual const char* GetCCDModelString() = 0;
    virtual std::uint32_t GetExposureResolution() = 0;
    virtual std::uint32_t GetTriggerDelayResolution() = 0;
    virtual const char* GetSerialNumberString() = 0;
    virtual bool GetRegulatedCoolingTemperatureLock() = 0;
    virtual std::int32_t GetRegulatedCoolingTemperature() = 0;
    virtual std::uint16_t GetCCDImageFormat() = 0;
    virtual std::uint16_t GetRGBFilterStartColour() = 0;
    virtual std::uint64_t GetUniqueID() = 0;
    virtual std::uint16_t GetIntensifierModel() = 0;
    virtual bool GetDoubleShotMode() = 0;

    // EM gain, dither, high gain, calibration, vertical clock (nanoseconds), close delay.
    virtual std::uint32_t GetEMGain() = 0;
    virtual std::uint32_t GetEMGainDefault() = 0;
    virtual std::uint32_t GetEMGainMin() = 0;
    virtual std::uint32_t GetEMGainMax() = 0;
    virtual bool GetDitherMode() = 0;
    virtual bool GetHighGainMode() = 0;
    virtual bool GetDitherModeDefault() = 0;
    virtual bool GetHighGainModeDefault() = 0;
    virtual std::uint32_t GetChan1CalibrationGainDefault() = 0;
    virtual std::uint32_t GetVClockPeriodDefault() = 0;
    virtual std::uint32_t GetVClockPeriodMin() = 0;
    virtual std::uint32_t GetVClockPeriodMax() = 0;
    virtual std::uint32_t GetChan1CalibrationGain() = 0;
    virtual std::uint32_t GetVClockPeriod() = 0;
    virtual std::uint64_t GetDefaultExposure() = 0;
    virtual std::uint32_t GetShutterCloseDelay() = 0;
    virtual std::uint32_t GetShutterCloseDelayDefault() = 0;
    virtual std::uint32_t GetShutterCloseDelayMin() = 0;
    virtual std::uint32_t GetShutterCloseDelayMax() = 0;

    // Limits by mode, pixel properties.
    virtual std::uint32_t GetROIMaxWidthForBinningMode(std::uint32_t mode) = 0;
    virtual std::uint32_t GetROIMaxHeightForBinningMode(std::uint32_t mode) = 0;
    virtual std::uint32_t GetROIMaxWidthForRTVMode() = 0;
    virtual std::uint32_t GetROIMaxHeightForRTVMode() = 0;
    virtual std::uint16_t GetPixelSize() = 0;
    virtual std::uint16_t GetDistanceBetweenPixels() = 0;
    virtual std::uint32_t GetFullWellCapacity() = 0;

    // Defaults of the analog tweak registers, readout port, OEM shutter delay.
    virtual std::uint32_t GetSubCpDefAd() = 0;
    virtual std::uint32_t GetResetVhDefAd() = 0;
    virtual std::uint32_t GetV1VmDefAd() = 0;
    virtual std::uint32_t GetV2VmDefAd() = 0;
    virtual std::uint32_t GetV3VmDefAd() = 0;
    virtual std::uint32_t GetV4VmDefAd() = 0;
    virtual std::uint32_t GetMiscCtrlDefAd() = 0;
    virtual std::uint16_t GetReadoutPort() = 0;
    virtual std::uint32_t GetMetronaShutterDelay() = 0;

    // Setters: the host copy changes, then one quadlet goes to the camera.
    virtual CameraResult SetROI(std::uint32_t x, std::uint32_t y, std::uint32_t width,
                                std::uint32_t height) = 0;
    virtual CameraResult SetBigEndian(bool isBigEndian) = 0;
    virtual CameraResult SetCompression(std::uint32_t compression) = 0;
    virtual CameraResult SetReadoutFrequency(float megahertz) = 0;
    virtual CameraResult SetBitDepth(std::uint32_t bits) = 0;
    virtual CameraResult SetExposure(std::uint64_t nanoseconds) = 0;
    virtual CameraResult SetGain(std::uint32_t gain) = 0;
    virtual CameraResult SetNormalizedGain(std::uint32_t normGain) = 0;
    virtual CameraResult SetNormalizedGaindB(std::int32_t gaindB) = 0;
    virtual CameraResult SetNormalizedIntensifierGain(std::uint64_t normGain) = 0;
    virtual CameraResult SetOffset(std::int32_t offset) = 0;
    virtual CameraResult SetAbsoluteOffset(std::int32_t absoluteOffset) = 0;
    virtual CameraResult SetCoolerStatus(bool isOn) = 0;
    virtual CameraResult SetSymmetricalBinning(std::uint32_t mode) = 0;
    virtual CameraResult SetVerticalBinning(std::uint32_t mode) = 0;
    virtual CameraResult SetHorizontalBinning(std::uint32_t mode) = 0;
    virtual CameraResult SetRTVMode(bool isOn) = 0;
    virtual CameraResult SetRGBFilterCycle(bool isOn) = 0;
    virtual CameraResult SetRGBFilterActive(bool isOn) = 0;
    virtual CameraResult SetTriggerMode(std::uint32_t mode) = 0;
    virtual CameraResult SetSyncBMode(std::uint32_t mode) = 0;
    virtual CameraResult SetFanSpeed(std::uint32_t speed) = 0;
    virtual CameraResult SetBlackoutMode(bool isOn) = 0;
    virtual CameraResult SetHighSensitivityMode(bool isOn) = 0;
    virtual CameraResult SetRegulatedCoolingTemp(std::int32_t celsius) = 0;
    virtual CameraResult SetRGBFilterRedExposure(std::uint64_t nanoseconds) = 0;
    virtual CameraResult SetRGBFilterBlueExposure(std::uint64_t nanoseconds) = 0;
    virtual CameraResult SetRGBFilterStartColour(std::uint32_t colour) = 0;
    virtual CameraResult SetShutterCloseDelay(std::uint32_t delay) = 0;
    virtual CameraResult SetDoubleShotMode(bool isOn) = 0;
    virtual CameraResult SoftwareTrigger() = 0;
    virtual CameraResult SetReserved0(std::uint32_t selector, void* data, std::uint32_t quadlets,
                                      std::uint32_t checksum) = 0;
    virtual CameraResult SetChan1CalibrationGain(std::uint32_t gain) = 0;
    virtual CameraResult SetDither(bool isOn) = 0;
    virtual CameraResult SetHighGainMode(bool isOn) = 0;
    virtual CameraResult SetVClockPeriod(std::uint32_t nanoseconds) = 0;
    virtual CameraResult SetEMGain(std::uint32_t gain) = 0;
    virtual CameraResult SetSubCpAd(std::uint32_t value) = 0;
    virtual CameraResult SetSubAd(std::uint32_t value) = 0;
    virtual CameraResult SetResetVhAd(std::uint32_t value) = 0;
    virtual CameraResult SetV1VmAd(std::uint32_t value) = 0;
    virtual CameraResult SetV2VmAd(std::uint32_t value) = 0;
    virtual CameraResult SetV3VmAd(std::uint32_t value) = 0;
    virtual CameraResult SetV4VmAd(std::uint32_t value) = 0;
    virtual CameraResult SetMiscCtrlAd(std::uint32_t value) = 0;
    virtual CameraResult SetReadoutPort(std::uint32_t port) = 0;
    virtual CameraResult SetMetronaShutterDelay(std::uint32_t delay) = 0;

    // Capabilities. The spellings IsTriggerDelayAvialable and IsTweekingRegisterSupported are the
    // names that clients link to.
    virtual bool IsCoolerAvailable() = 0;
    virtual bool IsRegulatedCoolingAvailable() = 0;
    virtual bool IsRGBFilterSupported() = 0;
    virtual bool IsRTVModeSupported() = 0;
    virtual bool IsFanControlAvailable() = 0;
    virtual bool IsHighSensitivityModeAvailable() = 0;
    virtual bool IsBlackoutModeAvailable() = 0;
    virtual bool IsSymmetricalBinningSupported() = 0;
    virtual bool IsVerticalBinningSupported() = 0;
    virtual bool IsHorizontalBinningSupported() = 0;
    virtual bool IsIntensifierAvailable() = 0;
    virtual bool IsShutterCloseDelayAvailable() = 0;
    virtual bool IsTriggerDelayAvialable() = 0;
    virtual bool IsEMGainAvailable() = 0;
    virtual bool IsDitherControlAvailable() = 0;
    virtual bool IsHighGainModeAvailable() = 0;
    virtual bool IsVClockControlAvailable() = 0;
    virtual bool IsDualChannelSupported() = 0;
    virtual bool IsSyncBSupported() = 0;
    virtual bool IsDoubleShotSupported() = 0;
    virtual bool IsTweekingRegisterSupported() = 0;
    virtual bool IsReadoutPortSupported() = 0;
    virtual bool IsMetronaShutterDelaySupported() = 0;

    // Control.
    virtual CameraResult UpdateSettingsOnCamera() = 0;
    virtual bool IsCameraStreaming() = 0;
    virtual CameraResult GetOneImage(ZExImage** image) = 0;
    virtual CameraResult StartStreamingImages(ImageCallback imageCallback,
                                              ExposeDoneCallback exposeDoneCallback,
                                              bool externalBuffers, void* refCon) = 0;
    virtual CameraResult StopStreamingImages() = 0;
    virtual CameraResult AddExternalImageBuffer(void* buffer) = 0;
    virtual bool DoesSupportExternalBuffers() = 0;
    virtual CameraResult ReallocateBandwidth(std::uint16_t payloadBytes) = 0;
    /// Id of the class that this camera must be made as; GetModel unless a model knows better.
    virtual std::uint32_t ReturnMasqueradedModel();
    virtual CameraResult ReadCameraInfo() = 0;

    /// What GetSerialNumberString tells, always terminated, for the caller alone: that text is
    /// rewritten when another thread finds that the camera's registers have changed. Thread-safe.
    using SerialNumberText = std::array<char, 29>;
    SerialNumberText CopySerialNumber();

    /// Around a batch of settings: between a change of the image's geometry and its commit frames
    /// are dropped, since they still come with the former one. At the end of the batch they count
    /// as they come again, also without a commit. Batches may be nested, and meet. Thread-safe.
    void BeginSettingsChange();
    void EndSettingsChange();

    /// What became of the frames of this object's streams. Thread-safe.
    StreamCounters& GetStreamCounters() { return streamCounters; }

  private:
    virtual CameraResult SetupCamera() = 0;
    virtual bool IsInterlaced() = 0;
    virtual std::uint16_t GetMaxPacketSize() = 0;
    virtual std::uint16_t GetTagCode() = 0;

  protected:
    /// Takes this camera into the list of those that are open in this process. Thread-safe.
    void AddToConnectedCameras();
    /// Takes the first camera whose GetUniqueID equals this one's out of that list. Thread-safe.
    void RemoveFromConnectedCameras();
    /// Takes this very object out of the list and its number, if it is in there. Thread-safe.
    void ForgetConnectedCamera();

    Relaxed<void*> refCon{nullptr};
    ZImagePipeline* imagePipeline = nullptr;
    ZImagePipeline* bayerPipeline = nullptr;
    ZBayerInterpolation* bayerFilter = nullptr;
    ZFolaryRatioCorrection* ratioCorrection = nullptr;
    Relaxed<bool> isOpen{false};
    Relaxed<bool> exclusiveAccess{false};
    StreamCounters streamCounters;
    /// A write of the image's geometry is told apart from a take-over: it stands before it or
    /// behind it. Held over their requests; nothing but the HAL's locks is taken under it.
    std::mutex geometryMutex;
    std::uint32_t changesInProgress = 0;  ///< Batches of settings. Guarded by geometryMutex.
    /// A setter has changed the image's geometry. Until the take-over the camera sends images of
    /// the geometry in force; a change that ends without one leaves frames to count as they come.
    Relaxed<bool> isGeometryPending{false};
    std::mutex serialMutex;              ///< Leaf.
    std::array<char, 256> serialText{};  ///< Last serial number told. Guarded by serialMutex.

    /// Null until a camera has been opened; guarded, like the number, by a leaf mutex.
    static std::vector<ZCamera*>* m_connectedCameras;
    static Relaxed<std::uint16_t> m_numOfConnectedCameras;
    static Relaxed<bool> m_isToolboxInitialized;
    static Relaxed<bool> m_shouldOutputReads;
    static Relaxed<bool> m_shouldOutputWrites;

  private:
    static CameraResult ListCamera(HALCamera& record, ZCamera** listed);
    static CameraResult ReadListedCamera(ZCamera& camera, bool* isOtherModel);
    static CameraResult SetUpListedCamera(ZCamera& camera);
    /// A camera that a failed listing leaves behind: kept until DeleteLostCameras.
    static void KeepLostCamera(ZCamera* camera);
    static void DeleteLostCameras();

    ZCamera* nextLost = nullptr;  // guarded by a leaf mutex, like the list's head
    static ZCamera* m_firstLostCamera;
};

}  // namespace ZV
