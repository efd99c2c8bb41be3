#pragma once

#include <cstdint>
#include <vector>

#include "imaging/image_filter.h"
#include "imaging/object.h"
#include "imaging/pixel_buffer.h"
#include "zentara/zentara.h"

namespace ZV {

class ZExImage;

/// An ordered list of filters, which it does not own, and one intermediate buffer.
///
/// One call at a time: it has no lock of its own.
class ZENTARA_API ZImagePipeline : public ZObject {
  public:
    /// Chooses the form of the pixel kernels.
    ZImagePipeline();
    ZImagePipeline(const ZImagePipeline&) = delete;
    ZImagePipeline& operator=(const ZImagePipeline&) = delete;
    virtual ~ZImagePipeline();

    /// Stores the size and makes an intermediate buffer for three colours of 16 bits. A second call
    /// replaces it. The filters in the list are not told.
    void Setup(std::uint32_t width, std::uint32_t height);

    /// Appends and calls the filter's `Init` with the size of `Setup`, 0 by 0 before it.
    void AddFilter(ZImageFilter* filter);
    /// Takes the first entry of this filter out. False when there is none.
    bool RemoveFilter(ZImageFilter* filter);
    void ResetFilters();
    /// Tells every filter; ends at the first that fails and returns its result.
    FilterResult SetOutputFormat(std::uint32_t format);
    /// The largest of the input's size and what the filters ask for, disabled ones too.
    std::uint32_t GetNeededOutputBufferSize(ZInImageBufferStruct* in);

    /// Runs the enabled filters over a pair of plain buffers and returns the result of the last
    /// filter in the list: a chain whose last filter declines returns `FilterDeclined` even if an
    /// earlier one has worked. `PipelineNotSetUp` leaves `*complete` alone; then it is set, and
    /// cleared when a filter holds the image back. `in` changes on the way. An output with a
    /// `dataCapacity` is not written beyond it, else its owner vouches for it; what does not fit
    /// ends the chain with `FilterFailed`.
    FilterResult ProcessImage(ZInImageBufferStruct* in, ZOutImageBufferStruct* out, bool* complete);

    /// Runs the filters over an image, whose buffer grows if one of them needs it. Only a result of
    /// `FilterDone` changes the image's format, size, width and height, the latter two cut to 16
    /// bits; its pixels may be those of an earlier filter in any case. An image that a filter has
    /// failed on for want of memory, that its filter has no buffers of its size for, or cannot have
    /// the lock for, gets the error code `FrameStatusBufferTooSmall`, unless it has one. Without an
    /// intermediate buffer the filters are asked all the same: what they decline needs none.
    FilterResult ProcessImage(ZExImage* image, bool* complete);

  private:
    // `image` is the one in progress, whose own buffer takes what the filters make; null for a pair
    // of plain buffers.
    FilterResult RunFilters(ZInImageBufferStruct& in, ZOutImageBufferStruct& out, bool* complete,
                            const ZExImage* image);
    FilterResult RunFilter(ZImageFilter& filter, ZInImageBufferStruct& in,
                           ZOutImageBufferStruct& out, const ZExImage* image);
    FilterResult TakeOutput(ZInImageBufferStruct& in, const ZOutImageBufferStruct& out,
                            const ZExImage* image);
    bool ReserveIntermediate(std::uint64_t bytes);

    std::vector<ZImageFilter*> filters;  // borrowed from the camera or its context, until removed
    std::uint32_t width = 0;
    std::uint32_t height = 0;
    bool hasBuffer = false;
    PixelBuffer intermediate;
};

}  // namespace ZV
