#include "system/settings_history.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <cstdlib>
#include <sstream>

#include "support/expect_zerr.h"
#include "support/reference_renderer.h"
#include "support/settings_words.h"

namespace ZV::Test {
namespace {

constexpr std::uint64_t Millisecond = 1000000;
constexpr std::uint32_t BinnedBy = 2;

ReferenceCamera GetReference(const StreamedCamera& camera) {
    ReferenceCamera reference;
    reference.width = StreamedCamera::Width;
    reference.height = StreamedCamera::Height;
    reference.hasMosaic = camera.hasMosaic;
    reference.binsWithinMosaic = camera.hasMosaic;
    reference.darkCurrentAt20 = 0;
    reference.scene = "ramp";
    reference.brightness = 1.5e6;
    reference.light = {0.8, 1, 0.6};
    return reference;
}

void Place(Zentara_Settings& block, std::uint32_t x, std::uint32_t y, std::uint32_t width,
           std::uint32_t height) {
    SetWord(block, zprmRoiX, x);
    SetWord(block, zprmRoiY, y);
    SetWord(block, zprmRoiWidth, width);
    SetWord(block, zprmRoiHeight, height);
}

}  // namespace

std::string StreamedCamera::GetScenario() const {
    return R"({"base": ")" + std::string(scenario) + R"(", "cameras": [{"sensor": {"width": )" +
           std::to_string(Width) + R"(, "height": )" + std::to_string(Height) +
           R"(, "darkCurrent": 0, "noise": false, "fullWell": 22000}, "scene": {"kind": "ramp",
           "brightness": 1.5e6, "light": [0.8, 1, 0.6]}}]})";
}

SettingsHistory::SettingsHistory(CameraSession& historySession, const StreamedCamera& historyCamera)
    : session(historySession), camera(historyCamera) {}

void SettingsHistory::AddSet(const Zentara_Settings& block) {
    Zentara_Settings sent = block;
    ASSERT_ZERR(zerrNone, Zentara_SendSettingsToCam(session.GetHandle(), &sent));
    const DeliveredFrame delivered = session.Grab();
    ASSERT_ZERR(zerrNone, delivered.result);
    ASSERT_ZERR(zerrNone, delivered.frame.errorCode);
    CompareWithRenderer(sent, delivered);
    const WholeSet added{block, delivered.frame.width, delivered.frame.height, delivered.frame.bits,
                         CalculateChecksum(delivered.pixels.data(), delivered.pixels.size())};
    for (const WholeSet& former : sets) {
        EXPECT_NE(former.checksum, added.checksum) << "two sets cannot be told apart";
    }
    sets.push_back(added);
}

void SettingsHistory::CompareWithRenderer(const Zentara_Settings& sent,
                                          const DeliveredFrame& delivered) {
    ZCamera& opened = session.GetCamera();
    ReferenceExposure exposure;
    exposure.x = GetWord(sent, zprmRoiX);
    exposure.y = GetWord(sent, zprmRoiY);
    exposure.width = GetWord(sent, zprmRoiWidth);
    exposure.height = GetWord(sent, zprmRoiHeight);
    exposure.binningY = GetWord(sent, camera.hasMosaic ? zprmVerticalBinning : zprmBinning);
    exposure.binningX = camera.hasMosaic ? 1 : exposure.binningY;
    exposure.bitDepth = opened.GetBitDepth();
    exposure.seconds = static_cast<double>(opened.GetExposure()) / 1e9;
    exposure.gainDb = opened.GetNormalizedGaindB() / 1e6;
    exposure.offset = opened.GetOffset();
    // A gain is read back with three digits.
    const double tolerance = exposure.gainDb == 0 ? 0 : 0.01;

    const auto expected = ReferenceRenderer(GetReference(camera)).Render(exposure);
    const auto samples = delivered.GetSamples();
    ASSERT_EQ(expected.size(), samples.size());
    for (std::size_t i = 0; i < samples.size(); ++i) {
        ASSERT_NEAR(expected[i], samples[i], std::ceil(tolerance * expected[i]))
            << "sample " << i % exposure.width << ", " << i / exposure.width;
    }
}

void SettingsHistory::BeginWith(std::size_t index) {
    Zentara_Settings block = sets[index].block;
    EXPECT_ZERR(zerrNone, Zentara_SendSettingsToCam(session.GetHandle(), &block));
    changes.clear();
    changes.push_back({index, CountExposed(), CountExposed()});
}

void SettingsHistory::Send(std::size_t index) {
    Zentara_Settings block = sets[index].block;
    const std::uint64_t before = CountExposed();
    EXPECT_ZERR(zerrNone, Zentara_SendSettingsToCam(session.GetHandle(), &block)) << index;
    Note(index, before, CountExposed());
}

void SettingsHistory::Note(std::size_t index, std::uint64_t framesBefore,
                           std::uint64_t framesAfter) {
    changes.push_back({index, framesBefore, framesAfter});
}

bool SettingsHistory::MayBe(const FlownFrame& frame, std::size_t change) const {
    if (frame.number <= changes[change].before) return false;
    return change + 1 == changes.size() || frame.number <= changes[change + 1].after;
}

bool SettingsHistory::IsOf(const FlownFrame& frame, std::size_t set) const {
    const WholeSet& whole = sets[set];
    return frame.width == whole.width && frame.height == whole.height && frame.bits == whole.bits &&
           frame.checksum == whole.checksum;
}

std::string SettingsHistory::Describe(const FlownFrame& frame) const {
    std::ostringstream text;
    text << "frame " << frame.number << " (queued as " << frame.userData << "), " << frame.width
         << " x " << frame.height << ", " << frame.bits << " bits, error " << frame.errorCode;
    for (std::size_t set = 0; set < sets.size(); ++set) {
        if (IsOf(frame, set)) text << ", is of set " << set;
    }
    for (std::size_t change = 0; change < changes.size(); ++change) {
        if (MayBe(frame, change)) {
            text << ", may be of set " << changes[change].set << " (" << changes[change].before
                 << " to " << changes[change].after << ")";
        }
    }
    return text.str();
}

void SettingsHistory::ExpectWholeSets(const std::vector<FlownFrame>& frames) const {
    std::uint64_t former = 0;
    for (const FlownFrame& frame : frames) {
        EXPECT_LT(former, frame.number) << "a frame came twice, or late";
        former = frame.number;
        bool isWhole = false;
        for (std::size_t change = 0; change < changes.size() && !isWhole; ++change) {
            isWhole = MayBe(frame, change) && IsOf(frame, changes[change].set);
        }
        ASSERT_TRUE(isWhole && frame.errorCode == zerrNone) << Describe(frame);
    }
}

std::size_t SettingsHistory::CountOfLatest(const std::vector<FlownFrame>& frames) const {
    return static_cast<std::size_t>(
        std::count_if(frames.begin(), frames.end(),
                      [&](const FlownFrame& frame) { return IsOf(frame, changes.back().set); }));
}

std::vector<Zentara_Settings> MakeDifferentSettings(const Zentara_Settings& base,
                                                    const StreamedCamera& camera) {
    std::vector<Zentara_Settings> blocks = MakeCompatibleSettings(base);
    const auto add = [&](std::uint64_t exposureNs) -> Zentara_Settings& {
        blocks.push_back(base);
        SetWide(blocks.back(), zprm64Exposure, exposureNs);
        return blocks.back();
    };
    Place(add(4 * Millisecond), 8, 16, 96, 64);
    Place(add(4 * Millisecond), 40, 32, 96, 64);  // the same size elsewhere
    Place(add(6 * Millisecond), 0, 0, 160, 72);
    Zentara_Settings& binned = add(2 * Millisecond);
    SetWord(binned, camera.hasMosaic ? zprmVerticalBinning : zprmBinning, BinnedBy);
    Zentara_Settings& deep = add(3 * Millisecond);
    SetWord(deep, zprmImageFormat, camera.hasMosaic ? zfmtBayer16 : zfmtMono16);
    // As many bytes as the block above at half the depth.
    Place(deep, 16, 8, 96, 32);
    return blocks;
}

std::vector<Zentara_Settings> MakeCompatibleSettings(const Zentara_Settings& base) {
    std::vector<Zentara_Settings> blocks(4, base);
    SetWide(blocks[0], zprm64Exposure, 2 * Millisecond);
    SetWide(blocks[1], zprm64Exposure, 5 * Millisecond);
    SetSigned(blocks[2], zprmS32NormalizedGaindB, 3000000);
    SetWide(blocks[2], zprm64Exposure, 3 * Millisecond);
    SetWide(blocks[3], zprm64Exposure, 7 * Millisecond);
    SetSigned(blocks[3], zprmS32AbsoluteOffset, 40);
    return blocks;
}

}  // namespace ZV::Test
