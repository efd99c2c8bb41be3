#pragma once

namespace ZV::Test {

#if defined(__SANITIZE_THREAD__) || defined(__SANITIZE_ADDRESS__)
inline constexpr bool IsSanitized = true;
#else
inline constexpr bool IsSanitized = false;
#endif

/// Rounds of a test that tries random values on one thread: all of them natively, an eighth under a
/// sanitizer, which looks at how each access is made and takes many times as long over a round.
constexpr int CountRounds(int rounds) {
    constexpr int Share = 8;
    return IsSanitized ? (rounds + Share - 1) / Share : rounds;
}

}  // namespace ZV::Test
