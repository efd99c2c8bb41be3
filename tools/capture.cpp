#include "capture.h"

#include <fmt/chrono.h>
#include <fmt/format.h>

#include <algorithm>
#include <ctime>

#include "models/sensor_table.h"

namespace ZentaraProgram {
namespace {

constexpr double NanosecondsPerSecond = 1e9;
constexpr double NanometresPerMicrometre = 1000;

std::string GetSoftwareName() {
    std::uint16_t major = 0, minor = 0, build = 0;
    (void)Zentara_LibVersion(&major, &minor,
                             &build);  // The library is loaded, so this cannot fail.
    return fmt::format("Zentara {}.{}.{}", major, minor, build);
}

}  // namespace

void FrameBuffer::Prepare(std::size_t bytes) {
    pixels.assign(bytes, 0);
    frame = Zentara_Frame{};
    frame.pBuffer = pixels.data();
    frame.bufferSize = static_cast<std::uint32_t>(bytes);
}

ZentaraResult ReadCaptureFacts(const Camera& camera, CaptureFacts* facts) {
    const ZentaraResult result = ReadSettings(camera, &facts->settings);
    if (result != zerrNone) return result;
    const CameraSettings& settings = facts->settings;
    const bool isSplit = camera.GetInfo(zinfAsymmetricalBinning).value_or(0) != 0;
    facts->imageBytes = camera.GetInfo(zinfImageSize).value_or(0);
    Image& image = facts->prototype;
    image.model = camera.GetModelName();
    image.serialNumber = camera.GetSerialNumber();
    image.software = GetSoftwareName();
    image.exposureSeconds = static_cast<double>(settings.exposureNs) / NanosecondsPerSecond;
    image.binningX = std::max(1U, isSplit ? settings.binningX : settings.binning);
    image.binningY = std::max(1U, isSplit ? settings.binningY : settings.binning);
    image.originX = settings.roiX;
    image.originY = settings.roiY;
    image.gain = settings.gain;
    image.offset = settings.offset;
    image.pixelSizeMicrometres =
        ZV::GetSensorPixelSize(camera.GetInfo(zinfCcd).value_or(0)) / NanometresPerMicrometre;
    return zerrNone;
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
