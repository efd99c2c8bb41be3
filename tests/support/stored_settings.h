#pragma once

#include <memory>
#include <string>
#include <string_view>

namespace ZV::Test {

/// The settings store of this process for the life of the object; at first it is not there. One at
/// a time.
class StoredSettings {
  public:
    StoredSettings();
    explicit StoredSettings(std::string_view lines) : StoredSettings() { Write(lines); }
    ~StoredSettings();
    StoredSettings(const StoredSettings&) = delete;
    StoredSettings& operator=(const StoredSettings&) = delete;

    /// Makes it anew of lines `name = value`. A value that is a number is stored as a number.
    void Write(std::string_view lines) const;
    void Remove() const;

  private:
    struct Store;
    std::unique_ptr<Store> store;
};

}  // namespace ZV::Test
