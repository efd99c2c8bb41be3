#include "stream_sums.h"

#include <fmt/format.h>

#include <algorithm>
#include <array>
#include <utility>

namespace ZentaraProgram {
namespace {

struct ErrorRow {
    std::uint32_t code;
    const char* name;
};

constexpr std::array ErrorRows{
    ErrorRow{zerrBufferTooSmall, "bufferTooSmall"}, ErrorRow{zerrMissingData, "missingData"},
    ErrorRow{zerrOutOfSync, "outOfSync"},           ErrorRow{zerrFrameIncomplete, "incomplete"},
    ErrorRow{zerrUnplugged, "unplugged"},
};

}  // namespace

StreamSums::StreamSums(std::uint32_t frameNumbers) : numbersPerFrame(std::max(1U, frameNumbers)) {}

void StreamSums::Count(const Zentara_Frame& frame) {
    const auto step = static_cast<std::uint16_t>(frame.frameNumber - lastNumber);
    if (!std::exchange(hasBegun, true)) {
        lastNumber = frame.frameNumber;
    } else {
        CountGap(step);
    }
    ++frames;
    bytes += frame.size;
    if (frame.errorCode == zerrNone) return;
    ++damaged;
    ++errors[frame.errorCode];
}

void StreamSums::CountGap(std::uint32_t step) {
    if (step == 0) {
        ++repeats;
        return;
    }
    const std::uint64_t former = lastNumber;
    lastNumber += step;
    const std::uint32_t lost = (step - 1) / numbersPerFrame;
    if (lost == 0) return;
    ++gaps;
    drops += lost;
    if (missing.size() < MissingMax) missing.push_back({former + 1, lastNumber - 1});
}

void StreamSums::ForgetCounts() {
    frames = bytes = damaged = gaps = drops = files = repeats = 0;
    missing.clear();
    errors.clear();
}

double StreamSums::GetRate() const {
    return seconds > 0 ? static_cast<double>(frames) / seconds : 0;
}

double StreamSums::GetMegabytesPerSecond() const {
    return seconds > 0 ? static_cast<double>(bytes) / seconds / 1e6 : 0;
}

std::string StreamSums::DescribeMissing() const {
    std::string text;
    for (const MissingFrames& run : missing) {
        if (!text.empty()) text += ", ";
        text += run.first == run.last ? fmt::format("{}", run.first)
                                      : fmt::format("{}-{}", run.first, run.last);
    }
    if (gaps > missing.size()) text += fmt::format(" and {} more gaps", gaps - missing.size());
    return text;
}

std::string GetFrameErrorName(std::uint32_t errorCode) {
    const auto* row = std::find_if(ErrorRows.begin(), ErrorRows.end(),
                                   [&](const ErrorRow& error) { return error.code == errorCode; });
    return row != ErrorRows.end() ? row->name : fmt::format("code{}", errorCode);
}

}  // namespace ZentaraProgram
