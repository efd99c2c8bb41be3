#pragma once

#include <filesystem>
#include <string>

namespace ZV::Test {

/// Collects the debugger output in a file for its life.
class DebugOutputFile {
  public:
    explicit DebugOutputFile(const std::filesystem::path& folder);
    ~DebugOutputFile();
    DebugOutputFile(const DebugOutputFile&) = delete;
    DebugOutputFile& operator=(const DebugOutputFile&) = delete;

    /// What has come since the last call.
    std::string Take();

  private:
    std::filesystem::path path;
    std::size_t taken = 0;
};

}  // namespace ZV::Test
