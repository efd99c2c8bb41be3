#include "fuzz/hostile_cameras.h"

#include <array>
#include <string_view>

#include "fuzz/fuzz_input.h"
#include "fuzz/hostile_driver.h"
#include "hal/platform/clock.h"

namespace ZV::Fuzzing {
namespace {

using Simulation::CameraScenario;
using Simulation::Scenario;

/// The first ten differ most from each other.
constexpr std::array<std::string_view, HostileCameraKinds> Kinds{"mono",
                                                                 "folary",
                                                                 "metrona",
                                                                 "intensified",
                                                                 "model:PellanB1",
                                                                 "rotated",
                                                                 "model:TirelM1",
                                                                 "old",
                                                                 "model:PellanA1",
                                                                 "model:SolvaneG1",
                                                                 "model:SolvaneA2",
                                                                 "model:DorixB1",
                                                                 "model:DorixR1",
                                                                 "model:SolvaneC1",
                                                                 "model:SolvaneB1",
                                                                 "model:SolvaneF1",
                                                                 "model:SolvaneC2",
                                                                 "model:SolvaneB2",
                                                                 "model:SolvaneE1",
                                                                 "model:PellanA2",
                                                                 "model:SolvaneD2",
                                                                 "model:SolvaneG2",
                                                                 "model:TirelM2",
                                                                 "model:SolvaneH1",
                                                                 "model:SolvaneJ1",
                                                                 "model:Unknown",
                                                                 "colour",
                                                                 "wheel"};

CameraScenario MakeHostileCamera(std::size_t kind) {
    Scenario named;
    Require(Simulation::MakeBuiltInScenario(Kinds[kind % Kinds.size()], &named));
    CameraScenario camera = named.cameras.front();
    camera.sensor.width = HostileSensorWidth;
    camera.sensor.height = HostileSensorHeight;
    return camera;
}

}  // namespace

std::vector<CameraScenario> MakeHostileCameras(std::size_t first, std::size_t count) {
    Scenario scenario;
    for (std::size_t kind = first; kind < first + count; ++kind) {
        scenario.cameras.push_back(MakeHostileCamera(kind));
    }
    FinishScenario(&scenario);
    return scenario.cameras;
}

void HurryWaits() {
    SetWaitClockDivisor(1'000'000);
}

std::vector<ZentaraHandle> OpenHostileCameras(std::size_t count) {
    HurryWaits();
    PlugHostileCameras(MakeHostileCameras(0, count));
    Require(Zentara_LoadDriver() == zerrNone);
    std::vector<Zentara_CamListItem> items(count);
    auto listed = static_cast<std::uint32_t>(count);
    Require(Zentara_ListCameras(items.data(), &listed) == zerrNone && listed == count);
    std::vector<ZentaraHandle> handles(count);
    for (std::uint32_t camera = 0; camera < count; ++camera) {
        Require(Zentara_OpenCamera(items[camera].cameraId, &handles[camera]) == zerrNone);
    }
    return handles;
}

}  // namespace ZV::Fuzzing
