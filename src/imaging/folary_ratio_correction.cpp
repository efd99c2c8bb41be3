#include "imaging/folary_ratio_correction.h"

namespace ZV {

ZFolaryRatioCorrection::ZFolaryRatioCorrection(std::uint16_t newOutputFormat)
    : outputFormat(newOutputFormat) {}

ZFolaryRatioCorrection::~ZFolaryRatioCorrection() = default;

FilterResult ZFolaryRatioCorrection::Process(ZInImageBufferStruct*, ZOutImageBufferStruct*) {
    return FilterDeclined;
}

FilterResult ZFolaryRatioCorrection::Init(std::uint32_t, std::uint32_t) {
    return FilterDone;
}

FilterResult ZFolaryRatioCorrection::SetOutputFormat(std::uint32_t format) {
    outputFormat.store(format, std::memory_order_relaxed);
    return FilterDone;
}

}  // namespace ZV
