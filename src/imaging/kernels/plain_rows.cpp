#include <algorithm>

#include "imaging/kernels/row_kernels.h"

namespace ZV {

namespace {

template <typename Sample>
struct SampleTraits;

template <>
struct SampleTraits<std::uint8_t> {
    using Value = std::uint8_t;
    static constexpr std::uint32_t Max = 255;
    // The row pass of linear enlarging keeps 6 fractional bits.
    static constexpr std::uint32_t RowHalf = 128, RowShift = 8;
    static constexpr std::uint32_t ColumnHalf = 0x80000, ColumnShift = 20;
};

template <>
struct SampleTraits<Word> {
    using Value = std::uint16_t;
    static constexpr std::uint32_t Max = 65535;
    static constexpr std::uint32_t RowHalf = 8192, RowShift = 14;
    static constexpr std::uint32_t ColumnHalf = 8192, ColumnShift = 14;
};

constexpr std::uint32_t Read(const std::uint8_t& sample) {
    return sample;
}

constexpr std::uint32_t Read(const Word& sample) {
    return sample.value;
}

template <typename Sample>
constexpr Sample Make(std::uint32_t value) {
    return Sample{static_cast<typename SampleTraits<Sample>::Value>(value)};
}

template <typename Sample, std::size_t Planes>
void Pack(const Sample* const* planes, Sample* pixels, std::size_t count) {
    for (std::size_t index = 0; index < count; ++index) {
        for (std::size_t plane = 0; plane < Planes; ++plane) *pixels++ = planes[plane][index];
    }
}

template <typename Sample>
void Add(const Sample* source, Sample* samples, std::size_t count) {
    for (std::size_t index = 0; index < count; ++index) {
        const std::uint32_t sum = Read(samples[index]) + Read(source[index]);
        samples[index] = Make<Sample>(std::min(sum, SampleTraits<Sample>::Max));
    }
}

template <typename Sample>
void ShiftRight(std::int32_t shift, Sample* samples, std::size_t count) {
    for (std::size_t index = 0; index < count; ++index) {
        samples[index] = Make<Sample>(Read(samples[index]) >> shift);
    }
}

template <typename Sample, std::size_t Channels>
void Lookup(const typename SampleTraits<Sample>::Value* tables, Sample* samples,
            std::size_t count) {
    constexpr std::size_t Entries = std::size_t{SampleTraits<Sample>::Max} + 1;
    for (std::size_t pixel = 0; pixel < count; ++pixel) {
        for (std::size_t channel = 0; channel < Channels; ++channel, ++samples) {
            *samples = Sample{tables[channel * Entries + Read(*samples)]};
        }
    }
}

template <typename Sample>
void Double(const Sample* row, Sample* output, std::size_t count) {
    for (std::size_t index = 0; index < count; ++index) output[index] = row[index / 2];
}

constexpr std::uint32_t WeightOne = 16384;

template <typename Sample>
void LinearRow(const Sample* row, const LinearPlan& plan, std::uint16_t* output) {
    using Traits = SampleTraits<Sample>;
    for (std::size_t index = 0; index < plan.count; ++index) {
        const LinearPosition& position = plan.positions[index];
        const Sample* const pair = row + position.index;
        const auto weight = static_cast<std::uint32_t>(position.weight);
        const std::uint32_t sum =
            (WeightOne - weight) * Read(pair[0]) + weight * Read(pair[1]) + Traits::RowHalf;
        output[index] = static_cast<std::uint16_t>(sum >> Traits::RowShift);
    }
}

template <typename Sample>
void LinearColumn(const std::uint16_t* upper, const std::uint16_t* lower, std::int32_t lowerWeight,
                  Sample* output, std::size_t count) {
    using Traits = SampleTraits<Sample>;
    const auto weight = static_cast<std::uint32_t>(lowerWeight);
    for (std::size_t index = 0; index < count; ++index) {
        const std::uint32_t sum =
            lower[index] * weight + upper[index] * (WeightOne - weight) + Traits::ColumnHalf;
        output[index] = Make<Sample>(sum >> Traits::ColumnShift);
    }
}

template <typename Sample>
void LinearColumnPair(const std::uint16_t* upper, const std::uint16_t* lower,
                      const std::int32_t weights[2], Sample* const outputs[2], std::size_t count) {
    LinearColumn(upper, lower, weights[0], outputs[0], count);
    LinearColumn(upper, lower, weights[1], outputs[1], count);
}

/// The value of the cubic through four samples: Newton's form, in this order of operations.
inline float EvaluateCubic(float a, float c, float d, float e, const CubicWeights& weights) {
    const float first = c - a;
    const float second = d - c - first;
    const float third = c - 2.0F * d + e - second;
    return a + weights.first * first + weights.second * second + weights.third * third;
}

template <typename Sample>
float ReadSingle(const Sample& sample) {
    return static_cast<float>(Read(sample));
}

template <typename Sample>
void CubicRow(const Sample* row, const CubicPlan& plan, float* output) {
    for (std::size_t index = 0; index < plan.count; ++index) {
        const CubicPosition& position = plan.positions[index];
        const Sample* const four = row + position.index;
        output[index] = EvaluateCubic(ReadSingle(four[0]), ReadSingle(four[1]), ReadSingle(four[2]),
                                      ReadSingle(four[3]), position.weights);
    }
}

template <typename Sample>
void CubicColumn(const float* const rows[4], const CubicWeights& weights, Sample* output,
                 std::size_t count) {
    constexpr double Rounding = 0.5000001;
    constexpr double Max = SampleTraits<Sample>::Max;
    for (std::size_t index = 0; index < count; ++index) {
        const float value =
            EvaluateCubic(rows[0][index], rows[1][index], rows[2][index], rows[3][index], weights);
        // Held within the range before the fraction goes: the same, and no value is too great.
        const double held = std::min(std::max(0.0, double{value} + Rounding), Max);
        output[index] = Make<Sample>(static_cast<std::uint32_t>(static_cast<std::int32_t>(held)));
    }
}

template <typename Sample>
void CubicColumnPair(const float* const rows[4], const CubicWeights weights[2],
                     Sample* const outputs[2], std::size_t count) {
    CubicColumn(rows, weights[0], outputs[0], count);
    CubicColumn(rows, weights[1], outputs[1], count);
}

template <typename Sample>
void Split(const Sample* row, Sample* even, Sample* odd, std::size_t count) {
    for (std::size_t index = 0; index < count; ++index) {
        even[index] = row[2 * index];
        odd[index] = row[2 * index + 1];
    }
}

template <typename Sample>
void AddHalves(const Sample* first, const Sample* second, Sample* output, std::size_t count) {
    for (std::size_t index = 0; index < count; ++index) {
        output[index] = Make<Sample>((Read(first[index]) >> 1) + (Read(second[index]) >> 1));
    }
}

}  // namespace

const RowKernels PlainRowKernels{
    .name = "plain",
    .pack8x3 = Pack<std::uint8_t, 3>,
    .pack8x4 = Pack<std::uint8_t, 4>,
    .pack16x3 = Pack<Word, 3>,
    .add8 = Add<std::uint8_t>,
    .add16 = Add<Word>,
    .shiftRight8 = ShiftRight<std::uint8_t>,
    .shiftRight16 = ShiftRight<Word>,
    .lookup8x1 = Lookup<std::uint8_t, 1>,
    .lookup8x3 = Lookup<std::uint8_t, 3>,
    .lookup8x4 = Lookup<std::uint8_t, 4>,
    .lookup16x1 = Lookup<Word, 1>,
    .lookup16x3 = Lookup<Word, 3>,
    .double8 = Double<std::uint8_t>,
    .double16 = Double<Word>,
    .linearRow8 = LinearRow<std::uint8_t>,
    .linearColumn8 = LinearColumn<std::uint8_t>,
    .linearColumnPair8 = LinearColumnPair<std::uint8_t>,
    .linearRow16 = LinearRow<Word>,
    .linearColumn16 = LinearColumn<Word>,
    .linearColumnPair16 = LinearColumnPair<Word>,
    .cubicRow8 = CubicRow<std::uint8_t>,
    .cubicRow16 = CubicRow<Word>,
    .cubicColumn8 = CubicColumn<std::uint8_t>,
    .cubicColumnPair8 = CubicColumnPair<std::uint8_t>,
    .cubicColumn16 = CubicColumn<Word>,
    .cubicColumnPair16 = CubicColumnPair<Word>,
    .split8 = Split<std::uint8_t>,
    .split16 = Split<Word>,
    .addHalves8 = AddHalves<std::uint8_t>,
    .addHalves16 = AddHalves<Word>,
};

}  // namespace ZV
