#pragma once

#include <cstdint>
#include <functional>
#include <string>
#include <vector>

#include "camera/bare_camera.h"
#include "imaging/bayer_interpolation.h"
#include "imaging/image_fixture.h"
#include "imaging/image_formats.h"
#include "imaging/image_pipeline.h"

namespace ZV::Testing {

/// Stands in a camera's Bayer pipeline and notes which format the Bayer filter was to make.
class PipelineProbe : public ZImageFilter {
  public:
    FilterResult Process(ZInImageBufferStruct* in, ZOutImageBufferStruct* out) override {
        if (bayerFilter != nullptr) formats.push_back(bayerFilter->GetOutputFormat());
        if (onProcess) onProcess(in);
        if (onProcessOutput) onProcessOutput(in, out);
        return result;
    }
    FilterResult Init(std::uint32_t, std::uint32_t) override { return FilterDone; }
    FilterResult SetOutputFormat(std::uint32_t) override { return FilterDone; }

    ZBayerInterpolation* bayerFilter = nullptr;
    FilterResult result = FilterDeclined;
    std::function<void(ZInImageBufferStruct*)> onProcess;
    std::function<void(ZInImageBufferStruct*, ZOutImageBufferStruct*)> onProcessOutput;
    std::vector<std::uint32_t> formats;
};

/// A camera whose images a test makes, and which tells what it was asked to do.
class ScriptedCamera : public ZV::Test::BareBase {
  public:
    ScriptedCamera() {
        probe.bayerFilter = GetBayerFilter();
        GetBayerPipeline()->Setup(16, 16);
        GetBayerPipeline()->AddFilter(&probe);
    }

    std::uint32_t GetImageFormat() override { return imageFormat; }
    std::uint32_t GetBitDepth() override { return bitDepth; }
    std::uint64_t GetExposure() override { return exposure; }
    std::uint64_t GetRGBFilterRedExposure() override { return redExposure; }
    std::uint64_t GetRGBFilterBlueExposure() override { return blueExposure; }
    std::uint64_t GetMinExposure() override { return minExposure; }
    std::uint64_t GetMaxExposure() override { return maxExposure; }
    bool GetRGBFilterCycleMode() override { return doesCycle; }
    std::uint16_t GetRGBFilterStartColour() override { return startColour; }

    CameraResult SetBitDepth(std::uint32_t bits) override { return Note("depth", bits, &bitDepth); }
    CameraResult SetExposure(std::uint64_t value) override {
        return Note("exposure", value, &exposure);
    }
    CameraResult SetRGBFilterRedExposure(std::uint64_t value) override {
        return Note("red", value, &redExposure);
    }
    CameraResult SetRGBFilterBlueExposure(std::uint64_t value) override {
        return Note("blue", value, &blueExposure);
    }
    CameraResult SetRGBFilterCycle(bool isOn) override { return Note("cycle", isOn, &doesCycle); }
    CameraResult SetRGBFilterStartColour(std::uint32_t colour) override {
        return Note("start", colour, &startColour);
    }
    CameraResult UpdateSettingsOnCamera() override {
        calls.push_back("update");
        return CameraOk;
    }
    CameraResult GetOneImage(ZExImage** image) override {
        calls.push_back("image");
        ++imageCount;
        if (imageCount == failingImage) return imageFailure;
        *image = new ZExImage(render(*this));
        return CameraOk;
    }

    /// An image of one sample value per colour or channel, as the camera would make it.
    ZExImage MakeFlatImage(ZImageFormatEnum format, const std::vector<std::uint16_t>& samples,
                           std::uint16_t depth) {
        const bool isDeep = Is16Bit(format);
        const bool isPlanar = format == RGBPlane8 || format == RGBPlane16;
        constexpr std::size_t Pixels = std::size_t{Width} * Height;
        Bytes bytes;
        for (std::size_t index = 0; index < Pixels * samples.size(); ++index) {
            const std::uint16_t sample =
                samples[isPlanar ? index / Pixels : index % samples.size()];
            bytes.push_back(static_cast<std::uint8_t>(sample));
            if (isDeep) bytes.push_back(static_cast<std::uint8_t>(sample >> 8));
        }
        ImageTraits traits;
        traits.width = Width;
        traits.height = Height;
        traits.bitDepth = depth;
        traits.format = format;
        traits.camera = static_cast<ZCamera*>(this);
        return Testing::MakeImage(bytes, traits);
    }

    std::vector<std::string> TakeCalls() { return std::exchange(calls, {}); }

    static constexpr std::uint32_t Width = 6;
    static constexpr std::uint32_t Height = 4;

    std::function<ZExImage(ScriptedCamera&)> render;
    std::uint32_t failingImage = 0;  ///< From 1; 0 for none.
    CameraResult imageFailure = CameraHalFault;
    std::uint32_t imageCount = 0;
    PipelineProbe probe;

    std::uint32_t imageFormat = CameraMono;
    std::uint32_t bitDepth = 8;
    std::uint64_t exposure = 1000;
    std::uint64_t redExposure = 1000;
    std::uint64_t blueExposure = 1000;
    std::uint64_t minExposure = 1;
    std::uint64_t maxExposure = 1000000000000;
    bool doesCycle = false;
    std::uint16_t startColour = PatternRed;

  private:
    template <typename Value, typename Member>
    CameraResult Note(const char* name, Value value, Member* member) {
        calls.push_back(std::string(name) + " " + std::to_string(value));
        *member = static_cast<Member>(value);
        return CameraOk;
    }

    std::vector<std::string> calls;
};

}  // namespace ZV::Testing
