#pragma once

#include <string>

#include "image_file.h"

namespace ZentaraProgram {

/// What a caller wants of a FITS file.
enum class FitsDemand {
    Pixels,      ///< An image of any origin; the header tells what it can.
    FrameRecord  ///< A frame of a camera with all that post-processing has to know of it.
};

/// Reads the image at the begin of a FITS file: samples of 8 bits, or of 16 bits without a sign,
/// one plane or three. Three planes have the format of planes, whatever the frame's format was.
/// Returns the reason of a failure, or an empty text; `image` is to be used on success only.
///
/// Nothing in the file is believed before it is checked: all samples have to be there, and for a
/// frame record every word has to be in its range and to agree with the samples and the others.
std::string ReadFits(const std::string& path, FitsDemand demand, Image* image);

}  // namespace ZentaraProgram
