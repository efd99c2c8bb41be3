#include "imaging/rgb_filter_wheel.h"

#include "imaging/image_formats.h"

namespace ZV {
namespace {

constexpr std::uint64_t SampleBytesMax = 2;

}  // namespace

ZRGBFilterWheel::ZRGBFilterWheel(std::uint16_t newOutputFormat) : outputFormat(newOutputFormat) {
    (void)HAL_SemaphoreCreate(&semaphore);  // Without one every wait fails, and is reported there.
}

ZRGBFilterWheel::~ZRGBFilterWheel() {
    (void)HAL_SemaphoreDestroy(&semaphore);
}

FilterResult ZRGBFilterWheel::Process(ZInImageBufferStruct*, ZOutImageBufferStruct*) {
    return FilterDeclined;
}

FilterResult ZRGBFilterWheel::Init(std::uint32_t width, std::uint32_t height) {
    widthMax = width;
    heightMax = height;
    AllocateBuffers(widthMax, heightMax);
    return FilterDone;
}

FilterResult ZRGBFilterWheel::SetOutputFormat(std::uint32_t format) {
    outputFormat.store(format, std::memory_order_relaxed);
    return FilterDone;
}

void ZRGBFilterWheel::Reset() {
    const bool isHeld = HAL_SemaphoreWait(semaphore) == HALOk;
    isStarted.store(false, std::memory_order_relaxed);
    redCount.store(0, std::memory_order_relaxed);
    greenCount.store(0, std::memory_order_relaxed);
    blueCount.store(0, std::memory_order_relaxed);
    if (isHeld) (void)HAL_SemaphoreSignal(semaphore);
}

void ZRGBFilterWheel::Enable() {
    ZImageFilter::Enable();
    AllocateBuffers(widthMax, heightMax);
}

void ZRGBFilterWheel::Disable() {
    ZImageFilter::Disable();
    Reset();
    FreeBuffers();
}

std::uint32_t ZRGBFilterWheel::GetNeededOutputBufferSize(ZInImageBufferStruct* in) {
    if (!WouldComplete(in->filterColour)) return in->imageSize;
    return GetThreeColourPixelBytes(GetOutputFormat()) * in->imageSize;
}

std::uint32_t ZRGBFilterWheel::GetOutputFormat() const {
    return outputFormat.load(std::memory_order_relaxed);
}

void ZRGBFilterWheel::AllocateBuffers(std::uint32_t width, std::uint32_t height) {
    if (buffersAllocated) return;
    const std::uint64_t planeBytes = std::uint64_t{width} * height * SampleBytesMax;
    for (PixelBuffer* plane : {&redPlane, &greenPlane, &bluePlane}) {
        (void)plane->AllocateAhead(planeBytes);
    }
    buffersAllocated = true;
}

void ZRGBFilterWheel::FreeBuffers() {
    for (PixelBuffer* plane : {&redPlane, &greenPlane, &bluePlane}) plane->Free();
    buffersAllocated = false;
}

bool ZRGBFilterWheel::WouldComplete(std::uint32_t filterColour) const {
    const bool hasRed = GetRedCount() != 0;
    const bool hasGreen = GetGreenCount() != 0;
    const bool hasBlue = GetBlueCount() != 0;
    if (filterColour == PatternRed) return hasGreen && hasBlue;
    if (filterColour == PatternGreen) return hasRed && hasBlue;
    if (filterColour == PatternBlue) return hasRed && hasGreen;
    return false;
}

}  // namespace ZV
