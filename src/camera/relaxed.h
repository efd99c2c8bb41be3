#pragma once

#include <atomic>

namespace ZV {

/// A word that several threads read and write without a named lock: a relaxed atomic that reads and
/// assigns like the plain type. It orders nothing; who needs order takes a lock beside it.
template <typename T>
class Relaxed {
  public:
    constexpr Relaxed(T initial = T()) : value(initial) {}
    Relaxed(const Relaxed&) = delete;
    Relaxed& operator=(const Relaxed&) = delete;

    operator T() const { return value.load(std::memory_order_relaxed); }
    Relaxed& operator=(T newValue) {
        value.store(newValue, std::memory_order_relaxed);
        return *this;
    }

  private:
    std::atomic<T> value;
};

}  // namespace ZV
