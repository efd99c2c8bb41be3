#pragma once

#include <cstdint>

#include "fuzz/fuzz_input.h"
#include "zentara/zentara.h"

namespace ZV::Fuzzing {

/// One call of an accessor of the block, a question about it, a limit or a table: which, its key
/// and its value come from the input. No code but those of the table of results comes back, and no
/// list is longer than its room.
void CallAccessor(FuzzInput& input, ZentaraHandle handle, Zentara_Settings* block);

/// All keys through all accessors that read.
void ReadWholeBlock(ZentaraHandle handle, Zentara_Settings* block);

/// A result that the flat interface can give.
void RequireKnownResult(ZentaraResult result);

}  // namespace ZV::Fuzzing
