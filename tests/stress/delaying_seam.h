#pragma once

#include <cstdint>
#include <string>
#include <vector>

namespace ZV::Test {

/// From here on every lock, signal and wait of the library, those for requests of the driver and
/// for threads included, is now and then preceded or followed by a delay: a yield, or a sleep of up
/// to a quarter of a millisecond, so that rare orders of threads become common. Each thread draws
/// from a generator of its own, made from `seed` and the order in which the threads came; which
/// thread gets which delays is therefore the system's choice. 0 ends it.
void DelaySeam(std::uint64_t seed);

/// Delays since the last DelaySeam that was not its end.
std::uint64_t CountSeamDelays();

/// Functions of the seam that no call has come through since the process began: what is compiled
/// together with its callers is not delayed.
std::vector<std::string> ListSeamCallsNotMet();

}  // namespace ZV::Test
