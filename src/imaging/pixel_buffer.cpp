#include "imaging/pixel_buffer.h"

#include <cstddef>
#include <limits>

namespace ZV {

bool PixelBuffer::Allocate(std::uint64_t bytes) {
    Free();
    if (bytes == 0) return true;
    if (bytes > std::numeric_limits<std::size_t>::max()) return false;
    block.reset(static_cast<std::uint8_t*>(std::calloc(static_cast<std::size_t>(bytes), 1)));
    if (!block) return false;
    blockBytes = bytes;
    return true;
}

bool PixelBuffer::AllocateAhead(std::uint64_t bytes) {
    if (bytes <= AheadBytesMax) return Allocate(bytes);
    Free();
    return false;
}

void PixelBuffer::Free() {
    block.reset();
    blockBytes = 0;
}

}  // namespace ZV
