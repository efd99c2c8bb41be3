#pragma once

#include <gtest/gtest.h>

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

#include "support/expected_registers.h"
#include "support/simulation_world.h"

namespace ZV::Test {

/// A camera of a simulated world as its registers show it past the bus.
class PeekedCamera {
  public:
    PeekedCamera(const SimulationWorld& world, std::string_view className,
                 std::uint32_t position = 0);

    std::uint32_t Peek(std::uint32_t address) const { return world.Peek(address, position); }
    /// Its contents as they are now.
    CameraContents ReadContents() const;
    std::vector<std::uint32_t> ReadConfiguration() const;
    std::vector<RegisterWrite> ReadWrites() const { return world.ReadRegisterWrites(position); }

    std::uint32_t GetAddress(const ExpectedWrite& write) const;
    /// An address as "control[3]".
    std::string DescribeAddress(std::uint32_t address) const;

    /// Whether the writes from the n-th on are these. A failure tells the first difference.
    testing::AssertionResult HasWritten(const std::vector<ExpectedWrite>& expected,
                                        std::size_t from = 0) const;

  private:
    std::uint32_t FindBlock(std::uint32_t directoryQuadlet) const;
    std::string DescribeWrite(const RegisterWrite& write) const;
    std::string DescribeExpected(const ExpectedWrite& write) const;

    const SimulationWorld& world;  // borrowed from the test, for its life
    std::string_view className;
    std::uint32_t position;
};

}  // namespace ZV::Test
