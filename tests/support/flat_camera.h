#pragma once

#include <gtest/gtest.h>

#include <cstdint>
#include <cstring>
#include <memory>
#include <mutex>
#include <string_view>
#include <thread>
#include <utility>
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

/// Keeps what the library was given until LoadedLibrary has released it: a test may end, also at a
/// failed assertion, while a stream still serves its entries.
class ClientMemory {
  public:
    static void Keep(std::shared_ptr<void> memory) {
        const std::lock_guard hold(GetAll().mutex);
        GetAll().kept.push_back(std::move(memory));
    }
    static void LetGo() {
        const std::lock_guard hold(GetAll().mutex);
        GetAll().kept.clear();
    }

  private:
    static ClientMemory& GetAll() {
        static ClientMemory all;
        return all;
    }

    std::mutex mutex;
    std::vector<std::shared_ptr<void>> kept;
};

/// A client's frame with its buffer, followed by guard bytes that nobody may touch.
class ClientFrame {
  public:
    static constexpr std::uint8_t Untouched = 0xA5;

    explicit ClientFrame(std::uint32_t bytes) : state(std::make_shared<State>()) {
        state->pixels.assign(bytes + GuardBytes, Untouched);
        state->record.pBuffer = state->pixels.data();
        state->record.bufferSize = bytes;
        ClientMemory::Keep(state);
    }
    ClientFrame(const ClientFrame&) = delete;
    ClientFrame& operator=(const ClientFrame&) = delete;

    Zentara_Frame* Get() { return &state->record; }
    Zentara_Frame* operator->() { return &state->record; }
    const std::uint8_t* GetPixels() const { return state->pixels.data(); }
    bool IsGuardIntact() const { return AreUntouched(state->pixels.size() - GuardBytes); }
    bool IsUntouched() const { return AreUntouched(0); }

  private:
    static constexpr std::size_t GuardBytes = 64;

    struct State {
        Zentara_Frame record{};
        std::vector<std::uint8_t> pixels;
    };

    bool AreUntouched(std::size_t from) const {
        for (std::size_t i = from; i < state->pixels.size(); ++i) {
            if (state->pixels[i] != Untouched) return false;
        }
        return true;
    }

    std::shared_ptr<State> state;
};

/// What callbacks were told, in order; GetPrivate is the `userPrivate` of the calls that it hears.
class CallbackLog {
  public:
    CallbackLog() : state(std::make_shared<State>()) { ClientMemory::Keep(state); }
    CallbackLog(const CallbackLog&) = delete;
    CallbackLog& operator=(const CallbackLog&) = delete;

    struct Call {
        std::uint32_t userData;
        std::uint32_t errorCode;
        std::uint32_t flags;
        std::thread::id thread;
    };

    std::uint64_t GetPrivate() { return reinterpret_cast<std::uintptr_t>(state.get()); }
    static void Record(std::uint64_t userPrivate, std::uint32_t userData, std::uint32_t errorCode,
                       std::uint32_t flags) {
        auto* const log = reinterpret_cast<State*>(static_cast<std::uintptr_t>(userPrivate));
        const std::lock_guard hold(log->mutex);
        log->calls.push_back({userData, errorCode, flags, std::this_thread::get_id()});
    }

    std::vector<Call> GetCalls() const {
        const std::lock_guard hold(state->mutex);
        return state->calls;
    }
    std::size_t CountCalls() const {
        const std::lock_guard hold(state->mutex);
        return state->calls.size();
    }
    [[nodiscard]] bool WaitForCalls(std::size_t count) const {
        return WaitUntil([&] { return CountCalls() >= count; }, std::chrono::seconds(20));
    }

  private:
    struct State {
        std::mutex mutex;
        std::vector<Call> calls;
    };

    std::shared_ptr<State> state;
};

/// A loaded library over a simulated world.
class LoadedLibrary : public testing::Test {
  protected:
    explicit LoadedLibrary(std::string_view scenario = SmallMono) : world(scenario) {}

    void SetUp() override { ASSERT_ZERR(zerrNone, Zentara_LoadDriver()); }
    void TearDown() override {
        Zentara_ReleaseDriver();
        ClientMemory::LetGo();
    }

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
