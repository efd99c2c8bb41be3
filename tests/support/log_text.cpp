#include "support/log_text.h"

#include <filesystem>
#include <fstream>
#include <regex>

#include "support/text_file.h"

namespace ZV::Test {

std::string DescribeLog(std::string_view bytes) {
    std::string text;
    for (const char byte : bytes) {
        if (byte == '\0') {
            text += "|\n";
        } else if (byte == '\n') {
            text += "\\n";
        } else {
            text += byte;
        }
    }
    text = std::regex_replace(text, std::regex(R"((^|\n)-?\d+:-?\d+\.-?\d+ )"), "$1<time> ");
    return std::regex_replace(text, std::regex("pBuffer: [0-9a-f]+"), "pBuffer: <address>");
}

testing::AssertionResult MatchesGolden(std::string_view name, const std::string& text) {
    const auto golden = std::filesystem::path(ZENTARA_SOURCE_DIR) / "tests" / name;
    const auto written = std::filesystem::path(ZENTARA_BINARY_DIR) / "golden" / name;
    std::filesystem::create_directories(written.parent_path());
    std::ofstream(written, std::ios::binary) << text;
    if (ReadTextFile(golden) == text) return testing::AssertionSuccess();
    return testing::AssertionFailure() << "diff " << golden << " " << written << "\n" << text;
}

}  // namespace ZV::Test
