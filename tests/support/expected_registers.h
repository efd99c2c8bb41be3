#pragma once

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

#include "support/expected_gain.h"

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

/// A quadlet write that a test expects.
struct ExpectedWrite {
    std::string step;  ///< The call that causes it, such as "SetROIX(1)".
    SetupBlock block = SetupBlock::Control;
    std::uint32_t quadlet = 0;
    std::uint32_t value = 0;
};

enum class GainBoardKind { One, Two, TwoFromFirmware6, TwoFromFirmware100, ByProfile };

/// What a model does differently; the others follow the first values.
struct ModelFacts {
    std::string_view name;
    GainBoardKind board = GainBoardKind::Two;
    float readoutMHz = 20;
    bool hasFilterWheel = true;  ///< Before a monochrome sensor.
};

/// Bits `first` to `last` of a value.
std::uint32_t TakeBits(std::uint32_t value, unsigned first, unsigned last);

/// The registers of a camera told once more without the library's code: its configuration, a shadow
/// of the control block and the writes that were made of it. The length of each block is that of
/// its version; beyond it the configuration reads 0, and the shadow keeps nothing.
class ExpectedRegisters {
  public:
    explicit ExpectedRegisters(const CameraContents& contents);

    std::vector<ExpectedWrite> writes;  ///< In bus order.
    std::vector<std::uint32_t> shadow;  ///< Begins as zeros.

  protected:
    // The camera as read.
    std::uint32_t Config(std::uint32_t quadlet) const;
    std::uint32_t Config(std::uint32_t quadlet, unsigned first, unsigned last) const;
    bool IsConfigurationAtLeast(std::uint32_t major, std::uint32_t minor) const;
    bool HasFeature(unsigned bit) const;
    bool HasTweaks() const { return IsConfigurationAtLeast(2, 10); }
    bool Is(std::string_view name) const { return facts.name == name; }
    bool IsMicrosecondControl() const { return (camera.controlVersion >> 16) == 1; }
    std::uint32_t GetSensorWidth() const { return Config(4, 16, 31); }
    std::uint32_t GetSensorHeight() const { return Config(4, 0, 15); }
    bool HasRatioBoard() const;
    GainBoard MakeGainBoard() const;
    /// Takes the camera's other configuration, if it has one.
    void ReadConfigurationAgain();

    // The shadow and the bus.
    std::uint32_t Shadow(std::uint32_t quadlet) const;
    std::uint32_t Shadow(std::uint32_t quadlet, unsigned first, unsigned last) const;
    void Store(std::uint32_t quadlet, std::uint32_t value);
    void Write(const std::string& step, std::uint32_t quadlet, std::uint32_t value);
    void WriteBits(const std::string& step, std::uint32_t quadlet, unsigned first, unsigned last,
                   std::uint32_t value);
    /// A setter that sends nothing when the value is there already.
    void ChangeBits(const std::string& step, std::uint32_t quadlet, unsigned first, unsigned last,
                    std::uint32_t value);
    void TakeOver(const std::string& step);

    float GetReadoutFrequency() const;
    /// Whether a frequency with this binning asks for more than an old control block has packets.
    bool IsTooFast(float megahertz, std::uint32_t binning) const;
    static std::int32_t ReadCelsius(std::uint32_t code);

    CameraContents camera;
    const ModelFacts& facts;

  private:
    void LimitConfiguration();
    bool HasCurve() const;
    std::uint32_t GetDacMax() const;

    std::vector<std::uint32_t> configuration;
};

}  // namespace ZV::Test
