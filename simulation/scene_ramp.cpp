#include <new>

#include "simulation/scene_kinds.h"

namespace ZV::Simulation {
namespace {

/// Rises along both axes, so that a sample in the wrong row or column shows.
class RampScene final : public Scene {
  public:
    explicit RampScene(const SceneRequest& request)
        : Scene(request.description, request.width, request.height) {}

    void FillRow(std::uint32_t y, std::uint32_t, double* levels) const override {
        const double last = static_cast<double>(GetWidth()) + GetHeight() - 2;
        for (std::uint32_t x = 0; x < GetWidth(); ++x) {
            levels[x] = last > 0 ? (static_cast<double>(x) + y) / last : 0;
        }
    }
};

}  // namespace

std::unique_ptr<Scene> MakeRampScene(const SceneRequest& request, std::string*) {
    return std::unique_ptr<Scene>(new (std::nothrow) RampScene(request));
}

}  // namespace ZV::Simulation
