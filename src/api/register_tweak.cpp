#include "api/register_tweak.h"

namespace ZV {

namespace {

struct TweakRow {
    std::uint32_t selector;
    CameraResult (ZCamera::*apply)(std::uint32_t value);
    std::uint32_t factor;
};

// Kept: only the first is given in thousandths.
constexpr TweakRow TweakRows[] = {
    {1, &ZCamera::SetSubCpAd, 1000}, {2, &ZCamera::SetSubAd, 1},
    {3, &ZCamera::SetResetVhAd, 1},  {4, &ZCamera::SetV1VmAd, 1},
    {5, &ZCamera::SetV2VmAd, 1},     {6, &ZCamera::SetV3VmAd, 1},
    {7, &ZCamera::SetV4VmAd, 1},     {8, &ZCamera::SetMiscCtrlAd, 1},
};

}  // namespace

void ApplyRegisterTweak(ZCamera& camera, std::uint32_t tweak) {
    if (!camera.IsTweekingRegisterSupported()) return;
    const std::uint32_t selector = tweak >> 28;
    const std::uint32_t value = tweak & 0xFFFF;
    for (const TweakRow& row : TweakRows) {
        if (row.selector == selector) (void)(camera.*row.apply)(value * row.factor);
    }
}

}  // namespace ZV
