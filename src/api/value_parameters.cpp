#include <array>
#include <cstdint>

#include "api/parameter_readers.h"
#include "api/parameter_rules.h"
#include "api/parameter_table.h"
#include "api/parameter_values.h"

/// The signed and the 64-bit parameters: the values that are sent.
namespace ZV {

namespace {

constexpr std::uint64_t RedExposureNanoseconds = 28100000;
constexpr std::uint64_t BlueExposureNanoseconds = 34900000;

template <auto Operation>
constexpr auto ReadSigned = Read<std::int32_t, Operation>;
template <auto Operation>
constexpr auto AskSigned = Ask<std::int32_t, Operation>;
template <auto Operation>
constexpr auto ReadWide = Read<std::uint64_t, Operation>;
template <auto Operation>
constexpr auto AskWide = Ask<std::uint64_t, Operation>;

constexpr ParameterLimits<std::uint64_t> ExposureLimits{AskWide<&ZCamera::GetMinExposure>,
                                                        AskWide<&ZCamera::GetMaxExposure>};

constexpr std::array SignedWords{
    SignedParameter{.key = zprmS32NormalizedGaindB,
                    .text = {.name = "zprmS32NormalizedGaindB",
                             .unit = "millionths of a dB",
                             .range = "limits of the camera, not checked",
                             .meaning = "Gain in decibels"},
                    .log = {.label = "Normalized Gain dB"},
                    .read = ReadSigned<&ZCamera::GetNormalizedGaindB>,
                    .initial = GetDefaultGaindB,
                    .isSupported = Always,
                    .limits = {AskSigned<&ZCamera::GetNormalizedGaindBMin>,
                               AskSigned<&ZCamera::GetNormalizedGaindBMax>},
                    .hasRange = true,
                    .get = GetGaindBParameter,
                    .set = SetSignedUnchecked},
    SignedParameter{.key = zprmS32AbsoluteOffset,
                    .text = {.name = "zprmS32AbsoluteOffset",
                             .unit = "camera units",
                             .range = "limits of the camera, not checked",
                             .meaning = "Offset from the camera's own zero"},
                    .log = {.label = "Absolute Offset"},
                    .read = ReadSigned<&ZCamera::GetAbsoluteOffset>,
                    .isSupported = Always,
                    .limits = {AskSigned<&ZCamera::GetAbsoluteOffsetMin>,
                               AskSigned<&ZCamera::GetAbsoluteOffsetMax>},
                    .hasRange = true,
                    .set = SetSignedUnchecked},
    SignedParameter{.key = zprmS32RegulatedCoolingTemp,
                    .text = {.name = "zprmS32RegulatedCoolingTemp",
                             .unit = "degrees C",
                             .range = "limits of the camera",
                             .meaning = "Target of the regulated cooling"},
                    .log = {.label = "Regulated Cooling Temp", .form = LogForm::Celsius},
                    .read = ReadSigned<&ZCamera::GetRegulatedCoolingTemperature>,
                    .initial = ReadSigned<&ZCamera::GetMinRegulatedCoolingTemp>,
                    .isSupported = Has<&ZCamera::IsRegulatedCoolingAvailable>,
                    .limits = {AskSigned<&ZCamera::GetMinRegulatedCoolingTemp>,
                               AskSigned<&ZCamera::GetMaxRegulatedCoolingTemp>},
                    .hasRange = true,
                    .set = SetCoolingTargetParameter},
};

constexpr std::array WideWords{
    WideParameter{.key = zprm64Exposure,
                  .text = {.name = "zprm64Exposure",
                           .unit = "ns",
                           .range = "limits of the camera",
                           .meaning = "Exposure"},
                  .log = {.label = "Exposure (64-bit)", .form = LogForm::Nanoseconds},
                  .read = ReadWide<&ZCamera::GetExposure>,
                  .initial = ReadWide<&ZCamera::GetDefaultExposure>,
                  .isSupported = Always,
                  .limits = ExposureLimits,
                  .hasRange = true,
                  .set = SetWideExposureParameter},
    WideParameter{.key = zprm64ExposureRed,
                  .text = {.name = "zprm64ExposureRed",
                           .unit = "ns",
                           .range = "limits of the camera",
                           .meaning = "Exposure behind the red filter"},
                  .log = {.label = "Red Exposure (64-bit)", .form = LogForm::Nanoseconds},
                  .read = ReadWide<&ZCamera::GetRGBFilterRedExposure>,
                  .initial = GiveInitial<std::uint64_t, RedExposureNanoseconds>,
                  .isSupported = Has<&ZCamera::IsRGBFilterSupported>,
                  .limits = ExposureLimits,
                  .hasRange = true,
                  .set = SetWideExposureParameter},
    WideParameter{.key = zprm64ExposureBlue,
                  .text = {.name = "zprm64ExposureBlue",
                           .unit = "ns",
                           .range = "limits of the camera",
                           .meaning = "Exposure behind the blue filter"},
                  .log = {.label = "Blue Exposure (64-bit)", .form = LogForm::Nanoseconds},
                  .read = ReadWide<&ZCamera::GetRGBFilterBlueExposure>,
                  .initial = GiveInitial<std::uint64_t, BlueExposureNanoseconds>,
                  .isSupported = Has<&ZCamera::IsRGBFilterSupported>,
                  .limits = ExposureLimits,
                  .hasRange = true,
                  .set = SetWideExposureParameter},
    WideParameter{.key = zprm64NormIntensGain,
                  .text = {.name = "zprm64NormIntensGain",
                           .unit = "millionths",
                           .range = "limits of the camera, not checked",
                           .meaning = "Gain of the intensifier as a factor"},
                  // The misspelling is what readers of logs know.
                  .log = {.label = "Normalized Intesifier Gain (64-bit)"},
                  .read = ReadWide<&ZCamera::GetNormalizedIntensifierGain>,
                  .initial = GetDefaultNormalizedIntensifierGain,
                  .isSupported = Has<&ZCamera::IsIntensifierAvailable>,
                  .limits = {AskWide<&ZCamera::GetNormalizedIntensifierGainMin>,
                             AskWide<&ZCamera::GetNormalizedIntensifierGainMax>},
                  .hasRange = true,
                  .set = SetWideUnchecked},
};

}  // namespace

std::span<const SignedParameter> GetSignedParameters() {
    return SignedWords;
}

std::span<const WideParameter> GetWideParameters() {
    return WideWords;
}

const SignedParameter* FindSignedParameter(std::uint32_t key) {
    return key < SignedWords.size() ? &SignedWords[key] : nullptr;
}

const WideParameter* FindWideParameter(std::uint32_t key) {
    return key < WideWords.size() ? &WideWords[key] : nullptr;
}

}  // namespace ZV
