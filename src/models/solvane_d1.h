#pragma once

#include <cstdint>
#include <vector>

#include "camera/morvane_fw_camera.h"

namespace ZV {

/// Model id 15. In streaming version 2 its image arrives turned by half a turn, so that the camera
/// states its ROI from the far corner; the mirror uses the unbinned sensor.
class SolvaneD1 : public MorvaneFWCamera {
  public:
    using MorvaneFWCamera::MorvaneFWCamera;
    ~SolvaneD1() override;

    void GetSymmetricalBinningModes(std::vector<std::uint16_t>& modes) override;
    const char* GetModelName() override;
    std::uint32_t GetAnalogBoardType() override;
    void GetReadoutFrequencyModes(std::vector<float>& modes) override;
    void GetTriggerModes(std::vector<std::uint32_t>& modes) override;

    std::uint32_t GetROIX() override;
    std::uint32_t GetROIY() override;
    /// In streaming version 2 CameraBadValue for a width or height of 0. A ROI beyond the sensor
    /// wraps.
    CameraResult SetROI(std::uint32_t x, std::uint32_t y, std::uint32_t width,
                        std::uint32_t height) override;

  private:
    bool IsTurned();
};

}  // namespace ZV
