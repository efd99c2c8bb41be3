#pragma once

#include <array>
#include <cstdint>
#include <optional>
#include <vector>

#include "api/parameter_table.h"
#include "imaging/image_format_labels.h"
#include "zentara/zentara.h"

namespace ZV {

/// Names of the enumerated values.
inline constexpr std::array SpeedNames{
    ValueName{zspeed20MHz, "20 MHz"}, ValueName{zspeed10MHz, "10 MHz"},
    ValueName{zspeed5MHz, "5 MHz"},   ValueName{zspeed2500kHz, "2.5 MHz"},
    ValueName{zspeed40MHz, "40 MHz"}, ValueName{zspeed30MHz, "30 MHz"},
};
inline constexpr std::array TriggerNames{
    ValueName{ztrigFreeRun, "Free Run"},
    ValueName{ztrigType2Polarity0, "Type 2 Polarity 0"},
    ValueName{ztrigType2Polarity1, "Type 2 Polarity 1"},
    ValueName{ztrigType3Polarity0, "Type 3 Polarity 0"},
    ValueName{ztrigType3Polarity1, "Type 3 Polarity 1"},
    ValueName{ztrigSoftware, "Software"},
    ValueName{ztrigType5Polarity0, "Type 5 Polarity 0"},
    ValueName{ztrigType5Polarity1, "Type 5 Polarity 1"},
};
inline constexpr std::array WheelNames{
    ValueName{zwheelRed, "Red"},
    ValueName{zwheelGreen, "Green"},
    ValueName{zwheelBlack, "Black"},
    ValueName{zwheelBlue, "Blue"},
};
constexpr std::array<ValueName, ImageFormatLabels.size()> MakeFormatNames() {
    std::array<ValueName, ImageFormatLabels.size()> names{};
    for (std::uint32_t format = 0; format < names.size(); ++format) {
        names[format] = {format, ImageFormatLabels[format]};
    }
    return names;
}
inline constexpr std::array FormatNames = MakeFormatNames();
inline constexpr std::array SyncBNames{
    ValueName{zsyncbTriggerMask, "Trigger Mask"},
    ValueName{zsyncbExpose, "Expose"},
};
inline constexpr std::array CameraModeNames{
    ValueName{zmodeStandard, "Standard Mode"},
    ValueName{zmodeRealTimeVideo, "RTV Mode"},
    ValueName{zmodeOversample, "Oversample Mode"},
};
inline constexpr std::array BayerAlgorithmNames{
    ValueName{zbayerAverage, "Average"},
    ValueName{zbayerFast, "Fast"},
    ValueName{zbayerBicubic, "Bicubic"},
    ValueName{zbayerBicubicFaster, "Bicubic - Faster"},
};
inline constexpr std::array FanNames{
    ValueName{zfanLow, "Low"},
    ValueName{zfanMedium, "Medium"},
    ValueName{zfanHigh, "High"},
    ValueName{zfanFull, "Full"},
};

/// Values of single rows that no one operation of the camera gives.
std::uint32_t ReadGain(const SettingsSource& source);
std::uint32_t ReadOffset(const SettingsSource& source);
std::uint32_t ReadReadoutSpeed(const SettingsSource& source);
std::uint32_t ReadPostProcessing(const SettingsSource& source);
std::uint32_t ReadBayerAlgorithm(const SettingsSource& source);
std::uint32_t ReadBayerOutputFormat(const SettingsSource& source);

/// A colour scale of the white balance in thousandths.
template <auto Getter>
std::uint32_t ReadScale(const SettingsSource& source) {
    return ConvertScaleToThousandths((source.context.whiteBalance.get()->*Getter)());
}

std::uint32_t GetDefaultReadoutSpeed(const SettingsSource& source);
std::uint32_t GetDefaultImageFormat(const SettingsSource& source);
std::uint32_t GetDefaultBayerAlgorithm(const SettingsSource& source);
std::uint32_t GetDefaultOutputFormat(const SettingsSource& source);
std::uint32_t GetDefaultIntensifierGain(const SettingsSource& source);
std::uint64_t GetDefaultNormalizedIntensifierGain(const SettingsSource& source);
std::int32_t GetDefaultGaindB(const SettingsSource& source);

bool IsSecondRevision(ZCamera& camera);

std::optional<std::uint32_t> GetFirstReadoutSpeed(ZCamera& camera);
std::optional<std::uint32_t> GetLastColumn(ZCamera& camera);
std::optional<std::uint32_t> GetLastRow(ZCamera& camera);
std::optional<std::uint32_t> GetFirstSyncBMode(ZCamera& camera);
std::optional<std::uint32_t> GetLastSyncBMode(ZCamera& camera);
/// In millionths, truncated.
std::optional<std::uint32_t> GetLeastNormalizedGain(ZCamera& camera);
std::optional<std::uint32_t> GetGreatestNormalizedGain(ZCamera& camera);

void ListReadoutSpeeds(ZCamera& camera, std::vector<std::uint32_t>& values);
void ListImageFormats(ZCamera& camera, std::vector<std::uint32_t>& values);
void ListCameraModes(ZCamera& camera, std::vector<std::uint32_t>& values);
void ListPostProcessFormats(ZCamera& camera, std::vector<std::uint32_t>& values);

}  // namespace ZV
