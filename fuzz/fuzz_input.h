#pragma once

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <span>

namespace ZV::Fuzzing {

/// The bytes of one execution, taken from the front; what is beyond their end reads as 0. Numbers
/// are little-endian, so that a seed can be written by hand.
class FuzzInput {
  public:
    FuzzInput(const std::uint8_t* data, std::size_t size) : rest(data, size) {}

    [[nodiscard]] bool IsEmpty() const { return rest.empty(); }

    template <typename Number>
    Number Take() {
        Number number{};
        const std::span<const std::uint8_t> bytes = TakeBytes(sizeof number);
        if (!bytes.empty()) std::memcpy(&number, bytes.data(), bytes.size());
        return number;
    }
    std::uint8_t TakeByte() { return Take<std::uint8_t>(); }
    std::uint16_t TakeShort() { return Take<std::uint16_t>(); }
    std::uint32_t TakeWord() { return Take<std::uint32_t>(); }
    std::uint64_t TakeWide() { return Take<std::uint64_t>(); }

    /// At most `count` bytes.
    std::span<const std::uint8_t> TakeBytes(std::size_t count) {
        const std::span<const std::uint8_t> taken = rest.first(std::min(count, rest.size()));
        rest = rest.subspan(taken.size());
        return taken;
    }
    std::span<const std::uint8_t> TakeRest() { return TakeBytes(rest.size()); }

  private:
    std::span<const std::uint8_t> rest;
};

/// Ends the execution as a find unless `holds`.
inline void Require(bool holds) {
    if (!holds) std::abort();
}

}  // namespace ZV::Fuzzing
