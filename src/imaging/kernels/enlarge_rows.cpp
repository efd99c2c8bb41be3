#include "imaging/kernels/enlarge_rows.h"

#include <algorithm>
#include <utility>

namespace ZV {

namespace {

/// Keeps a position that repeated addition left just below a whole number on that number.
constexpr double Slack = 1e-7;
constexpr std::int32_t WeightOne = 16384;
constexpr std::size_t GroupOutputs = 8;
constexpr std::size_t GroupBytes = 16;
constexpr std::int32_t GroupCubicSamples = 8;
constexpr std::size_t RunOutputs = 32;
constexpr std::size_t RunBytes = 64;
constexpr std::int32_t LastRunPlace = 63;

double CalculateStep(std::int32_t sourceLength, double factor) {
    const double length = sourceLength * factor;
    return length > 1.0 ? (sourceLength - 1) / (length - 1.0) : 0.0;
}

/// The sample at or before the position, at most the last one: the rounding of the step can carry
/// the end of a long row beyond what an index holds.
std::int32_t FindIndex(double position, std::int32_t last) {
    return static_cast<std::int32_t>(std::min(position + Slack, static_cast<double>(last)));
}

LinearPosition PlaceLinear(double position, std::int32_t last) {
    const std::int32_t index = FindIndex(position, last);
    if (index >= last) return {last - 1, WeightOne};
    return {index, static_cast<std::int32_t>((position - index) * double{WeightOne} + Slack)};
}

CubicWeights CalculateCubicWeights(float t) {
    const float half = t * (1.0F + t) * 0.5F;
    return {1.0F + t, half, (t - 1.0F) * half / 3.0F};
}

/// The four samples move inward at the edges, so that they lie inside.
CubicPosition PlaceCubic(double position, std::int32_t last) {
    const std::int32_t index = FindIndex(position, last);
    if (index >= last) return {last - 3, CalculateCubicWeights(2.0F)};
    std::int32_t base = index;
    if (index == 0) {
        base = 1;
    } else if (index == last - 1) {
        base = index - 1;
    }
    return {base - 1, CalculateCubicWeights(static_cast<float>(position - base))};
}

/// Every output's position; the rounding of the repeated addition is part of the result.
template <typename Position>
void PlaceOutputs(std::int32_t sourceLength, std::int32_t outputLength, double factor,
                  Position (*place)(double, std::int32_t), Position* positions) {
    const double step = CalculateStep(sourceLength, factor);
    double position = 0.0;
    for (std::int32_t output = 0; output < outputLength; ++output, position += step) {
        positions[output] = place(position, sourceLength - 1);
    }
}

/// The first sample that the group of eight outputs from `first` on reads at once, `groupSamples`
/// long and inside the row; below 0 where its outputs need more. `reach` is what one output needs.
template <typename Position>
std::int32_t FindGroupBase(const Position* first, std::int32_t sourceLength,
                           std::int32_t groupSamples, std::int32_t reach) {
    const std::int32_t base = std::min(first[0].index, sourceLength - groupSamples);
    const std::int32_t end = first[GroupOutputs - 1].index + reach;
    return end - base > groupSamples ? -1 : base;
}

/// Fills the bases from the first group on, up to one that needs more than a group reads.
template <typename Position>
std::size_t FillBases(const Position* positions, std::size_t count, std::int32_t sourceLength,
                      std::int32_t groupSamples, std::int32_t reach, std::int32_t* bases) {
    const std::size_t groups = count / GroupOutputs;
    for (std::size_t group = 0; group < groups; ++group) {
        const Position* const first = positions + group * GroupOutputs;
        bases[group] = FindGroupBase(first, sourceLength, groupSamples, reach);
        if (bases[group] < 0) return group;
    }
    return groups;
}

/// Byte positions of a sample and the one behind it.
std::uint8_t* WritePair(std::int32_t sample, std::size_t sampleBytes, std::uint8_t* pair) {
    const std::size_t first = static_cast<std::size_t>(sample) * sampleBytes;
    for (std::size_t byte = 0; byte < 2 * sampleBytes; ++byte) {
        *pair++ = static_cast<std::uint8_t>(first + byte);
    }
    return pair;
}

/// The first run's place in memory that has room for one run more.
LinearRun* AlignRuns(std::uint8_t* memory) {
    const auto address = reinterpret_cast<std::uintptr_t>(memory);
    const std::size_t skipped = (~address + 1) % alignof(LinearRun);
    return reinterpret_cast<LinearRun*>(memory + skipped);
}

void WriteRunSlot(const LinearPosition& position, std::int32_t place, std::size_t sampleBytes,
                  std::size_t slot, LinearRun* run) {
    const bool isNextSample = position.weight == WeightOne;
    const std::int32_t first = isNextSample ? place + 1 : place;
    const std::int32_t second = sampleBytes == 1 ? std::min(first + 1, LastRunPlace) : 0;
    run->places[2 * slot] = static_cast<std::uint8_t>(first);
    run->places[2 * slot + 1] = static_cast<std::uint8_t>(second);
    run->doubledWeights[slot] = static_cast<std::int16_t>(isNextSample ? 0 : 2 * position.weight);
}

}  // namespace

LinearPositions::LinearPositions(std::int32_t sourceLength, std::int32_t outputLength,
                                 double factor, std::size_t sampleBytes) {
    const auto count = static_cast<std::size_t>(outputLength);
    auto made = MakeScratch<LinearPosition>(count);
    bases = MakeScratch<std::int32_t>(count / GroupOutputs + 1);
    pairs = MakeScratch<std::uint8_t>(count * 2 * sampleBytes);
    weights = MakeScratch<std::int16_t>(count * 2);
    if (!made || !bases || !pairs || !weights) return;
    PlaceOutputs(sourceLength, outputLength, factor, PlaceLinear, made.get());
    const std::size_t groups =
        FillBases(made.get(), count, sourceLength,
                  static_cast<std::int32_t>(GroupBytes / sampleBytes), 2, bases.get());
    std::uint8_t* pair = pairs.get();
    for (std::size_t output = 0; output < groups * GroupOutputs; ++output) {
        const LinearPosition& position = made[output];
        pair = WritePair(position.index - bases[output / GroupOutputs], sampleBytes, pair);
        weights[2 * output] = static_cast<std::int16_t>(WeightOne - position.weight);
        weights[2 * output + 1] = static_cast<std::int16_t>(position.weight);
    }
    positions = std::move(made);
    plan.positions = positions.get();
    plan.count = count;
    plan.groupCount = groups;
    plan.bases = bases.get();
    plan.pairs = pairs.get();
    plan.weights = weights.get();
    if (!MakeRuns(sourceLength, sampleBytes)) positions = nullptr;
}

bool LinearPositions::MakeRuns(std::int32_t sourceLength, std::size_t sampleBytes) {
    const std::size_t count = (plan.count + RunOutputs - 1) / RunOutputs;
    const auto reach = static_cast<std::int32_t>(RunBytes / sampleBytes) - 2;
    runBases = MakeScratch<std::int32_t>(count);
    runMemory = MakeScratch<std::uint8_t>((count + 1) * sizeof(LinearRun));
    if (!runBases || !runMemory) return false;
    LinearRun* const runs = AlignRuns(runMemory.get());
    plan.sourceCount = static_cast<std::size_t>(sourceLength);
    plan.runBases = runBases.get();
    plan.runs = runs;
    for (std::size_t slot = 0; slot < count * RunOutputs; ++slot) {
        const LinearPosition& position = positions[std::min(slot, plan.count - 1)];
        std::int32_t& base = runBases[slot / RunOutputs];
        if (slot % RunOutputs == 0) base = position.index;
        if (position.index - base > reach) return true;
        WriteRunSlot(position, position.index - base, sampleBytes, slot % RunOutputs,
                     &runs[slot / RunOutputs]);
    }
    plan.runCount = count;
    return true;
}

CubicPositions::CubicPositions(std::int32_t sourceLength, std::int32_t outputLength,
                               double factor) {
    const auto count = static_cast<std::size_t>(outputLength);
    auto made = MakeScratch<CubicPosition>(count);
    bases = MakeScratch<std::int32_t>(count / GroupOutputs + 1);
    places = MakeScratch<std::int32_t>(count);
    weights = MakeScratch<float>(3 * count);
    if (!made || !bases || !places || !weights) return;
    PlaceOutputs(sourceLength, outputLength, factor, PlaceCubic, made.get());
    const std::size_t groups =
        FillBases(made.get(), count, sourceLength, GroupCubicSamples, 4, bases.get());
    float* const first = weights.get();
    float* const second = first + count;
    float* const third = second + count;
    for (std::size_t output = 0; output < groups * GroupOutputs; ++output) {
        const CubicPosition& position = made[output];
        places[output] = position.index - bases[output / GroupOutputs];
        first[output] = position.weights.first;
        second[output] = position.weights.second;
        third[output] = position.weights.third;
    }
    positions = std::move(made);
    plan = {positions.get(), count, groups, bases.get(), places.get(), first, second, third};
}

}  // namespace ZV
