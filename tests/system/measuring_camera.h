#pragma once

#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <future>
#include <string>
#include <string_view>
#include <vector>

#include "camera/register_map.h"
#include "simulation/register_file.h"
#include "support/flat_camera.h"
#include "support/settings_words.h"

namespace ZV::Test {

/// A client that lets the first camera of a world balance and expose itself. The camera's sensor
/// has no noise.
class MeasuringCamera : public LoadedLibrary {
  protected:
    static constexpr std::uint32_t Width = 64;
    static constexpr std::uint32_t Height = 48;

    explicit MeasuringCamera(std::string_view scenario) : LoadedLibrary(scenario) {}

    void SetUp() override {
        LoadedLibrary::SetUp();
        ASSERT_NO_FATAL_FAILURE(Open());
    }
    void Open() {
        ASSERT_FALSE(ListCameras().empty());
        ASSERT_ZERR(zerrNone, Zentara_OpenCamera(0, &handle));
        ASSERT_ZERR(zerrNone, Zentara_ReadSettingsFromCam(handle, &settings));
    }
    /// Plugs a device in again that has vanished, and begins anew.
    void Reopen() {
        (void)Zentara_CloseCamera(handle);
        EXPECT_TRUE(ListCameras().empty());
        ASSERT_TRUE(world.Plug());
        ASSERT_NO_FATAL_FAILURE(Open());
    }

    void Set(std::uint32_t key, std::uint32_t value) {
        ASSERT_ZERR(zerrNone, Zentara_SetParam(&settings, key, value));
    }
    void Set64(std::uint32_t key, std::uint64_t value) {
        ASSERT_ZERR(zerrNone, Zentara_SetParam64(&settings, key, value));
    }
    void Send() { ASSERT_ZERR(zerrNone, Zentara_SendSettingsToCam(handle, &settings)); }
    Zentara_Settings ReadBack() {
        Zentara_Settings present{};
        EXPECT_ZERR(zerrNone, Zentara_ReadSettingsFromCam(handle, &present));
        return present;
    }

    /// Runs a call that takes images; it is aborted when it has not ended in half a minute.
    template <typename Call>
    ZentaraResult Finish(Call call) {
        auto running = std::async(std::launch::async, call);
        if (running.wait_for(std::chrono::seconds(30)) != std::future_status::ready) {
            ADD_FAILURE() << "not done in 30 seconds";
            (void)Zentara_Abort(handle);
        }
        return running.get();
    }
    ZentaraResult Balance(std::uint32_t x, std::uint32_t y, std::uint32_t width,
                          std::uint32_t height) {
        return Finish([=, this] { return Zentara_WhiteBalance(&settings, x, y, width, height); });
    }
    ZentaraResult Balance() { return Balance(0, 0, Width, Height); }
    ZentaraResult Expose() {
        return Finish([this] { return Zentara_AutoExpose(&settings, 0, 0, Width, Height); });
    }

    /// A frame as the client gets it; 0 in each unused byte.
    std::vector<std::uint8_t> Grab(Zentara_Frame* record = nullptr) {
        std::vector<std::uint8_t> pixels(std::size_t{Width} * Height * 8);
        Zentara_Frame frame{};
        frame.pBuffer = pixels.data();
        frame.bufferSize = static_cast<std::uint32_t>(pixels.size());
        EXPECT_ZERR(zerrNone, Finish([&] { return Zentara_GrabFrame(handle, &frame); }));
        pixels.resize(frame.size);
        if (record != nullptr) *record = frame;
        return pixels;
    }
    std::uint8_t GrabMaximum() {
        const std::vector<std::uint8_t> pixels = Grab();
        return pixels.empty() ? std::uint8_t{0} : *std::max_element(pixels.begin(), pixels.end());
    }

    /// Images that were asked for: each switches the stream on once.
    std::size_t CountImages() const {
        constexpr std::uint32_t Switch = Simulation::StreamAddress + 4 * StreamSwitch;
        std::size_t count = 0;
        for (const RegisterWrite& write : world.ReadRegisterWrites()) {
            if (write.address == Switch && (write.values.at(0) & 1) != 0) ++count;
        }
        return count;
    }

    ZentaraHandle handle = 0;
    Zentara_Settings settings{};
};

}  // namespace ZV::Test
