#pragma once

#include <cstddef>
#include <cstdint>

namespace ZV::Simulation {

/// Adds photon and read noise to a row of electrons: a normal deviation of variance electrons plus
/// `readNoise` squared, drawn from a fixed table. The same for the same seed, frame and row.
void AddNoise(double* electrons, std::size_t count, double readNoise, std::uint64_t seed,
              std::uint64_t frameIndex, std::uint64_t row);

}  // namespace ZV::Simulation
