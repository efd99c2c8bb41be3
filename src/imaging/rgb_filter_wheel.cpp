#include "imaging/rgb_filter_wheel.h"

#include <algorithm>
#include <cstring>

#include "camera/camera.h"
#include "camera/camera_result.h"
#include "imaging/image_formats.h"

// Threads. The streaming thread collects; a client's thread may drop the set, or let the planes go
// and make them anew. Each of these is one hold of the semaphore: no frame comes between the end of
// a set and that of its planes, or the planes and the flag that lets frames in. The needed size is
// asked for without it: a set that is dropped in between makes the answer too large at worst, and
// no byte is written beyond the buffer that was made by it.

namespace ZV {
namespace {

constexpr std::uint64_t SampleBytesMax = 2;

/// The colours in the order in which the wheel turns, which is that of the planes.
constexpr std::array<std::uint16_t, 3> Turn{PatternRed, PatternGreen, PatternBlue};

/// Place in `Turn`; its size for what is no colour of the wheel.
std::size_t FindPlace(std::uint32_t colour) {
    return static_cast<std::size_t>(std::find(Turn.begin(), Turn.end(), colour) - Turn.begin());
}

/// The semaphore for the length of a block, as far as it can be had.
class WheelHold {
  public:
    explicit WheelHold(HALSemaphore* held)
        : semaphore(held), isHeld(HAL_SemaphoreWait(held) == HALOk) {}
    ~WheelHold() {
        if (isHeld) (void)HAL_SemaphoreSignal(semaphore);
    }
    WheelHold(const WheelHold&) = delete;
    WheelHold& operator=(const WheelHold&) = delete;

  private:
    HALSemaphore* semaphore;
    bool isHeld;
};

std::uint64_t CountPixels(const ZInImageBufferStruct& in) {
    return std::uint64_t{in.width} * in.height;
}

/// Whether that many samples fit; a product would wrap for sizes that are made up.
bool DoSamplesFit(std::uint64_t samples, std::uint32_t sampleBytes, std::uint64_t bytes) {
    return sampleBytes == 0 || samples <= bytes / sampleBytes;
}

// ---- Packing ----

using Planes = std::array<const std::uint8_t*, 4>;  // Red, green, blue, filler.

constexpr std::size_t Red = 0, Green = 1, Blue = 2, Filler = 3;

constexpr std::size_t BlockPixels = 1024;

constexpr std::array<std::uint8_t, BlockPixels> FillerRow = [] {
    std::array<std::uint8_t, BlockPixels> row{};
    for (std::uint8_t& sample : row) sample = 255;
    return row;
}();

/// Channels of a pixel in the order of its bytes.
template <std::size_t... Channels>
void PackBytes(const Planes& planes, std::uint8_t* pixels, std::size_t count) {
    for (std::size_t i = 0; i < count; ++i) ((*pixels++ = planes[Channels][i]), ...);
}

void PackWords(const Planes& planes, std::uint8_t* pixels, std::size_t count) {
    for (std::size_t i = 0; i < 2 * count; i += 2) {
        for (const std::size_t channel : {Red, Green, Blue}) {
            std::memcpy(pixels, planes[channel] + i, 2);
            pixels += 2;
        }
    }
}

struct Layout {
    std::uint32_t format;
    std::uint32_t sampleBytes;  ///< That the planes are read as. 0: they are copied whole.
    std::uint32_t pixelBytes;
    void (*pack)(const Planes& planes, std::uint8_t* pixels, std::size_t count);
};

// Kept: the format alone decides how the planes are read, whatever the depth of the frames.
constexpr std::array Layouts{
    Layout{RGBPlane8, 0, 0, nullptr},
    Layout{RGBPlane16, 0, 0, nullptr},
    Layout{BGR24, 1, 3, PackBytes<Blue, Green, Red>},
    Layout{XRGB32, 1, 4, PackBytes<Filler, Red, Green, Blue>},
    Layout{RGB48, 2, 6, PackWords},
    Layout{BGRX32, 1, 4, PackBytes<Blue, Green, Red, Filler>},
    Layout{RGB24, 1, 3, PackBytes<Red, Green, Blue>},
};

const Layout* FindLayout(std::uint32_t format) {
    for (const Layout& layout : Layouts) {
        if (layout.format == format) return &layout;
    }
    return nullptr;
}

void PackPixels(const Layout& layout, Planes planes, std::uint8_t* pixels, std::uint64_t count) {
    planes[Filler] = FillerRow.data();
    while (count != 0) {
        const auto block = static_cast<std::size_t>(std::min<std::uint64_t>(count, BlockPixels));
        layout.pack(planes, pixels, block);
        for (const std::size_t colour : {Red, Green, Blue}) {
            planes[colour] += block * layout.sampleBytes;
        }
        pixels += block * layout.pixelBytes;
        count -= block;
    }
}

void CopyPlanes(const Planes& planes, std::uint8_t* pixels, std::uint64_t planeBytes) {
    const auto bytes = static_cast<std::size_t>(planeBytes);
    for (const std::size_t colour : {Red, Green, Blue}) {
        std::memcpy(pixels, planes[colour], bytes);
        pixels += bytes;
    }
}

}  // namespace

ZRGBFilterWheel::ZRGBFilterWheel(std::uint16_t newOutputFormat) : outputFormat(newOutputFormat) {
    (void)HAL_SemaphoreCreate(&semaphore);  // Without one every wait fails, and is reported there.
}

ZRGBFilterWheel::~ZRGBFilterWheel() {
    (void)HAL_SemaphoreDestroy(&semaphore);
}

FilterResult ZRGBFilterWheel::Process(ZInImageBufferStruct* in, ZOutImageBufferStruct* out) {
    const HALStatus taken = HAL_SemaphoreWait(semaphore);
    if (taken != HALOk) return ReportHalStatus(taken);
    const FilterResult result = Collect(*in, *out);
    const HALStatus given = HAL_SemaphoreSignal(semaphore);
    if (result == FilterDone && given != HALOk) return ReportHalStatus(given);
    return result;
}

FilterResult ZRGBFilterWheel::Init(std::uint32_t width, std::uint32_t height) {
    const WheelHold hold(semaphore);
    widthMax = width;
    heightMax = height;
    MakePlanes(widthMax, heightMax);
    return FilterDone;
}

FilterResult ZRGBFilterWheel::SetOutputFormat(std::uint32_t format) {
    outputFormat.store(format, std::memory_order_relaxed);
    return FilterDone;
}

void ZRGBFilterWheel::Reset() {
    const WheelHold hold(semaphore);
    DropSet();
}

void ZRGBFilterWheel::Enable() {
    const WheelHold hold(semaphore);
    ZImageFilter::Enable();
    MakePlanes(widthMax, heightMax);
}

void ZRGBFilterWheel::Disable() {
    const WheelHold hold(semaphore);
    ZImageFilter::Disable();
    DropSet();
    FreePlanes();
}

std::uint32_t ZRGBFilterWheel::GetNeededOutputBufferSize(ZInImageBufferStruct* in) {
    const std::size_t place = FindPlace(in->filterColour);
    if (place == Turn.size()) return in->imageSize;
    const bool hasOthers = GetCount((place + 1) % 3) != 0 && GetCount((place + 2) % 3) != 0;
    if (!hasOthers) return in->imageSize;
    return GetThreeColourPixelBytes(GetOutputFormat()) * in->imageSize;
}

bool ZRGBFilterWheel::HasSemaphore() const {
    return IsHALSemaphoreMade(semaphore);
}

std::uint32_t ZRGBFilterWheel::GetOutputFormat() const {
    return outputFormat.load(std::memory_order_relaxed);
}

void ZRGBFilterWheel::AllocateBuffers(std::uint32_t width, std::uint32_t height) {
    const WheelHold hold(semaphore);
    MakePlanes(width, height);
}

void ZRGBFilterWheel::FreeBuffers() {
    const WheelHold hold(semaphore);
    FreePlanes();
}

std::uint16_t ZRGBFilterWheel::GetCount(std::size_t place) const {
    return shots[place].count.load(std::memory_order_relaxed);
}

FilterResult ZRGBFilterWheel::Collect(const ZInImageBufferStruct& in, ZOutImageBufferStruct& out) {
    if (in.camera == nullptr || in.camera->GetImageFormat() != CameraRGBFilter) {
        return FilterDeclined;
    }
    if (lackedPlaneBytes != 0) MakePlanesOf(lackedPlaneBytes);
    if (!IsInTurn(in)) return FilterNothingYet;
    const FilterResult stored = Store(in);
    if (stored != FilterDone) return stored;
    for (std::size_t place = 0; place < Turn.size(); ++place) {
        if (GetCount(place) == 0) return FilterNothingYet;
    }
    const FilterResult packed = Pack(in, out);
    // Kept: a set that could not be packed stays, so each later frame in turn ends the same way
    // until the format changes.
    if (packed == FilterDone) DropSet();
    return packed;
}

bool ZRGBFilterWheel::IsInTurn(const ZInImageBufferStruct& in) {
    if (!IsStarted()) {
        const std::uint16_t startColour = in.camera->GetRGBFilterStartColour();
        if (in.colourPattern != startColour) return false;
        isStarted.store(true, std::memory_order_relaxed);
        nextColour = startColour;
    }
    return in.colourPattern == nextColour;
}

/// Kept: the pattern decides whether it is a frame's turn, the filter colour where it goes. One
/// that is no colour of the wheel stores nothing, and the set waits for it again.
FilterResult ZRGBFilterWheel::Store(const ZInImageBufferStruct& in) {
    const std::size_t place = FindPlace(in.filterColour);
    if (place == Turn.size()) return FilterDone;
    Shot& shot = shots[place];
    const std::uint64_t room = shot.plane.GetBytes();
    if (in.imageSize > room) return FilterNotInitialised;
    if (!DoSamplesFit(CountPixels(in), GetBytesPerSample(in.bitDepth), room)) {
        return FilterNotInitialised;
    }
    if (in.imageSize != 0 && in.data != nullptr) {
        std::memcpy(shot.plane.GetData(), in.data, in.imageSize);
    }
    const auto count = static_cast<std::uint16_t>(GetCount(place) + 1);
    shot.count.store(count, std::memory_order_relaxed);
    nextColour = Turn[(place + 1) % Turn.size()];
    return FilterDone;
}

FilterResult ZRGBFilterWheel::Pack(const ZInImageBufferStruct& in,
                                   ZOutImageBufferStruct& out) const {
    const std::uint32_t format = GetOutputFormat();
    const Layout* const layout = FindLayout(format);
    if (layout == nullptr) return FilterFailed;
    const bool isWhole = layout->pack == nullptr;
    const std::uint64_t pixels = CountPixels(in);
    const std::uint32_t sampleBytes =
        isWhole ? GetBytesPerSample(in.bitDepth) : layout->sampleBytes;
    Planes planes{};
    for (std::size_t place = 0; place < shots.size(); ++place) {
        const PixelBuffer& plane = shots[place].plane;
        if (!DoSamplesFit(pixels, sampleBytes, plane.GetBytes())) return FilterNotInitialised;
        planes[place] = plane.GetData();
    }
    const std::uint64_t planeBytes = pixels * sampleBytes;
    const std::uint64_t written = isWhole ? planeBytes * Turn.size() : pixels * layout->pixelBytes;
    if (out.dataCapacity != 0 && written > out.dataCapacity) return FilterFailed;
    if (written != 0 && isWhole) CopyPlanes(planes, out.data, planeBytes);
    if (written != 0 && !isWhole) PackPixels(*layout, planes, out.data, pixels);
    // Kept: by the format alone, so planes of 16 bits in a format of 8 count for half their bytes.
    out.imageSize = GetThreeColourPixelBytes(format) * in.height * in.width;
    out.imageFormat = format;
    out.width = in.width;
    out.height = in.height;
    return FilterDone;
}

void ZRGBFilterWheel::DropSet() {
    isStarted.store(false, std::memory_order_relaxed);
    for (Shot& shot : shots) shot.count.store(0, std::memory_order_relaxed);
}

void ZRGBFilterWheel::MakePlanes(std::uint32_t width, std::uint32_t height) {
    MakePlanesOf(std::uint64_t{width} * height * SampleBytesMax);
}

void ZRGBFilterWheel::MakePlanesOf(std::uint64_t planeBytes) {
    if (buffersAllocated) return;
    // A frame that came while there were none may have begun a set.
    DropSet();
    if (planeBytes == 0) return;
    buffersAllocated = std::all_of(shots.begin(), shots.end(), [planeBytes](Shot& shot) {
        return shot.plane.AllocateAhead(planeBytes);
    });
    if (buffersAllocated) return;
    FreePlanes();
    lackedPlaneBytes = planeBytes;
}

void ZRGBFilterWheel::FreePlanes() {
    for (Shot& shot : shots) shot.plane.Free();
    buffersAllocated = false;
    lackedPlaneBytes = 0;
}

}  // namespace ZV
