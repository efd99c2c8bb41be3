// The parameters of a settings block: single values and their limits. Editing a block touches no
// camera; the camera of the block only lends its limits and conversions.

#include <optional>
#include <type_traits>

#include "api/exported_call.h"
#include "api/parameter_checks.h"
#include "api/parameter_table.h"
#include "api/settings_block.h"
#include "camera/camera.h"
#include "diagnostics/log.h"
#include "zentara/zentara.h"

namespace ZV {

namespace {

/// One family of keys: its rows, its words in a block, its support function and its log routines.
template <typename FamilyValue, auto Find, auto Load, auto Store, auto Support, auto Dump,
          auto Enter>
struct ParameterFamily {
    using Value = FamilyValue;

    static const ParameterRow<Value>* FindRow(std::uint32_t key) { return Find(key); }
    static Value GetWord(const Zentara_Settings& block, std::uint32_t key) {
        return Load(block, key);
    }
    static void SetWord(Zentara_Settings& block, std::uint32_t key, Value value) {
        Store(block, key, value);
    }
    // Kept: only a 1 is a no, so that a block of a camera in another process can be edited.
    static bool IsSupported(const Zentara_Settings& block, std::uint32_t key) {
        return Support(GetSettingsHandle(block), key) != zerrNotSupported;
    }
    static void Print(std::uint32_t key, Value value) { Dump(key, value); }
    static void LogEntry(const char* function, std::uint32_t key) { Enter(function, key); }
};

using WordFamily =
    ParameterFamily<std::uint32_t, FindWordParameter, GetSettingsWord, SetSettingsWord,
                    Zentara_IsParamSupported, ZentaraDebugOutputSetting32, ZLogEnterKey32>;
using SignedFamily =
    ParameterFamily<std::int32_t, FindSignedParameter, GetSettingsSigned, SetSettingsSigned,
                    Zentara_IsParamS32Supported, ZentaraDebugOutputSettingS32, ZLogEnterKeyS32>;
using WideFamily =
    ParameterFamily<std::uint64_t, FindWideParameter, GetSettingsWide, SetSettingsWide,
                    Zentara_IsParam64Supported, ZentaraDebugOutputSetting64, ZLogEnterKey64>;

template <typename Family, typename Body>
ZentaraResult TracedKey(const char* function, std::uint32_t key, Body&& body) noexcept {
    Family::LogEntry(function, key);
    const ZentaraResult result = Guarded(body);
    ZLogLeave(function, static_cast<std::uint16_t>(result));
    return result;
}

// ---- Reading: values and limits ----

/// What becomes of a key beyond the family's last.
enum class BeyondLast {
    AskForSupport,  ///< Refused once the support function has been asked.
    Print,          ///< The same, and the out value is printed like an answer.
    RefuseAtOnce,   ///< The support function is not asked.
};

template <typename Value>
struct Question {
    Zentara_Settings* block;
    std::uint32_t key;
    Value* value;
    BeyondLast beyondLast = BeyondLast::AskForSupport;
};

/// What is asked of a key once the arguments have passed.
template <typename Family>
using Answering = ZentaraResult (*)(const ParameterRow<typename Family::Value>& row,
                                    ZCamera& camera,
                                    const Question<typename Family::Value>& question);

template <typename Family>
ZentaraResult AskParameter(const Question<typename Family::Value>& question,
                           Answering<Family> answer) {
    if (!ZCamera::IsInitalized()) return zerrNotLoaded;
    if (question.block == nullptr || question.value == nullptr) return zerrBadParameter;
    if (!HasSettingsMagic(*question.block)) return zerrBadSettings;
    ZCamera* const camera = FindBlockCamera(*question.block);
    if (camera == nullptr) return zerrBadSettings;
    const auto* const row = Family::FindRow(question.key);
    if (row == nullptr && question.beyondLast == BeyondLast::RefuseAtOnce) return zerrNotSupported;
    const bool isSupported = Family::IsSupported(*question.block, question.key);
    if (row == nullptr && question.beyondLast == BeyondLast::Print) {
        Family::Print(question.key, *question.value);
    }
    if (row == nullptr || !isSupported) return zerrNotSupported;
    const ZentaraResult result = answer(*row, *camera, question);
    if (result == zerrNone) Family::Print(question.key, *question.value);
    return result;
}

template <typename Family>
ZentaraResult AnswerValue(const ParameterRow<typename Family::Value>& row, ZCamera& camera,
                          const Question<typename Family::Value>& question) {
    if (row.get != nullptr) return row.get(*question.block, camera, question.value);
    *question.value = Family::GetWord(*question.block, row.key);
    return zerrNone;
}

enum class Bound { Least, Greatest };

/// The first or the last entry of the list, whatever their order.
template <Bound Which>
ZentaraResult AnswerListed(const Question<std::uint32_t>& question) {
    constexpr std::int32_t Room = 100;
    std::uint32_t entries[Room];
    std::int32_t count = Room;
    const ZentaraResult result =
        Zentara_GetParamSparseTable(question.block, question.key, entries, &count);
    if (result != zerrNone) return result;
    if (count <= 0) return zerrNotSupported;
    *question.value = entries[Which == Bound::Least ? 0 : count - 1];
    return zerrNone;
}

template <typename Family, Bound Which>
ZentaraResult AnswerBound(const ParameterRow<typename Family::Value>& row, ZCamera& camera,
                          const Question<typename Family::Value>& question) {
    if constexpr (std::is_same_v<Family, WordFamily>) {
        if (row.list != nullptr && !row.hasRange) return AnswerListed<Which>(question);
    }
    const auto limit = Which == Bound::Least ? row.limits.least : row.limits.greatest;
    if (limit == nullptr) return zerrNotSupported;
    const std::optional<typename Family::Value> value = limit(camera);
    if (!value) return zerrNotSupported;
    *question.value = *value;
    return zerrNone;
}

template <typename Family>
ZentaraResult AskTraced(const char* function, const Question<typename Family::Value>& question,
                        Answering<Family> answer) {
    return TracedKey<Family>(function, question.key,
                             [&] { return AskParameter<Family>(question, answer); });
}

// ---- Writing ----

ZentaraResult CheckByTables(const WordParameter& row, Zentara_Settings& block,
                            std::uint32_t value) {
    if (row.list != nullptr) return CheckSparseTableEntry(block, row.key, value);
    if (row.hasRange) return CheckRangeTableEntry(block, row.key, value);
    return zerrNotSupported;
}

template <typename Family>
ZentaraResult Store(const ParameterRow<typename Family::Value>& row, ZCamera& camera,
                    Zentara_Settings& block, typename Family::Value value) {
    if (row.set != nullptr) return row.set(block, camera, row.key, value);
    if constexpr (std::is_same_v<Family, WordFamily>) {
        const ZentaraResult result = CheckByTables(row, block, value);
        if (result == zerrNone) Family::SetWord(block, row.key, value);
        return result;
    }
    return zerrNotSupported;
}

template <typename Family>
ZentaraResult SetParameter(Zentara_Settings* block, std::uint32_t key,
                           typename Family::Value value) {
    if (!ZCamera::IsInitalized()) return zerrNotLoaded;
    if (block == nullptr) return zerrBadParameter;
    if (!HasSettingsMagic(*block)) return zerrBadSettings;
    const auto* const row = Family::FindRow(key);
    if (row == nullptr) return zerrNotSupported;
    ZCamera* const camera = FindBlockCamera(*block);
    if (camera == nullptr) return zerrBadSettings;
    if (!Family::IsSupported(*block, key)) return zerrNotSupported;
    Family::Print(key, value);
    return Store<Family>(*row, *camera, *block, value);
}

template <typename Family>
ZentaraResult SetTraced(const char* function, Zentara_Settings* block, std::uint32_t key,
                        typename Family::Value value) {
    return TracedKey<Family>(function, key,
                             [&] { return SetParameter<Family>(block, key, value); });
}

}  // namespace

}  // namespace ZV

ZentaraResult Zentara_GetParam(Zentara_Settings* settings, uint32_t key, uint32_t* value) {
    using Family = ZV::WordFamily;
    return ZV::AskTraced<Family>(__func__, {settings, key, value}, ZV::AnswerValue<Family>);
}

ZentaraResult Zentara_GetParamMin(Zentara_Settings* settings, uint32_t key, uint32_t* value) {
    using Family = ZV::WordFamily;
    return ZV::AskTraced<Family>(__func__, {settings, key, value},
                                 ZV::AnswerBound<Family, ZV::Bound::Least>);
}

ZentaraResult Zentara_GetParamMax(Zentara_Settings* settings, uint32_t key, uint32_t* value) {
    using Family = ZV::WordFamily;
    return ZV::AskTraced<Family>(__func__, {settings, key, value},
                                 ZV::AnswerBound<Family, ZV::Bound::Greatest>);
}

ZentaraResult Zentara_GetParamS32(Zentara_Settings* settings, uint32_t key, int32_t* value) {
    using Family = ZV::SignedFamily;
    // Kept: it alone looks at the key first, so its trace shows no question for support.
    return ZV::AskTraced<Family>(__func__, {settings, key, value, ZV::BeyondLast::RefuseAtOnce},
                                 ZV::AnswerValue<Family>);
}

ZentaraResult Zentara_GetParamS32Min(Zentara_Settings* settings, uint32_t key, int32_t* value) {
    using Family = ZV::SignedFamily;
    // Kept: the limits of a signed key that does not exist print the out value all the same.
    return ZV::AskTraced<Family>(__func__, {settings, key, value, ZV::BeyondLast::Print},
                                 ZV::AnswerBound<Family, ZV::Bound::Least>);
}

ZentaraResult Zentara_GetParamS32Max(Zentara_Settings* settings, uint32_t key, int32_t* value) {
    using Family = ZV::SignedFamily;
    return ZV::AskTraced<Family>(__func__, {settings, key, value, ZV::BeyondLast::Print},
                                 ZV::AnswerBound<Family, ZV::Bound::Greatest>);
}

ZentaraResult Zentara_GetParam64(Zentara_Settings* settings, uint32_t key, uint64_t* value) {
    using Family = ZV::WideFamily;
    return ZV::AskTraced<Family>(__func__, {settings, key, value}, ZV::AnswerValue<Family>);
}

ZentaraResult Zentara_GetParam64Min(Zentara_Settings* settings, uint32_t key, uint64_t* value) {
    using Family = ZV::WideFamily;
    return ZV::AskTraced<Family>(__func__, {settings, key, value},
                                 ZV::AnswerBound<Family, ZV::Bound::Least>);
}

ZentaraResult Zentara_GetParam64Max(Zentara_Settings* settings, uint32_t key, uint64_t* value) {
    using Family = ZV::WideFamily;
    return ZV::AskTraced<Family>(__func__, {settings, key, value},
                                 ZV::AnswerBound<Family, ZV::Bound::Greatest>);
}

ZentaraResult Zentara_SetParam(Zentara_Settings* settings, uint32_t key, uint32_t value) {
    return ZV::SetTraced<ZV::WordFamily>(__func__, settings, key, value);
}

ZentaraResult Zentara_SetParamS32(Zentara_Settings* settings, uint32_t key, int32_t value) {
    return ZV::SetTraced<ZV::SignedFamily>(__func__, settings, key, value);
}

ZentaraResult Zentara_SetParam64(Zentara_Settings* settings, uint32_t key, uint64_t value) {
    return ZV::SetTraced<ZV::WideFamily>(__func__, settings, key, value);
}
