#pragma once

#include <cstdint>

#include "camera/camera.h"
#include "zentara/zentara.h"

namespace ZV {

/// Rules of single keys: what reading and writing them in a block does beyond moving the word. The
/// camera is that of the block. Those that hand a value on to another key return that call's
/// result.

ZentaraResult GetGainParameter(const Zentara_Settings& block, ZCamera& camera,
                               std::uint32_t* value);
ZentaraResult GetOffsetParameter(const Zentara_Settings& block, ZCamera& camera,
                                 std::uint32_t* value);
ZentaraResult GetNormalizedGainParameter(const Zentara_Settings& block, ZCamera& camera,
                                         std::uint32_t* value);
/// Microseconds of the 64-bit key that Wide names.
template <std::uint32_t Wide>
ZentaraResult GetExposureParameter(const Zentara_Settings& block, ZCamera& camera,
                                   std::uint32_t* value);
/// Always zerrNotSupported; the value is left alone and goes to the log all the same.
ZentaraResult RefuseRegisterTweak(const Zentara_Settings& block, ZCamera& camera,
                                  std::uint32_t* value);

ZentaraResult SetGainParameter(Zentara_Settings& block, ZCamera& camera, std::uint32_t key,
                               std::uint32_t value);
ZentaraResult SetOffsetParameter(Zentara_Settings& block, ZCamera& camera, std::uint32_t key,
                                 std::uint32_t value);
ZentaraResult SetNormalizedGainParameter(Zentara_Settings& block, ZCamera& camera,
                                         std::uint32_t key, std::uint32_t value);
/// Stores the word, and the nanoseconds in the 64-bit key that Wide names, also out of range.
template <std::uint32_t Wide>
ZentaraResult SetExposureParameter(Zentara_Settings& block, ZCamera& camera, std::uint32_t key,
                                   std::uint32_t value);
/// Stores a value of the key's list; zerrNotSupported for another.
ZentaraResult SetBinningParameter(Zentara_Settings& block, ZCamera& camera, std::uint32_t key,
                                  std::uint32_t value);
/// Stores a value of the key's list; zerrBadParameter for another.
ZentaraResult SetListedParameter(Zentara_Settings& block, ZCamera& camera, std::uint32_t key,
                                 std::uint32_t value);
/// The same for the list of formats, as Zentara_GetParamSparseTable gives it.
ZentaraResult SetImageFormatParameter(Zentara_Settings& block, ZCamera& camera, std::uint32_t key,
                                      std::uint32_t value);
/// Stores whatever it is.
ZentaraResult SetUnchecked(Zentara_Settings& block, ZCamera& camera, std::uint32_t key,
                           std::uint32_t value);

ZentaraResult GetGaindBParameter(const Zentara_Settings& block, ZCamera& camera,
                                 std::int32_t* value);
ZentaraResult SetSignedUnchecked(Zentara_Settings& block, ZCamera& camera, std::uint32_t key,
                                 std::int32_t value);
/// Stores a value within the key's limits; zerrBadParameter for another.
ZentaraResult SetCoolingTargetParameter(Zentara_Settings& block, ZCamera& camera, std::uint32_t key,
                                        std::int32_t value);

/// Stores always; zerrBadParameter out of range.
ZentaraResult SetWideExposureParameter(Zentara_Settings& block, ZCamera& camera, std::uint32_t key,
                                       std::uint64_t value);
ZentaraResult SetWideUnchecked(Zentara_Settings& block, ZCamera& camera, std::uint32_t key,
                               std::uint64_t value);

}  // namespace ZV
