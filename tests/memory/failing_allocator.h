#pragma once

#include <cstddef>
#include <cstdint>
#include <thread>

namespace ZV::Test {

/// From here on counts what the library and the test allocate, on all threads, and refuses number
/// `failing`, counted from 1. Threads, mutexes of the system, opened and grown files, loaded
/// modules, shared memory and its mappings count as allocations. Memory that the standard library's
/// own code or the simulation takes is not counted.
void BeginAllocations(std::int64_t failing);

/// Ends the counting. True when the allocation came that was to be refused.
bool EndAllocations();

/// The same without ending the counting.
bool HasRefusedAllocation();

/// Whose allocation was refused since BeginAllocations.
std::thread::id GetRefusedThread();

/// Prints how many countings have ended with a refusal, since it was last called.
void PrintRefusals();

/// How many are left before the one that is to be refused, that one included.
std::int64_t CountAllocationsLeft();

/// Allocations of memory that are not given back yet, of those that count; 0 under a sanitizer,
/// which looks at the end of the process.
std::size_t CountLiveAllocations();

/// Mappings of files that are not unmapped yet.
std::size_t CountLiveMappings();

/// While it lives, what its thread allocates is neither counted nor refused.
class UncountedAllocations {
  public:
    UncountedAllocations();
    ~UncountedAllocations();
    UncountedAllocations(const UncountedAllocations&) = delete;
    UncountedAllocations& operator=(const UncountedAllocations&) = delete;
};

}  // namespace ZV::Test
