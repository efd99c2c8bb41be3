#pragma once

#include <gtest/gtest.h>
#include <windows.h>

#include <string>

namespace ZV::Test {

/// The machine's switches, at first without their key; the former ones come back at the end. Every
/// process of the machine sees them.
class MachineSwitches {
  public:
    MachineSwitches() {
        // What a run that was killed has saved is what there was.
        if (!IsThere(SavedKey)) {
            CloseKey(MakeKey(SavedKey));
            Copy(StoreKey, SavedKey);
        }
        Remove();
    }
    ~MachineSwitches() {
        Remove();
        Copy(SavedKey, StoreKey);
        RegDeleteTreeA(HKEY_LOCAL_MACHINE, SavedKey);
    }
    MachineSwitches(const MachineSwitches&) = delete;
    MachineSwitches& operator=(const MachineSwitches&) = delete;

    void SetNumber(const char* name, DWORD number) const {
        SetValue(name, REG_DWORD, &number, sizeof number);
    }
    void SetText(const char* name, const std::string& text) const {
        SetValue(name, REG_SZ, text.c_str(), text.size() + 1);
    }
    void SetWideText(const wchar_t* name, const std::wstring& text) const {
        const DWORD bytes = static_cast<DWORD>((text.size() + 1) * sizeof(wchar_t));
        EXPECT_EQ(RegSetKeyValueW(HKEY_LOCAL_MACHINE, L"SOFTWARE\\Morvane\\Zentara", name, REG_SZ,
                                  text.c_str(), bytes),
                  ERROR_SUCCESS);
    }
    void SetValue(const char* name, DWORD type, const void* bytes, std::size_t count) const {
        EXPECT_EQ(RegSetKeyValueA(HKEY_LOCAL_MACHINE, StoreKey, name, type, bytes,
                                  static_cast<DWORD>(count)),
                  ERROR_SUCCESS)
            << name;
    }
    static void Remove() { RegDeleteTreeA(HKEY_LOCAL_MACHINE, StoreKey); }

  private:
    static constexpr char StoreKey[] = "SOFTWARE\\Morvane\\Zentara";
    static constexpr char SavedKey[] = "SOFTWARE\\ZentaraTestsSaved";

    static HKEY MakeKey(const char* path) {
        HKEY key = nullptr;
        EXPECT_EQ(RegCreateKeyExA(HKEY_LOCAL_MACHINE, path, 0, nullptr, 0, KEY_ALL_ACCESS, nullptr,
                                  &key, nullptr),
                  ERROR_SUCCESS)
            << path;
        return key;
    }
    static HKEY OpenKey(const char* path) {
        HKEY key = nullptr;
        (void)RegOpenKeyExA(HKEY_LOCAL_MACHINE, path, 0, KEY_READ, &key);
        return key;
    }
    static void CloseKey(HKEY key) {
        if (key != nullptr) RegCloseKey(key);
    }
    static bool IsThere(const char* path) {
        HKEY key = OpenKey(path);
        CloseKey(key);
        return key != nullptr;
    }
    static bool HasValues(HKEY key) {
        DWORD count = 0;
        (void)RegQueryInfoKeyA(key, nullptr, nullptr, nullptr, nullptr, nullptr, nullptr, &count,
                               nullptr, nullptr, nullptr, nullptr);
        return count != 0;
    }
    /// Nothing where the key `from` has no values.
    static void Copy(const char* from, const char* to) {
        HKEY source = OpenKey(from);
        if (source != nullptr && HasValues(source)) {
            HKEY target = MakeKey(to);
            EXPECT_EQ(RegCopyTreeA(source, nullptr, target), ERROR_SUCCESS);
            CloseKey(target);
        }
        CloseKey(source);
    }
};

}  // namespace ZV::Test
