#include "imaging/bayer_interpolation.h"

#include <array>

#include "imaging/image_formats.h"

namespace ZV {
namespace {

struct AlgorithmRow {
    std::uint16_t algorithm;
    KernelInterpolation interpolation;
};

// Kept: 3 is bicubic to a client, who never gets it in here; stored directly it is linear.
constexpr std::array Algorithms{
    AlgorithmRow{1, InterpolateLinear},
    AlgorithmRow{2, InterpolateNearest},
    AlgorithmRow{4, InterpolateCubic},
};

KernelInterpolation GetInterpolation(std::uint32_t algorithm) {
    for (const AlgorithmRow& row : Algorithms) {
        if (row.algorithm == algorithm) return row.interpolation;
    }
    return InterpolateLinear;
}

bool IsOfPlanes(std::uint32_t format) {
    return format == RGBPlane8 || format == RGBPlane16;
}

/// Whether an engine makes this format when it is asked for by `Process`.
bool HasEngine(std::uint32_t format) {
    return IsFilterThreeColour(format) && !IsOfPlanes(format);
}

/// Bytes of a sample in the engine of a format.
std::size_t GetSampleBytes(std::uint32_t format) {
    return format == RGB48 ? sizeof(Word) : 1;
}

BayerMosaic DescribeMosaic(const ZInImageBufferStruct& in) {
    return {in.data, in.imageSize, in.width, in.height, in.colourPattern};
}

}  // namespace

ZBayerInterpolation::ZBayerInterpolation(std::uint16_t newAlgorithm, std::uint16_t newOutputFormat)
    : algorithm(newAlgorithm), outputFormat(newOutputFormat) {}

ZBayerInterpolation::~ZBayerInterpolation() = default;

FilterResult ZBayerInterpolation::Process(ZInImageBufferStruct* in, ZOutImageBufferStruct* out) {
    const std::uint32_t format = GetOutputFormat();
    if (!IsBayer(in->imageFormat) || !IsFilterThreeColour(format)) return FilterDeclined;
    if (!IsInitialised()) return FilterNotInitialised;
    if (!HasEngine(format)) return FilterUnusableFormat;
    const KernelInterpolation interpolation = GetInterpolation(GetAlgorithm());
    const BayerTarget target{out->data, out->dataCapacity, format};
    std::uint32_t outputBytes = 0;
    FilterResult result = FilterNotInitialised;
    {
        const std::lock_guard hold(scratchMutex);
        if (!IsWithinSensor(*in)) return FilterNotInitialised;
        result = GetSampleBytes(format) == sizeof(Word)
                     ? engine.Run16(DescribeMosaic(*in), interpolation, target, &outputBytes)
                     : engine.Run8(DescribeMosaic(*in), interpolation, target, &outputBytes);
    }
    if (result != FilterDone) return result;
    out->imageSize = outputBytes;
    out->imageFormat = format;
    out->width = in->width;
    out->height = in->height;
    return FilterDone;
}

std::uint64_t ZBayerInterpolation::MeasureOutput(const ZInImageBufferStruct& in,
                                                 std::uint32_t format) const {
    if (!IsBayer(in.imageFormat) || !IsInitialised() || !HasEngine(format)) return 0;
    const std::lock_guard hold(scratchMutex);
    if (!IsWithinSensor(in)) return 0;
    return BayerEngine::MeasureImage(in.width, in.height, format, GetSampleBytes(format));
}

FilterResult ZBayerInterpolation::Init(std::uint32_t newWidth, std::uint32_t newHeight) {
    const std::lock_guard hold(scratchMutex);
    width = newWidth;
    height = newHeight;
    engine.Reserve(width);
    isInitialised.store(true, std::memory_order_relaxed);
    return FilterDone;
}

bool ZBayerInterpolation::IsWithinSensor(const ZInImageBufferStruct& in) const {
    return std::uint64_t{in.width} * in.height <= std::uint64_t{width} * height;
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

FilterResult ZBayerInterpolation::BayerUsingSSE(const std::uint8_t* in, std::uint32_t frameWidth,
                                                std::uint32_t frameHeight, std::uint32_t bitDepth,
                                                std::uint32_t pattern, std::uint8_t* out,
                                                std::uint32_t outFormat, std::uint32_t* outSize,
                                                std::uint8_t* const* outPlanes,
                                                std::uint8_t* const* quarterPlanes,
                                                std::uint32_t newAlgorithm) {
    // Kept: without an engine the algorithm comes back as the result.
    if (!HasEngine(outFormat)) return static_cast<FilterResult>(newAlgorithm);
    const auto run = outFormat == RGB48 ? &ZBayerInterpolation::Private_Bayer16BitUsingSSE
                                        : &ZBayerInterpolation::Private_Bayer8BitUsingSSE;
    return (this->*run)(in, frameWidth, frameHeight, bitDepth, pattern, out, outFormat, outSize,
                        outPlanes, quarterPlanes, GetInterpolation(newAlgorithm));
}

FilterResult ZBayerInterpolation::Private_Bayer8BitUsingSSE(
    const std::uint8_t* in, std::uint32_t frameWidth, std::uint32_t frameHeight, std::uint32_t,
    std::uint32_t pattern, std::uint8_t* out, std::uint32_t outFormat, std::uint32_t* outSize,
    std::uint8_t* const*, std::uint8_t* const*, std::uint32_t interpolation) {
    const std::lock_guard hold(scratchMutex);
    const std::uint64_t bytes = std::uint64_t{frameWidth} * frameHeight;
    return engine.Run8({in, bytes, frameWidth, frameHeight, pattern},
                       static_cast<KernelInterpolation>(interpolation), {out, 0, outFormat},
                       outSize);
}

FilterResult ZBayerInterpolation::Private_Bayer16BitUsingSSE(
    const std::uint8_t* in, std::uint32_t frameWidth, std::uint32_t frameHeight, std::uint32_t,
    std::uint32_t pattern, std::uint8_t* out, std::uint32_t outFormat, std::uint32_t* outSize,
    std::uint8_t* const*, std::uint8_t* const*, std::uint32_t interpolation) {
    const std::lock_guard hold(scratchMutex);
    const std::uint64_t bytes = std::uint64_t{frameWidth} * frameHeight * sizeof(Word);
    return engine.Run16({in, bytes, frameWidth, frameHeight, pattern},
                        static_cast<KernelInterpolation>(interpolation), {out, 0, outFormat},
                        outSize);
}

}  // namespace ZV
