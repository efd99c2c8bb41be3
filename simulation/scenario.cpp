#include "simulation/scenario.h"

#include <cstdio>

namespace ZV::Simulation {
namespace {

constexpr std::uint64_t UniqueIdBase = 0x0011F40000A10000;

double GetFullWell(std::uint32_t sensorId) {
    if (sensorId == 4 || sensorId == 5) return 36000;
    if (sensorId == 8 || sensorId == 9) return 10000;
    if (sensorId >= 20 && sensorId <= 75) return 80000;
    if (sensorId == 76 || sensorId == 77) return 55000;
    return 22000;
}

CameraScenario MakeNamed(std::string_view model) {
    return MakeCamera(*FindModel(model));
}

void AddMono(Scenario* scenario) {
    scenario->cameras.push_back(MakeNamed("SolvaneA1"));
}

void AddColour(Scenario* scenario) {
    scenario->cameras.push_back(MakeNamed("PellanA1"));
    // The first exposure shows all patches of the chart: its white stays below the full well.
    scenario->cameras.back().scene.brightness = 4e5;
}

void AddWheel(Scenario* scenario) {
    AddMono(scenario);
    scenario->cameras.back().scene.kind = "chart";
}

void AddFolary(Scenario* scenario) {
    scenario->cameras.push_back(MakeNamed("Folary"));
}

void AddMetrona(Scenario* scenario) {
    scenario->cameras.push_back(MakeNamed("Metrona"));
}

void AddIntensified(Scenario* scenario) {
    scenario->cameras.push_back(MakeNamed("SolvaneK1"));
}

void AddS400(Scenario* scenario) {
    AddMono(scenario);
    scenario->buses.front().speed = 400;
}

// First generation: exposures in microseconds, blocks of fixed packet sizes, version 0 packets.
void AddOld(Scenario* scenario) {
    AddMono(scenario);
    CameraScenario& camera = scenario->cameras.back();
    camera.versions.configuration = MakeVersion(1, 2);
    camera.versions.control = MakeVersion(1, 2);
    camera.versions.command = MakeVersion(1, 1);
    camera.versions.status = MakeVersion(1, 1);
    camera.firmwareVersion = 90;
    camera.firmwareBuild = 1;
    camera.streamingVersion = 0;
}

void AddRotated(Scenario* scenario) {
    scenario->cameras.push_back(MakeNamed("SolvaneD1"));
}

void AddLarge(Scenario* scenario) {
    CameraScenario camera = MakeNamed("SolvaneC2");
    camera.sensorId = 68;
    camera.sensor.width = 4008;
    camera.sensor.height = 2672;
    camera.sensor.colourKind = ColourKind::Bayer;
    camera.scene.kind = "chart";
    scenario->cameras.push_back(camera);
}

void AddTen(Scenario* scenario) {
    for (int i = 0; i < 10; ++i) AddMono(scenario);
}

void AddNone(Scenario*) {}

void AddHeld(Scenario* scenario) {
    AddMono(scenario);
    AddColour(scenario);
    scenario->cameras.back().heldFrom = 1;
}

struct BuiltIn {
    std::string_view name;
    void (*add)(Scenario*);
};
constexpr BuiltIn BuiltIns[] = {
    {"mono", AddMono},     {"colour", AddColour},   {"wheel", AddWheel},
    {"folary", AddFolary}, {"metrona", AddMetrona}, {"intensified", AddIntensified},
    {"s400", AddS400},     {"old", AddOld},         {"rotated", AddRotated},
    {"large", AddLarge},   {"ten", AddTen},         {"empty", AddNone},
    {"held", AddHeld},
};

void FinishCamera(const Scenario& scenario, std::uint32_t position, CameraScenario* camera) {
    char text[96];
    if (camera->serial.empty()) {
        std::snprintf(text, sizeof text, "S%04u-%05u", camera->modelId, 10001 + position);
        camera->serial = text;
    }
    if (camera->uniqueId == 0) camera->uniqueId = UniqueIdBase + position + 1;
    if (camera->seed == 0) camera->seed = scenario.seed * 1000003 + position + 1;
    camera->sensor.seed = camera->seed;
    if (camera->path.empty()) {
        std::snprintf(text, sizeof text,
                      "\\\\?\\1394#simulated&%016llx#%u#{e262a0c7-fd57-44a1-a9d3-8806349a39da}",
                      static_cast<unsigned long long>(camera->uniqueId), position);
        camera->path = text;
    }
    if (camera->path.size() < camera->pathLength) camera->path.resize(camera->pathLength, 'x');
}

}  // namespace

CameraScenario MakeCamera(const ModelRow& model) {
    CameraScenario camera;
    camera.modelId = model.id;
    camera.versions.configuration = model.configurationVersion;
    camera.versions.control = model.controlVersion;
    camera.sensorId = model.sensorId;
    camera.sensor.width = model.width;
    camera.sensor.height = model.height;
    camera.sensor.maxBitDepth = model.maxBitDepth;
    camera.sensor.colourKind = static_cast<ColourKind>(model.colourKind);
    camera.sensor.fullWell = GetFullWell(model.sensorId);
    camera.sensor.binsWithinMosaic = model.id == ModelFolary;
    camera.scene.kind = camera.sensor.colourKind == ColourKind::Bayer ? "chart" : "stars";
    camera.streamingVersion = model.streamingVersion;
    camera.tag = model.tag;
    return camera;
}

bool MakeBuiltInScenario(std::string_view name, Scenario* scenario) {
    constexpr std::string_view ModelPrefix = "model:";
    if (name.starts_with(ModelPrefix)) {
        const ModelRow* model = FindModel(name.substr(ModelPrefix.size()));
        if (model == nullptr) return false;
        scenario->cameras.push_back(MakeCamera(*model));
        return true;
    }
    for (const BuiltIn& builtIn : BuiltIns) {
        if (name != builtIn.name) continue;
        builtIn.add(scenario);
        return true;
    }
    return false;
}

void FinishScenario(Scenario* scenario) {
    std::uint32_t position = 0;
    for (CameraScenario& camera : scenario->cameras) FinishCamera(*scenario, position++, &camera);
}

}  // namespace ZV::Simulation
