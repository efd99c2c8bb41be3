#pragma once

#include <cstdint>
#include <string_view>
#include <vector>

#include "simulation/zentara_simulation.h"

/// A kernel driver between the library and the simulation: it counts the control requests and lets
/// one of them fail. The suite's linker sends the library's load of the simulation's module here.
namespace ZV::Test {

enum class RequestFailure {
    None,
    Fails,             ///< The call ends with error 31, and nothing is done.
    AnsweredAtOnce,    ///< Done and answered by the call itself, where it could be pended.
    CompletesInError,  ///< Pended, and ended with error 31; nothing is done.
    CompletesLate,     ///< Done, and ended after two seconds of the wait clock.
    DeviceGone,        ///< The camera is unplugged before it, and stays so.
};

/// Requests are numbered in three series, since a stream's own thread sends some of them beside the
/// callers: attached buffers, as many as frames pass, and the stream's entering and leaving.
enum class RequestSeries { Calls, Stream, Switches };
inline constexpr RequestSeries AllSeries[] = {RequestSeries::Calls, RequestSeries::Stream,
                                              RequestSeries::Switches};
/// Before a request's number.
inline constexpr std::string_view SeriesMarks[] = {"", "s", "e"};

struct CountedRequest {
    std::uint32_t code = 0;
    bool mayPend = false;
    std::uint32_t address = 0;  ///< Of the register that is written.
    bool isOfStream = false;    ///< Sent by a stream's own thread.

    bool operator==(const CountedRequest&) const = default;
};

/// From here on requests are counted; number `number` of `series`, from 1, meets `failure`.
void BeginRequests(RequestFailure failure, RequestSeries series, std::uint64_t number);
/// Ends the counting; nothing fails any more.
void EndRequests();
/// Whether the request that was to fail has come, and its code; 0 before.
std::uint32_t GetFailedCode();
/// What was counted since BeginRequests, in order.
std::vector<CountedRequest> GetCounted(RequestSeries series);

/// What the library has found when it loaded the simulation's module, which stays loaded.
struct ModuleLoads {
    std::uint32_t failed = 0;
    /// CountAllocationsLeft at the load that was good; 0 before.
    std::int64_t allocationsLeft = 0;
};
ModuleLoads GetModuleLoads();
/// From here on the system names the library's image by a relative path, as it does for one that
/// was found by such a path.
void NameImageRelatively();

/// Handles that are open at the driver.
std::uint32_t CountOpenDevices();
/// Reservations that the driver had to take back so far, since a handle was closed with them.
std::uint32_t CountReclaimed();
/// Forgets that the library has ended its bus.
void ForgetEnd();
/// True when the library has ended its bus since; `held` is what the driver held then, over all
/// cameras.
bool HasEnded(ZentaraSimulationState* held);

}  // namespace ZV::Test
