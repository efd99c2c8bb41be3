#pragma once

#include <cstdio>
#include <string>
#include <system_error>
#include <vector>

/// The few things that the program itself wants of the operating system. Texts are UTF-8.
namespace ZentaraProgram {

/// The arguments behind the program's name, from those that `main` was given.
std::vector<std::string> GetArguments(int count, char** values);

/// Gives the program a stream of its own to the standard output and sends whatever the library
/// prints there to standard error. Lines end alike on each system. Called once, first.
std::FILE* TakeStandardOutput();

void SetVariable(const char* name, const std::string& value);
bool IsTerminal(std::FILE* stream);

/// `fopen` for a name in UTF-8.
std::FILE* OpenFile(const std::string& path, const char* mode);

/// Whether a name that can be opened leads to a device, a console or a pipe. Waits for none.
bool IsDevice(const std::string& path);

/// Makes a folder; where the system has modes, one that nobody else may enter. An error of
/// `file_exists` when something has the name.
std::error_code MakePrivateFolder(const std::string& path);

/// A name as a library takes it that opens the file itself by the narrow functions of the system.
std::string GetNarrowPath(const std::string& path);

/// Checks a scenario with the simulation module beside the library. False with the reason in
/// `message`.
bool CheckScenario(const std::string& scenario, std::string* message);

}  // namespace ZentaraProgram
