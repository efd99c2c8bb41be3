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
    /// Judges against the first minute of a former run instead of the first that is added.
    void GoOnFrom(const ProcessUsage& firstMinute);
    void Add(const ProcessUsage& usage);
    /// A minute has ended.
    void EndMinute();
    /// The most of the first minute, or null before its end.
    [[nodiscard]] const ProcessUsage* GetFirstMinute() const;
    /// False before the end of a minute behind the first.
    [[nodiscard]] bool HasJudged() const { return hasLast; }
    /// True while nothing is judged.
    [[nodiscard]] bool IsSteady() const;

  private:
    bool isFirst = true, hasLast = false, isNewMinute = true;
    ProcessUsage most;              ///< Of the first minute.
    ProcessUsage least, lastLeast;  ///< Of this minute, and of the last whole one.
};

}  // namespace ZV::Soak
