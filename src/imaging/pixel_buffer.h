#pragma once

#include <cstdint>
#include <cstdlib>
#include <memory>

namespace ZV {

/// A block of the C allocator for pixels or scratch, which knows its size. Empty after
/// construction.
class PixelBuffer {
  public:
    /// A block that is made before a frame has shown that its size is real is at most this long, so
    /// that a camera that claims a nonsensical sensor takes no memory.
    static constexpr std::uint64_t AheadBytesMax = std::uint64_t{1} << 30;

    /// Replaces the block by one of `bytes` zeros. False when there is none to be had: the buffer
    /// is empty then. 0 bytes leave it empty and succeed.
    bool Allocate(std::uint64_t bytes);

    /// The same, refused above `AheadBytesMax`.
    bool AllocateAhead(std::uint64_t bytes);

    void Free();

    [[nodiscard]] std::uint8_t* GetData() const { return block.get(); }
    [[nodiscard]] std::uint64_t GetBytes() const { return blockBytes; }

  private:
    struct Releaser {
        void operator()(std::uint8_t* data) const { std::free(data); }
    };

    std::unique_ptr<std::uint8_t, Releaser> block;
    std::uint64_t blockBytes = 0;
};

}  // namespace ZV
