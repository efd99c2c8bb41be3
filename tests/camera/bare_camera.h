#pragma once

#include <cstdint>

#include "camera/morvane_fw_camera.h"

namespace ZV::Test {

/// A model without a device: bus operations do nothing and succeed, registers are what a test makes
/// of them.
template <typename Model>
class BareCamera : public Model {
  public:
    explicit BareCamera(std::uint32_t configurationVersion = MakeVersion(2, 11),
                        std::uint32_t controlVersion = MakeVersion(2, 8))
        : Model(MakeRecord()) {
        SetVersion(this->registers.configuration, configurationVersion);
        SetVersion(this->registers.control, controlVersion);
        SetVersion(this->registers.status, MakeVersion(1, 3));
    }
    ~BareCamera() override { this->EndWhatCloseLeft(); }

    void StoreConfiguration(std::uint32_t quadlet, std::uint32_t value) {
        this->registers.configuration.Store(quadlet, value);
    }
    void StoreConfiguration(const RegisterField& field, std::uint32_t value) {
        const std::uint32_t quadlet = this->registers.configuration.Read(field.quadlet);
        StoreConfiguration(field.quadlet, InsertField(field, quadlet, value));
    }
    using Model::StoreControl;
    void StoreControl(const RegisterField& field, std::uint32_t value) {
        StoreControl(field.quadlet, InsertField(field, this->ReadControl(field.quadlet), value));
    }
    /// Interlaced or not, as a frame that begins now is told.
    bool BeginsInterlacedFrame() {
        this->streaming.isStreaming = true;
        const tStFrameInfo* frame = this->PrivatePeekNewFrame();
        this->streaming.isStreaming = false;
        return frame != nullptr && frame->interlaced;
    }

    using Model::gainModel;
    using Model::ReadControl;
    using Model::ReadControlField;
    using Model::registers;
    using Model::streaming;

  private:
    static HALCamera MakeRecord() {
        constexpr std::uint32_t KindWithoutBackEnd = 2;
        HALCamera record{};
        record.kind = KindWithoutBackEnd;
        return record;
    }
    static void SetVersion(RegisterBlock& block, std::uint32_t version) {
        block.version = version;
        block.major = version >> 16;
        block.minor = version & 0xFFFF;
        (void)block.Provide(MorvaneFWCamera::CalculateRegisterLength(block.table, version));
    }
};

/// The base class with an analog board of any type.
class AnyBoard : public MorvaneFWCamera {
  public:
    using MorvaneFWCamera::MorvaneFWCamera;
    void GetSymmetricalBinningModes(std::vector<std::uint16_t>&) override {}
    const char* GetModelName() override { return "Any"; }
    std::uint32_t GetAnalogBoardType() override { return boardType; }

    std::uint32_t boardType = 2;
};
using BareBase = BareCamera<AnyBoard>;

}  // namespace ZV::Test
