#pragma once

#include <cstddef>
#include <cstdint>
#include <functional>
#include <span>

#include "simulation/register_file.h"
#include "simulation/scenario.h"

/// A kernel driver within the process that answers on the caller's own thread (but for late
/// answers), and whose cameras say whatever a fuzz target lets them say. It takes the place of the
/// simulation at the seam: the library sees its devices while it is linked in. Thread-safe.
namespace ZV::Fuzzing {

/// What happens to a request instead of its answer.
enum class Mischief : std::uint8_t {
    None,
    Fail,          ///< The call itself fails.
    EndWithError,  ///< It is pended and then ends with an error.
    AnswerAtOnce,  ///< The call answers, although it should pend.
    ShortAnswer,   ///< Half of the answer comes.
    Late,          ///< It is pended and answered from another thread after a while.
    Last = Late
};

/// Cameras of these scenarios are on the bus from now on, in their state after power on, and no
/// mischief is planned. No device may be open.
void PlugHostileCameras(std::span<const Simulation::CameraScenario> cameras);

/// What register reads answer. An address without memory answers its own number turned round.
void SetRegister(std::size_t camera, Simulation::BlockName block, std::uint32_t quadlet,
                 std::uint32_t value);
[[nodiscard]] std::uint32_t GetRegister(std::size_t camera, Simulation::BlockName block,
                                        std::uint32_t quadlet);

/// `count` requests after `skipped` others meet with mischief; replaces what was planned. Late
/// answers take `error` microseconds, modulo 1024.
void PlanMischief(Mischief mischief, std::uint32_t skipped, std::uint32_t count,
                  std::uint32_t error);

/// Lets `fill` write to the buffer that was attached first, and ends its request. False when none
/// is attached.
bool DeliverRequest(std::size_t camera, const std::function<void(std::span<std::uint8_t>)>& fill);

/// Waits until as many buffers are attached as a ring has, at most 20 ms: the loop has then taken
/// in all that was delivered. False when they are not.
bool WaitForRing(std::size_t camera);

/// Bytes of a packet slot, as the stream reserved it last.
[[nodiscard]] std::uint32_t GetPacketStride(std::size_t camera);

/// Handles that are open: none is left behind by a library that was released.
[[nodiscard]] std::size_t CountOpenHandles();

}  // namespace ZV::Fuzzing
