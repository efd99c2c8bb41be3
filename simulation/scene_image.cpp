#include <new>
#include <utility>

#include "simulation/image_file.h"
#include "simulation/scene_kinds.h"

namespace ZV::Simulation {
namespace {

class ImageScene final : public Scene {
  public:
    ImageScene(const SceneRequest& request, ImageFile&& file)
        : Scene(request.description, request.width, request.height), image(std::move(file)) {}

    void FillRow(std::uint32_t y, std::uint32_t colour, double* levels) const override {
        const std::uint64_t row = std::uint64_t{y} * image.height / GetHeight();
        const float* pixels = image.levels.data() + row * image.width * image.channels;
        const std::uint32_t channel = image.channels == 1 ? 0 : colour;
        for (std::uint32_t x = 0; x < GetWidth(); ++x) {
            const std::uint64_t column = std::uint64_t{x} * image.width / GetWidth();
            levels[x] = pixels[column * image.channels + channel];
        }
    }

  private:
    ImageFile image;
};

}  // namespace

std::unique_ptr<Scene> MakeImageScene(const SceneRequest& request, std::string* message) {
    ImageFile image;
    if (!ReadImageFile(request.description.path, &image, message)) return nullptr;
    return std::unique_ptr<Scene>(new (std::nothrow) ImageScene(request, std::move(image)));
}

}  // namespace ZV::Simulation
