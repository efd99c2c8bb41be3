#include "hal/open_camera_table.h"

#include <atomic>
#include <bit>

namespace ZV {
namespace {

constexpr std::uint32_t NodeNumberMask = 0x3F;

/// An entry as one word, so that processes never see half of it.
using EntryWord = std::uint64_t;

EntryWord ToWord(const OpenCameraEntry& entry) {
    return std::bit_cast<EntryWord>(entry);
}

bool IsUsed(EntryWord word) {
    return std::bit_cast<OpenCameraEntry>(word).adapterPlusOne != 0;
}

std::atomic_ref<EntryWord> GetEntry(SharedMemory* memory, std::size_t index) {
    return std::atomic_ref(static_cast<EntryWord*>(GetSharedMemoryAddress(memory))[index]);
}

}  // namespace

OpenCameraEntry MakeOpenCameraEntry(std::uint32_t adapterIndex, std::uint32_t nodeId) {
    return OpenCameraEntry{adapterIndex + 1, nodeId & NodeNumberMask};
}

OpenCameraTable::OpenCameraTable()
    : memory(OpenSharedMemory(OpenCameraTableName, OpenCameraTableBytes)) {}

OpenCameraTable::~OpenCameraTable() {
    CloseSharedMemory(memory);
}

std::size_t OpenCameraTable::CountUsed() const {
    std::size_t used = 0;
    for (std::size_t i = 0; IsReachable() && i < OpenCameraTableEntries; ++i) {
        if (IsUsed(GetEntry(memory, i).load())) ++used;
    }
    return used;
}

bool OpenCameraTable::Contains(const OpenCameraEntry& entry) const {
    for (std::size_t i = 0; IsReachable() && i < OpenCameraTableEntries; ++i) {
        if (GetEntry(memory, i).load() == ToWord(entry)) return true;
    }
    return false;
}

bool OpenCameraTable::Add(const OpenCameraEntry& entry) {
    for (std::size_t i = 0; IsReachable() && i < OpenCameraTableEntries; ++i) {
        EntryWord found = GetEntry(memory, i).load();
        // Whatever node number a free entry holds does not count.
        while (!IsUsed(found)) {
            if (GetEntry(memory, i).compare_exchange_weak(found, ToWord(entry))) return true;
        }
    }
    return false;
}

void OpenCameraTable::Remove(const OpenCameraEntry& entry) {
    for (std::size_t i = 0; IsReachable() && i < OpenCameraTableEntries; ++i) {
        EntryWord expected = ToWord(entry);
        if (GetEntry(memory, i).compare_exchange_strong(expected, 0)) return;
    }
}

}  // namespace ZV
