#include <fitsio.h>

#include <array>
#include <string>
#include <vector>

#include "fits_names.h"
#include "image_samples.h"
#include "image_writers.h"

namespace ZentaraProgram {
namespace {

std::string DescribeFitsStatus(int status) {
    std::array<char, FLEN_STATUS> text{};
    fits_get_errstatus(status, text.data());
    fits_clear_errmsg();
    return text.data();
}

/// Writes cards one after the other; the first failure stays and the rest do nothing.
class HeaderWriter {
  public:
    HeaderWriter(fitsfile* fits, int* fitsStatus) : file(fits), status(fitsStatus) {}

    void Text(const char* key, const std::string& value, const char* comment) {
        fits_write_key_str(file, key, value.c_str(), comment, status);
    }
    void Number(const char* key, std::uint64_t value, const char* comment) {
        fits_write_key_lng(file, key, static_cast<LONGLONG>(value), comment, status);
    }
    void Signed(const char* key, std::int64_t value, const char* comment) {
        fits_write_key_lng(file, key, value, comment, status);
    }
    void Truth(const char* key, bool value, const char* comment) {
        fits_write_key_log(file, key, value ? 1 : 0, comment, status);
    }
    void Decimal(const char* key, double value, int digits, const char* comment) {
        fits_write_key_dbl(file, key, value, digits, comment, status);
    }

  private:
    fitsfile* file;
    int* status;
};

/// What `zentara process` needs to finish a frame later.
void WriteFrameWords(HeaderWriter& header, const Image& image) {
    header.Number("PIXFORM", image.layout->format, "Format of the frame, by its number");
    header.Number("FRMBIN", image.words.binning, "Binning mode of the frame, by its code");
    header.Truth("FRMRTV", image.words.realTime != 0, "Frame of the real-time mode");
    header.Number("FRMPATT", image.words.pattern, "Colour pattern of the frame, by its code");
    for (std::size_t colour = 0; colour < ColourCount; ++colour)
        header.Decimal(FitsScaleKeys[colour], image.scales[colour], -15,
                       "Scale of post-processing");
}

void WriteHeader(fitsfile* file, const Image& image, int* status) {
    HeaderWriter header(file, status);
    header.Text("DATE-OBS", image.dateObs, "Begin of the exposure, UTC");
    header.Decimal("EXPTIME", image.exposureSeconds, -15, "[s] Exposure time");
    header.Decimal("EXPOSURE", image.exposureSeconds, -15, "[s] Exposure time");
    header.Number("XBINNING", image.binningX, "[pixel] Binning across");
    header.Number("YBINNING", image.binningY, "[pixel] Binning down");
    header.Number("XORGSUBF", image.originX, "[pixel] Left edge, binned pixels");
    header.Number("YORGSUBF", image.originY, "[pixel] Top edge, binned pixels");
    if (image.pixelSizeMicrometres > 0) {
        header.Decimal("XPIXSZ", image.pixelSizeMicrometres * image.binningX, -15,
                       "[um] Pixel width, binned");
        header.Decimal("YPIXSZ", image.pixelSizeMicrometres * image.binningY, -15,
                       "[um] Pixel height, binned");
    }
    header.Number("GAIN", image.gain, "Gain, camera units");
    header.Number("OFFSET", image.offset, "Offset, camera units");
    header.Decimal("GAINDB", image.gainDecibels, -15, "[dB] Gain");
    header.Text("READOUTM", image.readoutMode, "Readout speed");
    if (image.coolingTargetCelsius)
        header.Signed("SET-TEMP", *image.coolingTargetCelsius, "[degC] Target of the cooling");
    header.Text("IMGFORM", image.format, "Format of the samples");
    header.Truth("POSTPROC", image.isPostProcessed, "Post-processed by the library");
    if (image.isBayer)
        header.Text("BAYERPAT", std::string(FitsBayerNames[image.bayerPattern & 3U]),
                    "Mosaic of the first pixel");
    header.Text("ROWORDER", "TOP-DOWN", "The first row is the top of the image");
    header.Text("INSTRUME", image.model, "Camera model");
    header.Text("SERIALNO", image.serialNumber, "Camera serial number");
    header.Text("SWCREATE", image.software, "Program that wrote this file");
    header.Number("BITDEPTH", image.bits, "[bit] Depth of a sample");
    header.Number("FRAMENUM", image.frameNumber, "Number of the frame, counted by the camera");
    header.Number("FRAMEERR", image.frameError, "Error code of the frame, 0 is good");
    WriteFrameWords(header, image);
    fits_write_date(file, status);
}

}  // namespace

std::string WriteFits(const std::string& path, const Image& image) {
    int status = 0;
    fitsfile* file = nullptr;
    // The plain form of create: brackets in a name are part of it.
    fits_create_diskfile(&file, GetLiteralPath(path).c_str(), &status);
    if (status != 0) {
        std::string reason = DescribeFileFailure();
        fits_clear_errmsg();
        return reason;
    }
    const bool isDeep = image.bytesPerSample == 2;
    std::array<LONGLONG, 3> size{image.width, image.height, image.GetChannels()};
    fits_create_imgll(file, isDeep ? USHORT_IMG : BYTE_IMG, image.GetChannels() > 1 ? 3 : 2,
                      size.data(), &status);
    WriteHeader(file, image, &status);
    std::vector<std::uint8_t> scratch;
    // cfitsio does not write to its argument, although it takes a pointer to non-const.
    auto* pixels = const_cast<std::uint8_t*>(GetPlaneSamples(image, &scratch).data());
    fits_write_img(file, isDeep ? TUSHORT : TBYTE, 1, size[0] * size[1] * size[2], pixels, &status);
    fits_write_chksum(file, &status);
    int closeStatus = 0;
    fits_close_file(file, &closeStatus);
    if (status == 0) status = closeStatus;
    return status == 0 ? std::string{} : DescribeFitsStatus(status);
}

}  // namespace ZentaraProgram
