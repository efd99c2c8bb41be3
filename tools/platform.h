#pragma once

#include <cstdio>
#include <string>

/// The few things that the program itself wants of the operating system.
namespace ZentaraProgram {

/// Gives the program a stream of its own to the standard output and sends whatever the library
/// prints there to standard error. Called once, first.
std::FILE* TakeStandardOutput();

void SetVariable(const char* name, const std::string& value);
bool IsTerminal(std::FILE* stream);

/// Checks a scenario with the simulation module beside the library. False with the reason in
/// `message`.
bool CheckScenario(const std::string& scenario, std::string* message);

}  // namespace ZentaraProgram
