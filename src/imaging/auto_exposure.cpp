#include "imaging/auto_exposure.h"

#include <algorithm>
#include <cmath>

#include "camera/camera.h"
#include "imaging/image_formats.h"
#include "imaging/measuring_image.h"

namespace ZV {
namespace {

constexpr std::uint32_t MeasuringBitDepth = 8;
constexpr std::uint32_t BitDepthMax = 32;
constexpr std::uint64_t Target = 250;
// Both are the doubles nearest to the factors in single precision.
constexpr double SmallStepShare = 0.1F;
constexpr double TargetShare = 0.98F;

/// Sample values at which the correction changes its step.
struct Thresholds {
    std::uint64_t high;
    std::uint64_t mid;
    std::uint64_t low;
};

/// How many times the samples of a depth above 8 bits are those of 8 bits, as a shift.
std::uint32_t GetDepthShift(std::uint32_t bitDepth) {
    return std::clamp(bitDepth, MeasuringBitDepth, BitDepthMax) - MeasuringBitDepth;
}

Thresholds GetThresholds(std::uint32_t bitDepth) {
    constexpr Thresholds Of8Bits{255, 100, 50};
    const std::uint32_t shift = GetDepthShift(bitDepth);
    return {Of8Bits.high << shift, Of8Bits.mid << shift, Of8Bits.low << shift};
}

/// Kept: where the limits cross, the lower one holds.
std::uint64_t HoldWithinLimits(ZCamera& camera, std::uint64_t exposure) {
    return std::max(std::min(exposure, camera.GetMaxExposure()), camera.GetMinExposure());
}

std::uint64_t CorrectByMaximum(std::uint64_t exposure, std::uint32_t bitDepth,
                               std::uint64_t maximum) {
    const Thresholds thresholds = GetThresholds(bitDepth);
    if (maximum >= thresholds.high) return exposure >> 2;
    // Kept: the products wrap at 64 bits.
    if (maximum <= thresholds.low) return exposure * 4;
    if (maximum <= thresholds.mid) return exposure * 2;
    return exposure * (Target << GetDepthShift(bitDepth)) / maximum;
}

/// The brightest colour governs: its quotient is the smallest.
std::uint64_t CorrectByMaxima(std::uint64_t exposure, std::uint32_t bitDepth,
                              const ColourValues& maxima) {
    const Thresholds thresholds = GetThresholds(bitDepth);
    const std::uint32_t brightest = std::max({maxima.red, maxima.green, maxima.blue});
    if (brightest >= thresholds.high) return exposure >> 2;
    if (brightest <= thresholds.low) return exposure * 4;
    if (brightest <= thresholds.mid) return exposure * 2;
    const std::uint64_t top = std::uint64_t{1} << std::min(bitDepth, BitDepthMax);
    const double target = static_cast<double>(top) * TargetShare * static_cast<double>(exposure);
    return TruncateToNanoseconds(target / brightest);
}

/// What a wheel that cycles is given back after it was held.
class HeldWheel {
  public:
    /// Holds the wheel at green, if it cycles.
    explicit HeldWheel(ZCamera& heldCamera)
        : camera(heldCamera), isHeld(camera.GetRGBFilterCycleMode()) {
        if (!isHeld) return;
        redExposure = camera.GetRGBFilterRedExposure();
        blueExposure = camera.GetRGBFilterBlueExposure();
        startColour = camera.GetRGBFilterStartColour();
        (void)camera.SetRGBFilterStartColour(PatternGreen);
        (void)camera.SetRGBFilterCycle(false);
        (void)camera.UpdateSettingsOnCamera();
    }

    /// Kept: not at the end of its life; a failed iteration leaves the wheel at green.
    void LetGo(double exposureDifference) const {
        if (!isHeld) return;
        (void)camera.SetRGBFilterRedExposure(Move(redExposure, exposureDifference));
        (void)camera.SetRGBFilterBlueExposure(Move(blueExposure, exposureDifference));
        (void)camera.SetRGBFilterStartColour(startColour);
        (void)camera.SetRGBFilterCycle(true);
    }

  private:
    static std::uint64_t Move(std::uint64_t exposure, double difference) {
        return TruncateToNanoseconds(static_cast<double>(exposure) + difference);
    }

    ZCamera& camera;  // borrowed for the iteration
    bool isHeld;
    std::uint64_t redExposure = 0;
    std::uint64_t blueExposure = 0;
    std::uint32_t startColour = 0;
};

}  // namespace

ZAutoExposure::ZAutoExposure(bool calculate) : calculateValuesOnAllFrames(calculate) {}

ZAutoExposure::~ZAutoExposure() = default;

FilterResult ZAutoExposure::Process(ZInImageBufferStruct* in, ZOutImageBufferStruct*) {
    if (!calculateValuesOnAllFrames.load(std::memory_order_relaxed)) return FilterDeclined;
    if (in->camera == nullptr) return FilterDeclined;
    const MeasuredImage image{in->data, in->imageSize, in->width, in->height, in->imageFormat};
    FilterResult result = FilterDone;
    if (IsFilterThreeColour(in->imageFormat)) {
        ColourValues maxima;
        result = MeasureColourMaxima(image, region, &maxima);
        if (result == FilterDone) result = AutoExposeRGB(*in->camera, in->bitDepth, maxima);
    } else {
        std::uint32_t maximum = 0;
        result = MeasureMonoMaximum(image, region, &maximum);
        if (result == FilterDone) result = AutoExposeMono(*in->camera, in->bitDepth, maximum);
    }
    return result == FilterDone ? FilterDeclined : result;
}

FilterResult ZAutoExposure::Init(std::uint32_t newWidth, std::uint32_t newHeight) {
    region = {0, 0, newWidth, newHeight};
    return FilterDone;
}

FilterResult ZAutoExposure::SetOutputFormat(std::uint32_t) {
    return FilterDone;
}

void ZAutoExposure::SetCalculateValuesOnAllFrames(bool on) {
    calculateValuesOnAllFrames.store(on, std::memory_order_relaxed);
}

FilterResult ZAutoExposure::CalculateExposure(std::uint32_t x, std::uint32_t y, std::uint32_t width,
                                              std::uint32_t height, ZCamera* camera) {
    if (camera == nullptr) return FilterFailed;
    const bool wasAwake = calculateValuesOnAllFrames.exchange(true, std::memory_order_relaxed);
    const std::uint32_t bitDepth = camera->GetBitDepth();
    // Kept here and below: what a setter reports is not looked at; the next image tells.
    (void)camera->SetBitDepth(MeasuringBitDepth);
    (void)camera->UpdateSettingsOnCamera();
    const HeldWheel wheel(*camera);
    region = {x, y, width, height};

    Step last;
    const FilterResult result = Iterate(*camera, &last);
    // Kept: a failure leaves the camera, the wheel and this filter as they are.
    if (result != FilterDone) return result;

    (void)camera->SetBitDepth(bitDepth);
    wheel.LetGo(last.GetDifference());
    (void)camera->UpdateSettingsOnCamera();
    calculateValuesOnAllFrames.store(wasAwake, std::memory_order_relaxed);
    return FilterDone;
}

FilterResult ZAutoExposure::Iterate(ZCamera& camera, Step* step) {
    for (std::uint32_t pass = 0; pass < PassesMax; ++pass) {
        step->before = camera.GetExposure();
        MeasuringImage image(camera);
        const FilterResult result = RunPass(camera, image);
        if (result != FilterDone) return result;
        step->after = camera.GetExposure();
        if (step->IsSmall()) break;
    }
    return FilterDone;
}

FilterResult ZAutoExposure::RunPass(ZCamera& camera, MeasuringImage& image) {
    FilterResult result = image.Grab();
    if (result != FilterDone) return result;
    image.CutRegion(&region);
    result = image.Interpolate();
    if (result != FilterDone) return result;

    const MeasuredImage measured = image.Describe();
    ZInImageBufferStruct in;
    in.data = image.Get().GetImageData();
    in.imageSize = static_cast<std::uint32_t>(measured.bytes);
    in.width = measured.width;
    in.height = measured.height;
    in.bitDepth = image.Get().GetBitDepth();
    in.imageFormat = measured.format;
    in.camera = &camera;
    ZOutImageBufferStruct out;
    result = Process(&in, &out);
    return result == FilterDeclined ? FilterDone : result;
}

FilterResult ZAutoExposure::AutoExposeMono(ZCamera& camera, std::uint32_t bitDepth,
                                           std::uint32_t maximum) {
    const std::uint64_t corrected =
        CorrectByMaximum(camera.GetExposure(), bitDepth, std::max(maximum, 1U));
    const std::uint64_t exposure = HoldWithinLimits(camera, corrected);
    (void)camera.SetExposure(exposure);
    (void)camera.SetRGBFilterRedExposure(exposure);
    (void)camera.SetRGBFilterBlueExposure(exposure);
    (void)camera.UpdateSettingsOnCamera();
    return FilterDone;
}

// Kept: other than the one above this leaves the red and blue exposures of a wheel alone.
FilterResult ZAutoExposure::AutoExposeRGB(ZCamera& camera, std::uint32_t bitDepth,
                                          ColourValues maxima) {
    for (std::uint32_t* maximum : {&maxima.red, &maxima.green, &maxima.blue}) {
        *maximum = std::max(*maximum, 1U);
    }
    const std::uint64_t corrected = CorrectByMaxima(camera.GetExposure(), bitDepth, maxima);
    (void)camera.SetExposure(HoldWithinLimits(camera, corrected));
    (void)camera.UpdateSettingsOnCamera();
    return FilterDone;
}

double ZAutoExposure::Step::GetDifference() const {
    return static_cast<double>(after) - static_cast<double>(before);
}

bool ZAutoExposure::Step::IsSmall() const {
    return SmallStepShare * static_cast<double>(before) >= std::abs(GetDifference());
}

}  // namespace ZV
