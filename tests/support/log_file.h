#pragma once

#include <cstddef>
#include <regex>
#include <string>
#include <vector>

#include "support/stored_settings.h"
#include "support/temporary_folder.h"

namespace ZV::Test {

/// The log of a library that is loaded while this object lives: a file, nested calls shown. To be a
/// base before the one that loads.
class LogFile {
  protected:
    /// `switches`: further lines of the configuration.
    explicit LogFile(const std::string& switches = {})
        : stored(
              "outputEnabled = 1\noutputToFile = 1\noutputSettings = 1\noutputNestedCalls = 1\n" +
              switches + "outputFilePath = " + folder.GetPath("log.txt") + "\n") {}

    /// Texts of the messages of `function` since the last call.
    std::vector<std::string> TakeMessages(const std::string& function) {
        const std::regex message(R"(\d\d:\d\d\.\d{3} )" + function + " - ([^\\n]*)");
        std::vector<std::string> texts;
        for (const std::string& record : TakeRecords()) {
            std::smatch match;
            if (std::regex_match(record, match, message)) texts.push_back(match[1]);
        }
        return texts;
    }
    /// The records without their times, and without the line ends and the blank line of outermost
    /// calls: the depth of nesting is the process's own, and some calls leave it too high.
    std::vector<std::string> TakeTexts() {
        std::vector<std::string> texts = TakeRecords();
        for (std::string& text : texts) {
            text = std::regex_replace(text, std::regex(R"(^\s*\d\d:\d\d\.\d{3} |\n+$)"), "");
        }
        return texts;
    }

  private:
    std::vector<std::string> TakeRecords() {
        const std::string content = folder.ReadFile("log.txt");
        std::vector<std::string> records;
        while (taken < content.size()) {
            const std::size_t end = content.find('\0', taken);
            records.push_back(content.substr(taken, end - taken));
            taken = end == std::string::npos ? content.size() : end + 1;
        }
        return records;
    }

    TemporaryFolder folder;
    std::size_t taken = 0;
    StoredSettings stored;
};

}  // namespace ZV::Test
