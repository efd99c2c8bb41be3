#include "api/settings_block.h"

#include <cstring>

namespace ZV {

namespace {

static_assert(sizeof(Zentara_Settings) == SettingsBytes);

template <typename Value>
Value Load(const Zentara_Settings& block, std::uint32_t offset) {
    Value value;
    std::memcpy(&value, reinterpret_cast<const std::uint8_t*>(&block) + offset, sizeof(value));
    return value;
}

template <typename Value>
void Store(Zentara_Settings& block, std::uint32_t offset, Value value) {
    std::memcpy(reinterpret_cast<std::uint8_t*>(&block) + offset, &value, sizeof(value));
}

}  // namespace

std::uint32_t GetSettingsWord(const Zentara_Settings& block, std::uint32_t key) {
    if (key >= SettingsWordCount) return 0;
    return Load<std::uint32_t>(block, SettingsWordsOffset + 4 * key);
}

void SetSettingsWord(Zentara_Settings& block, std::uint32_t key, std::uint32_t value) {
    if (key >= SettingsWordCount) return;
    Store(block, SettingsWordsOffset + 4 * key, value);
}

std::int32_t GetSettingsSigned(const Zentara_Settings& block, std::uint32_t key) {
    if (key >= SettingsSignedCount) return 0;
    return Load<std::int32_t>(block, SettingsSignedOffset + 4 * key);
}

void SetSettingsSigned(Zentara_Settings& block, std::uint32_t key, std::int32_t value) {
    if (key >= SettingsSignedCount) return;
    Store(block, SettingsSignedOffset + 4 * key, value);
}

std::uint64_t GetSettingsWide(const Zentara_Settings& block, std::uint32_t key) {
    if (key >= SettingsWideCount) return 0;
    return Load<std::uint64_t>(block, SettingsWideOffset + 8 * key);
}

void SetSettingsWide(Zentara_Settings& block, std::uint32_t key, std::uint64_t value) {
    if (key >= SettingsWideCount) return;
    Store(block, SettingsWideOffset + 8 * key, value);
}

ZentaraHandle GetSettingsHandle(const Zentara_Settings& block) {
    return Load<ZentaraHandle>(block, SettingsHandleOffset);
}

void SetSettingsHandle(Zentara_Settings& block, ZentaraHandle handle) {
    Store(block, SettingsHandleOffset, handle);
}

void SetSettingsSize(Zentara_Settings& block) {
    Store(block, SettingsSizeOffset, SettingsBytes);
}

bool HasSettingsMagic(const Zentara_Settings& block) {
    return Load<std::uint32_t>(block, SettingsMagicOffset) == SettingsMagic;
}

void SetSettingsMagic(Zentara_Settings& block) {
    Store(block, SettingsMagicOffset, SettingsMagic);
}

}  // namespace ZV
