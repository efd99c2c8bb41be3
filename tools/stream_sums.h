#pragma once

#include <cstdint>
#include <map>
#include <string>
#include <vector>

#include "zentara/zentara.h"

namespace ZentaraProgram {

/// Numbers under which no frame came, first and last.
struct MissingFrames {
    std::uint64_t first = 0, last = 0;

    bool operator==(const MissingFrames&) const = default;
};

/// What the frames of a stream tell of it, one after the other.
///
/// The camera numbers its frames in 16 bits; here they go on counting beyond 65535. A loss shows
/// between two frames that came: what was lost before the first and behind the last is unknown, and
/// so are whole rounds of the number. A number that jumps is doubted until the next frame, or
/// `Settle`. A step of more than `CloseFrames` frames is believed when the next number lies close
/// behind it; a row of such steps, as of a client that is slower than its camera, when it has
/// `RowMin` of them (two at the end of the stream), each ahead by `AheadMax` at most. Whatever else
/// comes, a wrong number, as a damaged header makes it, moves nothing: its frame counts as
/// `misnumbered`, and as missing the number that none came under. So does a frame between two
/// single losses of more than `CloseFrames`, and a last one behind such a loss. A first number that
/// is wrong shows as a gap, and so does a wrong one that happens to lie close ahead.
class StreamSums {
  public:
    /// Runs of missing frames that are kept; of further ones the count alone.
    static constexpr std::size_t MissingMax = 100000;
    /// Of those, as many as a text names.
    static constexpr std::size_t DescribedMax = 1000;
    /// So many frames may be lost behind a jump that is believed.
    static constexpr std::uint32_t CloseFrames = 64;
    /// Of a row of jumps that is believed: its length, and the longest step.
    static constexpr std::size_t RowMin = 4;
    static constexpr std::uint32_t AheadMax = 8192;

    /// A frame of `numbersPerFrame` exposures uses up as many numbers.
    explicit StreamSums(std::uint32_t numbersPerFrame);

    void Count(const Zentara_Frame& frame);

    /// Ends the doubt about the last number; no frame follows.
    void Settle();

    /// Counts from 0 again; the numbers go on, and so does a doubt.
    void ForgetCounts();

    [[nodiscard]] double GetRate() const;
    [[nodiscard]] double GetMegabytesPerSecond() const;
    /// Of the last frame but those whose number is doubted or wrong; 0 before the first.
    [[nodiscard]] std::uint64_t GetLastNumber() const { return lastNumber; }
    [[nodiscard]] const std::vector<MissingFrames>& GetMissing() const { return missing; }
    /// Gaps whose frames are not among the missing ones that are kept.
    [[nodiscard]] std::uint64_t CountUnnamedGaps() const { return gaps - missing.size(); }
    /// Delivered frames of each error code but 0.
    [[nodiscard]] const std::map<std::uint32_t, std::uint64_t>& GetErrors() const { return errors; }
    /// As "3-5, 9", at its end how many gaps it does not name; empty when no frame is missing.
    [[nodiscard]] std::string DescribeMissing() const;

    std::uint64_t frames = 0, bytes = 0, damaged = 0, gaps = 0, drops = 0, files = 0;
    std::uint64_t repeats = 0;      ///< Frames under the number of the one before.
    std::uint64_t misnumbered = 0;  ///< Frames under a number that cannot be theirs.
    double seconds = 0;

  private:
    void CountNumber(std::uint16_t number);
    [[nodiscard]] bool IsClose(std::uint32_t step) const;
    [[nodiscard]] bool IsRowAhead() const;
    void Judge(std::uint16_t next);
    void Doubt(std::uint16_t number);
    void BelieveRow();
    void Discard(std::size_t suspects);
    void Advance(std::uint32_t step);

    std::uint32_t numbersPerFrame;
    std::uint64_t lastNumber = 0;
    bool hasBegun = false;
    std::vector<std::uint16_t> doubted;  ///< In the order of their frames.
    std::vector<MissingFrames> missing;
    std::map<std::uint32_t, std::uint64_t> errors;
};

/// Name of the code that a damaged frame bears, such as "missingData".
std::string GetFrameErrorName(std::uint32_t errorCode);

}  // namespace ZentaraProgram
