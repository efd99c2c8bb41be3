#pragma once

#include <cstdint>
#include <vector>

#include "camera/morvane_fw_camera.h"

namespace ZV {

/// Model id 8: a colour camera with two ways to read its sensor. Outside real-time video a frame
/// arrives as two fields. Binning is one register for both axes, which clients reach as vertical
/// binning.
class Folary : public MorvaneFWCamera {
  public:
    using MorvaneFWCamera::MorvaneFWCamera;
    ~Folary() override;

    const char* GetModelName() override;
    std::uint32_t GetAnalogBoardType() override;
    std::uint32_t GetGainMax() override;
    std::uint64_t GetDefaultExposure() override;
    std::uint32_t GetImageFormat() override;
    bool GetRTVMode() override;
    bool IsRTVModeSupported() override;

    void GetSymmetricalBinningModes(std::vector<std::uint16_t>& modes) override;
    void GetVerticalBinningModes(std::vector<std::uint16_t>& modes) override;
    void GetSyncBModes(std::vector<std::uint32_t>& modes) override;
    void GetTriggerModes(std::vector<std::uint32_t>& modes) override;
    bool IsSymmetricalBinningSupported() override;
    bool IsVerticalBinningSupported() override;
    bool IsSyncBSupported() override;
    /// Always 1.
    std::uint16_t GetHorizontalBinningMode() override;

    /// Outside real-time video the sensor's width cut to whole pairs of colour pixels, not divided.
    std::uint32_t GetMaxCCDWidthForBinningMode(std::uint32_t mode) override;
    std::uint32_t GetMaxCCDHeightForBinningMode(std::uint32_t mode) override;
    std::uint32_t GetROIMaxWidthForRTVMode() override;
    std::uint32_t GetROIMaxHeightForRTVMode() override;

    /// Makes all four even and cuts the width to an even number of chunks.
    CameraResult SetROI(std::uint32_t x, std::uint32_t y, std::uint32_t width,
                        std::uint32_t height) override;
    CameraResult SetSymmetricalBinning(std::uint32_t mode) override;
    CameraResult SetVerticalBinning(std::uint32_t mode) override;
    CameraResult SetRTVMode(bool isOn) override;

  private:
    bool IsInterlaced() override;
    CameraResult PlaceROI(std::uint32_t width, std::uint32_t height);
    CameraResult PlaceFullROI();
    std::uint32_t GetChunk(std::uint32_t height);
};

}  // namespace ZV
