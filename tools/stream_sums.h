#pragma once

#include <cstdint>
#include <map>
#include <string>
#include <vector>

#include "zentara/zentara.h"

namespace ZentaraProgram {

/// Numbers of frames that did not come, first and last.
struct MissingFrames {
    std::uint64_t first = 0, last = 0;

    bool operator==(const MissingFrames&) const = default;
};

/// What the frames of a stream tell of it, one after the other.
///
/// The camera numbers its frames in 16 bits; here they go on counting beyond 65535. A loss shows
/// between two frames that came: what was lost before the first and behind the last is unknown, and
/// so are whole rounds of the number.
class StreamSums {
  public:
    /// Runs of missing frames that are kept; of further ones the count alone.
    static constexpr std::size_t MissingMax = 1000;

    /// A frame of `numbersPerFrame` exposures uses up as many numbers.
    explicit StreamSums(std::uint32_t numbersPerFrame);

    void Count(const Zentara_Frame& frame);

    /// Counts from 0 again; the numbers go on.
    void ForgetCounts();

    [[nodiscard]] double GetRate() const;
    [[nodiscard]] double GetMegabytesPerSecond() const;
    /// Of the frame that came last; 0 before the first.
    [[nodiscard]] std::uint64_t GetLastNumber() const { return lastNumber; }
    [[nodiscard]] const std::vector<MissingFrames>& GetMissing() const { return missing; }
    /// Delivered frames of each error code but 0.
    [[nodiscard]] const std::map<std::uint32_t, std::uint64_t>& GetErrors() const { return errors; }
    /// As "3-5, 9", with what was not kept at its end; empty when no frame is missing.
    [[nodiscard]] std::string DescribeMissing() const;

    std::uint64_t frames = 0, bytes = 0, damaged = 0, gaps = 0, drops = 0, files = 0;
    std::uint64_t repeats = 0;  ///< Frames under the number of the one before.
    double seconds = 0;

  private:
    void CountGap(std::uint32_t step);

    std::uint32_t numbersPerFrame;
    std::uint64_t lastNumber = 0;
    bool hasBegun = false;
    std::vector<MissingFrames> missing;
    std::map<std::uint32_t, std::uint64_t> errors;
};

/// Name of the code that a damaged frame bears, such as "missingData".
std::string GetFrameErrorName(std::uint32_t errorCode);

}  // namespace ZentaraProgram
