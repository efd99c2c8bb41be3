#pragma once

#include <cstdint>
#include <span>

#include "zentara/zentara.h"

// What a client that ends knows of its end; the ways to end are the system's.
namespace ZV::Test {

/// Where the process ends.
enum class EndPlace : std::uint32_t {
    Elsewhere,         ///< On the thread of main, whatever the others do.
    FrameCallback,     ///< On the camera's frame thread.
    ExposureCallback,  ///< On the camera's exposure thread.
    SettingsCallback,  ///< In Zentara_QueueSettings, with the queue's lock held.
    TriggerWait,       ///< While a grab waits for a trigger that does not come.
};

struct EndingWay {
    const char* name;
    void (*end)();
    EndPlace place = EndPlace::Elsewhere;
};

/// The system's.
std::span<const EndingWay> GetEndingWays();

/// Writes one byte to standard output, or ends the process with 3.
void WriteMark();

/// Lets a thread rest for good: the end comes from elsewhere.
[[noreturn]] void RestForEver();

}  // namespace ZV::Test
