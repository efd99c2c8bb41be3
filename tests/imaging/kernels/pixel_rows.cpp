#include "imaging/kernels/pixel_rows.h"

#include <algorithm>
#include <cstring>
#include <iterator>

namespace ZV::Testing {
namespace {

constexpr std::size_t Alignment = 64;
constexpr std::size_t GuardBytes = 96;

constexpr std::uint8_t GuardAt(std::size_t index) {
    return static_cast<std::uint8_t>(index * 37 + 11);
}

std::uint32_t LoadSample(const std::uint8_t* row, std::size_t index, std::size_t sampleBytes) {
    if (sampleBytes == 1) return row[index];
    std::uint16_t sample;
    std::memcpy(&sample, row + 2 * index, 2);
    return sample;
}

void StoreSample(std::uint8_t* row, std::size_t index, std::size_t sampleBytes,
                 std::uint32_t value) {
    const auto sample = static_cast<std::uint16_t>(value);
    if (sampleBytes == 1)
        row[index] = static_cast<std::uint8_t>(value);
    else
        std::memcpy(row + 2 * index, &sample, 2);
}

std::uint32_t MakeSample(SampleKind kind, std::size_t index, std::uint32_t top,
                         std::mt19937& random) {
    const std::uint32_t extremes[] = {0, 1, top / 2, top / 2 + 1, top - 1, top};
    switch (kind) {
        case SampleKind::Random:
            return static_cast<std::uint32_t>(random()) & top;
        case SampleKind::Extreme:
            return extremes[random() % std::size(extremes)];
        case SampleKind::Zero:
            return 0;
        case SampleKind::Top:
            return top;
        case SampleKind::Alternating:
            return index % 2 == 0 ? 0 : top;
        case SampleKind::Ramp:
            return static_cast<std::uint32_t>(index * (top == 255 ? 3 : 701)) & top;
    }
    return 0;
}

/// Pages that a test before has given back: mapping them takes longer than most tests' work.
std::vector<std::unique_ptr<Test::GuardedPages>>& GetSparePages() {
    static std::vector<std::unique_ptr<Test::GuardedPages>> spare;
    return spare;
}

std::unique_ptr<Test::GuardedPages> TakePages(std::size_t count, std::size_t bytes) {
    auto& spare = GetSparePages();
    const auto found = std::find_if(spare.begin(), spare.end(),
                                    [&](const auto& pages) { return pages->IsFor(count, bytes); });
    if (found == spare.end()) return std::make_unique<Test::GuardedPages>(count, bytes);
    std::unique_ptr<Test::GuardedPages> pages = std::move(*found);
    spare.erase(found);
    return pages;
}

}  // namespace

PixelRows::PixelRows(const RowLayout& layout, std::size_t content, std::size_t count,
                     std::size_t skew)
    : rowContent(content), rowCount(count) {
    if (layout.placement == RowPlacement::InMemory)
        PlaceInMemory(layout, skew);
    else
        PlaceAtPages(layout.placement);
}

PixelRows::~PixelRows() {
    if (pages != nullptr) GetSparePages().push_back(std::move(pages));
}

void PixelRows::PlaceInMemory(const RowLayout& layout, std::size_t skew) {
    const std::size_t distance = rowContent + layout.padding;
    const std::size_t offset = (layout.offset + skew) % Alignment;
    memory.resize(Alignment + GuardBytes + offset + distance * rowCount + GuardBytes);
    for (std::size_t i = 0; i < memory.size(); ++i) memory[i] = GuardAt(i);

    const auto address = reinterpret_cast<std::uintptr_t>(memory.data()) + GuardBytes;
    const std::size_t toAligned = (Alignment - address % Alignment) % Alignment;
    start = memory.data() + GuardBytes + toAligned + offset;
    rowBytes = static_cast<std::int32_t>(distance);
    if (!layout.isBottomUp) return;
    start += (rowCount - 1) * distance;
    rowBytes = -rowBytes;
}

void PixelRows::PlaceAtPages(RowPlacement placement) {
    const bool isGapless =
        placement == RowPlacement::ImageEndsAtPage || placement == RowPlacement::ImageBeginsAtPage;
    const bool isAtEnd =
        placement == RowPlacement::RowsEndAtPage || placement == RowPlacement::ImageEndsAtPage;
    const std::size_t stretchBytes = isGapless ? rowContent * rowCount : rowContent;
    const std::size_t stretchCount = isGapless ? 1 : (rowCount + 31) / 32 * 32;
    pages = TakePages(stretchCount, stretchBytes);
    start = isAtEnd ? pages->GetEnd(0) - stretchBytes : pages->GetBegin(0);
    rowBytes = static_cast<std::int32_t>(isGapless ? rowContent : pages->GetDistance());
}

std::uint8_t* PixelRows::GetRow(std::size_t y) const {
    return start + static_cast<std::int64_t>(y) * rowBytes;
}

void PixelRows::Fill(SampleKind kind, std::size_t sampleBytes, std::mt19937& random) const {
    const std::uint32_t top = sampleBytes == 1 ? 255 : 65535;
    for (std::size_t y = 0; y < rowCount; ++y)
        for (std::size_t x = 0; x < rowContent / sampleBytes; ++x)
            StoreSample(GetRow(y), x, sampleBytes, MakeSample(kind, x + 5 * y, top, random));
}

void PixelRows::CopyRowsFrom(const PixelRows& other) const {
    for (std::size_t y = 0; y < rowCount; ++y) std::memcpy(GetRow(y), other.GetRow(y), rowContent);
}

std::string PixelRows::Compare(const PixelRows& expected, std::size_t sampleBytes) const {
    for (std::size_t y = 0; y < rowCount; ++y)
        for (std::size_t x = 0; x < rowContent / sampleBytes; ++x) {
            const std::uint32_t wanted = LoadSample(expected.GetRow(y), x, sampleBytes);
            const std::uint32_t found = LoadSample(GetRow(y), x, sampleBytes);
            if (wanted == found) continue;
            return "sample " + std::to_string(x) + " of row " + std::to_string(y) + " is " +
                   std::to_string(found) + " instead of " + std::to_string(wanted);
        }
    return CheckGuards();
}

std::string PixelRows::CheckGuards() const {
    const std::uint8_t* const lowest = rowBytes < 0 ? GetRow(rowCount - 1) : start;
    const std::int64_t distance = rowBytes < 0 ? -std::int64_t{rowBytes} : rowBytes;
    for (std::size_t i = 0; i < memory.size(); ++i) {
        if (memory[i] == GuardAt(i)) continue;
        const std::int64_t place = memory.data() + i - lowest;
        const bool isInside = place >= 0 &&
                              place / distance < static_cast<std::int64_t>(rowCount) &&
                              place % distance < static_cast<std::int64_t>(rowContent);
        if (isInside) continue;
        return "a guard byte " + std::to_string(place) + " bytes from the first row was written";
    }
    return {};
}

}  // namespace ZV::Testing
