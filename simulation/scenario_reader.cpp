#include "simulation/scenario_reader.h"

#include <filesystem>
#include <fstream>

#include "simulation/configuration.h"
#include "simulation/fault_reader.h"
#include "simulation/json_node.h"
#include "simulation/regular_file.h"

namespace ZV::Simulation {
namespace {

constexpr std::size_t ScenarioBytesMax = 4 << 20;
constexpr std::size_t CamerasMax = 64;
constexpr std::uint64_t SensorSizeMax = 16384;
constexpr std::size_t SerialCharactersMax = 28;
constexpr std::uint32_t PathLengthMax = 4096;

using Quadlets = std::map<std::uint32_t, std::uint32_t>;

// Quadlets of a block, by their numbers as keys.
void ReadQuadlets(const JsonNode& node, Quadlets* quadlets) {
    if (!node.CheckObject()) return;
    for (const auto& [name, value] : node.GetValue().items()) {
        const JsonNode::Json number = name;
        const JsonNode child = node.GetChild(name);
        std::uint32_t word = 0, quadlet = BlockQuadlets;
        ReadFailure ignored;
        JsonNode(number, "", &ignored).Get(&quadlet, 0, BlockQuadlets - 1);
        if (quadlet == BlockQuadlets) return child.Fail("the key is no quadlet, 0 to 255");
        child.Get(&word);
        (*quadlets)[quadlet] = word;
    }
}

// "major.minor", or the word as a number.
void ReadVersion(const JsonNode& node, std::uint32_t* version) {
    const JsonNode::Json& value = node.GetValue();
    const std::string text = value.is_string() ? value.get<std::string>() : "";
    const std::size_t point = text.find('.');
    if (point == std::string::npos) return node.Get(version);
    std::uint32_t major = 0, minor = 0;
    ReadFailure failure;
    const JsonNode::Json majorText = text.substr(0, point), minorText = text.substr(point + 1);
    JsonNode(majorText, "", &failure).Get(&major, 0, 65535);
    JsonNode(minorText, "", &failure).Get(&minor, 0, 65535);
    if (failure.HasFailed()) return node.Fail("a version such as \"2.9\" is wanted");
    *version = MakeVersion(major, minor);
}

template <std::uint32_t BlockVersions::*Member>
void ReadBlockVersion(const JsonNode& node, BlockVersions* versions) {
    ReadVersion(node, &(versions->*Member));
}

constexpr JsonKey<BlockVersions> VersionKeys[] = {
    {"directory", ReadBlockVersion<&BlockVersions::directory>},
    {"configuration", ReadBlockVersion<&BlockVersions::configuration>},
    {"control", ReadBlockVersion<&BlockVersions::control>},
    {"stream", ReadBlockVersion<&BlockVersions::stream>},
    {"command", ReadBlockVersion<&BlockVersions::command>},
    {"status", ReadBlockVersion<&BlockVersions::status>},
};

using Sensors = SensorDescription;

void ReadColour(const JsonNode& node, Sensors* sensor) {
    constexpr std::string_view Names[] = {"mono", "bayer"};
    auto choice = static_cast<std::size_t>(sensor->colourKind);
    node.GetChoice(&choice, Names);
    sensor->colourKind = static_cast<ColourKind>(choice);
}

void ReadMosaic(const JsonNode& node, Sensors* sensor) {
    constexpr std::string_view Names[] = {"RGGB", "GRBG", "GBRG", "BGGR"};
    constexpr std::uint32_t FirstMosaic = 5;
    std::size_t choice = sensor->mosaic - FirstMosaic;
    node.GetChoice(&choice, Names);
    sensor->mosaic = FirstMosaic + static_cast<std::uint32_t>(choice);
}

constexpr JsonKey<CameraScenario> SensorKeys[] = {
    {"id", [](const JsonNode& n, CameraScenario* c) { n.Get(&c->sensorId, 0, 65535); }},
    {"width",
     [](const JsonNode& n, CameraScenario* c) { n.Get(&c->sensor.width, 1, SensorSizeMax); }},
    {"height",
     [](const JsonNode& n, CameraScenario* c) { n.Get(&c->sensor.height, 1, SensorSizeMax); }},
    {"maxBitDepth",
     [](const JsonNode& n, CameraScenario* c) { n.Get(&c->sensor.maxBitDepth, 8, 16); }},
    {"colour", [](const JsonNode& n, CameraScenario* c) { ReadColour(n, &c->sensor); }},
    {"mosaic", [](const JsonNode& n, CameraScenario* c) { ReadMosaic(n, &c->sensor); }},
    {"fullWell", [](const JsonNode& n, CameraScenario* c) { n.Get(&c->sensor.fullWell, 1, 1e9); }},
    {"readNoise",
     [](const JsonNode& n, CameraScenario* c) { n.Get(&c->sensor.readNoise, 0, 1e6); }},
    {"darkCurrent",
     [](const JsonNode& n, CameraScenario* c) { n.Get(&c->sensor.darkCurrentAt20, 0, 1e9); }},
    {"noise", [](const JsonNode& n, CameraScenario* c) { n.Get(&c->sensor.hasNoise); }},
    {"videoBinning",
     [](const JsonNode& n, CameraScenario* c) { n.Get(&c->sensor.videoBinning, 1, 16); }},
};

void ReadSceneKind(const JsonNode& node, SceneDescription* scene) {
    constexpr std::string_view Names[] = {"flat", "ramp", "chart", "stars", "image"};
    std::size_t choice = std::size(Names);
    node.GetChoice(&choice, Names);
    if (choice < std::size(Names)) scene->kind = Names[choice];
}

void ReadLight(const JsonNode& node, SceneDescription* scene) {
    if (!node.CheckArray()) return;
    if (node.GetValue().size() != std::size(scene->light)) {
        return node.Fail("three factors are wanted: red, green, blue");
    }
    for (std::size_t i = 0; i < std::size(scene->light); ++i) {
        node.GetElement(i).Get(&scene->light[i], 0, 1000);
    }
}

constexpr JsonKey<SceneDescription> SceneKeys[] = {
    {"kind", ReadSceneKind},
    {"path", [](const JsonNode& n, SceneDescription* s) { n.Get(&s->path); }},
    {"brightness", [](const JsonNode& n, SceneDescription* s) { n.Get(&s->brightness, 0, 1e15); }},
    {"level", [](const JsonNode& n, SceneDescription* s) { n.Get(&s->level, 0, 1); }},
    {"light", ReadLight},
    {"starCount", [](const JsonNode& n, SceneDescription* s) { n.Get(&s->starCount, 0, 100000); }},
};

void ReadScene(const JsonNode& node, CameraScenario* camera) {
    ReadObject<SceneDescription>(node, SceneKeys, &camera->scene);
    if (camera->scene.kind == "image" && camera->scene.path.empty()) {
        node.Fail("the key \"path\" is missing");
    }
}

constexpr JsonKey<AlternateConfiguration> AlternateKeys[] = {
    {"controlQuadlet",
     [](const JsonNode& n, AlternateConfiguration* a) {
         n.Get(&a->controlQuadlet, 1, BlockQuadlets - 1);
     }},
    {"mask", [](const JsonNode& n, AlternateConfiguration* a) { n.Get(&a->mask); }},
    {"value", [](const JsonNode& n, AlternateConfiguration* a) { n.Get(&a->value); }},
    {"configuration",
     [](const JsonNode& n, AlternateConfiguration* a) { ReadQuadlets(n, &a->quadlets); }},
};

void ReadAlternate(const JsonNode& node, CameraScenario* camera) {
    ReadObject<AlternateConfiguration>(node, AlternateKeys, &camera->alternate);
    if (camera->alternate.controlQuadlet == 0) {
        node.Fail("the key \"controlQuadlet\" is missing");
    }
}

struct OpenRange {
    std::uint64_t from = 1, to = 0;
};
constexpr JsonKey<OpenRange> HeldKeys[] = {
    {"from", [](const JsonNode& n, OpenRange* r) { n.Get(&r->from, 1); }},
    {"to", [](const JsonNode& n, OpenRange* r) { n.Get(&r->to, 1); }},
};

void ReadHeld(const JsonNode& node, CameraScenario* camera) {
    OpenRange range;
    bool isHeld = true;
    if (node.GetValue().is_object()) {
        ReadObject<OpenRange>(node, HeldKeys, &range);
        if (range.to != 0 && range.to < range.from) node.Fail("\"to\" lies before \"from\"");
    } else {
        node.Get(&isHeld);
    }
    camera->heldFrom = isHeld ? range.from : 0;
    camera->heldTo = range.to;
}

void ReadIdentity(const JsonNode& node, CameraScenario* camera) {
    camera->hasIdentity = true;
    node.Get(&camera->identity);
}

void ReadIdentityAddress(const JsonNode& node, CameraScenario* camera) {
    constexpr std::string_view Names[] = {"primary", "secondary", "both", "none"};
    std::size_t choice = 0;
    node.GetChoice(&choice, Names);
    camera->identityPlace = static_cast<IdentityPlace>(choice);
}

void ReadSerial(const JsonNode& node, CameraScenario* camera) {
    node.Get(&camera->serial);
    if (camera->serial.size() > SerialCharactersMax) node.Fail("is longer than 28 bytes");
}

void ReadSpeed(const JsonNode& node, std::uint32_t* speed) {
    std::uint32_t number = 0;
    node.Get(&number);
    if (number != 400 && number != 800) return node.Fail("400 or 800 is wanted");
    *speed = number;
}

void ReadWrites(const JsonNode& node, CameraScenario* camera) {
    constexpr std::string_view Names[] = {"pended", "atOnce"};
    std::size_t choice = 0;
    node.GetChoice(&choice, Names);
    camera->areWritesPended = choice == 0;
}

void ReadFaults(const JsonNode& node, CameraScenario* camera) {
    if (!node.CheckArray()) return;
    for (std::size_t i = 0; i < node.GetValue().size() && !node.HasFailed(); ++i) {
        FaultDescription fault;
        ReadFault(node.GetElement(i), &fault);
        camera->faults.push_back(fault);
    }
}

void IgnoreKey(const JsonNode&, CameraScenario*) {}

void ReadTimeScale(const JsonNode& node, double* timeScale) {
    node.Get(timeScale, 0, 100);
}

constexpr JsonKey<CameraScenario> CameraKeys[] = {
    {"model", IgnoreKey},  // Read before all others.
    {"bus", [](const JsonNode& n, CameraScenario* c) { n.Get(&c->bus, 0, 63); }},
    {"speed", [](const JsonNode& n, CameraScenario* c) { ReadSpeed(n, &c->speed); }},
    {"path", [](const JsonNode& n, CameraScenario* c) { n.Get(&c->path); }},
    {"pathLength",
     [](const JsonNode& n, CameraScenario* c) { n.Get(&c->pathLength, 0, PathLengthMax); }},
    {"plugged", [](const JsonNode& n, CameraScenario* c) { n.Get(&c->isPlugged); }},
    {"identity", ReadIdentity},
    {"identityAddress", ReadIdentityAddress},
    {"serial", ReadSerial},
    {"uniqueId", [](const JsonNode& n, CameraScenario* c) { n.Get(&c->uniqueId, 1); }},
    {"firmwareVersion",
     [](const JsonNode& n, CameraScenario* c) { n.Get(&c->firmwareVersion, 0, 65535); }},
    {"firmwareBuild",
     [](const JsonNode& n, CameraScenario* c) { n.Get(&c->firmwareBuild, 0, 65535); }},
    {"versions",
     [](const JsonNode& n, CameraScenario* c) {
         ReadObject<BlockVersions>(n, VersionKeys, &c->versions);
     }},
    {"strictBlocks", [](const JsonNode& n, CameraScenario* c) { n.Get(&c->hasStrictBlocks); }},
    {"configuration",
     [](const JsonNode& n, CameraScenario* c) { ReadQuadlets(n, &c->configuration); }},
    {"alternate", ReadAlternate},
    {"sensor",
     [](const JsonNode& n, CameraScenario* c) { ReadObject<CameraScenario>(n, SensorKeys, c); }},
    {"scene", ReadScene},
    {"streamingVersion",
     [](const JsonNode& n, CameraScenario* c) { n.Get(&c->streamingVersion, 0, 2); }},
    {"tag", [](const JsonNode& n, CameraScenario* c) { n.Get(&c->tag, 0, 3); }},
    {"seed", [](const JsonNode& n, CameraScenario* c) { n.Get(&c->seed, 1); }},
    {"timeScale", [](const JsonNode& n, CameraScenario* c) { ReadTimeScale(n, &c->timeScale); }},
    {"idlePackets", [](const JsonNode& n, CameraScenario* c) { n.Get(&c->hasIdlePackets); }},
    {"waitsForBuffers", [](const JsonNode& n, CameraScenario* c) { n.Get(&c->waitsForBuffers); }},
    {"ringWindow", [](const JsonNode& n, CameraScenario* c) { n.Get(&c->ringWindow, 1, 61); }},
    {"triggerPeriod",
     [](const JsonNode& n, CameraScenario* c) { n.Get(&c->triggerPeriodMs, 0, 1e9); }},
    {"writes", ReadWrites},
    {"held", ReadHeld},
    {"faults", ReadFaults},
};

// By class name or id.
const ModelRow* ReadModel(const JsonNode& node) {
    const JsonNode::Json& value = node.GetValue();
    if (value.is_string()) {
        if (const ModelRow* model = FindModel(value.get<std::string>())) return model;
    }
    std::uint32_t id = 0;
    if (value.is_number_unsigned()) {
        node.Get(&id, 0, 65535);
        if (GetModel(id).id == id) return &GetModel(id);
    }
    node.Fail("is no model's class name or id");
    return nullptr;
}

// Over a camera of the base, or a new one at the end.
void ReadCamera(const JsonNode& node, std::size_t position, double timeScale, Scenario* scenario) {
    if (!node.CheckObject()) return;
    const bool isNew = position >= scenario->cameras.size();
    if (isNew && !node.Has("model")) return node.Fail("the key \"model\" is missing");
    if (isNew) scenario->cameras.emplace_back();
    CameraScenario& camera = scenario->cameras[position];
    if (node.Has("model")) {
        const ModelRow* model = ReadModel(node.GetChild("model"));
        if (model == nullptr) return;
        camera = MakeCamera(*model);
        camera.timeScale = timeScale;
    }
    ReadObject<CameraScenario>(node, CameraKeys, &camera);
    if (!node.HasFailed() && camera.bus >= scenario->buses.size()) {
        node.GetChild("bus").Fail("there is no such bus");
    }
}

void ReadCameras(const JsonNode& node, double timeScale, Scenario* scenario) {
    if (!node.CheckArray()) return;
    const std::size_t count = node.GetValue().size();
    if (count > CamerasMax) return node.Fail("more than 64 cameras");
    for (std::size_t i = 0; i < count && !node.HasFailed(); ++i) {
        ReadCamera(node.GetElement(i), i, timeScale, scenario);
    }
}

constexpr JsonKey<BusScenario> BusKeys[] = {
    {"speed", [](const JsonNode& n, BusScenario* b) { ReadSpeed(n, &b->speed); }},
    {"bytesPerCycle",
     [](const JsonNode& n, BusScenario* b) { n.Get(&b->bytesPerCycle, 1, 1000000); }},
};

void ReadBuses(const JsonNode& node, Scenario* scenario) {
    if (!node.CheckArray()) return;
    if (node.GetValue().empty() || node.GetValue().size() > CamerasMax) {
        return node.Fail("1 to 64 buses are wanted");
    }
    scenario->buses.assign(node.GetValue().size(), BusScenario{});
    for (std::size_t i = 0; i < scenario->buses.size() && !node.HasFailed(); ++i) {
        ReadObject<BusScenario>(node.GetElement(i), BusKeys, &scenario->buses[i]);
    }
}

constexpr JsonKey<DiscoveryFault> DiscoveryKeys[] = {
    {"step", [](const JsonNode& n, DiscoveryFault* f) { n.Get(&f->step, 1); }},
    {"listing", [](const JsonNode& n, DiscoveryFault* f) { n.Get(&f->listing, 1); }},
    {"error", [](const JsonNode& n, DiscoveryFault* f) { n.Get(&f->error, 1); }},
};

void ReadDiscoveryFaults(const JsonNode& node, Scenario* scenario) {
    if (!node.CheckArray()) return;
    for (std::size_t i = 0; i < node.GetValue().size() && !node.HasFailed(); ++i) {
        DiscoveryFault fault;
        ReadObject<DiscoveryFault>(node.GetElement(i), DiscoveryKeys, &fault);
        scenario->discoveryFaults.push_back(fault);
    }
}

void ReadLater(const JsonNode&, Scenario*) {}

// Those that others build on are read first, in the order that they need.
constexpr JsonKey<Scenario> ScenarioKeys[] = {
    {"base", ReadLater},
    {"timeScale", ReadLater},
    {"buses", ReadLater},
    {"cameras", ReadLater},
    {"seed", [](const JsonNode& n, Scenario* s) { n.Get(&s->seed, 1); }},
    {"trace", [](const JsonNode& n, Scenario* s) { n.Get(&s->trace); }},
    {"discoveryFaults", ReadDiscoveryFaults},
};

void ReadBase(const JsonNode& node, Scenario* scenario) {
    std::string name;
    node.Get(&name);
    if (node.HasFailed()) return;
    if (!MakeBuiltInScenario(name, scenario)) node.Fail("is no built-in scenario");
}

void ReadScenario(const JsonNode& node, Scenario* scenario) {
    ReadObject<Scenario>(node, ScenarioKeys, scenario);
    if (node.HasFailed()) return;
    double timeScale = 1;
    if (node.Has("base")) ReadBase(node.GetChild("base"), scenario);
    if (node.Has("timeScale")) {
        ReadTimeScale(node.GetChild("timeScale"), &timeScale);
        for (CameraScenario& camera : scenario->cameras) camera.timeScale = timeScale;
    }
    if (node.Has("buses")) ReadBuses(node.GetChild("buses"), scenario);
    if (node.Has("cameras")) ReadCameras(node.GetChild("cameras"), timeScale, scenario);
}

bool ReadFile(const std::string& path, std::string* text, std::string* message) {
    std::ifstream file;
    if (MeasureRegularFile(path)) file.open(path, std::ios::binary);
    if (!file.is_open()) {
        *message = "'" + path + "' is neither a built-in scenario nor a file that can be read";
        return false;
    }
    text->resize(ScenarioBytesMax + 1);
    file.read(text->data(), static_cast<std::streamsize>(text->size()));
    text->resize(static_cast<std::size_t>(file.gcount()));
    if (text->size() <= ScenarioBytesMax) return true;
    *message = path + ": is too large for a scenario";
    return false;
}

constexpr bool HasDrives = std::filesystem::path::preferred_separator != '/';
/// What ends a folder's name, or a drive's where there are drives.
constexpr const char* FolderEnds = HasDrives ? "/\\:" : "/";

bool HasRootOrDrive(const std::string& path) {
    const bool hasDrive = HasDrives && path.size() > 1 && path[1] == ':';
    return hasDrive || path.find_first_of(FolderEnds) == 0;
}

// Files that a scenario names lie beside it. Texts are joined, whatever code page their letters are
// of.
void ResolvePaths(const std::string& scenarioPath, Scenario* scenario) {
    const std::size_t folderLength = scenarioPath.find_last_of(FolderEnds) + 1;
    const auto resolve = [&](std::string* path) {
        if (path->empty() || HasRootOrDrive(*path)) return;
        path->insert(0, scenarioPath, 0, folderLength);
    };
    resolve(&scenario->trace);
    for (CameraScenario& camera : scenario->cameras) resolve(&camera.scene.path);
}

bool LoadFile(const std::string& path, Scenario* scenario, std::string* message) {
    std::string text, reason;
    if (!ReadFile(path, &text, message)) return false;
    nlohmann::json document;
    ReadFailure failure;
    if (ParseJson(text, &document, &reason)) {
        ReadScenario(JsonNode(document, "", &failure), scenario);
        reason = failure.message;
    }
    if (!reason.empty()) *message = path + ": " + reason;
    ResolvePaths(path, scenario);
    return reason.empty();
}

}  // namespace

bool LoadScenario(const std::string& name, Scenario* scenario, std::string* message) {
    try {
        *scenario = Scenario{};
        if (!MakeBuiltInScenario(name, scenario) && !LoadFile(name, scenario, message)) {
            return false;
        }
        FinishScenario(scenario);
        return true;
    } catch (const std::exception& error) {
        *message = name + ": " + error.what();
        return false;
    }
}

bool ReadFault(const std::string& json, FaultDescription* fault, std::string* message) {
    nlohmann::json document;
    if (!ParseJson(json, &document, message)) return false;
    ReadFailure failure;
    ReadFault(JsonNode(document, "", &failure), fault);
    *message = failure.message;
    return !failure.HasFailed();
}

}  // namespace ZV::Simulation
