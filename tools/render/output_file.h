// Files that appear complete or not at all.
#pragma once

#include <filesystem>
#include <span>
#include <string>
#include <vector>

namespace tessaly {

/// A file under a passing name beside its place; it gets its own name when it is complete and is
/// removed if it never is.
class PendingFile {
public:
    /// Creates the passing file, so an unwritable place is known before any work.
    /// @throws std::runtime_error with one line naming the file
    explicit PendingFile(const std::filesystem::path& finalFile);
    ~PendingFile();
    PendingFile(const PendingFile&) = delete;
    PendingFile& operator=(const PendingFile&) = delete;

    const std::filesystem::path& passingName() const noexcept { return passing; }
    const std::filesystem::path& finalName() const noexcept { return place; }

    /// Puts the file in its place, over an older one. @throws std::runtime_error
    void complete();

private:
    std::filesystem::path place;
    std::filesystem::path passing;
    bool pending = true;
};

/// A directory that is gone again, with those above it that it needed, if nothing came to lie in
/// it.
class NewDirectory {
public:
    /// @throws std::runtime_error with one line naming the directory
    explicit NewDirectory(std::filesystem::path wanted);
    ~NewDirectory();
    NewDirectory(const NewDirectory&) = delete;
    NewDirectory& operator=(const NewDirectory&) = delete;

private:
    void removeEmpty() noexcept;

    std::filesystem::path place;
    std::vector<std::filesystem::path> made;  // the innermost first
};

enum class SampleFormat { Float, Int16, Int24 };

/// Writes a stereo WAV file.
/// @param stereo  interleaved, full scale 1.0
/// @returns the number of samples cut at full scale; always 0 for float
/// @throws std::runtime_error with one line naming the place
std::size_t writeWav(const PendingFile& file,
                     std::span<const float> stereo,
                     int sampleRate,
                     SampleFormat format);

/// Writes a text. @throws std::runtime_error with one line naming the place
void writeText(const PendingFile& file, const std::string& text);

}  // namespace tessaly
