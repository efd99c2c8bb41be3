#include <gtest/gtest.h>

#include <array>
#include <cstdio>
#include <cstdlib>
#include <functional>
#include <regex>
#include <string>

#include "support/flat_camera.h"
#include "support/log_text.h"
#include "support/stored_settings.h"
#include "support/temporary_folder.h"

// The log as a client's user sees it: switches in the settings store, a file at the end. Each
// session runs in a process of its own, since the depth of calls is that of the process and other
// tests leave it too high or too low on purpose.

namespace ZV::Test {
namespace {

constexpr char AllDumps[] =
    "outputSettings = 1\noutputGetInfo = 1\noutputFrame = 1\noutputSparseTable = 1\n";

/// A world with one small camera and with the log to a file.
class LoggedWorld {
  public:
    explicit LoggedWorld(const std::string& switches)
        : settings("outputEnabled = 1\noutputToFile = 1\noutputFilePath = " +
                   folder.GetPath("log.txt") + "\n" + switches) {}

    /// The records, without the number of the frame, which depends on how far the camera was.
    std::string DescribeFile() const {
        return std::regex_replace(DescribeLog(folder.ReadFile("log.txt")),
                                  std::regex(R"(Frame Number: \d+)"), "Frame Number: <number>");
    }

  private:
    TemporaryFolder folder;
    StoredSettings settings;
    SimulationWorld world{SmallMono};
};

/// Runs `body` in a process of its own; what it returns is what went wrong.
void RunAlone(const std::function<std::string()>& body) {
    testing::FLAGS_gtest_death_test_style = "threadsafe";
    EXPECT_EXIT(
        {
            const std::string trouble = body();
            (void)std::fputs(trouble.c_str(), stderr);
            std::_Exit(trouble.empty() ? 0 : 1);
        },
        testing::ExitedWithCode(0), "");
}

std::string CompareWithGolden(const char* name, const std::string& text) {
    const testing::AssertionResult result = MatchesGolden(name, text);
    return result ? "" : result.message();
}

void EditSettings(Zentara_Settings& settings) {
    std::uint32_t value = 0;
    std::uint64_t exposure = 0;
    std::array<std::uint32_t, 20> table{};
    auto size = static_cast<std::int32_t>(table.size());
    (void)Zentara_GetParamSparseTable(&settings, zprmBinning, table.data(), &size);
    (void)Zentara_SetParam(&settings, zprmBinning, 2);
    (void)Zentara_SetParam(&settings, zprmRegisterTweak + 1, 0);
    (void)Zentara_SetParamS32(&settings, zprmS32AbsoluteOffset, 5);
    (void)Zentara_SetParam64(&settings, zprm64Exposure, 10000000);
    (void)Zentara_GetParam(&settings, zprmExposure, &value);
    (void)Zentara_GetParam64Max(&settings, zprm64Exposure, &exposure);
}

void AskCamera(ZentaraHandle handle) {
    std::uint32_t value = 0;
    std::array<char, 64> text{};
    for (const std::uint32_t key :
         {zinfCameraType, zinfImageSize, zinfPostProcessImageSize, zinfIntensifierModel}) {
        (void)Zentara_GetInfo(handle, key, &value);
    }
    (void)Zentara_GetSerialString(handle, text.data(), static_cast<std::uint32_t>(text.size()));
    (void)Zentara_GetCameraModelString(handle, text.data(),
                                       static_cast<std::uint32_t>(text.size()));
    (void)Zentara_GetCameraModelString(handle, text.data(), 1);
}

/// What a client asks of the library alone. Each question about a format has both answers.
void AskLibrary() {
    std::uint16_t major = 0, minor = 0, build = 0;
    (void)Zentara_Version(&major, &minor);
    (void)Zentara_LibVersion(&major, &minor, &build);
    for (const std::uint32_t format : {zfmtMono16, zfmtBayer8, zfmtRGB48}) {
        (void)Zentara_is16bit(format);
        (void)Zentara_is3Color(format);
        (void)Zentara_isBayer(format);
        (void)Zentara_isColor(format);
        (void)Zentara_isMonochrome(format);
    }
    (void)Zentara_CalcImageSize(zfmtRGB48, 0x10000, 0x4000);
}

/// Loads, lists, opens, asks, edits, sends, takes an image and undoes it all.
void RunClient() {
    (void)Zentara_LoadDriver();
    std::array<Zentara_CamListItem, 4> items{};
    auto length = static_cast<std::uint32_t>(items.size());
    ZentaraHandle handle{};
    (void)Zentara_ListCameras(items.data(), &length);
    (void)Zentara_OpenCamera(0, &handle);
    (void)Zentara_OpenCamera(0, &handle);
    (void)Zentara_OpenCamera(7, &handle);
    AskLibrary();
    AskCamera(handle);
    Zentara_Settings settings{};
    (void)Zentara_ReadDefaultSettings(handle, &settings);
    (void)Zentara_ReadSettingsFromCam(handle, &settings);
    EditSettings(settings);
    (void)Zentara_SendSettingsToCam(handle, &settings);
    (void)Zentara_SendSettingsToCam(handle, &settings);
    (void)Zentara_SetParam(&settings, zprmRoiY, 4000);
    (void)Zentara_SetParam64(&settings, zprm64Exposure, 1);
    (void)Zentara_PreflightSettings(handle, &settings);
    ClientFrame frame(64 * 48);
    (void)Zentara_GrabFrame(handle, frame.Get());
    (void)Zentara_QueueFrame(handle, nullptr, nullptr, 0, 0, 0);
    (void)Zentara_Trigger(handle);
    (void)Zentara_SetStreaming(handle, 0);
    (void)Zentara_Abort(handle);
    (void)Zentara_CloseCamera(handle);
    (void)Zentara_CloseCamera(handle);
    (void)Zentara_ReleaseDriver();
}

TEST(LogOfASession, ShowsItsOutermostCallsWithTheirDumps) {
    RunAlone([] {
        const LoggedWorld world(AllDumps);
        RunClient();
        return CompareWithGolden("system/golden/log_session.txt", world.DescribeFile());
    });
}

TEST(LogOfASession, ShowsNestedCallsBySwitch) {
    RunAlone([] {
        const LoggedWorld world("outputNestedCalls = 1\n");
        RunClient();
        return CompareWithGolden("system/golden/log_session_nested.txt", world.DescribeFile());
    });
}

/// A frame of each kind of callback through the queue and one settings change at once.
std::string RunStream() {
    // Nested calls too: the threads' calls raise one common depth, which may drift.
    const LoggedWorld world("outputFrame = 1\noutputNestedCalls = 1\n");
    (void)Zentara_LoadDriver();
    std::array<Zentara_CamListItem, 4> items{};
    auto length = static_cast<std::uint32_t>(items.size());
    ZentaraHandle handle{};
    Zentara_Settings settings{};
    (void)Zentara_ListCameras(items.data(), &length);
    (void)Zentara_OpenCamera(0, &handle);
    (void)Zentara_ReadSettingsFromCam(handle, &settings);
    (void)Zentara_QueueSettings(handle, &settings, nullptr, 0, 0, 0);
    CallbackLog calls;
    ClientFrame frame(64 * 48);
    (void)Zentara_QueueFrame(handle, frame.Get(), CallbackLog::Record, zcbFrameDone | zcbExposeDone,
                             calls.GetPrivate(), 7);
    (void)Zentara_SetStreaming(handle, 1);
    const bool isServed = calls.WaitForCalls(2);
    (void)Zentara_SetStreaming(handle, 1);
    (void)Zentara_SetStreaming(handle, 0);
    Zentara_ReleaseDriver();
    return isServed ? world.DescribeFile() : "";
}

TEST(LogOfASession, ShowsTheCallbacksOfAStream) {
    RunAlone([]() -> std::string {
        const std::string text = RunStream();
        for (const char* record :
             {"<time> ImageReceived start|\n", "<time> ImageReceived end (error code 0)\\n",
              "<time> Zentara_SetStreaming - Streaming is now on|\n",
              "<time> Zentara_SetStreaming - Streaming is already on|\n",
              "<time> Zentara_SetStreaming - Streaming is now off|\n",
              "<time> Zentara_QueueSettings - Queue was empty, so settings change applied "
              "immediately|\n"}) {
            if (text.find(record) == std::string::npos) return std::string(record) + "in\n" + text;
        }
        // Records of the exposure thread may stand between those of the frame.
        std::size_t place = 0;
        for (const char* record :
             {"<time> Zentara_Frame structure:|\n", "<time> pBuffer: <address>|\n",
              "<time> Buffer size: 3072|\n", "<time> Format: 2|\n", "<time> Width: 64|\n"}) {
            place = text.find(record, place);
            if (place == std::string::npos) return std::string(record) + "in order in\n" + text;
        }
        // Kept: a frame that is queued is silent.
        return text.find("Zentara_QueueFrame") == std::string::npos ? "" : text;
    });
}

}  // namespace
}  // namespace ZV::Test
