#include "api/parameter_documents.h"

#include <gtest/gtest.h>

#include <fstream>
#include <sstream>

namespace ZV::Test {
namespace {

std::string ReadSource(const std::string& path) {
    std::ifstream file(ZENTARA_SOURCE_DIR "/" + path);
    std::ostringstream text;
    text << file.rdbuf();
    return text.str();
}

constexpr const char* Advice = "scripts/generate-parameters writes it anew";

TEST(ParameterDocuments, TheDocumentIsWhatTheTablesSay) {
    EXPECT_EQ(MakeParameterDocument(), ReadSource("docs/parameters.md")) << Advice;
}

TEST(ParameterDocuments, TheProgramsNamesAreWhatTheTablesSay) {
    EXPECT_EQ(MakeParameterNames(), ReadSource("tools/parameter_names.inc")) << Advice;
}

}  // namespace
}  // namespace ZV::Test
