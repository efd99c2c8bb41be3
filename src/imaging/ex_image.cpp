#include "imaging/ex_image.h"

#include <algorithm>
#include <cstdlib>
#include <cstring>
#include <new>

namespace ZV {

ZExImage::ZExImage(std::uint8_t* newImageData, std::uint32_t newImageSize, std::uint32_t newWidth,
                   std::uint32_t newHeight, std::uint16_t newBitDepth, std::uint64_t newExposure,
                   double newGain, ZImageFormatEnum newImageFormat,
                   ZCameraImageFormatEnum newCameraImageFormat, ZColourPatternEnum newColourPattern,
                   std::uint16_t newRGBFilterStartColour, bool newIsBigEndian,
                   std::uint16_t newCameraModel, std::uint16_t newCameraNumber,
                   std::uint16_t newSymmetricalBinningMode, bool newIsRTV,
                   std::uint16_t newRollingFrameNumber, std::uint16_t newErrorCode, void* newCamera,
                   bool newOwnsBuffer)
    : imageData(newImageData),
      imageSize(newImageSize),
      width(newWidth),
      height(newHeight),
      bitDepth(newBitDepth),
      exposure(newExposure),
      gain(newGain),
      imageFormat(newImageFormat),
      cameraImageFormat(newCameraImageFormat),
      colourPattern(newColourPattern),
      rgbFilterStartColour(newRGBFilterStartColour),
      isBigEndian(newIsBigEndian),
      cameraModel(newCameraModel),
      cameraNumber(newCameraNumber),
      symmetricalBinningMode(newSymmetricalBinningMode),
      isRTV(newIsRTV),
      rollingFrameNumber(newRollingFrameNumber),
      errorCode(newErrorCode),
      camera(newCamera),
      bufferBytes(newImageData != nullptr ? newImageSize : 0) {
    if (newOwnsBuffer && newImageData != nullptr) ownedBuffer.reset(newImageData, std::free);
}

ZExImage::ZExImage(const ZExImage& other) = default;

ZExImage& ZExImage::operator=(const ZExImage& other) = default;

ZExImage::~ZExImage() = default;

std::uint8_t* ZExImage::GetImageData() const {
    return imageData;
}

std::uint32_t ZExImage::GetImageSize() const {
    return imageSize;
}

std::uint32_t ZExImage::GetWidth() const {
    return width;
}

std::uint32_t ZExImage::GetHeight() const {
    return height;
}

std::uint16_t ZExImage::GetBitDepth() const {
    return bitDepth;
}

std::uint64_t ZExImage::GetExposure() const {
    return exposure;
}

double ZExImage::GetGain() const {
    return gain;
}

std::uint32_t ZExImage::GetImageFormat() const {
    return imageFormat;
}

std::uint16_t ZExImage::GetCameraImageFormat() const {
    return cameraImageFormat;
}

std::uint16_t ZExImage::GetColourPattern() const {
    return colourPattern;
}

std::uint16_t ZExImage::GetRGBFilterStartColour() const {
    return rgbFilterStartColour;
}

bool ZExImage::IsBigEndian() const {
    return isBigEndian;
}

std::uint16_t ZExImage::GetCameraModel() const {
    return cameraModel;
}

std::uint16_t ZExImage::GetCameraNumber() const {
    return cameraNumber;
}

std::uint16_t ZExImage::GetSymmetricalBinningMode() const {
    return symmetricalBinningMode;
}

bool ZExImage::IsRTV() const {
    return isRTV;
}

std::uint16_t ZExImage::GetRollingFrameNumber() const {
    return rollingFrameNumber;
}

std::uint16_t ZExImage::GetErrorCode() const {
    return errorCode;
}

void* ZExImage::GetCamera() const {
    return camera;
}

void ZExImage::SetImageFormat(std::uint32_t newFormat) {
    imageFormat = newFormat;
}

void ZExImage::SetImageSize(std::uint32_t newSize) {
    imageSize = newSize;
}

void ZExImage::SetCameraImageFormat(ZCameraImageFormatEnum newFormat) {
    cameraImageFormat = newFormat;
}

void ZExImage::SetWidth(std::uint16_t newWidth) {
    width = newWidth;
}

void ZExImage::SetHeight(std::uint16_t newHeight) {
    height = newHeight;
}

void ZExImage::ReplaceImageBufferWith(const std::uint8_t* data, std::uint32_t size) {
    // Kept: an equal size copies nothing, so a client that replaces pixels one for one keeps the
    // old ones.
    if (size == imageSize) return;
    if (data == nullptr && size != 0) return;
    (void)TakeNewBuffer(data, size, size);  // Without memory the image stays as it was.
}

void ZExImage::ResizeBuffer(std::uint32_t size) {
    if (size == imageSize) return;
    const std::uint32_t keptBytes = std::min({imageSize, bufferBytes, size});
    (void)TakeNewBuffer(imageData, keptBytes, size);  // Without memory the image stays as it was.
}

std::uint32_t ZExImage::ImageFormatByteSize(std::uint32_t format) {
    return GetThreeColourPixelBytes(format);
}

// The old block is let go only after the copy: `data` may lie in it. Whoever shares it keeps it.
bool ZExImage::TakeNewBuffer(const std::uint8_t* data, std::uint32_t dataBytes,
                             std::uint32_t size) {
    std::uint8_t* block = nullptr;
    if (size != 0) {
        block = static_cast<std::uint8_t*>(std::calloc(size, 1));
        if (block == nullptr) return false;
        if (dataBytes != 0) std::memcpy(block, data, dataBytes);
    }
    try {
        ownedBuffer.reset(block, std::free);
    } catch (const std::bad_alloc&) {  // For the owners' count; the block has been freed.
        return false;
    }
    imageData = block;
    imageSize = size;
    bufferBytes = size;
    return true;
}

}  // namespace ZV
