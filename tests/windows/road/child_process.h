#pragma once

#include <windows.h>

#include <string>

namespace ZV::Test {

/// A program from the tests' folder, its input and output at the test's hand. The destructor ends
/// it.
class ChildProcess {
  public:
    /// Starts `program` with `arguments`. Its first line is for ReadLine.
    ChildProcess(const std::string& program, const std::string& arguments);
    ~ChildProcess();
    ChildProcess(const ChildProcess&) = delete;
    ChildProcess& operator=(const ChildProcess&) = delete;

    /// The next line of its output, without the line end; empty when there is none for a while.
    std::string ReadLine();
    /// Sends a line and reads the answer.
    std::string Ask(const std::string& line);
    /// Ends its input. True when it has gone by itself then.
    bool Finish();
    /// Ends it at once, as a crash does.
    void Kill();

  private:
    bool ReadAvailable();

    HANDLE process = nullptr;
    HANDLE input = nullptr;
    HANDLE output = nullptr;
    std::string read;
};

}  // namespace ZV::Test
