#pragma once

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

#include "system/camera_session.h"
#include "system/frame_flow.h"

namespace ZV::Test {

/// A camera of a built-in scenario with a small sensor and no noise, whose every sample can be
/// computed.
struct StreamedCamera {
    const char* scenario;
    bool hasMosaic;  ///< Frames in two fields, binned by rows within the mosaic.

    static constexpr std::uint32_t Width = 160, Height = 120;
    /// Room for the largest image of this sensor.
    static constexpr std::uint32_t BufferBytes = Width * Height * 2;

    std::string GetScenario() const;
};

/// A settings block and the frame that the camera makes under it.
struct WholeSet {
    Zentara_Settings block{};
    std::uint32_t width = 0, height = 0, bits = 0;
    std::uint64_t checksum = 0;
};

/// Which settings were in force for which frames of a camera, as a client can know it.
///
/// A frame whose exposure began after a send had returned has the sent settings, one that was
/// exposed before the call has the former ones; for those in between both are right, but never a
/// mixture.
class SettingsHistory {
  public:
    SettingsHistory(CameraSession& session, const StreamedCamera& camera);

    /// Sends the block without a stream and learns the frame from an image taken so. The image must
    /// be the one that an independent renderer computes.
    void AddSet(const Zentara_Settings& block);
    std::size_t CountSets() const { return sets.size(); }
    const WholeSet& GetSet(std::size_t index) const { return sets[index]; }

    /// Puts a set in force without a stream; the history begins anew with it.
    void BeginWith(std::size_t index);
    /// Sends a set from this thread.
    void Send(std::size_t index);
    /// A set was asked for after `framesBefore` exposures and was in force after `framesAfter`.
    void Note(std::size_t index, std::uint64_t framesBefore, std::uint64_t framesAfter);
    std::uint64_t CountExposed() const { return session.world.GetState().framesExposed; }
    /// Exposures at the end of the latest send.
    std::uint64_t GetLastMark() const { return changes.back().after; }

    /// Each frame was exposed, whole, under settings that may have been in force; none is damaged.
    void ExpectWholeSets(const std::vector<FlownFrame>& frames) const;
    /// How often the latest set stands among the frames.
    std::size_t CountOfLatest(const std::vector<FlownFrame>& frames) const;

  private:
    struct Change {
        std::size_t set;
        std::uint64_t before, after;
    };

    void CompareWithRenderer(const Zentara_Settings& sent, const DeliveredFrame& delivered);
    bool MayBe(const FlownFrame& frame, std::size_t change) const;
    bool IsOf(const FlownFrame& frame, std::size_t set) const;
    std::string Describe(const FlownFrame& frame) const;

    CameraSession& session;
    const StreamedCamera camera;
    std::vector<WholeSet> sets;
    std::vector<Change> changes;
};

/// Settings that differ in all that may change under a stream: exposure, gain and offset, the place
/// of the region, its size, binning and depth. `base` is the camera's own full frame.
std::vector<Zentara_Settings> MakeDifferentSettings(const Zentara_Settings& base,
                                                    const StreamedCamera& camera);
/// Settings that may be queued behind frames of `base`: exposure, gain and offset differ.
std::vector<Zentara_Settings> MakeCompatibleSettings(const Zentara_Settings& base);

}  // namespace ZV::Test
