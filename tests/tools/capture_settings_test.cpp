#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <nlohmann/json.hpp>
#include <numeric>

#include "tools/fits_file.h"
#include "tools/program.h"
#include "tools/traced_scenario.h"
#include "zentara/zentara.h"

namespace ZentaraTest {
namespace {

using nlohmann::json;
using testing::HasSubstr;
using testing::IsEmpty;

/// A scenario of one quick camera without noise before an even grey.
class CaptureSettings : public testing::Test {
  protected:
    explicit CaptureSettings() { UseScenario("colour"); }

    void UseScenario(const std::string& base, const std::string& faults = "") {
        WriteFile(GetScenario(), R"({"base": ")" + base + R"(", "timeScale": 0, "cameras": [
            {"sensor": {"noise": false}, "scene": {"kind": "flat", "level": 0.1}, "faults": [)" +
                                     faults + "]}]}");
    }
    [[nodiscard]] std::string GetScenario() const { return folder.GetPath("scenario.json"); }

    ProgramResult Run(std::vector<std::string> arguments) {
        arguments.insert(arguments.end(), {"--simulation", GetScenario()});
        return RunProgram(arguments);
    }
    /// Grabs an image with more arguments and returns its path.
    std::string Grab(const std::string& name, const std::vector<std::string>& more = {}) {
        std::vector<std::string> arguments{"grab", "0", "-o", folder.GetPath(name)};
        arguments.insert(arguments.end(), more.begin(), more.end());
        const ProgramResult result = Run(arguments);
        EXPECT_EQ(0, result.exitCode) << result.errors;
        return folder.GetPath(name);
    }

    TemporaryFolder folder;
};

double GetMean(const std::vector<std::uint16_t>& samples) {
    return std::accumulate(samples.begin(), samples.end(), 0.0) /
           static_cast<double>(samples.size());
}

TEST_F(CaptureSettings, AnExposureThatIsEditedInAFileShowsInHeaderAndPixels) {
    const std::string file = folder.GetPath("a.json");
    ASSERT_EQ(0, Run({"settings", "save", file}).exitCode);
    std::string text = ReadFile(file);
    const std::string exposure = "\"16.384 ms\"";
    ASSERT_NE(std::string::npos, text.find(exposure));
    WriteFile(file, text.replace(text.find(exposure), exposure.size(), "\"49.152 ms\""));

    const FitsFile before(Grab("before.fits", {"--set", "image-format=bayer16"}));
    const FitsFile after(Grab("after.fits", {"--load", file, "--set", "image-format=bayer16"}));

    EXPECT_DOUBLE_EQ(0.016384, ReadFitsNumber(before.Get(), "EXPTIME"));
    EXPECT_DOUBLE_EQ(0.049152, ReadFitsNumber(after.Get(), "EXPTIME"));
    // The camera has 12 bits, as its offset register: one step of offset is one step of a sample.
    const double black = ReadFitsNumber(before.Get(), "OFFSET");
    const double ratio =
        (GetMean(after.ReadPixels()) - black) / (GetMean(before.ReadPixels()) - black);
    EXPECT_NEAR(3.0, ratio, 0.02);
}

TEST_F(CaptureSettings, TheHeaderTellsTheSettingsInForce) {
    UseScenario("mono");

    const FitsFile file(Grab("a.fits", {"--set", "exposure=20ms",
                                        "--set", "gain-db=6",
                                        "--set", "binning=2",
                                        "--set", "roi-x=10",
                                        "--set", "roi-y=20",
                                        "--set", "roi-width=100",
                                        "--set", "roi-height=50",
                                        "--set", "image-format=mono16",
                                        "--set", "readout-speed=10MHz",
                                        "--set", "cooling=-10C"}));

    EXPECT_DOUBLE_EQ(0.02, ReadFitsNumber(file.Get(), "EXPTIME"));
    EXPECT_DOUBLE_EQ(6, ReadFitsNumber(file.Get(), "GAINDB"));
    EXPECT_EQ(2, ReadFitsNumber(file.Get(), "XBINNING"));
    EXPECT_EQ(2, ReadFitsNumber(file.Get(), "YBINNING"));
    EXPECT_EQ(10, ReadFitsNumber(file.Get(), "XORGSUBF"));
    EXPECT_EQ(20, ReadFitsNumber(file.Get(), "YORGSUBF"));
    EXPECT_EQ(100, ReadFitsNumber(file.Get(), "NAXIS1"));
    EXPECT_EQ(50, ReadFitsNumber(file.Get(), "NAXIS2"));
    EXPECT_EQ("Mono 16-Bit", ReadFitsText(file.Get(), "IMGFORM"));
    EXPECT_EQ("10 MHz", ReadFitsText(file.Get(), "READOUTM"));
    EXPECT_EQ(-10, ReadFitsNumber(file.Get(), "SET-TEMP"));
    EXPECT_NE(ReadFitsNumber(FitsFile(Grab("b.fits")).Get(), "GAIN"),
              ReadFitsNumber(file.Get(), "GAIN"));
}

TEST_F(CaptureSettings, TheHeaderTellsTheBinningOfEachDirection) {
    UseScenario("metrona");

    const FitsFile file(
        Grab("a.fits", {"--set", "horizontal-binning=4", "--set", "vertical-binning=2"}));

    EXPECT_EQ(4, ReadFitsNumber(file.Get(), "XBINNING"));
    EXPECT_EQ(2, ReadFitsNumber(file.Get(), "YBINNING"));
}

TEST_F(CaptureSettings, OnlyImagesOfThreeColoursAreToldToBePostProcessed) {
    const auto isProcessed = [&](const std::string& path) {
        int status = 0, truth = -1;
        fits_read_key_log(FitsFile(path).Get(), "POSTPROC", &truth, nullptr, &status);
        return truth;
    };
    const std::string colour = Grab("colour.fits", {"--colour"});
    UseScenario("mono");
    const std::string mono = Grab("mono.fits", {"--set", "do-post-processing=on"});

    EXPECT_EQ(1, isProcessed(colour));
    EXPECT_EQ(0, isProcessed(mono));
}

TEST_F(CaptureSettings, AStreamTakesSettingsToo) {
    const ProgramResult result = Run({"stream", "0", "-n", "2", "-o", folder.GetPath("s.fits"),
                                      "--set", "exposure=20ms", "--set", "roi-width=64"});

    // Without a clock of its own the camera may run ahead of a busy machine, which is code 6.
    ASSERT_THAT(result.exitCode, testing::AnyOf(0, 6)) << result.errors;
    const FitsFile file(folder.GetPath("s-000002.fits"));
    EXPECT_DOUBLE_EQ(0.02, ReadFitsNumber(file.Get(), "EXPTIME"));
    EXPECT_EQ(64, ReadFitsNumber(file.Get(), "NAXIS1"));
}

TEST_F(CaptureSettings, InTheModeOfTheSoftwareTriggerEachImageIsTriggered) {
    const std::vector<std::string> trigger{"--set", "trigger-type=software", "--timeout", "30"};
    std::vector<std::string> stream{"stream", "0", "-n", "3"};
    stream.insert(stream.end(), trigger.begin(), trigger.end());

    Grab("a.fits", trigger);

    const ProgramResult result = Run(stream);
    EXPECT_EQ(0, result.exitCode) << result.errors;
    EXPECT_THAT(result.output, testing::StartsWith("3 frames"));
}

TEST_F(CaptureSettings, ATriggeredImageThatDoesNotComeEndsWithCode1) {
    UseScenario("mono", R"({"kind": "losePacket", "packet": 0, "count": 0})");

    const ProgramResult result = Run({"grab", "-o", folder.GetPath("a.fits"), "--set",
                                      "trigger-type=software", "--timeout", "0.5"});

    EXPECT_EQ(1, result.exitCode);
    EXPECT_THAT(result.errors, HasSubstr("no image came within 0.5 s"));
}

TEST_F(CaptureSettings, TheNumberOfTheCameraMayStandBehindASetting) {
    const ProgramResult result =
        Run({"grab", "-o", folder.GetPath("a.fits"), "--set", "roi-width=64", "1"});

    EXPECT_EQ(3, result.exitCode);
    EXPECT_THAT(result.errors, HasSubstr("there is no camera 1"));
}

TEST_F(CaptureSettings, AValueThatTheCameraMendsIsToldAndTheImageIsTaken) {
    const std::string path = folder.GetPath("a.fits");

    const ProgramResult result = Run({"grab", "-o", path, "--set", "roi-width=101"});

    EXPECT_EQ(0, result.exitCode);
    EXPECT_THAT(result.errors,
                HasSubstr("roi-width: 101 px was asked for, 100 px is what it becomes"));
    EXPECT_EQ(100, ReadFitsNumber(FitsFile(path).Get(), "NAXIS1"));
}

TEST_F(CaptureSettings, ARefusedSettingEndsWithCode2AndNoImageIsTaken) {
    for (const std::string assignment : {"exposure=1ns", "exposre=1ms", "fan=full", "binning"}) {
        for (const std::vector<std::string>& command :
             {std::vector<std::string>{"grab", "-o", folder.GetPath("a.fits")},
              {"stream", "-n", "1", "-o", folder.GetPath("a.fits")}}) {
            std::vector<std::string> arguments = command;
            arguments.insert(arguments.end(), {"--set", assignment});

            const ProgramResult result = Run(arguments);

            EXPECT_EQ(2, result.exitCode) << assignment;
            EXPECT_THAT(result.output, IsEmpty());
            EXPECT_THAT(folder.ListFiles(), testing::ElementsAre("scenario.json"));
        }
    }
}

TEST_F(CaptureSettings, ASendThatTheCameraFailsEndsWithCode1AndNoImage) {
    // The first write behind those of the set-up fails.
    const TracedScenario read("{}");
    ASSERT_EQ(0, RunProgram({"info", "--simulation", read.GetName()}).exitCode);
    const std::size_t writes = CountWrites(read.GetTrace());
    const TracedScenario failing(
        R"({"faults": [{"kind": "failRequest", "code": "FW_IOCTL_ASYNC_WRITE", "request": )" +
        std::to_string(writes + 1) + "}]}");

    const ProgramResult result = RunProgram({"grab", "-o", folder.GetPath("a.fits"), "--set",
                                             "exposure=1s", "--simulation", failing.GetName()});

    EXPECT_EQ(1, result.exitCode);
    EXPECT_THAT(result.errors, HasSubstr("the camera does not take all settings"));
    EXPECT_THAT(ReadFile(folder.GetPath("a.fits")), IsEmpty());
}

}  // namespace
}  // namespace ZentaraTest
