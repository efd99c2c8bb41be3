#include "support/peeked_camera.h"

#include <algorithm>
#include <cstdio>
#include <utility>

namespace ZV::Test {
namespace {

constexpr std::uint32_t DirectoryAddress = 0xD0000000;
constexpr std::uint32_t BlockQuadlets = 256;

// Quadlets of the directory.
constexpr std::uint32_t DirectoryConfiguration = 2;
constexpr std::uint32_t DirectoryControl = 4;
constexpr std::uint32_t DirectoryCommand = 6;
constexpr std::uint32_t DirectoryStatus = 8;
constexpr std::uint32_t DirectoryStream = 10;

std::string FormatHex(std::uint32_t value) {
    char text[16];
    std::snprintf(text, sizeof text, "0x%08X", static_cast<unsigned>(value));
    return text;
}

}  // namespace

PeekedCamera::PeekedCamera(const SimulationWorld& peekedWorld, std::string_view modelName,
                           std::uint32_t cameraPosition)
    : world(peekedWorld), className(modelName), position(cameraPosition) {}

std::uint32_t PeekedCamera::FindBlock(std::uint32_t directoryQuadlet) const {
    return Peek(DirectoryAddress + 4 * directoryQuadlet);
}

std::vector<std::uint32_t> PeekedCamera::ReadConfiguration() const {
    std::vector<std::uint32_t> quadlets;
    const std::uint32_t address = FindBlock(DirectoryConfiguration);
    for (std::uint32_t i = 0; i < BlockQuadlets; ++i) quadlets.push_back(Peek(address + 4 * i));
    return quadlets;
}

CameraContents PeekedCamera::ReadContents() const {
    CameraContents contents;
    contents.className = className;
    contents.position = position;
    contents.configurationVersion = Peek(FindBlock(DirectoryConfiguration));
    contents.controlVersion = Peek(FindBlock(DirectoryControl));
    contents.configuration = ReadConfiguration();
    return contents;
}

std::uint32_t PeekedCamera::GetAddress(const ExpectedWrite& write) const {
    const bool isControl = write.block == SetupBlock::Control;
    return FindBlock(isControl ? DirectoryControl : DirectoryCommand) + 4 * write.quadlet;
}

std::string PeekedCamera::DescribeAddress(std::uint32_t address) const {
    constexpr std::pair<const char*, std::uint32_t> Blocks[] = {
        {"configuration", DirectoryConfiguration},
        {"control", DirectoryControl},
        {"command", DirectoryCommand},
        {"status", DirectoryStatus},
        {"stream", DirectoryStream}};
    for (const auto& [name, quadlet] : Blocks) {
        const std::uint32_t start = FindBlock(quadlet);
        if (address < start || address >= start + 4 * BlockQuadlets) continue;
        return std::string(name) + "[" + std::to_string((address - start) / 4) + "]";
    }
    return FormatHex(address);
}

std::string PeekedCamera::DescribeWrite(const RegisterWrite& write) const {
    std::string text = DescribeAddress(write.address) + " =";
    for (const std::uint32_t value : write.values) text += " " + FormatHex(value);
    return write.error == 0 ? text : text + ", error " + std::to_string(write.error);
}

std::string PeekedCamera::DescribeExpected(const ExpectedWrite& write) const {
    return write.step + ": " + DescribeAddress(GetAddress(write)) + " = " + FormatHex(write.value);
}

testing::AssertionResult PeekedCamera::HasWritten(const std::vector<ExpectedWrite>& expected,
                                                  std::size_t from) const {
    std::vector<RegisterWrite> got = ReadWrites();
    got.erase(got.begin(), got.begin() + static_cast<std::ptrdiff_t>(std::min(from, got.size())));
    for (std::size_t i = 0; i < std::max(expected.size(), got.size()); ++i) {
        const bool isBoth = i < expected.size() && i < got.size();
        if (isBoth && got[i] == RegisterWrite{GetAddress(expected[i]), {expected[i].value}, 0}) {
            continue;
        }
        return testing::AssertionFailure()
               << "write " << i << " of " << got.size() << " (expected " << expected.size()
               << ")\n  expected "
               << (i < expected.size() ? DescribeExpected(expected[i]) : "nothing")
               << "\n  got      " << (i < got.size() ? DescribeWrite(got[i]) : "nothing");
    }
    return testing::AssertionSuccess() << expected.size() << " writes";
}

}  // namespace ZV::Test
