#pragma once

#include <cstddef>
#include <cstdint>

namespace ZV::Test {

/// Stretches of memory with an unreadable page before and behind each: an access beyond a stretch
/// ends the process where it happens.
class GuardedPages {
  public:
    /// `count` stretches of at least `bytes` bytes.
    GuardedPages(std::size_t count, std::size_t bytes);
    ~GuardedPages();
    GuardedPages(const GuardedPages&) = delete;
    GuardedPages& operator=(const GuardedPages&) = delete;

    /// Whether one made with these numbers would look the same.
    [[nodiscard]] bool IsFor(std::size_t count, std::size_t bytes) const;
    /// The first byte of a stretch, behind an unreadable page.
    [[nodiscard]] std::uint8_t* GetBegin(std::size_t index) const;
    /// The end of a stretch, where an unreadable page begins.
    [[nodiscard]] std::uint8_t* GetEnd(std::size_t index) const;
    /// Bytes from one stretch to the next.
    [[nodiscard]] std::size_t GetDistance() const { return stretchBytes + pageBytes; }

  private:
    [[nodiscard]] std::size_t RoundUp(std::size_t bytes) const {
        return (bytes + pageBytes - 1) / pageBytes * pageBytes;
    }

    std::size_t pageBytes;
    std::size_t stretchBytes;
    std::size_t mappedBytes;
    std::uint8_t* memory;
};

}  // namespace ZV::Test
