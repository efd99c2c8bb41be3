#pragma once

#include <atomic>
#include <cstdint>

#include "imaging/object.h"
#include "zentara/zentara.h"

namespace ZV {

class ZCamera;

/// Results of filters and pipelines; camera result codes travel here as well.
using FilterResult = std::int16_t;

inline constexpr FilterResult FilterDone = 0;           ///< The output is written.
inline constexpr FilterResult FilterUnknownFormat = 3;  ///< The format cannot be measured.
inline constexpr FilterResult FilterFailed = 5;      ///< Format not possible, or a kernel failed.
inline constexpr FilterResult FilterNothingYet = 6;  ///< Set not complete: nothing to deliver.
inline constexpr FilterResult PipelineNotSetUp = 27;
inline constexpr FilterResult FilterNotInitialised = 28;
inline constexpr FilterResult FilterUnusableFormat = 29;
inline constexpr FilterResult PipelineEmpty = 30;
inline constexpr FilterResult FilterDeclined = 31;  ///< The image is left as it was.

/// The image as it enters a filter.
struct ZInImageBufferStruct {
    std::uint8_t* data = nullptr;
    std::uint32_t imageSize = 0;  ///< Bytes at `data`.
    std::uint32_t width = 0;
    std::uint32_t height = 0;
    std::uint32_t bitDepth = 0;
    std::uint32_t colourPattern = 0;  ///< `ZColourPatternEnum`.
    std::uint32_t imageFormat = 0;    ///< `ZImageFormatEnum`.
    std::uint32_t filterColour = 0;   ///< Colour of the wheel that this frame shows.
    std::uint32_t symmetricalBinningMode = 0;
    bool isRTV = false;
    ZCamera* camera = nullptr;
};

/// Where a filter leaves its result. A filter that returns `FilterDone` has set all fields but the
/// first and the last.
struct ZOutImageBufferStruct {
    std::uint8_t* data = nullptr;
    std::uint32_t imageSize = 0;
    std::uint32_t width = 0;
    std::uint32_t height = 0;
    std::uint32_t imageFormat = 0;
    /// Bytes that `data` holds: a filter writes no more. 0: whoever gave the buffer vouches for it.
    std::uint64_t dataCapacity = 0;
};

/// One step of a pipeline.
class ZENTARA_API ZImageFilter : public ZObject {
  public:
    virtual ~ZImageFilter() = 0;

    /// Reads `in->data`, which it may change, and writes `out->data`.
    virtual FilterResult Process(ZInImageBufferStruct* in, ZOutImageBufferStruct* out) = 0;
    /// Told the sensor's size by the pipeline that takes the filter in.
    virtual FilterResult Init(std::uint32_t width, std::uint32_t height) = 0;
    virtual FilterResult SetOutputFormat(std::uint32_t format) = 0;
    virtual void Reset();
    virtual void Enable();
    virtual void Disable();
    virtual bool IsEnabled();
    /// Bytes that the result of this input may take; by default the input's size.
    virtual std::uint32_t GetNeededOutputBufferSize(ZInImageBufferStruct* in);

  protected:
    ZImageFilter();

  private:
    std::atomic<bool> enabled{true};
};

}  // namespace ZV
