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
    SumRow{"seconds", &SoakSums::seconds},   SumRow{"frames", &SoakSums::frames},
    SumRow{"bytes", &SoakSums::bytes},       SumRow{"gaps", &SoakSums::gaps},
    SumRow{"missing", &SoakSums::missing},   SumRow{"damaged", &SoakSums::damaged},
    SumRow{"repeats", &SoakSums::repeats},   SumRow{"misnumbered", &SoakSums::misnumbered},
    SumRow{"begun", &SoakSums::begun},       SumRow{"dropped", &SoakSums::dropped},
    SumRow{"refused", &SoakSums::refused},   SumRow{"bad", &SoakSums::bad},
    SumRow{"cleared", &SoakSums::cleared},   SumRow{"withoutTaker", &SoakSums::withoutTaker},
    SumRow{"waiting", &SoakSums::waiting},   SumRow{"unaccounted", &SoakSums::unaccounted},
    SumRow{"changes", &SoakSums::changes},   SumRow{"changesDropped", &SoakSums::changesDropped},
    SumRow{"restarts", &SoakSums::restarts}, SumRow{"reopens", &SoakSums::reopens},
    SumRow{"unplugs", &SoakSums::unplugs},   SumRow{"failures", &SoakSums::failures},
};

const SumRow* FindRow(const std::string& name) {
    for (const SumRow& row : Rows) {
        if (row.name == name) return &row;
    }
    return nullptr;
}

}  // namespace

SoakSums& SoakSums::operator+=(const SoakSums& other) {
    for (const SumRow& row : Rows) this->*row.sum += other.*row.sum;
    return *this;
}

std::string Describe(const SoakSums& sums) {
    std::ostringstream text;
    for (const SumRow& row : Rows) {
        text << (&row == Rows.data() ? "" : ", ") << row.name << " " << sums.*row.sum;
    }
    return text.str();
}

bool ReadState(const std::string& path, SoakSums* sums) {
    *sums = {};
    std::ifstream file(path);
    if (!file) return !std::filesystem::exists(path);
    std::string name;
    std::uint64_t value = 0;
    while (file >> name >> value) {
        const SumRow* row = FindRow(name);
        if (row == nullptr) return false;
        sums->*row->sum = value;
    }
    return file.eof();
}

bool WriteState(const std::string& path, const SoakSums& sums) {
    const std::string unfinished = path + ".new";
    {
        std::ofstream file(unfinished);
        for (const SumRow& row : Rows) file << row.name << " " << sums.*row.sum << "\n";
        file.close();
        if (!file) return false;
    }
    std::error_code renamed;
    std::filesystem::rename(unfinished, path, renamed);
    return !renamed;
}

}  // namespace ZV::Soak
