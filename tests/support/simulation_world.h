#pragma once

#include <cstdint>
#include <filesystem>
#include <functional>
#include <mutex>
#include <string>
#include <string_view>
#include <vector>

#include "simulation/zentara_simulation.h"
#include "support/temporary_folder.h"

namespace ZV::Test {

/// One line of a trace file. `type` is "request", "frame", "open", "close", "plug", "unplug" or
/// "busReset"; the fields that a type does not have are 0 or empty.
struct TraceRecord {
    double time = 0;
    std::string type;
    std::uint32_t camera = 0;

    std::uint32_t code = 0;
    std::string name;  ///< Of the control code.
    std::vector<std::uint8_t> input, output;
    std::uint64_t inputBytes = 0,
                  outputBytes = 0;  ///< Also where the bytes themselves are left out.
    bool wasPended = false;
    std::uint32_t error = 0;

    std::uint64_t frame = 0;  ///< From 1, since the bus was started.
    std::uint32_t rollingFrameNumber = 0, psn = 0, plane = 0, width = 0, height = 0;
    std::uint64_t bytes = 0;
    std::uint64_t checksum = 0;  ///< CalculateChecksum of the pixels as sent.
};

/// A register write in the trace, its data as host-order values.
struct RegisterWrite {
    std::uint32_t address = 0;
    std::vector<std::uint32_t> values;
    std::uint32_t error = 0;

    bool operator==(const RegisterWrite&) const = default;
};

/// Checksum of a trace's frames: FNV-1a of 64 bits.
std::uint64_t CalculateChecksum(const void* bytes, std::size_t count);

/// Reads a trace that grows: what it has parsed once it does not parse again. Of several threads.
class TraceReader {
  public:
    std::vector<TraceRecord> Read(const std::string& path,
                                  const std::function<bool(const TraceRecord&)>& isWanted);

  private:
    std::mutex mutex;
    std::string known;  ///< The whole lines of `records`.
    std::vector<TraceRecord> records;
};

/// A simulated world for the life of the object: a scenario in a folder of its own, with a trace,
/// and `ZENTARA_SIMULATION` naming it. The bus starts when the library lists its devices, or with
/// Start; the destructor ends it, clears the variable and removes the folder.
///
/// The scenario is the name of a built-in one, or a JSON object (docs/simulation.md). Unless it
/// says otherwise, time scale is 0 and each camera's images have no noise.
class SimulationWorld {
  public:
    explicit SimulationWorld(std::string_view scenario);
    ~SimulationWorld();
    SimulationWorld(const SimulationWorld&) = delete;
    SimulationWorld& operator=(const SimulationWorld&) = delete;

    /// Folder of the world's files; more may be put there.
    const std::filesystem::path& GetFolder() const { return folder.GetFolder(); }
    /// The scenario file, which is what `ZENTARA_SIMULATION` says.
    std::string GetScenarioPath() const;

    /// Starts the bus without the library. False when the scenario is refused.
    bool Start();
    /// Ends the bus.
    void End();

    std::vector<TraceRecord> ReadTrace() const;
    std::vector<TraceRecord> ReadRequests(std::uint32_t camera = 0) const;
    std::vector<TraceRecord> ReadFrames(std::uint32_t camera = 0) const;
    std::vector<RegisterWrite> ReadRegisterWrites(std::uint32_t camera = 0) const;

    /// False when the fault is refused, or there is no such camera.
    bool AddFault(std::string_view fault, std::uint32_t camera = 0);
    bool Unplug(std::uint32_t camera = 0);
    bool Plug(std::uint32_t camera = 0);
    /// Zeros for a camera that is not there. 0xFFFFFFFF sums over all.
    ZentaraSimulationState GetState(std::uint32_t camera = 0) const;
    std::uint32_t Peek(std::uint32_t address, std::uint32_t camera = 0) const;
    bool Poke(std::uint32_t address, std::uint32_t value, std::uint32_t camera = 0);

  private:
    std::vector<TraceRecord> ReadTrace(std::string_view type, std::uint32_t camera) const;

    TemporaryFolder folder;
    mutable TraceReader trace;
};

}  // namespace ZV::Test
