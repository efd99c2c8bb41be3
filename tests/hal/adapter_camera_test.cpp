#include "hal/adapter_camera.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <atomic>
#include <cstring>
#include <string>
#include <thread>
#include <vector>

#include "hal/driver_selection.h"
#include "hal/frame_info.h"
#include "hal/hal_world.h"
#include "hal/open_camera_table.h"
#include "hal/stream_format.h"
#include "hal/table_lock.h"
#include "support/stored_settings.h"
#include "support/wait_until.h"

namespace ZV::Test {
namespace {

constexpr std::uint32_t ImageBytes = 32;

/// Sends one frame in one packet of version 1, and then nothing.
struct OnePacket {
    static std::uint32_t Get(void* reference, std::uint8_t* payload, std::uint32_t capacity) {
        auto& source = *static_cast<OnePacket*>(reference);
        source.capacity = capacity;
        if (source.isSent.exchange(true)) return 0;
        constexpr std::uint32_t Bytes = 8 + 12 + ImageBytes + 4;
        std::memset(payload, 0x55, Bytes);
        std::memset(payload, 0, PlainHeaderBytes + FrameHeaderBytes);
        payload[PlainFlagsOffset] = PlainFlagFirst;
        payload[PlainMarkOffset] = PlainMark;
        payload[PlainHeaderBytes + HeaderSampleBitsOffset] = 7;
        payload[PlainHeaderBytes + HeaderFieldOffset] = 1;
        std::memset(payload + Bytes - TailMarkBytes, TailMarkByte, TailMarkBytes);
        return Bytes;
    }

    std::atomic<bool> isSent{false};
    std::atomic<std::uint32_t> capacity{0};
};

struct AdapterCamera : testing::Test {
    AdapterCamera() : camera(MakeAdapterCamera(0, 1)) {
        frame.buffer = pixels.data();
        frame.bufferSize = ImageBytes;
        frame.bytesExpected = ImageBytes;
    }
    ~AdapterCamera() override {
        (void)HAL_CameraRelease(&camera);
        SetAdapterPacketSource({});
        SetLastCameraFlag(false);
    }

    HALStatus Connect(HALCamera* record, std::uint16_t payloadBytes = 100) {
        const HALFrameCallback getFrame = [](void* context) {
            return &static_cast<AdapterCamera*>(context)->frame;
        };
        return HAL_CameraConnect(
            record, payloadBytes, getFrame, getFrame,
            [](void* context) { ++static_cast<AdapterCamera*>(context)->images; }, nullptr,
            [](void* context) { ++static_cast<AdapterCamera*>(context)->silences; }, this);
    }

    /// Bytes that a request offers to the source while `stored` packets are stored.
    std::uint32_t GetCapacityWith(const char* stored) {
        const StoredSettings settings(std::string("MaxPacketsPerRequest = ") + stored + "\n");
        OnePacket source;
        source.isSent = true;
        SetAdapterPacketSource({OnePacket::Get, &source});
        EXPECT_EQ(HALOk, Connect(&camera));
        EXPECT_EQ(HALOk, HAL_CameraStartStreaming(&camera, 0, 1, nullptr));
        EXPECT_TRUE(WaitUntil([&] { return source.capacity != 0; }));
        EXPECT_EQ(HALOk, HAL_CameraDisconnect(&camera));
        return source.capacity;
    }

    TableLock lock;
    std::vector<std::uint8_t> pixels = std::vector<std::uint8_t>(ImageBytes);
    tStFrameInfo frame;
    std::atomic<std::uint32_t> images{0}, silences{0};
    HALCamera camera;
};

TEST_F(AdapterCamera, BusCallsAreMissing) {
    ASSERT_EQ(HALOk, Connect(&camera));
    std::uint32_t quadlet = 0;
    std::uint16_t word = 7;

    EXPECT_EQ(HALAdapterAccessFailed, HAL_CameraReadData(&camera, 0, &quadlet, 1));
    EXPECT_EQ(HALAdapterAccessFailed, HAL_CameraWriteData(&camera, 0, &quadlet, 1));
    EXPECT_EQ(HALAdapterAccessFailed, HAL_CameraGetTimeout(&camera));
    EXPECT_EQ(HALAdapterAccessFailed, HAL_CameraSetTimeout(&camera, 1));
    EXPECT_EQ(HALSpeedUnknown, HAL_CameraFastestPacketSizeSupported(&camera, &word));
    EXPECT_EQ(HALSpeedUnknown, HAL_CameraConnectionSpeed(&camera, &word));
    EXPECT_EQ(0, word);
}

TEST_F(AdapterCamera, AConnectEntersTheTableAndADisconnectLeavesIt) {
    ASSERT_EQ(HALOk, Connect(&camera));

    EXPECT_EQ(1, camera.connected);
    EXPECT_EQ(112u, camera.packetBytes);
    EXPECT_TRUE(OpenCameraTable().Contains(MakeOpenCameraEntry(0, 1)));

    EXPECT_EQ(HALOk, HAL_CameraDisconnect(&camera));
    EXPECT_EQ(0, camera.connected);
    EXPECT_FALSE(AnyCameraOpen());
}

TEST_F(AdapterCamera, ACameraThatIsOpenElsewhereIs37) {
    ASSERT_EQ(HALOk, Connect(&camera));
    HALCamera other = MakeAdapterCamera(0, 1);

    EXPECT_EQ(HALDeviceInUse, Connect(&other));

    EXPECT_EQ(0, other.connected);
    EXPECT_EQ(112u, other.packetBytes);
    EXPECT_EQ(1u, OpenCameraTable().CountUsed());
    EXPECT_EQ(HALOk, HAL_CameraRelease(&other));
    EXPECT_TRUE(AnyCameraOpen());
}

TEST_F(AdapterCamera, WithAFullTableACameraIsSimplyNotRecorded) {
    OpenCameraTable table;
    for (std::uint32_t i = 0; i < 63; ++i) ASSERT_TRUE(table.Add(MakeOpenCameraEntry(9, i)));

    EXPECT_EQ(HALOk, Connect(&camera));

    EXPECT_EQ(63u, table.CountUsed());
    EXPECT_FALSE(table.Contains(MakeOpenCameraEntry(0, 1)));
    EXPECT_EQ(HALOk, HAL_CameraDisconnect(&camera));
    EXPECT_EQ(63u, table.CountUsed());
}

TEST_F(AdapterCamera, TheLastDisconnectMakesADriverSwitchDue) {
    const StoredSettings missing;
    HALCamera second = MakeAdapterCamera(0, 2);
    ASSERT_EQ(HALOk, Connect(&camera));
    ASSERT_EQ(HALOk, Connect(&second));

    EXPECT_EQ(HALOk, HAL_CameraDisconnect(&camera));
    EXPECT_FALSE(DriverSwitchDue());
    EXPECT_EQ(HALOk, HAL_CameraDisconnect(&second));
    EXPECT_TRUE(DriverSwitchDue());

    (void)HAL_CameraRelease(&second);
}

TEST_F(AdapterCamera, AStreamFeedsTheAssemblerFromItsSource) {
    OnePacket source;
    SetAdapterPacketSource({OnePacket::Get, &source});
    ASSERT_EQ(HALOk, Connect(&camera));

    ASSERT_EQ(HALOk, HAL_CameraStartStreaming(&camera, 0, 1, nullptr));
    EXPECT_EQ(HALOk, HAL_CameraStartStreaming(&camera, 0, 1, nullptr));
    EXPECT_TRUE(WaitUntil([&] { return images == 1; }));
    EXPECT_EQ(HALOk, HAL_CameraStopStreaming(&camera, 0));
    EXPECT_EQ(HALOk, HAL_CameraStopStreaming(&camera, 0));

    EXPECT_EQ(std::vector<std::uint8_t>(ImageBytes, 0x55), pixels);
    EXPECT_EQ(AdapterPacketBytesMax, source.capacity);
}

TEST_F(AdapterCamera, ASilentSourceIsReported) {
    const FastWaits fast;
    ASSERT_EQ(HALOk, Connect(&camera));

    ASSERT_EQ(HALOk, HAL_CameraStartStreaming(&camera, 0, 1, nullptr));

    EXPECT_TRUE(WaitUntil([&] { return silences >= 2; }));
    EXPECT_EQ(HALOk, HAL_CameraStopStreaming(&camera, 0));
}

TEST_F(AdapterCamera, ADisconnectEndsTheStream) {
    ASSERT_EQ(HALOk, Connect(&camera));
    ASSERT_EQ(HALOk, HAL_CameraStartStreaming(&camera, 0, 1, nullptr));

    EXPECT_EQ(HALOk, HAL_CameraDisconnect(&camera));
    EXPECT_EQ(HALOk, HAL_CameraStopStreaming(&camera, 0));
}

TEST_F(AdapterCamera, AReallocationTakesTheNewSize) {
    ASSERT_EQ(HALOk, Connect(&camera));

    EXPECT_EQ(HALOk, HAL_CameraReallocateBandwidth(&camera, 200, 1));
    EXPECT_EQ(212u, camera.packetBytes);
}

TEST_F(AdapterCamera, ABufferHoldsTheStoredNumberOfPacketsOrAHundred) {
    EXPECT_EQ(112ull * 100 + 32, GetAdapterRequestBytes(100, AdapterPacketsPerRequestDefault));
    EXPECT_EQ(116ull * 7 + 32, GetAdapterRequestBytes(101, 7));

    EXPECT_EQ(112u + 32, GetCapacityWith("1"));
    EXPECT_EQ(112u * 7 + 32, GetCapacityWith("7"));
}

TEST_F(AdapterCamera, AnyStoredNumberOfPacketsCounts) {
    EXPECT_EQ(112ull * 5000 + 32, GetAdapterRequestBytes(100, 5000));
    EXPECT_EQ(65548ull * 0xFFFFFFFF + 32, GetAdapterRequestBytes(0xFFFF, 0xFFFFFFFF));

    EXPECT_EQ(AdapterPacketBytesMax, GetCapacityWith("5000"));
}

TEST_F(AdapterCamera, WithNoPacketStoredABufferHasItsSpareBytesAlone) {
    EXPECT_EQ(32u, GetCapacityWith("0"));
}

TEST_F(AdapterCamera, TheWaitForAFrameEndsAtTheDisconnect) {
    ASSERT_EQ(HALOk, Connect(&camera));
    std::thread waiter([&] { (void)HAL_CameraWaitingForFrame(&camera); });

    EXPECT_EQ(HALOk, HAL_CameraDisconnect(&camera));
    waiter.join();
    EXPECT_EQ(HALOk, HAL_CameraWaitingForFrame(&camera));
    EXPECT_EQ(HALOk, HAL_CameraStopWaitingForFrame(&camera));
}

TEST_F(AdapterCamera, ARecordWithoutAContextIsRefused) {
    HALCamera empty{};
    empty.kind = HALKindAdapter;

    EXPECT_EQ(HALDeviceNotOpen, Connect(&empty));
    EXPECT_EQ(HALThreadNotStarted, HAL_CameraStartStreaming(&empty, 0, 1, nullptr));
    EXPECT_EQ(HALOk, HAL_CameraStopStreaming(&empty, 0));
    EXPECT_EQ(HALOk, HAL_CameraDisconnect(&empty));
}

}  // namespace
}  // namespace ZV::Test
