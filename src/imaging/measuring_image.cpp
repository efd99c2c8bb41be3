#include "imaging/measuring_image.h"

#include <algorithm>
#include <limits>

#include "camera/camera.h"
#include "imaging/bayer_interpolation.h"
#include "imaging/image_formats.h"
#include "imaging/image_pipeline.h"

namespace ZV {
namespace {

constexpr double NanosecondsEnd = 18446744073709551616.0;

/// The output format of a Bayer filter for images of one depth, for the length of a block.
class FittingFormat {
  public:
    FittingFormat(ZBayerInterpolation* bayerFilter, std::uint32_t bitDepth) : filter(bayerFilter) {
        if (filter == nullptr) return;
        inForce = filter->GetOutputFormat();
        standIn = FindStandIn(inForce, bitDepth);
        if (standIn != inForce) (void)filter->SetOutputFormat(standIn);
    }
    ~FittingFormat() {
        // A format that was sent meanwhile stays, as far as it can be told: not one that equals the
        // stand-in, nor one that comes between this look and the setting.
        if (filter == nullptr || filter->GetOutputFormat() != standIn) return;
        if (standIn != inForce) (void)filter->SetOutputFormat(inForce);
    }
    FittingFormat(const FittingFormat&) = delete;
    FittingFormat& operator=(const FittingFormat&) = delete;

  private:
    // Planes and what is no format of three colours stay: the filter refuses or declines them.
    static std::uint32_t FindStandIn(std::uint32_t format, std::uint32_t bitDepth) {
        if (format < BGR24 || format > RGBX32) return format;
        if (Is16Bit(format) == (bitDepth != 8)) return format;
        return bitDepth == 8 ? RGB24 : RGB48;
    }

    ZBayerInterpolation* filter;  // borrowed from the camera, for the block
    std::uint32_t inForce = 0;
    std::uint32_t standIn = 0;
};

}  // namespace

MeasuringImage::~MeasuringImage() {
    ZCamera::FreeImage(image);
}

FilterResult MeasuringImage::Grab() {
    const CameraResult taken = camera.GetOneImage(&image);
    if (taken != CameraOk) return taken;
    return image != nullptr ? CameraOk : CameraNoImage;
}

FilterResult MeasuringImage::Interpolate() {
    ZImagePipeline* const pipeline = camera.GetBayerPipeline();
    if (pipeline == nullptr) return PipelineNotSetUp;
    const FittingFormat fitting(camera.GetBayerFilter(), image->GetBitDepth());
    bool isComplete = false;
    const FilterResult result = pipeline->ProcessImage(image, &isComplete);
    return result == FilterDeclined ? FilterDone : result;
}

void MeasuringImage::CutRegion(MeasuredRegion* region) const {
    region->width = std::min(region->width, image->GetWidth());
    region->height = std::min(region->height, image->GetHeight());
}

MeasuredImage MeasuringImage::Describe() const {
    return {image->GetImageData(), CountReadableBytes(*image), image->GetWidth(),
            image->GetHeight(), image->GetImageFormat()};
}

std::uint32_t CountReadableBytes(const ZExImage& image) {
    return std::min(image.GetImageSize(), image.GetBufferBytes());
}

std::uint64_t TruncateToNanoseconds(double nanoseconds) {
    if (!(nanoseconds > 0)) return 0;
    if (nanoseconds >= NanosecondsEnd) return std::numeric_limits<std::uint64_t>::max();
    return static_cast<std::uint64_t>(nanoseconds);
}

}  // namespace ZV
