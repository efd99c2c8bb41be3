#include <cstring>
#include <string>
#include <string_view>

#include "fuzz/input_file.h"
#include "simulation/image_file.h"
#include "tools/fits_reader.h"
#include "tools/image_readers.h"

// Any file as an image: by the reader of the program that its first bytes name, and by that of the
// simulation. What is read is as large as it says.
namespace ZV::Fuzzing {
namespace {

using ZentaraProgram::Image;

void RequireWholeImage(const Image& image) {
    const std::uint64_t samples =
        std::uint64_t{image.width} * image.height * image.GetChannels() * image.bytesPerSample;
    Require(image.pixels.size() == samples);
}

std::string ReadByFirstBytes(const std::string& path, std::string_view bytes, Image* image) {
    if (bytes.starts_with("\x89PNG")) return ZentaraProgram::ReadPng(path, image);
    if (!bytes.starts_with("SIMPLE")) return ZentaraProgram::ReadTiff(path, image);
    Image frame;
    if (ReadFits(path, ZentaraProgram::FitsDemand::FrameRecord, &frame).empty()) {
        RequireWholeImage(frame);
    }
    return ReadFits(path, ZentaraProgram::FitsDemand::Pixels, image);
}

void RunOnce(const std::uint8_t* data, std::size_t size) {
    static const InputFile file("image");
    const std::string path = file.Write(data, size);
    const std::string_view bytes(reinterpret_cast<const char*>(data), size);
    Image image;
    if (ReadByFirstBytes(path, bytes, &image).empty()) RequireWholeImage(image);
    Simulation::ImageFile levels;
    std::string message;
    if (Simulation::ReadImageFile(path, &levels, &message)) {
        Require(levels.levels.size() ==
                std::size_t{levels.width} * levels.height * levels.channels);
    }
}

}  // namespace
}  // namespace ZV::Fuzzing

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    ZV::Fuzzing::RunOnce(data, size);
    return 0;
}
