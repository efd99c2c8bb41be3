#include "diagnostics/key_names.h"

#include "api/information_table.h"
#include "api/parameter_table.h"

namespace ZV {

namespace {

template <typename Row>
const char* GetRowName(const Row* row, const char* unknown) {
    return row != nullptr && row->log.isNamed ? row->text.name : unknown;
}

}  // namespace

const char* GetKeyName32(std::uint32_t key) {
    return GetRowName(FindWordParameter(key), "InternalParam32KeyAsString() - Unknown parameter");
}

const char* GetKeyNameS32(std::uint32_t key) {
    return GetRowName(FindSignedParameter(key),
                      "InternalParamS32KeyAsString() - Unknown parameter");
}

const char* GetKeyName64(std::uint32_t key) {
    return GetRowName(FindWideParameter(key), "InternalParam64KeyAsString() - Unknown parameter");
}

const char* GetInformationKeyName(std::uint32_t key) {
    const InformationRow* const row = FindInformationRow(key);
    return row != nullptr && row->name != nullptr
               ? row->name
               : "InternalGetInfoKeyAsString() - Unknown parameter";
}

}  // namespace ZV
