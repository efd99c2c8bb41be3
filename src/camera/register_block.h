#pragma once

#include <atomic>
#include <cstdint>
#include <memory>
#include <mutex>

#include "camera/register_map.h"
#include "camera/relaxed.h"

namespace ZV {

/// Host copy of a register block: a fixed number of quadlets in host order. Reading and storing are
/// thread-safe and never leave the block.
class RegisterCopy {
  public:
    /// All zeros. Null when there is no memory.
    static std::unique_ptr<RegisterCopy> Make(std::uint32_t length);

    std::uint32_t GetLength() const { return length; }
    /// 0 beyond the length.
    std::uint32_t Read(std::uint32_t quadlet) const {
        return quadlet < length ? quadlets[quadlet].load(std::memory_order_relaxed) : 0;
    }
    /// Changes nothing beyond the length.
    void Store(std::uint32_t quadlet, std::uint32_t value) {
        if (quadlet < length) quadlets[quadlet].store(value, std::memory_order_relaxed);
    }
    void StoreZeros();

  private:
    friend class RegisterBlock;
    RegisterCopy(std::uint32_t newLength, std::unique_ptr<std::atomic<std::uint32_t>[]> words);

    const std::uint32_t length;
    const std::unique_ptr<std::atomic<std::uint32_t>[]> quadlets;
    std::unique_ptr<RegisterCopy> next;
};

/// What the host keeps of one block of a camera's registers.
///
/// Readers hold no lock, so a copy that another length replaces is kept until the block ends, and
/// used again when its length comes back: there is never more than one copy of each length.
class RegisterBlock {
  public:
    explicit RegisterBlock(const regVersionEntry* versions) : table(versions) {}

    /// Makes a copy of `length` quadlets the present one. The one in place stays, contents and all,
    /// while its length is the same; another starts as zeros or with what it last held. Null when
    /// there is no memory, the present copy then stays.
    RegisterCopy* Provide(std::uint32_t length);

    /// 0 beyond the copy's length, and before there is a copy.
    std::uint32_t Read(std::uint32_t quadlet) const {
        const RegisterCopy* present = copy.load(std::memory_order_acquire);
        return present != nullptr ? present->Read(quadlet) : 0;
    }
    /// Changes nothing beyond the copy's length, or before there is a copy.
    void Store(std::uint32_t quadlet, std::uint32_t value) {
        RegisterCopy* present = copy.load(std::memory_order_acquire);
        if (present != nullptr) present->Store(quadlet, value);
    }
    std::uint32_t GetLength() const;
    std::uint32_t GetQuadletAddress(std::uint32_t quadlet) const { return address + 4 * quadlet; }

    /// Takes `major` and `minor` from `version`.
    void KeepVersionNumbers() {
        major = version >> 16;
        minor = version & 0xFFFF;
    }

    const regVersionEntry* const table;
    Relaxed<std::uint32_t> address;
    Relaxed<std::uint32_t> version;  ///< As last read.
    /// The numbers of the version that ReadCameraInfo met.
    Relaxed<std::uint32_t> major, minor;

  private:
    RegisterCopy* FindOrMake(std::uint32_t length);

    std::atomic<RegisterCopy*> copy{nullptr};  ///< Borrowed from `copies`, until the block ends.
    std::mutex leafMutex;
    std::unique_ptr<RegisterCopy> copies;  // guarded by leafMutex
};

/// All blocks of one camera.
struct CameraRegisters {
    RegisterBlock directory{DirectoryVersions};
    RegisterBlock configuration{ConfigurationVersions};
    RegisterBlock control{ControlVersions};  ///< The shadow: what the camera has been told.
    RegisterBlock stream{StreamVersions};
    RegisterBlock command{CommandVersions};
    RegisterBlock status{StatusVersions};
};

}  // namespace ZV
