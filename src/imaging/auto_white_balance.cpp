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

void BuildTable(float scale, ZAutoWhiteBalance::ScaleTable& table) {
    table.scale.store(scale, std::memory_order_relaxed);
    BuildLevels(scale, table.levels8);
    BuildLevels(scale, table.levels16);
}

}  // namespace

ZAutoWhiteBalance::ZAutoWhiteBalance(bool calculate) : calculateValuesOnAllFrames(calculate) {
    BuildTable(StartRedScale, red);
    BuildTable(StartGreenScale, green);
    BuildTable(StartBlueScale, blue);
}

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
    return red.scale.load(std::memory_order_relaxed);
}

float ZAutoWhiteBalance::GetGreenScale() const {
    return green.scale.load(std::memory_order_relaxed);
}

float ZAutoWhiteBalance::GetBlueScale() const {
    return blue.scale.load(std::memory_order_relaxed);
}

void ZAutoWhiteBalance::SetRedScale(float scale) {
    BuildTable(scale, red);
}

void ZAutoWhiteBalance::SetGreenScale(float scale) {
    BuildTable(scale, green);
}

void ZAutoWhiteBalance::SetBlueScale(float scale) {
    BuildTable(scale, blue);
}

void ZAutoWhiteBalance::SetCalculateValuesOnAllFrames(bool on) {
    calculateValuesOnAllFrames.store(on, std::memory_order_relaxed);
}

}  // namespace ZV
