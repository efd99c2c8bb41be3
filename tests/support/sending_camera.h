#pragma once

#include <gtest/gtest.h>

#include <cstdint>
#include <string_view>
#include <vector>

#include "support/first_setup_expectation.h"
#include "support/flat_camera.h"
#include "support/peeked_camera.h"
#include "support/send_expectation.h"
#include "support/settings_words.h"

namespace ZV::Test {

/// A client of one open camera, and beside it what each of its sends is expected to do. The control
/// block is followed by calculation from the first setup on.
class SendingCamera {
  public:
    SendingCamera(std::string_view scenario, std::string_view className);
    ~SendingCamera();
    SendingCamera(const SendingCamera&) = delete;
    SendingCamera& operator=(const SendingCamera&) = delete;

    bool IsOpen() const { return handle != 0; }
    ZentaraHandle GetHandle() const { return handle; }
    SimulationWorld& GetWorld() { return world; }
    const CameraContents& GetContents() const { return contents; }

    /// Both succeed. What is read counts as the block that was last in force.
    Zentara_Settings Read();
    Zentara_Settings ReadDefaults() const;

    /// Sends, preflights, and compares result, block and register writes with what is expected.
    /// The block then is as the library left it.
    testing::AssertionResult Send(Zentara_Settings& block);
    testing::AssertionResult Preflight(Zentara_Settings& block);

    /// Result and register writes of the last send or preflight.
    ZentaraResult GetResult() const { return result; }
    std::vector<RegisterWrite> GetWrites() const;
    /// Whether the last send ended with the camera taking its settings over.
    bool WasCommitted() const;

  private:
    testing::AssertionResult Compare(const Zentara_Settings& block, const ExpectedSend& expected);

    SimulationWorld world;
    PeekedCamera registers;
    CameraContents contents;
    std::vector<std::uint32_t> shadow;
    Zentara_Settings last = MakeFilledBlock(0xCD);
    ZentaraHandle handle = 0;
    ZentaraResult result = zerrNone;
    std::size_t writesBefore = 0;
};

/// The first field in which two blocks differ.
testing::AssertionResult AreSameBlocks(const Zentara_Settings& expected,
                                       const Zentara_Settings& got);

}  // namespace ZV::Test
