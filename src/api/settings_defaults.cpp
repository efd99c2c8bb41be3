#include "api/camera_context.h"
#include "api/exported_call.h"
#include "api/handles.h"
#include "api/parameter_table.h"
#include "api/settings_block.h"
#include "camera/camera.h"
#include "diagnostics/log.h"
#include "zentara/zentara.h"

namespace ZV {

namespace {

template <typename Row, typename Store>
void FillWithDefaults(const SettingsSource& source, Zentara_Settings& settings,
                      std::span<const Row> rows, Store store) {
    for (const Row& row : rows) {
        if (row.initial != nullptr) store(settings, row.key, row.initial(source));
    }
}

void FillDefaults(const SettingsSource& source, ZentaraHandle handle, Zentara_Settings& settings) {
    settings = {};
    SetSettingsSize(settings);
    FillWithDefaults(source, settings, GetWordParameters(), SetSettingsWord);
    FillWithDefaults(source, settings, GetSignedParameters(), SetSettingsSigned);
    FillWithDefaults(source, settings, GetWideParameters(), SetSettingsWide);
    SetSettingsHandle(settings, handle);
    SetSettingsMagic(settings);
}

ZentaraResult ReadDefaults(const char* function, ZentaraHandle handle, Zentara_Settings* settings) {
    if (!ZCamera::IsInitalized()) return zerrNotLoaded;
    if (handle == 0) return zerrBadHandle;
    if (settings == nullptr) return zerrBadParameter;
    ZCamera* const camera = FindCamera(handle);
    if (!IsOpen(camera)) return zerrBadHandle;
    if (!HasExclusiveAccess(function, camera)) return zerrBadHandle;
    CameraContext* const context = GetCameraContext(*camera);
    if (context == nullptr) return zerrBadHandle;
    // Kept: asking for the defaults switches post-processing off, before any block is sent.
    context->postProcessing = 0;
    FillDefaults({*camera, *context}, handle, *settings);
    ZLogSettingsBlock(function, *settings);
    return zerrNone;
}

}  // namespace

}  // namespace ZV

ZentaraResult Zentara_ReadDefaultSettings(ZentaraHandle handle, Zentara_Settings* settings) {
    return ZV::Traced(__func__, [&](const char* function) {
        return ZV::ReadDefaults(function, handle, settings);
    });
}

ZentaraResult Zentara_TranslateSettings(ZentaraHandle /*handle*/, Zentara_Settings* /*settings*/) {
    return ZV::Traced(__func__, [](const char*) {
        return ZV::ZCamera::IsInitalized() ? ZentaraResult{zerrNotSupported}
                                           : ZentaraResult{zerrNotLoaded};
    });
}
