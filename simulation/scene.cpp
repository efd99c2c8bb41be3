#include "simulation/scene.h"

#include "simulation/scene_kinds.h"

namespace ZV::Simulation {
namespace {

struct SceneKind {
    const char* name;
    std::unique_ptr<Scene> (*make)(const SceneRequest&, std::string*);
};

constexpr SceneKind SceneKinds[] = {
    {"flat", MakeFlatScene},  {"ramp", MakeRampScene},   {"chart", MakeChartScene},
    {"stars", MakeStarScene}, {"image", MakeImageScene},
};

}  // namespace

Scene::Scene(const SceneDescription& description, std::uint32_t sensorWidth,
             std::uint32_t sensorHeight)
    : width(sensorWidth), height(sensorHeight) {
    for (std::uint32_t colour = 0; colour < ColourCount; ++colour) {
        rates[colour] = description.brightness * description.light[colour];
    }
}

std::unique_ptr<Scene> MakeScene(const SceneDescription& description, std::uint32_t sensorWidth,
                                 std::uint32_t sensorHeight, std::uint64_t seed,
                                 std::string* message) {
    const SceneRequest request{description, sensorWidth, sensorHeight, seed};
    for (const SceneKind& kind : SceneKinds) {
        if (description.kind == kind.name) return kind.make(request, message);
    }
    *message = "there is no scene of kind \"" + description.kind + "\"";
    return nullptr;
}

}  // namespace ZV::Simulation
