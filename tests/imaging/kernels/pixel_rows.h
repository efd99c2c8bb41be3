#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <memory>
#include <random>
#include <string>
#include <vector>

#include "support/guarded_pages.h"

namespace ZV::Testing {

enum class RowPlacement {
    InMemory,          ///< Guard bytes before, between and after.
    RowsEndAtPage,     ///< An unreadable page behind each row.
    RowsBeginAtPage,   ///< An unreadable page before each row.
    ImageEndsAtPage,   ///< No gaps; an unreadable page behind the last row.
    ImageBeginsAtPage  ///< No gaps; an unreadable page before the first row.
};

/// How rows of pixels lie in memory. Padding and offset are for rows in memory alone.
struct RowLayout {
    const char* name;
    RowPlacement placement = RowPlacement::InMemory;
    std::size_t padding = 0;  ///< Bytes from the end of a row to the next one.
    std::size_t offset = 0;   ///< Bytes from a multiple of 64 to the first row.
    bool isBottomUp = false;
};

inline constexpr std::array DownwardLayouts{
    RowLayout{"gapless"},
    RowLayout{"gapless at an odd address", RowPlacement::InMemory, 0, 33},
    RowLayout{"padded", RowPlacement::InMemory, 16, 16},
    RowLayout{"padded by an odd number", RowPlacement::InMemory, 7, 5},
    RowLayout{"rows that end at a page", RowPlacement::RowsEndAtPage},
    RowLayout{"rows that begin at a page", RowPlacement::RowsBeginAtPage},
    RowLayout{"gapless up to a page", RowPlacement::ImageEndsAtPage},
    RowLayout{"gapless from a page", RowPlacement::ImageBeginsAtPage},
};

/// For kernels that do not test row lengths.
inline constexpr RowLayout BottomUpLayout{"bottom up", RowPlacement::InMemory, 9, 3, true};

enum class SampleKind { Random, Extreme, Zero, Top, Alternating, Ramp };

inline constexpr std::array AllSampleKinds{SampleKind::Random,      SampleKind::Extreme,
                                           SampleKind::Zero,        SampleKind::Top,
                                           SampleKind::Alternating, SampleKind::Ramp};

/// Rows of bytes in a layout. Bound to one thread.
class PixelRows {
  public:
    /// Two with the same layout and sizes have the same row length; `skew` moves the offset, so
    /// that they need not be aligned alike.
    PixelRows(const RowLayout& layout, std::size_t rowContent, std::size_t rowCount,
              std::size_t skew = 0);
    ~PixelRows();
    PixelRows(PixelRows&&) = default;

    [[nodiscard]] void* GetStart() const { return start; }
    /// From one row to the next, as kernels take it.
    [[nodiscard]] std::int32_t GetRowBytes() const { return rowBytes; }
    [[nodiscard]] std::uint8_t* GetRow(std::size_t y) const;

    void Fill(SampleKind kind, std::size_t sampleBytes, std::mt19937& random) const;
    /// Both have rows of the same size.
    void CopyRowsFrom(const PixelRows& other) const;

    /// The first sample that differs and the first guard byte that was written, or nothing.
    [[nodiscard]] std::string Compare(const PixelRows& expected, std::size_t sampleBytes) const;

  private:
    void PlaceInMemory(const RowLayout& layout, std::size_t skew);
    void PlaceAtPages(RowPlacement placement);
    [[nodiscard]] std::string CheckGuards() const;

    std::size_t rowContent;
    std::size_t rowCount;
    std::vector<std::uint8_t> memory;
    std::unique_ptr<Test::GuardedPages> pages;
    std::uint8_t* start = nullptr;
    std::int32_t rowBytes = 0;
};

}  // namespace ZV::Testing
