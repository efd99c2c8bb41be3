#include "api/parameter_rules.h"

#include <algorithm>
#include <array>
#include <vector>

#include "api/parameter_table.h"
#include "api/settings_block.h"
#include "api/settings_units.h"
#include "diagnostics/log.h"

namespace ZV {

namespace {

/// Entries of the list of formats that a value is compared with.
constexpr std::int32_t CheckedFormats = 20;

bool IsExposureAllowed(ZCamera& camera, std::uint64_t nanoseconds) {
    return nanoseconds >= camera.GetMinExposure() && nanoseconds <= camera.GetMaxExposure();
}

ZentaraResult JudgeParameter(bool isAllowed) {
    return isAllowed ? ZentaraResult{zerrNone} : ZentaraResult{zerrBadParameter};
}

bool IsListed(ZCamera& camera, std::uint32_t key, std::uint32_t value) {
    std::vector<std::uint32_t> values;
    FindWordParameter(key)->list(camera, values);
    return std::find(values.begin(), values.end(), value) != values.end();
}

ZentaraResult StoreListed(Zentara_Settings& block, ZCamera& camera, std::uint32_t key,
                          std::uint32_t value, ZentaraResult refusal) {
    if (!IsListed(camera, key, value)) return refusal;
    SetSettingsWord(block, key, value);
    return zerrNone;
}

}  // namespace

ZentaraResult GetGainParameter(const Zentara_Settings& block, ZCamera& camera,
                               std::uint32_t* value) {
    *value = camera.ConvertNormGaindBToGain(GetSettingsSigned(block, zprmS32NormalizedGaindB));
    return zerrNone;
}

// Kept: a failure to read the signed key is told, and the conversion runs all the same.
ZentaraResult GetOffsetParameter(const Zentara_Settings& block, ZCamera& camera,
                                 std::uint32_t* value) {
    Zentara_Settings copy = block;
    std::int32_t absoluteOffset = 0;
    const ZentaraResult result = Zentara_GetParamS32(&copy, zprmS32AbsoluteOffset, &absoluteOffset);
    *value = camera.ConvertAbsoluteOffsetToOffset(absoluteOffset);
    return result == zerrNone ? ZentaraResult{zerrNone} : ZentaraResult{zerrNotSupported};
}

ZentaraResult GetNormalizedGainParameter(const Zentara_Settings& block, ZCamera& camera,
                                         std::uint32_t* value) {
    *value = camera.ConvertNormGaindBToNormGain(GetSettingsSigned(block, zprmS32NormalizedGaindB));
    return zerrNone;
}

template <std::uint32_t Wide>
ZentaraResult GetExposureParameter(const Zentara_Settings& block, ZCamera& /*camera*/,
                                   std::uint32_t* value) {
    *value = ConvertNanosecondsToMicroseconds(GetSettingsWide(block, Wide));
    return zerrNone;
}

// Kept: the log shows a value that was not read.
ZentaraResult RefuseRegisterTweak(const Zentara_Settings& /*block*/, ZCamera& /*camera*/,
                                  std::uint32_t* value) {
    ZentaraDebugOutputSetting32(zprmRegisterTweak, *value);
    return zerrNotSupported;
}

ZentaraResult SetGainParameter(Zentara_Settings& block, ZCamera& camera, std::uint32_t /*key*/,
                               std::uint32_t value) {
    return Zentara_SetParamS32(&block, zprmS32NormalizedGaindB,
                               camera.ConvertGainToNormGaindB(value));
}

ZentaraResult SetOffsetParameter(Zentara_Settings& block, ZCamera& camera, std::uint32_t /*key*/,
                                 std::uint32_t value) {
    return Zentara_SetParamS32(&block, zprmS32AbsoluteOffset,
                               camera.ConvertOffsetToAbsoluteOffset(value));
}

ZentaraResult SetNormalizedGainParameter(Zentara_Settings& block, ZCamera& camera,
                                         std::uint32_t /*key*/, std::uint32_t value) {
    return Zentara_SetParamS32(&block, zprmS32NormalizedGaindB,
                               camera.ConvertNormGainToNormGaindB(value));
}

// Kept: unlike any other value an exposure out of range is refused and stored; the next send brings
// it to the nearest limit.
template <std::uint32_t Wide>
ZentaraResult SetExposureParameter(Zentara_Settings& block, ZCamera& camera, std::uint32_t key,
                                   std::uint32_t value) {
    const std::uint64_t nanoseconds = ConvertMicrosecondsToNanoseconds(value);
    SetSettingsWord(block, key, value);
    SetSettingsWide(block, Wide, nanoseconds);
    return JudgeParameter(IsExposureAllowed(camera, nanoseconds));
}

ZentaraResult SetBinningParameter(Zentara_Settings& block, ZCamera& camera, std::uint32_t key,
                                  std::uint32_t value) {
    return StoreListed(block, camera, key, value, zerrNotSupported);
}

// Kept: another code than for binning.
ZentaraResult SetListedParameter(Zentara_Settings& block, ZCamera& camera, std::uint32_t key,
                                 std::uint32_t value) {
    return StoreListed(block, camera, key, value, zerrBadParameter);
}

ZentaraResult SetImageFormatParameter(Zentara_Settings& block, ZCamera& /*camera*/,
                                      std::uint32_t key, std::uint32_t value) {
    std::array<std::uint32_t, CheckedFormats> formats{};
    std::int32_t count = CheckedFormats;
    const ZentaraResult result = Zentara_GetParamSparseTable(&block, key, formats.data(), &count);
    if (result != zerrNone) return zerrBadParameter;
    const auto end = formats.begin() + count;
    if (std::find(formats.begin(), end, value) == end) return zerrBadParameter;
    SetSettingsWord(block, key, value);
    return zerrNone;
}

ZentaraResult SetUnchecked(Zentara_Settings& block, ZCamera& /*camera*/, std::uint32_t key,
                           std::uint32_t value) {
    SetSettingsWord(block, key, value);
    return zerrNone;
}

ZentaraResult GetGaindBParameter(const Zentara_Settings& block, ZCamera& camera,
                                 std::int32_t* value) {
    *value = camera.RoundNormGaindB(GetSettingsSigned(block, zprmS32NormalizedGaindB));
    return zerrNone;
}

ZentaraResult SetSignedUnchecked(Zentara_Settings& block, ZCamera& /*camera*/, std::uint32_t key,
                                 std::int32_t value) {
    SetSettingsSigned(block, key, value);
    return zerrNone;
}

ZentaraResult SetCoolingTargetParameter(Zentara_Settings& block, ZCamera& camera, std::uint32_t key,
                                        std::int32_t value) {
    if (value < camera.GetMinRegulatedCoolingTemp()) return zerrBadParameter;
    if (value > camera.GetMaxRegulatedCoolingTemp()) return zerrBadParameter;
    SetSettingsSigned(block, key, value);
    return zerrNone;
}

ZentaraResult SetWideExposureParameter(Zentara_Settings& block, ZCamera& camera, std::uint32_t key,
                                       std::uint64_t value) {
    SetSettingsWide(block, key, value);
    return JudgeParameter(IsExposureAllowed(camera, value));
}

ZentaraResult SetWideUnchecked(Zentara_Settings& block, ZCamera& /*camera*/, std::uint32_t key,
                               std::uint64_t value) {
    SetSettingsWide(block, key, value);
    return zerrNone;
}

template ZentaraResult GetExposureParameter<zprm64Exposure>(const Zentara_Settings&, ZCamera&,
                                                            std::uint32_t*);
template ZentaraResult GetExposureParameter<zprm64ExposureRed>(const Zentara_Settings&, ZCamera&,
                                                               std::uint32_t*);
template ZentaraResult GetExposureParameter<zprm64ExposureBlue>(const Zentara_Settings&, ZCamera&,
                                                                std::uint32_t*);
template ZentaraResult SetExposureParameter<zprm64Exposure>(Zentara_Settings&, ZCamera&,
                                                            std::uint32_t, std::uint32_t);
template ZentaraResult SetExposureParameter<zprm64ExposureRed>(Zentara_Settings&, ZCamera&,
                                                               std::uint32_t, std::uint32_t);
template ZentaraResult SetExposureParameter<zprm64ExposureBlue>(Zentara_Settings&, ZCamera&,
                                                                std::uint32_t, std::uint32_t);

}  // namespace ZV
