#include "api/camera_context.h"
#include "api/exported_call.h"
#include "api/handles.h"
#include "api/parameter_table.h"
#include "api/settings_block.h"
#include "camera/camera.h"
#include "diagnostics/log.h"
#include "imaging/image_formats.h"
#include "zentara/zentara.h"

namespace ZV {

namespace {

/// Kept: the camera's own format reads back, never a raw one, and for a camera without a format the
/// word stays as it is.
void ReadImageFormat(const SettingsSource& source, Zentara_Settings& settings) {
    const bool isByteDeep = source.camera.GetBitDepth() == 8;
    switch (source.camera.GetImageFormat()) {
        case CameraMono:
            SetSettingsWord(settings, zprmImageFormat, isByteDeep ? zfmtMono8 : zfmtMono16);
            break;
        case CameraBayer:
            SetSettingsWord(settings, zprmImageFormat, isByteDeep ? zfmtBayer8 : zfmtBayer16);
            break;
        case CameraRGBFilter:
            SetSettingsWord(settings, zprmImageFormat, source.context.rgbWheel->GetOutputFormat());
            break;
        default:
            break;
    }
}

// Kept: words 17, 18, 38, 40, 41, 45 and 46 are not read and keep what the client's memory held.
void FillSettings(const SettingsSource& source, ZentaraHandle handle, Zentara_Settings& settings) {
    SetSettingsSize(settings);
    for (const WordParameter& row : GetWordParameters()) {
        if (row.read != nullptr) SetSettingsWord(settings, row.key, row.read(source));
    }
    for (const SignedParameter& row : GetSignedParameters()) {
        SetSettingsSigned(settings, row.key, row.read(source));
    }
    for (const WideParameter& row : GetWideParameters()) {
        SetSettingsWide(settings, row.key, row.read(source));
    }
    ReadImageFormat(source, settings);
    SetSettingsHandle(settings, handle);
    SetSettingsMagic(settings);
}

ZentaraResult ReadSettings(const char* function, ZentaraHandle handle, Zentara_Settings* settings) {
    if (!ZCamera::IsInitalized()) return zerrNotLoaded;
    if (handle == 0) return zerrBadHandle;
    if (settings == nullptr) return zerrBadParameter;
    ZCamera* const camera = FindCamera(handle);
    if (!IsOpen(camera)) return zerrBadHandle;
    if (!HasExclusiveAccess(function, camera)) return zerrBadHandle;
    CameraContext* const context = GetCameraContext(*camera);
    if (context == nullptr) return zerrBadHandle;
    FillSettings({*camera, *context}, handle, *settings);
    SetLastSettings(*context, *settings);
    ZLogSettingsBlock(function, *settings);
    return zerrNone;
}

}  // namespace

}  // namespace ZV

ZentaraResult Zentara_ReadSettingsFromCam(ZentaraHandle handle, Zentara_Settings* settings) {
    return ZV::Traced(__func__, [&](const char* function) {
        return ZV::ReadSettings(function, handle, settings);
    });
}
