#include "api/parameter_documents.h"

#include <algorithm>
#include <span>
#include <sstream>
#include <vector>

#include "api/information_table.h"
#include "api/parameter_table.h"

namespace ZV::Test {
namespace {

struct Key {
    std::uint32_t number;
    std::string name;
    const char* unit;
    const char* range;
    const char* meaning;
    std::span<const ValueName> values;
    bool hasRange;
    bool hasList;
};

struct Family {
    const char* name;  ///< Of the program's enumeration.
    const char* title;
    const char* functions;
    std::vector<Key> keys;
};

template <typename Row>
std::vector<Key> CollectKeys(std::span<const Row> rows) {
    std::vector<Key> keys;
    for (const Row& row : rows) {
        keys.push_back({row.key, row.text.name, row.text.unit, row.text.range, row.text.meaning,
                        row.text.values, row.hasRange, row.list != nullptr});
    }
    return keys;
}

/// A key that the log has no name for is called as in zentara.h.
std::string GetInformationName(const InformationRow& row) {
    return row.name != nullptr ? row.name : "zinfReserved" + std::to_string(row.key);
}

Family CollectInformation() {
    Family family{"Information", "Information", "", {}};
    for (const InformationRow& row : GetInformationRows()) {
        family.keys.push_back({row.key, GetInformationName(row), row.unit, "", row.meaning,
                               row.values, false, false});
    }
    return family;
}

std::vector<Family> CollectFamilies() {
    return {{"Word", "32-bit parameters", "`Zentara_GetParam`, `Zentara_SetParam`",
             CollectKeys(GetWordParameters())},
            {"Signed", "Signed parameters", "`Zentara_GetParamS32`, `Zentara_SetParamS32`",
             CollectKeys(GetSignedParameters())},
            {"Wide", "64-bit parameters", "`Zentara_GetParam64`, `Zentara_SetParam64`",
             CollectKeys(GetWideParameters())}};
}

const char* GetTables(const Key& key) {
    if (key.hasRange && key.hasList) return "range, list";
    if (key.hasRange) return "range";
    return key.hasList ? "list" : "";
}

void PrintKeys(std::ostream& out, const Family& family) {
    out << "\n## " << family.title << "\n\nRead and written by " << family.functions << ".\n\n"
        << "| Key | Name | Unit | Values | Tables | Meaning |\n|---|---|---|---|---|---|\n";
    for (const Key& key : family.keys) {
        out << "| " << key.number << " | `" << key.name << "` | " << key.unit << " | " << key.range
            << " | " << GetTables(key) << " | " << key.meaning << " |\n";
    }
}

void PrintInformation(std::ostream& out, const Family& family) {
    out << "\n## " << family.title << "\n\nRead by `Zentara_GetInfo`. A yes or no is 1 or 0.\n\n"
        << "| Key | Name | Unit | Meaning |\n|---|---|---|---|\n";
    for (const Key& key : family.keys) {
        out << "| " << key.number << " | `" << key.name << "` | " << key.unit << " | "
            << key.meaning << " |\n";
    }
}

void PrintValues(std::ostream& out, const Key& key) {
    if (key.values.empty()) return;
    out << "\n`" << key.name << "`:\n\n| Value | Name |\n|---|---|\n";
    for (const ValueName& value : key.values) {
        out << "| " << value.value << " | " << value.name << " |\n";
    }
}

void PrintRow(std::ostream& out, const Family& family, const Key& key) {
    out << "{ParameterFamily::" << family.name << ", " << key.number << ", \"" << key.name
        << "\", \"" << key.unit << "\", \"" << key.meaning << "\", {";
    const char* separator = "";
    for (const ValueName& value : key.values) {
        out << separator << "{" << value.value << ", \"" << value.name << "\"}";
        separator = ", ";
    }
    out << "}},\n";
}

std::size_t CountMostValues(const std::vector<Family>& families) {
    std::size_t most = 0;
    for (const Family& family : families) {
        for (const Key& key : family.keys) most = std::max(most, key.values.size());
    }
    return most;
}

constexpr const char* DocumentHead =
    "# Parameters\n"
    "\n"
    "Written by `scripts/generate-parameters` from the library's own tables; do not edit.\n"
    "\n"
    "A parameter is one value of a settings block. Its limits and lists are those of the camera "
    "that\n"
    "the block belongs to: `Zentara_GetParamMin`, `Zentara_GetParamMax` and\n"
    "`Zentara_GetParamSparseTable` tell them. The column of tables says which of\n"
    "`Zentara_IsRangeTable` (range) and `Zentara_IsSparseTable` (list) answer yes on a camera "
    "that\n"
    "has the parameter.\n"
    "\n"
    "A value that is not in a key's list is refused. A value beyond a key's range is stored, and "
    "the\n"
    "camera's own answer shows when the block is sent. The exceptions: a cooling target beyond "
    "its\n"
    "limits is refused; an exposure beyond its limits is refused and stored all the same, and the "
    "send\n"
    "brings it to the nearest limit; \"not checked\" stands where any value is stored.\n";

constexpr const char* NamesHead =
    "// Written by scripts/generate-parameters from the library's own tables; do not edit.\n"
    "//\n"
    "// One row per key, in the order of the families and of the numbers, for an initialiser of\n"
    "//     {ParameterFamily family; std::uint32_t key; const char* name; const char* unit;\n"
    "//      const char* meaning; ValueName values[N];}\n"
    "// with struct ValueName {std::uint32_t value; const char* name;}: the values' names, if "
    "any,\n"
    "// come first and the rest of the array is empty. The includer gives these types their "
    "names.\n";

}  // namespace

std::string MakeParameterDocument() {
    std::ostringstream out;
    std::vector<Family> families = CollectFamilies();
    out << DocumentHead;
    for (const Family& family : families) PrintKeys(out, family);
    families.push_back(CollectInformation());
    PrintInformation(out, families.back());
    out << "\n## Names of values\n";
    for (const Family& family : families) {
        for (const Key& key : family.keys) PrintValues(out, key);
    }
    return out.str();
}

std::string MakeParameterNames() {
    std::ostringstream out;
    out << NamesHead;
    std::vector<Family> families = CollectFamilies();
    families.push_back(CollectInformation());
    out << "// The longest list of names has " << CountMostValues(families) << ".\n";
    for (const Family& family : families) {
        for (const Key& key : family.keys) PrintRow(out, family, key);
    }
    return out.str();
}

}  // namespace ZV::Test
