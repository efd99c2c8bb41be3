#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <nlohmann/json.hpp>

#include "support/wait_until.h"
#include "tools/fits_file.h"
#include "tools/paths.h"
#include "tools/program.h"

namespace ZentaraTest {
namespace {

using nlohmann::json;
using testing::HasSubstr;
using ZentaraProgram::GetPathText;
using ZentaraProgram::MakePath;

/// A folder whose name has blanks and letters of several alphabets, one of them outside the first
/// plane.
class ForeignFolder : public testing::Test {
  protected:
    ForeignFolder() { std::filesystem::create_directory(MakePath(path)); }

    [[nodiscard]] std::string GetPath(const std::string& name) const { return path + "/" + name; }
    [[nodiscard]] std::size_t CountFiles() const {
        const std::filesystem::directory_iterator files(MakePath(path));
        return static_cast<std::size_t>(std::distance(begin(files), end(files)));
    }
    [[nodiscard]] bool Exists(const std::string& name) const {
        return std::filesystem::is_regular_file(MakePath(GetPath(name)));
    }

    TemporaryFolder folder;
    const std::string path = GetPathText(folder.GetFolder()) + "/Nächte der Σterne ★ 𝔸";
};

TEST_F(ForeignFolder, ImagesOfEachFormatAreWrittenThereAndReadAgain) {
    for (const char* ending : {".fits", ".tiff", ".png"}) {
        const std::string file = GetPath("Mein Bild é★") + ending;

        const ProgramResult written =
            RunProgram({"grab", "0", "--simulation", "mono", "--json", "-o", file});
        const ProgramResult read = RunProgram({"histogram", file});

        ASSERT_EQ(0, written.exitCode) << written.errors;
        EXPECT_EQ(file, json::parse(written.output)["file"]);
        EXPECT_TRUE(Exists(std::string("Mein Bild é★") + ending));
        EXPECT_EQ(0, read.exitCode) << read.errors;
        EXPECT_THAT(read.output, HasSubstr("grey: "));
    }
    EXPECT_EQ(3U, CountFiles());
}

TEST_F(ForeignFolder, AnOlderImageIsReplaced) {
    const std::string file = GetPath("é.raw");
    WriteFile(file, "older");

    ASSERT_EQ(0, RunProgram({"grab", "0", "--simulation", "mono", "-o", file}).exitCode);

    EXPECT_GT(ReadFile(file).size(), 1000U);
    EXPECT_EQ(1U, CountFiles());
}

TEST_F(ForeignFolder, AStreamNumbersItsFilesThere) {
    const ProgramResult result =
        RunProgram({"stream", "0", "--simulation", "mono", "--count", "2", "-o", GetPath("ü.raw")});

    ASSERT_TRUE(result.exitCode == 0 || result.exitCode == 6) << result.errors;
    EXPECT_TRUE(Exists("ü-000001.raw"));
    EXPECT_TRUE(Exists("ü-000002.raw"));
}

TEST_F(ForeignFolder, AFrameThatWasStoredThereIsProcessed) {
    const std::string raw = GetPath("roh ß.fits"), finished = GetPath("fertig ß.tiff");
    ASSERT_EQ(0, RunProgram({"grab", "0", "--simulation", "colour", "-o", raw}).exitCode);

    const ProgramResult result =
        RunProgram({"process", raw, "--simulation", "colour", "-o", finished});

    EXPECT_EQ(0, result.exitCode) << result.errors;
    EXPECT_TRUE(Exists("fertig ß.tiff"));
}

TEST_F(ForeignFolder, SettingsAreSavedThereAndLoadedAgain) {
    const std::string file = GetPath("Einstellungen ø.json");

    const ProgramResult saved =
        RunProgram({"settings", "save", file, "--simulation", "mono", "--set", "exposure=250ms"});
    const ProgramResult loaded = RunProgram({"settings", "load", file, "--simulation", "mono"});

    EXPECT_EQ(0, saved.exitCode) << saved.errors;
    EXPECT_EQ(0, loaded.exitCode) << loaded.errors;
    EXPECT_EQ(1U, CountFiles());
}

TEST_F(ForeignFolder, AScenarioAndItsTraceMayLieThere) {
    const std::string scenario = GetPath("Σ.json");
    WriteFile(scenario, R"({"base": "mono", "timeScale": 0, "trace": "spur ★.jsonl"})");

    const ProgramResult result = RunProgram({"list", "--simulation", scenario});

    EXPECT_EQ(0, result.exitCode) << result.errors;
    EXPECT_TRUE(Exists("spur ★.jsonl"));
}

TEST_F(ForeignFolder, AMissingFolderIsToldInUtf8) {
    const std::string file = GetPath("fehlt/★.png");

    const ProgramResult result = RunProgram({"grab", "0", "--simulation", "mono", "-o", file});

    EXPECT_EQ(1, result.exitCode);
    EXPECT_THAT(result.errors, HasSubstr(file + " cannot be written: No such file or directory"));
}

TEST(Arguments, PatternsAndQuotesReachTheProgramAsTheyAre) {
    const TemporaryFolder folder;
    for (const char* word : {"*", "a b", "\"x\"", "a\\", "\\\"", "tab\there", "★"}) {
        const ProgramResult result = RunProgram({"get", word, "--simulation", "mono"});

        EXPECT_EQ(2, result.exitCode) << word;
    }
    EXPECT_THAT(RunProgram({"get", "a b*\\\"★", "--simulation", "mono"}).errors,
                HasSubstr("a b*\\\"★"));
}

TEST(Paths, AreUtf8InBothDirections) {
    for (const char* text : {"a.fits", "ä b/★.png", "𝔸.raw", ""}) {
        const std::string again = GetPathText(MakePath(text));

        EXPECT_EQ(MakePath(text), MakePath(again));
        EXPECT_EQ(std::string(text).size(), again.size());
    }
}

}  // namespace
}  // namespace ZentaraTest
