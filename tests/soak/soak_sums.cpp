#include "soak/soak_sums.h"

#include <array>
#include <filesystem>
#include <fstream>
#include <sstream>
#include <system_error>

namespace ZV::Soak {
namespace {

struct SumRow {
    const char* name;
    std::uint64_t SoakSums::*sum;
};

constexpr std::array Rows{
    SumRow{"seconds", &SoakSums::seconds},
    SumRow{"frames", &SoakSums::frames},
    SumRow{"bytes", &SoakSums::bytes},
    SumRow{"gaps", &SoakSums::gaps},
    SumRow{"missing", &SoakSums::missing},
    SumRow{"damaged", &SoakSums::damaged},
    SumRow{"repeats", &SoakSums::repeats},
    SumRow{"misnumbered", &SoakSums::misnumbered},
    SumRow{"wrongNumbers", &SoakSums::wrongNumbers},
    SumRow{"staleNumbers", &SoakSums::staleNumbers},
    SumRow{"begun", &SoakSums::begun},
    SumRow{"delivered", &SoakSums::delivered},
    SumRow{"heldBack", &SoakSums::heldBack},
    SumRow{"dropped", &SoakSums::dropped},
    SumRow{"refused", &SoakSums::refused},
    SumRow{"bad", &SoakSums::bad},
    SumRow{"cleared", &SoakSums::cleared},
    SumRow{"withoutTaker", &SoakSums::withoutTaker},
    SumRow{"waiting", &SoakSums::waiting},
    SumRow{"unaccounted", &SoakSums::unaccounted},
    SumRow{"changes", &SoakSums::changes},
    SumRow{"changesDropped", &SoakSums::changesDropped},
    SumRow{"restarts", &SoakSums::restarts},
    SumRow{"reopens", &SoakSums::reopens},
    SumRow{"unplugs", &SoakSums::unplugs},
    SumRow{"requestsFailed", &SoakSums::requestsFailed},
    SumRow{"stalls", &SoakSums::stalls},
    SumRow{"failures", &SoakSums::failures},
    SumRow{"grown", &SoakSums::grown},
};

struct UsageRow {
    const char* name;
    std::uint64_t ProcessUsage::*field;
};

constexpr std::array UsageRows{
    UsageRow{"firstResidentBytes", &ProcessUsage::residentBytes},
    UsageRow{"firstHeapBytes", &ProcessUsage::heapBytes},
    UsageRow{"firstThreads", &ProcessUsage::threads},
    UsageRow{"firstHandles", &ProcessUsage::handles},
};

/// Calls `visit` with the name and the value of each sum; of those by code, the ones that are not
/// 0.
template <typename Sums, typename Visit>
void ForEachSum(Sums& sums, const Visit& visit) {
    for (const SumRow& row : Rows) visit(std::string(row.name), sums.*row.sum);
    for (std::size_t code = 0; code < SoakSums::CodeCount; ++code) {
        if (sums.failedWith[code] == 0) continue;
        visit("failedWith" + std::to_string(code), sums.failedWith[code]);
    }
}

template <typename State, typename Visit>
void ForEachValue(State& state, const Visit& visit) {
    ForEachSum(state.sums, visit);
    if (state.cameras == 0) return;
    visit("cameras", state.cameras);
    for (const UsageRow& row : UsageRows) visit(row.name, state.firstMinute.*row.field);
}

/// The value of this name, or null.
std::uint64_t* FindValue(SoakState& state, const std::string& name) {
    if (name == "cameras") return &state.cameras;
    for (const SumRow& row : Rows) {
        if (row.name == name) return &(state.sums.*row.sum);
    }
    for (const UsageRow& row : UsageRows) {
        if (row.name == name) return &(state.firstMinute.*row.field);
    }
    for (std::size_t code = 0; code < SoakSums::CodeCount; ++code) {
        if (name == "failedWith" + std::to_string(code)) return &state.sums.failedWith[code];
    }
    return nullptr;
}

}  // namespace

SoakSums& SoakSums::operator+=(const SoakSums& other) {
    for (const SumRow& row : Rows) this->*row.sum += other.*row.sum;
    for (std::size_t code = 0; code < CodeCount; ++code) failedWith[code] += other.failedWith[code];
    return *this;
}

std::string Describe(const SoakSums& sums) {
    std::ostringstream text;
    ForEachSum(sums, [&](const std::string& name, std::uint64_t sum) {
        text << (text.tellp() == 0 ? "" : ", ") << name << " " << sum;
    });
    return text.str();
}

bool ReadState(const std::string& path, SoakState* state) {
    *state = {};
    std::ifstream file(path);
    if (!file) return !std::filesystem::exists(path);
    std::string name;
    std::uint64_t value = 0;
    while (file >> name >> value) {
        std::uint64_t* const found = FindValue(*state, name);
        if (found == nullptr) return false;
        *found = value;
    }
    return file.eof();
}

bool WriteState(const std::string& path, const SoakState& state) {
    const std::string unfinished = path + ".new";
    {
        std::ofstream file(unfinished);
        ForEachValue(state, [&](const std::string& name, std::uint64_t value) {
            file << name << " " << value << "\n";
        });
        file.close();
        if (!file) return false;
    }
    std::error_code renamed;
    std::filesystem::rename(unfinished, path, renamed);
    return !renamed;
}

}  // namespace ZV::Soak
