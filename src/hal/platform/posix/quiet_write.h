#pragma once

#include <cstddef>

namespace ZV {

/// Writes with one write. What the system refuses is lost without a word: a reader that is gone and
/// a file at its greatest size raise no signal. Thread-safe; changes errno.
void WriteQuietly(int descriptor, const void* bytes, std::size_t count);

}  // namespace ZV
