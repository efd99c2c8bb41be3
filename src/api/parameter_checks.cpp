#include "api/parameter_checks.h"

#include <algorithm>
#include <array>

#include "api/handles.h"
#include "api/parameter_table.h"
#include "api/settings_block.h"

namespace ZV {

ZentaraResult CheckSparseTableEntry(Zentara_Settings& block, std::uint32_t key,
                                    std::uint32_t value) {
    std::array<std::uint32_t, CheckedListEntries> entries{};
    std::int32_t count = CheckedListEntries;
    const ZentaraResult result = Zentara_GetParamSparseTable(&block, key, entries.data(), &count);
    if (result != zerrNone) return result;
    const auto end = entries.begin() + count;
    return std::find(entries.begin(), end, value) != end ? ZentaraResult{zerrNone}
                                                         : ZentaraResult{zerrBadParameter};
}

ZentaraResult CheckRangeTableEntry(Zentara_Settings& block, std::uint32_t key,
                                   std::uint32_t value) {
    std::uint32_t greatest = 0;
    ZentaraResult result = Zentara_GetParamMax(&block, key, &greatest);
    if (result != zerrNone) return result;
    std::uint32_t least = 0;
    result = Zentara_GetParamMin(&block, key, &least);
    if (result != zerrNone) return result;
    // Kept: one bound is enough, so a client may store any value and sees the camera's own answer
    // when the block is sent.
    const bool passes = value >= least || value <= greatest;
    return passes ? ZentaraResult{zerrNone} : ZentaraResult{zerrBadParameter};
}

ZCamera* FindBlockCamera(const Zentara_Settings& block) {
    ZCamera* const camera = FindCamera(GetSettingsHandle(block));
    return IsOpen(camera) ? camera : nullptr;
}

}  // namespace ZV
