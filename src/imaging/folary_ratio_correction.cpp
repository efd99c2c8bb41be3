#include "imaging/folary_ratio_correction.h"

#include <cstddef>
#include <cstring>

#include "camera/camera.h"
#include "imaging/horizontal_reduction.h"
#include "imaging/image_formats.h"
#include "imaging/row_zoom.h"

namespace ZV {
namespace {

constexpr std::uint32_t ByteDepth = 8;

struct VideoSensor {
    std::uint32_t width;
    std::uint32_t factor;  ///< By which its real-time video is reduced across.
};
constexpr VideoSensor VideoSensors[] = {{2048, 3}, {2560, 4}};

/// 0 for a sensor whose real-time video needs no correction.
std::uint32_t FindVideoFactor(std::uint32_t sensorWidth) {
    for (const VideoSensor& sensor : VideoSensors) {
        if (sensor.width == sensorWidth) return sensor.factor;
    }
    return 0;
}

std::uint32_t GetSampleBytes(const ZInImageBufferStruct& in) {
    return in.bitDepth == ByteDepth ? 1 : 2;
}

/// Whether the frame has the bytes that its size asks for. A product that would wrap does not.
bool IsWhole(const ZInImageBufferStruct& in) {
    if (in.width == 0 || in.height == 0) return true;
    const std::uint64_t samples = in.imageSize / GetSampleBytes(in);
    return in.width <= samples && in.height <= samples / in.width && in.data != nullptr;
}

/// Kept: every pattern that is no mosaic's counts as the first one.
std::uint32_t GetMosaicPattern(const ZInImageBufferStruct& in) {
    const bool isMosaic = in.colourPattern >= PatternRGGB && in.colourPattern <= PatternBGGR;
    return isMosaic ? in.colourPattern : std::uint32_t{PatternRGGB};
}

bool DoesFit(std::uint64_t bytes, const ZOutImageBufferStruct& out) {
    return out.dataCapacity == 0 || bytes <= out.dataCapacity;
}

/// The number by which columns are reduced; 1 for a frame that is left as it is.
std::uint32_t FindFactor(const ZInImageBufferStruct& in) {
    if (!in.isRTV) return in.symmetricalBinningMode;
    const std::uint32_t factor = FindVideoFactor(in.camera->GetCCDWidth());
    return factor != 0 ? factor : 1;
}

/// Kept: no camera reports this mode; it leaves size, width and height of the output as they came.
bool IsWithoutBinning(const ZInImageBufferStruct& in) {
    return !in.isRTV && in.symmetricalBinningMode == 0;
}

void DoubleRows(const ZInImageBufferStruct& in, const RatioOutcome& outcome, std::uint8_t* image) {
    // Kept: both sides travel as 16 bits, so larger frames are filled by what is left of them.
    const auto fillWidth = static_cast<std::uint16_t>(outcome.width);
    const auto fillHeight = static_cast<std::uint16_t>(outcome.height);
    const bool isFilledWhole = CanZoomFillRows(fillWidth, fillHeight) &&
                               fillWidth == outcome.width && fillHeight == outcome.height;
    if (!isFilledWhole) {
        // What no step writes must not be what the memory held before.
        const auto half = static_cast<std::size_t>(outcome.bytes / 2);
        std::memset(image + half, 0, half);
    }
    const std::uint32_t sampleBytes = GetSampleBytes(in);
    ZoomSpreadRows(image, image, outcome.width, in.height, sampleBytes);
    ZoomFillRows(GetMosaicPattern(in), image, fillWidth, fillHeight, sampleBytes);
}

void MakeImage(const ZInImageBufferStruct& in, const RatioOutcome& outcome,
               ZOutImageBufferStruct& out) {
    out.width = outcome.width;
    out.height = outcome.height;
    out.imageSize = static_cast<std::uint32_t>(outcome.bytes);
    if (outcome.bytes == 0) return;
    // Kept: a factor that nothing is reduced by gives the smaller size all the same, and leaves the
    // output's bytes as they were.
    ReduceRows(in.data, in.width, in.height, FindFactor(in), GetSampleBytes(in), out.data);
    if (in.isRTV) DoubleRows(in, outcome, out.data);
}

}  // namespace

ZFolaryRatioCorrection::ZFolaryRatioCorrection(std::uint16_t newOutputFormat)
    : outputFormat(newOutputFormat) {}

ZFolaryRatioCorrection::~ZFolaryRatioCorrection() = default;

FilterResult ZFolaryRatioCorrection::Process(ZInImageBufferStruct* in, ZOutImageBufferStruct* out) {
    const RatioOutcome outcome = Measure(*in, *out);
    if (outcome.result != FilterDone) return outcome.result;
    if (!IsWithoutBinning(*in)) {
        if (!DoesFit(outcome.bytes, *out)) return FilterFailed;
        MakeImage(*in, outcome, *out);
    }
    out->imageFormat = in->imageFormat;
    return FilterDone;
}

RatioOutcome ZFolaryRatioCorrection::Measure(const ZInImageBufferStruct& in,
                                             const ZOutImageBufferStruct& out) const {
    if (in.camera == nullptr || in.camera->GetModel() != zmodelFolary) return {FilterDeclined};
    if (IsWithoutBinning(in)) return {FilterDone, out.width, out.height, out.imageSize};
    const std::uint32_t factor = FindFactor(in);
    if (factor == 1) return {FilterDeclined};
    if (!IsWhole(in)) return {FilterFailed};
    const std::uint32_t width = CalculateReducedWidth(in.width, factor);
    const std::uint32_t height = in.isRTV ? in.height * 2 : in.height;
    const std::uint64_t rows = std::uint64_t{in.height} * (in.isRTV ? 2 : 1);
    return {FilterDone, width, height, width * rows * GetSampleBytes(in)};
}

FilterResult ZFolaryRatioCorrection::Init(std::uint32_t, std::uint32_t) {
    return FilterDone;
}

FilterResult ZFolaryRatioCorrection::SetOutputFormat(std::uint32_t format) {
    outputFormat.store(format, std::memory_order_relaxed);
    return FilterDone;
}

}  // namespace ZV
