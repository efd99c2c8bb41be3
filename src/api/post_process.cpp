#include "api/post_process.h"

#include <algorithm>
#include <array>
#include <cstdlib>
#include <cstring>
#include <mutex>

#include "api/exported_call.h"
#include "api/handles.h"
#include "api/settings_block.h"
#include "diagnostics/log.h"
#include "imaging/image_formats.h"

// Threads. Both calls run on the client's thread, beside deliveries of the same camera. The chain
// runs under `postMutex` of the frame's camera, the Bayer filter's scratch has a lock of its own.
// Format and algorithm are single words of the shared filter: a send in between may exchange them,
// and the output's capacity keeps whatever is made then within the client's buffer.

namespace ZV {

namespace {

struct AlgorithmRow {
    std::uint32_t asked;
    std::uint16_t stored;
};

constexpr std::array Algorithms{
    AlgorithmRow{zbayerAverage, zbayerAverage},
    AlgorithmRow{zbayerFast, zbayerFast},
    AlgorithmRow{zbayerBicubic, zbayerBicubicFaster},
    AlgorithmRow{zbayerBicubicFaster, zbayerBicubicFaster},
};

// ---- A single frame ----

/// Gives the frame a buffer of the C allocator with a copy of the pixels. The old one goes after
/// the copy, for both frames may lie in it.
bool ReplaceBuffer(Zentara_Frame& frame, const void* pixels, std::uint32_t bytes) {
    void* const made = std::malloc(std::max(bytes, std::uint32_t{1}));
    if (made == nullptr) return false;
    std::memcpy(made, pixels, bytes);
    std::free(frame.pBuffer);
    frame.pBuffer = made;
    frame.bufferSize = bytes;
    return true;
}

/// Kept: a buffer that is too small is given back to the C allocator, wherever the client had it
/// from, and the private words stay those of `to`.
ZentaraResult CopyFrame(const Zentara_Frame& from, Zentara_Frame& to) {
    if (!HoldsItsPixels(from)) return zerrBadParameter;
    if (to.pBuffer == nullptr || to.bufferSize < from.size) {
        if (!ReplaceBuffer(to, from.pBuffer, from.size)) return zerrDriverFault;
    } else {
        std::memmove(to.pBuffer, from.pBuffer, from.size);
    }
    to.format = from.format;
    to.width = from.width;
    to.height = from.height;
    to.size = from.size;
    to.bits = from.bits;
    to.frameNumber = from.frameNumber;
    to.bayerPattern = from.bayerPattern;
    to.errorCode = from.errorCode;
    to.timeStamp = from.timeStamp;
    return zerrNone;
}

/// Runs the chain of the frame's camera with the settings' algorithm and format.
ZentaraResult RunChain(CameraContext& context, ZInImageBufferStruct& in, std::uint32_t format,
                       std::uint32_t algorithm, const Zentara_Frame& outFrame,
                       ZOutImageBufferStruct* out) {
    const std::lock_guard hold(context.postMutex);
    (void)context.postPipeline->SetOutputFormat(format);
    if (algorithm == 0) return zerrBadParameter;
    SetFilterAlgorithm(*context.bayerFilter, algorithm);
    const ZOutImageBufferStruct asGiven = DescribeOutput(outFrame, format, 0);
    const std::uint64_t bytes = CalculatePostProcessBytes(context, in, asGiven, format);
    const ZentaraResult checked = CheckOutput(outFrame, bytes);
    if (checked != zerrNone) return checked;
    *out = DescribeOutput(outFrame, format, bytes);
    bool isComplete = true;
    // Kept: a failure of the chain is not told; the record is filled as for a success.
    (void)context.postPipeline->ProcessImage(&in, out, &isComplete);
    return zerrNone;
}

ZentaraResult ColourFrame(const char* function, Zentara_Settings& settings,
                          const Zentara_Frame& inFrame, Zentara_Frame& outFrame) {
    std::uint32_t format = 0;
    const ZentaraResult read = Zentara_GetParam(&settings, zprmPostProcessImageFormat, &format);
    if (read != zerrNone) return read;
    if (Zentara_CalcImageSize(format, inFrame.width, inFrame.height) == 0) return zerrBadParameter;
    // Kept: from here on the camera is the frame's, whatever the handle was.
    ZCamera* const camera = FindFrameCamera(inFrame);
    CameraContext* const context = camera != nullptr ? GetCameraContext(*camera) : nullptr;
    if (context == nullptr) return zerrBadHandle;
    if (!HoldsItsPixels(inFrame)) return zerrBadParameter;
    ZInImageBufferStruct in = DescribeFrame(inFrame, camera);
    const std::uint16_t bits = inFrame.bits;
    ZOutImageBufferStruct out;
    const std::uint32_t algorithm = GetSettingsWord(settings, zprmPostProcessBayerAlgorithm);
    const ZentaraResult ran = RunChain(*context, in, format, algorithm, outFrame, &out);
    if (ran != zerrNone) return ran;

    outFrame.bits = bits;
    outFrame.width = out.width;
    outFrame.height = out.height;
    outFrame.size =
        static_cast<std::uint32_t>(Zentara_CalcImageSize(format, out.width, out.height));
    outFrame.format = format;
    ZLogFrame(function, outFrame);
    return zerrNone;
}

ZentaraResult PostProcessSingleFrame(const char* function, ZentaraHandle handle,
                                     Zentara_Settings* settings, const Zentara_Frame* inFrame,
                                     Zentara_Frame* outFrame) {
    if (!ZCamera::IsInitalized()) return zerrNotLoaded;
    // Kept: a null handle is a bad parameter here, and nobody asks whether its camera is open.
    if (handle == 0 || inFrame == nullptr || outFrame == nullptr) return zerrBadParameter;
    if (settings == nullptr || !HasSettingsMagic(*settings)) return zerrBadSettings;
    if (!HasExclusiveAccess(function, FindCamera(handle))) return zerrBadHandle;
    if (inFrame->format < zfmtBayer8) return CopyFrame(*inFrame, *outFrame);
    return ColourFrame(function, *settings, *inFrame, *outFrame);
}

// ---- The Bayer filter alone ----

/// Whether the call has run to its end; false for algorithm 0.
struct BayerOutcome {
    ZentaraResult result = zerrNone;
    bool hasEnded = true;
};

BayerOutcome BayerToRgb(std::uint32_t algorithm, const Zentara_Frame* inFrame,
                        Zentara_Frame* outFrame) {
    if (!ZCamera::IsInitalized()) return {zerrNotLoaded};
    if (inFrame == nullptr || outFrame == nullptr) return {zerrBadParameter};
    ZCamera* const camera = FindFrameCamera(*inFrame);
    CameraContext* const context = camera != nullptr ? GetCameraContext(*camera) : nullptr;
    if (context == nullptr) return {zerrBadHandle};
    if (!HoldsItsPixels(*inFrame)) return {zerrBadParameter};

    ZBayerInterpolation& filter = *context->bayerFilter;
    const std::uint32_t format = static_cast<std::uint16_t>(outFrame->format);
    // Kept: format and algorithm stay behind in the filter that the camera's pipelines share.
    (void)filter.SetOutputFormat(format);
    if (algorithm == 0) return {zerrNone, false};
    SetFilterAlgorithm(filter, algorithm);
    ZInImageBufferStruct in = DescribeFrame(*inFrame, camera);
    const std::uint64_t bytes = filter.MeasureOutput(in, format);
    const ZentaraResult checked = CheckOutput(*outFrame, bytes);
    if (checked != zerrNone) return {checked};
    ZOutImageBufferStruct out = DescribeOutput(*outFrame, format, bytes);
    // Kept: a filter that fails or declines leaves the frame's own width and height, and no code.
    (void)filter.Process(&in, &out);
    outFrame->bits = inFrame->bits;
    outFrame->width = out.width;
    outFrame->height = out.height;
    // Kept: of the whole format, of which the filter had the low 16 bits.
    outFrame->size =
        static_cast<std::uint32_t>(Zentara_CalcImageSize(outFrame->format, out.width, out.height));
    return {zerrNone};
}

}  // namespace

ZInImageBufferStruct DescribeFrame(const Zentara_Frame& frame, ZCamera* camera) {
    ZInImageBufferStruct in;
    in.data = static_cast<std::uint8_t*>(frame.pBuffer);
    in.imageSize = frame.size;
    in.width = frame.width;
    in.height = frame.height;
    in.bitDepth = frame.bits;
    in.colourPattern = ConvertFrameMosaicToColourPattern(frame.bayerPattern);
    in.imageFormat = frame.format;
    in.filterColour = frame.privatePattern;
    in.symmetricalBinningMode = frame.privateBinning;
    in.isRTV = frame.privateRealTime != 0;
    in.camera = camera;
    return in;
}

bool HoldsItsPixels(const Zentara_Frame& frame) {
    if (frame.pBuffer == nullptr) return false;
    return frame.bufferSize == 0 || frame.bufferSize >= frame.size;
}

ZCamera* FindFrameCamera(const Zentara_Frame& frame) {
    ZentaraHandle handle = 0;
    std::memcpy(&handle, frame.privateCamera, sizeof(handle));
    ZCamera* const camera = FindCamera(handle);
    return IsOpen(camera) ? camera : nullptr;
}

std::uint64_t CalculatePostProcessBytes(const CameraContext& context,
                                        const ZInImageBufferStruct& in,
                                        const ZOutImageBufferStruct& out,
                                        std::uint32_t outputFormat) {
    const RatioOutcome ratio = context.ratioCorrection->Measure(in, out);
    ZInImageBufferStruct corrected = in;
    if (ratio.result == FilterDone) {
        corrected.imageSize = static_cast<std::uint32_t>(ratio.bytes);
        corrected.width = ratio.width;
        corrected.height = ratio.height;
    } else if (ratio.result != FilterDeclined) {
        return 0;  // The chain ends there.
    }
    // The white balance works in place.
    return std::max(std::uint64_t{corrected.imageSize},
                    context.bayerFilter->MeasureOutput(corrected, outputFormat));
}

ZentaraResult CheckOutput(const Zentara_Frame& frame, std::uint64_t bytes) {
    if (frame.pBuffer == nullptr) return zerrBadParameter;
    if (frame.bufferSize != 0 && frame.bufferSize < bytes) return zerrBufferTooSmall;
    return zerrNone;
}

ZOutImageBufferStruct DescribeOutput(const Zentara_Frame& frame, std::uint32_t format,
                                     std::uint64_t bytes) {
    ZOutImageBufferStruct out;
    out.data = static_cast<std::uint8_t*>(frame.pBuffer);
    out.width = frame.width;
    out.height = frame.height;
    out.imageFormat = static_cast<std::uint16_t>(format);
    out.dataCapacity = frame.bufferSize != 0 ? frame.bufferSize : std::max(bytes, std::uint64_t{1});
    return out;
}

void SetFilterAlgorithm(ZBayerInterpolation& filter, std::uint32_t algorithm) {
    for (const AlgorithmRow& row : Algorithms) {
        if (row.asked == algorithm) (void)filter.SetAlgorithm(row.stored);
    }
}

}  // namespace ZV

ZentaraResult Zentara_PostProcessSingleFrame(ZentaraHandle handle, Zentara_Settings* settings,
                                             const Zentara_Frame* inFrame,
                                             Zentara_Frame* outFrame) {
    return ZV::Traced(__func__, [&](const char* function) {
        return ZV::PostProcessSingleFrame(function, handle, settings, inFrame, outFrame);
    });
}

ZentaraResult Zentara_BayerToRgb(uint32_t algorithm, const Zentara_Frame* inFrame,
                                 Zentara_Frame* outFrame) {
    ZV::ZLogEnter(__func__);
    ZV::BayerOutcome outcome;
    outcome.result = ZV::Guarded([&] {
        outcome = ZV::BayerToRgb(algorithm, inFrame, outFrame);
        return outcome.result;
    });
    // Kept: with algorithm 0 no end record is written, and the log's depth stays one too high.
    if (outcome.hasEnded) ZV::ZLogLeave(__func__, static_cast<std::uint16_t>(outcome.result));
    return outcome.result;
}
