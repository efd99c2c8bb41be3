#include "simulation/register_file.h"

namespace ZV::Simulation {
namespace {

std::uint32_t GetLength(const regVersionEntry* table, std::uint32_t version) {
    for (; table->major != 0; ++table) {
        if (MakeVersion(table->major, table->minor) == version) return table->length;
    }
    return 1;
}

}  // namespace

RegisterFile::RegisterFile(const CameraScenario& scenario) : camera(scenario) {
    Reset();
}

void RegisterFile::Reset() {
    const BlockVersions& versions = camera.versions;
    blocks.clear();
    AddBlock(BlockName::Directory, DirectoryAddress, versions.directory, DirectoryVersions);
    AddBlock(BlockName::Configuration, ConfigurationAddress, versions.configuration,
             ConfigurationVersions);
    AddBlock(BlockName::Control, ControlAddress, versions.control, ControlVersions);
    AddBlock(BlockName::Command, CommandAddress, versions.command, CommandVersions);
    AddBlock(BlockName::Status, StatusAddress, versions.status, StatusVersions);
    AddBlock(BlockName::Stream, StreamAddress, versions.stream, StreamVersions);
    blocks[static_cast<std::size_t>(BlockName::Configuration)].quadlets = MakeConfiguration(camera);
    Set(BlockName::Directory, DirectoryConfiguration, ConfigurationAddress);
    Set(BlockName::Directory, DirectoryControl, ControlAddress);
    Set(BlockName::Directory, DirectoryCommand, CommandAddress);
    Set(BlockName::Directory, DirectoryStatus, StatusAddress);
    Set(BlockName::Directory, DirectoryStream, StreamAddress);
    const IdentityPlace place = camera.identityPlace;
    const bool isBoth = place == IdentityPlace::Both;
    if (isBoth || place == IdentityPlace::Primary) AddIdentity(PrimaryIdentityAddress);
    if (isBoth || place == IdentityPlace::Secondary) AddIdentity(SecondaryIdentityAddress);
}

void RegisterFile::AddBlock(BlockName name, std::uint32_t address, std::uint32_t version,
                            const regVersionEntry* table) {
    const std::uint32_t length = camera.hasStrictBlocks ? GetLength(table, version) : BlockQuadlets;
    blocks.push_back({name, address, length, std::vector<std::uint32_t>(BlockQuadlets)});
    blocks.back().quadlets[0] = version;
}

void RegisterFile::AddIdentity(std::uint32_t address) {
    const std::uint32_t identity = camera.hasIdentity ? camera.identity : camera.modelId << 16;
    blocks.push_back({BlockName::Identity, address, 1, {identity}});
}

const RegisterFile::BlockMemory* RegisterFile::Find(std::uint32_t address,
                                                    std::uint64_t quadlets) const {
    if (address % 4 != 0) return nullptr;
    for (const BlockMemory& block : blocks) {
        if (address < block.address) continue;
        const std::uint64_t first = (address - block.address) / 4;
        if (first < block.answering && first + quadlets <= block.answering) return &block;
    }
    return nullptr;
}

bool RegisterFile::IsReadable(std::uint32_t address, std::uint64_t quadlets) const {
    return quadlets == 0 || Find(address, quadlets) != nullptr;
}

bool RegisterFile::IsWritable(std::uint32_t address, std::uint64_t quadlets) const {
    if (quadlets == 0) return true;
    const BlockMemory* block = Find(address, quadlets);
    return block != nullptr && block->name != BlockName::Directory &&
           block->name != BlockName::Identity;
}

void RegisterFile::Read(std::uint32_t address, std::uint64_t quadlets,
                        std::uint32_t* values) const {
    for (std::uint64_t i = 0; i < quadlets; ++i) {
        (void)Peek(address + static_cast<std::uint32_t>(4 * i),
                   values + i);  // Checked by the caller.
    }
}

bool RegisterFile::Peek(std::uint32_t address, std::uint32_t* value) const {
    const BlockMemory* block = Find(address, 1);
    if (block == nullptr) return false;
    const std::uint32_t quadlet = (address - block->address) / 4;
    *value = block->quadlets[quadlet];
    const AlternateConfiguration& alternate = camera.alternate;
    if (block->name != BlockName::Configuration || alternate.controlQuadlet == 0) return true;
    const std::uint32_t control = Get(BlockName::Control, alternate.controlQuadlet);
    if ((control & alternate.mask) != alternate.value) return true;
    const auto found = alternate.quadlets.find(quadlet);
    if (found != alternate.quadlets.end()) *value = found->second;
    return true;
}

bool RegisterFile::Poke(std::uint32_t address, std::uint32_t value) {
    const BlockMemory* block = Find(address, 1);
    if (block == nullptr) return false;
    blocks[static_cast<std::size_t>(block - blocks.data())]
        .quadlets[(address - block->address) / 4] = value;
    return true;
}

std::uint32_t RegisterFile::Get(BlockName block, std::uint32_t quadlet) const {
    const std::vector<std::uint32_t>& quadlets = blocks[static_cast<std::size_t>(block)].quadlets;
    return quadlet < quadlets.size() ? quadlets[quadlet] : 0;
}

void RegisterFile::Set(BlockName block, std::uint32_t quadlet, std::uint32_t value) {
    std::vector<std::uint32_t>& quadlets = blocks[static_cast<std::size_t>(block)].quadlets;
    if (quadlet < quadlets.size()) quadlets[quadlet] = value;
}

bool RegisterFile::Locate(std::uint32_t address, BlockName* block, std::uint32_t* quadlet) const {
    const BlockMemory* found = Find(address, 1);
    if (found == nullptr) return false;
    *block = found->name;
    *quadlet = (address - found->address) / 4;
    return true;
}

}  // namespace ZV::Simulation
