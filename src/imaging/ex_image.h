#pragma once

#include <cstdint>
#include <memory>

#include "imaging/image_formats.h"
#include "imaging/object.h"
#include "zentara/zentara.h"

namespace ZV {

/// One frame on its way through the library: a pixel buffer and what was known when it was taken.
///
/// A copy shares the buffer with its original; the last owner releases it, once. Images are handed
/// on and never copied inside the library.
class ZENTARA_API ZExImage : public ZObject {
  public:
    /// `imageData` holds `imageSize` bytes. With `ownsBuffer` it is a block of the C allocator that
    /// the image frees; without, it stays the caller's and must outlive the image.
    ZExImage(std::uint8_t* imageData, std::uint32_t imageSize, std::uint32_t width,
             std::uint32_t height, std::uint16_t bitDepth, std::uint64_t exposure, double gain,
             ZImageFormatEnum imageFormat, ZCameraImageFormatEnum cameraImageFormat,
             ZColourPatternEnum colourPattern, std::uint16_t rgbFilterStartColour, bool isBigEndian,
             std::uint16_t cameraModel, std::uint16_t cameraNumber,
             std::uint16_t symmetricalBinningMode, bool isRTV, std::uint16_t rollingFrameNumber,
             std::uint16_t errorCode, void* camera, bool ownsBuffer);
    ZExImage(const ZExImage& other);
    ZExImage& operator=(const ZExImage& other);
    virtual ~ZExImage();

    // None of these is inline: clients link to them by name.
    std::uint8_t* GetImageData() const;
    std::uint32_t GetImageSize() const;
    std::uint32_t GetWidth() const;
    std::uint32_t GetHeight() const;
    std::uint16_t GetBitDepth() const;
    std::uint64_t GetExposure() const;  ///< Nanoseconds.
    double GetGain() const;
    std::uint32_t GetImageFormat() const;
    std::uint16_t GetCameraImageFormat() const;
    std::uint16_t GetColourPattern() const;
    std::uint16_t GetRGBFilterStartColour() const;
    bool IsBigEndian() const;
    std::uint16_t GetCameraModel() const;
    std::uint16_t GetCameraNumber() const;
    std::uint16_t GetSymmetricalBinningMode() const;
    bool IsRTV() const;
    std::uint16_t GetRollingFrameNumber() const;
    std::uint16_t GetErrorCode() const;
    void* GetCamera() const;

    /// Bytes that the buffer really holds, whatever `SetImageSize` has said.
    std::uint32_t GetBufferBytes() const { return bufferBytes; }

    void SetErrorCode(std::uint16_t newErrorCode) { errorCode = newErrorCode; }
    void SetImageFormat(std::uint32_t newFormat);
    void SetImageSize(std::uint32_t newSize);
    void SetCameraImageFormat(ZCameraImageFormatEnum newFormat);
    void SetWidth(std::uint16_t newWidth);
    void SetHeight(std::uint16_t newHeight);

    /// Gives the image a copy of `size` bytes at `data`. Nothing happens when `size` equals the
    /// present size: the old pixels stay. A size of 0 gives an empty buffer; null data or no memory
    /// leaves the image alone.
    void ReplaceImageBufferWith(const std::uint8_t* data, std::uint32_t size);

    /// Grows the buffer to `size` bytes, the new ones 0. Nothing happens when `size` equals the
    /// present size, or when there is no memory. A smaller size keeps the front of the image.
    void ResizeBuffer(std::uint32_t size);

    /// Bytes per pixel of a three-colour format, `RGBX32` included; 0 for the others.
    static std::uint32_t ImageFormatByteSize(std::uint32_t format);

  private:
    bool TakeNewBuffer(const std::uint8_t* data, std::uint32_t dataBytes, std::uint32_t size);

    std::uint8_t* imageData;
    std::uint32_t imageSize;
    std::uint32_t width;
    std::uint32_t height;
    std::uint16_t bitDepth;
    std::uint64_t exposure;
    double gain;
    std::uint32_t imageFormat;
    std::uint16_t cameraImageFormat;
    std::uint16_t colourPattern;
    std::uint16_t rgbFilterStartColour;
    bool isBigEndian;
    std::uint16_t cameraModel;
    std::uint16_t cameraNumber;
    std::uint16_t symmetricalBinningMode;
    bool isRTV;
    std::uint16_t rollingFrameNumber;
    std::uint16_t errorCode;
    void* camera;
    std::uint32_t bufferBytes;
    std::shared_ptr<std::uint8_t> ownedBuffer;  // Shared by the copies; null when the caller owns.
};

}  // namespace ZV
