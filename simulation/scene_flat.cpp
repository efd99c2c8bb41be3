#include <algorithm>
#include <new>

#include "simulation/scene_kinds.h"

namespace ZV::Simulation {
namespace {

class FlatScene final : public Scene {
  public:
    explicit FlatScene(const SceneRequest& request)
        : Scene(request.description, request.width, request.height),
          level(request.description.level) {}

    void FillRow(std::uint32_t, std::uint32_t, double* levels) const override {
        std::fill_n(levels, GetWidth(), level);
    }

  private:
    double level;
};

}  // namespace

std::unique_ptr<Scene> MakeFlatScene(const SceneRequest& request, std::string*) {
    return std::unique_ptr<Scene>(new (std::nothrow) FlatScene(request));
}

}  // namespace ZV::Simulation
