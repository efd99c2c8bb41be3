#include "api/stream_compatibility.h"

#include "api/format_sets.h"
#include "api/settings_block.h"
#include "api/settings_units.h"

namespace ZV {

namespace {

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
