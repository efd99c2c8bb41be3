#pragma once

#include <chrono>
#include <string>
#include <vector>

#include "driver.h"
#include "frame_size.h"
#include "image_file.h"
#include "settings_block.h"

namespace ZentaraProgram {

/// A frame record with a pixel buffer of its own.
struct FrameBuffer {
    std::vector<std::uint8_t> pixels;
    Zentara_Frame frame{};

    /// Room for `bytes`; the record is made anew.
    void Prepare(std::size_t bytes) {
        pixels.assign(bytes, 0);
        frame = Zentara_Frame{};
        frame.pBuffer = pixels.data();
        frame.bufferSize = static_cast<std::uint32_t>(bytes);
    }
};

/// What all images of one capture share.
struct CaptureFacts {
    std::size_t imageBytes = 0;
    std::uint64_t exposureNs = 0;
    bool isSoftwareTriggered = false;  ///< Each exposure waits for a Zentara_Trigger.
    /// Of one image, each with a number of its own: 3 where a filter wheel makes the colours.
    std::uint32_t exposures = 1;
    Size frameSize;  ///< Before post-processing changes its proportions; 0 where it does not.
    Image prototype;
};
/// From an open camera and the block of the settings in force.
CaptureFacts GetCaptureFacts(const Camera& camera, const SettingsBlock& settings);

/// Says on standard error when the ending of a name is that of no kind of file.
ExitCode CheckImageName(const std::string& path);

/// Why a delivered frame cannot be an image of a file; empty when it can. Frames of more than 8
/// bits in a format of bytes hold no colours.
std::string FindFrameProblem(const Zentara_Frame& frame);

/// Says on standard error when an image is damaged; its exit code.
ExitCode TellDamage(const Image& image);

/// Corrects the binning of an image whose frame had another size before post-processing.
void ScaleBinning(Size frame, Image* image);

/// Makes `pixels` and what the record of their frame says part of an image. The frame is writable;
/// what is missing of its pixels becomes 0.
void TakeFrame(const Zentara_Frame& frame, std::vector<std::uint8_t> pixels, Image* image);

/// The image of a delivered frame whose exposure began at `begin`.
Image MakeImage(const CaptureFacts& facts, const FrameBuffer& buffer,
                std::chrono::system_clock::time_point begin);

/// ISO 8601 in UTC with milliseconds and without a zone.
std::string FormatUtc(std::chrono::system_clock::time_point time);

}  // namespace ZentaraProgram
