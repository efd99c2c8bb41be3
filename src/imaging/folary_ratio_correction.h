#pragma once

#include <atomic>
#include <cstdint>

#include "imaging/image_filter.h"
#include "zentara/zentara.h"

namespace ZV {

/// Corrects the pixel ratio of a `Folary` mosaic. `Process` declines until it is built.
class ZENTARA_API ZFolaryRatioCorrection : public ZImageFilter {
  public:
    explicit ZFolaryRatioCorrection(std::uint16_t outputFormat);
    ~ZFolaryRatioCorrection() override;

    FilterResult Process(ZInImageBufferStruct* in, ZOutImageBufferStruct* out) override;
    /// Does nothing. `FilterDone`.
    FilterResult Init(std::uint32_t width, std::uint32_t height) override;
    /// Stores the format and does nothing with it. `FilterDone`.
    FilterResult SetOutputFormat(std::uint32_t format) override;

  private:
    std::atomic<std::uint32_t> outputFormat;
};

}  // namespace ZV
