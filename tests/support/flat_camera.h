#pragma once

#include <gtest/gtest.h>

#include <cstdint>
#include <cstring>
#include <mutex>
#include <string_view>
#include <thread>
#include <vector>

#include "support/expect_zerr.h"
#include "support/simulation_world.h"
#include "support/wait_until.h"
#include "zentara/zentara.h"

namespace ZV::Test {

/// One monochrome camera of 64 x 48 pixels, so that a frame is quick.
inline constexpr std::string_view SmallMono =
    R"({"base": "mono", "cameras": [{"sensor": {"width": 64, "height": 48}}]})";
/// The same behind a mosaic.
inline constexpr std::string_view SmallColour =
    R"({"base": "colour", "cameras": [{"sensor": {"width": 64, "height": 48}}]})";

/// A client's frame with its buffer, followed by guard bytes that nobody may touch.
class ClientFrame {
  public:
    static constexpr std::uint8_t Untouched = 0xA5;

    explicit ClientFrame(std::uint32_t bytes) : pixels(bytes + GuardBytes, Untouched) {
        record.pBuffer = pixels.data();
        record.bufferSize = bytes;
    }
    ClientFrame(const ClientFrame&) = delete;
    ClientFrame& operator=(const ClientFrame&) = delete;

    Zentara_Frame* Get() { return &record; }
    Zentara_Frame* operator->() { return &record; }
    const std::uint8_t* GetPixels() const { return pixels.data(); }
    bool IsGuardIntact() const { return AreUntouched(pixels.size() - GuardBytes); }
    bool IsUntouched() const { return AreUntouched(0); }

  private:
    static constexpr std::size_t GuardBytes = 64;

    bool AreUntouched(std::size_t from) const {
        for (std::size_t i = from; i < pixels.size(); ++i) {
            if (pixels[i] != Untouched) return false;
        }
        return true;
    }

    Zentara_Frame record{};
    std::vector<std::uint8_t> pixels;
};

/// What callbacks were told, in order. Its address is the `userPrivate` of the calls that it hears.
class CallbackLog {
  public:
    struct Call {
        std::uint32_t userData;
        std::uint32_t errorCode;
        std::uint32_t flags;
        std::thread::id thread;
    };

    std::uint64_t GetPrivate() { return reinterpret_cast<std::uintptr_t>(this); }
    static void Record(std::uint64_t userPrivate, std::uint32_t userData, std::uint32_t errorCode,
                       std::uint32_t flags) {
        auto* const log = reinterpret_cast<CallbackLog*>(static_cast<std::uintptr_t>(userPrivate));
        const std::lock_guard hold(log->mutex);
        log->calls.push_back({userData, errorCode, flags, std::this_thread::get_id()});
    }

    std::vector<Call> GetCalls() const {
        const std::lock_guard hold(mutex);
        return calls;
    }
    std::size_t CountCalls() const {
        const std::lock_guard hold(mutex);
        return calls.size();
    }
    [[nodiscard]] bool WaitForCalls(std::size_t count) const {
        return WaitUntil([&] { return CountCalls() >= count; }, std::chrono::seconds(20));
    }

  private:
    mutable std::mutex mutex;
    std::vector<Call> calls;
};

/// A loaded library over a simulated world.
class LoadedLibrary : public testing::Test {
  protected:
    explicit LoadedLibrary(std::string_view scenario = SmallMono) : world(scenario) {}

    void SetUp() override { ASSERT_ZERR(zerrNone, Zentara_LoadDriver()); }
    void TearDown() override { Zentara_ReleaseDriver(); }

    std::vector<Zentara_CamListItem> ListCameras() {
        std::vector<Zentara_CamListItem> items(16);
        auto length = static_cast<std::uint32_t>(items.size());
        EXPECT_ZERR(zerrNone, Zentara_ListCameras(items.data(), &length));
        items.resize(std::min<std::size_t>(length, items.size()));
        return items;
    }

    SimulationWorld world;
};

/// The first camera of a world, listed and open.
class OpenedCamera : public LoadedLibrary {
  protected:
    explicit OpenedCamera(std::string_view scenario = SmallMono) : LoadedLibrary(scenario) {}

    void SetUp() override {
        LoadedLibrary::SetUp();
        ASSERT_FALSE(ListCameras().empty());
        ASSERT_ZERR(zerrNone, Zentara_OpenCamera(0, &handle));
    }

    std::uint32_t GetInfo(std::uint32_t key) {
        std::uint32_t value = 0xDDDDDDDD;
        EXPECT_ZERR(zerrNone, Zentara_GetInfo(handle, key, &value));
        return value;
    }
    std::uint32_t GetImageBytes() { return GetInfo(zinfImageSize); }
    Zentara_Settings ReadSettings() {
        Zentara_Settings settings{};
        EXPECT_ZERR(zerrNone, Zentara_ReadSettingsFromCam(handle, &settings));
        return settings;
    }
    ZentaraResult Queue(ClientFrame& frame, CallbackLog& log, std::uint32_t flags,
                        std::uint32_t userData = 0) {
        return Zentara_QueueFrame(handle, frame.Get(), CallbackLog::Record, flags, log.GetPrivate(),
                                  userData);
    }

    ZentaraHandle handle = 0;
};

}  // namespace ZV::Test
