#include "hal/platform/settings_store.h"

#include <windows.h>

#include <algorithm>
#include <cstdlib>
#include <cstring>
#include <new>

namespace ZV {
namespace {

constexpr char StoreKey[] = "SOFTWARE\\Morvane\\Zentara";

}  // namespace

struct SettingsStore {
    HKEY key;
};

SettingsStore* OpenSettingsStore() {
    HKEY key = nullptr;
    const auto error = RegOpenKeyExA(HKEY_LOCAL_MACHINE, StoreKey, 0, KEY_QUERY_VALUE, &key);
    if (error != ERROR_SUCCESS) {
        SetLastError(static_cast<DWORD>(error));
        return nullptr;
    }
    auto* store = new (std::nothrow) SettingsStore{key};
    if (store != nullptr) return store;
    RegCloseKey(key);
    SetLastError(ERROR_NOT_ENOUGH_MEMORY);
    return nullptr;
}

bool ReadStoredNumber(SettingsStore* store, const char* name, std::uint32_t* value) {
    if (store == nullptr) return false;
    std::uint32_t number = 0;
    DWORD type = 0;
    DWORD bytes = sizeof number;
    const auto error = RegQueryValueExA(store->key, name, nullptr, &type,
                                        reinterpret_cast<BYTE*>(&number), &bytes);
    if (error != ERROR_SUCCESS || type != REG_DWORD || bytes != sizeof number) return false;
    *value = number;
    return true;
}

bool ReadStoredText(SettingsStore* store, const char* name, char* text, std::size_t capacity) {
    if (store == nullptr || capacity == 0) return false;
    DWORD type = 0;
    DWORD bytes = 0;
    if (RegQueryValueExA(store->key, name, nullptr, &type, nullptr, &bytes) != ERROR_SUCCESS ||
        (type != REG_SZ && type != REG_EXPAND_SZ)) {
        return false;
    }
    auto* stored = static_cast<char*>(std::malloc(std::size_t{bytes} + 1));
    if (stored == nullptr) return false;
    const bool isRead = RegQueryValueExA(store->key, name, nullptr, nullptr,
                                         reinterpret_cast<BYTE*>(stored), &bytes) == ERROR_SUCCESS;
    if (isRead) {
        const std::size_t length = std::min(strnlen(stored, bytes), capacity - 1);
        std::memcpy(text, stored, length);
        text[length] = '\0';
    }
    std::free(stored);
    return isRead;
}

void CloseSettingsStore(SettingsStore* store) {
    if (store == nullptr) return;
    RegCloseKey(store->key);
    delete store;
}

}  // namespace ZV
