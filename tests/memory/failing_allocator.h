#pragma once

#include <cstdint>

namespace ZV::Test {

/// From here on counts what the library and the test allocate, on all threads, and refuses number
/// `failing`, counted from 1. Memory that the standard library's own code or the simulation takes
/// is not counted.
void BeginAllocations(std::int64_t failing);

/// Ends the counting. True when the allocation came that was to be refused.
bool EndAllocations();

/// The same without ending the counting.
bool HasRefusedAllocation();

}  // namespace ZV::Test
