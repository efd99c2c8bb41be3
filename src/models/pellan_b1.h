#pragma once

#include <cstdint>
#include <vector>

#include "camera/morvane_fw_camera.h"

namespace ZV {

/// Model id 25. With a hardware profile it has an analog board of type 3, whose gain and offset
/// stand in registers of their own; the gain is then a plain ratio to its default.
class PellanB1 : public MorvaneFWCamera {
  public:
    using MorvaneFWCamera::MorvaneFWCamera;
    ~PellanB1() override;

    void GetSymmetricalBinningModes(std::vector<std::uint16_t>& modes) override;
    const char* GetModelName() override;
    std::uint32_t GetAnalogBoardType() override;
    void GetReadoutFrequencyModes(std::vector<float>& modes) override;
    void GetTriggerModes(std::vector<std::uint32_t>& modes) override;
    std::uint16_t GetReadoutPort() override;
    /// Does nothing and succeeds.
    CameraResult SetReadoutPort(std::uint32_t port) override;
    using MorvaneFWCamera::CalculateRequiredPacketSize;
    std::uint16_t CalculateRequiredPacketSize(bool clamp) override;

    std::uint32_t GetGainDACRange() override;
    std::uint32_t GetGain() override;
    std::uint32_t GetGainDefault() override;
    std::uint32_t GetGainMin() override;
    std::uint32_t GetGainMax() override;
    std::uint32_t GetNormalizedGain() override;
    double GetNormalizedGainMin() override;
    double GetNormalizedGainMax() override;
    std::int32_t GetNormalizedGaindB() override;
    std::int32_t GetNormalizedGaindBMin() override;
    std::int32_t GetNormalizedGaindBMax() override;
    CameraResult SetGain(std::uint32_t gain) override;
    CameraResult SetNormalizedGain(std::uint32_t normGain) override;
    CameraResult SetNormalizedGaindB(std::int32_t gaindB) override;

    std::int32_t GetOffset() override;
    std::int32_t GetOffsetDefault() override;
    std::int32_t GetOffsetMin() override;
    std::int32_t GetOffsetMax() override;
    CameraResult SetOffset(std::int32_t offset) override;

  private:
    std::uint16_t GetTagCode() override;
    bool IsRatioBoard();
    double DivideByDefault(std::uint32_t gain);
    std::int32_t ConvertRatioTodB(double ratio);
};

}  // namespace ZV
