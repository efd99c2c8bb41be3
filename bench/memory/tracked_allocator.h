#pragma once

#include <cstdint>

namespace ZV::Bench {

/// What the library and the benchmark hold and have taken since the start. Memory that the standard
/// library's own code or the simulation takes is not counted.
struct Allocations {
    std::uint64_t heldBytes;
    std::uint64_t count;
};
[[nodiscard]] Allocations GetAllocations();

}  // namespace ZV::Bench
