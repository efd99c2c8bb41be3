#pragma once

#include <cstdint>
#include <vector>

#include "zentara/zentara.h"

namespace ZV {

/// Common base of cameras, images and filters; no members and no virtual operations.
class ZENTARA_API ZObject {
  public:
    static void EraseVector(std::vector<std::uint16_t>& values);
    static void EraseVector(std::vector<std::uint32_t>& values);
    static void EraseVector(std::vector<float>& values);
};

}  // namespace ZV
