#pragma once

#include <cstddef>
#include <cstdint>

namespace ZV {

/// The system-wide store of the library's switches, opened for query: the key
/// "SOFTWARE\\Morvane\\Zentara" of the local machine, or the file of `name = value` lines
/// "/etc/zentara.conf" or that which `ZENTARA_CONFIG` names.
struct SettingsStore;

/// Null when there is no store.
SettingsStore* OpenSettingsStore();

/// A number of 32 bits, decimal or 0x-prefixed in a file. False, `value` untouched, when it is not
/// there.
bool ReadStoredNumber(SettingsStore* store, const char* name, std::uint32_t* value);

/// A text, cut to `capacity` - 1 bytes and always terminated. False, `text` untouched, when it is
/// not there.
bool ReadStoredText(SettingsStore* store, const char* name, char* text, std::size_t capacity);

/// Null is ignored.
void CloseSettingsStore(SettingsStore* store);

}  // namespace ZV
