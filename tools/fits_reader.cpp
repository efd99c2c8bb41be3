#include "fits_reader.h"

#include <fitsio.h>
#include <fmt/format.h>

#include <array>
#include <cmath>
#include <filesystem>
#include <fstream>
#include <limits>
#include <optional>
#include <string_view>

#include "fits_names.h"
#include "image_readers.h"
#include "output.h"
#include "paths.h"
#include "zentara/zentara.h"

namespace ZentaraProgram {
namespace {

constexpr LONGLONG GreatestSide = 65535;
constexpr const char* OriginNote = "only frames that this program wrote can be processed";

/// An open file; its reads give nothing for a card that is missing or holds something else.
class FitsInput {
  public:
    FitsInput() = default;
    ~FitsInput() {
        int ignored = 0;
        if (file != nullptr) fits_close_file(file, &ignored);
        fits_clear_errmsg();
    }
    FitsInput(const FitsInput&) = delete;
    FitsInput& operator=(const FitsInput&) = delete;

    [[nodiscard]] bool Open(const std::string& path) {
        int status = 0;
        fits_open_diskfile(&file, GetLiteralPath(path).c_str(), READONLY, &status);
        return status == 0;
    }
    [[nodiscard]] fitsfile* Get() const { return file; }

    [[nodiscard]] bool Has(const char* key) const {
        int status = 0;
        std::array<char, FLEN_CARD> card{};
        return fits_read_card(file, key, card.data(), &status) == 0;
    }
    [[nodiscard]] std::optional<std::string> ReadText(const char* key) const {
        int status = 0;
        std::array<char, FLEN_VALUE> text{};
        fits_read_key_str(file, key, text.data(), nullptr, &status);
        return status == 0 ? std::optional<std::string>(text.data()) : std::nullopt;
    }
    [[nodiscard]] std::optional<std::int64_t> ReadNumber(const char* key) const {
        int status = 0;
        LONGLONG number = 0;
        fits_read_key_lnglng(file, key, &number, nullptr, &status);
        return status == 0 ? std::optional<std::int64_t>(number) : std::nullopt;
    }
    [[nodiscard]] std::optional<double> ReadDecimal(const char* key) const {
        int status = 0;
        double number = 0;
        fits_read_key_dbl(file, key, &number, nullptr, &status);
        return status == 0 && std::isfinite(number) ? std::optional<double>(number) : std::nullopt;
    }
    [[nodiscard]] std::optional<bool> ReadTruth(const char* key) const {
        int status = 0, truth = 0;
        fits_read_key_log(file, key, &truth, nullptr, &status);
        return status == 0 ? std::optional<bool>(truth != 0) : std::nullopt;
    }

  private:
    fitsfile* file = nullptr;
};

/// The library of the format also unpacks what is compressed; only plain files get that far.
std::string FindDoorProblem(const std::string& path) {
    constexpr std::string_view Begin = "SIMPLE  =";
    if (std::string problem = FindFileProblem(path); !problem.empty()) return problem;
    std::ifstream file(MakePath(path), std::ios::binary);
    if (!file) return "it cannot be opened";
    std::array<char, Begin.size()> begin{};
    file.read(begin.data(), begin.size());
    const bool isFits = file && std::string_view(begin.data(), begin.size()) == Begin;
    return isFits ? std::string{} : "it is no FITS file";
}

std::string ReadShape(const FitsInput& input, const std::string& path, Image* image) {
    int status = 0, type = 0, axes = 0;
    std::array<LONGLONG, 3> size{1, 1, 1};
    fits_get_img_equivtype(input.Get(), &type, &status);
    fits_get_img_dim(input.Get(), &axes, &status);
    fits_get_img_sizell(input.Get(), static_cast<int>(size.size()), size.data(), &status);
    if (status != 0) return "its header cannot be read";
    if (type != BYTE_IMG && type != USHORT_IMG)
        return "its samples are neither bytes nor words of 16 bits without a sign";
    if (axes < 2 || axes > 3 || (size[2] != 1 && size[2] != LONGLONG{ColourCount}))
        return fmt::format("it holds no image of one or three planes (NAXIS {})", axes);
    for (const LONGLONG side : {size[0], size[1]}) {
        if (side < 1 || side > GreatestSide)
            return fmt::format("an image of {} x {} pixels is none of a camera", size[0], size[1]);
    }
    image->width = static_cast<std::uint32_t>(size[0]);
    image->height = static_cast<std::uint32_t>(size[1]);
    image->bytesPerSample = type == BYTE_IMG ? 1 : 2;
    const auto samples = static_cast<std::uint64_t>(size[0] * size[1] * size[2]);
    std::error_code failure;
    const std::uint64_t held = std::filesystem::file_size(MakePath(path), failure);
    if (failure || held < samples * image->bytesPerSample)
        return "the file is shorter than its header says";
    const bool isDeep = image->bytesPerSample == 2;
    const bool isColour = size[2] > 1;
    const std::uint32_t plain = isDeep ? zfmtMono16 : zfmtMono8;
    const std::uint32_t planes = isDeep ? zfmtRGBPlane16 : zfmtRGBPlane8;
    image->layout = FindPixelFormat(isColour ? planes : plain);
    image->bits = isDeep ? 16 : 8;
    return {};
}

std::string ReadPixels(const FitsInput& input, Image* image) {
    const std::size_t samples = std::size_t{image->width} * image->height * image->GetChannels();
    image->pixels.resize(samples * image->bytesPerSample);
    int status = 0;
    fits_read_img(input.Get(), image->bytesPerSample == 2 ? TUSHORT : TBYTE, 1,
                  static_cast<LONGLONG>(samples), nullptr, image->pixels.data(), nullptr, &status);
    return status == 0 ? std::string{} : "its samples cannot be read";
}

struct TextRow {
    const char* key;
    std::string Image::*member;
};
constexpr std::array Texts{
    TextRow{"DATE-OBS", &Image::dateObs},      TextRow{"READOUTM", &Image::readoutMode},
    TextRow{"IMGFORM", &Image::format},        TextRow{"INSTRUME", &Image::model},
    TextRow{"SERIALNO", &Image::serialNumber}, TextRow{"SWCREATE", &Image::software},
};

struct NumberRow {
    const char* key;
    std::uint32_t Image::*member;
    std::uint32_t least;
};
constexpr std::array Numbers{
    NumberRow{"XBINNING", &Image::binningX, 1}, NumberRow{"YBINNING", &Image::binningY, 1},
    NumberRow{"XORGSUBF", &Image::originX, 0},  NumberRow{"YORGSUBF", &Image::originY, 0},
    NumberRow{"GAIN", &Image::gain, 0},         NumberRow{"OFFSET", &Image::offset, 0},
};

/// What says something about an image and nothing about its samples: wrong cards count as missing.
void ReadDescription(const FitsInput& input, Image* image) {
    for (const TextRow& row : Texts) {
        if (const auto text = input.ReadText(row.key)) image->*row.member = MakeHarmless(*text);
    }
    for (const NumberRow& row : Numbers) {
        const auto number = input.ReadNumber(row.key);
        if (number && *number >= row.least && *number <= std::numeric_limits<std::int32_t>::max())
            image->*row.member = static_cast<std::uint32_t>(*number);
    }
    image->exposureSeconds = input.ReadDecimal("EXPTIME").value_or(0);
    image->gainDecibels = input.ReadDecimal("GAINDB").value_or(0);
    image->pixelSizeMicrometres = input.ReadDecimal("XPIXSZ").value_or(0) / image->binningX;
    image->coolingTargetCelsius = input.ReadNumber("SET-TEMP");
    image->isPostProcessed = input.ReadTruth("POSTPROC").value_or(false);
    for (std::size_t colour = 0; colour < ColourCount; ++colour)
        image->scales[colour] = input.ReadDecimal(FitsScaleKeys[colour]).value_or(1);
}

std::uint32_t FindBayerName(const std::string& name) {
    std::uint32_t place = 0;
    while (place < FitsBayerNames.size() && FitsBayerNames[place] != name) ++place;
    return place;
}

struct WordRow {
    const char* key;
    std::int64_t least, greatest;
    void (*store)(Image& image, std::uint32_t value);
};
constexpr std::array Words{
    WordRow{"PIXFORM", zfmtRaw8, zfmtRGB24,
            [](Image& image, std::uint32_t value) { image.layout = FindPixelFormat(value); }},
    WordRow{"BITDEPTH", 8, 16, [](Image& image, std::uint32_t value) { image.bits = value; }},
    WordRow{"FRMBIN", 0, 65535,
            [](Image& image, std::uint32_t value) { image.words.binning = value; }},
    WordRow{"FRMPATT", 0, 8,
            [](Image& image, std::uint32_t value) { image.words.pattern = value; }},
    WordRow{"FRAMENUM", 0, 65535,
            [](Image& image, std::uint32_t value) { image.frameNumber = value; }},
    WordRow{"FRAMEERR", 0, 255,
            [](Image& image, std::uint32_t value) { image.frameError = value; }},
};

std::string DescribeBadCard(const FitsInput& input, const char* key) {
    if (!input.Has(key)) return fmt::format("{} is missing; {}", key, OriginNote);
    return fmt::format("{} holds no value of a frame", key);
}

std::string ReadWords(const FitsInput& input, Image* image) {
    for (const WordRow& row : Words) {
        const auto value = input.ReadNumber(row.key);
        if (!value || *value < row.least || *value > row.greatest)
            return DescribeBadCard(input, row.key);
        row.store(*image, static_cast<std::uint32_t>(*value));
    }
    const auto isRealTime = input.ReadTruth("FRMRTV");
    if (!isRealTime) return DescribeBadCard(input, "FRMRTV");
    image->words.realTime = *isRealTime ? 1 : 0;
    image->isBayer = Zentara_isBayer(image->layout->format) != 0;
    if (!image->isBayer) return {};
    image->bayerPattern = FindBayerName(input.ReadText("BAYERPAT").value_or(""));
    const bool isMosaic = image->bayerPattern < FitsBayerNames.size();
    return isMosaic ? std::string{} : DescribeBadCard(input, "BAYERPAT");
}

/// `image` has the format of its samples before the words, and that of the words behind them.
std::string FindContradiction(const Image& image, const PixelFormat& samples) {
    constexpr std::uint32_t FirstMosaicPattern = 5;
    const PixelFormat& told = *image.layout;
    // Who asks for raw data is told raw, whatever the samples are.
    const bool isRaw = told.format == zfmtRaw8 || told.format == zfmtRaw16;
    const bool isOfOneKind = told.IsThreeColour() == samples.IsThreeColour() &&
                             (isRaw || told.bytesPerSample == samples.bytesPerSample);
    if (!isOfOneKind)
        return fmt::format("PIXFORM says {}, which does not fit the samples", told.name);
    if ((image.bits > 8) != samples.IsDeep())
        return fmt::format("BITDEPTH says {}, which does not fit the samples", image.bits);
    if (image.isBayer && image.words.pattern != FirstMosaicPattern + image.bayerPattern)
        return "BAYERPAT and FRMPATT do not say the same";
    return {};
}

/// The frame record of the header, if it is a good one. Leaves `image` alone otherwise.
std::string ReadFrameRecord(const FitsInput& input, Image* image) {
    Image record;
    std::string problem = ReadWords(input, &record);
    if (problem.empty()) problem = FindContradiction(record, *image->layout);
    if (!problem.empty()) return problem;
    if (!record.layout->IsThreeColour()) image->layout = record.layout;
    image->bits = record.bits;
    image->isBayer = record.isBayer;
    image->bayerPattern = record.bayerPattern;
    image->frameNumber = record.frameNumber;
    image->frameError = record.frameError;
    image->words = record.words;
    return {};
}

}  // namespace

std::string ReadFits(const std::string& path, FitsDemand demand, Image* image) {
    std::string problem = FindDoorProblem(path);
    if (!problem.empty()) return problem;
    FitsInput input;
    if (!input.Open(path)) return "its header cannot be read";
    problem = ReadShape(input, path, image);
    if (!problem.empty()) return problem;
    problem = ReadFrameRecord(input, image);
    if (!problem.empty() && demand == FitsDemand::FrameRecord) return problem;
    ReadDescription(input, image);
    return ReadPixels(input, image);
}

}  // namespace ZentaraProgram
