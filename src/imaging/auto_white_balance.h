#pragma once

#include <array>
#include <atomic>
#include <cstdint>
#include <memory>
#include <mutex>

#include "imaging/image_filter.h"
#include "zentara/zentara.h"

namespace ZV {

/// Scales the colours of an image by tables. `Process` declines until it is built.
class ZENTARA_API ZAutoWhiteBalance : public ZImageFilter {
  public:
    static constexpr std::size_t Levels8 = 256;
    static constexpr std::size_t Levels16 = 65536;

    /// What each level of a colour becomes. Entry i is i times the scale in single precision, cut
    /// at the top level and truncated; a product that is no number gives the top level. Never
    /// changes once it is made.
    struct ScaleTable {
        std::array<std::int32_t, Levels8> levels8;
        std::array<std::int32_t, Levels16> levels16;
    };

    explicit ZAutoWhiteBalance(bool calculateValuesOnAllFrames);
    ~ZAutoWhiteBalance() override;

    FilterResult Process(ZInImageBufferStruct* in, ZOutImageBufferStruct* out) override;
    /// Does nothing. `FilterDone`.
    FilterResult Init(std::uint32_t width, std::uint32_t height) override;
    /// Does nothing. `FilterDone`.
    FilterResult SetOutputFormat(std::uint32_t format) override;

    /// Last measured means, 128 before the first measurement.
    std::uint32_t GetRedMean() const { return redMean.load(std::memory_order_relaxed); }
    std::uint32_t GetGreenMean() const { return greenMean.load(std::memory_order_relaxed); }
    std::uint32_t GetBlueMean() const { return blueMean.load(std::memory_order_relaxed); }

    float GetRedScale() const;
    float GetGreenScale() const;
    float GetBlueScale() const;
    /// Each builds both tables of its colour anew, which then take the place of the old ones at
    /// once. Thread-safe.
    void SetRedScale(float scale);
    void SetGreenScale(float scale);
    void SetBlueScale(float scale);
    /// Kept without an effect.
    void SetCalculateValuesOnAllFrames(bool on);

    /// The tables in force. They stay whole for who holds them, whatever is set meanwhile.
    /// Thread-safe.
    std::shared_ptr<const ScaleTable> GetRedTable() const { return red.GetTable(); }
    std::shared_ptr<const ScaleTable> GetGreenTable() const { return green.GetTable(); }
    std::shared_ptr<const ScaleTable> GetBlueTable() const { return blue.GetTable(); }

  private:
    /// Scale and tables of one colour, exchanged together.
    class ColourScale {
      public:
        explicit ColourScale(float initial) { Set(initial); }

        float GetScale() const { return scale.load(std::memory_order_relaxed); }
        std::shared_ptr<const ScaleTable> GetTable() const;
        void Set(float newScale);

      private:
        mutable std::mutex leafMutex;
        std::atomic<float> scale{};
        std::shared_ptr<const ScaleTable> table;  // guarded by leafMutex
    };

    std::atomic<std::uint32_t> redMean{128};
    std::atomic<std::uint32_t> greenMean{128};
    std::atomic<std::uint32_t> blueMean{128};
    std::atomic<bool> calculateValuesOnAllFrames;
    ColourScale red;
    ColourScale green;
    ColourScale blue;
};

}  // namespace ZV
