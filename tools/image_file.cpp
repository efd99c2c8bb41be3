#include "image_file.h"

#include <fmt/format.h>

#include <algorithm>
#include <array>
#include <cctype>
#include <cerrno>
#include <cstdio>
#include <cstring>
#include <filesystem>
#include <random>
#include <string_view>
#include <system_error>

#include "image_writers.h"
#include "paths.h"
#include "platform.h"

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

/// A new folder beside the place of a file, removed with what is in it. Only a folder is made
/// exclusively and then written to by name, as the libraries of the formats want it.
class UnfinishedFolder {
  public:
    explicit UnfinishedFolder(const std::filesystem::path& parent) {
        std::random_device random;
        do {
            path = parent / fmt::format(".zentara-{:08x}", random());
        } while (!std::filesystem::create_directory(path, failure) && IsTaken());
    }
    ~UnfinishedFolder() {
        std::error_code ignored;
        if (!failure) std::filesystem::remove_all(path, ignored);
    }
    UnfinishedFolder(const UnfinishedFolder&) = delete;
    UnfinishedFolder& operator=(const UnfinishedFolder&) = delete;

    [[nodiscard]] const std::error_code& GetFailure() const { return failure; }
    [[nodiscard]] std::string GetPath(const char* name) const { return GetPathText(path / name); }

  private:
    /// A folder of the name is no failure to the standard library, a file of the name is one.
    [[nodiscard]] bool IsTaken() const { return !failure || failure == std::errc::file_exists; }

    std::filesystem::path path;
    std::error_code failure;
};

}  // namespace

ImageKind GetImageKind(const std::string& path) {
    const KindRow* row = FindKind(path);
    return row == nullptr ? ImageKind::Unknown : row->kind;
}

std::string WriteImage(const std::string& path, const Image& image) {
    const KindRow* row = FindKind(path);
    if (row == nullptr) return "the ending of the name is none of .fits, .tiff, .png, .raw";
    // The finished file takes its name in one step, so that nobody ever sees half of it.
    const UnfinishedFolder folder(MakePath(path).parent_path());
    if (folder.GetFailure()) return DescribeFailure(folder.GetFailure());
    const std::string unfinished = folder.GetPath("image");
    std::string reason = row->write(unfinished, image);
    if (!reason.empty()) return reason;
    std::error_code renamed;
    std::filesystem::rename(MakePath(unfinished), MakePath(path), renamed);
    return renamed ? DescribeFailure(renamed) : std::string{};
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
