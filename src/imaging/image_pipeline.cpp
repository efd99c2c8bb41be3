#include "imaging/image_pipeline.h"

#include <algorithm>
#include <cstring>

#include "camera/camera_result.h"
#include "imaging/ex_image.h"
#include "imaging/kernels/kernel_selection.h"

namespace ZV {
namespace {

constexpr std::uint32_t IntermediatePixelBytes = 6;  // `RGB48`, the widest format.

ZInImageBufferStruct DescribeImage(const ZExImage& image) {
    ZInImageBufferStruct in;
    in.data = image.GetImageData();
    in.imageSize = std::min(image.GetImageSize(), image.GetBufferBytes());
    in.width = image.GetWidth();
    in.height = image.GetHeight();
    in.bitDepth = image.GetBitDepth();
    in.colourPattern = image.GetColourPattern();
    in.imageFormat = image.GetImageFormat();
    in.filterColour = image.GetColourPattern();
    in.symmetricalBinningMode = image.GetSymmetricalBinningMode();
    in.isRTV = image.IsRTV();
    in.camera = static_cast<ZCamera*>(image.GetCamera());
    return in;
}

bool DoesFit(std::uint32_t bytes, const ZOutImageBufferStruct& out) {
    return out.dataCapacity == 0 || bytes <= out.dataCapacity;
}

// A client may give one buffer for both ends.
void CopyBytes(std::uint8_t* to, const std::uint8_t* from, std::uint32_t bytes) {
    if (bytes != 0 && to != from) std::memmove(to, from, bytes);
}

/// An image without an intermediate buffer is passed on where it lies: a filter that would work on
/// the output's bytes finds no room there and fails.
FilterResult PassInputOn(const ZInImageBufferStruct& in, ZOutImageBufferStruct& out,
                         bool isOfImage) {
    const bool doesFit = DoesFit(in.imageSize, out);
    if (!doesFit && !isOfImage) return FilterFailed;
    if (doesFit) CopyBytes(out.data, in.data, in.imageSize);
    out.imageSize = in.imageSize;
    out.width = in.width;
    out.height = in.height;
    out.imageFormat = in.imageFormat;
    return FilterDeclined;
}

/// Whether a filter that ended like this has left the image as it was though it is one for it: for
/// want of memory, or of its lock.
bool IsUnmade(FilterResult result, bool lacksMemory) {
    if (result == FilterFailed) return lacksMemory;
    return result == FilterNotInitialised || result == CameraHalFault;
}

}  // namespace

ZImagePipeline::ZImagePipeline() {
    SelectKernels();
}

ZImagePipeline::~ZImagePipeline() = default;

void ZImagePipeline::Setup(std::uint32_t newWidth, std::uint32_t newHeight) {
    width = newWidth;
    height = newHeight;
    hasBuffer = true;
    // The product wraps at 32 bits; a buffer that is too small, or missing, grows with the first
    // image.
    (void)intermediate.AllocateAhead(width * height * IntermediatePixelBytes);
}

void ZImagePipeline::AddFilter(ZImageFilter* filter) {
    if (filter == nullptr) return;
    filters.push_back(filter);
    (void)filter->Init(width, height);  // Kept: not looked at; such a filter declines by itself.
}

bool ZImagePipeline::RemoveFilter(ZImageFilter* filter) {
    const auto place = std::find(filters.begin(), filters.end(), filter);
    if (place == filters.end()) return false;
    filters.erase(place);
    return true;
}

void ZImagePipeline::ResetFilters() {
    for (ZImageFilter* filter : filters) filter->Reset();
}

FilterResult ZImagePipeline::SetOutputFormat(std::uint32_t format) {
    for (ZImageFilter* filter : filters) {
        const FilterResult result = filter->SetOutputFormat(format);
        if (result != FilterDone) return result;
    }
    return FilterDone;
}

std::uint32_t ZImagePipeline::GetNeededOutputBufferSize(ZInImageBufferStruct* in) {
    std::uint32_t needed = in->imageSize;
    for (ZImageFilter* filter : filters) {
        needed = std::max(needed, filter->GetNeededOutputBufferSize(in));
    }
    return needed;
}

FilterResult ZImagePipeline::ProcessImage(ZInImageBufferStruct* in, ZOutImageBufferStruct* out,
                                          bool* complete) {
    return RunFilters(*in, *out, complete, nullptr);
}

FilterResult ZImagePipeline::RunFilters(ZInImageBufferStruct& in, ZOutImageBufferStruct& out,
                                        bool* complete, const ZExImage* image) {
    // Kept: `*complete` is not touched by this one, so callers set it beforehand.
    if (!hasBuffer) return PipelineNotSetUp;
    *complete = true;
    if (filters.empty()) return PipelineEmpty;
    out.imageSize = 0;
    FilterResult status = FilterDone;
    for (ZImageFilter* filter : filters) {
        status = RunFilter(*filter, in, out, image);
        if (status == FilterNothingYet) {
            *complete = false;
        } else if (status != FilterDone && status != FilterDeclined) {
            break;
        }
    }
    return status;
}

FilterResult ZImagePipeline::ProcessImage(ZExImage* image, bool* complete) {
    const std::uint32_t oldSize = image->GetImageSize();
    ZInImageBufferStruct in = DescribeImage(*image);
    const std::uint32_t needed = GetNeededOutputBufferSize(&in);
    if (needed > oldSize) image->ResizeBuffer(needed);
    image->SetImageSize(oldSize);
    in.data = image->GetImageData();

    std::uint8_t noRoom = 0;  // A capacity of 0 would be one that its owner vouches for.
    ZOutImageBufferStruct out;
    out.data = &noRoom;
    out.dataCapacity = sizeof(noRoom);
    const bool hasRoom = hasBuffer && ReserveIntermediate(std::max(needed, std::uint32_t{1}));
    if (hasRoom) {
        out.data = intermediate.GetData();
        out.dataCapacity = intermediate.GetBytes();
    }
    const FilterResult result = RunFilters(in, out, complete, image);
    const bool lacksMemory = !hasRoom || image->GetBufferBytes() < needed;
    if (IsUnmade(result, lacksMemory) && image->GetErrorCode() == FrameStatusGood) {
        image->SetErrorCode(FrameStatusBufferTooSmall);
    }
    if (result == FilterDone) {
        image->SetImageFormat(out.imageFormat);
        image->SetImageSize(out.imageSize);
        image->SetWidth(static_cast<std::uint16_t>(out.width));
        image->SetHeight(static_cast<std::uint16_t>(out.height));
    }
    return result;
}

FilterResult ZImagePipeline::RunFilter(ZImageFilter& filter, ZInImageBufferStruct& in,
                                       ZOutImageBufferStruct& out, const ZExImage* image) {
    // Kept: nothing is copied for a disabled filter, so one that works in place behind it finds old
    // bytes.
    if (!filter.IsEnabled()) return FilterDeclined;
    const FilterResult status = filter.Process(&in, &out);
    if (status == FilterDone) return TakeOutput(in, out, image);
    if (status == FilterDeclined) return PassInputOn(in, out, image != nullptr);
    return status;
}

FilterResult ZImagePipeline::TakeOutput(ZInImageBufferStruct& in, const ZOutImageBufferStruct& out,
                                        const ZExImage* image) {
    if (!DoesFit(out.imageSize, out)) return FilterFailed;
    if (image != nullptr) {
        if (out.imageSize > image->GetBufferBytes()) return FilterFailed;
    } else {
        if (!ReserveIntermediate(out.imageSize)) return FilterFailed;
        in.data = intermediate.GetData();
    }
    CopyBytes(in.data, out.data, out.imageSize);
    in.imageSize = out.imageSize;
    in.imageFormat = out.imageFormat;
    in.width = out.width;
    in.height = out.height;
    return FilterDone;
}

bool ZImagePipeline::ReserveIntermediate(std::uint64_t bytes) {
    return bytes <= intermediate.GetBytes() || intermediate.Allocate(bytes);
}

}  // namespace ZV
