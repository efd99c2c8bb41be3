#pragma once

#include <chrono>
#include <cstdint>
#include <cstdio>
#include <mutex>
#include <string>

namespace ZV::Simulation {

/// A frame that has gone over the bus.
struct FrameRecord {
    std::uint64_t frame = 0;  ///< From 1, since the bus was started.
    std::uint32_t rollingFrameNumber = 0;
    std::uint32_t psn = 0;
    std::uint32_t plane = 0;
    std::uint32_t width = 0, height = 0;
    std::uint64_t bytes = 0;
    std::uint64_t checksum = 0;
};

/// A request that has ended.
struct RequestRecord {
    std::uint32_t code = 0;
    std::string input;   ///< Hex.
    std::string output;  ///< Hex.
    std::uint64_t inputBytes = 0, outputBytes = 0;
    bool wasPended = false;
    std::uint32_t error = 0;
};

/// FNV-1a of 64 bits over bytes.
std::uint64_t CalculateChecksum(const std::uint8_t* bytes, std::size_t count);

/// Two digits for each byte.
std::string ConvertToHex(const void* bytes, std::size_t count);

/// Name of a control code, "" for one that the driver does not know.
const char* GetControlCodeName(std::uint32_t code);

/// File of one JSON line per event. Each line is written whole before the call returns.
/// Thread-safe; its mutex is a leaf. Does nothing while no file is open.
class Trace {
  public:
    Trace() = default;
    ~Trace();
    Trace(const Trace&) = delete;
    Trace& operator=(const Trace&) = delete;

    /// Empties the file. False with `message` when it cannot be written.
    bool Open(const std::string& path, std::string* message);
    bool IsOpen() const { return file != nullptr; }

    void WriteRequest(std::uint32_t camera, const RequestRecord& record);
    void WriteFrame(std::uint32_t camera, const FrameRecord& record);
    /// "open", "close", "plug", "unplug".
    void WriteEvent(std::uint32_t camera, const char* event);

  private:
    void WriteLine(const std::string& line);
    double GetTime() const;

    std::mutex mutex;
    std::FILE* file = nullptr;  // Set once, before other threads come.
    std::chrono::steady_clock::time_point start;
};

}  // namespace ZV::Simulation
