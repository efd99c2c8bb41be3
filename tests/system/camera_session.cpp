#include "system/camera_session.h"

#include <gtest/gtest.h>

#include <chrono>
#include <cstring>
#include <future>

#include "camera/register_map.h"
#include "simulation/register_file.h"

namespace ZV::Test {
namespace {

using namespace std::chrono_literals;

constexpr std::uint32_t ListLength = 16;
constexpr auto Deadline = 30s;

}  // namespace

std::vector<std::uint16_t> DeliveredFrame::GetSamples() const {
    if (frame.bits <= 8) return {pixels.begin(), pixels.end()};
    std::vector<std::uint16_t> samples(pixels.size() / 2);
    std::memcpy(samples.data(), pixels.data(), 2 * samples.size());
    return samples;
}

CameraSession::CameraSession(std::string_view scenario, std::uint32_t position) : world(scenario) {
    EXPECT_EQ(zerrNone, Zentara_LoadDriver());
    items.resize(ListLength);
    std::uint32_t length = ListLength;
    EXPECT_EQ(zerrNone, Zentara_ListCameras(items.data(), &length));
    items.resize(std::min(length, ListLength));
    EXPECT_LT(position, items.size()) << "cameras in the list";
    if (position >= items.size()) return;
    EXPECT_EQ(zerrNone, Zentara_OpenCamera(items[position].cameraId, &handle));
}

CameraSession::~CameraSession() {
    if (IsOpen()) {
        EXPECT_EQ(zerrNone, Zentara_CloseCamera(handle));
    }
    Zentara_ReleaseDriver();
}

ZCamera& CameraSession::GetCamera() const {
    return *reinterpret_cast<ZCamera*>(handle);
}

DeliveredFrame CameraSession::MakeFrame() const {
    DeliveredFrame delivered;
    delivered.pixels.resize(GetCamera().GetImageSize());
    delivered.frame.bufferSize = static_cast<std::uint32_t>(delivered.pixels.size());
    return delivered;
}

DeliveredFrame CameraSession::Grab() {
    DeliveredFrame delivered = MakeFrame();
    delivered.frame.pBuffer = delivered.pixels.data();
    auto grab =
        std::async(std::launch::async, [&] { return Zentara_GrabFrame(handle, &delivered.frame); });
    if (grab.wait_for(Deadline) != std::future_status::ready) {
        ADD_FAILURE() << "no image in 30 seconds";
        (void)Zentara_Abort(handle);
    }
    delivered.result = grab.get();
    delivered.frame.pBuffer = nullptr;
    return delivered;
}

void CameraSession::ReceiveFrame(std::uint64_t userPrivate, std::uint32_t, std::uint32_t,
                                 std::uint32_t) {
    auto* session = reinterpret_cast<CameraSession*>(userPrivate);
    const std::lock_guard lock(session->mutex);
    ++session->receivedCount;
    session->received.notify_all();
}

std::vector<DeliveredFrame> CameraSession::Stream(std::size_t count) {
    std::vector<DeliveredFrame> frames(count, MakeFrame());
    receivedCount = 0;
    for (DeliveredFrame& delivered : frames) {
        delivered.frame.pBuffer = delivered.pixels.data();
        EXPECT_EQ(zerrNone, Zentara_QueueFrame(handle, &delivered.frame, ReceiveFrame, zcbFrameDone,
                                               reinterpret_cast<std::uint64_t>(this), 0));
    }
    EXPECT_EQ(zerrNone, Zentara_SetStreaming(handle, 1));
    {
        std::unique_lock lock(mutex);
        EXPECT_TRUE(received.wait_for(lock, Deadline, [&] { return receivedCount >= count; }))
            << receivedCount << " of " << count << " frames in 30 seconds";
    }
    EXPECT_EQ(zerrNone, Zentara_SetStreaming(handle, 0));
    EXPECT_EQ(zerrNone, Zentara_Abort(handle));
    const std::lock_guard lock(mutex);
    frames.resize(std::min(count, receivedCount));
    for (DeliveredFrame& delivered : frames) delivered.frame.pBuffer = nullptr;
    return frames;
}

std::uint32_t CameraSession::GetPacketBytes() const {
    const std::uint32_t address =
        Simulation::ControlAddress + std::uint32_t{ControlMaxPacketSize.quadlet} * 4;
    return ExtractField(ControlMaxPacketSize, world.Peek(address));
}

TraceRecord CameraSession::FindSent(const DeliveredFrame& delivered) const {
    std::vector<TraceRecord> found;
    for (const TraceRecord& record : world.ReadFrames()) {
        if (record.rollingFrameNumber == delivered.frame.frameNumber) found.push_back(record);
    }
    EXPECT_EQ(1U, found.size()) << "sent under number " << delivered.frame.frameNumber;
    return found.empty() ? TraceRecord{} : found.front();
}

}  // namespace ZV::Test
