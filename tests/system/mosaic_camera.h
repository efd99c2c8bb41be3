#pragma once

#include <gtest/gtest.h>

#include <cstdint>
#include <cstring>
#include <string_view>
#include <vector>

#include "support/flat_camera.h"
#include "support/reference_mosaic.h"
#include "support/settings_words.h"

namespace ZV::Test {

/// A frame of a client with pixels of its own; copies have pixels of their own too.
struct OwnedFrame {
    explicit OwnedFrame(std::size_t bytes = 0)
        : pixels(bytes, ClientFrame::Untouched), record(std::make_unique<Zentara_Frame>()) {
        *record = {};
        record->pBuffer = pixels.data();
        record->bufferSize = static_cast<std::uint32_t>(bytes);
    }

    Zentara_Frame* Get() { return record.get(); }
    Zentara_Frame* operator->() { return record.get(); }
    std::vector<std::uint8_t> GetImage() const {
        const std::size_t bytes = std::min<std::size_t>(record->size, pixels.size());
        return {pixels.begin(), pixels.begin() + static_cast<std::ptrdiff_t>(bytes)};
    }
    bool IsUntouchedFrom(std::size_t first) const {
        for (std::size_t i = first; i < pixels.size(); ++i) {
            if (pixels[i] != ClientFrame::Untouched) return false;
        }
        return true;
    }

    std::vector<std::uint8_t> pixels;
    std::unique_ptr<Zentara_Frame> record;
};

/// A small colour camera before a chart, its white balance at rest.
class MosaicCamera : public OpenedCamera {
  protected:
    explicit MosaicCamera(std::string_view scenario = SmallColour) : OpenedCamera(scenario) {}

    void SetUp() override {
        OpenedCamera::SetUp();
        if (handle != 0) Send(zfmtBayer8, zfmtRGB24, zbayerAverage, /*isPostProcessing=*/false);
    }

    /// A block with these choices, not sent.
    Zentara_Settings MakeSettings(std::uint32_t imageFormat, std::uint32_t outputFormat,
                                  std::uint32_t algorithm, bool isPostProcessing) {
        Zentara_Settings settings = ReadSettings();
        SetWord(settings, zprmImageFormat, imageFormat);
        SetWord(settings, zprmPostProcessImageFormat, outputFormat);
        SetWord(settings, zprmPostProcessBayerAlgorithm, algorithm);
        SetWord(settings, zprmDoPostProcessing, isPostProcessing ? 1 : 0);
        SetWord(settings, zprmPostProcessGainRed, scales[0]);
        SetWord(settings, zprmPostProcessGainGreen, scales[1]);
        SetWord(settings, zprmPostProcessGainBlue, scales[2]);
        return settings;
    }
    void Send(std::uint32_t imageFormat, std::uint32_t outputFormat, std::uint32_t algorithm,
              bool isPostProcessing) {
        Zentara_Settings settings =
            MakeSettings(imageFormat, outputFormat, algorithm, isPostProcessing);
        EXPECT_ZERR(zerrNone, Zentara_SendSettingsToCam(handle, &settings));
    }

    OwnedFrame Grab(std::size_t bytes) {
        OwnedFrame frame(bytes);
        EXPECT_ZERR(zerrNone, Zentara_GrabFrame(handle, frame.Get()));
        EXPECT_ZERR(zerrNone, frame->errorCode);
        return frame;
    }
    /// A mosaic of the depth in force; post-processing is off.
    OwnedFrame GrabMosaic() { return Grab(GetImageBytes()); }

    static ReferenceMosaic ReadMosaic(OwnedFrame& frame) {
        ReferenceMosaic mosaic{frame->width, frame->height, frame->bits, frame->bayerPattern, {}};
        const std::vector<std::uint8_t> bytes = frame.GetImage();
        if (frame->bits == 8) {
            mosaic.samples.assign(bytes.begin(), bytes.end());
        } else {
            mosaic.samples.resize(bytes.size() / 2);
            std::memcpy(mosaic.samples.data(), bytes.data(), bytes.size());
        }
        return mosaic;
    }

    /// What post-processing must make of a mosaic with the scales in force.
    std::vector<std::uint8_t> Finish(OwnedFrame& frame, std::uint32_t algorithm,
                                     std::uint32_t format) const {
        const ReferenceMosaic mosaic = ReadMosaic(frame);
        ReferenceColours colours = MakeReferenceColours(mosaic, algorithm);
        const float factors[3] = {static_cast<float>(scales[0]) / 1000.0F,
                                  static_cast<float>(scales[1]) / 1000.0F,
                                  static_cast<float>(scales[2]) / 1000.0F};
        ScaleReferenceColours(colours, factors, mosaic.bits);
        return PackReferenceColours(colours, format);
    }

    std::uint32_t scales[3] = {1000, 1000, 1000};  ///< Of the next send, times 1000.
};

inline constexpr std::uint32_t MosaicByteFormats[] = {zfmtBGR24, zfmtXRGB32, zfmtBGRX32, zfmtRGB24};
inline constexpr std::uint32_t MosaicAlgorithms[] = {zbayerAverage, zbayerFast, zbayerBicubic,
                                                     zbayerBicubicFaster};

}  // namespace ZV::Test
