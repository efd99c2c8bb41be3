#pragma once

#include <string_view>
#include <vector>

#include "camera/camera.h"
#include "support/simulation_world.h"

namespace ZV::Test {

/// A simulated world and what a listing of it gives. Closes and deletes all of it.
class ListedModels {
  public:
    explicit ListedModels(std::string_view scenario) : world(scenario) {
        result = ZCamera::GetCameraList(cameras);
    }
    ~ListedModels() {
        (void)ZCamera::FreeCameraList(cameras);
        (void)ZCamera::Shutdown();
    }
    ListedModels(const ListedModels&) = delete;
    ListedModels& operator=(const ListedModels&) = delete;

    /// The first camera; null when the listing gave none or another class.
    template <typename Model>
    Model* GetFirst() const {
        return cameras.empty() ? nullptr : dynamic_cast<Model*>(cameras[0]);
    }

    SimulationWorld world;
    CameraResult result = CameraOk;
    std::vector<ZCamera*> cameras;
};

}  // namespace ZV::Test
