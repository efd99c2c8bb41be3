#pragma once

#include <string>
#include <system_error>

#include "image_file.h"

namespace ZentaraProgram {

/// Each writes a new file and returns the reason of a failure, or an empty text.
std::string WriteFits(const std::string& path, const Image& image);
std::string WriteTiff(const std::string& path, const Image& image);
std::string WritePng(const std::string& path, const Image& image);
std::string WriteRaw(const std::string& path, const Image& image);

/// The system's words for the last failure of a file operation.
std::string DescribeFileFailure();
/// The same of a failure that came back as a code.
std::string DescribeFailure(const std::error_code& failure);

}  // namespace ZentaraProgram
