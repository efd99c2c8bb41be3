#include <gtest/gtest.h>
#include <windows.h>

#include <atomic>
#include <cstdlib>
#include <sstream>

#include "support/stored_settings.h"

// The machine's part of the registry is a key of the user's own for this process alone.

namespace ZV::Test {
namespace {

constexpr char StoreKey[] = "SOFTWARE\\Morvane\\Zentara";

std::string MakeRootPath() {
    static std::atomic<unsigned> counter{0};
    return "Software\\ZentaraTests\\" + std::to_string(GetCurrentProcessId()) + "-" +
           std::to_string(++counter);
}

HKEY MakeKey(HKEY parent, const char* path) {
    HKEY key = nullptr;
    const LSTATUS error =
        RegCreateKeyExA(parent, path, 0, nullptr, 0, KEY_ALL_ACCESS, nullptr, &key, nullptr);
    EXPECT_EQ(ERROR_SUCCESS, error) << path;
    return key;
}

std::string Trim(const std::string& text) {
    constexpr char Blanks[] = " \t\r";
    const std::size_t first = text.find_first_not_of(Blanks);
    if (first == std::string::npos) return {};
    return text.substr(first, text.find_last_not_of(Blanks) - first + 1);
}

bool IsNumber(const std::string& text, DWORD* number) {
    char* end = nullptr;
    *number = static_cast<DWORD>(std::strtoull(text.c_str(), &end, 0));
    return !text.empty() && *end == '\0';
}

void WriteValue(HKEY key, const std::string& name, const std::string& text) {
    DWORD number = 0;
    if (IsNumber(text, &number)) {
        RegSetValueExA(key, name.c_str(), 0, REG_DWORD, reinterpret_cast<const BYTE*>(&number),
                       sizeof number);
    } else {
        RegSetValueExA(key, name.c_str(), 0, REG_SZ, reinterpret_cast<const BYTE*>(text.c_str()),
                       static_cast<DWORD>(text.size() + 1));
    }
}

}  // namespace

struct StoredSettings::Store {
    std::string rootPath = MakeRootPath();
    HKEY root = MakeKey(HKEY_CURRENT_USER, rootPath.c_str());
};

StoredSettings::StoredSettings() : store(std::make_unique<Store>()) {
    EXPECT_EQ(ERROR_SUCCESS, RegOverridePredefKey(HKEY_LOCAL_MACHINE, store->root));
}

StoredSettings::~StoredSettings() {
    RegOverridePredefKey(HKEY_LOCAL_MACHINE, nullptr);
    RegCloseKey(store->root);
    RegDeleteTreeA(HKEY_CURRENT_USER, store->rootPath.c_str());
}

void StoredSettings::Write(std::string_view lines) const {
    Remove();
    HKEY key = MakeKey(store->root, StoreKey);
    std::istringstream stream{std::string(lines)};
    for (std::string line; std::getline(stream, line);) {
        const std::size_t equals = line.find('=');
        if (equals == std::string::npos) continue;
        WriteValue(key, Trim(line.substr(0, equals)), Trim(line.substr(equals + 1)));
    }
    RegCloseKey(key);
}

void StoredSettings::Remove() const {
    RegDeleteTreeA(store->root, StoreKey);
}

}  // namespace ZV::Test
