#pragma once

#include <cstdint>

namespace ZV::Soak {

/// Judges the 16-bit numbers of the frames that a camera has delivered, against the numbers that
/// it has really used up, counted without end. Whatever is lost, the next frame lies ahead of the
/// one before, and not ahead of the camera.
class FrameNumbers {
  public:
    enum class Verdict { Good, Repeated, Wrong };

    /// `used` numbers lie behind, of frames that cannot come any more.
    void Begin(std::uint64_t used);
    /// `used` by the time at which the frame came. A wrong number moves nothing.
    Verdict Judge(std::uint16_t number, bool isDamaged, std::uint64_t used);
    /// Of the last frame whose number was not wrong.
    [[nodiscard]] std::uint64_t GetLast() const { return last; }

  private:
    std::uint64_t last = 0;
    bool isLastWhole = false;
};

}  // namespace ZV::Soak
