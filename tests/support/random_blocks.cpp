#include "support/random_blocks.h"

#include <array>
#include <cstdlib>

#include "support/settings_words.h"

namespace ZV::Test {
namespace {

constexpr std::uint32_t DefaultSeed = 20240611;
constexpr std::uint32_t SettingsMagic = 0xDEADBEEF;

std::uint32_t ReadSeed() {
    const char* text = std::getenv("ZENTARA_TEST_SEED");
    if (text == nullptr) return DefaultSeed;
    return static_cast<std::uint32_t>(std::strtoul(text, nullptr, 0));
}

}  // namespace

RandomBlocks::RandomBlocks() : seed(ReadSeed()), random(seed) {}

std::string RandomBlocks::DescribeSeed() const {
    return "ZENTARA_TEST_SEED=" + std::to_string(seed);
}

std::uint32_t RandomBlocks::Pick(std::uint32_t below) {
    return static_cast<std::uint32_t>(random() % below);
}

void RandomBlocks::Change(Zentara_Settings& block) {
    for (std::uint32_t i = Pick(12) + 1; i > 0; --i) ChangeOne(block);
}

Zentara_Settings RandomBlocks::MakeNoise(ZentaraHandle handle) {
    Zentara_Settings block;
    block.size = PickWord();
    for (std::uint32_t& word : block.privateWords) word = PickWord();
    if (Pick(2) == 0) SetHandleOf(block, handle);
    block.privateWords[SettingsMagicWord] = SettingsMagic;
    return block;
}

void RandomBlocks::ChangeOne(Zentara_Settings& block) {
    const std::uint32_t kind = Pick(4);
    if (kind == 0) return ChangeSigned(block);
    if (kind == 1) return ChangeWide(block);
    ChangeWord(block);
}

void RandomBlocks::ChangeWord(Zentara_Settings& block) {
    const std::uint32_t key = Pick(46);
    SetWord(block, key, PickValue(key));
}

std::uint32_t RandomBlocks::PickValue(std::uint32_t key) {
    constexpr std::array Speeds{0u, 1u, 2u, 3u, 7u, 8u, 4u, 0xFFFFFFFFu};
    constexpr std::array Modes{1u, 2u, 3u, 4u, 8u, 5u, 0u, 64u};
    if (key >= zprmBinning && key <= zprmVerticalBinning) return Modes[Pick(Modes.size())];
    if (key == zprmReadoutSpeed) return Speeds[Pick(Speeds.size())];
    if (key == zprmImageFormat) return Pick(14);
    if (key >= zprmRoiX && key <= zprmRoiHeight) return Pick(8) == 0 ? PickWord() : Pick(2600);
    if (key == zprmCameraMode) return Pick(3);
    if (key == zprmEMGain) return Pick(1100);
    const bool isPeriod =
        key == zprmMetronaShutterDelay || key == zprmVClockPeriod || key == zprmCloseDelay;
    if (isPeriod) return Pick(8) == 0 ? PickWord() >> 1 : Pick(30000);
    return Pick(10);
}

void RandomBlocks::ChangeSigned(Zentara_Settings& block) {
    const std::uint32_t key = Pick(3);
    const std::array values{static_cast<std::int32_t>(Pick(60'000'000)) - 20'000'000,
                            static_cast<std::int32_t>(Pick(5000)) - 100,
                            static_cast<std::int32_t>(Pick(110)) - 57};
    const bool isAny = key < 2 && Pick(8) == 0;
    SetSigned(block, key, isAny ? static_cast<std::int32_t>(PickWord()) : values[key]);
}

void RandomBlocks::ChangeWide(Zentara_Settings& block) {
    const std::uint64_t any = random() >> Pick(40);
    // The greatest intensifier gains would overflow on their way to the nearest step.
    SetWide(block, Pick(4), any >> 1);
}

}  // namespace ZV::Test
