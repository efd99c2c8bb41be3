#include <string>
#include <vector>

#include "fuzz/input_file.h"
#include "tools/setting_values.h"
#include "tools/settings_file.h"

// Any file as the program's file of settings. A value that is taken over can be written as text.
namespace ZV::Fuzzing {
namespace {

void RunOnce(const std::uint8_t* data, std::size_t size) {
    static const InputFile file("settings.json");
    std::vector<std::string> problems;
    const std::vector<ZentaraProgram::SettingEdit> edits =
        ZentaraProgram::ReadSettingsFile(file.Write(data, size), &problems);
    if (!problems.empty()) return;
    for (const ZentaraProgram::SettingEdit& edit : edits) {
        Require(edit.setting != nullptr);
        Require(!ZentaraProgram::FormatValue(*edit.setting, edit.value).empty());
    }
}

}  // namespace
}  // namespace ZV::Fuzzing

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    ZV::Fuzzing::RunOnce(data, size);
    return 0;
}
