#include "simulation/noise.h"

#include <array>
#include <cmath>

#include "simulation/random.h"

namespace ZV::Simulation {
namespace {

constexpr std::size_t DeviationCount = 4096;
constexpr int DeviationBits = 12;
constexpr std::size_t DrawsPerNumber = 5;
constexpr std::uint64_t TableSeed = 0x5EED;

using Deviations = std::array<double, DeviationCount>;

/// Sums of twelve uniform numbers, each with its opposite, brought to variance 1. Of basic
/// arithmetic alone, so that all machines draw the same noise.
Deviations MakeDeviations() {
    Deviations deviations{};
    Random random(TableSeed);
    double squares = 0;
    for (std::size_t index = 0; index < DeviationCount; index += 2) {
        double sum = -6;
        for (int n = 0; n < 12; ++n) sum += random.GetNextFraction();
        deviations[index] = sum;
        deviations[index + 1] = -sum;
        squares += 2 * sum * sum;
    }
    const double scale = std::sqrt(DeviationCount / squares);
    for (double& deviation : deviations) deviation *= scale;
    return deviations;
}

const Deviations& GetDeviations() {
    static const Deviations deviations = MakeDeviations();
    return deviations;
}

}  // namespace

void AddNoise(double* electrons, std::size_t count, double readNoise, std::uint64_t seed,
              std::uint64_t frameIndex, std::uint64_t row) {
    const Deviations& deviations = GetDeviations();
    const double readVariance = readNoise * readNoise;
    Random random(Random::Mix(Random::Mix(Random::Mix(seed) + frameIndex) + row));
    std::uint64_t draws = 0;
    for (std::size_t index = 0; index < count; ++index) {
        draws = index % DrawsPerNumber == 0 ? random.GetNext() : draws >> DeviationBits;
        const double deviation = deviations[draws % DeviationCount];
        electrons[index] += std::sqrt(electrons[index] + readVariance) * deviation;
    }
}

}  // namespace ZV::Simulation
