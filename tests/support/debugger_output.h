#pragma once

#include <cstddef>
#include <memory>
#include <string>

namespace ZV::Test {

/// Collects the debugger output of this process for its life. One at a time.
class DebuggerOutput {
  public:
    DebuggerOutput();
    ~DebuggerOutput();
    DebuggerOutput(const DebuggerOutput&) = delete;
    DebuggerOutput& operator=(const DebuggerOutput&) = delete;

    /// What has come since the last call.
    [[nodiscard]] std::string Take();
    /// All that has come.
    [[nodiscard]] std::string Read() const;

  private:
    struct Listener;
    std::unique_ptr<Listener> listener;
    std::size_t taken = 0;
};

}  // namespace ZV::Test
