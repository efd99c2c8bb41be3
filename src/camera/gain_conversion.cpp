#include "camera/gain_conversion.h"

#include <algorithm>
#include <cmath>
#include <limits>

namespace ZV {

namespace {

constexpr double Million = 1e6;
constexpr double SmallestNormGain = 0.001;
constexpr std::uint64_t NormGainCeiling = std::numeric_limits<std::uint32_t>::max();

/// Piece of the curve of board type 1, up to and with `lastDac` and `lastdB`.
struct CurvePiece {
    std::uint32_t lastDac;
    double lastdB;
    double slope;
    double offsetDac;
    double offsetdB;
};
constexpr CurvePiece CurvePieces[] = {
    {500, 0.003759, 7.518e-6, 0, 0},
    {3500, 22.557195, 0.007517812, 500, 0.003759},
    {4000, 30.896667, 0.016678944, 3500, 22.557195},
    {4095, 30.89738121, 7.518e-6, 4000, 30.896667},
};
constexpr double CurveAboveEnd = 30.89738121;
// A default beyond the DAC counts as one at the end of the first piece.
constexpr double CurveDefaultAboveEnd = 0.003759;

double CalculateCurve(std::uint32_t dac, double aboveEnd) {
    for (const CurvePiece& piece : CurvePieces) {
        if (dac <= piece.lastDac) return (dac - piece.offsetDac) * piece.slope + piece.offsetdB;
    }
    return aboveEnd;
}

double InvertCurve(double gaindB) {
    for (const CurvePiece& piece : CurvePieces) {
        if (gaindB <= piece.lastdB)
            return (gaindB - piece.offsetdB) / piece.slope + piece.offsetDac + 0.5;
    }
    return static_cast<double>(GainDacFieldMax);
}

double CalculateLinear(const GainModel& model, double dac) {
    return dac * model.dynamicRange / model.dacRange;
}

double CalculateBasedB(const GainModel& model) {
    if (model.boardType == BoardTypeCurve)
        return CalculateCurve(model.dacDefault, CurveDefaultAboveEnd);
    return model.dacRange == 0 ? 0 : CalculateLinear(model, model.dacDefault);
}

bool IsBoardConvertible(const GainModel& model) {
    return model.boardType == BoardTypeCurve || model.boardType == BoardTypeLinear;
}

std::int32_t TruncateTodB(double millionths) {
    return static_cast<std::int32_t>(TruncateWithin(millionths,
                                                    std::numeric_limits<std::int32_t>::min(),
                                                    std::numeric_limits<std::int32_t>::max()));
}

/// 10 to the power `exponent`, by repeated squaring in single precision.
float RaiseTen(std::uint32_t exponent) {
    float result = 1;
    for (float square = 10; exponent != 0; exponent >>= 1, square *= square) {
        if ((exponent & 1) != 0) result *= square;
    }
    return result;
}

std::uint64_t ConvertdBToUnroundedNorm(std::int32_t gaindB) {
    const float exponent = static_cast<float>(gaindB / Million) / 20.0F;
    const double normGain = static_cast<double>(std::pow(10.0F, exponent)) * Million;
    return static_cast<std::uint64_t>(
        TruncateWithin(normGain, 0, static_cast<std::int64_t>(NormGainCeiling)));
}

std::uint32_t HoldWithinLimits(const GainModel& model, std::uint64_t normGain) {
    const auto lowered = std::min<std::uint64_t>(normGain, model.normGainMax);
    return static_cast<std::uint32_t>(std::max<std::uint64_t>(lowered, model.normGainMin));
}

/// dB of a limit of the DAC.
bool ConvertDacLimitTodB(const GainModel& model, std::uint32_t dac, std::int32_t* gaindB) {
    if (model.boardType < BoardTypeRatio) return ConvertDacTodB(model, dac, gaindB);
    if (dac == 0 || model.dacDefault == 0) return false;
    *gaindB = TruncateTodB(std::log10(static_cast<double>(dac) / model.dacDefault) * 20 * Million);
    return true;
}

}  // namespace

std::int64_t TruncateWithin(double value, std::int64_t low, std::int64_t high) {
    if (!(value > static_cast<double>(low))) return low;
    if (value >= static_cast<double>(high)) return high;
    return static_cast<std::int64_t>(value);
}

std::uint32_t SaturateDac(std::int64_t dac) {
    return static_cast<std::uint32_t>(
        std::clamp<std::int64_t>(dac, 0, std::numeric_limits<std::uint32_t>::max()));
}

bool ConvertDacTodB(const GainModel& model, std::uint32_t dac, std::int32_t* gaindB) {
    if (!IsBoardConvertible(model)) return false;
    const double absolutedB = model.boardType == BoardTypeCurve ? CalculateCurve(dac, CurveAboveEnd)
                                                                : CalculateLinear(model, dac);
    const double millionths = (absolutedB - CalculateBasedB(model)) * Million;
    if (!std::isfinite(millionths)) return false;
    *gaindB = TruncateTodB(millionths);
    return true;
}

bool ConvertdBToDac(const GainModel& model, std::int32_t gaindB, std::int64_t* dac) {
    if (!IsBoardConvertible(model)) return false;
    const double absolutedB = CalculateBasedB(model) + gaindB / Million;
    const double value = model.boardType == BoardTypeCurve
                             ? InvertCurve(absolutedB)
                             : absolutedB * model.dacRange / model.dynamicRange + 0.5;
    if (!std::isfinite(value)) return false;
    *dac = TruncateWithin(value, std::numeric_limits<std::int64_t>::min(),
                          std::numeric_limits<std::int64_t>::max());
    return true;
}

std::int32_t ConvertNormTodB(const GainModel& model, std::uint32_t* normGain) {
    *normGain = HoldWithinLimits(model, RoundNormGain(*normGain, model.significantFigures));
    return CalculateNormdB(*normGain);
}

std::uint32_t ConvertdBToNorm(const GainModel& model, std::int32_t gaindB) {
    const std::uint64_t normGain = ConvertdBToUnroundedNorm(gaindB);
    return HoldWithinLimits(model, RoundNormGain(normGain, model.significantFigures));
}

std::int32_t RoundGaindB(const GainModel& model, std::int32_t gaindB) {
    const std::int64_t step = model.dBResolution == 0 ? 1 : model.dBResolution;
    const std::int64_t half = gaindB < 0 ? -(step / 2) : step / 2;
    const std::int64_t rounded = (gaindB + half) / step * step;
    const auto lowered = std::min<std::int64_t>(rounded, model.gaindBMax);
    return static_cast<std::int32_t>(std::max<std::int64_t>(lowered, model.gaindBMin));
}

std::uint64_t GetNormGainStep(std::uint64_t normGain, std::uint32_t significantFigures) {
    if (normGain == 0) return 1;
    constexpr std::int64_t GreatestExponent = 19;
    const auto digits = static_cast<std::int64_t>(std::log10(static_cast<double>(normGain)));
    const std::int64_t exponent =
        std::min(digits - static_cast<std::int64_t>(significantFigures) + 1, GreatestExponent);
    if (exponent < 1) return 1;
    return static_cast<std::uint64_t>(RaiseTen(static_cast<std::uint32_t>(exponent)));
}

std::uint64_t RoundNormGain(std::uint64_t normGain, std::uint32_t significantFigures) {
    const std::uint64_t step = GetNormGainStep(normGain, significantFigures);
    const std::uint64_t half =
        std::min(step / 2, std::numeric_limits<std::uint64_t>::max() - normGain);
    return (normGain + half) / step * step;
}

std::uint64_t TruncateNormGain(std::uint64_t normGain, std::uint32_t significantFigures) {
    const std::uint64_t step = GetNormGainStep(normGain, significantFigures);
    return normGain / step * step;
}

std::int32_t CalculateNormdB(std::uint64_t normGain) {
    const double ratio = std::max(static_cast<double>(normGain) / Million, SmallestNormGain);
    return TruncateTodB(std::log10(ratio) * 20 * Million);
}

std::uint64_t LowerNormGainTo(std::uint64_t normGain, std::int32_t maxdB,
                              std::uint32_t significantFigures) {
    while (normGain > 0 && CalculateNormdB(normGain) > maxdB)
        normGain -= std::min(normGain, GetNormGainStep(normGain, significantFigures));
    return normGain;
}

std::uint64_t RaiseNormGainTo(std::uint64_t normGain, std::int32_t mindB,
                              std::uint32_t significantFigures, std::uint64_t ceiling) {
    while (normGain < ceiling && CalculateNormdB(normGain) < mindB)
        normGain += GetNormGainStep(normGain, significantFigures);
    return std::min(normGain, ceiling);
}

std::uint32_t CalculateSignificantFigures(std::int32_t dBResolution) {
    const double magnitude = std::log10(dBResolution / Million) - 1e-7;
    return static_cast<std::uint32_t>(std::abs(TruncateWithin(magnitude, -20, 20))) + 1;
}

CameraResult DeriveGainLimits(GainModel* model) {
    std::int32_t mindB = 0;
    std::int32_t maxdB = 0;
    if (!ConvertDacLimitTodB(*model, model->dacMin, &mindB)) return CameraGainSetupFailed;
    if (!ConvertDacLimitTodB(*model, model->dacMax, &maxdB)) return CameraGainSetupFailed;

    const std::int32_t step = model->dBResolution == 0 ? 1 : model->dBResolution;
    model->gaindBMin = mindB / step * step;
    model->gaindBMax = maxdB / step * step;

    const std::uint32_t figures = model->significantFigures;
    const std::uint64_t maximum =
        LowerNormGainTo(RoundNormGain(ConvertdBToUnroundedNorm(model->gaindBMax), figures),
                        model->gaindBMax, figures);
    const std::uint64_t minimum =
        RaiseNormGainTo(TruncateNormGain(ConvertdBToUnroundedNorm(model->gaindBMin), figures),
                        model->gaindBMin, figures, NormGainCeiling);
    model->normGainMax = static_cast<std::uint32_t>(std::min(maximum, NormGainCeiling));
    model->normGainMin = static_cast<std::uint32_t>(minimum);
    return CameraOk;
}

}  // namespace ZV
