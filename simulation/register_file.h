#pragma once

#include <array>
#include <cstdint>
#include <vector>

#include "simulation/configuration.h"
#include "simulation/scenario.h"

namespace ZV::Simulation {

inline constexpr std::uint32_t DirectoryAddress = 0xD0000000;
inline constexpr std::uint32_t ConfigurationAddress = 0xD0001000;
inline constexpr std::uint32_t ControlAddress = 0xD0002000;
inline constexpr std::uint32_t CommandAddress = 0xD0003000;
inline constexpr std::uint32_t StatusAddress = 0xD0004000;
inline constexpr std::uint32_t StreamAddress = 0xD0005000;
inline constexpr std::uint32_t PrimaryIdentityAddress = 0xE0010038;
inline constexpr std::uint32_t SecondaryIdentityAddress = 0xE0001138;

enum class BlockName { Directory, Configuration, Control, Command, Status, Stream, Identity };
inline constexpr std::size_t BlockCount = 7;

/// A camera's memory, as seen from the bus but in host-order values. Not thread-safe.
class RegisterFile {
  public:
    explicit RegisterFile(const CameraScenario& scenario);

    /// State after power on: all that was written is gone.
    void Reset();

    /// Whether `quadlets` quadlets from `address` on answer at all.
    bool IsReadable(std::uint32_t address, std::uint64_t quadlets) const;
    bool IsWritable(std::uint32_t address, std::uint64_t quadlets) const;

    /// Requires: IsReadable. `values` may be null for 0 quadlets.
    void Read(std::uint32_t address, std::uint64_t quadlets, std::uint32_t* values) const;

    /// One quadlet; false where there is none.
    bool Peek(std::uint32_t address, std::uint32_t* value) const;
    bool Poke(std::uint32_t address, std::uint32_t value);

    /// Quadlet of a block; 0 beyond its memory.
    std::uint32_t Get(BlockName block, std::uint32_t quadlet) const;
    void Set(BlockName block, std::uint32_t quadlet, std::uint32_t value);

    /// All of a block, BlockQuadlets values, past the alternate configuration.
    const std::vector<std::uint32_t>& GetBlock(BlockName block) const {
        return blocks[static_cast<std::size_t>(block)].quadlets;
    }

    /// Block and quadlet at an address. False where there is none.
    bool Locate(std::uint32_t address, BlockName* block, std::uint32_t* quadlet) const;

  private:
    struct BlockMemory {
        BlockName name;
        std::uint32_t address = 0;
        std::uint32_t answering = 0;  // Quadlets that answer.
        std::vector<std::uint32_t> quadlets;
    };

    const BlockMemory* Find(std::uint32_t address, std::uint64_t quadlets) const;
    void AddBlock(BlockName name, std::uint32_t address, std::uint32_t version,
                  const regVersionEntry* table);
    void AddIdentity(std::uint32_t address);

    CameraScenario camera;
    std::vector<BlockMemory> blocks;
};

}  // namespace ZV::Simulation
