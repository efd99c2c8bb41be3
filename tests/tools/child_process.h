#pragma once

#include <cstdint>
#include <string>
#include <vector>

/// Processes of the system that a test starts.
namespace ZentaraTest {

using ChildProcess = std::intptr_t;
inline constexpr ChildProcess NoProcess = -1;

struct ProcessStart {
    std::vector<std::string> commandLine;  ///< The program, then its arguments, UTF-8.
    std::vector<std::string> variables;    ///< "NAME=VALUE", beside those of the test itself.
    std::string output, errors;            ///< Files for the standard output and standard error.
};

ChildProcess StartProcess(const ProcessStart& start);

/// Ctrl-C at the console of the process.
void InterruptProcess(ChildProcess process);

/// Looks once. True when the process has ended; it must not be used again then. `exitCode` is -1
/// for an end that is no exit.
bool IsProcessEnded(ChildProcess process, int* exitCode);

/// Ends a process by force and waits for that.
void KillProcess(ChildProcess process);

/// File of a program that the build has made.
std::string GetBuiltProgram(const std::string& name);

}  // namespace ZentaraTest
