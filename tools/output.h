#pragma once

#include <cstdio>
#include <nlohmann/json_fwd.hpp>
#include <string>

namespace ZentaraProgram {

/// The program's own standard output: results only. Messages go to standard error.
void SetOutput(std::FILE* stream);
void Print(const std::string& text);
/// A serial number or a file name need not be UTF-8: bytes that are not become U+FFFD.
void PrintJson(const nlohmann::json& value);
/// The same, in the order in which the members were added.
void PrintJson(const nlohmann::ordered_json& value);
void PrintError(const std::string& text);

/// A text from elsewhere, with question marks for what a terminal could take as a command.
std::string MakeHarmless(std::string text);

/// False when something that was printed could not be written (a full disk, a closed pipe).
bool FlushOutput();

}  // namespace ZentaraProgram
