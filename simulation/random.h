#pragma once

#include <cstdint>

namespace ZV::Simulation {

/// A splitmix64 stream: the same seed gives the same numbers on every machine.
class Random {
  public:
    explicit Random(std::uint64_t seed) : state(seed) {}

    std::uint64_t GetNext() {
        state += 0x9E3779B97F4A7C15;
        return Mix(state);
    }

    /// From 0 to below 1, in steps of 2 to the power -53.
    double GetNextFraction() { return static_cast<double>(GetNext() >> 11) * 0x1p-53; }

    static std::uint64_t Mix(std::uint64_t value) {
        value = (value ^ (value >> 30)) * 0xBF58476D1CE4E5B9;
        value = (value ^ (value >> 27)) * 0x94D049BB133111EB;
        return value ^ (value >> 31);
    }

  private:
    std::uint64_t state;
};

}  // namespace ZV::Simulation
