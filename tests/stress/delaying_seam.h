#pragma once

#include <cstdint>

namespace ZV::Test {

/// From here on every lock, signal and wait of the library is now and then preceded or followed by
/// a delay: a yield, or a sleep of up to a quarter of a millisecond, so that rare orders of threads
/// become common. Each thread draws from a generator of its own, made from `seed` and the order in
/// which the threads came; the same seed gives each of them the same delays. 0 ends it.
void DelaySeam(std::uint64_t seed);

/// Delays since the last DelaySeam that was not its end.
std::uint64_t CountSeamDelays();

}  // namespace ZV::Test
