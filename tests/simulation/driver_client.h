#pragma once

#include <condition_variable>
#include <cstdint>
#include <memory>
#include <mutex>
#include <string>
#include <vector>

#include "hal/control_records.h"
#include "hal/platform/kernel_driver.h"

extern "C" const ZV::KernelDriver* ZentaraSimulation_GetKernelDriver(std::uint32_t version);

namespace ZV::Test {

const KernelDriver& GetDriver();

/// An overlapped request with buffers of its own and a wait with a deadline.
class TestRequest {
  public:
    TestRequest(std::uint32_t code, std::vector<std::uint8_t> requestInput,
                std::size_t outputBytes);
    TestRequest(const TestRequest&) = delete;
    TestRequest& operator=(const TestRequest&) = delete;

    /// Sends it; the result of the call itself.
    std::uint32_t Send(void* handle);
    /// Whether the completion came within ten seconds.
    bool Wait();
    bool IsComplete();

    std::vector<std::uint8_t> input, output;
    struct Owned : KernelRequest {
        TestRequest* owner;
    };
    Owned request{};
    std::uint32_t error = 0, bytes = 0;
    std::uint32_t completions = 0;

  private:
    static void Complete(KernelRequest* request, std::uint32_t error, std::uint32_t bytes);

    std::mutex mutex;
    std::condition_variable completed;
};

/// What a stream reserves.
struct Stream {
    std::uint64_t bandwidth = 0, resources = 0;
    std::uint32_t channel = 0, stride = 0;
};

/// One open of the device at a position of the list. Every call answers 0 or a system error number.
class DriverClient {
  public:
    explicit DriverClient(std::uint32_t position = 0);
    ~DriverClient();
    DriverClient(const DriverClient&) = delete;
    DriverClient& operator=(const DriverClient&) = delete;

    bool IsOpen() const { return handle != nullptr; }
    void Close();

    /// A request without an overlapped record.
    std::uint32_t Call(std::uint32_t code, const void* input, std::uint32_t inputBytes,
                       void* output, std::uint32_t outputBytes);
    template <typename Record>
    std::uint32_t Call(std::uint32_t code, Record* record) {
        return Call(code, record, sizeof *record, record, sizeof *record);
    }
    /// An overlapped request, waited for.
    std::uint32_t CallOverlapped(TestRequest* request);

    std::uint32_t Read(std::uint32_t address, std::uint32_t* values, std::uint32_t quadlets);
    std::uint32_t Read(std::uint32_t address, std::uint32_t* value) {
        return Read(address, value, 1);
    }
    std::uint32_t Write(std::uint32_t address, std::uint32_t value);

    std::uint32_t Reserve(std::uint32_t stride, std::uint32_t speed, std::uint32_t tag,
                          Stream* stream);
    std::uint32_t Listen(const Stream& stream);

    void* handle = nullptr;
};

std::vector<std::uint8_t> MakeReadRecord(std::uint32_t address, std::uint32_t quadlets);
std::vector<std::uint8_t> MakeWriteRecord(std::uint32_t address,
                                          const std::vector<std::uint32_t>& values);
std::vector<std::string> ListDevices();

}  // namespace ZV::Test
