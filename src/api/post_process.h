#pragma once

#include <cstdint>

#include "api/camera_context.h"
#include "imaging/image_filter.h"
#include "zentara/zentara.h"

namespace ZV {

/// A client's frame as a filter takes it in, by the record's public and private words. The bytes
/// are the client's: a filter may change them.
[[nodiscard]] ZInImageBufferStruct DescribeFrame(const Zentara_Frame& frame, ZCamera* camera);

/// Whether the frame's pixels may be read: it has a buffer, which by what it says of itself holds
/// them. A `bufferSize` of 0 says nothing: the client vouches for the buffer.
[[nodiscard]] bool HoldsItsPixels(const Zentara_Frame& frame);

/// The open camera that a frame's record names; null for a record that names none.
[[nodiscard]] ZCamera* FindFrameCamera(const Zentara_Frame& frame);

/// The most bytes that any step of the post-processing chain writes to an output of the given
/// width and height: ratio correction, Bayer filter, and the copies between them. A step that
/// refuses the image writes nothing and ends the chain.
[[nodiscard]] std::uint64_t CalculatePostProcessBytes(const CameraContext& context,
                                                      const ZInImageBufferStruct& in,
                                                      const ZOutImageBufferStruct& out,
                                                      std::uint32_t outputFormat);

/// zerrBadParameter for an output without a buffer; zerrBufferTooSmall for one whose `bufferSize`
/// is not 0 and below `bytes`.
[[nodiscard]] ZentaraResult CheckOutput(const Zentara_Frame& frame, std::uint64_t bytes);

/// An output to which at most `bytes` are written, with the low 16 bits of the format. Nothing goes
/// beyond `bufferSize`, nor beyond `bytes` where the client vouches for the buffer.
[[nodiscard]] ZOutImageBufferStruct DescribeOutput(const Zentara_Frame& frame, std::uint32_t format,
                                                   std::uint64_t bytes);

/// Stores a client's algorithm in the filter, both bicubic ones as 4; 0 and what is above 4 change
/// nothing.
void SetFilterAlgorithm(ZBayerInterpolation& filter, std::uint32_t algorithm);

}  // namespace ZV
