#include <algorithm>
#include <cstdint>

#include "api/exported_call.h"
#include "camera/camera.h"
#include "imaging/image_formats.h"
#include "imaging/row_zoom.h"
#include "zentara/zentara.h"

namespace ZV {

namespace {

constexpr std::uint32_t RowsForEach = 2;

std::uint8_t* GetPixels(const Zentara_Frame& frame) {
    return static_cast<std::uint8_t*>(frame.pBuffer);
}

/// Whether the frame's buffer holds what its record says, and the record's size all its rows.
bool IsWhole(const Zentara_Frame& frame, std::uint64_t bytes) {
    if (frame.bufferSize != 0 && frame.bufferSize < frame.size) return false;
    return bytes <= frame.size;
}

ZentaraResult ZoomVertically(std::uint32_t algorithm, const Zentara_Frame* inFrame,
                             Zentara_Frame* outFrame) {
    if (!ZCamera::IsInitalized()) return zerrNotLoaded;
    if (algorithm != zbayerFast) return zerrNotSupported;
    if (inFrame == nullptr || outFrame == nullptr) return zerrBadParameter;
    if (inFrame->pBuffer == nullptr || outFrame->pBuffer == nullptr) return zerrBadParameter;
    // Kept: a frame that is no mosaic is left alone, and the call succeeds.
    if (!IsBayer(inFrame->format)) return zerrNone;
    const std::uint64_t rowCount = inFrame->height;
    if (outFrame->height != RowsForEach * rowCount) return zerrBadParameter;
    const std::uint64_t bytes =
        CalculateImageSize(inFrame->format, inFrame->width, inFrame->height);
    if (!IsWhole(*inFrame, bytes)) return zerrBadParameter;
    if (outFrame->bufferSize != 0 && outFrame->bufferSize < RowsForEach * bytes) {
        return zerrBufferTooSmall;
    }
    // Kept: size, format and pattern of the output stay what the client has put there.
    outFrame->width = inFrame->width;
    outFrame->bits = inFrame->bits;
    const std::uint32_t sampleBytes = inFrame->format == Bayer8 ? 1 : 2;
    ZoomSpreadRows(GetPixels(*inFrame), GetPixels(*outFrame), inFrame->width, inFrame->height,
                   sampleBytes);
    ZoomFillRows(inFrame->bayerPattern, GetPixels(*outFrame), outFrame->width, outFrame->height,
                 sampleBytes);
    return zerrNone;
}

}  // namespace

}  // namespace ZV

ZentaraResult Zentara_BayerZoomVert(uint32_t algorithm, const Zentara_Frame* inFrame,
                                    Zentara_Frame* outFrame) {
    return ZV::Traced(
        __func__, [&](const char*) { return ZV::ZoomVertically(algorithm, inFrame, outFrame); });
}
