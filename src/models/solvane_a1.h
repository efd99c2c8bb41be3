#pragma once

#include <cstdint>
#include <vector>

#include "camera/morvane_fw_camera.h"

namespace ZV {

/// Model id 5. With sensor 46 or 53 the camera is a `SolvaneB1`.
class SolvaneA1 : public MorvaneFWCamera {
  public:
    using MorvaneFWCamera::MorvaneFWCamera;
    ~SolvaneA1() override;

    void GetSymmetricalBinningModes(std::vector<std::uint16_t>& modes) override;
    const char* GetModelName() override;
    std::uint32_t GetAnalogBoardType() override;
    std::uint32_t ReturnMasqueradedModel() override;
};

}  // namespace ZV
