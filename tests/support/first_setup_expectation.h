#pragma once

#include <cstdint>
#include <vector>

#include "support/expected_registers.h"

namespace ZV::Test {

struct ExpectedSetup {
    std::vector<ExpectedWrite> writes;  ///< In bus order.
    std::vector<std::uint32_t> shadow;  ///< Of the control block, afterwards.
    bool isRefused = false;             ///< A step failed, and the setup ended with it.
};

/// The writes that bring a camera to its default state, told once more without the library's code:
/// nothing but a shadow of the control block that begins as zeros, the camera's configuration and
/// the list of steps. The length of each block is that of its version; beyond it the configuration
/// reads 0, and the shadow keeps nothing.
ExpectedSetup CalculateFirstSetup(const CameraContents& camera);

}  // namespace ZV::Test
