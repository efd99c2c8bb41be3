#pragma once

#include <cstdint>

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

/// The way of this name, or null.
const EndingWay* FindEndingWay(const char* name);

/// Tells, once, that the end comes now.
void TellEnd();

/// Lets a thread rest for good: the end comes from elsewhere.
[[noreturn]] void RestForEver();

}  // namespace ZV::Test
