#include <gtest/gtest.h>
#include <windows.h>

#include <cstdint>
#include <cstring>
#include <memory>
#include <string>

#include "hal/platform/settings_store.h"
#include "windows/diagnostics/machine_switches.h"

namespace ZV::Test {
namespace {

constexpr std::uint32_t Untouched = 0xABCDABCD;

struct CloseStore {
    void operator()(SettingsStore* store) const { CloseSettingsStore(store); }
};
using OwnedStore = std::unique_ptr<SettingsStore, CloseStore>;

class RegistryStore : public testing::Test {
  protected:
    void SetValue(DWORD type, const void* bytes, std::size_t count) const {
        switches.SetValue("value", type, bytes, count);
    }

    std::uint32_t ReadNumber() const {
        const OwnedStore store(OpenSettingsStore());
        std::uint32_t number = Untouched;
        const bool isThere = ReadStoredNumber(store.get(), "value", &number);
        EXPECT_EQ(isThere, number != Untouched);
        return number;
    }
    /// The number, or Untouched, that a value gives.
    std::uint32_t ReadNumberOf(DWORD type, const void* bytes, std::size_t count) const {
        SetValue(type, bytes, count);
        return ReadNumber();
    }

    std::string ReadText(std::size_t capacity = 64) const {
        const OwnedStore store(OpenSettingsStore());
        char text[64] = "untouched";
        (void)ReadStoredText(store.get(), "value", text, capacity);
        return text;
    }
    std::string ReadTextOf(DWORD type, const void* bytes, std::size_t count) const {
        SetValue(type, bytes, count);
        return ReadText();
    }

    MachineSwitches switches;
};

TEST_F(RegistryStore, HoldsNumbersOf32Bits) {
    for (const std::uint32_t number : {0u, 1u, 0x7FFFFFFFu, 0x80000000u, 0xFFFFFFFFu}) {
        EXPECT_EQ(ReadNumberOf(REG_DWORD, &number, 4), number);
    }
}

TEST_F(RegistryStore, LeavesTheNumberUntouchedWhereTheValueIsOfAnotherKindOrLength) {
    constexpr std::uint64_t Number = 1;

    EXPECT_EQ(ReadNumber(), Untouched);
    EXPECT_EQ(ReadNumberOf(REG_SZ, "1", 2), Untouched);
    EXPECT_EQ(ReadNumberOf(REG_QWORD, &Number, 8), Untouched);
    EXPECT_EQ(ReadNumberOf(REG_BINARY, &Number, 4), Untouched);
    EXPECT_EQ(ReadNumberOf(REG_DWORD, &Number, 2), Untouched);
    EXPECT_EQ(ReadNumberOf(REG_DWORD, &Number, 8), Untouched);
}

TEST_F(RegistryStore, HoldsTextsWithAnEndAndWithoutOne) {
    EXPECT_EQ(ReadTextOf(REG_SZ, "C:\\log.txt", 11), "C:\\log.txt");
    EXPECT_EQ(ReadTextOf(REG_SZ, "C:\\log.txt", 10), "C:\\log.txt");
    EXPECT_EQ(ReadTextOf(REG_SZ, "a\0b", 4), "a");
    EXPECT_EQ(ReadTextOf(REG_SZ, "", 1), "");
    EXPECT_EQ(ReadTextOf(REG_SZ, "", 0), "");
}

TEST_F(RegistryStore, LeavesNamesOfVariablesInATextAsTheyAre) {
    EXPECT_EQ(ReadTextOf(REG_EXPAND_SZ, "%TEMP%\\log.txt", 15), "%TEMP%\\log.txt");
}

TEST_F(RegistryStore, LeavesTheTextUntouchedWhereTheValueIsNone) {
    constexpr std::uint32_t Number = 0x41414141;

    EXPECT_EQ(ReadText(), "untouched");
    EXPECT_EQ(ReadTextOf(REG_DWORD, &Number, 4), "untouched");
    EXPECT_EQ(ReadTextOf(REG_BINARY, "abc", 4), "untouched");
    EXPECT_EQ(ReadTextOf(REG_MULTI_SZ, "a\0b\0", 5), "untouched");
}

TEST_F(RegistryStore, CutsATextToItsBufferAndTerminatesIt) {
    SetValue(REG_SZ, "abcdef", 7);

    EXPECT_EQ(ReadText(4), "abc");
    EXPECT_EQ(ReadText(1), "");
    EXPECT_EQ(ReadText(0), "untouched");

    const std::string longText(100000, 'x');
    SetValue(REG_SZ, longText.c_str(), longText.size() + 1);
    EXPECT_EQ(ReadText(64), std::string(63, 'x'));
}

TEST_F(RegistryStore, GivesTextsInTheAnsiCodePage) {
    constexpr wchar_t Wide[] = L"C:\\B\u00FCcher.txt";
    char expected[64] = "";
    WideCharToMultiByte(CP_ACP, 0, Wide, -1, expected, sizeof expected, nullptr, nullptr);
    switches.SetWideText(L"value", Wide);

    EXPECT_EQ(ReadText(), expected);
}

TEST_F(RegistryStore, IsNoneWithTheSystemsErrorWhereTheKeyIsMissing) {
    EXPECT_EQ(OpenSettingsStore(), nullptr);

    EXPECT_EQ(GetLastError(), DWORD{ERROR_FILE_NOT_FOUND});
}

TEST_F(RegistryStore, LeavesNoKeyOpen) {
    SetValue(REG_SZ, "text", 5);
    DWORD before = 0, after = 0;
    (void)ReadText();
    GetProcessHandleCount(GetCurrentProcess(), &before);

    for (int i = 0; i < 50; ++i) (void)ReadText();

    GetProcessHandleCount(GetCurrentProcess(), &after);
    EXPECT_EQ(after, before);
}

}  // namespace
}  // namespace ZV::Test
