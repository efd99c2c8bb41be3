#include "capture.h"

#include <fmt/chrono.h>
#include <fmt/format.h>

#include <algorithm>
#include <array>
#include <ctime>
#include <utility>

#include "models/sensor_table.h"
#include "output.h"

namespace ZentaraProgram {
namespace {

constexpr double NanosecondsPerSecond = 1e9;
constexpr double MillionthsPerDecibel = 1e6;
constexpr double NanometresPerMicrometre = 1000;
constexpr double ScaleUnit = 1000;

std::string GetSoftwareName() {
    std::uint16_t major = 0, minor = 0, build = 0;
    (void)Zentara_LibVersion(&major, &minor,
                             &build);  // The library is loaded, so this cannot fail.
    return fmt::format("Zentara {}.{}.{}", major, minor, build);
}

std::uint32_t ReadWord(const SettingsBlock& settings, std::uint32_t key) {
    return static_cast<std::uint32_t>(
        settings.Get(GetSetting(ParameterFamily::Word, key)).value_or(0));
}

/// Of a camera that bins the two directions separately, or one of them alone.
std::uint32_t GetBinning(const Camera& camera, const SettingsBlock& settings, std::uint32_t key) {
    const bool isSplit = IsSupported(camera, GetSetting(ParameterFamily::Word, key));
    return std::max(1U, ReadWord(settings, isSplit ? key : std::uint32_t{zprmBinning}));
}

/// The wheel alone makes colours of an image format of three; a mosaic's frames have one.
std::uint32_t CountExposures(const SettingsBlock& settings) {
    const PixelFormat* format = FindPixelFormat(ReadWord(settings, zprmImageFormat));
    return format != nullptr && format->IsThreeColour() ? ColourCount : 1;
}

/// Post-processing and a filter wheel may make more bytes of an image, and the buffer must hold
/// either.
std::size_t GetImageBytes(const Camera& camera, const SettingsBlock& settings) {
    const std::uint64_t plain = camera.GetInfo(zinfImageSize).value_or(0);
    const std::uint64_t wheel = Zentara_CalcImageSize(ReadWord(settings, zprmImageFormat),
                                                      camera.GetInfo(zinfImageWidth).value_or(0),
                                                      camera.GetInfo(zinfImageHeight).value_or(0));
    const std::uint64_t processed = ReadWord(settings, zprmDoPostProcessing) != 0
                                        ? camera.GetInfo(zinfPostProcessImageSize).value_or(0)
                                        : 0;
    return std::max({plain, wheel, processed});
}

}  // namespace

CaptureFacts GetCaptureFacts(const Camera& camera, const SettingsBlock& settings) {
    const auto read = [&](ParameterFamily family, std::uint32_t key) {
        return settings.Get(GetSetting(family, key)).value_or(0);
    };
    const auto readWord = [&](std::uint32_t key) { return ReadWord(settings, key); };
    CaptureFacts facts;
    facts.imageBytes = GetImageBytes(camera, settings);
    facts.exposureNs = static_cast<std::uint64_t>(read(ParameterFamily::Wide, zprm64Exposure));
    facts.isSoftwareTriggered = readWord(zprmTriggerType) == ztrigSoftware;
    facts.exposures = CountExposures(settings);
    const Size frameSize = GetFrameSize(camera);
    if (GetFinishedSize(camera, settings) != frameSize) facts.frameSize = frameSize;
    Image& image = facts.prototype;
    image.model = camera.GetModelName();
    image.serialNumber = camera.GetSerialNumber();
    image.software = GetSoftwareName();
    image.exposureSeconds = static_cast<double>(facts.exposureNs) / NanosecondsPerSecond;
    image.binningX = GetBinning(camera, settings, zprmHorizontalBinning);
    image.binningY = GetBinning(camera, settings, zprmVerticalBinning);
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
    constexpr std::array ScaleKeys{zprmPostProcessGainRed, zprmPostProcessGainGreen,
                                   zprmPostProcessGainBlue};
    for (std::size_t i = 0; i < ScaleKeys.size(); ++i)
        image.scales[i] = readWord(ScaleKeys[i]) / ScaleUnit;
    image.pixelSizeMicrometres =
        ZV::GetSensorPixelSize(camera.GetInfo(zinfCcd).value_or(0)) / NanometresPerMicrometre;
    return facts;
}

ExitCode CheckImageName(const std::string& path) {
    if (GetImageKind(path) != ImageKind::Unknown) return ExitDone;
    PrintError(fmt::format("{}: the ending must be .fits, .tiff, .png or .raw", path));
    return ExitWrongUse;
}

std::string FindFrameProblem(const Zentara_Frame& frame) {
    constexpr std::uint32_t ByteBits = 8;
    const PixelFormat* format = FindPixelFormat(frame.format);
    if (format == nullptr || frame.width == 0 || frame.height == 0)
        return fmt::format("images of format {} cannot be written", frame.format);
    if (format->IsThreeColour() && !format->IsDeep() && frame.bits > ByteBits)
        return fmt::format("the camera makes no {} of its frames of {} bits", format->name,
                           frame.bits);
    return {};
}

ExitCode TellDamage(const Image& image) {
    if (image.frameError == zerrNone) return ExitDone;
    PrintError("the frame is damaged: " + DescribeResult(image.frameError));
    return ExitDamaged;
}

void ScaleBinning(Size frame, Image* image) {
    const auto scale = [](std::uint32_t binning, std::uint64_t before, std::uint64_t after) {
        const std::uint64_t scaled = after == 0 ? 0 : (binning * before + after / 2) / after;
        return static_cast<std::uint32_t>(std::clamp<std::uint64_t>(scaled, 1, 65535));
    };
    if (frame.width != 0) image->binningX = scale(image->binningX, frame.width, image->width);
    if (frame.height != 0) image->binningY = scale(image->binningY, frame.height, image->height);
}

void TakeFrame(const Zentara_Frame& frame, std::vector<std::uint8_t> pixels, Image* image) {
    const PixelFormat& layout = *FindPixelFormat(frame.format);
    image->layout = &layout;
    image->width = frame.width;
    image->height = frame.height;
    image->bits = frame.bits;
    const std::uint64_t samples =
        std::uint64_t{frame.width} * frame.height * layout.samplesPerPixel;
    image->bytesPerSample = layout.bytesPerSample;
    // Who asks for raw data is told raw, whatever the samples are.
    if (!layout.IsThreeColour()) image->bytesPerSample = frame.size >= 2 * samples ? 2 : 1;
    image->pixels = std::move(pixels);
    image->pixels.resize(samples * image->bytesPerSample);
    image->format = FormatValue(GetSetting(ParameterFamily::Word, zprmImageFormat), frame.format);
    image->isBayer = Zentara_isBayer(frame.format) != 0;
    image->bayerPattern = frame.bayerPattern;
    image->frameNumber = frame.frameNumber;
    image->frameError = frame.errorCode;
    image->words = {frame.privateBinning, frame.privateRealTime, frame.privatePattern};
    // Post-processing without three colours changes nothing of a frame's samples.
    image->isPostProcessed = image->isPostProcessed && layout.IsThreeColour();
}

Image MakeImage(const CaptureFacts& facts, const FrameBuffer& buffer,
                std::chrono::system_clock::time_point begin) {
    Image image = facts.prototype;
    TakeFrame(buffer.frame, buffer.pixels, &image);
    if (image.isPostProcessed) ScaleBinning(facts.frameSize, &image);
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
