#pragma once

#include <string>

namespace ZentaraTest {

/// Whether a FITS file keeps the standard, by the best judge that the system has: fitsverify, or
/// the checksums in the file.
bool IsFitsGood(const std::string& path);

}  // namespace ZentaraTest
