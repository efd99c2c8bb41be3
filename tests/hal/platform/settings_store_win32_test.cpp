#include <gtest/gtest.h>
#include <windows.h>

#include <cstring>
#include <memory>
#include <string>

#include "hal/platform/settings_store.h"
#include "support/stored_settings.h"

namespace ZV {
namespace {

using Test::StoredSettings;

constexpr char StoreKey[] = "SOFTWARE\\Morvane\\Zentara";
constexpr std::uint32_t Untouched = 0xABCDABCD;

struct CloseStore {
    void operator()(SettingsStore* store) const { CloseSettingsStore(store); }
};
using OwnedStore = std::unique_ptr<SettingsStore, CloseStore>;

class SettingsKey : public testing::Test {
  protected:
    void StoreRaw(const char* name, DWORD type, const void* bytes, DWORD count) const {
        settings.Write("");
        HKEY key = nullptr;
        ASSERT_EQ(ERROR_SUCCESS,
                  RegOpenKeyExA(HKEY_LOCAL_MACHINE, StoreKey, 0, KEY_SET_VALUE, &key));
        EXPECT_EQ(ERROR_SUCCESS,
                  RegSetValueExA(key, name, 0, type, static_cast<const BYTE*>(bytes), count));
        RegCloseKey(key);
    }

    static std::uint32_t ReadNumber(const char* name = "value") {
        std::uint32_t number = Untouched;
        const OwnedStore store(OpenSettingsStore());
        const bool isThere = ReadStoredNumber(store.get(), name, &number);
        EXPECT_EQ(isThere, number != Untouched);
        return number;
    }

    static std::string ReadText(const char* name = "value") {
        char text[64] = "untouched";
        const OwnedStore store(OpenSettingsStore());
        (void)ReadStoredText(store.get(), name, text, sizeof text);
        return text;
    }

    StoredSettings settings;
};

TEST_F(SettingsKey, IsNoStoreWhenItIsMissing) {
    EXPECT_EQ(OpenSettingsStore(), nullptr);
}

TEST_F(SettingsKey, HoldsNumbersOfThirtyTwoBits) {
    settings.Write("value = 4294967295\nother = 0\n");

    EXPECT_EQ(ReadNumber(), 0xFFFFFFFFu);
    EXPECT_EQ(ReadNumber("other"), 0u);
    EXPECT_EQ(ReadNumber("missing"), Untouched);
}

TEST_F(SettingsKey, HoldsTexts) {
    settings.Write("value = C:\\logs\\a file.txt\n");

    EXPECT_EQ(ReadText(), "C:\\logs\\a file.txt");
    EXPECT_EQ(ReadText("missing"), "untouched");
}

TEST_F(SettingsKey, AnswersNoNumberForAnotherTypeOrAnotherLength) {
    constexpr std::uint64_t Wide = 1;
    StoreRaw("value", REG_QWORD, &Wide, sizeof Wide);
    EXPECT_EQ(ReadNumber(), Untouched);
    StoreRaw("value", REG_DWORD, &Wide, 2);
    EXPECT_EQ(ReadNumber(), Untouched);
    StoreRaw("value", REG_SZ, "abc", 4);
    EXPECT_EQ(ReadNumber(), Untouched);
}

TEST_F(SettingsKey, AnswersNoTextForANumber) {
    settings.Write("value = 1\n");

    EXPECT_EQ(ReadText(), "untouched");
}

TEST_F(SettingsKey, ReadsATextThatIsStoredWithoutItsEnd) {
    StoreRaw("value", REG_SZ, "abcdef", 3);

    EXPECT_EQ(ReadText(), "abc");
}

TEST_F(SettingsKey, CutsATextToItsBufferAndTerminatesIt) {
    settings.Write("value = abcdef\n");
    const OwnedStore store(OpenSettingsStore());
    char text[5];
    std::memset(text, 'x', sizeof text);

    EXPECT_TRUE(ReadStoredText(store.get(), "value", text, 4));

    EXPECT_STREQ(text, "abc");
    EXPECT_EQ(text[4], 'x');
}

TEST(MissingStore, HasNoValues) {
    std::uint32_t number = Untouched;
    char text[4] = "ab";

    EXPECT_FALSE(ReadStoredNumber(nullptr, "value", &number));
    EXPECT_FALSE(ReadStoredText(nullptr, "value", text, sizeof text));
    CloseSettingsStore(nullptr);

    EXPECT_EQ(number, Untouched);
    EXPECT_STREQ(text, "ab");
}

}  // namespace
}  // namespace ZV
