#include "image_samples.h"

#include <cstring>

namespace ZentaraProgram {
namespace {

/// Where the samples of one colour lie: the first one, and how far the next is, in samples.
struct Walk {
    std::size_t begin, step;
};

Walk GetWalk(const PixelFormat& layout, std::size_t pixels, std::size_t colour) {
    if (layout.isPlanar) return {layout.at[colour] * pixels, 1};
    return {layout.at[colour], layout.samplesPerPixel};
}

template <typename Sample>
void CopySamples(const std::uint8_t* from, Walk source, std::uint8_t* to, Walk target,
                 std::size_t count) {
    for (std::size_t i = 0; i < count; ++i) {
        std::memcpy(to + (target.begin + i * target.step) * sizeof(Sample),
                    from + (source.begin + i * source.step) * sizeof(Sample), sizeof(Sample));
    }
}

std::span<const std::uint8_t> PutInOrder(const Image& image, const PixelFormat& wanted,
                                         std::vector<std::uint8_t>* scratch) {
    const PixelFormat& layout = *image.layout;
    const bool isInOrder = layout.isPlanar == wanted.isPlanar && layout.at == wanted.at &&
                           layout.samplesPerPixel == wanted.samplesPerPixel;
    if (!layout.IsThreeColour() || isInOrder) return image.pixels;
    const std::size_t pixels = std::size_t{image.width} * image.height;
    scratch->resize(pixels * ColourCount * image.bytesPerSample);
    for (std::size_t colour = 0; colour < ColourCount; ++colour) {
        const auto copy =
            image.bytesPerSample == 2 ? &CopySamples<std::uint16_t> : &CopySamples<std::uint8_t>;
        copy(image.pixels.data(), GetWalk(layout, pixels, colour), scratch->data(),
             GetWalk(wanted, pixels, colour), pixels);
    }
    return *scratch;
}

}  // namespace

std::span<const std::uint8_t> GetPixelSamples(const Image& image,
                                              std::vector<std::uint8_t>* scratch) {
    static constexpr PixelFormat Interleaved{0, "", 1, ColourCount, false, {0, 1, 2}};
    return PutInOrder(image, Interleaved, scratch);
}

std::span<const std::uint8_t> GetPlaneSamples(const Image& image,
                                              std::vector<std::uint8_t>* scratch) {
    static constexpr PixelFormat Planes{0, "", 1, ColourCount, true, {0, 1, 2}};
    return PutInOrder(image, Planes, scratch);
}

}  // namespace ZentaraProgram
