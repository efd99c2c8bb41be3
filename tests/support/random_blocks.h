#pragma once

#include <cstdint>
#include <random>
#include <string>

#include "zentara/zentara.h"

namespace ZV::Test {

/// Settings blocks by chance. The seed is always the same, or what `ZENTARA_TEST_SEED` says.
class RandomBlocks {
  public:
    RandomBlocks();

    /// For the message of a failure.
    std::string DescribeSeed() const;

    /// Changes some settings of a block to values that a client might choose, or nearly. Words that
    /// would be out of any camera's reach are rare, the register tweak is left out.
    void Change(Zentara_Settings& block);
    /// 260 bytes of anything with the right magic number and, half the time, this handle.
    Zentara_Settings MakeNoise(ZentaraHandle handle);

    std::uint32_t Pick(std::uint32_t below);

  private:
    std::uint32_t PickWord() { return static_cast<std::uint32_t>(random()); }
    std::uint32_t PickValue(std::uint32_t key);
    void ChangeOne(Zentara_Settings& block);
    void ChangeWord(Zentara_Settings& block);
    void ChangeSigned(Zentara_Settings& block);
    void ChangeWide(Zentara_Settings& block);

    std::uint32_t seed;
    std::mt19937_64 random;
};

}  // namespace ZV::Test
