#pragma once

#include <gtest/gtest.h>

#include <cstdint>
#include <cstdlib>
#include <cstring>

#include "api/camera_context.h"
#include "api/delivery.h"
#include "api/entry_queue.h"
#include "api/handles.h"
#include "api/settings_block.h"
#include "imaging/ex_image.h"
#include "support/flat_camera.h"

namespace ZV::Test {

/// An open camera that does not stream: the tests call what its engine calls, one event at a time.
class Delivery : public OpenedCamera {
  public:
    static constexpr std::uint32_t Width = 64;
    static constexpr std::uint32_t Height = 48;
    static constexpr std::uint32_t ImageBytes = Width * Height;

  protected:
    ZCamera& GetCamera() { return *FindCamera(handle); }
    CameraContext& GetContext() { return *GetCameraContext(GetCamera()); }
    std::uint32_t CountQueued() { return GetQueueCount(GetContext()); }

    static ZExImage* MakeImage(std::uint16_t errorCode = 0) {
        auto* const pixels = static_cast<std::uint8_t*>(std::malloc(ImageBytes));
        std::memset(pixels, 0x42, ImageBytes);
        return new ZExImage(pixels, ImageBytes, Width, Height, 8, 1000, 1.0, Mono8, CameraMono,
                            PatternRed, 0, false, 5, 0, 1, false, 17, errorCode, nullptr, true);
    }
    void ReceiveImage(ZExImage* image, std::uint16_t status = 0) {
        ZImageReceivedCallbackStruct record{image, &GetCamera(), status};
        EXPECT_EQ(nullptr, ImageReceived(&record));
    }
    void ReceiveImage() { ReceiveImage(MakeImage()); }
    void EndExposure() { EXPECT_EQ(nullptr, ExposeDone(&GetCamera())); }

    /// A change behind at least one frame.
    void QueueSettings(std::uint32_t flags = zcbFrameDone, std::uint32_t userData = 100) {
        ASSERT_GT(CountQueued(), 0u);
        ASSERT_ZERR(zerrNone, Zentara_QueueSettings(handle, &settings, CallbackLog::Record, flags,
                                                    calls.GetPrivate(), userData));
    }
    void QueueFrame(std::uint32_t flags, std::uint32_t userData = 0) {
        ASSERT_ZERR(zerrNone, Queue(frame, calls, flags, userData));
    }

    void SetUp() override {
        OpenedCamera::SetUp();
        settings = ReadSettings();
        SetLastSettings(GetContext(), formerSettings);
    }

    const Zentara_Settings formerSettings = [] {
        Zentara_Settings unknown;
        std::memset(&unknown, 0xCD, sizeof(unknown));
        return unknown;
    }();
    Zentara_Settings settings{};
    ClientFrame frame{ImageBytes};
    CallbackLog calls;
};

}  // namespace ZV::Test
