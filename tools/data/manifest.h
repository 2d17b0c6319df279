// MANIFEST.txt and ATTRIBUTION.txt: what lies in a data directory, where from, on what terms.
#pragma once

#include <cstddef>
#include <map>
#include <string>
#include <vector>

namespace tessaly::data {

inline constexpr const char* manifestName = "MANIFEST.txt";
inline constexpr const char* attributionName = "ATTRIBUTION.txt";

/// One data file. All text is one line.
struct ManifestEntry {
    std::string file;
    std::size_t size = 0;
    std::string sha256;
    std::string content;
    std::string source;
    std::string sourceSha256;
    std::string licence;
    std::string options;
    std::vector<std::string> parts = {};  ///< what a file is put together from, if several

    bool operator==(const ManifestEntry&) const = default;
};

/// @param entries  in the order of the file
std::string manifestText(const std::vector<ManifestEntry>& entries);

/// Reads `manifestText` back; lines it does not know are skipped.
/// @return empty for text that is no manifest
std::vector<ManifestEntry> parseManifest(const std::string& text);

/// Puts `added` in, replacing entries of the same file; sorted by file name.
std::vector<ManifestEntry> mergeManifest(std::vector<ManifestEntry> entries,
                                         const std::vector<ManifestEntry>& added);

/// Terms of each source, by its checksum.
using Attributions = std::map<std::string, std::string>;

std::string attributionText(const Attributions& attributions);
Attributions parseAttributions(const std::string& text);

}  // namespace tessaly::data
