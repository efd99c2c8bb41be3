#pragma once

#include <string>

namespace ZV::Test {

/// The keys of the library as documents, made from the rows that the library itself goes by.
/// `scripts/generate-parameters` writes them; a test compares what is checked in.

/// docs/parameters.md.
std::string MakeParameterDocument();

/// tools/parameter_names.inc: rows for the program, which sees the flat interface alone.
std::string MakeParameterNames();

}  // namespace ZV::Test
