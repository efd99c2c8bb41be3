#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cstdio>
#include <fstream>
#include <string>

#include "simulation/zentara_simulation.h"

namespace ZV::Test {
namespace {

using ::testing::HasSubstr;

// The message about a scenario file with this text; empty when it is accepted.
std::string Check(const std::string& text) {
    const std::string path = ::testing::TempDir() + "scenario_reader_test.json";
    std::ofstream(path, std::ios::binary) << text;
    char message[512] = "";
    const std::uint32_t result = ZentaraSimulation_CheckScenario(path.c_str(), message, 512);
    std::remove(path.c_str());
    EXPECT_EQ(result != 0, message[0] != '\0');
    return message;
}

bool IsAccepted(const std::string& name) {
    return ZentaraSimulation_CheckScenario(name.c_str(), nullptr, 0) == 0;
}

TEST(ScenarioReader, AcceptsEveryBuiltInScenario) {
    for (const char* name : {"mono", "colour", "wheel", "folary", "metrona", "intensified", "s400",
                             "old", "rotated", "large", "ten", "empty", "held"}) {
        EXPECT_TRUE(IsAccepted(name)) << name;
    }
}

TEST(ScenarioReader, AcceptsEachOfThe25ModelsByName) {
    for (const char* name :
         {"SolvaneA1", "SolvaneA2", "DorixB1",   "Folary",    "SolvaneK1", "DorixR1",   "SolvaneC1",
          "SolvaneB1", "PellanA1",  "SolvaneD1", "SolvaneF1", "SolvaneJ1", "SolvaneC2", "SolvaneB2",
          "PellanB1",  "SolvaneE1", "PellanA2",  "SolvaneD2", "SolvaneG2", "SolvaneG1", "TirelM2",
          "TirelM1",   "SolvaneH1", "Metrona",   "Unknown"}) {
        EXPECT_TRUE(IsAccepted(std::string("model:") + name)) << name;
    }
}

TEST(ScenarioReader, RefusesANameThatIsNeitherBuiltInNorAFile) {
    char message[256] = "";

    EXPECT_EQ(1u, ZentaraSimulation_CheckScenario("no such scenario", message, 256));

    EXPECT_THAT(message, HasSubstr("'no such scenario'"));
    EXPECT_FALSE(IsAccepted("model:Nobody"));
    EXPECT_FALSE(IsAccepted(""));
    EXPECT_FALSE(IsAccepted("/"));
}

TEST(ScenarioReader, RefusesADeviceAndAFileOfManyMegabytesWithoutReadingThem) {
    EXPECT_FALSE(IsAccepted("/dev/zero"));
    EXPECT_THAT(Check(std::string(5 << 20, ' ')), HasSubstr("is too large for a scenario"));
}

TEST(ScenarioReader, CutsTheMessageToTheBuffer) {
    char message[8] = "";

    EXPECT_EQ(1u, ZentaraSimulation_CheckScenario("no such scenario", message, sizeof message));

    EXPECT_STREQ("'no suc", message);
}

TEST(ScenarioReader, AcceptsAScenarioWithEveryKey) {
    EXPECT_EQ("", Check(R"({
        "seed": 7, "timeScale": 0, "trace": "trace.jsonl",
        "discoveryFaults": [{"step": 2, "listing": 1, "error": 5}],
        "buses": [{"speed": 400, "bytesPerCycle": 5000}, {}],
        "cameras": [{
            "model": "SolvaneG2", "bus": 1, "speed": 800, "path": "device", "pathLength": 300,
            "plugged": true, "identity": "0x000D0000", "identityAddress": "both",
            "serial": "0123456789", "uniqueId": "0x0011223344556677", "firmwareVersion": 101,
            "firmwareBuild": 3,
            "versions": {"directory": "1.1", "configuration": "2.12", "control": 131080,
                         "stream": "1.2", "command": "1.1", "status": "1.2"},
            "strictBlocks": true, "configuration": {"66": 1, "0x2A": "0x1"},
            "alternate": {"controlQuadlet": 41, "mask": 255, "value": 3, "configuration": {"4": 5}},
            "sensor": {"id": 6, "width": 640, "height": 480, "maxBitDepth": 12, "colour": "bayer",
                       "mosaic": "GBRG", "fullWell": 20000, "readNoise": 5.5, "darkCurrent": 0,
                       "noise": false, "videoBinning": 8},
            "scene": {"kind": "image", "path": "light.png", "brightness": 1e6, "level": 0.25,
                      "light": [1, 0.5, 2], "starCount": 3},
            "streamingVersion": 2, "tag": 0, "seed": 3, "timeScale": 0.5, "idlePackets": false,
            "waitsForBuffers": false, "ringWindow": 8, "triggerPeriod": 20.5, "writes": "atOnce",
            "held": {"from": 2, "to": 3},
            "faults": [{"kind": "failRequest", "code": "FW_IOCTL_LISTEN", "request": 1, "count": 0,
                        "error": 170, "pended": true},
                       {"kind": "shortAnswer", "code": 2236538, "address": "0xD0000000", "bytes": 2},
                       {"kind": "losePacket", "frame": 2, "packet": 7, "probability": 0.5},
                       {"kind": "corruptPacket", "offset": 30, "bytes": 9},
                       {"kind": "unplug", "frame": 3}, {"kind": "unplug", "request": 30},
                       {"kind": "wrongPsn", "frame": 4}]
        }]
    })"));
}

struct BadScenario {
    const char* text;
    const char* place;
};

class BadScenarioTest : public ::testing::TestWithParam<BadScenario> {};

TEST_P(BadScenarioTest, IsRefusedWithItsPlace) {
    EXPECT_THAT(Check(GetParam().text), HasSubstr(GetParam().place));
}

INSTANTIATE_TEST_SUITE_P(
    ScenarioReader, BadScenarioTest,
    ::testing::Values(
        BadScenario{"", "line 1"}, BadScenario{"{\n  \"seed\": }", "line 2, column 11"},
        BadScenario{"[]", "/: an object"}, BadScenario{R"({"sed": 1})", "/sed: "},
        BadScenario{R"({"seed": 1, "seed": 2})", "\"seed\" stands twice"},
        BadScenario{R"({"seed": -1})", "/seed: "}, BadScenario{R"({"seed": 1.5})", "/seed: "},
        BadScenario{R"({"timeScale": 101})", "/timeScale: "},
        BadScenario{R"({"trace": ""})", "/trace: "},
        BadScenario{R"({"base": "nobody"})", "/base: "},
        BadScenario{R"({"cameras": {}})", "/cameras: "},
        BadScenario{R"({"cameras": [{}]})", "/cameras/0: "},
        BadScenario{R"({"cameras": [{"model": "Nobody"}]})", "/cameras/0/model: "},
        BadScenario{R"({"cameras": [{"model": 4}]})", "/cameras/0/model: "},
        BadScenario{R"({"base": "mono", "cameras": [{"bus": 1}]})", "/cameras/0/bus: "},
        BadScenario{R"({"base": "mono", "cameras": [{"speed": 200}]})", "/cameras/0/speed: "},
        BadScenario{R"({"base": "mono", "cameras": [{"a/b": 1}]})", "/cameras/0/a~1b: "},
        BadScenario{R"({"base": "mono", "cameras": [{"serial": "12345678901234567890123456789"}]})",
                    "/cameras/0/serial: "},
        BadScenario{R"({"base": "mono", "cameras": [{"configuration": {"256": 1}}]})",
                    "/cameras/0/configuration/256: "},
        BadScenario{R"({"base": "mono", "cameras": [{"configuration": {"1": 4294967296}}]})",
                    "/cameras/0/configuration/1: "},
        BadScenario{R"({"base": "mono", "cameras": [{"versions": {"control": "2.x"}}]})",
                    "/cameras/0/versions/control: "},
        BadScenario{R"({"base": "folary", "cameras": [{"sensor": {"videoBinning": 17}}]})",
                    "/cameras/0/sensor/videoBinning: "},
        BadScenario{R"({"base": "mono", "cameras": [{"sensor": {"width": 0}}]})",
                    "/cameras/0/sensor/width: "},
        BadScenario{R"({"base": "mono", "cameras": [{"scene": {"kind": "moon"}}]})",
                    "/cameras/0/scene/kind: "},
        BadScenario{R"({"base": "mono", "cameras": [{"scene": {"kind": "image"}}]})",
                    "/cameras/0/scene: "},
        BadScenario{R"({"base": "mono", "cameras": [{"scene": {"light": [1, 2]}}]})",
                    "/cameras/0/scene/light: "},
        BadScenario{R"({"base": "mono", "cameras": [{"held": {"from": 3, "to": 2}}]})",
                    "/cameras/0/held: "},
        BadScenario{R"({"base": "mono", "cameras": [{"alternate": {}}]})",
                    "/cameras/0/alternate: "},
        BadScenario{R"({"base": "mono", "cameras": [{"faults": [{}]}]})", "/cameras/0/faults/0: "},
        BadScenario{R"({"base": "mono", "cameras": [{"faults": [{"kind": "losePacket"},
                        {"kind": "failRequest", "packet": 2}]}]})",
                    "/cameras/0/faults/1/packet: "},
        BadScenario{R"({"base": "mono", "cameras": [{"faults": [{"kind": "losePacket",
                        "probability": 2}]}]})",
                    "/cameras/0/faults/0/probability: "},
        BadScenario{R"({"discoveryFaults": [{"step": 0}]})", "/discoveryFaults/0/step: "},
        BadScenario{R"({"buses": []})", "/buses: "}));

}  // namespace
}  // namespace ZV::Test
