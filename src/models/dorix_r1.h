#pragma once

#include <cstdint>
#include <vector>

#include "camera/morvane_fw_camera.h"

namespace ZV {

/// Model id 10.
class DorixR1 : public MorvaneFWCamera {
  public:
    using MorvaneFWCamera::MorvaneFWCamera;
    ~DorixR1() override;

    void GetSymmetricalBinningModes(std::vector<std::uint16_t>& modes) override;
    const char* GetModelName() override;
    std::uint32_t GetAnalogBoardType() override;
    bool IsRGBFilterSupported() override;
};

}  // namespace ZV
