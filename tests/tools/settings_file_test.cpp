#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <nlohmann/json.hpp>

#include "tools/program.h"

namespace ZentaraTest {
namespace {

using nlohmann::json;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::Not;

ProgramResult Save(const std::string& file, const std::string& scenario,
                   const std::vector<std::string>& more = {}) {
    std::vector<std::string> arguments{"settings", "save", file, "--simulation", scenario};
    arguments.insert(arguments.end(), more.begin(), more.end());
    return RunProgram(arguments);
}

TEST(SettingsFile, HoldsNamesAndValuesWithUnitsAndTellsWhereTheyComeFrom) {
    const TemporaryFolder folder;
    const std::string file = folder.GetPath("a.json");

    const ProgramResult result = Save(file, "mono");

    ASSERT_EQ(0, result.exitCode) << result.errors;
    EXPECT_EQ(file + ": the settings of Solvane A1\n", result.output);
    const json document = json::parse(ReadFile(file));
    EXPECT_EQ("Solvane A1", document["model"]);
    EXPECT_EQ("S0005-10001", document["serialNumber"]);
    EXPECT_EQ("16.384 ms", document["settings"]["exposure"]);
    EXPECT_EQ("0 dB", document["settings"]["gain-db"]);
    EXPECT_EQ("Mono 8-Bit", document["settings"]["image-format"]);
    EXPECT_EQ(1392, document["settings"]["roi-width"]);
    EXPECT_TRUE(document["settings"]["cooler-active"].is_boolean());
    EXPECT_FALSE(document["settings"].contains("exposure-us"));
    EXPECT_FALSE(document["settings"].contains("em-gain"));
}

TEST(SettingsFile, SavedLoadedAndSavedAgainItIsTheSameForEachBuiltInScenario) {
    for (const char* scenario : {"mono", "colour", "wheel", "folary", "metrona", "intensified",
                                 "s400", "old", "rotated", "large", "ten", "held"}) {
        const TemporaryFolder folder;
        const std::string first = folder.GetPath("a.json"), second = folder.GetPath("b.json");

        ASSERT_EQ(0, Save(first, scenario).exitCode) << scenario;
        const ProgramResult again = Save(second, scenario, {"--load", first});

        EXPECT_EQ(0, again.exitCode) << scenario << again.errors;
        EXPECT_THAT(again.errors, Not(HasSubstr("asked for"))) << scenario;
        EXPECT_EQ(ReadFile(first), ReadFile(second)) << scenario;
    }
}

TEST(SettingsFile, WhatWasSetIsInTheFileAndComesBackFromIt) {
    const TemporaryFolder folder;
    const std::string first = folder.GetPath("a.json"), second = folder.GetPath("b.json");

    const ProgramResult set = Save(first, "mono", {"--set", "exposure=250ms",
                                                   "--set", "image-format=mono16",
                                                   "--set", "binning=2",
                                                   "--set", "gain-db=6",
                                                   "--set", "offset=100",
                                                   "--set", "cooling=-10C",
                                                   "--set", "readout-speed=10MHz",
                                                   "--set", "trigger-type=software",
                                                   "--set", "roi-x=10",
                                                   "--set", "roi-width=200",
                                                   "--set", "fan=low"});
    const ProgramResult loaded = Save(second, "mono", {"--load", first});

    ASSERT_EQ(0, set.exitCode) << set.errors;
    ASSERT_EQ(0, loaded.exitCode) << loaded.errors;
    const json settings = json::parse(ReadFile(first))["settings"];
    EXPECT_EQ("250 ms", settings["exposure"]);
    EXPECT_EQ("Mono 16-Bit", settings["image-format"]);
    EXPECT_EQ(2, settings["binning"]);
    EXPECT_EQ("6 dB", settings["gain-db"]);
    EXPECT_EQ(100, settings["offset"]);
    EXPECT_EQ("-10 C", settings["cooling"]);
    EXPECT_EQ("10 MHz", settings["readout-speed"]);
    EXPECT_EQ("Software", settings["trigger-type"]);
    EXPECT_EQ(10, settings["roi-x"]);
    EXPECT_EQ(200, settings["roi-width"]);
    EXPECT_EQ("Low", settings["fan"]);
    EXPECT_EQ(ReadFile(first), ReadFile(second));
}

TEST(SettingsFile, LoadShowsWhatItChanges) {
    const TemporaryFolder folder;
    const std::string file = folder.GetPath("a.json");
    WriteFile(file, R"({"settings": {"exposure": "1 s", "roi-width": 100}})");

    const ProgramResult result =
        RunProgram({"settings", "load", file, "--simulation", "colour", "--json"});

    ASSERT_EQ(0, result.exitCode) << result.errors;
    EXPECT_EQ(json::parse(R"({"changes": [
                  {"name": "roi-width", "before": 1392, "after": 100},
                  {"name": "exposure", "before": "16.384 ms", "after": "1 s"}]})"),
              json::parse(result.output));
}

TEST(SettingsFile, WhatIsSetOnTheCommandLineOutdoesTheFile) {
    const TemporaryFolder folder;
    const std::string file = folder.GetPath("a.json");
    WriteFile(file, R"({"settings": {"exposure": "1 s", "binning": 2}})");

    const ProgramResult result =
        RunProgram({"preflight", "--simulation", "mono", "--set", "exposure=2s", "--load", file});

    EXPECT_EQ(0, result.exitCode) << result.errors;
    EXPECT_THAT(result.output, HasSubstr("exposure    16.384 ms -> 2 s\n"));
    EXPECT_THAT(result.output, HasSubstr("binning     1 -> 2\n"));
}

struct BadFile {
    const char* text;
    const char* error;  ///< Behind the file's name.
};

constexpr BadFile BadFiles[] = {
    {"{\"settings\": {\n\"binning\": 1,\n\"exposre\": \"1 ms\"}}",
     ":3: unknown setting 'exposre'; did you mean exposure?"},
    {"{\"settings\": {\n\n\"exposure\": 250}}", ":3: exposure: '250' needs a unit: ns, us, ms, s"},
    {"{\"settings\": {\n\"exposure\": true}}", ":2: exposure: a text is wanted, not true"},
    {"{\"settings\": {\n\"roi-width\": null}}", ":2: roi-width: a number is wanted, not null"},
    {"{\"settings\": {\n\"roi-width\": [1, 2]}}", ":2: roi-width: a number is wanted, not a list"},
    {"{\"settings\": {\n\"roi-width\": {\"roi-x\": 1}}}",
     ":2: roi-width: a number is wanted, not an object"},
    {"{\"settings\": {\n\"cooler-active\": {}}}",
     ":2: cooler-active: true or false is wanted, not an object"},
    {"{\"settings\": {\n\"roi-width\": 1.5}}", ":2: roi-width: '1.5' is finer than its steps"},
    {"{\"settings\": {\n\"image-format\": 3}}", ":2: image-format: '3' is not a value of it"},
    {"{\"settings\": {\n\"binning\": 1,\n\n\"binning\": 2}}", ":4: binning stands here twice"},
    {"{\"settings\": {\n\"exposure\": \"1 ms\",\n\"zprm64Exposure\": \"2 ms\"}}",
     ":3: exposure stands here twice"},
    {"{\"settings\": {\n\"binning\": 3}}", ":2: binning: 3 is not allowed; allowed are 1, 2, 4, 8"},
    {"{\"settings\": {\"binning\": 2,\n\"exposure\": \"1 ns\"}}",
     ":2: exposure: 1 ns is out of range; allowed is 10 us to 3600 s"},
    {"{\"settings\": {\n\"em-gain\":\n 3\n}\n}",
     ":2: this camera (Solvane A1) does not have the setting em-gain"},
    {"{\n\"settngs\": {}}", ":2: unknown member 'settngs'; did you mean settings?"},
    {"{\n\"model\": 3,\n\"settings\": {}}", ":2: model: a text is wanted, not 3"},
    {"{\n\"settings\": 3}", ":2: settings: an object is wanted, not 3"},
    {"{\"settings\": {},\n\"settings\": {}}", ":2: settings stand here twice"},
    {"{}", ": the member settings is missing"},
    {"[]", ":1: an object is wanted, not a list"},
    {"\n7", ":2: an object is wanted, not 7"},
    {"{\"settings\": {\n\"binning\": 1,\n}}", ":3: this is no JSON: "},
    {"{\"settings\": {\n\"binning\" 1}}", ":2: this is no JSON: "},
    {"{\"settings\": {\n\"binning\": tru\n}}", ":2: this is no JSON: "},
    {"", ":1: this is no JSON: "},
    {"{\"settings\": {\n\"exposure-us\": 1e999\n}}", ":2: this is no JSON: number overflow"},
};

TEST(SettingsFile, WhatIsWrongWithItIsToldWithItsLine) {
    const TemporaryFolder folder;
    const std::string file = folder.GetPath("bad.json");
    for (const BadFile& bad : BadFiles) {
        WriteFile(file, bad.text);

        const ProgramResult result = RunProgram({"settings", "load", file, "--simulation", "mono"});

        EXPECT_EQ(2, result.exitCode) << bad.text;
        EXPECT_THAT(result.errors, HasSubstr("zentara: " + file + bad.error)) << bad.text;
        EXPECT_THAT(result.output, IsEmpty());
    }
}

TEST(SettingsFile, AllThatIsWrongWithItIsToldAtOnce) {
    const TemporaryFolder folder;
    const std::string file = folder.GetPath("bad.json");
    WriteFile(file, "{\"settings\": {\n\"a\": 1,\n\"binning\": \"x\",\n\"fan\": []}}");

    const ProgramResult result = RunProgram({"settings", "load", file, "--simulation", "mono"});

    EXPECT_THAT(result.errors, HasSubstr(file + ":2: "));
    EXPECT_THAT(result.errors, HasSubstr(file + ":3: "));
    EXPECT_THAT(result.errors, HasSubstr(file + ":4: "));
}

TEST(SettingsFile, OneThatCannotBeReadIsWrongUse) {
    const TemporaryFolder folder;

    for (const std::string& file : {folder.GetPath("none.json"), folder.GetPath("")}) {
        const ProgramResult result = RunProgram({"settings", "load", file, "--simulation", "mono"});

        EXPECT_EQ(2, result.exitCode);
        EXPECT_THAT(result.errors, HasSubstr("cannot be read"));
    }
}

TEST(SettingsFile, OneOfManyMegabytesIsRefused) {
    const TemporaryFolder folder;
    const std::string file = folder.GetPath("big.json");
    WriteFile(file, std::string(3 << 20, ' '));

    EXPECT_THAT(RunProgram({"settings", "load", file, "--simulation", "mono"}).errors,
                HasSubstr("is too large for a file of settings"));
}

TEST(SettingsFile, OneThatCannotBeWrittenEndsWithCode1AndLeavesNothing) {
    const TemporaryFolder folder;

    const ProgramResult result = Save(folder.GetPath("none/a.json"), "mono");

    EXPECT_EQ(1, result.exitCode);
    EXPECT_THAT(result.errors, HasSubstr("cannot be written"));
    EXPECT_THAT(folder.ListFiles(), IsEmpty());
}

TEST(SettingsFile, SaveReplacesAnOlderFileAndLeavesNoOther) {
    const TemporaryFolder folder;
    WriteFile(folder.GetPath("a.json"), "old");

    ASSERT_EQ(0, Save(folder.GetPath("a.json"), "mono").exitCode);

    EXPECT_THAT(ReadFile(folder.GetPath("a.json")), HasSubstr("\"settings\""));
    EXPECT_THAT(folder.ListFiles(), testing::ElementsAre("a.json"));
}

}  // namespace
}  // namespace ZentaraTest
