#pragma once

#include <cstddef>
#include <cstdint>

namespace ZV::Test {

/// True while the thread `id` of this process sleeps in the system.
[[nodiscard]] bool IsAsleep(std::uint32_t id);

/// Threads of this process.
[[nodiscard]] std::size_t CountThreads();

}  // namespace ZV::Test
