#include "windows/road/road.h"

#include <algorithm>
#include <chrono>
#include <nlohmann/json.hpp>
#include <sstream>

#include "support/wait_until.h"

namespace ZV::Test {
namespace {

constexpr char ScenarioFile[] = "scenario.json";
constexpr char TraceFile[] = "trace.jsonl";
constexpr auto ServiceLimit = std::chrono::seconds(60);

/// The driver serves all tests; it starts with the first and stops after the last.
class DriverEnvironment : public testing::Environment {
  public:
    void SetUp() override {
        driver = std::make_unique<TestDriver>();
        if (driver->IsRunning()) RemoveLeftDevices();
    }
    void TearDown() override { driver.reset(); }

    /// One test's loss of the driver is not the next one's.
    void Renew() {
        if (driver->IsRunning()) return;
        driver.reset();
        driver = std::make_unique<TestDriver>();
    }

    std::unique_ptr<TestDriver> driver;
};

DriverEnvironment& GetEnvironment() {
    static auto* const environment =
        static_cast<DriverEnvironment*>(testing::AddGlobalTestEnvironment(new DriverEnvironment));
    return *environment;
}

[[maybe_unused]] const DriverEnvironment& registered = GetEnvironment();

/// FNV-1a of 64 bits, as the trace has it.
std::uint64_t CalculateChecksum(const std::uint8_t* bytes, std::size_t count) {
    std::uint64_t sum = 0xCBF29CE484222325;
    for (std::size_t i = 0; i < count; ++i) sum = (sum ^ bytes[i]) * 0x100000001B3;
    return sum;
}

}  // namespace

Road::Road(std::vector<std::string_view> cameras) {
    WriteScenario(cameras);
    for (std::uint32_t i = 0; i < cameras.size(); ++i) {
        interfaces.push_back(std::make_unique<DeviceInterface>(i));
    }
}

Road::~Road() {
    for (std::uint32_t i = 0; i < interfaces.size(); ++i) GetDriver().Unplug(i);
}

void Road::SetUp() {
    GetEnvironment().Renew();
    ASSERT_TRUE(GetDriver().IsRunning());
    ASSERT_EQ(nullptr, std::getenv("ZENTARA_SIMULATION"));
    for (std::uint32_t i = 0; i < interfaces.size(); ++i) {
        ASSERT_FALSE(GetPath(i).empty());
        ASSERT_TRUE(GetDriver().Plug(i, GetPath(i)));
    }
    host =
        std::make_unique<ChildProcess>("camera-host.exe", '"' + folder.GetPath(ScenarioFile) + '"');
    ASSERT_EQ("ok", host->ReadLine());
    ASSERT_TRUE(WaitUntil([&] { return GetDriver().GetState().isServed != 0; }, ServiceLimit));
}

void Road::WriteScenario(const std::vector<std::string_view>& cameras) {
    nlohmann::json document{{"trace", TraceFile}, {"timeScale", 0}};
    document["cameras"] = nlohmann::json::array();
    for (const std::string_view camera : cameras) {
        document["cameras"].push_back(nlohmann::json::parse(camera));
    }
    folder.WriteFile(ScenarioFile, document.dump());
}

TestDriver& Road::GetDriver() {
    return *GetEnvironment().driver;
}

bool Road::AddFault(std::string fault, std::uint32_t camera) {
    // A command is one line.
    std::replace(fault.begin(), fault.end(), '\n', ' ');
    const std::string answer = host->Ask("fault " + std::to_string(camera) + ' ' + fault);
    EXPECT_EQ("ok", answer);
    return answer == "ok";
}

HostState Road::GetState(std::uint32_t camera) {
    std::istringstream words(host->Ask("state " + std::to_string(camera)));
    std::string outcome;
    HostState state;
    words >> outcome >> state.openHandles >> state.reservedResources >> state.pendedRequests >>
        state.attachedBuffers >> state.framesSent >> state.isStreaming;
    EXPECT_EQ("ok", outcome);
    return state;
}

std::uint32_t Road::Peek(std::uint32_t address, std::uint32_t camera) {
    std::istringstream words(
        host->Ask("peek " + std::to_string(camera) + ' ' + std::to_string(address)));
    std::string outcome;
    std::uint32_t value = 0;
    words >> outcome >> value;
    EXPECT_EQ("ok", outcome);
    return value;
}

bool Road::WasSent(const Zentara_Frame& frame) const {
    const auto* const pixels = static_cast<const std::uint8_t*>(frame.pBuffer);
    const std::uint64_t checksum = CalculateChecksum(pixels, frame.size);
    std::istringstream trace(folder.ReadFile(TraceFile));
    for (std::string line; std::getline(trace, line);) {
        const auto record = nlohmann::json::parse(line, nullptr, false);
        // The last line may be half written.
        if (!record.is_object() || record.value("type", "") != "frame") continue;
        if (record.value("rollingFrameNumber", 0u) != frame.frameNumber) continue;
        if (std::stoull(record.value("checksum", "0"), nullptr, 16) == checksum) return true;
    }
    return false;
}

}  // namespace ZV::Test
