#include "stream_sums.h"

#include <fmt/format.h>

#include <algorithm>
#include <array>
#include <cstddef>
#include <span>
#include <tuple>
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
    if (!doubted.empty() && doubted.back() == number) {
        ++repeats;
        return;
    }
    doubted.push_back(number);
    while (const std::size_t first = GetCertainFirst(ReadDoubted())) Believe(first);
    if (doubted.size() <= DoubtedMax) return;
    if (const std::size_t first = GetCheapestFirst(ReadDoubted())) {
        Believe(first);
    } else {
        Discard(1);
    }
}

bool StreamSums::Reading::IsCheaper(const Reading& other) const {
    return std::tie(cost, missing) < std::tie(other.cost, other.missing);
}

std::uint32_t StreamSums::GetLost(std::uint32_t step) const {
    return step == 0 ? 0 : (step - 1) / numbersPerFrame;
}

/// The reading of the numbers up to `from` with the one at `to` as its next that is believed.
StreamSums::Reading StreamSums::GoOn(const Reading& reading, std::size_t from,
                                     std::size_t to) const {
    Reading further{reading.cost + (to - from - 1), reading.missing,
                    from == 0 ? to : reading.first};
    if (from == 0 && !hasBegun) return further;
    const std::uint64_t former = from == 0 ? lastNumber : doubted[from - 1];
    const std::uint32_t lost = GetLost(GetStep(former, doubted[to - 1]));
    further.missing += lost;
    if (lost > ShortLossMax) further.cost += LongLossCost;
    return further;
}

/// The reading at 0 believes none of the doubted numbers, that at i the i-th one as its last.
std::vector<StreamSums::Reading> StreamSums::ReadDoubted() const {
    std::vector<Reading> readings(1);
    readings.reserve(doubted.size() + 1);
    for (std::size_t to = 1; to <= doubted.size(); ++to) {
        Reading cheapest = GoOn(readings[to - 1], to - 1, to);
        for (std::size_t from = to - 1; from-- > 0;) {
            const Reading reading = GoOn(readings[from], from, to);
            if (reading.IsCheaper(cheapest)) cheapest = reading;
        }
        readings.push_back(cheapest);
    }
    for (std::size_t i = 0; i < readings.size(); ++i) readings[i].cost += doubted.size() - i;
    return readings;
}

std::size_t StreamSums::GetCheapestFirst(const std::vector<Reading>& readings) {
    return std::min_element(
               readings.begin(), readings.end(),
               [](const Reading& left, const Reading& right) { return left.IsCheaper(right); })
        ->first;
}

/// From the cheapest reading any number can be reached by one long loss, so that a reading which
/// costs more than both is out. 0 while those that are left do not begin alike.
std::size_t StreamSums::GetCertainFirst(const std::vector<Reading>& readings) {
    std::uint64_t costMax = readings.front().cost;
    for (const Reading& reading : readings) costMax = std::min(costMax, reading.cost);
    costMax += LongLossCost;
    const std::size_t first = readings.back().first;
    const bool isCertain = std::all_of(
        readings.begin(), readings.end(),
        [&](const Reading& reading) { return reading.cost > costMax || reading.first == first; });
    return isCertain ? first : 0;
}

void StreamSums::Believe(std::size_t first) {
    Discard(first - 1);
    const std::uint16_t number = doubted.front();
    doubted.erase(doubted.begin());
    if (std::exchange(hasBegun, true)) {
        Advance(GetStep(lastNumber, number));
    } else {
        lastNumber = number;
    }
}

void StreamSums::Discard(std::size_t count) {
    misnumbered += count;
    doubted.erase(doubted.begin(), doubted.begin() + static_cast<std::ptrdiff_t>(count));
}

void StreamSums::Advance(std::uint32_t step) {
    if (step == 0) {
        ++repeats;
        return;
    }
    const std::uint64_t former = lastNumber;
    lastNumber += step;
    const std::uint32_t lost = GetLost(step);
    if (lost == 0) return;
    ++gaps;
    drops += lost;
    if (missing.size() >= MissingMax) return;
    missing.push_back({former + 1, former + std::uint64_t{lost} * numbersPerFrame});
}

void StreamSums::Settle() {
    while (!doubted.empty()) {
        const std::size_t first = GetCheapestFirst(ReadDoubted());
        if (first == 0) {
            Discard(doubted.size());
        } else {
            Believe(first);
        }
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
