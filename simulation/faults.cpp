#include "simulation/faults.h"

namespace ZV::Simulation {
namespace {

bool IsRequestFault(const FaultDescription& fault) {
    switch (fault.kind) {
        case FaultKind::FailRequest:
        case FaultKind::AnswerAtOnce:
        case FaultKind::NeverComplete:
        case FaultKind::ShortAnswer:
        case FaultKind::Plug:
            return true;
        case FaultKind::BusReset:
        case FaultKind::Unplug:
            return fault.request != 0 || fault.code != 0;
        default:
            return false;
    }
}

bool IsFrameFault(const FaultDescription& fault) {
    return fault.kind == FaultKind::WrongPsn;
}

bool IsPacketFault(const FaultDescription& fault) {
    return !IsFrameFault(fault) && !IsRequestFault(fault);
}

// Whether event `number` lies in the run of `count` events that begins at `first`; 0 stands for no
// limit in both.
bool IsInRun(std::uint64_t number, std::uint64_t first, std::uint64_t count) {
    if (first == 0) return count == 0 || number <= count;
    return number >= first && (count == 0 || number - first < count);
}

}  // namespace

void FaultPlan::Add(const FaultDescription& fault) {
    entries.push_back({fault});
    if (IsPacketFault(fault)) ++packetFaults;
}

bool FaultPlan::Decide(const FaultDescription& fault) {
    if (fault.probability < 0) return true;
    return std::uniform_real_distribution<double>(0, 1)(random) < fault.probability;
}

std::vector<FaultDescription> FaultPlan::MatchRequest(std::uint32_t code, bool hasAddress,
                                                      std::uint32_t address) {
    std::vector<FaultDescription> matches;
    for (Entry& entry : entries) {
        const FaultDescription& fault = entry.fault;
        if (!IsRequestFault(fault) || (fault.code != 0 && fault.code != code)) continue;
        if (fault.hasAddress && (!hasAddress || fault.address != address)) continue;
        ++entry.seen;
        if (fault.probability < 0 && !IsInRun(entry.seen, fault.request, fault.count)) continue;
        if (Decide(fault)) matches.push_back(fault);
    }
    return matches;
}

std::vector<FaultDescription> FaultPlan::MatchFrame(std::uint64_t frame) {
    std::vector<FaultDescription> matches;
    for (Entry& entry : entries) {
        const FaultDescription& fault = entry.fault;
        if (!IsFrameFault(fault)) continue;
        ++entry.seen;
        const std::uint64_t number = fault.frame != 0 ? frame : entry.seen;
        if (fault.probability < 0 && !IsInRun(number, fault.frame, fault.count)) continue;
        if (Decide(fault)) matches.push_back(fault);
    }
    return matches;
}

std::vector<FaultDescription> FaultPlan::MatchPacket(std::uint64_t frame, std::uint64_t packet) {
    std::vector<FaultDescription> matches;
    if (packetFaults == 0) return matches;
    for (Entry& entry : entries) {
        const FaultDescription& fault = entry.fault;
        if (!IsPacketFault(fault)) continue;
        if (fault.frame != 0 && frame != fault.frame) continue;
        if (fault.hasPacket && packet < fault.packet) continue;
        // With a packet given, `count` packets of each frame from it on; else `count` of all that
        // fit.
        const std::uint64_t number = fault.hasPacket ? packet - fault.packet + 1 : entry.seen + 1;
        if (fault.probability < 0 && !IsInRun(number, 0, fault.count)) continue;
        if (!Decide(fault)) continue;
        ++entry.seen;
        matches.push_back(fault);
    }
    return matches;
}

}  // namespace ZV::Simulation
