#include "image_file.h"

#include <algorithm>
#include <array>
#include <cctype>
#include <cerrno>
#include <cstdio>
#include <cstring>
#include <string_view>
#include <system_error>

#include "image_writers.h"
#include "paths.h"
#include "platform.h"
#include "unfinished_file.h"

namespace ZentaraProgram {
namespace {

struct KindRow {
    std::string_view ending;
    ImageKind kind;
    std::string (*write)(const std::string&, const Image&);
};

constexpr std::array Kinds{
    KindRow{".fits", ImageKind::Fits, &WriteFits}, KindRow{".fit", ImageKind::Fits, &WriteFits},
    KindRow{".fts", ImageKind::Fits, &WriteFits},  KindRow{".tiff", ImageKind::Tiff, &WriteTiff},
    KindRow{".tif", ImageKind::Tiff, &WriteTiff},  KindRow{".png", ImageKind::Png, &WritePng},
    KindRow{".raw", ImageKind::Raw, &WriteRaw},
};

const KindRow* FindKind(const std::string& path) {
    std::string ending = GetPathText(MakePath(path).extension());
    std::transform(ending.begin(), ending.end(), ending.begin(),
                   [](unsigned char c) { return static_cast<char>(std::tolower(c)); });
    const auto* row = std::find_if(Kinds.begin(), Kinds.end(),
                                   [&](const KindRow& kind) { return kind.ending == ending; });
    return row == Kinds.end() ? nullptr : row;
}

}  // namespace

ImageKind GetImageKind(const std::string& path) {
    const KindRow* row = FindKind(path);
    return row == nullptr ? ImageKind::Unknown : row->kind;
}

std::string WriteImage(const std::string& path, const Image& image) {
    const KindRow* row = FindKind(path);
    if (row == nullptr) return "the ending of the name is none of .fits, .tiff, .png, .raw";
    const UnfinishedFile unfinished(path);
    if (unfinished.GetFailure()) return DescribeFailure(unfinished.GetFailure());
    std::string reason = row->write(unfinished.GetPath(), image);
    if (!reason.empty()) return reason;
    const std::error_code failure = unfinished.Finish();
    return failure ? DescribeFailure(failure) : std::string{};
}

std::string DescribeFailure(const std::error_code& failure) {
    return failure.default_error_condition().message();  // The same texts on each system.
}

std::string DescribeFileFailure() {
    return errno != 0 ? std::generic_category().message(errno) : "the file cannot be written";
}

std::string WriteRaw(const std::string& path, const Image& image) {
    errno = 0;
    std::FILE* file = OpenFile(path, "wb");
    if (file == nullptr) return DescribeFileFailure();
    const bool isWritten =
        std::fwrite(image.pixels.data(), 1, image.pixels.size(), file) == image.pixels.size();
    const bool isClosed = std::fclose(file) == 0;
    return isWritten && isClosed ? std::string{} : DescribeFileFailure();
}

}  // namespace ZentaraProgram
