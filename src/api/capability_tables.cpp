// What a camera offers for each key: whether it has it, and which values. The answers come from the
// camera's model; nothing is stored and nothing goes over the bus.

#include <algorithm>
#include <cstddef>
#include <vector>

#include "api/exported_call.h"
#include "api/handles.h"
#include "api/parameter_checks.h"
#include "api/parameter_table.h"
#include "api/settings_block.h"
#include "camera/camera.h"
#include "diagnostics/log.h"
#include "zentara/zentara.h"

namespace ZV {

namespace {

ZentaraResult AnswerYes(bool isYes) {
    return isYes ? ZentaraResult{zerrNone} : ZentaraResult{zerrNotSupported};
}

template <typename Body>
ZentaraResult TracedBy(void (*enter)(const char*, std::uint32_t), const char* function,
                       std::uint32_t key, Body&& body) noexcept {
    enter(function, key);
    const ZentaraResult result = Guarded(body);
    ZLogLeave(function, static_cast<std::uint16_t>(result));
    return result;
}

template <typename Row>
ZentaraResult IsSupported(const char* function, ZentaraHandle handle, const Row* row) {
    if (!ZCamera::IsInitalized()) return zerrNotLoaded;
    if (handle == 0) return zerrBadHandle;
    ZCamera* const camera = FindCamera(handle);
    if (!IsOpen(camera)) return zerrBadHandle;
    if (!HasExclusiveAccess(function, camera)) return zerrBadHandle;
    return AnswerYes(row != nullptr && row->isSupported(*camera));
}

using SupportFunction = ZentaraResult (*)(ZentaraHandle handle, std::uint32_t key);

// Kept: only a 1 of the support function is a no. A block of a camera that is closed, or open in
// another process, is still answered from the table.
template <typename Row, typename Predicate>
ZentaraResult AskTable(const Zentara_Settings* block, const Row* row, SupportFunction isSupported,
                       Predicate&& predicate) {
    if (!ZCamera::IsInitalized()) return zerrNotLoaded;
    if (block == nullptr) return zerrBadParameter;
    if (!HasSettingsMagic(*block)) return zerrBadSettings;
    if (row == nullptr) return zerrNotSupported;
    if (isSupported(GetSettingsHandle(*block), row->key) == zerrNotSupported) {
        return zerrNotSupported;
    }
    return AnswerYes(predicate(*row));
}

bool HasList(const WordParameter& row) {
    return row.list != nullptr;
}

template <typename Row>
bool HasRange(const Row& row) {
    return row.hasRange;
}

ZentaraResult IsListedKey(Zentara_Settings* block, std::uint32_t key) {
    return AskTable(block, FindWordParameter(key), Zentara_IsParamSupported, HasList);
}

/// Fills as far as there is room: what does not fit is left out without a word.
ZentaraResult GetSparseTable(const char* function, Zentara_Settings* block, std::uint32_t key,
                             std::uint32_t* table, std::int32_t* size) {
    if (!ZCamera::IsInitalized()) return zerrNotLoaded;
    if (block == nullptr || table == nullptr || size == nullptr) return zerrBadParameter;
    if (!HasSettingsMagic(*block)) return zerrBadSettings;
    ZCamera* const camera = FindBlockCamera(*block);
    if (camera == nullptr) return zerrBadSettings;
    if (*size == 0) return zerrNone;
    if (*size < 0) return zerrNotSupported;
    if (IsListedKey(block, key) != zerrNone) return zerrNotSupported;
    std::vector<std::uint32_t> values;
    FindWordParameter(key)->list(*camera, values);
    const std::size_t room = static_cast<std::size_t>(*size);
    if (values.size() > room) values.resize(room);
    std::copy(values.begin(), values.end(), table);
    *size = static_cast<std::int32_t>(values.size());
    ZLogSparseTable(function, key, table, static_cast<std::uint32_t>(*size));
    return zerrNone;
}

ZentaraResult RefuseSparseTable(std::int32_t* size) {
    if (!ZCamera::IsInitalized()) return zerrNotLoaded;
    if (size != nullptr) *size = 0;
    return zerrNotSupported;
}

ZentaraResult DenySparseTable() {
    return ZCamera::IsInitalized() ? ZentaraResult{zerrNotSupported} : ZentaraResult{zerrNotLoaded};
}

}  // namespace

}  // namespace ZV

ZentaraResult Zentara_IsParamSupported(ZentaraHandle handle, uint32_t key) {
    const char* const function = __func__;
    return ZV::TracedBy(ZV::ZLogEnterKey32, function, key, [&] {
        return ZV::IsSupported(function, handle, ZV::FindWordParameter(key));
    });
}

ZentaraResult Zentara_IsParamS32Supported(ZentaraHandle handle, uint32_t key) {
    const char* const function = __func__;
    return ZV::TracedBy(ZV::ZLogEnterKeyS32, function, key, [&] {
        return ZV::IsSupported(function, handle, ZV::FindSignedParameter(key));
    });
}

ZentaraResult Zentara_IsParam64Supported(ZentaraHandle handle, uint32_t key) {
    const char* const function = __func__;
    return ZV::TracedBy(ZV::ZLogEnterKey64, function, key, [&] {
        return ZV::IsSupported(function, handle, ZV::FindWideParameter(key));
    });
}

ZentaraResult Zentara_IsRangeTable(Zentara_Settings* settings, uint32_t key) {
    return ZV::TracedBy(ZV::ZLogEnterKey32, __func__, key, [&] {
        return ZV::AskTable(settings, ZV::FindWordParameter(key), Zentara_IsParamSupported,
                            ZV::HasRange<ZV::WordParameter>);
    });
}

ZentaraResult Zentara_IsRangeTableS32(Zentara_Settings* settings, uint32_t key) {
    return ZV::TracedBy(ZV::ZLogEnterKeyS32, __func__, key, [&] {
        return ZV::AskTable(settings, ZV::FindSignedParameter(key), Zentara_IsParamS32Supported,
                            ZV::HasRange<ZV::SignedParameter>);
    });
}

ZentaraResult Zentara_IsRangeTable64(Zentara_Settings* settings, uint32_t key) {
    return ZV::TracedBy(ZV::ZLogEnterKey64, __func__, key, [&] {
        return ZV::AskTable(settings, ZV::FindWideParameter(key), Zentara_IsParam64Supported,
                            ZV::HasRange<ZV::WideParameter>);
    });
}

ZentaraResult Zentara_IsSparseTable(Zentara_Settings* settings, uint32_t key) {
    return ZV::TracedBy(ZV::ZLogEnterKey32, __func__, key,
                        [&] { return ZV::IsListedKey(settings, key); });
}

ZentaraResult Zentara_IsSparseTableS32(Zentara_Settings* /*settings*/, uint32_t key) {
    return ZV::TracedBy(ZV::ZLogEnterKeyS32, __func__, key, ZV::DenySparseTable);
}

ZentaraResult Zentara_IsSparseTable64(Zentara_Settings* /*settings*/, uint32_t key) {
    return ZV::TracedBy(ZV::ZLogEnterKey64, __func__, key, ZV::DenySparseTable);
}

ZentaraResult Zentara_GetParamSparseTable(Zentara_Settings* settings, uint32_t key, uint32_t* table,
                                          int32_t* size) {
    const char* const function = __func__;
    return ZV::TracedBy(ZV::ZLogEnterKey32, function, key,
                        [&] { return ZV::GetSparseTable(function, settings, key, table, size); });
}

ZentaraResult Zentara_GetParamSparseTableS32(Zentara_Settings* /*settings*/, uint32_t key,
                                             int32_t* /*table*/, int32_t* size) {
    return ZV::TracedBy(ZV::ZLogEnterKeyS32, __func__, key,
                        [&] { return ZV::RefuseSparseTable(size); });
}

ZentaraResult Zentara_GetParamSparseTable64(Zentara_Settings* /*settings*/, uint32_t key,
                                            uint64_t* /*table*/, int32_t* size) {
    return ZV::TracedBy(ZV::ZLogEnterKey64, __func__, key,
                        [&] { return ZV::RefuseSparseTable(size); });
}
