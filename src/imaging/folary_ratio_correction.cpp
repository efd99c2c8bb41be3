#include "imaging/folary_ratio_correction.h"

#include <cstddef>
#include <cstring>

#include "camera/camera.h"
#include "imaging/horizontal_reduction.h"
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

bool DoesFit(std::uint64_t bytes, const ZOutImageBufferStruct& out) {
    return out.dataCapacity == 0 || bytes <= out.dataCapacity;
}

void Describe(std::uint32_t width, std::uint32_t height, std::uint64_t bytes,
              ZOutImageBufferStruct& out) {
    out.width = width;
    out.height = height;
    out.imageSize = static_cast<std::uint32_t>(bytes);
}

}  // namespace

ZFolaryRatioCorrection::ZFolaryRatioCorrection(std::uint16_t newOutputFormat)
    : outputFormat(newOutputFormat) {}

ZFolaryRatioCorrection::~ZFolaryRatioCorrection() = default;

FilterResult ZFolaryRatioCorrection::Process(ZInImageBufferStruct* in, ZOutImageBufferStruct* out) {
    if (in->camera == nullptr || in->camera->GetModel() != zmodelFolary) return FilterDeclined;
    if (!in->isRTV && in->symmetricalBinningMode == 1) return FilterDeclined;
    FilterResult result = FilterDone;
    if (in->isRTV) {
        result = CorrectRTV(*in, *out);
    } else if (in->symmetricalBinningMode > 1) {
        result = CorrectHorizontalRatio(*in, *out);
    }
    // Kept: a binning of 0 leaves size, width and height of the output as they came.
    if (result == FilterDone) out->imageFormat = in->imageFormat;
    return result;
}

FilterResult ZFolaryRatioCorrection::Init(std::uint32_t, std::uint32_t) {
    return FilterDone;
}

FilterResult ZFolaryRatioCorrection::SetOutputFormat(std::uint32_t format) {
    outputFormat.store(format, std::memory_order_relaxed);
    return FilterDone;
}

/// Kept: a factor that nothing is reduced by gives the smaller size all the same, and leaves the
/// output's bytes as they were.
FilterResult ZFolaryRatioCorrection::CorrectHorizontalRatio(const ZInImageBufferStruct& in,
                                                            ZOutImageBufferStruct& out) const {
    if (!IsWhole(in)) return FilterFailed;
    const std::uint32_t factor = in.symmetricalBinningMode;
    const std::uint32_t sampleBytes = GetSampleBytes(in);
    const std::uint32_t width = CalculateReducedWidth(in.width, factor);
    const std::uint64_t bytes = std::uint64_t{width} * in.height * sampleBytes;
    if (!DoesFit(bytes, out)) return FilterFailed;
    if (bytes != 0) ReduceRows(in.data, in.width, in.height, factor, sampleBytes, out.data);
    Describe(width, in.height, bytes, out);
    return FilterDone;
}

FilterResult ZFolaryRatioCorrection::CorrectRTV(const ZInImageBufferStruct& in,
                                                ZOutImageBufferStruct& out) const {
    const std::uint32_t factor = FindVideoFactor(in.camera->GetCCDWidth());
    if (factor == 0) return FilterDeclined;
    if (!IsWhole(in)) return FilterFailed;
    const std::uint32_t sampleBytes = GetSampleBytes(in);
    const std::uint32_t width = CalculateReducedWidth(in.width, factor);
    const std::uint64_t reducedBytes = std::uint64_t{width} * in.height * sampleBytes;
    if (!DoesFit(2 * reducedBytes, out)) return FilterFailed;
    Describe(width, in.height * 2, 2 * reducedBytes, out);
    if (reducedBytes == 0) return FilterDone;

    ReduceRows(in.data, in.width, in.height, factor, sampleBytes, out.data);
    // Kept: both sides travel as 16 bits, so larger frames are filled by what is left of them.
    const auto fillWidth = static_cast<std::uint16_t>(width);
    const auto fillHeight = static_cast<std::uint16_t>(out.height);
    const bool isFilledWhole =
        CanZoomFillRows(fillWidth, fillHeight) && fillWidth == width && fillHeight == out.height;
    if (!isFilledWhole) {
        // What no step writes must not be what the memory held before.
        const auto bytes = static_cast<std::size_t>(reducedBytes);
        std::memset(out.data + bytes, 0, bytes);
    }
    ZoomSpreadRows(out.data, out.data, width, in.height, sampleBytes);
    ZoomFillRows(in.colourPattern, out.data, fillWidth, fillHeight, sampleBytes);
    return FilterDone;
}

}  // namespace ZV
