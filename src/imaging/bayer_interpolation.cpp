#include "imaging/bayer_interpolation.h"

#include "imaging/image_formats.h"

namespace ZV {
namespace {

constexpr std::uint64_t SampleBytesMax = 2;

}  // namespace

ZBayerInterpolation::ZBayerInterpolation(std::uint16_t newAlgorithm, std::uint16_t newOutputFormat)
    : algorithm(newAlgorithm), outputFormat(newOutputFormat) {}

ZBayerInterpolation::~ZBayerInterpolation() = default;

FilterResult ZBayerInterpolation::Process(ZInImageBufferStruct*, ZOutImageBufferStruct*) {
    return FilterDeclined;
}

FilterResult ZBayerInterpolation::Init(std::uint32_t newWidth, std::uint32_t newHeight) {
    width = newWidth;
    height = newHeight;
    const std::uint64_t samples = std::uint64_t{width} * height;
    for (PixelBuffer* plane : {&redPlane, &bluePlane, &greenPlane}) {
        (void)plane->AllocateAhead(samples * SampleBytesMax);
    }
    for (PixelBuffer& plane : quarterPlanes) {
        (void)plane.AllocateAhead((samples * SampleBytesMax + 3) / 4);
    }
    (void)alphaPlane.AllocateAhead(samples);
    isInitialised = true;
    return FilterDone;
}

FilterResult ZBayerInterpolation::SetOutputFormat(std::uint32_t format) {
    outputFormat.store(format, std::memory_order_relaxed);
    return FilterDone;
}

std::uint32_t ZBayerInterpolation::GetNeededOutputBufferSize(ZInImageBufferStruct* in) {
    if (!IsBayer(in->imageFormat)) return in->imageSize;
    // Kept: bytes per pixel times bytes, so 16-bit samples ask for twice their need.
    return GetThreeColourPixelBytes(GetOutputFormat()) * in->imageSize;
}

std::uint16_t ZBayerInterpolation::GetAlgorithm() const {
    return algorithm.load(std::memory_order_relaxed);
}

FilterResult ZBayerInterpolation::SetAlgorithm(std::uint16_t newAlgorithm) {
    algorithm.store(newAlgorithm, std::memory_order_relaxed);
    return FilterDone;
}

std::uint32_t ZBayerInterpolation::GetOutputFormat() const {
    return outputFormat.load(std::memory_order_relaxed);
}

}  // namespace ZV
