#include "api/information_table.h"

#include <array>

#include "imaging/ex_image.h"
#include "imaging/image_formats.h"

namespace ZV {

namespace {

// Kept: a list of its own. It names types that no camera has, calls 14, 31 and 32 by other names
// than GetModelName does, and leaves some models out.
constexpr std::array CameraTypeNames{
    ValueName{5, "Solvane A1"},  ValueName{6, "Solvane A2"},  ValueName{7, "Dorix B1"},
    ValueName{8, "Folary"},      ValueName{9, "Solvane K1"},  ValueName{10, "Dorix R1"},
    ValueName{12, "Solvane C1"}, ValueName{13, "Solvane B1"}, ValueName{14, "Pellan A1"},
    ValueName{15, "Solvane D1"}, ValueName{17, "Pellan C1"},  ValueName{18, "Solvane C2"},
    ValueName{21, "Nessa A"},    ValueName{22, "Nessa B"},    ValueName{23, "Nessa C"},
    ValueName{24, "Nessa D"},    ValueName{25, "Pellan D1"},  ValueName{26, "Solvane E1"},
    ValueName{27, "Pellan A2"},  ValueName{28, "Solvane D2"}, ValueName{29, "Solvane G2"},
    ValueName{30, "Solvane G1"}, ValueName{31, "Tirel M2"},   ValueName{32, "Tirel M1"},
    ValueName{33, "Solvane H1"},
};

template <std::uint32_t Value>
ZentaraResult AnswerConstant(const InformationSource&, std::uint32_t* value) {
    *value = Value;
    return zerrNone;
}

template <auto Getter>
ZentaraResult Answer(const InformationSource& source, std::uint32_t* value) {
    *value = static_cast<std::uint32_t>((source.camera.*Getter)());
    return zerrNone;
}

template <auto Getter>
ZentaraResult AnswerOfIntensifier(const InformationSource& source, std::uint32_t* value) {
    if (!source.camera.IsIntensifierAvailable()) return zerrNotSupported;
    return Answer<Getter>(source, value);
}

// Kept: the value is written on a camera without a trigger delay too.
ZentaraResult AnswerTriggerDelayResolution(const InformationSource& source, std::uint32_t* value) {
    *value = source.camera.GetTriggerDelayResolution();
    return source.camera.IsTriggerDelayAvialable() ? ZentaraResult{zerrNone}
                                                   : ZentaraResult{zerrNotSupported};
}

ZentaraResult AnswerImageSize(const InformationSource& source, std::uint32_t* value) {
    std::uint32_t pixelBytes = GetBytesPerSample(source.camera.GetBitDepth());
    if (source.camera.GetRGBFilterCycleMode()) {
        if (source.context == nullptr) return zerrBadHandle;
        pixelBytes = ZExImage::ImageFormatByteSize(source.context->rgbWheel->GetOutputFormat());
    }
    *value = pixelBytes * source.camera.GetImageWidth() * source.camera.GetImageHeight();
    return zerrNone;
}

// Kept: for a camera that is neither, the value stays untouched and the result is success.
ZentaraResult AnswerCcdType(const InformationSource& source, std::uint32_t* value) {
    const std::uint32_t format = source.camera.GetImageFormat();
    if (format == CameraMono || format == CameraRGBFilter) *value = 0;
    if (format == CameraBayer) *value = 1;
    return zerrNone;
}

ZentaraResult AnswerPostProcessImageSize(const InformationSource& source, std::uint32_t* value) {
    if (source.context == nullptr) return zerrBadHandle;
    *value = static_cast<std::uint32_t>(
        Zentara_CalcImageSize(source.context->bayerFilter->GetOutputFormat(),
                              source.camera.GetROIWidth(), source.camera.GetROIHeight()));
    return zerrNone;
}

ZentaraResult AnswerAsymmetricalBinning(const InformationSource& source, std::uint32_t* value) {
    *value =
        source.camera.IsVerticalBinningSupported() && source.camera.IsHorizontalBinningSupported()
            ? 1
            : 0;
    return zerrNone;
}

constexpr std::array Rows{
    InformationRow{.key = zinfCameraType,
                   .name = "zinfCameraType",
                   .unit = "",
                   .meaning = "Model, one of zmodel...",
                   .label = "Camera Type",
                   .answer = Answer<&ZCamera::GetModel>,
                   .form = LogForm::Named,
                   .values = CameraTypeNames},
    InformationRow{.key = zinfSerialNumber,
                   .name = "zinfSerialNumber",
                   .unit = "",
                   .meaning = "Always 0; Zentara_GetSerialString has the number",
                   .label = "Serial Number",
                   .answer = AnswerConstant<0>},
    InformationRow{.key = zinfHardwareVersion,
                   .name = "zinfHardwareVersion",
                   .unit = "",
                   .meaning = "Version of the camera's hardware",
                   .label = "Hardware Version",
                   .answer = Answer<&ZCamera::GetHardwareVersion>},
    InformationRow{.key = zinfFirmwareVersion,
                   .name = "zinfFirmwareVersion",
                   .unit = "",
                   .meaning = "Version of the camera's firmware",
                   .label = "Firmware Version",
                   .answer = Answer<&ZCamera::GetFirmwareVersion>},
    InformationRow{.key = zinfCcd,
                   .name = "zinfCcd",
                   .unit = "",
                   .meaning = "Sensor id",
                   .label = "CCD Model",
                   .answer = Answer<&ZCamera::GetCCDModel>},
    InformationRow{.key = zinfBitDepth,
                   .name = "zinfBitDepth",
                   .unit = "bits",
                   .meaning = "Greatest bit depth",
                   .label = "Maximum Bit Depth",
                   .answer = Answer<&ZCamera::GetMaxBitDepth>},
    InformationRow{.key = zinfCooled,
                   .name = "zinfCooled",
                   .unit = "",
                   .meaning = "Has a cooler",
                   .label = "Cooled",
                   .answer = Answer<&ZCamera::IsCoolerAvailable>},
    InformationRow{.key = zinfReserved7,
                   .name = nullptr,
                   .unit = "",
                   .meaning = "Always 0",
                   .label = "Reserved 7",
                   .answer = AnswerConstant<0>},
    InformationRow{.key = zinfImageWidth,
                   .name = "zinfImageWidth",
                   .unit = "pixels",
                   .meaning = "Width of the region of interest",
                   .label = "Image Width",
                   .answer = Answer<&ZCamera::GetROIWidth>},
    InformationRow{.key = zinfImageHeight,
                   .name = "zinfImageHeight",
                   .unit = "pixels",
                   .meaning = "Height of the region of interest",
                   .label = "Image Height",
                   .answer = Answer<&ZCamera::GetROIHeight>},
    InformationRow{.key = zinfImageSize,
                   .name = "zinfImageSize",
                   .unit = "bytes",
                   .meaning = "Size of an image as it is set now, without post-processing",
                   .label = "Image Size",
                   .answer = AnswerImageSize,
                   .form = LogForm::WithUnit},
    InformationRow{.key = zinfCcdType,
                   .name = "zinfCcdType",
                   .unit = "",
                   .meaning = "0 monochrome, 1 colour mosaic; untouched if neither",
                   .label = "CCD Type",
                   .answer = AnswerCcdType},
    InformationRow{.key = zinfCcdWidth,
                   .name = "zinfCcdWidth",
                   .unit = "pixels",
                   .meaning = "Width of the sensor",
                   .label = "CCD Width",
                   .answer = Answer<&ZCamera::GetCCDWidth>,
                   .form = LogForm::WithUnit},
    InformationRow{.key = zinfCcdHeight,
                   .name = "zinfCcdHeight",
                   .unit = "pixels",
                   .meaning = "Height of the sensor",
                   .label = "CCD Height",
                   .answer = Answer<&ZCamera::GetCCDHeight>,
                   .form = LogForm::WithUnit},
    InformationRow{.key = zinfFirmwareBuild,
                   .name = "zinfFirmwareBuild",
                   .unit = "",
                   .meaning = "Build number of the firmware",
                   .label = "Firmware Build",
                   .answer = Answer<&ZCamera::GetFirmwareBuildNumber>},
    InformationRow{.key = zinfUniqueId,
                   .name = "zinfUniqueId",
                   .unit = "",
                   .meaning = "Low 32 bits of the unique id",
                   .label = "Unique ID",
                   .answer = Answer<&ZCamera::GetUniqueID>},
    InformationRow{.key = zinfIsModelB,
                   .name = "zinfIsModelB",
                   .unit = "",
                   .meaning = "Always 1",
                   .label = "Is Model B",
                   .answer = AnswerConstant<1>},
    InformationRow{.key = zinfIntensifierModel,
                   .name = "zinfIntensifierModel",
                   .unit = "",
                   .meaning = "Model of the intensifier, if there is one",
                   .label = "Intensifier Model",
                   .answer = AnswerOfIntensifier<&ZCamera::GetIntensifierModel>},
    InformationRow{.key = zinfExposureRes,
                   .name = "zinfExposureRes",
                   .unit = "ns",
                   .meaning = "Resolution of the exposure",
                   .label = "Exposure Resolution",
                   .answer = Answer<&ZCamera::GetExposureResolution>,
                   .form = LogForm::WithUnit},
    InformationRow{
        .key = zinfTriggerDelayRes,
        .name = "zinfTriggerDelayRes",
        .unit = "ns",
        .meaning = "Resolution of the trigger delay; written without a trigger delay too",
        .label = "Trigger Delay Resolution",
        .answer = AnswerTriggerDelayResolution,
        .form = LogForm::WithUnit},
    InformationRow{.key = zinfStreamVersion,
                   .name = "zinfStreamVersion",
                   .unit = "",
                   .meaning = "Version of the stream format",
                   .label = "Streaming Version",
                   .answer = Answer<&ZCamera::GetStreamingVersion>},
    InformationRow{.key = zinfNormGainSigFigs,
                   .name = "zinfNormGainSigFigs",
                   .unit = "",
                   .meaning = "Significant figures of the normalised gain",
                   .label = "Normalized Gain Significant Figures",
                   .answer = Answer<&ZCamera::GetNormalizedGainSignificantFigures>},
    InformationRow{.key = zinfNormGaindBRes,
                   .name = "zinfNormGaindBRes",
                   .unit = "millionths of a dB",
                   .meaning = "Resolution of the gain in decibels",
                   .label = "Normalized Gain dB Resolution",
                   .answer = Answer<&ZCamera::GetNormalizedGaindBResolution>,
                   .form = LogForm::WithUnit},
    InformationRow{
        .key = zinfNormITGainSigFigs,
        .name = "zinfNormITGainSigFigs",
        .unit = "",
        .meaning = "Significant figures of the intensifier's gain, if there is one",
        .label = "Normalized Intensifier Gain Significant Figures",
        .answer = AnswerOfIntensifier<&ZCamera::GetNormalizedIntensifierGainSignificantFigures>},
    InformationRow{
        .key = zinfNormITGaindBRes,
        .name = "zinfNormITGaindBRes",
        .unit = "millionths of a dB",
        .meaning = "Resolution of the intensifier's gain in decibels, if there is one",
        .label = "Normalized Intensifier Gain dB Resolution",
        .answer = AnswerOfIntensifier<&ZCamera::GetNormalizedIntensifierGaindBResolution>,
        .form = LogForm::WithUnit},
    InformationRow{.key = zinfRegulatedCooling,
                   .name = "zinfRegulatedCooling",
                   .unit = "",
                   .meaning = "Has regulated cooling",
                   .label = "Regulated Cooling",
                   .answer = Answer<&ZCamera::IsRegulatedCoolingAvailable>},
    InformationRow{.key = zinfRegulatedCoolingLock,
                   .name = "zinfRegulatedCoolingLock",
                   .unit = "",
                   .meaning = "The target temperature is reached; reads the camera",
                   .label = "Regulated Cooling Lock",
                   .answer = Answer<&ZCamera::GetRegulatedCoolingTemperatureLock>},
    InformationRow{.key = zinfReserved27,
                   .name = nullptr,
                   .unit = "",
                   .meaning = "Not supported",
                   .label = "Reserved 27"},
    InformationRow{.key = zinfReserved28,
                   .name = nullptr,
                   .unit = "",
                   .meaning = "Not supported",
                   .label = "Reserved 28"},
    InformationRow{.key = zinfFanControl,
                   .name = "zinfFanControl",
                   .unit = "",
                   .meaning = "Has a fan control",
                   .label = "Fan Control",
                   .answer = Answer<&ZCamera::IsFanControlAvailable>},
    InformationRow{.key = zinfHighSensitivityMode,
                   .name = "zinfHighSensitivityMode",
                   .unit = "",
                   .meaning = "Has a high sensitivity mode",
                   .label = "High Sensitivity Mode",
                   .answer = Answer<&ZCamera::IsHighSensitivityModeAvailable>},
    InformationRow{.key = zinfBlackoutMode,
                   .name = "zinfBlackoutMode",
                   .unit = "",
                   .meaning = "Has a blackout mode",
                   .label = "Blackout Mode",
                   .answer = Answer<&ZCamera::IsBlackoutModeAvailable>},
    InformationRow{.key = zinfPostProcessImageSize,
                   .name = "zinfPostProcessImageSize",
                   .unit = "bytes",
                   .meaning = "Size of an image after post-processing",
                   .label = "Post Process Image Size",
                   .answer = AnswerPostProcessImageSize,
                   .form = LogForm::WithUnit},
    InformationRow{.key = zinfAsymmetricalBinning,
                   .name = "zinfAsymmetricalBinning",
                   .unit = "",
                   .meaning = "Bins the two directions separately",
                   .label = "Asymmetrical Binning",
                   .answer = AnswerAsymmetricalBinning},
    InformationRow{.key = zinfEMGain,
                   .name = "zinfEMGain",
                   .unit = "",
                   .meaning = "Has an electron-multiplying gain",
                   .label = "EM Gain",
                   .answer = Answer<&ZCamera::IsEMGainAvailable>},
    InformationRow{.key = zinfReserved35,
                   .name = nullptr,
                   .unit = "",
                   .meaning = "Not supported",
                   .label = "Reserved 35"},
    InformationRow{.key = zinfCloseDelay,
                   .name = "zinfCloseDelay",
                   .unit = "",
                   .meaning = "Has a shutter close delay",
                   .label = "Close Delay",
                   .answer = Answer<&ZCamera::IsShutterCloseDelayAvailable>},
    InformationRow{.key = zinfColorWheelSupported,
                   .name = "zinfColorWheelSupported",
                   .unit = "",
                   .meaning = "Supports a colour filter wheel",
                   .label = "Color Wheel Supported",
                   .answer = Answer<&ZCamera::IsRGBFilterSupported>},
    InformationRow{.key = zinfReserved2,
                   .name = "zinfReserved2",
                   .unit = "",
                   .meaning = "Has a dither control; the name is kept",
                   .label = "Dither",
                   .answer = Answer<&ZCamera::IsDitherControlAvailable>},
    InformationRow{.key = zinfReserved3,
                   .name = "zinfReserved3",
                   .unit = "",
                   .meaning = "Has a high gain mode; the name is kept",
                   .label = "High Gain Mode",
                   .answer = Answer<&ZCamera::IsHighGainModeAvailable>},
    InformationRow{.key = zinfReserved4,
                   .name = "zinfReserved4",
                   .unit = "",
                   .meaning = "Has a vertical clock control; the name is kept",
                   .label = "VClock Control",
                   .answer = Answer<&ZCamera::IsVClockControlAvailable>},
};

constexpr bool AreRowsInOrder() {
    for (std::uint32_t index = 0; index < Rows.size(); ++index) {
        if (Rows[index].key != index) return false;
    }
    return true;
}
static_assert(AreRowsInOrder());

}  // namespace

std::span<const InformationRow> GetInformationRows() {
    return Rows;
}

const InformationRow* FindInformationRow(std::uint32_t key) {
    return key < Rows.size() ? &Rows[key] : nullptr;
}

}  // namespace ZV
