#include "support/sending_camera.h"

#include <algorithm>
#include <string>

namespace ZV::Test {
namespace {

std::string DescribeWord(std::size_t index) {
    if (index < 47) return "word " + std::to_string(index);
    if (index < 50) return "signed word " + std::to_string(index - 47);
    if (index < 58) return "wide word " + std::to_string((index - 50) / 2);
    return "private word " + std::to_string(index);
}

}  // namespace

testing::AssertionResult AreSameBlocks(const Zentara_Settings& expected,
                                       const Zentara_Settings& got) {
    if (expected.size != got.size) return testing::AssertionFailure() << "size " << got.size;
    for (std::size_t i = 0; i < 64; ++i) {
        if (expected.privateWords[i] == got.privateWords[i]) continue;
        return testing::AssertionFailure() << DescribeWord(i) << " is " << got.privateWords[i]
                                           << ", expected " << expected.privateWords[i];
    }
    return testing::AssertionSuccess();
}

SendingCamera::SendingCamera(std::string_view scenario, std::string_view className)
    : world(scenario), registers(world, className) {
    EXPECT_ZERR(zerrNone, Zentara_LoadDriver());
    EXPECT_TRUE(world.Start());
    contents = registers.ReadContents();
    Zentara_CamListItem items[16];
    std::uint32_t length = 16;
    EXPECT_ZERR(zerrNone, Zentara_ListCameras(items, &length));
    contents.configurationAfterTakeOver = registers.ReadConfiguration();
    shadow = CalculateFirstSetup(contents).shadow;
    contents.configuration = contents.configurationAfterTakeOver;
    EXPECT_ZERR(zerrNone, Zentara_OpenCamera(0, &handle));
}

SendingCamera::~SendingCamera() {
    if (IsOpen()) {
        EXPECT_ZERR(zerrNone, Zentara_CloseCamera(handle));
    }
    Zentara_ReleaseDriver();
}

Zentara_Settings SendingCamera::Read() {
    Zentara_Settings block{};
    EXPECT_ZERR(zerrNone, Zentara_ReadSettingsFromCam(handle, &block));
    last = block;
    return block;
}

Zentara_Settings SendingCamera::ReadDefaults() const {
    Zentara_Settings block{};
    EXPECT_ZERR(zerrNone, Zentara_ReadDefaultSettings(handle, &block));
    return block;
}

testing::AssertionResult SendingCamera::Send(Zentara_Settings& block) {
    const ExpectedSend expected = CalculateSend(contents, shadow, block, last);
    writesBefore = registers.ReadWrites().size();
    result = Zentara_SendSettingsToCam(handle, &block);
    if (result == zerrNone) last = block;
    return Compare(block, expected);
}

testing::AssertionResult SendingCamera::Preflight(Zentara_Settings& block) {
    const ExpectedSend expected = CalculatePreflight(contents, shadow, block);
    writesBefore = registers.ReadWrites().size();
    result = Zentara_PreflightSettings(handle, &block);
    return Compare(block, expected);
}

testing::AssertionResult SendingCamera::Compare(const Zentara_Settings& block,
                                                const ExpectedSend& expected) {
    shadow = expected.shadow;
    if (result != expected.result) {
        return testing::AssertionFailure()
               << "result " << result << ", expected " << expected.result;
    }
    const testing::AssertionResult areSame = AreSameBlocks(expected.block, block);
    return areSame ? registers.HasWritten(expected.writes, writesBefore) : areSame;
}

std::vector<RegisterWrite> SendingCamera::GetWrites() const {
    std::vector<RegisterWrite> writes = registers.ReadWrites();
    writes.erase(writes.begin(), writes.begin() + static_cast<std::ptrdiff_t>(writesBefore));
    return writes;
}

bool SendingCamera::WasCommitted() const {
    const std::uint32_t takeOver = registers.GetAddress({"", SetupBlock::Command, 1, 1});
    const std::vector<RegisterWrite> writes = GetWrites();
    return std::ranges::any_of(
        writes, [&](const RegisterWrite& write) { return write.address == takeOver; });
}

}  // namespace ZV::Test
