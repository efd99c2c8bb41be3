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
/// so are whole rounds of the number. A damaged header makes a wrong number; which ones are wrong
/// is read from all that came, in the cheapest way: a number that is not believed costs 1, a loss
/// of up to `ShortLossMax` frames nothing, a longer one `LongLossCost`. A number that goes back is
/// a loss of most of a round. Of equally cheap ways the one with the fewest missing frames is
/// taken.
///
/// So numbers that only go ahead by short losses are all believed. Up to `LongLossCost` wrong ones
/// in a row are `misnumbered`, and missing the numbers that none came under; so are as few right
/// ones between, before or behind long losses. Wrong ones are believed when nothing disproves them,
/// as last ones that lie short losses ahead, or when more than so few go on from each other.
class StreamSums {
  public:
    /// Runs of missing frames that are kept; of further ones the count alone.
    static constexpr std::size_t MissingMax = 100000;
    /// Of those, as many as a text names.
    static constexpr std::size_t DescribedMax = 1000;
    /// A client that is slower than its camera loses fewer frames at a time.
    static constexpr std::uint32_t ShortLossMax = 1024;
    static constexpr std::uint32_t LongLossCost = 3;
    /// A number is in doubt while frames to come could change how it is read, and no longer than
    /// until so many are.
    static constexpr std::size_t DoubtedMax = 64;

    /// A frame of `numbersPerFrame` exposures uses up as many numbers.
    explicit StreamSums(std::uint32_t numbersPerFrame);

    void Count(const Zentara_Frame& frame);

    /// Ends the doubt about the last numbers, as if no frame followed.
    void Settle();

    /// Counts from 0 again; the numbers go on, and those in doubt count later.
    void ForgetCounts();

    [[nodiscard]] double GetRate() const;
    [[nodiscard]] double GetMegabytesPerSecond() const;
    /// The last one that is believed and no longer in doubt; 0 before the first.
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
    std::uint64_t misnumbered = 0;  ///< Frames whose number is not believed.
    double seconds = 0;

  private:
    /// The cheapest way to read the doubted numbers up to one that is believed.
    struct Reading {
        std::uint64_t cost = 0, missing = 0;
        std::size_t first = 0;  ///< Of those believed, counted from 1; 0 when none is.

        [[nodiscard]] bool IsCheaper(const Reading& other) const;
    };

    void CountNumber(std::uint16_t number);
    [[nodiscard]] std::uint32_t GetLost(std::uint32_t step) const;
    [[nodiscard]] Reading GoOn(const Reading& reading, std::size_t from, std::size_t to) const;
    [[nodiscard]] std::vector<Reading> ReadDoubted() const;
    [[nodiscard]] static std::size_t GetCheapestFirst(const std::vector<Reading>& readings);
    [[nodiscard]] static std::size_t GetCertainFirst(const std::vector<Reading>& readings);
    void Believe(std::size_t first);
    void Discard(std::size_t count);
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
