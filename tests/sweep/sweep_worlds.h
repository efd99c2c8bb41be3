#pragma once

#include <cstddef>
#include <cstdint>
#include <string_view>

namespace ZV::Test {

/// Where everything goes that the debug log can tell.
enum class LogTarget { None, File, DebuggerOutput };

/// A simulated world of a sweep and its first camera, which the stories use; all sensors are of
/// Client::Width by Client::Height.
struct SweepCamera {
    std::string_view name;
    std::string_view base;      ///< Built-in scenario or model.
    std::string_view sensor;    ///< Further keys of its sensor.
    std::string_view extra;     ///< Further keys of the camera.
    std::uint32_t imageFormat;  ///< In which the stories begin.
    std::string_view others;    ///< Further cameras.
    /// Of post-processing, which is on where it changes the frames; else none.
    std::uint32_t finishedFormat;
    bool hasAllStories;  ///< Else those that go another way with this one.
    LogTarget log = LogTarget::None;
};

extern const SweepCamera SweepCameras[16];

/// Makes the world the one that the library finds from here on; it stays for the next rounds.
void SelectCamera(std::size_t camera);

}  // namespace ZV::Test
