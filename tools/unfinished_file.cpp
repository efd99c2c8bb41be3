#include "unfinished_file.h"

#include <fmt/format.h>

#include <random>

#include "paths.h"
#include "platform.h"

namespace ZentaraProgram {
namespace {

constexpr const char* NameInside = "image";

}  // namespace

UnfinishedFile::UnfinishedFile(const std::string& path) : finished(MakePath(path)) {
    std::random_device random;
    do {
        folder = finished.parent_path() / fmt::format(".zentara-{:08x}", random());
        failure = MakePrivateFolder(GetPathText(folder));
    } while (failure == std::errc::file_exists);
}

UnfinishedFile::~UnfinishedFile() {
    std::error_code ignored;
    if (!failure) std::filesystem::remove_all(folder, ignored);
}

std::string UnfinishedFile::GetPath() const {
    return GetPathText(folder / NameInside);
}

std::error_code UnfinishedFile::Finish() const {
    std::error_code renamed;
    std::filesystem::rename(folder / NameInside, finished, renamed);
    return renamed;
}

}  // namespace ZentaraProgram
