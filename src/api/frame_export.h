#pragma once

#include <cstdint>

#include "zentara/zentara.h"

namespace ZV {

class ZExImage;

/// Fills the client's record from an image. With `copiesPixels` the pixels go to the client's
/// buffer; an image that is larger than the buffer is not copied: size is 0 and errorCode
/// zerrBufferTooSmall then. `format` is raw where the settings say so, else the image's own.
void ExportImageToFrame(ZentaraHandle handle, const Zentara_Settings& lastSettings,
                        const ZExImage& image, Zentara_Frame& frame, bool copiesPixels);

/// Bytes that the client's buffer holds; a null buffer holds none.
[[nodiscard]] std::uint32_t GetFrameCapacity(const Zentara_Frame& frame);

}  // namespace ZV
