#pragma once

#include <cstdint>
#include <vector>

#include "camera/morvane_fw_camera.h"

namespace ZV {

inline constexpr std::uint32_t SolvaneB1Id = 13;

/// Model id 13, which it answers whatever its configuration says.
class SolvaneB1 : public MorvaneFWCamera {
  public:
    using MorvaneFWCamera::MorvaneFWCamera;
    ~SolvaneB1() override;

    void GetSymmetricalBinningModes(std::vector<std::uint16_t>& modes) override;
    const char* GetModelName() override;
    std::uint32_t GetAnalogBoardType() override;
    std::uint32_t GetModel() override;
    void GetReadoutFrequencyModes(std::vector<float>& modes) override;
};

}  // namespace ZV
