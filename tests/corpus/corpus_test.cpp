#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <string>
#include <vector>

#define DECLARE_TARGET(name) \
    extern "C" int Replay_##name##_fuzz(const std::uint8_t* data, std::size_t size)
DECLARE_TARGET(frame_record);
DECLARE_TARGET(image_file);
DECLARE_TARGET(register_files);
DECLARE_TARGET(scenario_file);
DECLARE_TARGET(settings_block);
DECLARE_TARGET(settings_file);
DECLARE_TARGET(stream_assembler);
#undef DECLARE_TARGET

// The inputs that the fuzz targets begin with, those among them that have found something once.
// Each target runs in a process of its own: what it opens stays open from one input to the next.
namespace ZV::Test {
namespace {

using std::filesystem::path;

struct Target {
    const char* name;
    int (*run)(const std::uint8_t* data, std::size_t size);
};
constexpr Target Targets[] = {
    {"frame_record", Replay_frame_record_fuzz},        {"image_file", Replay_image_file_fuzz},
    {"register_files", Replay_register_files_fuzz},    {"scenario_file", Replay_scenario_file_fuzz},
    {"settings_block", Replay_settings_block_fuzz},    {"settings_file", Replay_settings_file_fuzz},
    {"stream_assembler", Replay_stream_assembler_fuzz}};

const path CorpusFolder = path(ZENTARA_SOURCE_DIR) / "fuzz/corpus";

std::vector<path> ListInputs(const char* target) {
    std::vector<path> inputs;
    for (const auto& entry : std::filesystem::directory_iterator(CorpusFolder / target)) {
        inputs.push_back(entry.path());
    }
    std::sort(inputs.begin(), inputs.end());
    return inputs;
}

[[noreturn]] void Replay(const Target& target) {
    for (const path& input : ListInputs(target.name)) {
        std::ifstream file(input, std::ios::binary);
        const std::vector<char> bytes{std::istreambuf_iterator<char>(file), {}};
        // A target's own end tells nothing of the input.
        std::fprintf(stderr, "%s\n", input.filename().c_str());
        (void)target.run(reinterpret_cast<const std::uint8_t*>(bytes.data()), bytes.size());
    }
    std::exit(0);
}

class Corpus : public testing::TestWithParam<Target> {};

TEST_P(Corpus, IsReplayedWithoutAFind) {
    ASSERT_FALSE(ListInputs(GetParam().name).empty());
    GTEST_FLAG_SET(death_test_style, "threadsafe");
    EXPECT_EXIT(Replay(GetParam()), testing::ExitedWithCode(0), "");
}

INSTANTIATE_TEST_SUITE_P(Targets, Corpus, testing::ValuesIn(Targets),
                         [](const auto& info) { return std::string(info.param.name); });

TEST(Corpora, BelongToATargetEach) {
    std::vector<std::string> folders, names;
    for (const auto& entry : std::filesystem::directory_iterator(CorpusFolder)) {
        folders.push_back(entry.path().filename().string());
    }
    std::sort(folders.begin(), folders.end());
    for (const Target& target : Targets) names.emplace_back(target.name);
    EXPECT_EQ(names, folders);
}

}  // namespace
}  // namespace ZV::Test
