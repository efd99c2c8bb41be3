#include "api/stream_compatibility.h"

#include <array>

#include "api/settings_block.h"
#include "api/settings_units.h"

namespace ZV {

namespace {

using FormatSet = std::uint32_t;  // Bit n stands for format n.

template <std::size_t Count>
constexpr FormatSet MakeFormatSet(const std::uint32_t (&formats)[Count]) {
    FormatSet set = 0;
    for (const std::uint32_t format : formats) set |= FormatSet{1} << format;
    return set;
}

constexpr FormatSet DeepFormats =
    MakeFormatSet({zfmtRaw16, zfmtMono16, zfmtBayer16, zfmtRGBPlane16, zfmtRGB48});
constexpr FormatSet ByteFormats = MakeFormatSet(
    {zfmtRaw8, zfmtMono8, zfmtBayer8, zfmtRGBPlane8, zfmtBGR24, zfmtXRGB32, zfmtBGRX32, zfmtRGB24});
constexpr FormatSet ThreeColourFormats = MakeFormatSet(
    {zfmtRGBPlane8, zfmtRGBPlane16, zfmtBGR24, zfmtXRGB32, zfmtRGB48, zfmtBGRX32, zfmtRGB24});
constexpr FormatSet RawAndMonoFormats = MakeFormatSet({zfmtRaw8, zfmtRaw16, zfmtMono8, zfmtMono16});

bool Holds(FormatSet set, std::uint32_t format) {
    return format < 32 && ((set >> format) & 1) != 0;
}

bool IsFormatCompatible(ZCamera& camera, std::uint32_t format) {
    if (Holds(camera.GetBitDepth() == 8 ? DeepFormats : ByteFormats, format)) return false;
    if (camera.GetCCDImageFormat() == 0) return true;
    return !Holds(camera.GetRGBFilterCycleMode() ? RawAndMonoFormats : ThreeColourFormats, format);
}

bool IsRegionUnchanged(ZCamera& camera, const Zentara_Settings& settings) {
    return GetSettingsWord(settings, zprmRoiX) == camera.GetROIX() &&
           GetSettingsWord(settings, zprmRoiY) == camera.GetROIY() &&
           GetSettingsWord(settings, zprmRoiWidth) == camera.GetROIWidth() &&
           GetSettingsWord(settings, zprmRoiHeight) == camera.GetROIHeight();
}

}  // namespace

bool IsStreamCompatible(ZCamera& camera, const Zentara_Settings& settings) {
    if (!IsFormatCompatible(camera, GetSettingsWord(settings, zprmImageFormat))) return false;
    const std::uint32_t speed = ConvertMegahertzToSpeedIndex(camera.GetReadoutFrequency());
    if (GetSettingsWord(settings, zprmReadoutSpeed) != speed) return false;
    return IsRegionUnchanged(camera, settings);
}

}  // namespace ZV
