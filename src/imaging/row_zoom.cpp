#include "imaging/row_zoom.h"

#include <cstddef>
#include <cstring>

namespace ZV {
namespace {

constexpr std::uint32_t WidthMin = 5;
constexpr std::uint32_t HeightMin = 6;

/// Of the doubled frame, four rows to each cell of the mosaic: rows 0 and 3 are real.
constexpr std::size_t RowsPerCell = 4;

template <typename Sample>
class Frame {
  public:
    Frame(std::uint8_t* newData, std::uint32_t newWidth, std::uint32_t newHeight)
        : data(newData),
          width(newWidth),
          height(newHeight),
          run((std::size_t{newWidth} + newWidth % 2 - 4) / 2) {}

    [[nodiscard]] std::size_t GetHeight() const { return height; }
    [[nodiscard]] bool IsOddWidth() const { return width % 2 != 0; }
    /// Samples of a row's computed columns between the left and the right edge.
    [[nodiscard]] std::size_t GetRun() const { return run; }
    [[nodiscard]] std::size_t GetLastEvenColumn() const { return 2 + 2 * run; }

    [[nodiscard]] std::uint32_t Get(std::size_t row, std::size_t column) const {
        Sample sample;
        std::memcpy(&sample, Find(row, column), sizeof sample);
        return sample;
    }
    void Put(std::size_t row, std::size_t column, std::uint32_t value) {
        const auto sample = static_cast<Sample>(value);
        std::memcpy(Find(row, column), &sample, sizeof sample);
    }
    void Copy(std::size_t toRow, std::size_t toColumn, std::size_t row, std::size_t column) {
        Put(toRow, toColumn, Get(row, column));
    }

  private:
    [[nodiscard]] std::uint8_t* Find(std::size_t row, std::size_t column) const {
        return data + (row * width + column) * sizeof(Sample);
    }

    std::uint8_t* data;
    std::size_t width;
    std::size_t height;
    std::size_t run;
};

/// The third of a sum, rounded up.
std::uint32_t Third(std::uint32_t sum) {
    return (sum + 2) / 3;
}

// ---- Rows inside the frame ----

/// Computed rows of one kind: 2, 6, 10, ..., whose real neighbours of the other colours stand
/// below, or 5, 9, 13, ..., where they stand above. Both real neighbours of a sample in its own
/// column stand two rows away; where they have its colour, rows 2, 6, ... weigh the upper one
/// twice, rows 5, 9, ... the lower one.
struct RowFamily {
    std::size_t firstRow;
    std::size_t rowCount;
    bool isBelow;  ///< The adjacent real row stands below.
};

/// Samples with their own colour above and below, two rows away.
template <typename Sample>
void ZoomFillVertical(Frame<Sample>& frame, const RowFamily& rows, std::size_t startColumn) {
    const std::uint32_t upperWeight = rows.isBelow ? 2 : 1;
    const std::uint32_t lowerWeight = 3 - upperWeight;
    const bool hasRightEdge = startColumn % 2 == 0 || !frame.IsOddWidth();
    const std::size_t columnCount = frame.GetRun() + (hasRightEdge ? 2 : 1);
    for (std::size_t index = 0; index < rows.rowCount; ++index) {
        const std::size_t row = rows.firstRow + RowsPerCell * index;
        for (std::size_t step = 0; step < columnCount; ++step) {
            const std::size_t column = startColumn - 2 + 2 * step;
            frame.Put(row, column,
                      Third(upperWeight * frame.Get(row - 2, column) +
                            lowerWeight * frame.Get(row + 2, column)));
        }
    }
}

/// Samples with their own colour left and right of the adjacent real row, and two rows away on the
/// other side.
template <typename Sample>
void ZoomFillDiagonal(Frame<Sample>& frame, const RowFamily& rows, std::size_t startColumn) {
    const std::size_t rightEdge = startColumn + 2 * frame.GetRun();
    const bool hasRightEdge = startColumn % 2 == 0 || !frame.IsOddWidth();
    for (std::size_t index = 0; index < rows.rowCount; ++index) {
        const std::size_t row = rows.firstRow + RowsPerCell * index;
        const std::size_t near = rows.isBelow ? row + 1 : row - 1;
        const std::size_t far = rows.isBelow ? row - 2 : row + 2;
        // Kept: column 1 has a left neighbour, and column w - 2 of an even width a right one;
        // neither is used.
        frame.Put(row, startColumn - 2,
                  Third(frame.Get(far, startColumn - 2) + 2 * frame.Get(near, startColumn - 1)));
        for (std::size_t column = startColumn; column < rightEdge; column += 2) {
            frame.Put(row, column,
                      Third(frame.Get(near, column - 1) + frame.Get(near, column + 1) +
                            frame.Get(far, column)));
        }
        if (!hasRightEdge) continue;
        frame.Put(row, rightEdge,
                  Third(frame.Get(far, rightEdge) + 2 * frame.Get(near, rightEdge - 1)));
    }
}

template <typename Sample>
void FillRowsInside(Frame<Sample>& frame, const RowFamily& rows, bool isVerticalInEvenColumns) {
    constexpr std::size_t EvenStart = 2, OddStart = 3;
    ZoomFillVertical(frame, rows, isVerticalInEvenColumns ? EvenStart : OddStart);
    ZoomFillDiagonal(frame, rows, isVerticalInEvenColumns ? OddStart : EvenStart);
}

// ---- The first and last rows ----

/// Row 1 of a frame whose first sample is green.
template <typename Sample>
void FinishTopGreenFirst(Frame<Sample>& frame) {
    const std::size_t last = frame.GetLastEvenColumn();
    for (std::size_t c = 0; c < last; c += 2) {
        frame.Copy(1, c, 3, c);
        frame.Put(1, c + 1, Third(frame.Get(3, c + 1) + frame.Get(0, c) + frame.Get(0, c + 2)));
    }
    frame.Copy(1, last, 3, last);
    if (frame.IsOddWidth()) return;
    frame.Put(1, last + 1, Third(frame.Get(3, last + 1) + 2 * frame.Get(0, last)));
}

/// Row h - 2, where the real row h - 1 stands below it.
template <typename Sample>
void FinishRowBeforeLastGreenFirst(Frame<Sample>& frame) {
    const std::size_t last = frame.GetLastEvenColumn();
    const std::size_t row = frame.GetHeight() - 2;
    const std::size_t below = row + 1, above = row - 2;
    // Kept: the sample above is taken two columns too far to the right.
    frame.Put(row, 0, Third(2 * frame.Get(below, 1) + frame.Get(above, 2)));
    frame.Copy(row, 1, above, 1);
    for (std::size_t c = 2; c < last; c += 2) {
        frame.Put(row, c,
                  Third(frame.Get(above, c) + frame.Get(below, c - 1) + frame.Get(below, c + 1)));
        frame.Copy(row, c + 1, above, c + 1);
    }
    frame.Put(row, last, Third(frame.Get(above, last) + 2 * frame.Get(below, last - 1)));
    if (!frame.IsOddWidth()) frame.Copy(row, last + 1, above, last + 1);
}

/// Row h - 1, with no row below it.
template <typename Sample>
void FinishLastRowGreenFirst(Frame<Sample>& frame) {
    const std::size_t last = frame.GetLastEvenColumn();
    const std::size_t row = frame.GetHeight() - 1;
    const std::size_t above = row - 1, real = row - 2;
    for (std::size_t c = 0; c < last; c += 2) {
        frame.Copy(row, c, real, c);
        frame.Put(row, c + 1, (frame.Get(above, c) + frame.Get(above, c + 2) + 1) >> 1);
    }
    frame.Copy(row, last, real, last);
    if (!frame.IsOddWidth()) frame.Copy(row, last + 1, above, last);
}

/// Row 1 of a frame whose second sample is green.
template <typename Sample>
void FinishTopGreenSecond(Frame<Sample>& frame) {
    const std::size_t last = frame.GetLastEvenColumn();
    frame.Put(1, 0, Third(2 * frame.Get(0, 1) + frame.Get(3, 0)));
    frame.Copy(1, 1, 3, 1);
    for (std::size_t c = 2; c < last; c += 2) {
        frame.Put(1, c, Third(frame.Get(0, c - 1) + frame.Get(0, c + 1) + frame.Get(3, c)));
        frame.Copy(1, c + 1, 3, c + 1);
    }
    frame.Put(1, last, Third(frame.Get(3, last) + 2 * frame.Get(0, last - 1)));
    if (!frame.IsOddWidth()) frame.Copy(1, last + 1, 3, last + 1);
}

template <typename Sample>
void FinishRowBeforeLastGreenSecond(Frame<Sample>& frame) {
    const std::size_t last = frame.GetLastEvenColumn();
    const std::size_t row = frame.GetHeight() - 2;
    const std::size_t below = row + 1, above = row - 2;
    frame.Copy(row, 0, above, 0);
    // Kept: the sample above is taken two columns too far to the right.
    frame.Put(row, 1, Third(frame.Get(above, 3) + 2 * frame.Get(below, 2)));
    for (std::size_t c = 2; c < last; c += 2) {
        frame.Copy(row, c, above, c);
        frame.Put(row, c + 1,
                  Third(frame.Get(above, c + 1) + frame.Get(below, c) + frame.Get(below, c + 2)));
    }
    frame.Copy(row, last, above, last);
    if (frame.IsOddWidth()) return;
    frame.Put(row, last + 1, Third(frame.Get(above, last + 1) + 2 * frame.Get(below, last)));
}

template <typename Sample>
void FinishLastRowGreenSecond(Frame<Sample>& frame) {
    const std::size_t last = frame.GetLastEvenColumn();
    const std::size_t row = frame.GetHeight() - 1;
    const std::size_t above = row - 1, real = row - 2;
    frame.Copy(row, 0, above, 1);
    frame.Copy(row, 1, real, 1);
    for (std::size_t c = 2; c < last; c += 2) {
        frame.Put(row, c, (frame.Get(above, c - 1) + frame.Get(above, c + 1) + 1) >> 1);
        frame.Copy(row, c + 1, real, c + 1);
    }
    frame.Copy(row, last, above, last - 1);
    if (!frame.IsOddWidth()) frame.Copy(row, last + 1, real, last + 1);
}

template <typename Sample>
void ZoomBordersGreenFirst(Frame<Sample>& frame) {
    FinishTopGreenFirst(frame);
    if (frame.GetHeight() % RowsPerCell == 0) {
        FinishRowBeforeLastGreenFirst(frame);
    } else {
        FinishLastRowGreenFirst(frame);
    }
}

template <typename Sample>
void ZoomBordersGreenSecond(Frame<Sample>& frame) {
    FinishTopGreenSecond(frame);
    if (frame.GetHeight() % RowsPerCell == 0) {
        FinishRowBeforeLastGreenSecond(frame);
    } else {
        FinishLastRowGreenSecond(frame);
    }
}

bool IsGreenFirst(std::uint32_t pattern) {
    return pattern == 1 || pattern == 2 || pattern == 6 || pattern == 7;
}

template <typename Sample>
void FillRows(std::uint32_t pattern, Frame<Sample> frame) {
    const std::size_t height = frame.GetHeight();
    const bool isGreenFirst = IsGreenFirst(pattern);
    FillRowsInside(frame, {2, (height - 1) / RowsPerCell, true}, !isGreenFirst);
    FillRowsInside(frame, {5, (height - 4) / RowsPerCell, false}, isGreenFirst);
    if (isGreenFirst) {
        ZoomBordersGreenFirst(frame);
    } else {
        ZoomBordersGreenSecond(frame);
    }
}

}  // namespace

void ZoomSpreadRows(const std::uint8_t* rows, std::uint8_t* zoomed, std::uint32_t width,
                    std::uint32_t rowCount, std::uint32_t sampleBytes) {
    const std::size_t rowBytes = std::size_t{width} * sampleBytes;
    if (rowBytes == 0) return;
    // From the last row up: a row never goes further up than it stands, so none is lost in place.
    for (std::size_t row = rowCount; row-- != 0;) {
        const std::size_t target = 2 * row + row % 2;
        std::memmove(zoomed + target * rowBytes, rows + row * rowBytes, rowBytes);
    }
}

bool CanZoomFillRows(std::uint32_t width, std::uint32_t height) {
    return width >= WidthMin && height >= HeightMin;
}

void ZoomFillRows(std::uint32_t pattern, std::uint8_t* data, std::uint32_t width,
                  std::uint32_t height, std::uint32_t sampleBytes) {
    if (!CanZoomFillRows(width, height)) return;
    if (sampleBytes == 1) {
        FillRows(pattern, Frame<std::uint8_t>(data, width, height));
    } else {
        FillRows(pattern, Frame<std::uint16_t>(data, width, height));
    }
}

}  // namespace ZV
