#include "imaging/image_filter.h"

namespace ZV {

ZImageFilter::ZImageFilter() = default;

ZImageFilter::~ZImageFilter() = default;

void ZImageFilter::Reset() {}

void ZImageFilter::Enable() {
    enabled.store(true, std::memory_order_relaxed);
}

void ZImageFilter::Disable() {
    enabled.store(false, std::memory_order_relaxed);
}

bool ZImageFilter::IsEnabled() {
    return enabled.load(std::memory_order_relaxed);
}

std::uint32_t ZImageFilter::GetNeededOutputBufferSize(ZInImageBufferStruct* in) {
    return in->imageSize;
}

}  // namespace ZV
