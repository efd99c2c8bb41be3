#include "imaging/bayer_engine.h"

#include <algorithm>
#include <array>
#include <cstring>
#include <limits>

#include "imaging/image_formats.h"
#include "imaging/kernels/kernel_selection.h"

namespace ZV {
namespace {

constexpr std::size_t ChannelCount = 3;  // red, green, blue
constexpr std::uint8_t Alpha = 3;
constexpr std::uint8_t AlphaLevel = 255;

// Pixels that are finished and packed at a time: their samples stay in the first cache.
constexpr std::size_t ChunkPixels = 1024;
constexpr std::size_t RowAlignment = 64;
constexpr std::size_t LineBytes = 64;

struct PatternRow {
    std::uint32_t colourPattern;
    std::array<std::uint8_t, 4> planes;  // Of the cell's places; 0 red, 1 and 2 green, 3 blue.
};

constexpr std::array Patterns{
    PatternRow{PatternRGGB, {0, 1, 2, 3}},
    PatternRow{PatternGRBG, {1, 0, 3, 2}},
    PatternRow{PatternGBRG, {1, 3, 0, 2}},
    PatternRow{PatternBGGR, {3, 1, 2, 0}},
};

const PatternRow& FindPattern(std::uint32_t colourPattern) {
    for (const PatternRow& row : Patterns) {
        if (row.colourPattern == colourPattern) return row;
    }
    return Patterns.front();
}

struct FormatRow {
    std::uint32_t format;
    std::uint8_t sampleBytes;
    bool isPlanar;
    std::uint8_t samplesPerPixel;
    std::array<std::uint8_t, 4> order;  // Channels side by side.
};

constexpr std::array Formats{
    FormatRow{RGBPlane8, 1, true, 3, {0, 1, 2}}, FormatRow{RGBPlane16, 2, true, 3, {0, 1, 2}},
    FormatRow{BGR24, 1, false, 3, {2, 1, 0}},    FormatRow{XRGB32, 1, false, 4, {Alpha, 0, 1, 2}},
    FormatRow{RGB48, 2, false, 3, {0, 1, 2}},    FormatRow{BGRX32, 1, false, 4, {2, 1, 0, Alpha}},
    FormatRow{RGB24, 1, false, 3, {0, 1, 2}},    FormatRow{RGBX32, 1, false, 4, {0, 1, 2, Alpha}},
};

const FormatRow* FindFormat(std::uint32_t format, std::size_t sampleBytes) {
    for (const FormatRow& row : Formats) {
        if (row.format == format && row.sampleBytes == sampleBytes) return &row;
    }
    return nullptr;
}

/// The row loops for samples of one width.
template <typename Sample>
struct SampleLoops {
    void (*split)(const Sample* row, Sample* even, Sample* odd, std::size_t count);
    void (*addHalves)(const Sample* first, const Sample* second, Sample* output, std::size_t count);
    void (*repeat)(const Sample* row, Sample* output, std::size_t count);
    void (*linearRow)(const Sample* row, const LinearPlan& plan, std::uint16_t* output);
    void (*linearColumn)(const std::uint16_t* upper, const std::uint16_t* lower,
                         std::int32_t weight, Sample* output, std::size_t count);
    void (*linearColumnPair)(const std::uint16_t* upper, const std::uint16_t* lower,
                             const std::int32_t weights[2], Sample* const outputs[2],
                             std::size_t count);
    void (*cubicRow)(const Sample* row, const CubicPlan& plan, float* output);
    void (*cubicColumn)(const float* const rows[4], const CubicWeights& weights, Sample* output,
                        std::size_t count);
    void (*cubicColumnPair)(const float* const rows[4], const CubicWeights weights[2],
                            Sample* const outputs[2], std::size_t count);
    void (*packThree)(const Sample* const planes[3], Sample* pixels, std::size_t count);
    void (*packFour)(const Sample* const planes[4], Sample* pixels, std::size_t count);
};

template <typename Sample>
SampleLoops<Sample> GetLoops();

template <>
SampleLoops<std::uint8_t> GetLoops() {
    const RowKernels& rows = GetRowKernels();
    return {rows.split8,           rows.addHalves8,        rows.double8,   rows.linearRow8,
            rows.linearColumn8,    rows.linearColumnPair8, rows.cubicRow8, rows.cubicColumn8,
            rows.cubicColumnPair8, rows.pack8x3,           rows.pack8x4};
}

template <>
SampleLoops<Word> GetLoops() {
    const RowKernels& rows = GetRowKernels();
    return {rows.split16,           rows.addHalves16,        rows.double16,   rows.linearRow16,
            rows.linearColumn16,    rows.linearColumnPair16, rows.cubicRow16, rows.cubicColumn16,
            rows.cubicColumnPair16, rows.pack16x3,           nullptr};  // no format of words has
                                                                        // four samples
}

/// Hands out rows of the scratch, one after the other.
class RowCarver {
  public:
    explicit RowCarver(std::uint8_t* start) : next(start) {
        const auto address = reinterpret_cast<std::uintptr_t>(start);
        next += (RowAlignment - address % RowAlignment) % RowAlignment;
    }

    template <typename Element>
    Element* Take(std::size_t count) {
        auto* const row = reinterpret_cast<Element*>(next);
        next += Measure(count * sizeof(Element));
        return row;
    }

    static constexpr std::uint64_t Measure(std::uint64_t bytes) {
        return (bytes + RowAlignment - 1) / RowAlignment * RowAlignment;
    }

  private:
    std::uint8_t* next;
};

/// Bytes of scratch for the rows that an enlarging has in use.
std::uint64_t MeasureEnlarged(std::uint64_t width, KernelInterpolation interpolation,
                              std::size_t sampleBytes) {
    if (interpolation == InterpolateCubic) {
        return 4 * ChannelCount * RowCarver::Measure(width * sizeof(float));
    }
    if (interpolation == InterpolateLinear) {
        return 2 * ChannelCount * RowCarver::Measure(width * sizeof(std::uint16_t));
    }
    return ChannelCount * RowCarver::Measure(width * sampleBytes);
}

/// Bytes of scratch that a frame of this width takes; a width of 0 those of a black image.
std::uint64_t MeasureScratch(std::uint64_t width, KernelInterpolation interpolation,
                             std::size_t sampleBytes) {
    const std::uint64_t source = RowCarver::Measure(width * sampleBytes);
    const std::uint64_t quarters = 5 * RowCarver::Measure(width / 2 * sampleBytes);
    const std::uint64_t chunks =
        (2 * ChannelCount + 1) * RowCarver::Measure(ChunkPixels * sampleBytes);
    return RowAlignment + source + quarters + MeasureEnlarged(width, interpolation, sampleBytes) +
           chunks;
}

/// The rows of the quarter planes, with the greens made one.
template <typename Sample>
class ColourRows {
  public:
    ColourRows(const BayerMosaic& frame, const SampleLoops<Sample>& rowLoops, RowCarver& carver)
        : mosaic(frame), loops(rowLoops), pattern(FindPattern(frame.colourPattern)) {
        padded = carver.Take<Sample>(mosaic.width);
        for (Sample*& plane : planes) plane = carver.Take<Sample>(GetCount());
        green = carver.Take<Sample>(GetCount());
    }

    std::size_t GetCount() const { return mosaic.width / 2; }

    /// Rows of red, green and blue, until the next call.
    std::array<const Sample*, ChannelCount> Load(std::size_t row) {
        const auto& places = pattern.planes;
        loops.split(GetRow(2 * row), planes[places[0]], planes[places[1]], GetCount());
        loops.split(GetRow(2 * row + 1), planes[places[2]], planes[places[3]], GetCount());
        loops.addHalves(planes[1], planes[2], green, GetCount());
        return {planes[0], green, planes[3]};
    }

  private:
    const Sample* GetRow(std::size_t row) {
        const std::uint64_t rowBytes = std::uint64_t{mosaic.width} * sizeof(Sample);
        const std::uint64_t begin = row * rowBytes;
        if (begin + rowBytes <= mosaic.bytes) {
            return reinterpret_cast<const Sample*>(mosaic.data + begin);
        }
        const std::uint64_t there = begin < mosaic.bytes ? mosaic.bytes - begin : 0;
        auto* const bytes = reinterpret_cast<std::uint8_t*>(padded);
        std::memset(bytes, 0, rowBytes);
        if (there != 0) std::memcpy(bytes, mosaic.data + begin, there);
        return padded;
    }

    const BayerMosaic& mosaic;
    const SampleLoops<Sample>& loops;
    const PatternRow& pattern;
    Sample* padded;
    std::array<Sample*, 4> planes;
    Sample* green;
};

/// The rows that an enlarging has in use: each row of the quarter planes after its row pass, the
/// latest `Depth` of them.
template <typename Sample, typename Element, std::size_t Depth>
class RowWindow {
  public:
    RowWindow(ColourRows<Sample>& colourRows, RowCarver& carver) : source(colourRows) {
        for (auto& slot : slots) {
            for (Element*& row : slot) row = carver.Take<Element>(2 * source.GetCount());
        }
    }

    /// Makes the rows up to and with `last`; `pass(input, output)` is the row pass.
    template <typename Pass>
    void Advance(std::size_t last, Pass&& pass) {
        for (; nextRow <= last; ++nextRow) {
            const auto input = source.Load(nextRow);
            const auto& slot = slots[nextRow % Depth];
            for (std::size_t channel = 0; channel < ChannelCount; ++channel) {
                pass(input[channel], slot[channel]);
            }
        }
    }

    const Element* Get(std::size_t row, std::size_t channel) const {
        return slots[row % Depth][channel];
    }

  private:
    ColourRows<Sample>& source;
    std::size_t nextRow = 0;
    std::array<std::array<Element*, ChannelCount>, Depth> slots;
};

/// Room for a part of up to two output rows of each channel.
template <typename Sample>
using ChunkRoom = std::array<std::array<Sample*, 2>, ChannelCount>;

/// Parts of up to two output rows of each channel.
template <typename Sample>
using RowParts = std::array<std::array<const Sample*, 2>, ChannelCount>;

template <typename Sample>
RowParts<Sample> PartsOf(const ChunkRoom<Sample>& room) {
    RowParts<Sample> parts;
    for (std::size_t channel = 0; channel < ChannelCount; ++channel) {
        parts[channel] = {room[channel][0], room[channel][1]};
    }
    return parts;
}

/// How many output rows from `row` on are made at once: two where both lie between the same rows.
template <typename Positions>
std::size_t CountRowsAtOnce(const Positions& positions, std::size_t row, std::size_t end) {
    return row + 1 < end && positions[row].index == positions[row + 1].index ? 2 : 1;
}

// Each way of enlarging brings what output rows are made of together (Prepare, which returns how
// many of the rows from `row` on, below `end`, it is good for: one or two) and finishes a part of
// them (Finish, into `room` or in place).

template <typename Sample>
class NearestRows {
  public:
    NearestRows(ColourRows<Sample>& source, const SampleLoops<Sample>& rowLoops, RowCarver& carver)
        : loops(rowLoops), window(source, carver), count(2 * source.GetCount()) {}

    std::size_t Prepare(std::size_t row, std::size_t) {
        current = row / 2;
        window.Advance(current, [this](const Sample* input, Sample* output) {
            loops.repeat(input, output, count);
        });
        return 2;
    }

    RowParts<Sample> Finish(std::size_t from, std::size_t, const ChunkRoom<Sample>&) const {
        RowParts<Sample> parts;
        for (std::size_t channel = 0; channel < ChannelCount; ++channel) {
            parts[channel].fill(window.Get(current, channel) + from);
        }
        return parts;
    }

  private:
    const SampleLoops<Sample>& loops;
    RowWindow<Sample, Sample, 1> window;
    std::size_t count;
    std::size_t current = 0;
};

template <typename Sample>
class LinearRows {
  public:
    LinearRows(ColourRows<Sample>& source, const SampleLoops<Sample>& rowLoops, RowCarver& carver,
               const LinearPositions& columnPositions, const LinearPositions& rowPositions)
        : loops(rowLoops),
          window(source, carver),
          plan(columnPositions.GetPlan()),
          positions(rowPositions) {}

    std::size_t Prepare(std::size_t row, std::size_t end) {
        upper = static_cast<std::size_t>(positions[row].index);
        window.Advance(upper + 1, [this](const Sample* input, std::uint16_t* output) {
            loops.linearRow(input, plan, output);
        });
        rowCount = CountRowsAtOnce(positions, row, end);
        for (std::size_t i = 0; i < rowCount; ++i) weights[i] = positions[row + i].weight;
        return rowCount;
    }

    RowParts<Sample> Finish(std::size_t from, std::size_t count,
                            const ChunkRoom<Sample>& room) const {
        for (std::size_t channel = 0; channel < ChannelCount; ++channel) {
            const std::uint16_t* const above = window.Get(upper, channel) + from;
            const std::uint16_t* const below = window.Get(upper + 1, channel) + from;
            if (rowCount == 2) {
                loops.linearColumnPair(above, below, weights, room[channel].data(), count);
            } else {
                loops.linearColumn(above, below, weights[0], room[channel][0], count);
            }
        }
        return PartsOf(room);
    }

  private:
    const SampleLoops<Sample>& loops;
    RowWindow<Sample, std::uint16_t, 2> window;
    const LinearPlan& plan;
    const LinearPositions& positions;
    std::size_t upper = 0;
    std::size_t rowCount = 0;
    std::int32_t weights[2] = {};
};

template <typename Sample>
class CubicRows {
  public:
    CubicRows(ColourRows<Sample>& source, const SampleLoops<Sample>& rowLoops, RowCarver& carver,
              const CubicPositions& columnPositions, const CubicPositions& rowPositions)
        : loops(rowLoops),
          window(source, carver),
          plan(columnPositions.GetPlan()),
          positions(rowPositions) {}

    std::size_t Prepare(std::size_t row, std::size_t end) {
        top = static_cast<std::size_t>(positions[row].index);
        window.Advance(top + 3, [this](const Sample* input, float* output) {
            loops.cubicRow(input, plan, output);
        });
        rowCount = CountRowsAtOnce(positions, row, end);
        for (std::size_t i = 0; i < rowCount; ++i) weights[i] = positions[row + i].weights;
        return rowCount;
    }

    RowParts<Sample> Finish(std::size_t from, std::size_t count,
                            const ChunkRoom<Sample>& room) const {
        for (std::size_t channel = 0; channel < ChannelCount; ++channel) {
            const float* rows[4];
            for (std::size_t i = 0; i < 4; ++i) rows[i] = window.Get(top + i, channel) + from;
            if (rowCount == 2) {
                loops.cubicColumnPair(rows, weights, room[channel].data(), count);
            } else {
                loops.cubicColumn(rows, weights[0], room[channel][0], count);
            }
        }
        return PartsOf(room);
    }

  private:
    const SampleLoops<Sample>& loops;
    RowWindow<Sample, float, 4> window;
    const CubicPlan& plan;
    const CubicPositions& positions;
    std::size_t top = 0;
    std::size_t rowCount = 0;
    CubicWeights weights[2] = {};
};

/// The image, row by row.
template <typename Sample>
class ImageWriter {
  public:
    ImageWriter(const BayerMosaic& mosaic, const BayerTarget& target, const FormatRow& formatRow,
                const SampleLoops<Sample>& rowLoops, RowCarver& carver)
        : format(formatRow), loops(rowLoops), width(mosaic.width), height(mosaic.height) {
        image = reinterpret_cast<Sample*>(target.data);
        alpha = carver.Take<Sample>(ChunkPixels);
        std::memset(static_cast<void*>(alpha), AlphaLevel, ChunkPixels * sizeof(Sample));
    }

    /// At most ChunkPixels pixels of a row.
    void Write(const std::array<const Sample*, ChannelCount>& channels, std::size_t row,
               std::size_t from, std::size_t count) {
        if (format.isPlanar) {
            for (std::size_t channel = 0; channel < ChannelCount; ++channel) {
                std::memcpy(static_cast<void*>(GetPlaneRow(row, channel) + from), channels[channel],
                            count * sizeof(Sample));
            }
            return;
        }
        const Sample* planes[4];
        for (std::size_t place = 0; place < format.samplesPerPixel; ++place) {
            const std::uint8_t channel = format.order[place];
            planes[place] = channel == Alpha ? alpha : channels[channel];
        }
        Sample* const pixels = GetRow(row) + from * format.samplesPerPixel;
        const auto pack = format.samplesPerPixel == 4 ? loops.packFour : loops.packThree;
        pack(planes, pixels, count);
    }

    /// Fetches the lines that a later Write of packed pixels fills.
    void Announce(std::size_t row, std::size_t from, std::size_t count) const {
        if (format.isPlanar) return;
        const auto* line =
            reinterpret_cast<const std::uint8_t*>(GetRow(row) + from * format.samplesPerPixel);
        const auto* const end = line + count * format.samplesPerPixel * sizeof(Sample);
        for (; line < end; line += LineBytes) __builtin_prefetch(line, /*rw=*/1);
    }

    /// The pixels of the row from `from` on repeat the one before.
    void RepeatPixel(std::size_t row, std::size_t from) {
        ForEachRun(row, [&](Sample* run, std::size_t step) {
            for (std::size_t i = from * step; i < width * step; ++i) run[i] = run[i - step];
        });
    }

    /// The row repeats the one before.
    void RepeatRow(std::size_t row) {
        ForEachRun(row, [&](Sample* run, std::size_t step) {
            const std::size_t count = width * step;
            std::memcpy(static_cast<void*>(run), run - count, count * sizeof(Sample));
        });
    }

  private:
    Sample* GetRow(std::size_t row) const { return image + row * width * format.samplesPerPixel; }
    Sample* GetPlaneRow(std::size_t row, std::size_t plane) const {
        return image + (plane * height + row) * width;
    }

    template <typename Action>
    void ForEachRun(std::size_t row, Action&& action) const {
        if (!format.isPlanar) return action(GetRow(row), format.samplesPerPixel);
        for (std::size_t plane = 0; plane < ChannelCount; ++plane) {
            action(GetPlaneRow(row, plane), std::size_t{1});
        }
    }

    const FormatRow& format;
    const SampleLoops<Sample>& loops;
    std::size_t width;
    std::size_t height;
    Sample* image;
    Sample* alpha;
};

template <typename Sample>
ChunkRoom<Sample> TakeChunkRoom(RowCarver& carver) {
    ChunkRoom<Sample> room;
    for (auto& rows : room) {
        for (Sample*& row : rows) row = carver.Take<Sample>(ChunkPixels);
    }
    return room;
}

template <typename Sample, typename Enlarger>
void WriteRows(const Enlarger& enlarger, ImageWriter<Sample>& writer, const ChunkRoom<Sample>& room,
               std::size_t row, std::size_t rowCount, std::size_t width) {
    for (std::size_t from = 0; from < width; from += ChunkPixels) {
        const std::size_t count = std::min(ChunkPixels, width - from);
        for (std::size_t i = 0; i < rowCount; ++i) writer.Announce(row + i, from, count);
        const RowParts<Sample> parts = enlarger.Finish(from, count, room);
        for (std::size_t i = 0; i < rowCount; ++i) {
            writer.Write({parts[0][i], parts[1][i], parts[2][i]}, row + i, from, count);
        }
    }
}

/// The part of the image that cells of the mosaic cover, and what repeats it.
template <typename Sample, typename Enlarger>
void EnlargeRows(const BayerMosaic& mosaic, Enlarger enlarger, ImageWriter<Sample>& writer,
                 const ChunkRoom<Sample>& room) {
    const std::size_t width = mosaic.width - mosaic.width % 2;
    const std::size_t height = mosaic.height - mosaic.height % 2;
    for (std::size_t row = 0; row < height;) {
        const std::size_t rowCount = enlarger.Prepare(row, height);
        WriteRows(enlarger, writer, room, row, rowCount, width);
        for (const std::size_t end = row + rowCount; row < end; ++row) {
            writer.RepeatPixel(row, width);
        }
    }
    if (height < mosaic.height) writer.RepeatRow(height);
}

template <typename Sample>
void WriteBlack(const BayerMosaic& mosaic, ImageWriter<Sample>& writer,
                const ChunkRoom<Sample>& room) {
    struct Nothing {
        RowParts<Sample> Finish(std::size_t, std::size_t, const ChunkRoom<Sample>& black) const {
            return PartsOf(black);
        }
    };
    for (const auto& rows : room) {
        std::memset(static_cast<void*>(rows[0]), 0, ChunkPixels * sizeof(Sample));
    }
    for (std::size_t row = 0; row < mosaic.height; ++row) {
        WriteRows(Nothing{}, writer, room, row, 1, mosaic.width);
    }
}

/// What the pixel kernels make of a code for planes of this size; a code that they refuse is
/// linear.
KernelInterpolation FitInterpolation(KernelInterpolation interpolation, std::uint32_t columns,
                                     std::uint32_t rows) {
    const std::uint32_t least = std::min(columns, rows);
    const bool isCubic =
        interpolation == InterpolateCubic || (interpolation == InterpolateLanczos && least < 8);
    if (least < 2 || interpolation == InterpolateNearest) return InterpolateNearest;
    return isCubic && least >= 4 ? InterpolateCubic : InterpolateLinear;
}

bool DoOverlap(const BayerMosaic& mosaic, const BayerTarget& target, std::uint64_t outputBytes) {
    const auto in = reinterpret_cast<std::uintptr_t>(mosaic.data);
    const auto out = reinterpret_cast<std::uintptr_t>(target.data);
    return mosaic.bytes != 0 && in < out + outputBytes && out < in + mosaic.bytes;
}

}  // namespace

void BayerEngine::Reserve(std::uint32_t width) {
    const std::uint64_t bytes = MeasureScratch(width, InterpolateCubic, sizeof(Word));
    if (scratch.GetBytes() != bytes) (void)scratch.AllocateAhead(bytes);
}

std::uint64_t BayerEngine::MeasureImage(std::uint32_t width, std::uint32_t height,
                                        std::uint32_t format, std::size_t sampleBytes) {
    constexpr std::uint64_t BytesMax = std::numeric_limits<std::uint32_t>::max();
    const FormatRow* const row = FindFormat(format, sampleBytes);
    if (row == nullptr) return 0;
    const std::uint64_t pixels = std::uint64_t{width} * height;
    const std::uint64_t pixelBytes = row->samplesPerPixel * sampleBytes;
    return pixels <= BytesMax / pixelBytes ? pixels * pixelBytes : 0;
}

FilterResult BayerEngine::Run8(const BayerMosaic& mosaic, KernelInterpolation interpolation,
                               const BayerTarget& target, std::uint32_t* outputBytes) {
    return Run<std::uint8_t>(mosaic, interpolation, target, outputBytes);
}

FilterResult BayerEngine::Run16(const BayerMosaic& mosaic, KernelInterpolation interpolation,
                                const BayerTarget& target, std::uint32_t* outputBytes) {
    return Run<Word>(mosaic, interpolation, target, outputBytes);
}

template <typename Sample>
FilterResult BayerEngine::Run(const BayerMosaic& mosaic, KernelInterpolation interpolation,
                              const BayerTarget& target, std::uint32_t* outputBytes) {
    const FormatRow* const format = FindFormat(target.format, sizeof(Sample));
    if (format == nullptr) return FilterUnusableFormat;
    if (outputBytes == nullptr) return FilterFailed;
    const std::uint64_t pixels = std::uint64_t{mosaic.width} * mosaic.height;
    if (pixels == 0) {
        *outputBytes = 0;
        return FilterDone;
    }
    if (mosaic.data == nullptr || target.data == nullptr) return FilterFailed;
    const std::uint64_t bytes =
        MeasureImage(mosaic.width, mosaic.height, target.format, sizeof(Sample));
    if (bytes == 0) return FilterFailed;
    if (target.capacity != 0 && bytes > target.capacity) return FilterFailed;
    if (!Prepare(mosaic, interpolation, sizeof(Sample))) return FilterNotInitialised;

    BayerMosaic source = mosaic;
    source.bytes = std::min(mosaic.bytes, pixels * sizeof(Sample));
    PixelBuffer copy;
    if (DoOverlap(source, target, bytes)) {
        // A client may have given one buffer for both ends; rows would be overwritten unread.
        if (!copy.Allocate(source.bytes)) return FilterNotInitialised;
        std::memcpy(copy.GetData(), source.data, source.bytes);
        source.data = copy.GetData();
    }
    MakeImage<Sample>(source, target);
    *outputBytes = static_cast<std::uint32_t>(bytes);
    return FilterDone;
}

template <typename Sample>
void BayerEngine::MakeImage(const BayerMosaic& mosaic, const BayerTarget& target) {
    const SampleLoops<Sample> loops = GetLoops<Sample>();
    RowCarver carver(scratch.GetData());
    const FormatRow& format = *FindFormat(target.format, sizeof(Sample));
    ImageWriter<Sample> writer(mosaic, target, format, loops, carver);
    const ChunkRoom<Sample> room = TakeChunkRoom<Sample>(carver);
    if (key.columns == 0 || key.rows == 0) return WriteBlack(mosaic, writer, room);

    ColourRows<Sample> source(mosaic, loops, carver);
    if (key.interpolation == InterpolateNearest) {
        EnlargeRows(mosaic, NearestRows<Sample>(source, loops, carver), writer, room);
    } else if (key.interpolation == InterpolateLinear) {
        LinearRows<Sample> enlarger(source, loops, carver, linearColumns, linearRows);
        EnlargeRows(mosaic, enlarger, writer, room);
    } else {
        CubicRows<Sample> enlarger(source, loops, carver, cubicColumns, cubicRows);
        EnlargeRows(mosaic, enlarger, writer, room);
    }
}

bool BayerEngine::Prepare(const BayerMosaic& mosaic, KernelInterpolation interpolation,
                          std::size_t sampleBytes) {
    const std::uint32_t columns = mosaic.width / 2;
    const std::uint32_t rows = mosaic.height / 2;
    const PositionsKey wanted{static_cast<std::int32_t>(columns), static_cast<std::int32_t>(rows),
                              FitInterpolation(interpolation, columns, rows), sampleBytes};
    const bool isBlack = columns == 0 || rows == 0;
    const std::uint64_t needed =
        MeasureScratch(isBlack ? 0 : mosaic.width, wanted.interpolation, sampleBytes);
    if (scratch.GetBytes() < needed && !scratch.AllocateAhead(needed)) return false;
    if (wanted == key) return true;
    key = {};
    if (!MakePositions(wanted)) return false;
    key = wanted;
    return true;
}

bool BayerEngine::MakePositions(const PositionsKey& wanted) {
    constexpr double Factor = 2.0;
    linearColumns = {};
    linearRows = {};
    cubicColumns = {};
    cubicRows = {};
    if (wanted.interpolation == InterpolateLinear) {
        linearColumns =
            LinearPositions(wanted.columns, 2 * wanted.columns, Factor, wanted.sampleBytes);
        linearRows = LinearPositions(wanted.rows, 2 * wanted.rows, Factor, wanted.sampleBytes);
        return linearColumns.IsMade() && linearRows.IsMade();
    }
    if (wanted.interpolation == InterpolateCubic) {
        cubicColumns = CubicPositions(wanted.columns, 2 * wanted.columns, Factor);
        cubicRows = CubicPositions(wanted.rows, 2 * wanted.rows, Factor);
        return cubicColumns.IsMade() && cubicRows.IsMade();
    }
    return true;
}

}  // namespace ZV
