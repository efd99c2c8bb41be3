#include "soak/process_usage.h"

#include <malloc.h>
#include <unistd.h>

#include <algorithm>
#include <filesystem>
#include <fstream>

#include "simulation/zentara_simulation.h"

namespace ZV::Soak {
namespace {

/// A field may lie so much above the first minute.
struct FieldRow {
    std::uint64_t ProcessUsage::*field;
    std::uint64_t slack;
};

constexpr std::uint64_t Megabyte = 1 << 20;
constexpr FieldRow Fields[] = {
    // What the allocator keeps of memory that was freed fills up slowly.
    {&ProcessUsage::residentBytes, 24 * Megabyte},
    {&ProcessUsage::heapBytes, 2 * Megabyte},  // frames on their way
    {&ProcessUsage::threads, 0},
    {&ProcessUsage::handles, 0},
};

std::uint64_t CountEntries(const char* folder) {
    std::error_code failure;
    std::uint64_t count = 0;
    for (std::filesystem::directory_iterator it(folder, failure), end; !failure && it != end;
         it.increment(failure)) {
        ++count;
    }
    return count;
}

std::uint64_t ReadResidentBytes() {
    std::ifstream file("/proc/self/statm");
    std::uint64_t all = 0, resident = 0;
    file >> all >> resident;
    return resident * static_cast<std::uint64_t>(sysconf(_SC_PAGESIZE));
}

}  // namespace

ProcessUsage MeasureUsage() {
    ZentaraSimulationState state{};
    (void)ZentaraSimulation_GetState(0xFFFFFFFF, &state);  // zeros without a bus
    const struct mallinfo2 heap = mallinfo2();
    ProcessUsage usage;
    usage.residentBytes = ReadResidentBytes();
    usage.heapBytes = heap.uordblks + heap.hblkhd;
    usage.threads = CountEntries("/proc/self/task");
    usage.handles = CountEntries("/proc/self/fd") + state.openHandles;
    return usage;
}

void GrowthJudge::GoOnFrom(const ProcessUsage& firstMinute) {
    most = firstMinute;
    isFirst = false;
}

void GrowthJudge::Add(const ProcessUsage& usage) {
    for (const auto& [field, slack] : Fields) {
        if (isFirst) most.*field = std::max(most.*field, usage.*field);
        least.*field = isNewMinute ? usage.*field : std::min(least.*field, usage.*field);
    }
    isNewMinute = false;
}

void GrowthJudge::EndMinute() {
    hasLast = !isFirst;
    isFirst = false;
    lastLeast = least;
    isNewMinute = true;
}

const ProcessUsage* GrowthJudge::GetFirstMinute() const {
    return isFirst ? nullptr : &most;
}

bool GrowthJudge::IsSteady() const {
    if (!hasLast) return true;
    return std::all_of(std::begin(Fields), std::end(Fields), [this](const FieldRow& row) {
        return lastLeast.*row.field <= most.*row.field + row.slack;
    });
}

}  // namespace ZV::Soak
