#include "sweep/counted_waits.h"

std::uint64_t RealGetRealWaitMs(std::uint64_t timeoutMs) __asm__("__real__ZN2ZV13GetRealWaitMsEm");
std::uint64_t WrapGetRealWaitMs(std::uint64_t timeoutMs) __asm__("__wrap__ZN2ZV13GetRealWaitMsEm");

namespace ZV::Test {
namespace {

thread_local std::uint64_t begunWaitsMs = 0;

}  // namespace

std::uint64_t GetBegunWaitsMs() {
    return begunWaitsMs;
}

}  // namespace ZV::Test

std::uint64_t WrapGetRealWaitMs(std::uint64_t timeoutMs) {
    ZV::Test::begunWaitsMs += timeoutMs;
    return RealGetRealWaitMs(timeoutMs);
}
