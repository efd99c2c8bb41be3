#pragma once

#include <cstdint>

namespace ZV::Test {

/// Lets the `allocation`-th `new` of the calling thread fail, counted from 1.
void FailAllocation(std::uint32_t allocation);

/// From here on every `new` succeeds. How many were left until the one that was to fail; 0 when it
/// has.
[[nodiscard]] std::uint32_t EndFailingAllocation();

}  // namespace ZV::Test
