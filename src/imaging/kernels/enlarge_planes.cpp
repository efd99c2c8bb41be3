// Enlarging keeps only the source rows in use, two for linear and four for cubic interpolation,
// each already passed along its row; a row that several output rows need is passed once.

#include <algorithm>
#include <array>
#include <cstddef>
#include <cstring>

#include "imaging/kernels/enlarge_rows.h"
#include "imaging/kernels/image_rows.h"
#include "imaging/kernels/kernel_selection.h"
#include "imaging/kernels/kernels.h"
#include "imaging/kernels/scratch.h"

namespace ZV {

namespace {

/// Keeps a position that repeated addition left just below a whole number on that number.
constexpr double Slack = 1e-7;

template <typename Sample>
struct Loops;

template <>
struct Loops<std::uint8_t> {
    static constexpr auto Double = &RowKernels::double8;
    static constexpr auto LinearRow = &RowKernels::linearRow8;
    static constexpr auto LinearColumn = &RowKernels::linearColumn8;
    static constexpr auto CubicRow = &RowKernels::cubicRow8;
    static constexpr auto CubicColumn = &RowKernels::cubicColumn8;
};

template <>
struct Loops<Word> {
    static constexpr auto Double = &RowKernels::double16;
    static constexpr auto LinearRow = &RowKernels::linearRow16;
    static constexpr auto LinearColumn = &RowKernels::linearColumn16;
    static constexpr auto CubicRow = &RowKernels::cubicRow16;
    static constexpr auto CubicColumn = &RowKernels::cubicColumn16;
};

/// The arguments of one call and, once they are checked, what is to be done.
struct Enlarging {
    const void* source;
    KernelSize sourceSize;
    std::int32_t sourceRowBytes;
    KernelRect rect;  ///< Cut to the image when checked.
    void* destination;
    std::int32_t destinationRowBytes;
    KernelSize outputSize;  ///< The destination's; the result's when checked.
    double xFactor;
    double yFactor;
    std::int32_t interpolation;

    template <typename Sample>
    [[nodiscard]] const Sample* GetSourceRow(std::int32_t row) const {
        const std::int64_t line = std::int64_t{rect.y} + row;
        return GetImageRow<Sample>(source, sourceRowBytes, line) + rect.x;
    }
    template <typename Sample>
    [[nodiscard]] Sample* GetOutputRow(std::int32_t row) const {
        return GetImageRow<Sample>(destination, destinationRowBytes, row);
    }
};

std::int32_t FitInterpolation(std::int32_t code, std::int32_t width, std::int32_t height) {
    const std::int32_t least = std::min(width, height);
    if (code == InterpolateLanczos && least < 8) code = InterpolateCubic;
    if (code == InterpolateCubic && least < 4) code = InterpolateLinear;
    if (code == InterpolateLinear && least < 2) code = InterpolateNearest;
    return code;
}

KernelStatus CheckArguments(const Enlarging& call) {
    const KernelRect& rect = call.rect;
    if (call.source == nullptr || call.destination == nullptr) return KernelNullPointer;
    if (IsKernelSizeBad(call.sourceSize)) return KernelBadSize;
    if (rect.x < 0 || rect.y < 0 || IsKernelSizeBad({rect.width, rect.height}))
        return KernelBadSize;
    if (rect.x >= call.sourceSize.width || rect.y >= call.sourceSize.height) return KernelNoOverlap;
    if (IsKernelSizeBad(call.outputSize)) return KernelBadSize;
    // A factor that is not a number is not above 0 either.
    return call.xFactor > 0.0 && call.yFactor > 0.0 ? KernelOk : KernelBadFactor;
}

KernelStatus ChooseInterpolation(Enlarging* call) {
    const std::int32_t code =
        FitInterpolation(call->interpolation, call->sourceSize.width, call->sourceSize.height);
    if (code != InterpolateNearest && code != InterpolateLinear && code != InterpolateCubic) {
        return KernelBadInterpolation;
    }
    call->interpolation = FitInterpolation(code, call->rect.width, call->rect.height);
    return KernelOk;
}

/// Cuts the room of one direction to the length of the result.
KernelStatus CutLength(std::int32_t sourceLength, double factor, std::int32_t* length) {
    const double unrounded = sourceLength * factor;
    const double whole = unrounded + Slack;
    if (whole < 1.0 && unrounded < 0.5) return KernelEmptyResult;
    if (whole < *length) *length = std::max(static_cast<std::int32_t>(whole), 1);
    return KernelOk;
}

KernelStatus CutToResult(Enlarging* call) {
    const KernelStatus status = CutLength(call->rect.width, call->xFactor, &call->outputSize.width);
    if (status != KernelOk) return status;
    return CutLength(call->rect.height, call->yFactor, &call->outputSize.height);
}

void CutToImage(Enlarging* call) {
    KernelRect& rect = call->rect;
    rect.width = std::min(rect.width, call->sourceSize.width - rect.x);
    rect.height = std::min(rect.height, call->sourceSize.height - rect.y);
}

/// Rows that have been passed along their length, kept by source row: row r stands in slot r modulo
/// the number of slots until another row takes it.
template <typename Item, std::size_t Slots>
class RowCache {
  public:
    explicit RowCache(std::size_t rowLength)
        : items(MakeScratch<Item>(Slots * rowLength)), length(rowLength) {
        rows.fill(-1);
    }
    [[nodiscard]] bool IsMade() const { return items != nullptr; }
    /// The row, made by `pass(row, items)` if it is not there.
    template <typename Pass>
    const Item* Get(std::int32_t row, Pass&& pass) {
        const std::size_t slot = static_cast<std::size_t>(row) % Slots;
        Item* const stored = items.get() + slot * length;
        if (rows[slot] != row) {
            pass(row, stored);
            rows[slot] = row;
        }
        return stored;
    }

  private:
    Scratch<Item> items;
    std::size_t length;
    std::array<std::int32_t, Slots> rows{};
};

/// The source samples of the nearest interpolation in one direction; null without memory.
Scratch<std::int32_t> PlaceNearest(std::int32_t sourceLength, std::int32_t outputLength,
                                   double factor) {
    auto indices = MakeScratch<std::int32_t>(static_cast<std::size_t>(outputLength));
    if (indices == nullptr) return indices;
    const double step = 1.0 / factor;
    double position = step / 2.0;
    for (std::int32_t output = 0; output < outputLength; ++output, position += step) {
        const auto index = static_cast<std::int64_t>(position + Slack);
        indices[output] =
            static_cast<std::int32_t>(std::min(index, std::int64_t{sourceLength} - 1));
    }
    return indices;
}

template <typename Sample>
KernelStatus EnlargeNearest(const Enlarging& call) {
    const auto width = static_cast<std::size_t>(call.outputSize.width);
    const auto columns = PlaceNearest(call.rect.width, call.outputSize.width, call.xFactor);
    const auto lines = PlaceNearest(call.rect.height, call.outputSize.height, call.yFactor);
    if (columns == nullptr || lines == nullptr) return KernelNoMemory;
    const auto doubleRow = GetRowKernels().*Loops<Sample>::Double;
    for (std::int32_t row = 0; row < call.outputSize.height; ++row) {
        auto* const output = call.GetOutputRow<Sample>(row);
        const auto* const source = call.GetSourceRow<Sample>(lines[row]);
        if (row > 0 && lines[row] == lines[row - 1]) {
            std::memmove(output, call.GetOutputRow<Sample>(row - 1), width * sizeof(Sample));
        } else if (call.xFactor == 2.0) {
            doubleRow(source, output, width);
        } else {
            for (std::size_t index = 0; index < width; ++index) {
                output[index] = source[columns[index]];
            }
        }
    }
    return KernelOk;
}

template <typename Sample>
KernelStatus EnlargeLinear(const Enlarging& call) {
    const auto width = static_cast<std::size_t>(call.outputSize.width);
    const LinearPositions columns(call.rect.width, call.outputSize.width, call.xFactor,
                                  sizeof(Sample));
    const LinearPositions lines(call.rect.height, call.outputSize.height, call.yFactor,
                                sizeof(Sample));
    RowCache<std::uint16_t, 2> cache(width);
    if (!columns.IsMade() || !lines.IsMade() || !cache.IsMade()) return KernelNoMemory;
    const RowKernels& rows = GetRowKernels();
    const auto pass = [&](std::int32_t row, std::uint16_t* output) {
        (rows.*Loops<Sample>::LinearRow)(call.GetSourceRow<Sample>(row), columns.GetPlan(), output);
    };
    for (std::int32_t row = 0; row < call.outputSize.height; ++row) {
        const LinearPosition& line = lines[static_cast<std::size_t>(row)];
        const std::uint16_t* const upper = cache.Get(line.index, pass);
        const std::uint16_t* const lower = cache.Get(line.index + 1, pass);
        (rows.*Loops<Sample>::LinearColumn)(upper, lower, line.weight,
                                            call.GetOutputRow<Sample>(row), width);
    }
    return KernelOk;
}

template <typename Sample>
KernelStatus EnlargeCubic(const Enlarging& call) {
    const auto width = static_cast<std::size_t>(call.outputSize.width);
    const CubicPositions columns(call.rect.width, call.outputSize.width, call.xFactor);
    const CubicPositions lines(call.rect.height, call.outputSize.height, call.yFactor);
    RowCache<float, 4> cache(width);
    if (!columns.IsMade() || !lines.IsMade() || !cache.IsMade()) return KernelNoMemory;
    const RowKernels& rows = GetRowKernels();
    const auto pass = [&](std::int32_t row, float* output) {
        (rows.*Loops<Sample>::CubicRow)(call.GetSourceRow<Sample>(row), columns.GetPlan(), output);
    };
    for (std::int32_t row = 0; row < call.outputSize.height; ++row) {
        const CubicPosition& line = lines[static_cast<std::size_t>(row)];
        const float* const taken[4] = {cache.Get(line.index, pass), cache.Get(line.index + 1, pass),
                                       cache.Get(line.index + 2, pass),
                                       cache.Get(line.index + 3, pass)};
        (rows.*Loops<Sample>::CubicColumn)(taken, line.weights, call.GetOutputRow<Sample>(row),
                                           width);
    }
    return KernelOk;
}

template <typename Sample>
KernelStatus Enlarge(Enlarging call) {
    KernelStatus status = CheckArguments(call);
    if (status != KernelOk) return status;
    CutToImage(&call);
    status = ChooseInterpolation(&call);
    if (status == KernelOk) status = CutToResult(&call);
    if (status != KernelOk) return status;
    if (call.interpolation == InterpolateNearest) return EnlargeNearest<Sample>(call);
    if (call.interpolation == InterpolateLinear) return EnlargeLinear<Sample>(call);
    return EnlargeCubic<Sample>(call);
}

}  // namespace

KernelStatus EnlargePlane8(const void* source, KernelSize sourceSize, std::int32_t sourceRowBytes,
                           KernelRect sourceRect, void* destination,
                           std::int32_t destinationRowBytes, KernelSize destinationSize,
                           double xFactor, double yFactor, std::int32_t interpolation) {
    return Enlarge<std::uint8_t>({source, sourceSize, sourceRowBytes, sourceRect, destination,
                                  destinationRowBytes, destinationSize, xFactor, yFactor,
                                  interpolation});
}

KernelStatus EnlargePlane16(const void* source, KernelSize sourceSize, std::int32_t sourceRowBytes,
                            KernelRect sourceRect, void* destination,
                            std::int32_t destinationRowBytes, KernelSize destinationSize,
                            double xFactor, double yFactor, std::int32_t interpolation) {
    return Enlarge<Word>({source, sourceSize, sourceRowBytes, sourceRect, destination,
                          destinationRowBytes, destinationSize, xFactor, yFactor, interpolation});
}

}  // namespace ZV
