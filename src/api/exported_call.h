#pragma once

#include <cstdint>

#include "diagnostics/log.h"
#include "zentara/zentara.h"

namespace ZV {

/// Runs `body` and turns what the standard library throws into zerrDriverFault, so that nothing
/// leaves an exported function or a callback of the library but a code. The locks that `body` took
/// in guard objects are given back.
template <typename Body>
ZentaraResult Guarded(Body&& body) noexcept {
    try {
        return body();
    } catch (...) {
        return zerrDriverFault;
    }
}

/// Guarded, between the log's start and end records of `function`, which is handed on to `body`.
template <typename Body>
ZentaraResult Traced(const char* function, Body&& body) noexcept {
    ZLogEnter(function);
    const ZentaraResult result = Guarded([&] { return body(function); });
    ZLogLeave(function, static_cast<std::uint16_t>(result));
    return result;
}

}  // namespace ZV
