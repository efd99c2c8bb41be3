#include "imaging/auto_exposure.h"

namespace ZV {

ZAutoExposure::ZAutoExposure(bool calculate) : calculateValuesOnAllFrames(calculate) {}

ZAutoExposure::~ZAutoExposure() = default;

FilterResult ZAutoExposure::Process(ZInImageBufferStruct*, ZOutImageBufferStruct*) {
    return FilterDeclined;
}

FilterResult ZAutoExposure::Init(std::uint32_t newWidth, std::uint32_t newHeight) {
    x = 0;
    y = 0;
    width = newWidth;
    height = newHeight;
    return FilterDone;
}

FilterResult ZAutoExposure::SetOutputFormat(std::uint32_t) {
    return FilterDone;
}

void ZAutoExposure::SetCalculateValuesOnAllFrames(bool on) {
    calculateValuesOnAllFrames.store(on, std::memory_order_relaxed);
}

}  // namespace ZV
