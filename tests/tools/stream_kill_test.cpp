#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <chrono>
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
constexpr int Kills = 8;
constexpr const char* Camera = R"({"sensor": {"width": 320, "height": 240},
                                   "scene": {"kind": "flat"}})";

class KilledStream : public testing::TestWithParam<const char*> {};

std::vector<std::string> ListImages(const TemporaryFolder& folder) {
    std::vector<std::string> images;
    for (const std::string& name : folder.ListFiles()) {
        if (name.starts_with("night-")) images.push_back(name);
    }
    return images;
}

TEST_P(KilledStream, LeavesNoHalfImageUnderItsName) {
    SCOPED_TRACE("seed " + std::to_string(Seed));
    std::mt19937 random(Seed);
    const TracedScenario scenario(Camera);
    for (int kill = 0; kill < Kills; ++kill) {
        const TemporaryFolder folder;
        const std::size_t files = 1 + random() % 6;
        RunningProgram program({"stream", "0", "--simulation", scenario.GetName(), "--duration",
                                "600", "-o", folder.GetPath(std::string("night") + GetParam())});
        ASSERT_TRUE(ZV::Test::WaitUntil([&] { return ListImages(folder).size() >= files; },
                                        std::chrono::seconds(60)));
        // Somewhere in the writing of the next files: a spread of moments, whichever they are.
        ZV::Test::Disturb(std::chrono::microseconds(random() % 3000));
        program.Kill();
        EXPECT_EQ(-1, program.Wait().exitCode);

        std::set<std::uintmax_t> sizes;
        for (const std::string& name : ListImages(folder)) {
            sizes.insert(std::filesystem::file_size(folder.GetFolder() / name));
            EXPECT_THAT(name, MatchesPattern("night-[0-9]{6}[.][a-z]+"));
            if (GetParam() == std::string(".raw")) continue;
            ZentaraProgram::Image image;
            EXPECT_EQ("", ZentaraProgram::ReadImage(folder.GetPath(name), &image)) << name;
            EXPECT_EQ(320U, image.width);
        }
        // Packed, the pixels decide the size.
        if (GetParam() != std::string(".png")) {
            EXPECT_EQ(1U, sizes.size()) << "of all files";
        }
    }
}

INSTANTIATE_TEST_SUITE_P(Kinds, KilledStream, testing::Values(".fits", ".tiff", ".png", ".raw"),
                         [](const auto& kind) { return std::string(kind.param).substr(1); });

}  // namespace
}  // namespace ZentaraTest
