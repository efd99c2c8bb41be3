#include "simulation/driver_client.h"

#include <chrono>
#include <cstring>
#include <utility>

#include "hal/platform/last_error.h"
#include "hal/stream_format.h"

namespace ZV::Test {
namespace {

constexpr std::chrono::seconds Deadline{10};

std::uint32_t SwapBytes(std::uint32_t value) {
    return __builtin_bswap32(value);
}

AsyncReadRecord MakeHead(std::uint32_t address, std::uint32_t quadlets) {
    AsyncReadRecord record{};
    record.getGeneration = 1;
    record.destinationNode = AsyncDestinationNode;
    record.offsetHigh = AsyncOffsetHigh;
    record.offsetLow = address;
    record.bytes = 4 * quadlets;
    return record;
}

void CompleteNothing(KernelRequest*, std::uint32_t, std::uint32_t) {}

}  // namespace

const KernelDriver& GetDriver() {
    return *ZentaraSimulation_GetKernelDriver(KernelDriverVersion);
}

TestRequest::TestRequest(std::uint32_t code, std::vector<std::uint8_t> requestInput,
                         std::size_t outputBytes)
    : input(std::move(requestInput)), output(outputBytes) {
    request.code = code;
    request.owner = this;
    request.isOverlapped = 1;
    request.complete = &TestRequest::Complete;
}

std::uint32_t TestRequest::Send(void* handle) {
    request.input = input.data();
    request.inputBytes = static_cast<std::uint32_t>(input.size());
    request.output = output.data();
    request.outputBytes = static_cast<std::uint32_t>(output.size());
    std::uint32_t answered = 0;
    const std::uint32_t result = GetDriver().control(handle, &request, &answered);
    if (result == PlatformErrorIoPending) return result;
    const std::lock_guard lock(mutex);
    error = result;
    bytes = answered;
    return result;
}

bool TestRequest::Wait() {
    std::unique_lock lock(mutex);
    return completed.wait_for(lock, Deadline, [this] { return completions > 0; });
}

bool TestRequest::IsComplete() {
    const std::lock_guard lock(mutex);
    return completions > 0;
}

void TestRequest::Complete(KernelRequest* request, std::uint32_t error, std::uint32_t bytes) {
    TestRequest& owner = *static_cast<Owned*>(request)->owner;
    const std::lock_guard lock(owner.mutex);
    ++owner.completions;
    owner.error = error;
    owner.bytes = bytes;
    owner.completed.notify_all();
}

DriverClient::DriverClient(std::uint32_t position) {
    const std::vector<std::string> paths = ListDevices();
    if (position < paths.size()) (void)GetDriver().open(paths[position].c_str(), &handle);
}

DriverClient::~DriverClient() {
    Close();
}

void DriverClient::Close() {
    if (handle != nullptr) GetDriver().close(handle);
    handle = nullptr;
}

std::uint32_t DriverClient::Call(std::uint32_t code, const void* input, std::uint32_t inputBytes,
                                 void* output, std::uint32_t outputBytes) {
    KernelRequest request{code, inputBytes, input, output, outputBytes, 0, &CompleteNothing};
    std::uint32_t bytes = 0;
    return GetDriver().control(handle, &request, &bytes);
}

std::uint32_t DriverClient::CallOverlapped(TestRequest* request) {
    const std::uint32_t result = request->Send(handle);
    if (result != PlatformErrorIoPending) return result;
    return request->Wait() ? request->error : PlatformErrorIoPending;
}

std::uint32_t DriverClient::Read(std::uint32_t address, std::uint32_t* values,
                                 std::uint32_t quadlets) {
    TestRequest request(FW_IOCTL_ASYNC_READ, MakeReadRecord(address, quadlets), 4 * quadlets);
    const std::uint32_t error = CallOverlapped(&request);
    for (std::uint32_t i = 0; error == 0 && i < quadlets; ++i) {
        std::memcpy(values + i, request.output.data() + 4 * i, 4);
        values[i] = SwapBytes(values[i]);
    }
    return error;
}

std::uint32_t DriverClient::Write(std::uint32_t address, std::uint32_t value) {
    TestRequest request(FW_IOCTL_ASYNC_WRITE, MakeWriteRecord(address, {value}), 0);
    return CallOverlapped(&request);
}

std::uint32_t DriverClient::Reserve(std::uint32_t stride, std::uint32_t speed, std::uint32_t tag,
                                    Stream* stream) {
    AllocateBandwidthRecord bandwidth{stride, SpeedFlagS800, 0, 0, 0};
    if (const std::uint32_t error = Call(FW_IOCTL_ALLOC_BANDWIDTH, &bandwidth)) return error;
    AllocateChannelRecord channel{AnyChannel, 0, 0};
    if (const std::uint32_t error = Call(FW_IOCTL_ALLOC_CHANNEL, &channel)) return error;
    const auto bufferBytes = static_cast<std::uint32_t>(stride * PacketsPerRequest);
    AllocateResourcesRecord resources{speed,
                                      ResourceFlagsListen,
                                      channel.channel,
                                      stride,
                                      AnnouncedBufferCount,
                                      bufferBytes,
                                      0,
                                      tag,
                                      0};
    if (const std::uint32_t error = Call(FW_IOCTL_ALLOC_RESOURCES, &resources)) return error;
    *stream = {bandwidth.bandwidthHandle, resources.resourceHandle, channel.channel, stride};
    return PlatformErrorNone;
}

std::uint32_t DriverClient::Listen(const Stream& stream) {
    std::vector<std::uint8_t> record(sizeof(StreamSwitchRecord));
    std::memcpy(record.data(), &stream.resources, sizeof stream.resources);
    TestRequest request(FW_IOCTL_LISTEN, record, record.size());
    return CallOverlapped(&request);
}

std::vector<std::uint8_t> MakeReadRecord(std::uint32_t address, std::uint32_t quadlets) {
    const AsyncReadRecord head = MakeHead(address, quadlets);
    std::vector<std::uint8_t> record(sizeof head);
    std::memcpy(record.data(), &head, sizeof head);
    return record;
}

std::vector<std::uint8_t> MakeWriteRecord(std::uint32_t address,
                                          const std::vector<std::uint32_t>& values) {
    const AsyncReadRecord head = MakeHead(address, static_cast<std::uint32_t>(values.size()));
    std::vector<std::uint8_t> record(AsyncWriteExtraBytes + 4 * values.size());
    std::memcpy(record.data(), &head, AsyncWriteDataOffset);
    for (std::size_t i = 0; i < values.size(); ++i) {
        const std::uint32_t value = SwapBytes(values[i]);
        std::memcpy(record.data() + AsyncWriteDataOffset + 4 * i, &value, sizeof value);
    }
    return record;
}

std::vector<std::string> ListDevices() {
    std::vector<std::string> paths;
    void* list = nullptr;
    if (GetDriver().openList(&list) != PlatformErrorNone) return paths;
    for (std::uint32_t i = 0; GetDriver().selectInterface(list, i) == PlatformErrorNone; ++i) {
        std::uint32_t required = 0;
        (void)GetDriver().getDetail(list, i, nullptr, 0, &required);
        std::vector<char> path(required);
        if (GetDriver().getDetail(list, i, path.data(), required, &required) != 0) break;
        paths.emplace_back(path.data());
    }
    GetDriver().closeList(list);
    return paths;
}

}  // namespace ZV::Test
