#include "simulation/scenario_reader.h"

#include <gtest/gtest.h>

#include <string>

#include "support/temporary_folder.h"

namespace ZV::Test {
namespace {

/// The path of the trace of a scenario that stands in the current folder, a new one.
class TracePath : public ::testing::Test {
  protected:
    TracePath() { std::filesystem::current_path(folder.GetFolder()); }
    ~TracePath() override { std::filesystem::current_path(before); }

    std::string Load(const std::string& drive, const std::string& trace) {
        folder.WriteFile("scenario.json",
                         R"({"cameras": [{"model": "SolvaneA1"}], "trace": ")" + trace + "\"}");
        std::string message;
        EXPECT_TRUE(Simulation::LoadScenario(drive + "scenario.json", &scenario, &message))
            << message;
        return scenario.trace;
    }

    const std::filesystem::path before = std::filesystem::current_path();
    const TemporaryFolder folder;
    Simulation::Scenario scenario;
};

TEST_F(TracePath, KeepsTheDriveOfAScenarioThatIsNamedByItAlone) {
    const std::string drive = folder.GetFolder().root_name().string();
    ASSERT_EQ(2u, drive.size());

    EXPECT_EQ(drive + "trace.jsonl", Load(drive, "trace.jsonl"));
    EXPECT_EQ("trace.jsonl", Load("", "trace.jsonl"));
}

TEST_F(TracePath, WithARootOrADriveOfItsOwnIsTakenAsItStands) {
    const std::string folderPath = folder.GetFolder().string() + "\\";

    EXPECT_EQ("/traces/trace.jsonl", Load(folderPath, "/traces/trace.jsonl"));
    EXPECT_EQ("\\trace.jsonl", Load(folderPath, R"(\\trace.jsonl)"));
    EXPECT_EQ("D:trace.jsonl", Load(folderPath, "D:trace.jsonl"));
    EXPECT_EQ(folderPath + "traces/trace.jsonl", Load(folderPath, "traces/trace.jsonl"));
}

}  // namespace
}  // namespace ZV::Test
