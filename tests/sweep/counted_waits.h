#pragma once

#include <cstdint>

namespace ZV::Test {

/// Sum of the limits of all limited waits that the calling thread has begun so far, in milliseconds
/// of the wait clock: what they take in the field when none of them is ended by what it waits for.
/// The suite's linker sends the library's question for the length of a wait here.
std::uint64_t GetBegunWaitsMs();

}  // namespace ZV::Test
