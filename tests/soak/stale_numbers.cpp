#include "soak/stale_numbers.h"

#include <algorithm>

namespace ZV::Soak {
namespace {

/// From the first parsing of a packet to its third, and the failures that it takes.
constexpr std::uint64_t TurnsToThirdParsing = 2;
constexpr std::uint32_t FailuresToThirdParsing = 2;

std::uint16_t ExchangeBytes(std::uint16_t number) {
    return static_cast<std::uint16_t>(number << 8 | number >> 8);
}

}  // namespace

StaleNumbers::StaleNumbers(bool areBlocks, std::uint64_t framesOfTurn)
    : hasBlocks(areBlocks), framesPerTurn(framesOfTurn) {}

void StaleNumbers::Begin(const PacketTroubles& now) {
    looks.assign(1, now);
}

void StaleNumbers::Add(const PacketTroubles& now, std::uint64_t last) {
    looks.push_back(now);
    const std::uint64_t earliest = GoBack(last, TurnsToThirdParsing);
    while (looks.size() > 1 && looks[1].used < earliest) looks.pop_front();
}

bool StaleNumbers::MayBe(std::uint16_t number, bool isDamaged, std::uint64_t last) const {
    if (hasBlocks) return MayBeOfBlocks(number, isDamaged, last);
    return isDamaged && CountSince(last).buffersFailed > 0 && WasUsedSince(GoBack(last, 1), number);
}

bool StaleNumbers::MayBeOfBlocks(std::uint16_t number, bool isDamaged, std::uint64_t last) const {
    const bool hasOddPackets =
        CountSince(GoBack(last, 1)).buffersFailed > 0 || CountSince(last).packetsCorrupted > 0;
    if (isDamaged && hasOddPackets) return true;
    const std::uint64_t sent = GoBack(last, TurnsToThirdParsing);
    return CountSince(sent).buffersFailed >= FailuresToThirdParsing &&
           WasUsedSince(sent, ExchangeBytes(number));
}

std::uint64_t StaleNumbers::GoBack(std::uint64_t last, std::uint64_t turns) const {
    return last - std::min(last, turns * framesPerTurn);
}

/// All since the camera began frame `number`; more where nobody has looked just before.
PacketTroubles StaleNumbers::CountSince(std::uint64_t number) const {
    const auto since = std::partition_point(looks.begin(), looks.end(),
                                            [=](const auto& look) { return look.used < number; });
    const PacketTroubles& before = since == looks.begin() ? *since : *(since - 1);
    const PacketTroubles& now = looks.back();
    return {now.used - before.used, now.buffersFailed - before.buffersFailed,
            now.packetsCorrupted - before.packetsCorrupted};
}

/// From `former` on, of the numbers that are used up by now.
bool StaleNumbers::WasUsedSince(std::uint64_t former, std::uint16_t number) const {
    const std::uint64_t step = static_cast<std::uint16_t>(number - former);
    return step <= looks.back().used - former;
}

}  // namespace ZV::Soak
