#pragma once

#include <algorithm>
#include <string>
#include <string_view>
#include <vector>

#include "camera/camera.h"
#include "simulation/register_file.h"
#include "support/flat_camera.h"
#include "support/settings_words.h"

namespace ZV::Test {

/// Small, with all features of quadlet 169 and double shot.
inline constexpr std::string_view SmallRich =
    R"({"base": "model:SolvaneG1", "cameras": [{"sensor": {"width": 64, "height": 48},
        "configuration": {"169": "0x1F5E", "29": 1}}]})";
/// Sends blocks to a camera and looks at the register writes that each gives.
class SettingsSend : public OpenedCamera {
  protected:
    explicit SettingsSend(std::string_view scenario = SmallMono) : OpenedCamera(scenario) {}

    ZentaraResult Send(Zentara_Settings& block) {
        writesBefore = world.ReadRegisterWrites().size();
        return Zentara_SendSettingsToCam(handle, &block);
    }
    /// The register writes of the last send.
    std::vector<RegisterWrite> GetWrites() const {
        std::vector<RegisterWrite> writes = world.ReadRegisterWrites();
        return {writes.begin() + static_cast<std::ptrdiff_t>(writesBefore), writes.end()};
    }
    std::size_t CountWrites(std::uint32_t address) const {
        const std::vector<RegisterWrite> writes = GetWrites();
        return static_cast<std::size_t>(
            std::ranges::count(writes, address, [](const auto& write) { return write.address; }));
    }
    bool WasCommitted() const { return CountWrites(Simulation::CommandAddress + 4) != 0; }
    static std::uint32_t Control(std::uint32_t quadlet) {
        return Simulation::ControlAddress + 4 * quadlet;
    }
    std::uint32_t Peek(std::uint32_t quadlet) const { return world.Peek(Control(quadlet)); }
    bool RefuseWrites(std::uint32_t address, int count = 1) {
        return world.AddFault(
            R"({"kind": "failRequest", "code": "FW_IOCTL_ASYNC_WRITE", "address": )" +
            std::to_string(address) + R"(, "count": )" + std::to_string(count) + "}");
    }
    Zentara_Settings ReadDefaults() {
        Zentara_Settings block{};
        EXPECT_ZERR(zerrNone, Zentara_ReadDefaultSettings(handle, &block));
        return block;
    }
    ZCamera& GetCamera() { return *reinterpret_cast<ZCamera*>(handle); }

  private:
    std::size_t writesBefore = 0;
};

}  // namespace ZV::Test
