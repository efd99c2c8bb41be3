#pragma once

#include <algorithm>
#include <chrono>
#include <condition_variable>
#include <cstdint>
#include <mutex>

#include "hal/platform/clock.h"
#include "hal/platform/wait_outcome.h"

namespace ZV {

/// Waits until `isOver()` holds, at most `timeoutMs` milliseconds of the wait clock; 0 looks once,
/// and `WaitForEver` has no limit. Returns what `isOver()` says at the end. `lock` is held on entry
/// and exit.
template <typename Predicate>
bool WaitForLimit(std::condition_variable& condition, std::unique_lock<std::mutex>& lock,
                  std::uint64_t timeoutMs, Predicate isOver) {
    if (timeoutMs == 0) return isOver();
    if (timeoutMs == WaitForEver) {
        condition.wait(lock, isOver);
        return true;
    }
    // A limit of more years than a clock can count must not wrap its deadline into the past.
    constexpr std::uint64_t LongestWaitMs = std::uint64_t{100} * 365 * 24 * 3600 * 1000;
    const std::uint64_t realMs = std::min(GetRealWaitMs(timeoutMs), LongestWaitMs);
    return condition.wait_for(lock, std::chrono::milliseconds(realMs), isOver);
}

}  // namespace ZV
