#include "hal/table_lock.h"
#include "windows/support/named_turn.h"

namespace ZV::Test {

TableLock::TableLock() {
    file = reinterpret_cast<std::intptr_t>(new NamedTurn(OpenCameraTableTurn));
}

TableLock::~TableLock() {
    delete reinterpret_cast<NamedTurn*>(file);
}

}  // namespace ZV::Test
