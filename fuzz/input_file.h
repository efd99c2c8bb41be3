#pragma once

#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <string>

#include "fuzz/fuzz_input.h"

namespace ZV::Fuzzing {

/// A file in a folder of this process that holds the bytes of one execution after the other. The
/// folder goes when the process ends.
class InputFile {
  public:
    explicit InputFile(const char* name) : folder(MakeFolder()), path(folder / name) {}
    ~InputFile() {
        std::error_code ignored;
        std::filesystem::remove_all(folder, ignored);
    }
    InputFile(const InputFile&) = delete;
    InputFile& operator=(const InputFile&) = delete;

    std::string Write(const std::uint8_t* data, std::size_t size) const {
        std::FILE* const file = std::fopen(path.c_str(), "wb");
        Require(file != nullptr);
        const bool isWritten = size == 0 || std::fwrite(data, 1, size, file) == size;
        Require(std::fclose(file) == 0 && isWritten);
        return path.string();
    }

  private:
    static std::filesystem::path MakeFolder() {
        std::string name =
            (std::filesystem::temp_directory_path() / "zentara-fuzz-XXXXXX").string();
        Require(mkdtemp(name.data()) != nullptr);
        return name;
    }

    const std::filesystem::path folder, path;
};

}  // namespace ZV::Fuzzing
