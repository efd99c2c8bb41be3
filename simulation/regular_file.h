#pragma once

#include <cstdint>
#include <optional>
#include <string>

namespace ZV::Simulation {

/// Bytes of the regular file that `path` names as fopen() takes it: on Windows in the code page of
/// the process. Nothing if there is none: a pipe would be waited for, a device never ends.
std::optional<std::uint64_t> MeasureRegularFile(const std::string& path);

}  // namespace ZV::Simulation
