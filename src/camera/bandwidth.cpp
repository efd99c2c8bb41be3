#include <algorithm>
#include <cstdint>

#include "camera/morvane_fw_camera.h"
#include "camera/packet_size.h"

namespace ZV {

BusConnection MorvaneFWCamera::ReadBusConnection() {
    HALCamera record = GetHALCamera();
    BusConnection bus{0, 0};
    // The sizes say what is to be done when either is not known.
    (void)HAL_CameraConnectionSpeed(&record, &bus.megabits);
    (void)HAL_CameraFastestPacketSizeSupported(&record, &bus.fastestBytes);
    return bus;
}

std::uint16_t MorvaneFWCamera::GetFastestPacketSize() {
    if (GetControlVersion() < FirstSizedControlVersion) return FixedPacketBytes;
    return ReadBusConnection().fastestBytes;
}

std::uint16_t MorvaneFWCamera::CalculateRequiredPacketSize(std::uint16_t binning,
                                                           std::uint16_t bitDepth,
                                                           float megahertz) {
    const ReadoutLoad load{binning, bitDepth, megahertz};
    if (GetControlVersion() < FirstSizedControlVersion) return CalculateFixedPacketSize(load);
    return CalculatePacketSize(load, ReadBusConnection(), GetFirmwareVersion());
}

std::uint16_t MorvaneFWCamera::CalculateRequiredPacketSize(bool clamp) {
    const std::uint16_t size = CalculateRequiredPacketSize(
        GetHorizontalBinningMode(), static_cast<std::uint16_t>(GetBitDepth()),
        GetReadoutFrequency());
    return clamp ? std::min(size, ReadBusConnection().fastestBytes) : size;
}

CameraResult MorvaneFWCamera::SetMaxPacketSize(std::uint32_t payloadBytes) {
    if (GetControlVersion() < FirstSizedControlVersion) return CameraNotSupported;
    return WriteControlField(ControlMaxPacketSize, payloadBytes);
}

std::uint16_t MorvaneFWCamera::GetMaxPacketSize() {
    return static_cast<std::uint16_t>(ReadControlField(ControlMaxPacketSize));
}

CameraResult MorvaneFWCamera::ReallocateBandwidth(std::uint16_t payloadBytes) {
    const CameraResult result = SetMaxPacketSize(payloadBytes);
    // An older camera is not told its size, and has nothing to take over.
    if (result != CameraOk && result != CameraNotSupported) return result;
    if (result == CameraOk) {
        const HALStatus status = WriteCommand(CommandTakeOver, 1);
        if (status != HALOk) return TranslateHalStatus(status);
    }

    HALCamera record = GetHALCamera();
    const HALStatus status = HAL_CameraReallocateBandwidth(&record, payloadBytes, GetTagCode());
    SetHALCamera(record);
    return status == HALOk ? CameraOk : CameraBandwidthFault;
}

}  // namespace ZV
