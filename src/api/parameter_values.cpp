#include "api/parameter_values.h"

#include <algorithm>
#include <optional>

#include "api/settings_units.h"
#include "imaging/image_formats.h"

namespace ZV {

namespace {

constexpr std::uint32_t ByteBitDepth = 8;
constexpr std::uint32_t WordMax = 0xFFFFFFFF;

bool IsDeep(ZCamera& camera) {
    return camera.GetMaxBitDepth() > ByteBitDepth;
}

std::uint32_t TruncateToMillionths(double factor) {
    const double millionths = factor * 1000000.0;
    if (!(millionths > 0.0)) return 0;
    if (millionths >= 4294967295.0) return WordMax;
    return static_cast<std::uint32_t>(millionths);
}

std::vector<std::uint32_t> GetSyncBModes(ZCamera& camera) {
    std::vector<std::uint32_t> modes;
    camera.GetSyncBModes(modes);
    return modes;
}

struct FormatRow {
    std::uint32_t format;
    bool needsDepth;  ///< Listed only by a camera of more than 8 bits.
};

void AddFormats(ZCamera& camera, std::span<const FormatRow> rows,
                std::vector<std::uint32_t>& values) {
    for (const FormatRow& row : rows) {
        if (!row.needsDepth || IsDeep(camera)) values.push_back(row.format);
    }
}

constexpr std::array PlainFormats{
    FormatRow{zfmtRaw8, false},
    FormatRow{zfmtRaw16, true},
    FormatRow{zfmtMono8, false},
    FormatRow{zfmtMono16, true},
};

// Kept: listed without regard to the depth.
constexpr std::array WheelFormats{
    FormatRow{zfmtRGBPlane8, false}, FormatRow{zfmtRGBPlane16, false}, FormatRow{zfmtBGR24, false},
    FormatRow{zfmtXRGB32, false},    FormatRow{zfmtRGB48, false},      FormatRow{zfmtBGRX32, false},
    FormatRow{zfmtRGB24, false},
};

// Kept: also the formats of a monochrome camera without a wheel, and without regard to the depth.
constexpr std::array MosaicFormats{FormatRow{zfmtBayer8, false}, FormatRow{zfmtBayer16, false}};

constexpr std::array BayerOutputFormats{
    FormatRow{zfmtBayer8, false}, FormatRow{zfmtBayer16, true}, FormatRow{zfmtBGR24, false},
    FormatRow{zfmtXRGB32, false}, FormatRow{zfmtRGB48, true},   FormatRow{zfmtBGRX32, false},
    FormatRow{zfmtRGB24, false},
};

constexpr std::array WheelOutputFormats{
    FormatRow{zfmtRGBPlane8, false}, FormatRow{zfmtRGBPlane16, true}, FormatRow{zfmtBGR24, false},
    FormatRow{zfmtXRGB32, false},    FormatRow{zfmtRGB48, true},      FormatRow{zfmtBGRX32, false},
    FormatRow{zfmtRGB24, false},
};

bool HasWheel(ZCamera& camera) {
    return camera.GetCCDImageFormat() == CameraMono && camera.IsRGBFilterSupported();
}

}  // namespace

const char* FindValueName(std::span<const ValueName> names, std::uint32_t value) {
    const auto found =
        std::find_if(names.begin(), names.end(),
                     [value](const ValueName& candidate) { return candidate.value == value; });
    return found != names.end() ? found->name : "Unknown";
}

std::uint32_t ReadGain(const SettingsSource& source) {
    return source.camera.ConvertNormGaindBToGain(source.camera.GetNormalizedGaindB());
}

std::uint32_t ReadOffset(const SettingsSource& source) {
    return source.camera.ConvertAbsoluteOffsetToOffset(source.camera.GetAbsoluteOffset());
}

std::uint32_t ReadReadoutSpeed(const SettingsSource& source) {
    return ConvertMegahertzToSpeedIndex(source.camera.GetReadoutFrequency());
}

std::uint32_t ReadPostProcessing(const SettingsSource& source) {
    return source.context.postProcessing;
}

std::uint32_t ReadBayerAlgorithm(const SettingsSource& source) {
    return source.context.bayerFilter->GetAlgorithm();
}

std::uint32_t ReadBayerOutputFormat(const SettingsSource& source) {
    return source.context.bayerFilter->GetOutputFormat();
}

std::uint32_t GetDefaultReadoutSpeed(const SettingsSource& source) {
    return ConvertMegahertzToSpeedIndex(source.camera.GetReadoutFrequencyDefault());
}

// Kept: the depth is the present one, so the defaults of a camera at 16 bits keep it there.
std::uint32_t GetDefaultImageFormat(const SettingsSource& source) {
    const bool isByteDeep = source.camera.GetBitDepth() == ByteBitDepth;
    switch (source.camera.GetCCDImageFormat()) {
        case CameraMono:
            return isByteDeep ? zfmtMono8 : zfmtMono16;
        case CameraBayer:
            return isByteDeep ? zfmtBayer8 : zfmtBayer16;
        default:
            return 0;
    }
}

std::uint32_t GetDefaultBayerAlgorithm(const SettingsSource& source) {
    switch (source.camera.GetCCDImageFormat()) {
        case CameraMono:
            return zbayerAverage;
        case CameraBayer:
            return zbayerBicubicFaster;
        default:
            return 0;
    }
}

std::uint32_t GetDefaultOutputFormat(const SettingsSource& source) {
    switch (source.camera.GetCCDImageFormat()) {
        case CameraMono:
            return zfmtMono8;
        case CameraBayer:
            return zfmtRGB24;
        default:
            return 0;
    }
}

std::uint32_t GetDefaultIntensifierGain(const SettingsSource& source) {
    return source.camera.IsIntensifierAvailable() ? source.camera.GetIntensifierGainMin() : 0;
}

std::uint64_t GetDefaultNormalizedIntensifierGain(const SettingsSource& source) {
    return source.camera.IsIntensifierAvailable() ? source.camera.GetNormalizedIntensifierGainMin()
                                                  : 0;
}

std::int32_t GetDefaultGaindB(const SettingsSource& source) {
    constexpr std::uint32_t UnityGain = 1000000;
    return source.camera.ConvertNormGainToNormGaindB(UnityGain);
}

bool IsSecondRevision(ZCamera& camera) {
    return camera.GetHardwareVersion() >= 2;
}

std::optional<std::uint32_t> GetFirstReadoutSpeed(ZCamera& camera) {
    std::vector<float> modes;
    camera.GetReadoutFrequencyModes(modes);
    if (modes.empty()) return std::nullopt;
    return ConvertMegahertzToSpeedIndex(modes.front());
}

std::optional<std::uint32_t> GetLastColumn(ZCamera& camera) {
    return camera.GetCCDWidth() - 1;
}

std::optional<std::uint32_t> GetLastRow(ZCamera& camera) {
    return camera.GetCCDHeight() - 1;
}

std::optional<std::uint32_t> GetFirstSyncBMode(ZCamera& camera) {
    const std::vector<std::uint32_t> modes = GetSyncBModes(camera);
    return modes.empty() ? std::nullopt : std::optional(modes.front());
}

std::optional<std::uint32_t> GetLastSyncBMode(ZCamera& camera) {
    const std::vector<std::uint32_t> modes = GetSyncBModes(camera);
    return modes.empty() ? std::nullopt : std::optional(modes.back());
}

std::optional<std::uint32_t> GetLeastNormalizedGain(ZCamera& camera) {
    return TruncateToMillionths(camera.GetNormalizedGainMin());
}

std::optional<std::uint32_t> GetGreatestNormalizedGain(ZCamera& camera) {
    return TruncateToMillionths(camera.GetNormalizedGainMax());
}

/// From the camera's last mode to its first; a frequency without a speed index is skipped.
void ListReadoutSpeeds(ZCamera& camera, std::vector<std::uint32_t>& values) {
    std::vector<float> modes;
    camera.GetReadoutFrequencyModes(modes);
    for (auto mode = modes.rbegin(); mode != modes.rend(); ++mode) {
        const std::optional<std::uint32_t> index = FindSpeedIndex(*mode);
        if (index) values.push_back(*index);
    }
}

void ListImageFormats(ZCamera& camera, std::vector<std::uint32_t>& values) {
    AddFormats(camera, PlainFormats, values);
    if (HasWheel(camera)) {
        AddFormats(camera, WheelFormats, values);
    } else {
        AddFormats(camera, MosaicFormats, values);
    }
}

void ListCameraModes(ZCamera& camera, std::vector<std::uint32_t>& values) {
    values.push_back(zmodeStandard);
    if (camera.IsRTVModeSupported()) values.push_back(zmodeRealTimeVideo);
}

void ListPostProcessFormats(ZCamera& camera, std::vector<std::uint32_t>& values) {
    AddFormats(camera, PlainFormats, values);
    if (camera.GetCCDImageFormat() == CameraBayer) {
        AddFormats(camera, BayerOutputFormats, values);
    } else if (HasWheel(camera)) {
        AddFormats(camera, WheelOutputFormats, values);
    }
}

}  // namespace ZV
