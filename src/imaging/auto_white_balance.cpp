#include "imaging/auto_white_balance.h"

#include <limits>
#include <span>

namespace ZV {
namespace {

constexpr float StartRedScale = 1.16F;
constexpr float StartGreenScale = 1.0F;
constexpr float StartBlueScale = 1.88F;
constexpr float Lowest = -2147483648.0F;

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

}  // namespace

std::shared_ptr<const ZAutoWhiteBalance::ScaleTable> ZAutoWhiteBalance::ColourScale::GetTable()
    const {
    const std::lock_guard hold(leafMutex);
    return table;
}

void ZAutoWhiteBalance::ColourScale::Set(float newScale) {
    const auto built = std::make_shared<ScaleTable>();
    BuildLevels(newScale, built->levels8);
    BuildLevels(newScale, built->levels16);
    const std::lock_guard hold(leafMutex);
    scale.store(newScale, std::memory_order_relaxed);
    table = built;
}

ZAutoWhiteBalance::ZAutoWhiteBalance(bool calculate)
    : calculateValuesOnAllFrames(calculate),
      red(StartRedScale),
      green(StartGreenScale),
      blue(StartBlueScale) {}

ZAutoWhiteBalance::~ZAutoWhiteBalance() = default;

FilterResult ZAutoWhiteBalance::Process(ZInImageBufferStruct*, ZOutImageBufferStruct*) {
    return FilterDeclined;
}

FilterResult ZAutoWhiteBalance::Init(std::uint32_t, std::uint32_t) {
    return FilterDone;
}

FilterResult ZAutoWhiteBalance::SetOutputFormat(std::uint32_t) {
    return FilterDone;
}

float ZAutoWhiteBalance::GetRedScale() const {
    return red.GetScale();
}

float ZAutoWhiteBalance::GetGreenScale() const {
    return green.GetScale();
}

float ZAutoWhiteBalance::GetBlueScale() const {
    return blue.GetScale();
}

void ZAutoWhiteBalance::SetRedScale(float scale) {
    red.Set(scale);
}

void ZAutoWhiteBalance::SetGreenScale(float scale) {
    green.Set(scale);
}

void ZAutoWhiteBalance::SetBlueScale(float scale) {
    blue.Set(scale);
}

void ZAutoWhiteBalance::SetCalculateValuesOnAllFrames(bool on) {
    calculateValuesOnAllFrames.store(on, std::memory_order_relaxed);
}

}  // namespace ZV
