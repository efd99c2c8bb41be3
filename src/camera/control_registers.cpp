#include <cstdio>
#include <memory>
#include <new>
#include <numeric>

#include "camera/morvane_fw_camera.h"
#include "imaging/image_pipeline.h"

namespace ZV {

namespace {

constexpr std::uint32_t UnityNormalizedGain = 1000000;
constexpr std::uint32_t StartBitDepth = 8;
constexpr std::uint64_t StartRedExposureNs = 28100000;
constexpr std::uint64_t StartBlueExposureNs = 34900000;
constexpr std::uint32_t FanSpeedFull = 4;
constexpr std::uint32_t SubDefaultDivisor = 1000;

// SetReserved0.
constexpr std::uint32_t SelectorRead = 2;
constexpr std::uint32_t SelectorWrite = 3;
constexpr std::uint32_t WholeWriteQuadlets = 151;
constexpr std::uint32_t FirstPartQuadlets = 80;

}  // namespace

std::uint32_t MorvaneFWCamera::CalculateRegisterLength(const regVersionEntry* table,
                                                       std::uint32_t version) {
    for (; table->major != 0 && table->minor != 0; ++table) {
        if (MakeVersion(table->major, table->minor) == version) return table->length;
    }
    return 0;
}

HALStatus MorvaneFWCamera::ReadQuadlet(std::uint32_t address, Relaxed<std::uint32_t>& value) {
    HALCamera record = GetHALCamera();
    std::uint32_t read = 0;
    const HALStatus status = HAL_CameraReadData(&record, address, &read, 1);
    if (status == HALOk) value = read;
    return status;
}

HALStatus MorvaneFWCamera::ReadBlock(RegisterBlock& block) {
    HALStatus status = ReadQuadlet(block.address, block.version);
    if (status != HALOk) return status;
    const std::uint32_t length = CalculateRegisterLength(block.table, block.version);
    const std::unique_ptr<std::uint32_t[]> quadlets(new (std::nothrow) std::uint32_t[length]());
    RegisterCopy* copy = block.Provide(length);
    if (quadlets == nullptr || copy == nullptr) return HALReadFailed;
    // An unknown version has a length of 0; the read of no quadlets goes out all the same.
    HALCamera record = GetHALCamera();
    status = HAL_CameraReadData(&record, block.address, quadlets.get(), length);
    if (status != HALOk) return status;
    for (std::uint32_t quadlet = 0; quadlet < length; ++quadlet) {
        copy->Store(quadlet, quadlets[quadlet]);
    }
    return HALOk;
}

CameraResult MorvaneFWCamera::ReadRegisterSet(RegisterBlock& block) {
    const HALStatus status = ReadBlock(block);
    return status == HALOk ? CameraOk : TranslateHalStatus(status);
}

/// Takes the block's address from the directory and reads the block's version.
HALStatus MorvaneFWCamera::ReadVersion(RegisterBlock& block, std::uint32_t directoryQuadlet) {
    block.address = registers.directory.Read(directoryQuadlet);
    return ReadQuadlet(block.address, block.version);
}

CameraResult MorvaneFWCamera::ReadCameraInfo() {
    registers.directory.address = m_registersAddress;
    CameraResult result = ReadRegisterSet(registers.directory);
    if (result != CameraOk) return result;

    registers.configuration.address = registers.directory.Read(DirectoryConfiguration);
    result = ReadRegisterSet(registers.configuration);
    if (result != CameraOk) return result;
    registers.configuration.KeepVersionNumbers();

    HALStatus status = ReadVersion(registers.stream, DirectoryStream);
    if (status == HALOk) status = ReadVersion(registers.command, DirectoryCommand);
    // The control block itself is never read: SetupControlRegisters builds it.
    if (status == HALOk) status = ReadVersion(registers.control, DirectoryControl);
    if (status != HALOk) return ReportHalStatus(status);
    registers.control.KeepVersionNumbers();

    // Kept: the version of the status block is read by itself and once more with the block.
    status = ReadVersion(registers.status, DirectoryStatus);
    if (status == HALOk) status = ReadBlock(registers.status);
    if (status != HALOk) return ReportHalStatus(status);
    registers.status.KeepVersionNumbers();
    return CameraOk;
}

bool MorvaneFWCamera::CheckConfigRegVersion(std::uint32_t major, std::uint32_t minor) {
    return CheckVersionAtLeast(registers.configuration.major, registers.configuration.minor, major,
                               minor);
}

bool MorvaneFWCamera::CheckVersionAtLeast(std::uint32_t aMajor, std::uint32_t aMinor,
                                          std::uint32_t bMajor, std::uint32_t bMinor) {
    return aMajor != bMajor ? aMajor > bMajor : aMinor >= bMinor;
}

/// One row of the default state. Without a condition a step always runs.
struct MorvaneFWCamera::SetupStep {
    bool (MorvaneFWCamera::*isWanted)();
    CameraResult (*run)(MorvaneFWCamera&);
};

/// The shadow starts as zeros and setters skip what is in place, so that the ROI and the binning
/// mode are first set to something else: that way their defaults really reach the camera.
const MorvaneFWCamera::SetupStep MorvaneFWCamera::SetupSteps[] = {
    {nullptr, [](MorvaneFWCamera& camera) { return camera.SetPSN(camera.GetHALCamera().index); }},
    {nullptr, [](MorvaneFWCamera& camera) { return camera.SetCompression(0); }},
    {nullptr,
     [](MorvaneFWCamera& camera) {
         return camera.SetReadoutFrequency(camera.GetReadoutFrequencyDefault());
     }},
    {nullptr, [](MorvaneFWCamera& camera) { return camera.SetBitDepth(StartBitDepth); }},
    {nullptr,
     [](MorvaneFWCamera& camera) { return camera.SetNormalizedGain(UnityNormalizedGain); }},
    {nullptr, [](MorvaneFWCamera& camera) { return camera.SetAbsoluteOffset(0); }},
    {nullptr, [](MorvaneFWCamera& camera) { return camera.SetTriggerMode(0); }},
    {nullptr, [](MorvaneFWCamera& camera) { return camera.SetROIX(1); }},
    {nullptr, [](MorvaneFWCamera& camera) { return camera.SetROIY(1); }},
    {nullptr, [](MorvaneFWCamera& camera) { return camera.SetROIHeight(1); }},
    {nullptr, [](MorvaneFWCamera& camera) { return camera.SetROIWidth(1); }},
    {nullptr, [](MorvaneFWCamera& camera) { return camera.SetROIX(0); }},
    {nullptr, [](MorvaneFWCamera& camera) { return camera.SetROIY(0); }},
    {nullptr, [](MorvaneFWCamera& camera) { return camera.SetROIHeight(camera.GetCCDHeight()); }},
    {nullptr, [](MorvaneFWCamera& camera) { return camera.SetROIWidth(camera.GetCCDWidth()); }},
    {nullptr,
     [](MorvaneFWCamera& camera) { return camera.SetExposure(camera.GetDefaultExposure()); }},
    {nullptr,
     [](MorvaneFWCamera& camera) {
         return camera.SetRGBFilterDelays(camera.ReadConfiguration(ConfigFilterDelays));
     }},
    {nullptr, [](MorvaneFWCamera& camera) { return camera.SetRGBFilterStartColour(0); }},
    {nullptr,
     [](MorvaneFWCamera& camera) { return camera.SetRGBFilterRedExposure(StartRedExposureNs); }},
    {nullptr,
     [](MorvaneFWCamera& camera) { return camera.SetRGBFilterBlueExposure(StartBlueExposureNs); }},
    {nullptr, [](MorvaneFWCamera& camera) { return camera.SetSymmetricalBinning(2); }},
    {nullptr, [](MorvaneFWCamera& camera) { return camera.SetSymmetricalBinning(1); }},
    {&MorvaneFWCamera::IsHorizontalBinningSupported,
     [](MorvaneFWCamera& camera) { return camera.SetHorizontalBinning(1); }},
    {&MorvaneFWCamera::IsVerticalBinningSupported,
     [](MorvaneFWCamera& camera) { return camera.SetVerticalBinning(1); }},
    {&MorvaneFWCamera::IsRTVModeSupported,
     [](MorvaneFWCamera& camera) { return camera.SetRTVMode(false); }},
    {&MorvaneFWCamera::IsVClockControlAvailable,
     [](MorvaneFWCamera& camera) {
         return camera.SetVClockPeriod(camera.GetVClockPeriodDefault());
     }},
    {&MorvaneFWCamera::IsSyncBSupported,
     [](MorvaneFWCamera& camera) { return camera.SetSyncBMode(1); }},
    {&MorvaneFWCamera::IsEMGainAvailable,
     [](MorvaneFWCamera& camera) { return camera.SetEMGain(camera.GetEMGainDefault()); }},
    {&MorvaneFWCamera::IsIntensifierAvailable,
     [](MorvaneFWCamera& camera) {
         return camera.SetNormalizedIntensifierGain(camera.GetNormalizedIntensifierGainMin());
     }},
    {&MorvaneFWCamera::IsFanControlAvailable,
     [](MorvaneFWCamera& camera) { return camera.SetFanSpeed(FanSpeedFull); }},
    {&MorvaneFWCamera::IsRGBFilterSupported,
     [](MorvaneFWCamera& camera) { return camera.SetRGBFilterActive(true); }},
    {&MorvaneFWCamera::IsShutterCloseDelayAvailable,
     [](MorvaneFWCamera& camera) {
         return camera.SetShutterCloseDelay(camera.GetShutterCloseDelayDefault());
     }},
    {&MorvaneFWCamera::IsRegulatedCoolingAvailable,
     [](MorvaneFWCamera& camera) {
         return camera.SetRegulatedCoolingTemp(camera.GetMinRegulatedCoolingTemp());
     }},
    {&MorvaneFWCamera::IsCoolerAvailable,
     [](MorvaneFWCamera& camera) { return camera.SetCoolerStatus(true); }},
    {&MorvaneFWCamera::IsTweekingRegisterSupported,
     [](MorvaneFWCamera& camera) {
         // Kept: no failure of these ends the setup.
         (void)camera.SetSubCpAd(camera.GetSubCpDefAd());
         (void)camera.SetSubAd(camera.GetSubDefAd() / SubDefaultDivisor);
         (void)camera.SetResetVhAd(camera.GetResetVhDefAd());
         (void)camera.SetV1VmAd(camera.GetV1VmDefAd());
         (void)camera.SetV2VmAd(camera.GetV2VmDefAd());
         (void)camera.SetV3VmAd(camera.GetV3VmDefAd());
         (void)camera.SetV4VmAd(camera.GetV4VmDefAd());
         return CameraOk;
     }},
    {&MorvaneFWCamera::IsMetronaShutterDelaySupported,
     [](MorvaneFWCamera& camera) { return camera.SetMetronaShutterDelay(1); }},
    {&MorvaneFWCamera::IsMetronaShutterDelaySupported,
     [](MorvaneFWCamera& camera) { return camera.SetMetronaShutterDelay(0); }},
};

CameraResult MorvaneFWCamera::SetupControlRegisters(RegisterBlock& block) {
    const HALStatus status = ReadQuadlet(block.address, block.version);
    if (status != HALOk) return ReportHalStatus(status);
    RegisterCopy* shadow = block.Provide(CalculateRegisterLength(block.table, block.version));
    if (shadow == nullptr) return CameraHalFault;
    shadow->StoreZeros();

    CameraResult result = CameraOk;
    if (IsTweekingRegisterSupported()) result = ApplyTweakDefaults();
    if (result == CameraOk) result = RunSetupSteps();
    if (result != CameraOk) return result;
    streaming.bigEndian = false;
    (void)SetBigEndian(false);  // kept: a failure here does not fail the setup
    return UpdateSettingsOnCamera();
}

/// MiscCtrl changes what the camera reports, so that the configuration is read again behind it.
CameraResult MorvaneFWCamera::ApplyTweakDefaults() {
    CameraResult result = SetROIX(1);
    if (result == CameraOk) result = SetROIY(1);
    if (result == CameraOk) result = SetROIHeight(1);
    if (result == CameraOk) result = SetROIWidth(1);
    if (result == CameraOk) result = SetMiscCtrlAd(GetMiscCtrlDefAd());
    if (result != CameraOk) return result;
    const HALStatus status = WriteCommand(CommandTakeOver, 1);
    if (status != HALOk) return ReportHalStatus(status);
    return ReadRegisterSet(registers.configuration);
}

CameraResult MorvaneFWCamera::RunSetupSteps() {
    for (const SetupStep& step : SetupSteps) {
        if (step.isWanted != nullptr && !(this->*step.isWanted)()) continue;
        const CameraResult result = step.run(*this);
        if (result != CameraOk) return result;
    }
    return CameraOk;
}

CameraResult MorvaneFWCamera::SetupCamera() {
    CameraResult result = SetupNormalizedGain();
    if (result == CameraGainModelDeferred) return CameraOk;
    if (result == CameraOk) result = SetupNormalizedIntensifiedGain();
    if (result == CameraOk) result = SetupControlRegisters(registers.control);
    if (result != CameraOk) return result;
    if (imagePipeline != nullptr) imagePipeline->Setup(GetCCDWidth(), GetCCDHeight());
    return CameraOk;
}

CameraResult MorvaneFWCamera::PrintOutControlRegisters() {
    const std::uint32_t length =
        CalculateRegisterLength(registers.control.table, registers.control.version);
    std::printf("---\n");
    std::printf("Length in control registers: %d\n", static_cast<int>(length));
    std::printf("Control registers: ");
    for (std::uint32_t quadlet = 0; quadlet < length; ++quadlet) {
        std::printf("%08x ", ReadControl(quadlet));
    }
    std::printf("\n");
    return CameraOk;
}

CameraResult MorvaneFWCamera::SetReserved0(std::uint32_t selector, void* data,
                                           std::uint32_t quadlets, std::uint32_t checksum) {
    if (selector == SelectorRead) return ReadConfigurationBlock(data, quadlets);
    if (selector == SelectorWrite) return WriteConfigurationBlock(data, quadlets, checksum);
    return CameraRefused;
}

CameraResult MorvaneFWCamera::ReadConfigurationBlock(void* data, std::uint32_t quadlets) {
    HALCamera record = GetHALCamera();
    const HALStatus status = HAL_CameraReadData(&record, registers.configuration.address,
                                                static_cast<std::uint32_t*>(data), quadlets);
    return status == HALOk ? CameraOk : ReportHalStatus(status);
}

CameraResult MorvaneFWCamera::WriteConfigurationBlock(void* data, std::uint32_t quadlets,
                                                      std::uint32_t checksum) {
    const auto* words = static_cast<const std::uint32_t*>(data);
    if (words != nullptr) {
        const std::uint32_t sum = std::accumulate(
            words, words + quadlets, 0u,
            [](std::uint32_t sumSoFar, std::uint32_t word) { return sumSoFar + ~word; });
        if (sum != checksum) return CameraRefused;
    }
    HALCamera record = GetHALCamera();
    const std::uint32_t address = registers.configuration.address;
    const bool isWhole = words == nullptr || quadlets <= WholeWriteQuadlets;
    HALStatus status = HAL_CameraWriteData(&record, address, words,  //
                                           isWhole ? quadlets : FirstPartQuadlets);
    if (status == HALOk && !isWhole) {
        // Kept: quadlets 80 to 150 of the block are never written this way.
        status = HAL_CameraWriteData(&record, address + 4 * WholeWriteQuadlets,
                                     words + WholeWriteQuadlets, quadlets - WholeWriteQuadlets);
    }
    return status == HALOk ? CameraOk : ReportHalStatus(status);
}

}  // namespace ZV
