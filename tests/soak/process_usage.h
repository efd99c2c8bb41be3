#pragma once

#include <cstdint>

namespace ZV::Soak {

/// What the process holds at a moment.
struct ProcessUsage {
    std::uint64_t residentBytes = 0;
    std::uint64_t heapBytes = 0;  ///< In use, of the C allocator.
    std::uint64_t threads = 0;
    std::uint64_t handles = 0;  ///< Open files of the process and handles of the simulated driver.
};
ProcessUsage MeasureUsage();

/// Judges whether what a process holds grows: the least of the last minute against the most of the
/// first. What comes and goes in between is no growth.
class GrowthJudge {
  public:
    void Add(const ProcessUsage& usage);
    /// A minute has ended.
    void EndMinute();
    /// True without a second minute.
    [[nodiscard]] bool IsSteady() const;

  private:
    bool isFirst = true, hasLast = false, isNewMinute = true;
    ProcessUsage most;              ///< Of the first minute.
    ProcessUsage least, lastLeast;  ///< Of this minute, and of the last whole one.
};

}  // namespace ZV::Soak
