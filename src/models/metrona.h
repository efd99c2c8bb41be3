#pragma once

#include <cstdint>
#include <vector>

#include "camera/morvane_fw_camera.h"

namespace ZV {

/// Model id 1002: a 16-bit camera whose axes bin separately, each from 1 to 64.
class Metrona : public MorvaneFWCamera {
  public:
    using MorvaneFWCamera::MorvaneFWCamera;
    ~Metrona() override;

    const char* GetModelName() override;
    std::uint32_t GetAnalogBoardType() override;
    std::uint32_t GetBitDepth() override;
    std::uint64_t GetDefaultExposure() override;
    void GetReadoutFrequencyModes(std::vector<float>& modes) override;

    void GetSymmetricalBinningModes(std::vector<std::uint16_t>& modes) override;
    void GetHorizontalBinningModes(std::vector<std::uint16_t>& modes) override;
    void GetVerticalBinningModes(std::vector<std::uint16_t>& modes) override;
    bool IsSymmetricalBinningSupported() override;
    bool IsHorizontalBinningSupported() override;
    bool IsVerticalBinningSupported() override;
    std::uint16_t GetHorizontalBinningMode() override;
    std::uint16_t GetVerticalBinningMode() override;
    /// CameraBadValue outside 1 to 64. No stop step and no new ROI.
    CameraResult SetHorizontalBinning(std::uint32_t mode) override;
    CameraResult SetVerticalBinning(std::uint32_t mode) override;

    std::uint32_t GetMaxCCDWidthForBinningMode(std::uint32_t mode) override;
    std::uint32_t GetMaxCCDHeightForBinningMode(std::uint32_t mode) override;
    std::uint32_t GetImageWidth() override;
    std::uint32_t GetImageHeight() override;

    /// Bits of the exposure where control major 2 keeps its lower half in the same register.
    std::uint32_t GetMetronaShutterDelay() override;
    /// Rounded up to a multiple of 50. CameraNotSupported unless the control block is of 1.2.
    CameraResult SetMetronaShutterDelay(std::uint32_t delay) override;
    bool IsMetronaShutterDelaySupported() override;

  private:
    CameraResult SetAxisBinning(const RegisterField& field, std::uint32_t mode);
};

}  // namespace ZV
