// Frames are balanced on the frame thread while a client's thread may set scales: a frame takes the
// set of tables once; a setter builds another one beside it and exchanges the pointer.

#include "imaging/auto_white_balance.h"

#include <algorithm>
#include <bit>
#include <cstring>
#include <limits>
#include <optional>
#include <span>

#include "camera/camera.h"
#include "imaging/colour_layout.h"
#include "imaging/image_formats.h"
#include "imaging/kernels/kernel_selection.h"
#include "imaging/measuring_image.h"

namespace ZV {
namespace {

constexpr std::uint32_t IndexRed = 0;
constexpr std::uint32_t IndexGreen = 1;
constexpr std::uint32_t IndexBlue = 2;
constexpr std::uint32_t ColourCount = 3;
constexpr std::uint32_t PixelSamplesMax = 4;

constexpr float StartRedScale = 1.16F;
constexpr float StartGreenScale = 1.0F;
constexpr float StartBlueScale = 1.88F;
constexpr float Lowest = -2147483648.0F;

/// Means from the first up to but not including the second are in band.
constexpr std::uint32_t BandBegin8 = 80;
constexpr std::uint32_t BandEnd8 = 200;
constexpr std::uint32_t BandBegin16 = 20560;
constexpr std::uint32_t BandEnd16 = 51401;

void BuildLevels(float scale, std::span<std::int32_t> levels) {
    const auto top = static_cast<float>(levels.size() - 1);
    for (std::size_t level = 0; level < levels.size(); ++level) {
        const float product = static_cast<float>(level) * scale;
        // A comparison with something that is no number is false, which makes it the top level.
        const float cut = product < top ? product : top;
        levels[level] = cut > Lowest ? static_cast<std::int32_t>(cut)
                                     : std::numeric_limits<std::int32_t>::min();
    }
}

/// What a lookup by these levels does to each sample. The top sample value stays as it is, also by
/// a scale below 1.
template <typename Sample>
void BuildLookup(std::span<const std::int32_t> levels, Sample* lookup) {
    constexpr std::int32_t Top = std::numeric_limits<Sample>::max();
    for (std::size_t level = 0; level < levels.size(); ++level) {
        lookup[level] = static_cast<Sample>(std::clamp(levels[level], 0, Top));
    }
    lookup[levels.size() - 1] = static_cast<Sample>(Top);
}

std::shared_ptr<const ZAutoWhiteBalance::ScaleTable> MakeScaleTable(float scale) {
    const auto table = std::make_shared<ZAutoWhiteBalance::ScaleTable>();
    BuildLevels(scale, table->levels8);
    BuildLevels(scale, table->levels16);
    return table;
}

/// Tells numbers that are none apart, too.
bool HasSameBits(float one, float other) {
    return std::bit_cast<std::uint32_t>(one) == std::bit_cast<std::uint32_t>(other);
}

bool IsEmpty(std::uint32_t width, std::uint32_t height) {
    // Sizes of the kernels are signed.
    constexpr std::uint32_t SideMax = std::numeric_limits<std::int32_t>::max();
    return width == 0 || height == 0 || width > SideMax || height > SideMax;
}

/// Rows of pixels. Those that follow each other are one.
struct PixelRows {
    std::size_t count;
    std::size_t apart;  ///< In bytes.
    std::size_t pixels;
};

/// None where rows would overlap, or lie further apart than the row lengths of kernels tell.
std::optional<PixelRows> LayOutRows(std::uint32_t width, std::uint32_t height, std::uint32_t step,
                                    std::uint32_t pixelSamples, std::uint32_t sampleBytes) {
    constexpr std::uint64_t RowBytesMax = std::numeric_limits<std::int32_t>::max();
    const std::uint64_t rowBytes = std::uint64_t{step} * width * sampleBytes;
    if (step < pixelSamples || rowBytes > RowBytesMax) return std::nullopt;
    if (step == pixelSamples) return PixelRows{1, 0, std::size_t{width} * height};
    return PixelRows{height, static_cast<std::size_t>(rowBytes), width};
}

/// The order of the colours in pixels of bytes. Null where the format has no such pixels.
const ColourLayout* FindPixelLayout(std::uint32_t format, std::uint32_t pixelSamples) {
    const ColourLayout* const layout = FindColourLayout(format);
    if (layout == nullptr || layout->sampleBytes != 1) return nullptr;
    return layout->step == pixelSamples ? layout : nullptr;
}

using Planes = std::array<std::uint8_t*, ColourCount>;

bool IsOneMissing(const Planes& planes) {
    return std::find(planes.begin(), planes.end(), nullptr) != planes.end();
}

bool IsWithin(std::uint32_t value, std::uint32_t begin, std::uint32_t end) {
    return value >= begin && value < end;
}

/// Whether the pixels of the input stand at the output's data.
bool AreHeld(const ZInImageBufferStruct& in, const ZOutImageBufferStruct& out,
             const ColourLayout& layout) {
    if (out.data == nullptr || IsEmpty(in.width, in.height)) return false;
    const std::uint64_t pixels = std::uint64_t{in.width} * in.height;
    std::uint64_t held = in.imageSize;
    if (out.dataCapacity != 0) held = std::min(held, out.dataCapacity);
    return pixels <= held / layout.GetPixelBytes();
}

}  // namespace

/// The tables of all colours. Never changes once it is in force.
struct ZAutoWhiteBalance::TableSet {
    std::shared_ptr<const ScaleTable> levels[ColourCount];
    std::uint8_t lookup8[ColourCount * Levels8];
    std::uint16_t lookup16[ColourCount * Levels16 + 1];

    void Take(std::uint32_t colour, std::shared_ptr<const ScaleTable> table) {
        BuildLookup(std::span(table->levels8), lookup8 + colour * Levels8);
        BuildLookup(std::span(table->levels16), lookup16 + colour * Levels16);
        levels[colour] = std::move(table);
    }
    const std::uint8_t* Get8(std::uint32_t colour) const { return lookup8 + colour * Levels8; }
    const std::uint16_t* Get16(std::uint32_t colour) const { return lookup16 + colour * Levels16; }

    /// The 8-bit tables of a pixel's samples, one behind the other. Without a layout no sample
    /// changes.
    void Order8(const ColourLayout* layout, std::span<std::uint8_t> ordered) const {
        for (std::size_t level = 0; level < ordered.size(); ++level) {
            ordered[level] = static_cast<std::uint8_t>(level);  // What the padding keeps.
        }
        if (layout == nullptr) return;
        const std::uint8_t positions[ColourCount] = {layout->red, layout->green, layout->blue};
        for (std::uint32_t colour = 0; colour < ColourCount; ++colour) {
            std::memcpy(ordered.data() + positions[colour] * Levels8, Get8(colour), Levels8);
        }
    }
};

ZAutoWhiteBalance::ZAutoWhiteBalance(bool calculate)
    : calculateValuesOnAllFrames(calculate),
      red{IndexRed, StartRedScale},
      green{IndexGreen, StartGreenScale},
      blue{IndexBlue, StartBlueScale} {
    const auto made = std::make_shared<TableSet>();
    for (const Colour* colour : {&red, &green, &blue}) {
        made->Take(colour->index, MakeScaleTable(colour->scale));
    }
    tables = made;
}

ZAutoWhiteBalance::~ZAutoWhiteBalance() = default;

// ---- Applying ----

FilterResult ZAutoWhiteBalance::Process(ZInImageBufferStruct* in, ZOutImageBufferStruct* out) {
    if (in->camera == nullptr || in->camera->GetImageFormat() == CameraMono) return FilterDeclined;
    // Kept: the output's format decides here, the input's from here on.
    if (!IsFilterThreeColour(out->imageFormat)) return FilterDeclined;
    const std::uint32_t sampleBytes = in->bitDepth == 8 ? 1 : 2;
    const ColourLayout* const layout = FindColourLayout(in->imageFormat);
    if (layout == nullptr || layout->sampleBytes != sampleBytes) return FilterUnusableFormat;
    if (!AreHeld(*in, *out, *layout)) return FilterFailed;

    const std::uint32_t pixels = in->width * in->height;
    const std::size_t apart = (layout->IsPlanar() ? std::size_t{pixels} : 1) * sampleBytes;
    const auto run =
        sampleBytes == 1 ? &ZAutoWhiteBalance::GreyWorld : &ZAutoWhiteBalance::GreyWorld_16Bit;
    const FilterResult result =
        (this->*run)(out->data, out->data + layout->red * apart, out->data + layout->green * apart,
                     out->data + layout->blue * apart, in->width, in->height, pixels, layout->step,
                     in->imageFormat);
    if (result != FilterDone) return result;
    out->imageSize = in->imageSize;
    out->imageFormat = in->imageFormat;
    out->width = in->width;
    out->height = in->height;
    return FilterDone;
}

FilterResult ZAutoWhiteBalance::GreyWorld(std::uint8_t* image, std::uint8_t* redSamples,
                                          std::uint8_t* greenSamples, std::uint8_t* blueSamples,
                                          std::uint32_t width, std::uint32_t height, std::uint32_t,
                                          std::uint32_t step, std::uint32_t format) const {
    if (IsEmpty(width, height)) return FilterFailed;
    const RowKernels& kernels = GetRowKernels();
    const std::shared_ptr<const TableSet> set = GetTables();
    const std::size_t pixels = std::size_t{width} * height;
    if (step == 1) {
        const Planes planes{redSamples, greenSamples, blueSamples};
        if (IsOneMissing(planes)) return FilterFailed;
        for (std::uint32_t colour = 0; colour < ColourCount; ++colour) {
            kernels.lookup8x1(set->Get8(colour), planes[colour], pixels);
        }
        return FilterDone;
    }
    const std::uint32_t pixelSamples = step == ColourCount ? ColourCount : PixelSamplesMax;
    const auto rows = LayOutRows(width, height, step, pixelSamples, 1);
    if (image == nullptr || !rows) return FilterFailed;
    std::uint8_t ordered[PixelSamplesMax * Levels8];
    set->Order8(FindPixelLayout(format, pixelSamples), std::span(ordered, pixelSamples * Levels8));
    const auto lookup = pixelSamples == ColourCount ? kernels.lookup8x3 : kernels.lookup8x4;
    for (std::size_t row = 0; row < rows->count; ++row) {
        lookup(ordered, image + row * rows->apart, rows->pixels);
    }
    return FilterDone;
}

FilterResult ZAutoWhiteBalance::GreyWorld_16Bit(std::uint8_t* image, std::uint8_t* redSamples,
                                                std::uint8_t* greenSamples,
                                                std::uint8_t* blueSamples, std::uint32_t width,
                                                std::uint32_t height, std::uint32_t,
                                                std::uint32_t step, std::uint32_t) const {
    if (IsEmpty(width, height)) return FilterFailed;
    const RowKernels& kernels = GetRowKernels();
    const std::shared_ptr<const TableSet> set = GetTables();
    const std::size_t pixels = std::size_t{width} * height;
    if (step == 1) {
        const Planes planes{redSamples, greenSamples, blueSamples};
        if (IsOneMissing(planes)) return FilterFailed;
        for (std::uint32_t colour = 0; colour < ColourCount; ++colour) {
            kernels.lookup16x1(set->Get16(colour), reinterpret_cast<Word*>(planes[colour]), pixels);
        }
        return FilterDone;
    }
    const auto rows = LayOutRows(width, height, step, ColourCount, sizeof(Word));
    if (image == nullptr || !rows) return FilterFailed;
    for (std::size_t row = 0; row < rows->count; ++row) {
        auto* const first = reinterpret_cast<Word*>(image + row * rows->apart);
        kernels.lookup16x3(set->lookup16, first, rows->pixels);
    }
    return FilterDone;
}

FilterResult ZAutoWhiteBalance::Init(std::uint32_t, std::uint32_t) {
    return FilterDone;
}

FilterResult ZAutoWhiteBalance::SetOutputFormat(std::uint32_t) {
    return FilterDone;
}

// ---- Measuring ----

FilterResult ZAutoWhiteBalance::Preprocess(std::uint32_t x, std::uint32_t y, std::uint32_t width,
                                           std::uint32_t height, ZCamera* camera) {
    if (camera == nullptr) return FilterFailed;
    MeasuredRegion region{x, y, width, height};
    for (std::uint32_t pass = 0; pass < PassesMax; ++pass) {
        MeasuringImage image(*camera);
        const FilterResult result = RunPass(image, &region, *camera);
        if (result != FilterDone) return result;
        if (AreMeansInBand(image.Get().GetBitDepth())) break;
    }
    return FilterDone;
}

FilterResult ZAutoWhiteBalance::RunPass(MeasuringImage& image, MeasuredRegion* region,
                                        ZCamera& camera) {
    FilterResult result = image.Grab();
    if (result == FilterDone) result = image.Interpolate();
    if (result != FilterDone) return result;
    image.CutRegion(region);
    ColourValues means{GetRedMean(), GetGreenMean(), GetBlueMean()};
    result = MeasureColourMeans(image.Describe(), *region, &means);
    if (result != FilterDone) return result;
    redMean.store(means.red, std::memory_order_relaxed);
    greenMean.store(means.green, std::memory_order_relaxed);
    blueMean.store(means.blue, std::memory_order_relaxed);
    ScaleToGreen(means);
    if (camera.GetImageFormat() == CameraRGBFilter) BalanceExposures(camera);
    return FilterDone;
}

// A mean of 0 gives an infinite scale or one that is no number; the tables take either.
void ZAutoWhiteBalance::ScaleToGreen(const ColourValues& means) {
    const std::uint64_t sum = std::uint64_t{means.red} + means.green + means.blue;
    const float average = static_cast<float>(sum) / 3.0F;
    const float redShare = average / static_cast<float>(means.red);
    const float greenShare = average / static_cast<float>(means.green);
    const float blueShare = average / static_cast<float>(means.blue);
    const float inverse = 1.0F / greenShare;
    SetScales(redShare * inverse, 1.0F, blueShare * inverse);
}

void ZAutoWhiteBalance::BalanceExposures(ZCamera& camera) const {
    const auto multiply = [](float scale, std::uint64_t exposure) {
        return TruncateToNanoseconds(static_cast<double>(scale) * static_cast<double>(exposure));
    };
    (void)camera.SetRGBFilterRedExposure(multiply(GetRedScale(), camera.GetRGBFilterRedExposure()));
    (void)camera.SetExposure(multiply(GetGreenScale(), camera.GetExposure()));
    (void)camera.SetRGBFilterBlueExposure(
        multiply(GetBlueScale(), camera.GetRGBFilterBlueExposure()));
    (void)camera.UpdateSettingsOnCamera();  // Kept: a trouble shows when the next image is taken.
}

bool ZAutoWhiteBalance::AreMeansInBand(std::uint32_t bitDepth) const {
    const bool isDeep = bitDepth != 8;
    const std::uint32_t begin = isDeep ? BandBegin16 : BandBegin8;
    const std::uint32_t end = isDeep ? BandEnd16 : BandEnd8;
    return IsWithin(GetRedMean(), begin, end) && IsWithin(GetGreenMean(), begin, end) &&
           IsWithin(GetBlueMean(), begin, end);
}

// ---- Scales and tables ----

float ZAutoWhiteBalance::GetRedScale() const {
    return red.scale.load(std::memory_order_relaxed);
}

float ZAutoWhiteBalance::GetGreenScale() const {
    return green.scale.load(std::memory_order_relaxed);
}

float ZAutoWhiteBalance::GetBlueScale() const {
    return blue.scale.load(std::memory_order_relaxed);
}

void ZAutoWhiteBalance::SetRedScale(float scale) {
    const Change change{&red, scale};
    Exchange({&change, 1});
}

void ZAutoWhiteBalance::SetGreenScale(float scale) {
    const Change change{&green, scale};
    Exchange({&change, 1});
}

void ZAutoWhiteBalance::SetBlueScale(float scale) {
    const Change change{&blue, scale};
    Exchange({&change, 1});
}

void ZAutoWhiteBalance::SetScales(float redScale, float greenScale, float blueScale) {
    const Change changes[] = {{&red, redScale}, {&green, greenScale}, {&blue, blueScale}};
    Exchange(changes);
}

void ZAutoWhiteBalance::Exchange(std::span<const Change> changes) {
    const std::lock_guard setting(setterMutex);
    std::shared_ptr<TableSet> made;
    for (const Change& change : changes) {
        const float present = change.colour->scale.load(std::memory_order_relaxed);
        if (HasSameBits(present, change.scale)) continue;
        if (made == nullptr) made = std::make_shared<TableSet>(*GetTables());
        made->Take(change.colour->index, MakeScaleTable(change.scale));
    }
    if (made == nullptr) return;
    std::shared_ptr<const TableSet> set = made;
    const std::lock_guard hold(leafMutex);
    for (const Change& change : changes) {
        change.colour->scale.store(change.scale, std::memory_order_relaxed);
    }
    tables.swap(set);
}

std::shared_ptr<const ZAutoWhiteBalance::TableSet> ZAutoWhiteBalance::GetTables() const {
    const std::lock_guard hold(leafMutex);
    return tables;
}

std::shared_ptr<const ZAutoWhiteBalance::ScaleTable> ZAutoWhiteBalance::GetRedTable() const {
    return GetTables()->levels[IndexRed];
}

std::shared_ptr<const ZAutoWhiteBalance::ScaleTable> ZAutoWhiteBalance::GetGreenTable() const {
    return GetTables()->levels[IndexGreen];
}

std::shared_ptr<const ZAutoWhiteBalance::ScaleTable> ZAutoWhiteBalance::GetBlueTable() const {
    return GetTables()->levels[IndexBlue];
}

void ZAutoWhiteBalance::SetCalculateValuesOnAllFrames(bool on) {
    calculateValuesOnAllFrames.store(on, std::memory_order_relaxed);
}

}  // namespace ZV
