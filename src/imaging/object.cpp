#include "imaging/object.h"

namespace ZV {

void ZObject::EraseVector(std::vector<std::uint16_t>& values) {
    values.clear();
}

void ZObject::EraseVector(std::vector<std::uint32_t>& values) {
    values.clear();
}

void ZObject::EraseVector(std::vector<float>& values) {
    values.clear();
}

}  // namespace ZV
