#include "tools/program.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <png.h>
#include <tiffio.h>

#include <array>
#include <cstdio>
#include <cstring>
#include <nlohmann/json.hpp>
#include <sstream>

#include "support/wait_until.h"
#include "tools/fits_file.h"
#include "tools/fits_verdict.h"
#include "tools/text_pattern.h"
#include "tools/traced_scenario.h"

namespace ZentaraTest {
namespace {

using nlohmann::json;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::Not;

/// Samples of a grey PNG of 16 bits, as they stand in the file.
std::vector<std::uint16_t> ReadPngSamples(const std::string& path) {
    std::FILE* file = std::fopen(path.c_str(), "rb");
    if (file == nullptr) return {};
    png_structp png = png_create_read_struct(PNG_LIBPNG_VER_STRING, nullptr, nullptr, nullptr);
    png_infop info = png_create_info_struct(png);
    png_init_io(png, file);
    png_read_png(png, info, PNG_TRANSFORM_SWAP_ENDIAN, nullptr);
    const png_bytepp rows = png_get_rows(png, info);
    const std::size_t width = png_get_image_width(png, info);
    std::vector<std::uint16_t> samples;
    for (std::uint32_t row = 0; row < png_get_image_height(png, info); ++row) {
        const std::size_t end = samples.size();
        samples.resize(end + width);
        std::memcpy(samples.data() + end, rows[row], width * 2);
    }
    png_destroy_read_struct(&png, &info, nullptr);
    std::fclose(file);
    return samples;
}

TEST(Program, HelpIsPrintedOnStandardOutputAndSucceeds) {
    for (const std::vector<std::string>& arguments : {std::vector<std::string>{"--help"},
                                                      {"list", "--help"},
                                                      {"info", "--help"},
                                                      {"get", "--help"},
                                                      {"limits", "--help"},
                                                      {"set", "--help"},
                                                      {"preflight", "--help"},
                                                      {"settings", "--help"},
                                                      {"settings", "save", "--help"},
                                                      {"settings", "load", "--help"},
                                                      {"grab", "--help"},
                                                      {"stream", "--help"},
                                                      {"histogram", "--help"},
                                                      {"white-balance", "--help"},
                                                      {"process", "--help"},
                                                      {"auto-expose", "--help"}}) {
        const ProgramResult result = RunProgram(arguments);

        EXPECT_EQ(0, result.exitCode);
        EXPECT_THAT(result.output, HasSubstr("--simulation"));
        EXPECT_THAT(result.errors, IsEmpty());
    }
}

TEST(Program, WrongUseEndsWithCode2AndSaysHowToGetHelp) {
    for (const std::vector<std::string>& arguments :
         {std::vector<std::string>{},
          {"fly"},
          {"grab"},
          {"grab", "x", "-o", "a.fits"},
          {"settings"},
          {"settings", "save"},
          {"settings", "load", "--simulation", "mono"},
          {"set"},
          {"stream", "--simulation", "mono"},
          {"grab", "--simulation", "mono", "-o", "image.jpg"}}) {
        const ProgramResult result = RunProgram(arguments);

        EXPECT_EQ(2, result.exitCode);
        EXPECT_THAT(result.errors, HasSubstr("zentara:"));
        EXPECT_THAT(result.output, IsEmpty());
    }
}

TEST(Program, ListShowsTheTenCamerasOfTheScenario) {
    const ProgramResult result = RunProgram({"list", "--simulation", "ten", "--json"});

    ASSERT_EQ(0, result.exitCode) << result.errors;
    const json cameras = json::parse(result.output)["cameras"];
    ASSERT_EQ(10U, cameras.size());
    for (std::size_t i = 0; i < cameras.size(); ++i) {
        EXPECT_EQ(i, cameras[i]["id"].get<std::size_t>());
        EXPECT_THAT(cameras[i]["model"].get<std::string>(), Not(IsEmpty()));
        EXPECT_TRUE(cameras[i]["free"].get<bool>());
    }
}

TEST(Program, ListOfAnEmptyBusSaysSoAndSucceeds) {
    const ProgramResult result = RunProgram({"list", "--simulation", "empty"});

    EXPECT_EQ(0, result.exitCode);
    EXPECT_EQ("No cameras.\n", result.output);
}

TEST(Program, TheSimulationOptionMayStandBeforeTheCommand) {
    const ProgramResult before = RunProgram({"--simulation", "mono", "list"});
    const ProgramResult after = RunProgram({"list", "--simulation", "mono"});

    EXPECT_EQ(0, before.exitCode);
    EXPECT_EQ(after.output, before.output);
}

TEST(Program, InfoTellsModelAndSensor) {
    const ProgramResult result =
        RunProgram({"info", "0", "--simulation", "model:SolvaneG2", "--json"});

    ASSERT_EQ(0, result.exitCode) << result.errors;
    const json info = json::parse(result.output);
    EXPECT_EQ("Solvane G2", info["model"]);
    EXPECT_EQ(29, info["cameraType"]);
    EXPECT_GT(info["ccdWidth"].get<int>(), 0);
    EXPECT_TRUE(info["intensifierModel"].is_null());
}

TEST(Program, InfoHasNoSensorKindForASensorThatIsNeitherMonoNorBayer) {
    // The colour kind stands in bits 8 to 11 of configuration quadlet 17.
    const TemporaryFolder folder;
    const std::string scenario = folder.GetPath("kind.json");
    WriteFile(scenario, R"({"base": "mono", "cameras": [{"configuration": {"17": 1280}}]})");

    const ProgramResult asJson = RunProgram({"info", "0", "--simulation", scenario, "--json"});
    const ProgramResult asText = RunProgram({"info", "0", "--simulation", scenario});

    EXPECT_EQ(0, asJson.exitCode) << asJson.errors;
    EXPECT_TRUE(json::parse(asJson.output)["ccdType"].is_null());
    EXPECT_THAT(asText.output, HasPattern("ccd-type +-  "));
}

TEST(Program, InfoTellsTheSensorKindsThatAre0And1) {
    for (const auto& [scenario, kind] : {std::pair{"mono", 0}, {"colour", 1}}) {
        const ProgramResult result = RunProgram({"info", "0", "--simulation", scenario, "--json"});

        EXPECT_EQ(kind, json::parse(result.output)["ccdType"]) << scenario;
    }
}

TEST(Program, ASerialNumberThatIsNotUtf8IsPrintedWithReplacementsInJson) {
    // The serial number begins at configuration quadlet 18: "A", a byte that is no UTF-8, "B".
    const TemporaryFolder folder;
    const std::string scenario = folder.GetPath("serial.json");
    WriteFile(scenario, R"({"base": "mono",
        "cameras": [{"configuration": {"18": 1107247616, "19": 0}}]})");
    const std::string expected =
        "A\xEF\xBF\xBD"
        "B";

    const ProgramResult list = RunProgram({"list", "--simulation", scenario, "--json"});
    const ProgramResult info = RunProgram({"info", "0", "--simulation", scenario, "--json"});

    ASSERT_EQ(0, list.exitCode) << list.errors;
    EXPECT_EQ(expected, json::parse(list.output)["cameras"][0]["serialNumber"]);
    ASSERT_EQ(0, info.exitCode) << info.errors;
    EXPECT_EQ(expected, json::parse(info.output)["serialNumber"]);
}

TEST(Program, ASerialNumberOfACameraGivesTheTerminalNoCommand) {
    // "A", an escape, "[J"; then the same command as one control of UTF-8.
    const TemporaryFolder folder;
    const std::string scenario = folder.GetPath("serial.json");
    WriteFile(scenario, R"({"base": "mono",
        "cameras": [{"configuration": {"18": "0x411B5B4A", "19": "0x42C29B4A", "20": 0}}]})");

    const ProgramResult list = RunProgram({"list", "--simulation", scenario});
    const ProgramResult info = RunProgram({"info", "0", "--simulation", scenario});

    EXPECT_THAT(list.output, HasSubstr("A?[JB\xC2?J")) << list.errors;
    EXPECT_THAT(info.output, HasSubstr("A?[JB\xC2?J")) << info.errors;
}

TEST(Program, ARefusedScenarioEndsWithCode2AndNamesThePlace) {
    const TemporaryFolder folder;
    WriteFile(folder.GetPath("bad.json"), R"({"base": "mono", "cameras": [{"colour": 1}]})");

    const ProgramResult result = RunProgram({"list", "--simulation", folder.GetPath("bad.json")});

    EXPECT_EQ(2, result.exitCode);
    EXPECT_THAT(result.errors, HasSubstr("colour"));
    EXPECT_THAT(result.output, IsEmpty());
}

TEST(Program, ACameraThatIsNotInTheListEndsWithCode3) {
    EXPECT_EQ(3, RunProgram({"info", "1", "--simulation", "mono"}).exitCode);
    EXPECT_EQ(3, RunProgram({"grab", "0", "--simulation", "empty", "-o", "a.fits"}).exitCode);
}

TEST(Program, GrabWritesAFitsFileThatAstronomersProgramsRead) {
    const TemporaryFolder folder;
    const std::string path = folder.GetPath("star [1].fits");

    const ProgramResult result = RunProgram({"grab", "0", "--simulation", "mono", "-o", path});

    ASSERT_EQ(0, result.exitCode) << result.errors;
    const FitsFile file(path);
    ASSERT_NE(nullptr, file.Get());
    EXPECT_THAT(ReadFitsText(file.Get(), "DATE-OBS"),
                MatchesPattern("[0-9]{4}-[0-9]{2}-[0-9]{2}T[0-9]{2}:[0-9]{2}:[0-9]{2}[.][0-9]{3}"));
    EXPECT_DOUBLE_EQ(0.016384, ReadFitsNumber(file.Get(), "EXPTIME"));
    EXPECT_DOUBLE_EQ(0.016384, ReadFitsNumber(file.Get(), "EXPOSURE"));
    EXPECT_EQ(1, ReadFitsNumber(file.Get(), "XBINNING"));
    EXPECT_EQ(1, ReadFitsNumber(file.Get(), "YBINNING"));
    EXPECT_EQ(0, ReadFitsNumber(file.Get(), "XORGSUBF"));
    EXPECT_EQ(0, ReadFitsNumber(file.Get(), "YORGSUBF"));
    EXPECT_GT(ReadFitsNumber(file.Get(), "XPIXSZ"), 0);
    EXPECT_GT(ReadFitsNumber(file.Get(), "YPIXSZ"), 0);
    EXPECT_GE(ReadFitsNumber(file.Get(), "GAIN"), 0);
    EXPECT_GE(ReadFitsNumber(file.Get(), "OFFSET"), 0);
    EXPECT_THAT(ReadFitsText(file.Get(), "INSTRUME"), Not(IsEmpty()));
    EXPECT_THAT(ReadFitsText(file.Get(), "SERIALNO"), Not(IsEmpty()));
    EXPECT_EQ("Zentara 2.0.8", ReadFitsText(file.Get(), "SWCREATE"));
    EXPECT_EQ(0, ReadFitsNumber(file.Get(), "FRAMEERR"));
    EXPECT_EQ(0, ReadFitsText(file.Get(), "ROWORDER").compare("TOP-DOWN"));
}

TEST(Program, ItsFitsFilesKeepTheStandard) {
    const TemporaryFolder folder;
    for (const char* scenario : {"mono", "metrona", "colour"}) {
        const std::string path = folder.GetPath(std::string(scenario) + ".fits");
        ASSERT_EQ(0, RunProgram({"grab", "0", "--simulation", scenario, "-o", path}).exitCode);

        EXPECT_TRUE(IsFitsGood(path)) << scenario;
    }
}

TEST(Program, AColourCameraSaysItsMosaicInTheFitsHeader) {
    const TemporaryFolder folder;
    const std::string path = folder.GetPath("colour.fits");
    ASSERT_EQ(0, RunProgram({"grab", "0", "--simulation", "colour", "-o", path}).exitCode);

    const FitsFile file(path);

    ASSERT_NE(nullptr, file.Get());
    EXPECT_THAT(ReadFitsText(file.Get(), "BAYERPAT"), MatchesPattern("RGGB|GRBG|GBRG|BGGR"));
}

TEST(Program, AllKindsOfFileHoldTheSamePixels) {
    const TemporaryFolder folder;
    // Nothing of chance or time in it: every run takes the same image.
    const std::string scenario = folder.GetPath("still.json");
    WriteFile(
        scenario,
        R"({"base": "metrona", "cameras": [{"sensor": {"noise": false, "darkCurrent": 0}}]})");
    for (const char* name : {"a.fits", "a.tiff", "a.png", "a.raw"}) {
        ASSERT_EQ(0, RunProgram({"grab", "0", "--simulation", scenario, "-o", folder.GetPath(name)})
                         .exitCode);
    }
    const std::vector<std::uint16_t> pixels = FitsFile(folder.GetPath("a.fits")).ReadPixels();
    const std::string expected(reinterpret_cast<const char*>(pixels.data()), pixels.size() * 2);

    EXPECT_TRUE(expected == ReadFile(folder.GetPath("a.raw")));

    TIFF* tiff = TIFFOpen(folder.GetPath("a.tiff").c_str(), "r");
    ASSERT_NE(nullptr, tiff);
    std::string tiffPixels;
    for (std::uint32_t strip = 0; strip < TIFFNumberOfStrips(tiff); ++strip) {
        std::string bytes(static_cast<std::size_t>(TIFFStripSize(tiff)), '\0');
        const tmsize_t read = TIFFReadEncodedStrip(tiff, strip, bytes.data(), -1);
        ASSERT_GE(read, 0);
        tiffPixels.append(bytes, 0, static_cast<std::size_t>(read));
    }
    TIFFClose(tiff);
    EXPECT_TRUE(expected == tiffPixels);

    png_image png{};
    png.version = PNG_IMAGE_VERSION;
    ASSERT_NE(0, png_image_begin_read_from_file(&png, folder.GetPath("a.png").c_str()));
    EXPECT_EQ(PNG_FORMAT_LINEAR_Y, png.format);
    png_image_free(&png);
    EXPECT_TRUE(pixels == ReadPngSamples(folder.GetPath("a.png")));
}

TEST(Program, AFileThatCannotBeWrittenIsNamedWithTheReasonAndLeavesNothing) {
    const TemporaryFolder folder;
    for (const char* ending : {"fits", "tiff", "png", "raw"}) {
        const std::string path = folder.GetPath("missing/image.") + ending;

        const ProgramResult result = RunProgram({"grab", "0", "--simulation", "mono", "-o", path});

        EXPECT_EQ(1, result.exitCode);
        EXPECT_THAT(result.errors, HasSubstr(path));
        EXPECT_THAT(result.errors, HasSubstr("No such file or directory"));
    }
    EXPECT_THAT(folder.ListFiles(), IsEmpty());
}

TEST(Program, FilesWithNamesLikeThatOfTheImageAreLeftAlone) {
    const TemporaryFolder folder;
    for (const char* ending : {"fits", "tiff", "png", "raw"}) {
        const std::string path = folder.GetPath("image.") + ending;
        for (const char* tail : {".part", ".tmp", "~"}) WriteFile(path + tail, "the user's");

        EXPECT_EQ(0, RunProgram({"grab", "0", "--simulation", "mono", "-o", path}).exitCode);
        std::filesystem::remove(path);
        std::filesystem::create_directory(path);  // This one cannot be written.
        EXPECT_EQ(1, RunProgram({"grab", "0", "--simulation", "mono", "-o", path}).exitCode);

        for (const char* tail : {".part", ".tmp", "~"}) {
            EXPECT_EQ("the user's", ReadFile(path + tail)) << path << tail;
        }
    }
    EXPECT_EQ(16U, folder.ListFiles().size());
}

TEST(Program, StreamCountsItsFramesAndWritesNumberedFiles) {
    const TemporaryFolder folder;

    const ProgramResult result = RunProgram({"stream", "0", "--simulation", "mono", "--count", "5",
                                             "--json", "-o", folder.GetPath("night.raw")});

    ASSERT_TRUE(result.exitCode == 0 || result.exitCode == 6) << result.errors;
    const json report = json::parse(result.output);
    EXPECT_EQ(5, report["frames"]);
    EXPECT_EQ(5, report["files"]);
    EXPECT_EQ(0, report["damaged"]);
    EXPECT_THAT(folder.ListFiles(),
                testing::ElementsAre("night-000001.raw", "night-000002.raw", "night-000003.raw",
                                     "night-000004.raw", "night-000005.raw"));
}

TEST(Program, StreamEndsAfterItsDuration) {
    const ProgramResult result =
        RunProgram({"stream", "0", "--simulation", "mono", "--duration", "0.5", "--json"});

    ASSERT_TRUE(result.exitCode == 0 || result.exitCode == 6) << result.errors;
    EXPECT_GE(json::parse(result.output)["seconds"].get<double>(), 0.5);
}

TEST(Program, AnInterruptEndsAStreamCleanlyWithCode130) {
    const TemporaryFolder folder;
    RunningProgram program({"stream", "0", "--simulation", "mono", "--duration", "600", "-o",
                            folder.GetPath("night.raw")});
    ASSERT_TRUE(
        ZV::Test::WaitUntil([&] { return !folder.ListFiles().empty(); }, std::chrono::seconds(60)));

    program.Interrupt();
    const ProgramResult result = program.Wait();

    EXPECT_EQ(130, result.exitCode);
    EXPECT_THAT(result.output, HasSubstr("files written"));
    EXPECT_THAT(folder.ListFiles(), testing::Each(MatchesPattern("night-[0-9]{6}[.]raw")));
}

TEST(Program, AnInterruptedStreamAccountsForEveryFrameUpToTheLastFile) {
    const TemporaryFolder folder;
    RunningProgram program({"stream", "0", "--simulation", "mono", "--duration", "600", "--json",
                            "--buffers", "20", "-o", folder.GetPath("night.fits")});
    ASSERT_TRUE(
        ZV::Test::WaitUntil([&] { return !folder.ListFiles().empty(); }, std::chrono::seconds(60)));

    program.Interrupt();
    const ProgramResult result = program.Wait();

    EXPECT_EQ(130, result.exitCode);
    const json report = json::parse(result.output);
    EXPECT_EQ(report["frames"], report["files"]);
    EXPECT_EQ(report["files"], folder.ListFiles().size());
    EXPECT_EQ(0, report["surplus"]);
}

TEST(Program, AStreamTellsOfFramesThatCameBehindThoseThatWereAskedFor) {
    const TracedScenario scenario(R"({"sensor": {"width": 64, "height": 48}})");
    const TemporaryFolder folder;

    json report;
    EXPECT_TRUE(ZV::Test::WaitUntil(
        [&] {
            report = json::parse(
                RunProgram({"stream", "0", "--simulation", scenario.GetName(), "--count", "1",
                            "--buffers", "20", "--json", "-o", folder.GetPath("night.fits")})
                    .output);
            return report["surplus"] > 0;
        },
        std::chrono::seconds(60)));
    EXPECT_EQ(1, report["frames"]);
    EXPECT_EQ(1, report["files"]);
}

/// FNV-1a of 64 bits as 16 hexadecimal digits, as a trace holds it.
std::string GetChecksum(const std::string& bytes) {
    std::uint64_t hash = 0xCBF29CE484222325U;
    for (const char byte : bytes) hash = (hash ^ static_cast<unsigned char>(byte)) * 0x100000001B3U;
    std::array<char, 17> text{};
    std::snprintf(text.data(), text.size(), "%016llx", static_cast<unsigned long long>(hash));
    return text.data();
}

std::vector<std::string> ReadFrameChecksums(const std::string& trace) {
    std::vector<std::string> checksums;
    std::istringstream lines(ReadFile(trace));
    for (std::string line; std::getline(lines, line);) {
        const json record = json::parse(line, nullptr, false);
        if (record.is_object() && record.value("type", "") == "frame") {
            checksums.push_back(record["checksum"]);
        }
    }
    return checksums;
}

TEST(Program, ThePixelsOfAFitsFileAreThoseOfAFrameThatTheCameraSent) {
    const TracedScenario scenario("{}");
    const std::string path = scenario.folder.GetPath("star.fits");

    ASSERT_EQ(0,
              RunProgram({"grab", "0", "--simulation", scenario.GetName(), "-o", path}).exitCode);

    const std::vector<std::uint16_t> pixels = FitsFile(path).ReadPixels();
    const std::string bytes(pixels.begin(), pixels.end());
    EXPECT_THAT(ReadFrameChecksums(scenario.GetTrace()), testing::Contains(GetChecksum(bytes)));
}

TEST(Program, ACameraThatAnotherProcessTakesAfterTheListingEndsWithCode4) {
    // The listing opens the device three times: to probe it, to read it and to set it up.
    const TracedScenario scenario(R"({"held": {"from": 4}})");

    const ProgramResult result = RunProgram({"info", "0", "--simulation", scenario.GetName()});

    EXPECT_EQ(4, result.exitCode);
    EXPECT_THAT(result.errors, HasSubstr("cannot be opened"));
}

TEST(Program, ACameraThatIsUnpluggedDuringAGrabEndsWithCode5) {
    const TracedScenario scenario(R"({"sensor": {"width": 64, "height": 48},
                                                     "faults": [{"kind": "unplug", "frame": 1, "packet": 0}]})");
    const std::string path = scenario.folder.GetPath("a.fits");

    const ProgramResult result =
        RunProgram({"grab", "0", "--simulation", scenario.GetName(), "-o", path, "--timeout", "3"});

    EXPECT_EQ(5, result.exitCode);
    EXPECT_THAT(result.errors, HasSubstr("gone"));
}

TEST(Program, AGrabThatGetsNoImageEndsAfterItsTimeout) {
    const TracedScenario scenario(
        R"({"faults": [{"kind": "losePacket", "count": 0, "frame": 1, "packet": 0},
                                                 {"kind": "losePacket", "probability": 1}]})");
    const std::string path = scenario.folder.GetPath("a.fits");

    const ProgramResult result = RunProgram(
        {"grab", "0", "--simulation", scenario.GetName(), "-o", path, "--timeout", "0.5"});

    EXPECT_EQ(1, result.exitCode);
    EXPECT_THAT(result.errors, HasSubstr("no image came within 0.5 s"));
    EXPECT_THAT(ReadFile(path), IsEmpty());
}

TEST(Program, ADamagedFrameIsWrittenAndEndsWithCode6) {
    const TracedScenario scenario(
        R"({"faults": [{"kind": "losePacket", "count": 1, "packet": 7}]})");
    const std::string path = scenario.folder.GetPath("a.fits");

    const ProgramResult result =
        RunProgram({"grab", "0", "--simulation", scenario.GetName(), "-o", path});

    EXPECT_EQ(6, result.exitCode);
    EXPECT_THAT(result.errors, HasSubstr("damaged"));
    EXPECT_EQ(26, ReadFitsNumber(FitsFile(path).Get(), "FRAMEERR"));
}

TEST(Program, AStreamWithALostPacketCountsTheDamagedFrameAndEndsWithCode6) {
    const TracedScenario scenario(
        R"({"faults": [{"kind": "losePacket", "frame": 2, "packet": 7}]})");

    const ProgramResult result =
        RunProgram({"stream", "0", "--simulation", scenario.GetName(), "--count", "4", "--json"});

    EXPECT_EQ(6, result.exitCode);
    EXPECT_EQ(1, json::parse(result.output)["damaged"]);
}

TEST(Program, AStreamNamesTheFramesThatAreMissingAndTheErrorsOfTheOthers) {
    const TracedScenario scenario(
        R"({"sensor": {"width": 64, "height": 48},
            "faults": [{"kind": "losePacket", "frame": 3, "packet": 0},
                       {"kind": "missingTail", "frame": 5, "packet": 1}]})");
    const std::vector<std::string> arguments{"stream",           "0",       "--simulation",
                                             scenario.GetName(), "--count", "12"};

    const ProgramResult text = RunProgram(arguments);
    std::vector<std::string> jsonArguments = arguments;
    jsonArguments.push_back("--json");
    const json report = json::parse(RunProgram(jsonArguments).output);

    EXPECT_EQ(6, text.exitCode) << text.errors;
    EXPECT_THAT(text.output, HasSubstr("missing frames: "));
    std::uint64_t missing = 0;
    bool isThirdMissing = false;
    for (const json& run : report["missing"]) {
        missing += run[1].get<std::uint64_t>() - run[0].get<std::uint64_t>() + 1;
        isThirdMissing = isThirdMissing || (run[0] <= 3 && run[1] >= 3);
    }
    EXPECT_TRUE(isThirdMissing) << report.dump();
    EXPECT_EQ(report["drops"], missing);
    EXPECT_EQ(0, report["gapsNotNamed"]);
    EXPECT_EQ(12, report["frames"]);
}

// Of many frames with a wrong number some come, however many a slow machine drops.
TEST(Program, AStreamTakesNoWrongNumberForAGap) {
    const TracedScenario scenario(
        R"({"sensor": {"width": 64, "height": 48}, "streamingVersion": 1,
            "faults": [{"kind": "corruptPacket", "packet": 0, "offset": 8, "bytes": 2,
                        "probability": 0.2}]})");

    const ProgramResult result =
        RunProgram({"stream", "0", "--simulation", scenario.GetName(), "--count", "90", "--json"});
    const json report = json::parse(result.output);

    EXPECT_EQ(6, result.exitCode) << result.errors;
    EXPECT_LE(1, report["misnumbered"]) << report.dump();
    EXPECT_LT(report["lastNumber"], 10000) << report.dump();
    EXPECT_LT(report["drops"], 10000);
}

TEST(Program, TheTextsOfTheLibraryDoNotMixWithItsOwnOutput) {
    const ProgramResult result = RunProgram({"list", "--simulation", "model:Unknown", "--json"});

    EXPECT_EQ(0, result.exitCode);
    EXPECT_FALSE(json::parse(result.output, nullptr, false).is_discarded());
    EXPECT_THAT(result.errors, HasSubstr("unkown camera type being used"));
}

}  // namespace
}  // namespace ZentaraTest
