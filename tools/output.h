#pragma once

#include <cstdio>
#include <string>

namespace ZentaraProgram {

/// The program's own standard output: results only. Messages go to standard error.
void SetOutput(std::FILE* stream);
void Print(const std::string& text);
void PrintError(const std::string& text);

/// False when something that was printed could not be written (a full disk, a closed pipe).
bool FlushOutput();

}  // namespace ZentaraProgram
