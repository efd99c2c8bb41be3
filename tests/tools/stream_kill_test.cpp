#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <chrono>
#include <filesystem>
#include <optional>
#include <random>
#include <set>
#include <string>

#include "support/wait_until.h"
#include "tools/image_readers.h"
#include "tools/program.h"
#include "tools/text_pattern.h"
#include "tools/traced_scenario.h"

// A stream that is killed leaves whole images alone under the names of images.
namespace ZentaraTest {
namespace {

constexpr std::uint32_t Seed = 20;
constexpr int KillsLeast = 8;
constexpr auto CutLimit = std::chrono::seconds(180);
// So large that most of the time goes into the writing of files.
constexpr std::uint32_t Width = 1392;
constexpr const char* Camera = R"({"sensor": {"width": 1392, "height": 1040},
                                   "scene": {"kind": "flat"}})";

class KilledStream : public testing::TestWithParam<const char*> {};

std::vector<std::string> ListImages(const TemporaryFolder& folder) {
    std::vector<std::string> images;
    for (const std::string& name : folder.ListFiles()) {
        if (name.starts_with("night-")) images.push_back(name);
    }
    return images;
}

std::set<std::uintmax_t> MeasureImages(const TemporaryFolder& folder) {
    std::set<std::uintmax_t> sizes;
    for (const std::string& name : ListImages(folder)) {
        sizes.insert(std::filesystem::file_size(folder.GetFolder() / name));
    }
    return sizes;
}

/// The bytes of a file that was begun and has not got its name; nothing when there is none.
std::optional<std::uintmax_t> MeasureBegunFile(const TemporaryFolder& folder) {
    std::error_code error;  // Files come and go.
    std::filesystem::recursive_directory_iterator entry(folder.GetFolder(), error);
    for (; entry != std::filesystem::recursive_directory_iterator(); entry.increment(error)) {
        if (entry->path().parent_path() == folder.GetFolder()) continue;
        const std::uintmax_t size = entry->file_size(error);
        if (!error) return size;
    }
    return std::nullopt;
}

/// Waits, without a rest, until some bytes of a file are written.
void WaitForBegunFile(const TemporaryFolder& folder) {
    const auto end = std::chrono::steady_clock::now() + std::chrono::seconds(2);
    while (MeasureBegunFile(folder).value_or(0) == 0 && std::chrono::steady_clock::now() < end) {
    }
}

void CheckImages(const TemporaryFolder& folder, const std::string& kind) {
    for (const std::string& name : ListImages(folder)) {
        EXPECT_THAT(name, MatchesPattern("night-[0-9]{6}[.][a-z]+"));
        if (kind == ".raw") continue;
        ZentaraProgram::Image image;
        EXPECT_EQ("", ZentaraProgram::ReadImage(folder.GetPath(name), &image)) << name;
        EXPECT_EQ(Width, image.width);
    }
    // Packed, the pixels decide the size.
    if (kind != ".png") {
        EXPECT_EQ(1U, MeasureImages(folder).size()) << "of all files";
    }
}

// However a machine spreads the kills, it goes on until one has cut the writing of a file short.
TEST_P(KilledStream, LeavesNoHalfImageUnderItsName) {
    SCOPED_TRACE("seed " + std::to_string(Seed));
    std::mt19937 random(Seed);
    const TracedScenario scenario(Camera);
    int kills = 0;
    bool hasCut = false;
    const auto killOnce = [&] {
        const TemporaryFolder folder;
        const std::size_t files = 1 + random() % 6;
        RunningProgram program({"stream", "0", "--simulation", scenario.GetName(), "--duration",
                                "600", "-o", folder.GetPath(std::string("night") + GetParam())});
        ASSERT_TRUE(ZV::Test::WaitUntil([&] { return ListImages(folder).size() >= files; },
                                        std::chrono::seconds(60)));
        // A spread of moments, whichever they are, and the midst of a file in turns.
        ZV::Test::Disturb(std::chrono::microseconds(random() % 3000));
        if (kills % 2 == 1) WaitForBegunFile(folder);
        program.Kill();
        EXPECT_EQ(-1, program.Wait().exitCode);
        CheckImages(folder, GetParam());
        const std::uintmax_t begun = MeasureBegunFile(folder).value_or(0);
        hasCut = hasCut || (begun > 0 && begun < *MeasureImages(folder).begin());
        ++kills;
    };
    EXPECT_TRUE(ZV::Test::WaitUntil(
        [&] {
            killOnce();
            return HasFailure() || (kills >= KillsLeast && hasCut);
        },
        CutLimit));
    RecordProperty("kills", kills);
}

INSTANTIATE_TEST_SUITE_P(Kinds, KilledStream, testing::Values(".fits", ".tiff", ".png", ".raw"),
                         [](const auto& kind) { return std::string(kind.param).substr(1); });

}  // namespace
}  // namespace ZentaraTest
