// Writes the files of one command: all of them or none.
#pragma once

#include <filesystem>
#include <string>
#include <vector>

namespace tessaly::data {

/// Collects files in memory and puts them into a directory together. Until `commit` the directory
/// keeps what it had; a failure leaves nothing behind, not even a directory made for it.
class OutputDirectory {
public:
    /// Creates the directory if it is missing, and tries whether it can be written to.
    /// @throws DataError naming the directory
    explicit OutputDirectory(std::filesystem::path directory);
    OutputDirectory(const OutputDirectory&) = delete;
    OutputDirectory& operator=(const OutputDirectory&) = delete;
    ~OutputDirectory();

    const std::filesystem::path& path() const noexcept { return directory_; }

    void add(const std::string& name, std::string bytes);

    /// Writes each file under a temporary name, flushes it to the disk, then renames all.
    /// @throws DataError
    void commit();

private:
    struct File {
        std::string name;
        std::string bytes;
        std::filesystem::path temporary;  ///< empty once it is in its place
        std::filesystem::path former;     ///< where the file of this name went, if there was one
    };
    void removeTemporaries() noexcept;
    void putFormerFilesBack() noexcept;

    std::filesystem::path directory_;
    std::vector<std::filesystem::path> created_;  ///< outermost first
    std::vector<File> files_;
    bool committed_ = false;
};

/// The whole file; empty if it does not exist.
/// @throws DataError if it exists and cannot be read
std::string readIfPresent(const std::filesystem::path& path);

}  // namespace tessaly::data
