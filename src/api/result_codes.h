#pragma once

#include <cstdint>

#include "camera/camera_result.h"
#include "zentara/zentara.h"

namespace ZV {

/// The one translation of a camera operation's result. A feature that the camera does not have is
/// success.
[[nodiscard]] ZentaraResult TranslateCameraResult(CameraResult result);

/// What an image's error code becomes in the `errorCode` of a frame record: 18 to 21 have codes of
/// their own, any other is zerrNone.
[[nodiscard]] ZentaraResult TranslateImageError(std::uint16_t imageError);

/// Words of a result code, as the log prints them. Codes without an entry share one text.
[[nodiscard]] const char* GetResultMessage(ZentaraResult code);

}  // namespace ZV
