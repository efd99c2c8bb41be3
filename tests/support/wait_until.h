#pragma once

#include <chrono>
#include <thread>

namespace ZV::Test {

/// Waits until `isTrue` holds, asking every millisecond. False when the deadline passed first.
template <typename Condition>
[[nodiscard]] bool WaitUntil(Condition isTrue,
                             std::chrono::milliseconds deadline = std::chrono::seconds(10)) {
    const auto end = std::chrono::steady_clock::now() + deadline;
    while (!isTrue()) {
        if (std::chrono::steady_clock::now() >= end) return false;
        std::this_thread::sleep_for(std::chrono::milliseconds(1));
    }
    return true;
}

/// Lets other threads and processes come to another point. No test may need it to pass: it spreads
/// the moments at which something happens.
inline void Disturb(std::chrono::microseconds length) {
    std::this_thread::sleep_for(length);
}

}  // namespace ZV::Test
