#pragma once

#include <gtest/gtest.h>

#include <cstdint>
#include <memory>

#include "support/expect_zerr.h"
#include "system/camera_session.h"
#include "system/frame_flow.h"
#include "system/settings_history.h"

namespace ZV::Test {

inline constexpr std::size_t Circulating = 8;

inline constexpr StreamedCamera VersionZero{"old", false};
inline constexpr StreamedCamera VersionOne{"mono", false};
inline constexpr StreamedCamera VersionTwo{"rotated", false};
inline constexpr StreamedCamera TwoFields{"folary", true};

/// An open camera and the frames that circulate through it.
class Streamed {
  public:
    explicit Streamed(const StreamedCamera& streamedCamera)
        : session(streamedCamera.GetScenario()),
          camera(streamedCamera),
          history(session, streamedCamera) {}
    ~Streamed() {
        if (session.IsOpen()) (void)Zentara_SetStreaming(session.GetHandle(), 0);
        if (flow == nullptr || !session.IsOpen()) return;
        EXPECT_ZERR(zerrNone, Zentara_Abort(session.GetHandle()));
    }
    Streamed(const Streamed&) = delete;
    Streamed& operator=(const Streamed&) = delete;

    ZentaraHandle GetHandle() const { return session.GetHandle(); }
    Zentara_Settings ReadSettings() const {
        Zentara_Settings settings{};
        EXPECT_ZERR(zerrNone, Zentara_ReadSettingsFromCam(GetHandle(), &settings));
        return settings;
    }
    void AddDifferentSets() {
        for (const Zentara_Settings& block : MakeDifferentSettings(ReadSettings(), camera)) {
            history.AddSet(block);
        }
    }
    void AddCompatibleSets() {
        for (const Zentara_Settings& block : MakeCompatibleSettings(ReadSettings())) {
            history.AddSet(block);
        }
    }

    /// Puts the first set in force, queues the frames and streams until the first is there.
    void BeginFlow() {
        history.BeginWith(0);
        flow = std::make_unique<FrameFlow>(GetHandle(), Circulating, StreamedCamera::BufferBytes,
                                           history.CountExposed());
        flow->Begin();
        ASSERT_ZERR(zerrNone, Zentara_SetStreaming(GetHandle(), 1));
        ASSERT_TRUE(flow->WaitForFrames(1));
    }
    [[nodiscard]] bool WaitForFrameOfLatest() const {
        return flow->WaitForFrameAfter(history.GetLastMark());
    }
    /// Whether frames are on: a trigger is refused in another way without a stream.
    bool IsStreaming() const { return Zentara_Trigger(GetHandle()) != zerrNotStreaming; }

    CameraSession session;
    StreamedCamera camera;
    SettingsHistory history;
    std::unique_ptr<FrameFlow> flow;
};

}  // namespace ZV::Test
