#pragma once

#include <atomic>
#include <cstdint>
#include <mutex>

#include "imaging/bayer_engine.h"
#include "imaging/image_filter.h"
#include "zentara/zentara.h"

namespace ZV {

/// Turns a mosaic into three colours, at once for each frame.
///
/// Two pipelines of a camera share one filter: format and algorithm are words that each of them
/// reads when its frame comes, and the scratch serves one frame at a time. Thread-safe.
class ZENTARA_API ZBayerInterpolation : public ZImageFilter {
  public:
    /// Algorithms 1 (linear), 2 (nearest) and 4 (cubic); the output is a `ZImageFormatEnum`.
    ZBayerInterpolation(std::uint16_t algorithm, std::uint16_t outputFormat);
    ~ZBayerInterpolation() override;

    /// The format in force decides between bytes and words, not the input: the caller keeps them
    /// matched, and samples that the input does not hold count as 0. In this order:
    /// `FilterDeclined` for an input without a mosaic or an output without three colours;
    /// `FilterNotInitialised` before `Init`; `FilterUnusableFormat` for whole planes (6, 7);
    /// `FilterNotInitialised` for a frame of more pixels than the sensor of `Init`; `FilterFailed`
    /// for missing data, an image above 32 bits and one above the output's capacity;
    /// `FilterNotInitialised` without memory. Nothing is written then.
    FilterResult Process(ZInImageBufferStruct* in, ZOutImageBufferStruct* out) override;
    /// Bytes that `Process` writes for this input with this format in force, into an output that
    /// holds them: 0 where it declines or refuses, without memory apart.
    [[nodiscard]] std::uint64_t MeasureOutput(const ZInImageBufferStruct& in,
                                              std::uint32_t format) const;
    /// Makes the scratch for a sensor of this size anew. `FilterDone` also without memory: the
    /// first frame tries again.
    FilterResult Init(std::uint32_t width, std::uint32_t height) override;
    FilterResult SetOutputFormat(std::uint32_t format) override;
    /// A mosaic needs its bytes times those of an output pixel, taken in 32 bits; any other input
    /// its own.
    std::uint32_t GetNeededOutputBufferSize(ZInImageBufferStruct* in) override;

    std::uint16_t GetAlgorithm() const;
    /// Not checked. `FilterDone`.
    FilterResult SetAlgorithm(std::uint16_t newAlgorithm);
    std::uint32_t GetOutputFormat() const;
    bool IsInitialised() const { return isInitialised.load(std::memory_order_relaxed); }

    /// The two engines by the format: words for `RGB48`, bytes for 8, 9 and 11 to 13. Every other
    /// format does nothing and gives the low 16 bits of `algorithm` as its result. The caller
    /// vouches for `in`, of `width` times `height` samples, and for `out`. `*outSize` is set with
    /// `FilterDone`, and `FilterFailed` where it is null; the other results are those of
    /// `BayerEngine`. `bitDepth`, `outPlanes` and
    /// `quarterPlanes` belong to the form of the call; nothing is read or written there.
    FilterResult BayerUsingSSE(const std::uint8_t* in, std::uint32_t width, std::uint32_t height,
                               std::uint32_t bitDepth, std::uint32_t pattern, std::uint8_t* out,
                               std::uint32_t outFormat, std::uint32_t* outSize,
                               std::uint8_t* const* outPlanes, std::uint8_t* const* quarterPlanes,
                               std::uint32_t algorithm);
    /// Each also makes whole planes, format 6 and format 7. A code of `KernelInterpolation`.
    FilterResult Private_Bayer8BitUsingSSE(const std::uint8_t* in, std::uint32_t width,
                                           std::uint32_t height, std::uint32_t bitDepth,
                                           std::uint32_t pattern, std::uint8_t* out,
                                           std::uint32_t outFormat, std::uint32_t* outSize,
                                           std::uint8_t* const* outPlanes,
                                           std::uint8_t* const* quarterPlanes,
                                           std::uint32_t interpolation);
    FilterResult Private_Bayer16BitUsingSSE(const std::uint8_t* in, std::uint32_t width,
                                            std::uint32_t height, std::uint32_t bitDepth,
                                            std::uint32_t pattern, std::uint8_t* out,
                                            std::uint32_t outFormat, std::uint32_t* outSize,
                                            std::uint8_t* const* outPlanes,
                                            std::uint8_t* const* quarterPlanes,
                                            std::uint32_t interpolation);

  private:
    /// Whether the frame has no more pixels than the sensor. Under scratchMutex.
    bool IsWithinSensor(const ZInImageBufferStruct& in) const;

    std::atomic<std::uint16_t> algorithm;
    std::atomic<std::uint32_t> outputFormat;
    std::atomic<bool> isInitialised{false};
    mutable std::mutex scratchMutex;  // leaf, of all below
    BayerEngine engine;               // guarded by scratchMutex
    std::uint32_t width = 0;          // guarded by scratchMutex
    std::uint32_t height = 0;         // guarded by scratchMutex
};

}  // namespace ZV
