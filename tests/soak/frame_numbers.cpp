#include "soak/frame_numbers.h"

namespace ZV::Soak {

void FrameNumbers::Begin(std::uint64_t used) {
    last = used;
    isLastWhole = false;
}

FrameNumbers::Verdict FrameNumbers::Judge(std::uint16_t number, bool isDamaged,
                                          std::uint64_t used) {
    const std::uint64_t step = static_cast<std::uint16_t>(number - last);
    // A repeated first packet cuts its own frame short and begins it anew: one of the two lacks
    // packets.
    if (step == 0 && isLastWhole && !isDamaged) return Verdict::Wrong;
    if (step > used - last) return Verdict::Wrong;
    last += step;
    isLastWhole = !isDamaged;
    return step == 0 ? Verdict::Repeated : Verdict::Good;
}

}  // namespace ZV::Soak
