#pragma once

#include <array>
#include <atomic>
#include <cstdint>
#include <memory>
#include <mutex>
#include <span>

#include "imaging/image_filter.h"
#include "imaging/region_measure.h"
#include "zentara/zentara.h"

namespace ZV {

class MeasuringImage;

/// Scales the colours of an image by tables, one lookup per sample, and finds the scales that make
/// the mean of a region grey. A scale is set at the price of a table of all sample values.
class ZENTARA_API ZAutoWhiteBalance : public ZImageFilter {
  public:
    static constexpr std::size_t Levels8 = 256;
    static constexpr std::size_t Levels16 = 65536;
    static constexpr std::uint32_t PassesMax = 6;

    /// What each level of a colour becomes. Entry i is i times the scale in single precision, cut
    /// at the top level and truncated; a product that is no number gives the top level. Never
    /// changes once it is made.
    struct ScaleTable {
        std::array<std::int32_t, Levels8> levels8;
        std::array<std::int32_t, Levels16> levels16;
    };

    explicit ZAutoWhiteBalance(bool calculateValuesOnAllFrames);
    ~ZAutoWhiteBalance() override;

    /// Scales the image at `out->data`, where a pipeline has put it, in place; width, height, depth
    /// and format are those of `in`.
    ///
    /// `FilterDeclined` without a camera, on a monochrome one, and when the format of `out` has not
    /// three colours. `FilterUnusableFormat` when the input's format is none for its depth: 8 bits
    /// take the formats of bytes, any other depth those of words. `FilterFailed` for an image
    /// without pixels or data, and for one whose pixels `in->imageSize` or `out->dataCapacity` does
    /// not hold; nothing is written then. One set of tables serves the whole image. Thread-safe.
    FilterResult Process(ZInImageBufferStruct* in, ZOutImageBufferStruct* out) override;
    /// Does nothing. `FilterDone`.
    FilterResult Init(std::uint32_t width, std::uint32_t height) override;
    /// Does nothing. `FilterDone`.
    FilterResult SetOutputFormat(std::uint32_t format) override;

    /// Takes images from the camera, at most `PassesMax`, means the colours over the region and
    /// sets the scales to green over each colour, until all means lie in the middle of the range.
    /// On a camera with a filter wheel the exposures of the colours are multiplied by the scales as
    /// well and sent, so that the next image is taken with them.
    ///
    /// `FilterDone` also when the passes have run out; the last scales stay. The first failure of
    /// the camera, the pipeline or the measuring ends it and leaves the scales of the last finished
    /// pass. `width` and `height` are cut to those of the image behind the pipeline, for the later
    /// passes too; `x` and `y` are not cut: the walk goes on into the rows that follow, and what
    /// lies beyond the image counts as 0. In `RGBPlane16` it takes every second row. Goes over the
    /// bus, on the caller's thread; let no settings be sent meanwhile.
    FilterResult Preprocess(std::uint32_t x, std::uint32_t y, std::uint32_t width,
                            std::uint32_t height, ZCamera* camera);

    /// Scales samples of 8 bits in place. A `step` of 1 stands for three planes at `red`, `green`
    /// and `blue`; 3 for pixels of three samples at `image`; any other for `width` pixels of four
    /// samples in each row, rows `step` * `width` samples apart, what stands between them left
    /// alone. The order of the colours is that of `format`; the sample for padding stays, and all
    /// of them do where `format` is none of such pixels. `pixels` is not looked at. The caller
    /// vouches for the memory that the rows name.
    /// `FilterFailed` for an empty size, null data, rows of 2 GiB or more, and a step of 0 or 2, by
    /// which rows would overlap.
    FilterResult GreyWorld(std::uint8_t* image, std::uint8_t* red, std::uint8_t* green,
                           std::uint8_t* blue, std::uint32_t width, std::uint32_t height,
                           std::uint32_t pixels, std::uint32_t step, std::uint32_t format) const;
    /// The same for samples of 16 bits, host order, at any address. Any step but 1 stands for
    /// pixels of three samples, red, green and blue, whatever `format` is.
    FilterResult GreyWorld_16Bit(std::uint8_t* image, std::uint8_t* red, std::uint8_t* green,
                                 std::uint8_t* blue, std::uint32_t width, std::uint32_t height,
                                 std::uint32_t pixels, std::uint32_t step,
                                 std::uint32_t format) const;

    /// Last measured means, 128 before the first measurement.
    std::uint32_t GetRedMean() const { return redMean.load(std::memory_order_relaxed); }
    std::uint32_t GetGreenMean() const { return greenMean.load(std::memory_order_relaxed); }
    std::uint32_t GetBlueMean() const { return blueMean.load(std::memory_order_relaxed); }

    float GetRedScale() const;
    float GetGreenScale() const;
    float GetBlueScale() const;
    /// Each builds both tables of its colour anew, which then take the place of the old ones at
    /// once: a frame is balanced by the old tables or by the new ones. Thread-safe.
    void SetRedScale(float scale);
    void SetGreenScale(float scale);
    void SetBlueScale(float scale);
    /// All three at once: no frame is balanced by new tables of one colour and old ones of another.
    /// Thread-safe.
    void SetScales(float redScale, float greenScale, float blueScale);
    /// Kept without an effect.
    void SetCalculateValuesOnAllFrames(bool on);

    /// The tables in force. They stay whole for who holds them, whatever is set meanwhile.
    /// Thread-safe.
    std::shared_ptr<const ScaleTable> GetRedTable() const;
    std::shared_ptr<const ScaleTable> GetGreenTable() const;
    std::shared_ptr<const ScaleTable> GetBlueTable() const;

  private:
    struct TableSet;
    struct Colour {
        std::uint32_t index;  ///< In a set: red, green, blue.
        std::atomic<float> scale;
    };

    struct Change {
        Colour* colour;
        float scale;
    };

    std::shared_ptr<const TableSet> GetTables() const;
    void Exchange(std::span<const Change> changes);
    void ScaleToGreen(const ColourValues& means);
    FilterResult RunPass(MeasuringImage& image, MeasuredRegion* region, ZCamera& camera);
    bool AreMeansInBand(std::uint32_t bitDepth) const;
    void BalanceExposures(ZCamera& camera) const;

    std::atomic<std::uint32_t> redMean{128};
    std::atomic<std::uint32_t> greenMean{128};
    std::atomic<std::uint32_t> blueMean{128};
    std::atomic<bool> calculateValuesOnAllFrames;
    std::mutex setterMutex;  ///< One change of a set at a time. Before leafMutex.
    Colour red;
    Colour green;
    Colour blue;
    mutable std::mutex leafMutex;
    std::shared_ptr<const TableSet> tables;  // guarded by leafMutex
};

}  // namespace ZV
