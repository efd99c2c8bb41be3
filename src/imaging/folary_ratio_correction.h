#pragma once

#include <atomic>
#include <cstdint>

#include "imaging/image_filter.h"
#include "zentara/zentara.h"

namespace ZV {

/// What the ratio correction makes of an image.
struct RatioOutcome {
    FilterResult result = FilterDone;
    std::uint32_t width = 0;  ///< With `FilterDone`, as are the next two.
    std::uint32_t height = 0;
    std::uint64_t bytes = 0;
};

/// Corrects the pixel ratio of a `Folary` mosaic, which is binned down its columns alone, and keeps
/// it a mosaic. Images of every other model are declined. No state between frames.
class ZENTARA_API ZFolaryRatioCorrection : public ZImageFilter {
  public:
    explicit ZFolaryRatioCorrection(std::uint16_t outputFormat);
    ~ZFolaryRatioCorrection() override;

    /// A binned frame is reduced across by its binning mode. A frame of real-time video is reduced
    /// by what its sensor asks for and doubled down, as a mosaic of its pattern: 5 to 8, every
    /// other one counts as 5. The image format is not looked at; a bit depth of 8 means samples of
    /// a byte, every other one words. `in->data` is only read, unless it is `out->data`.
    ///
    /// Done as well, without real-time video: a binning of 0 sets the output's format and leaves
    /// size, width and height as they came; one for which there is no reduction (5, 7, 8) sets all
    /// four and writes no samples.
    ///
    /// In this order: `FilterDeclined` for another model, for a frame of binning 1 that is not
    /// real-time video, and for real-time video of a sensor that is neither 2048 nor 2560 wide;
    /// `FilterFailed` for a frame with fewer bytes than its size asks for, and for an output that
    /// does not hold the result.
    FilterResult Process(ZInImageBufferStruct* in, ZOutImageBufferStruct* out) override;
    /// What `Process` would make of this input if the output held it. Nothing is written. The
    /// output's own size, width and height are those of a frame with a binning mode of 0.
    [[nodiscard]] RatioOutcome Measure(const ZInImageBufferStruct& in,
                                       const ZOutImageBufferStruct& out) const;
    /// Does nothing. `FilterDone`.
    FilterResult Init(std::uint32_t width, std::uint32_t height) override;
    /// Stores the format and does nothing with it. `FilterDone`.
    FilterResult SetOutputFormat(std::uint32_t format) override;

  private:
    std::atomic<std::uint32_t> outputFormat;
};

}  // namespace ZV
