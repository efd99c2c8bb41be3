#include "support/ratio_judge.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cstddef>

namespace ZV::Test {
namespace {

using Samples = std::vector<std::uint32_t>;

/// A frame as a judge sees it: every access is checked.
struct Judged {
    Samples samples;
    int width;
    int height;

    std::uint32_t& At(int row, int column) {
        EXPECT_TRUE(row >= 0 && row < height && column >= 0 && column < width)
            << row << ", " << column << " of " << width << " x " << height;
        return samples.at(static_cast<std::size_t>(row) * static_cast<std::size_t>(width) +
                          static_cast<std::size_t>(column));
    }
};

enum class From { Top, Bottom };         ///< What a row of the tables counts from.
enum class Place { First, Each, Last };  ///< Columns 0 and 1; c and c + 1; ce and ce + 1.
enum class Rule { Copy, Third, Half };

/// Bottom rows are negative distances from h. Columns count from the place's own.
struct Term {
    std::uint32_t weight;
    int row;
    int column;
};

struct Target {
    Place place;
    int column;
    Rule rule;
    std::vector<Term> terms;
};

struct BorderRow {
    From from;
    int row;
    std::vector<Target> targets;
};

struct Borders {
    BorderRow top, beforeLast, last;
};

using enum Place;
using enum Rule;

const Borders GreenFirst = {{From::Top,
                             1,
                             {{First, 0, Copy, {{1, 3, 0}}},
                              {First, 1, Third, {{1, 3, 1}, {1, 0, 0}, {1, 0, 2}}},
                              {Each, 0, Copy, {{1, 3, 0}}},
                              {Each, 1, Third, {{1, 3, 1}, {1, 0, 0}, {1, 0, 2}}},
                              {Last, 0, Copy, {{1, 3, 0}}},
                              {Last, 1, Third, {{1, 3, 1}, {2, 0, 0}}}}},
                            {From::Bottom,
                             -2,
                             {{First, 0, Third, {{2, -1, 1}, {1, -4, 2}}},
                              {First, 1, Copy, {{1, -4, 1}}},
                              {Each, 0, Third, {{1, -4, 0}, {1, -1, -1}, {1, -1, 1}}},
                              {Each, 1, Copy, {{1, -4, 1}}},
                              {Last, 0, Third, {{1, -4, 0}, {2, -1, -1}}},
                              {Last, 1, Copy, {{1, -4, 1}}}}},
                            {From::Bottom,
                             -1,
                             {{First, 0, Copy, {{1, -3, 0}}},
                              {First, 1, Half, {{1, -2, 0}, {1, -2, 2}}},
                              {Each, 0, Copy, {{1, -3, 0}}},
                              {Each, 1, Half, {{1, -2, 0}, {1, -2, 2}}},
                              {Last, 0, Copy, {{1, -3, 0}}},
                              {Last, 1, Copy, {{1, -2, 0}}}}}};

const Borders GreenSecond = {{From::Top,
                              1,
                              {{First, 0, Third, {{2, 0, 1}, {1, 3, 0}}},
                               {First, 1, Copy, {{1, 3, 1}}},
                               {Each, 0, Third, {{1, 0, -1}, {1, 0, 1}, {1, 3, 0}}},
                               {Each, 1, Copy, {{1, 3, 1}}},
                               {Last, 0, Third, {{1, 3, 0}, {2, 0, -1}}},
                               {Last, 1, Copy, {{1, 3, 1}}}}},
                             {From::Bottom,
                              -2,
                              {{First, 0, Copy, {{1, -4, 0}}},
                               {First, 1, Third, {{1, -4, 3}, {2, -1, 2}}},
                               {Each, 0, Copy, {{1, -4, 0}}},
                               {Each, 1, Third, {{1, -4, 1}, {1, -1, 0}, {1, -1, 2}}},
                               {Last, 0, Copy, {{1, -4, 0}}},
                               {Last, 1, Third, {{1, -4, 1}, {2, -1, 0}}}}},
                             {From::Bottom,
                              -1,
                              {{First, 0, Copy, {{1, -2, 1}}},
                               {First, 1, Copy, {{1, -3, 1}}},
                               {Each, 0, Half, {{1, -2, -1}, {1, -2, 1}}},
                               {Each, 1, Copy, {{1, -3, 1}}},
                               {Last, 0, Copy, {{1, -2, -1}}},
                               {Last, 1, Copy, {{1, -3, 1}}}}}};

std::uint32_t TakeThird(std::uint32_t sum) {
    return static_cast<std::uint32_t>((std::uint64_t{sum} * 0x55555556U) >> 32);
}

class Judge {
  public:
    Judge(const Samples& samples, int width, int height, std::uint32_t pattern)
        : frame{samples, width, height},
          run((width + (width & 1) - 4) / 2),
          lastEven(2 + 2 * run),
          isGreenFirst(pattern == 1 || pattern == 2 || pattern == 6 || pattern == 7) {}

    Samples Fill() {
        if (frame.width < 5 || frame.height < 6) return frame.samples;
        for (const int start : {2, 3}) {
            for (int i = 0; i < (frame.height - 4 + 3) / 4; ++i) {
                FillRow(2 + 4 * i, start, (start == 2) != isGreenFirst);
            }
        }
        for (const int start : {2, 3}) {
            for (int i = 0; i < (frame.height - 4) / 4; ++i) {
                FillRow(5 + 4 * i, start, (start == 2) == isGreenFirst);
            }
        }
        const Borders& borders = isGreenFirst ? GreenFirst : GreenSecond;
        Finish(borders.top);
        Finish(frame.height % 4 == 0 ? borders.beforeLast : borders.last);
        return frame.samples;
    }

  private:
    void FillRow(int row, int start, bool isVertical) {
        const bool isBelow = row % 4 == 2;
        const int near = isBelow ? row + 1 : row - 1;
        const int far = isBelow ? row - 2 : row + 2;
        const bool isWithoutRightEdge = frame.width % 2 == 1 && start == 3;
        const int pieces = run + (isWithoutRightEdge ? 1 : 2);
        for (int piece = 0; piece < pieces; ++piece) {
            const int c = start - 2 + 2 * piece;
            std::uint32_t sum = 2;
            if (isVertical) {
                sum += isBelow ? 2 * frame.At(row - 2, c) + frame.At(row + 2, c)
                               : frame.At(row - 2, c) + 2 * frame.At(row + 2, c);
            } else if (piece == 0) {
                sum += frame.At(far, c) + 2 * frame.At(near, c + 1);
            } else if (piece <= run) {
                sum += frame.At(near, c - 1) + frame.At(near, c + 1) + frame.At(far, c);
            } else {
                sum += frame.At(far, c) + 2 * frame.At(near, c - 1);
            }
            frame.At(row, c) = TakeThird(sum);
        }
    }

    void Finish(const BorderRow& row) {
        for (const Target& target : row.targets) {
            if (target.place == First) Finish(row, target, 0);
            if (target.place == Last && !(target.column == 1 && frame.width % 2 == 1)) {
                Finish(row, target, lastEven);
            }
            if (target.place != Each) continue;
            for (int c = 2; c <= lastEven - 2; c += 2) Finish(row, target, c);
        }
    }

    void Finish(const BorderRow& row, const Target& target, int c) {
        const int base = row.from == From::Top ? 0 : frame.height;
        std::uint32_t sum = target.rule == Third ? 2 : target.rule == Half ? 1 : 0;
        for (const Term& term : target.terms) {
            sum += term.weight * frame.At(base + term.row, c + term.column);
        }
        if (target.rule == Third) sum = TakeThird(sum);
        if (target.rule == Half) sum >>= 1;
        frame.At(base + row.row, c + target.column) = sum;
    }

    Judged frame;
    int run, lastEven;
    bool isGreenFirst;
};

}  // namespace

std::vector<std::uint32_t> JudgeZoomFill(const std::vector<std::uint32_t>& samples,
                                         std::uint32_t width, std::uint32_t height,
                                         std::uint32_t pattern) {
    return Judge(samples, static_cast<int>(width), static_cast<int>(height), pattern).Fill();
}

std::vector<std::uint32_t> JudgeZoomSpread(const std::vector<std::uint32_t>& samples,
                                           std::uint32_t width, std::uint32_t other) {
    Samples spread(2 * samples.size(), other);
    for (std::size_t i = 0; i < samples.size(); ++i) {
        const std::size_t row = i / width;
        const std::size_t target = row % 2 == 0 ? 2 * row : 2 * row + 1;
        spread[target * width + i % width] = samples[i];
    }
    return spread;
}

std::vector<std::uint32_t> JudgeReduction(const std::vector<std::uint32_t>& samples,
                                          std::uint32_t width, std::uint32_t factor) {
    const std::size_t height = width == 0 ? 0 : samples.size() / width;
    const std::size_t reducedWidth = (width - width % (2 * factor)) / factor;
    Samples reduced;
    for (std::size_t row = 0; row < height; ++row) {
        for (std::size_t column = 0; column < reducedWidth; ++column) {
            const std::size_t first = row * width + column / 2 * 2 * factor + column % 2;
            std::uint32_t sum = 0;
            for (std::size_t n = 0; n < factor; ++n) sum += samples[first + 2 * n];
            reduced.push_back(factor == 2 ? sum >> 1 : factor == 3 ? sum / 3 : sum >> 2);
        }
    }
    return reduced;
}

}  // namespace ZV::Test
