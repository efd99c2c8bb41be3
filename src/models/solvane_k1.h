#pragma once

#include <cstdint>
#include <memory>
#include <vector>

#include "camera/morvane_fw_camera.h"
#include "models/intensifier_gain_model.h"

namespace ZV {

/// Model id 9: a camera behind an image intensifier, whose gain has a model of its own.
class SolvaneK1 : public MorvaneFWCamera {
  public:
    using MorvaneFWCamera::MorvaneFWCamera;
    ~SolvaneK1() override;

    void GetSymmetricalBinningModes(std::vector<std::uint16_t>& modes) override;
    const char* GetModelName() override;
    std::uint32_t GetAnalogBoardType() override;
    bool IsIntensifierAvailable() override;
    bool IsTriggerDelayAvialable() override;

    CameraResult SetupNormalizedIntensifiedGain() override;
    std::uint32_t GetIntensifierGainMin() override;
    std::uint32_t GetIntensifierGainMax() override;
    std::uint64_t GetNormalizedIntensifierGainMin() override;
    std::uint64_t GetNormalizedIntensifierGainMax() override;
    std::int32_t GetNormalizedIntensifierGaindBMin() override;
    std::int32_t GetNormalizedIntensifierGaindBMax() override;
    std::uint16_t GetNormalizedIntensifierGaindBResolution() override;
    std::uint16_t GetNormalizedIntensifierGainSignificantFigures() override;
    std::uint32_t GetNormalizedIntensifierGaindB() override;
    std::uint64_t GetNormalizedIntensifierGain() override;
    std::uint32_t GetIntensifierGain() override;
    CameraResult SetNormalizedIntensifierGain(std::uint64_t normGain) override;

  private:
    /// The model, or one of zeros before it has been set up.
    const IntensifierGainModel& GetIntensifierModelOrNone() const;

    std::unique_ptr<IntensifierGainModel> intensifierGainModel;
};

}  // namespace ZV
