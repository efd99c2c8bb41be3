#pragma once

#include <cstdint>
#include <memory>
#include <string>

#include "simulation/scene.h"

/// One maker for each kind of scene. Each gives null with `message` when it fails.
namespace ZV::Simulation {

/// What every maker is given.
struct SceneRequest {
    const SceneDescription& description;
    std::uint32_t width;
    std::uint32_t height;
    std::uint64_t seed;
};

std::unique_ptr<Scene> MakeFlatScene(const SceneRequest& request, std::string* message);
std::unique_ptr<Scene> MakeRampScene(const SceneRequest& request, std::string* message);
std::unique_ptr<Scene> MakeChartScene(const SceneRequest& request, std::string* message);
std::unique_ptr<Scene> MakeStarScene(const SceneRequest& request, std::string* message);
std::unique_ptr<Scene> MakeImageScene(const SceneRequest& request, std::string* message);

}  // namespace ZV::Simulation
