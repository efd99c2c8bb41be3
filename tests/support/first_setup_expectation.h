#pragma once

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

namespace ZV::Test {

/// A camera before it is listed, as the first setup finds it.
struct CameraContents {
    std::string_view className;  ///< Of the model, such as "SolvaneG2".
    std::uint32_t configurationVersion = 0, controlVersion = 0;  ///< Version words.
    std::vector<std::uint32_t> configuration;  ///< At least as long as the version's block.
    /// What the camera reports once the first take-over has happened; empty: the same.
    std::vector<std::uint32_t> configurationAfterTakeOver;
    std::uint32_t position = 0;  ///< Among the devices that the bus lists.
};

enum class SetupBlock { Control, Command };

/// A quadlet write of the first setup.
struct ExpectedWrite {
    std::string step;  ///< The call that causes it, such as "SetROIX(1)".
    SetupBlock block = SetupBlock::Control;
    std::uint32_t quadlet = 0;
    std::uint32_t value = 0;
};

struct ExpectedSetup {
    std::vector<ExpectedWrite> writes;  ///< In bus order.
    bool isRefused = false;             ///< A step failed, and the setup ended with it.
};

/// The writes that bring a camera to its default state, told once more without the library's code:
/// nothing but a shadow of the control block that begins as zeros, the camera's configuration and
/// the list of steps. The length of each block is that of its version; beyond it the configuration
/// reads 0, and the shadow keeps nothing.
ExpectedSetup CalculateFirstSetup(const CameraContents& camera);

}  // namespace ZV::Test
