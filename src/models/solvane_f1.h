#pragma once

#include <cstdint>
#include <vector>

#include "camera/morvane_fw_camera.h"

namespace ZV {

/// Model id 16.
class SolvaneF1 : public MorvaneFWCamera {
  public:
    using MorvaneFWCamera::MorvaneFWCamera;
    ~SolvaneF1() override;

    void GetSymmetricalBinningModes(std::vector<std::uint16_t>& modes) override;
    const char* GetModelName() override;
    std::uint32_t GetAnalogBoardType() override;
    void GetTriggerModes(std::vector<std::uint32_t>& modes) override;
    /// Does nothing and succeeds.
    CameraResult SetVerticalBinning(std::uint32_t mode) override;
    bool IsShutterCloseDelayAvailable() override;
};

}  // namespace ZV
