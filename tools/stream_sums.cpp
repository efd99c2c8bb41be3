#include "stream_sums.h"

#include <fmt/format.h>

#include <algorithm>
#include <array>
#include <cstddef>
#include <span>
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

std::uint32_t GetStep(std::uint64_t from, std::uint16_t to) {
    return static_cast<std::uint16_t>(to - from);
}

}  // namespace

StreamSums::StreamSums(std::uint32_t frameNumbers) : numbersPerFrame(std::max(1U, frameNumbers)) {}

void StreamSums::Count(const Zentara_Frame& frame) {
    CountNumber(frame.frameNumber);
    ++frames;
    bytes += frame.size;
    if (frame.errorCode == zerrNone) return;
    ++damaged;
    ++errors[frame.errorCode];
}

void StreamSums::CountNumber(std::uint16_t number) {
    if (!std::exchange(hasBegun, true)) {
        lastNumber = number;
        return;
    }
    if (!doubted.empty() && doubted.back() == number) {
        ++repeats;
        return;
    }
    if (!doubted.empty()) Judge(number);
    const std::uint32_t step = GetStep(lastNumber, number);
    if (step > numbersPerFrame) {
        Doubt(number);
    } else {
        Advance(step);
    }
}

bool StreamSums::IsClose(std::uint32_t step) const {
    return step > 0 && step <= CloseFrames * numbersPerFrame;
}

bool StreamSums::IsRowAhead() const {
    std::uint64_t former = lastNumber;
    return std::all_of(doubted.begin(), doubted.end(), [&](std::uint16_t number) {
        const std::uint32_t step = GetStep(std::exchange(former, number), number);
        return step > 0 && step <= AheadMax * numbersPerFrame;
    });
}

/// A short step is believed unless the next frame belongs before it; a long one, ahead or back,
/// only when the next frame carries on behind it and not behind the frame before it.
void StreamSums::Judge(std::uint16_t next) {
    const std::uint16_t number = doubted.back();
    const std::uint32_t jump = GetStep(lastNumber, number);
    const bool goesOn = IsClose(GetStep(number, next));
    const bool goesOnFromLast = IsClose(GetStep(lastNumber, next));
    if (goesOnFromLast && !(IsClose(jump) && goesOn)) {
        Discard(doubted.size());
    } else if (goesOn || IsClose(jump)) {
        Discard(doubted.size() - 1);
        BelieveRow();
    }
}

void StreamSums::Doubt(std::uint16_t number) {
    doubted.push_back(number);
    if (doubted.size() < RowMin) return;
    if (IsRowAhead()) {
        BelieveRow();
    } else {
        Discard(1);
    }
}

void StreamSums::BelieveRow() {
    for (const std::uint16_t number : doubted) Advance(GetStep(lastNumber, number));
    doubted.clear();
}

void StreamSums::Discard(std::size_t suspects) {
    misnumbered += suspects;
    doubted.erase(doubted.begin(), doubted.begin() + static_cast<std::ptrdiff_t>(suspects));
}

void StreamSums::Advance(std::uint32_t step) {
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
    if (missing.size() >= MissingMax) return;
    missing.push_back({former + 1, former + std::uint64_t{lost} * numbersPerFrame});
}

void StreamSums::Settle() {
    if (doubted.empty()) return;
    const bool isRow = doubted.size() > 1 && IsRowAhead();
    if (isRow || IsClose(GetStep(lastNumber, doubted.back()))) {
        BelieveRow();
    } else {
        Discard(doubted.size());
    }
}

void StreamSums::ForgetCounts() {
    frames = bytes = damaged = gaps = drops = files = repeats = misnumbered = 0;
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
    const std::size_t described = std::min(missing.size(), DescribedMax);
    std::string text;
    for (const MissingFrames& run : std::span(missing).first(described)) {
        if (!text.empty()) text += ", ";
        text += run.first == run.last ? fmt::format("{}", run.first)
                                      : fmt::format("{}-{}", run.first, run.last);
    }
    if (gaps > described) text += fmt::format(" and {} more gaps", gaps - described);
    return text;
}

std::string GetFrameErrorName(std::uint32_t errorCode) {
    const auto* row = std::find_if(ErrorRows.begin(), ErrorRows.end(),
                                   [&](const ErrorRow& error) { return error.code == errorCode; });
    return row != ErrorRows.end() ? row->name : fmt::format("code{}", errorCode);
}

}  // namespace ZentaraProgram
