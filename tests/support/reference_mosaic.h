#pragma once

#include <cstdint>
#include <vector>

namespace ZV::Test {

/// Three planes of samples, as large as the frame.
struct ReferenceColours {
    std::uint32_t width = 0, height = 0;
    std::vector<std::uint16_t> planes[3];  ///< Red, green, blue.
};

/// A mosaic as a client has it; `pattern` is one of zpat....
struct ReferenceMosaic {
    std::uint32_t width = 0, height = 0;
    std::uint32_t bits = 8;  ///< 8, or anything above for samples of two bytes.
    std::uint32_t pattern = 0;
    std::vector<std::uint16_t> samples;
};

/// Makes colours of a mosaic with even sides, sample by sample from the written formulas; nothing
/// is shared with the library. `algorithm` is one of zbayer....
ReferenceColours MakeReferenceColours(const ReferenceMosaic& mosaic, std::uint32_t algorithm);

/// Scales the colours as the white balance does, the top sample apart.
void ScaleReferenceColours(ReferenceColours& colours, const float (&scales)[3], std::uint32_t bits);

/// The bytes of an image of a format from 6 to 12.
std::vector<std::uint8_t> PackReferenceColours(const ReferenceColours& colours,
                                               std::uint32_t format);

}  // namespace ZV::Test
