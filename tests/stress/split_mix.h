#pragma once

#include <cstdint>

namespace ZV::Test {

/// The splitmix generator of 64 bits: cheap to make, so that each thing may have one of its own.
class SplitMix {
  public:
    explicit SplitMix(std::uint64_t seed = 0) : state(seed) {}

    std::uint64_t Draw() {
        std::uint64_t z = state += 0x9E3779B97F4A7C15U;
        z = (z ^ (z >> 30)) * 0xBF58476D1CE4E5B9U;
        z = (z ^ (z >> 27)) * 0x94D049BB133111EBU;
        return z ^ (z >> 31);
    }
    /// From 0 to `count` - 1.
    std::uint32_t DrawBelow(std::uint32_t count) {
        return static_cast<std::uint32_t>(Draw() % count);
    }
    bool DrawOneOf(std::uint32_t count) { return DrawBelow(count) == 0; }

  private:
    std::uint64_t state;
};

}  // namespace ZV::Test
