#pragma once

#include <chrono>
#include <string>
#include <vector>

#include "support/temporary_folder.h"
#include "tools/child_process.h"

/// The zentara program as a child process.
namespace ZentaraTest {

using ZV::Test::TemporaryFolder;

struct ProgramResult {
    int exitCode = -1;
    std::string output;  ///< Standard output.
    std::string errors;  ///< Standard error.
};

/// A run that goes on beside the test.
class RunningProgram {
  public:
    explicit RunningProgram(const std::vector<std::string>& arguments,
                            const std::vector<std::string>& variables = {});
    ~RunningProgram();
    RunningProgram(const RunningProgram&) = delete;
    RunningProgram& operator=(const RunningProgram&) = delete;

    /// Ctrl-C.
    void Interrupt() const;
    /// An end by force; Wait gives the exit code -1 then.
    void Kill();
    /// Waits for the end, at most `limit`; a run that takes longer is killed and has the exit code
    /// -1.
    ProgramResult Wait(std::chrono::seconds limit = std::chrono::seconds(60));

  private:
    TemporaryFolder folder;
    ChildProcess process = NoProcess;
};

ProgramResult RunProgram(const std::vector<std::string>& arguments,
                         const std::vector<std::string>& variables = {});

/// Runs a tool of the system by its name and arguments.
ProgramResult RunTool(const std::vector<std::string>& commandLine);

std::string ReadFile(const std::string& path);
void WriteFile(const std::string& path, const std::string& text);

}  // namespace ZentaraTest
