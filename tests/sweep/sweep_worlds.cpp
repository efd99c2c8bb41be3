#include "sweep/sweep_worlds.h"

#include <cstdlib>
#include <iterator>
#include <string>

#include "support/scoped_variable.h"
#include "support/stored_settings.h"
#include "support/temporary_folder.h"
#include "zentara/zentara.h"

namespace ZV::Test {

constexpr std::string_view OtherCamera =
    R"(, {"model": "Folary", "sensor": {"width": 64, "height": 48, "noise": false}})";

const SweepCamera SweepCameras[16] = {
    {"mono", "mono", "", "", zfmtMono8, "", 0, true},
    {"old", "old", "", "", zfmtMono8, "", 0, true},
    {"rotated", "rotated", "", R"(, "idlePackets": false)", zfmtMono16, "", 0, true},
    {"folary", "folary", "", "", zfmtBayer8, "", zfmtRGB24, true},
    {"metrona", "metrona", "", R"(, "idlePackets": false)", zfmtMono16, "", 0, true},
    {"intensified", "intensified", "", R"(, "writes": "atOnce")", zfmtMono8, "", 0, true},
    {"colour", "colour", "", R"(, "versions": {"status": "1.1", "command": "1.1"})", zfmtBayer8, "",
     zfmtRGB24, true},
    {"wheel", "model:SolvaneG2", "", R"(, "versions": {"control": "2.3", "configuration": "2.7"})",
     zfmtRGBPlane8, "", zfmtRGB24, true},
    {"s400", "model:SolvaneF1", "", R"(, "speed": 400, "streamingVersion": 0)", zfmtMono16, "", 0,
     true},
    {"tirel", "model:TirelM1", "", R"(, "streamingVersion": 2)", zfmtMono8, "", 0, true},
    {"dithered", "model:PellanB1", "", "", zfmtMono16, "", 0, false},
    {"multiplied", "model:SolvaneJ1", "", "", zfmtMono8, "", 0, false},
    // By its sensor it answers as another model.
    {"masked", "mono", R"(, "id": 46)", "", zfmtMono8, "", 0, false},
    {"two", "mono", "", "", zfmtMono8, OtherCamera, 0, false},
    {"logged", "mono", "", "", zfmtMono8, "", 0, false, LogTarget::File},
    {"told", "mono", "", "", zfmtMono8, "", 0, false, LogTarget::DebuggerOutput},
};

namespace {

std::string MakeScenario(const SweepCamera& camera) {
    return R"({"base": ")" + std::string(camera.base) +
           R"(", "timeScale": 0, "cameras": [{"sensor": {"width": 64, "height": 48, "noise": false)" +
           std::string(camera.sensor) + R"(}, "scene": {"kind": "chart", "brightness": 400000})" +
           std::string(camera.extra) + "}" + std::string(camera.others) + "]}";
}

/// What the log is told to tell, and where: in files in the folder of the scenarios.
void SelectLog(const TemporaryFolder& folder, LogTarget target) {
    static const StoredSettings settings;
    static ScopedVariable debuggerOutput("ZENTARA_DEBUG_OUTPUT", nullptr);
    settings.Remove();
    debuggerOutput.Set(nullptr);
    if (target == LogTarget::None) return;
    std::string lines =
        "outputEnabled = 1\noutputNestedCalls = 1\noutputSettings = 1\noutputGetInfo = 1\n"
        "outputFrame = 1\noutputSparseTable = 1\n";
    if (target == LogTarget::File) {
        lines += "outputToFile = 1\noutputFilePath = " + folder.GetPath("zentara.log") + "\n";
    } else {
        debuggerOutput.Set(folder.GetPath("debugger.txt").c_str());
    }
    settings.Write(lines);
}

}  // namespace

void SelectCamera(std::size_t camera) {
    static const TemporaryFolder folder;
    static std::size_t selected = std::size(SweepCameras);
    if (selected == camera) return;
    const SweepCamera& world = SweepCameras[camera];
    const std::string path =
        folder.WriteFile(std::string(world.name) + ".json", MakeScenario(world));
    setenv("ZENTARA_SIMULATION", path.c_str(), 1);
    SelectLog(folder, world.log);
    selected = camera;
}

}  // namespace ZV::Test
