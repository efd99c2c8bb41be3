#pragma once

#include <cstddef>
#include <cstdint>

namespace ZV::Test {

/// A stretch of addresses, zeros at first, that takes memory only where it is written: an image
/// larger than the machine.
class SparseMemory {
  public:
    explicit SparseMemory(std::size_t bytes);
    ~SparseMemory();
    SparseMemory(const SparseMemory&) = delete;
    SparseMemory& operator=(const SparseMemory&) = delete;

    /// False where the system refuses so many addresses; a test is skipped then.
    [[nodiscard]] bool IsMapped() const { return memory != nullptr; }
    [[nodiscard]] std::uint8_t* GetData() const { return memory; }

  private:
    std::size_t mappedBytes;
    std::uint8_t* memory = nullptr;
};

/// One block of memory, zeros at first, that shows again and again, end to end: a large image whose
/// parts lie on each other.
class RepeatedMemory {
  public:
    /// At least `bytes` bytes of addresses. `blockBytes` is a multiple of 64 KB.
    RepeatedMemory(std::size_t blockBytes, std::size_t bytes);
    ~RepeatedMemory();
    RepeatedMemory(const RepeatedMemory&) = delete;
    RepeatedMemory& operator=(const RepeatedMemory&) = delete;

    /// False where the system refuses so many addresses; a test is skipped then.
    [[nodiscard]] bool IsMapped() const { return memory != nullptr; }
    [[nodiscard]] std::uint8_t* GetData() const { return memory; }

  private:
    [[nodiscard]] bool MapBlocks(std::uint8_t* place, std::size_t blockBytes) const;

    std::size_t mappedBytes;
    std::uint8_t* memory = nullptr;
};

}  // namespace ZV::Test
