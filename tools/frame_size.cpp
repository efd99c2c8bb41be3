#include "frame_size.h"

#include <algorithm>
#include <array>

namespace ZentaraProgram {
namespace {

struct VideoRow {
    std::uint32_t sensorWidth, columns;
};
/// Columns of a frame of real-time video that become one, by the sensor. Frames of other sensors
/// stay as they are.
constexpr std::array VideoRows{VideoRow{2048, 3}, VideoRow{2560, 4}};

/// Mosaics stay mosaics: columns are added in pairs, and those of no whole group are left out.
std::uint32_t Reduce(std::uint32_t width, std::uint32_t columns) {
    const std::uint64_t group = std::uint64_t{2} * columns;
    return static_cast<std::uint32_t>((width - width % group) / columns);
}

}  // namespace

Size GetFrameSize(const Camera& camera) {
    return {camera.GetInfo(zinfImageWidth).value_or(0),
            camera.GetInfo(zinfImageHeight).value_or(0)};
}

Size GetFinishedSize(const Camera& camera, const SettingsBlock& settings) {
    const Size frame = GetFrameSize(camera);
    if (camera.GetInfo(zinfCameraType) != std::uint32_t{zmodelFolary}) return frame;
    const auto read = [&](std::uint32_t key) {
        return settings.Get(GetSetting(ParameterFamily::Word, key)).value_or(0);
    };
    if (read(zprmCameraMode) == zmodeRealTimeVideo) {
        const std::uint32_t sensorWidth = camera.GetInfo(zinfCcdWidth).value_or(0);
        const auto* row = std::find_if(VideoRows.begin(), VideoRows.end(), [&](const VideoRow& r) {
            return r.sensorWidth == sensorWidth;
        });
        return row == VideoRows.end() ? frame
                                      : Size{Reduce(frame.width, row->columns), 2 * frame.height};
    }
    const auto rows = static_cast<std::uint32_t>(read(zprmVerticalBinning));
    return rows > 1 ? Size{Reduce(frame.width, rows), frame.height} : frame;
}

}  // namespace ZentaraProgram
