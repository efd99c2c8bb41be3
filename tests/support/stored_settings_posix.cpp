#include <filesystem>

#include "support/scoped_variable.h"
#include "support/stored_settings.h"
#include "support/temporary_folder.h"

namespace ZV::Test {

struct StoredSettings::Store {
    TemporaryFolder folder;
    ScopedVariable variable{"ZENTARA_CONFIG", folder.GetPath("zentara.conf").c_str()};
};

StoredSettings::StoredSettings() : store(std::make_unique<Store>()) {}

StoredSettings::~StoredSettings() = default;

void StoredSettings::Write(std::string_view lines) const {
    store->folder.WriteFile("zentara.conf", lines);
}

void StoredSettings::Remove() const {
    std::error_code ignored;
    std::filesystem::remove(store->folder.GetPath("zentara.conf"), ignored);
}

}  // namespace ZV::Test
