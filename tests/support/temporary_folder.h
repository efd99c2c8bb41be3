#pragma once

#include <gtest/gtest.h>

#include <algorithm>
#include <filesystem>
#include <fstream>
#include <random>
#include <string>
#include <string_view>
#include <vector>

#include "support/text_file.h"

namespace ZV::Test {

/// A new folder for the life of the object, removed with what is in it.
class TemporaryFolder {
  public:
    TemporaryFolder() {
        std::random_device random;
        std::error_code failure;
        do {
            const std::string name = "zentara-" + std::to_string(random());
            path = std::filesystem::temp_directory_path() / name;
        } while (!std::filesystem::create_directory(path, failure) && !failure);
        if (failure) ADD_FAILURE() << "no folder " << path;
    }
    ~TemporaryFolder() {
        std::error_code ignored;
        std::filesystem::remove_all(path, ignored);
    }
    TemporaryFolder(const TemporaryFolder&) = delete;
    TemporaryFolder& operator=(const TemporaryFolder&) = delete;

    const std::filesystem::path& GetFolder() const { return path; }
    std::string GetPath(std::string_view name) const { return (path / name).string(); }

    std::string WriteFile(std::string_view name, std::string_view content) const {
        std::ofstream(path / name, std::ios::binary) << content;
        return GetPath(name);
    }

    std::string ReadFile(std::string_view name) const { return ReadTextFile(path / name); }

    /// Names of the files in it, sorted.
    std::vector<std::string> ListFiles() const {
        std::vector<std::string> names;
        for (const auto& entry : std::filesystem::directory_iterator(path)) {
            names.push_back(entry.path().filename().string());
        }
        std::sort(names.begin(), names.end());
        return names;
    }

  private:
    std::filesystem::path path;
};

}  // namespace ZV::Test
