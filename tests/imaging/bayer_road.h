#pragma once

#include <cstdint>
#include <cstring>
#include <vector>

#include "imaging/bayer_engine.h"
#include "imaging/image_formats.h"
#include "imaging/kernels/kernels.h"

namespace ZV::Testing {

/// The pixel kernels of one kind of sample, for the road over whole planes.
struct PlaneKernels {
    decltype(&ShiftRightPlane8) shiftRight;
    decltype(&AddPlane8) add;
    decltype(&EnlargePlane8) enlarge;
    decltype(&PackPlanes8x3) packThree;
    decltype(&PackPlanes8x4) packFour;
};

/// A mosaic's way to three colours over whole planes, one kernel after the other: split, halve the
/// greens, add them, enlarge, pack.
class BayerRoad {
  public:
    BayerRoad(const PlaneKernels& planeKernels, std::size_t bytesPerSample)
        : kernels(planeKernels), sampleBytes(bytesPerSample) {}

    std::vector<std::uint8_t> Run(const BayerMosaic& mosaic, std::int32_t interpolation,
                                  std::uint32_t format) const {
        Planes planes = Split(mosaic);
        const std::uint32_t width = mosaic.width & ~1U, height = mosaic.height & ~1U;
        const KernelSize quarter{static_cast<std::int32_t>(width / 2),
                                 static_cast<std::int32_t>(height / 2)};
        const auto rowBytes = static_cast<std::int32_t>(width / 2 * sampleBytes);
        (void)kernels.shiftRight(1, planes[1].data(), rowBytes, quarter);
        (void)kernels.shiftRight(1, planes[2].data(), rowBytes, quarter);
        (void)kernels.add(planes[2].data(), rowBytes, planes[1].data(), rowBytes, quarter, 0);
        const Plane colours[] = {Enlarge(planes[0], mosaic, interpolation),
                                 Enlarge(planes[1], mosaic, interpolation),
                                 Enlarge(planes[3], mosaic, interpolation)};
        return Pack(colours, mosaic, format);
    }

  private:
    using Plane = std::vector<std::uint8_t>;
    using Planes = std::vector<Plane>;

    Planes Split(const BayerMosaic& mosaic) const {
        static constexpr std::uint8_t Places[4][4] = {
            {0, 1, 2, 3}, {1, 0, 3, 2}, {1, 3, 0, 2}, {3, 1, 2, 0}};
        const bool isKnown = mosaic.colourPattern >= 5 && mosaic.colourPattern <= 8;
        const auto& places = Places[isKnown ? mosaic.colourPattern - 5 : 0];
        Planes planes(4);
        for (std::size_t y = 0; y + 1 < mosaic.height; y += 2) {
            for (std::size_t x = 0; x + 1 < mosaic.width; x += 2) {
                for (std::size_t place = 0; place < 4; ++place) {
                    const std::size_t at =
                        ((y + place / 2) * mosaic.width + x + place % 2) * sampleBytes;
                    Plane& plane = planes[places[place]];
                    for (std::size_t i = 0; i < sampleBytes; ++i) {
                        plane.push_back(at + i < mosaic.bytes ? mosaic.data[at + i]
                                                              : std::uint8_t{0});
                    }
                }
            }
        }
        return planes;
    }

    /// As large as the frame: what no cell covers repeats its neighbour.
    Plane Enlarge(const Plane& plane, const BayerMosaic& mosaic, std::int32_t interpolation) const {
        Plane full(std::size_t{mosaic.width} * mosaic.height * sampleBytes);
        const std::size_t rowBytes = mosaic.width * sampleBytes;
        const KernelSize quarter{static_cast<std::int32_t>(mosaic.width / 2),
                                 static_cast<std::int32_t>(mosaic.height / 2)};
        (void)kernels.enlarge(
            plane.data(), quarter, static_cast<std::int32_t>(mosaic.width / 2 * sampleBytes),
            {0, 0, quarter.width, quarter.height}, full.data(), static_cast<std::int32_t>(rowBytes),
            {static_cast<std::int32_t>(mosaic.width), static_cast<std::int32_t>(mosaic.height)},
            2.0, 2.0, interpolation);
        if (quarter.width == 0 || quarter.height == 0) return full;
        for (std::size_t y = 0; mosaic.width % 2 != 0 && y < mosaic.height; ++y) {
            std::uint8_t* const last = full.data() + (y + 1) * rowBytes - sampleBytes;
            std::memcpy(last, last - sampleBytes, sampleBytes);
        }
        if (mosaic.height % 2 != 0) {
            std::uint8_t* const last = full.data() + (mosaic.height - 1) * rowBytes;
            std::memcpy(last, last - rowBytes, rowBytes);
        }
        return full;
    }

    std::vector<std::uint8_t> Pack(const Plane (&colours)[3], const BayerMosaic& mosaic,
                                   std::uint32_t format) const {
        const std::size_t pixels = std::size_t{mosaic.width} * mosaic.height;
        const auto rowBytes = static_cast<std::int32_t>(mosaic.width * sampleBytes);
        const KernelSize size{static_cast<std::int32_t>(mosaic.width),
                              static_cast<std::int32_t>(mosaic.height)};
        const Plane alpha(pixels * sampleBytes, 255);
        const void *red = colours[0].data(), *green = colours[1].data(), *blue = colours[2].data();
        std::vector<std::uint8_t> image(pixels * GetThreeColourPixelBytes(format));
        const auto packThree = [&](const void* first, const void* second, const void* third) {
            const void* const planes[] = {first, second, third};
            (void)kernels.packThree(planes, rowBytes, image.data(), 3 * rowBytes, size);
        };
        const auto packFour = [&](const void* first, const void* second, const void* third,
                                  const void* fourth) {
            const void* const planes[] = {first, second, third, fourth};
            (void)kernels.packFour(planes, rowBytes, image.data(), 4 * rowBytes, size);
        };
        if (format == BGR24) packThree(blue, green, red);
        if (format == RGB24 || format == RGB48) packThree(red, green, blue);
        if (format == XRGB32) packFour(alpha.data(), red, green, blue);
        if (format == BGRX32) packFour(blue, green, red, alpha.data());
        if (format == RGBX32) packFour(red, green, blue, alpha.data());
        if (format == RGBPlane8 || format == RGBPlane16) {
            image.clear();
            for (const Plane& colour : colours) {
                image.insert(image.end(), colour.begin(), colour.end());
            }
        }
        return image;
    }

    PlaneKernels kernels;
    std::size_t sampleBytes;
};

}  // namespace ZV::Testing
