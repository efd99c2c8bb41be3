#pragma once

#include <cstdint>
#include <vector>

#include "support/expected_registers.h"
#include "zentara/zentara.h"

namespace ZV::Test {

/// What a send of a settings block does to a camera that does not stream.
struct ExpectedSend {
    ZentaraResult result = zerrNone;
    std::vector<ExpectedWrite> writes;  ///< In bus order.
    std::vector<std::uint32_t> shadow;  ///< Of the control block, afterwards.
    Zentara_Settings block{};           ///< As the client finds it afterwards.
};

/// The writes of a send, told once more without the library's code, for a block that belongs to the
/// camera. `shadow` is the control block before, `last` what was read or sent last.
ExpectedSend CalculateSend(const CameraContents& camera, const std::vector<std::uint32_t>& shadow,
                           const Zentara_Settings& block, const Zentara_Settings& last);

/// The same of a preflight alone.
ExpectedSend CalculatePreflight(const CameraContents& camera,
                                const std::vector<std::uint32_t>& shadow,
                                const Zentara_Settings& block);

}  // namespace ZV::Test
