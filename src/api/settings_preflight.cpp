// Mends a settings block so that it fits the camera. Each step changes the block in place and says
// in the log what it changed.

#include <cstdint>

#include "api/exported_call.h"
#include "api/format_sets.h"
#include "api/handles.h"
#include "api/settings_block.h"
#include "api/settings_change.h"
#include "camera/camera.h"
#include "diagnostics/log.h"
#include "imaging/image_formats.h"
#include "zentara/zentara.h"

namespace ZV {

namespace {

struct Preflight {
    const char* function;
    ZentaraHandle handle;
    ZCamera& camera;
    Zentara_Settings& settings;

    [[nodiscard]] std::uint32_t Get(std::uint32_t key) const {
        return GetSettingsWord(settings, key);
    }
};

/// A line of the region of interest, along x or y.
struct RegionLine {
    std::uint32_t startKey;
    std::uint32_t lengthKey;
    const char* startMessage;
    const char* lengthMessage;
};

constexpr RegionLine Columns{zprmRoiX, zprmRoiWidth, "Roi X is now %d", "Roi Width is now %d"};
constexpr RegionLine Rows{zprmRoiY, zprmRoiHeight, "Roi Y is now %d", "Roi Height is now %d"};

void ChangeWord(const Preflight& preflight, std::uint32_t key, std::uint32_t value,
                const char* message) {
    SetSettingsWord(preflight.settings, key, value);
    ZLogMessage(preflight.function, message, value);
}

void CapReadoutSpeed(const Preflight& preflight) {
    if (preflight.camera.GetStreamingVersion() != 0) return;
    if (preflight.Get(zprmReadoutSpeed) != zspeed20MHz) return;
    if (!Holds(DeepFormats, preflight.Get(zprmImageFormat))) return;
    SetSettingsWord(preflight.settings, zprmReadoutSpeed, zspeed10MHz);
    ZLogMessage(preflight.function, "Readout speed is now 10MHz");
}

void AlignLine(const Preflight& preflight, const RegionLine& line) {
    const std::uint32_t start = preflight.Get(line.startKey);
    if (start % 2 != 0) ChangeWord(preflight, line.startKey, start - 1, line.startMessage);
}

void AlignLength(const Preflight& preflight, const RegionLine& line) {
    constexpr std::uint32_t LeastLength = 2;
    const std::uint32_t length = preflight.Get(line.lengthKey);
    if (length % 2 == 0) return;
    const std::uint32_t aligned = length == 1 ? LeastLength : length - 1;
    ChangeWord(preflight, line.lengthKey, aligned, line.lengthMessage);
}

void AlignToMosaic(const Preflight& preflight) {
    if (preflight.camera.GetCCDImageFormat() != CameraBayer) return;
    AlignLine(preflight, Columns);
    AlignLine(preflight, Rows);
    AlignLength(preflight, Columns);
    AlignLength(preflight, Rows);
}

void SetLength(const Preflight& preflight, const RegionLine& line, std::uint32_t length) {
    if (preflight.Get(line.lengthKey) == length) return;
    ChangeWord(preflight, line.lengthKey, length, line.lengthMessage);
}

// Kept: a client's own region is given up only on the way into the mode.
void FitToRealTimeVideo(const Preflight& preflight) {
    if (preflight.Get(zprmCameraMode) != zmodeRealTimeVideo) return;
    for (const std::uint32_t key : {zprmBinning, zprmHorizontalBinning, zprmVerticalBinning}) {
        SetSettingsWord(preflight.settings, key, 1);
    }
    if (preflight.camera.GetRTVMode()) return;
    SetLength(preflight, Columns, preflight.camera.GetROIMaxWidthForRTVMode());
    SetLength(preflight, Rows, preflight.camera.GetROIMaxHeightForRTVMode());
}

// A start at the very limit passes and leaves a length of 0.
void LimitLine(const Preflight& preflight, const RegionLine& line, std::uint32_t limit) {
    if (preflight.Get(line.startKey) > limit) {
        ChangeWord(preflight, line.startKey, 0, line.startMessage);
    }
    const std::uint32_t start = preflight.Get(line.startKey);
    const std::uint64_t end = std::uint64_t{preflight.Get(line.lengthKey)} + start;
    if (end > limit) ChangeWord(preflight, line.lengthKey, limit - start, line.lengthMessage);
}

std::uint32_t GetVerticalBinning(const Preflight& preflight) {
    return preflight.Get(preflight.camera.IsVerticalBinningSupported() ? zprmVerticalBinning
                                                                       : zprmBinning);
}

std::uint32_t GetHorizontalBinning(const Preflight& preflight) {
    return preflight.Get(preflight.camera.IsHorizontalBinningSupported() ? zprmHorizontalBinning
                                                                         : zprmBinning);
}

/// The limits of the standard mode are those that the camera shows while it is in that mode.
///
/// Kept: for that it really leaves real-time video and enters it again, which ends with the region
/// at the mode's maximum and stops a stream. The results are dropped, as everywhere with this mode.
void LimitRegion(const Preflight& preflight) {
    ZCamera& camera = preflight.camera;
    std::uint32_t verticalBinning = GetVerticalBinning(preflight);
    const std::uint32_t horizontalBinning = GetHorizontalBinning(preflight);
    const bool leavesMode = preflight.Get(zprmCameraMode) == zmodeStandard && camera.GetRTVMode();
    if (leavesMode) {
        (void)camera.SetRTVMode(false);
        verticalBinning = camera.GetVerticalBinningMode();
    }
    LimitLine(preflight, Rows, camera.GetROIMaxHeightForBinningMode(verticalBinning));
    LimitLine(preflight, Columns, camera.GetROIMaxWidthForBinningMode(horizontalBinning));
    if (leavesMode) (void)camera.SetRTVMode(true);
}

/// Kept: the microsecond word of the exposure is not brought into line.
ZentaraResult LimitExposure(const Preflight& preflight, std::uint32_t key, const char* message) {
    std::uint64_t least = 0;
    ZentaraResult result = Zentara_GetParam64Min(&preflight.settings, key, &least);
    if (result != zerrNone) return result;
    std::uint64_t greatest = 0;
    result = Zentara_GetParam64Max(&preflight.settings, key, &greatest);
    if (result != zerrNone) return result;
    const std::uint64_t exposure = GetSettingsWide(preflight.settings, key);
    if (exposure >= least && exposure <= greatest) return zerrNone;
    const std::uint64_t mended = exposure < least ? least : greatest;
    SetSettingsWide(preflight.settings, key, mended);
    ZLogMessage(preflight.function, message, mended);
    return zerrNone;
}

struct FilterExposure {
    std::uint32_t key;
    const char* message;
};

constexpr FilterExposure FilterExposures[] = {
    {zprm64ExposureRed, "Red Exposure is now %l"},
    {zprm64ExposureBlue, "Blue Exposure is now %l"},
};

ZentaraResult LimitExposures(const Preflight& preflight) {
    ZentaraResult result = LimitExposure(preflight, zprm64Exposure, "Exposure is now %l");
    if (result != zerrNone) return result;
    for (const FilterExposure& filter : FilterExposures) {
        if (Zentara_IsParam64Supported(preflight.handle, filter.key) != zerrNone) continue;
        result = LimitExposure(preflight, filter.key, filter.message);
        if (result != zerrNone) return result;
    }
    return zerrNone;
}

ZentaraResult PreflightSettings(const char* function, ZentaraHandle handle,
                                Zentara_Settings* settings) {
    if (!ZCamera::IsInitalized()) return zerrNotLoaded;
    if (handle == 0) return zerrBadHandle;
    if (settings == nullptr) return zerrBadParameter;
    ZCamera* const camera = FindCamera(handle);
    if (!HasExclusiveAccess(function, camera)) return zerrBadHandle;
    const Preflight preflight{function, handle, *camera, *settings};
    const SettingsChange change(*camera);
    CapReadoutSpeed(preflight);
    AlignToMosaic(preflight);
    FitToRealTimeVideo(preflight);
    LimitRegion(preflight);
    return LimitExposures(preflight);
}

}  // namespace

}  // namespace ZV

ZentaraResult Zentara_PreflightSettings(ZentaraHandle handle, Zentara_Settings* settings) {
    return ZV::Traced(__func__, [&](const char* function) {
        return ZV::PreflightSettings(function, handle, settings);
    });
}
