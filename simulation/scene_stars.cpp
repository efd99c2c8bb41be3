#include <algorithm>
#include <cmath>
#include <new>
#include <vector>

#include "simulation/random.h"
#include "simulation/scene_kinds.h"

namespace ZV::Simulation {
namespace {

constexpr double SkyLevel = 0.002;
constexpr double FaintestPeak = 0.01;
constexpr double SigmaLeast = 0.9;
constexpr double SigmaSpan = 0.7;
/// Pixels from a star's centre, in each axis, at which its light is cut off.
constexpr double Reach = 8;

struct Star {
    double x, y;  ///< Pixels; the centre of the first pixel is 0, 0.
    double sigma;
    double peak[ColourCount];
};

/// Exponential of -`value` up to 64, of arithmetic alone: the same on every machine.
double CalculateDecay(double value) {
    const double part = -value / 256;
    double term = 1;
    double sum = 1;
    for (int n = 1; n <= 10; ++n) {
        term *= part / n;
        sum += term;
    }
    for (int n = 0; n < 8; ++n) sum *= sum;
    return sum;
}

double CalculateProfile(double distance, double sigma) {
    return CalculateDecay(distance * distance / (2 * sigma * sigma));
}

Star MakeStar(Random& random, std::uint32_t width, std::uint32_t height) {
    Star star;
    star.x = random.GetNextFraction() * width - 0.5;
    star.y = random.GetNextFraction() * height - 0.5;
    star.sigma = SigmaLeast + SigmaSpan * random.GetNextFraction();
    const double rank = random.GetNextFraction();
    const double warmth = random.GetNextFraction();
    const double peak = FaintestPeak + (1 - FaintestPeak) * rank * rank * rank * rank;
    star.peak[ColourRed] = peak * (0.6 + 0.4 * warmth);
    star.peak[ColourGreen] = peak * 0.9;
    star.peak[ColourBlue] = peak * (1.0 - 0.4 * warmth);
    return star;
}

class StarScene final : public Scene {
  public:
    explicit StarScene(const SceneRequest& request)
        : Scene(request.description, request.width, request.height) {
        Random random(request.seed);
        stars.reserve(request.description.starCount);
        for (std::uint32_t n = 0; n < request.description.starCount; ++n) {
            stars.push_back(MakeStar(random, request.width, request.height));
        }
        std::stable_sort(stars.begin(), stars.end(),
                         [](const Star& left, const Star& right) { return left.y < right.y; });
    }

    void FillRow(std::uint32_t y, std::uint32_t colour, double* levels) const override {
        std::fill_n(levels, GetWidth(), SkyLevel);
        const auto first =
            std::lower_bound(stars.begin(), stars.end(), y - Reach,
                             [](const Star& star, double edge) { return star.y < edge; });
        for (auto star = first; star != stars.end() && star->y <= y + Reach; ++star) {
            AddStar(*star, y, colour, levels);
        }
    }

  private:
    void AddStar(const Star& star, std::uint32_t y, std::uint32_t colour, double* levels) const {
        const double inRow = star.peak[colour] * CalculateProfile(y - star.y, star.sigma);
        const auto left = static_cast<std::size_t>(std::max(std::ceil(star.x - Reach), 0.0));
        const double right = std::min(std::floor(star.x + Reach), GetWidth() - 1.0);
        for (std::size_t x = left; static_cast<double>(x) <= right; ++x) {
            levels[x] += inRow * CalculateProfile(static_cast<double>(x) - star.x, star.sigma);
        }
    }

    std::vector<Star> stars;  ///< From the top to the bottom.
};

}  // namespace

std::unique_ptr<Scene> MakeStarScene(const SceneRequest& request, std::string*) {
    return std::unique_ptr<Scene>(new (std::nothrow) StarScene(request));
}

}  // namespace ZV::Simulation
