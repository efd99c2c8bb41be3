#pragma once

#include <cstddef>
#include <cstdint>

namespace ZV {

/// A 16-bit sample at any address: rows of 16-bit images need not be aligned.
struct [[gnu::packed]] Word {
    std::uint16_t value;
};

/// One output sample of a linear row pass: the weights of samples `index` and `index` + 1 are
/// 16384 - `weight` and `weight`.
struct LinearPosition {
    std::int32_t index;
    std::int32_t weight;
};

/// What the 32 outputs of a run take of the samples that are read for it: sample `index`, or for
/// the weight 16384 the one behind it, with the weight 0.
struct alignas(64) LinearRun {
    /// Per output two bytes: for 8-bit samples the places of the sample and of the one behind it
    /// (at most 63), for 16-bit samples the place of the sample as a word.
    std::uint8_t places[64];
    std::int16_t doubledWeights[32];  ///< Twice the weight, 0 to 32766.
};

/// The linear row pass of one call: what every output sample takes, and the same once more for
/// groups of eight outputs in the shape in which vector forms read it. Groups cover the first
/// 8 * `groupCount` outputs; the rest, or all of a row too short for groups, goes by `positions`.
struct LinearPlan {
    const LinearPosition* positions = nullptr;
    std::size_t count = 0;  ///< Output samples.
    std::size_t groupCount = 0;
    /// Per group: the sample at which the 16 bytes begin that the group reads. All 16 lie inside
    /// the row.
    const std::int32_t* bases = nullptr;
    /// Per output: byte positions, within those 16, of sample `index` and of the one behind it: two
    /// bytes for 8-bit samples (16 per group), four for 16-bit samples (32 per group).
    const std::uint8_t* pairs = nullptr;
    /// Per output: 16384 - `weight`, `weight` (16 numbers per group).
    const std::int16_t* weights = nullptr;

    /// The same for runs of 32 outputs, of which the last may have less: all of them, or none where
    /// a run needs more samples than 64 bytes hold.
    std::size_t runCount = 0;
    std::size_t sourceCount = 0;  ///< Samples of the row.
    /// Per run: the sample at which its samples begin. What of the 64 bytes lies beyond the row is
    /// not there to be read.
    const std::int32_t* runBases = nullptr;
    const LinearRun* runs = nullptr;
};

/// Weights of a cubic pass at a parameter t, in single precision: 1 + t, t * (1 + t) * 0.5, and
/// (t - 1) * (t * (1 + t) * 0.5) / 3. With the samples a, c, d, e and the differences
///   first = c - a, second = d - c - first, third = c - 2 * d + e - second
/// the value is a + weights.first * first + weights.second * second + weights.third * third, each
/// line from left to right, each step rounded to single precision.
struct CubicWeights {
    float first;
    float second;
    float third;
};

/// One output sample of a cubic row pass: the samples are `index` to `index` + 3.
struct CubicPosition {
    std::int32_t index;
    CubicWeights weights;
};

/// The cubic row pass of one call, laid out as LinearPlan.
struct CubicPlan {
    const CubicPosition* positions = nullptr;
    std::size_t count = 0;
    std::size_t groupCount = 0;
    /// Per group: the first of the eight samples, all inside the row, among which those of the
    /// eight outputs lie.
    const std::int32_t* bases = nullptr;
    /// Per output: the place of its first sample among those eight, 0 to 4.
    const std::int32_t* places = nullptr;
    /// Per output, the three weights, each in an array of its own.
    const float* first = nullptr;
    const float* second = nullptr;
    const float* third = nullptr;
};

/// The inner loops of the pixel kernels for one instruction set, each over one row. Arguments have
/// been tested; counts are of samples or pixels and above 0. Rows stand at any address and do not
/// overlap, except where a loop works in place.
///
/// Every form gives the samples of the plain one: sums and products in the same order and the same
/// precision, never fused.
struct RowKernels {
    const char* name;

    void (*pack8x3)(const std::uint8_t* const planes[3], std::uint8_t* pixels, std::size_t count);
    void (*pack8x4)(const std::uint8_t* const planes[4], std::uint8_t* pixels, std::size_t count);
    void (*pack16x3)(const Word* const planes[3], Word* pixels, std::size_t count);

    /// Sums, held at the greatest sample.
    void (*add8)(const std::uint8_t* source, std::uint8_t* samples, std::size_t count);
    void (*add16)(const Word* source, Word* samples, std::size_t count);

    /// `shift` is below the samples' width.
    void (*shiftRight8)(std::int32_t shift, std::uint8_t* samples, std::size_t count);
    void (*shiftRight16)(std::int32_t shift, Word* samples, std::size_t count);

    /// In place. `tables` holds 256 entries per channel, channel by channel; `count` is of pixels.
    void (*lookup8x1)(const std::uint8_t* tables, std::uint8_t* samples, std::size_t count);
    void (*lookup8x3)(const std::uint8_t* tables, std::uint8_t* samples, std::size_t count);
    void (*lookup8x4)(const std::uint8_t* tables, std::uint8_t* samples, std::size_t count);
    /// `tables` holds 65536 entries per channel, and one word more that nothing depends on, so that
    /// each entry can be read as the low half of 32 bits.
    void (*lookup16x1)(const std::uint16_t* tables, Word* samples, std::size_t count);
    void (*lookup16x3)(const std::uint16_t* tables, Word* samples, std::size_t count);

    /// Each sample twice; `count` is of output samples.
    void (*double8)(const std::uint8_t* row, std::uint8_t* output, std::size_t count);
    void (*double16)(const Word* row, Word* output, std::size_t count);

    /// Row pass of 8-bit samples into words with 6 fractional bits, and its column pass. `weight`
    /// is that of the lower row, 0 to 16384.
    void (*linearRow8)(const std::uint8_t* row, const LinearPlan& plan, std::uint16_t* output);
    void (*linearColumn8)(const std::uint16_t* upper, const std::uint16_t* lower,
                          std::int32_t weight, std::uint8_t* output, std::size_t count);
    /// Two output rows at once, one by each weight.
    void (*linearColumnPair8)(const std::uint16_t* upper, const std::uint16_t* lower,
                              const std::int32_t weights[2], std::uint8_t* const outputs[2],
                              std::size_t count);
    void (*linearRow16)(const Word* row, const LinearPlan& plan, std::uint16_t* output);
    void (*linearColumn16)(const std::uint16_t* upper, const std::uint16_t* lower,
                           std::int32_t weight, Word* output, std::size_t count);
    void (*linearColumnPair16)(const std::uint16_t* upper, const std::uint16_t* lower,
                               const std::int32_t weights[2], Word* const outputs[2],
                               std::size_t count);

    /// Row pass into single precision, without rounding, and its column pass over four such rows:
    /// converted to double, 0.5000001 added, the fraction cut off, held within the samples' range.
    void (*cubicRow8)(const std::uint8_t* row, const CubicPlan& plan, float* output);
    void (*cubicRow16)(const Word* row, const CubicPlan& plan, float* output);
    void (*cubicColumn8)(const float* const rows[4], const CubicWeights& weights,
                         std::uint8_t* output, std::size_t count);
    /// Two output rows at once, one by each of the weights.
    void (*cubicColumnPair8)(const float* const rows[4], const CubicWeights weights[2],
                             std::uint8_t* const outputs[2], std::size_t count);
    void (*cubicColumn16)(const float* const rows[4], const CubicWeights& weights, Word* output,
                          std::size_t count);
    void (*cubicColumnPair16)(const float* const rows[4], const CubicWeights weights[2],
                              Word* const outputs[2], std::size_t count);

    /// Samples 0, 2, 4, ... go to `even`, the others to `odd`; `count` is of pairs.
    void (*split8)(const std::uint8_t* row, std::uint8_t* even, std::uint8_t* odd,
                   std::size_t count);
    void (*split16)(const Word* row, Word* even, Word* odd, std::size_t count);
    /// (first >> 1) + (second >> 1).
    void (*addHalves8)(const std::uint8_t* first, const std::uint8_t* second, std::uint8_t* output,
                       std::size_t count);
    void (*addHalves16)(const Word* first, const Word* second, Word* output, std::size_t count);
};

/// The forms; which of them the processor has, kernel_selection.h tells.
extern const RowKernels PlainRowKernels;  ///< No instruction beyond the baseline; the reference.
extern const RowKernels SSE2RowKernels;
extern const RowKernels SSSE3RowKernels;
extern const RowKernels AVX2RowKernels;
extern const RowKernels AVX512RowKernels;  ///< F, BW, DQ, VL and VBMI.

}  // namespace ZV
