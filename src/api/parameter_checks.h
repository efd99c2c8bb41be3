#pragma once

#include <cstdint>

#include "camera/camera.h"
#include "zentara/zentara.h"

namespace ZV {

/// zerrNone if `value` is in the key's list; zerrBadParameter if not. A failure to read the list is
/// returned as it is.
ZentaraResult CheckSparseTableEntry(Zentara_Settings& block, std::uint32_t key,
                                    std::uint32_t value);

/// Lets every value pass while the key's least value is not above its greatest, and stays so: it
/// refuses only what is too small and too great at once. A failure to read a limit is returned as
/// it is.
ZentaraResult CheckRangeTableEntry(Zentara_Settings& block, std::uint32_t key, std::uint32_t value);

/// The camera that a block names by its handle; null unless it is open.
[[nodiscard]] ZCamera* FindBlockCamera(const Zentara_Settings& block);

}  // namespace ZV
