#include "models/folary.h"

#include <algorithm>
#include <array>

#include "camera/gain_conversion.h"
#include "models/model_traits.h"

namespace ZV {

namespace {

constexpr std::array<std::uint16_t, 4> VerticalModes{1, 2, 3, 4};
constexpr std::array<std::uint32_t, 2> TriggerModes{0, 5};
constexpr std::uint32_t EarlyGainMax = 3171;
constexpr std::uint64_t DefaultExposureNs = 100000000;

constexpr std::uint32_t BinningQuadlet = ControlBinning.quadlet;
constexpr std::uint32_t BinningBits = 0x00FFFF03;
struct BinningRow {
    std::uint32_t mode;
    std::uint32_t bits;
};
constexpr BinningRow BinningRows[] = {
    {1, 0}, {2, 0x10101}, {3, 0x20202}, {4, 0x30303}, {8, 0x70702}};

struct SensorChunk {
    std::uint32_t sensorWidth;
    std::uint32_t chunk;
};
constexpr SensorChunk VideoChunks[] = {{2048, 3}, {2560, 4}};

const BinningRow* FindBinning(std::uint32_t mode) {
    for (const BinningRow& row : BinningRows) {
        if (row.mode == mode) return &row;
    }
    return nullptr;
}

std::uint32_t MakeEven(std::uint32_t value) {
    return value & ~1u;
}

}  // namespace

Folary::~Folary() = default;

const char* Folary::GetModelName() {
    return "Folary";
}

std::uint32_t Folary::GetAnalogBoardType() {
    return BoardTypeCurve;
}

std::uint32_t Folary::GetGainMax() {
    const bool isEarly = registers.configuration.major < 3 && registers.configuration.minor < 4;
    return isEarly ? EarlyGainMax : MorvaneFWCamera::GetGainMax();
}

std::uint64_t Folary::GetDefaultExposure() {
    return DefaultExposureNs;
}

std::uint32_t Folary::GetImageFormat() {
    constexpr std::uint32_t CameraBayer = 2;
    return GetSymmetricalBinningMode() > 1 ? CameraBayer : MorvaneFWCamera::GetImageFormat();
}

bool Folary::GetRTVMode() {
    return ReadControlField(ControlRtvMode) != 0;
}

bool Folary::IsRTVModeSupported() {
    return ReadConfigurationField(ConfigRtvMode) != 0;
}

bool Folary::IsInterlaced() {
    return !GetRTVMode();
}

void Folary::GetSymmetricalBinningModes(std::vector<std::uint16_t>& modes) {
    EraseVector(modes);
}

void Folary::GetVerticalBinningModes(std::vector<std::uint16_t>& modes) {
    AppendModes(VerticalModes, modes);
}

void Folary::GetSyncBModes(std::vector<std::uint32_t>& modes) {
    EraseVector(modes);
}

void Folary::GetTriggerModes(std::vector<std::uint32_t>& modes) {
    AppendModes(TriggerModes, modes);
}

bool Folary::IsSymmetricalBinningSupported() {
    return false;
}

bool Folary::IsVerticalBinningSupported() {
    return true;
}

bool Folary::IsSyncBSupported() {
    return false;
}

std::uint16_t Folary::GetHorizontalBinningMode() {
    return 1;
}

std::uint32_t Folary::GetMaxCCDWidthForBinningMode(std::uint32_t mode) {
    if (GetRTVMode()) return GetROIMaxWidthForRTVMode();
    const std::uint64_t pair = std::max<std::uint64_t>(mode, 1) * 2;
    return static_cast<std::uint32_t>(GetCCDWidth() / pair * pair);
}

std::uint32_t Folary::GetMaxCCDHeightForBinningMode(std::uint32_t mode) {
    if (GetRTVMode()) return GetROIMaxHeightForRTVMode();
    return MakeEven(GetCCDHeight() / std::max(mode, 1u));
}

std::uint32_t Folary::GetROIMaxWidthForRTVMode() {
    return ReadConfigurationField(ConfigWidthBinning2);
}

std::uint32_t Folary::GetROIMaxHeightForRTVMode() {
    return ReadConfigurationField(ConfigHeightBinning2);
}

std::uint32_t Folary::GetChunk(std::uint32_t height) {
    if (!GetRTVMode()) return GetVerticalBinningMode();
    for (const SensorChunk& row : VideoChunks) {
        if (row.sensorWidth == GetCCDWidth()) return row.chunk;
    }
    // Kept: on any other sensor the chunk in real-time video is the height that was asked for.
    return height & 0xFFFF;
}

CameraResult Folary::SetROI(std::uint32_t x, std::uint32_t y, std::uint32_t width,
                            std::uint32_t height) {
    const std::uint32_t chunk = GetChunk(height);
    std::uint32_t evenWidth = MakeEven(width);
    if (chunk != 0 && evenWidth / chunk % 2 != 0) evenWidth -= chunk;
    return MorvaneFWCamera::SetROI(MakeEven(x), MakeEven(y), evenWidth, MakeEven(height));
}

CameraResult Folary::SetSymmetricalBinning(std::uint32_t mode) {
    const std::uint16_t formerMode = GetSymmetricalBinningMode();
    if (mode == formerMode) return CameraOk;

    const std::uint32_t cleared = ReadControl(BinningQuadlet) & ~BinningBits;
    const BinningRow* const row = FindBinning(mode);
    if (row == nullptr) {
        // Kept: a refused mode leaves the shadow at mode 1 while the camera bins as before.
        StoreControl(BinningQuadlet, cleared);
        return CameraBadValue;
    }
    const CameraResult result = WriteGeometry(BinningQuadlet, cleared | row->bits);
    if (result != CameraOk) return result;

    if (mode >= 2)
        return PlaceROI(GetMaxCCDWidthForBinningMode(mode), GetMaxCCDHeightForBinningMode(mode));
    return formerMode >= 2 ? PlaceFullROI() : CameraOk;
}

CameraResult Folary::PlaceROI(std::uint32_t width, std::uint32_t height) {
    CameraResult result = SetROIWidth(width);
    if (result == CameraOk) result = SetROIX(0);
    if (result == CameraOk) result = SetROIHeight(height);
    if (result == CameraOk) result = SetROIY(0);
    return result;
}

CameraResult Folary::PlaceFullROI() {
    CameraResult result = SetROIWidth(GetCCDWidth());
    if (result == CameraOk) result = SetROIHeight(GetCCDHeight());
    if (result == CameraOk) result = SetROIX(0);
    if (result == CameraOk) result = SetROIY(0);
    return result;
}

CameraResult Folary::SetVerticalBinning(std::uint32_t mode) {
    return SetSymmetricalBinning(GetRTVMode() ? 1 : mode);
}

CameraResult Folary::SetRTVMode(bool isOn) {
    if (isOn == GetRTVMode()) return CameraOk;
    CameraResult result = WriteGeometryField(ControlRtvMode, isOn);
    if (result != CameraOk) return result;
    if (!isOn) return PlaceROI(GetCCDWidth(), GetCCDHeight());

    result = SetVerticalBinning(1);
    if (result == CameraOk) result = SetROIHeight(GetMaxCCDHeightForBinningMode(1));
    if (result == CameraOk) result = SetROIX(0);
    if (result == CameraOk) result = SetROIWidth(GetMaxCCDWidthForBinningMode(1));
    if (result == CameraOk) result = SetROIY(0);
    return result;
}

}  // namespace ZV
