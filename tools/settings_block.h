#pragma once

#include <optional>
#include <string>
#include <vector>

#include "driver.h"
#include "setting_values.h"

namespace ZentaraProgram {

struct Region;

/// What a camera allows for a setting: a list, or a least and a greatest value, or all there is.
struct SettingLimits {
    bool isList = false;
    std::vector<SettingValue> values;
    std::optional<SettingValue> least, greatest;

    [[nodiscard]] bool Allows(SettingValue value) const;
};

/// The settings block of an open camera, by the library's accessors. The camera must outlive it.
class SettingsBlock {
  public:
    /// Fills the block with the state of the camera.
    ZentaraResult Read(const Camera& camera);
    /// Makes the block the camera's state; the block then holds what the camera made of it.
    ZentaraResult Send(const Camera& camera);
    /// Mends the block as a send would.
    ZentaraResult Preflight(const Camera& camera);

    /// Measures the white balance over a region and sends it; the block then holds the new gains.
    ZentaraResult BalanceWhite(const Region& region);
    /// Looks for the exposure of a region and sends it; the block then holds the new exposure.
    ZentaraResult Expose(const Region& region);

    /// Finishes a frame of the record's camera with the algorithm and the format of the block.
    ZentaraResult ProcessFrame(const Camera& camera, const Zentara_Frame& in, Zentara_Frame* out);

    /// Nothing when the camera does not have it, or when it cannot be read.
    [[nodiscard]] std::optional<SettingValue> Get(const Setting& setting) const;
    ZentaraResult Set(const Setting& setting, SettingValue value);
    [[nodiscard]] SettingLimits GetLimits(const Setting& setting) const;

    /// True when all bytes are the same.
    [[nodiscard]] bool IsSame(const SettingsBlock& other) const;

  private:
    // The accessors take a pointer to non-const, and those that ask do not write.
    mutable Zentara_Settings block{};
};

[[nodiscard]] bool IsSupported(const Camera& camera, const Setting& setting);

/// "this camera (Solvane A1) does not have the setting fan"
std::string DescribeMissing(const Camera& camera, const Setting& setting);

/// "16 us to 300 s", "20 MHz, 10 MHz"; empty where the camera tells no limit.
std::string DescribeLimits(const Setting& setting, const SettingLimits& limits);

/// A setting that differs between two blocks.
struct SettingChange {
    const Setting* setting;
    std::optional<SettingValue> before, after;
};
/// The settings of a file that differ, in their order.
std::vector<SettingChange> FindChanges(const SettingsBlock& before, const SettingsBlock& after);

}  // namespace ZentaraProgram
