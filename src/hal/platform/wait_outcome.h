#pragma once

#include <cstdint>

namespace ZV {

/// How a wait of the platform seam ended.
enum class WaitOutcome {
    Signalled,  ///< What was waited for came.
    TimedOut,   ///< The limit ran out first.
    Failed,     ///< The system refused the wait; the last platform error says why.
};

/// Limit of a wait that has none.
inline constexpr std::uint64_t WaitForEver = ~std::uint64_t{0};

}  // namespace ZV
