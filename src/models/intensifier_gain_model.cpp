#include "models/intensifier_gain_model.h"

#include <algorithm>
#include <cmath>
#include <limits>

#include "camera/gain_conversion.h"

namespace ZV {

namespace {

constexpr double Million = 1e6;
constexpr std::uint32_t SetupdBResolution = 2000;
constexpr std::int64_t GreatestdB = 2000000000;
constexpr std::uint64_t GreatestNormGain = std::numeric_limits<std::int64_t>::max();

std::int32_t CalculatedB(const IntensifierGainModel& model, std::uint32_t raw) {
    return static_cast<std::int32_t>(
        TruncateWithin((raw * model.slope + model.intercept) * Million, 0, GreatestdB));
}

std::uint64_t ConvertdBToTruncatedNorm(const IntensifierGainModel& model, std::int32_t gaindB) {
    const double normGain = std::pow(10.0, gaindB / Million / 20) * Million;
    const std::int64_t whole =
        TruncateWithin(normGain, 0, static_cast<std::int64_t>(GreatestNormGain));
    return TruncateNormGain(static_cast<std::uint64_t>(whole), model.significantFigures);
}

}  // namespace

CameraResult SetupIntensifierGain(IntensifierGainModel* model, std::uint32_t rawMin,
                                  std::uint32_t rawMax) {
    model->rawMin = rawMin;
    model->rawMax = rawMax;
    if (rawMax <= rawMin) return CameraGainSetupFailed;

    model->dBResolution = SetupdBResolution;
    const auto step = static_cast<std::int32_t>(SetupdBResolution);
    const std::int32_t mindB = (CalculatedB(*model, rawMin) + step - 1) / step * step;
    const std::int32_t maxdB = CalculatedB(*model, rawMax) / step * step;
    model->dBMin = static_cast<std::uint32_t>(mindB);
    model->dBMax = static_cast<std::uint32_t>(maxdB);

    const std::uint32_t figures = model->significantFigures;
    model->normalizedMax = LowerNormGainTo(ConvertdBToTruncatedNorm(*model, maxdB), maxdB, figures);
    model->normalizedMin =
        RaiseNormGainTo(ConvertdBToTruncatedNorm(*model, mindB), mindB, figures, GreatestNormGain);
    return CameraOk;
}

std::int32_t ConvertRawTodB(const IntensifierGainModel& model, std::uint32_t raw) {
    return CalculatedB(model, raw);
}

std::uint64_t RoundIntensifierGain(const IntensifierGainModel& model, std::uint64_t normGain) {
    const std::uint64_t rounded = RoundNormGain(normGain, model.significantFigures);
    return std::max(std::min(rounded, model.normalizedMax), model.normalizedMin);
}

bool ConvertNormToRaw(const IntensifierGainModel& model, std::uint64_t normGain,
                      std::uint32_t* raw) {
    const std::int32_t gaindB = CalculateNormdB(normGain);
    const double value = (gaindB / Million - model.intercept) / model.slope + 0.5;
    if (!std::isfinite(value)) return false;
    *raw = static_cast<std::uint32_t>(TruncateWithin(value, 0, GainDacFieldMax));
    return true;
}

}  // namespace ZV
