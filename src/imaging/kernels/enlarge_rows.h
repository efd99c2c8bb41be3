#pragma once

#include <cstddef>
#include <cstdint>

#include "imaging/kernels/row_kernels.h"
#include "imaging/kernels/scratch.h"

namespace ZV {

/// Positions of an enlarging in one direction, worked out in double precision by adding the step up
/// once per output sample, in the shapes that the row loops read. `sampleBytes` (1 or 2) says what
/// the linear plan's groups index. Without memory `IsMade` is false.
class LinearPositions {
  public:
    LinearPositions() = default;
    LinearPositions(std::int32_t sourceLength, std::int32_t outputLength, double factor,
                    std::size_t sampleBytes);
    [[nodiscard]] bool IsMade() const { return positions != nullptr; }
    /// One entry per output sample; sample `index` + 1 lies inside the source.
    [[nodiscard]] const LinearPosition& operator[](std::size_t output) const {
        return positions[output];
    }
    [[nodiscard]] const LinearPlan& GetPlan() const { return plan; }

  private:
    Scratch<LinearPosition> positions;
    Scratch<std::int32_t> bases;
    Scratch<std::uint8_t> pairs;
    Scratch<std::int16_t> weights;
    Scratch<std::int32_t> runBases;
    Scratch<std::uint8_t> runMemory;
    LinearPlan plan;

    [[nodiscard]] bool MakeRuns(std::int32_t sourceLength, std::size_t sampleBytes);
};

class CubicPositions {
  public:
    CubicPositions() = default;
    CubicPositions(std::int32_t sourceLength, std::int32_t outputLength, double factor);
    [[nodiscard]] bool IsMade() const { return positions != nullptr; }
    /// One entry per output sample; the four samples from `index` lie inside the source.
    [[nodiscard]] const CubicPosition& operator[](std::size_t output) const {
        return positions[output];
    }
    [[nodiscard]] const CubicPlan& GetPlan() const { return plan; }

  private:
    Scratch<CubicPosition> positions;
    Scratch<std::int32_t> bases;
    Scratch<std::int32_t> places;
    Scratch<float> weights;
    CubicPlan plan;
};

}  // namespace ZV
