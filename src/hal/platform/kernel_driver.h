#pragma once

#include <cstdint>

/// What a driver below the seam offers when it is not reached through the operating system's own
/// device interface: open, close, and control with the records and codes of the kernel driver, and
/// the list of its device interfaces. The simulation is such a driver. Plain C layout, so that the
/// driver may live in a module of its own.
namespace ZV {

inline constexpr std::uint32_t KernelDriverVersion = 1;

/// One control request. It and its buffers belong to the seam until the request has ended.
struct KernelRequest {
    std::uint32_t code;
    std::uint32_t inputBytes;
    const void* input;
    void* output;
    std::uint32_t outputBytes;
    /// 1 when the caller gave an overlapped record; a driver may pend such a request alone.
    std::uint32_t isOverlapped;
    /// Ends a request that was pended: called exactly once, from any thread, with no lock of the
    /// seam held. `error` is 0 or a system error number, `bytes` the length of the answer. The
    /// request may be gone when it returns.
    void (*complete)(KernelRequest* request, std::uint32_t error, std::uint32_t bytes);
};

/// Table of operations. Each returns 0 or a system error number (last_error.h). Thread-safe.
struct KernelDriver {
    std::uint32_t version;

    /// Makes the devices that `configuration` names; the same text as before goes on with the same
    /// devices, another starts anew. On failure `message` holds what is wrong and where,
    /// terminated.
    std::uint32_t (*begin)(const char* configuration, char* message, std::uint32_t messageBytes);
    /// Ends all devices; requests that are still pended end with an error.
    void (*end)();

    /// The list of device interfaces as it is now.
    std::uint32_t (*openList)(void** list);
    /// 0 when `index` exists, 259 beyond the last.
    std::uint32_t (*selectInterface)(void* list, std::uint32_t index);
    /// Size of the detail record of `index`: 4 bytes, the path and its terminator. Writes
    /// `requiredBytes`; 122 when `capacity` is less, else the path, terminated, goes to `path`
    /// (`capacity` - 4 bytes).
    std::uint32_t (*getDetail)(void* list, std::uint32_t index, char* path, std::uint32_t capacity,
                               std::uint32_t* requiredBytes);
    void (*closeList)(void* list);

    std::uint32_t (*open)(const char* path, void** handle);
    /// Ends what is pended on `handle` with error 995 before it returns.
    void (*close)(void* handle);
    /// 0: answered, `bytes` written. 997: pended, `complete` follows (or came already). Else the
    /// failure.
    std::uint32_t (*control)(void* handle, KernelRequest* request, std::uint32_t* bytes);
    /// Asks for the early end of one pended request: it completes with error 995 unless it has
    /// ended.
    void (*cancel)(void* handle, KernelRequest* request);
};

/// Exported by a driver's module under this name; null for a version that it does not know.
using GetKernelDriverFunction = const KernelDriver* (*)(std::uint32_t version);
inline constexpr char GetKernelDriverName[] = "ZentaraSimulation_GetKernelDriver";

}  // namespace ZV
