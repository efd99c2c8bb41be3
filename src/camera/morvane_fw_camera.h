#pragma once

#include <array>
#include <cstdint>
#include <mutex>
#include <vector>

#include "camera/camera.h"
#include "camera/gain_model.h"
#include "camera/register_block.h"
#include "camera/register_map.h"
#include "camera/streaming_state.h"
#include "hal/hal.h"

namespace ZV {

struct BusConnection;

/// The concrete camera: register model, imaging settings, gain, bandwidth and streaming over the
/// HAL. Models override what they do differently.
class ZENTARA_API MorvaneFWCamera : public ZCamera {
  public:
    static const std::uint32_t m_cameraModelAddress = 0xE0010038;
    static const std::uint32_t m_cameraModelAddressAlt = 0xE0001138;
    static const std::uint16_t m_cameraModelShift = 16;
    static const std::uint32_t m_registersAddress = 0xD0000000;
    static const std::uint32_t m_bulkDataControlOffset = 4;
    static const std::uint32_t m_asyncWriteAddressLow = 0xFA000000;
    static const std::uint32_t m_asyncWriteAddressLength = 4;

    explicit MorvaneFWCamera(HALCamera newRecord);
    /// A copy owns nothing: no device, no registers, no threads. It serves for nothing else.
    MorvaneFWCamera(const MorvaneFWCamera& other);
    MorvaneFWCamera& operator=(const MorvaneFWCamera& other);
    ~MorvaneFWCamera() override;

    // Lifetime.
    CameraResult OpenCamera() override;
    CameraResult CloseCamera() override;
    bool IsCameraOpen() override;
    CameraResult Abort() override;
    void SetShouldDeleteHALCamera(bool shouldDelete) override;

    // Gain and offset conversion: DAC values, normalized gain in millionths, dB in millionths.
    std::uint32_t ConvertGainToNormGain(std::uint32_t gain) override;
    std::int32_t ConvertGainToNormGaindB(std::uint32_t gain) override;
    std::uint32_t ConvertNormGainToGain(std::uint32_t normGain) override;
    std::int32_t ConvertNormGainToNormGaindB(std::uint32_t normGain) override;
    std::uint32_t ConvertNormGaindBToGain(std::int32_t gaindB) override;
    std::uint32_t ConvertNormGaindBToNormGain(std::int32_t gaindB) override;
    std::int32_t RoundNormGaindB(std::int32_t gaindB) override;
    std::int32_t ConvertOffsetToAbsoluteOffset(std::uint32_t offset) override;
    std::uint32_t ConvertAbsoluteOffsetToOffset(std::int32_t absoluteOffset) override;

    // Current state, from the host copy of the registers. Exposure in nanoseconds.
    std::uint32_t GetModel() override;
    std::uint32_t GetROIX() override;
    std::uint32_t GetROIY() override;
    std::uint32_t GetROIWidth() override;
    std::uint32_t GetROIHeight() override;
    std::uint32_t GetBitDepth() override;
    std::uint32_t GetPSN() override;
    std::uint64_t GetExposure() override;

    // Gain.
    std::uint32_t GetGain() override;
    std::uint32_t GetGainDefault() override;
    std::uint32_t GetGainMin() override;
    std::uint32_t GetGainMax() override;
    std::uint32_t GetNormalizedGain() override;
    std::uint32_t GetNormalizedGainDefault() override;
    double GetNormalizedGainMin() override;
    double GetNormalizedGainMax() override;
    std::int32_t GetNormalizedGaindB() override;
    std::int32_t GetNormalizedGaindBMin() override;
    std::int32_t GetNormalizedGaindBMax() override;
    std::uint16_t GetNormalizedGaindBResolution() override;
    std::uint16_t GetNormalizedGainSignificantFigures() override;

    // Image and identity.
    std::uint32_t GetImageFormat() override;
    std::uint32_t GetFirmwareVersion() override;
    bool GetCoolerStatus() override;
    void GetHorizontalBinningModes(std::vector<std::uint16_t>& modes) override;
    void GetVerticalBinningModes(std::vector<std::uint16_t>& modes) override;
    std::uint16_t GetSymmetricalBinningMode() override;
    std::uint16_t GetHorizontalBinningMode() override;
    std::uint16_t GetVerticalBinningMode() override;
    std::uint32_t GetCCDWidth() override;
    std::uint32_t GetCCDHeight() override;
    std::uint32_t GetHardwareVersion() override;
    std::uint32_t GetFirmwareBuildNumber() override;
    bool GetRGBFilterCycleMode() override;
    std::uint16_t GetStreamingVersion() override;

    // Readout. Frequencies in MHz.
    float GetReadoutFrequencyDefault() override;
    float GetReadoutFrequency() override;
    float GetReadoutFrequencyMin() override;
    float GetReadoutFrequencyMax() override;
    std::uint32_t GetImageWidth() override;
    std::uint32_t GetImageHeight() override;
    std::uint32_t GetImageSize() override;
    bool GetBigEndian() override;
    std::uint32_t GetCompression() override;
    bool GetRTVMode() override;
    std::uint32_t GetMaxBitDepth() override;
    std::uint64_t GetMinExposure() override;
    std::uint64_t GetMaxExposure() override;
    void GetReadoutFrequencyModes(std::vector<float>& modes) override;

    // Offset.
    std::int32_t GetOffset() override;
    std::int32_t GetOffsetDefault() override;
    std::int32_t GetOffsetMin() override;
    std::int32_t GetOffsetMax() override;
    std::int32_t GetAbsoluteOffset() override;
    std::int32_t GetAbsoluteOffsetDefault() override;
    std::int32_t GetAbsoluteOffsetMin() override;
    std::int32_t GetAbsoluteOffsetMax() override;

    // Trigger, filter wheel exposures (nanoseconds), sync output.
    std::uint32_t GetTriggerMode() override;
    std::uint64_t GetRGBFilterRedExposure() override;
    std::uint64_t GetRGBFilterBlueExposure() override;
    std::uint32_t GetSyncBMode() override;

    // Intensifier.
    std::uint64_t GetNormalizedIntensifierGain() override;
    std::uint64_t GetNormalizedIntensifierGainMin() override;
    std::uint64_t GetNormalizedIntensifierGainMax() override;
    std::uint16_t GetNormalizedIntensifierGaindBResolution() override;
    std::uint16_t GetNormalizedIntensifierGainSignificantFigures() override;
    std::uint32_t GetNormalizedIntensifierGaindB() override;
    std::int32_t GetNormalizedIntensifierGaindBMin() override;
    std::int32_t GetNormalizedIntensifierGaindBMax() override;
    std::uint32_t GetIntensifierGain() override;
    std::uint32_t GetIntensifierGainMin() override;
    std::uint32_t GetIntensifierGainMax() override;

    // Trigger delay, fan, modes, cooling (degrees C), sensor, serial number.
    std::uint32_t GetTriggerDelay() override;
    std::uint32_t GetTriggerDelayMin() override;
    std::uint32_t GetTriggerDelayMax() override;
    std::uint32_t GetFanSpeed() override;
    bool GetBlackoutMode() override;
    bool GetHighSensitivityMode() override;
    void GetSyncBModes(std::vector<std::uint32_t>& modes) override;
    void GetTriggerModes(std::vector<std::uint32_t>& modes) override;
    std::int32_t GetMinRegulatedCoolingTemp() override;
    std::int32_t GetMaxRegulatedCoolingTemp() override;
    std::uint32_t GetCCDModel() override;
    const char* GetCCDModelString() override;
    std::uint32_t GetExposureResolution() override;
    std::uint32_t GetTriggerDelayResolution() override;
    const char* GetSerialNumberString() override;
    bool GetRegulatedCoolingTemperatureLock() override;
    std::int32_t GetRegulatedCoolingTemperature() override;
    std::uint16_t GetCCDImageFormat() override;
    std::uint16_t GetRGBFilterStartColour() override;
    std::uint64_t GetUniqueID() override;
    std::uint16_t GetIntensifierModel() override;
    bool GetDoubleShotMode() override;

    // EM gain, dither, high gain, calibration, vertical clock (nanoseconds), close delay.
    std::uint32_t GetEMGain() override;
    std::uint32_t GetEMGainDefault() override;
    std::uint32_t GetEMGainMin() override;
    std::uint32_t GetEMGainMax() override;
    bool GetDitherMode() override;
    bool GetHighGainMode() override;
    bool GetDitherModeDefault() override;
    bool GetHighGainModeDefault() override;
    std::uint32_t GetChan1CalibrationGainDefault() override;
    std::uint32_t GetVClockPeriodDefault() override;
    std::uint32_t GetVClockPeriodMin() override;
    std::uint32_t GetVClockPeriodMax() override;
    std::uint32_t GetChan1CalibrationGain() override;
    std::uint32_t GetVClockPeriod() override;
    std::uint64_t GetDefaultExposure() override;
    std::uint32_t GetShutterCloseDelay() override;
    std::uint32_t GetShutterCloseDelayDefault() override;
    std::uint32_t GetShutterCloseDelayMin() override;
    std::uint32_t GetShutterCloseDelayMax() override;

    // Limits by mode, pixel properties.
    std::uint32_t GetROIMaxWidthForBinningMode(std::uint32_t mode) override;
    std::uint32_t GetROIMaxHeightForBinningMode(std::uint32_t mode) override;
    std::uint32_t GetROIMaxWidthForRTVMode() override;
    std::uint32_t GetROIMaxHeightForRTVMode() override;
    std::uint16_t GetPixelSize() override;
    std::uint16_t GetDistanceBetweenPixels() override;
    std::uint32_t GetFullWellCapacity() override;

    // Defaults of the analog tweak registers, readout port, OEM shutter delay.
    std::uint32_t GetSubCpDefAd() override;
    std::uint32_t GetResetVhDefAd() override;
    std::uint32_t GetV1VmDefAd() override;
    std::uint32_t GetV2VmDefAd() override;
    std::uint32_t GetV3VmDefAd() override;
    std::uint32_t GetV4VmDefAd() override;
    std::uint32_t GetMiscCtrlDefAd() override;
    std::uint16_t GetReadoutPort() override;
    std::uint32_t GetMetronaShutterDelay() override;

    // Setters: the host copy changes, then one quadlet goes to the camera.
    CameraResult SetROI(std::uint32_t x, std::uint32_t y, std::uint32_t width,
                        std::uint32_t height) override;
    CameraResult SetBigEndian(bool isBigEndian) override;
    CameraResult SetCompression(std::uint32_t compression) override;
    CameraResult SetReadoutFrequency(float megahertz) override;
    CameraResult SetBitDepth(std::uint32_t bits) override;
    CameraResult SetExposure(std::uint64_t nanoseconds) override;
    CameraResult SetGain(std::uint32_t gain) override;
    CameraResult SetNormalizedGain(std::uint32_t normGain) override;
    CameraResult SetNormalizedGaindB(std::int32_t gaindB) override;
    CameraResult SetNormalizedIntensifierGain(std::uint64_t normGain) override;
    CameraResult SetOffset(std::int32_t offset) override;
    CameraResult SetAbsoluteOffset(std::int32_t absoluteOffset) override;
    CameraResult SetCoolerStatus(bool isOn) override;
    CameraResult SetSymmetricalBinning(std::uint32_t mode) override;
    CameraResult SetVerticalBinning(std::uint32_t mode) override;
    CameraResult SetHorizontalBinning(std::uint32_t mode) override;
    CameraResult SetRTVMode(bool isOn) override;
    CameraResult SetRGBFilterCycle(bool isOn) override;
    CameraResult SetRGBFilterActive(bool isOn) override;
    CameraResult SetTriggerMode(std::uint32_t mode) override;
    CameraResult SetSyncBMode(std::uint32_t mode) override;
    CameraResult SetFanSpeed(std::uint32_t speed) override;
    CameraResult SetBlackoutMode(bool isOn) override;
    CameraResult SetHighSensitivityMode(bool isOn) override;
    CameraResult SetRegulatedCoolingTemp(std::int32_t celsius) override;
    CameraResult SetRGBFilterRedExposure(std::uint64_t nanoseconds) override;
    CameraResult SetRGBFilterBlueExposure(std::uint64_t nanoseconds) override;
    CameraResult SetRGBFilterStartColour(std::uint32_t colour) override;
    CameraResult SetShutterCloseDelay(std::uint32_t delay) override;
    CameraResult SetDoubleShotMode(bool isOn) override;
    CameraResult SoftwareTrigger() override;
    CameraResult SetReserved0(std::uint32_t selector, void* data, std::uint32_t quadlets,
                              std::uint32_t checksum) override;
    CameraResult SetChan1CalibrationGain(std::uint32_t gain) override;
    CameraResult SetDither(bool isOn) override;
    CameraResult SetHighGainMode(bool isOn) override;
    CameraResult SetVClockPeriod(std::uint32_t nanoseconds) override;
    CameraResult SetEMGain(std::uint32_t gain) override;
    CameraResult SetSubCpAd(std::uint32_t value) override;
    CameraResult SetSubAd(std::uint32_t value) override;
    CameraResult SetResetVhAd(std::uint32_t value) override;
    CameraResult SetV1VmAd(std::uint32_t value) override;
    CameraResult SetV2VmAd(std::uint32_t value) override;
    CameraResult SetV3VmAd(std::uint32_t value) override;
    CameraResult SetV4VmAd(std::uint32_t value) override;
    CameraResult SetMiscCtrlAd(std::uint32_t value) override;
    CameraResult SetReadoutPort(std::uint32_t port) override;
    CameraResult SetMetronaShutterDelay(std::uint32_t delay) override;

    // Capabilities. The spellings IsTriggerDelayAvialable and IsTweekingRegisterSupported are the
    // names that clients link to.
    bool IsCoolerAvailable() override;
    bool IsRegulatedCoolingAvailable() override;
    bool IsRGBFilterSupported() override;
    bool IsRTVModeSupported() override;
    bool IsFanControlAvailable() override;
    bool IsHighSensitivityModeAvailable() override;
    bool IsBlackoutModeAvailable() override;
    bool IsSymmetricalBinningSupported() override;
    bool IsVerticalBinningSupported() override;
    bool IsHorizontalBinningSupported() override;
    bool IsIntensifierAvailable() override;
    bool IsShutterCloseDelayAvailable() override;
    bool IsTriggerDelayAvialable() override;
    bool IsEMGainAvailable() override;
    bool IsDitherControlAvailable() override;
    bool IsHighGainModeAvailable() override;
    bool IsVClockControlAvailable() override;
    bool IsDualChannelSupported() override;
    bool IsSyncBSupported() override;
    bool IsDoubleShotSupported() override;
    bool IsTweekingRegisterSupported() override;
    bool IsReadoutPortSupported() override;
    bool IsMetronaShutterDelaySupported() override;

    // Control.
    CameraResult UpdateSettingsOnCamera() override;
    bool IsCameraStreaming() override;
    CameraResult GetOneImage(ZExImage** image) override;
    CameraResult StartStreamingImages(ImageCallback imageCallback,
                                      ExposeDoneCallback exposeDoneCallback, bool externalBuffers,
                                      void* refCon) override;
    CameraResult StopStreamingImages() override;
    CameraResult AddExternalImageBuffer(void* buffer) override;
    bool DoesSupportExternalBuffers() override;
    CameraResult ReallocateBandwidth(std::uint16_t payloadBytes) override;
    CameraResult ReadCameraInfo() override;

    // Added by this class, private to it and its models.
    virtual std::uint16_t GetHardwareProfile();
    virtual std::uint32_t GetVClockFrequencyResolution();
    virtual std::uint32_t GetAnalogBoardType() = 0;
    virtual std::uint32_t GetGainDACRange();
    virtual double GetNormalizedGaindBDR();
    virtual std::uint32_t GetNormalizedGaindBRes();
    virtual std::uint32_t GetGainOffsetDefault();
    virtual std::uint32_t GetMaxCCDWidthForBinningMode(std::uint32_t mode);
    virtual std::uint32_t GetMaxCCDHeightForBinningMode(std::uint32_t mode);
    virtual CameraResult SetPSN(std::uint32_t psn);
    virtual CameraResult SetMaxPacketSize(std::uint32_t payloadBytes);
    virtual CameraResult SetRGBFilterDelays(std::uint32_t delays);
    virtual CameraResult SetupNormalizedIntensifiedGain();
    virtual std::uint16_t CalculateRequiredPacketSize(std::uint16_t binning, std::uint16_t bitDepth,
                                                      float megahertz);
    virtual std::uint16_t CalculateRequiredPacketSize(bool clamp);

    // Operations without a slot.
    CameraResult SetROIX(std::uint32_t x);
    CameraResult SetROIY(std::uint32_t y);
    CameraResult SetROIWidth(std::uint32_t width);
    CameraResult SetROIHeight(std::uint32_t height);
    std::uint32_t GetSubDefAd();
    std::uint32_t GetEMGainDefaultWithFlip();
    CameraResult AdjustSettingsForMaxPacketSize(std::uint32_t binning, std::uint16_t bitDepth,
                                                float* megahertz);
    CameraResult StartImageStreamingRunLoop();
    void SetStreamingCallback(ImageCallback imageCallback, void* refCon);
    CameraResult IgnoreNextFrame();
    bool IsFrameValid(tStFrameInfo* frame);
    /// Stop step of a setter: stops a stream and leaves it to UpdateSettingsOnCamera to start it
    /// again.
    void TurnOffStreaming();

    // Register model.
    static std::uint32_t CalculateRegisterLength(const regVersionEntry* table,
                                                 std::uint32_t version);
    /// Reads a block's version at its address and then as many quadlets as its table has for this
    /// version; none for a version that the table does not know.
    CameraResult ReadRegisterSet(RegisterBlock& block);
    /// Makes the control copy anew from zeros and drives the camera to its default state.
    CameraResult SetupControlRegisters(RegisterBlock& block);
    /// Tests the configuration version that ReadCameraInfo met, not one read again later.
    bool CheckConfigRegVersion(std::uint32_t major, std::uint32_t minor);
    static bool CheckVersionAtLeast(std::uint32_t aMajor, std::uint32_t aMinor,
                                    std::uint32_t bMajor, std::uint32_t bMinor);
    CameraResult PrintOutControlRegisters();
    CameraResult SetupNormalizedGain();

    // Public for callbacks only.
    tStFrameInfo* PrivateGetNewFrame();
    tStFrameInfo* PrivatePeekNewFrame();
    void PrivateImageHasArrived();
    void PrivateImageHasTimedOut();
    void PrivateImageStreamingRunLoop();
    void PrivateRunExposeDoneCB();

    /// False when one of the camera's locks or conditions could not be made: a call would not know
    /// whether it holds it.
    bool HasSynchronisation() const;

    /// True while one of the camera's two threads lives: a close does not wait for ever for an
    /// exposure callback that lasts.
    bool HasLivingThreads() const {
        return streaming.runLoopsAlive.load(std::memory_order_acquire) != 0 ||
               streaming.exposeThreadsAlive.load(std::memory_order_acquire) != 0;
    }

    /// Ends what a close has left: wakes and joins the threads, lets the device go without a
    /// request. To be called before the object is deleted; waits for a client's callback to return.
    void EndWhatCloseLeft();

  protected:
    // Access to the host copies. A quadlet beyond a block's length reads 0. Fields: register_map.h.
    std::uint32_t ReadConfiguration(std::uint32_t quadlet) const;
    /// 0 below the version from which the field exists (by CheckConfigRegVersion).
    std::uint32_t ReadConfigurationField(const RegisterField& field) const;
    std::uint32_t ReadControl(std::uint32_t quadlet) const;
    std::uint32_t ReadControlField(const RegisterField& field) const;
    /// Changes the shadow alone; a quadlet beyond the block leaves it as it is.
    void StoreControl(std::uint32_t quadlet, std::uint32_t value);
    /// Writes one quadlet of the control block to the camera and leaves the shadow alone. Failures
    /// print HAL_ErrorMessage and are translated.
    CameraResult SendControl(std::uint32_t quadlet, std::uint32_t value);
    /// Changes the shadow and writes that quadlet to the camera; a quadlet beyond the block is
    /// written with `value` while the shadow stays. Failures as SendControl; the shadow is not
    /// rolled back.
    CameraResult WriteControl(std::uint32_t quadlet, std::uint32_t value);
    CameraResult WriteControlField(const RegisterField& field, std::uint32_t value);
    /// Write a register that decides the image's size or fields. A stream may run meanwhile, since
    /// not every model stops it and another client may start it: within a batch of settings what
    /// arrives before they are taken over is not taken for an image of the new geometry.
    CameraResult WriteGeometry(std::uint32_t quadlet, std::uint32_t value);
    CameraResult WriteGeometryField(const RegisterField& field, std::uint32_t value);
    /// Writes one quadlet of the command block; prints nothing.
    HALStatus WriteCommand(std::uint32_t quadlet, std::uint32_t value);
    /// Version words as last read, the major number in the upper half.
    std::uint32_t GetControlVersion() const { return registers.control.version; }
    std::uint32_t GetConfigurationVersion() const { return registers.configuration.version; }

    /// The device record is copied whole for each HAL call; what a call changed (connect,
    /// disconnect, reallocation) is stored back whole. Thread-safe.
    HALCamera GetHALCamera() const;
    void SetHALCamera(const HALCamera& newRecord);

    /// Speed and fastest packet of the present connection, 0 where not known.
    BusConnection ReadBusConnection();

    /// Takes or gives a lock; a failure prints HAL_ErrorMessage and is translated.
    static CameraResult TakeLock(HALSemaphore* lock);
    static CameraResult GiveLock(HALSemaphore* lock);
    /// What GetOneImage hands to its limited wait: five seconds and the exposures, in nanoseconds.
    std::uint64_t CalculateOneImageWait();
    /// Marks every frame of the queue, so that the run loop discards it. Under frameLock.
    void IgnoreFrameInfoVector();

    CameraRegisters registers;
    StreamingState streaming;
    GainModel gainModel;
    std::int32_t defaultGaindB = 0;

  private:
    struct SetupStep;
    static const SetupStep SetupSteps[];

    CameraResult SetupCamera() override;
    bool IsInterlaced() override;
    std::uint16_t GetMaxPacketSize() override;
    std::uint16_t GetTagCode() override;

    /// Stop step, then the field.
    CameraResult ChangeField(const RegisterField& field, std::uint32_t value);
    /// Whether a change has still to stop the stream first, or runs where that is done.
    enum class StopStep { Due, Done };
    static constexpr std::uint32_t ROIUnlimited = 0xFFFFFFFF;
    /// Changes one field of the ROI, cut down to `greatest`, unless `value` is in place.
    CameraResult ChangeROIField(const RegisterField& field, std::uint32_t value,
                                std::uint32_t greatest, StopStep stopStep);
    std::uint32_t GetGreatestROIWidth();
    std::uint32_t GetGreatestROIHeight();
    CameraResult WriteExposure(std::uint32_t quadlet, std::uint32_t lowQuadlet,
                               std::uint64_t nanoseconds, std::uint32_t microseconds);
    CameraResult WriteTweak(std::uint32_t quadlet, std::uint32_t value);
    CameraResult StopAndTakeStreamLock();
    CameraResult WriteBinning(std::uint32_t mode);
    void FitROIToBinning(std::uint32_t mode, std::uint32_t formerMode);
    /// True where the bus connection cannot carry full resolution at a fast readout.
    bool IsTooFastForBus(float megahertz, std::uint32_t binning);
    CameraResult LowerFrequencyForBus(float megahertz, std::uint32_t binning);
    std::uint16_t GetFastestPacketSize();
    CameraResult TakeOverSettings();
    HALStatus TakeOverGeometry();
    void AnnounceNewGeometry();
    CameraResult RefreshConfiguration();
    void RestartStreaming();

    void MakeSynchronisation();
    void DestroySynchronisation();
    void FreeFrames();

    HALStatus ReadQuadlet(std::uint32_t address, Relaxed<std::uint32_t>& value);
    HALStatus ReadBlock(RegisterBlock& block);
    HALStatus ReadVersion(RegisterBlock& block, std::uint32_t directoryQuadlet);
    CameraResult ApplyTweakDefaults();
    CameraResult RunSetupSteps();
    CameraResult ReadConfigurationBlock(void* data, std::uint32_t quadlets);
    CameraResult WriteConfigurationBlock(void* data, std::uint32_t quadlets,
                                         std::uint32_t checksum);

    HALStatus StartRunLoop();
    void StartExposeDoneThread();
    void EndThreads();
    void CleanUpThreads();
    HALStatus WakeRunLoop();
    void WaitForRunLoopEnd();
    void WaitForExposeDoneEnd();
    HALStatus WaitForCloseOfRunLoop();
    HALStatus Disconnect();
    /// Null callbacks stay as they are. `hasStarted` tells a start from a stream that ran already,
    /// whose callbacks are left alone.
    CameraResult StartStream(const StreamCallbacks* newCallbacks, bool externalBuffers,
                             bool* hasStarted);
    CameraResult StartUnderStreamLock(const StreamCallbacks* newCallbacks, bool externalBuffers);
    CameraResult StopUnderSwitchMutex();
    void ClearFrameInfoVector();

    /// Null when the frame is refused.
    tStFrameInfo* MakeHeldFrame();
    bool DropSurplusFrame();
    bool ProvideBuffer(tStFrameInfo& frame);
    bool DescribeFrame(tStFrameInfo& frame);
    bool PushHeldFrame(tStFrameInfo& frame);
    std::uint64_t CalculateFrameBytes();
    bool IsGeometryInForce(const tStFrameInfo& frame) const;

    void ServeNextWake();
    tStFrameInfo* TakeOldestFrame();
    void ServeFrame(tStFrameInfo* frame);
    void DiscardFrame(tStFrameInfo* frame);
    ZExImage* MakeImage(tStFrameInfo& frame);
    std::uint32_t ChooseImageFormat(std::uint32_t bitDepth);
    void DeliverImage(ZExImage* image);
    void RunExposeThread(std::uint32_t number);
    void ServeExposeDone();
    void RunShielded(void (MorvaneFWCamera::*step)());

    HALStatus ForgetOneImage();
    void DropOneImage(ZExImage* next);
    ZExImage* ClaimOneImage();
    CameraResult AwaitOneImage();
    static void* TakeOneImage(ZImageReceivedCallbackStruct* record);

    mutable std::mutex recordMutex;
    HALCamera halCamera{};  // guarded by recordMutex
    bool shouldDeleteHALCamera = true;
};

}  // namespace ZV
