#include "hal/platform/settings_store.h"

#include <gtest/gtest.h>

#include <cstring>
#include <memory>
#include <string>

#include "support/scoped_variable.h"
#include "support/temporary_folder.h"

namespace ZV {
namespace {

using Test::ScopedVariable;
using Test::TemporaryFolder;

constexpr char Variable[] = "ZENTARA_CONFIG";
constexpr std::uint32_t Untouched = 0xABCDABCD;

struct CloseStore {
    void operator()(SettingsStore* store) const { CloseSettingsStore(store); }
};
using OwnedStore = std::unique_ptr<SettingsStore, CloseStore>;

class SettingsFile : public testing::Test {
  protected:
    OwnedStore Open(std::string_view content) {
        variable.Set(folder.WriteFile("zentara.conf", content).c_str());
        return OwnedStore(OpenSettingsStore());
    }

    std::uint32_t ReadNumber(std::string_view content, const char* name = "value") {
        std::uint32_t number = Untouched;
        const OwnedStore store = Open(content);
        const bool isThere = ReadStoredNumber(store.get(), name, &number);
        EXPECT_EQ(isThere, number != Untouched);
        return number;
    }

    std::string ReadText(std::string_view content, const char* name = "value") {
        char text[64] = "untouched";
        const OwnedStore store = Open(content);
        (void)ReadStoredText(store.get(), name, text, sizeof text);
        return text;
    }

    TemporaryFolder folder;
    ScopedVariable variable{Variable, nullptr};
};

TEST_F(SettingsFile, IsTheOneThatTheVariableNames) {
    EXPECT_EQ(ReadNumber("value = 100\n"), 100u);
}

TEST_F(SettingsFile, HoldsNumbersInDecimalAndHexadecimal) {
    EXPECT_EQ(ReadNumber("value = 4294967295"), 0xFFFFFFFFu);
    EXPECT_EQ(ReadNumber("value = 0xE0010038"), 0xE0010038u);
    EXPECT_EQ(ReadNumber("value = 0X1f"), 0x1Fu);
    EXPECT_EQ(ReadNumber("value = 0"), 0u);
}

TEST_F(SettingsFile, LeavesTheNumberUntouchedWhenItIsNone) {
    for (const char* line : {"value = ", "value = one", "value = 12x", "value = -1", "value = 1 2",
                             "value = 4294967296", "value = 0x", "value", "other = 1", ""}) {
        EXPECT_EQ(ReadNumber(line), Untouched) << line;
    }
}

TEST_F(SettingsFile, TrimsBlanksAroundNamesAndValues) {
    EXPECT_EQ(ReadNumber("\t value\t=  7 \t\r\n"), 7u);
    EXPECT_EQ(ReadText("value =  /var/log/a file.txt \r\n"), "/var/log/a file.txt");
}

TEST_F(SettingsFile, SkipsCommentsAndEmptyLines) {
    EXPECT_EQ(ReadNumber("# value = 1\n\n   # value = 2\n=3\nvalue = 4\n# value = 5"), 4u);
}

TEST_F(SettingsFile, LetsTheLastLineOfANameHold) {
    EXPECT_EQ(ReadNumber("value = 1\nvalue = 2\n"), 2u);
}

TEST_F(SettingsFile, TakesNamesWhole) {
    EXPECT_EQ(ReadNumber("value2 = 1\nmyvalue = 2\nval = 3\n"), Untouched);
}

TEST_F(SettingsFile, KeepsNumberSignsAndEqualsSignsInAValue) {
    EXPECT_EQ(ReadText("value = a=b#c\n"), "a=b#c");
}

TEST_F(SettingsFile, CutsATextToItsBufferAndTerminatesIt) {
    const OwnedStore store = Open("value = abcdef\n");
    char text[5];
    std::memset(text, 'x', sizeof text);

    EXPECT_TRUE(ReadStoredText(store.get(), "value", text, 4));

    EXPECT_STREQ(text, "abc");
    EXPECT_EQ(text[4], 'x');
}

TEST_F(SettingsFile, LeavesTheTextUntouchedWhenItIsNotThere) {
    EXPECT_EQ(ReadText("other = a\n"), "untouched");
}

TEST_F(SettingsFile, IsNoStoreWhenItIsMissing) {
    variable.Set(folder.GetPath("missing").c_str());

    EXPECT_EQ(OpenSettingsStore(), nullptr);
}

TEST_F(SettingsFile, IsNoStoreWhenItIsNoRegularFile) {
    variable.Set(folder.GetPath(".").c_str());

    EXPECT_EQ(OpenSettingsStore(), nullptr);
}

TEST_F(SettingsFile, IsReadAsFarAsTheStoreReaches) {
    const std::string content = "value = 1\n" + std::string(100'000, 'x') + "\nvalue = 2\n";

    EXPECT_EQ(ReadNumber(content), 1u);
}

TEST_F(SettingsFile, MayHoldAnyBytes) {
    std::string content;
    for (int i = 0; i < 4096; ++i) content.push_back(static_cast<char>(i * 37 + i / 256));

    EXPECT_EQ(ReadNumber(content), Untouched);
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
