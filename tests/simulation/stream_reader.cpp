#include "simulation/stream_reader.h"

#include <cstring>

#include "camera/register_map.h"
#include "hal/platform/last_error.h"
#include "hal/stream_format.h"
#include "simulation/register_file.h"

namespace ZV::Test {
namespace {

using namespace Simulation;

std::uint32_t ControlQuadlet(std::uint32_t quadlet) {
    return ControlAddress + 4 * quadlet;
}

bool IsIdle(const Payload& payload) {
    if (payload.size() <= CipHeaderBytes) return true;
    return payload[PlainMarkOffset] == PlainMark && (payload[PlainFlagsOffset] & PlainFlagIgnore);
}

}  // namespace

void SetUpImage(DriverClient* client, std::uint32_t width, std::uint32_t height) {
    (void)client->Write(ControlQuadlet(1), 7u << 24 | 1u << 2);
    (void)client->Write(ControlQuadlet(3), width << 16 | height);
    (void)client->Write(ControlQuadlet(ControlExposureLow), 1000000);
    (void)client->Write(CommandAddress + 4 * CommandTakeOver, 1);
}

StreamReader::StreamReader(DriverClient* streamClient, std::uint32_t stride, std::size_t ring,
                           std::uint32_t streamSpeed, std::uint32_t streamTag)
    : client(streamClient), wantedStride(stride), speed(streamSpeed), tag(streamTag) {
    for (std::size_t i = 0; i < ring; ++i) requests.push_back(nullptr);
}

StreamReader::~StreamReader() {
    Stop();
}

bool StreamReader::Attach(std::size_t index) {
    const std::size_t bytes = std::size_t{stream.stride} * PacketsPerRequest;
    requests[index] =
        std::make_unique<TestRequest>(FW_IOCTL_ATTACH_BUFFER, std::vector<std::uint8_t>(), bytes);
    TestRequest& request = *requests[index];
    request.input.resize(bytes);
    return request.Send(client->handle) == PlatformErrorIoPending;
}

std::uint32_t StreamReader::Start() {
    if (const std::uint32_t error = client->Reserve(wantedStride, speed, tag, &stream))
        return error;
    for (std::size_t i = 0; i < requests.size(); ++i) {
        if (!Attach(i)) return PlatformErrorGeneralFailure;
    }
    if (const std::uint32_t error = client->Listen(stream)) return error;
    isOn = true;
    return client->Write(StreamAddress + 4 * StreamSwitch, stream.channel << 24 | 1);
}

void StreamReader::Stop() {
    if (!isOn || !client->IsOpen()) return;
    isOn = false;
    StreamSwitchRecord record{stream.resources, 0};
    (void)client->Write(StreamAddress + 4 * StreamSwitch, 0);
    (void)client->Call(FW_IOCTL_STOP, &record);
    (void)client->Call(FW_IOCTL_DETACH_BUFFERS, &stream.resources);
    for (const auto& request : requests) (void)request->Wait();
}

std::vector<Payload> StreamReader::ReadRequest() {
    TestRequest& request = *requests[next];
    if (!request.Wait()) return {};
    lastError = request.error;
    std::vector<Payload> payloads;
    for (std::size_t slot = 0; slot < PacketsPerRequest; ++slot) {
        const std::uint8_t* start = request.output.data() + slot * stream.stride;
        const std::size_t length =
            start[PacketLengthOffset] | std::size_t{start[PacketLengthOffset + 1]} << 8;
        payloads.emplace_back(start + PacketPayloadOffset, start + PacketPayloadOffset + length);
    }
    (void)Attach(next);
    next = (next + 1) % requests.size();
    return payloads;
}

Payload StreamReader::ReadPacket() {
    while (true) {
        while (!waiting.empty()) {
            const Payload payload = waiting.front();
            waiting.pop_front();
            if (!IsIdle(payload)) return payload;
        }
        const std::vector<Payload> payloads = ReadRequest();
        if (payloads.empty()) return {};
        waiting.assign(payloads.begin(), payloads.end());
    }
}

ReceivedFrame StreamReader::ReadFrame(std::uint64_t bytes) {
    ReceivedFrame frame;
    while (frame.pixels.size() < bytes) {
        const Payload payload = ReadPacket();
        if (payload.empty()) break;
        ++frame.packets;
        std::size_t begin = PlainHeaderBytes;
        if (payload[PlainFlagsOffset] & PlainFlagFirst) {
            const std::uint8_t* header = payload.data() + PlainHeaderBytes;
            frame.rollingFrameNumber = header[0] << 8 | header[1];
            frame.psn = header[HeaderPsnOffset];
            frame.plane = header[HeaderPlaneOffset] & 15;
            frame.field = header[HeaderFieldOffset] & 15;
            frame.sampleBits = header[HeaderSampleBitsOffset] & 15;
            begin += FrameHeaderBytes;
        }
        frame.pixels.insert(frame.pixels.end(),
                            payload.begin() + static_cast<std::ptrdiff_t>(begin),
                            payload.end() - static_cast<std::ptrdiff_t>(TailMarkBytes));
    }
    return frame;
}

}  // namespace ZV::Test
