#include <string>

#include "fuzz/input_file.h"
#include "simulation/register_file.h"
#include "simulation/scenario_reader.h"

// Any file as a scenario of the simulation, and any text as a fault. What is accepted makes
// cameras.
namespace ZV::Fuzzing {
namespace {

void RunOnce(const std::uint8_t* data, std::size_t size) {
    static const InputFile file("scenario.json");
    Simulation::Scenario scenario;
    std::string message;
    const bool isRead = Simulation::LoadScenario(file.Write(data, size), &scenario, &message);
    Require(isRead == message.empty());
    if (isRead) {
        for (const Simulation::CameraScenario& camera : scenario.cameras) {
            Require(camera.bus < scenario.buses.size());
            const Simulation::RegisterFile registers(camera);
        }
    }
    Simulation::FaultDescription fault;
    const std::string text(reinterpret_cast<const char*>(data), size);
    (void)Simulation::ReadFault(text, &fault, &message);
}

}  // namespace
}  // namespace ZV::Fuzzing

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    ZV::Fuzzing::RunOnce(data, size);
    return 0;
}
