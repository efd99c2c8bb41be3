#pragma once

#include <gtest/gtest.h>

#include <algorithm>
#include <cstring>
#include <string_view>

#include "system/mosaic_camera.h"

namespace ZV::Test {

/// Finishes frames of a small camera one by one.
class SingleFrame : public MosaicCamera {
  protected:
    explicit SingleFrame(std::string_view scenario = SmallColour) : MosaicCamera(scenario) {}

    Zentara_Settings MakeBlock(std::uint32_t format, std::uint32_t algorithm) {
        return MakeSettings(zfmtBayer8, format, algorithm, false);
    }
    ZentaraResult Process(std::uint32_t format, std::uint32_t algorithm, OwnedFrame& from,
                          OwnedFrame& to) {
        Zentara_Settings block = MakeBlock(format, algorithm);
        return Zentara_PostProcessSingleFrame(handle, &block, from.Get(), to.Get());
    }
    static OwnedFrame MakeTarget(OwnedFrame& mosaic, std::uint32_t format) {
        return OwnedFrame(std::max<std::size_t>(
            Zentara_CalcImageSize(format, mosaic->width, mosaic->height), mosaic->size));
    }
    void ExpectFinished(OwnedFrame& mosaic, std::uint32_t format, std::uint32_t algorithm) {
        OwnedFrame target = MakeTarget(mosaic, format);
        ASSERT_ZERR(zerrNone, Process(format, algorithm, mosaic, target));
        EXPECT_EQ(Finish(mosaic, algorithm, format), target.GetImage())
            << format << " by " << algorithm;
        EXPECT_EQ(format, target->format);
        EXPECT_EQ(mosaic->width, target->width);
        EXPECT_EQ(mosaic->height, target->height);
        EXPECT_EQ(mosaic->bits, target->bits);
        EXPECT_EQ(Zentara_CalcImageSize(format, mosaic->width, mosaic->height), target->size);
    }
    /// The record of `from` for the pixels of `to`.
    static void CopyRecord(OwnedFrame& from, OwnedFrame& to) {
        *to.Get() = *from.Get();
        to->pBuffer = to.pixels.data();
        to->size = to->bufferSize = static_cast<std::uint32_t>(to.pixels.size());
    }
    static Zentara_Frame GetRecord(OwnedFrame& frame) { return *frame.Get(); }
    static void ExpectSameRecord(const Zentara_Frame& expected, OwnedFrame& frame) {
        EXPECT_EQ(0, std::memcmp(&expected, frame.Get(), sizeof(expected)));
    }
};

}  // namespace ZV::Test
