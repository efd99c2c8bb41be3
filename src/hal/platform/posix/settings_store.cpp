#include "hal/platform/settings_store.h"

#include <fcntl.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <charconv>
#include <cstring>
#include <memory>
#include <new>
#include <string_view>

#include "hal/platform/environment.h"
#include "hal/platform/last_error.h"
#include "hal/platform/posix/regular_file.h"
#include "hal/platform/posix/system_error.h"

namespace ZV {
namespace {

constexpr char DefaultPath[] = "/etc/zentara.conf";
constexpr std::size_t FileBytesMax = 64 * 1024;
constexpr std::string_view Blanks = " \t\r\v\f";

std::string_view Trim(std::string_view text) {
    const std::size_t first = text.find_first_not_of(Blanks);
    if (first == std::string_view::npos) return {};
    return text.substr(first, text.find_last_not_of(Blanks) - first + 1);
}

const char* GetStorePath() {
    const char* path = GetLibraryVariable("ZENTARA_CONFIG");
    return path != nullptr && path[0] != '\0' ? path : DefaultPath;
}

std::size_t ReadWhole(int file, char* content, std::size_t capacity) {
    std::size_t length = 0;
    while (length < capacity) {
        const ssize_t count = read(file, content + length, capacity - length);
        if (count < 0 && errno == EINTR) continue;
        if (count <= 0) break;
        length += static_cast<std::size_t>(count);
    }
    return length;
}

}  // namespace

struct SettingsStore {
    std::size_t length = 0;
    char content[FileBytesMax];
};

namespace {

/// Value of the last line that names `name`. False when there is none.
bool FindValue(const SettingsStore& store, std::string_view name, std::string_view* value) {
    std::string_view rest(store.content, store.length);
    bool isFound = false;
    while (!rest.empty()) {
        const std::string_view line = Trim(rest.substr(0, rest.find('\n')));
        rest.remove_prefix(std::min(rest.size(), rest.find('\n')));
        if (!rest.empty()) rest.remove_prefix(1);
        const std::size_t equals = line.find('=');
        if (line.empty() || line.front() == '#' || equals == std::string_view::npos) continue;
        if (Trim(line.substr(0, equals)) != name) continue;
        *value = Trim(line.substr(equals + 1));
        isFound = true;
    }
    return isFound;
}

bool ParseNumber(std::string_view text, std::uint32_t* number) {
    const bool isHexadecimal = text.starts_with("0x") || text.starts_with("0X");
    if (isHexadecimal) text.remove_prefix(2);
    std::uint32_t parsed = 0;
    const char* end = text.data() + text.size();
    const auto result = std::from_chars(text.data(), end, parsed, isHexadecimal ? 16 : 10);
    if (result.ec != std::errc{} || result.ptr != end) return false;
    *number = parsed;
    return true;
}

}  // namespace

SettingsStore* OpenSettingsStore() {
    const int file = OpenRegularFile(GetStorePath(), O_RDONLY);
    if (file < 0) {
        SetLastPlatformErrorFromErrno(errno);
        return nullptr;
    }
    auto* store = new (std::nothrow) SettingsStore;
    if (store == nullptr) {
        SetLastPlatformError(PlatformErrorNotEnoughMemory);
    } else {
        store->length = ReadWhole(file, store->content, sizeof store->content);
    }
    close(file);
    return store;
}

bool ReadStoredNumber(SettingsStore* store, const char* name, std::uint32_t* value) {
    std::string_view text;
    if (store == nullptr || !FindValue(*store, name, &text)) return false;
    return ParseNumber(text, value);
}

bool ReadStoredText(SettingsStore* store, const char* name, char* text, std::size_t capacity) {
    std::string_view value;
    if (store == nullptr || capacity == 0 || !FindValue(*store, name, &value)) return false;
    const std::size_t length = std::min(value.size(), capacity - 1);
    std::memcpy(text, value.data(), length);
    text[length] = '\0';
    return true;
}

void CloseSettingsStore(SettingsStore* store) {
    delete store;
}

}  // namespace ZV
