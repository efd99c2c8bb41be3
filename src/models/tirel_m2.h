#pragma once

#include <cstdint>
#include <vector>

#include "camera/morvane_fw_camera.h"

namespace ZV {

/// Model id 31.
class TirelM2 : public MorvaneFWCamera {
  public:
    using MorvaneFWCamera::MorvaneFWCamera;
    ~TirelM2() override;

    void GetSymmetricalBinningModes(std::vector<std::uint16_t>& modes) override;
    const char* GetModelName() override;
    std::uint32_t GetAnalogBoardType() override;
    float GetReadoutFrequencyDefault() override;
    void GetReadoutFrequencyModes(std::vector<float>& modes) override;
    void GetTriggerModes(std::vector<std::uint32_t>& modes) override;

  private:
    std::uint16_t GetTagCode() override;
};

}  // namespace ZV
