#include "capture.h"

#include <fmt/chrono.h>
#include <fmt/format.h>

#include <algorithm>
#include <ctime>

#include "models/sensor_table.h"

namespace ZentaraProgram {
namespace {

constexpr double NanosecondsPerSecond = 1e9;
constexpr double MillionthsPerDecibel = 1e6;
constexpr double NanometresPerMicrometre = 1000;

std::string GetSoftwareName() {
    std::uint16_t major = 0, minor = 0, build = 0;
    (void)Zentara_LibVersion(&major, &minor,
                             &build);  // The library is loaded, so this cannot fail.
    return fmt::format("Zentara {}.{}.{}", major, minor, build);
}

/// Post-processing may make more bytes of an image, and the buffer must hold either.
std::size_t GetImageBytes(const Camera& camera, bool isPostProcessed) {
    const std::uint32_t plain = camera.GetInfo(zinfImageSize).value_or(0);
    if (!isPostProcessed) return plain;
    return std::max(plain, camera.GetInfo(zinfPostProcessImageSize).value_or(0));
}

}  // namespace

void FrameBuffer::Prepare(std::size_t bytes) {
    pixels.assign(bytes, 0);
    frame = Zentara_Frame{};
    frame.pBuffer = pixels.data();
    frame.bufferSize = static_cast<std::uint32_t>(bytes);
}

CaptureFacts GetCaptureFacts(const Camera& camera, const SettingsBlock& settings) {
    const auto read = [&](ParameterFamily family, std::uint32_t key) {
        return settings.Get(GetSetting(family, key)).value_or(0);
    };
    const auto readWord = [&](std::uint32_t key) {
        return static_cast<std::uint32_t>(read(ParameterFamily::Word, key));
    };
    CaptureFacts facts;
    facts.imageBytes = GetImageBytes(camera, readWord(zprmDoPostProcessing) != 0);
    facts.exposureNs = static_cast<std::uint64_t>(read(ParameterFamily::Wide, zprm64Exposure));
    facts.isSoftwareTriggered = readWord(zprmTriggerType) == ztrigSoftware;
    const bool isSplit = camera.GetInfo(zinfAsymmetricalBinning).value_or(0) != 0;
    Image& image = facts.prototype;
    image.model = camera.GetModelName();
    image.serialNumber = camera.GetSerialNumber();
    image.software = GetSoftwareName();
    image.exposureSeconds = static_cast<double>(facts.exposureNs) / NanosecondsPerSecond;
    image.binningX = std::max(1U, readWord(isSplit ? zprmHorizontalBinning : zprmBinning));
    image.binningY = std::max(1U, readWord(isSplit ? zprmVerticalBinning : zprmBinning));
    image.originX = readWord(zprmRoiX);
    image.originY = readWord(zprmRoiY);
    image.gain = readWord(zprmGain);
    image.offset = readWord(zprmOffset);
    image.gainDecibels =
        static_cast<double>(read(ParameterFamily::Signed, zprmS32NormalizedGaindB)) /
        MillionthsPerDecibel;
    image.readoutMode = FormatValue(GetSetting(ParameterFamily::Word, zprmReadoutSpeed),
                                    read(ParameterFamily::Word, zprmReadoutSpeed));
    image.coolingTargetCelsius =
        settings.Get(GetSetting(ParameterFamily::Signed, zprmS32RegulatedCoolingTemp));
    image.isPostProcessed = readWord(zprmDoPostProcessing) != 0;
    image.pixelSizeMicrometres =
        ZV::GetSensorPixelSize(camera.GetInfo(zinfCcd).value_or(0)) / NanometresPerMicrometre;
    return facts;
}

bool IsWritable(const Zentara_Frame& frame) {
    return Zentara_is3Color(frame.format) == 0 && frame.width > 0 && frame.height > 0;
}

Image MakeImage(const CaptureFacts& facts, const FrameBuffer& buffer,
                std::chrono::system_clock::time_point begin) {
    const Zentara_Frame& frame = buffer.frame;
    Image image = facts.prototype;
    image.width = frame.width;
    image.height = frame.height;
    image.bits = frame.bits;
    const std::uint64_t pixels = std::uint64_t{frame.width} * frame.height;
    image.bytesPerSample = frame.size >= 2 * pixels ? 2 : 1;
    image.pixels = buffer.pixels;
    image.pixels.resize(pixels * image.bytesPerSample);
    image.format = FormatValue(GetSetting(ParameterFamily::Word, zprmImageFormat), frame.format);
    image.isBayer = Zentara_isBayer(frame.format) != 0;
    image.bayerPattern = frame.bayerPattern;
    image.frameNumber = frame.frameNumber;
    image.frameError = frame.errorCode;
    image.dateObs = FormatUtc(begin);
    return image;
}

std::string FormatUtc(std::chrono::system_clock::time_point time) {
    using namespace std::chrono;
    const auto milliseconds =
        duration_cast<std::chrono::milliseconds>(time.time_since_epoch()).count();
    const auto seconds = static_cast<std::time_t>(milliseconds / 1000);
    return fmt::format("{:%Y-%m-%dT%H:%M:%S}.{:03}", fmt::gmtime(seconds), milliseconds % 1000);
}

}  // namespace ZentaraProgram
