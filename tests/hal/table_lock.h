#pragma once

#include <cstdint>

namespace ZV::Test {

/// Keeps other processes of this suite away from the system-wide open-camera table for its life.
class TableLock {
  public:
    TableLock();
    ~TableLock();
    TableLock(const TableLock&) = delete;
    TableLock& operator=(const TableLock&) = delete;

  private:
    std::intptr_t file = -1;
};

}  // namespace ZV::Test
