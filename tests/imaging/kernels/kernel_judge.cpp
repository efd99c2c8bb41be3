#include "imaging/kernels/kernel_judge.h"

#include <algorithm>
#include <cmath>
#include <cstring>
#include <limits>
#include <numeric>
#include <vector>

namespace ZV::Testing::Judge {
namespace {

const std::uint8_t* RowOf(const void* image, std::int64_t rowBytes, std::int64_t y) {
    return static_cast<const std::uint8_t*>(image) + y * rowBytes;
}

std::uint8_t* RowOf(void* image, std::int64_t rowBytes, std::int64_t y) {
    return static_cast<std::uint8_t*>(image) + y * rowBytes;
}

template <typename Sample>
std::int64_t Load(const std::uint8_t* row, std::int64_t index) {
    Sample sample;
    std::memcpy(&sample, row + index * std::int64_t{sizeof(Sample)}, sizeof(Sample));
    return sample;
}

template <typename Sample>
constexpr std::int64_t Top = std::numeric_limits<Sample>::max();

/// Held within the range of samples.
template <typename Sample>
void Store(std::uint8_t* row, std::int64_t index, std::int64_t value) {
    const auto sample = static_cast<Sample>(std::clamp<std::int64_t>(value, 0, Top<Sample>));
    std::memcpy(row + index * std::int64_t{sizeof(Sample)}, &sample, sizeof(Sample));
}

bool IsBelowOne(KernelSize size) {
    return size.width < 1 || size.height < 1;
}

template <typename Sample>
KernelStatus PackPlanes(int planeCount, const void* const* planes, std::int32_t planeRowBytes,
                        void* pixels, std::int32_t pixelRowBytes, KernelSize size) {
    if (planes == nullptr || pixels == nullptr) return KernelNullPointer;
    for (int plane = 0; plane < planeCount; ++plane)
        if (planes[plane] == nullptr) return KernelNullPointer;
    if (IsBelowOne(size)) return KernelBadSize;

    for (std::int64_t y = 0; y < size.height; ++y) {
        std::int64_t position = 0;
        for (std::int64_t x = 0; x < size.width; ++x)
            for (int plane = 0; plane < planeCount; ++plane)
                Store<Sample>(RowOf(pixels, pixelRowBytes, y), position++,
                              Load<Sample>(RowOf(planes[plane], planeRowBytes, y), x));
    }
    return KernelOk;
}

template <typename Sample>
KernelStatus AddPlane(const void* source, std::int32_t sourceRowBytes, void* destination,
                      std::int32_t destinationRowBytes, KernelSize size, std::int32_t scale) {
    if (source == nullptr || destination == nullptr) return KernelNullPointer;
    if (IsBelowOne(size) || scale != 0) return KernelBadSize;

    for (std::int64_t y = 0; y < size.height; ++y) {
        std::uint8_t* const row = RowOf(destination, destinationRowBytes, y);
        for (std::int64_t x = 0; x < size.width; ++x)
            Store<Sample>(row, x,
                          Load<Sample>(row, x) + Load<Sample>(RowOf(source, sourceRowBytes, y), x));
    }
    return KernelOk;
}

template <typename Sample>
KernelStatus ShiftRightPlane(std::int32_t count, void* plane, std::int32_t rowBytes,
                             KernelSize size) {
    if (plane == nullptr) return KernelNullPointer;
    if (IsBelowOne(size) || count < 0) return KernelBadSize;
    if (rowBytes < 1) return KernelBadStep;

    for (std::int64_t y = 0; y < size.height; ++y) {
        std::uint8_t* const row = RowOf(plane, rowBytes, y);
        for (std::int64_t x = 0; x < size.width; ++x) {
            std::int64_t sample = Load<Sample>(row, x);
            for (std::int32_t bit = 0; bit < count && sample > 0; ++bit) sample /= 2;
            Store<Sample>(row, x, sample);
        }
    }
    return KernelOk;
}

/// What every sample becomes by one channel's tables.
template <typename Sample>
std::vector<std::int64_t> MakeTable(const std::int32_t* values, const std::int32_t* levels,
                                    std::int32_t count) {
    std::vector<std::int64_t> table(static_cast<std::size_t>(Top<Sample>) + 1);
    std::iota(table.begin(), table.end(), 0);
    for (std::int32_t k = 0; k <= count - 2; ++k) {
        const std::int64_t first = std::max<std::int64_t>(levels[k], 0);
        const std::int64_t end = std::min<std::int64_t>(levels[k + 1], Top<Sample> + 1);
        for (std::int64_t sample = first; sample < end; ++sample)
            table[static_cast<std::size_t>(sample)] = values[k];
    }
    return table;
}

template <typename Sample>
KernelStatus LookupInPlace(int channels, void* image, std::int32_t rowBytes, KernelSize size,
                           const std::int32_t* const* values, const std::int32_t* const* levels,
                           const std::int32_t* counts) {
    if (image == nullptr || values == nullptr || levels == nullptr || counts == nullptr)
        return KernelNullPointer;
    for (int channel = 0; channel < channels; ++channel)
        if (values[channel] == nullptr || levels[channel] == nullptr) return KernelNullPointer;
    if (IsBelowOne(size)) return KernelBadSize;
    if (rowBytes < 1) return KernelBadStep;
    for (int channel = 0; channel < channels; ++channel)
        if (counts[channel] < 2) return KernelBadLevels;

    for (int channel = 0; channel < channels; ++channel) {
        const std::vector<std::int64_t> table =
            MakeTable<Sample>(values[channel], levels[channel], counts[channel]);
        for (std::int64_t y = 0; y < size.height; ++y) {
            std::uint8_t* const row = RowOf(image, rowBytes, y);
            for (std::int64_t x = 0; x < size.width; ++x) {
                const std::int64_t place = x * channels + channel;
                const std::int64_t sample = Load<Sample>(row, place);
                Store<Sample>(row, place, table[static_cast<std::size_t>(sample)]);
            }
        }
    }
    return KernelOk;
}

/// Samples that one direction of an enlarging yields, at most `limit`; 0 if there are none.
std::int32_t CountOutput(std::int32_t sourceLength, double factor, std::int32_t limit) {
    const double unrounded = sourceLength * factor;
    double whole = std::floor(unrounded + 1e-7);
    if (whole < 1.0) whole = unrounded >= 0.5 ? 1.0 : 0.0;
    return whole < limit ? static_cast<std::int32_t>(whole) : limit;
}

/// The step added up one by one.
std::vector<double> AddUp(double start, double step, std::int32_t count) {
    std::vector<double> positions;
    double position = start;
    for (std::int32_t output = 0; output < count; ++output) {
        positions.push_back(position);
        position += step;
    }
    return positions;
}

std::vector<double> MakeNearestPositions(double factor, std::int32_t count) {
    const double step = 1.0 / factor;
    return AddUp(step / 2.0, step, count);
}

std::vector<double> MakeSmoothPositions(std::int32_t sourceLength, double factor,
                                        std::int32_t count) {
    const double length = sourceLength * factor;
    const double step = length > 1.0 ? (sourceLength - 1) / (length - 1.0) : 0.0;
    return AddUp(0.0, step, count);
}

std::int64_t WholeOf(double position) {
    return static_cast<std::int64_t>(position + 1e-7);
}

/// The part of the source that an enlarging reads.
struct Source {
    const std::uint8_t* firstSample;
    std::int64_t rowBytes;
    std::int32_t width;
    std::int32_t height;
};

template <typename Sample>
std::int64_t LoadAt(const Source& source, std::int64_t x, std::int64_t y) {
    return Load<Sample>(source.firstSample + y * source.rowBytes, x);
}

template <typename Sample>
std::int64_t PickNearest(const Source& source, double xPosition, double yPosition) {
    const std::int64_t x = std::min<std::int64_t>(WholeOf(xPosition), source.width - 1);
    const std::int64_t y = std::min<std::int64_t>(WholeOf(yPosition), source.height - 1);
    return LoadAt<Sample>(source, x, y);
}

struct LinearPlace {
    std::int64_t index;
    std::int64_t weight;
};

LinearPlace PlaceLinear(double position, std::int32_t length) {
    const std::int64_t index = WholeOf(position);
    if (index >= length - 1) return {length - 2, 16384};
    const double part = position - static_cast<double>(index);
    return {index, static_cast<std::int64_t>(part * 16384.0 + 1e-7)};
}

template <typename Sample>
std::int64_t InterpolateLinearly(const Source& source, double xPosition, double yPosition) {
    constexpr bool IsDeep = sizeof(Sample) == 2;
    constexpr std::int64_t RowHalf = IsDeep ? 8192 : 128;
    constexpr int RowShift = IsDeep ? 14 : 8;
    constexpr std::int64_t ColumnHalf = IsDeep ? 8192 : 0x80000;
    constexpr int ColumnShift = IsDeep ? 14 : 20;
    const LinearPlace x = PlaceLinear(xPosition, source.width);
    const LinearPlace y = PlaceLinear(yPosition, source.height);

    std::int64_t rows[2];
    for (int row = 0; row < 2; ++row) {
        const std::int64_t left = LoadAt<Sample>(source, x.index, y.index + row);
        const std::int64_t right = LoadAt<Sample>(source, x.index + 1, y.index + row);
        rows[row] = ((16384 - x.weight) * left + x.weight * right + RowHalf) >> RowShift;
    }
    return (rows[1] * y.weight + rows[0] * (16384 - y.weight) + ColumnHalf) >> ColumnShift;
}

struct CubicPlace {
    std::int64_t base;  // the second of the four samples
    float t;
};

CubicPlace PlaceCubic(double position, std::int32_t length) {
    const std::int64_t index = std::min<std::int64_t>(WholeOf(position), length - 1);
    if (index == length - 1) return {index - 2, 2.0F};
    if (index == 0) return {1, static_cast<float>(position - 1.0)};
    const std::int64_t base = index == length - 2 ? index - 1 : index;
    return {base, static_cast<float>(position - static_cast<double>(base))};
}

/// The cubic through four samples, Newton's form, each step in single precision.
float InterpolateCubic(float a, float c, float d, float e, float t) {
    const float first = c - a;
    const float second = d - c - first;
    const float third = c - 2.0F * d + e - second;
    return a + (1.0F + t) * first + (t * (1.0F + t) * 0.5F) * second +
           ((t - 1.0F) * (t * (1.0F + t) * 0.5F) / 3.0F) * third;
}

template <typename Sample>
std::int64_t InterpolateCubically(const Source& source, double xPosition, double yPosition) {
    const CubicPlace x = PlaceCubic(xPosition, source.width);
    const CubicPlace y = PlaceCubic(yPosition, source.height);

    float rows[4];
    for (int row = 0; row < 4; ++row) {
        const auto sampleAt = [&](std::int64_t column) {
            return static_cast<float>(LoadAt<Sample>(source, column, y.base - 1 + row));
        };
        rows[row] = InterpolateCubic(sampleAt(x.base - 1), sampleAt(x.base), sampleAt(x.base + 1),
                                     sampleAt(x.base + 2), x.t);
    }
    const float value = InterpolateCubic(rows[0], rows[1], rows[2], rows[3], y.t);
    return static_cast<std::int64_t>(static_cast<double>(value) + 0.5000001);
}

KernelStatus CheckEnlarging(const void* source, KernelSize sourceSize, KernelRect rect,
                            const void* destination, KernelSize destinationSize, double xFactor,
                            double yFactor, std::int32_t interpolation) {
    if (source == nullptr || destination == nullptr) return KernelNullPointer;
    if (IsBelowOne(sourceSize)) return KernelBadSize;
    if (rect.x < 0 || rect.y < 0 || rect.width < 1 || rect.height < 1) return KernelBadSize;
    if (rect.x >= sourceSize.width || rect.y >= sourceSize.height) return KernelNoOverlap;
    if (IsBelowOne(destinationSize)) return KernelBadSize;
    if (!(xFactor > 0.0) || !(yFactor > 0.0)) return KernelBadFactor;
    const bool isKnown =
        interpolation == 1 || interpolation == 2 || interpolation == 4 || interpolation == 16;
    return isKnown ? KernelOk : KernelBadInterpolation;
}

/// `length` is the smaller side of what is looked at.
std::int32_t FitInterpolation(std::int32_t interpolation, std::int32_t length) {
    if (interpolation == 16 && length < 8) interpolation = 4;
    if (interpolation == 4 && length < 4) interpolation = 2;
    return length < 2 ? 1 : interpolation;
}

template <typename Sample>
KernelStatus EnlargePlane(const void* source, KernelSize sourceSize, std::int32_t sourceRowBytes,
                          KernelRect rect, void* destination, std::int32_t destinationRowBytes,
                          KernelSize destinationSize, double xFactor, double yFactor,
                          std::int32_t interpolation) {
    const KernelStatus status = CheckEnlarging(source, sourceSize, rect, destination,
                                               destinationSize, xFactor, yFactor, interpolation);
    if (status != KernelOk) return status;
    interpolation = FitInterpolation(interpolation, std::min(sourceSize.width, sourceSize.height));
    if (interpolation == 16) return KernelBadInterpolation;

    const Source part{RowOf(source, sourceRowBytes, rect.y) + rect.x * sizeof(Sample),
                      sourceRowBytes, std::min(rect.width, sourceSize.width - rect.x),
                      std::min(rect.height, sourceSize.height - rect.y)};
    interpolation = FitInterpolation(interpolation, std::min(part.width, part.height));
    const std::int32_t width = CountOutput(part.width, xFactor, destinationSize.width);
    const std::int32_t height = CountOutput(part.height, yFactor, destinationSize.height);
    if (width == 0 || height == 0) return KernelEmptyResult;

    const bool isNearest = interpolation == 1;
    const std::vector<double> columns = isNearest ? MakeNearestPositions(xFactor, width)
                                                  : MakeSmoothPositions(part.width, xFactor, width);
    const std::vector<double> rows = isNearest ? MakeNearestPositions(yFactor, height)
                                               : MakeSmoothPositions(part.height, yFactor, height);
    const auto pick = isNearest            ? PickNearest<Sample>
                      : interpolation == 2 ? InterpolateLinearly<Sample>
                                           : InterpolateCubically<Sample>;
    for (std::size_t y = 0; y < rows.size(); ++y)
        for (std::size_t x = 0; x < columns.size(); ++x)
            Store<Sample>(RowOf(destination, destinationRowBytes, static_cast<std::int64_t>(y)),
                          static_cast<std::int64_t>(x), pick(part, columns[x], rows[y]));
    return KernelOk;
}

}  // namespace

KernelStatus PackPlanes8x4(const void* const planes[4], std::int32_t planeRowBytes, void* pixels,
                           std::int32_t pixelRowBytes, KernelSize size) {
    return PackPlanes<std::uint8_t>(4, planes, planeRowBytes, pixels, pixelRowBytes, size);
}

KernelStatus PackPlanes8x3(const void* const planes[3], std::int32_t planeRowBytes, void* pixels,
                           std::int32_t pixelRowBytes, KernelSize size) {
    return PackPlanes<std::uint8_t>(3, planes, planeRowBytes, pixels, pixelRowBytes, size);
}

KernelStatus PackPlanes16x3(const void* const planes[3], std::int32_t planeRowBytes, void* pixels,
                            std::int32_t pixelRowBytes, KernelSize size) {
    return PackPlanes<std::uint16_t>(3, planes, planeRowBytes, pixels, pixelRowBytes, size);
}

KernelStatus EnlargePlane8(const void* source, KernelSize sourceSize, std::int32_t sourceRowBytes,
                           KernelRect sourceRect, void* destination,
                           std::int32_t destinationRowBytes, KernelSize destinationSize,
                           double xFactor, double yFactor, std::int32_t interpolation) {
    return EnlargePlane<std::uint8_t>(source, sourceSize, sourceRowBytes, sourceRect, destination,
                                      destinationRowBytes, destinationSize, xFactor, yFactor,
                                      interpolation);
}

KernelStatus EnlargePlane16(const void* source, KernelSize sourceSize, std::int32_t sourceRowBytes,
                            KernelRect sourceRect, void* destination,
                            std::int32_t destinationRowBytes, KernelSize destinationSize,
                            double xFactor, double yFactor, std::int32_t interpolation) {
    return EnlargePlane<std::uint16_t>(source, sourceSize, sourceRowBytes, sourceRect, destination,
                                       destinationRowBytes, destinationSize, xFactor, yFactor,
                                       interpolation);
}

KernelStatus AddPlane8(const void* source, std::int32_t sourceRowBytes, void* destination,
                       std::int32_t destinationRowBytes, KernelSize size, std::int32_t scale) {
    return AddPlane<std::uint8_t>(source, sourceRowBytes, destination, destinationRowBytes, size,
                                  scale);
}

KernelStatus AddPlane16(const void* source, std::int32_t sourceRowBytes, void* destination,
                        std::int32_t destinationRowBytes, KernelSize size, std::int32_t scale) {
    return AddPlane<std::uint16_t>(source, sourceRowBytes, destination, destinationRowBytes, size,
                                   scale);
}

KernelStatus ShiftRightPlane8(std::int32_t count, void* plane, std::int32_t rowBytes,
                              KernelSize size) {
    return ShiftRightPlane<std::uint8_t>(count, plane, rowBytes, size);
}

KernelStatus ShiftRightPlane16(std::int32_t count, void* plane, std::int32_t rowBytes,
                               KernelSize size) {
    return ShiftRightPlane<std::uint16_t>(count, plane, rowBytes, size);
}

KernelStatus LookupInPlace8x4(void* image, std::int32_t rowBytes, KernelSize size,
                              const std::int32_t* const values[4],
                              const std::int32_t* const levels[4], const std::int32_t counts[4]) {
    return LookupInPlace<std::uint8_t>(4, image, rowBytes, size, values, levels, counts);
}

KernelStatus LookupInPlace8x3(void* image, std::int32_t rowBytes, KernelSize size,
                              const std::int32_t* const values[3],
                              const std::int32_t* const levels[3], const std::int32_t counts[3]) {
    return LookupInPlace<std::uint8_t>(3, image, rowBytes, size, values, levels, counts);
}

KernelStatus LookupInPlace8x1(void* plane, std::int32_t rowBytes, KernelSize size,
                              const std::int32_t* values, const std::int32_t* levels,
                              std::int32_t count) {
    return LookupInPlace<std::uint8_t>(1, plane, rowBytes, size, &values, &levels, &count);
}

KernelStatus LookupInPlace16x3(void* image, std::int32_t rowBytes, KernelSize size,
                               const std::int32_t* const values[3],
                               const std::int32_t* const levels[3], const std::int32_t counts[3]) {
    return LookupInPlace<std::uint16_t>(3, image, rowBytes, size, values, levels, counts);
}

KernelStatus LookupInPlace16x1(void* plane, std::int32_t rowBytes, KernelSize size,
                               const std::int32_t* values, const std::int32_t* levels,
                               std::int32_t count) {
    return LookupInPlace<std::uint16_t>(1, plane, rowBytes, size, &values, &levels, &count);
}

}  // namespace ZV::Testing::Judge
