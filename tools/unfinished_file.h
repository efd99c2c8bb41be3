#pragma once

#include <filesystem>
#include <string>
#include <system_error>

namespace ZentaraProgram {

/// A file that takes its name in one step when it is finished, so that nobody ever sees half of it.
/// Until then it lies in a new folder beside its place, which no one else can have laid there nor
/// may enter: a link in the writer's way would lead it elsewhere. The folder goes with the object.
class UnfinishedFile {
  public:
    explicit UnfinishedFile(const std::string& path);
    ~UnfinishedFile();
    UnfinishedFile(const UnfinishedFile&) = delete;
    UnfinishedFile& operator=(const UnfinishedFile&) = delete;

    /// Why there is no folder; a default one when there is.
    [[nodiscard]] const std::error_code& GetFailure() const { return failure; }
    /// Where to write it, by name, as the libraries of the formats want it.
    [[nodiscard]] std::string GetPath() const;
    /// Gives the written file its name. An older file of that name is replaced, or stays after a
    /// failure.
    [[nodiscard]] std::error_code Finish() const;

  private:
    const std::filesystem::path finished;
    std::filesystem::path folder;
    std::error_code failure;
};

}  // namespace ZentaraProgram
