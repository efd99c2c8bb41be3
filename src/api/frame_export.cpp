#include "api/frame_export.h"

#include <algorithm>
#include <array>
#include <cstring>

#include "api/result_codes.h"
#include "api/settings_block.h"
#include "imaging/ex_image.h"

namespace ZV {

namespace {

struct PatternRow {
    std::uint16_t colourPattern;
    std::uint32_t bayerPattern;
};

constexpr std::array Patterns{
    PatternRow{PatternRGGB, zpatRGGB},
    PatternRow{PatternGRBG, zpatGRBG},
    PatternRow{PatternGBRG, zpatGBRG},
    PatternRow{PatternBGGR, zpatBGGR},
};

std::uint32_t ConvertColourPattern(std::uint16_t colourPattern) {
    for (const PatternRow& row : Patterns) {
        if (row.colourPattern == colourPattern) return row.bayerPattern;
    }
    return 0;
}

// Kept: who asks for raw data is told raw, whatever the image says.
std::uint32_t GetFrameFormat(const Zentara_Settings& lastSettings, const ZExImage& image) {
    const std::uint32_t asked = GetSettingsWord(lastSettings, zprmImageFormat);
    return asked == zfmtRaw8 || asked == zfmtRaw16 ? asked : image.GetImageFormat();
}

void CopyPixels(const ZExImage& image, Zentara_Frame& frame) {
    if (image.GetImageSize() > GetFrameCapacity(frame)) {
        frame.size = 0;
        frame.errorCode = zerrBufferTooSmall;
        return;
    }
    const std::uint32_t bytes = std::min(image.GetImageSize(), image.GetBufferBytes());
    if (bytes != 0) std::memcpy(frame.pBuffer, image.GetImageData(), bytes);
}

}  // namespace

std::uint32_t GetFrameCapacity(const Zentara_Frame& frame) {
    return frame.pBuffer != nullptr ? frame.bufferSize : 0;
}

void ExportImageToFrame(ZentaraHandle handle, const Zentara_Settings& lastSettings,
                        const ZExImage& image, Zentara_Frame& frame, bool copiesPixels) {
    frame.format = GetFrameFormat(lastSettings, image);
    frame.width = image.GetWidth();
    frame.height = image.GetHeight();
    frame.size = image.GetImageSize();
    frame.bits = image.GetBitDepth();
    frame.frameNumber = image.GetRollingFrameNumber();
    frame.bayerPattern = ConvertColourPattern(image.GetColourPattern());
    frame.errorCode = TranslateImageError(image.GetErrorCode());
    frame.timeStamp = 0;
    std::memcpy(frame.privateCamera, &handle, sizeof(handle));
    frame.privateBinning = image.GetSymmetricalBinningMode();
    frame.privateRealTime = image.IsRTV() ? 1 : 0;
    frame.privatePattern = image.GetColourPattern();
    frame.privateFilled = 1;
    if (copiesPixels) CopyPixels(image, frame);
}

}  // namespace ZV
